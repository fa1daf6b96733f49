// Whole gestures through the frame pipeline: frames from the hand builder go into HIDParser,
// and the returned and dispatched events and the gesture log lines are checked per frame.
//
// The surface is 1024 × 512 units and frames come every 8 ms. Fingers stay at y = 200: away
// from the edges (x between 204.8 and 819.2, y between 128 and 409.6), off the diving button
// (y ≤ 256) and above the thumb rest zone (y < 0.45 × 512 = 230.4), so no finger is taken for
// a resting thumb unless the button is pressed.
//
// A moving finger is held back by the position hysteresis (radius 0.05): its first step of
// 10 moves the steadied position by 9.95, each later step of 10 by 10. One quantum of pointer
// and scroll motion is 0.635: 9.95 / 0.635 = 15.7 and 10 / 0.635 = 15.7 both give 15 quanta,
// 15 × 0.635 = 9.525, and a scroll moves by -2 × 9.525 = -19.05.

#include <gtest/gtest.h>

#include <cstdio>
#include <map>
#include <memory>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "gestures/HIDGestureParser.h"
#include "pipeline/HIDParser.h"
#include "platform/Logging.h"
#include "stats/HIDHandStatistics.h"
#include "tests/support/EventText.h"
#include "tests/support/FrameBuilder.h"

namespace orvane {
namespace {

using test::ContactFields;
using test::contactEvent;
using test::frameEvent;
using test::Hand;
using test::TestClock;

constexpr float kWidth = 1024.0f;
constexpr float kHeight = 512.0f;
constexpr double kFrameMs = 8.0;
// The device's own time runs a little ahead of the host's; it feeds the pipeline only.
constexpr double kDeviceLeadMs = 3.0;

std::string render(const HIDEventRef& pointer) {
    return test::pointerEventText(pointer, {.scaleRotateValues = false});
}

struct FrameResult {
    HIDEventRef frame;
    HIDEventRef returned;
    std::string summary;     // render(returned)
    std::string dispatched;  // the dispatched events, rendered at the moment they were sent
    std::string logs;        // gesture lines without their method name, joined by ", "
};

class GestureScenarioTest : public ::testing::Test {
protected:
    void SetUp() override { Logging::setSink(sink); }
    void TearDown() override { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }

    FrameResult send(const HIDEventRef& frame) {
        sink->clear();
        dispatched.clear();
        const double deviceTime = static_cast<double>(frame->timestamp() + TestClock::msToTicks(kDeviceLeadMs));
        HIDEventRef result = parser.handleContactFrame(deviceTime, frame);
        clock.advance(kFrameMs);

        FrameResult r{frame, result, render(result), "", ""};
        for (const HIDEventRef& e : dispatched) {
            r.dispatched += (r.dispatched.empty() ? "" : " | ") + render(e);
            expectHostTimestamps(e, frame->timestamp());
        }
        if (result && !result->children().empty()) expectHostTimestamps(result, frame->timestamp());
        for (std::string line : sink->messages()) {
            for (const std::string& p : kPrefixes)
                if (line.rfind(p, 0) == 0) line = line.substr(p.size());
            r.logs += (r.logs.empty() ? "" : ", ") + line;
        }
        return r;
    }
    FrameResult step() { return send(hand.frame()); }

    // Frames of a hand that does not move: the frame reports no change, so nothing goes out.
    void rest(int frames) {
        for (int i = 0; i < frames; ++i) {
            FrameResult f = step();
            EXPECT_EQ(f.summary, "none") << "resting frame " << i;
            EXPECT_EQ(f.logs, "") << "resting frame " << i;
        }
    }

    // Puts a finger down at (x, y); it touches from the next frame.
    void place(int finger, float x, float y) {
        positions[finger] = {x, y};
        hand.finger(finger).at(x, y).down();
    }
    // Moves fingers by (dx, dy) each and sends the frame.
    FrameResult moveAll(const std::vector<std::tuple<int, float, float>>& moves) {
        for (const auto& [finger, dx, dy] : moves) {
            auto& p = positions[finger];
            p.first += dx;
            p.second += dy;
            hand.finger(finger).moveTo(p.first, p.second);
        }
        return step();
    }
    FrameResult move(int finger, float dx, float dy) { return moveAll({{finger, dx, dy}}); }

    // Every event made carries the frame event's own (host) timestamp.
    static void expectHostTimestamps(const HIDEventRef& pointer, uint64_t host) {
        EXPECT_EQ(pointer->timestamp(), host);
        for (const HIDEventRef& c : pointer->children()) EXPECT_EQ(c->timestamp(), host);
    }

