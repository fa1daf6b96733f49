// What the virtual pointer is given for each event the filter delivers: counts with the
// remainder carried, the wheels through the scroll factor, buttons as stateful presses and
// releases, one SYN_REPORT per delivered event that changes something.

#include <gtest/gtest.h>
#include <linux/input-event-codes.h>

#include <vector>

#include "tools/live/PointerOutput.h"
#include "tools/live/VirtualPointer.h"

namespace orvane::live {
namespace {

using W = CapturePointer::Written;

constexpr uint16_t kBegan = 1, kChanged = 2, kEnded = 4, kMayBegin = 0x80;

HIDEventRef pointer(double x, double y) { return HIDEvent::pointerEvent(1000, x, y, 0.0, 0, 0); }

HIDEventRef scroll(double x, double y, uint16_t phase) {
    HIDEventRef s = HIDEvent::scrollEvent(1000, x, y, 0.0, 0);
    s->setPhase(phase);
    return s;
}

// A pointer event without motion carrying one child.
HIDEventRef carrying(const HIDEventRef& child, uint32_t pointerMask = 0) {
    HIDEventRef p = HIDEvent::pointerEvent(1000, 0.0, 0.0, 0.0, pointerMask, 0);
    p->appendEvent(child);
    return p;
}

HIDEventRef filterButton(uint32_t mask) { return HIDEvent::createButtonEvent(1000, mask, 0); }

// A separate physical button of the touchpad, as the evemu conversion makes it.
HIDEventRef physicalButton(int64_t number, int64_t state) {
    HIDEventRef b = HIDEvent::createButtonEvent(1000, state ? 1u << (number - 1) : 0u, 0);
    b->setIntegerValue(number, kHIDEventFieldButtonNumber);
    b->setIntegerValue(state, kHIDEventFieldButtonState);
    return b;
}

class PointerOutputTest : public ::testing::Test {
protected:
    // What one delivered event wrote.
    std::vector<W> deliver(const HIDEventRef& event) {
        const size_t before = capture.written.size();
        std::string error;
        EXPECT_TRUE(output.deliver(*event, &error)) << error;
        return {capture.written.begin() + static_cast<std::ptrdiff_t>(before), capture.written.end()};
    }

    static W syn() { return {EV_SYN, SYN_REPORT, 0}; }

