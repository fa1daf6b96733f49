// Hand statistics: finger counts, touch-down and lift-off times, button activity and the
// clears, fed directly and through a path table set up by hand.

#include <gtest/gtest.h>

#include "paths/HIDPathStates.h"
#include "stats/HIDHandStatistics.h"

using namespace orvane;

namespace {

constexpr float kWidth = 1000.0f;
constexpr float kHeight = 600.0f;  // a lift-off heading to y ≤ 150 is near the edge

HIDPathTimestamps makeAt(double t) {
    HIDPathTimestamps ts{};
    ts.t_makeTouch = t;
    return ts;
}

HIDPathTimestamps brokeAt(double tMake, double tBreak) {
    HIDPathTimestamps ts{};
    ts.t_makeTouch = tMake;
    ts.t_breakTouch = tBreak;
    return ts;
}

struct Contact {
    float x = 500.0f;
    float y = 300.0f;
    bool touching = true;
    bool wasTouching = true;
    double tMake = 0.0;
    double tBreak = 0.0;
    bool palm = false;
    bool wasPalm = false;
};

HIDParserPath* place(HIDPathStates& table, int slot, const Contact& c) {
    HIDParserPath* path = table.getParserPath(slot);
    HIDContact current{};
    current.fingerTipSwitch = c.touching ? 1 : 0;
    current.fingerConfidence = c.palm ? 0 : 1;
    current.path_id = slot;
    current.finger_id = slot + 1;
    current.position = {c.x, c.y};
    current.device_timestamp = 2.0;
    HIDContact previous = current;
    previous.fingerTipSwitch = c.wasTouching ? 1 : 0;
    previous.fingerConfidence = c.wasPalm ? 0 : 1;
    previous.device_timestamp = 1.0;
    path->setCurrentContact(current);
    path->setPreviousContact(previous);
    path->setTimestamps(brokeAt(c.tMake, c.tBreak));
    return path;
}

// One frame of the pipeline as far as the statistics see it.
bool frameAt(HIDHandStatistics& stats, HIDPathStates& table, double t) {
    table.setCurrentTimestamp(t);
    return stats.processHandState(table);
}

}  // namespace

// ---- Touch-downs ----

TEST(HIDHandStatistics, FirstTouchAfterAnEmptyFrameSetsFirstAndRecentTouchDownAlike) {
    HIDHandStatistics stats;
    stats.updateStatsWithFingerPath(3, {10, 20}, makeAt(500), true, false, false, false, false);
    EXPECT_EQ(stats.t_firstFingerTouchDown(), 500.0);
    EXPECT_EQ(stats.t_recentFingerTouchDown(), 500.0);
    EXPECT_EQ(stats.t_previousRecentFingerTouchDown(), 0.0);
    EXPECT_EQ(stats.pathID_recentFingerTouched(), 3);
    EXPECT_EQ(stats.numFingersTouching(), 1);
}

TEST(HIDHandStatistics, SecondTouchDownKeepsTheFirstAndGivesTheGap) {
    HIDHandStatistics stats;
    stats.updateStatsWithFingerPath(1, {10, 20}, makeAt(500), true, false, false, false, false);
    stats.clear(true);  // the next frame: one finger touched in the last one
    stats.updateStatsWithFingerPath(1, {10, 20}, makeAt(500), true, true, false, false, false);
    stats.updateStatsWithFingerPath(2, {40, 20}, makeAt(620), true, false, false, false, false);
    EXPECT_EQ(stats.t_firstFingerTouchDown(), 500.0);
    EXPECT_EQ(stats.t_recentFingerTouchDown(), 620.0);
    EXPECT_EQ(stats.t_previousRecentFingerTouchDown(), 500.0);
    EXPECT_EQ(stats.timeBetweenMostRecentTouches(), 120.0);
    EXPECT_EQ(stats.pathID_recentFingerTouched(), 2);
    EXPECT_EQ(stats.numFingersTouching(), 2);
}

