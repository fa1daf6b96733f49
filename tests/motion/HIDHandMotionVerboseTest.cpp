// The hand-motion diagnostics, on an internal build: they go to the verbose handle at
// debug level, and only while debug is enabled.

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "filter/FilterLogging.h"
#include "motion/HIDHandMotion.h"
#include "paths/HIDPathStates.h"
#include "pipeline/HIDParserPath.h"
#include "tests/support/FrameBuilder.h"

namespace orvane {
namespace {

class HIDHandMotionVerboseTest : public ::testing::Test {
protected:
    void SetUp() override {
        Logging::setSink(sink);
        Logging::setDebugEnabled(true);
    }
    void TearDown() override {
        Logging::setDebugEnabled(false);
        Logging::setSink(std::make_shared<StandardErrorLogSink>());
    }

    // Two fingers 20 apart along x moving apart by 1 each: a separation of 20 after 18.
    void placeSpreadingPair() {
        HIDContact inner{1, 1, 1, 2, HIDPoint{-1.0f, 0.0f}, 0.0, HIDPoint{10.0f, 20.0f}};
        HIDContact innerPrev = inner;
        innerPrev.position = HIDPoint{11.0f, 20.0f};
        HIDContact outer{1, 1, 2, 3, HIDPoint{1.0f, 0.0f}, 0.0, HIDPoint{30.0f, 20.0f}};
        HIDContact outerPrev = outer;
        outerPrev.position = HIDPoint{29.0f, 20.0f};
        HIDParserPath* i = table.getParserPath(1);
        i->setCurrentContact(inner);
        i->setPreviousContact(innerPrev);
        i->setPixelDelta(HIDPoint{-1.0f, 0.0f});
        HIDParserPath* o = table.getParserPath(2);
        o->setCurrentContact(outer);
        o->setPreviousContact(outerPrev);
        o->setPixelDelta(HIDPoint{1.0f, 0.0f});
    }

