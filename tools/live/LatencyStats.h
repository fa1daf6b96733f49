#pragma once
// Frames handled and the time from reading each frame's SYN_REPORT to having written its
// output, kept in whole microseconds in a fixed table (no allocation per frame): median,
// 99th percentile and maximum are exact to the microsecond; a latency of a second or more
// counts as a second for the percentiles and exactly for the maximum.

#include <cstdint>
#include <string>
#include <vector>

namespace orvane::live {

class LatencyStats {
public:
    static constexpr uint32_t kTableMicroseconds = 1'000'000;

    LatencyStats();

    void add(uint64_t nanoseconds);

    uint64_t count() const { return count_; }
    // The latency that `fraction` (0.5: the median) of the frames did not exceed, in
    // microseconds: the smallest value with at least ceil(fraction × count) frames at or
    // below it. 0 without frames.
    uint64_t percentileMicroseconds(double fraction) const;
    uint64_t maximumNanoseconds() const { return maximum_; }

    // "1234 frames handled; latency from reading a frame's SYN_REPORT to writing its output:
    // median 41 us, 99th percentile 97 us, maximum 412 us"
    std::string summary() const;

private:
    std::vector<uint32_t> table_;  // frames per whole microsecond
    uint64_t count_ = 0;
    uint64_t maximum_ = 0;
};

}  // namespace orvane::live
