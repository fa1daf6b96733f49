#pragma once
// What an input device says about itself: name, identity, properties, the codes it sends
// and the range of each absolute axis. An evemu description fills it from its N:, I:, P:,
// B: and A: lines; a live device would fill it from its ioctls.

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace orvane::evemu {

struct EvdevAxis {
    int32_t minimum = 0;
    int32_t maximum = 0;
    int32_t fuzz = 0;
    int32_t flat = 0;
    int32_t resolution = 0;  // units per millimetre; 0 when the device does not say
};

struct EvdevDevice {
    std::string name;
    uint16_t bus = 0;
    uint16_t vendor = 0;
    uint16_t product = 0;
    uint16_t version = 0;
    std::vector<uint8_t> properties;                   // one bit per INPUT_PROP_*
    std::map<uint16_t, std::vector<uint8_t>> codes;     // per event type, one bit per code
    std::map<uint16_t, EvdevAxis> axes;                 // per EV_ABS code

    bool hasProperty(unsigned property) const { return bit(properties, property); }
    bool hasCode(uint16_t type, uint16_t code) const {
        auto it = codes.find(type);
        return it != codes.end() && bit(it->second, code);
    }
    const EvdevAxis* axis(uint16_t code) const {
        auto it = axes.find(code);
        return it == axes.end() ? nullptr : &it->second;
    }

private:
    static bool bit(const std::vector<uint8_t>& bits, unsigned n) {
        return n / 8 < bits.size() && (bits[n / 8] >> (n % 8) & 1) != 0;
    }
};

// One input event: the time in nanoseconds, type, code and value.
struct EvdevEvent {
    uint64_t time_ns = 0;
    uint16_t type = 0;
    uint16_t code = 0;
    int32_t value = 0;
};

}  // namespace orvane::evemu
