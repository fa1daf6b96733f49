// Runs as an internal build: the device-information library answers InternalBuild true.

#include <gtest/gtest.h>

#include "FilterTestSupport.h"
#include "filter/FilterLogging.h"

using namespace orvane;
using namespace orvane::test;

TEST(InternalBuild, TheDeviceInformationLibraryAnswersTrue) { EXPECT_TRUE(_isInternalBuild()); }

TEST(InternalBuild, VerboseLinesNeedDebugEnabled) {
    LogCapture logs;
    Logging::setDebugEnabled(false);
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    logs.clear();
    filter->filterEvent(HIDEvent::create(kHIDEventTypeKeyboard, 1));
    EXPECT_TRUE(logs.messages().empty());
}

TEST(InternalBuild, FilterEventLogsTheEventAndItsChildren) {
    LogCapture logs;
    Logging::setDebugEnabled(true);
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    logs.clear();
    auto keyboard = HIDEvent::create(kHIDEventTypeKeyboard, 1);
    filter->filterEvent(keyboard);
    Logging::setDebugEnabled(false);
    ASSERT_EQ(logs.entries().size(), 1u);
    EXPECT_EQ(logs.entries()[0].category, "ServiceFilterVerbose");
    EXPECT_EQ(logs.entries()[0].level, LogLevel::Debug);
    EXPECT_EQ(logs.messages()[0],
              "-[OrvaneServiceFilter filterEvent:] " + keyboard->description() + ", childrens: (null)");
}

TEST(InternalBuild, TheDispatchHandlerLogsWhatItSends) {
    LogCapture logs;
    Logging::setDebugEnabled(true);
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    auto dispatcher = std::make_shared<RecordingDispatcher>();
    filter->setEventDispatcher(dispatcher);
    auto pointer = HIDEvent::pointerEvent(1, 0, 0, 0, 1, 0);
    logs.clear();
    filter->parser()->dispatchHandler()(pointer);
    Logging::setDebugEnabled(false);
    ASSERT_EQ(dispatcher->events.size(), 1u);
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter initWithService:]_block_invoke " + pointer->description()));
}

TEST(InternalBuild, FilterEventMatchingLogsAtDebug) {
    LogCapture logs;
    Logging::setDebugEnabled(true);
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    logs.clear();
    auto e = HIDEvent::create(kHIDEventTypeKeyboard, 1);
    filter->filterEventMatching({{"k", int64_t{2}}}, e, std::make_shared<HIDConnection>(4));
    Logging::setDebugEnabled(false);
    EXPECT_TRUE(logs.contains("-[OrvaneServiceFilter filterEventMatching:event:forClient:] { k = 2; }, event: " +
                              e->description() + ", client: <HIDConnection 4>"));
}
