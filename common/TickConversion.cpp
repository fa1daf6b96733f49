#include "TickConversion.h"

namespace orvane {

TimebaseInfo cachedTimebase() {
    static const TimebaseInfo info = Timebase::info();
    return info;
}

TickScale cachedTickScale() {
    const TimebaseInfo tb = cachedTimebase();
    return TickScale{static_cast<double>(tb.numer), static_cast<double>(tb.denom) * 1000000.0};
}

double ticksToMillisecondsFromTimebase(double ticks) {
    const TimebaseInfo tb = cachedTimebase();
    return ticks * static_cast<double>(tb.numer) / (static_cast<double>(tb.denom) * 1000000.0);
}

}  // namespace orvane
