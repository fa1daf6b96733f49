#include "HIDEvent.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

#include "HIDEventPool.h"

namespace orvane {

namespace {

const std::vector<uint8_t> kNoData;

}  // namespace

bool hidFieldIsKnown(uint32_t selector) {
    // No kind is its own fallback for both of these unless the selector is known.
    return hidFieldKind(selector, HIDFieldKind::Integer) == hidFieldKind(selector, HIDFieldKind::Double);
}

int64_t HIDEvent::truncateToInteger(double v) {
    if (std::isnan(v)) return 0;
    if (v >= 9.2233720368547758e18) return INT64_MAX;
    if (v <= -9.2233720368547758e18) return INT64_MIN;
    return static_cast<int64_t>(v);
}

HIDEvent::HIDEvent(uint32_t type, uint64_t timestamp, uint32_t options)
    : type_(type), options_(options), timestamp_(timestamp) {}

HIDEventRef HIDEvent::create(uint32_t type, uint64_t timestamp, uint32_t options) {
    return HIDEventPool::make(type, timestamp, options);
}

void HIDEvent::resetForPool() noexcept {
    senderID_ = 0;
    phase_ = 0;
    fields_.clear();
    children_.clear();
    if (fields_.capacity() > HIDEventPool::kKeepFields) {
        std::vector<Field>().swap(fields_);
        fields_.reserve(HIDEventPool::kInitialFields);
    }
    if (children_.capacity() > HIDEventPool::kKeepChildren) {
        std::vector<HIDEventRef>().swap(children_);
        children_.reserve(HIDEventPool::kInitialChildren);
    }
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

HIDEvent::Field& HIDEvent::insertField(Field* before, uint32_t selector, HIDFieldKind kind) {
    return *fields_.insert(fields_.begin() + (before - fields_.data()), Field{selector, kind, 0, 0.0, {}});
}

const std::vector<uint8_t>& HIDEvent::dataValueForField(uint32_t selector) const {
    const Field* f = findField(selector);
    return (f && f->kind == HIDFieldKind::Data) ? f->data : kNoData;
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
    HIDEventRef e = HIDEventPool::make(type_, timestamp_, options_);
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
