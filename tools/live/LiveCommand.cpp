#include "LiveCommand.h"

#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <cmath>
#include <cstdlib>
#include <iostream>

#include <CLI/CLI.hpp>

#include "DeviceDiscovery.h"
#include "GestureStream.h"
#include "LatencyStats.h"
#include "LiveBridge.h"
#include "LiveRunner.h"
#include "PointerOutput.h"
#include "SystemDevices.h"
#include "UinputPointer.h"
#include "platform/DeviceInformation.h"
#include "platform/Logging.h"
#include "tools/host/PlugInHost.h"

namespace orvane::live {

namespace {

// The filter's log lines are not wanted on a live run unless asked for.
class DiscardLogSink : public LogSink {
public:
    void write(const LogRecord&) override {}
};

struct LogSinkRestorer {
    ~LogSinkRestorer() { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }
};

// SIGINT and SIGTERM make a descriptor readable, so the loop ends where it waits. SIGPIPE
// is ignored: a client that vanished is noticed by the write that fails.
class StopSignals {
public:
    ~StopSignals() {
        if (!installed_) return;
        ::sigaction(SIGINT, &oldInt_, nullptr);
        ::sigaction(SIGTERM, &oldTerm_, nullptr);
        ::sigaction(SIGPIPE, &oldPipe_, nullptr);
        ::close(pipe_[0]);
        ::close(pipe_[1]);
        writeEnd_ = -1;
    }
    bool install(std::string* error) {
        if (::pipe2(pipe_, O_NONBLOCK | O_CLOEXEC) != 0) {
            *error = "orvane: cannot set up the signal handlers";
            return false;
        }
        writeEnd_ = pipe_[1];
        struct sigaction stop {};
        stop.sa_handler = &StopSignals::handle;
        sigemptyset(&stop.sa_mask);
        struct sigaction ignore {};
        ignore.sa_handler = SIG_IGN;
        sigemptyset(&ignore.sa_mask);
        ::sigaction(SIGINT, &stop, &oldInt_);
        ::sigaction(SIGTERM, &stop, &oldTerm_);
        ::sigaction(SIGPIPE, &ignore, &oldPipe_);
        installed_ = true;
        return true;
    }
    int descriptor() const { return pipe_[0]; }

private:
    static void handle(int) {
        const int saved = errno;
        const char byte = 1;
        if (writeEnd_ >= 0) {
            const ssize_t written = ::write(writeEnd_, &byte, 1);
            (void)written;  // a full pipe already says "stop"
        }
        errno = saved;
    }
    static inline volatile sig_atomic_t writeEnd_ = -1;
    int pipe_[2] = {-1, -1};
    bool installed_ = false;
    struct sigaction oldInt_ {}, oldTerm_ {}, oldPipe_ {};
};

int fail(const std::string& line) {
    std::cerr << line << '\n';
    return 1;
}

void setFlag(CLI::App* command, const std::string& name, std::optional<bool>& into, bool value,
             const std::string& help) {
    command->add_flag_function(name, [&into, value](int64_t) { into = value; }, help);
}

}  // namespace

CLI::App* addRunCommand(CLI::App& app, RunOptions& o) {
    CLI::App* run = app.add_subcommand(
        "run",
        "Read a live touchpad (evdev) through the filter: pointer motion, scrolling, clicks and taps go to a "
        "virtual pointer (uinput); scale, rotation and every scroll phase go to a gesture stream. Runs until "
        "SIGINT or SIGTERM.");
    run->add_option_function<std::string>(
           "DEVICE", [&o](const std::string& v) { o.flags.device = v; },
           "The touchpad: its node (/dev/input/event5) or a part of its name. Default: the first touchpad found "
           "(orvane devices lists them).")
        ->type_name("DEVICE");
    run->add_option("--config,-c", o.config,
                    "Read settings from FILE: one key = value per line, each key a flag of this command without its "
                    "dashes (device, tap-to-click, secondary-click, scroll-factor, keyboard-cover, size, "
                    "gesture-socket, print, wait, grab, lid-switch). Flags win over the file.")
        ->type_name("FILE");
    setFlag(run, "--tap-to-click", o.flags.tapToClick, true, "Turn tap-to-click on (the filter's TapToClickEnabled).");
    setFlag(run, "--no-tap-to-click", o.flags.tapToClick, false, "Turn tap-to-click off.");
    setFlag(run, "--secondary-click", o.flags.twoFingerSecondaryClick, true,
            "Turn two-finger secondary click on (TwoFingersSecondaryClickEnabled): a click or tap with two fingers "
            "close together is a right click.");
    setFlag(run, "--no-secondary-click", o.flags.twoFingerSecondaryClick, false,
            "Turn two-finger secondary click off.");
    run->add_option_function<double>(
           "--scroll-factor", [&o](double v) { o.flags.scrollFactor = v; },
           "Wheel high-resolution units (120 to a detent) per unit of the filter's scroll (half a millimetre of "
           "finger travel). Default: 12, a detent per 5 mm. A negative factor reverses scrolling.")
        ->type_name("FACTOR")
        ->check(CLI::Validator(
            [](std::string& text) {
                char* end = nullptr;
                const double v = std::strtod(text.c_str(), &end);
                return (end && *end == '\0' && std::isfinite(v) && v != 0.0) ? std::string()
                                                                             : "must be a number other than 0";
            },
            "FACTOR"));
    setFlag(run, "--keyboard-cover", o.flags.keyboardCover, true,
            "Present the touchpad as the trackpad of a keyboard cover (adds the keyboard usage), the only device "
            "the filter matches.");
    run->add_option_function<std::string>(
           "--size",
           [&o](const std::string& text) {
               evemu::SurfaceSize size;
               std::string error;
               if (evemu::parseSurfaceSize(text, &size, &error)) o.flags.size = size;
           },
           "The touchpad's surface in millimetres, needed when the device gives no resolution; replaces the size "
           "worked out from the resolutions.")
        ->type_name("WIDTHxHEIGHT")
        ->check(CLI::Validator(
            [](std::string& text) {
                evemu::SurfaceSize size;
                std::string error;
                return evemu::parseSurfaceSize(text, &size, &error) ? std::string() : error;
            },
            "WIDTHxHEIGHT"));
    run->add_option_function<std::string>(
           "--gesture-socket", [&o](const std::string& v) { o.flags.gestureSocket = v; },
           "Serve the gesture stream on a Unix stream socket at PATH: one line of event JSON per scale, rotation "
           "and scroll event.")
        ->type_name("PATH");
    setFlag(run, "--print", o.flags.print, true, "Write the gesture stream to standard output too.");
    setFlag(run, "--wait", o.flags.wait, true,
            "Wait for the touchpad when it is not there, and for it to come back when it goes away.");
    setFlag(run, "--no-grab", o.flags.grab, false,
            "Do not take the touchpad for Orvane alone: the desktop then sees it too (for trying things out).");
    setFlag(run, "--no-lid-switch", o.flags.lidSwitch, false, "Do not report the lid switch to the filter.");
    run->add_flag("--stats", o.stats,
                  "On exit, print the frames handled and the latency from reading a frame's SYN_REPORT to writing "
                  "its output (median, 99th percentile, maximum).");
    run->add_flag("--verbose,-v", o.verbose,
                  "Write the filter's log lines to standard error, its debug diagnostics included.");
    run->add_option("--plugin", o.plugIn,
                    "The plug-in module, or the folder holding it and OrvaneServiceFilter.json. Default: "
                    "$ORVANE_PLUGIN_PATH, else " +
                        host::PlugInHost::builtInPlugInDirectory() + ".")
        ->type_name("PATH");
    return run;
}

CLI::App* addDevicesCommand(CLI::App& app) {
    return app.add_subcommand("devices",
                              "List the touchpads (multitouch slots and INPUT_PROP_POINTER) and lid switches, and "
                              "whether they can be read.");
}

bool settingsFor(const RunOptions& options, LiveSettings* settings, std::string* error) {
    LiveSettings file;
    if (!options.config.empty() && !readLiveSettingsFile(options.config, &file, error)) return false;
    *settings = options.flags.over(file);
    return true;
}

int runLive(const RunOptions& options) {
    std::string error;
    LiveSettings s;
    if (!settingsFor(options, &s, &error)) return fail(error);

    if (options.verbose) {
        ::setenv(kInternalBuildEnvironment, "1", 1);
        Logging::setDebugEnabled(true);
    }
    LogSinkRestorer restorer;
    if (options.verbose)
        Logging::setSink(std::make_shared<StandardErrorLogSink>());
    else
        Logging::setSink(std::make_shared<DiscardLogSink>());

    StopSignals signals;
    if (!signals.install(&error)) return fail(error);

    LatencyStats stats;
    int status = 1;
    uint64_t resyncs = 0, dropped = 0, leftOut = 0;
    {
        std::unique_ptr<UinputPointer> pointer = UinputPointer::create(&error);
        if (!pointer) return fail("orvane: " + error);
        GestureStream gestures;
        if (s.gestureSocket && !gestures.listen(*s.gestureSocket, &error)) return fail("orvane: " + error);
        if (s.print.value_or(false)) gestures.printTo(STDOUT_FILENO);

        PointerOutput output(*pointer, s.scrollFactor.value_or(PointerOutput::kDefaultScrollFactor));
        LiveBridge bridge(output, &gestures, &stats);
        SystemDevices devices(s.device.value_or(""), s.grab.value_or(true), s.lidSwitch.value_or(true));
        LiveRunner runner(devices, bridge, &gestures, std::cerr);
        BridgeSettings settings;
        settings.plugInPath = options.plugIn;
        settings.size = s.size;
        settings.keyboardCover = s.keyboardCover.value_or(false);
        settings.tapToClick = s.tapToClick;
        settings.secondaryClick = s.twoFingerSecondaryClick;
        status = runner.run(settings, s.wait.value_or(false), signals.descriptor());
        gestures.flush(200);
        resyncs = bridge.resynchronisations();
        dropped = gestures.clientsDropped();
        leftOut = gestures.printedLinesLeftOut();
    }
    if (options.stats) {
        std::ostream& out = s.print.value_or(false) ? std::cerr : std::cout;
        out << "orvane: " << stats.summary() << '\n';
        out << "orvane: " << resyncs << " resynchronisations after SYN_DROPPED, " << dropped
            << " gesture clients dropped, " << leftOut << " printed gesture lines left out\n";
    }
    return status;
}

int listDevices() {
    const InputDeviceScan scan = scanInputDevices();
    const auto pads = scan.touchpads();
    const auto lids = scan.lidSwitches();
    auto show = [](const InputDeviceInfo* d) {
        std::cout << "  " << d->node << "  " << d->describe();
        if (!d->readable) std::cout << "  cannot be read: " << d->problem;
        std::cout << '\n';
    };
    if (pads.empty()) {
        std::cout << "no touchpad found among " << scan.devices.size() << " input devices\n";
    } else {
        std::cout << "touchpads (orvane run takes the first readable one unless told which):\n";
        for (const InputDeviceInfo* d : pads) show(d);
    }
    if (!lids.empty()) {
        std::cout << "lid switches:\n";
        for (const InputDeviceInfo* d : lids) show(d);
    }
    return pads.empty() ? 1 : 0;
}

}  // namespace orvane::live
