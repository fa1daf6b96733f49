#pragma once
// Platform ticks to milliseconds, with the tick timebase read once and cached.

#include "platform/Timebase.h"

namespace orvane {

// The platform timebase, read on first use and kept for the process.
TimebaseInfo cachedTimebase();

// The two factors of the conversion in double precision: the numerator, and the
// denominator times 1,000,000.
struct TickScale {
    double numer;
    double denomTimesMillion;
};

// The factors of the cached timebase.
TickScale cachedTickScale();

// ticks × numerator / (denominator × 1,000,000), in double precision: the same two steps
// as ticksToMillisecondsFromTimebase, with the factors worked out once.
inline double ticksToMilliseconds(double ticks) {
    static const TickScale scale = cachedTickScale();
    return ticks * scale.numer / scale.denomTimesMillion;
}

// The same conversion, reading the timebase and widening its parts on every call.
double ticksToMillisecondsFromTimebase(double ticks);

}  // namespace orvane
