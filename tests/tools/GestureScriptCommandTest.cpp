// The orvane command given a gesture script: both commands tell it from its content.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "ToolTestSupport.h"

namespace orvane::tooltest {
namespace {

const std::string kScript =
    "# orvane gesture script\n"
    "surface 100 x 64 mm usb\n"
    "set TapToClickEnabled on\n"
    "0   finger a down at 50 32\n"
    "+8  finger a up\n";

std::string fakePlugIn() { return std::string("ORVANE_PLUGIN_PATH=") + kFakePlugInDirectory; }

TEST(GestureScriptCommand, FramesWritesTheRecordingOfAScript) {
    ScratchFolder scratch;
    const std::string input = scratch.write("tap.gestures", kScript);
    const CommandResult r = runOrvane({"frames", input, "--out", "-"});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    const std::vector<std::string> out = lines(r.out);
    ASSERT_EQ(out.size(), 5u);  // header, client, setting, two frames
    EXPECT_EQ(out[0],
              "{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": [[13, 5], [13, 34], [1, "
              "6]], \"properties\": {\"SurfaceDimensions\": {\"Height\": 419430, \"Width\": 655360}, \"Transport\": "
              "\"USB\"}}, \"timebase\": [1, 1]}");
    EXPECT_EQ(out[1], "{\"client\": {\"id\": 1, \"added\": true}}");
    EXPECT_EQ(out[2], "{\"setProperty\": {\"key\": \"TapToClickEnabled\", \"value\": true}}");
    // x = 50 / 100, y = 1 - 32 / 64; touch-down: mask 7.
    EXPECT_EQ(out[3],
              "{\"type\": 11, \"timestamp\": 1000000000, \"fields\": {\"0xb0003\": 0, \"0xb0007\": 7, \"0xb0008\": 1, "
              "\"0xb0009\": 1}, \"children\": [{\"type\": 11, \"timestamp\": 1000000000, \"fields\": {\"0xb0000\": "
              "0.5, \"0xb0001\": 0.5, \"0xb0004\": 1, \"0xb0005\": 0, \"0xb0007\": 7, \"0xb0008\": 1, \"0xb0009\": "
              "1}}]}");
    // The lift, 8 ms later: touch and range 0, mask 3.
    EXPECT_EQ(out[4],
              "{\"type\": 11, \"timestamp\": 1008000000, \"fields\": {\"0xb0003\": 0, \"0xb0007\": 3, \"0xb0008\": 0, "
              "\"0xb0009\": 0}, \"children\": [{\"type\": 11, \"timestamp\": 1008000000, \"fields\": {\"0xb0000\": "
              "0.5, \"0xb0001\": 0.5, \"0xb0004\": 1, \"0xb0005\": 0, \"0xb0007\": 3, \"0xb0008\": 0, \"0xb0009\": "
              "0}}]}");
}

TEST(GestureScriptCommand, FramesReadsAScriptFromStandardInput) {
    const CommandResult r = runOrvane({"frames", "-", "--out", "-"}, {}, "surface 10 x 10\n");
    ASSERT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(lines(r.out).size(), 1u);
}

TEST(GestureScriptCommand, ReplayRunsAScript) {
    ScratchFolder scratch;
    const std::string input = scratch.write("tap.gestures", kScript);
    const CommandResult r = runOrvane({"replay", input}, {fakePlugIn()});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    EXPECT_NE(r.out.find("Replayed " + input + " through FakeServiceFilter"), std::string::npos) << r.out;
    EXPECT_NE(r.out.find("records:     4 (2 events, 1 setProperty, 1 client)"), std::string::npos) << r.out;
    EXPECT_NE(r.out.find("Timeline of " + input), std::string::npos) << r.out;
}

TEST(GestureScriptCommand, ABadScriptStopsBothCommandsWithOneLine) {
    ScratchFolder scratch;
    const std::string input =
        scratch.write("bad.gestures", "# orvane gesture script\nsurface 100 x 64\n0 finger a down at 50 32\n+8 finger b up\n");
    const std::string expected = input + ":4: there is no finger b on the surface at 8 ms\n";
    const CommandResult frames = runOrvane({"frames", input, "--out", scratch.file("out.frames.jsonl")});
    EXPECT_EQ(frames.exitCode, 1);
    EXPECT_EQ(frames.err, expected);
    EXPECT_FALSE(fileExists(scratch.file("out.frames.jsonl")));
    const CommandResult replay = runOrvane({"replay", input}, {fakePlugIn()});
    EXPECT_EQ(replay.exitCode, 1);
    EXPECT_EQ(replay.err, expected);
}

}  // namespace
}  // namespace orvane::tooltest
