#pragma once
// Random touchpad sessions for the nothing-lost tests and the soak: up to five fingers that
// touch down, move, rest and lift, quick taps, clicks, a palm now and then, property
// records that turn the tap settings on and off, clients coming and going, events of
// other types, and, rarely, a hostile frame (a NaN coordinate, an index outside 0..13, a
// timestamp that repeats or goes back, several button bits). The same seed gives the same
// session; records are made one at a time, so a session can be as long as wanted.

#include <array>
#include <cstdint>
#include <random>

#include "platform/HIDEvent.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::robust {

class RandomSession {
public:
    explicit RandomSession(uint64_t seed, bool wireless = false);

    // The header of a recording of this session: a keyboard cover's trackpad of 100 x 60.
    formats::FrameRecordingHeader header() const;
    // The next input record.
    formats::InputRecord next();

private:
    struct Finger {
        bool down = false;
        bool lifting = false;  // reported once more with touch 0
        bool palm = false;
        int framesLeft = 0;    // until it lifts
        double x = 0, y = 0, dx = 0, dy = 0;
        bool justDown = false;
    };

    HIDEventRef frame();
    double uniform(double lo, double hi) { return std::uniform_real_distribution<double>(lo, hi)(rng_); }
    int below(int n) { return std::uniform_int_distribution<int>(0, n - 1)(rng_); }
    bool chance(double p) { return uniform(0.0, 1.0) < p; }

    std::mt19937_64 rng_;
    bool wireless_;
    uint64_t timestamp_ = 1000000000;  // ticks (ns); starts at 1 s
    uint16_t scanTime_ = 0;
    std::array<Finger, 5> fingers_{};
    int buttonMask_ = 0;
    int buttonFramesLeft_ = 0;
    int idleFrames_ = 0;
};

}  // namespace orvane::robust
