#include "HIDEvent.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

namespace orvane {

namespace {

bool knownKind(uint32_t selector, HIDFieldKind* kind) {
    const uint32_t type = selector >> 16;
    const uint32_t index = selector & 0xffff;
    switch (type) {
    case kHIDEventTypeVendorDefined:
        if (index <= 3) { *kind = HIDFieldKind::Integer; return true; }
        if (index == 4) { *kind = HIDFieldKind::Data; return true; }
        return false;
    case kHIDEventTypeButton:
        if (index == 0 || index == 1 || index == 4) { *kind = HIDFieldKind::Integer; return true; }
        return false;
    case kHIDEventTypeKeyboard:
        if (index <= 2) { *kind = HIDFieldKind::Integer; return true; }
        return false;
    case kHIDEventTypeRotation:
    case kHIDEventTypeScroll:
    case kHIDEventTypeScale:
        if (index <= 2) { *kind = HIDFieldKind::Double; return true; }
        return false;
    case kHIDEventTypeDigitizer:
        if (index <= 2) { *kind = HIDFieldKind::Double; return true; }
        if ((index >= 3 && index <= 9) || index == 0x1b) { *kind = HIDFieldKind::Integer; return true; }
        return false;
    case kHIDEventTypePointer:
        if (index <= 2) { *kind = HIDFieldKind::Double; return true; }
        if (index == 3) { *kind = HIDFieldKind::Integer; return true; }
        return false;
    default: return false;
    }
}

// Truncation toward zero that stays defined for NaN and out-of-range values.
int64_t truncateToInteger(double v) {
    if (std::isnan(v)) return 0;
    if (v >= 9.2233720368547758e18) return INT64_MAX;
    if (v <= -9.2233720368547758e18) return INT64_MIN;
    return static_cast<int64_t>(v);
}

const std::vector<uint8_t> kNoData;

}  // namespace

HIDFieldKind hidFieldKind(uint32_t selector, HIDFieldKind fallback) {
    HIDFieldKind kind;
    return knownKind(selector, &kind) ? kind : fallback;
}

bool hidFieldIsKnown(uint32_t selector) {
    HIDFieldKind kind;
    return knownKind(selector, &kind);
}

HIDEvent::HIDEvent(uint32_t type, uint64_t timestamp, uint32_t options)
    : type_(type), options_(options), timestamp_(timestamp) {}

HIDEventRef HIDEvent::create(uint32_t type, uint64_t timestamp, uint32_t options) {
    return std::make_shared<HIDEvent>(type, timestamp, options);
}

HIDEventRef HIDEvent::pointerEvent(uint64_t timestamp, double x, double y, double z, uint32_t buttonMask,
                                   uint32_t options) {
    auto e = create(kHIDEventTypePointer, timestamp, options);
    e->setDoubleValue(x, kHIDEventFieldPointerX);
    e->setDoubleValue(y, kHIDEventFieldPointerY);
    e->setDoubleValue(z, kHIDEventFieldPointerZ);
    e->setIntegerValue(buttonMask, kHIDEventFieldPointerButtonMask);
    return e;
}

namespace {
HIDEventRef threeAxisEvent(uint32_t type, uint64_t timestamp, double x, double y, double z, uint32_t options) {
    auto e = HIDEvent::create(type, timestamp, options);
    e->setDoubleValue(x, hidFieldSelector(type, 0));
    e->setDoubleValue(y, hidFieldSelector(type, 1));
    e->setDoubleValue(z, hidFieldSelector(type, 2));
    return e;
}
}  // namespace

HIDEventRef HIDEvent::scrollEvent(uint64_t timestamp, double x, double y, double z, uint32_t options) {
    return threeAxisEvent(kHIDEventTypeScroll, timestamp, x, y, z, options);
}

HIDEventRef HIDEvent::createScaleEvent(uint64_t timestamp, double x, double y, double z, uint32_t options) {
    return threeAxisEvent(kHIDEventTypeScale, timestamp, x, y, z, options);
}

HIDEventRef HIDEvent::createRotationEvent(uint64_t timestamp, double x, double y, double z, uint32_t options) {
    return threeAxisEvent(kHIDEventTypeRotation, timestamp, x, y, z, options);
}

HIDEventRef HIDEvent::createButtonEvent(uint64_t timestamp, uint32_t buttonMask, uint32_t options) {
    auto e = create(kHIDEventTypeButton, timestamp, options);
    e->setIntegerValue(buttonMask, kHIDEventFieldButtonMask);
    return e;
}

const HIDEvent::Field* HIDEvent::findField(uint32_t selector) const {
    for (const Field& f : fields_) {
        if (f.selector == selector) return &f;
        if (f.selector > selector) break;
    }
    return nullptr;
}

HIDEvent::Field& HIDEvent::fieldForWriting(uint32_t selector, HIDFieldKind kind) {
    auto it = std::lower_bound(fields_.begin(), fields_.end(), selector,
                               [](const Field& f, uint32_t s) { return f.selector < s; });
    if (it != fields_.end() && it->selector == selector) {
        it->kind = kind;
        return *it;
    }
    return *fields_.insert(it, Field{selector, kind, 0, 0.0, {}});
}

int64_t HIDEvent::integerValueForField(uint32_t selector) const {
    const Field* f = findField(selector);
    if (!f) return 0;
    switch (f->kind) {
    case HIDFieldKind::Integer: return f->integer;
    case HIDFieldKind::Double: return truncateToInteger(f->real);
    case HIDFieldKind::Data: return 0;
    }
    return 0;
}

double HIDEvent::doubleValueForField(uint32_t selector) const {
    const Field* f = findField(selector);
    if (!f) return 0.0;
    switch (f->kind) {
    case HIDFieldKind::Integer: return static_cast<double>(f->integer);
    case HIDFieldKind::Double: return f->real;
    case HIDFieldKind::Data: return 0.0;
    }
    return 0.0;
}

const std::vector<uint8_t>& HIDEvent::dataValueForField(uint32_t selector) const {
    const Field* f = findField(selector);
    return (f && f->kind == HIDFieldKind::Data) ? f->data : kNoData;
}

// A known field keeps its own kind whatever setter is used; an unknown one takes the setter's.
void HIDEvent::setIntegerValue(int64_t value, uint32_t selector) {
    switch (hidFieldKind(selector, HIDFieldKind::Integer)) {
    case HIDFieldKind::Integer: fieldForWriting(selector, HIDFieldKind::Integer).integer = value; break;
    case HIDFieldKind::Double:
        fieldForWriting(selector, HIDFieldKind::Double).real = static_cast<double>(value);
        break;
    case HIDFieldKind::Data: break;
    }
}

void HIDEvent::setDoubleValue(double value, uint32_t selector) {
    switch (hidFieldKind(selector, HIDFieldKind::Double)) {
    case HIDFieldKind::Double: fieldForWriting(selector, HIDFieldKind::Double).real = value; break;
    case HIDFieldKind::Integer:
        fieldForWriting(selector, HIDFieldKind::Integer).integer = truncateToInteger(value);
        break;
    case HIDFieldKind::Data: break;
    }
}

void HIDEvent::setDataValue(const uint8_t* bytes, size_t length, uint32_t selector) {
    if (hidFieldKind(selector, HIDFieldKind::Data) != HIDFieldKind::Data) return;
    fieldForWriting(selector, HIDFieldKind::Data).data.assign(bytes, bytes + length);
}

void HIDEvent::appendEvent(const HIDEventRef& child) {
    if (child) children_.push_back(child);
}

void HIDEvent::removeEvent(const HIDEventRef& child) {
    auto it = std::find(children_.begin(), children_.end(), child);
    if (it != children_.end()) children_.erase(it);
}

HIDEventRef HIDEvent::copy() const {
    auto e = std::make_shared<HIDEvent>(type_, timestamp_, options_);
    e->senderID_ = senderID_;
    e->phase_ = phase_;
    e->fields_ = fields_;
    e->children_.reserve(children_.size());
    for (const auto& c : children_) e->children_.push_back(c->copy());
    return e;
}

std::string HIDEvent::description() const {
    char buf[96];
    std::snprintf(buf, sizeof buf, "{type %u ts %llu sender %llu phase %u", type_,
                  static_cast<unsigned long long>(timestamp_), static_cast<unsigned long long>(senderID_),
                  static_cast<unsigned>(phase_));
    std::string s = buf;
    for (const Field& f : fields_) {
        switch (f.kind) {
        case HIDFieldKind::Integer:
            std::snprintf(buf, sizeof buf, " 0x%x=%lld", f.selector, static_cast<long long>(f.integer));
            s += buf;
            break;
        case HIDFieldKind::Double:
            std::snprintf(buf, sizeof buf, " 0x%x=%.9g", f.selector, f.real);
            s += buf;
            break;
        case HIDFieldKind::Data:
            std::snprintf(buf, sizeof buf, " 0x%x=<", f.selector);
            s += buf;
            for (uint8_t b : f.data) {
                std::snprintf(buf, sizeof buf, "%02x", b);
                s += buf;
            }
            s += ">";
            break;
        }
    }
    if (!children_.empty()) {
        s += " children [";
        for (size_t i = 0; i < children_.size(); ++i) {
            if (i) s += ", ";
            s += children_[i]->description();
        }
        s += "]";
    }
    return s + "}";
}

}  // namespace orvane
