#include "RandomSession.h"

#include <cmath>
#include <limits>

namespace orvane::robust {

namespace {

constexpr uint64_t kFrameTicks = 8000000;  // 8 ms at 1/1

}  // namespace

RandomSession::RandomSession(uint64_t seed, bool wireless) : rng_(seed), wireless_(wireless) {}

formats::FrameRecordingHeader RandomSession::header() const {
    formats::FrameRecordingHeader h;
    h.service.usagePairs = {{13, 5}, {13, 34}, {1, 6}};
    h.service.properties = PropertyDictionary{
        {"SurfaceDimensions", PropertyDictionary{{"Width", int64_t{655360}}, {"Height", int64_t{393216}}}},
        {"Transport", wireless_ ? "Bluetooth" : "USB"}};
    return h;
}

formats::InputRecord RandomSession::next() {
    formats::InputRecord record;
    const int pick = below(1000);
    if (pick < 4) {
        static const char* const kKeys[] = {"TapToClickEnabled", "TwoFingersSecondaryClickEnabled"};
        record.kind = formats::InputRecord::Kind::SetProperty;
        record.propertyKey = kKeys[below(2)];
        // Mostly on, so that taps click and the dispatcher is used.
        record.propertyValue = PropertyValue(chance(0.8));
    } else if (pick < 6) {
        record.kind = formats::InputRecord::Kind::Client;
        record.clientID = static_cast<uint64_t>(below(3) + 1);
        record.clientAdded = chance(0.7);
    } else if (pick < 10) {
        auto keyboard = HIDEvent::create(kHIDEventTypeKeyboard, timestamp_);
        keyboard->setIntegerValue(7, kHIDEventFieldKeyboardUsagePage);
        keyboard->setIntegerValue(4 + below(26), kHIDEventFieldKeyboardUsage);
        keyboard->setIntegerValue(below(2), kHIDEventFieldKeyboardDown);
        record.event = keyboard;
    } else {
        record.event = frame();
    }
    return record;
}

HIDEventRef RandomSession::frame() {
    // The clock: 8 ms a frame, sometimes a pause; rarely repeated or stepping back.
    if (chance(0.002)) {
        // repeated
    } else if (chance(0.001)) {
        timestamp_ -= kFrameTicks / 2;
    } else {
        timestamp_ += kFrameTicks;
        scanTime_ = static_cast<uint16_t>(scanTime_ + 80);
        if (idleFrames_ > 0) {
            const uint64_t pause = static_cast<uint64_t>(below(400)) * 1000000;
            timestamp_ += pause;
            scanTime_ = static_cast<uint16_t>(scanTime_ + pause / 100000);
        }
    }

    // New touches: a finger lands now and then, more often when the pad is idle.
    for (size_t i = 0; i < fingers_.size(); ++i) {
        Finger& f = fingers_[i];
        f.justDown = false;
        if (f.down || f.lifting) continue;
        if (chance(idleFrames_ > 0 ? 0.05 : 0.01)) {
            f.down = true;
            f.justDown = true;
            f.palm = chance(0.03);
            f.x = uniform(0.05, 0.95);
            f.y = uniform(0.05, 0.95);
            const bool tap = chance(0.3);
            f.framesLeft = tap ? 2 + below(10) : 5 + below(120);
            const double speed = tap ? 0.0 : (chance(0.3) ? 0.0 : uniform(0.0, 0.02));
            const double angle = uniform(0.0, 6.283185307179586);
            f.dx = speed * std::cos(angle);
            f.dy = speed * std::sin(angle);
        }
    }
    // The click: pressed for a while, now and then.
    if (buttonFramesLeft_ > 0) {
        if (--buttonFramesLeft_ == 0) buttonMask_ = 0;
    } else if (chance(0.004)) {
        buttonMask_ = chance(0.95) ? 1 : 1 + below(7);  // rarely several bits
        buttonFramesLeft_ = 3 + below(30);
    }

    auto parent = HIDEvent::create(kHIDEventTypeDigitizer, timestamp_);
    int64_t touch = 0, range = 0, eventMask = 0;
    for (size_t i = 0; i < fingers_.size(); ++i) {
        Finger& f = fingers_[i];
        if (!f.down && !f.lifting) continue;
        int64_t mask = 0;
        if (f.lifting) {
            mask = 3;
        } else if (f.justDown) {
            mask = 7;
        } else if (f.dx != 0.0 || f.dy != 0.0) {
            f.x = std::fmin(1.0, std::fmax(0.0, f.x + f.dx));
            f.y = std::fmin(1.0, std::fmax(0.0, f.y + f.dy));
            mask = 4;
        }
        auto child = HIDEvent::create(kHIDEventTypeDigitizer, timestamp_);
        double x = f.x, y = f.y;
        int64_t index = static_cast<int64_t>(i);
        if (chance(0.0005)) x = std::numeric_limits<double>::quiet_NaN();
        if (chance(0.0005)) index = chance(0.5) ? 14 + below(100) : -1 - below(100);
        child->setDoubleValue(x, kHIDEventFieldDigitizerX);
        child->setDoubleValue(y, kHIDEventFieldDigitizerY);
        child->setIntegerValue(f.palm ? 3 : 1, kHIDEventFieldDigitizerType);
        child->setIntegerValue(index, kHIDEventFieldDigitizerIndex);
        child->setIntegerValue(mask, kHIDEventFieldDigitizerEventMask);
        child->setIntegerValue(f.lifting ? 0 : 1, kHIDEventFieldDigitizerRange);
        child->setIntegerValue(f.lifting ? 0 : 1, kHIDEventFieldDigitizerTouch);
        parent->appendEvent(child);
        touch |= f.lifting ? 0 : 1;
        range |= f.lifting ? 0 : 1;
        eventMask |= mask;

        if (f.lifting) {
            f.lifting = false;
        } else if (--f.framesLeft <= 0) {
            f.down = false;
            f.lifting = true;
        }
    }
    parent->setIntegerValue(buttonMask_, kHIDEventFieldDigitizerButtonMask);
    parent->setIntegerValue(eventMask, kHIDEventFieldDigitizerEventMask);
    parent->setIntegerValue(range, kHIDEventFieldDigitizerRange);
    parent->setIntegerValue(touch, kHIDEventFieldDigitizerTouch);
    if (wireless_) {
        auto scan = HIDEvent::create(kHIDEventTypeVendorDefined, timestamp_);
        scan->setIntegerValue(13, kHIDEventFieldVendorDefinedUsagePage);
        scan->setIntegerValue(86, kHIDEventFieldVendorDefinedUsage);
        scan->setIntegerValue(2, kHIDEventFieldVendorDefinedDataLength);
        const uint8_t bytes[2] = {static_cast<uint8_t>(scanTime_ & 0xff), static_cast<uint8_t>(scanTime_ >> 8)};
        scan->setDataValue(bytes, 2, kHIDEventFieldVendorDefinedData);
        parent->appendEvent(scan);
    }
    idleFrames_ = parent->children().empty() ? idleFrames_ + 1 : 0;
    return parent;
}

}  // namespace orvane::robust
