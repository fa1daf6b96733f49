// Taps through the loaded plug-in: one and two fingers, with and without the settings, and
// tap-to-click turned on halfway through a session.
//
// A tap is recognised in the frame that reports the lift when the touch lasted less than
// 250 ms (here 88 ms), the lift is that frame (0 ms ago, less than 30), nothing has been
// reset or clicked for 250 ms (the clock starts at 1000 ms and nothing clicks) and no
// finger moved 5 mm in a frame. Touches less than 60 ms apart make it a two-finger tap.

#include <gtest/gtest.h>

#include "EndToEndSupport.h"

namespace orvane::e2e {
namespace {

const std::string kOneFingerTap =
    "0   finger a down at 80 30\n"
    "+88 finger a up\n";  // the lift is the 12th frame

const std::string kTwoFingerTap =
    "0   finger a down at 60 25\n"
    "+0  finger b down at 100 25\n"
    "+88 finger a up\n"
    "+0  finger b up\n";

std::vector<Contact> one(int mask, int touch = 1) { return {Contact{0, 80, 30, mask, touch}}; }
std::vector<Contact> two(int mask, int touch = 1) { return {Contact{0, 60, 25, mask, touch}, Contact{1, 100, 25, mask, touch}}; }

TEST(TapEndToEnd, AOneFingerTapClicksWithTapToClickOn) {
    // Records: 0 the settings' client, 1 the setting, 2 to 13 the frames.
    const Replay r = replayScript(kSurface + "set TapToClickEnabled on\n" + kOneFingerTap);
    std::vector<std::string> expected;
    expected.push_back(setProperty(1, "TapToClickEnabled", true));
    expected.push_back(returned(2, pointer({hand(0, one(7))})));
    nones(expected, 3, 12);
    // The press goes out through the dispatcher, complete: the hand event, then a button
    // event of mask 1 (button 1, pressed). Then the same pointer event is returned with the
    // button event changed to mask 0 (button 1, released).
    expected.push_back(dispatched(13, pointer({hand(1, one(3, 0)), button(1)})));
    expected.push_back(returned(13, pointer({hand(1, one(3, 0)), button(0)})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog, {gestureLine(13, "1F TAP")}, "log");
}

TEST(TapEndToEnd, AOneFingerTapWithTapToClickOffIsOnlyTheHandEvent) {
    const Replay r = replayScript(kSurface + kOneFingerTap);
    std::vector<std::string> expected;
    expected.push_back(returned(0, pointer({hand(0, one(7))})));
    nones(expected, 1, 10);
    expected.push_back(returned(11, pointer({hand(1, one(3, 0))})));
    expectLines(r.stream, expected, "stream");
    EXPECT_TRUE(r.gestureLog.empty()) << r.gestureLog.front();
}

TEST(TapEndToEnd, ATwoFingerTapWithTheSecondaryClickPressesTheSecondaryButton) {
    // Records: 0 the client, 1 and 2 the settings, 3 to 14 the frames.
    const Replay r =
        replayScript(kSurface + "set TapToClickEnabled on\nset TwoFingersSecondaryClickEnabled on\n" + kTwoFingerTap);
    std::vector<std::string> expected;
    expected.push_back(setProperty(1, "TapToClickEnabled", true));
    expected.push_back(setProperty(2, "TwoFingersSecondaryClickEnabled", true));
    // Two fingers touching together: the scroll may begin.
    expected.push_back(returned(3, pointer({hand(0, two(7)), scroll(kMayBegin)})));
    nones(expected, 4, 13);
    // The lift: a two-finger tap (the touches were 0 ms apart). The may-begin is withdrawn
    // first (the cancelling scroll), then the hand event and a button event of mask 2
    // (button 2, pressed) go out through the dispatcher; the cancelling scroll goes out
    // with the press only and the returned event carries the release (mask 0, button 1).
    expected.push_back(dispatched(14, pointer({scroll(kCancelled), hand(1, two(3, 0)), button(2)})));
    expected.push_back(returned(14, pointer({hand(1, two(3, 0)), button(0)})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog, {gestureLine(3, "SCROLL MAY BEGIN"), gestureLine(14, "SCROLL CANCELLED", kCancelScrollMayBegin),
                               gestureLine(14, "2F TAP")},
                "log");
}

TEST(TapEndToEnd, ATwoFingerTapWithoutTheSecondaryClickOnlyWithdrawsTheScroll) {
    // Records: 0 the client, 1 the setting, 2 to 13 the frames. The tap is recognised
    // (gesture 6) but the secondary click is off: the frame is handled as one without a
    // gesture, where a phase of 0 after a may-begin withdraws the scroll (phase 8) before
    // the hand event is appended.
    const Replay r = replayScript(kSurface + "set TapToClickEnabled on\n" + kTwoFingerTap);
    std::vector<std::string> expected;
    expected.push_back(setProperty(1, "TapToClickEnabled", true));
    expected.push_back(returned(2, pointer({hand(0, two(7)), scroll(kMayBegin)})));
    nones(expected, 3, 12);
    expected.push_back(returned(13, pointer({scroll(kCancelled), hand(1, two(3, 0))})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog, {gestureLine(2, "SCROLL MAY BEGIN"), gestureLine(13, "SCROLL CANCELLED", kCancelScrollMayBegin)},
                "log");
}

TEST(TapEndToEnd, TapToClickTurnedOnHalfwayClicksOnlyTheTapsAfter) {
    // Four taps 88 ms long: A at 0 ms and B at 400 ms with tap-to-click off, then a client
    // turns it on at 700 ms, then C at 800 ms and D at 1200 ms.
    //   A: recognised (gesture 5), but off: the hand event alone; gesture 5 is left
    //      standing, since only a frame with no finger, or fewer fingers than before, or
    //      another rule clears it.
    //   B: its touch-down frame still has gesture 5 (off: the hand event alone); at its lift
    //      the last gesture (5) is not a pointer or none, so B is not taken for a tap, and
    //      the lift clears the gesture.
    //   C, D: taps, and now they click: press dispatched, release returned.
    // Records: A 0-11, B 12-23, the client 24 and the setting 25 (before the frame at 800
    // ms), C 26-37, D 38-49.
    const Replay r = replayScript(kSurface +
                                  "0     finger a down at 80 30\n+88 finger a up\n"
                                  "400   finger a down at 80 30\n+88 finger a up\n"
                                  "700   set TapToClickEnabled on\n"
                                  "800   finger a down at 80 30\n+88 finger a up\n"
                                  "1200  finger a down at 80 30\n+88 finger a up\n");
    std::vector<std::string> expected;
    expected.push_back(returned(0, pointer({hand(0, one(7))})));
    nones(expected, 1, 10);
    expected.push_back(returned(11, pointer({hand(1, one(3, 0))})));
    expected.push_back(returned(12, pointer({hand(2, one(7))})));
    nones(expected, 13, 22);
    expected.push_back(returned(23, pointer({hand(3, one(3, 0))})));
    expected.push_back(setProperty(25, "TapToClickEnabled", true));
    expected.push_back(returned(26, pointer({hand(4, one(7))})));
    nones(expected, 27, 36);
    expected.push_back(dispatched(37, pointer({hand(5, one(3, 0)), button(1)})));
    expected.push_back(returned(37, pointer({hand(5, one(3, 0)), button(0)})));
    expected.push_back(returned(38, pointer({hand(6, one(7))})));
    nones(expected, 39, 48);
    expected.push_back(dispatched(49, pointer({hand(7, one(3, 0)), button(1)})));
    expected.push_back(returned(49, pointer({hand(7, one(3, 0)), button(0)})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog, {gestureLine(37, "1F TAP"), gestureLine(49, "1F TAP")}, "log");
    EXPECT_EQ(r.timeline.counts.taps, 2u);
}

}  // namespace
}  // namespace orvane::e2e
