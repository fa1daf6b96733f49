#pragma once
// Before a command reads anything: no output may be one of its inputs, nor the same as
// another output. Files are compared by device and inode, so a symbolic link, a hard link,
// "./" or another spelling cannot slip through; "-" and /dev/stdout are the command's
// standard output (and "-" as an input its standard input), compared by what they are
// open on. Outputs that do not exist yet are compared by folder and name. Terminals and
// other devices may be named more than once (a terminal is both input and output of an
// interactive command), but not one descriptor twice among the outputs; the null device is
// never a clash.

#include <string>
#include <vector>

namespace orvane::files {

struct NamedPath {
    std::string role;  // how the command line names it: "INPUT", "--desc", "--events-out", ...
    std::string path;
};

// False with one line naming both paths when an output clashes.
bool checkOutputs(const std::vector<NamedPath>& inputs, const std::vector<NamedPath>& outputs, std::string* error);

}  // namespace orvane::files
