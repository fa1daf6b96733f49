// The path table's button state, post-filtering, resting thumb, speed symmetries, break-out
// and hand centre, with the paths set up directly through their setters.

#include <gtest/gtest.h>

#include <cmath>
#include <memory>

#include "paths/HIDPathStates.h"
#include "platform/Logging.h"
#include "tests/support/FrameBuilder.h"

using namespace orvane;
using orvane::test::ContactFields;
using orvane::test::contactEvent;
using orvane::test::frameEvent;

namespace {

constexpr float kWidth = 1000.0f;
constexpr float kHeight = 600.0f;  // the thumb rest zone starts at 0.45 × 600 = 270

struct Contact {
    float x = 500.0f;
    float y = 200.0f;
    bool touching = true;
    bool wasTouching = true;
    double tMake = 0.0;
    bool palm = false;
};

// Puts a contact into the path at `slot`; its path ID is the slot.
HIDParserPath* place(HIDPathStates& table, int slot, const Contact& c) {
    HIDParserPath* path = table.getParserPath(slot);
    HIDContact current{};
    current.fingerTipSwitch = c.touching ? 1 : 0;
    current.fingerConfidence = c.palm ? 0 : 1;
    current.path_id = slot;
    current.finger_id = slot + 1;
    current.position = {c.x, c.y};
    HIDContact previous = current;
    previous.fingerTipSwitch = c.wasTouching ? 1 : 0;
    path->setCurrentContact(current);
    path->setPreviousContact(previous);
    HIDPathTimestamps timestamps{};
    timestamps.t_makeTouch = c.tMake;
    path->setTimestamps(timestamps);
    return path;
}

void setVelocity(HIDParserPath* path, HIDPoint velocity) {
    HIDContact current = path->currentContact();
    HIDContact previous = path->previousContact();
    current.velocity = velocity;
    previous.velocity = velocity;
    path->setCurrentContact(current);
    path->setPreviousContact(previous);
}

void setDamped(HIDParserPath* path, float speed, HIDPoint velocity) {
    path->setDampedSpeed(speed);
    path->setDampedVelocity(velocity);
}

HIDEventRef buttonFrame(int32_t mask) { return frameEvent(1, {}, mask); }

HIDEventRef child(int32_t index, double x, double y, int32_t eventMask = 0) {
    ContactFields c;
    c.index = index;
    c.x = x;
    c.y = y;
    c.eventMask = eventMask;
    return contactEvent(c, 1);
}

// A thumb low in the rest zone (path 1) and a finger higher up (path 2), both touching
// since time 100; the table says what the contact loop would have worked out.
struct ThumbAndFinger {
    HIDPathStates table{kHeight, kWidth};
    HIDParserPath* thumb;
    HIDParserPath* finger;

    ThumbAndFinger() {
        thumb = place(table, 1, {.x = 300, .y = 500, .tMake = 100});
        finger = place(table, 2, {.x = 600, .y = 200, .tMake = 100});
        table.setCurrentTimestamp(200);
        table.setBottomDivingPathIndex(1);
        table.setNumNonEdgeTouches(2);
        table.setNumTouches(2);
        table.setNumFingersOnDivingButton(1);
    }
};

}  // namespace

// ---- Button state ----

TEST(HIDPathStatesButton, PressIsReadInItsFrameAndTimeStampedInTheNext) {
    HIDPathStates table(kHeight, kWidth);
    table.updateFrameTimestamp(100);
    table.updateButtonState(buttonFrame(0));
    table.updateFrameTimestamp(200);  // frame N: the press arrives
    table.updateButtonState(buttonFrame(1));
    EXPECT_EQ(table.buttonState(), 1);
    EXPECT_EQ(table.previousButtonState(), 0);
    EXPECT_EQ(table.divingButtonChangeTimestamp(), 0.0);

    table.setHandledDivingButtonStateChange(true);
    table.updateFrameTimestamp(300);  // frame N+1 notices it
    table.updateButtonState(buttonFrame(1));
    EXPECT_EQ(table.divingButtonChangeTimestamp(), 300.0);
    EXPECT_FALSE(table.handledDivingButtonStateChange());
    EXPECT_EQ(table.previousButtonState(), 1);
    EXPECT_EQ(table.buttonState(), 1);
}

TEST(HIDPathStatesButton, ReleaseIsNoticedOneFrameLateToo) {
    HIDPathStates table(kHeight, kWidth);
    table.setPreviousButtonState(1);
    table.setButtonState(1);
    table.updateFrameTimestamp(400);
    table.updateButtonState(buttonFrame(0));
    EXPECT_EQ(table.buttonState(), 0);
    EXPECT_EQ(table.divingButtonChangeTimestamp(), 0.0);
    table.updateFrameTimestamp(500);
    table.updateButtonState(buttonFrame(0));
    EXPECT_EQ(table.divingButtonChangeTimestamp(), 500.0);
    table.updateFrameTimestamp(600);
    table.updateButtonState(buttonFrame(0));
    EXPECT_EQ(table.divingButtonChangeTimestamp(), 500.0);
}

