#pragma once
// `orvane run` and `orvane devices`: a live touchpad through the filter to a virtual pointer
// and a gesture stream, and the list of the touchpads and lid switches there are.

#include <string>

#include "LiveSettings.h"

namespace CLI {
class App;
}

namespace orvane::live {

struct RunOptions {
    std::string config;    // --config FILE
    LiveSettings flags;    // the flags given; they win over the file
    bool stats = false;    // --stats
    bool verbose = false;  // --verbose
    std::string plugIn;    // --plugin PATH
};

// Adds the two subcommands to the program and returns them.
CLI::App* addRunCommand(CLI::App& app, RunOptions& options);
CLI::App* addDevicesCommand(CLI::App& app);

// The process exit status: 0 when stopped by SIGINT or SIGTERM; 1 with one line on
// standard error otherwise.
int runLive(const RunOptions& options);
// Lists touchpads and lid switches; 1 when there is no touchpad.
int listDevices();

// The settings in force: the configuration file (when given) under the flags. False with
// one line "FILE:LINE: ..." for a file that cannot be read or has a bad line.
bool settingsFor(const RunOptions& options, LiveSettings* settings, std::string* error);

}  // namespace orvane::live
