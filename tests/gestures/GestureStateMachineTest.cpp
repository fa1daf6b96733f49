// The gesture recogniser: its rules one by one, and whole gestures frame by frame as tables.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "gestures/HIDGestureParser.h"
#include "motion/HIDHandMotion.h"
#include "platform/Logging.h"
#include "stats/HIDHandStatistics.h"
#include "tests/support/EventText.h"
#include "tests/support/FrameBuilder.h"

namespace orvane {
namespace {

using test::TestClock;

double ticks(double ms) { return static_cast<double>(TestClock::msToTicks(ms)); }

// ---------------------------------------------------------------------------------------
// The rules, one at a time: the recogniser alone, with its inputs set directly.

class GestureRecogniserTest : public ::testing::Test {
protected:
    static constexpr double kNow = 1000.0;

    void SetUp() override {
        Logging::setSink(sink);
        stats.setCurrentTimestamp(ticks(kNow));
        // Fingers that moved fast enough that nothing is a tap unless a test says so.
        motion.setLastMaxFingerSpeed(10.0f);
    }
    void TearDown() override { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }

    void fingers(int now, int last) {
        stats.setNumFingersTouching(now);
        stats.setLastNumFingersTouching(last);
        stats.setMaxFingersTouching(now > last ? now : last);
    }
    void parse() { parser.parseGesture(stats, motion); }
    HIDMotion deltas() const { return motion.motionDeltas(); }

    // A one-finger touch of 100 ms, lifted 3 ms ago, slow, nowhere near a button or reset.
    void quickTouch() {
        fingers(0, 1);
        stats.setT_firstFingerTouchDown(ticks(kNow - 100));
        stats.setT_recentFingerTouchDown(ticks(kNow - 100));
        stats.setT_previousRecentFingerTouchDown(0);
        stats.setT_recentFingerLiftoff(ticks(kNow - 3));
        motion.setLastMaxFingerSpeed(1.0f);
    }

    // One finger down 41 ms, 21 ms after a lift-off, 71 ms after a scale and 51 ms after a
    // scroll ended, with 6 pixels of accumulated motion.
    void movingFinger() {
        fingers(1, 1);
        stats.setT_firstFingerTouchDown(ticks(kNow - 41));
        stats.setT_recentFingerTouchDown(ticks(kNow - 41));
        stats.setT_recentFingerLiftoff(ticks(kNow - 21));
        stats.setT_recentScaleEnd(ticks(kNow - 71));
        stats.setT_recentScrollEnd(ticks(kNow - 51));
        motion.setAccumulatedDeltas({6.0f, 0.0f, 0.0f, 0.0f});
        motion.setPixelDeltas({1.3f, -0.7f, 0.0f, 0.0f});
    }

    std::shared_ptr<CaptureLogSink> sink = std::make_shared<CaptureLogSink>();
    HIDGestureParser parser;
    HIDHandStatistics stats;
    HIDHandMotion motion;
};

TEST_F(GestureRecogniserTest, FrameStartKeepsThePreviousGestureAndPhaseAndClearsTheMotion) {
    parser.setCurrentGesture(kHIDGestureTypeScale);
    parser.setCurrentPhase(kHIDGesturePhaseChanged);
    motion.setMotionDeltas({1.0f, 2.0f, 3.0f, 4.0f});
    fingers(2, 2);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 3.0f, 0.0f});  // below the threshold: nothing fires
    parse();
    EXPECT_EQ(parser.prevGesture(), kHIDGestureTypeScale);
    EXPECT_EQ(parser.prevPhase(), kHIDGesturePhaseChanged);
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScale);
    EXPECT_EQ(deltas().x, 0.0f);
    EXPECT_EQ(deltas().y, 0.0f);
    EXPECT_EQ(deltas().scale, 0.0f);
    EXPECT_EQ(deltas().rotate, 0.0f);
}

TEST_F(GestureRecogniserTest, PixelDeltasQuantiseToWholeQuantaTowardZero) {
    motion.setPixelDeltas({0.6f, -1.3f, 3.3f, -0.2f});
    parser.quantizeMotion(motion);
    // 0.6 / 0.635 = 0.94 -> 0; -1.3 / 0.635 = -2.05 -> -2, -2 x 0.635 = -1.27.
    EXPECT_EQ(motion.pixelDeltas().x, 0.0f);
    EXPECT_EQ(motion.pixelDeltas().y, -1.27f);
    // Scale and rotate are kept as they are.
    EXPECT_EQ(motion.pixelDeltas().scale, 3.3f);
    EXPECT_EQ(motion.pixelDeltas().rotate, -0.2f);
}

TEST_F(GestureRecogniserTest, MotionBelowOneQuantumBecomesZero) {
    motion.setPixelDeltas({0.634f, -0.634f, 0.0f, 0.0f});
    parser.quantizeMotion(motion);
    EXPECT_EQ(motion.pixelDeltas().x, 0.0f);
    EXPECT_EQ(motion.pixelDeltas().y, 0.0f);
    motion.setPixelDeltas({-0.9f, 3.2f, 0.0f, 0.0f});
    parser.quantizeMotion(motion);
    EXPECT_EQ(motion.pixelDeltas().x, -0.635f);  // -1.42 -> -1 quantum
    EXPECT_EQ(motion.pixelDeltas().y, 3.175f);  // 5.04 -> 5 quanta: 5 x 0.635
}

TEST_F(GestureRecogniserTest, OneFingerMovingPastTheThresholdMovesThePointerByQuantisedDeltas) {
    movingFinger();
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypePointer);
    // (1.3, -0.7) quantise to (2 x 0.635, -1 x 0.635).
    EXPECT_EQ(deltas().x, 1.27f);
    EXPECT_EQ(deltas().y, -0.635f);
    EXPECT_EQ(deltas().scale, 0.0f);
    EXPECT_EQ(deltas().rotate, 0.0f);
}