TEST(HIDPathStatesButton, MissingFrameReadsAsReleased) {
    HIDPathStates table(kHeight, kWidth);
    table.setButtonState(1);
    table.updateButtonState(nullptr);
    EXPECT_EQ(table.buttonState(), 0);
    EXPECT_EQ(table.previousButtonState(), 1);
}

TEST(HIDPathStatesButton, ButtonStateChangedStampsEveryTimeItIsAsked) {
    HIDPathStates table(kHeight, kWidth);
    table.setCurrentTimestamp(700);
    EXPECT_FALSE(table.buttonStateChanged());
    EXPECT_EQ(table.divingButtonChangeTimestamp(), 0.0);

    table.setPreviousButtonState(0);
    table.setButtonState(1);
    table.setHandledDivingButtonStateChange(true);
    EXPECT_TRUE(table.buttonStateChanged());
    EXPECT_EQ(table.divingButtonChangeTimestamp(), 700.0);
    EXPECT_FALSE(table.handledDivingButtonStateChange());

    // Asked again in the same frame it answers the same and stamps again.
    table.setHandledDivingButtonStateChange(true);
    table.setCurrentTimestamp(710);
    EXPECT_TRUE(table.buttonStateChanged());
    EXPECT_EQ(table.divingButtonChangeTimestamp(), 710.0);
    EXPECT_FALSE(table.handledDivingButtonStateChange());
}

// ---- Make or break ----

TEST(HIDPathStatesMakeOrBreak, SteadyTouchesAreNeither) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 1, {});
    place(table, 4, {.x = 700});
    EXPECT_FALSE(table.makeOrBreakTouchHappened(nullptr));
}

TEST(HIDPathStatesMakeOrBreak, TouchDownCounts) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 1, {});
    place(table, 3, {.wasTouching = false});
    EXPECT_TRUE(table.makeOrBreakTouchHappened(nullptr));
}

TEST(HIDPathStatesMakeOrBreak, LiftCounts) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 2, {.touching = false, .wasTouching = true});
    EXPECT_TRUE(table.makeOrBreakTouchHappened(nullptr));
}

TEST(HIDPathStatesMakeOrBreak, PathWithoutItsIDIsNotAsked) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* path = place(table, 2, {.wasTouching = false});
    HIDContact c = path->currentContact();
    c.path_id = 0;  // a cleared slot is never found by ID
    path->setCurrentContact(c);
    EXPECT_FALSE(table.makeOrBreakTouchHappened(nullptr));
}

// ---- Earliest non-diving touch ----

TEST(HIDPathStatesDivingBoard, EarliestTouchOfTheOtherFingersIsKept) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 1, {.y = 500, .tMake = 50});  // the bottom-most path: left out
    place(table, 2, {.tMake = 300});
    place(table, 3, {.tMake = 120});
    place(table, 4, {.tMake = 200});
    table.setBottomDivingPathIndex(1);
    table.updateDivingBoardDisplacements();
    EXPECT_EQ(table.earliestNonDivingTimestamp(), 120.0);
}

TEST(HIDPathStatesDivingBoard, RestingLiftedAndPalmPathsAreLeftOut) {
    HIDPathStates table(kHeight, kWidth);
    table.setEarliestNonDivingTimestamp(999);
    place(table, 1, {.y = 500, .tMake = 50});
    place(table, 2, {.tMake = 10})->setIsRestingInThumbZone(true);
    place(table, 3, {.touching = false, .tMake = 20});
    place(table, 4, {.tMake = 30, .palm = true});
    place(table, 5, {.tMake = 400});
    table.setBottomDivingPathIndex(1);
    table.updateDivingBoardDisplacements();
    EXPECT_EQ(table.earliestNonDivingTimestamp(), 400.0);

    place(table, 5, {.touching = false, .tMake = 400});
    table.updateDivingBoardDisplacements();
    EXPECT_EQ(table.earliestNonDivingTimestamp(), 0.0);
}

// ---- Resting thumb ----

TEST(HIDPathStatesRestingThumb, MaxThumbRestingHeightIsFortyFivePercentOfTheHeight) {
    HIDPathStates table(kHeight, kWidth);
    EXPECT_EQ(table.getMaxThumbRestingHeight(table.getParserPath(1)), 270.0f);  // 0.45 × 600
    HIDPathStates odd(333.0f, kWidth);
    // 0.45 × 333 = 149.85, worked in double and rounded once to float.
    EXPECT_EQ(odd.getMaxThumbRestingHeight(odd.getParserPath(1)), static_cast<float>(0.45 * 333.0));
    EXPECT_EQ(table.getMaxThumbRestingHeight(nullptr), 0.0f);
}

TEST(HIDPathStatesRestingThumb, OneFingerAloneIsNeverARestingThumb) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* thumb = place(table, 1, {.y = 500, .tMake = 100});
    thumb->setThumbMovementTimedOut(true);
    table.setCurrentTimestamp(200);
    table.setBottomDivingPathIndex(1);
    table.setNumNonEdgeTouches(1);
    table.setNumFingersOnDivingButton(1);
    for (int button : {0, 1}) {
        table.setButtonState(button);
        table.checkForRestingThumb();
        EXPECT_EQ(table.earliestNonDivingTimestamp(), 0.0);
        EXPECT_FALSE(table.restingThumbExists()) << "button " << button;
    }
}

