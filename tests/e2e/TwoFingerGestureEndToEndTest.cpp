// Two-finger gestures through the loaded plug-in: scroll, a withdrawn scroll, pinch,
// rotation, and three fingers.
//
// Every scenario runs at 125 Hz (a frame every 8 ms, input record k is the frame at 8k ms
// when the script sets nothing) on the 160 x 80 mm surface, with the fingers in its upper
// part (y below 0.45 x 80 = 36 mm at touch-down), so that the lower finger is never taken
// for a resting thumb. Fingers that move do so by 1.25 mm a frame.
//
// What the rules give for two fingers that touch together, whatever comes after:
// - the touch-down frame has no accumulated motion (M = 0), two fingers, no gesture yet
//   and no may-begin: the recogniser sets scroll with zero motion, and event creation
//   turns it into a scroll that may begin (phase 0x80) after the hand event, puts the
//   gesture back to 0 and logs "SCROLL MAY BEGIN";
// - a frame in which nothing moved (every event mask 0, no button change) gives no hand
//   event, so the gesture stage returns none and the recogniser does not run;
// - the first frame of a move gives each finger a pixel delta of 1.25 - 0.05 = 1.2 mm
//   (the 0.05 mm hysteresis centre trails the finger), every later one 1.25 mm; the
//   accumulated motion M passes 5 in the fifth moving frame (1.2 + 4 x 1.25 = 6.2).

#include <gtest/gtest.h>

#include "EndToEndSupport.h"