TEST(HIDHandStatistics, SteadyTouchChangesNoTime) {
    HIDHandStatistics stats;
    stats.setLastNumFingersTouching(1);
    stats.updateStatsWithFingerPath(4, {10, 20}, makeAt(700), true, true, false, false, false);
    EXPECT_EQ(stats.t_recentFingerTouchDown(), 0.0);
    EXPECT_EQ(stats.pathID_recentFingerTouched(), 0);
    EXPECT_EQ(stats.numFingersTouching(), 1);
}

TEST(HIDHandStatistics, IdleFingerChangesNothing) {
    HIDHandStatistics stats;
    stats.updateStatsWithFingerPath(4, {10, 20}, brokeAt(700, 800), false, false, true, true, true);
    EXPECT_EQ(stats.numFingersTouching(), 0);
    EXPECT_EQ(stats.numFingersRestingInZone(), 0);
    EXPECT_EQ(stats.t_recentFingerLiftoff(), 0.0);
    EXPECT_EQ(stats.numConsecutiveLiftoffsCountingThumb(), 0);
}

// ---- Resting thumb ----

TEST(HIDHandStatistics, RestingThumbCountsInTheZoneAndItsLiftIsAThumbLift) {
    HIDHandStatistics stats;
    stats.updateStatsWithFingerPath(1, {300, 500}, makeAt(100), true, true, true, true, false);
    stats.updateStatsWithFingerPath(2, {600, 200}, makeAt(100), true, true, false, false, false);
    EXPECT_EQ(stats.numFingersRestingInZone(), 1);
    EXPECT_EQ(stats.numFingersTouching(), 1);
    EXPECT_EQ(stats.numFingersTouchingOrResting(), 2);

    stats.clear(true);
    stats.updateStatsWithFingerPath(1, {300, 500}, brokeAt(100, 900), false, true, true, true, false);
    EXPECT_TRUE(stats.lastFingerLiftedWasThumb());
    EXPECT_EQ(stats.pathID_recentFingerLifted(), 1);
    EXPECT_EQ(stats.numConsecutiveLiftoffsCountingThumb(), 1);
}

// ---- Lift-offs ----

TEST(HIDHandStatistics, LiftRemembersTimeIDPlaceAndEdge) {
    HIDHandStatistics stats;
    stats.setRecentFingerLiftoffLocation({1, 2});
    stats.updateStatsWithFingerPath(5, {250, 80}, brokeAt(300, 400), false, true, false, false, true);
    EXPECT_EQ(stats.t_recentFingerLiftoff(), 400.0);
    EXPECT_EQ(stats.pathID_recentFingerLifted(), 5);
    EXPECT_EQ(stats.previousFingerLiftoffLocation().x, 1.0f);
    EXPECT_EQ(stats.previousFingerLiftoffLocation().y, 2.0f);
    EXPECT_EQ(stats.recentFingerLiftoffLocation().x, 250.0f);
    EXPECT_EQ(stats.recentFingerLiftoffLocation().y, 80.0f);
    EXPECT_TRUE(stats.lastFingerLiftedWasOnEdge());
    EXPECT_FALSE(stats.lastFingerLiftedWasThumb());
}

TEST(HIDHandStatistics, SeveralLiftsWithOneBreakTimeRememberTheLowestPathID) {
    HIDHandStatistics stats;
    stats.updateStatsWithFingerPath(2, {100, 100}, brokeAt(300, 800), false, true, false, false, false);
    stats.updateStatsWithFingerPath(5, {500, 100}, brokeAt(300, 800), false, true, true, true, true);
    EXPECT_EQ(stats.pathID_recentFingerLifted(), 2);
    EXPECT_EQ(stats.recentFingerLiftoffLocation().x, 100.0f);
    EXPECT_FALSE(stats.lastFingerLiftedWasThumb());
    EXPECT_FALSE(stats.lastFingerLiftedWasOnEdge());
    EXPECT_EQ(stats.numConsecutiveLiftoffsCountingThumb(), 2);
}