TEST(HIDPathStatesRestingThumb, ThumbPlacedLowThenSecondFingerMakesARestingThumb) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* thumb = place(table, 1, {.x = 300, .y = 500, .tMake = 100});
    place(table, 2, {.x = 600, .y = 200, .wasTouching = false, .tMake = 200});
    thumb->setThumbAboveTRZOnTouchdown(true);
    table.setCurrentTimestamp(200);  // the second finger's touch-down frame
    table.setBottomDivingPathIndex(1);
    table.setNumNonEdgeTouches(2);
    table.setNumFingersOnDivingButton(1);
    table.setRestingThumbExists(true);

    table.checkForRestingThumb();
    EXPECT_TRUE(table.restingThumbDidExist());
    EXPECT_EQ(table.earliestNonDivingTimestamp(), 200.0);
    // 200 − max(100, 200) = 0: the thumb's height is judged now, 500 ≥ 270 lies in the zone.
    EXPECT_FALSE(thumb->thumbAboveTRZOnTouchdown());
    EXPECT_TRUE(thumb->thumbMovementTimedOut());
    EXPECT_TRUE(table.restingThumbExists());
}

TEST(HIDPathStatesRestingThumb, HeightIsJudgedOnlyInTheFrameOfTheLaterTouchDown) {
    ThumbAndFinger hand;  // both touched down at 100, now 200
    hand.thumb->setThumbAboveTRZOnTouchdown(true);
    hand.table.checkForRestingThumb();
    EXPECT_TRUE(hand.thumb->thumbAboveTRZOnTouchdown());
    // T holds through the diving-button count, but the thumb came down above the zone.
    EXPECT_FALSE(hand.thumb->thumbMovementTimedOut());
    EXPECT_FALSE(hand.table.restingThumbExists());
}

TEST(HIDPathStatesRestingThumb, ThumbAboveTheZoneWithoutTheButtonIsNotResting) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* thumb = place(table, 1, {.x = 300, .y = 250, .tMake = 100});
    place(table, 2, {.x = 600, .y = 100, .wasTouching = false, .tMake = 200});
    table.setCurrentTimestamp(200);
    table.setBottomDivingPathIndex(1);
    table.setNumNonEdgeTouches(2);
    table.setNumFingersOnDivingButton(0);
    table.checkForRestingThumb();
    // 250 < 270: above the zone at touch-down, and T holds through the height alone.
    EXPECT_TRUE(thumb->thumbAboveTRZOnTouchdown());
    EXPECT_FALSE(thumb->thumbMovementTimedOut());
    EXPECT_FALSE(table.restingThumbExists());
}

TEST(HIDPathStatesRestingThumb, ThreeNonEdgeFingersMeanNoRestingThumb) {
    ThumbAndFinger hand;
    place(hand.table, 3, {.x = 800, .y = 220, .tMake = 100});
    hand.table.setNumNonEdgeTouches(3);
    hand.table.setButtonState(1);
    hand.thumb->setThumbMovementTimedOut(true);
    hand.table.checkForRestingThumb();
    EXPECT_EQ(hand.table.earliestNonDivingTimestamp(), 100.0);
    EXPECT_FALSE(hand.table.restingThumbExists());
}

TEST(HIDPathStatesRestingThumb, ButtonHeldWithSecondFingerMakesARestingThumbAtAnyHeight) {
    for (float y : {150.0f, 500.0f}) {  // above the zone, and in it
        ThumbAndFinger hand;
        place(hand.table, 1, {.x = 300, .y = y, .tMake = 100});
        hand.thumb->setThumbAboveTRZOnTouchdown(true);
        hand.table.setNumFingersOnDivingButton(0);
        hand.table.setButtonState(1);
        hand.table.setHandledDivingButtonStateChange(true);
        hand.table.checkForRestingThumb();
        EXPECT_TRUE(hand.thumb->thumbMovementTimedOut()) << "y " << y;
        EXPECT_TRUE(hand.table.restingThumbExists()) << "y " << y;
    }
}

TEST(HIDPathStatesRestingThumb, TimedOutThumbStaysRestingAfterTheButtonIsUp) {
    ThumbAndFinger hand;
    hand.thumb->setThumbAboveTRZOnTouchdown(true);
    hand.thumb->setThumbMovementTimedOut(true);
    hand.table.setHandledDivingButtonStateChange(true);
    hand.table.checkForRestingThumb();
    EXPECT_TRUE(hand.table.restingThumbExists());
}