TEST_F(GestureRecogniserTest, AccumulatedMotionOfExactlyFiveMovesNoPointer) {
    movingFinger();
    motion.setAccumulatedDeltas({5.0f, 0.0f, 0.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(deltas().x, 0.0f);
    EXPECT_EQ(deltas().y, 0.0f);
}

struct PointerTiming {
    const char* name;
    void (*set)(HIDHandStatistics&, double now);
};
std::ostream& operator<<(std::ostream& os, const PointerTiming& p) { return os << p.name; }

class PointerTimingTest : public GestureRecogniserTest, public ::testing::WithParamInterface<PointerTiming> {};

TEST_P(PointerTimingTest, PointerWaitsStrictlyLongerThanItsThreshold) {
    movingFinger();
    GetParam().set(stats, kNow);
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(deltas().x, 0.0f);
}

INSTANTIATE_TEST_SUITE_P(
    EachTimer, PointerTimingTest,
    ::testing::Values(PointerTiming{"TouchDown40ms",
                                    [](HIDHandStatistics& s, double t) { s.setT_firstFingerTouchDown(ticks(t - 40)); }},
                      PointerTiming{"Liftoff20ms",
                                    [](HIDHandStatistics& s, double t) { s.setT_recentFingerLiftoff(ticks(t - 20)); }},
                      PointerTiming{"ScaleEnd70ms",
                                    [](HIDHandStatistics& s, double now) { s.setT_recentScaleEnd(ticks(now - 70)); }},
                      PointerTiming{"ScrollEnd50ms",
                                    [](HIDHandStatistics& s, double now) { s.setT_recentScrollEnd(ticks(now - 50)); }}),
    [](const ::testing::TestParamInfo<PointerTiming>& info) { return std::string(info.param.name); });

TEST_F(GestureRecogniserTest, PointerRuleEndsATwoFingerGestureLeftWithOneFinger) {
    movingFinger();
    parser.setCurrentGesture(kHIDGestureTypeScroll);
    parser.setCurrentPhase(kHIDGesturePhaseChanged);
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseNone);
    EXPECT_EQ(deltas().x, 0.0f);
}

TEST_F(GestureRecogniserTest, OneFingerBesideARestingThumbChecksWhetherTheyAreClose) {
    fingers(1, 1);
    stats.setNumFingersRestingInZone(1);
    stats.setT_firstFingerTouchDown(ticks(kNow - 10));  // too early for the pointer
    motion.setInnermostOutermostSeparation_mm(259.0f);
    motion.setInnermostOutermostVerticalSeparation_mm(119.0f);
    parse();
    EXPECT_TRUE(stats.twoFingersClose());
}

TEST_F(GestureRecogniserTest, OneFingerAloneLeavesTheClosenessAsItWas) {
    fingers(1, 1);
    stats.setTwoFingersClose(true);
    motion.setInnermostOutermostSeparation_mm(500.0f);
    parse();
    EXPECT_TRUE(stats.twoFingersClose());
}

TEST_F(GestureRecogniserTest, MovingPointerDoesNotCheckTheCloseness) {
    movingFinger();
    stats.setNumFingersRestingInZone(1);
    motion.setInnermostOutermostSeparation_mm(10.0f);
    motion.setInnermostOutermostVerticalSeparation_mm(10.0f);
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypePointer);
    EXPECT_FALSE(stats.twoFingersClose());
}

TEST_F(GestureRecogniserTest, StillTwoFingersAreCloseOnlyBelowBothSeparations) {
    fingers(2, 2);
    motion.setAccumulatedDeltas({0.0f, 5.0f, 0.0f, 0.0f});
    motion.setInnermostOutermostSeparation_mm(259.9f);
    motion.setInnermostOutermostVerticalSeparation_mm(119.9f);
    parse();
    EXPECT_TRUE(stats.twoFingersClose());

    motion.setInnermostOutermostSeparation_mm(260.0f);
    parse();
    EXPECT_FALSE(stats.twoFingersClose());

    motion.setInnermostOutermostSeparation_mm(100.0f);
    motion.setInnermostOutermostVerticalSeparation_mm(120.0f);
    parse();
    EXPECT_FALSE(stats.twoFingersClose());
}

TEST_F(GestureRecogniserTest, MovingTwoFingersKeepTheClosenessAndEngageInAGesture) {
    fingers(2, 2);
    stats.setTwoFingersClose(true);
    motion.setAccumulatedDeltas({0.0f, 6.0f, 0.0f, 0.0f});
    motion.setInnermostOutermostSeparation_mm(900.0f);
    parse();
    EXPECT_TRUE(stats.twoFingersClose());
    EXPECT_TRUE(stats.engagedinGesture());
}

TEST_F(GestureRecogniserTest, TwoFingersDominatedByYScrollWithInvertedDoubledDeltas) {
    fingers(2, 2);
    motion.setAccumulatedDeltas({1.0f, 8.0f, 0.5f, 0.0f});
    motion.setPixelDeltas({-1.27f, 2.54f, 0.5f, 0.0f});  // -2 and 4 quanta exactly
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(deltas().x, 2.54f);   // -1.27 x -2
    EXPECT_EQ(deltas().y, -5.08f);  // 2.54 x -2
    EXPECT_EQ(deltas().scale, 0.0f);
    EXPECT_EQ(deltas().rotate, 0.0f);
    EXPECT_TRUE(stats.engagedinGesture());
}

