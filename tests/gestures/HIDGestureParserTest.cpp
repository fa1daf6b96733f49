// The hand event for the UI: lift reports, dropped contacts, stamping and the generation count.

#include "gestures/HIDGestureParser.h"

#include <gtest/gtest.h>

#include <vector>

#include "stats/HIDHandStatistics.h"
#include "tests/support/FrameBuilder.h"

namespace orvane {
namespace {

using test::ContactFields;
using test::contactEvent;
using test::frameEvent;

constexpr uint64_t kT = 5000;
// Every byte 1: 0x01010101.
constexpr int32_t kNeverSeen = 16843009;

HIDEventRef contact(int32_t index, double y, int32_t touch, int32_t eventMask, int32_t type = 1) {
    ContactFields c;
    c.index = index;
    c.x = 0.5;
    c.y = y;
    c.touch = touch;
    c.range = touch;
    c.type = type;
    c.eventMask = eventMask;
    return contactEvent(c, kT);
}

int64_t field(const HIDEventRef& e, uint32_t selector) { return e->integerValueForField(selector); }

class HandEventForUITest : public ::testing::Test {
protected:
    // Runs one frame whose children are `children`, with numPaths = their count.
    HIDEventRef prepare(const HIDEventRef& frame, int numPaths) {
        stats.setNumPaths(numPaths);
        return parser.prepareHandEventforUI(stats, frame);
    }

    HIDGestureParser parser;
    HIDHandStatistics stats;
};

TEST_F(HandEventForUITest, StartsWithEveryEntryByteSetToOneAndEverythingElseClear) {
    for (int i = 0; i < HIDGestureParser::kNumContactIndexes; ++i) {
        EXPECT_EQ(parser.prevFingerType()[i], kNeverSeen) << i;
        EXPECT_FALSE(parser.sentOutOfRange()[i]) << i;
    }
    EXPECT_EQ(parser.generationCount(), 0);
    EXPECT_FALSE(parser.shouldEndRotate());
    EXPECT_FALSE(parser.shouldEndScale());
    EXPECT_FALSE(parser.shouldCancelScrollMayBegin());
    EXPECT_FALSE(parser.buttonStateWasSent());
    EXPECT_EQ(parser.currentGesture(), 0);
    EXPECT_EQ(parser.prevGesture(), 0);
    EXPECT_EQ(parser.currentPhase(), 0);
    EXPECT_EQ(parser.prevPhase(), 0);
}

TEST_F(HandEventForUITest, OutOfRangeReportClearsTouchAndRangeAndReplacesTheMask) {
    HIDEventRef c = contact(2, 0.5, 1, kHIDDigitizerEventPosition | kHIDDigitizerEventResting);
    parser.sendOutOfRange(*c);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerTouch), 0);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerRange), 0);
    // Exactly range changed | touch changed: the position and resting bits are gone.
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerEventMask), 3);
}

TEST_F(HandEventForUITest, ChildStampingSetsIdentityGenerationAndFlipsY) {
    parser.setGenerationCount(7);
    HIDEventRef c = contact(4, 0.25, 1, 0);
    parser.fillChildDigitizerFields(*c);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerIdentity), 5);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerGenerationCount), 7);
    EXPECT_EQ(c->doubleValueForField(kHIDEventFieldDigitizerY), 0.75);
}