TEST(HIDPathStatesRestingThumb, ButtonReleaseReArmsTheThumbTimerOnce) {
    ThumbAndFinger hand;
    hand.thumb->setThumbAboveTRZOnTouchdown(true);
    hand.thumb->setThumbMovementTimedOut(true);
    // The release was read in the previous frame and is noticed in this one.
    hand.table.setPreviousButtonState(1);
    hand.table.setButtonState(0);
    hand.table.updateButtonState(buttonFrame(0));
    EXPECT_EQ(hand.table.divingButtonChangeTimestamp(), 200.0);

    hand.table.checkForRestingThumb();
    EXPECT_TRUE(hand.table.handledDivingButtonStateChange());
    EXPECT_FALSE(hand.thumb->thumbMovementTimedOut());
    EXPECT_FALSE(hand.table.restingThumbExists());

    // Handled: a timer set again later is not re-armed by the same change.
    hand.thumb->setThumbMovementTimedOut(true);
    hand.table.checkForRestingThumb();
    EXPECT_TRUE(hand.thumb->thumbMovementTimedOut());
    EXPECT_TRUE(hand.table.restingThumbExists());
}

TEST(HIDPathStatesRestingThumb, ReleaseIsActedOnOnlyWithinATenthOfATickOfItsStamp) {
    struct Row {
        double stamp;
        bool reArmed;
    };
    // 200 − 199.875 = 0.125 is too late; 200 − 199.9375 = 0.0625 is within.
    for (Row row : {Row{199.875, false}, Row{199.9375, true}}) {
        const double stamp = row.stamp;
        ThumbAndFinger hand;
        hand.thumb->setThumbAboveTRZOnTouchdown(true);
        hand.thumb->setThumbMovementTimedOut(true);
        hand.table.setDivingButtonChangeTimestamp(stamp);
        hand.table.setHandledDivingButtonStateChange(false);
        hand.table.checkForRestingThumb();
        EXPECT_EQ(hand.table.handledDivingButtonStateChange(), row.reArmed) << stamp;
        EXPECT_EQ(hand.thumb->thumbMovementTimedOut(), !row.reArmed) << stamp;
    }
}

TEST(HIDPathStatesRestingThumb, PressNoticedIsHandledWithoutReArming) {
    ThumbAndFinger hand;
    hand.thumb->setThumbMovementTimedOut(true);
    hand.table.setButtonState(1);
    hand.table.setDivingButtonChangeTimestamp(200);
    hand.table.setHandledDivingButtonStateChange(false);
    hand.table.checkForRestingThumb();
    EXPECT_TRUE(hand.table.handledDivingButtonStateChange());
    EXPECT_TRUE(hand.thumb->thumbMovementTimedOut());
}

TEST(HIDPathStatesRestingThumb, NoBottomMostPathMeansNoRestingThumb) {
    ThumbAndFinger hand;
    hand.table.setRestingThumbExists(true);
    hand.table.setBottomDivingPathIndex(0);
    hand.table.setButtonState(1);
    hand.table.checkForRestingThumb();
    EXPECT_TRUE(hand.table.restingThumbDidExist());
    EXPECT_FALSE(hand.table.restingThumbExists());
    // The earliest other touch is still worked out (every touching finger counts now).
    EXPECT_EQ(hand.table.earliestNonDivingTimestamp(), 100.0);
}

// ---- Thumb-zone flags in post-filtering ----

TEST(HIDPathStatesPostFiltering, BottomPathOfARestingThumbIsFlaggedInTheThumbZone) {
    ThumbAndFinger hand;
    hand.table.postFilteringTasks(frameEvent(1, {}));
    ASSERT_TRUE(hand.table.restingThumbExists());
    EXPECT_TRUE(hand.thumb->isRestingInThumbZone());
    EXPECT_FALSE(hand.thumb->wasRestingInThumbZone());
    EXPECT_FALSE(hand.finger->isRestingInThumbZone());

    hand.table.postFilteringTasks(frameEvent(1, {}));
    EXPECT_TRUE(hand.thumb->isRestingInThumbZone());
    EXPECT_TRUE(hand.thumb->wasRestingInThumbZone());
}

TEST(HIDPathStatesPostFiltering, FrameWithATouchDownLeavesEveryThumbZoneFlagAsItWas) {
    ThumbAndFinger hand;
    hand.thumb->setIsRestingInThumbZone(true);
    hand.thumb->setIsRestingInThumbZone(true);  // was = is = true
    hand.finger->setIsRestingInThumbZone(true);  // was false, is true
    // A third non-edge finger touches down: no resting thumb this frame.
    place(hand.table, 3, {.x = 800, .y = 220, .wasTouching = false, .tMake = 200});
    hand.table.setNumNonEdgeTouches(3);
    hand.table.postFilteringTasks(frameEvent(1, {}));
    EXPECT_FALSE(hand.table.restingThumbExists());
    EXPECT_TRUE(hand.thumb->isRestingInThumbZone());
    EXPECT_TRUE(hand.thumb->wasRestingInThumbZone());
    EXPECT_TRUE(hand.finger->isRestingInThumbZone());
    EXPECT_FALSE(hand.finger->wasRestingInThumbZone());
    EXPECT_FALSE(hand.table.getParserPath(3)->isRestingInThumbZone());
}

