// Frames handled and the latency percentiles printed by --stats.

#include <gtest/gtest.h>

#include "tools/live/LatencyStats.h"

namespace orvane::live {
namespace {

TEST(LatencyStats, MedianPercentileAndMaximumOfTenFrames) {
    LatencyStats stats;
    // 10, 20, ..., 100 microseconds, given out of order.
    for (uint64_t us : {70, 10, 100, 40, 20, 90, 30, 60, 80, 50}) stats.add(us * 1000 + 400);
    EXPECT_EQ(stats.count(), 10u);
    // The median is the 5th smallest (ceil(0.5 × 10) = 5): 50 us.
    EXPECT_EQ(stats.percentileMicroseconds(0.5), 50u);
    // The 99th percentile is the 10th (ceil(0.99 × 10) = 10): 100 us.
    EXPECT_EQ(stats.percentileMicroseconds(0.99), 100u);
    EXPECT_EQ(stats.maximumNanoseconds(), 100'400u);
    EXPECT_EQ(stats.summary(),
              "10 frames handled; latency from reading a frame's SYN_REPORT to writing its output: median 50 us, "
              "99th percentile 100 us, maximum 100 us");
}

TEST(LatencyStats, TheNinetyNinthPercentileOfTwoHundredFramesIsTheOneHundredAndNinetyEighth) {
    LatencyStats stats;
    // 198 frames of 5 us, then 2 of 900 us: ceil(0.99 × 200) = 198 → 5 us.
    for (int i = 0; i < 198; ++i) stats.add(5'000);
    stats.add(900'000);
    stats.add(900'000);
    EXPECT_EQ(stats.percentileMicroseconds(0.99), 5u);
    // One more slow frame: ceil(0.99 × 201) = 199 → 900 us.
    stats.add(900'000);
    EXPECT_EQ(stats.percentileMicroseconds(0.99), 900u);
}

TEST(LatencyStats, ASecondOrMoreCountsAsASecondExceptForTheMaximum) {
    LatencyStats stats;
    stats.add(3'000'000'000ull);  // 3 s
    EXPECT_EQ(stats.percentileMicroseconds(0.5), 1'000'000u);
    EXPECT_EQ(stats.maximumNanoseconds(), 3'000'000'000ull);
}

TEST(LatencyStats, NoFramesSaysSo) {
    LatencyStats stats;
    EXPECT_EQ(stats.percentileMicroseconds(0.5), 0u);
    EXPECT_EQ(stats.summary(), "0 frames handled");
}

}  // namespace
}  // namespace orvane::live
