// Hand motion: the vector operations, the two-finger extraction, the smoothing and
// dominance clipping, the accumulation and the per-frame entry that writes back into the
// path table. Paths are set up through their setters.

#include <gtest/gtest.h>

#include <cmath>

#include "filter/FilterLogging.h"
#include "motion/HIDHandMotion.h"
#include "paths/HIDPathStates.h"
#include "pipeline/HIDParserPath.h"
#include "tests/support/FrameBuilder.h"

namespace orvane {
namespace {

using test::TestClock;

constexpr float kHeight = 500.0f;
constexpr float kWidth = 1000.0f;
constexpr float kPi = 3.14159265358979f;

void expectMotion(const HIDMotion& m, float x, float y, float scale, float rotate) {
    EXPECT_FLOAT_EQ(m.x, x);
    EXPECT_FLOAT_EQ(m.y, y);
    EXPECT_FLOAT_EQ(m.scale, scale);
    EXPECT_FLOAT_EQ(m.rotate, rotate);
}

struct PathSetup {
    HIDPoint position;
    HIDPoint previousPosition;
    HIDPoint pixelDelta{};
    HIDPoint engagedVelocity{};
    bool touching = true;
    bool wasTouching = true;
    bool previousValid = true;  // the previous contact carries the path ID
};

class HIDHandMotionTest : public ::testing::Test {
protected:
    HIDPathStates table{kHeight, kWidth};
    HIDHandMotion motion;

    // A path in `slot` with finger ID slot + 1.
    HIDParserPath* place(int slot, const PathSetup& s) {
        HIDContact cur{};
        cur.fingerTipSwitch = s.touching ? 1 : 0;
        cur.fingerConfidence = 1;
        cur.path_id = slot;
        cur.finger_id = slot + 1;
        cur.position = s.position;
        HIDContact prev = cur;
        prev.fingerTipSwitch = s.wasTouching ? 1 : 0;
        prev.position = s.previousPosition;
        if (!s.previousValid) prev = HIDContact{};
        HIDParserPath* path = table.getParserPath(slot);
        path->setCurrentContact(cur);
        path->setPreviousContact(prev);
        path->setPixelDelta(s.pixelDelta);
        path->setEngagedVelocity(s.engagedVelocity);
        return path;
    }

    // The path table's previous and current frame times.
    void setFrameTimes(double previousMs, double currentMs) {
        table.setPreviousTimestamp(static_cast<double>(TestClock::msToTicks(previousMs)));
        table.setCurrentTimestamp(static_cast<double>(TestClock::msToTicks(currentMs)));
    }

