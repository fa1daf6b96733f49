// The path table's per-frame diagnostics on an internal build with debug logging on.

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "paths/HIDPathStates.h"
#include "platform/Logging.h"
#include "tests/support/FrameBuilder.h"

using namespace orvane;
using orvane::test::ContactFields;
using orvane::test::contactEvent;
using orvane::test::frameEvent;

namespace {

HIDParserPath* place(HIDPathStates& table, int slot, float x, float y, double tMake) {
    HIDParserPath* path = table.getParserPath(slot);
    HIDContact c{};
    c.fingerTipSwitch = 1;
    c.fingerConfidence = 1;
    c.path_id = slot;
    c.finger_id = slot + 1;
    c.position = {x, y};
    path->setCurrentContact(c);
    path->setPreviousContact(c);
    HIDPathTimestamps t{};
    t.t_makeTouch = tMake;
    path->setTimestamps(t);
    return path;
}

HIDEventRef child(int32_t index, double x, double y, int32_t eventMask) {
    ContactFields c;
    c.index = index;
    c.x = x;
    c.y = y;
    c.eventMask = eventMask;
    return contactEvent(c, 1);
}

class HIDPathStatesVerbose : public ::testing::Test {
protected:
    void SetUp() override {
        Logging::setSink(sink);
        Logging::setDebugEnabled(true);
    }
    void TearDown() override {
        Logging::setDebugEnabled(false);
        Logging::setSink(std::make_shared<StandardErrorLogSink>());
    }
    // The messages of the path table's own diagnostics, in order.
    std::vector<std::string> ownMessages() const {
        std::vector<std::string> out;
        for (const auto& e : sink->entries()) {
            if (e.message.rfind("-[HIDPathStates ", 0) == 0 || e.message.rfind("getCosineThetas ", 0) == 0) {
                EXPECT_EQ(e.category, "ServiceFilterVerbose");
                EXPECT_EQ(e.level, LogLevel::Debug);
                out.push_back(e.message);
            }
        }
        return out;
    }

    std::shared_ptr<CaptureLogSink> sink = std::make_shared<CaptureLogSink>();
};

}  // namespace

TEST_F(HIDPathStatesVerbose, FrameWithARestingThumbTellsEveryStep) {
    HIDPathStates table(600.0f, 1000.0f);
    HIDParserPath* thumb = place(table, 1, 300, 500, 100);  // in the rest zone (≥ 270)
    HIDParserPath* finger = place(table, 2, 600, 450, 100);
    thumb->setDampedSpeed(1.0f);
    thumb->setDampedVelocity({1, 0});
    finger->setDampedSpeed(2.0f);
    finger->setDampedVelocity({0, 2});
    table.setCurrentTimestamp(200);
    table.setBottomDivingPathIndex(1);
    table.setNumNonEdgeTouches(2);
    table.setNumTouches(2);
    table.setNumFingersOnDivingButton(1);

    auto frame = frameEvent(1, {child(0, 0.3, 1.0 / 6.0, 0x4), child(1, 0.6, 0.25, 0x4)});
    table.updateButtonState(frame);
    table.postFilteringTasks(frame);

    const std::vector<std::string> expected{
        "-[HIDPathStates updateButtonState:] _previous button state 0 ",
        "-[HIDPathStates checkForRestingThumb] possibly diving path 1",
        "-[HIDPathStates checkForRestingThumb] RESTING THUMB divingpathID 1",
        "-[HIDPathStates postFilteringTasks:] restingthumexists 1 divingpathID 1 pathID 1 isRestingthumbinzone 1",
        "-[HIDPathStates postFilteringTasks:] restingthumexists 1 divingpathID 1 pathID 2 isRestingthumbinzone 0",
        // Path 1 against path 2, then path 2 against path 1.
        "getCosineThetas vel_inner (1.000000,0.000000)",
        "getCosineThetas cosine theta 0.000000",
        "getCosineThetas vel_inner (0.000000,2.000000)",
        "getCosineThetas cosine theta 0.000000",
        "-[HIDPathStates setRestingFlag:] restingthumb path index 1 eventmask 4",
        "-[HIDPathStates setRestingFlag:] after eventmask 516 path index 1",  // 0x4 | 0x200
        "-[HIDPathStates setRestingFlag:] after eventmask 4 path index 2",
        "-[HIDPathStates calculateNewHandCenter:] hand center (0.600000, 0.250000)",
    };
    EXPECT_EQ(ownMessages(), expected);
}

TEST_F(HIDPathStatesVerbose, CosinesTellEachPair) {
    getCosineThetas(std::vector<HIDPoint>{{1, 0}, {-2, 0}, {0, 0}});
    const std::vector<std::string> expected{
        "getCosineThetas vel_inner (1.000000,0.000000)",  "getCosineThetas cosine theta -1.000000",
        "getCosineThetas vel_inner (1.000000,0.000000)",  "getCosineThetas cosine theta 1.000000",
        "getCosineThetas vel_inner (-2.000000,0.000000)", "getCosineThetas cosine theta 1.000000",
    };
    EXPECT_EQ(ownMessages(), expected);
}

TEST_F(HIDPathStatesVerbose, HandCentreIsToldAlsoWhenUnchanged) {
    HIDPathStates table(600.0f, 1000.0f);
    auto frame = frameEvent(1, {});
    frame->setDoubleValue(0.5, kHIDEventFieldDigitizerX);
    frame->setDoubleValue(0.125, kHIDEventFieldDigitizerY);
    table.calculateNewHandCenter(frame);
    EXPECT_EQ(ownMessages(),
              std::vector<std::string>{"-[HIDPathStates calculateNewHandCenter:] hand center (0.500000, 0.125000)"});
}

TEST_F(HIDPathStatesVerbose, NothingIsToldWithDebugOff) {
    Logging::setDebugEnabled(false);
    HIDPathStates table(600.0f, 1000.0f);
    table.updateButtonState(frameEvent(1, {}, 1));
    table.postFilteringTasks(frameEvent(1, {}));
    getCosineThetas(std::vector<HIDPoint>{{1, 0}, {0, 1}});
    EXPECT_TRUE(ownMessages().empty());
}
