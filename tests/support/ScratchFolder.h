#pragma once
// A folder for a test's files, removed with everything in it when the test ends, and small
// helpers for the files in it.

#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace orvane::testsupport {

class ScratchFolder {
public:
    ScratchFolder() {
        char pattern[] = "/tmp/orvane-test-XXXXXX";
        const char* made = ::mkdtemp(pattern);
        path_ = made ? made : "";
    }
    ~ScratchFolder() {
        if (!path_.empty()) std::system(("rm -rf '" + path_ + "'").c_str());
    }
    ScratchFolder(const ScratchFolder&) = delete;
    ScratchFolder& operator=(const ScratchFolder&) = delete;

    const std::string& path() const { return path_; }
    std::string file(const std::string& name) const { return path_ + "/" + name; }
    // Writes the file and returns its path.
    std::string write(const std::string& name, const std::string& content) const {
        const std::string p = file(name);
        std::ofstream(p, std::ios::binary) << content;
        return p;
    }
    // The names of the files in the folder, sorted.
    std::vector<std::string> list() const {
        std::vector<std::string> out;
        const std::string listing = file(".listing");
        std::system(("ls -A '" + path_ + "' > '" + listing + "'").c_str());
        std::ifstream in(listing);
        for (std::string line; std::getline(in, line);)
            if (line != ".listing") out.push_back(line);
        return out;
    }

private:
    std::string path_;
};

inline std::string readFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    std::ostringstream s;
    s << in.rdbuf();
    return s.str();
}

inline bool fileExists(const std::string& path) { return ::access(path.c_str(), F_OK) == 0; }

inline std::vector<std::string> splitLines(const std::string& text) {
    std::vector<std::string> out;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) out.push_back(line);
    return out;
}

}  // namespace orvane::testsupport
