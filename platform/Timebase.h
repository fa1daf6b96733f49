#pragma once
// The platform clock's tick timebase: one tick lasts numerator / denominator nanoseconds.
// It is read once per process; a host may set it before the first read. On Linux a
// tick is a nanosecond (1/1).

#include <cstdint>

namespace orvane {

struct TimebaseInfo {
    uint32_t numer;
    uint32_t denom;
};

namespace Timebase {
// The timebase; the first call fixes it for the rest of the process.
TimebaseInfo info();
// Sets the timebase; false (and nothing changes) once it has been read, or for a zero part.
bool set(uint32_t numer, uint32_t denom);
}  // namespace Timebase

}  // namespace orvane
