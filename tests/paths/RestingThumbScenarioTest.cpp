// The resting thumb seen through the whole frame pipeline: frames from the hand builder go
// into HIDParser and the path table, the contact events and the statistics are checked
// after each frame.
//
// The surface is 1024 × 512 units, so whole-unit positions survive the digitizer's
// fractions exactly. The thumb rest zone starts at 0.45 × 512 = 230.4, the diving-button
// half at y > 256, and a contact is away from the edges for 204.8 < x < 819.2 and
// 128 < y < 409.6.

#include <gtest/gtest.h>

#include "paths/HIDPathStates.h"
#include "pipeline/HIDParser.h"
#include "stats/HIDHandStatistics.h"
#include "tests/support/PipelineScenario.h"

namespace orvane {
namespace {

using test::Hand;
using test::TestClock;

class RestingThumbScenario : public test::PipelineScenario {
protected:
    // The event mask of the frame's contact with this index, as it left the filter.
    int64_t maskOf(int index) const {
        for (const HIDEventRef& c : frame->children()) {
            if (c->conformsToEventType(kHIDEventTypeDigitizer) &&
                c->integerValueForField(kHIDEventFieldDigitizerIndex) == index) {
                return c->integerValueForField(kHIDEventFieldDigitizerEventMask);
            }
        }
        ADD_FAILURE() << "no contact " << index;
        return -1;
    }
};

TEST_F(RestingThumbScenario, ThumbPlacedLowThenSecondFingerBecomesARestingThumb) {
    // Frame 1: the thumb alone, low in the rest zone and on the diving button.
    hand.finger(0).at(300, 400).down();
    send();
    EXPECT_EQ(table().bottomDivingPathIndex(), 1);
    EXPECT_EQ(table().numFingersOnDivingButton(), 1);
    EXPECT_FALSE(table().restingThumbExists());
    EXPECT_FALSE(path(1).thumbAboveTRZOnTouchdown());  // 400 ≥ 230.4
    EXPECT_FALSE(path(1).thumbMovementTimedOut());
    EXPECT_FALSE(path(1).isRestingInThumbZone());

    // Frame 2: a finger touches down higher up. The thumb timer is set and a resting thumb
    // exists, but the thumb-zone flag waits for a frame without a touch-down.
    const double t2 = static_cast<double>(clock.ticks());
    hand.finger(1).at(600, 200).down();
    send();
    EXPECT_EQ(table().earliestNonDivingTimestamp(), t2);
    EXPECT_TRUE(path(1).thumbMovementTimedOut());
    EXPECT_TRUE(table().restingThumbExists());
    EXPECT_FALSE(path(1).isRestingInThumbZone());
    EXPECT_EQ(maskOf(0), 0);
    EXPECT_EQ(stats().numFingersTouching(), 2);
    EXPECT_EQ(stats().numFingersRestingInZone(), 0);

    // Frame 3: nothing touches down or lifts: the thumb is in the zone and its contact is marked.
    send();
    EXPECT_TRUE(table().restingThumbDidExist());
    EXPECT_TRUE(table().restingThumbExists());
    EXPECT_TRUE(path(1).isRestingInThumbZone());
    EXPECT_FALSE(path(1).wasRestingInThumbZone());
    EXPECT_FALSE(path(2).isRestingInThumbZone());
    EXPECT_EQ(maskOf(0), 0x200);
    EXPECT_EQ(maskOf(1), 0);
    EXPECT_EQ(stats().numFingersTouching(), 1);
    EXPECT_EQ(stats().numFingersRestingInZone(), 1);
    EXPECT_EQ(stats().numFingersTouchingOrResting(), 2);
    // The hand centre is the finger alone, in the digitizer's own fractions: 600 / 1024 and
    // 1 − 200 / 512.
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerX), 0.5859375);
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerY), 0.609375);

    // Frame 4: it stays.
    send();
    EXPECT_TRUE(path(1).isRestingInThumbZone());
    EXPECT_TRUE(path(1).wasRestingInThumbZone());
    EXPECT_EQ(maskOf(0), 0x200);
}

