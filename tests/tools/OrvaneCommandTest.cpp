// The orvane command run as a separate process, as a person or a script runs it.

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "ToolTestSupport.h"

namespace orvane::tooltest {
namespace {

const std::string kHeader =
    "{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": [[13, 5], [13, 34], [1, 6]], "
    "\"properties\": {\"SurfaceDimensions\": {\"Width\": 655360, \"Height\": 327680}}}}";

std::string fakePlugIn() { return std::string("ORVANE_PLUGIN_PATH=") + kFakePlugInDirectory; }

std::string demoWithoutComments() {
    std::string out;
    for (const std::string& line : lines(readFile(kDemoRecording)))
        if (!line.empty() && line[0] != '#') out += line + "\n";
    return out;
}

// Exactly one line on standard error.
void expectOneErrorLine(const CommandResult& r, const std::string& expected) {
    EXPECT_NE(r.exitCode, 0);
    EXPECT_NE(r.exitCode, -1) << "the command did not exit normally";
    EXPECT_EQ(r.err, expected + "\n");
}

TEST(OrvaneCommand, HelpNamesBothCommandsAndEveryOption) {
    const CommandResult top = runOrvane({"--help"});
    EXPECT_EQ(top.exitCode, 0);
    EXPECT_NE(top.out.find("frames"), std::string::npos);
    EXPECT_NE(top.out.find("replay"), std::string::npos);
    const CommandResult replay = runOrvane({"replay", "--help"});
    EXPECT_EQ(replay.exitCode, 0);
    for (const char* option : {"INPUT", "--events-out", "--log-out", "--verbose", "--plugin"})
        EXPECT_NE(replay.out.find(option), std::string::npos) << option;
    const CommandResult frames = runOrvane({"frames", "--help"});
    EXPECT_EQ(frames.exitCode, 0);
    EXPECT_NE(frames.out.find("--out"), std::string::npos);
}

TEST(OrvaneCommand, UsageErrorsAreOneLine) {
    const CommandResult r = runOrvane({"frames", kDemoRecording});
    EXPECT_EQ(r.exitCode, 2);
    EXPECT_EQ(lines(r.err).size(), 1u) << r.err;
    EXPECT_NE(r.err.find("--out"), std::string::npos) << r.err;
}

TEST(OrvaneCommand, FramesRewritesTheBundledRecording) {
    ScratchFolder scratch;
    const std::string out = scratch.file("demo.frames.jsonl");
    const CommandResult r = runOrvane({"frames", kDemoRecording, "--out", out});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.err, "");
    EXPECT_EQ(readFile(out), demoWithoutComments());
}

TEST(OrvaneCommand, FramesWritesToStandardOutputForADash) {
    const CommandResult r = runOrvane({"frames", kDemoRecording, "--out", "-"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.out, demoWithoutComments());
}

TEST(OrvaneCommand, FramesReadsStandardInputForADash) {
    const CommandResult r = runOrvane({"frames", "-", "--out", "-"}, {}, kHeader + "\n");
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(lines(r.out).size(), 1u);
}

// A client turns tap-to-click on; then one finger touches down, moves for 20 frames 8 ms
// apart and lifts: 24 records, 22 of them frames.
std::string oneFingerSession(const ScratchFolder& scratch) {
    std::string content = kHeader + "\n{\"client\": {\"id\": 1, \"added\": true}}\n" +
                          "{\"setProperty\": {\"key\": \"TapToClickEnabled\", \"value\": true}}\n";
    for (int frame = 0; frame < 22; ++frame) {
        const std::string t = std::to_string(1'000'000'000LL + 8'000'000LL * frame);
        const std::string touch = frame < 21 ? "1" : "0";
        content += "{\"type\": 11, \"timestamp\": " + t + ", \"fields\": {\"0xb0003\": 0}, \"children\": [{\"type\": 11, " +
                   "\"timestamp\": " + t + ", \"fields\": {\"0xb0000\": " + std::to_string(0.2 + 0.02 * frame) +
                   ", \"0xb0001\": 0.5, \"0xb0005\": 0, \"0xb0008\": " + touch + ", \"0xb0009\": " + touch + "}}]}\n";
    }
    return scratch.write("session.frames.jsonl", content);
}

TEST(OrvaneCommand, ReplayWritesTheEventAndLogStreams) {
    ScratchFolder scratch;
    const std::string events = scratch.file("demo.events.jsonl");
    const std::string log = scratch.file("demo.log.jsonl");
    const CommandResult r =
        runOrvane({"replay", oneFingerSession(scratch), "--events-out", events, "--log-out", log}, {fakePlugIn()});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.err, "");

    const std::vector<std::string> e = lines(readFile(events));
    // Header; record 0 (client) writes nothing; record 1 sets a property; each of the 22
    // frames dispatches one button event and returns a pointer.
    ASSERT_EQ(e.size(), 1u + 1u + 2u * 22u);
    EXPECT_EQ(e[0], "{\"format\": \"orvane-events\", \"version\": 1}");
    EXPECT_EQ(e[1], "{\"input\": 1, \"setProperty\": \"TapToClickEnabled\", \"result\": true}");
    EXPECT_EQ(e[2],
              "{\"input\": 2, \"via\": \"dispatch\", \"event\": {\"type\": 2, \"timestamp\": 1000000000, \"fields\": "
              "{\"0x20000\": 1}}}");
    EXPECT_EQ(e[3].rfind("{\"input\": 2, \"via\": \"return\", \"event\": {\"type\": 17, \"timestamp\": 1000000000, "
                         "\"fields\": {\"0x110000\": 1.5, \"0x110001\": -2.0, \"0x110002\": 0.0, \"0x110003\": 0}, "
                         "\"children\": [{\"type\": 11, ",
                         0),
              0u)
        << e[3];
    EXPECT_EQ(e.back().rfind("{\"input\": 23, \"via\": \"return\"", 0), 0u) << e.back();

    const std::vector<std::string> l = lines(readFile(log));
    ASSERT_GE(l.size(), 4u);
    EXPECT_EQ(l[0],
              "{\"input\": -1, \"category\": \"FakeServiceFilter\", \"level\": \"default\", \"message\": "
              "\"matchService score 0\"}");
    EXPECT_NE(std::find(l.begin(), l.end(),
                        "{\"input\": 0, \"category\": \"FakeServiceFilter\", \"level\": \"default\", \"message\": "
                        "\"clientNotification <HIDConnection 1> added 1\"}"),
              l.end());
    EXPECT_NE(std::find(l.begin(), l.end(),
                        "{\"input\": 1, \"category\": \"FakeServiceFilter\", \"level\": \"default\", \"message\": "
                        "\"setProperty TapToClickEnabled = 1 client <HIDConnection 1>\"}"),
              l.end());
    EXPECT_EQ(l.back(),
              "{\"input\": 23, \"category\": \"FakeServiceFilter\", \"level\": \"default\", \"message\": "
              "\"dealloc\"}");

    EXPECT_NE(r.out.find("records:     24 (22 events, 1 setProperty, 1 client)"), std::string::npos) << r.out;
    EXPECT_NE(r.out.find("dispatched:  22 events"), std::string::npos) << r.out;
    EXPECT_NE(r.out.find("event types: button 22, digitizer 44, pointer 22"), std::string::npos) << r.out;
}

TEST(OrvaneCommand, ReplayWithoutInputReplaysTheBundledRecording) {
    const CommandResult r = runOrvane({"replay"}, {fakePlugIn()});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    EXPECT_NE(r.out.find(std::string("Replayed ") + kDemoRecording), std::string::npos) << r.out;
}

TEST(OrvaneCommand, ReplayTakesThePlugInFromAnOption) {
    const CommandResult r = runOrvane({"replay", "--plugin", kFakePlugInModule});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    EXPECT_NE(r.out.find("through FakeServiceFilter"), std::string::npos) << r.out;
}

TEST(OrvaneCommand, ReplayVerboseTurnsOnTheInternalBuildAndDebugLines) {
    ScratchFolder scratch;
    const std::string log = scratch.file("v.log.jsonl");
    CommandResult r = runOrvane({"replay", "--log-out", log, "--verbose"}, {fakePlugIn()});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    EXPECT_NE(readFile(log).find("\"category\": \"FakeServiceFilterVerbose\", \"level\": \"debug\""),
              std::string::npos);
    r = runOrvane({"replay", "--log-out", log}, {fakePlugIn(), "ORVANE_INTERNAL_BUILD=0"});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(readFile(log).find("FakeServiceFilterVerbose"), std::string::npos);
}

TEST(OrvaneCommand, ReplayStreamOnStandardOutputMovesTheSummaryToStandardError) {
    const CommandResult r = runOrvane({"replay", "--events-out", "-"}, {fakePlugIn()});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(lines(r.out).front(), "{\"format\": \"orvane-events\", \"version\": 1}");
    EXPECT_NE(r.err.find("records:"), std::string::npos);
}

TEST(OrvaneCommand, ReplayRefusesOneOutputForBothStreams) {
    expectOneErrorLine(runOrvane({"replay", "--events-out", "-", "--log-out", "-"}, {fakePlugIn()}),
                       "orvane: --events-out - (standard output) and --log-out - (standard output) are the same "
                       "output; give each one of its own");
}

TEST(OrvaneCommand, ReplayOfAServiceTheFilterDoesNotMatchNamesTheHeader) {
    ScratchFolder scratch;
    const std::string input = scratch.write(
        "keyboard.frames.jsonl",
        "{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": [[1, 6]]}}\n");
    expectOneErrorLine(runOrvane({"replay", input}, {fakePlugIn()}),
                       input + ":1: FakeServiceFilter does not match the service <HIDEventService 1 usages 1/6>");
}

TEST(OrvaneCommand, ReplayOfAServiceTheFilterRefusesNamesTheHeader) {
    ScratchFolder scratch;
    const std::string input = scratch.write(
        "bare.frames.jsonl", "\n{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": [[13, "
                             "5]]}}\n");
    expectOneErrorLine(runOrvane({"replay", input}, {fakePlugIn()}),
                       input + ":2: FakeServiceFilter refused the service <HIDEventService 1 usages 13/5> (no filter "
                               "was created)");
}

TEST(OrvaneCommand, ReplayWithAMissingPlugInIsOneLine) {
    expectOneErrorLine(runOrvane({"replay", "--plugin", "/nonexistent/plugin"}),
                       "orvane: /nonexistent/plugin: no plug-in module there");
}

TEST(OrvaneCommand, ReplayOfTheBundledRecordingThroughTheRealFilter) {
    const std::string module = std::string(kRealPlugInDirectory) + "/OrvaneServiceFilter.so";
    void* handle = ::dlopen(module.c_str(), RTLD_NOW | RTLD_LOCAL);
    const bool ready = handle && ::dlsym(handle, "OrvaneServiceFilterPlugIn");
    if (handle) ::dlclose(handle);
    if (!ready) GTEST_SKIP() << "the filter module does not export its factory yet";
    ScratchFolder scratch;
    const std::string events = scratch.file("demo.events.jsonl");
    const CommandResult r = runOrvane({"replay", "--events-out", events}, {"ORVANE_PLUGIN_PATH="});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    const std::vector<std::string> e = lines(readFile(events));
    ASSERT_FALSE(e.empty());
    EXPECT_EQ(e[0], "{\"format\": \"orvane-events\", \"version\": 1}");
    EXPECT_NE(r.out.find("through OrvaneServiceFilter (matched with score 500)"), std::string::npos) << r.out;
}

TEST(OrvaneCommand, EvemuRecordingWithoutSlotsIsOneLine) {
    ScratchFolder scratch;
    const std::string input = scratch.write("pad.evemu", "# EVEMU 1.3\nN: Touchpad\nI: 0011 0002 0007 01b1\n");
    const std::string expected = input +
                                 ":2: a single-touch device: its description has no A: line for ABS_MT_POSITION_X, "
                                 "ABS_MT_POSITION_Y, ABS_MT_SLOT and ABS_MT_TRACKING_ID, and the conversion needs "
                                 "multitouch slots with tracking IDs (protocol B)";
    expectOneErrorLine(runOrvane({"frames", input, "--out", "-"}), expected);
    expectOneErrorLine(runOrvane({"replay", input}, {fakePlugIn()}), expected);
}

TEST(OrvaneCommand, MissingInputFileIsOneLine) {
    expectOneErrorLine(runOrvane({"frames", "/nonexistent/in.frames.jsonl", "--out", "-"}),
                       "/nonexistent/in.frames.jsonl: cannot be read (No such file or directory)");
}

TEST(OrvaneCommand, FailedRunLeavesNoOutputBehind) {
    ScratchFolder scratch;
    const std::string input = scratch.write("bad.frames.jsonl", kHeader + "\n{\"type\": 11,\n");
    const std::string out = scratch.file("out.frames.jsonl");
    EXPECT_NE(runOrvane({"frames", input, "--out", out}).exitCode, 0);
    const std::string events = scratch.file("out.events.jsonl");
    EXPECT_NE(runOrvane({"replay", input, "--events-out", events}, {fakePlugIn()}).exitCode, 0);
    EXPECT_FALSE(fileExists(out));
    EXPECT_FALSE(fileExists(events));
    EXPECT_EQ(std::system(("test -z \"$(ls -A '" + scratch.path() + "' | grep -v '^bad.frames.jsonl$')\"").c_str()), 0)
        << "a temporary file was left behind";
}

struct MalformedInput {
    const char* name;
    std::string content;
    std::string expected;  // after "FILE:"
};

void PrintTo(const MalformedInput& input, std::ostream* os) { *os << input.name; }

class OrvaneMalformedInput : public ::testing::TestWithParam<MalformedInput> {};

TEST_P(OrvaneMalformedInput, FramesAndReplayStopWithOneLineNamingFileAndLine) {
    ScratchFolder scratch;
    const std::string input = scratch.write("in.frames.jsonl", GetParam().content);
    expectOneErrorLine(runOrvane({"frames", input, "--out", scratch.file("out.frames.jsonl")}),
                       input + ":" + GetParam().expected);
    expectOneErrorLine(runOrvane({"replay", input, "--events-out", scratch.file("out.events.jsonl")}, {fakePlugIn()}),
                       input + ":" + GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(
    , OrvaneMalformedInput,
    ::testing::Values(
        MalformedInput{"BadJson", kHeader + "\n{\"type\": 11, \"timestamp\": 1,,}\n",
                       "2: invalid JSON at column 29: syntax error while parsing object key - unexpected ','; "
                       "expected string literal"},
        MalformedInput{"MissingHeader", "# frames\n{\"type\": 11, \"timestamp\": 1}\n",
                       "2: missing header: the first record must be the header {\"format\": \"orvane-frames\", "
                       "\"version\": 1, ...}"},
        MalformedInput{"UnknownVersion",
                       "{\"format\": \"orvane-frames\", \"version\": 7, \"service\": {\"usagePairs\": []}}\n",
                       "1: unsupported version 7 of \"orvane-frames\" (this program reads version 1)"},
        MalformedInput{"UnknownFormat", "{\"format\": \"orvane-gestures\", \"version\": 1}\n",
                       "1: unknown format \"orvane-gestures\" (expected \"orvane-frames\")"},
        MalformedInput{"StringForAnIntegerField",
                       kHeader + "\n\n{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xb0005\": \"zero\"}}\n",
                       "3: field \"0xb0005\" must be an integer, not a string"},
        MalformedInput{"IntegerForADataField",
                       kHeader + "\n{\"type\": 1, \"timestamp\": 1, \"fields\": {\"0x10004\": 255}}\n",
                       "2: field \"0x10004\" must be a hex string, not an integer"},
        MalformedInput{"NonObjectRecord", kHeader + "\n42\n", "2: a record must be a JSON object, not an integer"},
        MalformedInput{"UnknownRecordKind", kHeader + "\n{\"hello\": 1}\n",
                       "2: unknown record kind (keys: \"hello\"); a record is an event with \"type\", "
                       "{\"setProperty\": ...} or {\"client\": ...}"},
        MalformedInput{"NotARecording", "hello\n", "1: not a frame recording"},
        MalformedInput{"Empty", "", "1: missing header: the file has no records"}),
    [](const ::testing::TestParamInfo<MalformedInput>& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace orvane::tooltest
