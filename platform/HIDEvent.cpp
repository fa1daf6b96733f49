#include "HIDEvent.h"

#include <algorithm>
#include <cstdio>
#include <thread>

#include "HIDEventPool.h"

namespace orvane {

namespace {

const std::vector<uint8_t> kNoData;

// The selector of every slot, in slot order.
constexpr std::array<uint32_t, kHIDFieldSlotCount> kSlotSelectors = [] {
    std::array<uint32_t, kHIDFieldSlotCount> selectors{};
    for (uint32_t type = 0; type <= kHIDEventTypePointer; ++type) {
        for (uint32_t index = 0; index <= 0xff; ++index) {
            const int slot = hidFieldSlot(hidFieldSelector(type, index));
            if (slot >= 0) selectors[static_cast<size_t>(slot)] = hidFieldSelector(type, index);
        }
    }
    return selectors;
}();

// The slots are exactly the known integer and double fields, numbered in selector order,
// and a slot holds a double exactly when its field is one.
constexpr bool slotsMatchTheKnownFields() {
    int next = 0;
    for (uint32_t type = 0; type <= 0x20; ++type) {
        for (uint32_t index = 0; index <= 0xff; ++index) {
            const uint32_t selector = hidFieldSelector(type, index);
            const HIDFieldKind kind = hidFieldKind(selector, HIDFieldKind::Data);
            const int slot = hidFieldSlot(selector);
            if (kind == HIDFieldKind::Data) {
                if (slot != -1) return false;
                continue;
            }
            if (slot != next++) return false;
            if (hidFieldSlotIsDouble(slot) != (kind == HIDFieldKind::Double)) return false;
        }
    }
    return next == kHIDFieldSlotCount;
}
static_assert(slotsMatchTheKnownFields());

}  // namespace

bool hidFieldIsKnown(uint32_t selector) {
    // No kind is its own fallback for both of these unless the selector is known.
    return hidFieldKind(selector, HIDFieldKind::Integer) == hidFieldKind(selector, HIDFieldKind::Double);
}

uint32_t hidFieldSlotSelector(int slot) { return kSlotSelectors[static_cast<size_t>(slot)]; }

HIDEvent::HIDEvent(uint32_t type, uint64_t timestamp, uint32_t options)
    : type_(type), options_(options), timestamp_(timestamp) {}

HIDEventRef HIDEvent::create(uint32_t type, uint64_t timestamp, uint32_t options) {
    return HIDEventPool::make(type, timestamp, options);
}

void HIDEvent::resetForPool() noexcept {
    senderID_ = 0;
    phase_ = 0;
    if (known_ != 0) {
        slots_.fill(0);
        known_ = 0;
    }
    others_.clear();
    list_.clear();
    children_.clear();
    if (others_.capacity() > HIDEventPool::kKeepFields) std::vector<Field>().swap(others_);
    if (list_.capacity() > HIDEventPool::kKeepFields) {
        std::vector<Field>().swap(list_);
        list_.reserve(HIDEventPool::kInitialFields);
    }
    if (children_.capacity() > HIDEventPool::kKeepChildren) {
        std::vector<HIDEventRef>().swap(children_);
        children_.reserve(HIDEventPool::kInitialChildren);
    }
}

HIDEventRef HIDEvent::pointerEventLiteral(uint64_t timestamp, double x, double y, double z, uint32_t buttonMask,
                                          uint32_t options) {
    HIDEventRef e = create(kHIDEventTypePointer, timestamp, options);
    e->setDoubleValue(x, kHIDEventFieldPointerX);
    e->setDoubleValue(y, kHIDEventFieldPointerY);
    e->setDoubleValue(z, kHIDEventFieldPointerZ);
    e->setIntegerValue(buttonMask, kHIDEventFieldPointerButtonMask);
    return e;
}

HIDEventRef HIDEvent::threeAxisEventLiteral(uint32_t type, uint64_t timestamp, double x, double y, double z,
                                            uint32_t options) {
    HIDEventRef e = create(type, timestamp, options);
    e->setDoubleValue(x, hidFieldSelector(type, 0));
    e->setDoubleValue(y, hidFieldSelector(type, 1));
    e->setDoubleValue(z, hidFieldSelector(type, 2));
    return e;
}

HIDEventRef HIDEvent::createScaleEvent(uint64_t timestamp, double x, double y, double z, uint32_t options) {
    return threeAxisEvent<kHIDEventTypeScale>(timestamp, x, y, z, options);
}

HIDEventRef HIDEvent::createRotationEvent(uint64_t timestamp, double x, double y, double z, uint32_t options) {
    return threeAxisEvent<kHIDEventTypeRotation>(timestamp, x, y, z, options);
}

HIDEventRef HIDEvent::createButtonEvent(uint64_t timestamp, uint32_t buttonMask, uint32_t options) {
    HIDEventRef e = HIDEventPool::make(kHIDEventTypeButton, timestamp, options);
    e->setIntegerValue(buttonMask, kHIDEventFieldButtonMask);
    return e;
}

int64_t HIDEvent::otherIntegerValue(uint32_t selector) const {
    const Field* f = findOtherField(selector);
    if (!f) return 0;
    switch (f->kind) {
    case HIDFieldKind::Integer: return f->integer;
    case HIDFieldKind::Double: return truncateToInteger(f->real);
    case HIDFieldKind::Data: return 0;
    }
    return 0;
}

double HIDEvent::otherDoubleValue(uint32_t selector) const {
    const Field* f = findOtherField(selector);
    if (!f) return 0.0;
    switch (f->kind) {
    case HIDFieldKind::Integer: return static_cast<double>(f->integer);
    case HIDFieldKind::Double: return f->real;
    case HIDFieldKind::Data: return 0.0;
    }
    return 0.0;
}

void HIDEvent::setOtherIntegerValue(int64_t value, uint32_t selector) {
    // The vendor numbers are integer slots; the data field ignores numbers; an unknown
    // selector becomes (or stays) an integer.
    const int slot = hidFieldSlot(selector);
    if (slot >= 0) {
        storeSlot(slot, hidFieldSlotIsDouble(slot) ? std::bit_cast<uint64_t>(static_cast<double>(value))
                                                   : static_cast<uint64_t>(value));
        return;
    }
    if (hidFieldKind(selector, HIDFieldKind::Integer) != HIDFieldKind::Integer) return;
    otherFieldForWriting(selector, HIDFieldKind::Integer).integer = value;
}

void HIDEvent::setOtherDoubleValue(double value, uint32_t selector) {
    const int slot = hidFieldSlot(selector);
    if (slot >= 0) {
        storeSlot(slot, hidFieldSlotIsDouble(slot) ? std::bit_cast<uint64_t>(value)
                                                   : static_cast<uint64_t>(truncateToInteger(value)));
        return;
    }
    if (hidFieldKind(selector, HIDFieldKind::Double) != HIDFieldKind::Double) return;
    otherFieldForWriting(selector, HIDFieldKind::Double).real = value;
}

HIDEvent::Field& HIDEvent::otherFieldForWriting(uint32_t selector, HIDFieldKind kind) {
    for (auto it = others_.begin(); it != others_.end(); ++it) {
        if (it->selector == selector) {
            it->kind = kind;
            return *it;
        }
        if (it->selector > selector) return *others_.insert(it, Field{selector, kind, 0, 0.0, {}});
    }
    others_.push_back(Field{selector, kind, 0, 0.0, {}});
    return others_.back();
}

const std::vector<uint8_t>& HIDEvent::dataValueForField(uint32_t selector) const {
    if (hidFieldSlot(selector) >= 0) return kNoData;
    const Field* f = findOtherField(selector);
    return (f && f->kind == HIDFieldKind::Data) ? f->data : kNoData;
}

void HIDEvent::setDataValue(const uint8_t* bytes, size_t length, uint32_t selector) {
    if (hidFieldKind(selector, HIDFieldKind::Data) != HIDFieldKind::Data) return;
    otherFieldForWriting(selector, HIDFieldKind::Data).data.assign(bytes, bytes + length);
}

template <typename Visit>
void HIDEvent::forEachField(Visit&& visit) const {
    uint64_t known = known_;
    auto other = others_.begin();
    while (known != 0 || other != others_.end()) {
        const int slot = known != 0 ? std::countr_zero(known) : -1;
        const uint32_t slotSelector = slot >= 0 ? kSlotSelectors[static_cast<size_t>(slot)] : UINT32_MAX;
        if (other != others_.end() && (slot < 0 || other->selector < slotSelector)) {
            visit(other->selector, other->kind, other->integer, other->real, other->data);
            ++other;
            continue;
        }
        const uint64_t bits = slots_[static_cast<size_t>(slot)];
        if (hidFieldSlotIsDouble(slot)) {
            visit(slotSelector, HIDFieldKind::Double, int64_t{0}, std::bit_cast<double>(bits), kNoData);
        } else {
            visit(slotSelector, HIDFieldKind::Integer, static_cast<int64_t>(bits), 0.0, kNoData);
        }
        known &= known - 1;
    }
}

const std::vector<HIDEvent::Field>& HIDEvent::fields() const {
    // The list is written only when it no longer matches the fields, so that readers on
    // several threads may list the same event (as they could always read it).
    while (listLock_.test_and_set(std::memory_order_acquire)) std::this_thread::yield();
    size_t n = 0;
    bool matches = true;
    forEachField([this, &n, &matches](uint32_t selector, HIDFieldKind kind, int64_t integer, double real,
                                      const std::vector<uint8_t>& data) {
        if (!matches) return;
        const Field* f = n < list_.size() ? &list_[n++] : nullptr;
        matches = f && f->selector == selector && f->kind == kind && f->integer == integer &&
                  std::bit_cast<uint64_t>(f->real) == std::bit_cast<uint64_t>(real) && f->data == data;
    });
    if (!matches || n != list_.size()) {
        // Entries are overwritten in place, so the storage of their data is reused.
        n = 0;
        forEachField([this, &n](uint32_t selector, HIDFieldKind kind, int64_t integer, double real,
                                const std::vector<uint8_t>& data) {
            if (n == list_.size()) list_.push_back(Field{selector, kind, integer, real, {}});
            Field& f = list_[n++];
            f.selector = selector;
            f.kind = kind;
            f.integer = integer;
            f.real = real;
            f.data.assign(data.begin(), data.end());
        });
        list_.resize(n, Field{0, HIDFieldKind::Integer, 0, 0.0, {}});
    }
    listLock_.clear(std::memory_order_release);
    return list_;
}

void HIDEvent::removeEvent(const HIDEventRef& child) {
    auto it = std::find(children_.begin(), children_.end(), child);
    if (it != children_.end()) children_.erase(it);
}

HIDEventRef HIDEvent::copy() const {
    HIDEventRef e = HIDEventPool::make(type_, timestamp_, options_);
    e->senderID_ = senderID_;
    e->phase_ = phase_;
    e->known_ = known_;
    e->slots_ = slots_;
    e->others_ = others_;
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
    forEachField([&](uint32_t selector, HIDFieldKind kind, int64_t integer, double real,
                     const std::vector<uint8_t>& data) {
        switch (kind) {
        case HIDFieldKind::Integer:
            std::snprintf(buf, sizeof buf, " 0x%x=%lld", selector, static_cast<long long>(integer));
            s += buf;
            break;
        case HIDFieldKind::Double:
            std::snprintf(buf, sizeof buf, " 0x%x=%.9g", selector, real);
            s += buf;
            break;
        case HIDFieldKind::Data:
            std::snprintf(buf, sizeof buf, " 0x%x=<", selector);
            s += buf;
            for (uint8_t b : data) {
                std::snprintf(buf, sizeof buf, "%02x", b);
                s += buf;
            }
            s += ">";
            break;
        }
    });
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
