#include "tools/formats/LogStreamSink.h"

#include <gtest/gtest.h>

#include <sstream>

#include "ToolTestSupport.h"

namespace orvane::formats {
namespace {

TEST(LogStreamSink, LinesBeforeTheFirstRecordHaveInputMinusOne) {
    std::ostringstream out;
    auto sink = std::make_shared<LogStreamSink>(out);
    Logging::setSink(sink);
    LogHandle handle("org.orvane.tests", "ServiceFilter");
    handle.log("%s Entered", "-[OrvaneServiceFilter activate]");
    Logging::setSink(std::make_shared<StandardErrorLogSink>());
    EXPECT_EQ(out.str(),
              "{\"input\": -1, \"category\": \"ServiceFilter\", \"level\": \"default\", \"message\": "
              "\"-[OrvaneServiceFilter activate] Entered\"}\n");
}

TEST(LogStreamSink, LinesCarryTheCurrentInputAndLevel) {
    std::ostringstream out;
    auto sink = std::make_shared<LogStreamSink>(out);
    Logging::setSink(sink);
    Logging::setDebugEnabled(true);
    LogHandle normal("org.orvane.tests", "ServiceFilter");
    LogHandle verbose("org.orvane.tests", "ServiceFilterVerbose");
    sink->setInput(3);
    normal.log(LogLevel::Error, "%s I don't know", "x");
    sink->setInput(4);
    verbose.log(LogLevel::Debug, "width %f \"quoted\"\n", 10.0);
    Logging::setDebugEnabled(false);
    Logging::setSink(std::make_shared<StandardErrorLogSink>());
    EXPECT_EQ(out.str(),
              "{\"input\": 3, \"category\": \"ServiceFilter\", \"level\": \"error\", \"message\": \"x I don't "
              "know\"}\n"
              "{\"input\": 4, \"category\": \"ServiceFilterVerbose\", \"level\": \"debug\", \"message\": \"width "
              "10.000000 \\\"quoted\\\"\\n\"}\n");
    EXPECT_EQ(sink->linesWritten(), 2u);
}

TEST(LogStreamSink, LinesTheLevelHoldsBackAreNotWritten) {
    std::ostringstream out;
    auto sink = std::make_shared<LogStreamSink>(out);
    Logging::setSink(sink);
    Logging::setDebugEnabled(false);
    LogHandle handle("org.orvane.tests", "ServiceFilterVerbose");
    handle.log(LogLevel::Debug, "not shown");
    Logging::setSink(std::make_shared<StandardErrorLogSink>());
    EXPECT_EQ(out.str(), "");
}

}  // namespace
}  // namespace orvane::formats
