// The click under the surface, through the loaded plug-in.

#include <gtest/gtest.h>

#include "EndToEndSupport.h"

namespace orvane::e2e {
namespace {

TEST(ClickEndToEnd, AClickWithTwoCloseFingersAndTheSecondaryClickIsSecondary) {
    // Two fingers touch together, b (index 1) 5 mm lower than a; the click is pressed at 48
    // ms (input 8), released at 144 ms (input 20); the fingers lift at 304 ms (input 40).
    // Records: 0 the client, 1 the setting, then frame k is input k + 2.
    //
    // #2, touch-down: two fingers at rest, the scroll may begin. Two fingers with no
    // accumulated motion are also checked for closeness: 20.6 mm apart, 5 mm vertically,
    // below 260 and 120: close.
    // #8, the press: the click held with another finger touching makes the lower finger,
    // b (the one nearest the click), a resting thumb; its contact event gets the resting
    // bit 0x200 and the hand centre leaves it out. One finger touches and one rests: the
    // count fell from 2 to 1, so gesture and phase go to 0; the fingers are still close.
    // The button changed to 1 with the fingers close and the secondary click on: a button
    // event of mask 2 (button 2, pressed), first in the pointer event. Phase 0 after the
    // may-begin then withdraws it (a scroll with phase 8), and the hand event comes last.
    // The pointer event's own button mask is the click's state, 1.
    // #20, the release: the thumb still rests (its timer ran out while the click was held;
    // the release re-arms it one frame later). One finger with a resting thumb, no motion,
    // phase 8: the scroll may begin again, after the button event of mask 0 (button 1,
    // released), sent because the press was sent.
    // #21: the release is noticed; the thumb is no resting thumb any more, and nothing
    // moved: none.
    // #40, the lift: no finger, phase 0 after a may-begin: withdrawn before the hand event.
    // The touch lasted 304 ms: no tap.
    const Replay r = replayScript(kSurface +
                                  "set TwoFingersSecondaryClickEnabled on\n"
                                  "0    finger a down at 60 25\n"
                                  "+0   finger b down at 80 30\n"
                                  "+48  click down\n"
                                  "+96  click up\n"
                                  "+160 finger a up\n"
                                  "+0   finger b up\n");
    auto fingers = [](int maskA, int maskB, bool bRests, int touch = 1) {
        return std::vector<Contact>{Contact{0, 60, 25, maskA, touch}, Contact{1, 80, 30, maskB, touch, 1, bRests}};
    };
    std::vector<std::string> expected;
    expected.push_back(setProperty(1, "TwoFingersSecondaryClickEnabled", true));
    expected.push_back(returned(2, pointer({hand(0, fingers(7, 7, false)), scroll(kMayBegin)})));
    nones(expected, 3, 7);
    expected.push_back(returned(8, pointer({button(2), scroll(kCancelled), hand(1, fingers(0, 0x200, true), 1)}, 0, 0, 1)));
    nones(expected, 9, 19);
    expected.push_back(returned(20, pointer({button(0), hand(2, fingers(0, 0x200, true), 0), scroll(kMayBegin)})));
    nones(expected, 21, 39);
    expected.push_back(returned(40, pointer({scroll(kCancelled), hand(3, fingers(3, 3, false, 0))})));
    expectLines(r.stream, expected, "stream");
    expectLines(r.gestureLog,
                {gestureLine(2, "SCROLL MAY BEGIN"), gestureLine(8, "BUTTON PRESSED"),
                 gestureLine(8, "SCROLL CANCELLED", kCancelScrollMayBegin), gestureLine(20, "BUTTON RELEASED"),
                 gestureLine(20, "SCROLL MAY BEGIN"), gestureLine(40, "SCROLL CANCELLED", kCancelScrollMayBegin)},
                "log");
}

}  // namespace
}  // namespace orvane::e2e
