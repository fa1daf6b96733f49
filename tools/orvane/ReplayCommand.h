#pragma once
// `orvane replay [INPUT] [--events-out FILE] [--log-out FILE] [--verbose]`: runs a frame
// recording through the filter as the host would, writes the event and log streams where
// asked and prints a summary for a person.

#include <string>

#include "tools/evemu/EvemuConversion.h"

namespace orvane::cli {

struct ReplayOptions {
    std::string input;      // empty: the bundled demonstration recording
    std::string eventsOut;  // empty: no event stream
    std::string logOut;     // empty: no log stream
    std::string html;       // empty: no HTML page
    std::string plugIn;     // empty: ORVANE_PLUGIN_PATH or the build's plug-in folder
    bool verbose = false;
    evemu::EvemuOptions evemu;  // how to read an evemu recording
};

// The bundled demonstration recording.
std::string demoRecordingPath();

// The process exit status: 0 on success; 2, with one line on standard error, for an output
// that is one of the inputs or another output; 1 with one line for anything else.
int runReplay(const ReplayOptions& options);

}  // namespace orvane::cli