TEST(HIDHandStatistics, OlderBreakTimeCountsButIsNotRemembered) {
    HIDHandStatistics stats;
    stats.setT_recentFingerLiftoff(900);
    stats.setPathID_recentFingerLifted(7);
    stats.updateStatsWithFingerPath(3, {100, 100}, brokeAt(300, 800), false, true, true, true, true);
    EXPECT_EQ(stats.t_recentFingerLiftoff(), 900.0);
    EXPECT_EQ(stats.pathID_recentFingerLifted(), 7);
    EXPECT_FALSE(stats.lastFingerLiftedWasThumb());
    EXPECT_EQ(stats.numConsecutiveLiftoffsCountingThumb(), 1);
}

TEST(HIDHandStatistics, LastFingerLiftedWasLastFingerTouchedComparesTheIDs) {
    HIDHandStatistics stats;
    stats.setPathID_recentFingerTouched(4);
    stats.setPathID_recentFingerLifted(3);
    EXPECT_FALSE(stats.lastFingerLiftedWasLastFingerTouched());
    stats.setPathID_recentFingerLifted(4);
    EXPECT_TRUE(stats.lastFingerLiftedWasLastFingerTouched());
}

// ---- Maximum ----

TEST(HIDHandStatistics, MaxFingersTouchingLastsOnlyWhileAFingerTouches) {
    HIDHandStatistics stats;
    stats.setNumFingersTouching(3);
    stats.updateCumulativeMaxStats();
    EXPECT_EQ(stats.maxFingersTouching(), 3);
    stats.setNumFingersTouching(2);
    stats.updateCumulativeMaxStats();
    EXPECT_EQ(stats.maxFingersTouching(), 3);
    // Only a resting thumb left: no touching finger.
    stats.setNumFingersTouching(0);
    stats.setNumFingersRestingInZone(1);
    stats.updateCumulativeMaxStats();
    EXPECT_EQ(stats.maxFingersTouching(), 0);
}

// ---- Clears ----

TEST(HIDHandStatistics, PerFrameClearKeepsLastCountsAndZeroesThisFrames) {
    HIDHandStatistics stats;
    stats.setNumPaths(4);
    stats.setNumFingersTouching(3);
    stats.setNumFingersRestingInZone(1);
    stats.setNumFingersReidentifiedAsPalms(1);
    stats.setMaxFingersTouching(3);
    stats.setT_recentFingerTouchDown(50);
    stats.clear(true);
    EXPECT_EQ(stats.lastNumPaths(), 4);
    EXPECT_EQ(stats.lastNumFingersTouching(), 3);
    EXPECT_EQ(stats.numPaths(), 0);
    EXPECT_EQ(stats.numFingersTouching(), 0);
    EXPECT_EQ(stats.numFingersRestingInZone(), 0);
    EXPECT_EQ(stats.numFingersReidentifiedAsPalms(), 0);
    EXPECT_EQ(stats.maxFingersTouching(), 3);
    EXPECT_EQ(stats.t_recentFingerTouchDown(), 50.0);
}