TEST_F(HandEventForUITest, ParentStampingMergesTheChildrenAndReplacesItsOwnMask) {
    parser.setGenerationCount(3);
    HIDEventRef a = contact(0, 0.5, 0, kHIDDigitizerEventRange);
    a->setIntegerValue(1, kHIDEventFieldDigitizerRange);
    HIDEventRef b = contact(1, 0.5, 0, kHIDDigitizerEventTouch);
    HIDEventRef parent = frameEvent(kT, {a, b});
    parent->setIntegerValue(kHIDDigitizerEventPosition, kHIDEventFieldDigitizerEventMask);
    parent->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    parent->setDoubleValue(0.4, kHIDEventFieldDigitizerY);
    parser.fillParentDigitizerFields(*parent);
    EXPECT_EQ(field(parent, kHIDEventFieldDigitizerTouch), 0);  // no child touches
    EXPECT_EQ(field(parent, kHIDEventFieldDigitizerRange), 1);  // child a is in range
    EXPECT_EQ(field(parent, kHIDEventFieldDigitizerEventMask), 3);  // 1 | 2, the parent's 4 dropped
    EXPECT_EQ(field(parent, kHIDEventFieldDigitizerGenerationCount), 3);
    EXPECT_EQ(parent->doubleValueForField(kHIDEventFieldDigitizerY), 1.0 - 0.4);
}

TEST_F(HandEventForUITest, ParentTouchesWhenAnyChildTouches) {
    HIDEventRef a = contact(0, 0.5, 0, 0);
    HIDEventRef b = contact(1, 0.5, 1, 0);
    HIDEventRef parent = frameEvent(kT, {a, b});
    parser.fillParentDigitizerFields(*parent);
    EXPECT_EQ(field(parent, kHIDEventFieldDigitizerTouch), 1);
    EXPECT_EQ(field(parent, kHIDEventFieldDigitizerRange), 1);
    EXPECT_EQ(field(parent, kHIDEventFieldDigitizerEventMask), 0);
}

TEST_F(HandEventForUITest, FrameWhoseChildrenAreAllDroppedYieldsNoneAndMarksPalmsRemoved) {
    // Contacts seen for the first time while not touching are dropped at once.
    HIDEventRef frame = frameEvent(kT, {contact(0, 0.5, 0, 3), contact(1, 0.5, 0, 3)});
    EXPECT_EQ(prepare(frame, 2), nullptr);
    EXPECT_TRUE(stats.palmsRemoved());
    EXPECT_TRUE(frame->children().empty());
    EXPECT_EQ(parser.prevFingerType()[0], 0);
    EXPECT_EQ(parser.prevFingerType()[1], 0);
    EXPECT_EQ(parser.generationCount(), 0);
}

TEST_F(HandEventForUITest, NoPathsYieldsNoneAndMarksPalmsRemoved) {
    HIDEventRef frame = frameEvent(kT, {});
    EXPECT_EQ(prepare(frame, 0), nullptr);
    EXPECT_TRUE(stats.palmsRemoved());
}

TEST_F(HandEventForUITest, MissingFrameYieldsNone) {
    EXPECT_EQ(prepare(nullptr, 2), nullptr);
    EXPECT_FALSE(stats.palmsRemoved());
    EXPECT_EQ(prepare(nullptr, 0), nullptr);
    EXPECT_TRUE(stats.palmsRemoved());
    EXPECT_EQ(parser.generationCount(), 0);
}

TEST_F(HandEventForUITest, PalmsRemovedIsRememberedForOneFrame) {
    EXPECT_EQ(prepare(frameEvent(kT, {contact(0, 0.5, 0, 0)}), 1), nullptr);
    EXPECT_TRUE(stats.palmsRemoved());
    EXPECT_FALSE(stats.werePalmsRemoved());

    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 3)}), 1), nullptr);
    EXPECT_FALSE(stats.palmsRemoved());
    EXPECT_TRUE(stats.werePalmsRemoved());

    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 4)}), 1), nullptr);
    EXPECT_FALSE(stats.palmsRemoved());
    EXPECT_FALSE(stats.werePalmsRemoved());
}

