// Hand statistics seen through the whole frame pipeline: touch-downs, lift-offs (several in
// one frame), the finger counts and their maximum, frame by frame.
//
// The surface is 1024 × 512 units, so whole-unit positions survive the digitizer's
// fractions exactly; the fingers stay away from the edges and above the thumb rest zone.

#include <gtest/gtest.h>

#include "paths/HIDPathStates.h"
#include "pipeline/HIDParser.h"
#include "stats/HIDHandStatistics.h"
#include "tests/support/PipelineScenario.h"

namespace orvane {
namespace {

using test::Hand;
using test::TestClock;

using HandStatisticsScenario = test::PipelineScenario;

TEST_F(HandStatisticsScenario, TouchDownsAndLiftOffsFrameByFrame) {
    // Frame 1: the first finger.
    hand.finger(0).at(300, 200).down();
    send();
    const double t1 = frameTime;
    EXPECT_EQ(stats().numPaths(), 1);
    EXPECT_EQ(stats().numFingersTouching(), 1);
    EXPECT_EQ(stats().t_firstFingerTouchDown(), t1);
    EXPECT_EQ(stats().t_recentFingerTouchDown(), t1);
    EXPECT_EQ(stats().pathID_recentFingerTouched(), 1);
    EXPECT_EQ(stats().maxFingersTouching(), 1);
    EXPECT_EQ(stats().timeSinceFingerTouch(), 0.0);

    // Frame 2: a second finger, one frame later.
    hand.finger(1).at(500, 200).down();
    send();
    const double t2 = frameTime;
    EXPECT_EQ(stats().t_firstFingerTouchDown(), t1);
    EXPECT_EQ(stats().t_recentFingerTouchDown(), t2);
    EXPECT_EQ(stats().t_previousRecentFingerTouchDown(), t1);
    EXPECT_EQ(stats().timeBetweenMostRecentTouches(), t2 - t1);
    EXPECT_EQ(stats().timeBetweenMostRecentTouches(), static_cast<double>(TestClock::msToTicks(kFrameMs)));
    EXPECT_EQ(stats().pathID_recentFingerTouched(), 2);
    EXPECT_EQ(stats().lastNumFingersTouching(), 1);

    // Frame 3: a third.
    hand.finger(2).at(700, 200).down();
    send();
    const double t3 = frameTime;
    EXPECT_EQ(stats().t_recentFingerTouchDown(), t3);
    EXPECT_EQ(stats().pathID_recentFingerTouched(), 3);
    EXPECT_EQ(stats().numFingersTouching(), 3);
    EXPECT_EQ(stats().maxFingersTouching(), 3);

    send();
    EXPECT_EQ(stats().t_recentFingerTouchDown(), t3);
    EXPECT_EQ(stats().lastNumPaths(), 3);

    // Frame 5: the second and third fingers lift together. Both break at this frame's time;
    // the lower path ID is the one remembered, and both are counted.
    hand.finger(1).up();
    hand.finger(2).up();
    send();
    const double t5 = frameTime;
    EXPECT_EQ(stats().numPaths(), 3);  // the lifted paths are still seen this frame
    EXPECT_EQ(stats().numFingersTouching(), 1);
    EXPECT_EQ(stats().maxFingersTouching(), 3);
    EXPECT_EQ(stats().t_recentFingerLiftoff(), t5);
    EXPECT_EQ(stats().pathID_recentFingerLifted(), 2);
    EXPECT_EQ(stats().recentFingerLiftoffLocation().x, 500.0f);
    EXPECT_EQ(stats().recentFingerLiftoffLocation().y, 200.0f);
    EXPECT_EQ(stats().numConsecutiveLiftoffsCountingThumb(), 2);
    EXPECT_FALSE(stats().lastFingerLiftedWasThumb());
    EXPECT_FALSE(stats().lastFingerLiftedWasOnEdge());  // standing at y = 200 > 0.25 × 512
    EXPECT_FALSE(stats().lastFingerLiftedWasLastFingerTouched());  // touched 3, lifted 2

    // Frame 6: the lifted paths are gone; the first finger lifts.
    hand.finger(0).up();
    send();
    const double t6 = frameTime;
    EXPECT_EQ(stats().numPaths(), 1);
    EXPECT_EQ(stats().lastNumPaths(), 3);
    EXPECT_EQ(stats().numFingersTouching(), 0);
    EXPECT_EQ(stats().maxFingersTouching(), 0);
    EXPECT_EQ(stats().t_recentFingerLiftoff(), t6);
    EXPECT_EQ(stats().pathID_recentFingerLifted(), 1);
    EXPECT_EQ(stats().previousFingerLiftoffLocation().x, 500.0f);
    EXPECT_EQ(stats().recentFingerLiftoffLocation().x, 300.0f);
    EXPECT_EQ(stats().numConsecutiveLiftoffsCountingThumb(), 3);
    EXPECT_EQ(stats().timeSinceRecentFingerLiftoff(), 0.0);

    // Frame 7: no contact at all.
    send();
    EXPECT_EQ(stats().numPaths(), 0);
    EXPECT_EQ(stats().t_recentFingerLiftoff(), t6);
    EXPECT_EQ(stats().timeSinceRecentFingerLiftoff(), static_cast<double>(TestClock::msToTicks(kFrameMs)));
    EXPECT_EQ(stats().t_firstFingerTouchDown(), t1);
}

TEST_F(HandStatisticsScenario, FrameWithoutContactsReportsNoPaths) {
    hand.finger(0).at(300, 200).down();
    send();
    EXPECT_TRUE(parser.handStats()->processHandState(*parser.pathStates()));
    hand.finger(0).up();
    send();
    send();
    EXPECT_FALSE(parser.handStats()->processHandState(*parser.pathStates()));
}

TEST_F(HandStatisticsScenario, NewTouchSequenceStartsANewFirstTouchDown) {
    hand.finger(0).at(300, 200).down();
    send();
    hand.finger(0).up();
    send();
    send();
    hand.finger(0).at(400, 200).down();
    send();
    const double t4 = frameTime;
    EXPECT_EQ(stats().t_firstFingerTouchDown(), t4);
    EXPECT_EQ(stats().t_recentFingerTouchDown(), t4);
    EXPECT_TRUE(stats().lastFingerLiftedWasLastFingerTouched());  // path 1 both times
}

TEST_F(HandStatisticsScenario, PressIsStampedOneFrameAfterItIsRead) {
    hand.finger(0).at(300, 200).down();
    send();
    hand.press();
    send();
    EXPECT_EQ(stats().currentButtonState(), 1);
    EXPECT_EQ(stats().t_recentButtonActivity(), 0.0);
    send();
    EXPECT_EQ(stats().t_recentButtonActivity(), frameTime);
    EXPECT_EQ(stats().timeSinceLastButtonActivity(), 0.0);
}

}  // namespace
}  // namespace orvane
