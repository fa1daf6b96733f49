#include "DeviceAccess.h"

#include <grp.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstring>

namespace orvane::live {

namespace {

// The name of the group that owns the node, when the group may read it; empty otherwise.
std::string readingGroup(const std::string& path) {
    struct stat st {};
    if (::stat(path.c_str(), &st) != 0 || st.st_gid == 0 || (st.st_mode & S_IRGRP) == 0) return "";
    const struct group* g = ::getgrgid(st.st_gid);
    return g && g->gr_name ? g->gr_name : "";
}

bool isUinput(const std::string& path) { return path.find("uinput") != std::string::npos; }

}  // namespace

std::string describeOpenFailure(const std::string& path, int errorNumber) {
    if (errorNumber == EACCES || errorNumber == EPERM) {
        if (isUinput(path)) {
            return path + ": permission denied: install the udev rule data/" + std::string(kUdevRuleName) +
                   " (it lets the user at the seat and the group input make virtual devices) or run as root";
        }
        const std::string group = readingGroup(path);
        if (!group.empty()) {
            return path + ": permission denied: the device belongs to the group " + group +
                   "; join it (sudo usermod -aG " + group + " $USER, then log in again) or install the udev rule data/" +
                   std::string(kUdevRuleName);
        }
        return path + ": permission denied: install the udev rule data/" + std::string(kUdevRuleName) +
               " (it lets the user at the seat read touchpads and lid switches) or run as root";
    }
    if (errorNumber == ENOENT || errorNumber == ENODEV || errorNumber == ENXIO) {
        if (isUinput(path)) return path + ": not there: load the uinput module (sudo modprobe uinput)";
        return path + ": no such device";
    }
    return path + ": " + std::strerror(errorNumber);
}

}  // namespace orvane::live
