// Ticks to milliseconds with the factors worked out once gives the same bits as reading the
// timebase and widening its parts on every call. This program also runs under a 125/3
// timebase, so the numerator and denominator both take part.

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>

#include "common/TickConversion.h"

namespace orvane {
namespace {

bool sameBits(double a, double b) { return std::memcmp(&a, &b, sizeof a) == 0; }

TEST(TickConversion, CachedFactorsGiveTheSameBitsAsTheTimebase) {
    std::mt19937_64 random(20261127);
    std::uniform_int_distribution<uint64_t> anyBits;
    std::uniform_real_distribution<double> frameTimes(0.0, 1.0e15);
    std::uniform_real_distribution<double> intervals(-1.0e8, 1.0e8);
    int differences = 0;
    for (int n = 0; n < 300000; ++n) {
        double ticks = 0.0;
        switch (n % 3) {
            case 0: {
                const uint64_t bits = anyBits(random);
                std::memcpy(&ticks, &bits, sizeof ticks);  // every double, NaNs and infinities included
                break;
            }
            case 1: ticks = frameTimes(random); break;
            default: ticks = std::round(intervals(random)); break;
        }
        if (!sameBits(ticksToMilliseconds(ticks), ticksToMillisecondsFromTimebase(ticks))) ++differences;
    }
    for (double ticks : {0.0, -0.0, 1.0, 8333333.0, 16666667.0, std::numeric_limits<double>::max(),
                         std::numeric_limits<double>::denorm_min(), std::numeric_limits<double>::infinity()}) {
        EXPECT_TRUE(sameBits(ticksToMilliseconds(ticks), ticksToMillisecondsFromTimebase(ticks))) << ticks;
    }
    EXPECT_EQ(differences, 0);
}

}  // namespace
}  // namespace orvane