TEST(HIDPathStatesPostFiltering, WithoutMakeOrBreakTheFlagsFollowTheRestingThumb) {
    ThumbAndFinger hand;
    hand.thumb->setIsRestingInThumbZone(true);
    hand.finger->setIsRestingInThumbZone(true);
    place(hand.table, 3, {.x = 800, .y = 220, .tMake = 150});  // touching since 150
    hand.table.setNumNonEdgeTouches(3);
    hand.table.postFilteringTasks(frameEvent(1, {}));
    EXPECT_FALSE(hand.thumb->isRestingInThumbZone());
    EXPECT_TRUE(hand.thumb->wasRestingInThumbZone());
    EXPECT_FALSE(hand.finger->isRestingInThumbZone());
}

TEST(HIDPathStatesPostFiltering, TwoFingerGestureKeepsTheBottomPathOutOfTheThumbZone) {
    ThumbAndFinger hand;
    hand.table.setEngagedinGesture(true);  // numTouches is 2
    hand.table.postFilteringTasks(frameEvent(1, {}));
    EXPECT_TRUE(hand.table.restingThumbExists());
    EXPECT_FALSE(hand.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesPostFiltering, GestureWithThreeTouchesStillFlagsTheThumb) {
    ThumbAndFinger hand;
    hand.table.setEngagedinGesture(true);
    hand.table.setNumTouches(3);
    hand.table.postFilteringTasks(frameEvent(1, {}));
    EXPECT_TRUE(hand.thumb->isRestingInThumbZone());
}

// ---- Resting mark ----

TEST(HIDPathStatesRestingMark, RestingThumbIsMarkedFromItsSecondTouchingFrame) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* thumb = place(table, 1, {.y = 500, .wasTouching = false});
    thumb->setIsRestingInThumbZone(true);
    place(table, 2, {});

    auto thumbEvent = child(0, 0.3, 0.2, 0x6);
    auto fingerEvent = child(1, 0.6, 0.6, 0x4);
    auto frame = frameEvent(1, {thumbEvent, fingerEvent});
    table.setRestingFlag(frame);
    EXPECT_EQ(thumbEvent->integerValueForField(kHIDEventFieldDigitizerEventMask), 0x6);  // first touching frame

    place(table, 1, {.y = 500, .wasTouching = true});
    table.setRestingFlag(frame);
    EXPECT_EQ(thumbEvent->integerValueForField(kHIDEventFieldDigitizerEventMask), 0x206);  // 0x6 | 0x200
    EXPECT_EQ(fingerEvent->integerValueForField(kHIDEventFieldDigitizerEventMask), 0x4);
}

TEST(HIDPathStatesRestingMark, LiftedThumbIsNotMarked) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 1, {.y = 500, .touching = false, .wasTouching = true})->setIsRestingInThumbZone(true);
    auto thumbEvent = child(0, 0.3, 0.2, 0x3);
    table.setRestingFlag(frameEvent(1, {thumbEvent}));
    EXPECT_EQ(thumbEvent->integerValueForField(kHIDEventFieldDigitizerEventMask), 0x3);
}

// ---- Speed symmetries ----

TEST(HIDPathStatesSymmetry, OppositeMotionGivesANegativeSymmetry) {
    HIDPathStates table(kHeight, kWidth);
    setDamped(place(table, 1, {}), 2.0f, {2, 0});
    setDamped(place(table, 2, {}), 2.0f, {-2, 0});
    table.computePathAndFingerSpeedSymmetries(1);
    // √(2 × 2) = 2 over (2 + 2) × 0.5 + 1 = 3, opposite directions.
    EXPECT_FLOAT_EQ(table.getParserPath(1)->_2F_speed_symmetry(), -2.0f / 3.0f);
    EXPECT_EQ(table.getParserPath(2)->_2F_speed_symmetry(), 0.0f);
}

TEST(HIDPathStatesSymmetry, SpeedsAndVelocitiesAreEachSortedFastestFirst) {
    HIDPathStates table(kHeight, kWidth);
    setDamped(place(table, 1, {}), 2.0f, {2, 0});
    // The damped speeds and velocities are sorted separately: the fastest speed is path 2's
    // 4, the longest velocity path 3's (−4, 0).
    setDamped(place(table, 2, {}), 4.0f, {1, 0});
    setDamped(place(table, 3, {}), 1.0f, {-4, 0});
    table.computePathAndFingerSpeedSymmetries(1);
    // √(4 × 2) = 2.828427 over (4 + 2) × 0.5 + 1 = 4; cos with (−4, 0) is −1.
    EXPECT_FLOAT_EQ(table.getParserPath(1)->_2F_speed_symmetry(),
                    -static_cast<float>(static_cast<double>(sqrtf(8.0f)) / 4.0));
}

