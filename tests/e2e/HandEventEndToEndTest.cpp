// The UI hand event through the loaded plug-in: a lift is reported once, out of range,
// and the contact is dropped afterwards, also when the driver goes on reporting it.
//
// These frames are written directly: a gesture script's driver stops reporting a contact
// after its lift, while these drivers report it, lifted, twice more.

#include <gtest/gtest.h>

#include "EndToEndSupport.h"

namespace orvane::e2e {
namespace {

TEST(HandEventEndToEnd, ALiftIsReportedOnceOutOfRangeAndThenDropped) {
    // A finger (index 0) and a palm (index 1) touch; the palm keeps moving 1.25 mm a frame
    // toward the click so that every frame reports a change. The finger lifts at 256 ms and
    // the driver reports it lifted in two frames; then it stops reporting it.
    const formats::FrameRecording recording = rawRecording({
        rawFrame(0, {RawContact{0, 60, 25, 1, 1, 7}, RawContact{1, 120, 60, 1, 3, 7}}),
        rawFrame(256, {RawContact{0, 60, 25, 0, 1, 3}, RawContact{1, 120, 61.25, 1, 3, 4}}),
        rawFrame(264, {RawContact{0, 60, 25, 0, 1, 0}, RawContact{1, 120, 62.5, 1, 3, 4}}),
        rawFrame(272, {RawContact{1, 120, 63.75, 1, 3, 4}}),
    });
    const Replay r = replay(recording);
    std::vector<std::string> expected;
    // #0: both touch; the palm counts as touching in the hand event (its type is not 2) and
    // takes part in the hand centre, but not in the gesture: one finger, no gesture.
    expected.push_back(returned(0, pointer({hand(0, {Contact{0, 60, 25, 7}, Contact{1, 120, 60, 7, 1, 3}})})));
    // #1: the finger's lift is reported: touch 0, range 0, mask 3. The parent still touches
    // (the palm). The touch lasted 256 ms: no tap.
    expected.push_back(
        returned(1, pointer({hand(1, {Contact{0, 60, 25, 3, 0}, Contact{1, 120, 61.25, 4, 1, 3}})})));
    // #2: reported lifted again: it is taken out of the hand event (after the hand centre
    // was worked out with it). The walk goes from the last child back: the palm was stamped
    // first; after the removal at position 0 the palm moved up into it and is stamped a
    // second time, which flips its y back to the digitizer's own.
    expected.push_back(returned(
        2, pointer({hand(2, {Contact{0, 60, 25, 0, 0, 1, false, false, true}, Contact{1, 120, 62.5, 4, 1, 3, false, true}})})));
    // #3: the driver no longer reports it.
    expected.push_back(returned(3, pointer({hand(3, {Contact{1, 120, 63.75, 4, 1, 3}})})));
    expectLines(r.stream, expected, "stream");
    EXPECT_TRUE(r.gestureLog.empty()) << r.gestureLog.front();
}

TEST(HandEventEndToEnd, WhenTheLastContactIsDroppedABarePointerFollowsOnce) {
    // One finger; its lift is reported at 256 ms and the driver reports it lifted twice
    // more. In the first of those frames no contact is left: the gesture stage sends, once,
    // a bare pointer event without children, timestamp 0 and sender 0 (there is no hand
    // event to take them from). In the next one nothing.
    const formats::FrameRecording recording = rawRecording({
        rawFrame(0, {RawContact{0, 60, 25, 1, 1, 7}}),
        rawFrame(256, {RawContact{0, 60, 25, 0, 1, 3}}),
        rawFrame(264, {RawContact{0, 60, 25, 0, 1, 0}}),
        rawFrame(272, {RawContact{0, 60, 25, 0, 1, 0}}),
    });
    const Replay r = replay(recording);
    const std::vector<std::string> expected = {
        returned(0, pointer({hand(0, {Contact{0, 60, 25, 7}})})),
        returned(1, pointer({hand(1, {Contact{0, 60, 25, 3, 0}})})),
        returned(2, "pointer t=0{x=0 y=0 z=0 buttons=0}"),
        none(3),
    };
    expectLines(r.stream, expected, "stream");
    EXPECT_TRUE(r.gestureLog.empty()) << r.gestureLog.front();
}

}  // namespace
}  // namespace orvane::e2e