TEST_F(GestureRecogniserTest, TwoFingersDominatedByXScrollToo) {
    fingers(2, 2);
    motion.setAccumulatedDeltas({7.0f, 2.0f, 0.0f, 0.0f});
    motion.setPixelDeltas({0.635f, 0.0f, 0.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(deltas().x, -1.27f);
}

TEST_F(GestureRecogniserTest, TwoFingersDoNotScrollWithin14msOfALiftoff) {
    fingers(2, 2);
    stats.setT_recentFingerLiftoff(ticks(kNow - 14));
    motion.setAccumulatedDeltas({1.0f, 8.0f, 0.0f, 0.0f});
    motion.setPixelDeltas({0.0f, 2.54f, 0.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(deltas().y, 0.0f);  // the motion is set only when the rule holds
    EXPECT_TRUE(stats.engagedinGesture());

    stats.setT_recentFingerLiftoff(ticks(kNow - 15));
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(deltas().y, -5.08f);
}

TEST_F(GestureRecogniserTest, ScrollingWithoutMotionInAFrameKeepsTheScroll) {
    fingers(2, 2);
    parser.setCurrentGesture(kHIDGestureTypeScroll);
    motion.setAccumulatedDeltas({0.0f, 8.0f, 0.0f, 0.0f});
    motion.setPixelDeltas({0.0f, 0.5f, 0.0f, 0.0f});  // below one quantum
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(deltas().x, 0.0f);
    EXPECT_EQ(deltas().y, 0.0f);
}

TEST_F(GestureRecogniserTest, PinchDominatedByScaleBecomesScaleWithGainInDoublePrecision) {
    fingers(2, 2);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 6.0f, 1.0f});
    motion.setPixelDeltas({0.0f, 0.0f, 10.0f, 1.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScale);
    // 10 x 0.005 = 0.05 exactly in double, then the nearest float; a single-precision
    // product would give 0.049999997.
    EXPECT_EQ(deltas().scale, 0.05f);
    EXPECT_EQ(deltas().x, 0.0f);
    EXPECT_EQ(deltas().y, 0.0f);
    EXPECT_EQ(deltas().rotate, 0.0f);
}

TEST_F(GestureRecogniserTest, TurnDominatedByRotationBecomesRotate) {
    fingers(2, 2);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 1.0f, 6.0f});
    motion.setPixelDeltas({0.0f, 0.0f, 1.0f, -9.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeRotate);
    // -9 x 0.005 = -0.045 in double, then the nearest float (a float product is -0.044999998).
    EXPECT_EQ(deltas().rotate, -0.045f);
    EXPECT_EQ(deltas().scale, 0.0f);
}

TEST_F(GestureRecogniserTest, EqualScaleAndRotationGoToScale) {
    fingers(2, 2);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 6.0f, 6.0f});
    motion.setPixelDeltas({0.0f, 0.0f, -2.0f, 2.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScale);
    EXPECT_EQ(deltas().scale, -0.01f);
    EXPECT_EQ(deltas().rotate, 0.0f);
}

TEST_F(GestureRecogniserTest, ScaleAndRotateTurnIntoEachOther) {
    fingers(2, 2);
    parser.setCurrentGesture(kHIDGestureTypeScale);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 2.0f, 6.0f});
    motion.setPixelDeltas({0.0f, 0.0f, 0.0f, 3.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeRotate);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 9.0f, 6.0f});
    motion.setPixelDeltas({0.0f, 0.0f, 3.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScale);
}

TEST_F(GestureRecogniserTest, ScrollDoesNotTurnIntoScale) {
    fingers(2, 2);
    parser.setCurrentGesture(kHIDGestureTypeScroll);
    motion.setAccumulatedDeltas({0.0f, 1.0f, 6.0f, 0.0f});
    motion.setPixelDeltas({0.0f, 0.0f, 4.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(deltas().scale, 0.0f);
}

TEST_F(GestureRecogniserTest, PointerTurnsIntoScrollOrScale) {
    fingers(2, 2);
    parser.setCurrentGesture(kHIDGestureTypePointer);
    motion.setAccumulatedDeltas({0.0f, 6.0f, 0.0f, 0.0f});
    motion.setPixelDeltas({0.0f, 0.635f, 0.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);

    parser.setCurrentGesture(kHIDGestureTypePointer);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 6.0f, 0.0f});
    motion.setPixelDeltas({0.0f, 0.0f, 2.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScale);
}

TEST_F(GestureRecogniserTest, ScrollWinsAFrameInWhichScaleCouldAlsoFire) {
    fingers(2, 2);
    motion.setAccumulatedDeltas({6.0f, 0.0f, 6.0f, 0.0f});
    motion.setPixelDeltas({0.635f, 0.0f, 4.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(deltas().x, -1.27f);
    EXPECT_EQ(deltas().scale, 0.0f);
}

TEST_F(GestureRecogniserTest, NoScaleWithAFingerRestingInTheThumbZone) {
    fingers(2, 2);
    stats.setNumFingersRestingInZone(1);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 6.0f, 0.0f});
    motion.setPixelDeltas({0.0f, 0.0f, 4.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
}

TEST_F(GestureRecogniserTest, NoScaleOnceMoreThanTwoFingersTouched) {
    fingers(2, 2);
    stats.setMaxFingersTouching(3);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 6.0f, 0.0f});
    motion.setPixelDeltas({0.0f, 0.0f, 4.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
}

TEST_F(GestureRecogniserTest, StillTwoFingersMayBeginAScrollInTheirFirstFrameOnly) {
    fingers(2, 0);
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    EXPECT_EQ(deltas().x, 0.0f);
    EXPECT_EQ(deltas().y, 0.0f);

    // Event creation turns it into a may-begin: gesture back to none, phase 0x80.
    auto hand = HIDEvent::create(kHIDEventTypeDigitizer, TestClock::msToTicks(kNow));
    auto pointer = HIDEvent::pointerEvent(hand->timestamp(), 0, 0, 0, 0, 0);
    parser.createGestureEvents(stats, motion, hand, pointer, nullptr, nullptr, false, false);
    ASSERT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    ASSERT_EQ(parser.currentPhase(), kHIDGesturePhaseMayBegin);

    fingers(2, 2);
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
}

TEST_F(GestureRecogniserTest, OneFingerBesideARestingThumbMayBeginAScroll) {
    fingers(1, 1);
    stats.setNumFingersRestingInZone(1);
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
}

TEST_F(GestureRecogniserTest, NoMayBeginWhileTheLastFrameWasAScroll) {
    fingers(2, 2);
    parser.setCurrentGesture(kHIDGestureTypeScroll);
    parse();  // the scroll goes on, motionless
    ASSERT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
    parser.setCurrentGesture(kHIDGestureTypeNone);
    parse();  // prevGesture is none now: the rule may fire again
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeScroll);
}

TEST_F(GestureRecogniserTest, NoMayBeginWhileTheHandHasMoved) {
    fingers(2, 2);
    motion.setAccumulatedDeltas({0.0f, 0.5f, 0.0f, 0.0f});
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
}

TEST_F(GestureRecogniserTest, LiftingAllFingersEndsTheGestureAndTheCloseness) {
    fingers(0, 2);
    parser.setCurrentGesture(kHIDGestureTypeScroll);
    parser.setCurrentPhase(kHIDGesturePhaseChanged);
    stats.setEngagedinGesture(true);
    stats.setTwoFingersClose(true);
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseNone);
    EXPECT_FALSE(stats.engagedinGesture());
    EXPECT_FALSE(stats.twoFingersClose());
}

TEST_F(GestureRecogniserTest, LiftingOneOfTwoFingersEndsTheGestureButKeepsTheCloseness) {
    fingers(1, 2);
    stats.setT_recentFingerLiftoff(ticks(kNow));
    parser.setCurrentGesture(kHIDGestureTypeScale);
    parser.setCurrentPhase(kHIDGesturePhaseChanged);
    stats.setEngagedinGesture(true);
    stats.setTwoFingersClose(true);
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseNone);
    EXPECT_FALSE(stats.engagedinGesture());
    EXPECT_TRUE(stats.twoFingersClose());
}

TEST_F(GestureRecogniserTest, QuickTouchIsAOneFingerTap) {
    quickTouch();
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeOneFingerTap);
    EXPECT_EQ(stats.t_recentSingleFingerTap(), ticks(kNow));
    EXPECT_EQ(stats.t_recentTwoFingerTap(), 0.0);
}

