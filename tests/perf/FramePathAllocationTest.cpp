// The frame path through the loaded plug-in's event entry takes nothing from the heap once
// the hand is in its steady state, and its memory stays flat.

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "bench/support/AllocationCounter.h"
#include "bench/support/PerfDriver.h"
#include "bench/support/PerfFrames.h"
#include "platform/HIDEventPool.h"

namespace orvane::perf {
namespace {

// Frames before anything is counted: the scroll has begun and the pools have grown.
constexpr int kWarmUpFrames = 600;

bool hasScrollChild(const HIDEvent& event) {
    for (const HIDEventRef& child : event.children()) {
        if (child->type() == kHIDEventTypeScroll) return true;
    }
    return false;
}

class TwoFingerScroll : public ::testing::Test {
protected:
    void SetUp() override {
        source_ = makeMadeUpSource("two-finger-scroll");
        ASSERT_NE(source_, nullptr);
        std::string error;
        ASSERT_TRUE(driver_.open(source_->service(), &error)) << error;
        for (int i = 0; i < kWarmUpFrames; ++i) driver_.feed(source_->next());
    }

    // The next frame (the made-up hand sends its two settings before its first frame only).
    HIDEventRef nextFrame() {
        FrameSource::Record record = source_->next();
        while (!record.event) {
            driver_.feed(record);
            record = source_->next();
        }
        return record.event;
    }

    std::unique_ptr<FrameSource> source_;
    PerfDriver driver_;
};

TEST(AllocationCounter, SeesTheAllocationsOfThisProgram) {
    const AllocationCount before = allocationCount();
    auto one = std::make_unique<int>(1);
    std::vector<int> many(1000);
    const AllocationCount after = allocationCount();
    EXPECT_GE(after.allocations - before.allocations, 2u);
    EXPECT_GE(after.bytes - before.bytes, sizeof(int) + 1000 * sizeof(int));
}

TEST(AllocationCounter, SeesTheAllocationsOfTheLoadedPlugIn) {
    // Making the filter reads the service's properties and builds the parser: the module's
    // own allocations are counted too, or a count of 0 below would mean nothing.
    auto source = makeMadeUpSource("two-finger-scroll");
    const AllocationCount before = allocationCount();
    PerfDriver driver;
    std::string error;
    ASSERT_TRUE(driver.open(source->service(), &error)) << error;
    EXPECT_GT(allocationCount().allocations - before.allocations, 20u);
}

TEST_F(TwoFingerScroll, ScrollsOnAlmostEveryFrame) {
    // The case under test is a real scroll: a pointer event carrying the hand and a scroll
    // event. The hand moves 0.7 surface units a frame and turns every 36 frames, so only
    // frames around a turn may pass without a scroll event.
    int scrolling = 0;
    for (int i = 0; i < 360; ++i) {
        HIDEventRef result = driver_.filterEvent(nextFrame());
        ASSERT_NE(result, nullptr);
        ASSERT_EQ(result->type(), kHIDEventTypePointer);
        if (hasScrollChild(*result)) ++scrolling;
    }
    EXPECT_GE(scrolling, 300);
}

TEST_F(TwoFingerScroll, EventEntryAllocatesNothingOnceWarm) {
    uint64_t allocations = 0;
    for (int i = 0; i < 2000; ++i) {
        HIDEventRef frame = nextFrame();  // made outside the count
        const AllocationCount before = allocationCount();
        HIDEventRef result = driver_.filterEvent(frame);
        const AllocationCount after = allocationCount();
        allocations += after.allocations - before.allocations;
        ASSERT_NE(result, nullptr);
    }
    EXPECT_EQ(allocations, 0u);
}

TEST_F(TwoFingerScroll, MakingAndDroppingTheEventsOfAFrameAllocatesNothingOnceWarm) {
    // Frames made and results dropped inside the count this time: the pool takes them back.
    const AllocationCount before = allocationCount();
    for (int i = 0; i < 2000; ++i) {
        HIDEventRef result = driver_.filterEvent(nextFrame());
        ASSERT_NE(result, nullptr);
    }
    EXPECT_EQ(allocationCount().allocations - before.allocations, 0u);
}

TEST_F(TwoFingerScroll, PoolStopsGrowingOnceWarm) {
    // Memory stays flat: 50,000 more frames make no new event object or count block.
    const HIDEventPool::Statistics warm = HIDEventPool::statistics();
    for (int i = 0; i < 50000; ++i) driver_.filterEvent(nextFrame());
    const HIDEventPool::Statistics later = HIDEventPool::statistics();
    EXPECT_EQ(later.created, warm.created);
    EXPECT_EQ(later.blocksCreated, warm.blocksCreated);
}

}  // namespace
}  // namespace orvane::perf
