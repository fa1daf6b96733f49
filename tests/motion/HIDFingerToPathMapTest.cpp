// The finger-to-path map: which path carries which finger, the touching counts of both
// views and the innermost, next-innermost and outermost fingers.

#include <gtest/gtest.h>

#include "motion/HIDFingerToPathMap.h"
#include "paths/HIDPathStates.h"
#include "pipeline/HIDParserPath.h"

namespace orvane {
namespace {

constexpr float kHeight = 500.0f;
constexpr float kWidth = 1000.0f;

class HIDFingerToPathMapTest : public ::testing::Test {
protected:
    HIDPathStates table{kHeight, kWidth};
    HIDFingerToPathMap map;

    // A contact in `slot` carrying `fingerID`, touching unless told otherwise.
    HIDParserPath* place(int slot, int32_t fingerID, bool touching = true, bool palm = false) {
        HIDContact c{};
        c.fingerTipSwitch = touching ? 1 : 0;
        c.fingerConfidence = palm ? 0 : 1;
        c.path_id = slot;
        c.finger_id = fingerID;
        c.position = HIDPoint{100.0f + 50.0f * static_cast<float>(slot), 200.0f};
        HIDParserPath* path = table.getParserPath(slot);
        path->setCurrentContact(c);
        path->setPreviousContact(c);
        return path;
    }

    void expectMapsEmpty() const {
        for (int f = 0; f < HIDFingerToPathMap::kNumFingerIDs; ++f) {
            EXPECT_EQ(map.fingersToPathIDs()[f], 0) << "finger " << f;
            EXPECT_EQ(map.fingersToPathIDsWithResting()[f], 0) << "finger " << f;
        }
    }
};

TEST_F(HIDFingerToPathMapTest, NoTouchingFingersLeavesEverythingEmpty) {
    map.setMaxFingersTouching(3);
    map.setInnermostTouchingFingerID(4);
    map.setNextInnermostTouchingFingerID(5);
    map.setOutermostTouchingFingerID(6);
    map.setNumFingersTouching(2);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.innermostTouchingFingerID(), 0);
    EXPECT_EQ(map.nextInnermostTouchingFingerID(), 0);
    EXPECT_EQ(map.outermostTouchingFingerID(), 0);
    EXPECT_EQ(map.innermostTouchingFingerIDWithResting(), 0);
    EXPECT_EQ(map.outermostTouchingFingerIDWithResting(), 0);
    EXPECT_EQ(map.numFingersTouching(), 0);
    EXPECT_EQ(map.maxFingersTouching(), 0);
    expectMapsEmpty();
}

TEST_F(HIDFingerToPathMapTest, OneTouchingFingerIsInnermostAndOutermost) {
    place(2, 3);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.innermostTouchingFingerID(), 3);
    EXPECT_EQ(map.outermostTouchingFingerID(), 3);
    EXPECT_EQ(map.nextInnermostTouchingFingerID(), 0);
    EXPECT_EQ(map.handIdentity(), 1);
    EXPECT_EQ(map.numFingersTouching(), 1);
    EXPECT_EQ(map.maxFingersTouching(), 1);
    EXPECT_EQ(map.fingersToPathIDs()[3], 2);
    EXPECT_EQ(map.fingersToPathIDsWithResting()[3], 2);
}

TEST_F(HIDFingerToPathMapTest, FingersMetInAscendingOrderLeaveNextInnermostEmpty) {
    place(1, 2);
    place(2, 3);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.innermostTouchingFingerID(), 2);
    // Finger 3 is not smaller than the innermost and never fills the empty slot.
    EXPECT_EQ(map.nextInnermostTouchingFingerID(), 0);
    EXPECT_EQ(map.outermostTouchingFingerID(), 3);
}

TEST_F(HIDFingerToPathMapTest, FingersMetInDescendingOrderFillNextInnermost) {
    place(1, 3);
    place(2, 2);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.innermostTouchingFingerID(), 2);
    EXPECT_EQ(map.nextInnermostTouchingFingerID(), 3);
    EXPECT_EQ(map.outermostTouchingFingerID(), 3);
}

TEST_F(HIDFingerToPathMapTest, FingerBetweenInnermostAndNextInnermostTakesNextInnermost) {
    // After 4: inner 4. After 2: next 4, inner 2. After 3: 3 < 4, so next becomes 3.
    place(1, 4);
    place(2, 2);
    place(3, 3);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.innermostTouchingFingerID(), 2);
    EXPECT_EQ(map.nextInnermostTouchingFingerID(), 3);
    EXPECT_EQ(map.outermostTouchingFingerID(), 4);
    EXPECT_EQ(map.numFingersTouching(), 3);
}