    int32_t gesture() const { return parser.gestureParser()->currentGesture(); }
    uint16_t phase() const { return parser.gestureParser()->currentPhase(); }

    static inline const std::string kPrefixes[] = {
        "-[HIDGestureParser createGestureEvents:handMotion:handEvent:pointerEvent:gestureEvent:dispatcher:"
        "tapToClickEnabled:twoFingersSecondaryClickEnabled:] GESTURE ",
        "-[HIDGestureParser cancelScrollMayBegin:pointerEvent:] GESTURE "};

    std::shared_ptr<CaptureLogSink> sink = std::make_shared<CaptureLogSink>();
    TestClock clock;
    Hand hand{kWidth, kHeight, clock};
    std::vector<HIDEventRef> dispatched;
    HIDParser parser{[this](const HIDEventRef& e) { dispatched.push_back(e->copy()); }, kHeight, kWidth};
    std::map<int, std::pair<float, float>> positions;
};

TEST_F(GestureScenarioTest, ScrollThatRestsThenMoves) {
    place(0, 400, 200);
    place(1, 500, 200);
    FrameResult f = step();
    EXPECT_EQ(f.summary, "hand scroll:maybegin(0,0)");
    EXPECT_EQ(f.logs, "SCROLL MAY BEGIN");
    EXPECT_EQ(phase(), kHIDGesturePhaseMayBegin);
    rest(5);

    // Both fingers move 10 down: the hand's y accumulates 9.95, the scroll goes up.
    f = moveAll({{0, 0, 10}, {1, 0, 10}});
    EXPECT_EQ(f.summary, "hand scroll:began(0,-19.05)");
    EXPECT_EQ(f.logs, "SCROLL BEGAN");
    ASSERT_NE(f.returned, nullptr);
    EXPECT_EQ(f.returned->children()[0], f.frame);
    EXPECT_EQ(f.returned->doubleValueForField(kHIDEventFieldPointerX), 0.0);
    EXPECT_EQ(f.returned->doubleValueForField(kHIDEventFieldPointerY), 0.0);
    for (int i = 0; i < 3; ++i) {
        f = moveAll({{0, 0, 10}, {1, 0, 10}});
        EXPECT_EQ(f.summary, "hand scroll:changed(0,-19.05)") << i;
        EXPECT_EQ(f.logs, "") << i;
        EXPECT_EQ(f.returned->doubleValueForField(kHIDEventFieldPointerY), 0.0);
    }
    EXPECT_EQ(gesture(), kHIDGestureTypeScroll);

    // One finger lifts: the scroll ends.
    hand.finger(1).up();
    f = step();
    EXPECT_EQ(f.summary, "hand scroll:ended(0,0)");
    EXPECT_EQ(f.logs, "END SCROLL");

    hand.finger(0).up();
    f = step();
    EXPECT_EQ(f.summary, "hand");
    EXPECT_EQ(f.logs, "");

    // The first frame with no contact gets a bare pointer event; the next nothing.
    f = step();
    EXPECT_EQ(f.summary, "bare");
    EXPECT_EQ(f.returned->timestamp(), 0u);
    EXPECT_EQ(f.returned->senderID(), 0u);
    f = step();
    EXPECT_EQ(f.summary, "none");
    EXPECT_TRUE(dispatched.empty());
}

TEST_F(GestureScenarioTest, TwoFingersThatRestAndLiftCancelTheMayBegin) {
    place(0, 400, 200);
    place(1, 500, 200);
    FrameResult f = step();
    EXPECT_EQ(f.summary, "hand scroll:maybegin(0,0)");
    EXPECT_EQ(f.logs, "SCROLL MAY BEGIN");
    // Rest past the longest tap (250 ms): the lift is no tap.
    rest(32);

    hand.finger(0).up();
    hand.finger(1).up();
    f = step();
    EXPECT_EQ(f.summary, "scroll:cancelled(0,0) hand");
    EXPECT_EQ(f.logs, "SCROLL CANCELLED");
    EXPECT_EQ(phase(), kHIDGesturePhaseCancelled);

    f = step();
    EXPECT_EQ(f.summary, "bare");
    EXPECT_EQ(f.logs, "");
}

TEST_F(GestureScenarioTest, Pinch) {
    // 200 apart; each frame both fingers move 10 outward along x: the separation grows, the
    // mean motion is 0, so scale dominates.
    place(0, 400, 200);
    place(1, 600, 200);
    FrameResult f = step();
    EXPECT_EQ(f.summary, "hand scroll:maybegin(0,0)");

    f = moveAll({{0, -10, 0}, {1, 10, 0}});
    EXPECT_EQ(f.summary, "scroll:cancelled(0,0) hand scale:began");
    EXPECT_EQ(f.logs, "SCROLL CANCELLED, SCALE BEGAN");
    ASSERT_NE(f.returned, nullptr);
    const HIDEventRef& began = f.returned->children()[2];
    // The separation grew by about 19.9 (two steps of 9.95): 19.9 × 0.005.
    EXPECT_NEAR(began->doubleValueForField(kHIDEventFieldScaleZ), 19.9 * 0.005, 1e-5);
    EXPECT_EQ(gesture(), kHIDGestureTypeScale);

    f = moveAll({{0, -10, 0}, {1, 10, 0}});
    EXPECT_EQ(f.summary, "hand scale:changed");
    EXPECT_EQ(f.logs, "");
    EXPECT_NEAR(f.returned->children()[1]->doubleValueForField(kHIDEventFieldScaleZ), 20 * 0.005, 1e-5);

    // Pinching in: negative scale.
    f = moveAll({{0, 10, 0}, {1, -10, 0}});
    EXPECT_EQ(f.summary, "hand scale:changed");
    EXPECT_LT(f.returned->children()[1]->doubleValueForField(kHIDEventFieldScaleZ), 0.0);

    hand.finger(1).up();
    f = step();
    EXPECT_EQ(f.summary, "hand scale:ended");
    EXPECT_EQ(f.logs, "END SCALE");
    EXPECT_EQ(f.returned->children()[1]->doubleValueForField(kHIDEventFieldScaleZ), 0.0);
}

TEST_F(GestureScenarioTest, Rotation) {
    // The fingers move in opposite directions across the line joining them: rotation.
    place(0, 400, 200);
    place(1, 600, 200);
    FrameResult f = step();
    EXPECT_EQ(f.summary, "hand scroll:maybegin(0,0)");

    f = moveAll({{0, 0, 10}, {1, 0, -10}});
    EXPECT_EQ(f.summary, "scroll:cancelled(0,0) hand rotate:began");
    EXPECT_EQ(f.logs, "SCROLL CANCELLED, ROTATE BEGAN");
    EXPECT_EQ(gesture(), kHIDGestureTypeRotate);
    ASSERT_NE(f.returned, nullptr);
    EXPECT_NE(f.returned->children()[2]->doubleValueForField(kHIDEventFieldRotationZ), 0.0);

    f = moveAll({{0, 0, 10}, {1, 0, -10}});
    EXPECT_EQ(f.summary, "hand rotate:changed");
    EXPECT_EQ(f.logs, "");

    hand.finger(1).up();
    f = step();
    EXPECT_EQ(f.summary, "hand rotate:ended");
    EXPECT_EQ(f.logs, "END ROTATION");
}

TEST_F(GestureScenarioTest, PointerMovesByQuantisedDeltas) {
    place(0, 400, 200);
    FrameResult f = step();
    EXPECT_EQ(f.summary, "hand");
    EXPECT_EQ(f.logs, "");

    // 8 to 40 ms after the touch-down: too early for the pointer.
    for (int i = 0; i < 5; ++i) {
        f = move(0, 10, 0);
        EXPECT_EQ(f.summary, "hand") << i;
        EXPECT_EQ(gesture(), kHIDGestureTypeNone) << i;
    }
    // 48 ms: 15 quanta of 0.635.
    f = move(0, 10, 0);
    EXPECT_EQ(f.summary, "move(9.525,0) hand");
    EXPECT_EQ(f.logs, "POINTER BEGAN");
    EXPECT_EQ(f.returned->doubleValueForField(kHIDEventFieldPointerX), static_cast<double>(15 * 0.635f));
    EXPECT_EQ(gesture(), kHIDGestureTypePointer);

    f = move(0, -10, 0);  // a reversal: the centre first crosses its radius, 9.9 → 15 quanta
    EXPECT_EQ(f.summary, "move(-9.525,0) hand");
    EXPECT_EQ(f.logs, "");
    f = move(0, -3.25f, 0);  // 3.25 / 0.635 = 5.1 → 5 quanta, 3.175
    EXPECT_EQ(f.summary, "move(-3.175,0) hand");
    f = move(0, -0.5f, 0);  // under one quantum: the pointer stays
    EXPECT_EQ(f.summary, "hand");
    EXPECT_EQ(gesture(), kHIDGestureTypePointer);

    hand.finger(0).up();
    f = step();
    EXPECT_EQ(f.summary, "hand");
    EXPECT_EQ(f.logs, "POINTER ENDED");
    EXPECT_EQ(gesture(), kHIDGestureTypeNone);
}

TEST_F(GestureScenarioTest, OneFingerTapClicksWithTapToClick) {
    parser.setTapToClickEnabled(true);
    place(0, 400, 200);
    EXPECT_EQ(step().summary, "hand");
    rest(9);  // lifted 80 ms after the touch-down
    hand.finger(0).up();
    FrameResult f = step();
    EXPECT_EQ(f.dispatched, "hand button:1");
    EXPECT_EQ(f.summary, "hand button:0");
    EXPECT_EQ(f.logs, "1F TAP");
    ASSERT_NE(f.returned, nullptr);
    // The hand event reports the lift.
    ASSERT_EQ(f.frame->children().size(), 1u);
    EXPECT_EQ(f.frame->children()[0]->integerValueForField(kHIDEventFieldDigitizerEventMask), 3);
    EXPECT_EQ(f.returned->integerValueForField(kHIDEventFieldPointerButtonMask), 0);
    EXPECT_EQ(gesture(), kHIDGestureTypeNone);

    f = step();
    EXPECT_EQ(f.summary, "bare");
    EXPECT_EQ(f.dispatched, "");
}

TEST_F(GestureScenarioTest, OneFingerTapWithoutTapToClickSendsOnlyTheHandEvent) {
    place(0, 400, 200);
    EXPECT_EQ(step().summary, "hand");
    rest(9);
    hand.finger(0).up();
    FrameResult f = step();
    EXPECT_EQ(f.summary, "hand");
    EXPECT_EQ(f.dispatched, "");
    EXPECT_EQ(f.logs, "");
    EXPECT_EQ(gesture(), kHIDGestureTypeOneFingerTap);
}

TEST_F(GestureScenarioTest, TwoFingerTapClicksTheSecondaryButtonWithBothSettings) {
    parser.setTapToClickEnabled(true);
    parser.setTwoFingersSecondaryClickEnabled(true);
    place(0, 400, 200);
    place(1, 450, 200);
    EXPECT_EQ(step().summary, "hand scroll:maybegin(0,0)");
    rest(9);
    hand.finger(0).up();
    hand.finger(1).up();
    FrameResult f = step();
    // The press goes out with the withdrawal of the may-begin; the release comes back alone.
    EXPECT_EQ(f.dispatched, "scroll:cancelled(0,0) hand button:2");
    EXPECT_EQ(f.summary, "hand button:0");
    EXPECT_EQ(f.logs, "SCROLL CANCELLED, 2F TAP");
}

TEST_F(GestureScenarioTest, TwoFingerTapWithoutTheSecondarySettingOnlyCancelsTheMayBegin) {
    parser.setTapToClickEnabled(true);
    place(0, 400, 200);
    place(1, 450, 200);
    EXPECT_EQ(step().summary, "hand scroll:maybegin(0,0)");
    rest(9);
    hand.finger(0).up();
    hand.finger(1).up();
    FrameResult f = step();
    EXPECT_EQ(f.dispatched, "");
    EXPECT_EQ(f.summary, "scroll:cancelled(0,0) hand");
    EXPECT_EQ(f.logs, "SCROLL CANCELLED");
    EXPECT_EQ(gesture(), kHIDGestureTypeTwoFingerTap);
}

TEST_F(GestureScenarioTest, ClickWithTwoCloseFingersPressesTheSecondaryButton) {
    parser.setTwoFingersSecondaryClickEnabled(true);
    // 30 apart: close (under 260, vertically under 120).
    place(0, 400, 200);
    place(1, 430, 200);
    EXPECT_EQ(step().summary, "hand scroll:maybegin(0,0)");
    rest(3);

    // The press makes finger 0 (the bottom-most, lower path ID on a tie) a resting thumb:
    // one finger touches, one rests, fewer than before, so the may-begin is withdrawn.
    hand.press();
    FrameResult f = step();
    EXPECT_EQ(f.summary, "button:2 scroll:cancelled(0,0) hand");
    EXPECT_EQ(f.logs, "BUTTON PRESSED, SCROLL CANCELLED");
    ASSERT_NE(f.returned, nullptr);
    // The pointer event itself carries the button state, 1.
    EXPECT_EQ(f.returned->integerValueForField(kHIDEventFieldPointerButtonMask), 1);
    rest(3);

    // The release goes out because the press did; the finger beside the resting thumb, still,
    // may begin a scroll again.
    hand.release();
    f = step();
    EXPECT_EQ(f.summary, "button:0 hand scroll:maybegin(0,0)");
    EXPECT_EQ(f.logs, "BUTTON RELEASED, SCROLL MAY BEGIN");
    EXPECT_EQ(f.returned->integerValueForField(kHIDEventFieldPointerButtonMask), 0);
    EXPECT_TRUE(dispatched.empty());
}

TEST_F(GestureScenarioTest, ClickWithTwoCloseFingersWithoutTheSecondarySettingPressesThePrimaryButton) {
    place(0, 400, 200);
    place(1, 430, 200);
    EXPECT_EQ(step().summary, "hand scroll:maybegin(0,0)");
    rest(3);
    hand.press();
    FrameResult f = step();
    EXPECT_EQ(f.summary, "button:1 scroll:cancelled(0,0) hand");
    EXPECT_EQ(f.logs, "BUTTON PRESSED, SCROLL CANCELLED");
}

TEST_F(GestureScenarioTest, LiftIsReportedOnceOutOfRangeThenDropped) {
    // Raw frames: the device keeps reporting the lifted contact.
    auto frameAt = [](double ms, std::vector<ContactFields> contacts) {
        std::vector<HIDEventRef> children;
        const uint64_t t = TestClock::msToTicks(ms);
        for (const ContactFields& c : contacts) children.push_back(contactEvent(c, t));
        return frameEvent(t, children);
    };
    auto contact = [](int32_t index, double x, int32_t touch, int32_t mask) {
        ContactFields c;
        c.index = index;
        c.x = x;
        c.y = 1.0 - 200.0 / 512.0;
        c.touch = touch;
        c.range = touch;
        c.eventMask = mask;
        return c;
    };

    FrameResult f = send(frameAt(1000, {contact(0, 400.0 / 1024, 1, 3), contact(1, 500.0 / 1024, 1, 3)}));
    EXPECT_EQ(f.summary, "hand scroll:maybegin(0,0)");

    // 400 ms later (no tap), contact 1 is reported lifted: it stays as a lift report.
    f = send(frameAt(1400, {contact(0, 400.0 / 1024, 1, 0), contact(1, 500.0 / 1024, 0, 2)}));
    EXPECT_EQ(f.summary, "scroll:cancelled(0,0) hand");
    ASSERT_EQ(f.frame->children().size(), 2u);
    const HIDEventRef& lifted = f.frame->children()[1];
    EXPECT_EQ(lifted->integerValueForField(kHIDEventFieldDigitizerTouch), 0);
    EXPECT_EQ(lifted->integerValueForField(kHIDEventFieldDigitizerRange), 0);
    EXPECT_EQ(lifted->integerValueForField(kHIDEventFieldDigitizerEventMask), 3);
    EXPECT_EQ(lifted->integerValueForField(kHIDEventFieldDigitizerIdentity), 2);

    // Still reported: its child is dropped. Contact 0 moves, so the frame goes out.
    f = send(frameAt(1408, {contact(0, 410.0 / 1024, 1, 4), contact(1, 500.0 / 1024, 0, 0)}));
    EXPECT_EQ(f.summary, "hand");
    ASSERT_EQ(f.frame->children().size(), 1u);
    EXPECT_EQ(f.frame->children()[0]->integerValueForField(kHIDEventFieldDigitizerIndex), 0);

    f = send(frameAt(1416, {contact(0, 420.0 / 1024, 1, 4), contact(1, 500.0 / 1024, 0, 0)}));
    EXPECT_EQ(f.summary, "hand");
    ASSERT_EQ(f.frame->children().size(), 1u);
}

TEST_F(GestureScenarioTest, ThreeFingersMakeNoGesture) {
    place(0, 300, 200);
    place(1, 400, 200);
    place(2, 500, 200);
    FrameResult f = step();
    EXPECT_EQ(f.summary, "hand");
    for (int i = 0; i < 4; ++i) {
        f = moveAll({{0, 0, 10}, {1, 0, 10}, {2, 0, 10}});
        EXPECT_EQ(f.summary, "hand") << i;
        EXPECT_EQ(gesture(), kHIDGestureTypeNone) << i;
    }
    for (int i = 0; i < 3; ++i) {
        f = moveAll({{0, -10, 0}, {2, 10, 0}});  // spreading
        EXPECT_EQ(f.summary, "hand") << i;
        EXPECT_EQ(gesture(), kHIDGestureTypeNone) << i;
    }
    hand.finger(0).up();
    hand.finger(1).up();
    hand.finger(2).up();
    f = step();
    EXPECT_EQ(f.summary, "hand");
    EXPECT_EQ(step().summary, "bare");
    EXPECT_TRUE(sink->messages().empty());
}

}  // namespace
}  // namespace orvane