TEST_F(GestureRecogniserTest, QuickTouchOfTwoFingersLessThan60msApartIsATwoFingerTap) {
    quickTouch();
    stats.setT_previousRecentFingerTouchDown(ticks(kNow - 159));  // 59 ms before the other
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeTwoFingerTap);
    EXPECT_EQ(stats.t_recentTwoFingerTap(), ticks(kNow));
    EXPECT_EQ(stats.t_recentSingleFingerTap(), 0.0);
}

TEST_F(GestureRecogniserTest, TouchesExactly60msApartAreAOneFingerTap) {
    quickTouch();
    stats.setT_previousRecentFingerTouchDown(ticks(kNow - 160));
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeOneFingerTap);
}

TEST_F(GestureRecogniserTest, SecondOneFingerTapWithin100msGivesNothing) {
    quickTouch();
    stats.setT_recentSingleFingerTap(ticks(kNow - 100));
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(stats.t_recentSingleFingerTap(), ticks(kNow - 100));

    stats.setT_recentSingleFingerTap(ticks(kNow - 101));
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeOneFingerTap);
}

TEST_F(GestureRecogniserTest, SecondTwoFingerTapWithin100msGivesNothing) {
    quickTouch();
    stats.setT_previousRecentFingerTouchDown(ticks(kNow - 120));
    stats.setT_recentTwoFingerTap(ticks(kNow - 80));
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
}

TEST_F(GestureRecogniserTest, TapAfterAGestureOtherThanPointerGivesNothing) {
    quickTouch();
    parser.setCurrentGesture(kHIDGestureTypeScroll);  // becomes prevGesture
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);

    quickTouch();
    parser.setCurrentGesture(kHIDGestureTypePointer);
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeOneFingerTap);
}

struct GestureEnd {
    const char* name;
    void (*set)(HIDHandStatistics&, double time);
};
std::ostream& operator<<(std::ostream& os, const GestureEnd& g) { return os << g.name; }

class TwoFingerTapAfterGestureEndTest : public GestureRecogniserTest,
                                        public ::testing::WithParamInterface<GestureEnd> {};

TEST_P(TwoFingerTapAfterGestureEndTest, TwoFingerTapWithin250msOfTheEndIsIgnored) {
    quickTouch();
    stats.setT_previousRecentFingerTouchDown(ticks(kNow - 130));
    GetParam().set(stats, ticks(kNow - 250));
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
    EXPECT_EQ(stats.t_recentTwoFingerTap(), 0.0);

    GetParam().set(stats, ticks(kNow - 251));
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeTwoFingerTap);
}

INSTANTIATE_TEST_SUITE_P(
    EachGesture, TwoFingerTapAfterGestureEndTest,
    ::testing::Values(GestureEnd{"Scroll", [](HIDHandStatistics& s, double t) { s.setTimeofScrollEnd(t); }},
                      GestureEnd{"Scale", [](HIDHandStatistics& s, double t) { s.setTimeofScaleEnd(t); }},
                      GestureEnd{"Rotate", [](HIDHandStatistics& s, double t) { s.setTimeofRotateEnd(t); }}),
    [](const ::testing::TestParamInfo<GestureEnd>& info) { return std::string(info.param.name); });

TEST_F(GestureRecogniserTest, OneFingerTapRightAfterAScrollIsStillATap) {
    quickTouch();
    stats.setTimeofScrollEnd(ticks(kNow - 10));
    parse();
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeOneFingerTap);
}

TEST_F(GestureRecogniserTest, ThreeFingersAlwaysEndWithNoGesture) {
    for (int32_t gesture = kHIDGestureTypeNone; gesture <= kHIDGestureTypeTwoFingerTap; ++gesture) {
        SCOPED_TRACE(gesture);
        fingers(3, 3);
        parser.setCurrentGesture(gesture);
        parser.setCurrentPhase(kHIDGesturePhaseChanged);
        motion.setAccumulatedDeltas({0.0f, 9.0f, 0.0f, 0.0f});
        motion.setPixelDeltas({0.0f, 1.27f, 0.0f, 0.0f});
        parse();
        EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
        EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseChanged);  // only no finger clears it
        EXPECT_EQ(deltas().y, 0.0f);
    }
    fingers(3, 0);
    motion.setAccumulatedDeltas({0.0f, 0.0f, 0.0f, 0.0f});
    parse();  // a still hand of three fingers is no may-begin either
    EXPECT_EQ(parser.currentGesture(), kHIDGestureTypeNone);
}