TEST(HIDPathStatesSymmetry, OfEquallyFastFingersTheHigherPathIDLeads) {
    HIDPathStates table(kHeight, kWidth);
    setDamped(place(table, 1, {}), 1.0f, {1, 0});
    setDamped(place(table, 2, {}), 3.0f, {-3, 0});  // against the desired path
    setDamped(place(table, 3, {}), 3.0f, {3, 0});   // along it, same length 3
    table.computePathAndFingerSpeedSymmetries(1);
    // Path 3 comes first, cos = 1: √(3 × 1) / ((3 + 1) × 0.5 + 1) = 1.7320508 / 3, positive.
    EXPECT_FLOAT_EQ(table.getParserPath(1)->_2F_speed_symmetry(),
                    static_cast<float>(static_cast<double>(sqrtf(3.0f)) / 3.0));
}

TEST(HIDPathStatesSymmetry, StillDesiredPathGetsZero) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* desired = place(table, 1, {});
    desired->set_2F_speed_symmetry(0.9f);
    setDamped(desired, 0.0f, {0, 0});
    setDamped(place(table, 2, {}), 3.0f, {3, 0});
    table.computePathAndFingerSpeedSymmetries(1);
    EXPECT_EQ(desired->_2F_speed_symmetry(), 0.0f);
}

TEST(HIDPathStatesSymmetry, LoneFingerGetsZero) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* desired = place(table, 1, {});
    desired->set_2F_speed_symmetry(0.9f);
    setDamped(desired, 2.0f, {2, 0});
    table.computePathAndFingerSpeedSymmetries(1);
    EXPECT_EQ(desired->_2F_speed_symmetry(), 0.0f);
}

TEST(HIDPathStatesSymmetry, PalmsAndLiftedPathsAreNotOtherFingers) {
    HIDPathStates table(kHeight, kWidth);
    setDamped(place(table, 1, {}), 0.5f, {0.5f, 0});
    setDamped(place(table, 2, {.palm = true}), 5.0f, {-5, 0});
    setDamped(place(table, 3, {.touching = false}), 5.0f, {-5, 0});
    setDamped(place(table, 4, {}), 0.5f, {0, 0.5f});
    table.computePathAndFingerSpeedSymmetries(1);
    // Only path 4: two slow fingers, √0.25 × 3 / ((0.5 + 0.5) × 0.5 + 1) = 1.0; cos 0 is not > 0.
    EXPECT_FLOAT_EQ(table.getParserPath(1)->_2F_speed_symmetry(), -1.0f);
}

TEST(HIDPathStatesSymmetry, AllPathsUpdatedAndLiftedOnesCleared) {
    HIDPathStates table(kHeight, kWidth);
    setDamped(place(table, 1, {}), 2.0f, {2, 0});
    setDamped(place(table, 2, {}), 2.0f, {2, 0});
    HIDParserPath* lifted = place(table, 3, {.touching = false});
    lifted->set_2F_speed_symmetry(0.7f);
    HIDParserPath* palm = place(table, 4, {.palm = true});
    palm->set_2F_speed_symmetry(0.5f);
    table.updateSpeedSymmetriesOfAllPaths();
    // Each of paths 1 and 2 against the other: √(2 × 2) = 2 over (2 + 2) × 0.5 + 1 = 3, same direction.
    EXPECT_FLOAT_EQ(table.getParserPath(1)->_2F_speed_symmetry(), 2.0f / 3.0f);
    EXPECT_FLOAT_EQ(table.getParserPath(2)->_2F_speed_symmetry(), 2.0f / 3.0f);
    EXPECT_EQ(lifted->_2F_speed_symmetry(), 0.0f);
    EXPECT_EQ(palm->_2F_speed_symmetry(), 0.5f);
}

// ---- Speed similarity ----

TEST(HIDPathStatesSimilarity, AllFingersSlowerThanOneGiveOne) {
    HIDPathStates table(kHeight, kWidth);
    setVelocity(place(table, 1, {}), {0.5f, 0});
    setVelocity(place(table, 2, {}), {0.6f, 0.7f});  // length 0.92
    EXPECT_EQ(table.computeSpeedSimilarity(), 1.0f);
}

TEST(HIDPathStatesSimilarity, NoFingersGiveOne) {
    HIDPathStates table(kHeight, kWidth);
    EXPECT_EQ(table.computeSpeedSimilarity(), 1.0f);
}

TEST(HIDPathStatesSimilarity, SlowestOverFastest) {
    HIDPathStates table(kHeight, kWidth);
    setVelocity(place(table, 1, {}), {2, 0});
    setVelocity(place(table, 2, {}), {0, 4});
    setVelocity(place(table, 3, {.touching = false}), {0, 40});
    setVelocity(place(table, 4, {.palm = true}), {0, 40});
    EXPECT_FLOAT_EQ(table.computeSpeedSimilarity(), 0.5f);  // 2 / 4
}

TEST(HIDPathStatesSimilarity, AStillFingerCountsAsZero) {
    HIDPathStates table(kHeight, kWidth);
    setVelocity(place(table, 1, {}), {0.9f, 0});
    setVelocity(place(table, 2, {}), {3, 4});
    EXPECT_EQ(table.computeSpeedSimilarity(), 0.0f);  // 0 / 5
}

