#include "TouchFrameConverter.h"

#include <algorithm>
#include <cstring>

#include "EvdevCodes.h"

namespace orvane::evemu {

namespace {

// More slots than any touchpad has; a description that claims more is damaged.
constexpr int32_t kMaxSlots = 64;

// The relative scan time child: vendor-defined usage page 13 (digitizer), usage 86.
constexpr int64_t kScanTimeUsagePage = 13;
constexpr int64_t kScanTimeUsage = 86;
constexpr uint64_t kScanTimeUnit_us = 100;

std::string joined(const std::vector<std::string>& names) {
    std::string s;
    for (size_t i = 0; i < names.size(); ++i) s += (i == 0 ? "" : i + 1 == names.size() ? " and " : ", ") + names[i];
    return s;
}

}  // namespace

bool touchpadLayoutFor(const EvdevDevice& device, TouchpadLayout* layout, std::string* error) {
    const bool hasX = device.axis(kAbsMtPositionX), hasY = device.axis(kAbsMtPositionY);
    const bool hasSlot = device.axis(kAbsMtSlot);
    std::vector<std::string> missing;
    for (uint16_t code : {kAbsMtPositionX, kAbsMtPositionY, kAbsMtSlot, kAbsMtTrackingId})
        if (!device.axis(code)) missing.push_back(eventCodeName(kEvAbs, code));
    if (!missing.empty()) {
        const char* what = !hasX && !hasY          ? "a single-touch device"
                           : hasX && hasY && !hasSlot ? "a protocol-A multitouch device"
                                                      : "an incomplete multitouch device";
        *error = std::string(what) + ": its description has no A: line for " + joined(missing) +
                 ", and the conversion needs multitouch slots with tracking IDs (protocol B)";
        return false;
    }
    TouchpadLayout l;
    l.device = device;
    l.x = *device.axis(kAbsMtPositionX);
    l.y = *device.axis(kAbsMtPositionY);
    for (const auto& [code, axis] : {std::pair{kAbsMtPositionX, l.x}, std::pair{kAbsMtPositionY, l.y}}) {
        if (axis.maximum == axis.minimum) {
            *error = eventCodeName(kEvAbs, code) + " has an empty range (minimum and maximum " +
                     std::to_string(axis.minimum) + ")";
            return false;
        }
    }
    const EvdevAxis& slot = *device.axis(kAbsMtSlot);
    if (slot.minimum != 0 || slot.maximum < 0 || slot.maximum >= kMaxSlots) {
        *error = "ABS_MT_SLOT must count from 0 to at most " + std::to_string(kMaxSlots - 1) + ", not from " +
                 std::to_string(slot.minimum) + " to " + std::to_string(slot.maximum);
        return false;
    }
    l.slots = slot.maximum + 1;
    for (uint16_t code = kBtn0; code <= kBtnTask; ++code)
        if (isPhysicalButton(code) && device.hasCode(kEvKey, code)) l.buttons.push_back(code);
    l.clickpad = device.hasProperty(kInputPropButtonpad) ||
                 (l.buttons.size() == 1 && l.buttons.front() == kBtnLeft);
    l.wireless = device.bus == kBusBluetooth;
    *layout = std::move(l);
    return true;
}

TouchFrameConverter::TouchFrameConverter(TouchpadLayout layout)
    : layout_(std::move(layout)), slots_(static_cast<size_t>(std::max(layout_.slots, 0))) {}

double TouchFrameConverter::normalised(int32_t value, const EvdevAxis& axis) const {
    const double f = (double(value) - double(axis.minimum)) / (double(axis.maximum) - double(axis.minimum));
    return std::clamp(f, 0.0, 1.0);
}

bool TouchFrameConverter::feed(const EvdevEvent& event, std::vector<HIDEventRef>* out, std::string* error) {
    switch (event.type) {
    case kEvSyn:
        switch (event.code) {
        case kSynReport: report(event.time_ns, out); return true;
        case kSynMtReport:
            *error = "SYN_MT_REPORT belongs to multitouch protocol A; the conversion needs slots with tracking IDs "
                     "(protocol B)";
            return false;
        case kSynDropped:
            *error = "SYN_DROPPED: events were lost here, so the touchpad's state after it is unknown";
            return false;
        default: return true;
        }
    case kEvAbs: return absolute(event, error);
    case kEvKey: return key(event, error);
    case kEvMsc:
        if (event.code == kMscTimestamp && layout_.wireless) {
            const uint32_t now = static_cast<uint32_t>(event.value);
            // The kernel's microsecond count wraps at 32 bits; the difference does not.
            deviceMicroseconds_ = haveScanTime_ ? deviceMicroseconds_ + uint32_t(now - lastDeviceMicroseconds_) : now;
            lastDeviceMicroseconds_ = now;
            haveScanTime_ = true;
            scanTimeInFrame_ = true;
        }
        return true;
    default: return true;
    }
}

bool TouchFrameConverter::absolute(const EvdevEvent& event, std::string* error) {
    if (!layout_.device.axis(event.code)) {
        *error = eventCodeName(kEvAbs, event.code) + " is not an axis of this device (it has no A: line)";
        return false;
    }
    Slot& slot = slots_[static_cast<size_t>(currentSlot_)];
    switch (event.code) {
    case kAbsMtSlot:
        if (event.value < 0 || event.value >= layout_.slots) {
            *error = "slot " + std::to_string(event.value) + " is outside the device's slots 0 to " +
                     std::to_string(layout_.slots - 1);
            return false;
        }
        currentSlot_ = event.value;
        return true;
    case kAbsMtTrackingId:
        if (event.value < -1) {
            *error = "tracking ID " + std::to_string(event.value) + " is neither -1 (the contact ends) nor a contact";
            return false;
        }
        if (event.value != slot.trackingId && slot.reportedId != -1) slot.endedInFrame = true;
        slot.trackingId = event.value;
        return true;
    case kAbsMtPositionX: slot.x = event.value; return true;
    case kAbsMtPositionY: slot.y = event.value; return true;
    case kAbsMtToolType: slot.toolType = event.value; return true;
    default: return true;
    }
}

bool TouchFrameConverter::key(const EvdevEvent& event, std::string* error) {
    if (!layout_.device.hasCode(kEvKey, event.code)) {
        *error = eventCodeName(kEvKey, event.code) + " is not a key of this device (its B: 01 lines)";
        return false;
    }
    if (event.value < 0 || event.value > 2) {
        *error = eventCodeName(kEvKey, event.code) + " has the value " + std::to_string(event.value) +
                 " (0 up, 1 down, 2 held)";
        return false;
    }
    if (!isPhysicalButton(event.code)) return true;
    const bool down = event.value != 0;
    if (layout_.clickpad && event.code == kBtnLeft) {
        clickDown_ = down;
    } else {
        const uint32_t bit = 1u << (platformButtonNumber(event.code) - 1);
        buttonsDown_ = down ? buttonsDown_ | bit : buttonsDown_ & ~bit;
    }
    return true;
}

void TouchFrameConverter::report(uint64_t time, std::vector<HIDEventRef>* out) {
    for (uint16_t code : layout_.buttons) {
        if (layout_.clickpad && code == kBtnLeft) continue;
        const uint32_t number = platformButtonNumber(code);
        const uint32_t bit = 1u << (number - 1);
        if (((buttonsDown_ ^ buttonsReported_) & bit) == 0) continue;
        buttonsReported_ ^= bit;
        HIDEventRef button = HIDEvent::createButtonEvent(time, buttonsReported_, 0);
        button->setIntegerValue(number, kHIDEventFieldButtonNumber);
        button->setIntegerValue((buttonsReported_ & bit) ? 1 : 0, kHIDEventFieldButtonState);
        out->push_back(std::move(button));
    }

    HIDEventRef frame = HIDEvent::create(kHIDEventTypeDigitizer, time);
    int64_t parentMask = 0, parentTouch = 0, parentRange = 0;
    for (size_t index = 0; index < slots_.size(); ++index) {
        Slot& slot = slots_[index];
        const bool lifts = slot.reportedId != -1 && slot.endedInFrame;
        slot.endedInFrame = false;
        if (!lifts && slot.trackingId == -1) continue;
        double x = slot.reportedX, y = slot.reportedY;
        int64_t mask = kHIDDigitizerEventRange | kHIDDigitizerEventTouch;
        int64_t touching = 0;
        if (lifts) {
            // Reported once more where it was last seen, then no longer.
            slot.reportedId = -1;
        } else {
            x = normalised(slot.x, layout_.x);
            y = 1.0 - normalised(slot.y, layout_.y);
            touching = 1;
            if (slot.reportedId != -1) {
                mask = (x != slot.reportedX || y != slot.reportedY) ? int64_t(kHIDDigitizerEventPosition) : int64_t(0);
            } else {
                mask |= kHIDDigitizerEventPosition;
            }
            slot.reportedId = slot.trackingId;
            slot.reportedX = x;
            slot.reportedY = y;
        }
        HIDEventRef contact = HIDEvent::create(kHIDEventTypeDigitizer, time);
        contact->setDoubleValue(x, kHIDEventFieldDigitizerX);
        contact->setDoubleValue(y, kHIDEventFieldDigitizerY);
        const uint32_t transducer =
            slot.toolType == kMtToolPalm ? kHIDDigitizerTransducerTypePalm : kHIDDigitizerTransducerTypeFinger;
        contact->setIntegerValue(transducer, kHIDEventFieldDigitizerType);
        contact->setIntegerValue(static_cast<int64_t>(index), kHIDEventFieldDigitizerIndex);
        contact->setIntegerValue(mask, kHIDEventFieldDigitizerEventMask);
        contact->setIntegerValue(touching, kHIDEventFieldDigitizerRange);
        contact->setIntegerValue(touching, kHIDEventFieldDigitizerTouch);
        frame->appendEvent(contact);
        parentMask |= mask;
        parentTouch |= touching;
        parentRange |= touching;
    }
    frame->setIntegerValue(clickDown_ ? 1 : 0, kHIDEventFieldDigitizerButtonMask);
    frame->setIntegerValue(parentMask, kHIDEventFieldDigitizerEventMask);
    frame->setIntegerValue(parentRange, kHIDEventFieldDigitizerRange);
    frame->setIntegerValue(parentTouch, kHIDEventFieldDigitizerTouch);

    if (scanTimeInFrame_) {
        // After the contacts: the filter reads contacts by position from the first child.
        const uint16_t count = static_cast<uint16_t>((deviceMicroseconds_ / kScanTimeUnit_us) & 0xffff);
        uint8_t bytes[2];
        std::memcpy(bytes, &count, sizeof bytes);
        HIDEventRef scan = HIDEvent::create(kHIDEventTypeVendorDefined, time);
        scan->setIntegerValue(kScanTimeUsagePage, kHIDEventFieldVendorDefinedUsagePage);
        scan->setIntegerValue(kScanTimeUsage, kHIDEventFieldVendorDefinedUsage);
        scan->setIntegerValue(sizeof bytes, kHIDEventFieldVendorDefinedDataLength);
        scan->setDataValue(bytes, sizeof bytes, kHIDEventFieldVendorDefinedData);
        frame->appendEvent(scan);
        scanTimeInFrame_ = false;
    }
    out->push_back(std::move(frame));
    ++frames_;
}

}  // namespace orvane::evemu
