// Multi-frame scenarios through the whole pipeline, checking what the unpacking leaves in the
// path table after each frame: slots, IDs, velocities, stable positions, pixel deltas, damped
// velocities and counts. Frames are 8 ms apart on the test clock, so under any timebase the
// damping weight of the old value is k = 2^(−8/14), stored as a float.

#include <gtest/gtest.h>

#include <cmath>
#include <memory>
#include <vector>

#include "paths/HIDPathStates.h"
#include "pipeline/HIDParser.h"
#include "tests/support/FrameBuilder.h"

using namespace orvane;
using orvane::test::ContactFields;
using orvane::test::contactEvent;
using orvane::test::frameEvent;
using orvane::test::Hand;
using orvane::test::TestClock;

namespace {

// Fractions 1/1024 and 1/512 land on whole surface units, so positions read back exactly.
constexpr float kWidth = 1024.0f;
constexpr float kHeight = 512.0f;
constexpr float kRadius = 0.05f;

float dampingWeight8ms() { return static_cast<float>(std::pow(2.0, -8.0 / 14.0)); }

class FingerPathScenario : public testing::Test {
protected:
    FingerPathScenario() : parser(nullptr, kHeight, kWidth), hand(kWidth, kHeight, clock) {}

    // Runs the hand's frame for the clock's time through the parser, then moves the clock on 8 ms.
    void step() { run(hand.frame()); }
    void run(const HIDEventRef& frame) {
        parser.handleContactFrame(static_cast<double>(clock.ticks()), frame);
        clock.advance(8.0);
    }
    HIDPathStates& table() { return *parser.pathStates(); }
    HIDParserPath& slot(int i) { return *table().getParserPath(i); }

    TestClock clock;
    HIDParser parser;
    Hand hand;
};

void expectPoint(HIDPoint actual, float x, float y) {
    EXPECT_EQ(actual.x, x);
    EXPECT_EQ(actual.y, y);
}

}  // namespace

