#include <gtest/gtest.h>

#include "platform/HIDEvent.h"
#include "platform/Logging.h"

using namespace orvane;

namespace {
struct Described {
    std::string description() const { return "<thing>"; }
};
}  // namespace

TEST(LogFormat, TakesPrintfConversionsWithLengthModifiers) {
    EXPECT_EQ(formatLogMessage("%s matched?: %@, score: %ld", {detail::makeLogArgument("-[X y]"),
                                                               detail::makeLogArgument("NO"),
                                                               detail::makeLogArgument(int64_t{0})}),
              "-[X y] matched?: NO, score: 0");
    EXPECT_EQ(formatLogMessage("%f x %f", {detail::makeLogArgument(10.0f), detail::makeLogArgument(5.0)}),
              "10.000000 x 5.000000");
    EXPECT_EQ(formatLogMessage("Mask (0x%x) %u %d%%", {detail::makeLogArgument(6u), detail::makeLogArgument(true),
                                                       detail::makeLogArgument(-3)}),
              "Mask (0x6) 1 -3%");
    EXPECT_EQ(formatLogMessage("%4.2fdx %5.3f", {detail::makeLogArgument(1.0f), detail::makeLogArgument(0.5)}),
              "1.00dx 0.500");
}

TEST(LogFormat, ObjectConversionTakesTheDescription) {
    auto e = HIDEvent::create(kHIDEventTypeKeyboard, 1);
    HIDEventRef none;
    EXPECT_EQ(formatLogMessage("%@ %@ %@", {detail::makeLogArgument(Described{}), detail::makeLogArgument(e),
                                           detail::makeLogArgument(none)}),
              "<thing> {type 3 ts 1 sender 0 phase 0} (null)");
}

TEST(LogFormat, MissingArgumentsLeaveTheConversionAsWritten) {
    EXPECT_EQ(formatLogMessage("%s and %d", {detail::makeLogArgument("a")}), "a and %d");
}

TEST(LogHandle, DebugIsOffUntilTurnedOn) {
    auto sink = std::make_shared<CaptureLogSink>();
    Logging::setSink(sink);
    LogHandle handle("org.orvane.test", "Cat");
    handle.log(LogLevel::Debug, "hidden");
    handle.log("shown %d", 1);
    handle.log(LogLevel::Error, "error");
    Logging::setDebugEnabled("Cat", true);
    handle.log(LogLevel::Debug, "now shown");
    Logging::setDebugEnabled(false);
    EXPECT_EQ(sink->messages(), (std::vector<std::string>{"shown 1", "error", "now shown"}));
    auto entries = sink->entries();
    EXPECT_EQ(entries[0].level, LogLevel::Default);
    EXPECT_EQ(entries[1].level, LogLevel::Error);
    EXPECT_EQ(entries[2].category, "Cat");
    EXPECT_EQ(entries[2].subsystem, "org.orvane.test");
    Logging::setSink(std::make_shared<StandardErrorLogSink>());
}

TEST(LogHandle, DebugCanBeEnabledPerCategory) {
    Logging::setDebugEnabled(false);
    Logging::setDebugEnabled("Verbose", true);
    EXPECT_TRUE(Logging::debugEnabled("Verbose"));
    EXPECT_FALSE(Logging::debugEnabled("Other"));
    Logging::setDebugEnabled(true);
    EXPECT_TRUE(Logging::debugEnabled("Other"));
    Logging::setDebugEnabled(false);
}
