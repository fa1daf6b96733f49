#include "Timebase.h"

#include <mutex>

namespace orvane::Timebase {

namespace {
std::mutex gMutex;
TimebaseInfo gInfo{1, 1};
bool gRead = false;
}  // namespace

TimebaseInfo info() {
    std::lock_guard<std::mutex> lock(gMutex);
    gRead = true;
    return gInfo;
}

bool set(uint32_t numer, uint32_t denom) {
    std::lock_guard<std::mutex> lock(gMutex);
    if (gRead || numer == 0 || denom == 0) return false;
    gInfo = TimebaseInfo{numer, denom};
    return true;
}

}  // namespace orvane::Timebase
