#pragma once
// Running the orvane command from a test, in a scratch folder that is removed afterwards.

#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace orvane::robust {

inline constexpr const char* kOrvaneCommand = ORVANE_TEST_ORVANE_COMMAND;

class ScratchFolder {
public:
    ScratchFolder() {
        char pattern[] = "/tmp/orvane-robustness-XXXXXX";
        const char* made = ::mkdtemp(pattern);
        path_ = made ? made : "";
    }
    ~ScratchFolder() {
        if (!path_.empty()) std::system(("rm -rf '" + path_ + "'").c_str());
    }
    const std::string& path() const { return path_; }
    std::string file(const std::string& name) const { return path_ + "/" + name; }
    std::string write(const std::string& name, const std::string& content) const {
        std::ofstream(file(name), std::ios::binary) << content;
        return file(name);
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

inline std::vector<std::string> splitLines(const std::string& text) {
    std::vector<std::string> out;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) out.push_back(line);
    return out;
}

inline std::string quoted(const std::string& s) {
    std::string q = "'";
    for (char c : s) q += c == '\'' ? std::string("'\\''") : std::string(1, c);
    return q + "'";
}

struct CommandResult {
    int exitCode = -1;  // -1 when it did not exit normally (a crash or a signal)
    std::string out;
    std::string err;
};

inline CommandResult runOrvane(const std::vector<std::string>& args, const std::string& standardInput = "") {
    ScratchFolder io;
    std::string command = quoted(kOrvaneCommand);
    for (const auto& a : args) command += " " + quoted(a);
    command += " <" + quoted(io.write("stdin", standardInput)) + " >" + quoted(io.file("stdout")) + " 2>" +
               quoted(io.file("stderr"));
    const int status = std::system(command.c_str());
    CommandResult r;
    if (status != -1 && WIFEXITED(status)) r.exitCode = WEXITSTATUS(status);
    r.out = readFile(io.file("stdout"));
    r.err = readFile(io.file("stderr"));
    return r;
}

}  // namespace orvane::robust
