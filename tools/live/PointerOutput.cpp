#include "PointerOutput.h"

#include <linux/input-event-codes.h>

#include <cmath>
#include <limits>

namespace orvane::live {

namespace {

constexpr uint16_t kPhaseBegan = 1;
constexpr uint16_t kPhaseMayBegin = 0x80;

// A field's value, or 0 when it is not a finite number.
double finite(double v) { return std::isfinite(v) ? v : 0.0; }

}  // namespace

PointerOutput::PointerOutput(VirtualPointer& pointer, double scrollFactor)
    : pointer_(pointer), scrollFactor_(scrollFactor) {}

uint16_t PointerOutput::buttonCode(int64_t number) {
    if (number >= 1 && number <= 8) return static_cast<uint16_t>(BTN_LEFT + number - 1);
    if (number >= 9 && number <= kButtons) return static_cast<uint16_t>(BTN_0 + number - 9);
    return 0;
}

bool PointerOutput::isDown(uint16_t code) const {
    for (int n = 1; n <= kButtons; ++n)
        if (buttonCode(n) == code) return (written_ >> (n - 1) & 1u) != 0;
    return false;
}

int32_t PointerOutput::takeWhole(double* remainder) {
    constexpr double kLimit = std::numeric_limits<int32_t>::max();
    double whole = std::trunc(*remainder);
    if (whole > kLimit) whole = kLimit;
    if (whole < -kLimit) whole = -kLimit;
    *remainder -= whole;
    return static_cast<int32_t>(whole);
}

bool PointerOutput::emit(uint16_t type, uint16_t code, int32_t value) {
    if (failed_) return false;
    if (!pointer_.write(type, code, value, &error_)) {
        failed_ = true;
        return false;
    }
    if (type == EV_SYN && code == SYN_REPORT) {
        pending_ = false;
        ++reports_;
    } else {
        pending_ = true;
    }
    return true;
}

void PointerOutput::pointerMotion(const HIDEvent& event) {
    remainderX_ += finite(event.doubleValueForField(kHIDEventFieldPointerX));
    remainderY_ += finite(event.doubleValueForField(kHIDEventFieldPointerY));
    const int32_t dx = takeWhole(&remainderX_);
    const int32_t dy = takeWhole(&remainderY_);
    if (dx != 0) emit(EV_REL, REL_X, dx);
    if (dy != 0) emit(EV_REL, REL_Y, dy);
}

void PointerOutput::scroll(const HIDEvent& event) {
    if (event.phase() & (kPhaseBegan | kPhaseMayBegin)) {
        wheelRemainder_ = hwheelRemainder_ = 0.0;
        wheelUnits_ = hwheelUnits_ = 0;
    }
    wheelRemainder_ += finite(event.doubleValueForField(kHIDEventFieldScrollY)) * scrollFactor_;
    hwheelRemainder_ -= finite(event.doubleValueForField(kHIDEventFieldScrollX)) * scrollFactor_;
    const int32_t wheel = takeWhole(&wheelRemainder_);
    const int32_t hwheel = takeWhole(&hwheelRemainder_);
    if (wheel != 0) {
        emit(EV_REL, REL_WHEEL_HI_RES, wheel);
        wheelUnits_ += wheel;
        const int32_t detents = wheelUnits_ / kHighResolutionPerDetent;
        wheelUnits_ -= detents * kHighResolutionPerDetent;
        if (detents != 0) emit(EV_REL, REL_WHEEL, detents);
    }
    if (hwheel != 0) {
        emit(EV_REL, REL_HWHEEL_HI_RES, hwheel);
        hwheelUnits_ += hwheel;
        const int32_t detents = hwheelUnits_ / kHighResolutionPerDetent;
        hwheelUnits_ -= detents * kHighResolutionPerDetent;
        if (detents != 0) emit(EV_REL, REL_HWHEEL, detents);
    }
}

bool PointerOutput::writeButtons() {
    const uint32_t wanted = filterButtons_ | physicalButtons_;
    for (int n = 1; n <= kButtons; ++n) {
        const uint32_t bit = 1u << (n - 1);
        if ((wanted & bit) == (written_ & bit)) continue;
        if (!emit(EV_KEY, buttonCode(n), (wanted & bit) ? 1 : 0)) return false;
        written_ ^= bit;
    }
    return true;
}

bool PointerOutput::deliver(const HIDEvent& event, std::string* error) {
    constexpr uint32_t kAllButtons = (1u << kButtons) - 1;
    switch (event.type()) {
    case kHIDEventTypePointer:
        pointerMotion(event);
        for (const HIDEventRef& child : event.children()) {
            if (!child) continue;
            if (child->type() == kHIDEventTypeScroll) {
                scroll(*child);
            } else if (child->type() == kHIDEventTypeButton) {
                filterButtons_ =
                    static_cast<uint32_t>(child->integerValueForField(kHIDEventFieldButtonMask)) & kAllButtons;
                writeButtons();
            }
        }
        break;
    case kHIDEventTypeButton: {
        const int64_t number = event.integerValueForField(kHIDEventFieldButtonNumber);
        if (buttonCode(number) != 0) {
            const uint32_t bit = 1u << (number - 1);
            if (event.integerValueForField(kHIDEventFieldButtonState) != 0)
                physicalButtons_ |= bit;
            else
                physicalButtons_ &= ~bit;
            writeButtons();
        }
        break;
    }
    default: break;
    }
    if (pending_) emit(EV_SYN, SYN_REPORT, 0);
    if (failed_) {
        *error = error_;
        return false;
    }
    return true;
}

bool PointerOutput::releaseAll(std::string* error) {
    filterButtons_ = physicalButtons_ = 0;
    writeButtons();
    if (pending_) emit(EV_SYN, SYN_REPORT, 0);
    if (failed_) {
        *error = error_;
        return false;
    }
    return true;
}

}  // namespace orvane::live