namespace orvane::e2e {
namespace {

// Two fingers: a (contact index 0) at x = ax, b (index 1) at x = bx.
std::vector<Contact> pair(double ax, double ay, double bx, double by, int mask, int touch = 1) {
    return {Contact{0, ax, ay, mask, touch}, Contact{1, bx, by, mask, touch}};
}

TEST(TwoFingerGestureEndToEnd, AScrollThatRestsThenMoves) {
    const Replay r = replayScript(kSurface +
                                  "0    finger a down at 60 25\n"
                                  "+0   finger b down at 100 25\n"
                                  "+24  finger a move by 0 10 over 64 ms\n"  // frames at 32 ... 88 ms
                                  "+0   finger b move by 0 10 over 64 ms\n"
                                  "+112 finger a up\n"  // at 136 ms, input 17
                                  "+0   finger b up\n");
    std::vector<std::string> expected;
    // #0: touch-down, the scroll may begin.
    expected.push_back(returned(0, pointer({hand(0, pair(60, 25, 100, 25, 7)), scroll(kMayBegin)})));
    nones(expected, 1, 3);  // resting
    // #4 to #7: moving, M = 1.2, 2.45, 3.7, 4.95: not above 5, and the phase is still 0x80,
    // so nothing else happens: the hand event alone.
    for (int k = 4; k <= 7; ++k)
        expected.push_back(returned(k, pointer({hand(k - 3, pair(60, 25 + 1.25 * (k - 3), 100, 25 + 1.25 * (k - 3), 4))})));
    // #8: M = 6.2 > 5, all of it along y: the scroll begins. Its motion is the frame's
    // pixel delta cut down to whole steps of 0.635 (1.25 -> 0.635) times -2: y = -1.27;
    // x is 0 times -2, a negative zero.
    expected.push_back(returned(8, pointer({hand(5, pair(60, 31.25, 100, 31.25, 4)), scroll(kBegan, -0.0, -1.27)})));
    // #9 to #11: the scroll changes with each moving frame.
    for (int k = 9; k <= 11; ++k) {
        const double y = 25 + 1.25 * (k - 3);
        expected.push_back(returned(k, pointer({hand(k - 3, pair(60, y, 100, y, 4)), scroll(kChanged, -0.0, -1.27)})));
    }
    nones(expected, 12, 16);
    // #17: both lift (reported once out of range: touch and range 0, mask 3). No finger
    // touches, the gesture goes to 0; the last gesture was a scroll not in may-begin, so
    // the scroll ends: phase 4 after the hand event. It is no tap: the last gesture was 2.
    expected.push_back(returned(17, pointer({hand(9, pair(60, 35, 100, 35, 3, 0)), scroll(kEnded)})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog, {gestureLine(0, "SCROLL MAY BEGIN"), gestureLine(8, "SCROLL BEGAN"), gestureLine(17, "END SCROLL")},
                "log");
}

TEST(TwoFingerGestureEndToEnd, TwoFingersThatRestAndLiftWithdrawTheScroll) {
    const Replay r = replayScript(kSurface +
                                  "0    finger a down at 60 25\n"
                                  "+0   finger b down at 100 25\n"
                                  "+296 finger a up\n"  // input 37: after 250 ms, so no tap
                                  "+0   finger b up\n");
    std::vector<std::string> expected;
    expected.push_back(returned(0, pointer({hand(0, pair(60, 25, 100, 25, 7)), scroll(kMayBegin)})));
    nones(expected, 1, 36);
    // #37: no finger, gesture 0 and phase 0; the phase of the frame before was 0x80, so the
    // may-begin is withdrawn: a scroll with phase 8, appended before the hand event.
    expected.push_back(returned(37, pointer({scroll(kCancelled), hand(1, pair(60, 25, 100, 25, 3, 0))})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog, {gestureLine(0, "SCROLL MAY BEGIN"), gestureLine(37, "SCROLL CANCELLED", kCancelScrollMayBegin)},
                "log");
}

TEST(TwoFingerGestureEndToEnd, APinchScales) {
    // The fingers move apart along x, 1.25 mm a frame each: the separation grows by 2.4 mm
    // in the first moving frame (each hysteresis centre trails by 0.05 mm) and 2.5 mm in
    // every later one; the fingers' mean does not move and the line joining them does not
    // turn, so scaling dominates, x and y motion are dropped and the scale accumulates:
    // 2.4, then about 4.9 (2.5 weighed by a speed similarity just under 1), then 7.4 > 5.
    const Replay r = replayScript(kSurface +
                                  "0    finger a down at 60 25\n"
                                  "+0   finger b down at 100 25\n"
                                  "+24  finger a move by -10 0 over 64 ms\n"
                                  "+0   finger b move by 10 0 over 64 ms\n"
                                  "+112 finger a up\n"
                                  "+0   finger b up\n");
    std::vector<std::string> expected;
    expected.push_back(returned(0, pointer({hand(0, pair(60, 25, 100, 25, 7)), scroll(kMayBegin)})));
    nones(expected, 1, 3);
    expected.push_back(returned(4, pointer({hand(1, pair(58.75, 25, 101.25, 25, 4))})));
    expected.push_back(returned(5, pointer({hand(2, pair(57.5, 25, 102.5, 25, 4))})));
    // #6: the scale begins with 2.5 x 0.005 = 0.0125. Beginning withdraws the may-begin:
    // the cancelling scroll comes first, then the hand event, then the scale event.
    expected.push_back(returned(6, pointer({scroll(kCancelled), hand(3, pair(56.25, 25, 103.75, 25, 4)), scale(kBegan, 0.0125)})));
    for (int k = 7; k <= 11; ++k) {
        const double d = 1.25 * (k - 3);
        expected.push_back(returned(k, pointer({hand(k - 3, pair(60 - d, 25, 100 + d, 25, 4)), scale(kChanged, 0.0125)})));
    }
    nones(expected, 12, 16);
    // #17: the fingers lift; the last gesture was a scale, so the scale ends (z = 0).
    expected.push_back(returned(17, pointer({hand(9, pair(50, 25, 110, 25, 3, 0)), scale(kEnded, 0.0)})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog,
                {gestureLine(0, "SCROLL MAY BEGIN"), gestureLine(6, "SCROLL CANCELLED", kCancelScrollMayBegin),
                 gestureLine(6, "SCALE BEGAN"), gestureLine(17, "END SCALE")},
                "log");
}

TEST(TwoFingerGestureEndToEnd, TwoFingersTurningRotate) {
    // a (left) moves toward the click, b (right) away from it, 1.25 mm a frame each. With
    // the separation s = outer - inner of the steadied positions and u = s / |s|, the
    // rotation term is (do.x u.y - do.y u.x) - (di.x u.y - di.y u.x) = (di.y - do.y) u.x
    // for these vertical deltas: 2.4 u.x in the first moving frame, 2.5 u.x after. The
    // scale term (the change of |s|) is small beside it, and so is the weighted scaling
    // speed (|s| about 40 to 45 mm: weights 0.70 to 0.93), so rotation dominates and the
    // scale is dropped. Frame by frame (u.x = 40 / |s|):
    //   moving frame  |s| (mm)   rotation term         accumulated
    //   1             40.0719    2.4 x 0.99820 = 2.396   2.396
    //   2             40.2990    2.5 x 0.99258 = 2.481   4.877
    //   3             40.6787    2.5 x 0.98331 = 2.458   7.335 > 5: rotation, z = 0.005 x 2.458
    //   4             41.2069    2.427                   z = 0.01213
    //   5             41.8779    2.388                   z = 0.01194
    //   6             42.6850    2.343                   z = 0.01171
    //   7             43.6206    2.292                   z = 0.01146
    //   8             44.6767    2.238                   z = 0.01119
    // (|s| in frame n: sqrt(40^2 + (2.5 n - 0.1)^2), the centres trailing by 0.05 mm each.)
    const Replay r = replayScript(kSurface +
                                  "0    finger a down at 60 30\n"
                                  "+0   finger b down at 100 30\n"
                                  "+24  finger a move by 0 10 over 64 ms\n"
                                  "+0   finger b move by 0 -10 over 64 ms\n"
                                  "+112 finger a up\n"
                                  "+0   finger b up\n");
    std::vector<std::string> expected;
    expected.push_back(returned(0, pointer({hand(0, pair(60, 30, 100, 30, 7)), scroll(kMayBegin)})));
    nones(expected, 1, 3);
    expected.push_back(returned(4, pointer({hand(1, pair(60, 31.25, 100, 28.75, 4))})));
    expected.push_back(returned(5, pointer({hand(2, pair(60, 32.5, 100, 27.5, 4))})));
    expected.push_back(returned(6, pointer({scroll(kCancelled), hand(3, pair(60, 33.75, 100, 26.25, 4)), rotation(kBegan, 0.01229)})));
    const double z[] = {0.01213, 0.01194, 0.01171, 0.01146, 0.01119};
    for (int k = 7; k <= 11; ++k) {
        const double d = 1.25 * (k - 3);
        expected.push_back(returned(k, pointer({hand(k - 3, pair(60, 30 + d, 100, 30 - d, 4)), rotation(kChanged, z[k - 7])})));
    }
    nones(expected, 12, 16);
    expected.push_back(returned(17, pointer({hand(9, pair(60, 40, 100, 20, 3, 0)), rotation(kEnded, 0.0)})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog,
                {gestureLine(0, "SCROLL MAY BEGIN"), gestureLine(6, "SCROLL CANCELLED", kCancelScrollMayBegin),
                 gestureLine(6, "ROTATE BEGAN"), gestureLine(17, "END ROTATION")},
                "log");
}

TEST(TwoFingerGestureEndToEnd, ThreeFingersMakeNoGesture) {
    // Three fingers: the scroll and scale rules are for two, the may-begin for two (or a
    // finger beside a resting thumb), and three non-edge fingers are never a resting
    // thumb. The gesture stays 0: every frame that changes returns the hand event alone.
    // The touch lasts 304 ms, so the lift is no tap either.
    const Replay r = replayScript(kSurface +
                                  "0    finger a down at 50 25\n"
                                  "+0   finger b down at 80 25\n"
                                  "+0   finger c down at 110 25\n"
                                  "+24  finger a move by 0 10 over 64 ms\n"
                                  "+0   finger b move by 0 10 over 64 ms\n"
                                  "+0   finger c move by 0 10 over 64 ms\n"
                                  "+280 finger a up\n"
                                  "+0   finger b up\n"
                                  "+0   finger c up\n");
    auto three = [](double y, int mask, int touch = 1) {
        return std::vector<Contact>{Contact{0, 50, y, mask, touch}, Contact{1, 80, y, mask, touch},
                                    Contact{2, 110, y, mask, touch}};
    };
    std::vector<std::string> expected;
    expected.push_back(returned(0, pointer({hand(0, three(25, 7))})));
    nones(expected, 1, 3);
    for (int k = 4; k <= 11; ++k) expected.push_back(returned(k, pointer({hand(k - 3, three(25 + 1.25 * (k - 3), 4))})));
    nones(expected, 12, 37);
    expected.push_back(returned(38, pointer({hand(9, three(35, 3, 0))})));
    expectLines(r.stream, expected, "stream");
    EXPECT_TRUE(r.gestureLog.empty()) << r.gestureLog.front();
}

TEST(TwoFingerGestureEndToEnd, AThirdFingerEndsAScroll) {
    // The scroll of AScrollThatRestsThenMoves, then a third finger touches at 96 ms
    // (input 12): with three fingers the recogniser drops the gesture to 0, and the scroll
    // (phase 2, not a may-begin) ends in that same frame. The lift comes 304 ms after the
    // third finger's touch, so it is no tap.
    const Replay r = replayScript(kSurface +
                                  "0    finger a down at 60 25\n"
                                  "+0   finger b down at 100 25\n"
                                  "+24  finger a move by 0 10 over 64 ms\n"
                                  "+0   finger b move by 0 10 over 64 ms\n"
                                  "+72  finger c down at 80 35\n"
                                  "+304 finger a up\n"  // at 400 ms, input 50
                                  "+0   finger b up\n"
                                  "+0   finger c up\n");
    std::vector<std::string> expected;
    expected.push_back(returned(0, pointer({hand(0, pair(60, 25, 100, 25, 7)), scroll(kMayBegin)})));
    nones(expected, 1, 3);
    for (int k = 4; k <= 7; ++k)
        expected.push_back(returned(k, pointer({hand(k - 3, pair(60, 25 + 1.25 * (k - 3), 100, 25 + 1.25 * (k - 3), 4))})));
    expected.push_back(returned(8, pointer({hand(5, pair(60, 31.25, 100, 31.25, 4)), scroll(kBegan, -0.0, -1.27)})));
    for (int k = 9; k <= 11; ++k) {
        const double y = 25 + 1.25 * (k - 3);
        expected.push_back(returned(k, pointer({hand(k - 3, pair(60, y, 100, y, 4)), scroll(kChanged, -0.0, -1.27)})));
    }
    std::vector<Contact> three = pair(60, 35, 100, 35, 0);
    three.push_back(Contact{2, 80, 35, 7});
    expected.push_back(returned(12, pointer({hand(9, three), scroll(kEnded)})));
    nones(expected, 13, 49);
    std::vector<Contact> lifted = pair(60, 35, 100, 35, 3, 0);
    lifted.push_back(Contact{2, 80, 35, 3, 0});
    expected.push_back(returned(50, pointer({hand(10, lifted)})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog, {gestureLine(0, "SCROLL MAY BEGIN"), gestureLine(8, "SCROLL BEGAN"), gestureLine(12, "END SCROLL")},
                "log");
}

}  // namespace
}  // namespace orvane::e2e
