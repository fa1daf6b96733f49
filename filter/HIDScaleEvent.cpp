#include "HIDScaleEvent.h"

#include <bit>

#include "filter/FilterLogging.h"

namespace orvane {

HIDEventRef HIDScaleEvent::scaleEvent(uint64_t timestamp, double x, double y, double z, uint32_t options) {
    return HIDEvent::createScaleEvent(timestamp, x, y, z, options);
}

HIDEventRef HIDScaleEvent::rotationEvent(uint64_t timestamp, double x, double y, double z, uint32_t options) {
    return HIDEvent::createRotationEvent(timestamp, x, y, z, options);
}

HIDEventRef HIDScaleEvent::statefulButtonEvent(uint64_t timestamp, uint32_t buttonMask, uint32_t options) {
    HIDEventRef event = HIDEvent::createButtonEvent(timestamp, buttonMask, options);
    HIDStatefulButtonEvent::setStatefulButtonMask(*event, buttonMask);
    return event;
}

void HIDStatefulButtonEvent::setStatefulButtonMask(HIDEvent& event, uint32_t mask) {
    event.setIntegerValue(mask, kHIDEventFieldButtonMask);
    if (std::popcount(mask) > 1) {
        // One button event names one button: the whole mask is still stored, the number
        // names only the lowest of its buttons.
        LoggingServiceFilter()->log(LogLevel::Error,
                                    "%s Mask (0x%x) has more than one bit set. Button state cannot be "
                                    "represented correctly with just one event",
                                    "-[HIDEvent(HIDStatefulButtonEvent) setStatefulButtonMask:]", mask);
    }
    // A release reports button 1.
    const int64_t buttonNumber = mask != 0 ? std::countr_zero(mask) + 1 : 1;
    event.setIntegerValue(buttonNumber, kHIDEventFieldButtonNumber);
    event.setIntegerValue(mask != 0 ? 1 : 0, kHIDEventFieldButtonState);
}

}  // namespace orvane
