#include "FrameBuilder.h"

#include <cmath>

#include "platform/Timebase.h"

namespace orvane::test {

uint64_t TestClock::msToTicks(double ms) {
    const TimebaseInfo tb = Timebase::info();
    return static_cast<uint64_t>(std::llround(ms * 1000000.0 * tb.denom / tb.numer));
}

double TestClock::ticksToMs(double ticks) {
    const TimebaseInfo tb = Timebase::info();
    return ticks * tb.numer / (tb.denom * 1000000.0);
}

HIDEventRef contactEvent(const ContactFields& c, uint64_t timestamp) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
    e->setDoubleValue(c.x, kHIDEventFieldDigitizerX);
    e->setDoubleValue(c.y, kHIDEventFieldDigitizerY);
    e->setIntegerValue(c.type, kHIDEventFieldDigitizerType);
    e->setIntegerValue(c.index, kHIDEventFieldDigitizerIndex);
    e->setIntegerValue(c.eventMask, kHIDEventFieldDigitizerEventMask);
    e->setIntegerValue(c.range, kHIDEventFieldDigitizerRange);
    e->setIntegerValue(c.touch, kHIDEventFieldDigitizerTouch);
    return e;
}

HIDEventRef frameEvent(uint64_t timestamp, const std::vector<HIDEventRef>& children, int32_t buttonMask) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
    int64_t touch = 0, range = 0, mask = 0;
    for (const auto& c : children) {
        touch |= c->integerValueForField(kHIDEventFieldDigitizerTouch) != 0;
        range |= c->integerValueForField(kHIDEventFieldDigitizerRange) != 0;
        mask |= c->integerValueForField(kHIDEventFieldDigitizerEventMask);
    }
    e->setIntegerValue(buttonMask, kHIDEventFieldDigitizerButtonMask);
    e->setIntegerValue(mask, kHIDEventFieldDigitizerEventMask);
    e->setIntegerValue(range, kHIDEventFieldDigitizerRange);
    e->setIntegerValue(touch, kHIDEventFieldDigitizerTouch);
    for (const auto& c : children) e->appendEvent(c);
    return e;
}

Hand& Hand::finger(int index) {
    selected_ = index;
    fingers_[index];
    return *this;
}

Hand& Hand::at(float x, float y) {
    FingerState& f = fingers_[selected_];
    f.x = x;
    f.y = y;
    return *this;
}

Hand& Hand::down() {
    FingerState& f = fingers_[selected_];
    f.touching = true;
    f.lifting = false;
    return *this;
}

Hand& Hand::moveTo(float x, float y) { return at(x, y); }

Hand& Hand::up() {
    FingerState& f = fingers_[selected_];
    if (f.touching) f.lifting = true;
    f.touching = false;
    return *this;
}

Hand& Hand::palm(bool isPalm) {
    fingers_[selected_].palm = isPalm;
    return *this;
}

Hand& Hand::press() {
    buttonMask_ = 1;
    return *this;
}

Hand& Hand::release() {
    buttonMask_ = 0;
    return *this;
}

Hand& Hand::wireless(bool on) {
    wireless_ = on;
    return *this;
}

HIDEventRef Hand::frame() {
    const uint64_t t = clock_.ticks();
    std::vector<HIDEventRef> children;
    for (auto& [index, f] : fingers_) {
        if (!f.touching && !f.lifting) {
            f.reported = false;
            continue;
        }
        ContactFields c;
        c.index = index;
        c.x = normalisedX(f.x);
        c.y = normalisedY(f.y);
        c.touch = f.touching ? 1 : 0;
        c.range = f.touching ? 1 : 0;
        c.type = f.palm ? 3 : 1;
        int32_t mask = 0;
        if (!f.reported || f.lastTouching != f.touching) mask |= kHIDDigitizerEventRange | kHIDDigitizerEventTouch;
        if (f.reported && (f.lastX != f.x || f.lastY != f.y)) mask |= kHIDDigitizerEventPosition;
        c.eventMask = mask;
        children.push_back(contactEvent(c, t));
        f.reported = true;
        f.lastX = f.x;
        f.lastY = f.y;
        f.lastTouching = f.touching;
        f.lifting = false;
    }
    HIDEventRef e = frameEvent(t, children, buttonMask_);
    if (wireless_) {
        // The relative scan time in 100 µs units, 16 bits, little-endian.
        const uint16_t scan = static_cast<uint16_t>(std::llround(clock_.nowMs() * 10.0) & 0xffff);
        auto v = HIDEvent::create(kHIDEventTypeVendorDefined, t);
        v->setIntegerValue(13, kHIDEventFieldVendorDefinedUsagePage);
        v->setIntegerValue(86, kHIDEventFieldVendorDefinedUsage);
        v->setIntegerValue(2, kHIDEventFieldVendorDefinedDataLength);
        const uint8_t bytes[2] = {static_cast<uint8_t>(scan & 0xff), static_cast<uint8_t>(scan >> 8)};
        v->setDataValue(bytes, 2, kHIDEventFieldVendorDefinedData);
        e->appendEvent(v);
    }
    return e;
}

std::vector<HIDEventRef> Hand::frames(int n, double everyMs, float dx, float dy) {
    std::vector<HIDEventRef> out;
    for (int i = 0; i < n; ++i) {
        FingerState& f = fingers_[selected_];
        f.x += dx;
        f.y += dy;
        out.push_back(frame());
        clock_.advance(everyMs);
    }
    return out;
}

}  // namespace orvane::test
