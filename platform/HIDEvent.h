#pragma once
// The platform's HID event: a type, a timestamp in ticks, a sender ID, a phase,
// options, fields addressed by selector (type << 16 | index) and ordered children.
// Events made by the creation calls and by copy() come from HIDEventPool and go back to it
// when their last strong reference goes.

#include <array>
#include <atomic>
#include <bit>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "HIDEventPool.h"

namespace orvane {

class HIDEvent;
using HIDEventRef = std::shared_ptr<HIDEvent>;

enum HIDEventType : uint32_t {
    kHIDEventTypeVendorDefined = 1,
    kHIDEventTypeButton = 2,
    kHIDEventTypeKeyboard = 3,
    kHIDEventTypeRotation = 5,
    kHIDEventTypeScroll = 6,
    kHIDEventTypeScale = 7,
    kHIDEventTypeDigitizer = 11,
    kHIDEventTypePointer = 17,
};

constexpr uint32_t hidFieldSelector(uint32_t type, uint32_t index) { return type << 16 | index; }

enum HIDEventField : uint32_t {
    kHIDEventFieldVendorDefinedUsagePage = 0x10000,
    kHIDEventFieldVendorDefinedUsage = 0x10001,
    kHIDEventFieldVendorDefinedVersion = 0x10002,
    kHIDEventFieldVendorDefinedDataLength = 0x10003,
    kHIDEventFieldVendorDefinedData = 0x10004,
    kHIDEventFieldButtonMask = 0x20000,
    kHIDEventFieldButtonNumber = 0x20001,
    kHIDEventFieldButtonState = 0x20004,
    kHIDEventFieldKeyboardUsagePage = 0x30000,
    kHIDEventFieldKeyboardUsage = 0x30001,
    kHIDEventFieldKeyboardDown = 0x30002,
    kHIDEventFieldRotationX = 0x50000,
    kHIDEventFieldRotationY = 0x50001,
    kHIDEventFieldRotationZ = 0x50002,
    kHIDEventFieldScrollX = 0x60000,
    kHIDEventFieldScrollY = 0x60001,
    kHIDEventFieldScrollZ = 0x60002,
    kHIDEventFieldScaleX = 0x70000,
    kHIDEventFieldScaleY = 0x70001,
    kHIDEventFieldScaleZ = 0x70002,
    kHIDEventFieldDigitizerX = 0xb0000,
    kHIDEventFieldDigitizerY = 0xb0001,
    kHIDEventFieldDigitizerZ = 0xb0002,
    kHIDEventFieldDigitizerButtonMask = 0xb0003,
    kHIDEventFieldDigitizerType = 0xb0004,
    kHIDEventFieldDigitizerIndex = 0xb0005,
    kHIDEventFieldDigitizerIdentity = 0xb0006,
    kHIDEventFieldDigitizerEventMask = 0xb0007,
    kHIDEventFieldDigitizerRange = 0xb0008,
    kHIDEventFieldDigitizerTouch = 0xb0009,
    kHIDEventFieldDigitizerGenerationCount = 0xb001b,
    kHIDEventFieldPointerX = 0x110000,
    kHIDEventFieldPointerY = 0x110001,
    kHIDEventFieldPointerZ = 0x110002,
    kHIDEventFieldPointerButtonMask = 0x110003,
};

// Digitizer event-mask bits.
enum : uint32_t {
    kHIDDigitizerEventRange = 0x1,
    kHIDDigitizerEventTouch = 0x2,
    kHIDDigitizerEventPosition = 0x4,
    kHIDDigitizerEventResting = 0x200,
};

// Digitizer transducer types the trackpad reports.
enum : uint32_t {
    kHIDDigitizerTransducerTypeFinger = 1,
    kHIDDigitizerTransducerTypeHand = 2,
    kHIDDigitizerTransducerTypePalm = 3,
};

enum class HIDFieldKind : uint8_t { Integer, Double, Data };

// The kind of a field known to the platform, or `fallback` for any other selector.
constexpr HIDFieldKind hidFieldKind(uint32_t selector, HIDFieldKind fallback) {
    const uint32_t index = selector & 0xffff;
    switch (selector >> 16) {
    case kHIDEventTypeVendorDefined:
        return index <= 3 ? HIDFieldKind::Integer : index == 4 ? HIDFieldKind::Data : fallback;
    case kHIDEventTypeButton:
        return (index == 0 || index == 1 || index == 4) ? HIDFieldKind::Integer : fallback;
    case kHIDEventTypeKeyboard: return index <= 2 ? HIDFieldKind::Integer : fallback;
    case kHIDEventTypeRotation:
    case kHIDEventTypeScroll:
    case kHIDEventTypeScale: return index <= 2 ? HIDFieldKind::Double : fallback;
    case kHIDEventTypeDigitizer:
        if (index <= 2) return HIDFieldKind::Double;
        return ((index >= 3 && index <= 9) || index == 0x1b) ? HIDFieldKind::Integer : fallback;
    case kHIDEventTypePointer:
        return index <= 2 ? HIDFieldKind::Double : index == 3 ? HIDFieldKind::Integer : fallback;
    default: return fallback;
    }
}
// True when the selector is one of the platform's known fields.
bool hidFieldIsKnown(uint32_t selector);

// Each of the platform's known integer and double fields has a fixed slot in every event,
// numbered in ascending selector order; -1 for any other selector (the vendor data field and
// selectors the platform does not know, which an event keeps in a short sorted list).
constexpr int kHIDFieldSlotCount = 34;
constexpr int hidFieldSlot(uint32_t selector) {
    const uint32_t index = selector & 0xffff;
    const int i = static_cast<int>(index);
    switch (selector >> 16) {
    case kHIDEventTypeVendorDefined: return index <= 3 ? i : -1;
    case kHIDEventTypeButton: return index <= 1 ? 4 + i : index == 4 ? 6 : -1;
    case kHIDEventTypeKeyboard: return index <= 2 ? 7 + i : -1;
    case kHIDEventTypeRotation: return index <= 2 ? 10 + i : -1;
    case kHIDEventTypeScroll: return index <= 2 ? 13 + i : -1;
    case kHIDEventTypeScale: return index <= 2 ? 16 + i : -1;
    case kHIDEventTypeDigitizer: return index <= 9 ? 19 + i : index == 0x1b ? 29 : -1;
    case kHIDEventTypePointer: return index <= 3 ? 30 + i : -1;
    default: return -1;
    }
}
// The slots whose field is a double (the others hold integers).
constexpr uint64_t kHIDDoubleFieldSlots = 0x7ull << 10 | 0x7ull << 13 | 0x7ull << 16 | 0x7ull << 19 | 0x7ull << 30;
constexpr bool hidFieldSlotIsDouble(int slot) { return (kHIDDoubleFieldSlots >> slot & 1) != 0; }
// The selector of a slot.
uint32_t hidFieldSlotSelector(int slot);

class HIDEvent {
public:
    struct Field {
        uint32_t selector;
        HIDFieldKind kind;
        int64_t integer;
        double real;
        std::vector<uint8_t> data;
    };

