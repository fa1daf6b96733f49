#pragma once
// Frames that read like a hand, for tests:
//
//   TestClock clock;                       // times in ms, converted to ticks
//   Hand hand(1000.0f, 500.0f, clock);     // surface size in the filter's units
//   auto f1 = hand.finger(0).at(300, 200).down().frame();
//   clock.advance(8);
//   auto f2 = hand.finger(0).moveTo(310, 200).frame();
//   auto f3 = hand.finger(0).up().frame();  // reported once with touch 0, then gone
//
// Positions are surface units as the filter sees them: x from the left, y growing toward
// the diving-button edge (the digitizer's y is 1 − y / height).

#include <cstdint>
#include <map>
#include <vector>

#include "platform/HIDEvent.h"

namespace orvane::test {

// The test's own clock, in milliseconds; ticks() converts with the platform timebase.
class TestClock {
public:
    explicit TestClock(double startMs = 1000.0) : nowMs_(startMs) {}
    double nowMs() const { return nowMs_; }
    void advance(double ms) { nowMs_ += ms; }
    void set(double ms) { nowMs_ = ms; }
    uint64_t ticks() const { return msToTicks(nowMs_); }
    static uint64_t msToTicks(double ms);
    static double ticksToMs(double ticks);

private:
    double nowMs_;
};

// One contact's raw fields.
struct ContactFields {
    int32_t index = 0;
    double x = 0.0;  // normalised 0..1
    double y = 0.0;  // normalised 0..1, the digitizer's own y
    int32_t touch = 1;
    int32_t range = 1;
    int32_t type = 1;  // 1 finger, 3 palm
    int32_t eventMask = 0;
};

// A child digitizer event with exactly these fields.
HIDEventRef contactEvent(const ContactFields& c, uint64_t timestamp);
// A digitizer frame event: parent fields touch, range, button mask and event mask (the OR
// of the children's) and the children in order.
HIDEventRef frameEvent(uint64_t timestamp, const std::vector<HIDEventRef>& children, int32_t buttonMask = 0);

class Hand {
public:
    Hand(float width, float height, TestClock& clock) : width_(width), height_(height), clock_(clock) {}

    Hand& finger(int index);
    Hand& at(float x, float y);      // place the selected finger (before down)
    Hand& down();                    // touches from the next frame
    Hand& moveTo(float x, float y);  // jumps there by the next frame
    Hand& up();                      // the next frame reports it lifted, then it is gone
    Hand& palm(bool isPalm = true);  // transducer type 3
    Hand& press();                   // the diving button
    Hand& release();
    Hand& wireless(bool on = true);  // attach the 16-bit relative scan time child

    // The frame for the current state at the clock's time.
    HIDEventRef frame();
    // n frames `everyMs` apart, moving the selected finger by (dx, dy) per frame.
    std::vector<HIDEventRef> frames(int n, double everyMs, float dx = 0, float dy = 0);

    float width() const { return width_; }
    float height() const { return height_; }
    double normalisedX(float x) const { return static_cast<double>(x) / width_; }
    double normalisedY(float y) const { return 1.0 - static_cast<double>(y) / height_; }

private:
    struct FingerState {
        float x = 0, y = 0;
        bool touching = false;
        bool lifting = false;   // reported once more with touch 0
        bool reported = false;  // reported in the last frame
        bool palm = false;
        float lastX = 0, lastY = 0;
        bool lastTouching = false;
    };
    float width_, height_;
    TestClock& clock_;
    std::map<int, FingerState> fingers_;
    int selected_ = 0;
    int32_t buttonMask_ = 0;
    bool wireless_ = false;
};

}  // namespace orvane::test
