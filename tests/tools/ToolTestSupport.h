#pragma once
// Helpers the tools' tests share: a scratch folder, files, and running the orvane command.

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include "platform/Logging.h"

namespace orvane::tooltest {

inline constexpr const char* kFakePlugInDirectory = ORVANE_TEST_FAKE_PLUGIN_DIRECTORY;
inline constexpr const char* kFakePlugInModule = ORVANE_TEST_FAKE_PLUGIN_MODULE;
inline constexpr const char* kRealPlugInDirectory = ORVANE_TEST_REAL_PLUGIN_DIRECTORY;
inline constexpr const char* kOrvaneCommand = ORVANE_TEST_ORVANE_COMMAND;
inline constexpr const char* kDemoRecording = ORVANE_TEST_DEMO_RECORDING;

// A folder that is removed with everything in it when the test ends.
class ScratchFolder {
public:
    ScratchFolder() {
        char pattern[] = "/tmp/orvane-tools-test-XXXXXX";
        const char* made = ::mkdtemp(pattern);
        path_ = made ? made : "/tmp";
    }
    ~ScratchFolder() {
        if (path_ != "/tmp") std::system(("rm -rf '" + path_ + "'").c_str());
    }
    const std::string& path() const { return path_; }
    std::string file(const std::string& name) const { return path_ + "/" + name; }
    std::string write(const std::string& name, const std::string& content) const {
        const std::string p = file(name);
        std::ofstream(p, std::ios::binary) << content;
        return p;
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

inline std::vector<std::string> lines(const std::string& text) {
    std::vector<std::string> out;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line)) out.push_back(line);
    return out;
}

inline std::string shellQuote(const std::string& s) {
    std::string q = "'";
    for (char c : s) {
        if (c == '\'') q += "'\\''";
        else q += c;
    }
    return q + "'";
}

struct CommandResult {
    int exitCode = -1;  // -1 when the command did not exit normally (a crash)
    std::string out;
    std::string err;
};

// Runs orvane with the arguments and environment assignments ("NAME=value") given.
inline CommandResult runOrvane(const std::vector<std::string>& args, const std::vector<std::string>& environment = {},
                               const std::string& standardInput = "") {
    ScratchFolder scratch;
    std::string command = "env";
    for (const auto& e : environment) command += " " + shellQuote(e);
    command += " " + shellQuote(kOrvaneCommand);
    for (const auto& a : args) command += " " + shellQuote(a);
    const std::string in = scratch.write("stdin", standardInput);
    command += " <" + shellQuote(in) + " >" + shellQuote(scratch.file("stdout")) + " 2>" +
               shellQuote(scratch.file("stderr"));
    const int status = std::system(command.c_str());
    CommandResult r;
    if (status != -1 && WIFEXITED(status)) r.exitCode = WEXITSTATUS(status);
    r.out = readFile(scratch.file("stdout"));
    r.err = readFile(scratch.file("stderr"));
    return r;
}

// Sends every log line to a capture for the length of a test, then back to standard error.
class CapturedLog {
public:
    CapturedLog() : sink_(std::make_shared<CaptureLogSink>()) { Logging::setSink(sink_); }
    ~CapturedLog() { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }
    std::vector<std::string> messages(const std::string& category) const {
        std::vector<std::string> out;
        for (const auto& e : sink_->entries())
            if (e.category == category) out.push_back(e.message);
        return out;
    }
    CaptureLogSink& sink() { return *sink_; }

private:
    std::shared_ptr<CaptureLogSink> sink_;
};

}  // namespace orvane::tooltest
