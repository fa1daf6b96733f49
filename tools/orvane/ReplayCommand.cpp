#include "ReplayCommand.h"

#include <cstdlib>
#include <iostream>
#include <map>
#include <memory>
#include <mutex>
#include <sstream>
#include <vector>

#include "InputLoader.h"
#include "ProgressLine.h"
#include "platform/DeviceInformation.h"
#include "platform/HIDEventDispatcher.h"
#include "platform/HIDEventService.h"
#include "platform/Logging.h"
#include "platform/Timebase.h"
#include "tools/analysis/Timeline.h"
#include "tools/formats/EventJson.h"
#include "tools/formats/EventStreamWriter.h"
#include "tools/files/OutputCheck.h"
#include "tools/files/OutputFile.h"
#include "tools/files/TemporaryFiles.h"
#include "tools/formats/LogStreamSink.h"
#include "tools/host/PlugInHost.h"
#include "tools/html/ReplayPage.h"

#ifndef ORVANE_DEMO_RECORDING
#define ORVANE_DEMO_RECORDING "data/demo.frames.jsonl"
#endif

namespace orvane::cli {

std::string demoRecordingPath() { return ORVANE_DEMO_RECORDING; }

namespace {

// Counts the filter's log lines and passes them on to the log stream, to standard error
// (with --verbose and no log stream), or nowhere.
class ReplayLogSink : public LogSink {
public:
    ReplayLogSink(std::shared_ptr<formats::LogStreamSink> stream, std::shared_ptr<LogSink> echo)
        : stream_(std::move(stream)), echo_(std::move(echo)) {}

    void write(const LogRecord& record) override {
        {
            std::lock_guard<std::mutex> lock(mutex_);
            ++counts_[record.level];
        }
        if (stream_) stream_->write(record);
        if (echo_) echo_->write(record);
    }
    void setInput(int64_t input) {
        if (stream_) stream_->setInput(input);
    }
    std::map<LogLevel, size_t> counts() const {
        std::lock_guard<std::mutex> lock(mutex_);
        return counts_;
    }

private:
    std::shared_ptr<formats::LogStreamSink> stream_;
    std::shared_ptr<LogSink> echo_;
    mutable std::mutex mutex_;
    std::map<LogLevel, size_t> counts_;
};

// Puts the standard error sink back however the replay ends, before the streams close.
struct LogSinkRestorer {
    ~LogSinkRestorer() { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }
};

struct Tally {
    size_t events = 0;
    size_t setProperties = 0;
    size_t clients = 0;
    size_t returned = 0;
    size_t returnedNone = 0;
    size_t dispatched = 0;
    size_t propertiesAccepted = 0;
    std::map<std::string, size_t> byType;  // every event that left the filter, children included