TEST_F(GestureRecogniserTest, NoFingerClearsThePhase) {
    fingers(0, 0);
    parser.setCurrentPhase(kHIDGesturePhaseCancelled);
    parse();
    EXPECT_EQ(parser.currentPhase(), kHIDGesturePhaseNone);
}

// The tap test, condition by condition.
class TapTest : public GestureRecogniserTest {
protected:
    void SetUp() override {
        GestureRecogniserTest::SetUp();
        quickTouch();
    }
    bool tap(bool adjacent = true) const { return parser.tapHasValidTimingAndStrength(stats, motion, adjacent); }
};

TEST_F(TapTest, QuickSlowTouchAwayFromResetAndButtonIsValid) { EXPECT_TRUE(tap()); }

TEST_F(TapTest, TheThirdArgumentIsIgnored) {
    EXPECT_TRUE(tap(false));
    motion.setLastMaxFingerSpeed(5.0f);
    EXPECT_FALSE(tap(false));
    EXPECT_FALSE(tap(true));
}

TEST_F(TapTest, TouchOf250msIsTooLong) {
    stats.setT_recentFingerTouchDown(ticks(kNow - 250));
    EXPECT_FALSE(tap());
    stats.setT_recentFingerTouchDown(ticks(kNow - 249));
    EXPECT_TRUE(tap());
}

TEST_F(TapTest, LiftoffMustBeUnder30msAgo) {
    stats.setT_recentFingerLiftoff(ticks(kNow - 30));
    EXPECT_FALSE(tap());
    stats.setT_recentFingerLiftoff(ticks(kNow - 29));
    EXPECT_TRUE(tap());
}

TEST_F(TapTest, TouchMustLastLongerThanTwoHundredthsOfAMillisecond) {
    stats.setT_recentFingerTouchDown(ticks(kNow));
    EXPECT_FALSE(tap());
    stats.setT_recentFingerTouchDown(ticks(kNow - 0.02));
    EXPECT_FALSE(tap());
    stats.setT_recentFingerTouchDown(ticks(kNow - 0.03));
    EXPECT_TRUE(tap());
}

TEST_F(TapTest, ResetMustBeAtLeast250msAgo) {
    stats.setT_recentReset(ticks(kNow - 249));
    EXPECT_FALSE(tap());
    stats.setT_recentReset(ticks(kNow - 250));
    EXPECT_TRUE(tap());
}

TEST_F(TapTest, ButtonActivityMustBeAtLeast250msAgo) {
    stats.setT_recentButtonActivity(ticks(kNow - 249));
    EXPECT_FALSE(tap());
    stats.setT_recentButtonActivity(ticks(kNow - 250));
    EXPECT_TRUE(tap());
}

TEST_F(TapTest, FingersMustBeSlowerThanFive) {
    motion.setLastMaxFingerSpeed(5.0f);
    EXPECT_FALSE(tap());
    motion.setLastMaxFingerSpeed(4.99f);
    EXPECT_TRUE(tap());
}

// ---------------------------------------------------------------------------------------
// Whole gestures, one row per frame: the hand going in, and the gesture, the phase, the
// events and the log lines coming out.

struct Row {
    double t_ms;
    int fingers;
    int touchDowns = 0;    // fingers that touched down in this frame
    bool liftoff = false;  // a finger lifted in this frame
    int button = 0;        // the diving button's state
    HIDMotion accumulated{};
    HIDMotion pixels{};
    // After the frame:
    int32_t gesture = 0;
    uint16_t phase = 0;
    const char* returned = "";    // children of the returned pointer event
    const char* dispatched = "";  // what the dispatcher received, at the moment it was sent
    const char* logs = "";        // gesture log lines
};

struct HandSetup {
    bool tapToClick = true;
    bool secondaryClick = true;
    float lastMaxFingerSpeed = 10.0f;  // fast: no taps
    float separation_mm = 500.0f;      // far apart
    float verticalSeparation_mm = 300.0f;
};

std::string render(const HIDEventRef& pointer) { return test::pointerEventText(pointer, {.bare = ""}); }

class GestureSequenceTest : public ::testing::Test {
protected:
    void SetUp() override { Logging::setSink(sink); }
    void TearDown() override { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }

    void run(const HandSetup& hand, const std::vector<Row>& rows) {
        motion.setLastMaxFingerSpeed(hand.lastMaxFingerSpeed);
        motion.setInnermostOutermostSeparation_mm(hand.separation_mm);
        motion.setInnermostOutermostVerticalSeparation_mm(hand.verticalSeparation_mm);
        std::vector<HIDEventRef> dispatched;
        const HIDDispatchHandler dispatcher = [&dispatched](const HIDEventRef& e) { dispatched.push_back(e->copy()); };
        int lastFingers = 0;
        int lastButton = 0;
        int maxFingers = 0;
        for (size_t i = 0; i < rows.size(); ++i) {
            const Row& row = rows[i];
            SCOPED_TRACE("frame " + std::to_string(i) + " at " + test::numberText(row.t_ms) + " ms");
            const double now = ticks(row.t_ms);
            stats.setCurrentTimestamp(now);
            for (int k = 0; k < row.touchDowns; ++k) {
                stats.setT_previousRecentFingerTouchDown(stats.t_recentFingerTouchDown());
                stats.setT_recentFingerTouchDown(now);
                if (lastFingers == 0) stats.setT_firstFingerTouchDown(now);
            }
            if (row.liftoff) stats.setT_recentFingerLiftoff(now);
            maxFingers = row.fingers == 0 ? 0 : std::max(maxFingers, row.fingers);
            stats.setNumFingersTouching(row.fingers);
            stats.setLastNumFingersTouching(lastFingers);
            stats.setMaxFingersTouching(maxFingers);
            stats.setCurrentButtonState(row.button);
            stats.setLastButtonState(lastButton);
            motion.setAccumulatedDeltas(row.accumulated);
            motion.setPixelDeltas(row.pixels);

            HIDEventRef handEvent = HIDEvent::create(kHIDEventTypeDigitizer, TestClock::msToTicks(row.t_ms));
            handEvent->setSenderID(0x1234);
            sink->clear();
            dispatched.clear();
            HIDEventRef result = parser.parseHandGesturesCreateHIDEvents(stats, motion, handEvent, dispatcher,
                                                                         hand.tapToClick, hand.secondaryClick);

            EXPECT_EQ(parser.currentGesture(), row.gesture);
            EXPECT_EQ(parser.currentPhase(), row.phase);
            EXPECT_EQ(render(result), row.returned);
            std::string sent;
            for (const HIDEventRef& e : dispatched) sent += (sent.empty() ? "" : " | ") + render(e);
            EXPECT_EQ(sent, row.dispatched);
            EXPECT_EQ(logLines(), row.logs);
            if (result) {
                EXPECT_EQ(result->timestamp(), handEvent->timestamp());
                EXPECT_EQ(result->senderID(), 0x1234u);
                EXPECT_EQ(result->integerValueForField(kHIDEventFieldPointerButtonMask), row.button);
            }
            lastFingers = row.fingers;
            lastButton = row.button;
        }
    }

    // The gesture lines of the frame without their method name, joined by ", ".
    std::string logLines() const {
        static const std::string kPrefixes[] = {
            "-[HIDGestureParser createGestureEvents:handMotion:handEvent:pointerEvent:gestureEvent:dispatcher:"
            "tapToClickEnabled:twoFingersSecondaryClickEnabled:] GESTURE ",
            "-[HIDGestureParser cancelScrollMayBegin:pointerEvent:] GESTURE "};
        std::string out;
        for (const std::string& m : sink->messages()) {
            std::string line = m;
            for (const std::string& p : kPrefixes)
                if (line.rfind(p, 0) == 0) line = line.substr(p.size());
            out += (out.empty() ? "" : ", ") + line;
        }
        return out;
    }

    std::shared_ptr<CaptureLogSink> sink = std::make_shared<CaptureLogSink>();
    HIDGestureParser parser;
    HIDHandStatistics stats;
    HIDHandMotion motion;
};

constexpr uint16_t kMayBegin = kHIDGesturePhaseMayBegin;

TEST_F(GestureSequenceTest, TwoFingersRestThenScrollThenLift) {
    run(HandSetup{}, {
        {.t_ms = 1000, .fingers = 2, .touchDowns = 2,
         .gesture = 0, .phase = kMayBegin, .returned = "hand scroll:maybegin(0,0)", .logs = "SCROLL MAY BEGIN"},
        {.t_ms = 1008, .fingers = 2,
         .gesture = 0, .phase = kMayBegin, .returned = "hand"},
        {.t_ms = 1016, .fingers = 2, .accumulated = {0, 3, 0, 0}, .pixels = {0, 3, 0, 0},
         .gesture = 0, .phase = kMayBegin, .returned = "hand"},
        // 1.27 is two quanta; the scroll goes against the fingers at twice the motion.
        {.t_ms = 1024, .fingers = 2, .accumulated = {0, 6, 0, 0}, .pixels = {0, 1.27f, 0, 0},
         .gesture = 2, .phase = 1, .returned = "hand scroll:began(0,-2.54)", .logs = "SCROLL BEGAN"},
        {.t_ms = 1032, .fingers = 2, .accumulated = {0.5f, 8, 0, 0}, .pixels = {0.635f, 1.27f, 0, 0},
         .gesture = 2, .phase = 2, .returned = "hand scroll:changed(-1.27,-2.54)"},
        // Motion under one quantum: no scroll event, the scroll goes on.
        {.t_ms = 1040, .fingers = 2, .accumulated = {0.5f, 8.5f, 0, 0}, .pixels = {0, 0.5f, 0, 0},
         .gesture = 2, .phase = 2, .returned = "hand"},
        {.t_ms = 1048, .fingers = 2, .accumulated = {0.5f, 10, 0, 0}, .pixels = {0, -1.27f, 0, 0},
         .gesture = 2, .phase = 2, .returned = "hand scroll:changed(0,2.54)"},
        {.t_ms = 1056, .fingers = 1, .liftoff = true,
         .gesture = 0, .phase = 4, .returned = "hand scroll:ended(0,0)", .logs = "END SCROLL"},
        {.t_ms = 1064, .fingers = 0, .liftoff = true,
         .gesture = 0, .phase = 0, .returned = "hand"},
    });
    EXPECT_EQ(stats.t_recentScrollEnd(), ticks(1056));
}

TEST_F(GestureSequenceTest, TwoFingersRestAndLiftWithoutMoving) {
    run(HandSetup{}, {
        {.t_ms = 1000, .fingers = 2, .touchDowns = 2,
         .gesture = 0, .phase = kMayBegin, .returned = "hand scroll:maybegin(0,0)", .logs = "SCROLL MAY BEGIN"},
        {.t_ms = 1008, .fingers = 2,
         .gesture = 0, .phase = kMayBegin, .returned = "hand"},
        // The may-begin is withdrawn: the cancel comes before the hand event here.
        {.t_ms = 1016, .fingers = 1, .liftoff = true,
         .gesture = 0, .phase = 8, .returned = "scroll:cancelled(0,0) hand", .logs = "SCROLL CANCELLED"},
        {.t_ms = 1024, .fingers = 0, .liftoff = true,
         .gesture = 0, .phase = 0, .returned = "hand"},
        {.t_ms = 1032, .fingers = 0,
         .gesture = 0, .phase = 0, .returned = "hand"},
    });
    EXPECT_EQ(stats.t_recentScrollEnd(), ticks(1016));
}

