#include <gtest/gtest.h>

#include <cmath>

#include "FilterTestSupport.h"
#include "filter/FilterLogging.h"
#include "paths/HIDPathStates.h"
#include "platform/DispatchQueue.h"
#include "platform/PlugInBundle.h"

using namespace orvane;
using namespace orvane::test;

namespace {
const char* kMatchSig = "+[OrvaneServiceFilter matchService:options:score:]";
const char* kInitSig = "-[OrvaneServiceFilter initWithService:]";
}  // namespace

TEST(Matching, TrackpadOfAKeyboardCoverMatchesWithScore500) {
    int64_t score = 7;
    EXPECT_TRUE(OrvaneServiceFilter::matchService(trackpadService(), {}, &score));
    EXPECT_EQ(score, 500);
}

TEST(Matching, WithoutTheKeyboardUsageTheScoreKeepsItsValue) {
    auto service = std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}, {13, 34}}, PropertyDictionary{});
    int64_t score = 123;
    EXPECT_FALSE(OrvaneServiceFilter::matchService(service, {}, &score));
    EXPECT_EQ(score, 123);
}

TEST(Matching, EachUsageIsRequired) {
    const std::vector<std::vector<HIDUsagePair>> missingOne = {
        {{13, 34}, {1, 6}}, {{13, 5}, {1, 6}}, {{13, 5}, {13, 34}}};
    for (const auto& pairs : missingOne) {
        int64_t score = 0;
        EXPECT_FALSE(OrvaneServiceFilter::matchService(std::make_shared<HIDEventService>(pairs, PropertyDictionary{}),
                                                       {}, &score));
        EXPECT_EQ(score, 0);
    }
}

TEST(Matching, LogsTheServiceOptionsAndResult) {
    LogCapture logs;
    auto service = trackpadService();
    int64_t score = 0;
    OrvaneServiceFilter::matchService(service, {{"k", int64_t{1}}}, &score);
    auto service2 = std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}}, PropertyDictionary{});
    int64_t score2 = 0;
    OrvaneServiceFilter::matchService(service2, {}, &score2);
    const auto m = logs.messages();
    ASSERT_EQ(m.size(), 4u);
    EXPECT_EQ(m[0], std::string(kMatchSig) + " " + service->description() + ", options: { k = 1; }");
    EXPECT_EQ(m[1], std::string(kMatchSig) + " matched?: YES, score: 500");
    EXPECT_EQ(m[2], std::string(kMatchSig) + " " + service2->description() + ", options: {}");
    EXPECT_EQ(m[3], std::string(kMatchSig) + " matched?: NO, score: 0");
}

TEST(Construction, ReadsDimensionsAndCreatesTheParserHeightFirst) {
    LogCapture logs;
    auto filter = OrvaneServiceFilter::initWithService(trackpadService(655360, 327680));
    ASSERT_NE(filter, nullptr);
    // 655360 / 65536 = 10.0 wide, 327680 / 65536 = 5.0 high; the parser gets 10 × each.
    EXPECT_TRUE(logs.contains(std::string(kInitSig) + " Trackpad dimensions: 10.000000 x 5.000000"));
    ASSERT_NE(filter->parser(), nullptr);
    HIDParserPath* path = filter->parser()->pathStates()->getParserPath(1);
    ASSERT_NE(path, nullptr);
    EXPECT_EQ(path->surfaceDimensions().x, 100.0f);  // width
    EXPECT_EQ(path->surfaceDimensions().y, 50.0f);   // height
    EXPECT_FALSE(filter->parser()->tapToClickEnabled());
}

TEST(Construction, RefusesATrackpadWithoutSurfaceDimensions) {
    LogCapture logs;
    auto service = std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}, {13, 34}, {1, 6}},
                                                     PropertyDictionary{});
    EXPECT_EQ(OrvaneServiceFilter::initWithService(service), nullptr);
    bool found = false;
    for (const auto& e : logs.entries()) {
        if (e.message == std::string(kInitSig) + " I don't know the physical dimensions of this trackpad") {
            found = true;
            EXPECT_EQ(e.level, LogLevel::Error);
            EXPECT_EQ(e.category, "ServiceFilter");
        }
    }
    EXPECT_TRUE(found);
}

TEST(Construction, SurfaceDimensionsThatAreNotADictionaryCountAsAbsent) {
    auto service = std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}, {13, 34}, {1, 6}},
                                                     PropertyDictionary{{"SurfaceDimensions", int64_t{5}}});
    EXPECT_EQ(OrvaneServiceFilter::initWithService(service), nullptr);
}