TEST_F(FingerPathScenario, OneFingerDownMoveAndLift) {
    const float k = dampingWeight8ms();
    const double t1 = static_cast<double>(clock.ticks());

    // Frame 1: touch-down at (300, 300).
    hand.finger(0).at(300, 300).down();
    step();
    {
        HIDParserPath& p = slot(1);
        EXPECT_EQ(table().getParserPathforPathID(1), &p);
        EXPECT_EQ(p.currentContact().path_id, 1);
        EXPECT_EQ(p.currentContact().finger_id, 2);
        EXPECT_TRUE(p.isNewContact());
        expectPoint(p.currentContact().position, 300, 300);
        expectPoint(p.currentContact().velocity, 0, 0);
        expectPoint(p.stablePositionForUI(), 300, 300);
        expectPoint(p.pixelDelta(), 0, 0);
        expectPoint(p.dampedVelocity(), 0, 0);  // no previous frame time: nothing decays in
        EXPECT_EQ(p.timestamps().t_makeTouch, t1);
        EXPECT_EQ(table().numNewContacts(), 1);
        EXPECT_EQ(table().numTouches(), 1);
        EXPECT_EQ(table().numNonEdgeTouches(), 1);
        EXPECT_EQ(table().bottomDivingPathIndex(), 1);
        EXPECT_EQ(table().numFingersOnDivingButton(), 1);  // 300 > 512 / 2
        EXPECT_EQ(table().maxFingerSpeed(), 0.0f);
    }

    // Frame 2: moves to (304, 297).
    hand.finger(0).moveTo(304, 297);
    step();
    const float cx = 304.0f - kRadius;  // the centre trails the raw reading by the radius
    const float cy = 297.0f + kRadius;
    const HIDPoint damped2{0.0f * k + 4.0f * (1 - k), 0.0f * k + -3.0f * (1 - k)};
    {
        HIDParserPath& p = slot(1);
        EXPECT_FALSE(p.isNewContact());
        expectPoint(p.currentContact().velocity, 4, -3);
        expectPoint(p.currentContact().position, cx, cy);
        expectPoint(p.pixelDelta(), cx - 300.0f, cy - 300.0f);
        expectPoint(p.cumulativeDeltas(), cx - 300.0f, cy - 300.0f);
        expectPoint(p.stablePositionForUI(), 300, 300);
        expectPoint(p.dampedVelocity(), damped2.x, damped2.y);
        EXPECT_EQ(p.dampedSpeed(), sqrtf(damped2.x * damped2.x + damped2.y * damped2.y));
        EXPECT_EQ(p.peakDisplacement(), 5.0f);  // √(4² + 3²), from the raw reading
        EXPECT_EQ(table().numNewContacts(), 0);
        EXPECT_EQ(table().numTouches(), 1);
        EXPECT_EQ(table().lastNumTouches(), 1);
        EXPECT_EQ(table().maxFingerSpeed(), 5.0f);
    }

    // Frame 3: lifts, reported once more with touch 0 at its last place.
    const double t3 = static_cast<double>(clock.ticks());
    hand.finger(0).up();
    step();
    {
        HIDParserPath& p = slot(1);
        EXPECT_EQ(table().getParserPathforPathID(1), &p);
        EXPECT_FALSE(p.isTouching());
        EXPECT_TRUE(p.isMakeStage());
        EXPECT_EQ(p.timestamps().t_breakTouch, t3);
        // Velocity from the steadied previous position to the raw reading.
        const HIDPoint v{304.0f - cx, 297.0f - cy};
        expectPoint(p.currentContact().velocity, v.x, v.y);
        expectPoint(p.currentContact().position, 304, 297);
        expectPoint(p.stablePositionForUI(), 304, 297);
        expectPoint(p.previousStablePositionForUI(), 300, 300);
        expectPoint(p.pixelDelta(), 0, 0);
        expectPoint(p.cumulativeDeltas(), 0, 0);
        // The lift zeroes the damped velocity before the decay step.
        expectPoint(p.dampedVelocity(), 0.0f * k + v.x * (1 - k), 0.0f * k + v.y * (1 - k));
        EXPECT_EQ(table().numTouches(), 0);
        EXPECT_EQ(table().lastNumTouches(), 1);
        EXPECT_EQ(table().bottomDivingPathIndex(), 0);
        EXPECT_EQ(table().numFingersOnDivingButton(), 0);
        EXPECT_EQ(table().dampedSpeedOfFastestFinger(), 0.0f);
        EXPECT_EQ(table().maxFingerSpeed(), 0.0f);
    }

    // Frame 4: no contacts: the slot is wiped.
    step();
    {
        HIDParserPath& p = slot(1);
        EXPECT_EQ(table().getParserPathforPathID(1), nullptr);
        EXPECT_EQ(p.currentContact().path_id, 0);
        expectPoint(p.currentContact().position, 0, 0);
        expectPoint(p.dampedVelocity(), 0, 0);
        expectPoint(p.stablePositionForUI(), 0, 0);
        EXPECT_EQ(p.timestamps().t_makeTouch, t1);  // stage times survive the clear
        EXPECT_EQ(p.timestamps().t_breakTouch, t3);
        EXPECT_EQ(table().numTouches(), 0);
        EXPECT_EQ(table().lastNumTouches(), 0);
    }
}