TEST_F(GestureSequenceTest, Pinch) {
    run(HandSetup{}, {
        {.t_ms = 1000, .fingers = 2, .touchDowns = 2,
         .gesture = 0, .phase = kMayBegin, .returned = "hand scroll:maybegin(0,0)", .logs = "SCROLL MAY BEGIN"},
        // 10 x 0.005 = 0.05. The outstanding may-begin is withdrawn with the first scale.
        {.t_ms = 1008, .fingers = 2, .accumulated = {0, 0, 6, 1}, .pixels = {0, 0, 10, 1},
         .gesture = 3, .phase = 1, .returned = "scroll:cancelled(0,0) hand scale:began(0.05)",
         .logs = "SCROLL CANCELLED, SCALE BEGAN"},
        {.t_ms = 1016, .fingers = 2, .accumulated = {0, 0, 10, 1}, .pixels = {0, 0, -4, 0},
         .gesture = 3, .phase = 2, .returned = "hand scale:changed(-0.02)"},
        // No scale motion in this frame: only the hand event, the scale goes on.
        {.t_ms = 1024, .fingers = 2, .accumulated = {0, 0, 10, 1},
         .gesture = 3, .phase = 2, .returned = "hand"},
        {.t_ms = 1032, .fingers = 2, .accumulated = {0, 0, 12, 1}, .pixels = {0, 0, 2, 0},
         .gesture = 3, .phase = 2, .returned = "hand scale:changed(0.01)"},
        {.t_ms = 1040, .fingers = 1, .liftoff = true,
         .gesture = 0, .phase = 4, .returned = "hand scale:ended(0)", .logs = "END SCALE"},
        {.t_ms = 1048, .fingers = 0, .liftoff = true,
         .gesture = 0, .phase = 0, .returned = "hand"},
    });
    EXPECT_EQ(stats.t_recentScaleEnd(), ticks(1040));
}

TEST_F(GestureSequenceTest, RotationThatTurnsIntoAScale) {
    run(HandSetup{}, {
        // -4 x 0.005 = -0.02; -2 x 0.005 = -0.01; 6 x 0.005 = 0.03.
        {.t_ms = 1000, .fingers = 2, .touchDowns = 2, .accumulated = {0, 0, 1, 6}, .pixels = {0, 0, 1, -4},
         .gesture = 4, .phase = 1, .returned = "hand rotate:began(-0.02)", .logs = "ROTATE BEGAN"},
        {.t_ms = 1008, .fingers = 2, .accumulated = {0, 0, 1, 8}, .pixels = {0, 0, 0, -2},
         .gesture = 4, .phase = 2, .returned = "hand rotate:changed(-0.01)"},
        {.t_ms = 1016, .fingers = 2, .accumulated = {0, 0, 10, 8}, .pixels = {0, 0, 6, 1},
         .gesture = 3, .phase = 1, .returned = "hand scale:began(0.03)", .logs = "SCALE BEGAN"},
        // Both are still in progress: both end, scale first.
        {.t_ms = 1024, .fingers = 1, .liftoff = true,
         .gesture = 0, .phase = 4, .returned = "hand scale:ended(0) rotate:ended(0)",
         .logs = "END SCALE, END ROTATION"},
        {.t_ms = 1032, .fingers = 0, .liftoff = true,
         .gesture = 0, .phase = 0, .returned = "hand"},
    });
}

TEST_F(GestureSequenceTest, PointerMovesByQuantisedDeltas) {
    run(HandSetup{}, {
        {.t_ms = 1000, .fingers = 1, .touchDowns = 1,
         .gesture = 0, .phase = 0, .returned = "hand"},
        // Down only 16 ms: too early.
        {.t_ms = 1016, .fingers = 1, .accumulated = {6, 1, 0, 0}, .pixels = {1.3f, -0.7f, 0, 0},
         .gesture = 0, .phase = 0, .returned = "hand"},
        // (1.3, -0.7) quantise to (1.27, -0.635).
        {.t_ms = 1041, .fingers = 1, .accumulated = {8, 2, 0, 0}, .pixels = {1.3f, -0.7f, 0, 0},
         .gesture = 1, .phase = 0, .returned = "move(1.27,-0.635) hand", .logs = "POINTER BEGAN"},
        {.t_ms = 1049, .fingers = 1, .accumulated = {12, 2, 0, 0}, .pixels = {-3.2f, 0.6f, 0, 0},
         .gesture = 1, .phase = 0, .returned = "move(-3.175,0) hand"},
        {.t_ms = 1057, .fingers = 1, .accumulated = {12, 2, 0, 0}, .pixels = {0.3f, 0.3f, 0, 0},
         .gesture = 1, .phase = 0, .returned = "hand"},
        {.t_ms = 1065, .fingers = 0, .liftoff = true,
         .gesture = 0, .phase = 0, .returned = "hand", .logs = "POINTER ENDED"},
    });
    EXPECT_EQ(stats.t_recentSwipeEnd(), ticks(1065));
}

TEST_F(GestureSequenceTest, OneFingerTapClicksWithTapToClick) {
    HandSetup hand;
    hand.lastMaxFingerSpeed = 1.0f;
    run(hand, {
        {.t_ms = 1000, .fingers = 1, .touchDowns = 1,
         .gesture = 0, .phase = 0, .returned = "hand"},
        {.t_ms = 1050, .fingers = 1,
         .gesture = 0, .phase = 0, .returned = "hand"},
        // Touched 100 ms, lifted now: the press goes out at once, the release is returned.
        {.t_ms = 1100, .fingers = 0, .liftoff = true,
         .gesture = 0, .phase = 0, .returned = "hand button:0", .dispatched = "hand button:1", .logs = "1F TAP"},
        // 8 ms later the tap test still holds, but a tap came less than 100 ms ago.
        {.t_ms = 1108, .fingers = 0,
         .gesture = 0, .phase = 0, .returned = "hand"},
    });
}

