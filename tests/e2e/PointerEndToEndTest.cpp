// One finger moving the pointer, through the loaded plug-in.

#include <gtest/gtest.h>

#include "EndToEndSupport.h"

namespace orvane::e2e {
namespace {

TEST(PointerEndToEnd, PointerMotionComesInQuantisedSteps) {
    // The finger rests 24 ms, moves 1.25 mm right and 1.875 mm toward the click every frame
    // from 32 to 104 ms (inputs 4 to 13), rests, and lifts at 304 ms (input 38).
    //
    // Pixel deltas: 1.2 and 1.825 in the first moving frame (the 0.05 mm hysteresis centre
    // trails), 1.25 and 1.875 after. The pointer moves when the finger has been down more
    // than 40 ms and the largest accumulated motion passes 5: at 32 ms and 40 ms it has not
    // been down long enough; at 48 ms (input 6) the y motion adds up to
    // 1.825 + 1.875 + 1.875 = 5.575. From then on each frame's delta is cut down to whole
    // steps of 0.635: trunc(1.25 / 0.635) = 1 step, x = 0.635; trunc(1.875 / 0.635) = 2
    // steps, y = 1.27.
    const Replay r = replayScript(kSurface +
                                  "0    finger a down at 40 20\n"
                                  "+24  finger a move by 12.5 18.75 over 80 ms\n"
                                  "+280 finger a up\n");
    auto at = [](int moved, int mask, int touch = 1) {
        return std::vector<Contact>{Contact{0, 40 + 1.25 * moved, 20 + 1.875 * moved, mask, touch}};
    };
    std::vector<std::string> expected;
    expected.push_back(returned(0, pointer({hand(0, at(0, 7))})));
    nones(expected, 1, 3);
    expected.push_back(returned(4, pointer({hand(1, at(1, 4))})));
    expected.push_back(returned(5, pointer({hand(2, at(2, 4))})));
    for (int k = 6; k <= 13; ++k) expected.push_back(returned(k, pointer({hand(k - 3, at(k - 3, 4))}, 0.635, 1.27)));
    nones(expected, 14, 37);
    // The lift: no finger, the pointer ends; the touch lasted 304 ms, so it is no tap.
    expected.push_back(returned(38, pointer({hand(11, at(10, 3, 0))})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog, {gestureLine(6, "POINTER BEGAN"), gestureLine(38, "POINTER ENDED")}, "log");
}

}  // namespace
}  // namespace orvane::e2e