TEST_F(FingerPathScenario, TwoFingersWithASecondLandingLater) {
    const float k = dampingWeight8ms();

    // Frame 1: finger 0 at (300, 300).
    hand.finger(0).at(300, 300).down();
    step();

    // Frame 2: finger 0 moves 8 to the right; finger 1 lands at (320, 310).
    hand.finger(0).moveTo(308, 300);
    hand.finger(1).at(320, 310).down();
    step();
    const float c0 = 308.0f - kRadius;
    const float d0 = 0.0f * k + 8.0f * (1 - k);
    {
        HIDParserPath& a = slot(1);
        HIDParserPath& b = slot(2);
        EXPECT_EQ(a.currentContact().path_id, 1);
        EXPECT_EQ(b.currentContact().path_id, 2);
        EXPECT_EQ(b.currentContact().finger_id, 3);
        EXPECT_TRUE(b.isNewContact());
        expectPoint(a.currentContact().velocity, 8, 0);
        expectPoint(a.currentContact().position, c0, 300);
        expectPoint(a.pixelDelta(), c0 - 300.0f, 0);
        // Finger 0 is read before the frame's new contact: no strong damping.
        expectPoint(a.dampedVelocity(), d0, 0.0f * k + 0.0f * (1 - k));
        expectPoint(b.currentContact().position, 320, 310);
        expectPoint(b.stablePositionForUI(), 320, 310);
        expectPoint(b.pixelDelta(), 0, 0);
        expectPoint(b.dampedVelocity(), 0, 0);
        EXPECT_EQ(table().numNewContacts(), 1);
        EXPECT_EQ(table().numTouches(), 2);
        EXPECT_EQ(table().numNonEdgeTouches(), 2);
        // Finger 1 (y 310) is bottom-most; finger 0 is 10 above and 320 − 307.95 to the side.
        EXPECT_EQ(table().bottomDivingPathIndex(), 2);
        EXPECT_EQ(table().numFingersOnDivingButton(), 2);
        // Fastest finger: only finger 0 has a damped speed, so the weighted means are its own.
        EXPECT_EQ(table().dampedSpeedOfFastestFinger(), (d0 * d0) / d0);
        EXPECT_EQ(table().dampedVelocityOfFastestFinger().x, (d0 * d0) / d0);
        EXPECT_EQ(table().maxFingerSpeed(), 8.0f);
    }

    // Frame 3: finger 0 moves on to 316; finger 1 stays; finger 2 lands at (600, 200).
    hand.finger(0).moveTo(316, 300);
    hand.finger(2).at(600, 200).down();
    step();
    {
        HIDParserPath& a = slot(1);
        HIDParserPath& b = slot(2);
        HIDParserPath& c = slot(3);
        const float v0 = 316.0f - c0;
        const float c0b = 316.0f - kRadius;
        expectPoint(a.currentContact().velocity, v0, 0);
        expectPoint(a.currentContact().position, c0b, 300);
        expectPoint(a.pixelDelta(), c0b - c0, 0);
        expectPoint(a.cumulativeDeltas(), (c0 - 300.0f) + (c0b - c0), 0);
        expectPoint(a.dampedVelocity(), d0 * k + v0 * (1 - k), 0);
        // Finger 1 did not move: held at its centre, no delta, its damped velocity stays 0.
        expectPoint(b.currentContact().position, 320, 310);
        expectPoint(b.currentContact().velocity, 0, 0);
        expectPoint(b.pixelDelta(), 0, 0);
        expectPoint(b.dampedVelocity(), 0, 0);
        EXPECT_EQ(c.currentContact().path_id, 3);
        EXPECT_EQ(c.currentContact().finger_id, 4);
        expectPoint(c.currentContact().position, 600, 200);
        EXPECT_EQ(table().numNewContacts(), 1);
        EXPECT_EQ(table().numTouches(), 3);
        EXPECT_EQ(table().lastNumTouches(), 2);
        EXPECT_EQ(table().bottomDivingPathIndex(), 2);
        EXPECT_EQ(table().numFingersOnDivingButton(), 2);
    }
}

TEST_F(FingerPathScenario, PalmTakesASlotButNotATouch) {
    // A palm in the bottom band and one finger on the upper half.
    hand.finger(0).at(500, 480).palm().down();
    hand.finger(1).at(300, 200).down();
    step();
    HIDParserPath& palm = slot(1);
    HIDParserPath& finger = slot(2);
    EXPECT_EQ(palm.currentContact().path_id, 1);
    EXPECT_EQ(palm.currentContact().fingerConfidence, 0);
    EXPECT_TRUE(palm.isPalmContact());
    EXPECT_TRUE(palm.isEdgeContact());
    expectPoint(palm.currentContact().position, 500, 480);
    expectPoint(palm.stablePositionForUI(), 500, 480);
    EXPECT_EQ(finger.currentContact().fingerConfidence, 1);
    EXPECT_EQ(table().numNewContacts(), 2);
    EXPECT_EQ(table().numTouches(), 1);
    EXPECT_EQ(table().numNonEdgeTouches(), 1);
    EXPECT_EQ(table().numPalms(), 1);
    // With only one non-edge finger the edge palm takes part and is bottom-most: on the button
    // (480 > 256) and in the edge band.
    EXPECT_EQ(table().bottomDivingPathIndex(), 1);
    EXPECT_EQ(table().numFingersOnDivingButton(), 1);
    EXPECT_EQ(table().numEdgeTouchesOnDivingButton(), 1);

    // A second finger inside the box: the palm drops out of the bottom-most search.
    hand.finger(2).at(400, 260).down();
    step();
    EXPECT_EQ(table().numNonEdgeTouches(), 2);
    EXPECT_EQ(table().numPalms(), 1);
    EXPECT_EQ(table().bottomDivingPathIndex(), 3);
    EXPECT_EQ(table().numFingersOnDivingButton(), 1);
    EXPECT_EQ(table().numEdgeTouchesOnDivingButton(), 0);
}

