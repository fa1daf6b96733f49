#include "OutputFile.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <streambuf>
#include <vector>

#include "PathTarget.h"
#include "TemporaryFiles.h"

namespace orvane::files {

// What is written goes through one buffer of 64 KiB straight to the descriptor; the first
// error is kept for commit() to report.
class OutputFile::Buffer : public std::streambuf {
public:
    explicit Buffer(int fd) : fd_(fd), data_(kSize) { setp(data_.data(), data_.data() + data_.size()); }
    int error() const { return error_; }

protected:
    int_type overflow(int_type c) override {
        if (!drain()) return traits_type::eof();
        if (!traits_type::eq_int_type(c, traits_type::eof())) {
            *pptr() = traits_type::to_char_type(c);
            pbump(1);
        }
        return traits_type::not_eof(c);
    }
    std::streamsize xsputn(const char* s, std::streamsize n) override {
        if (n > epptr() - pptr()) {
            if (!drain()) return 0;
            if (n >= static_cast<std::streamsize>(data_.size())) return writeAll(s, static_cast<size_t>(n)) ? n : 0;
        }
        std::memcpy(pptr(), s, static_cast<size_t>(n));
        pbump(static_cast<int>(n));
        return n;
    }
    int sync() override { return drain() ? 0 : -1; }

private:
    static constexpr size_t kSize = 64 * 1024;

    bool drain() {
        const size_t n = static_cast<size_t>(pptr() - pbase());
        setp(data_.data(), data_.data() + data_.size());
        return n == 0 || writeAll(data_.data(), n);
    }
    bool writeAll(const char* s, size_t n) {
        if (error_) return false;
        while (n > 0) {
            const ssize_t w = ::write(fd_, s, n);
            if (w < 0) {
                if (errno == EINTR) continue;
                error_ = errno;
                return false;
            }
            s += w;
            n -= static_cast<size_t>(w);
        }
        return true;
    }

