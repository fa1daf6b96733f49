// Bad files and bad devices given to the orvane command: one line on standard error naming
// the file and line (or the device, or the command for problems that are not the input's),
// exit status 1, never a crash or a stack trace, and no output file left behind, complete
// or partial.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "CommandSupport.h"

namespace orvane::robust {
namespace {

const std::string kHeader =
    R"({"format": "orvane-frames", "version": 1, "service": {"usagePairs": [[13, 5], [13, 34], [1, 6]], )"
    R"("properties": {"SurfaceDimensions": {"Width": 655360, "Height": 327680}}}})";
const std::string kFrame = R"({"type": 11, "timestamp": 1000000000, "fields": {"0xb0003": 0}})";

// One line, starting with `start`, exit 1, and nothing a crash or an uncaught exception
// prints.
void expectOneClearLine(const CommandResult& r, const std::string& start) {
    EXPECT_EQ(r.exitCode, 1) << r.err;
    const std::vector<std::string> lines = splitLines(r.err);
    ASSERT_EQ(lines.size(), 1u) << r.err;
    EXPECT_EQ(lines[0].rfind(start, 0), 0u) << lines[0];
    for (const char* crash : {"terminate called", "Aborted", "Sanitizer", "#0 ", "Segmentation", "what():"})
        EXPECT_EQ(r.err.find(crash), std::string::npos) << r.err;
}

// Runs `orvane replay FILE --events-out ... --log-out ...` in a scratch folder holding only
// FILE, and checks that nothing else is in the folder afterwards.
CommandResult replayLeavingNothing(const std::string& content, const std::string& name = "in.frames.jsonl") {
    ScratchFolder scratch;
    const std::string input = scratch.write(name, content);
    const CommandResult r = runOrvane({"replay", input, "--events-out", scratch.file("out.events.jsonl"),
                                       "--log-out", scratch.file("out.log.jsonl")});
    EXPECT_EQ(scratch.list(), std::vector<std::string>{name}) << "an output was left behind";
    // The same for frames.
    const CommandResult f = runOrvane({"frames", input, "--out", scratch.file("out.frames.jsonl")});
    if (f.exitCode != 0) {
        EXPECT_EQ(scratch.list(), std::vector<std::string>{name}) << "frames left an output";
    }
    return r;
}

TEST(OrvaneBadFiles, AnUnknownKeyNamesTheFileAndLine) {
    ScratchFolder scratch;
    const std::string file = scratch.write("bad.frames.jsonl", kHeader + "\n" + kFrame + "\n" +
                                                                R"({"type": 11, "timestamp": 5, "fieldz": {}})" + "\n");
    const CommandResult r = replayLeavingNothing(readFile(file));
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("in.frames.jsonl:3: unknown key \"fieldz\""), std::string::npos) << r.err;
}

// A key holding a line break once split the message over two lines.
TEST(OrvaneBadFiles, AKeyWithALineBreakStaysOnOneLine) {
    const CommandResult r = replayLeavingNothing(kHeader + "\n" + R"({"type": 11, "timestamp": 5, "time\nstamp": 1})" + "\n");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("in.frames.jsonl:2: unknown key \"time\\nstamp\""), std::string::npos) << r.err;
}

// A double field holding a string with a line break once split the message too.
TEST(OrvaneBadFiles, AStringWithALineBreakStaysOnOneLine) {
    const CommandResult r =
        replayLeavingNothing(kHeader + "\n" + R"({"type": 11, "timestamp": 5, "fields": {"0xb0000": "In\nfinity"}})" +
                             "\n");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("in.frames.jsonl:2: "), std::string::npos) << r.err;
    EXPECT_NE(r.err.find("not the string \"In\\nfinity\""), std::string::npos) << r.err;
}

// Property values nested 100,000 deep once exhausted the stack; nesting is refused past 64.
TEST(OrvaneBadFiles, DeeplyNestedPropertyValuesAreRefusedNotACrash) {
    const std::string deep = std::string(100000, '[') + std::string(100000, ']');
    const CommandResult r = replayLeavingNothing(kHeader + "\n" + R"({"setProperty": {"key": "K", "value": )" + deep +
                                                 "}}\n");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("in.frames.jsonl:2: "), std::string::npos) << r.err;
    EXPECT_NE(r.err.find("nested more than 64 deep"), std::string::npos) << r.err;

    // 64 levels are still a property value.
    const std::string ok = std::string(63, '[') + "1" + std::string(63, ']');
    ScratchFolder scratch;
    const std::string input =
        scratch.write("ok.frames.jsonl", kHeader + "\n" + R"({"setProperty": {"key": "K", "value": )" + ok + "}}\n");
    EXPECT_EQ(runOrvane({"replay", input}).exitCode, 0);
}

// Children nested deeper than the reader takes are refused with the line.
TEST(OrvaneBadFiles, DeeplyNestedChildrenAreRefusedNotACrash) {
    std::string event = R"({"type": 11, "timestamp": 0})";
    for (int i = 0; i < 5000; ++i) event = R"({"type": 11, "timestamp": 0, "children": [)" + event + "]}";
    const CommandResult r = replayLeavingNothing(kHeader + "\n" + event + "\n");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("in.frames.jsonl:2: "), std::string::npos) << r.err;
}

TEST(OrvaneBadFiles, ATruncatedLastLineNamesItsLine) {
    const CommandResult r = replayLeavingNothing(kHeader + "\n" + kFrame + "\n" + R"({"type": 11, "timestamp": 5, "fi)");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("in.frames.jsonl:3: invalid JSON"), std::string::npos) << r.err;
}