    static double ticks(double ms) { return static_cast<double>(TestClock::msToTicks(ms)); }
};

// ---------------------------------------------------------------------------------------
// Vector operations

TEST_F(HIDHandMotionTest, MagnitudeOfThreeFourIsFive) {
    EXPECT_FLOAT_EQ(HIDHandMotion::getVectorMagnitudeX(3.0f, 4.0f), 5.0f);
    EXPECT_FLOAT_EQ(HIDHandMotion::getVectorMagnitudeX(-3.0f, -4.0f), 5.0f);
    EXPECT_FLOAT_EQ(HIDHandMotion::getVectorMagnitudeX(0.0f, 0.0f), 0.0f);
}

TEST_F(HIDHandMotionTest, DirectionIsMeasuredWithTheYAxisPointingUp) {
    EXPECT_FLOAT_EQ(HIDHandMotion::getVectorDirectionX(1.0f, 0.0f), 0.0f);
    // y grows downward on the pad, so +y is the angle −π/2.
    EXPECT_FLOAT_EQ(HIDHandMotion::getVectorDirectionX(0.0f, 1.0f), -kPi / 2.0f);
    EXPECT_FLOAT_EQ(HIDHandMotion::getVectorDirectionX(0.0f, -1.0f), kPi / 2.0f);
    EXPECT_FLOAT_EQ(HIDHandMotion::getVectorDirectionX(-1.0f, 1.0f), -3.0f * kPi / 4.0f);
    EXPECT_FLOAT_EQ(HIDHandMotion::getVectorDirectionX(1.0f, -1.0f), kPi / 4.0f);
}

TEST_F(HIDHandMotionTest, DotProductFlipsYAgainstTheUnitVector) {
    // (3, 2) against θ = 0: 3·1 − 2·0 = 3; against θ = π/2: 3·0 − 2·1 = −2.
    EXPECT_FLOAT_EQ(HIDHandMotion::getVectorDotProduct(HIDPoint{3.0f, 2.0f}, 0.0f), 3.0f);
    EXPECT_NEAR(HIDHandMotion::getVectorDotProduct(HIDPoint{3.0f, 2.0f}, kPi / 2.0f), -2.0f, 1e-6f);
}

TEST_F(HIDHandMotionTest, SeparationVectorPointsFromInnermostToOutermost) {
    HIDContact inner{};
    inner.position = HIDPoint{10.0f, 20.0f};
    HIDContact outer{};
    outer.position = HIDPoint{13.0f, 24.0f};

    const HIDSeparationVector s = HIDHandMotion::computeSeparationVector(inner, outer);

    EXPECT_FLOAT_EQ(s.x, 3.0f);
    EXPECT_FLOAT_EQ(s.y, 4.0f);
    EXPECT_FLOAT_EQ(s.magnitude, 5.0f);
    // atan2(−4, 3) = −0.927295218 rad.
    EXPECT_NEAR(s.direction, -0.927295218f, 1e-6f);
}

TEST_F(HIDHandMotionTest, VerticalSeparationMaximumOnlyGrows) {
    HIDContact inner{};
    inner.position = HIDPoint{10.0f, 20.0f};
    HIDContact outer{};
    outer.position = HIDPoint{13.0f, 16.0f};  // 3 across, 4 up

    motion.computeSeparation_mm(inner, outer);
    EXPECT_FLOAT_EQ(motion.innermostOutermostSeparation_mm(), 5.0f);
    EXPECT_FLOAT_EQ(motion.innermostOutermostVerticalSeparation_mm(), 4.0f);
    EXPECT_FLOAT_EQ(motion.maxInnermostOutermostVerticalSeparation_mm(), 4.0f);

    outer.position = HIDPoint{16.0f, 21.0f};  // 6 across, 1 down: √37
    motion.computeSeparation_mm(inner, outer);
    EXPECT_FLOAT_EQ(motion.innermostOutermostSeparation_mm(), std::sqrt(37.0f));
    EXPECT_FLOAT_EQ(motion.innermostOutermostVerticalSeparation_mm(), 1.0f);
    EXPECT_FLOAT_EQ(motion.maxInnermostOutermostVerticalSeparation_mm(), 4.0f);
}

TEST_F(HIDHandMotionTest, ScalingIsTheRateOfMovingApartAlongTheJoiningLine) {
    // u = (0.6, 0.8), i = (1, 2), o = (3, −1): (3·0.6 − 1·0.8) − (1·0.6 + 2·0.8) = 1.0 − 2.2 = −1.2.
    EXPECT_FLOAT_EQ(HIDHandMotion::scalingFromDotProduct(HIDPoint{0.6f, 0.8f}, HIDPoint{1.0f, 2.0f},
                                                         HIDPoint{3.0f, -1.0f}),
                    -1.2f);
}

TEST_F(HIDHandMotionTest, RotationIsTheDifferenceAcrossTheJoiningLine) {
    // u = (0.6, 0.8), i = (1, 2), o = (3, −1): (3·0.8 + 1·0.6) − (1·0.8 − 2·0.6) = 3.0 − (−0.4) = 3.4.
    EXPECT_FLOAT_EQ(HIDHandMotion::rotationFromVectorProduct(HIDPoint{0.6f, 0.8f}, HIDPoint{1.0f, 2.0f},
                                                             HIDPoint{3.0f, -1.0f}),
                    3.4f);
}

TEST_F(HIDHandMotionTest, WeightedAverageBlendsNewWithOld) {
    // 0.25·8 + 0.75·4 = 2 + 3 = 5.
    EXPECT_FLOAT_EQ(HIDHandMotion::getWeightedAverage(0.25f, 8.0f, 4.0f), 5.0f);
    EXPECT_FLOAT_EQ(HIDHandMotion::getWeightedAverage(1.0f, 7.5f, 100.0f), 7.5f);
    EXPECT_FLOAT_EQ(HIDHandMotion::getWeightedAverage(0.0f, 7.5f, 100.0f), 100.0f);
}

TEST_F(HIDHandMotionTest, WeightedAverageRoundsTheProductToFloatAndAddsInDouble) {
    // w = 0.3f = 0.300000012; w·7 = 2.100000083 rounds to the float 2.100000143.
    // (1 − w)·3 in double = 2.099999964; the sum 4.200000107 rounds to the float just above
    // 4.2f (4.199999809 and 4.200000286 are neighbours; 4.200000107 is nearer the upper).
    // Adding in single precision, or taking the product in double, would give 4.2f itself.
    EXPECT_EQ(HIDHandMotion::getWeightedAverage(0.3f, 7.0f, 3.0f), std::nextafter(4.2f, 5.0f));
}

TEST_F(HIDHandMotionTest, SetMotionDeltaStoresAllFour) {
    motion.setMotionDelta(1.0f, -2.0f, 3.5f, -4.5f);
    expectMotion(motion.motionDeltas(), 1.0f, -2.0f, 3.5f, -4.5f);
}

TEST_F(HIDHandMotionTest, Clear2DPlaneMotionZeroesAllFour) {
    HIDMotion m{1.0f, 2.0f, 3.0f, 4.0f};
    HIDHandMotion::clear2DPlaneMotion(m);
    expectMotion(m, 0.0f, 0.0f, 0.0f, 0.0f);
}

// ---------------------------------------------------------------------------------------
// Extraction

TEST_F(HIDHandMotionTest, OneFingerGivesItsOwnDeltaVelocityAndLocation) {
    HIDParserPath* p = place(3, {.position = {300.0f, 200.0f},
                                 .previousPosition = {298.0f, 201.0f},
                                 .pixelDelta = {2.0f, -1.0f},
                                 .engagedVelocity = {2.5f, -1.5f}});
    motion.setAbsoluteLocation(HIDMotion{1.0f, 2.0f, 3.0f, 4.0f});

    motion.extractHandMotion(table, p, p, true, true);

    expectMotion(motion.pixelDeltas(), 2.0f, -1.0f, 0.0f, 0.0f);
    expectMotion(motion.velocity(), 2.5f, -1.5f, 0.0f, 0.0f);
    expectMotion(motion.absoluteLocation(), 300.0f, 200.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(motion.innermostOutermostSeparation_mm(), 0.0f);
}

TEST_F(HIDHandMotionTest, OneFingerNotTouchingGivesNoPixelDelta) {
    HIDParserPath* p = place(3, {.position = {300.0f, 200.0f},
                                 .previousPosition = {298.0f, 201.0f},
                                 .pixelDelta = {2.0f, -1.0f},
                                 .engagedVelocity = {2.5f, -1.5f},
                                 .touching = false});

    motion.extractHandMotion(table, p, p, false, true);

    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.velocity(), 2.5f, -1.5f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, FingersMovingApartSymmetricallyScaleWithoutTranslation) {
    HIDParserPath* inner = place(1, {.position = {10.0f, 20.0f},
                                     .previousPosition = {11.0f, 20.0f},
                                     .pixelDelta = {-1.0f, 0.0f},
                                     .engagedVelocity = {-1.0f, 0.0f}});
    HIDParserPath* outer = place(2, {.position = {30.0f, 20.0f},
                                     .previousPosition = {29.0f, 20.0f},
                                     .pixelDelta = {1.0f, 0.0f},
                                     .engagedVelocity = {1.0f, 0.0f}});

    motion.extractHandMotion(table, inner, outer, true, true);

    // x: (1 + −1)·0.5 = 0; scale: 20 − 18 = 2; rotate with u = (1, 0): (1·0 − 0·1) − (−1·0 − 0·1) = 0.
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 2.0f, 0.0f);
    // scale: (1·1 + 0·0) − (−1·1 + 0·0) = 2.
    expectMotion(motion.velocity(), 0.0f, 0.0f, 2.0f, 0.0f);
    // Midpoint (20, 20), separation 20, direction of (20, 0) is 0.
    expectMotion(motion.absoluteLocation(), 20.0f, 20.0f, 20.0f, 0.0f);
    EXPECT_FLOAT_EQ(motion.innermostOutermostSeparation_mm(), 20.0f);
    EXPECT_FLOAT_EQ(motion.innermostOutermostVerticalSeparation_mm(), 0.0f);
}

TEST_F(HIDHandMotionTest, FingersTurningAboutTheirMidpointGiveRotateTermMinusTwo) {
    HIDParserPath* inner = place(1, {.position = {10.0f, 20.0f},
                                     .previousPosition = {10.0f, 21.0f},
                                     .pixelDelta = {0.0f, -1.0f},
                                     .engagedVelocity = {0.0f, -1.0f}});
    HIDParserPath* outer = place(2, {.position = {30.0f, 20.0f},
                                     .previousPosition = {30.0f, 19.0f},
                                     .pixelDelta = {0.0f, 1.0f},
                                     .engagedVelocity = {0.0f, 1.0f}});

    motion.extractHandMotion(table, inner, outer, true, true);

    // u = (1, 0): (0·0 − 1·1) − (0·0 − (−1)·1) = −1 − 1 = −2.
    EXPECT_FLOAT_EQ(motion.pixelDeltas().rotate, -2.0f);
    EXPECT_FLOAT_EQ(motion.velocity().rotate, -2.0f);
    // Mean y: (1 + −1)·0.5 = 0.
    EXPECT_FLOAT_EQ(motion.pixelDeltas().x, 0.0f);
    EXPECT_FLOAT_EQ(motion.pixelDeltas().y, 0.0f);
    // The previous separation was √(20² + 2²) = √404 = 20.0997512; 20 − that = −0.0997512.
    EXPECT_NEAR(motion.pixelDeltas().scale, -0.0997512f, 1e-5f);
    EXPECT_FLOAT_EQ(motion.velocity().scale, 0.0f);
}

TEST_F(HIDHandMotionTest, SamePathAsInnermostAndOutermostFormsNoPair) {
    HIDParserPath* p = place(4, {.position = {120.0f, 80.0f}, .previousPosition = {120.0f, 80.0f}});
    motion.setAbsoluteLocation(HIDMotion{0.0f, 0.0f, 12.0f, 1.0f});

    motion.extractHandMotion(table, p, p, true, true);

    expectMotion(motion.absoluteLocation(), 120.0f, 80.0f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, FingerThatJustLandedGivesNoScaleOrRotate) {
    HIDParserPath* inner = place(1, {.position = {10.0f, 20.0f},
                                     .previousPosition = {8.0f, 20.0f},
                                     .pixelDelta = {2.0f, 0.0f},
                                     .engagedVelocity = {2.0f, 0.0f}});
    HIDParserPath* outer = place(2, {.position = {40.0f, 20.0f},
                                     .previousPosition = {0.0f, 0.0f},
                                     .pixelDelta = {4.0f, 0.0f},
                                     .engagedVelocity = {4.0f, 0.0f},
                                     .wasTouching = false,
                                     .previousValid = false});

    motion.extractHandMotion(table, inner, outer, true, false);

    EXPECT_FLOAT_EQ(motion.pixelDeltas().scale, 0.0f);
    EXPECT_FLOAT_EQ(motion.pixelDeltas().rotate, 0.0f);
    // Only the innermost delta, not a mean.
    EXPECT_FLOAT_EQ(motion.pixelDeltas().x, 2.0f);
    // The velocity is still the mean: (4 + 2)·0.5 = 3.
    EXPECT_FLOAT_EQ(motion.velocity().x, 3.0f);
}

TEST_F(HIDHandMotionTest, MissingInnermostPathHalvesTheOutermostValues) {
    HIDParserPath* outer = place(2, {.position = {30.0f, 40.0f},
                                     .previousPosition = {30.0f, 40.0f},
                                     .pixelDelta = {2.0f, 2.0f},
                                     .engagedVelocity = {4.0f, 2.0f}});
    motion.setAbsoluteLocation(HIDMotion{10.0f, 20.0f, 0.0f, 0.0f});

    motion.extractHandMotion(table, nullptr, outer, false, false);

    // Against a contact of zeros: S = (30, 40), magnitude 50, u = (0.6, 0.8).
    // velocity x, y = (4 + 0)·0.5, (2 + 0)·0.5; scale = 4·0.6 + 2·0.8 = 4; rotate = 4·0.8 − 2·0.6 = 2.
    expectMotion(motion.velocity(), 2.0f, 1.0f, 4.0f, 2.0f);
    // Location: (30 + 10)·0.5 = 20, (40 + 20)·0.5 = 30 — the mean with the earlier location.
    EXPECT_FLOAT_EQ(motion.absoluteLocation().x, 20.0f);
    EXPECT_FLOAT_EQ(motion.absoluteLocation().y, 30.0f);
    EXPECT_FLOAT_EQ(motion.absoluteLocation().scale, 50.0f);
    EXPECT_FLOAT_EQ(motion.innermostOutermostSeparation_mm(), 50.0f);
    EXPECT_FLOAT_EQ(motion.innermostOutermostVerticalSeparation_mm(), 40.0f);
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, ZeroSeparationLeavesScaleAndRotateAtZero) {
    HIDParserPath* inner = place(1, {.position = {50.0f, 50.0f},
                                     .previousPosition = {49.0f, 50.0f},
                                     .pixelDelta = {1.0f, 0.0f},
                                     .engagedVelocity = {1.0f, 0.0f}});
    HIDParserPath* outer = place(2, {.position = {50.0f, 50.0f},
                                     .previousPosition = {51.0f, 50.0f},
                                     .pixelDelta = {-3.0f, 0.0f},
                                     .engagedVelocity = {-3.0f, 0.0f}});

    motion.extractHandMotion(table, inner, outer, true, true);

    EXPECT_FLOAT_EQ(motion.velocity().scale, 0.0f);
    EXPECT_FLOAT_EQ(motion.velocity().rotate, 0.0f);
    // The pixel deltas keep only the innermost delta; the velocity is still the mean, (−3 + 1)·0.5.
    expectMotion(motion.pixelDeltas(), 1.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(motion.velocity().x, -1.0f);
    EXPECT_FLOAT_EQ(motion.absoluteLocation().scale, 0.0f);
}

TEST_F(HIDHandMotionTest, NoPathsLeaveTheLocationAsItWas) {
    motion.setAbsoluteLocation(HIDMotion{10.0f, 20.0f, 5.0f, 1.0f});
    motion.setPixelDeltas(HIDMotion{1.0f, 1.0f, 1.0f, 1.0f});
    motion.setInnermostOutermostSeparation_mm(30.0f);

    motion.extractHandMotion(table, nullptr, nullptr, false, false);

    expectMotion(motion.absoluteLocation(), 10.0f, 20.0f, 0.0f, 0.0f);
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.velocity(), 0.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(motion.innermostOutermostSeparation_mm(), 0.0f);
}

TEST_F(HIDHandMotionTest, ExtractionCopiesTheSpeedSimilarityOfThePathTable) {
    table.setSpeedSimilarity(0.4f);
    motion.extractHandMotion(table, nullptr, nullptr, false, false);
    EXPECT_FLOAT_EQ(motion.speedSimilarity(), 0.4f);
}

TEST_F(HIDHandMotionTest, WithRestingExtractionWritesOnlyItsOwnDeltas) {
    HIDParserPath* inner = place(1, {.position = {10.0f, 20.0f},
                                     .previousPosition = {10.0f, 21.0f},
                                     .pixelDelta = {0.0f, -1.0f},
                                     .engagedVelocity = {0.0f, -1.0f}});
    HIDParserPath* outer = place(2, {.position = {30.0f, 20.0f},
                                     .previousPosition = {30.0f, 19.0f},
                                     .pixelDelta = {0.0f, 1.0f},
                                     .engagedVelocity = {0.0f, 1.0f}});
    motion.setVelocity(HIDMotion{9.0f, 9.0f, 9.0f, 9.0f});
    motion.setPixelDeltas(HIDMotion{8.0f, 8.0f, 8.0f, 8.0f});
    motion.setAbsoluteLocation(HIDMotion{7.0f, 7.0f, 7.0f, 7.0f});
    motion.setSpeedSimilarity(0.25f);
    table.setSpeedSimilarity(0.75f);

    motion.extractHandMotionWithResting(table, inner, outer, true, true);

    EXPECT_FLOAT_EQ(motion.pixelDeltasWithResting().x, 0.0f);
    EXPECT_FLOAT_EQ(motion.pixelDeltasWithResting().y, 0.0f);
    EXPECT_NEAR(motion.pixelDeltasWithResting().scale, -0.0997512f, 1e-5f);  // 20 − √404
    EXPECT_FLOAT_EQ(motion.pixelDeltasWithResting().rotate, -2.0f);
    expectMotion(motion.velocity(), 9.0f, 9.0f, 9.0f, 9.0f);
    expectMotion(motion.pixelDeltas(), 8.0f, 8.0f, 8.0f, 8.0f);
    expectMotion(motion.absoluteLocation(), 7.0f, 7.0f, 7.0f, 7.0f);
    EXPECT_FLOAT_EQ(motion.speedSimilarity(), 0.25f);
    EXPECT_FLOAT_EQ(motion.innermostOutermostSeparation_mm(), 0.0f);
}

TEST_F(HIDHandMotionTest, WithRestingExtractionOfOneFingerIsItsDelta) {
    HIDParserPath* p = place(5, {.position = {60.0f, 60.0f},
                                 .previousPosition = {57.0f, 62.0f},
                                 .pixelDelta = {3.0f, -2.0f}});

    motion.extractHandMotionWithResting(table, p, p, true, true);

    expectMotion(motion.pixelDeltasWithResting(), 3.0f, -2.0f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, WithRestingExtractionOfAJustLandedPairKeepsTheInnermostDelta) {
    HIDParserPath* inner = place(1, {.position = {10.0f, 20.0f},
                                     .previousPosition = {8.0f, 20.0f},
                                     .pixelDelta = {2.0f, 0.0f}});
    HIDParserPath* outer = place(2, {.position = {40.0f, 20.0f},
                                     .previousPosition = {0.0f, 0.0f},
                                     .pixelDelta = {4.0f, 0.0f},
                                     .wasTouching = false,
                                     .previousValid = false});

    motion.extractHandMotionWithResting(table, inner, outer, true, false);

    expectMotion(motion.pixelDeltasWithResting(), 2.0f, 0.0f, 0.0f, 0.0f);
}

// ---------------------------------------------------------------------------------------
// Smoothing and dominance

TEST_F(HIDHandMotionTest, TranslationDominatesAndTheDeadZoneLeavesOne) {
    motion.setVelocity(HIDMotion{5.0f, 0.0f, 0.0f, 0.0f});
    motion.setPixelDeltas(HIDMotion{2.0f, 3.0f, 0.0f, 0.0f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    // T = 5 > M = 0: ratio M / T = 0, scale and rotate clipped, x = 5 − 4 = 1.
    EXPECT_FLOAT_EQ(motion.nondominantAxesRatio(), 0.0f);
    expectMotion(motion.smoothedClippedVelocity(), 1.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.smoothedVelocity(), 5.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(motion.smoothedTranslationSpeed(), 5.0f);
    expectMotion(motion.pixelDeltas(), 2.0f, 3.0f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, TranslationDominatingClipsScaleAndRotateAndGivesTheRatio) {
    motion.setVelocity(HIDMotion{6.0f, -8.0f, 10.0f, 0.0f});
    motion.setPixelDeltas(HIDMotion{1.0f, 1.0f, 1.0f, 1.0f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    // Separation 0, so the scale weight is 0.45: S = 4.5, T = |(6, −8)| = 10, ratio 0.45.
    EXPECT_FLOAT_EQ(motion.nondominantAxesRatio(), 0.45f);
    // x = 6 − 4, y = −8 + 4.
    expectMotion(motion.smoothedClippedVelocity(), 2.0f, -4.0f, 0.0f, 0.0f);
    expectMotion(motion.pixelDeltas(), 1.0f, 1.0f, 1.0f, 1.0f);
}

TEST_F(HIDHandMotionTest, SmallDominantScaleFallsIntoTheDeadZone) {
    motion.setVelocity(HIDMotion{0.0f, 0.0f, 3.9f, 0.0f});
    motion.setPixelDeltas(HIDMotion{2.0f, 3.0f, 0.5f, 0.25f});
    motion.setPixelDeltasWithResting(HIDMotion{1.0f, 1.0f, 0.5f, 0.25f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    // S = 0.45·3.9 > T = 0 = R: scale branch; |3.9| < 4 so the clipped scale is 0.
    expectMotion(motion.smoothedClippedVelocity(), 0.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(motion.nondominantAxesRatio(), 0.0f);
    // x, y zeroed; S > R so rotate zeroed too; scale stays.
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 0.5f, 0.0f);
    expectMotion(motion.pixelDeltasWithResting(), 0.0f, 0.0f, 0.5f, 0.0f);
}

TEST_F(HIDHandMotionTest, AllZeroMotionTakesTheScaleRotationBranch) {
    motion.setNondominantAxesRatio(0.25f);
    motion.setPixelDeltas(HIDMotion{3.0f, -2.0f, 0.0f, 0.0f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    EXPECT_FLOAT_EQ(motion.nondominantAxesRatio(), 1.0f);
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.smoothedClippedVelocity(), 0.0f, 0.0f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, EqualScaleAndRotationAboveTranslationBothSurvive) {
    motion.setVelocity(HIDMotion{1.0f, 0.0f, 10.0f, -10.0f});
    motion.setPixelDeltas(HIDMotion{1.0f, 1.0f, 2.0f, -2.0f});
    motion.setPixelDeltasWithResting(HIDMotion{1.0f, 1.0f, 3.0f, -3.0f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    // S = R = 0.45·10 = 4.5 > T = 1: ratio 1 / 4.5; scale 10 − 4, rotate −10 + 4.
    EXPECT_FLOAT_EQ(motion.nondominantAxesRatio(), 1.0f / 4.5f);
    expectMotion(motion.smoothedClippedVelocity(), 0.0f, 0.0f, 6.0f, -6.0f);
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 2.0f, -2.0f);
    expectMotion(motion.pixelDeltasWithResting(), 0.0f, 0.0f, 3.0f, -3.0f);
}

TEST_F(HIDHandMotionTest, DominantScaleClearsRotation) {
    motion.setVelocity(HIDMotion{0.0f, 0.0f, 10.0f, 5.0f});
    motion.setPixelDeltas(HIDMotion{1.0f, 1.0f, 2.0f, 1.0f});
    motion.setPixelDeltasWithResting(HIDMotion{1.0f, 1.0f, 2.0f, 1.0f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    // S = 4.5 > R = 2.25.
    expectMotion(motion.smoothedClippedVelocity(), 0.0f, 0.0f, 6.0f, 0.0f);
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 2.0f, 0.0f);
    expectMotion(motion.pixelDeltasWithResting(), 0.0f, 0.0f, 2.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, DominantRotationClearsScale) {
    motion.setVelocity(HIDMotion{0.0f, 0.0f, -5.0f, -10.0f});
    motion.setPixelDeltas(HIDMotion{1.0f, 1.0f, 2.0f, 1.0f});
    motion.setPixelDeltasWithResting(HIDMotion{1.0f, 1.0f, 2.0f, 1.0f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    // R = 4.5 > S = 2.25; rotate −10 + 4 = −6.
    expectMotion(motion.smoothedClippedVelocity(), 0.0f, 0.0f, 0.0f, -6.0f);
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 0.0f, 1.0f);
    expectMotion(motion.pixelDeltasWithResting(), 0.0f, 0.0f, 0.0f, 1.0f);
}

TEST_F(HIDHandMotionTest, WideFingersLetScaleWinOverTranslation) {
    // At 55 mm the weight is 1.45: S = 1.45·5 = 7.25 > T = 6; at 0 mm S = 2.25 < 6.
    motion.setInnermostOutermostSeparation_mm(60.0f);
    motion.setVelocity(HIDMotion{6.0f, 0.0f, 5.0f, 0.0f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    EXPECT_FLOAT_EQ(motion.nondominantAxesRatio(), 6.0f / 7.25f);
    expectMotion(motion.smoothedClippedVelocity(), 0.0f, 0.0f, 1.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, OrdinaryFrameIntervalPassesTheVelocityStraightThrough) {
    motion.setSmoothedVelocity(HIDMotion{100.0f, 100.0f, 100.0f, 100.0f});
    motion.setSmoothedTranslationSpeed(100.0f);
    motion.setVelocity(HIDMotion{3.0f, 4.0f, -1.0f, 2.0f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    // 8 ms against a 0.03 ms time constant: the weight is 1 − e^−266.7 = 1.
    expectMotion(motion.smoothedVelocity(), 3.0f, 4.0f, -1.0f, 2.0f);
    EXPECT_FLOAT_EQ(motion.smoothedTranslationSpeed(), 5.0f);
}

TEST_F(HIDHandMotionTest, ZeroFrameIntervalKeepsTheOldSmoothedVelocity) {
    motion.setSmoothedVelocity(HIDMotion{6.0f, 0.0f, 0.0f, 0.0f});
    motion.setSmoothedTranslationSpeed(6.0f);
    motion.setVelocity(HIDMotion{10.0f, 0.0f, 0.0f, 0.0f});

    motion.clipMotionToDominantAxes(0.0);

    // Weight 1 − e^0 = 0: the old values stay; clipped x = 6 − 4.
    expectMotion(motion.smoothedVelocity(), 6.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(motion.smoothedTranslationSpeed(), 6.0f);
    expectMotion(motion.smoothedClippedVelocity(), 2.0f, 0.0f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, IntervalOfOneTimeConstantBlendsNewAndOld) {
    motion.setVelocity(HIDMotion{10.0f, 0.0f, 0.0f, 0.0f});

    motion.clipMotionToDominantAxes(ticks(0.03));

    // w = 1 − e^(−0.03 / 0.030000001192) = 1 − 0.3678794 = 0.6321206; 0.6321206·10 + 0.
    EXPECT_NEAR(motion.smoothedVelocity().x, 6.321206f, 1e-5f);
    // The speed uses the raw velocity's length, 10, blended the same way.
    EXPECT_NEAR(motion.smoothedTranslationSpeed(), 6.321206f, 1e-5f);
}

TEST_F(HIDHandMotionTest, TranslationSpeedUsesTheRawVelocityNotTheSmoothedOne) {
    motion.setSmoothedVelocity(HIDMotion{30.0f, 40.0f, 0.0f, 0.0f});
    motion.setSmoothedTranslationSpeed(0.0f);
    motion.setVelocity(HIDMotion{3.0f, 4.0f, 0.0f, 0.0f});

    motion.clipMotionToDominantAxes(ticks(0.03));

    // w = 0.6321206: smoothed x = 0.6321206·3 + 0.3678794·30 = 1.8963618 + 11.036382 = 12.932744.
    EXPECT_NEAR(motion.smoothedVelocity().x, 12.932744f, 1e-4f);
    // Speed = w·|(3, 4)| + (1 − w)·0 = 0.6321206·5 = 3.160603, not the smoothed vector's length.
    EXPECT_NEAR(motion.smoothedTranslationSpeed(), 3.160603f, 1e-5f);
}

TEST_F(HIDHandMotionTest, NegativeClippedComponentsAreRaisedByTheDeadZone) {
    motion.setVelocity(HIDMotion{-5.0f, -3.0f, 0.0f, 0.0f});

    motion.clipMotionToDominantAxes(ticks(8.0));

    // x = −5 + 4 = −1; |−3| < 4 gives 0.
    expectMotion(motion.smoothedClippedVelocity(), -1.0f, 0.0f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, DominanceWeightsAtFortyFiveMillimetresAreNinetyFiveHundredths) {
    motion.setInnermostOutermostSeparation_mm(45.0f);
    float w = 0.0f, v = 0.0f;
    motion.computeTrackpadDominanceWeights(w, v);
    // (45 − 35) / 20 + 0.45 = 0.95.
    EXPECT_FLOAT_EQ(w, 0.95f);
    EXPECT_FLOAT_EQ(v, 0.95f);
}

TEST_F(HIDHandMotionTest, DominanceWeightsAtThirtyFiveMillimetresAreTheNarrowWeight) {
    motion.setInnermostOutermostSeparation_mm(35.0f);
    float w = 0.0f, v = 0.0f;
    motion.computeTrackpadDominanceWeights(w, v);
    EXPECT_FLOAT_EQ(w, 0.45f);
    EXPECT_FLOAT_EQ(v, 0.45f);
}

TEST_F(HIDHandMotionTest, DominanceWeightsAtFiftyFiveMillimetresAreTheWideWeight) {
    motion.setInnermostOutermostSeparation_mm(55.0f);
    float w = 0.0f, v = 0.0f;
    motion.computeTrackpadDominanceWeights(w, v);
    // (55 − 35) / 20 + 0.45 = 1.45 by the ramp, the same as beyond it.
    EXPECT_FLOAT_EQ(w, 1.45f);
    EXPECT_FLOAT_EQ(v, 1.45f);
}

TEST_F(HIDHandMotionTest, DominanceWeightsBeyondTheRampStayWide) {
    motion.setInnermostOutermostSeparation_mm(80.0f);
    float w = 0.0f, v = 0.0f;
    motion.computeTrackpadDominanceWeights(w, v);
    EXPECT_FLOAT_EQ(w, 1.45f);
    EXPECT_FLOAT_EQ(v, 1.45f);
}

TEST_F(HIDHandMotionTest, ClosingFingersMovingDownWeighLessAsAPinch) {
    motion.setInnermostOutermostSeparation_mm(45.0f);
    motion.setSmoothedVelocity(HIDMotion{1.0f, 6.0f, -2.0f, -1.0f});
    float w = 0.0f, v = 0.0f;
    motion.computeTrackpadDominanceWeights(w, v);
    // g = 6 − (−2) = 8, h = 1 + 1 = 2, r = 0.25: W = 0.95 / (2 − 0.0625) = 0.95 / 1.9375 = 0.4903226.
    EXPECT_NEAR(w, 0.4903226f, 1e-6f);
    EXPECT_FLOAT_EQ(v, 0.95f);
}

TEST_F(HIDHandMotionTest, PinchCorrectionNeedsMoreDownwardMotionThanSideways) {
    motion.setSmoothedVelocity(HIDMotion{5.0f, 1.0f, -2.0f, 0.0f});
    float w = 0.0f, v = 0.0f;
    motion.computeTrackpadDominanceWeights(w, v);
    // g = 3, h = 5: no correction.
    EXPECT_FLOAT_EQ(w, 0.45f);

    motion.setSmoothedVelocity(HIDMotion{0.0f, -1.0f, -2.0f, 0.0f});
    motion.computeTrackpadDominanceWeights(w, v);
    // Moving up: no correction.
    EXPECT_FLOAT_EQ(w, 0.45f);

    motion.setSmoothedVelocity(HIDMotion{0.0f, 1.0f, 2.0f, 0.0f});
    motion.computeTrackpadDominanceWeights(w, v);
    // Fingers opening: no correction.
    EXPECT_FLOAT_EQ(w, 0.45f);
}

// ---------------------------------------------------------------------------------------
// Fastest finger

TEST_F(HIDHandMotionTest, FastestFingerKeepsTheRunningMaximumAndBlendsWithTheCurrent) {
    setFrameTimes(1000.0, 1014.0);  // 14 ms: a = 2^−1 = 0.5
    table.setMaxFingerSpeed(2.0f);
    motion.setMaxFingerSpeed(6.0f);

    motion.updateFastestFingerSpeed(table);

    EXPECT_FLOAT_EQ(motion.maxFingerSpeed(), 6.0f);
    // 0.5·6 + 0.5·2 = 4.
    EXPECT_FLOAT_EQ(motion.averageMaxFingerSpeed(), 4.0f);
}

TEST_F(HIDHandMotionTest, FastestFingerTakesAFasterCurrentSpeed) {
    setFrameTimes(1000.0, 1028.0);  // 28 ms: a = 2^−2 = 0.25
    table.setMaxFingerSpeed(8.0f);
    motion.setMaxFingerSpeed(6.0f);
    motion.setAverageMaxFingerSpeed(100.0f);

    motion.updateFastestFingerSpeed(table);

    EXPECT_FLOAT_EQ(motion.maxFingerSpeed(), 8.0f);
    // 0.25·8 + 0.75·8 = 8: the previous average plays no part.
    EXPECT_FLOAT_EQ(motion.averageMaxFingerSpeed(), 8.0f);
}

TEST_F(HIDHandMotionTest, FastestFingerBlendDecaysWithAFourteenMillisecondHalfLife) {
    setFrameTimes(1000.0, 1028.0);  // a = 0.25
    table.setMaxFingerSpeed(2.0f);
    motion.setMaxFingerSpeed(6.0f);

    motion.updateFastestFingerSpeed(table);

    // 0.25·6 + 0.75·2 = 1.5 + 1.5 = 3.
    EXPECT_FLOAT_EQ(motion.averageMaxFingerSpeed(), 3.0f);
}

// ---------------------------------------------------------------------------------------
// Accumulation and clearing

TEST_F(HIDHandMotionTest, AccumulationAddsAbsoluteDeltasWeightingScaleAndRotate) {
    motion.setAccumulatedDeltas(HIDMotion{1.0f, 1.0f, 1.0f, 1.0f});
    motion.setPixelDeltas(HIDMotion{-2.0f, 3.0f, -1.5f, 0.5f});
    motion.setPixelDeltasWithResting(HIDMotion{1.0f, -1.0f, -2.0f, 4.0f});
    motion.setSpeedSimilarity(0.5f);

    motion.accumulateHandMotion();

    // x 1 + 2, y 1 + 3, scale 1.5·0.5 + 1 = 1.75, rotate 0.5·0.5 + 1 = 1.25.
    expectMotion(motion.accumulatedDeltas(), 3.0f, 4.0f, 1.75f, 1.25f);
    // No speed-similarity weight in the WithResting sum.
    expectMotion(motion.accumulatedDeltasWithResting(), 1.0f, 1.0f, 2.0f, 4.0f);

    motion.accumulateHandMotion();
    expectMotion(motion.accumulatedDeltas(), 5.0f, 7.0f, 2.5f, 1.5f);
    expectMotion(motion.accumulatedDeltasWithResting(), 2.0f, 2.0f, 4.0f, 8.0f);
}

TEST_F(HIDHandMotionTest, ClearAccumulationZeroesBothSums) {
    motion.setAccumulatedDeltas(HIDMotion{1.0f, 2.0f, 3.0f, 4.0f});
    motion.setAccumulatedDeltasWithResting(HIDMotion{5.0f, 6.0f, 7.0f, 8.0f});

    motion.clearAccumulateHandMotion();

    expectMotion(motion.accumulatedDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.accumulatedDeltasWithResting(), 0.0f, 0.0f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, ResetAccumulationLeavesTheWithRestingSum) {
    motion.setAccumulatedDeltas(HIDMotion{1.0f, 2.0f, 3.0f, 4.0f});
    motion.setAccumulatedDeltasWithResting(HIDMotion{5.0f, 6.0f, 7.0f, 8.0f});

    motion.resetAccumulateHandMotion();

    expectMotion(motion.accumulatedDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.accumulatedDeltasWithResting(), 5.0f, 6.0f, 7.0f, 8.0f);
}

void fillMotionState(HIDHandMotion& m) {
    const HIDMotion ones{1.0f, 1.0f, 1.0f, 1.0f};
    m.setAbsoluteLocation(ones);
    m.setHandCentroid(HIDPoint{2.0f, 3.0f});
    m.setTLastPixelDelta(1234.0);
    m.setPixelDeltas(ones);
    m.setPixelDeltasWithResting(ones);
    m.setVelocity(ones);
    m.setSmoothedVelocity(ones);
    m.setSmoothedClippedVelocity(ones);
    m.setAccumulatedDeltas(ones);
    m.setAccumulatedDeltasWithResting(ones);
    m.setSmoothedTranslationSpeed(1.0f);
    m.setStartedWithTwoWidelySeparatedFingers(true);
    m.setInnermostTouchingFingerID(2);
    m.setOutermostTouchingFingerID(3);
    m.setNumFingersTouching(2);
    m.setMaxFingerSpeed(4.0f);
    m.setAverageMaxFingerSpeed(5.0f);
    m.setLastMaxFingerSpeed(6.0f);
    m.setNondominantAxesRatio(0.5f);
    m.setSpeedSimilarity(0.7f);
    m.setInnermostOutermostSeparation_mm(40.0f);
    m.setMaxInnermostOutermostVerticalSeparation_mm(9.0f);
}

void expectMotionRecordsCleared(const HIDHandMotion& m) {
    expectMotion(m.pixelDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(m.pixelDeltasWithResting(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(m.velocity(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(m.smoothedVelocity(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(m.smoothedClippedVelocity(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(m.accumulatedDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(m.accumulatedDeltasWithResting(), 0.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(m.smoothedTranslationSpeed(), 0.0f);
    EXPECT_FALSE(m.startedWithTwoWidelySeparatedFingers());
    EXPECT_EQ(m.innermostTouchingFingerID(), 0);
    EXPECT_EQ(m.outermostTouchingFingerID(), 0);
    EXPECT_EQ(m.numFingersTouching(), 0);
    // Untouched by the clear.
    EXPECT_FLOAT_EQ(m.maxFingerSpeed(), 4.0f);
    EXPECT_FLOAT_EQ(m.averageMaxFingerSpeed(), 5.0f);
    EXPECT_FLOAT_EQ(m.lastMaxFingerSpeed(), 6.0f);
    EXPECT_FLOAT_EQ(m.nondominantAxesRatio(), 0.5f);
    EXPECT_FLOAT_EQ(m.speedSimilarity(), 0.7f);
    EXPECT_FLOAT_EQ(m.innermostOutermostSeparation_mm(), 40.0f);
    EXPECT_FLOAT_EQ(m.maxInnermostOutermostVerticalSeparation_mm(), 9.0f);
}

TEST_F(HIDHandMotionTest, ClearingWithoutTheFlagKeepsLocationCentroidAndTime) {
    fillMotionState(motion);

    motion.clearHandMotion(false);

    expectMotionRecordsCleared(motion);
    expectMotion(motion.absoluteLocation(), 1.0f, 1.0f, 1.0f, 1.0f);
    EXPECT_FLOAT_EQ(motion.handCentroid().x, 2.0f);
    EXPECT_FLOAT_EQ(motion.handCentroid().y, 3.0f);
    EXPECT_DOUBLE_EQ(motion.tLastPixelDelta(), 1234.0);
}

TEST_F(HIDHandMotionTest, ClearingWithTheFlagAlsoZeroesLocationCentroidAndTime) {
    fillMotionState(motion);

    motion.clearHandMotion(true);

    expectMotionRecordsCleared(motion);
    expectMotion(motion.absoluteLocation(), 0.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(motion.handCentroid().x, 0.0f);
    EXPECT_FLOAT_EQ(motion.handCentroid().y, 0.0f);
    EXPECT_DOUBLE_EQ(motion.tLastPixelDelta(), 0.0);
}

TEST_F(HIDHandMotionTest, AnyPixelDeltasSeesEachComponent) {
    EXPECT_FALSE(motion.anyPixelDeltas());
    motion.setPixelDeltas(HIDMotion{0.0f, 0.0f, 0.0f, -0.5f});
    EXPECT_TRUE(motion.anyPixelDeltas());
    motion.setPixelDeltas(HIDMotion{0.0f, 0.0f, 0.25f, 0.0f});
    EXPECT_TRUE(motion.anyPixelDeltas());
    motion.setPixelDeltas(HIDMotion{0.0f, 1.0f, 0.0f, 0.0f});
    EXPECT_TRUE(motion.anyPixelDeltas());
    motion.setPixelDeltas(HIDMotion{-1.0f, 0.0f, 0.0f, 0.0f});
    EXPECT_TRUE(motion.anyPixelDeltas());
}

TEST_F(HIDHandMotionTest, MaximaAreTheLargestAbsoluteComponents) {
    motion.setPixelDeltas(HIDMotion{1.0f, -5.0f, 2.0f, 3.0f});
    motion.setAccumulatedDeltas(HIDMotion{1.0f, 2.0f, 3.0f, 7.0f});
    motion.setAccumulatedDeltasWithResting(HIDMotion{9.0f, 2.0f, -3.0f, 7.0f});

    EXPECT_FLOAT_EQ(motion.maxPixelDelta(), 5.0f);
    EXPECT_FLOAT_EQ(motion.maxAccumPixelDelta(), 7.0f);
    EXPECT_FLOAT_EQ(motion.maxAccumPixelDeltaResting(), 9.0f);

    motion.setPixelDeltas(HIDMotion{0.0f, 0.0f, -6.5f, 0.0f});
    EXPECT_FLOAT_EQ(motion.maxPixelDelta(), 6.5f);
}

// ---------------------------------------------------------------------------------------
// The per-frame entry

TEST_F(HIDHandMotionTest, NoFingerTouchingSkipsExtractionAndSendsZeroMotion) {
    place(2, {.position = {200.0f, 100.0f},
              .previousPosition = {190.0f, 100.0f},
              .pixelDelta = {10.0f, 0.0f},
              .engagedVelocity = {10.0f, 0.0f}});
    setFrameTimes(1000.0, 1008.0);
    motion.setAbsoluteLocation(HIDMotion{5.0f, 6.0f, 0.0f, 0.0f});
    motion.setAccumulatedDeltas(HIDMotion{3.0f, 3.0f, 3.0f, 3.0f});
    motion.setAccumulatedDeltasWithResting(HIDMotion{2.0f, 2.0f, 2.0f, 2.0f});
    motion.setMaxInnermostOutermostVerticalSeparation_mm(7.0f);
    motion.setTLastPixelDelta(55.0);
    table.setMotionDeltas(HIDMotion{9.0f, 9.0f, 9.0f, 9.0f});
    table.setMotionDeltasResting(HIDMotion{9.0f, 9.0f, 9.0f, 9.0f});
    table.setMaxMotionDeltas(9.0f);
    table.setMaxMotionDeltasResting(9.0f);

    motion.processHandMotion(table, 0, 1, 0);

    EXPECT_FLOAT_EQ(motion.maxInnermostOutermostVerticalSeparation_mm(), 0.0f);
    // No extraction: the location stays, no delta or velocity comes from the moving path.
    expectMotion(motion.absoluteLocation(), 5.0f, 6.0f, 0.0f, 0.0f);
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.velocity(), 0.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_DOUBLE_EQ(motion.tLastPixelDelta(), 55.0);
    expectMotion(table.motionDeltas(), 0.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(table.motionDeltasResting(), 0.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(table.maxMotionDeltas(), 0.0f);
    EXPECT_FLOAT_EQ(table.maxMotionDeltasResting(), 0.0f);
}

TEST_F(HIDHandMotionTest, OneMovingFingerAccumulatesAndWritesBack) {
    place(3, {.position = {200.0f, 100.0f},
              .previousPosition = {195.0f, 100.0f},
              .pixelDelta = {5.0f, 0.0f},
              .engagedVelocity = {5.0f, 0.0f}});
    setFrameTimes(1000.0, 1008.0);
    table.setSpeedSimilarity(1.0f);

    motion.processHandMotion(table, 1, 1, 0);

    EXPECT_EQ(motion.innermostTouchingFingerID(), 4);
    expectMotion(motion.pixelDeltas(), 5.0f, 0.0f, 0.0f, 0.0f);
    // Translation dominates; clipped x = 5 − 4.
    expectMotion(motion.smoothedClippedVelocity(), 1.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.accumulatedDeltas(), 5.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(table.motionDeltas(), 5.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(table.maxMotionDeltas(), 5.0f);
    expectMotion(table.motionDeltasResting(), 5.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_FLOAT_EQ(table.maxMotionDeltasResting(), 5.0f);
    EXPECT_DOUBLE_EQ(motion.tLastPixelDelta(), ticks(1008.0));

    setFrameTimes(1008.0, 1016.0);
    motion.processHandMotion(table, 1, 1, 0);
    expectMotion(table.motionDeltas(), 10.0f, 0.0f, 0.0f, 0.0f);
    EXPECT_DOUBLE_EQ(motion.tLastPixelDelta(), ticks(1016.0));
}

TEST_F(HIDHandMotionTest, ChangeOfFingerCountRestartsTheSumsAndTheSmoothing) {
    place(3, {.position = {200.0f, 100.0f},
              .previousPosition = {195.0f, 100.0f},
              .pixelDelta = {5.0f, 0.0f},
              .engagedVelocity = {5.0f, 0.0f}});
    setFrameTimes(1000.0, 1000.0);  // a zero interval keeps the smoothed velocity as it was
    motion.setAccumulatedDeltas(HIDMotion{10.0f, 10.0f, 10.0f, 10.0f});
    motion.setAccumulatedDeltasWithResting(HIDMotion{10.0f, 10.0f, 10.0f, 10.0f});
    motion.setSmoothedVelocity(HIDMotion{9.0f, 9.0f, 9.0f, 9.0f});
    // Kept above the smoothed scale and rotation so translation dominates and the pixel
    // deltas stay as extracted.
    motion.setSmoothedTranslationSpeed(20.0f);

    motion.processHandMotion(table, 1, 2, 0);

    expectMotion(motion.accumulatedDeltas(), 5.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.accumulatedDeltasWithResting(), 5.0f, 0.0f, 0.0f, 0.0f);
    expectMotion(motion.smoothedVelocity(), 0.0f, 0.0f, 0.0f, 0.0f);
}

TEST_F(HIDHandMotionTest, SameFingerCountKeepsTheSums) {
    place(3, {.position = {200.0f, 100.0f},
              .previousPosition = {195.0f, 100.0f},
              .pixelDelta = {5.0f, 0.0f},
              .engagedVelocity = {5.0f, 0.0f}});
    setFrameTimes(1000.0, 1000.0);
    motion.setAccumulatedDeltas(HIDMotion{10.0f, 10.0f, 10.0f, 10.0f});
    motion.setSmoothedVelocity(HIDMotion{9.0f, 9.0f, 9.0f, 9.0f});
    // T = 20 > 0.45·9: translation dominates and the pixel deltas stay as extracted.
    motion.setSmoothedTranslationSpeed(20.0f);
    table.setSpeedSimilarity(1.0f);

    motion.processHandMotion(table, 1, 1, 0);

    expectMotion(motion.accumulatedDeltas(), 15.0f, 10.0f, 10.0f, 10.0f);
    expectMotion(motion.smoothedVelocity(), 9.0f, 9.0f, 9.0f, 9.0f);
}

TEST_F(HIDHandMotionTest, ChangeOfTouchCountRestartsTheFastestFingerSpeed) {
    setFrameTimes(1000.0, 1014.0);
    table.setNumTouches(0);
    table.setLastNumTouches(1);
    table.setMaxFingerSpeed(3.0f);
    motion.setMaxFingerSpeed(7.0f);

    motion.processHandMotion(table, 0, 1, 0);

    EXPECT_FLOAT_EQ(motion.lastMaxFingerSpeed(), 7.0f);
    // With no finger the fastest-finger update does not run.
    EXPECT_FLOAT_EQ(motion.maxFingerSpeed(), 0.0f);
}

TEST_F(HIDHandMotionTest, ChangeOfRestingThumbRestartsTheFastestFingerSpeedBeforeTheUpdate) {
    place(3, {.position = {200.0f, 100.0f}, .previousPosition = {200.0f, 100.0f}});
    setFrameTimes(1000.0, 1014.0);
    table.setRestingThumbExists(false);
    table.setRestingThumbDidExist(true);
    table.setMaxFingerSpeed(3.0f);
    motion.setMaxFingerSpeed(7.0f);

    motion.processHandMotion(table, 1, 1, 0);

    EXPECT_FLOAT_EQ(motion.lastMaxFingerSpeed(), 7.0f);
    EXPECT_FLOAT_EQ(motion.maxFingerSpeed(), 3.0f);
    // a = 0.5 at 14 ms: 0.5·3 + 0.5·3.
    EXPECT_FLOAT_EQ(motion.averageMaxFingerSpeed(), 3.0f);
}

TEST_F(HIDHandMotionTest, SteadyTouchCountKeepsTheFastestFingerSpeed) {
    place(3, {.position = {200.0f, 100.0f}, .previousPosition = {200.0f, 100.0f}});
    setFrameTimes(1000.0, 1014.0);
    table.setMaxFingerSpeed(3.0f);
    motion.setMaxFingerSpeed(7.0f);
    motion.setLastMaxFingerSpeed(1.0f);

    motion.processHandMotion(table, 1, 1, 0);

    EXPECT_FLOAT_EQ(motion.lastMaxFingerSpeed(), 1.0f);
    EXPECT_FLOAT_EQ(motion.maxFingerSpeed(), 7.0f);
}

TEST_F(HIDHandMotionTest, OneFingerWithARestingThumbMeasuresSeparationAgainstTheThumb) {
    HIDParserPath* thumb = place(1, {.position = {430.0f, 140.0f}, .previousPosition = {430.0f, 140.0f}});
    thumb->setRestingInThumbZone(true);
    place(2, {.position = {400.0f, 100.0f}, .previousPosition = {400.0f, 100.0f}});
    setFrameTimes(1000.0, 1008.0);
    table.setRestingThumbExists(true);
    table.setRestingThumbDidExist(true);
    table.setBottomDivingPathIndex(1);

    motion.processHandMotion(table, 1, 1, 0);

    // Finger (400, 100) to thumb (430, 140): 30 across, 40 down, 50 apart.
    EXPECT_FLOAT_EQ(motion.innermostOutermostSeparation_mm(), 50.0f);
    EXPECT_FLOAT_EQ(motion.innermostOutermostVerticalSeparation_mm(), 40.0f);
    EXPECT_FLOAT_EQ(motion.maxInnermostOutermostVerticalSeparation_mm(), 40.0f);
}

TEST_F(HIDHandMotionTest, OneFingerWithoutARestingThumbHasNoSeparation) {
    place(1, {.position = {430.0f, 140.0f}, .previousPosition = {430.0f, 140.0f}})->setRestingInThumbZone(true);
    place(2, {.position = {400.0f, 100.0f}, .previousPosition = {400.0f, 100.0f}});
    setFrameTimes(1000.0, 1008.0);
    table.setBottomDivingPathIndex(1);

    motion.processHandMotion(table, 1, 1, 0);

    EXPECT_FLOAT_EQ(motion.innermostOutermostSeparation_mm(), 0.0f);
}

TEST_F(HIDHandMotionTest, StillFingerLeavesTheTimeOfTheLastPixelDelta) {
    place(3, {.position = {200.0f, 100.0f}, .previousPosition = {200.0f, 100.0f}});
    setFrameTimes(1000.0, 1008.0);
    motion.setTLastPixelDelta(42.0);

    motion.processHandMotion(table, 1, 1, 0);

    EXPECT_DOUBLE_EQ(motion.tLastPixelDelta(), 42.0);
}

TEST_F(HIDHandMotionTest, SpeedSimilarityIsWrittenBackToThePathTable) {
    setFrameTimes(1000.0, 1008.0);
    motion.setSpeedSimilarity(0.3f);
    table.setSpeedSimilarity(0.7f);

    // No finger: nothing copies the table's value, so ours goes back.
    motion.processHandMotion(table, 0, 0, 0);

    EXPECT_FLOAT_EQ(table.speedSimilarity(), 0.3f);
}

TEST_F(HIDHandMotionTest, CentroidComesFromThePathTable) {
    place(2, {.position = {200.0f, 100.0f}, .previousPosition = {200.0f, 100.0f}})
        ->setStablePositionForUI(HIDPoint{200.0f, 100.0f});
    place(4, {.position = {300.0f, 140.0f}, .previousPosition = {300.0f, 140.0f}})
        ->setStablePositionForUI(HIDPoint{300.0f, 140.0f});
    setFrameTimes(1000.0, 1008.0);

    motion.processHandMotion(table, 2, 2, 0);

    EXPECT_FLOAT_EQ(motion.handCentroid().x, 250.0f);
    EXPECT_FLOAT_EQ(motion.handCentroid().y, 120.0f);
}

TEST_F(HIDHandMotionTest, PinchAccumulatesScaleWeightedBySpeedSimilarity) {
    place(1, {.position = {100.0f, 100.0f},
              .previousPosition = {101.0f, 100.0f},
              .pixelDelta = {-1.0f, 0.0f},
              .engagedVelocity = {-10.0f, 0.0f}});
    place(2, {.position = {160.0f, 100.0f},
              .previousPosition = {159.0f, 100.0f},
              .pixelDelta = {1.0f, 0.0f},
              .engagedVelocity = {10.0f, 0.0f}});
    setFrameTimes(1000.0, 1008.0);
    table.setSpeedSimilarity(0.5f);

    motion.processHandMotion(table, 2, 2, 0);

    // Separation 60 now, 58 before: scale delta 2. Velocity scale 10 − (−10) = 20 at weight
    // 1.45 (60 mm) beats a translation of 0, so x and y are cleared and rotate too (S > R).
    expectMotion(motion.pixelDeltas(), 0.0f, 0.0f, 2.0f, 0.0f);
    // Clipped scale 20 − 4.
    expectMotion(motion.smoothedClippedVelocity(), 0.0f, 0.0f, 16.0f, 0.0f);
    // 2·0.5 + 0.
    expectMotion(table.motionDeltas(), 0.0f, 0.0f, 1.0f, 0.0f);
    EXPECT_FLOAT_EQ(table.maxMotionDeltas(), 1.0f);
    // The WithResting sum is not weighted.
    expectMotion(table.motionDeltasResting(), 0.0f, 0.0f, 2.0f, 0.0f);
    EXPECT_FLOAT_EQ(table.maxMotionDeltasResting(), 2.0f);
    EXPECT_FLOAT_EQ(table.speedSimilarity(), 0.5f);
}

TEST_F(HIDHandMotionTest, DiagnosticsNeedAnInternalBuild) {
    // This program runs as a release build: even with debug on, nothing is written.
    auto sink = std::make_shared<CaptureLogSink>();
    Logging::setSink(sink);
    Logging::setDebugEnabled(true);
    motion.setPixelDeltas(HIDMotion{1.0f, 1.0f, 1.0f, 1.0f});

    motion.accumulateHandMotion();
    motion.clearAccumulateHandMotion();
    motion.printExtractedMotion(1);

    Logging::setDebugEnabled(false);
    Logging::setSink(std::make_shared<StandardErrorLogSink>());
    EXPECT_TRUE(sink->messages().empty());
}

}  // namespace
}  // namespace orvane
