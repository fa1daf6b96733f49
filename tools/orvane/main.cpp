// orvane: the project's command-line program.
//   orvane frames INPUT --out FILE
//   orvane replay [INPUT] [--events-out FILE] [--log-out FILE] [--verbose]
//   orvane run [DEVICE] [--config FILE] [--gesture-socket PATH] [--print] [--wait] [--stats] ...
//   orvane devices

#include <exception>
#include <iostream>
#include <string>

#include <CLI/CLI.hpp>

#include "FramesCommand.h"
#include "ReplayCommand.h"
#include "tools/evemu/EvemuConversion.h"
#include "tools/host/PlugInHost.h"
#include "tools/live/LiveCommand.h"

namespace {

// The options that say how to read an evemu recording; both commands take them.
void addEvemuOptions(CLI::App* command, orvane::evemu::EvemuOptions& options) {
    command->add_option("--desc", options.descriptionPath,
                        "Evemu: the device description (N:, I:, P:, B:, A: lines) of an events file without one. "
                        "Default: a .desc file beside it (for a.b.events, a.b.desc or a.desc).")
        ->type_name("FILE");
    command
        ->add_option_function<std::string>(
            "--size",
            [&options](const std::string& text) {
                orvane::evemu::SurfaceSize size;
                std::string error;
                if (orvane::evemu::parseSurfaceSize(text, &size, &error)) options.size = size;
            },
            "Evemu: the touchpad's surface in millimetres, needed when the description gives no resolution; "
            "replaces the size worked out from the resolutions.")
        ->type_name("WIDTHxHEIGHT")
        ->check(CLI::Validator(
            [](std::string& text) {
                orvane::evemu::SurfaceSize size;
                std::string error;
                return orvane::evemu::parseSurfaceSize(text, &size, &error) ? std::string() : error;
            },
            "WIDTHxHEIGHT"));
    command->add_flag("--keyboard-cover", options.keyboardCover,
                      "Evemu: present the touchpad as the trackpad of a keyboard cover (adds the keyboard usage), the "
                      "only device the filter matches.");
    command->add_flag("--tap-to-click", options.tapToClick,
                      "Evemu: a client turns tap-to-click on before the first frame.");
    command->add_flag("--secondary-click", options.secondaryClick,
                      "Evemu: a client turns two-finger secondary click on before the first frame.");
}

// CLI11's messages, one line each.
std::string oneLine(std::string text) {
    for (char& c : text)
        if (c == '\n' || c == '\r') c = ' ';
    while (!text.empty() && text.back() == ' ') text.pop_back();
    return text;
}

int run(int argc, char** argv) {
    CLI::App app{"Orvane: tools for the touchpad gesture filter."};
    app.require_subcommand(1);
    app.fallthrough(false);

    orvane::cli::FramesOptions frames;
    CLI::App* framesCommand = app.add_subcommand(
        "frames",
        "Write the frame recording the filter would be given for INPUT (the kind of INPUT is told from its "
        "content).");
    framesCommand->add_option("INPUT", frames.input, "Input file: a frame recording (*.frames.jsonl), an evemu "
                                                     "recording of a touchpad or a gesture script; - reads "
                                                     "standard input.")
        ->required()
        ->type_name("FILE");
    framesCommand->add_option("--out,-o", frames.out, "Where to write the frame recording; - is standard output.")
        ->required()
        ->type_name("FILE");
    addEvemuOptions(framesCommand, frames.evemu);

    orvane::cli::ReplayOptions replay;
    CLI::App* replayCommand = app.add_subcommand(
        "replay",
        "Run INPUT through the filter as the host would (match, construct, configure, activate, one event at a "
        "time, cancel) and print a summary.");
    replayCommand->add_option("INPUT", replay.input,
                              "Input file: a frame recording (*.frames.jsonl), an evemu recording of a touchpad or "
                              "a gesture script; - reads standard input. Default: "
                              "the bundled demonstration recording " +
                                  orvane::cli::demoRecordingPath() + ".")
        ->type_name("FILE");
    replayCommand->add_option("--events-out", replay.eventsOut,
                              "Write the event stream (*.events.jsonl: what left the filter) to FILE; - is "
                              "standard output.")
        ->type_name("FILE");
    replayCommand->add_option("--log-out", replay.logOut,
                              "Write the log stream (*.log.jsonl: the filter's log lines) to FILE; - is standard "
                              "output.")
        ->type_name("FILE");
    replayCommand->add_option("--html", replay.html,
                              "Write one self-contained HTML page to FILE: the surface with each finger's path, the "
                              "click and thumb zones, and the gesture timeline; - is standard output.")
        ->type_name("FILE");
    replayCommand->add_flag("--verbose,-v", replay.verbose,
                            "Answer the internal-build question with yes (ORVANE_INTERNAL_BUILD=1) and turn on "
                            "debug logging, so the filter's debug diagnostics run too. Without --log-out they go "
                            "to standard error.");
    replayCommand->add_option("--plugin", replay.plugIn,
                              "The plug-in module, or the folder holding it and OrvaneServiceFilter.json. Default: "
                              "$ORVANE_PLUGIN_PATH, else " +
                                  orvane::host::PlugInHost::builtInPlugInDirectory() + ".")
        ->type_name("PATH");
    addEvemuOptions(replayCommand, replay.evemu);

    orvane::live::RunOptions live;
    CLI::App* runCommand = orvane::live::addRunCommand(app, live);
    CLI::App* devicesCommand = orvane::live::addDevicesCommand(app);

    try {
        app.parse(argc, argv);
    } catch (const CLI::CallForHelp& e) {
        return app.exit(e);
    } catch (const CLI::CallForAllHelp& e) {
        return app.exit(e);
    } catch (const CLI::CallForVersion& e) {
        return app.exit(e);
    } catch (const CLI::ParseError& e) {
        std::cerr << "orvane: " << oneLine(e.what()) << " (see orvane --help)\n";
        return 2;
    }

    if (framesCommand->parsed()) return orvane::cli::runFrames(frames);
    if (replayCommand->parsed()) return orvane::cli::runReplay(replay);
    if (runCommand->parsed()) return orvane::live::runLive(live);
    if (devicesCommand->parsed()) return orvane::live::listDevices();
    return 2;
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return run(argc, argv);
    } catch (const std::exception& e) {
        std::cerr << "orvane: " << oneLine(e.what()) << '\n';
    } catch (...) {
        std::cerr << "orvane: an unexpected error\n";
    }
    return 1;
}