TEST(HIDHandStatistics, FullResetClearsTheRecentHistoryButNotTapsGestureEndsPlacesOrButtons) {
    HIDHandStatistics stats;
    stats.updateFrameTimestamp(1234);
    stats.setMaxFingersTouching(3);
    stats.setLastNumPaths(2);
    stats.setLastNumFingersTouching(2);
    stats.setT_previousRecentFingerTouchDown(10);
    stats.setPathID_recentFingerTouched(2);
    stats.setPathID_recentFingerLifted(3);
    stats.setT_recentButtonActivity(20);
    stats.setT_firstFingerTouchDown(30);
    stats.setT_recentFingerTouchDown(40);
    stats.setT_recentFingerLiftoff(50);
    stats.setRecentFingerLiftedWasThumb(true);
    stats.setRecentFingerLiftedWasOnEdge(true);
    stats.setNumConsecutiveLiftoffsCountingThumb(4);
    stats.setNumPaths(2);
    stats.setNumFingersTouching(2);
    stats.setNumFingersRestingInZone(1);
    stats.setNumFingersReidentifiedAsPalms(1);
    stats.setTimeofTwoFingerTap(60);
    stats.setTimeofSingleFingerTap(61);
    stats.setTimeofScrollEnd(62);
    stats.setTimeofSwipeEnd(63);
    stats.setTimeofScaleEnd(64);
    stats.setTimeofRotateEnd(65);
    stats.setRecentFingerLiftoffLocation({7, 8});
    stats.setPreviousFingerLiftoffLocation({5, 6});
    stats.setCurrentButtonState(1);
    stats.setLastButtonState(1);

    stats.clear(false);
    EXPECT_EQ(stats.maxFingersTouching(), 0);
    EXPECT_EQ(stats.lastNumPaths(), 0);
    EXPECT_EQ(stats.lastNumFingersTouching(), 0);
    EXPECT_EQ(stats.t_previousRecentFingerTouchDown(), 0.0);
    EXPECT_EQ(stats.pathID_recentFingerTouched(), 0);
    EXPECT_EQ(stats.pathID_recentFingerLifted(), 0);
    EXPECT_EQ(stats.t_recentReset(), 1234.0);
    EXPECT_EQ(stats.timeSinceLastReset(), 0.0);
    EXPECT_EQ(stats.t_recentButtonActivity(), 0.0);
    EXPECT_EQ(stats.t_firstFingerTouchDown(), 0.0);
    EXPECT_EQ(stats.t_recentFingerTouchDown(), 0.0);
    EXPECT_EQ(stats.t_recentFingerLiftoff(), 0.0);
    EXPECT_FALSE(stats.recentFingerLiftedWasThumb());
    EXPECT_FALSE(stats.recentFingerLiftedWasOnEdge());
    EXPECT_EQ(stats.numConsecutiveLiftoffsCountingThumb(), 0);
    EXPECT_EQ(stats.numPaths(), 0);
    EXPECT_EQ(stats.numFingersTouching(), 0);
    EXPECT_EQ(stats.numFingersRestingInZone(), 0);
    EXPECT_EQ(stats.numFingersReidentifiedAsPalms(), 0);

    EXPECT_EQ(stats.t_recentTwoFingerTap(), 60.0);
    EXPECT_EQ(stats.t_recentSingleFingerTap(), 61.0);
    EXPECT_EQ(stats.t_recentScrollEnd(), 62.0);
    EXPECT_EQ(stats.t_recentSwipeEnd(), 63.0);
    EXPECT_EQ(stats.t_recentScaleEnd(), 64.0);
    EXPECT_EQ(stats.t_recentRotateEnd(), 65.0);
    EXPECT_EQ(stats.recentFingerLiftoffLocation().x, 7.0f);
    EXPECT_EQ(stats.previousFingerLiftoffLocation().y, 6.0f);
    EXPECT_EQ(stats.currentButtonState(), 1);
    EXPECT_EQ(stats.lastButtonState(), 1);
}

// ---- Times since ----