TEST(HIDPathStatesSimilarity, SpeedIsTheAverageOfThisAndTheLastFrameVelocity) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* path = place(table, 1, {});
    HIDContact c = path->currentContact();
    c.velocity = {6, 0};
    path->setCurrentContact(c);
    setVelocity(place(table, 2, {}), {0, 4});
    // Path 1: 0.5 × (0, 0) + 0.5 × (6, 0) = (3, 0); 3 / 4.
    EXPECT_FLOAT_EQ(table.computeSpeedSimilarity(), 0.75f);
}

// ---- Break-out ----

namespace {

// A resting thumb (path 1) and a finger (path 2), the thumb moving with symmetry `symmetry`
// at position y; speed similarity = thumbSpeed / fingerSpeed.
struct BreakOut {
    HIDPathStates table{kHeight, kWidth};
    HIDParserPath* thumb;

    BreakOut(float y, float symmetry, float thumbSpeed, float fingerSpeed) {
        thumb = place(table, 1, {.x = 300, .y = y});
        thumb->setIsRestingInThumbZone(true);
        thumb->set_2F_speed_symmetry(symmetry);
        setVelocity(thumb, {thumbSpeed, 0});
        setVelocity(place(table, 2, {.x = 600, .y = 200}), {0, fingerSpeed});
    }
    // The resting hand's largest motion was a translation.
    void translating(float maxMotion = 5.0f) {
        table.setMaxMotionDeltas(maxMotion);
        table.setMotionDeltasResting({5.0f, 1.0f, 0.5f, 0.25f});
        table.setMaxMotionDeltasResting(5.0f);
    }
    // ... or a scaling.
    void scaling(float maxMotion = 5.0f) {
        table.setMaxMotionDeltas(maxMotion);
        table.setMotionDeltasResting({1.0f, 1.0f, 5.0f, 0.25f});
        table.setMaxMotionDeltasResting(5.0f);
    }
};

}  // namespace

TEST(HIDPathStatesBreakOut, TranslatingWithTheHandLeavesTheThumbZoneAtOnce) {
    BreakOut b(300, 0.7f, 2, 4);
    b.translating();
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_FALSE(b.thumb->isRestingInThumbZone());
    EXPECT_TRUE(b.thumb->wasRestingInThumbZone());
    EXPECT_FLOAT_EQ(b.table.speedSimilarity(), 0.5f);
}

