#pragma once
// One-line constructors for the events the gesture stage makes that the platform's event
// object lacks: scale, rotation and stateful button events. Each wraps one platform
// creation call and hands the new event to the caller to keep.

#include <cstdint>

#include "platform/HIDEvent.h"

namespace orvane {

struct HIDScaleEvent {
    // A scale event with these values, unchanged.
    static HIDEventRef scaleEvent(uint64_t timestamp, double x, double y, double z, uint32_t options);
    // A rotation event with these values, unchanged.
    static HIDEventRef rotationEvent(uint64_t timestamp, double x, double y, double z, uint32_t options);
    // A button event whose mask, number and state all describe `buttonMask`.
    static HIDEventRef statefulButtonEvent(uint64_t timestamp, uint32_t buttonMask, uint32_t options);
};

struct HIDStatefulButtonEvent {
    // Stores the mask, the number of its lowest button (1 for a release) and the state
    // (pressed when any bit is set).
    static void setStatefulButtonMask(HIDEvent& event, uint32_t mask);
};

}  // namespace orvane
