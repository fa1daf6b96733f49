#pragma once
// An output of the command: "-" is standard output; any other path is written to a
// temporary file beside it and renamed into place only when complete, so a failed run never
// leaves a half-written file.

#include <fstream>
#include <ostream>
#include <string>

namespace orvane::cli {

class OutputFile {
public:
    OutputFile() = default;
    ~OutputFile();
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;

    bool open(const std::string& path, std::string* error);
    bool isOpen() const { return open_; }
    bool isStandardOutput() const { return standardOutput_; }
    const std::string& path() const { return path_; }
    std::ostream& stream();

    // Flushes and, for a file, renames the temporary file into place.
    bool commit(std::string* error);
    // Removes the temporary file (done by the destructor when not committed).
    void discard();

private:
    std::string path_;
    std::string temporaryPath_;
    std::ofstream file_;
    bool open_ = false;
    bool standardOutput_ = false;
};

}  // namespace orvane::cli
