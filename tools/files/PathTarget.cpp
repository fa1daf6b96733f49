#include "PathTarget.h"

#include <unistd.h>

#include <cerrno>
#include <climits>
#include <string_view>

namespace orvane::files {

namespace {

// The names under which a command's own descriptors are opened; "-" is `dashDescriptor`.
bool descriptorNamed(const std::string& path, int dashDescriptor, int* descriptor) {
    if (path == "-") {
        *descriptor = dashDescriptor;
        return true;
    }
    static constexpr struct {
        std::string_view name;
        int descriptor;
    } kFixed[] = {{"/dev/stdin", 0}, {"/dev/stdout", 1}, {"/dev/stderr", 2}};
    for (const auto& f : kFixed)
        if (path == f.name) {
            *descriptor = f.descriptor;
            return true;
        }
    for (std::string_view prefix : {std::string_view("/dev/fd/"), std::string_view("/proc/self/fd/")}) {
        if (path.size() <= prefix.size() || path.size() > prefix.size() + 9 || path.compare(0, prefix.size(), prefix) != 0)
            continue;
        int n = 0;
        for (size_t i = prefix.size(); i < path.size(); ++i) {
            if (path[i] < '0' || path[i] > '9') return false;
            n = n * 10 + (path[i] - '0');
        }
        *descriptor = n;
        return true;
    }
    return false;
}

constexpr int kMostLinksFollowed = 40;  // as the kernel's own limit for one path

}  // namespace

std::string folderOf(const std::string& path) {
    const size_t slash = path.find_last_of('/');
    if (slash == std::string::npos) return ".";
    if (slash == 0) return "/";
    return path.substr(0, slash);
}

std::string lastPartOf(const std::string& path) {
    const size_t slash = path.find_last_of('/');
    return slash == std::string::npos ? path : path.substr(slash + 1);
}

PathTarget findPathTarget(const std::string& path, int dashDescriptor) {
    PathTarget t;
    std::string p = path;
    for (int hop = 0; hop <= kMostLinksFollowed; ++hop) {
        int descriptor = -1;
        if (descriptorNamed(p, dashDescriptor, &descriptor)) {
            t.kind = PathTarget::Kind::Descriptor;
            t.descriptor = descriptor;
            t.hasStatus = ::fstat(descriptor, &t.status) == 0;
            return t;
        }
        struct stat st {};
        if (::lstat(p.c_str(), &st) != 0) {
            const int lstatError = errno;
            t.target = p;
            if (lstatError != ENOENT) {
                t.kind = PathTarget::Kind::Unreachable;
                t.error = lstatError;
                return t;
            }
            // A new file needs a folder to go into.
            struct stat folder {};
            if (::stat(folderOf(p).c_str(), &folder) != 0) {
                t.kind = PathTarget::Kind::Unreachable;
                t.error = errno;
            } else if (!S_ISDIR(folder.st_mode)) {
                t.kind = PathTarget::Kind::Unreachable;
                t.error = ENOTDIR;
            } else {
                t.kind = PathTarget::Kind::Missing;
            }
            return t;
        }
        // The links of /proc name open files rather than paths ("pipe:[42]"): the object is
        // what opening the path reaches.
        if (!S_ISLNK(st.st_mode) || p.rfind("/proc/", 0) == 0) {
            if (S_ISLNK(st.st_mode) && ::stat(p.c_str(), &st) != 0) {
                t.kind = PathTarget::Kind::Unreachable;
                t.error = errno;
                t.target = p;
                return t;
            }
            t.kind = PathTarget::Kind::Existing;
            t.target = p;
            t.status = st;
            t.hasStatus = true;
            return t;
        }
        char link[PATH_MAX];
        const ssize_t n = ::readlink(p.c_str(), link, sizeof link);
        if (n < 0 || n == static_cast<ssize_t>(sizeof link)) {
            t.kind = PathTarget::Kind::Unreachable;
            t.error = n < 0 ? errno : ENAMETOOLONG;
            t.target = p;
            return t;
        }
        std::string next(link, static_cast<size_t>(n));
        p = next.empty() || next[0] == '/' ? next : folderOf(p) + "/" + next;
    }
    t.kind = PathTarget::Kind::Unreachable;
    t.error = ELOOP;
    t.target = path;
    return t;
}

}  // namespace orvane::files