TEST_F(HandEventForUITest, UnchangedFrameWithoutButtonChangeYieldsNoneButIsStillStamped) {
    HIDEventRef a = contact(0, 0.25, 1, 0);
    HIDEventRef b = contact(1, 0.5, 1, 0);
    HIDEventRef frame = frameEvent(kT, {a, b});
    frame->setDoubleValue(0.3, kHIDEventFieldDigitizerY);
    EXPECT_EQ(prepare(frame, 2), nullptr);
    EXPECT_FALSE(stats.palmsRemoved());
    // The children were stamped and the per-index state moved on.
    EXPECT_EQ(field(a, kHIDEventFieldDigitizerIdentity), 1);
    EXPECT_EQ(field(b, kHIDEventFieldDigitizerIdentity), 2);
    EXPECT_EQ(a->doubleValueForField(kHIDEventFieldDigitizerY), 0.75);
    EXPECT_EQ(parser.prevFingerType()[0], 1);
    EXPECT_EQ(parser.prevFingerType()[1], 1);
    // The parent was not.
    EXPECT_FALSE(frame->hasField(kHIDEventFieldDigitizerGenerationCount));
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerY), 0.3);
    EXPECT_EQ(parser.generationCount(), 0);
}

TEST_F(HandEventForUITest, UnchangedFrameIsReturnedWhileTheButtonChanges) {
    stats.setCurrentButtonState(1);
    stats.setLastButtonState(0);
    HIDEventRef frame = frameEvent(kT, {contact(0, 0.25, 1, 0), contact(1, 0.5, 1, 0)});
    EXPECT_EQ(prepare(frame, 2), frame);
    EXPECT_EQ(field(frame, kHIDEventFieldDigitizerGenerationCount), 0);
    EXPECT_EQ(parser.generationCount(), 1);
}

TEST_F(HandEventForUITest, ParentMaskIsReadBeforeTheChildrenAreMerged) {
    // The child gets the touch-changed bit (it touches again after a lift), but the frame
    // itself reported no change, so nothing is returned.
    ASSERT_EQ(prepare(frameEvent(kT, {contact(0, 0.5, 0, 0)}), 1), nullptr);  // dropped: entry 0
    HIDEventRef c = contact(0, 0.5, 1, 0);
    HIDEventRef frame = frameEvent(kT, {c});
    EXPECT_EQ(prepare(frame, 1), nullptr);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerEventMask), kHIDDigitizerEventTouch);
}

TEST_F(HandEventForUITest, LiftedFingerIsReportedOnceOutOfRangeThenDropped) {
    // Frame k-1: two fingers touching.
    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 3), contact(1, 0.5, 1, 3)}), 2), nullptr);

    // Frame k: finger 1 lifts, finger 0 moves.
    HIDEventRef staying = contact(0, 0.5, 1, kHIDDigitizerEventPosition);
    HIDEventRef lifted = contact(1, 0.5, 0, kHIDDigitizerEventTouch);
    lifted->setIntegerValue(1, kHIDEventFieldDigitizerRange);
    HIDEventRef frameK = frameEvent(kT, {staying, lifted});
    ASSERT_EQ(prepare(frameK, 2), frameK);
    ASSERT_EQ(frameK->children().size(), 2u);
    EXPECT_EQ(frameK->children()[1], lifted);
    EXPECT_EQ(field(lifted, kHIDEventFieldDigitizerTouch), 0);
    EXPECT_EQ(field(lifted, kHIDEventFieldDigitizerRange), 0);
    EXPECT_EQ(field(lifted, kHIDEventFieldDigitizerEventMask), 3);
    EXPECT_TRUE(parser.sentOutOfRange()[1]);
    EXPECT_EQ(parser.prevFingerType()[1], 0);

    // Frame k+1: the device still reports the lifted contact; its child is removed.
    HIDEventRef again = contact(1, 0.5, 0, 0);
    HIDEventRef frameK1 = frameEvent(kT, {contact(0, 0.5, 1, kHIDDigitizerEventPosition), again});
    ASSERT_EQ(prepare(frameK1, 2), frameK1);
    ASSERT_EQ(frameK1->children().size(), 1u);
    EXPECT_EQ(field(frameK1->children()[0], kHIDEventFieldDigitizerIndex), 0);
    EXPECT_FALSE(parser.sentOutOfRange()[1]);
    EXPECT_EQ(parser.prevFingerType()[1], 0);
    // The removed child was the last one: it is not stamped.
    EXPECT_FALSE(again->hasField(kHIDEventFieldDigitizerIdentity));
}