TEST(Construction, TheThirtyTwoBitMinimumMeansAnUnknownDimension) {
    LogCapture logs;
    auto filter = OrvaneServiceFilter::initWithService(trackpadService(INT32_MIN, 327680));
    ASSERT_NE(filter, nullptr);
    EXPECT_TRUE(logs.contains(std::string(kInitSig) + " Trackpad dimensions: nan x 5.000000") ||
                logs.contains(std::string(kInitSig) + " Trackpad dimensions: -nan x 5.000000"));
    EXPECT_TRUE(std::isnan(filter->parser()->pathStates()->getParserPath(1)->surfaceDimensions().x));
}

TEST(Construction, BluetoothTransportMakesTheDeviceWireless) {
    LogCapture logs;
    auto wireless = OrvaneServiceFilter::initWithService(trackpadService(655360, 327680, "Bluetooth Low Energy"));
    auto wired = OrvaneServiceFilter::initWithService(trackpadService(655360, 327680, "USB"));
    auto unknown = OrvaneServiceFilter::initWithService(trackpadService(655360, 327680, nullptr));
    EXPECT_TRUE(wireless->isWireless());
    EXPECT_FALSE(wired->isWireless());
    EXPECT_FALSE(unknown->isWireless());
    EXPECT_TRUE(logs.contains(std::string(kInitSig) + " Device is wireless? yes (transport: Bluetooth Low Energy)"));
    EXPECT_TRUE(logs.contains(std::string(kInitSig) + " Device is wireless? no (transport: USB)"));
    EXPECT_TRUE(logs.contains(std::string(kInitSig) + " Device is wireless? no (transport: (null))"));
}

TEST(Construction, ReadsTheBundlesAccelerationSettings) {
    PlugInBundle::setInfoDictionary(kOrvaneBundleIdentifier,
                                    {{"Acceleration", PropertyDictionary{{"PointerAcceleration", 1.5}}}});
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    PlugInBundle::setInfoDictionary(kOrvaneBundleIdentifier, {});
    ASSERT_TRUE(filter->accelSettings().isDictionary());
    EXPECT_EQ(filter->accelSettings().find("PointerAcceleration")->doubleValue(), 1.5);
    auto without = OrvaneServiceFilter::initWithService(trackpadService());
    EXPECT_TRUE(without->accelSettings().isNone());
}

TEST(Construction, StartsUnanchoredAndInactive) {
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    EXPECT_EQ(filter->lastDeviceTstamp(), 0u);
    EXPECT_EQ(filter->lastTscan(), 0);
    EXPECT_FALSE(filter->activated());
    EXPECT_FALSE(filter->clientAdded());
}

TEST(Lifecycle, DescriptionIsAlwaysTheClassName) {
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    EXPECT_EQ(filter->description(), "OrvaneServiceFilter");
    filter->activate();
    filter->clientNotification(std::make_shared<HIDConnection>(3), true);
    EXPECT_EQ(filter->description(), "OrvaneServiceFilter");
}

TEST(Lifecycle, ActivateSetsTheFlagAndLogs) {
    LogCapture logs;
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    filter->activate();
    EXPECT_TRUE(filter->activated());
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter activate] Entered"));
}

TEST(Lifecycle, ClientNotificationKeepsTheAddedClientWeakly) {
    LogCapture logs;
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    auto client = std::make_shared<HIDConnection>(3);
    filter->clientNotification(client, true);
    EXPECT_TRUE(filter->clientAdded());
    EXPECT_EQ(filter->client(), client);
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter clientNotification:added:] <HIDConnection 3>, added: 1"));
    filter->clientNotification(client, false);
    EXPECT_FALSE(filter->clientAdded());
    EXPECT_EQ(filter->client(), nullptr);
    filter->clientNotification(client, true);
    client.reset();
    EXPECT_EQ(filter->client(), nullptr);
}

TEST(Lifecycle, SetEventDispatcherLogsItAndHoldsItWeakly) {
    LogCapture logs;
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    auto dispatcher = std::make_shared<RecordingDispatcher>();
    filter->setEventDispatcher(dispatcher);
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter setEventDispatcher:] <RecordingDispatcher>"));
    EXPECT_EQ(filter->dispatcher(), dispatcher);
    dispatcher.reset();
    EXPECT_EQ(filter->dispatcher(), nullptr);
}

TEST(Lifecycle, CancelReturnsAtOnceAndRunsTheHandlerOnceOnTheQueue) {
    LogCapture logs;
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    auto queue = std::make_shared<DispatchQueue>("service");
    int calls = 0;
    filter->setDispatchQueue(queue);
    filter->setCancelHandler([&] { ++calls; });
    filter->cancel();
    EXPECT_EQ(calls, 0);  // deferred to the queue
    EXPECT_EQ(queue->pending(), 1u);
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter cancel] Entered"));
    queue->drain();
    EXPECT_EQ(calls, 1);
    EXPECT_FALSE(filter->hasCancelHandler());  // dropped after the call
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter cancel]_block_invoke Calling cancel handler"));
    filter->cancel();
    queue->drain();
    EXPECT_EQ(calls, 1);
}

