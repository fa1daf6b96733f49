// Nothing lost between input and output: replayed by the orvane command, every event record
// yields exactly one return line in the event stream, after the dispatches it caused; every
// property record one result line; a client record none; and the summary's counts agree
// with the stream. For random sessions, the bundled recordings and script, and the evemu
// recordings kept beside the repository.

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <regex>
#include <string>
#include <vector>

#include "CommandSupport.h"
#include "RandomSession.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::robust {
namespace {

namespace fs = std::filesystem;
using Json = nlohmann::json;

struct StreamCounts {
    size_t returned = 0;      // return lines with an event
    size_t returnedNone = 0;  // return lines with null
    size_t dispatched = 0;
    size_t setProperty = 0;
};

// Checks the stream record by record against the recording and counts its lines.
StreamCounts checkStream(const std::string& stream, const formats::FrameRecording& recording) {
    StreamCounts counts;
    const std::vector<std::string> lines = splitLines(stream);
    EXPECT_FALSE(lines.empty());
    if (lines.empty()) return counts;
    EXPECT_EQ(Json::parse(lines[0]), Json::parse(R"({"format": "orvane-events", "version": 1})"));

    size_t line = 1;
    for (size_t n = 0; n < recording.records.size(); ++n) {
        const formats::InputRecord& record = recording.records[n];
        SCOPED_TRACE("record " + std::to_string(n) + " (line " + std::to_string(record.line) + ")");
        size_t dispatches = 0, results = 0;
        // Every line of this record; dispatches first, then its one result.
        while (line < lines.size()) {
            const Json j = Json::parse(lines[line]);
            const int64_t input = j.at("input").get<int64_t>();
            EXPECT_GE(input, static_cast<int64_t>(n)) << "a line for an earlier record comes late: " << lines[line];
            if (input != static_cast<int64_t>(n)) break;
            ++line;
            if (j.contains("setProperty")) {
                EXPECT_EQ(record.kind, formats::InputRecord::Kind::SetProperty);
                EXPECT_EQ(j.at("setProperty").get<std::string>(), record.propertyKey);
                ++results;
                ++counts.setProperty;
                continue;
            }
            const std::string via = j.at("via").get<std::string>();
            EXPECT_EQ(record.kind, formats::InputRecord::Kind::Event);
            if (via == "dispatch") {
                EXPECT_EQ(results, 0u) << "a dispatch after the return";
                EXPECT_TRUE(j.at("event").is_object());
                ++dispatches;
                ++counts.dispatched;
            } else {
                EXPECT_EQ(via, "return");
                ++results;
                if (j.at("event").is_null()) ++counts.returnedNone;
                else ++counts.returned;
            }
        }
        switch (record.kind) {
        case formats::InputRecord::Kind::Event: EXPECT_EQ(results, 1u); break;
        case formats::InputRecord::Kind::SetProperty:
            EXPECT_EQ(results, 1u);
            EXPECT_EQ(dispatches, 0u);
            break;
        case formats::InputRecord::Kind::Client: EXPECT_EQ(results + dispatches, 0u); break;
        }
    }
    EXPECT_EQ(line, lines.size()) << "lines after the last record";
    return counts;
}

size_t summaryNumber(const std::string& summary, const std::string& pattern) {
    std::smatch m;
    if (!std::regex_search(summary, m, std::regex(pattern))) {
        ADD_FAILURE() << "no \"" << pattern << "\" in the summary:\n" << summary;
        return 0;
    }
    return std::stoul(m[1].str());
}

// Replays INPUT (with the options) and checks the stream and the summary. Returns the counts.
StreamCounts replayAndCheck(const std::string& input, const std::vector<std::string>& options) {
    ScratchFolder scratch;
    const std::string events = scratch.file("out.events.jsonl");
    std::vector<std::string> args = {"replay", input, "--events-out", events};
    args.insert(args.end(), options.begin(), options.end());
    const CommandResult replay = runOrvane(args);
    EXPECT_EQ(replay.exitCode, 0) << replay.err;

    // What the filter was given, as the command reads it.
    const CommandResult frames = runOrvane([&] {
        std::vector<std::string> a = {"frames", input, "--out", scratch.file("given.frames.jsonl")};
        a.insert(a.end(), options.begin(), options.end());
        return a;
    }());
    EXPECT_EQ(frames.exitCode, 0) << frames.err;
    formats::FrameRecording recording;
    std::string error;
    EXPECT_TRUE(formats::readFrameRecordingFile(scratch.file("given.frames.jsonl"), &recording, &error)) << error;

    const StreamCounts counts = checkStream(readFile(events), recording);
    size_t eventRecords = 0, propertyRecords = 0, clientRecords = 0;
    for (const auto& r : recording.records) {
        eventRecords += r.kind == formats::InputRecord::Kind::Event;
        propertyRecords += r.kind == formats::InputRecord::Kind::SetProperty;
        clientRecords += r.kind == formats::InputRecord::Kind::Client;
    }
    const std::string& s = replay.out;
    EXPECT_EQ(summaryNumber(s, R"(records: +(\d+))"), recording.records.size());
    EXPECT_EQ(summaryNumber(s, R"(records: +\d+ \((\d+) events)"), eventRecords);
    EXPECT_EQ(summaryNumber(s, R"((\d+) setProperty)"), propertyRecords);
    EXPECT_EQ(summaryNumber(s, R"((\d+) client\))"), clientRecords);
    EXPECT_EQ(summaryNumber(s, R"(returned: +(\d+) events)"), counts.returned);
    EXPECT_EQ(summaryNumber(s, R"(returned: +\d+ events, (\d+) none)"), counts.returnedNone);
    EXPECT_EQ(summaryNumber(s, R"(dispatched: +(\d+) events)"), counts.dispatched);
    EXPECT_EQ(counts.returned + counts.returnedNone, eventRecords);
    EXPECT_EQ(counts.setProperty, propertyRecords);
    return counts;
}

// Random sessions of 2,500 records, wired and wireless, written as frame recordings.
TEST(NothingLost, RandomSessionsYieldOneReturnPerEventAfterItsDispatches) {
    size_t dispatched = 0, properties = 0;
    for (uint64_t seed : {1u, 2u, 3u, 4u}) {
        SCOPED_TRACE("seed " + std::to_string(seed));
        RandomSession session(seed, seed % 2 == 0);
        formats::FrameRecording recording;
        recording.header = session.header();
        for (int n = 0; n < 2500; ++n) recording.records.push_back(session.next());
        ScratchFolder scratch;
        {
            std::ofstream out(scratch.file("random.frames.jsonl"), std::ios::binary);
            formats::writeFrameRecording(out, recording);
        }
        const StreamCounts counts = replayAndCheck(scratch.file("random.frames.jsonl"), {});
        dispatched += counts.dispatched;
        properties += counts.setProperty;
    }
    // The ordering of dispatches and returns was put to the test: taps clicked.
    EXPECT_GT(dispatched, 0u);
    EXPECT_GT(properties, 0u);
}

TEST(NothingLost, TheBundledRecordingAndScript) {
    for (const char* name : {"demo.frames.jsonl", "demo.gestures"}) {
        SCOPED_TRACE(name);
        const StreamCounts counts = replayAndCheck(std::string(ORVANE_TEST_RECORDINGS_DIRECTORY) + "/" + name, {});
        EXPECT_GT(counts.returned, 0u);
        EXPECT_GT(counts.dispatched, 0u);  // the demonstration's taps
    }
}

// The touchpad recordings kept beside the repository, as keyboard-cover trackpads with the
// tap settings on; the size is given where the description has no resolution.
TEST(NothingLost, EveryEvemuRecording) {
    struct Recording {
        std::string name;
        std::vector<std::string> size;
    };
    const std::vector<Recording> recordings = {
        {"alps-glidepoint.one-finger-tap.events", {"--size", "100x70"}},
        {"alps-glidepoint.two-finger-tap.events", {"--size", "100x70"}},
        {"cypress.two-finger-tap.evemu", {}},
        {"elantech.mixed.events", {"--size", "100x55"}},
        {"synaptics.two-finger-scroll-vertical.events", {"--size", "100x76"}},
    };
    const fs::path folder = ORVANE_TEST_EVEMU_RECORDINGS;
    ASSERT_TRUE(fs::is_directory(folder)) << folder;
    // Every recording there is in the list above (descriptions and notes aside).
    for (const auto& entry : fs::directory_iterator(folder)) {
        const std::string name = entry.path().filename().string();
        if (!name.ends_with(".events") && !name.ends_with(".evemu")) continue;
        EXPECT_TRUE(std::any_of(recordings.begin(), recordings.end(),
                                [&](const Recording& r) { return r.name == name; }))
            << name << " is not replayed here";
    }
    for (const Recording& r : recordings) {
        SCOPED_TRACE(r.name);
        std::vector<std::string> options = {"--keyboard-cover", "--tap-to-click", "--secondary-click"};
        options.insert(options.end(), r.size.begin(), r.size.end());
        const StreamCounts counts = replayAndCheck((folder / r.name).string(), options);
        EXPECT_GT(counts.returned, 0u);
    }
}

}  // namespace
}  // namespace orvane::robust
