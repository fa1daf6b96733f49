#pragma once
// An output of a command, opened the way a user expects whatever its path names:
//
//   "-"                          standard output
//   a new path, a plain file     written to a temporary file beside it and renamed over it
//                                only when complete, so a failed or interrupted run leaves the
//                                old file whole; an existing file keeps its mode and, when
//                                running as root, its owner and group
//   a symbolic link              followed (through any number of links) and its final target
//                                treated as above; the link stays a link
//   a device, a named pipe       opened and written through, as the shell's ">" does
//   /dev/stdout, /dev/stderr,    the command's own descriptor, written through
//   /dev/fd/N, /proc/self/fd/N
//
// An existing plain file whose replacement would lose something (other hard links, which
// would keep the old text; an owner or group that only root could give the new file; a
// folder that takes no new file) is written to a temporary file too, and only when complete
// copied into the file in place, which so keeps its inode, owner, mode and links.
//
// Every command opens every output here; OutputCheck.h compares them with the inputs first.

#include <sys/stat.h>

#include <memory>
#include <ostream>
#include <string>

namespace orvane::files {

class OutputFile {
public:
    // How the output is written.
    enum class Kind {
        None,            // not open
        Replace,         // a temporary file beside the target, renamed over it by commit()
        CopyInto,        // a temporary file, copied into the existing target by commit()
        WriteThrough,    // the path opened and written directly
        StandardOutput,  // "-" or a name of the command's own standard output
    };

    OutputFile();
    ~OutputFile();  // discards what was not committed
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;

    // On failure `error` is one line naming the path.
    bool open(const std::string& path, std::string* error);
    bool isOpen() const { return kind_ != Kind::None; }
    Kind kind() const { return kind_; }
    // True when what is written goes to the command's standard output.
    bool isStandardOutput() const { return kind_ == Kind::StandardOutput; }
    // The path as given.
    const std::string& path() const { return path_; }
    // The file that is written: the final target of a link, or the path itself.
    const std::string& target() const { return target_; }
    std::ostream& stream();

    // Writes out what is buffered and, for a replaced file, renames the temporary file over
    // the target. On failure `error` is one line and nothing is left behind.
    bool commit(std::string* error);
    // Removes the temporary file; the old file, if any, is left as it was.
    void discard();

private:
    class Buffer;

    bool openTemporary(const struct stat* existing, std::string* error);
    bool openWriteThrough(std::string* error);
    bool copyIntoTarget(std::string* error);
    void adopt(int fd, Kind kind);
    std::string failure(int error) const;

    std::string path_;
    std::string target_;
    std::string temporaryPath_;
    int temporarySlot_ = -1;
    int fd_ = -1;
    Kind kind_ = Kind::None;
    std::unique_ptr<Buffer> buffer_;
    std::unique_ptr<std::ostream> stream_;
};

}  // namespace orvane::files