TEST_F(GestureSequenceTest, OneFingerTapWithoutTapToClickSendsOnlyTheHandEvent) {
    HandSetup hand;
    hand.lastMaxFingerSpeed = 1.0f;
    hand.tapToClick = false;
    run(hand, {
        {.t_ms = 1000, .fingers = 1, .touchDowns = 1,
         .gesture = 0, .phase = 0, .returned = "hand"},
        {.t_ms = 1100, .fingers = 0, .liftoff = true,
         .gesture = 5, .phase = 0, .returned = "hand"},
        // The tap stays the gesture until the recogniser clears it.
        {.t_ms = 1108, .fingers = 0,
         .gesture = 0, .phase = 0, .returned = "hand"},
    });
}

TEST_F(GestureSequenceTest, TwoFingerTapClicksTheSecondaryButton) {
    HandSetup hand;
    hand.lastMaxFingerSpeed = 1.0f;
    run(hand, {
        {.t_ms = 1000, .fingers = 1, .touchDowns = 1,
         .gesture = 0, .phase = 0, .returned = "hand"},
        {.t_ms = 1030, .fingers = 2, .touchDowns = 1,
         .gesture = 0, .phase = kMayBegin, .returned = "hand scroll:maybegin(0,0)", .logs = "SCROLL MAY BEGIN"},
        // Touches 30 ms apart. The cancel of the may-begin goes out with the press only.
        {.t_ms = 1090, .fingers = 0, .liftoff = true,
         .gesture = 0, .phase = 0, .returned = "hand button:0", .dispatched = "scroll:cancelled(0,0) hand button:2",
         .logs = "SCROLL CANCELLED, 2F TAP"},
        {.t_ms = 1098, .fingers = 0,
         .gesture = 0, .phase = 0, .returned = "hand"},
    });
}

TEST_F(GestureSequenceTest, TwoFingerTapWithoutTheSecondarySettingOnlyWithdrawsTheMayBegin) {
    HandSetup hand;
    hand.lastMaxFingerSpeed = 1.0f;
    hand.secondaryClick = false;
    run(hand, {
        {.t_ms = 1000, .fingers = 1, .touchDowns = 1,
         .gesture = 0, .phase = 0, .returned = "hand"},
        {.t_ms = 1030, .fingers = 2, .touchDowns = 1,
         .gesture = 0, .phase = kMayBegin, .returned = "hand scroll:maybegin(0,0)", .logs = "SCROLL MAY BEGIN"},
        {.t_ms = 1090, .fingers = 0, .liftoff = true,
         .gesture = 6, .phase = 8, .returned = "scroll:cancelled(0,0) hand", .logs = "SCROLL CANCELLED"},
        {.t_ms = 1098, .fingers = 0,
         .gesture = 0, .phase = 0, .returned = "hand"},
    });
}

TEST_F(GestureSequenceTest, ClickWithTwoCloseFingersPressesTheSecondaryButton) {
    HandSetup hand;
    hand.separation_mm = 200.0f;
    hand.verticalSeparation_mm = 50.0f;
    run(hand, {
        {.t_ms = 1000, .fingers = 2, .touchDowns = 2,
         .gesture = 0, .phase = kMayBegin, .returned = "hand scroll:maybegin(0,0)", .logs = "SCROLL MAY BEGIN"},
        // The pointer event's own mask says 1 (checked by the runner), the button event 2.
        {.t_ms = 1008, .fingers = 2, .button = 1,
         .gesture = 0, .phase = kMayBegin, .returned = "button:2 hand", .logs = "BUTTON PRESSED"},
        {.t_ms = 1016, .fingers = 2, .button = 1,
         .gesture = 0, .phase = kMayBegin, .returned = "hand"},
        {.t_ms = 1024, .fingers = 2, .button = 0,
         .gesture = 0, .phase = kMayBegin, .returned = "button:0 hand", .logs = "BUTTON RELEASED"},
    });
}

TEST_F(GestureSequenceTest, ClickWithTwoCloseFingersWithoutTheSecondarySettingPressesThePrimaryButton) {
    HandSetup hand;
    hand.separation_mm = 200.0f;
    hand.verticalSeparation_mm = 50.0f;
    hand.secondaryClick = false;
    run(hand, {
        {.t_ms = 1000, .fingers = 2, .touchDowns = 2,
         .gesture = 0, .phase = kMayBegin, .returned = "hand scroll:maybegin(0,0)", .logs = "SCROLL MAY BEGIN"},
        {.t_ms = 1008, .fingers = 2, .button = 1,
         .gesture = 0, .phase = kMayBegin, .returned = "button:1 hand", .logs = "BUTTON PRESSED"},
        {.t_ms = 1016, .fingers = 2, .button = 0,
         .gesture = 0, .phase = kMayBegin, .returned = "button:0 hand", .logs = "BUTTON RELEASED"},
    });
}

TEST_F(GestureSequenceTest, ThreeFingersEndAScrollAndMakeNoGesture) {
    run(HandSetup{}, {
        {.t_ms = 1000, .fingers = 2, .touchDowns = 2, .accumulated = {0, 6, 0, 0}, .pixels = {0, 1.27f, 0, 0},
         .gesture = 2, .phase = 1, .returned = "hand scroll:began(0,-2.54)", .logs = "SCROLL BEGAN"},
        {.t_ms = 1008, .fingers = 3, .touchDowns = 1, .accumulated = {0, 8, 0, 0}, .pixels = {0, 1.27f, 0, 0},
         .gesture = 0, .phase = 4, .returned = "hand scroll:ended(0,0)", .logs = "END SCROLL"},
        {.t_ms = 1016, .fingers = 3, .accumulated = {0, 12, 0, 0}, .pixels = {0, 2.54f, 0, 0},
         .gesture = 0, .phase = 4, .returned = "hand"},
        {.t_ms = 1024, .fingers = 3, .accumulated = {0, 12, 9, 0}, .pixels = {0, 0, 5, 0},
         .gesture = 0, .phase = 4, .returned = "hand"},
    });
}

}  // namespace
}  // namespace orvane