TEST_F(FingerPathScenario, ContactIndexAboveThirteenIsDropped) {
    const uint64_t t = clock.ticks();
    auto at = [t](int index, double x, double y) {
        ContactFields c;
        c.index = index;
        c.x = x / kWidth;
        c.y = 1.0 - y / kHeight;
        return contactEvent(c, t);
    };
    run(frameEvent(t, {at(14, 300, 300), at(13, 400, 300), at(0, 500, 300)}));
    EXPECT_EQ(slot(14).currentContact().path_id, 14);
    EXPECT_EQ(slot(14).currentContact().finger_id, 15);
    expectPoint(slot(14).currentContact().position, 400, 300);
    EXPECT_EQ(slot(1).currentContact().path_id, 1);
    expectPoint(slot(1).currentContact().position, 500, 300);
    for (int i = 2; i <= 13; ++i) EXPECT_EQ(slot(i).currentContact().path_id, 0) << "slot " << i;
    EXPECT_EQ(slot(0).currentContact().path_id, 0);
    EXPECT_EQ(table().getParserPathforPathID(15), nullptr);
    EXPECT_EQ(table().numNewContacts(), 2);
    EXPECT_EQ(table().numTouches(), 2);
}

TEST_F(FingerPathScenario, FrameWithNoChildrenWipesEveryTouchingSlot) {
    hand.finger(0).at(300, 300).down();
    hand.finger(5).at(400, 300).down();
    step();
    ASSERT_EQ(table().numTouches(), 2);
    // Both fingers vanish without a lift frame: the next frame has no children at all.
    run(frameEvent(clock.ticks(), {}));
    for (int i = 1; i <= 14; ++i) {
        EXPECT_EQ(slot(i).currentContact().path_id, 0) << "slot " << i;
        EXPECT_EQ(slot(i).currentContact().fingerTipSwitch, 0) << "slot " << i;
    }
    expectPoint(slot(6).stablePositionForUI(), 0, 0);
    EXPECT_EQ(table().numTouches(), 0);
    EXPECT_EQ(table().lastNumTouches(), 2);
    EXPECT_EQ(table().numNewContacts(), 0);
    EXPECT_EQ(table().bottomDivingPathIndex(), 0);
    EXPECT_EQ(table().numFingersOnDivingButton(), 0);
}

TEST_F(FingerPathScenario, NoneFrameOnlyMovesTheClockAndRecomputesFastestFinger) {
    hand.finger(0).at(300, 300).down();
    step();
    hand.finger(0).moveTo(306, 308);
    step();
    const HIDParserPath& p = slot(1);
    const HIDContact before = p.currentContact();
    const HIDPoint damped = p.dampedVelocity();
    ASSERT_EQ(table().maxFingerSpeed(), 10.0f);  // √(6² + 8²)
    const double t = static_cast<double>(clock.ticks());

    parser.handleContactFrame(t, nullptr);

    EXPECT_EQ(table().currentTimestamp(), t);
    EXPECT_EQ(p.currentContact().path_id, 1);
    EXPECT_EQ(p.currentContact().device_timestamp, before.device_timestamp);
    expectPoint(p.currentContact().position, before.position.x, before.position.y);
    expectPoint(p.dampedVelocity(), damped.x, damped.y);
    EXPECT_EQ(table().numTouches(), 1);
    EXPECT_EQ(table().lastNumTouches(), 1);
    EXPECT_EQ(table().bottomDivingPathIndex(), 1);
    // Recomputed over the same paths, so the same values.
    EXPECT_EQ(table().maxFingerSpeed(), 10.0f);
    EXPECT_EQ(table().dampedSpeedOfFastestFinger(), p.dampedSpeed() * p.dampedSpeed() / p.dampedSpeed());
}