    void countTypes(const HIDEvent& event) {
        ++byType[formats::eventTypeName(event.type())];
        for (const HIDEventRef& child : event.children()) countTypes(*child);
    }
};

std::string located(const formats::FrameRecording& recording, size_t line, const std::string& what) {
    return recording.name + ":" + std::to_string(line) + ": " + what;
}

void printSummary(std::ostream& out, const formats::FrameRecording& recording, const host::PlugInHost& host,
                  int64_t score, const analysis::Timeline& timeline, const Tally& tally,
                  const std::map<LogLevel, size_t>& logCounts) {
    out << "Replayed " << recording.name << " through " << host.info().className << " (matched with score "
        << score << ")\n\n";
    analysis::writeTimeline(out, timeline);
    out << '\n';
    out << "  records:     " << recording.records.size() << " (" << tally.events << " events, "
        << tally.setProperties << " setProperty, " << tally.clients << " client)\n";
    out << "  returned:    " << tally.returned << " events, " << tally.returnedNone << " none\n";
    out << "  dispatched:  " << tally.dispatched << " events\n";
    if (tally.setProperties)
        out << "  properties:  " << tally.propertiesAccepted << " of " << tally.setProperties << " accepted\n";
    out << "  event types:";
    if (tally.byType.empty()) out << " none";
    bool first = true;
    for (const auto& [name, count] : tally.byType) {
        out << (first ? " " : ", ") << name << ' ' << count;
        first = false;
    }
    out << '\n';
    size_t logLines = 0;
    for (const auto& [level, count] : logCounts) logLines += count;
    out << "  log lines:   " << logLines;
    if (logLines) {
        out << " (";
        bool firstLevel = true;
        for (const auto& [level, count] : logCounts) {
            out << (firstLevel ? "" : ", ") << logLevelName(level) << ' ' << count;
            firstLevel = false;
        }
        out << ')';
    }
    out << '\n';
}

int fail(const std::string& message) {
    std::cerr << message << '\n';
    return 1;
}

}  // namespace

int runReplay(const ReplayOptions& options) {
    if (options.verbose) {
        // The internal-build answer is read when the plug-in first asks, after loading.
        ::setenv(kInternalBuildEnvironment, "1", 1);
        Logging::setDebugEnabled(true);
    }
    std::string error;
    const std::string inputPath = options.input.empty() ? demoRecordingPath() : options.input;
    std::vector<files::NamedPath> outputs;
    if (!options.eventsOut.empty()) outputs.push_back({"--events-out", options.eventsOut});
    if (!options.logOut.empty()) outputs.push_back({"--log-out", options.logOut});
    if (!options.html.empty()) outputs.push_back({"--html", options.html});
    if (!files::checkOutputs(inputFiles(inputPath, options.evemu, options.input.empty() ? "the demonstration" : "INPUT"),
                             outputs, &error)) {
        std::cerr << error << '\n';
        return 2;
    }
    files::TemporaryFiles::removeOnSignals();
    formats::FrameRecording recording;
    bool isEvemu = false;
    if (!loadFrameInput(inputPath, options.evemu, &recording, &error, &isEvemu)) return fail(error);

    const TimebaseInfo timebase = recording.header.timebase;
    if (!Timebase::set(timebase.numer, timebase.denom)) {
        const TimebaseInfo fixed = Timebase::info();
        if (fixed.numer != timebase.numer || fixed.denom != timebase.denom)
            return fail(located(recording, recording.headerLine, "the timebase can no longer be set"));
    }

    files::OutputFile eventsFile, logFile, htmlFile;
    if (!options.eventsOut.empty() && !eventsFile.open(options.eventsOut, &error)) return fail(error);
    if (!options.logOut.empty() && !logFile.open(options.logOut, &error)) return fail(error);
    if (!options.html.empty() && !htmlFile.open(options.html, &error)) return fail(error);
    std::unique_ptr<html::ReplayPage> page;
    if (htmlFile.isOpen())
        page = std::make_unique<html::ReplayPage>(recording.name, recording.header.service.properties,
                                                  recording.header.timebase);

    std::unique_ptr<formats::EventStreamWriter> events;
    if (eventsFile.isOpen()) {
        events = std::make_unique<formats::EventStreamWriter>(eventsFile.stream());
        events->writeHeader();
    }
    std::shared_ptr<formats::LogStreamSink> logStream;
    if (logFile.isOpen()) logStream = std::make_shared<formats::LogStreamSink>(logFile.stream());
    std::shared_ptr<LogSink> echo;
    if (options.verbose && !logStream) echo = std::make_shared<StandardErrorLogSink>();
    auto logSink = std::make_shared<ReplayLogSink>(logStream, echo);
    LogSinkRestorer restorer;
    Logging::setSink(logSink);

    Tally tally;
    analysis::TimelineBuilder timeline(recording.header.timebase, recording.name);
    int64_t input = -1;
    auto dispatcher = std::make_shared<CallbackEventDispatcher>([&](const HIDEventRef& event) {
        if (!event) return;
        ++tally.dispatched;
        tally.countTypes(*event);
        timeline.addDispatched(input, *event);
        if (page) page->addDispatched(input, *event);
        // Written now: the filter may change the event once it has been sent.
        if (events) events->writeDispatched(input, *event);
    });

    auto service = std::make_shared<HIDEventService>(recording.header.service.usagePairs,
                                                     recording.header.service.properties);
    host::PlugInHost host;
    const std::string plugInPath = options.plugIn.empty() ? host::PlugInHost::defaultPlugInPath() : options.plugIn;
    if (!host.load(plugInPath, recording.header.bundle.value_or(PropertyDictionary{}), &error))
        return fail("orvane: " + error);
    int64_t score = 0;
    if (!host.matchService(service, {}, &score, &error)) {
        if (isEvemu && !options.evemu.keyboardCover)
            error = "the filter did not match this touchpad: it takes only the trackpad of a keyboard cover (touch "
                    "pad, finger and keyboard usages); add --keyboard-cover to replay the recording as one";
        return fail(located(recording, recording.headerLine, error));
    }
    if (!host.createFilter(service, &error)) return fail(located(recording, recording.headerLine, error));
    if (!host.activate(dispatcher, &error)) return fail("orvane: " + error);

    std::map<uint64_t, HIDConnectionRef> clients;
    std::vector<HIDConnectionRef> connected;  // in order of arrival; setProperty comes from the last
    // No progress line while the filter's log lines or a stream go to the terminal too.
    ProgressLine progress("replaying " + recording.name, recording.records.size(),
                          !echo && !eventsFile.isStandardOutput() && !logFile.isStandardOutput() &&
                              !htmlFile.isStandardOutput());
    for (size_t n = 0; n < recording.records.size(); ++n) {
        const formats::InputRecord& record = recording.records[n];
        input = static_cast<int64_t>(n);
        progress.update(n);
        logSink->setInput(input);
        switch (record.kind) {
        case formats::InputRecord::Kind::Event: {
            ++tally.events;
            HIDEventRef result;
            timeline.addFrame(input, record.event->timestamp());
            // Before the filter sees it: the filter changes the frame it is given.
            if (page) page->addFrame(input, *record.event);
            if (!host.filterEvent(record.event, &result, &error)) return fail(located(recording, record.line, error));
            if (result) {
                ++tally.returned;
                tally.countTypes(*result);
            } else {
                ++tally.returnedNone;
            }
            timeline.addReturned(input, result.get());
            if (page) page->addReturned(input, result.get());
            if (events) events->writeReturned(input, result.get());
            break;
        }
        case formats::InputRecord::Kind::SetProperty: {
            ++tally.setProperties;
            bool accepted = false;
            const HIDConnectionRef client = connected.empty() ? nullptr : connected.back();
            if (!host.setProperty(record.propertyValue, record.propertyKey, client, &accepted, &error))
                return fail(located(recording, record.line, error));
            if (accepted) ++tally.propertiesAccepted;
            timeline.addSetting(input, record.propertyKey, record.propertyValue, accepted);
            if (events) events->writeSetProperty(input, record.propertyKey, accepted);
            break;
        }
        case formats::InputRecord::Kind::Client: {
            ++tally.clients;
            timeline.addOtherRecord(input);
            HIDConnectionRef& client = clients[record.clientID];
            if (!client) client = std::make_shared<HIDConnection>(record.clientID);
            std::erase(connected, client);
            if (record.clientAdded) connected.push_back(client);
            if (!host.clientNotification(client, record.clientAdded, &error))
                return fail(located(recording, record.line, error));
            break;
        }
        }
    }

    progress.finish();

    if (!host.cancel(&error)) return fail("orvane: " + error);
    host.unload();
    const auto logCounts = logSink->counts();
    Logging::setSink(std::make_shared<StandardErrorLogSink>());

    const analysis::Timeline finished = timeline.finish();
    if (page) page->write(htmlFile.stream(), finished);
    // The summary stays off standard output when a stream is written there.
    const bool streamOnStandardOutput =
        eventsFile.isStandardOutput() || logFile.isStandardOutput() || htmlFile.isStandardOutput();
    if (!eventsFile.commit(&error) || !logFile.commit(&error) || !htmlFile.commit(&error)) return fail(error);

    std::ostream& summary = streamOnStandardOutput ? std::cerr : std::cout;
    printSummary(summary, recording, host, score, finished, tally, logCounts);
    return 0;
}

}  // namespace orvane::cli