TEST_F(HIDFingerToPathMapTest, FingerAboveNextInnermostLeavesItAlone) {
    // After 5: inner 5. After 3: next 5, inner 3. After 6: not below 5, nothing moves.
    place(1, 5);
    place(2, 3);
    place(3, 6);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.innermostTouchingFingerID(), 3);
    EXPECT_EQ(map.nextInnermostTouchingFingerID(), 5);
    EXPECT_EQ(map.outermostTouchingFingerID(), 6);
}

TEST_F(HIDFingerToPathMapTest, RestingThumbCountsOnlyInTheWithRestingView) {
    place(1, 1)->setRestingInThumbZone(true);
    place(2, 3);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.numFingersTouching(), 1);
    EXPECT_EQ(map.innermostTouchingFingerID(), 3);
    EXPECT_EQ(map.outermostTouchingFingerID(), 3);
    EXPECT_EQ(map.numFingersTouchingWithResting(), 2);
    EXPECT_EQ(map.innermostTouchingFingerIDWithResting(), 1);
    EXPECT_EQ(map.outermostTouchingFingerIDWithResting(), 3);
    EXPECT_EQ(map.fingersToPathIDs()[1], 1);
    EXPECT_EQ(map.fingersToPathIDsWithResting()[1], 1);
    EXPECT_EQ(map.fingersToPathIDs()[3], 2);
    EXPECT_EQ(map.fingersToPathIDsWithResting()[3], 2);
}

TEST_F(HIDFingerToPathMapTest, PalmIsMappedAndCountedButTakesNoPartInEitherView) {
    place(1, 2, /*touching=*/true, /*palm=*/true);
    place(2, 3);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.numPalmContacts(), 1);
    EXPECT_EQ(map.fingersToPathIDs()[2], 1);
    EXPECT_EQ(map.fingersToPathIDsWithResting()[2], 1);
    EXPECT_EQ(map.numFingersTouching(), 1);
    EXPECT_EQ(map.numFingersTouchingWithResting(), 1);
    EXPECT_EQ(map.innermostTouchingFingerID(), 3);
    EXPECT_EQ(map.outermostTouchingFingerID(), 3);
    EXPECT_EQ(map.innermostTouchingFingerIDWithResting(), 3);
    EXPECT_EQ(map.outermostTouchingFingerIDWithResting(), 3);
}

TEST_F(HIDFingerToPathMapTest, FingerIDAboveFifteenIsCountedButNeverMapped) {
    place(1, 16);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.numFingersTouching(), 1);
    EXPECT_EQ(map.numFingersTouchingWithResting(), 1);
    EXPECT_EQ(map.innermostTouchingFingerID(), 16);
    EXPECT_EQ(map.outermostTouchingFingerID(), 16);
    expectMapsEmpty();
    EXPECT_EQ(map.getPathIndexforFingerID(16, false), 0);
    EXPECT_EQ(map.getPathIndexforFingerID(16, true), 0);
    EXPECT_EQ(map.getInnermostTouchingPath(table, false), nullptr);
}

TEST_F(HIDFingerToPathMapTest, WithRestingCountIsNeverClearedAndWrapsAtEightBits) {
    place(1, 2);
    map.setNumFingersTouchingWithResting(254);

    map.updateFingerPathMappings(table);
    EXPECT_EQ(map.numFingersTouchingWithResting(), 255);

    map.clearFingerPathMappings();
    EXPECT_EQ(map.numFingersTouchingWithResting(), 255);

    map.updateFingerPathMappings(table);  // 255 + 1 wraps to 0
    EXPECT_EQ(map.numFingersTouchingWithResting(), 0);

    map.updateFingerPathMappings(table);
    EXPECT_EQ(map.numFingersTouchingWithResting(), 1);
}

TEST_F(HIDFingerToPathMapTest, LiftedFingerIsMappedButNotCounted) {
    place(1, 2, /*touching=*/false);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.fingersToPathIDs()[2], 1);
    EXPECT_EQ(map.fingersToPathIDsWithResting()[2], 1);
    EXPECT_EQ(map.numFingersTouching(), 0);
    EXPECT_EQ(map.numFingersTouchingWithResting(), 0);
    EXPECT_EQ(map.numPalmContacts(), 0);
    EXPECT_EQ(map.innermostTouchingFingerID(), 0);
    EXPECT_EQ(map.innermostTouchingFingerIDWithResting(), 0);
}

TEST_F(HIDFingerToPathMapTest, EqualFingerIDsKeepLowestPathAsInnermostButMapTheHighest) {
    place(2, 3);
    place(5, 3);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.innermostTouchingFingerID(), 3);
    EXPECT_EQ(map.outermostTouchingFingerID(), 3);
    EXPECT_EQ(map.nextInnermostTouchingFingerID(), 0);
    EXPECT_EQ(map.fingersToPathIDs()[3], 5);
    EXPECT_EQ(map.fingersToPathIDsWithResting()[3], 5);
    EXPECT_EQ(map.numFingersTouching(), 2);
}