TEST_F(HandEventForUITest, YIsFlippedOnceOnEachChildAndOnTheParent) {
    HIDEventRef a = contact(0, 0.25, 1, 3);
    HIDEventRef b = contact(1, 0.25, 1, 3);
    HIDEventRef frame = frameEvent(kT, {a, b});
    frame->setDoubleValue(0.25, kHIDEventFieldDigitizerY);
    ASSERT_EQ(prepare(frame, 2), frame);
    EXPECT_EQ(a->doubleValueForField(kHIDEventFieldDigitizerY), 0.75);
    EXPECT_EQ(b->doubleValueForField(kHIDEventFieldDigitizerY), 0.75);
    EXPECT_EQ(frame->doubleValueForField(kHIDEventFieldDigitizerY), 0.75);
}

TEST_F(HandEventForUITest, ChildrenAndParentOfOneEventShareTheGenerationCount) {
    for (int32_t expected = 0; expected < 3; ++expected) {
        HIDEventRef a = contact(0, 0.5, 1, 4);
        HIDEventRef b = contact(1, 0.5, 1, 4);
        HIDEventRef frame = frameEvent(kT, {a, b});
        ASSERT_EQ(prepare(frame, 2), frame);
        EXPECT_EQ(field(a, kHIDEventFieldDigitizerGenerationCount), expected);
        EXPECT_EQ(field(b, kHIDEventFieldDigitizerGenerationCount), expected);
        EXPECT_EQ(field(frame, kHIDEventFieldDigitizerGenerationCount), expected);
    }
    EXPECT_EQ(parser.generationCount(), 3);
}

TEST_F(HandEventForUITest, GenerationCountAdvancesOnlyWhenAnEventIsReturned) {
    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 3)}), 1), nullptr);   // carries 0
    ASSERT_EQ(prepare(frameEvent(kT, {contact(0, 0.5, 1, 0)}), 1), nullptr);   // still
    HIDEventRef c = contact(0, 0.5, 1, 4);
    ASSERT_NE(prepare(frameEvent(kT, {c}), 1), nullptr);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerGenerationCount), 1);
    EXPECT_EQ(parser.generationCount(), 2);
}

TEST_F(HandEventForUITest, ContactFirstSeenTouchingDoesNotGetTheTouchChangedBit) {
    HIDEventRef c = contact(3, 0.5, 1, kHIDDigitizerEventRange);
    HIDEventRef frame = frameEvent(kT, {c});
    ASSERT_EQ(prepare(frame, 1), frame);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerEventMask), kHIDDigitizerEventRange);
    EXPECT_EQ(parser.prevFingerType()[3], 1);
    EXPECT_FALSE(parser.sentOutOfRange()[3]);
}

TEST_F(HandEventForUITest, ContactTouchingAgainAfterItsLiftGetsTheTouchChangedBit) {
    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 3)}), 1), nullptr);
    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 0, 3)}), 1), nullptr);  // lift report
    EXPECT_EQ(parser.prevFingerType()[0], 0);
    HIDEventRef c = contact(0, 0.5, 1, kHIDDigitizerEventRange | kHIDDigitizerEventPosition);
    ASSERT_NE(prepare(frameEvent(kT, {c}), 1), nullptr);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerEventMask), 7);  // 1 | 4, plus 2
}

TEST_F(HandEventForUITest, ContactFirstSeenNotTouchingIsDroppedWithoutALiftReport) {
    HIDEventRef gone = contact(2, 0.5, 0, 3);
    HIDEventRef frame = frameEvent(kT, {contact(0, 0.5, 1, 3), contact(1, 0.5, 1, 3), gone});
    ASSERT_EQ(prepare(frame, 3), frame);
    ASSERT_EQ(frame->children().size(), 2u);
    EXPECT_FALSE(parser.sentOutOfRange()[2]);
    EXPECT_EQ(parser.prevFingerType()[2], 0);
    // Untouched: not turned into a lift report.
    EXPECT_EQ(field(gone, kHIDEventFieldDigitizerEventMask), 3);
    EXPECT_EQ(field(gone, kHIDEventFieldDigitizerRange), 0);
}