    HIDEvent(uint32_t type, uint64_t timestamp, uint32_t options = 0);
    HIDEvent(const HIDEvent&) = delete;
    HIDEvent& operator=(const HIDEvent&) = delete;

    // Creation calls. Each sets exactly the fields named and no others. The pointer and scroll
    // calls, made on every frame, are written out where they are called (below).
    static HIDEventRef create(uint32_t type, uint64_t timestamp, uint32_t options = 0);
    static HIDEventRef pointerEvent(uint64_t timestamp, double x, double y, double z, uint32_t buttonMask,
                                    uint32_t options);
    static HIDEventRef scrollEvent(uint64_t timestamp, double x, double y, double z, uint32_t options);
    static HIDEventRef createScaleEvent(uint64_t timestamp, double x, double y, double z, uint32_t options);
    static HIDEventRef createRotationEvent(uint64_t timestamp, double x, double y, double z, uint32_t options);
    static HIDEventRef createButtonEvent(uint64_t timestamp, uint32_t buttonMask, uint32_t options);
    // The pointer and three-axis creation calls written as a new event and one setter call per
    // field; the calls above write the fields' slots at once and must make the same events.
    static HIDEventRef pointerEventLiteral(uint64_t timestamp, double x, double y, double z, uint32_t buttonMask,
                                           uint32_t options);
    static HIDEventRef threeAxisEventLiteral(uint32_t type, uint64_t timestamp, double x, double y, double z,
                                             uint32_t options);

    uint32_t type() const { return type_; }
    uint64_t timestamp() const { return timestamp_; }
    void setTimestamp(uint64_t t) { timestamp_ = t; }
    uint64_t senderID() const { return senderID_; }
    void setSenderID(uint64_t s) { senderID_ = s; }
    uint16_t phase() const { return phase_; }
    void setPhase(uint16_t p) { phase_ = p; }
    uint32_t options() const { return options_; }

