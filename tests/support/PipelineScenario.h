#pragma once
// A test fixture that sends a hand's frames through a whole pipeline, one frame every 8 ms.

#include <gtest/gtest.h>

#include "motion/HIDHandMotion.h"
#include "paths/HIDPathStates.h"
#include "pipeline/HIDParser.h"
#include "stats/HIDHandStatistics.h"
#include "tests/support/FrameBuilder.h"

namespace orvane::test {

class PipelineScenario : public ::testing::Test {
protected:
    static constexpr float kWidth = 1024.0f;
    static constexpr float kHeight = 512.0f;
    static constexpr double kFrameMs = 8.0;

    TestClock clock;
    Hand hand{kWidth, kHeight, clock};
    HIDParser parser{[](const HIDEventRef&) {}, kHeight, kWidth};
    HIDEventRef frame;      // the last frame sent, as the pipeline left it
    HIDEventRef result;     // what the pipeline returned for it
    double frameTime = 0.0;

    HIDPathStates& table() { return *parser.pathStates(); }
    const HIDHandStatistics& stats() { return *parser.handStats(); }
    const HIDHandMotion& motion() { return *parser.handMotionExtractor(); }
    HIDParserPath& path(int slot) { return *table().getParserPath(slot); }

    // Sends the hand's current frame, then moves the clock on by one frame.
    void send() {
        frame = hand.frame();
        frameTime = static_cast<double>(clock.ticks());
        result = parser.handleContactFrame(frameTime, frame);
        clock.advance(kFrameMs);
    }
};

}  // namespace orvane::test
