#pragma once
// One-line explanations of why an input device node cannot be opened, naming the group or
// the udev rule that would give access.

#include <string>

namespace orvane::live {

// The udev rule shipped in data/, as the README installs it.
inline constexpr const char* kUdevRuleName = "70-orvane.rules";

// "PATH: permission denied: ..." for an open that failed with `errorNumber`: for EACCES and
// EPERM the group that owns the node and how to join it (or the rule to install for
// /dev/uinput); for ENOENT that the node is not there; otherwise the system's message.
std::string describeOpenFailure(const std::string& path, int errorNumber);

}  // namespace orvane::live