TEST(OrvaneBadFiles, BinaryGarbageIsNotARecording) {
    std::string garbage;
    for (int i = 0; i < 4096; ++i) garbage += static_cast<char>((i * 7919 + 13) & 0xff);
    const CommandResult r = replayLeavingNothing(garbage, "garbage.bin");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("garbage.bin"), std::string::npos) << r.err;
}

TEST(OrvaneBadFiles, AnEmptyFileHasNoHeader) {
    const CommandResult r = replayLeavingNothing("");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("in.frames.jsonl"), std::string::npos) << r.err;
}

TEST(OrvaneBadFiles, AMissingFileAndAFolderCannotBeRead) {
    ScratchFolder scratch;
    expectOneClearLine(runOrvane({"replay", scratch.file("missing.frames.jsonl")}),
                       scratch.file("missing.frames.jsonl") + ": cannot be read");
    // A folder once read as an empty file ("missing header").
    expectOneClearLine(runOrvane({"replay", scratch.path()}), scratch.path() + ": cannot be read (Is a directory)");
    expectOneClearLine(runOrvane({"frames", scratch.path(), "--out", "-"}),
                       scratch.path() + ": cannot be read (Is a directory)");
}

// A trackpad without "SurfaceDimensions" gets no filter; a service without the keyboard
// usage is not matched. Both name the header's line and the service.
TEST(OrvaneBadDevices, AServiceTheFilterRefusesNamesTheHeaderAndTheService) {
    const std::string noSize =
        R"({"format": "orvane-frames", "version": 1, "service": {"usagePairs": [[13, 5], [13, 34], [1, 6]]}})";
    CommandResult r = replayLeavingNothing("# a comment first\n" + noSize + "\n" + kFrame + "\n");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("in.frames.jsonl:2: "), std::string::npos) << r.err;
    EXPECT_NE(r.err.find("HIDEventService"), std::string::npos) << r.err;

    const std::string noKeyboard =
        R"({"format": "orvane-frames", "version": 1, "service": {"usagePairs": [[13, 5], [13, 34]], )"
        R"("properties": {"SurfaceDimensions": {"Width": 655360, "Height": 327680}}}})";
    r = replayLeavingNothing(noKeyboard + "\n" + kFrame + "\n");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("in.frames.jsonl:1: "), std::string::npos) << r.err;
    EXPECT_NE(r.err.find("does not match"), std::string::npos) << r.err;
}

TEST(OrvaneBadDevices, AnEvemuRecordingWithoutMultitouchNamesWhatIsMissing) {
    const CommandResult r = replayLeavingNothing("# EVEMU 1.3\nN: Mouse\nI: 0003 0001 0002 0001\n"
                                                 "P: 00 00 00 00 00 00 00 00\nB: 00 0b 00 00 00 00 00 00 00\n",
                                                 "mouse.evemu");
    expectOneClearLine(r, "");
    EXPECT_NE(r.err.find("mouse.evemu"), std::string::npos) << r.err;
}

TEST(OrvaneBadOutputs, AnOutputThatCannotBeWrittenLeavesNothing) {
    ScratchFolder scratch;
    const std::string input = scratch.write("in.frames.jsonl", kHeader + "\n" + kFrame + "\n");
    expectOneClearLine(runOrvane({"replay", input, "--events-out", scratch.file("no/such/folder.jsonl")}),
                       scratch.file("no/such/folder.jsonl") + ": cannot be written");
    expectOneClearLine(runOrvane({"frames", input, "--out", scratch.path()}), scratch.path() + ": cannot be written");
    // A log stream that cannot be written: the event stream opened before it is not left.
    expectOneClearLine(runOrvane({"replay", input, "--events-out", scratch.file("out.events.jsonl"), "--log-out",
                                  scratch.file("no/log.jsonl")}),
                       scratch.file("no/log.jsonl") + ": cannot be written");
    EXPECT_EQ(scratch.list(), std::vector<std::string>{"in.frames.jsonl"});
}

TEST(OrvaneBadPlugIns, AModuleThatIsNotThereIsTheCommandsProblem) {
    ScratchFolder scratch;
    const std::string input = scratch.write("in.frames.jsonl", kHeader + "\n" + kFrame + "\n");
    expectOneClearLine(runOrvane({"replay", input, "--plugin", scratch.file("nothing.so"), "--events-out",
                                  scratch.file("out.events.jsonl")}),
                       "orvane: ");
    // Not a module at all.
    const std::string fake = scratch.write("fake.so", "not an ELF file");
    scratch.write("OrvaneServiceFilter.json", "{\"broken\": ");
    expectOneClearLine(runOrvane({"replay", input, "--plugin", fake}), "orvane: ");
    EXPECT_EQ(scratch.list(), (std::vector<std::string>{"OrvaneServiceFilter.json", "fake.so", "in.frames.jsonl"}));
}

// A whole good replay still writes both streams, complete.
TEST(OrvaneBadFiles, AGoodReplayWritesBothStreams) {
    ScratchFolder scratch;
    const std::string input = scratch.write("in.frames.jsonl", kHeader + "\n" + kFrame + "\n");
    const CommandResult r = runOrvane({"replay", input, "--events-out", scratch.file("out.events.jsonl"), "--log-out",
                                       scratch.file("out.log.jsonl")});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(scratch.list(), (std::vector<std::string>{"in.frames.jsonl", "out.events.jsonl", "out.log.jsonl"}));
    EXPECT_EQ(splitLines(readFile(scratch.file("out.events.jsonl"))).size(), 2u);  // header, one return
}

}  // namespace
}  // namespace orvane::robust
