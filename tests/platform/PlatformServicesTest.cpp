#include <gtest/gtest.h>

#include "platform/DispatchQueue.h"
#include "platform/HIDEventService.h"
#include "platform/PlugInBundle.h"
#include "platform/Timebase.h"
#include "platform/Trace.h"

using namespace orvane;

TEST(DispatchQueue, RunsWorkInOrderOnlyWhenDrained) {
    DispatchQueue q("test");
    std::vector<int> ran;
    q.async([&] { ran.push_back(1); });
    q.async([&] {
        ran.push_back(2);
        q.async([&] { ran.push_back(3); });  // queued while draining: runs in the same drain
    });
    EXPECT_TRUE(ran.empty());
    EXPECT_EQ(q.pending(), 2u);
    EXPECT_EQ(q.drain(), 3u);
    EXPECT_EQ(ran, (std::vector<int>{1, 2, 3}));
    EXPECT_EQ(q.drain(), 0u);
}

TEST(HIDEventService, ConformanceFollowsTheUsagePairsProperty) {
    HIDEventService s({{13, 5}, {13, 34}}, {});
    EXPECT_TRUE(s.conformsToUsagePage(13, 5));
    EXPECT_FALSE(s.conformsToUsagePage(1, 6));
    PropertyValue pairs = s.propertyForKey("DeviceUsagePairs");
    pairs.mutableArray().push_back(PropertyDictionary{{"DeviceUsagePage", int64_t{1}}, {"DeviceUsage", int64_t{6}}});
    ASSERT_TRUE(s.setPropertyForKey(pairs, "DeviceUsagePairs"));
    EXPECT_TRUE(s.conformsToUsagePage(1, 6));
}

TEST(HIDEventService, RefusedKeysAreNotWritten) {
    HIDEventService s({}, {{"KeyboardEnabled", int64_t{1}}});
    s.refuseProperty("KeyboardEnabled");
    EXPECT_FALSE(s.setPropertyForKey(int64_t{0}, "KeyboardEnabled"));
    EXPECT_EQ(s.propertyForKey("KeyboardEnabled").integerValue(), 1);
    EXPECT_TRUE(s.setPropertyForKey(int64_t{1}, "Other"));
    EXPECT_TRUE(s.propertyForKey("Absent").isNone());
}

TEST(PlugInBundle, AnswersRegisteredEntriesOnly) {
    PlugInBundle::setInfoDictionary("org.orvane.test", {{"Acceleration", PropertyDictionary{{"k", int64_t{1}}}}});
    EXPECT_TRUE(PlugInBundle::objectForInfoDictionaryKey("org.orvane.test", "Acceleration").isDictionary());
    EXPECT_TRUE(PlugInBundle::objectForInfoDictionaryKey("org.orvane.test", "Other").isNone());
    EXPECT_TRUE(PlugInBundle::objectForInfoDictionaryKey("org.orvane.none", "Acceleration").isNone());
}

TEST(Trace, PointsReachTheSink) {
    auto sink = std::make_shared<CaptureTraceSink>();
    Trace::setSink(sink);
    Trace::emit(0x2b150400, 1, 2, 3, 4);
    Trace::setSink(nullptr);
    Trace::emit(0x2b150404, 0, 0, 0, 0);
    ASSERT_EQ(sink->points().size(), 1u);
    EXPECT_EQ(sink->points()[0], (TracePoint{0x2b150400, 1, 2, 3, 4}));
}

TEST(Timebase, IsFixedOnceRead) {
    const TimebaseInfo first = Timebase::info();
    EXPECT_FALSE(Timebase::set(first.numer + 1, first.denom));
    EXPECT_EQ(Timebase::info().numer, first.numer);
    EXPECT_FALSE(Timebase::set(0, 1));
}