TEST_F(HIDFingerToPathMapTest, PathLookupsFollowTheMapInEachView) {
    HIDParserPath* thumb = place(1, 1);
    thumb->setRestingInThumbZone(true);
    HIDParserPath* index = place(3, 4);
    HIDParserPath* middle = place(4, 5);
    HIDParserPath* ring = place(6, 7);
    // Met in the order 4, 5, 7, so next-innermost stays empty until it is set below.
    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.getInnermostTouchingPath(table, false), index);
    EXPECT_EQ(map.getOutermostTouchingPath(table, false), ring);
    EXPECT_EQ(map.getInnermostTouchingPath(table, true), thumb);
    EXPECT_EQ(map.getOutermostTouchingPath(table, true), ring);
    EXPECT_EQ(map.getNextInnermostTouchingPath(table), nullptr);

    map.setNextInnermostTouchingFingerID(5);
    EXPECT_EQ(map.getNextInnermostTouchingPath(table), middle);
    EXPECT_EQ(map.getPathIndexforFingerID(5, false), 4);
    EXPECT_EQ(map.getPathIndexforFingerID(0, false), 0);
}

TEST_F(HIDFingerToPathMapTest, NoFingerGivesNoPath) {
    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.getInnermostTouchingPath(table, false), nullptr);
    EXPECT_EQ(map.getOutermostTouchingPath(table, true), nullptr);
    EXPECT_EQ(map.getNextInnermostTouchingPath(table), nullptr);
}

TEST_F(HIDFingerToPathMapTest, ThumbAsInnermostOrOutermostIsReported) {
    EXPECT_FALSE(map.innermostOrOutermostIsThumb());
    map.setInnermostTouchingFingerID(1);
    EXPECT_TRUE(map.innermostOrOutermostIsThumb());
    map.setInnermostTouchingFingerID(2);
    map.setOutermostTouchingFingerID(1);
    EXPECT_TRUE(map.innermostOrOutermostIsThumb());
    map.setOutermostTouchingFingerID(3);
    EXPECT_FALSE(map.innermostOrOutermostIsThumb());
}

TEST_F(HIDFingerToPathMapTest, TouchingThumbOutsideTheZoneIsInnermost) {
    place(1, 1);
    place(2, 3);

    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.innermostTouchingFingerID(), 1);
    EXPECT_TRUE(map.innermostOrOutermostIsThumb());
}

TEST_F(HIDFingerToPathMapTest, MaxFingersTouchingHoldsUntilTheHandIsEmpty) {
    map.setNumFingersTouching(2);
    map.updateMaxFingersTouching();
    EXPECT_EQ(map.maxFingersTouching(), 2);

    map.setNumFingersTouching(3);
    map.updateMaxFingersTouching();
    EXPECT_EQ(map.maxFingersTouching(), 3);

    map.setNumFingersTouching(1);
    map.updateMaxFingersTouching();
    EXPECT_EQ(map.maxFingersTouching(), 3);

    map.setNumFingersTouching(0);
    map.updateMaxFingersTouching();
    EXPECT_EQ(map.maxFingersTouching(), 0);
}

TEST_F(HIDFingerToPathMapTest, ClearKeepsHandIdentityAndMaximum) {
    place(1, 2);
    place(2, 4);
    map.updateFingerPathMappings(table);
    map.setNumFingersStraddlingEdge(2);
    ASSERT_EQ(map.maxFingersTouching(), 2);

    map.clearFingerPathMappings();

    EXPECT_EQ(map.handIdentity(), 1);
    EXPECT_EQ(map.maxFingersTouching(), 2);
    EXPECT_EQ(map.numFingersTouching(), 0);
    EXPECT_EQ(map.numFingersStraddlingEdge(), 0);
    EXPECT_EQ(map.numPalmContacts(), 0);
    EXPECT_EQ(map.innermostTouchingFingerID(), 0);
    EXPECT_EQ(map.outermostTouchingFingerID(), 0);
    EXPECT_EQ(map.innermostTouchingFingerIDWithResting(), 0);
    EXPECT_EQ(map.outermostTouchingFingerIDWithResting(), 0);
    expectMapsEmpty();
}

TEST_F(HIDFingerToPathMapTest, HandIdentityIsNeverResetByAnEmptyFrame) {
    place(1, 2);
    map.updateFingerPathMappings(table);
    ASSERT_EQ(map.handIdentity(), 1);

    table.getParserPath(1)->setCurrentContact(HIDContact{});
    map.updateFingerPathMappings(table);

    EXPECT_EQ(map.handIdentity(), 1);
    EXPECT_EQ(map.innermostTouchingFingerID(), 0);
}

}  // namespace
}  // namespace orvane
