#pragma once
// Platform ticks to milliseconds, with the tick timebase read once and cached.

#include "platform/Timebase.h"

namespace orvane {

// The platform timebase, read on first use and kept for the process.
TimebaseInfo cachedTimebase();

// ticks × numerator / (denominator × 1,000,000), in double precision.
double ticksToMilliseconds(double ticks);

}  // namespace orvane
