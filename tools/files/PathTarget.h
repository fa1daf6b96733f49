#pragma once
// What a path given on the command line names, found before anything is opened: the
// command's own descriptor (standard input or output under one of its names), or a file
// system object reached by following every symbolic link, which may not exist yet.

#include <sys/stat.h>

#include <string>

namespace orvane::files {

struct PathTarget {
    enum class Kind {
        Descriptor,  // "-" or /dev/stdin, /dev/stdout, /dev/stderr, /dev/fd/N, /proc/self/fd/N
        Existing,    // an existing object; `status` describes it
        Missing,     // nothing there yet; `target` is where a new file would go
        Unreachable, // the path cannot be followed (a loop of links, a missing folder, ...)
    };
    Kind kind = Kind::Unreachable;
    int descriptor = -1;   // Descriptor: the descriptor named
    std::string target;    // Existing, Missing: the path after the last link
    struct stat status {}; // Existing: of the target; Descriptor: of the descriptor, when open
    bool hasStatus = false;
    int error = 0;         // Unreachable: the errno that says why
};

// "-" names `dashDescriptor` (0 for an input, 1 for an output).
PathTarget findPathTarget(const std::string& path, int dashDescriptor);

// The folder part of a path ("." for a bare name) and the last part.
std::string folderOf(const std::string& path);
std::string lastPartOf(const std::string& path);

}  // namespace orvane::files
