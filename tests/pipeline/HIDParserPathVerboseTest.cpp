// Runs as an internal build: the finger path's per-frame diagnostics on the verbose handle.

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "filter/FilterLogging.h"
#include "pipeline/HIDParserPath.h"
#include "platform/Logging.h"
#include "tests/support/FrameBuilder.h"

using namespace orvane;
using orvane::test::ContactFields;
using orvane::test::contactEvent;

namespace {

constexpr float kWidth = 1024.0f;
constexpr float kHeight = 512.0f;

HIDEventRef contactAt(float x, float y, int touch = 1, int index = 0) {
    ContactFields c;
    c.index = index;
    c.x = static_cast<double>(x) / kWidth;
    c.y = 1.0 - static_cast<double>(y) / kHeight;
    c.touch = touch;
    return contactEvent(c, 0);
}

class HIDParserPathVerbose : public testing::Test {
protected:
    void SetUp() override {
        sink = std::make_shared<CaptureLogSink>();
        Logging::setSink(sink);
    }
    void TearDown() override {
        Logging::setDebugEnabled(false);
        Logging::setSink(std::make_shared<StandardErrorLogSink>());
    }
    void read(HIDParserPath& path, float x, float y, double t, int touch = 1, int index = 0) {
        path.updateCurPrevContactsWith(*contactAt(x, y, touch, index), t);
        path.filterContactForScreenUI(false);
    }
    std::shared_ptr<CaptureLogSink> sink;
};

}  // namespace

TEST_F(HIDParserPathVerbose, RunsAsInternalBuild) { EXPECT_TRUE(_isInternalBuild()); }

TEST_F(HIDParserPathVerbose, SilentWithoutDebugLevel) {
    Logging::setDebugEnabled(false);
    HIDParserPath path(kHeight, kWidth);
    read(path, 256, 128, 1.0);
    read(path, 260, 128, 2.0);
    EXPECT_TRUE(sink->entries().empty());
}

TEST_F(HIDParserPathVerbose, TouchDownLogsPeakDisplacementAndResetBranchPosition) {
    Logging::setDebugEnabled(true);
    HIDParserPath path(kHeight, kWidth);
    read(path, 256, 128, 1.0, 1, 2);
    const std::vector<std::string> expected = {
        "-[HIDParserPath setPeakDisplacement] initial position (256.000000, 128.000000) current (256.000000, "
        "128.000000)",
        "-[HIDParserPath filterContactForScreenUI:] Current position (256.000000,128.000000), Previous position "
        "(0.000000,0.000000) pixel delta (0.000000, 0.000000) path_id 3",
    };
    EXPECT_EQ(sink->messages(), expected);
    for (const auto& e : sink->entries()) {
        EXPECT_EQ(e.category, "ServiceFilterVerbose");
        EXPECT_EQ(e.level, LogLevel::Debug);
        EXPECT_EQ(e.subsystem, kOrvaneLogSubsystem);
    }
}

TEST_F(HIDParserPathVerbose, MovingFrameLogsHysteresisCentres) {
    HIDParserPath path(kHeight, kWidth);
    read(path, 256, 128, 1.0);
    Logging::setDebugEnabled(true);
    read(path, 260, 128, 2.0);
    // New centre x = 260 − 0.05f; floats near 260 are 2^−15 apart, so it rounds to 259.95001221; y holds.
    // Pixel delta x = 259.95001221 − 256 = 3.95001221.
    const std::vector<std::string> expected = {
        "-[HIDParserPath setPeakDisplacement] initial position (256.000000, 128.000000) current (260.000000, "
        "128.000000)",
        "-[HIDParserPath filterContactForScreenUI:] hysteresis center (259.950012,128.000000), "
        "pulled_hysteresis_center (256.000000,128.000000) path_id 1",
        "-[HIDParserPath filterContactForScreenUI:] Current position (259.950012,128.000000), Previous position "
        "(256.000000,128.000000) pixel delta (3.950012, 0.000000) path_id 1",
    };
    EXPECT_EQ(sink->messages(), expected);
}