TEST_F(RestingThumbScenario, ThumbTouchingDownWithAFingerIsMarkedFromItsSecondFrame) {
    hand.finger(0).at(300, 400).down();
    hand.finger(1).at(600, 200).down();
    send();
    EXPECT_TRUE(table().restingThumbExists());
    EXPECT_FALSE(path(1).isRestingInThumbZone());
    EXPECT_EQ(maskOf(0), 0x3);  // range and touch changed, no resting bit

    send();
    EXPECT_TRUE(path(1).isRestingInThumbZone());
    EXPECT_EQ(maskOf(0), 0x200);
}

TEST_F(RestingThumbScenario, ButtonPressAndReleaseAreNoticedOneFrameLate) {
    // The thumb comes down just above the rest zone (220 < 230.4), off the diving button,
    // together with a finger: thumb-like by its height, but not resting.
    hand.finger(0).at(300, 220).down();
    hand.finger(1).at(600, 150).down();
    send();
    EXPECT_TRUE(path(1).thumbAboveTRZOnTouchdown());
    EXPECT_FALSE(table().restingThumbExists());
    send();
    EXPECT_FALSE(table().restingThumbExists());
    EXPECT_FALSE(path(1).isRestingInThumbZone());

    // Frame 3: the press is read. A held button with another finger makes a resting thumb
    // and sets the thumb timer, but the change is not time-stamped yet.
    hand.press();
    send();
    EXPECT_EQ(table().buttonState(), 1);
    EXPECT_EQ(table().divingButtonChangeTimestamp(), 0.0);
    EXPECT_TRUE(table().restingThumbExists());
    EXPECT_TRUE(path(1).thumbMovementTimedOut());
    EXPECT_TRUE(path(1).isRestingInThumbZone());
    EXPECT_EQ(stats().currentButtonState(), 1);
    EXPECT_EQ(stats().lastButtonState(), 0);
    EXPECT_EQ(stats().t_recentButtonActivity(), 0.0);

    // Frame 4: the press is time-stamped, in both stages.
    send();
    const double t4 = frameTime;
    EXPECT_EQ(table().divingButtonChangeTimestamp(), t4);
    EXPECT_TRUE(table().handledDivingButtonStateChange());
    EXPECT_TRUE(path(1).thumbMovementTimedOut());
    EXPECT_EQ(stats().t_recentButtonActivity(), t4);

    // Frame 5: the release is read; the thumb timer still holds the thumb resting.
    hand.release();
    send();
    EXPECT_EQ(table().buttonState(), 0);
    EXPECT_EQ(table().divingButtonChangeTimestamp(), t4);
    EXPECT_TRUE(path(1).thumbMovementTimedOut());
    EXPECT_TRUE(table().restingThumbExists());
    EXPECT_TRUE(path(1).isRestingInThumbZone());
    EXPECT_EQ(stats().t_recentButtonActivity(), t4);

    // Frame 6: the release is time-stamped and re-arms the thumb timer: no resting thumb.
    send();
    const double t6 = frameTime;
    EXPECT_EQ(table().divingButtonChangeTimestamp(), t6);
    EXPECT_TRUE(table().handledDivingButtonStateChange());
    EXPECT_FALSE(path(1).thumbMovementTimedOut());
    EXPECT_FALSE(table().restingThumbExists());
    EXPECT_FALSE(path(1).isRestingInThumbZone());
    EXPECT_EQ(stats().t_recentButtonActivity(), t6);
    EXPECT_EQ(stats().numFingersTouching(), 2);
}