TEST_F(HandEventForUITest, HandTypeChildCountsAsNotTouching) {
    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 3)}), 1), nullptr);
    // Still reports touch, but its type is 2: its lift is reported.
    HIDEventRef c = contact(0, 0.5, 1, 4, kHIDDigitizerTransducerTypeHand);
    ASSERT_NE(prepare(frameEvent(kT, {c}), 1), nullptr);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerTouch), 0);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerEventMask), 3);
    EXPECT_TRUE(parser.sentOutOfRange()[0]);
}

TEST_F(HandEventForUITest, PalmTouchingCountsAsTouching) {
    HIDEventRef c = contact(0, 0.5, 1, 3, kHIDDigitizerTransducerTypePalm);
    ASSERT_NE(prepare(frameEvent(kT, {c}), 1), nullptr);
    EXPECT_EQ(parser.prevFingerType()[0], 1);
    EXPECT_EQ(field(c, kHIDEventFieldDigitizerTouch), 1);
}

TEST_F(HandEventForUITest, LiftedContactIsKeptUnchangedWhileAPressIsReported) {
    parser.setButtonStateWasSent(true);
    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 3), contact(1, 0.5, 1, 3)}), 2), nullptr);
    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 4), contact(1, 0.5, 0, 3)}), 2), nullptr);  // lift report
    ASSERT_EQ(parser.prevFingerType()[1], 0);

    // The button changes while the lifted contact is still reported: it stays, unchanged.
    stats.setCurrentButtonState(1);
    stats.setLastButtonState(0);
    HIDEventRef kept = contact(1, 0.5, 0, 0);
    HIDEventRef frame = frameEvent(kT, {contact(0, 0.5, 1, 0), kept});
    ASSERT_EQ(prepare(frame, 2), frame);
    ASSERT_EQ(frame->children().size(), 2u);
    EXPECT_EQ(frame->children()[1], kept);
    EXPECT_EQ(field(kept, kHIDEventFieldDigitizerEventMask), 0);
    EXPECT_EQ(parser.prevFingerType()[1], 1);
    EXPECT_FALSE(parser.sentOutOfRange()[1]);

    // Without a button change it then gets its one lift report.
    stats.setLastButtonState(1);
    HIDEventRef later = contact(1, 0.5, 0, 0);
    HIDEventRef frame2 = frameEvent(kT, {contact(0, 0.5, 1, 4), later});
    ASSERT_EQ(prepare(frame2, 2), frame2);
    ASSERT_EQ(frame2->children().size(), 2u);
    EXPECT_EQ(field(later, kHIDEventFieldDigitizerEventMask), 3);
    EXPECT_TRUE(parser.sentOutOfRange()[1]);
}

TEST_F(HandEventForUITest, LiftedContactIsDroppedDuringAButtonChangeWhenNoPressWasSent) {
    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 3), contact(1, 0.5, 1, 3)}), 2), nullptr);
    ASSERT_NE(prepare(frameEvent(kT, {contact(0, 0.5, 1, 4), contact(1, 0.5, 0, 3)}), 2), nullptr);
    stats.setCurrentButtonState(1);
    stats.setLastButtonState(0);
    HIDEventRef frame = frameEvent(kT, {contact(0, 0.5, 1, 0), contact(1, 0.5, 0, 0)});
    ASSERT_EQ(prepare(frame, 2), frame);
    EXPECT_EQ(frame->children().size(), 1u);
}