    // An event conforms to a type when it is of that type.
    bool conformsToEventType(uint32_t type) const { return type_ == type; }

    // Fields. A field that was never set reads as 0, 0.0 or empty data.
    int64_t integerValueForField(uint32_t selector) const {
        const int slot = hidFieldSlot(selector);
        if (slot < 0) return otherIntegerValue(selector);
        const uint64_t bits = slots_[static_cast<size_t>(slot)];
        return hidFieldSlotIsDouble(slot) ? truncateToInteger(std::bit_cast<double>(bits))
                                          : static_cast<int64_t>(bits);
    }
    double doubleValueForField(uint32_t selector) const {
        const int slot = hidFieldSlot(selector);
        if (slot < 0) return otherDoubleValue(selector);
        const uint64_t bits = slots_[static_cast<size_t>(slot)];
        return hidFieldSlotIsDouble(slot) ? std::bit_cast<double>(bits)
                                          : static_cast<double>(static_cast<int64_t>(bits));
    }
    const std::vector<uint8_t>& dataValueForField(uint32_t selector) const;
    // A known field keeps its own kind whatever setter is used; an unknown one takes the setter's.
    // Writes to the vendor fields (made once per device, not per frame) stay out of line:
    // inlined, they let GCC 12 inline more of a caller such as the fuzz frame decoder, where
    // it then reports a false -Wfree-nonheap-object.
    void setIntegerValue(int64_t value, uint32_t selector) {
        const int slot = hidFieldSlot(selector);
        if (slot < 0 || (selector >> 16) == kHIDEventTypeVendorDefined) return setOtherIntegerValue(value, selector);
        storeSlot(slot, hidFieldSlotIsDouble(slot) ? std::bit_cast<uint64_t>(static_cast<double>(value))
                                                   : static_cast<uint64_t>(value));
    }
    void setDoubleValue(double value, uint32_t selector) {
        const int slot = hidFieldSlot(selector);
        if (slot < 0 || (selector >> 16) == kHIDEventTypeVendorDefined) return setOtherDoubleValue(value, selector);
        storeSlot(slot, hidFieldSlotIsDouble(slot) ? std::bit_cast<uint64_t>(value)
                                                   : static_cast<uint64_t>(truncateToInteger(value)));
    }
    void setDataValue(const uint8_t* bytes, size_t length, uint32_t selector);
    bool hasField(uint32_t selector) const {
        const int slot = hidFieldSlot(selector);
        return slot >= 0 ? (known_ >> slot & 1) != 0 : findOtherField(selector) != nullptr;
    }
    // Every field that was set, in ascending selector order. Listed afresh when the fields
    // changed, into storage the event keeps, so that a warm event lists its fields without
    // the heap; the reference stays valid, and lists the fields as they are after each call.
    const std::vector<Field>& fields() const;

    // Children.
    const std::vector<HIDEventRef>& children() const { return children_; }
    void appendEvent(const HIDEventRef& child) {
        if (child) children_.push_back(child);
    }
    void appendEvent(HIDEventRef&& child) {
        if (child) children_.push_back(std::move(child));
    }
    // Removes the first child that is this very object; nothing when it is not a child.
    void removeEvent(const HIDEventRef& child);

    // A deep copy: fields, timestamp, sender, phase, options and children.
    HIDEventRef copy() const;

    // A one-line text for logs ("%@").
    std::string description() const;

private:
    friend class HIDEventPool;

    template <uint32_t Type>
    static HIDEventRef threeAxisEvent(uint64_t timestamp, double x, double y, double z, uint32_t options);
    // Truncation toward zero that stays defined for NaN and out-of-range values.
    static int64_t truncateToInteger(double v) {
        if (v != v) return 0;
        if (v >= 9.2233720368547758e18) return INT64_MAX;
        if (v <= -9.2233720368547758e18) return INT64_MIN;
        return static_cast<int64_t>(v);
    }
    void storeSlot(int slot, uint64_t bits) {
        slots_[static_cast<size_t>(slot)] = bits;
        known_ |= uint64_t{1} << slot;
    }

