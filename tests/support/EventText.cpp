#include "EventText.h"

#include <cstdio>

namespace orvane::test {

std::string numberText(double v) {
    char buf[32];
    std::snprintf(buf, sizeof buf, "%g", v == 0.0 ? 0.0 : v);
    return buf;
}

std::string phaseText(uint16_t phase) {
    switch (phase) {
    case 0: return "none";
    case 1: return "began";
    case 2: return "changed";
    case 4: return "ended";
    case 8: return "cancelled";
    case 0x80: return "maybegin";
    default: return "phase" + std::to_string(phase);
    }
}

std::string pointerEventText(const HIDEventRef& pointer, const PointerTextOptions& options) {
    if (!pointer) return "none";
    std::string out;
    const double dx = pointer->doubleValueForField(kHIDEventFieldPointerX);
    const double dy = pointer->doubleValueForField(kHIDEventFieldPointerY);
    if (dx != 0.0 || dy != 0.0) out += "move(" + numberText(dx) + "," + numberText(dy) + ")";
    for (const HIDEventRef& c : pointer->children()) {
        if (!out.empty()) out += " ";
        switch (c->type()) {
        case kHIDEventTypeDigitizer: out += "hand"; break;
        case kHIDEventTypeButton:
            out += "button:" + std::to_string(c->integerValueForField(kHIDEventFieldButtonMask));
            break;
        case kHIDEventTypeScroll:
            out += "scroll:" + phaseText(c->phase()) + "(" + numberText(c->doubleValueForField(kHIDEventFieldScrollX)) +
                   "," + numberText(c->doubleValueForField(kHIDEventFieldScrollY)) + ")";
            break;
        case kHIDEventTypeScale:
        case kHIDEventTypeRotation: {
            out += c->type() == kHIDEventTypeScale ? "scale:" : "rotate:";
            out += phaseText(c->phase());
            if (options.scaleRotateValues) out += "(" + numberText(c->doubleValueForField(hidFieldSelector(c->type(), 2))) + ")";
            break;
        }
        default: out += "type" + std::to_string(c->type()); break;
        }
    }
    return out.empty() ? options.bare : out;
}

}  // namespace orvane::test