TEST(HIDHandStatistics, TimesSinceCountFromTheCurrentFrame) {
    HIDHandStatistics stats;
    stats.updateFrameTimestamp(1000);
    stats.setT_recentFingerTouchDown(900);
    stats.setTimeofScrollEnd(800);
    stats.setTimeofScaleEnd(700);
    stats.setTimeofRotateEnd(600);
    stats.setTimeofSwipeEnd(500);
    stats.setTimeofTwoFingerTap(400);
    stats.setTimeofSingleFingerTap(300);
    stats.setT_recentReset(200);
    stats.setT_recentFingerLiftoff(100);
    stats.setT_recentButtonActivity(50);
    EXPECT_EQ(stats.timeSince(250), 750.0);
    EXPECT_EQ(stats.timeSinceFingerTouch(), 100.0);
    EXPECT_EQ(stats.timeSinceScrollEnd(), 200.0);
    EXPECT_EQ(stats.timeSinceScaleEnd(), 300.0);
    EXPECT_EQ(stats.timeSinceRotateEnd(), 400.0);
    EXPECT_EQ(stats.timeSinceSwipeEnd(), 500.0);
    EXPECT_EQ(stats.timeSinceTwoFingerTap(), 600.0);
    EXPECT_EQ(stats.timeSinceSingleFingerTap(), 700.0);
    EXPECT_EQ(stats.timeSinceLastReset(), 800.0);
    EXPECT_EQ(stats.timeSinceRecentFingerLiftoff(), 900.0);
    EXPECT_EQ(stats.timeSinceLastButtonActivity(), 950.0);
}

TEST(HIDHandStatistics, NeverIsTheWholeTimeSinceZero) {
    HIDHandStatistics stats;
    stats.updateFrameTimestamp(1000);
    EXPECT_EQ(stats.timeSinceScrollEnd(), 1000.0);
}

// ---- Per frame, from the path table ----

TEST(HIDHandStatisticsFrame, EmptyTableGivesFalse) {
    HIDPathStates table(kHeight, kWidth);
    HIDHandStatistics stats;
    EXPECT_FALSE(frameAt(stats, table, 100));
    EXPECT_EQ(stats.numPaths(), 0);
    EXPECT_EQ(stats.currentTimestamp(), 100.0);
}

TEST(HIDHandStatisticsFrame, PathsThatCannotBeFoundGiveFalse) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* path = place(table, 2, {});
    HIDContact c = path->currentContact();
    c.path_id = 0;  // a cleared slot
    path->setCurrentContact(c);
    HIDHandStatistics stats;
    EXPECT_FALSE(frameAt(stats, table, 100));
}

TEST(HIDHandStatisticsFrame, ClockFollowsThePathTable) {
    HIDPathStates table(kHeight, kWidth);
    HIDHandStatistics stats;
    frameAt(stats, table, 100);
    frameAt(stats, table, 180);
    EXPECT_EQ(stats.previousTimestamp(), 100.0);
    EXPECT_EQ(stats.frameInterval(), 80.0);
}

TEST(HIDHandStatisticsFrame, PressReadInFrameNIsStampedWithFrameNPlusOne) {
    HIDPathStates table(kHeight, kWidth);
    HIDHandStatistics stats;
    frameAt(stats, table, 100);
    table.setButtonState(1);  // frame N reads the press
    frameAt(stats, table, 200);
    EXPECT_EQ(stats.currentButtonState(), 1);
    EXPECT_EQ(stats.lastButtonState(), 0);
    EXPECT_EQ(stats.t_recentButtonActivity(), 0.0);
    frameAt(stats, table, 300);
    EXPECT_EQ(stats.t_recentButtonActivity(), 300.0);
    EXPECT_EQ(stats.lastButtonState(), 1);
    frameAt(stats, table, 400);
    EXPECT_EQ(stats.t_recentButtonActivity(), 300.0);
}

TEST(HIDHandStatisticsFrame, CountsFingersRestingThumbsAndPaths) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 1, {.y = 500, .tMake = 50})->setIsRestingInThumbZone(true);
    place(table, 2, {.tMake = 50});
    place(table, 3, {.x = 700, .tMake = 100, .palm = true});
    place(table, 4, {.x = 800, .wasTouching = false, .tMake = 100});
    HIDHandStatistics stats;
    EXPECT_TRUE(frameAt(stats, table, 100));
    EXPECT_EQ(stats.numPaths(), 4);
    EXPECT_EQ(stats.numFingersTouching(), 2);
    EXPECT_EQ(stats.numFingersRestingInZone(), 1);
    EXPECT_EQ(stats.numFingersTouchingOrResting(), 3);
    EXPECT_EQ(stats.maxFingersTouching(), 2);
    EXPECT_EQ(stats.pathID_recentFingerTouched(), 4);
    EXPECT_EQ(stats.t_recentFingerTouchDown(), 100.0);
    EXPECT_EQ(stats.t_firstFingerTouchDown(), 100.0);
}

