// The cosines between velocities and the two-finger speed symmetry, on hand-worked inputs.

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstdlib>
#include <vector>

#include "paths/HIDPathStates.h"

using namespace orvane;

TEST(CosineThetas, OppositeVelocitiesGiveMinusOne) {
    // (3, 4)·(−6, −8) = −50 over 5 × 10.
    EXPECT_EQ(getCosineThetas(std::vector<HIDPoint>{{3, 4}, {-6, -8}}), std::vector<float>{-1.0f});
}

TEST(CosineThetas, ZeroVelocityAgainstAnyOtherGivesOne) {
    EXPECT_EQ(getCosineThetas(std::vector<HIDPoint>{{0, 0}, {-3, 4}}), std::vector<float>{1.0f});
    EXPECT_EQ(getCosineThetas(std::vector<HIDPoint>{{-3, 4}, {0, 0}}), std::vector<float>{1.0f});
    EXPECT_EQ(getCosineThetas(std::vector<HIDPoint>{{0, 0}, {0, 0}}), std::vector<float>{1.0f});
}

TEST(CosineThetas, PairsComeInOrderOfTheFirstPointThenTheSecond) {
    const std::vector<HIDPoint> points{{1, 0}, {3, 4}, {0, 1}, {-1, 0}};
    const std::vector<float> cosines = getCosineThetas(points);
    ASSERT_EQ(cosines.size(), 6u);
    EXPECT_FLOAT_EQ(cosines[0], 0.6f);   // (0,1): 3 / 5
    EXPECT_FLOAT_EQ(cosines[1], 0.0f);   // (0,2): perpendicular
    EXPECT_FLOAT_EQ(cosines[2], -1.0f);  // (0,3): opposite
    EXPECT_FLOAT_EQ(cosines[3], 0.8f);   // (1,2): 4 / 5
    EXPECT_FLOAT_EQ(cosines[4], -0.6f);  // (1,3): −3 / 5
    EXPECT_FLOAT_EQ(cosines[5], 0.0f);   // (2,3): perpendicular
}

TEST(CosineThetas, SameDirectionGivesOne) {
    const std::vector<float> cosines = getCosineThetas(std::vector<HIDPoint>{{0.5f, 0.5f}, {2, 2}});
    ASSERT_EQ(cosines.size(), 1u);
    EXPECT_FLOAT_EQ(cosines[0], 1.0f);
}

TEST(CosineThetas, EmptyAndOnePointListsGiveNothing) {
    EXPECT_TRUE(getCosineThetas(std::vector<HIDPoint>{}).empty());
    EXPECT_TRUE(getCosineThetas(std::vector<HIDPoint>{{3, 4}}).empty());

    std::array<float, 4> out{9, 9, 9, 9};
    const std::array<HIDPoint, 1> one{{{3, 4}}};
    EXPECT_EQ(getCosineThetas(std::span<const HIDPoint>(one), std::span<float>(out)), 0u);
    EXPECT_EQ(out[0], 9.0f);
}

TEST(CosineThetas, SpanFormFillsTheGivenRoom) {
    const std::array<HIDPoint, 3> points{{{3, 4}, {-6, -8}, {4, -3}}};
    std::array<float, 3> out{};
    ASSERT_EQ(getCosineThetas(std::span<const HIDPoint>(points), std::span<float>(out)), 3u);
    EXPECT_FLOAT_EQ(out[0], -1.0f);  // (3,4)·(−6,−8) = −50 / 50
    EXPECT_FLOAT_EQ(out[1], 0.0f);   // (3,4)·(4,−3) = 0
    EXPECT_FLOAT_EQ(out[2], 0.0f);   // (−6,−8)·(4,−3) = 0
}

TEST(CosineThetas, ExportedFormReturnsANewArray) {
    const HIDPoint points[3] = {{1, 0}, {3, 4}, {0, 0}};
    size_t count = 99;
    float* cosines = ::getCosineThetas(points, 3, &count);
    ASSERT_NE(cosines, nullptr);
    ASSERT_EQ(count, 3u);
    EXPECT_FLOAT_EQ(cosines[0], 0.6f);  // 3 / 5
    EXPECT_EQ(cosines[1], 1.0f);        // against a zero velocity
    EXPECT_EQ(cosines[2], 1.0f);
    std::free(cosines);
}

