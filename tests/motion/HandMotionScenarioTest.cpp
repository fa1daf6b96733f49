// Hand motion seen through the whole frame pipeline: frames from the hand builder go into
// HIDParser, and the hand-motion stage's results and the motion it leaves in the path table
// are checked after each frame.
//
// The surface is 1024 × 512 units, so every whole-unit position survives the trip through
// the digitizer's fractions exactly. A moving finger is held back by the position
// hysteresis (radius 0.05): its first step of 10 moves the steadied position by 9.95, each
// later step of 10 by 10, and the contact velocity is the raw position less the previous
// steadied one (10 on the first step, 10.05 after).
//
// Later in the same frame the gesture stage quantises the x and y of pixelDeltas, so the
// translation this stage extracted is read from the sums, which were taken before.

#include <gtest/gtest.h>

#include <cmath>

#include "motion/HIDHandMotion.h"
#include "paths/HIDPathStates.h"
#include "pipeline/HIDParser.h"
#include "stats/HIDHandStatistics.h"
#include "tests/support/FrameBuilder.h"

namespace orvane {
namespace {

using test::Hand;
using test::TestClock;

constexpr float kWidth = 1024.0f;
constexpr float kHeight = 512.0f;
constexpr double kFrameMs = 8.0;
constexpr float kTolerance = 1e-3f;

class HandMotionScenarioTest : public ::testing::Test {
protected:
    TestClock clock;
    Hand hand{kWidth, kHeight, clock};
    HIDParser parser{[](const HIDEventRef&) {}, kHeight, kWidth};

    const HIDHandMotion& motion() const { return *parser.handMotionExtractor(); }
    const HIDPathStates& table() const { return *parser.pathStates(); }

    // Sends the hand's current frame, then moves the clock on by one frame.
    void send() {
        HIDEventRef frame = hand.frame();
        parser.handleContactFrame(static_cast<double>(clock.ticks()), frame);
        clock.advance(kFrameMs);
    }