    CapturePointer capture;
    PointerOutput output{capture};
};

TEST_F(PointerOutputTest, PointerMotionCarriesTheFractionalRemainder) {
    // Three quanta of 0.635 along x: 0.635 writes nothing, 1.27 writes 1 and keeps 0.27,
    // 0.27 + 0.635 = 0.905 writes nothing.
    EXPECT_EQ(deliver(pointer(0.635, 0.0)), std::vector<W>{});
    EXPECT_EQ(deliver(pointer(0.635, 0.0)), (std::vector<W>{{EV_REL, REL_X, 1}, syn()}));
    EXPECT_EQ(deliver(pointer(0.635, 0.0)), std::vector<W>{});
    // 0.905 + 0.635 = 1.54: one more count, 0.54 kept.
    EXPECT_EQ(deliver(pointer(0.635, 0.0)), (std::vector<W>{{EV_REL, REL_X, 1}, syn()}));
}

TEST_F(PointerOutputTest, NegativeMotionTruncatesTowardZeroAndCarriesItsRemainder) {
    // y = -1.905: -1 written, -0.905 kept; then -0.905 - 0.635 = -1.54: -1, -0.54 kept;
    // then -0.54 + 1.27 = 0.73: nothing.
    EXPECT_EQ(deliver(pointer(0.0, -1.905)), (std::vector<W>{{EV_REL, REL_Y, -1}, syn()}));
    EXPECT_EQ(deliver(pointer(0.0, -0.635)), (std::vector<W>{{EV_REL, REL_Y, -1}, syn()}));
    EXPECT_EQ(deliver(pointer(0.0, 1.27)), std::vector<W>{});
}

TEST_F(PointerOutputTest, BothAxesGoInOneReport) {
    // 9.525 (15 quanta) and -3.175 (5 quanta): 9 and -3 counts in one report.
    EXPECT_EQ(deliver(pointer(9.525, -3.175)), (std::vector<W>{{EV_REL, REL_X, 9}, {EV_REL, REL_Y, -3}, syn()}));
}

TEST_F(PointerOutputTest, ScrollGoesToTheHighResolutionWheelsAndADetentPer120) {
    // Factor 12. y = -19.05: -228.6 units, -228 written and -0.6 kept; -228 / 120 gives one
    // detent down (-1) and keeps -108 towards the next.
    EXPECT_EQ(deliver(carrying(scroll(0.0, -19.05, kBegan))),
              (std::vector<W>{{EV_REL, REL_WHEEL_HI_RES, -228}, {EV_REL, REL_WHEEL, -1}, syn()}));
    // -0.6 - 228.6 = -229.2: -229 written; -108 - 229 = -337, two detents (-240), -97 kept.
    EXPECT_EQ(deliver(carrying(scroll(0.0, -19.05, kChanged))),
              (std::vector<W>{{EV_REL, REL_WHEEL_HI_RES, -229}, {EV_REL, REL_WHEEL, -2}, syn()}));
    // Below a detent: -5 × 12 = -60, -97 - 60 = -157: one more detent, -37 kept.
    EXPECT_EQ(deliver(carrying(scroll(0.0, -5.0, kChanged))),
              (std::vector<W>{{EV_REL, REL_WHEEL_HI_RES, -60}, {EV_REL, REL_WHEEL, -1}, syn()}));
}

TEST_F(PointerOutputTest, HorizontalScrollTurnsTheWheelTheOtherWay) {
    // The filter's x says where the content goes; the wheel where the view goes.
    // x = -19.05: +228.6 units, 228 written, one detent right.
    EXPECT_EQ(deliver(carrying(scroll(-19.05, 0.0, kBegan))),
              (std::vector<W>{{EV_REL, REL_HWHEEL_HI_RES, 228}, {EV_REL, REL_HWHEEL, 1}, syn()}));
}

TEST_F(PointerOutputTest, AScrollThatBeginsStartsTheWheelsFromZero) {
    // -9 × 12 = -108 towards a detent and -0.0 kept after the first scroll.
    EXPECT_EQ(deliver(carrying(scroll(0.0, -9.0, kBegan))), (std::vector<W>{{EV_REL, REL_WHEEL_HI_RES, -108}, syn()}));
    EXPECT_EQ(deliver(carrying(scroll(0.0, 0.0, kEnded))), std::vector<W>{});
    // A new scroll: -5 × 12 = -60 from zero, no detent (-108 - 60 would have made one).
    EXPECT_EQ(deliver(carrying(scroll(0.0, -5.0, kBegan))), (std::vector<W>{{EV_REL, REL_WHEEL_HI_RES, -60}, syn()}));
    // A scroll that may begin starts from zero too: -60 - 60 would have been -120.
    EXPECT_EQ(deliver(carrying(scroll(0.0, 0.0, kMayBegin))), std::vector<W>{});
    EXPECT_EQ(deliver(carrying(scroll(0.0, -5.0, kBegan))), (std::vector<W>{{EV_REL, REL_WHEEL_HI_RES, -60}, syn()}));
}

TEST(PointerOutputFactor, ANegativeFactorReversesScrolling) {
    CapturePointer capture;
    PointerOutput output(capture, -12.0);
    std::string error;
    // y = -10 × -12 = +120: one detent up.
    ASSERT_TRUE(output.deliver(*carrying(scroll(0.0, -10.0, kBegan)), &error));
    EXPECT_EQ(capture.written, (std::vector<W>{{EV_REL, REL_WHEEL_HI_RES, 120}, {EV_REL, REL_WHEEL, 1}, {EV_SYN, SYN_REPORT, 0}}));
}

TEST_F(PointerOutputTest, PhasesWithoutMotionWriteNothing) {
    EXPECT_EQ(deliver(carrying(scroll(0.0, 0.0, kMayBegin))), std::vector<W>{});
    EXPECT_EQ(deliver(carrying(scroll(0.0, 0.0, 8))), std::vector<W>{});
    EXPECT_EQ(deliver(carrying(scroll(0.0, 0.0, kEnded))), std::vector<W>{});
    // A scale or rotation event is for the gesture stream only.
    EXPECT_EQ(deliver(carrying(HIDEvent::createScaleEvent(1000, 0.0, 0.0, 0.1, 0))), std::vector<W>{});
    EXPECT_EQ(deliver(carrying(HIDEvent::createRotationEvent(1000, 0.0, 0.0, 0.1, 0))), std::vector<W>{});
    // So is the hand event alone.
    EXPECT_EQ(deliver(carrying(HIDEvent::create(kHIDEventTypeDigitizer, 1000))), std::vector<W>{});
    EXPECT_EQ(output.reports(), 0u);
}

TEST_F(PointerOutputTest, ATapPressesWhenDispatchedAndReleasesWhenReturned) {
    // The filter dispatches the pointer event with the button at mask 1, then changes that
    // very button event to 0 and returns the same pointer event.
    HIDEventRef button = filterButton(1);
    HIDEventRef tap = carrying(button);
    EXPECT_EQ(deliver(tap), (std::vector<W>{{EV_KEY, BTN_LEFT, 1}, syn()}));
    button->setIntegerValue(0, kHIDEventFieldButtonMask);
    EXPECT_EQ(deliver(tap), (std::vector<W>{{EV_KEY, BTN_LEFT, 0}, syn()}));
}

TEST_F(PointerOutputTest, ASecondaryClickFollowsTheButtonEventNotThePointerMask) {
    // Two close fingers click: the button event says 2, the pointer event's own mask 1.
    EXPECT_EQ(deliver(carrying(filterButton(2), 1)), (std::vector<W>{{EV_KEY, BTN_RIGHT, 1}, syn()}));
    EXPECT_FALSE(output.isDown(BTN_LEFT));
    EXPECT_EQ(deliver(carrying(filterButton(0), 0)), (std::vector<W>{{EV_KEY, BTN_RIGHT, 0}, syn()}));
}

TEST_F(PointerOutputTest, MaskBitThreeIsTheMiddleButton) {
    EXPECT_EQ(deliver(carrying(filterButton(4))), (std::vector<W>{{EV_KEY, BTN_MIDDLE, 1}, syn()}));
    EXPECT_EQ(deliver(carrying(filterButton(0))), (std::vector<W>{{EV_KEY, BTN_MIDDLE, 0}, syn()}));
}

TEST_F(PointerOutputTest, SeparateButtonsPassThroughAsTheyAre) {
    EXPECT_EQ(deliver(physicalButton(2, 1)), (std::vector<W>{{EV_KEY, BTN_RIGHT, 1}, syn()}));
    EXPECT_EQ(deliver(physicalButton(3, 1)), (std::vector<W>{{EV_KEY, BTN_MIDDLE, 1}, syn()}));
    EXPECT_EQ(deliver(physicalButton(2, 0)), (std::vector<W>{{EV_KEY, BTN_RIGHT, 0}, syn()}));
    EXPECT_EQ(deliver(physicalButton(3, 0)), (std::vector<W>{{EV_KEY, BTN_MIDDLE, 0}, syn()}));
    // Numbers 4 to 8 are BTN_SIDE to BTN_TASK, 9 to 18 BTN_0 to BTN_9.
    EXPECT_EQ(deliver(physicalButton(4, 1)), (std::vector<W>{{EV_KEY, BTN_SIDE, 1}, syn()}));
    EXPECT_EQ(deliver(physicalButton(9, 1)), (std::vector<W>{{EV_KEY, BTN_0, 1}, syn()}));
    EXPECT_EQ(deliver(physicalButton(18, 1)), (std::vector<W>{{EV_KEY, BTN_9, 1}, syn()}));
    // A number without a code is left alone.
    EXPECT_EQ(deliver(physicalButton(19, 1)), std::vector<W>{});
}

TEST_F(PointerOutputTest, AButtonStaysDownWhileTheTouchpadOrTheFilterHoldsIt) {
    EXPECT_EQ(deliver(physicalButton(1, 1)), (std::vector<W>{{EV_KEY, BTN_LEFT, 1}, syn()}));
    // A tap while the separate left button is held: already down, and still held after.
    EXPECT_EQ(deliver(carrying(filterButton(1))), std::vector<W>{});
    EXPECT_EQ(deliver(carrying(filterButton(0))), std::vector<W>{});
    EXPECT_TRUE(output.isDown(BTN_LEFT));
    EXPECT_EQ(deliver(physicalButton(1, 0)), (std::vector<W>{{EV_KEY, BTN_LEFT, 0}, syn()}));
}

TEST_F(PointerOutputTest, MotionScrollAndButtonOfOneEventShareOneReport) {
    HIDEventRef p = pointer(1.905, 0.0);
    p->appendEvent(filterButton(1));
    p->appendEvent(HIDEvent::create(kHIDEventTypeDigitizer, 1000));
    p->appendEvent(scroll(0.0, -10.0, kBegan));
    // 1.905 → 1 count; the button; -10 × 12 = -120, one detent.
    EXPECT_EQ(deliver(p), (std::vector<W>{{EV_REL, REL_X, 1},
                                          {EV_KEY, BTN_LEFT, 1},
                                          {EV_REL, REL_WHEEL_HI_RES, -120},
                                          {EV_REL, REL_WHEEL, -1},
                                          syn()}));
    EXPECT_EQ(output.reports(), 1u);
}

TEST_F(PointerOutputTest, ReleaseAllLeavesNoButtonPressed) {
    deliver(physicalButton(2, 1));
    deliver(carrying(filterButton(1)));
    const size_t before = capture.written.size();
    std::string error;
    ASSERT_TRUE(output.releaseAll(&error)) << error;
    EXPECT_EQ(std::vector<W>(capture.written.begin() + static_cast<std::ptrdiff_t>(before), capture.written.end()),
              (std::vector<W>{{EV_KEY, BTN_LEFT, 0}, {EV_KEY, BTN_RIGHT, 0}, syn()}));
    // Nothing left to release: nothing written.
    ASSERT_TRUE(output.releaseAll(&error));
    EXPECT_EQ(capture.written.size(), before + 3);
}

class RefusingPointer : public VirtualPointer {
public:
    bool write(uint16_t, uint16_t, int32_t, std::string* error) override {
        *error = "the virtual pointer refused an event: No such device";
        return false;
    }
};

TEST(PointerOutputFailure, AWriteTheDeviceRefusesIsReported) {
    RefusingPointer refusing;
    PointerOutput output(refusing);
    std::string error;
    EXPECT_FALSE(output.deliver(*pointer(3.175, 0.0), &error));
    EXPECT_EQ(error, "the virtual pointer refused an event: No such device");
}

}  // namespace
}  // namespace orvane::live