TEST(HIDPathStatesBreakOut, OppositeMotionBreaksOutToo) {
    BreakOut b(300, -0.7f, 2, 4);
    b.translating();
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_FALSE(b.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, WeakSymmetryKeepsTheThumb) {
    BreakOut b(300, 0.55f, 2, 4);
    b.translating();
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_TRUE(b.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, EngagedGestureKeepsTheThumb) {
    BreakOut b(300, 0.7f, 2, 4);
    b.translating();
    b.table.setEngagedinGesture(true);
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_TRUE(b.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, LargeHandMotionKeepsTheThumb) {
    BreakOut b(300, 0.7f, 2, 4);
    b.translating(55.0f);  // not below 55
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_TRUE(b.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, PinchAboveTheBoundaryNeedsSimilarityAboveThreeTenths) {
    BreakOut b(300, 0.7f, 2, 4);  // similarity 0.5
    b.scaling();
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_FALSE(b.thumb->isRestingInThumbZone());

    BreakOut slow(300, 0.7f, 1, 4);  // similarity 0.25
    slow.scaling();
    slow.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_TRUE(slow.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, EquallyFastFingersDoNotBreakOutOfAPinch) {
    BreakOut b(300, 0.7f, 4, 4);  // similarity exactly 1.0
    b.scaling();
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_TRUE(b.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, RotationCountsLikeAPinch) {
    BreakOut b(300, 0.7f, 1, 4);  // similarity 0.25: a pinch or turn stays
    b.table.setMaxMotionDeltas(5.0f);
    b.table.setMotionDeltasResting({1.0f, 1.0f, 0.5f, 5.0f});
    b.table.setMaxMotionDeltasResting(5.0f);
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_TRUE(b.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, PinchBelowTheBoundaryNeedsMotionAndSimilarity) {
    BreakOut weak(500, 0.7f, 2, 4);  // similarity 0.5, not above 0.6
    weak.scaling(20.0f);
    weak.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_TRUE(weak.thumb->isRestingInThumbZone());

    BreakOut still(500, 0.7f, 3, 4);  // similarity 0.75, but the hand moved only 10
    still.scaling(10.0f);
    still.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_TRUE(still.thumb->isRestingInThumbZone());

    BreakOut moving(500, 0.7f, 3, 4);
    moving.scaling(20.0f);
    moving.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_FALSE(moving.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, PinchExactlyOnTheBoundaryKeepsTheThumb) {
    BreakOut b(450, 0.7f, 3, 4);  // neither below nor above 450
    b.scaling(20.0f);
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_TRUE(b.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, StrongSymmetryLowOnTheSurfaceBreaksOutEvenInAGesture) {
    BreakOut b(420, 0.9f, 3, 4);  // y > 400, symmetry > 0.8, similarity 0.75 > 0.7
    b.translating();
    b.table.setEngagedinGesture(true);
    b.table.breakOutOfRestingThumbBasedOnSymmetry();
    EXPECT_FALSE(b.thumb->isRestingInThumbZone());
}

TEST(HIDPathStatesBreakOut, StrongSymmetryRuleNeedsEachOfItsConditions) {
    {
        BreakOut b(400, 0.9f, 3, 4);  // y not above 400
        b.translating();
        b.table.setEngagedinGesture(true);
        b.table.breakOutOfRestingThumbBasedOnSymmetry();
        EXPECT_TRUE(b.thumb->isRestingInThumbZone());
    }
    {
        BreakOut b(420, 0.75f, 3, 4);  // symmetry not above 0.8
        b.translating();
        b.table.setEngagedinGesture(true);
        b.table.breakOutOfRestingThumbBasedOnSymmetry();
        EXPECT_TRUE(b.thumb->isRestingInThumbZone());
    }
    {
        BreakOut b(420, 0.9f, 2.6f, 4);  // similarity 0.65, not above 0.7
        b.translating();
        b.table.setEngagedinGesture(true);
        b.table.breakOutOfRestingThumbBasedOnSymmetry();
        EXPECT_TRUE(b.thumb->isRestingInThumbZone());
    }
    {
        BreakOut b(420, 0.9f, 3, 4);  // a pinch, not a translation
        b.scaling();
        b.table.setEngagedinGesture(true);
        b.table.breakOutOfRestingThumbBasedOnSymmetry();
        EXPECT_TRUE(b.thumb->isRestingInThumbZone());
    }
}

// ---- Hand centre ----

TEST(HIDPathStatesHandCenter, CentreOfTheContactsLeavesTheRestingThumbOut) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 1, {.y = 540})->setIsRestingInThumbZone(true);
    place(table, 2, {});
    place(table, 3, {});
    auto frame = frameEvent(1, {child(0, 0.1, 0.1), child(1, 0.4, 0.2), child(2, 0.6, 0.4)});
    table.calculateNewHandCenter(frame);
    // Raw digitizer values of paths 2 and 3: x (0.4 + 0.6) / 2, y (0.2 + 0.4) / 2.
    EXPECT_DOUBLE_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerX), 0.5);
    EXPECT_DOUBLE_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerY), 0.3);
}

TEST(HIDPathStatesHandCenter, FrameWhoseOnlyContactRestsKeepsItsPosition) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 1, {.y = 540})->setIsRestingInThumbZone(true);
    auto frame = frameEvent(1, {child(0, 0.1, 0.1)});
    frame->setDoubleValue(0.25, kHIDEventFieldDigitizerX);
    frame->setDoubleValue(0.75, kHIDEventFieldDigitizerY);
    table.calculateNewHandCenter(frame);
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerX), 0.25);
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerY), 0.75);
}

TEST(HIDPathStatesHandCenter, ContactsWithoutAPathCountAndOtherEventsDoNot) {
    HIDPathStates table(kHeight, kWidth);
    auto vendor = HIDEvent::create(kHIDEventTypeVendorDefined, 1);
    vendor->setDoubleValue(0.9, kHIDEventFieldDigitizerX);
    auto frame = frameEvent(1, {child(5, 0.2, 0.7), vendor});
    table.calculateNewHandCenter(frame);
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerX), 0.2);
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerY), 0.7);
}

TEST(HIDPathStatesPostFiltering, RestingThumbFrameIsMarkedAndCentredOnTheOtherFinger) {
    ThumbAndFinger hand;
    hand.thumb->setIsRestingInThumbZone(true);
    auto thumbEvent = child(0, 0.3, 1.0 - 500.0 / 600.0, 0x4);
    auto fingerEvent = child(1, 0.6, 1.0 - 200.0 / 600.0, 0x4);
    auto frame = frameEvent(1, {thumbEvent, fingerEvent});
    hand.table.postFilteringTasks(frame);
    EXPECT_EQ(thumbEvent->integerValueForField(kHIDEventFieldDigitizerEventMask), 0x204);
    EXPECT_EQ(fingerEvent->integerValueForField(kHIDEventFieldDigitizerEventMask), 0x4);
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerX), 0.6);
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerY), 1.0 - 200.0 / 600.0);
}

TEST(HIDPathStatesLogging, NothingIsLoggedOutsideAnInternalBuild) {
    auto sink = std::make_shared<CaptureLogSink>();
    Logging::setSink(sink);
    Logging::setDebugEnabled(true);
    ThumbAndFinger hand;
    hand.table.updateButtonState(buttonFrame(0));
    hand.table.postFilteringTasks(frameEvent(1, {child(0, 0.3, 0.2), child(1, 0.6, 0.6)}));
    getCosineThetas(std::vector<HIDPoint>{{1, 0}, {0, 1}});
    Logging::setDebugEnabled(false);
    Logging::setSink(std::make_shared<StandardErrorLogSink>());
    EXPECT_TRUE(sink->messages().empty());
}
