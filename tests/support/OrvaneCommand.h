#pragma once
// Running the orvane command from a test (its path comes from ORVANE_TEST_ORVANE_COMMAND), with
// standard input, output and error through files of a scratch folder.

#include <sys/wait.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "tests/support/ScratchFolder.h"

namespace orvane::testsupport {

inline constexpr const char* kOrvaneCommand = ORVANE_TEST_ORVANE_COMMAND;

// The text in single quotes for the shell.
inline std::string shellQuote(const std::string& s) {
    std::string q = "'";
    for (char c : s) {
        if (c == '\'') q += "'\\''";
        else q += c;
    }
    return q + "'";
}

struct CommandResult {
    int exitCode = -1;  // -1 when the command did not exit normally (a crash or a signal)
    std::string out;
    std::string err;
};

// Runs orvane with the arguments and environment assignments ("NAME=value") given.
inline CommandResult runOrvane(const std::vector<std::string>& args, const std::vector<std::string>& environment = {},
                               const std::string& standardInput = "") {
    ScratchFolder io;
    std::string command = "env";
    for (const auto& e : environment) command += " " + shellQuote(e);
    command += " " + shellQuote(kOrvaneCommand);
    for (const auto& a : args) command += " " + shellQuote(a);
    command += " <" + shellQuote(io.write("stdin", standardInput)) + " >" + shellQuote(io.file("stdout")) + " 2>" +
               shellQuote(io.file("stderr"));
    const int status = std::system(command.c_str());
    CommandResult r;
    if (status != -1 && WIFEXITED(status)) r.exitCode = WEXITSTATUS(status);
    r.out = readFile(io.file("stdout"));
    r.err = readFile(io.file("stderr"));
    return r;
}

}  // namespace orvane::testsupport
