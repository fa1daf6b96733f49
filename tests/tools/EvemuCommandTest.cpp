// orvane frames and orvane replay on evemu recordings, run as a person runs them: the real
// touchpad recordings bundled in data/evemu and the hand-written
// ones of tests/tools/data. For each real recording the test says which gestures the
// filter's rules give and why.
//
// Two rules decide most of it for these old recordings. The filter reads a time of 0 as
// "never", and the statistics' reset time, button time and gesture end times start at 0;
// so in a recording whose clock starts at 0 every "time since" is simply the clock:
//   - a tap needs 250 ms since the last reset and since the last button activity, so no tap
//     can happen in the first 250 ms;
//   - the pointer needs more than 70 ms since a scale ended and 50 ms since a scroll ended,
//     so no pointer can start in the first 70 ms.
// Both alps recordings start at 0.000000 and are over by 225 ms.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <pty.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "ToolTestSupport.h"

namespace orvane::tooltest {
namespace {

using Json = nlohmann::json;

const std::string kRecordings = ORVANE_TEST_EVEMU_RECORDINGS;
const std::string kData = ORVANE_TEST_TOOLS_DATA;

std::string recording(const std::string& name) { return kRecordings + "/" + name; }

struct Replayed {
    CommandResult result;
    std::vector<std::string> gestures;  // the filter's "GESTURE ..." log lines, in order
    std::vector<Json> returned;         // the events returned, null included
    std::vector<Json> dispatched;       // the events sent through the dispatcher
};

Replayed replay(const std::string& input, const std::vector<std::string>& options) {
    ScratchFolder scratch;
    const std::string events = scratch.file("out.events.jsonl"), log = scratch.file("out.log.jsonl");
    std::vector<std::string> args = {"replay", input, "--events-out", events, "--log-out", log};
    args.insert(args.end(), options.begin(), options.end());
    Replayed r;
    r.result = runOrvane(args);
    for (const std::string& line : lines(readFile(log))) {
        const std::string message = Json::parse(line).at("message").get<std::string>();
        const size_t at = message.find("] GESTURE ");
        if (at != std::string::npos) r.gestures.push_back(message.substr(at + 2));
    }
    for (const std::string& line : lines(readFile(events))) {
        const Json j = Json::parse(line);
        if (!j.contains("via")) continue;
        (j.at("via") == "dispatch" ? r.dispatched : r.returned).push_back(j.at("event"));
    }
    return r;
}

// The phases of the scroll events in the returned events, in order.
void scrollPhases(const Json& event, std::vector<int>* phases) {
    if (event.is_null()) return;
    if (event.at("type") == 6) phases->push_back(event.value("phase", 0));
    for (const Json& child : event.value("children", Json::array())) scrollPhases(child, phases);
}

// The button masks of the button events (type 2) in an event, in order.
std::vector<int> buttonMasks(const Json& event) {
    std::vector<int> masks;
    if (event.is_null()) return masks;
    for (const Json& child : event.value("children", Json::array()))
        if (child.at("type") == 2) masks.push_back(child.at("fields").value("0x20000", 0));
    return masks;
}

const std::vector<std::string> kKeyboardCover = {"--keyboard-cover"};

TEST(EvemuRecordings, AreAllThere) {
    // Missing recordings fail the test rather than skip it.
    for (const char* name : {"alps-glidepoint.desc", "alps-glidepoint.one-finger-tap.events",
                             "alps-glidepoint.two-finger-tap.events", "cypress.two-finger-tap.evemu", "elantech.desc",
                             "elantech.mixed.events", "synaptics.desc", "synaptics.two-finger-scroll-vertical.events"})
        EXPECT_TRUE(fileExists(recording(name))) << recording(name) << " is missing";
}

struct RealRecording {
    const char* file;
    std::vector<std::string> size;  // --size where the description gives no resolution
    size_t frames;                  // its SYN_REPORT lines (none of them presses a button)
    const char* noResolution;       // where the size is missing, as the error names it
};

const RealRecording kReal[] = {
    {"alps-glidepoint.one-finger-tap.events", {"--size", "100x70"}, 8, "alps-glidepoint.one-finger-tap.events:98"},
    {"alps-glidepoint.two-finger-tap.events", {"--size", "100x70"}, 13, "alps-glidepoint.two-finger-tap.events:98"},
    {"cypress.two-finger-tap.evemu", {}, 8, nullptr},
    {"elantech.mixed.events", {"--size", "100x55"}, 397, "elantech.desc:118"},
    {"synaptics.two-finger-scroll-vertical.events", {"--size", "100x76"}, 82, "synaptics.desc:30"},
};

TEST(EvemuRecordings, EveryOneConvertsToOneFramePerReport) {
    for (const RealRecording& r : kReal) {
        SCOPED_TRACE(r.file);
        std::vector<std::string> args = {"frames", recording(r.file), "--out", "-"};
        args.insert(args.end(), r.size.begin(), r.size.end());
        const CommandResult c = runOrvane(args);
        EXPECT_EQ(c.exitCode, 0) << c.err;
        EXPECT_EQ(c.err, "");
        const std::vector<std::string> out = lines(c.out);
        ASSERT_EQ(out.size(), 1 + r.frames);
        const Json header = Json::parse(out[0]);
        EXPECT_EQ(header.at("service").at("usagePairs"), Json::parse("[[13, 5], [13, 34]]"));
        EXPECT_EQ(header.at("service").at("properties").at("Transport"), "PS/2");  // all are bus 0011
        for (size_t i = 1; i < out.size(); ++i) EXPECT_EQ(Json::parse(out[i]).at("type"), 11);
    }
}

TEST(EvemuRecordings, WithoutAResolutionTheSizeMustBeGiven) {
    for (const RealRecording& r : kReal) {
        if (!r.noResolution) continue;
        SCOPED_TRACE(r.file);
        const CommandResult c = runOrvane({"frames", recording(r.file), "--out", "-"});
        EXPECT_EQ(c.exitCode, 1);
        EXPECT_EQ(c.err, kRecordings + "/" + r.noResolution +
                             ": ABS_MT_POSITION_X gives no resolution, so the surface size is unknown: give it with "
                             "--size WIDTHxHEIGHT in millimetres (for example --size 100x60)\n");
    }
}

TEST(EvemuRecordings, TheCypressSizeComesFromItsResolution) {
    const CommandResult c = runOrvane({"frames", recording("cypress.two-finger-tap.evemu"), "--out", "-"});
    ASSERT_EQ(c.exitCode, 0) << c.err;
    // 1600 units at 16 per mm and 900 at 15 per mm: 10 x 6 cm.
    EXPECT_EQ(Json::parse(lines(c.out).at(0)).at("service").at("properties").at("SurfaceDimensions"),
              Json::parse("{\"Height\": 393216, \"Width\": 655360}"));
}

TEST(EvemuRecordings, AnAlpsRecordingUsesItsOwnDescriptionNotTheSiblingOne) {
    // The .events file carries the description of the pad that recorded it (0..2000 x
    // 0..1400; its x reaches 1382, past the 1360 of alps-glidepoint.desc beside it). The
    // first contact at x 1038 is therefore 1038 / 2000.
    const CommandResult c = runOrvane(
        {"frames", recording("alps-glidepoint.one-finger-tap.events"), "--size", "100x70", "--out", "-"});
    ASSERT_EQ(c.exitCode, 0) << c.err;
    const Json first = Json::parse(lines(c.out).at(1));
    EXPECT_DOUBLE_EQ(first.at("children").at(0).at("fields").at("0xb0000").get<double>(), 1038.0 / 2000.0);
}

TEST(EvemuRecordings, TheFilterMatchesThemOnlyAsAKeyboardCoverTrackpad) {
    for (const RealRecording& r : kReal) {
        SCOPED_TRACE(r.file);
        std::vector<std::string> args = {"replay", recording(r.file)};
        args.insert(args.end(), r.size.begin(), r.size.end());
        const CommandResult c = runOrvane(args);
        EXPECT_EQ(c.exitCode, 1);
        EXPECT_EQ(lines(c.err).size(), 1u) << c.err;
        EXPECT_NE(c.err.find(": the filter did not match this touchpad: it takes only the trackpad of a keyboard "
                             "cover (touch pad, finger and keyboard usages); add --keyboard-cover to replay the "
                             "recording as one\n"),
                  std::string::npos)
            << c.err;
    }
    // The message points at the description's first line.
    const CommandResult c = runOrvane({"replay", recording("cypress.two-finger-tap.evemu")});
    EXPECT_EQ(c.err.rfind(recording("cypress.two-finger-tap.evemu") + ":86: ", 0), 0u) << c.err;
}

TEST(EvemuRecordings, EveryOneReplaysWithEverySetting) {
    for (const RealRecording& r : kReal) {
        SCOPED_TRACE(r.file);
        std::vector<std::string> options = {"--keyboard-cover", "--tap-to-click", "--secondary-click"};
        options.insert(options.end(), r.size.begin(), r.size.end());
        const Replayed replayed = replay(recording(r.file), options);
        EXPECT_EQ(replayed.result.exitCode, 0) << replayed.result.err;
        EXPECT_EQ(replayed.result.err, "");
        EXPECT_EQ(replayed.returned.size(), r.frames);  // one answer per frame
        EXPECT_NE(replayed.result.out.find("properties:  2 of 2 accepted"), std::string::npos) << replayed.result.out;
    }
}

// One finger touches at 0 ms, wanders about 2 mm and lifts at 71.5 ms.
TEST(EvemuRecordings, AlpsOneFingerTapGivesNoGestureBecauseItsClockStartsAtZero) {
    const Replayed r = replay(recording("alps-glidepoint.one-finger-tap.events"),
                              {"--keyboard-cover", "--tap-to-click", "--size", "100x70"});
    ASSERT_EQ(r.result.exitCode, 0) << r.result.err;
    // Its last touching frame is at 61.3 ms, short of the 70 ms the pointer waits after
    // the "never" scale end; the tap at 71.5 ms falls short of 250 ms since the "never"
    // reset. Tap-to-click changes nothing: no gesture at all, nothing dispatched.
    EXPECT_EQ(r.gestures, std::vector<std::string>{});
    EXPECT_TRUE(r.dispatched.empty());
}

// One finger at 0 ms, a second at 30.6 ms (a semi-multitouch pad: the two slots are the
// corners of the box around the fingers), the second lifts at 214.3 ms, the first at
// 224.5 ms.
TEST(EvemuRecordings, AlpsTwoFingerTapCannotTapWithinItsFirst250Milliseconds) {
    const Replayed r = replay(recording("alps-glidepoint.two-finger-tap.events"),
                              {"--keyboard-cover", "--tap-to-click", "--secondary-click", "--size", "100x70"});
    ASSERT_EQ(r.result.exitCode, 0) << r.result.err;
    // The lifts at 214.3 and 224.5 ms would be a tap by their timing, but the clock is below
    // 250 ms: no tap, no click. No pointer either: one finger touches alone only before
    // 40 ms after its touch-down (at 0) and in the frame right after the other lifted
    // (the pointer waits 20 ms after a lift-off).
    for (const std::string& g : r.gestures) {
        EXPECT_EQ(g.find("TAP"), std::string::npos) << g;
        EXPECT_EQ(g.find("POINTER"), std::string::npos) << g;
        EXPECT_EQ(g.find("BUTTON"), std::string::npos) << g;
    }
    EXPECT_TRUE(r.dispatched.empty());
}

// Two fingers touch in the same frame, stay within half a millimetre of where they landed
// and lift together 108 ms later. Its clock is the time of day, far from 0.
TEST(EvemuRecordings, CypressTwoFingerTapClicksTheSecondaryButton) {
    const Replayed r = replay(recording("cypress.two-finger-tap.evemu"),
                              {"--keyboard-cover", "--tap-to-click", "--secondary-click"});
    ASSERT_EQ(r.result.exitCode, 0) << r.result.err;
    // Frame 0: two fingers and no accumulated motion: a scroll that may begin. They never
    // move 5 mm, so it never begins. At the lift: touched 108 ms ago (< 250), lifted now
    // (< 30 ms), both touch-downs in the same frame (< 60 ms apart): a two-finger tap. Its
    // press withdraws the may-begin scroll and goes out at once with mask 2; the returned
    // event carries the release.
    EXPECT_EQ(r.gestures, (std::vector<std::string>{"GESTURE SCROLL MAY BEGIN", "GESTURE SCROLL CANCELLED",
                                                    "GESTURE 2F TAP"}));
    ASSERT_EQ(r.dispatched.size(), 1u);
    EXPECT_EQ(buttonMasks(r.dispatched[0]), std::vector<int>{2});
    std::vector<int> dispatchedPhases;
    scrollPhases(r.dispatched[0], &dispatchedPhases);
    EXPECT_EQ(dispatchedPhases, std::vector<int>{8});  // the cancel goes out with the press only
    ASSERT_EQ(r.returned.size(), 8u);
    EXPECT_EQ(buttonMasks(r.returned.back()), std::vector<int>{0});
    std::vector<int> phases;
    for (const Json& e : r.returned) scrollPhases(e, &phases);
    EXPECT_EQ(phases, std::vector<int>{0x80});
}

TEST(EvemuRecordings, CypressTwoFingerTapWithoutTheSecondaryClickOnlyWithdrawsTheScroll) {
    const Replayed r = replay(recording("cypress.two-finger-tap.evemu"), {"--keyboard-cover", "--tap-to-click"});
    ASSERT_EQ(r.result.exitCode, 0) << r.result.err;
    // The two-finger tap is recognised, but it clicks only with both settings on; the
    // may-begin scroll is withdrawn all the same (phase 8).
    EXPECT_EQ(r.gestures, (std::vector<std::string>{"GESTURE SCROLL MAY BEGIN", "GESTURE SCROLL CANCELLED"}));
    EXPECT_TRUE(r.dispatched.empty());
    std::vector<int> phases;
    for (const Json& e : r.returned) scrollPhases(e, &phases);
    EXPECT_EQ(phases, (std::vector<int>{0x80, 8}));
}

// Three long touches of one finger (0 to 4493 ms, 4766 to 11261 ms, 11791 to 13526 ms),
// each moving tens of millimetres; one slot only, no button pressed.
TEST(EvemuRecordings, ElantechMixedSessionIsThreePointerMovements) {
    const Replayed r = replay(recording("elantech.mixed.events"),
                              {"--keyboard-cover", "--tap-to-click", "--secondary-click", "--size", "100x55"});
    ASSERT_EQ(r.result.exitCode, 0) << r.result.err;
    // One finger moving more than 5 mm, long after any end time: the pointer begins in each
    // touch and ends when the finger lifts. Each touch lasts far longer than the 250 ms a
    // tap may take, so there is no tap.
    const std::vector<std::string> pointer = {"GESTURE POINTER BEGAN", "GESTURE POINTER ENDED"};
    EXPECT_EQ(r.gestures, (std::vector<std::string>{pointer[0], pointer[1], pointer[0], pointer[1], pointer[0],
                                                    pointer[1]}));
    EXPECT_TRUE(r.dispatched.empty());
}

// Two fingers land in the same frame and scroll up and down the pad together for two
// seconds, then lift together. The lower finger lands above the thumb rest zone (y 0.438 of
// the height, the zone starts at 0.45), so it is never taken for a resting thumb.
TEST(EvemuRecordings, SynapticsTwoFingerScrollGivesScrollPhases) {
    const Replayed r =
        replay(recording("synaptics.two-finger-scroll-vertical.events"),
               {"--keyboard-cover", "--tap-to-click", "--secondary-click", "--size", "100x76"});
    ASSERT_EQ(r.result.exitCode, 0) << r.result.err;
    // Frame 0: two fingers, no motion yet: may begin. Then both move down the pad by the
    // same amount (y dominates the accumulated motion) and past 5 mm: the scroll begins,
    // changes while they move, and ends when they lift. Too long for a tap.
    EXPECT_EQ(r.gestures, (std::vector<std::string>{"GESTURE SCROLL MAY BEGIN", "GESTURE SCROLL BEGAN",
                                                    "GESTURE END SCROLL"}));
    EXPECT_TRUE(r.dispatched.empty());
    std::vector<int> phases;
    for (const Json& e : r.returned) scrollPhases(e, &phases);
    ASSERT_GE(phases.size(), 4u);
    EXPECT_EQ(phases[0], 0x80);
    EXPECT_EQ(phases[1], 1);
    for (size_t i = 2; i + 1 < phases.size(); ++i) EXPECT_EQ(phases[i], 2) << i;
    EXPECT_EQ(phases.back(), 4);
    // The fingers first move toward the bottom edge (larger y); the scroll runs the other
    // way (twice the motion, sign inverted).
    for (const Json& e : r.returned) {
        std::vector<int> p;
        scrollPhases(e, &p);
        if (p != std::vector<int>{1}) continue;
        for (const Json& child : e.at("children")) {
            if (child.at("type") != 6) continue;
            EXPECT_LT(child.at("fields").at("0x60001").get<double>(), 0.0);
        }
    }
}

TEST(EvemuRecordings, HandWrittenBluetoothRecordingReplays) {
    const Replayed r = replay(kData + "/bluetooth.evemu", kKeyboardCover);
    ASSERT_EQ(r.result.exitCode, 0) << r.result.err;
    EXPECT_EQ(r.returned.size(), 7u);
}

TEST(EvemuCommand, EvemuOptionsAreRefusedForOtherInputs) {
    const CommandResult c = runOrvane({"frames", kDemoRecording, "--keyboard-cover", "--out", "-"});
    EXPECT_EQ(c.exitCode, 1);
    EXPECT_EQ(c.err, std::string("orvane: --desc, --size, --keyboard-cover, --tap-to-click and --secondary-click are "
                                 "for evemu recordings, and ") +
                         kDemoRecording + " is not one\n");
}

TEST(EvemuCommand, AMalformedSizeIsAUsageError) {
    const CommandResult c = runOrvane({"frames", kData + "/clickpad.evemu", "--size", "100x", "--out", "-"});
    EXPECT_EQ(c.exitCode, 2);
    EXPECT_EQ(lines(c.err).size(), 1u) << c.err;
    EXPECT_NE(c.err.find("--size must be WIDTHxHEIGHT in millimetres"), std::string::npos) << c.err;
}

TEST(EvemuCommand, HelpNamesTheEvemuOptions) {
    for (const char* command : {"frames", "replay"}) {
        const CommandResult c = runOrvane({command, "--help"});
        EXPECT_EQ(c.exitCode, 0);
        for (const char* option : {"--desc", "--size", "--keyboard-cover", "--tap-to-click", "--secondary-click"})
            EXPECT_NE(c.out.find(option), std::string::npos) << command << " " << option;
    }
}

TEST(EvemuCommand, StandardInputTakesARecordingWithItsDescription) {
    const CommandResult c = runOrvane({"frames", "-", "--out", "-"}, {}, readFile(kData + "/clickpad.evemu"));
    EXPECT_EQ(c.exitCode, 0) << c.err;
    EXPECT_EQ(lines(c.out).size(), 11u);  // the header and ten frames
    const CommandResult bare = runOrvane({"frames", "-", "--out", "-", "--desc", kData + "/buttons.desc", "--size",
                                          "70x40"},
                                         {}, readFile(kData + "/buttons.two-presses.events"));
    EXPECT_EQ(bare.exitCode, 0) << bare.err;
    EXPECT_EQ(lines(bare.out).size(), 12u);  // the header, five frames and six button events
}

// A recording of `frames` frames: one finger moving right across the clickpad.
std::string longRecording(const ScratchFolder& scratch, int frames, const std::string& name = "long.evemu") {
    std::string text = readFile(kData + "/clickpad.evemu");
    text.resize(text.find("################################"));  // its description only
    char line[96];
    std::snprintf(line, sizeof line, "E: 5.000000 0003 0039 0001\n");
    text += line;
    for (int i = 0; i < frames; ++i) {
        const int us = 5000000 + i * 8000;
        std::snprintf(line, sizeof line, "E: %d.%06d 0003 0035 %04d\nE: %d.%06d 0000 0000 0000\n", us / 1000000,
                      us % 1000000, i % 1000, us / 1000000, us % 1000000);
        text += line;
    }
    return scratch.write(name, text);
}

// Runs orvane with standard error on a terminal (standard output to a file) and returns
// everything the terminal showed.
std::string runOnATerminal(const std::vector<std::string>& args, int* exitCode) {
    int master = -1;
    const pid_t child = ::forkpty(&master, nullptr, nullptr, nullptr);
    if (child == 0) {
        const int null = ::open("/dev/null", O_WRONLY);
        ::dup2(null, STDOUT_FILENO);
        std::vector<char*> argv;
        argv.push_back(const_cast<char*>(kOrvaneCommand));
        for (const std::string& a : args) argv.push_back(const_cast<char*>(a.c_str()));
        argv.push_back(nullptr);
        ::execv(kOrvaneCommand, argv.data());
        ::_exit(127);
    }
    std::string shown;
    char buffer[4096];
    for (;;) {
        const ssize_t n = ::read(master, buffer, sizeof buffer);
        if (n > 0) shown.append(buffer, size_t(n));
        else if (n < 0 && errno == EINTR) continue;
        else break;  // EIO once the child has gone
    }
    int status = 0;
    ::waitpid(child, &status, 0);
    ::close(master);
    *exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    return shown;
}

TEST(EvemuCommand, LongReplaysShowProgressOnATerminal) {
    ScratchFolder scratch;
    const std::string input = longRecording(scratch, 1500);  // 1500 records, above the 1000 that count as long
    int exitCode = -1;
    const std::string shown = runOnATerminal({"replay", input, "--keyboard-cover"}, &exitCode);
    EXPECT_EQ(exitCode, 0) << shown;
    // One line redrawn in place (a carriage return, then the line wiped), at 0 % and ending
    // at 99 % (1499 of 1500 done when the last record starts), then wiped.
    EXPECT_NE(shown.find("\r\033[Korvane: replaying " + input + ": 0 / 1500 records (0%)"), std::string::npos)
        << shown;
    EXPECT_NE(shown.find("orvane: replaying " + input + ": 1485 / 1500 records (99%)"), std::string::npos);
    EXPECT_EQ(shown.find("(100%)"), std::string::npos);
    EXPECT_EQ(shown.find('\n'), std::string::npos);  // never a new line
    ASSERT_GE(shown.size(), 4u);
    EXPECT_EQ(shown.substr(shown.size() - 4), "\r\033[K");
    // Once per percent: 100 redraws.
    size_t redraws = 0;
    for (size_t at = shown.find("records ("); at != std::string::npos; at = shown.find("records (", at + 1)) ++redraws;
    EXPECT_EQ(redraws, 100u);
}

TEST(EvemuCommand, NoProgressWhenNotATerminalOrForShortInputs) {
    ScratchFolder scratch;
    const std::string input = longRecording(scratch, 1500);
    const CommandResult piped = runOrvane({"replay", input, "--keyboard-cover"});
    EXPECT_EQ(piped.exitCode, 0) << piped.err;
    EXPECT_EQ(piped.err, "");
    int exitCode = -1;
    const std::string shortRun =
        runOnATerminal({"replay", longRecording(scratch, 998, "short.evemu"), "--keyboard-cover"}, &exitCode);
    EXPECT_EQ(exitCode, 0);
    EXPECT_EQ(shortRun, "");  // 998 records
    // Nor while a stream goes to the same terminal's standard output.
    const std::string streamed = runOnATerminal({"replay", input, "--keyboard-cover", "--events-out", "-"}, &exitCode);
    EXPECT_EQ(exitCode, 0);
    EXPECT_EQ(streamed.find("records ("), std::string::npos);
}

}  // namespace
}  // namespace orvane::tooltest
