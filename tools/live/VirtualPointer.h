#pragma once
// The pointing device the desktop sees: relative motion, wheels and buttons. The live bridge
// writes to a uinput device; tests capture what would have been written.

#include <cstdint>
#include <string>
#include <vector>

namespace orvane::live {

class VirtualPointer {
public:
    virtual ~VirtualPointer() = default;
    // Writes one input event (type, code, value); an EV_SYN SYN_REPORT ends a report.
    // False with a message when the device refuses it.
    virtual bool write(uint16_t type, uint16_t code, int32_t value, std::string* error) = 0;
};

// Keeps every event written, in order.
class CapturePointer : public VirtualPointer {
public:
    struct Written {
        uint16_t type;
        uint16_t code;
        int32_t value;
        bool operator==(const Written&) const = default;
    };
    bool write(uint16_t type, uint16_t code, int32_t value, std::string*) override {
        written.push_back({type, code, value});
        return true;
    }
    std::vector<Written> written;
};

}  // namespace orvane::live