TEST(CosineThetas, ExportedFormGivesNullForFewerThanTwoPoints) {
    const HIDPoint point{3, 4};
    size_t count = 99;
    EXPECT_EQ(::getCosineThetas(&point, 1, &count), nullptr);
    EXPECT_EQ(count, 0u);
    count = 99;
    EXPECT_EQ(::getCosineThetas(nullptr, 0, &count), nullptr);
    EXPECT_EQ(count, 0u);
}

TEST(CosineThetas, DotProductIsWorkedInDouble) {
    // (4097, 1)·(4097, −16785408) = 16785409 − 16785408 = 1 in double; in float 4097 × 4097
    // would round to 16785408 and the product come out 0. Lengths ≈ 4097 and 16785408.
    const std::vector<float> cosines = getCosineThetas(std::vector<HIDPoint>{{4097, 1}, {4097, -16785408.0f}});
    ASSERT_EQ(cosines.size(), 1u);
    EXPECT_GT(cosines[0], 0.0f);
    EXPECT_NEAR(cosines[0], 1.0 / (4097.0 * 16785408.0), 1e-15);
}

// ---- Two-finger speed symmetry ----

TEST(TwoFingerSpeedSymmetry, TwoSlowFingersAloneAreTripled) {
    const std::array<float, 1> speeds{0.5f};
    // √0.25 × 3 / ((0.5 + 0.5) × 0.5 + 1) = 1.5 / 1.5.
    EXPECT_EQ(HIDPathStates::compute_2F_path_speed_symmetry(speeds, {}, 0.5f), 1.0f);
}

TEST(TwoFingerSpeedSymmetry, NoOtherFingerGivesZero) {
    const std::array<float, 1> cosines{-1.0f};
    EXPECT_EQ(HIDPathStates::compute_2F_path_speed_symmetry({}, cosines, 2.0f), 0.0f);
}

TEST(TwoFingerSpeedSymmetry, GeometricOverArithmeticMeanPlusOne) {
    const std::array<float, 1> speeds{2.0f};
    const std::array<float, 1> along{0.5f};
    // √(2 × 2) = 2 over (2 + 2) × 0.5 + 1 = 3.
    EXPECT_EQ(HIDPathStates::compute_2F_path_speed_symmetry(speeds, along, 2.0f), static_cast<float>(2.0 / 3.0));
}

TEST(TwoFingerSpeedSymmetry, DirectionComesFromTheFirstCosine) {
    const std::array<float, 1> speeds{2.0f};
    const std::array<float, 2> against{-0.5f, 0.9f};
    const std::array<float, 2> square{0.0f, 0.9f};
    EXPECT_EQ(HIDPathStates::compute_2F_path_speed_symmetry(speeds, against, 2.0f), -static_cast<float>(2.0 / 3.0));
    // A cosine of exactly 0 is not a similar direction.
    EXPECT_EQ(HIDPathStates::compute_2F_path_speed_symmetry(speeds, square, 2.0f), -static_cast<float>(2.0 / 3.0));
}

TEST(TwoFingerSpeedSymmetry, OnlyTheFastestOtherSpeedCounts) {
    const std::array<float, 2> speeds{0.5f, 0.25f};
    // Two others, so no tripling: √(0.5 × 0.5) = 0.5 over (0.5 + 0.5) × 0.5 + 1 = 1.5.
    EXPECT_EQ(HIDPathStates::compute_2F_path_speed_symmetry(speeds, {}, 0.5f), static_cast<float>(0.5 / 1.5));
}

TEST(TwoFingerSpeedSymmetry, OneFastFingerIsNotTripled) {
    const std::array<float, 1> speeds{2.0f};
    // √(2 × 0.5) = 1 over (2 + 0.5) × 0.5 + 1 = 2.25.
    EXPECT_EQ(HIDPathStates::compute_2F_path_speed_symmetry(speeds, {}, 0.5f), static_cast<float>(1.0 / 2.25));
    // Slow desired path, other one exactly 1.0: not below 1, so not tripled either.
    const std::array<float, 1> one{1.0f};
    // √(1 × 0.25) = 0.5 over (1 + 0.25) × 0.5 + 1 = 1.625.
    EXPECT_EQ(HIDPathStates::compute_2F_path_speed_symmetry(one, {}, 0.25f), static_cast<float>(0.5 / 1.625));
}