TEST(HIDHandStatisticsFrame, FingerTurnedPalmIsCountedAsReidentified) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 1, {.palm = true, .wasPalm = false});
    place(table, 2, {.palm = true, .wasPalm = true});
    HIDHandStatistics stats;
    EXPECT_TRUE(frameAt(stats, table, 100));
    EXPECT_EQ(stats.numPaths(), 2);
    EXPECT_EQ(stats.numFingersReidentifiedAsPalms(), 1);
    EXPECT_EQ(stats.numFingersTouching(), 0);
}

TEST(HIDHandStatisticsFrame, PalmTurnedFingerIsATouchDown) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 3, {.tMake = 40, .wasPalm = true});  // touching in both frames
    HIDHandStatistics stats;
    stats.setLastNumFingersTouching(0);
    frameAt(stats, table, 100);
    EXPECT_EQ(stats.pathID_recentFingerTouched(), 3);
    EXPECT_EQ(stats.t_recentFingerTouchDown(), 40.0);
}

TEST(HIDHandStatisticsFrame, LiftOfARestingThumbNearTheEdge) {
    HIDPathStates table(kHeight, kWidth);
    HIDParserPath* thumb = place(table, 1, {.y = 120, .touching = false, .tMake = 50, .tBreak = 100});
    thumb->setIsRestingInThumbZone(true);
    thumb->setIsRestingInThumbZone(false);  // the flag it had is kept as the former one
    place(table, 2, {.tMake = 50});
    HIDHandStatistics stats;
    frameAt(stats, table, 100);
    EXPECT_TRUE(stats.lastFingerLiftedWasThumb());
    // Standing still at y = 120 as it lifted: 120 ≤ 0.25 × 600.
    EXPECT_TRUE(stats.lastFingerLiftedWasOnEdge());
    EXPECT_EQ(stats.pathID_recentFingerLifted(), 1);
    EXPECT_EQ(stats.t_recentFingerLiftoff(), 100.0);
    EXPECT_EQ(stats.recentFingerLiftoffLocation().y, 120.0f);
    EXPECT_EQ(stats.numFingersTouching(), 1);
}

TEST(HIDHandStatisticsFrame, LiftAwayFromTheEdgeIsNotAnEdgeLift) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 1, {.y = 400, .touching = false, .tMake = 50, .tBreak = 100});
    HIDHandStatistics stats;
    stats.setRecentFingerLiftedWasOnEdge(true);
    frameAt(stats, table, 100);
    EXPECT_FALSE(stats.lastFingerLiftedWasOnEdge());
    EXPECT_FALSE(stats.lastFingerLiftedWasThumb());
    EXPECT_EQ(stats.maxFingersTouching(), 0);
}

TEST(HIDHandStatisticsFrame, PathsAreVisitedInPathIDOrder) {
    HIDPathStates table(kHeight, kWidth);
    place(table, 6, {.x = 600, .touching = false, .tMake = 50, .tBreak = 100});
    place(table, 3, {.x = 300, .touching = false, .tMake = 50, .tBreak = 100});
    HIDHandStatistics stats;
    frameAt(stats, table, 100);
    EXPECT_EQ(stats.pathID_recentFingerLifted(), 3);
    EXPECT_EQ(stats.recentFingerLiftoffLocation().x, 300.0f);
    EXPECT_EQ(stats.numConsecutiveLiftoffsCountingThumb(), 2);
}
