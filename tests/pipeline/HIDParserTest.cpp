// The per-frame pipeline's own rules: settings, the frame clock it drives and the copy of
// the engaged-in-gesture flag at the end of every frame.

#include <gtest/gtest.h>

#include <memory>
#include <vector>

#include "paths/HIDPathStates.h"
#include "pipeline/HIDParser.h"
#include "stats/HIDHandStatistics.h"
#include "tests/support/FrameBuilder.h"

using namespace orvane;
using orvane::test::ContactFields;
using orvane::test::contactEvent;
using orvane::test::frameEvent;
using orvane::test::TestClock;

namespace {

HIDEventRef emptyFrame(uint64_t t) { return frameEvent(t, {}); }

}  // namespace

TEST(HIDParser, NewParserHasBothTapSettingsFalse) {
    HIDParser parser(nullptr, 512.0f, 1024.0f);
    EXPECT_FALSE(parser.tapToClickEnabled());
    EXPECT_FALSE(parser.twoFingersSecondaryClickEnabled());
    parser.setTapToClickEnabled(true);
    EXPECT_TRUE(parser.tapToClickEnabled());
    EXPECT_FALSE(parser.twoFingersSecondaryClickEnabled());
}

TEST(HIDParser, NewParserMakesAllStagesAndPassesHeightThenWidthToThePaths) {
    int sent = 0;
    HIDParser parser([&sent](const HIDEventRef&) { ++sent; }, 300.0f, 700.0f);
    ASSERT_NE(parser.pathStates(), nullptr);
    EXPECT_NE(parser.handStats(), nullptr);
    EXPECT_NE(parser.handMotionExtractor(), nullptr);
    EXPECT_NE(parser.gestureParser(), nullptr);
    ASSERT_EQ(parser.pathStates()->paths().size(), 15u);
    EXPECT_EQ(parser.pathStates()->getParserPath(1)->surfaceDimensions().x, 700.0f);
    EXPECT_EQ(parser.pathStates()->getParserPath(1)->surfaceDimensions().y, 300.0f);
    ASSERT_TRUE(parser.dispatchHandler());
    parser.dispatchHandler()(nullptr);
    EXPECT_EQ(sent, 1);
}

TEST(HIDParser, FirstFrameIntervalIsItsOwnTimeAndSecondIsTheDifference) {
    HIDParser parser(nullptr, 512.0f, 1024.0f);
    const double t1 = static_cast<double>(TestClock::msToTicks(1000.0));
    const double t2 = static_cast<double>(TestClock::msToTicks(1008.0));
    parser.handleContactFrame(t1, emptyFrame(static_cast<uint64_t>(t1)));
    EXPECT_EQ(parser.pathStates()->frameInterval(), t1);
    parser.handleContactFrame(t2, emptyFrame(static_cast<uint64_t>(t2)));
    EXPECT_EQ(parser.pathStates()->currentTimestamp(), t2);
    EXPECT_EQ(parser.pathStates()->frameInterval(), t2 - t1);
}

TEST(HIDParser, FrameTimeComesFromTheArgumentNotTheEvent) {
    HIDParser parser(nullptr, 512.0f, 1024.0f);
    parser.handleContactFrame(5000.0, emptyFrame(123));
    EXPECT_EQ(parser.pathStates()->currentTimestamp(), 5000.0);
}

TEST(HIDParser, FirstStepUnpacksTheFrameIntoThePathTable) {
    HIDParser parser(nullptr, 512.0f, 1024.0f);
    ContactFields c;
    c.index = 2;
    c.x = 0.25;
    c.y = 0.5;
    parser.handleContactFrame(7.0, frameEvent(7, {contactEvent(c, 7)}));
    HIDParserPath* path = parser.pathStates()->getParserPathforPathID(3);
    ASSERT_EQ(path, parser.pathStates()->getParserPath(3));
    EXPECT_EQ(path->currentContact().position.x, 256.0f);
    EXPECT_EQ(path->currentContact().position.y, 256.0f);
    EXPECT_EQ(path->currentContact().device_timestamp, 7.0);
    EXPECT_EQ(parser.pathStates()->numTouches(), 1);
}

TEST(HIDParser, GestureStageReturningNoneGivesNoneAndEngagedFlagIsStillCopied) {
    // Two frames without contacts: the second is the gesture stage's "nothing to report" case.
    // The path table's flag is preset to each value in turn, so that whatever the statistics
    // end the frame with, one of the two parsers would show a missing copy.
    for (bool preset : {false, true}) {
        SCOPED_TRACE(preset);
        HIDParser parser(nullptr, 512.0f, 1024.0f);
        parser.handleContactFrame(1000.0, emptyFrame(1000));
        parser.pathStates()->setEngagedinGesture(preset);
        parser.handStats()->setEngagedinGesture(!preset);
        HIDEventRef result = parser.handleContactFrame(2000.0, emptyFrame(2000));
        EXPECT_EQ(result, nullptr);
        EXPECT_EQ(parser.pathStates()->engagedinGesture(), parser.handStats()->engagedinGesture());
    }
}