TEST(Lifecycle, TheQueuedCancelKeepsTheFilterAliveUntilItRuns) {
    LogCapture logs;
    auto queue = std::make_shared<DispatchQueue>("service");
    bool called = false;
    {
        auto filter = OrvaneServiceFilter::initWithService(trackpadService());
        filter->setDispatchQueue(queue);
        filter->setCancelHandler([&] { called = true; });
        filter->cancel();
    }
    EXPECT_FALSE(logs.contains("-[OrvaneServiceFilter dealloc] Entered"));
    queue->drain();
    EXPECT_TRUE(called);
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter dealloc] Entered"));
}

TEST(DispatchHandler, ForwardsToTheDispatcher) {
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    auto dispatcher = std::make_shared<RecordingDispatcher>();
    filter->setEventDispatcher(dispatcher);
    filter->parser()->dispatchHandler()(HIDEvent::pointerEvent(1, 0, 0, 0, 1, 0));
    ASSERT_EQ(dispatcher->events.size(), 1u);
    EXPECT_EQ(dispatcher->events[0]->type(), kHIDEventTypePointer);
}

TEST(DispatchHandler, DoesNothingWithoutADispatcher) {
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    HIDDispatchHandler handler = filter->parser()->dispatchHandler();
    handler(HIDEvent::pointerEvent(1, 0, 0, 0, 1, 0));  // none set yet: dropped, not kept for later
    auto gone = std::make_shared<RecordingDispatcher>();
    filter->setEventDispatcher(gone);
    gone.reset();  // held weakly: gone
    handler(HIDEvent::pointerEvent(2, 0, 0, 0, 1, 0));
    auto dispatcher = std::make_shared<RecordingDispatcher>();
    filter->setEventDispatcher(dispatcher);
    handler(HIDEvent::pointerEvent(3, 0, 0, 0, 1, 0));
    ASSERT_EQ(dispatcher->events.size(), 1u);
    EXPECT_EQ(dispatcher->events[0]->timestamp(), 3u);
}

TEST(DispatchHandler, DoesNothingOnceTheFilterIsGone) {
    auto dispatcher = std::make_shared<RecordingDispatcher>();
    HIDDispatchHandler handler;
    {
        auto filter = OrvaneServiceFilter::initWithService(trackpadService());
        filter->setEventDispatcher(dispatcher);
        handler = filter->parser()->dispatchHandler();
    }
    handler(HIDEvent::pointerEvent(1, 0, 0, 0, 1, 0));
    EXPECT_TRUE(dispatcher->events.empty());
}

TEST(Lifecycle, DestructionLogsEntered) {
    LogCapture logs;
    { auto filter = OrvaneServiceFilter::initWithService(trackpadService()); }
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter dealloc] Entered"));
}

TEST(Logging, HandlesAreMadeOnceWithTheirCategories) {
    EXPECT_EQ(LoggingServiceFilter(), LoggingServiceFilter());
    EXPECT_EQ(LoggingServiceFilter()->category(), "ServiceFilter");
    EXPECT_EQ(LoggingServiceFilterVerbose()->category(), "ServiceFilterVerbose");
    EXPECT_EQ(LoggingServiceFilter()->subsystem(), LoggingServiceFilterVerbose()->subsystem());
}

TEST(Logging, APlainBuildIsNotInternal) { EXPECT_FALSE(_isInternalBuild()); }

TEST(Version, NumberAndTextAreExported) {
    EXPECT_EQ(OrvaneServiceFilterVersionNumber, 27.0);
    EXPECT_STREQ(reinterpret_cast<const char*>(OrvaneServiceFilterVersionString),
                 "@(#)PROGRAM:OrvaneServiceFilter  PROJECT:Orvane-27\n");
}

// Not an internal build: a stage's copy of the diagnostics flag says no whatever the log
// level, whether it was taken before or after the flag learnt the build's kind.
TEST(Diagnostics, OnAPublicBuildAStagesCopyOfTheFlagSaysNo) {
    Logging::setDebugEnabled(true);
    FrameDiagnostics before;
    EXPECT_FALSE(before.verboseDebugEnabled());
    FrameDiagnostics after;
    after.takeCopy();
    EXPECT_FALSE(after.verboseDebugEnabled());
    EXPECT_FALSE(before.verboseDebugEnabled());
    Logging::setDebugEnabled(false);
}
