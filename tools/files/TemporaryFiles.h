#pragma once
// The temporary files of a command's outputs, removed when a signal ends the command half
// way (SIGINT, SIGTERM, SIGHUP, and SIGPIPE when a reader goes away), so that an interrupted
// run leaves every old output whole and nothing beside it.
//
// The handler only unlinks the registered paths and then lets the signal end the process as
// it would have: it keeps to async-signal-safe calls and a fixed table of paths.

#include <string>

namespace orvane::files {

class TemporaryFiles {
public:
    // How many temporary files can be registered at once; a file that finds no place is
    // still removed by its output, just not by a signal.
    static constexpr int kCapacity = 16;

    // Returns the slot, or -1 when none is free or the path is too long.
    static int add(const std::string& path);
    static void remove(int slot);

    // Installs the handler for the signals above whose disposition is the default one (a
    // signal the caller ignores, such as SIGHUP under nohup, stays ignored). Idempotent.
    static void removeOnSignals();
    // Unlinks every registered path; async-signal-safe, for other signal handlers.
    static void unlinkAll();
};

}  // namespace orvane::files
