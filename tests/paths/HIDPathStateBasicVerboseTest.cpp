// Runs as an internal build: the path table's per-frame diagnostics on the verbose handle.

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "filter/FilterLogging.h"
#include "paths/HIDPathStateBasic.h"
#include "platform/Logging.h"

using namespace orvane;

namespace {

constexpr float kWidth = 1024.0f;
constexpr float kHeight = 512.0f;
const std::string kSig = "-[HIDPathStateBasic countFingersOnDivingButton]";

HIDParserPath& place(HIDPathStateBasic& table, int slot, float x, float y, int tip = 1, int confidence = 1) {
    HIDParserPath& path = *table.getParserPath(slot);
    HIDContact c{};
    c.fingerTipSwitch = tip;
    c.fingerConfidence = confidence;
    c.path_id = slot;
    c.finger_id = slot + 1;
    c.position = HIDPoint{x, y};
    path.setCurrentContact(c);
    return path;
}

class HIDPathStateBasicVerbose : public testing::Test {
protected:
    void SetUp() override {
        sink = std::make_shared<CaptureLogSink>();
        Logging::setSink(sink);
    }
    void TearDown() override {
        Logging::setDebugEnabled(false);
        Logging::setSink(std::make_shared<StandardErrorLogSink>());
    }
    std::shared_ptr<CaptureLogSink> sink;
};

}  // namespace

TEST_F(HIDPathStateBasicVerbose, RunsAsInternalBuild) { EXPECT_TRUE(_isInternalBuild()); }

TEST_F(HIDPathStateBasicVerbose, SilentWithoutDebugLevel) {
    Logging::setDebugEnabled(false);
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 512, 320);
    table.countFingersOnDivingButton();
    EXPECT_TRUE(sink->entries().empty());
}

TEST_F(HIDPathStateBasicVerbose, OneFingerLogsItsTestsScoreAndTheResult) {
    Logging::setDebugEnabled(true);
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 1, 512, 320);
    table.countFingersOnDivingButton();
    const std::vector<std::string> expected = {
        kSig + " [parserPath isEdgeContact] 0 _numNonEdgeTouches 1 [parserPath isTouching] 1 "
               "[parserPath isFingerOrRestingContact ] 1",
        kSig + " in here bottom_most_pidx 0 peakdisplacement 0.000000 ypos_plus 320.000000 "
               "bottom_most_y_mm-100000.000000",
        kSig + " _numFingersOnDivingButton 1 _numEdgeTouchesOnDivingButton 0",
    };
    EXPECT_EQ(sink->messages(), expected);
    for (const auto& e : sink->entries()) {
        EXPECT_EQ(e.category, "ServiceFilterVerbose");
        EXPECT_EQ(e.level, LogLevel::Debug);
    }
}

TEST_F(HIDPathStateBasicVerbose, EveryFoundPathIsLoggedAndOnlyScoredPathsGetTheScoreLine) {
    Logging::setDebugEnabled(true);
    HIDPathStateBasic table(kHeight, kWidth);
    place(table, 2, 100, 300);  // touching edge finger
    place(table, 3, 500, 270).setPeakDisplacement(2.5f);
    place(table, 5, 500, 480, 1, 0);  // palm in the bottom band, one non-edge finger: takes part
    place(table, 7, 600, 300, 0);     // lifted
    table.countFingersOnDivingButton();
    // Scores: path 2: 300; path 3: 270 − 2.5 = 267.5; path 5: 480. Best after each: 2, 2, 5.
    // Path 5 is on the button and an edge contact; path 2 (second, 300) is 180 above: count 1.
    const std::vector<std::string> expected = {
        kSig + " [parserPath isEdgeContact] 1 _numNonEdgeTouches 1 [parserPath isTouching] 1 "
               "[parserPath isFingerOrRestingContact ] 1",
        kSig + " in here bottom_most_pidx 0 peakdisplacement 0.000000 ypos_plus 300.000000 "
               "bottom_most_y_mm-100000.000000",
        kSig + " [parserPath isEdgeContact] 0 _numNonEdgeTouches 1 [parserPath isTouching] 1 "
               "[parserPath isFingerOrRestingContact ] 1",
        kSig + " in here bottom_most_pidx 2 peakdisplacement 2.500000 ypos_plus 267.500000 "
               "bottom_most_y_mm300.000000",
        kSig + " [parserPath isEdgeContact] 1 _numNonEdgeTouches 1 [parserPath isTouching] 1 "
               "[parserPath isFingerOrRestingContact ] 0",
        kSig + " in here bottom_most_pidx 2 peakdisplacement 0.000000 ypos_plus 480.000000 "
               "bottom_most_y_mm300.000000",
        kSig + " [parserPath isEdgeContact] 0 _numNonEdgeTouches 1 [parserPath isTouching] 0 "
               "[parserPath isFingerOrRestingContact ] 1",
        kSig + " _numFingersOnDivingButton 1 _numEdgeTouchesOnDivingButton 1",
    };
    EXPECT_EQ(sink->messages(), expected);
    EXPECT_EQ(table.bottomDivingPathIndex(), 5);
}