TEST_F(RestingThumbScenario, ThumbMovingWithTheFingerBreaksOutBySpeedSymmetry) {
    hand.finger(0).at(300, 400).down();
    send();
    hand.finger(1).at(600, 200).down();
    send();
    send();
    ASSERT_TRUE(path(1).isRestingInThumbZone());

    // Both move right, the thumb 4 and the finger 5 per frame. The contact velocity is the
    // raw position less the last steadied one: 4 and 5 on the first step, 4.05 and 5.05
    // after. Damped velocities (weight of the old value 2^(−8/14) = 0.67295 per 8 ms frame):
    //   step 1: 4 × 0.32705 = 1.3082 and 5 × 0.32705 = 1.6352;
    //   symmetry √(1.3082 × 1.6352) / ((1.3082 + 1.6352) × 0.5 + 1) = 1.4626 / 2.4717 = 0.5917
    //   step 2: 1.3082 × 0.67295 + 4.05 × 0.32705 = 2.2049 and 2.7520;
    //   symmetry √(2.2049 × 2.7520) / ((2.2049 + 2.7520) × 0.5 + 1) = 2.4633 / 3.4785 = 0.7082
    hand.finger(0).moveTo(304, 400);
    hand.finger(1).moveTo(605, 200);
    send();
    EXPECT_NEAR(path(1)._2F_speed_symmetry(), 0.5917f, 1e-3f);
    EXPECT_TRUE(path(1).isRestingInThumbZone());  // not above 0.6 yet
    EXPECT_EQ(maskOf(0), 0x204);                  // moved, and resting

    hand.finger(0).moveTo(308, 400);
    hand.finger(1).moveTo(610, 200);
    send();
    EXPECT_NEAR(path(1)._2F_speed_symmetry(), 0.7082f, 1e-3f);
    EXPECT_NEAR(path(2)._2F_speed_symmetry(), 0.7082f, 1e-3f);
    // Average speeds 0.5 × (4 + 4.05) = 4.025 and 0.5 × (5 + 5.05) = 5.025.
    EXPECT_NEAR(table().speedSimilarity(), 4.025f / 5.025f, 1e-4f);
    EXPECT_TRUE(table().restingThumbExists());
    EXPECT_FALSE(path(1).isRestingInThumbZone());
    EXPECT_TRUE(path(1).wasRestingInThumbZone());
    EXPECT_EQ(maskOf(0), 0x4);  // no longer marked
    EXPECT_EQ(stats().numFingersTouching(), 2);
    EXPECT_EQ(stats().numFingersRestingInZone(), 0);
}

TEST_F(RestingThumbScenario, ThreeNonEdgeFingersLeaveNoRestingThumb) {
    hand.finger(0).at(300, 400).down();
    send();
    hand.finger(1).at(500, 200).down();
    send();
    send();
    ASSERT_TRUE(path(1).isRestingInThumbZone());

    // A third finger away from the edges touches down: no resting thumb, but the flags keep
    // their values in a frame with a touch-down.
    hand.finger(2).at(700, 200).down();
    send();
    EXPECT_EQ(table().numNonEdgeTouches(), 3);
    EXPECT_FALSE(table().restingThumbExists());
    EXPECT_TRUE(path(1).isRestingInThumbZone());
    EXPECT_EQ(maskOf(0), 0x200);
    EXPECT_EQ(stats().numFingersTouching(), 2);
    EXPECT_EQ(stats().numFingersRestingInZone(), 1);

    send();
    EXPECT_FALSE(table().restingThumbExists());
    EXPECT_FALSE(path(1).isRestingInThumbZone());
    EXPECT_EQ(maskOf(0), 0);
    EXPECT_EQ(stats().numFingersTouching(), 3);
    EXPECT_EQ(stats().numFingersRestingInZone(), 0);
}

TEST_F(RestingThumbScenario, HandCentreLeavesTheRestingThumbOut) {
    hand.finger(0).at(300, 400).down();
    send();
    // Two fingers, one of them at the right edge (900 > 819.2), so two non-edge touches.
    hand.finger(1).at(600, 200).down();
    hand.finger(2).at(900, 200).down();
    send();
    // Frame of the touch-down: the thumb is not in the zone yet and counts.
    // x: (300 + 600 + 900) / 3 / 1024 = 0.5859375.
    EXPECT_DOUBLE_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerX), 0.5859375);

    send();
    ASSERT_TRUE(path(1).isRestingInThumbZone());
    // x: (600 + 900) / 2 / 1024 = 0.732421875; y: 1 − 200 / 512 = 0.609375.
    EXPECT_DOUBLE_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerX), 0.732421875);
    EXPECT_DOUBLE_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerY), 0.609375);
}

}  // namespace
}  // namespace orvane
