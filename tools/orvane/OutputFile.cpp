#include "OutputFile.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <vector>

namespace orvane::cli {

OutputFile::~OutputFile() { discard(); }

bool OutputFile::open(const std::string& path, std::string* error) {
    path_ = path;
    if (path == "-") {
        standardOutput_ = true;
        open_ = true;
        return true;
    }
    std::string pattern = path + ".tmp-XXXXXX";
    std::vector<char> name(pattern.begin(), pattern.end());
    name.push_back('\0');
    const int fd = ::mkstemp(name.data());
    if (fd < 0) {
        *error = path + ": cannot be written (" + std::strerror(errno) + ")";
        return false;
    }
    // mkstemp makes the file private; the finished file gets the usual permissions.
    const mode_t mask = ::umask(0);
    ::umask(mask);
    ::fchmod(fd, 0666 & ~mask);
    ::close(fd);
    temporaryPath_ = name.data();
    file_.open(temporaryPath_, std::ios::binary | std::ios::trunc);
    if (!file_) {
        *error = path + ": cannot be written (" + std::strerror(errno) + ")";
        ::unlink(temporaryPath_.c_str());
        temporaryPath_.clear();
        return false;
    }
    open_ = true;
    return true;
}

std::ostream& OutputFile::stream() { return standardOutput_ ? std::cout : static_cast<std::ostream&>(file_); }

bool OutputFile::commit(std::string* error) {
    if (!open_) return true;
    if (standardOutput_) {
        std::cout.flush();
        open_ = false;
        if (!std::cout) {
            *error = "standard output cannot be written";
            return false;
        }
        return true;
    }
    file_.flush();
    const bool written = static_cast<bool>(file_);
    file_.close();
    open_ = false;
    if (!written || file_.fail()) {
        *error = path_ + ": cannot be written (" + std::strerror(errno) + ")";
        discard();
        return false;
    }
    if (::rename(temporaryPath_.c_str(), path_.c_str()) != 0) {
        *error = path_ + ": cannot be written (" + std::strerror(errno) + ")";
        discard();
        return false;
    }
    temporaryPath_.clear();
    return true;
}

void OutputFile::discard() {
    if (file_.is_open()) file_.close();
    if (!temporaryPath_.empty()) ::unlink(temporaryPath_.c_str());
    temporaryPath_.clear();
    open_ = false;
}

}  // namespace orvane::cli
