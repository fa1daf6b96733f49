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

namespace {

// A frame of two fingers touching, side by side, `step` frames into a movement upward.
HIDEventRef twoFingerFrame(int step) {
    const uint64_t time = 1000000 + static_cast<uint64_t>(step) * 8000000;
    auto frame = HIDEvent::create(kHIDEventTypeDigitizer, time);
    frame->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    for (int finger = 0; finger < 2; ++finger) {
        auto contact = HIDEvent::create(kHIDEventTypeDigitizer, time);
        contact->setIntegerValue(finger, kHIDEventFieldDigitizerIndex);
        contact->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
        contact->setIntegerValue(1, kHIDEventFieldDigitizerRange);
        contact->setDoubleValue(0.4 + 0.2 * finger, kHIDEventFieldDigitizerX);
        contact->setDoubleValue(0.6 - 0.01 * step, kHIDEventFieldDigitizerY);
        frame->appendEvent(contact);
    }
    return frame;
}

// How many captured lines a method wrote.
size_t linesOf(const LogCapture& logs, const std::string& method) {
    size_t n = 0;
    for (const auto& m : logs.messages()) n += m.rfind(method + " ", 0) == 0 ? 1 : 0;
    return n;
}

}  // namespace

// Each stage keeps its own copy of the diagnostics flag for the frame; on an internal build
// the copies leave every per-frame line to the log level, frame after frame, and the lines
// come and go with it.
TEST(InternalBuild, EveryStageWritesItsFrameLinesWhileDebugIsEnabled) {
    LogCapture logs;
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    const char* methods[] = {
        "-[HIDParserPath filterContactForScreenUI:]",      "-[HIDParserPath setPeakDisplacement]",
        "-[HIDPathStateBasic countFingersOnDivingButton]", "-[HIDPathStates updateButtonState:]",
        "-[HIDHandMotion accumulateHandMotion]",           "-[HIDHandMotion printExtractedMotion:]"};
    for (int step = 0; step < 6; ++step) {
        const bool debug = step % 3 != 2;
        Logging::setDebugEnabled(debug);
        logs.clear();
        filter->filterEvent(twoFingerFrame(step));
        for (const char* method : methods) {
            if (debug) {
                EXPECT_GT(linesOf(logs, method), 0u) << method << " on frame " << step;
            } else {
                EXPECT_EQ(linesOf(logs, method), 0u) << method << " on frame " << step;
            }
        }
    }
    Logging::setDebugEnabled(false);
}

// A stage's copy of the flag, taken while the diagnostics may be on, passes the test on to the
// log level.
TEST(InternalBuild, AStagesCopyOfTheDiagnosticsFlagLeavesTheTestToTheLogLevel) {
    FrameDiagnostics copy;
    Logging::setDebugEnabled(true);
    EXPECT_TRUE(copy.verboseDebugEnabled());
    copy.takeCopy();
    EXPECT_TRUE(copy.verboseDebugEnabled());
    Logging::setDebugEnabled(false);
    EXPECT_FALSE(copy.verboseDebugEnabled());
}