    void expectNear(const HIDMotion& m, float x, float y, float scale, float rotate) const {
        EXPECT_NEAR(m.x, x, kTolerance);
        EXPECT_NEAR(m.y, y, kTolerance);
        EXPECT_NEAR(m.scale, scale, kTolerance);
        EXPECT_NEAR(m.rotate, rotate, kTolerance);
    }
};

TEST_F(HandMotionScenarioTest, OneMovingFingerAccumulatesPointerMotion) {
    hand.finger(0).at(300, 200).down();
    send();
    expectNear(motion().accumulatedDeltas(), 0, 0, 0, 0);
    expectNear(motion().absoluteLocation(), 300, 200, 0, 0);

    hand.finger(0).moveTo(310, 200);
    send();
    // Steadied at 309.95: a delta of 9.95; velocity 10, less the dead zone of 4.
    expectNear(motion().velocity(), 10, 0, 0, 0);
    expectNear(motion().smoothedClippedVelocity(), 6, 0, 0, 0);
    expectNear(motion().accumulatedDeltas(), 9.95f, 0, 0, 0);

    hand.finger(0).moveTo(320, 200);
    send();
    hand.finger(0).moveTo(330, 200);
    const double lastFrameTicks = static_cast<double>(clock.ticks());
    send();

    // 9.95 + 10 + 10.
    expectNear(motion().accumulatedDeltas(), 29.95f, 0, 0, 0);
    expectNear(motion().accumulatedDeltasWithResting(), 29.95f, 0, 0, 0);
    expectNear(motion().absoluteLocation(), 329.95f, 200, 0, 0);
    EXPECT_EQ(motion().innermostTouchingFingerID(), 2);  // contact index 0 + 2
    EXPECT_EQ(motion().outermostTouchingFingerID(), 2);
    EXPECT_DOUBLE_EQ(motion().tLastPixelDelta(), lastFrameTicks);
}

TEST_F(HandMotionScenarioTest, PathTableHoldsTheAccumulatedMotionForTheNextFrame) {
    hand.finger(0).at(300, 200).down();
    send();
    hand.finger(0).moveTo(310, 200);
    send();

    expectNear(table().motionDeltas(), 9.95f, 0, 0, 0);
    EXPECT_NEAR(table().maxMotionDeltas(), 9.95f, kTolerance);
    expectNear(table().motionDeltasResting(), 9.95f, 0, 0, 0);
    EXPECT_NEAR(table().maxMotionDeltasResting(), 9.95f, kTolerance);

    hand.finger(0).moveTo(310, 180);
    send();

    // A second step, down the other axis: the sums carry over, 9.95 then 19.95 across.
    expectNear(table().motionDeltas(), 9.95f, 19.95f, 0, 0);
    EXPECT_NEAR(table().maxMotionDeltas(), 19.95f, kTolerance);
    expectNear(table().motionDeltasResting(), 9.95f, 19.95f, 0, 0);

    hand.finger(0).up();
    send();

    // No finger touching: the sums are cleared and the table sees zero motion.
    expectNear(table().motionDeltas(), 0, 0, 0, 0);
    EXPECT_FLOAT_EQ(table().maxMotionDeltas(), 0.0f);
    expectNear(table().motionDeltasResting(), 0, 0, 0, 0);
}

TEST_F(HandMotionScenarioTest, TwoFingersTranslatingTogetherMoveTheHand) {
    hand.finger(0).at(300, 150).down();
    hand.finger(1).at(500, 150).down();
    send();
    hand.finger(0).moveTo(300, 160);
    hand.finger(1).moveTo(500, 160);
    send();

    // Both steadied 9.95 down: mean (9.95 + 9.95) × 0.5; separation 200 before and after,
    // and with u = (1, 0) the rotation term is (0 − 9.95) − (0 − 9.95) = 0.
    expectNear(motion().accumulatedDeltas(), 0, 9.95f, 0, 0);
    EXPECT_FLOAT_EQ(motion().pixelDeltas().scale, 0.0f);
    EXPECT_FLOAT_EQ(motion().pixelDeltas().rotate, 0.0f);
    expectNear(motion().velocity(), 0, 10, 0, 0);
    expectNear(motion().absoluteLocation(), 400, 159.95f, 200, 0);

    hand.finger(0).moveTo(300, 170);
    hand.finger(1).moveTo(500, 170);
    send();

    expectNear(motion().accumulatedDeltas(), 0, 19.95f, 0, 0);
    EXPECT_NEAR(motion().innermostOutermostSeparation_mm(), 200, kTolerance);
    EXPECT_EQ(motion().innermostTouchingFingerID(), 2);
    EXPECT_EQ(motion().outermostTouchingFingerID(), 3);
}

TEST_F(HandMotionScenarioTest, TwoFingersPinchingOutGivePositiveScale) {
    hand.finger(0).at(300, 150).down();
    hand.finger(1).at(500, 150).down();
    send();
    hand.finger(0).moveTo(290, 150);
    hand.finger(1).moveTo(510, 150);
    send();

    // Steadied at 290.05 and 509.95: separation 219.9 after 200, so scale 19.9. The velocity
    // scale 10 − (−10) = 20 weighs 1.45 at this width and beats a translation of 0, so the
    // translation and rotation deltas are cleared.
    expectNear(motion().pixelDeltas(), 0, 0, 19.9f, 0);
    expectNear(motion().velocity(), 0, 0, 20, 0);
    expectNear(motion().smoothedClippedVelocity(), 0, 0, 16, 0);
    // Both fingers equally fast: speed similarity 1.
    EXPECT_FLOAT_EQ(motion().speedSimilarity(), 1.0f);
    expectNear(motion().accumulatedDeltas(), 0, 0, 19.9f, 0);

    hand.finger(0).moveTo(280, 150);
    hand.finger(1).moveTo(520, 150);
    send();

    // 280.05 to 519.95 is 239.9, 20 more than before.
    expectNear(motion().pixelDeltas(), 0, 0, 20, 0);
    expectNear(motion().accumulatedDeltas(), 0, 0, 39.9f, 0);
    expectNear(table().motionDeltas(), 0, 0, 39.9f, 0);
}

TEST_F(HandMotionScenarioTest, TwoFingersPinchingInGiveNegativeScale) {
    hand.finger(0).at(300, 150).down();
    hand.finger(1).at(500, 150).down();
    send();
    hand.finger(0).moveTo(310, 150);
    hand.finger(1).moveTo(490, 150);
    send();

    // 309.95 to 490.05 is 180.1 after 200: −19.9. The sum holds its absolute value.
    expectNear(motion().pixelDeltas(), 0, 0, -19.9f, 0);
    expectNear(motion().velocity(), 0, 0, -20, 0);
    expectNear(motion().accumulatedDeltas(), 0, 0, 19.9f, 0);
}

TEST_F(HandMotionScenarioTest, TwoFingersTurningAboutTheirMidpointGiveRotation) {
    hand.finger(0).at(300, 200).down();
    hand.finger(1).at(500, 200).down();
    send();
    // The left finger moves down and the right one up. (The other way round the right finger
    // would become the bottom-most path that did not land as such, and rest as a thumb.)
    hand.finger(0).moveTo(300, 210);
    hand.finger(1).moveTo(500, 190);
    send();

    // Steadied at (300, 209.95) and (500, 190.05): S = (200, −19.9), |S| = √(40000 + 396.01)
    // = 200.98759, u = (0.995086, −0.099011). Pixel rotate with di = (0, 9.95), do = (0, −9.95):
    // (0·u.y + 9.95·u.x) − (0·u.y − 9.95·u.x) = 19.9 × 0.995086 = 19.80222.
    // Velocity rotate with (0, 10) and (0, −10): 20 × 0.995086 = 19.90173; velocity scale
    // (−10·u.y) − (10·u.y) = 20 × 0.099011 = 1.98022. At weight 1.45 rotation dominates, so
    // the scale is cleared.
    EXPECT_NEAR(motion().pixelDeltas().rotate, 19.80222f, kTolerance);
    EXPECT_FLOAT_EQ(motion().pixelDeltas().scale, 0.0f);
    EXPECT_FLOAT_EQ(motion().pixelDeltas().x, 0.0f);
    EXPECT_FLOAT_EQ(motion().pixelDeltas().y, 0.0f);
    EXPECT_NEAR(motion().velocity().rotate, 19.90173f, kTolerance);
    EXPECT_NEAR(motion().velocity().scale, 1.98022f, kTolerance);
    // Clipped rotate 19.90173 − 4; the midpoint stays at (400, 200).
    expectNear(motion().smoothedClippedVelocity(), 0, 0, 0, 15.90173f);
    EXPECT_NEAR(motion().absoluteLocation().x, 400, kTolerance);
    EXPECT_NEAR(motion().absoluteLocation().y, 200, kTolerance);
    EXPECT_NEAR(motion().absoluteLocation().scale, 200.98759f, kTolerance);
    // The direction of S measured with y up: atan2(19.9, 200) = 0.0991736.
    EXPECT_NEAR(motion().absoluteLocation().rotate, 0.0991736f, 1e-5f);
    expectNear(motion().accumulatedDeltas(), 0, 0, 0, 19.80222f);
}

TEST_F(HandMotionScenarioTest, FingerJoiningAndLeavingRestartsTheSums) {
    hand.finger(0).at(300, 150).down();
    send();
    hand.finger(0).moveTo(310, 150);
    send();
    hand.finger(0).moveTo(320, 150);
    send();
    expectNear(motion().accumulatedDeltas(), 19.95f, 0, 0, 0);

    // A second finger lands 20 away while the first moves on: the count goes from 1 to 2,
    // the sums restart. The pair has no previous frame, so the delta is the first finger's
    // 10 alone; the velocity (10.05 + 0) × 0.5 = 5.025 beats the scale 0.45 × 10.05 = 4.52
    // at this narrow width, so the delta is kept.
    hand.finger(0).moveTo(330, 150);
    hand.finger(1).at(350, 150).down();
    send();
    expectNear(motion().accumulatedDeltas(), 10, 0, 0, 0);
    expectNear(motion().accumulatedDeltasWithResting(), 10, 0, 0, 0);
    EXPECT_EQ(motion().outermostTouchingFingerID(), 3);

    // It lifts while the first moves on: from 2 to 1, the sums restart again.
    hand.finger(1).up();
    hand.finger(0).moveTo(340, 150);
    send();
    expectNear(motion().accumulatedDeltas(), 10, 0, 0, 0);
    expectNear(motion().accumulatedDeltasWithResting(), 10, 0, 0, 0);
    EXPECT_EQ(motion().outermostTouchingFingerID(), 2);

    // One finger again in the next frame: the sum runs on.
    hand.finger(0).moveTo(350, 150);
    send();
    expectNear(motion().accumulatedDeltas(), 20, 0, 0, 0);
}

TEST_F(HandMotionScenarioTest, RestingThumbAndOneMovingFingerMeasureSeparationAgainstTheThumb) {
    // The thumb lands low, in the rest zone (y ≥ 0.45 × 512 = 230.4) and on the diving button.
    hand.finger(0).at(512, 480).down();
    send();
    // A finger lands above it: the thumb is the bottom-most path and now rests.
    hand.finger(1).at(302, 200).down();
    send();
    ASSERT_TRUE(table().restingThumbExists());
    // The next frame, without a touch-down, flags the thumb as resting in the thumb zone.
    send();
    ASSERT_TRUE(table().getParserPath(1)->isRestingInThumbZone());
    ASSERT_EQ(table().bottomDivingPathIndex(), 1);

    // One plain finger; the plain view has it alone, the WithResting view has both.
    EXPECT_EQ(motion().numFingersTouching(), 1);
    EXPECT_EQ(motion().innermostTouchingFingerID(), 3);
    EXPECT_EQ(motion().outermostTouchingFingerID(), 3);
    EXPECT_EQ(motion().innermostTouchingFingerIDWithResting(), 2);
    EXPECT_EQ(motion().outermostTouchingFingerIDWithResting(), 3);
    // Finger (302, 200) to thumb (512, 480): 210 across, 280 down, 350 apart.
    EXPECT_NEAR(motion().innermostOutermostSeparation_mm(), 350, kTolerance);
    EXPECT_NEAR(motion().innermostOutermostVerticalSeparation_mm(), 280, kTolerance);

    hand.finger(1).moveTo(312, 200);
    send();

    // Steadied at 311.95: (512 − 311.95, 480 − 200) = (200.05, 280), √(40020.0025 + 78400)
    // = 344.12207.
    EXPECT_NEAR(motion().innermostOutermostSeparation_mm(), 344.12207f, kTolerance);
    EXPECT_NEAR(motion().innermostOutermostVerticalSeparation_mm(), 280, kTolerance);
    // The plain view moves with the finger alone.
    expectNear(motion().accumulatedDeltas(), 9.95f, 0, 0, 0);
    // The WithResting view pairs thumb (inner) and finger (outer): x = (9.95 + 0) × 0.5.
    EXPECT_NEAR(motion().pixelDeltasWithResting().x, 4.975f, kTolerance);
    // Separation change 344.12207 − 350.
    EXPECT_NEAR(motion().pixelDeltasWithResting().scale, -5.87793f, kTolerance);
    // u = (−200.05, −280) / 344.12207 = (−0.581329, −0.813664); with di = (0, 0) and
    // do = (9.95, 0) the rotation term is 9.95 × u.y = −8.09596. The sums restarted when the
    // thumb began to rest (two plain fingers, then one), so they hold this frame alone.
    EXPECT_NEAR(motion().pixelDeltasWithResting().rotate, -8.09596f, kTolerance);
    expectNear(motion().accumulatedDeltasWithResting(), 4.975f, 0, 5.87793f, 8.09596f);
}

}  // namespace
}  // namespace orvane