TEST_F(HandEventForUITest, RemovingTheLastChildSkipsTheStamping) {
    HIDEventRef first = contact(0, 0.25, 1, 3);
    HIDEventRef last = contact(1, 0.25, 0, 3);  // first seen while lifted: dropped
    HIDEventRef frame = frameEvent(kT, {first, last});
    ASSERT_EQ(prepare(frame, 2), frame);
    ASSERT_EQ(frame->children().size(), 1u);
    EXPECT_FALSE(last->hasField(kHIDEventFieldDigitizerIdentity));
    EXPECT_EQ(last->doubleValueForField(kHIDEventFieldDigitizerY), 0.25);
    EXPECT_EQ(first->doubleValueForField(kHIDEventFieldDigitizerY), 0.75);  // stamped once
}

TEST_F(HandEventForUITest, ChildThatMovesUpAfterARemovalIsStampedASecondTime) {
    HIDEventRef dropped = contact(0, 0.5, 0, 3);
    HIDEventRef moving = contact(1, 0.25, 1, 3);
    HIDEventRef frame = frameEvent(kT, {dropped, moving});
    ASSERT_EQ(prepare(frame, 2), frame);
    ASSERT_EQ(frame->children().size(), 1u);
    EXPECT_EQ(frame->children()[0], moving);
    // Stamped at position 1, then again at position 0 after the removal: y is back to 0.25.
    EXPECT_EQ(moving->doubleValueForField(kHIDEventFieldDigitizerY), 0.25);
    EXPECT_EQ(field(moving, kHIDEventFieldDigitizerIdentity), 2);
    EXPECT_EQ(field(moving, kHIDEventFieldDigitizerGenerationCount), 0);
}

TEST_F(HandEventForUITest, NegativeIndexIsSkipped) {
    HIDEventRef odd = contact(-1, 0.25, 1, 4);
    HIDEventRef frame = frameEvent(kT, {odd});
    ASSERT_EQ(prepare(frame, 1), frame);  // counted as remaining, the frame changed
    EXPECT_FALSE(odd->hasField(kHIDEventFieldDigitizerIdentity));
    EXPECT_EQ(odd->doubleValueForField(kHIDEventFieldDigitizerY), 0.25);
    for (int i = 0; i < HIDGestureParser::kNumContactIndexes; ++i) EXPECT_EQ(parser.prevFingerType()[i], kNeverSeen);
}

TEST_F(HandEventForUITest, IndexOfFifteenOrMoreIsPassedThroughUntouched) {
    HIDEventRef odd = contact(15, 0.25, 0, 4);
    HIDEventRef frame = frameEvent(kT, {odd});
    ASSERT_EQ(prepare(frame, 1), frame);  // not dropped, so one remains
    ASSERT_EQ(frame->children().size(), 1u);
    EXPECT_FALSE(odd->hasField(kHIDEventFieldDigitizerIdentity));
    EXPECT_FALSE(odd->hasField(kHIDEventFieldDigitizerGenerationCount));
    EXPECT_EQ(odd->doubleValueForField(kHIDEventFieldDigitizerY), 0.25);
    EXPECT_EQ(field(odd, kHIDEventFieldDigitizerEventMask), 4);
}

TEST_F(HandEventForUITest, OnlyTheFirstNumPathsPositionsAreVisited) {
    HIDEventRef visited = contact(0, 0.25, 1, 3);
    HIDEventRef beyond = contact(1, 0.25, 1, 3);
    HIDEventRef frame = frameEvent(kT, {visited, beyond});
    ASSERT_EQ(prepare(frame, 1), frame);
    EXPECT_TRUE(visited->hasField(kHIDEventFieldDigitizerIdentity));
    EXPECT_FALSE(beyond->hasField(kHIDEventFieldDigitizerIdentity));
    EXPECT_EQ(parser.prevFingerType()[1], kNeverSeen);
}

TEST_F(HandEventForUITest, PositionsBeyondTheChildrenAreSkipped) {
    HIDEventRef only = contact(0, 0.25, 1, 3);
    HIDEventRef frame = frameEvent(kT, {only});
    ASSERT_EQ(prepare(frame, 3), frame);
    EXPECT_EQ(field(only, kHIDEventFieldDigitizerIdentity), 1);
}

}  // namespace
}  // namespace orvane
