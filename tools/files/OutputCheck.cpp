#include "OutputCheck.h"

#include <sys/stat.h>
#include <sys/sysmacros.h>

#include "PathTarget.h"

namespace orvane::files {

namespace {

// What a path is, for comparing.
struct Identity {
    enum class Kind { None, Object, NewFile } kind = Kind::None;
    dev_t device = 0;
    ino_t inode = 0;
    std::string name;  // NewFile: the name in the folder (device, inode)
    int descriptor = -1;  // the command's own descriptor, when the path names one
};

bool isNullDevice(const struct stat& st) { return S_ISCHR(st.st_mode) && st.st_rdev == makedev(1, 3); }

Identity identify(const std::string& path, int dashDescriptor) {
    Identity id;
    const PathTarget t = findPathTarget(path, dashDescriptor);
    if (t.kind == PathTarget::Kind::Descriptor) id.descriptor = t.descriptor;
    if ((t.kind == PathTarget::Kind::Descriptor || t.kind == PathTarget::Kind::Existing) && t.hasStatus) {
        // Plain files and named pipes are what a command must not both read and write.
        if (S_ISREG(t.status.st_mode) || S_ISFIFO(t.status.st_mode) || S_ISDIR(t.status.st_mode)) {
            id.kind = Identity::Kind::Object;
            id.device = t.status.st_dev;
            id.inode = t.status.st_ino;
        } else if (isNullDevice(t.status)) {
            id.descriptor = -1;
        }
    } else if (t.kind == PathTarget::Kind::Missing) {
        struct stat folder {};
        if (::stat(folderOf(t.target).c_str(), &folder) == 0) {
            id.kind = Identity::Kind::NewFile;
            id.device = folder.st_dev;
            id.inode = folder.st_ino;
            id.name = lastPartOf(t.target);
        }
    }
    return id;
}

bool same(const Identity& a, const Identity& b) {
    if (a.kind != Identity::Kind::None && a.kind == b.kind && a.device == b.device && a.inode == b.inode &&
        a.name == b.name)
        return true;
    return false;
}

std::string named(const NamedPath& p) { return p.role + " " + (p.path == "-" ? "- (standard output)" : p.path); }

}  // namespace

bool checkOutputs(const std::vector<NamedPath>& inputs, const std::vector<NamedPath>& outputs, std::string* error) {
    std::vector<Identity> in, out;
    for (const NamedPath& p : inputs) in.push_back(identify(p.path, 0));
    for (const NamedPath& p : outputs) out.push_back(identify(p.path, 1));
    for (size_t o = 0; o < outputs.size(); ++o) {
        for (size_t i = 0; i < inputs.size(); ++i) {
            if (!same(out[o], in[i])) continue;
            const std::string input = inputs[i].role + " " + (inputs[i].path == "-" ? "- (standard input)" : inputs[i].path);
            *error = "orvane: " + named(outputs[o]) + " is the same file as " + input +
                     "; nothing was read or written";
            return false;
        }
        for (size_t e = 0; e < o; ++e) {
            const bool oneDescriptor = out[o].descriptor >= 0 && out[o].descriptor == out[e].descriptor;
            if (!oneDescriptor && !same(out[o], out[e])) continue;
            *error = "orvane: " + named(outputs[e]) + " and " + named(outputs[o]) +
                     " are the same output; give each one of its own";
            return false;
        }
    }
    return true;
}

}  // namespace orvane::files