    int fd_;
    int error_ = 0;
    std::vector<char> data_;
};

namespace {

// A new private file from a mkstemp pattern; -1 with errno set on failure.
int makeTemporary(const std::string& pattern, std::string* name) {
    std::vector<char> buffer(pattern.begin(), pattern.end());
    buffer.push_back('\0');
    const int fd = ::mkostemp(buffer.data(), O_CLOEXEC);
    if (fd >= 0) *name = buffer.data();
    return fd;
}

mode_t newFileMode() {
    const mode_t mask = ::umask(0);
    ::umask(mask);
    return 0666 & ~mask;
}

std::string temporaryFolder() {
    const char* tmp = std::getenv("TMPDIR");
    return tmp && *tmp ? tmp : "/tmp";
}

}  // namespace

OutputFile::OutputFile() = default;

OutputFile::~OutputFile() { discard(); }

std::string OutputFile::failure(int error) const {
    const std::string what = std::string("cannot be written (") + std::strerror(error) + ")";
    return path_ == "-" ? "standard output " + what : path_ + ": " + what;
}

void OutputFile::adopt(int fd, Kind kind) {
    fd_ = fd;
    kind_ = kind;
    buffer_ = std::make_unique<Buffer>(fd);
    stream_ = std::make_unique<std::ostream>(buffer_.get());
}

bool OutputFile::open(const std::string& path, std::string* error) {
    discard();
    path_ = path;
    target_ = path;
    const PathTarget t = findPathTarget(path, STDOUT_FILENO);
    switch (t.kind) {
    case PathTarget::Kind::Descriptor: {
        const int fd = ::fcntl(t.descriptor, F_DUPFD_CLOEXEC, 3);
        if (fd < 0) {
            *error = failure(errno);
            return false;
        }
        adopt(fd, t.descriptor == STDOUT_FILENO ? Kind::StandardOutput : Kind::WriteThrough);
        return true;
    }
    case PathTarget::Kind::Unreachable: *error = failure(t.error); return false;
    case PathTarget::Kind::Missing: target_ = t.target; return openTemporary(nullptr, error);
    case PathTarget::Kind::Existing:
        target_ = t.target;
        if (S_ISDIR(t.status.st_mode)) {
            *error = failure(EISDIR);
            return false;
        }
        // Devices, named pipes and what /proc names are written through, never replaced.
        if (!S_ISREG(t.status.st_mode) || target_.rfind("/proc/", 0) == 0) return openWriteThrough(error);
        return openTemporary(&t.status, error);
    }
    return false;
}

bool OutputFile::openWriteThrough(std::string* error) {
    // As the shell's ">": a named pipe waits here for its reader.
    int fd;
    do fd = ::open(target_.c_str(), O_WRONLY | O_NOCTTY | O_CLOEXEC);
    while (fd < 0 && errno == EINTR);
    if (fd < 0) {
        *error = failure(errno);
        return false;
    }
    adopt(fd, Kind::WriteThrough);
    return true;
}

bool OutputFile::openTemporary(const struct stat* existing, std::string* error) {
    Kind kind = Kind::Replace;
    if (existing) {
        if (::access(target_.c_str(), W_OK) != 0) {
            *error = failure(errno);
            return false;
        }
        // A new file would part the other names from the text, or lose the owner.
        if (existing->st_nlink > 1 || (::geteuid() != 0 && existing->st_uid != ::geteuid())) kind = Kind::CopyInto;
    }
    std::string name;
    int fd = makeTemporary(target_ + ".tmp-XXXXXX", &name);
    if (fd < 0) {
        const int made = errno;
        if (!existing || (made != EACCES && made != EPERM && made != EROFS)) {
            *error = failure(made);
            return false;
        }
        // The folder takes no new file, but the file itself can be written.
        kind = Kind::CopyInto;
        fd = makeTemporary(temporaryFolder() + "/orvane-" + lastPartOf(target_) + ".tmp-XXXXXX", &name);
        if (fd < 0) {
            *error = failure(errno);
            return false;
        }
    }
    if (kind == Kind::Replace) {
        if (existing && (existing->st_uid != ::geteuid() || existing->st_gid != ::getegid()) &&
            ::fchown(fd, ::geteuid() == 0 ? existing->st_uid : static_cast<uid_t>(-1), existing->st_gid) != 0)
            kind = Kind::CopyInto;  // a group this user cannot give: keep the file's own
        // After the owner: changing the owner clears the set-user and set-group bits.
        ::fchmod(fd, existing ? existing->st_mode & 07777 : newFileMode());
    }
    temporaryPath_ = name;
    temporarySlot_ = TemporaryFiles::add(name);
    adopt(fd, kind);
    return true;
}

std::ostream& OutputFile::stream() { return *stream_; }

bool OutputFile::copyIntoTarget(std::string* error) {
    int out;
    do out = ::open(target_.c_str(), O_WRONLY | O_TRUNC | O_NOCTTY | O_CLOEXEC);
    while (out < 0 && errno == EINTR);
    if (out < 0 || ::lseek(fd_, 0, SEEK_SET) != 0) {
        *error = failure(errno);
        if (out >= 0) ::close(out);
        return false;
    }
    std::vector<char> chunk(64 * 1024);
    for (;;) {
        const ssize_t r = ::read(fd_, chunk.data(), chunk.size());
        if (r == 0) break;
        if (r < 0 && errno == EINTR) continue;
        ssize_t done = r < 0 ? -1 : 0;
        while (done >= 0 && done < r) {
            const ssize_t w = ::write(out, chunk.data() + done, static_cast<size_t>(r - done));
            if (w < 0 && errno != EINTR) done = -1;
            else if (w > 0) done += w;
        }
        if (done < 0) {
            *error = failure(errno);
            ::close(out);
            return false;
        }
    }
    if (::close(out) != 0) {
        *error = failure(errno);
        return false;
    }
    return true;
}

bool OutputFile::commit(std::string* error) {
    if (kind_ == Kind::None) return true;
    stream_->flush();
    if (buffer_->error()) {
        *error = failure(buffer_->error());
        discard();
        return false;
    }
    bool done = true;
    switch (kind_) {
    case Kind::None: break;
    case Kind::StandardOutput:
    case Kind::WriteThrough:
        done = ::close(fd_) == 0;
        if (!done) *error = failure(errno);
        fd_ = -1;
        break;
    case Kind::Replace:
        done = ::close(fd_) == 0 && ::rename(temporaryPath_.c_str(), target_.c_str()) == 0;
        if (!done) *error = failure(errno);
        fd_ = -1;
        break;
    case Kind::CopyInto: done = copyIntoTarget(error); break;
    }
    if (done && kind_ == Kind::Replace) {
        temporaryPath_.clear();  // it is the target now
        TemporaryFiles::remove(temporarySlot_);
        temporarySlot_ = -1;
    }
    discard();
    return done;
}

void OutputFile::discard() {
    stream_.reset();
    buffer_.reset();
    if (fd_ >= 0) ::close(fd_);
    fd_ = -1;
    if (!temporaryPath_.empty()) ::unlink(temporaryPath_.c_str());
    temporaryPath_.clear();
    TemporaryFiles::remove(temporarySlot_);
    temporarySlot_ = -1;
    kind_ = Kind::None;
}

}  // namespace orvane::files
