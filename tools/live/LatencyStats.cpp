#include "LatencyStats.h"

#include <cmath>
#include <cstdio>

namespace orvane::live {

LatencyStats::LatencyStats() : table_(kTableMicroseconds + 1, 0) {}

void LatencyStats::add(uint64_t nanoseconds) {
    uint64_t us = nanoseconds / 1000;
    if (us > kTableMicroseconds) us = kTableMicroseconds;
    ++table_[us];
    ++count_;
    if (nanoseconds > maximum_) maximum_ = nanoseconds;
}

uint64_t LatencyStats::percentileMicroseconds(double fraction) const {
    if (count_ == 0) return 0;
    uint64_t rank = static_cast<uint64_t>(std::ceil(fraction * static_cast<double>(count_)));
    if (rank < 1) rank = 1;
    if (rank > count_) rank = count_;
    uint64_t seen = 0;
    for (uint32_t us = 0; us <= kTableMicroseconds; ++us) {
        seen += table_[us];
        if (seen >= rank) return us;
    }
    return kTableMicroseconds;
}

std::string LatencyStats::summary() const {
    char text[256];
    if (count_ == 0) {
        std::snprintf(text, sizeof(text), "0 frames handled");
    } else {
        std::snprintf(text, sizeof(text),
                      "%llu frames handled; latency from reading a frame's SYN_REPORT to writing its output: "
                      "median %llu us, 99th percentile %llu us, maximum %llu us",
                      static_cast<unsigned long long>(count_),
                      static_cast<unsigned long long>(percentileMicroseconds(0.5)),
                      static_cast<unsigned long long>(percentileMicroseconds(0.99)),
                      static_cast<unsigned long long>(maximum_ / 1000));
    }
    return text;
}

}  // namespace orvane::live