    // The vendor data field and unknown selectors, kept in ascending selector order in
    // `others_`; there are only ever a few.
    const Field* findOtherField(uint32_t selector) const {
        for (const Field& f : others_) {
            if (f.selector >= selector) return f.selector == selector ? &f : nullptr;
        }
        return nullptr;
    }
    int64_t otherIntegerValue(uint32_t selector) const;
    double otherDoubleValue(uint32_t selector) const;
    // The setters out of line: for the vendor fields and for the selectors without a slot.
    void setOtherIntegerValue(int64_t value, uint32_t selector);
    void setOtherDoubleValue(double value, uint32_t selector);
    // The field to write, made (with the given kind) where it is missing.
    Field& otherFieldForWriting(uint32_t selector, HIDFieldKind kind);
    // Calls `visit(selector, kind, integer, real, data)` for every set field in ascending
    // selector order.
    template <typename Visit>
    void forEachField(Visit&& visit) const;
    // Back to the state of a new event, keeping the storage (pool use only).
    void resetForPool() noexcept;

    HIDEvent* poolNext_ = nullptr;
    uint32_t type_;
    uint32_t options_;
    uint64_t timestamp_;
    uint64_t senderID_ = 0;
    uint16_t phase_ = 0;
    // Bit s set: slot s holds a value. An unset slot holds zero bits (0 and +0.0).
    uint64_t known_ = 0;
    std::array<uint64_t, kHIDFieldSlotCount> slots_{};
    std::vector<Field> others_;
    std::vector<HIDEventRef> children_;
    // What fields() returns: the fields as they were when last listed.
    mutable std::vector<Field> list_;
    mutable std::atomic_flag listLock_ = ATOMIC_FLAG_INIT;
};

// Written out here so that the filter makes its events without calls into this library: the
// event and the block that counts its references come off the idle lists under one lock.
inline std::shared_ptr<HIDEvent> HIDEventPool::makeInline(uint32_t type, uint64_t timestamp, uint32_t options) {
    State& s = state_;
    HIDEvent* event;
    void* block = nullptr;
    {
        Guard guard(s.lock);
        if ((event = s.idleEvents) != nullptr) {
            s.idleEvents = event->poolNext_;
            --s.idle;
            if (IdleBlock* idle = s.idleBlocks) {
                s.idleBlocks = idle->next;
                block = idle;
            }
        } else {
            ++s.created;
        }
    }
    // The link of a taken event is left as it was: it is read only while the event is idle.
    if (event) [[likely]] {
        event->type_ = type;
        event->options_ = options;
        event->timestamp_ = timestamp;
    } else {
        event = newEvent(type, timestamp, options);
    }
    // Without a block taken here the allocator gets one from allocateBlock.
    return std::shared_ptr<HIDEvent>(event, HIDEventRecycler{}, HIDEventBlockAllocator<HIDEvent>(block));
}

// The creation calls write the slots of the new event directly: it comes from the pool with
// no field set, so its fields are exactly the ones written here.
inline HIDEventRef HIDEvent::pointerEvent(uint64_t timestamp, double x, double y, double z, uint32_t buttonMask,
                                          uint32_t options) {
    HIDEventRef e = HIDEventPool::makeInline(kHIDEventTypePointer, timestamp, options);
    constexpr int first = hidFieldSlot(kHIDEventFieldPointerX);
    static_assert(hidFieldSlot(kHIDEventFieldPointerButtonMask) == first + 3 && !hidFieldSlotIsDouble(first + 3));
    e->slots_[first] = std::bit_cast<uint64_t>(x);
    e->slots_[first + 1] = std::bit_cast<uint64_t>(y);
    e->slots_[first + 2] = std::bit_cast<uint64_t>(z);
    e->slots_[first + 3] = static_cast<uint64_t>(static_cast<int64_t>(buttonMask));
    e->known_ = uint64_t{0xf} << first;
    return e;
}

template <uint32_t Type>
inline HIDEventRef HIDEvent::threeAxisEvent(uint64_t timestamp, double x, double y, double z, uint32_t options) {
    HIDEventRef e = HIDEventPool::makeInline(Type, timestamp, options);
    constexpr int first = hidFieldSlot(hidFieldSelector(Type, 0));
    static_assert(hidFieldSlot(hidFieldSelector(Type, 2)) == first + 2 && hidFieldSlotIsDouble(first) &&
                  hidFieldSlotIsDouble(first + 2));
    e->slots_[first] = std::bit_cast<uint64_t>(x);
    e->slots_[first + 1] = std::bit_cast<uint64_t>(y);
    e->slots_[first + 2] = std::bit_cast<uint64_t>(z);
    e->known_ = uint64_t{0x7} << first;
    return e;
}

inline HIDEventRef HIDEvent::scrollEvent(uint64_t timestamp, double x, double y, double z, uint32_t options) {
    return threeAxisEvent<kHIDEventTypeScroll>(timestamp, x, y, z, options);
}

}  // namespace orvane