    std::shared_ptr<CaptureLogSink> sink = std::make_shared<CaptureLogSink>();
    HIDPathStates table{500.0f, 1000.0f};
    HIDHandMotion motion;
};

TEST_F(HIDHandMotionVerboseTest, AccumulationLogsTheSumsAndTheSpeedSimilarity) {
    motion.setPixelDeltas(HIDMotion{1.0f, -2.0f, 3.0f, 4.0f});
    motion.setSpeedSimilarity(0.5f);

    motion.accumulateHandMotion();

    const auto entries = sink->entries();
    ASSERT_EQ(entries.size(), 1u);
    EXPECT_EQ(entries[0].category, "ServiceFilterVerbose");
    EXPECT_EQ(entries[0].level, LogLevel::Debug);
    // scale 3·0.5, rotate 4·0.5.
    EXPECT_EQ(entries[0].message,
              "-[HIDHandMotion accumulateHandMotion] AccumMotion 1.000000 x 2.000000 y 1.500000 scale 2.000000 "
              "rotate speedSimilarity 0.500000");
}

TEST_F(HIDHandMotionVerboseTest, ClearingTheSumsLogsTheZeroedValues) {
    motion.setAccumulatedDeltas(HIDMotion{1.0f, 2.0f, 3.0f, 4.0f});

    motion.clearAccumulateHandMotion();

    ASSERT_EQ(sink->messages().size(), 1u);
    EXPECT_EQ(sink->messages()[0],
              "-[HIDHandMotion clearAccumulateHandMotion] AccumMotion 0.000000 x 0.000000 y 0.000000 scale "
              "0.000000 rotate");
}

TEST_F(HIDHandMotionVerboseTest, ResettingThePlainSumLogsTheZeroedValues) {
    motion.setAccumulatedDeltas(HIDMotion{1.0f, 2.0f, 3.0f, 4.0f});

    motion.resetAccumulateHandMotion();

    ASSERT_EQ(sink->messages().size(), 1u);
    EXPECT_EQ(sink->messages()[0],
              "-[HIDHandMotion resetAccumulateHandMotion] AccumMotion 0.000000 x 0.000000 y 0.000000 scale "
              "0.000000 rotate");
}

TEST_F(HIDHandMotionVerboseTest, PrintedMotionShowsFingersDeltasAndBothVelocities) {
    motion.setInnermostTouchingFingerID(2);
    motion.setOutermostTouchingFingerID(3);
    motion.setPixelDeltas(HIDMotion{1.5f, -2.0f, 0.25f, 0.0f});
    motion.setSmoothedClippedVelocity(HIDMotion{1.0f, 0.0f, 0.0f, 0.0f});
    motion.setVelocity(HIDMotion{5.0f, 0.5f, 0.125f, -1.0f});

    motion.printExtractedMotion(2);

    const auto messages = sink->messages();
    ASSERT_EQ(messages.size(), 2u);
    EXPECT_EQ(messages[0], "-[HIDHandMotion printExtractedMotion:] Motion 2M, 2<-->3\n");
    EXPECT_EQ(messages[1],
              "-[HIDHandMotion printExtractedMotion:] Motion \t1.50dx -2.00dy 0.25ds 0.00dr | 1.000/5.000vx "
              "0.000/0.500vy 0.000/0.125vs 0.000/-1.000vr\n");
}

TEST_F(HIDHandMotionVerboseTest, PairExtractionLogsSeparationAndDeltas) {
    placeSpreadingPair();

    motion.extractHandMotion(table, table.getParserPath(1), table.getParserPath(2), true, true);

    const auto messages = sink->messages();
    ASSERT_EQ(messages.size(), 2u);
    const std::string sig = "-[HIDHandMotion extractHandMotion:innermostPath:outermostPath:areTouching:wereTouching:]";
    EXPECT_EQ(messages[0], sig + " GESTURE : separation 20.000000 - previous_sep 18.000000");
    EXPECT_EQ(messages[1], sig + " GESTURE : normalized separation (1.000000,0.000000)  delta_innermost "
                                 "(-1.000000,0.000000) delta_outermost (1.000000,0.000000)");
}

TEST_F(HIDHandMotionVerboseTest, PairWithoutAPreviousFrameLogsNothing) {
    placeSpreadingPair();

    motion.extractHandMotion(table, table.getParserPath(1), table.getParserPath(2), true, false);

    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(HIDHandMotionVerboseTest, WithRestingExtractionLogsNothing) {
    placeSpreadingPair();

    motion.extractHandMotionWithResting(table, table.getParserPath(1), table.getParserPath(2), true, true);

    EXPECT_TRUE(sink->messages().empty());
}

TEST_F(HIDHandMotionVerboseTest, FrameWithNoFingerLogsTheSumsThenTheMotion) {
    table.setPreviousTimestamp(static_cast<double>(test::TestClock::msToTicks(1000.0)));
    table.setCurrentTimestamp(static_cast<double>(test::TestClock::msToTicks(1008.0)));

    motion.processHandMotion(table, 0, 0, 0);

    const auto messages = sink->messages();
    ASSERT_EQ(messages.size(), 3u);
    EXPECT_EQ(messages[0].rfind("-[HIDHandMotion accumulateHandMotion] AccumMotion ", 0), 0u);
    EXPECT_EQ(messages[1], "-[HIDHandMotion printExtractedMotion:] Motion 0M, 0<-->0\n");
    EXPECT_EQ(messages[2].rfind("-[HIDHandMotion printExtractedMotion:] Motion \t0.00dx", 0), 0u);
}

TEST_F(HIDHandMotionVerboseTest, ChangeOfFingerCountLogsTheClearedSumsFirst) {
    placeSpreadingPair();
    table.setPreviousTimestamp(static_cast<double>(test::TestClock::msToTicks(1000.0)));
    table.setCurrentTimestamp(static_cast<double>(test::TestClock::msToTicks(1008.0)));

    motion.processHandMotion(table, 2, 1, 0);

    const auto messages = sink->messages();
    ASSERT_GE(messages.size(), 1u);
    EXPECT_EQ(messages[0].rfind("-[HIDHandMotion clearAccumulateHandMotion] AccumMotion ", 0), 0u);
}

TEST_F(HIDHandMotionVerboseTest, NothingIsLoggedWithoutDebug) {
    Logging::setDebugEnabled(false);
    placeSpreadingPair();
    motion.setPixelDeltas(HIDMotion{1.0f, 1.0f, 1.0f, 1.0f});

    motion.accumulateHandMotion();
    motion.clearAccumulateHandMotion();
    motion.resetAccumulateHandMotion();
    motion.printExtractedMotion(2);
    motion.extractHandMotion(table, table.getParserPath(1), table.getParserPath(2), true, true);

    EXPECT_TRUE(sink->messages().empty());
}

}  // namespace
}  // namespace orvane
