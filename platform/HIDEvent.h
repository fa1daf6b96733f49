#pragma once
// The platform's HID event: a type, a timestamp in ticks, a sender ID, a phase,
// options, fields addressed by selector (type << 16 | index) and ordered children.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

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
HIDFieldKind hidFieldKind(uint32_t selector, HIDFieldKind fallback);
// True when the selector is one of the platform's known fields.
bool hidFieldIsKnown(uint32_t selector);

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

    // Creation calls. Each sets exactly the fields named and no others.
    static HIDEventRef create(uint32_t type, uint64_t timestamp, uint32_t options = 0);
    static HIDEventRef pointerEvent(uint64_t timestamp, double x, double y, double z, uint32_t buttonMask,
                                    uint32_t options);
    static HIDEventRef scrollEvent(uint64_t timestamp, double x, double y, double z, uint32_t options);
    static HIDEventRef createScaleEvent(uint64_t timestamp, double x, double y, double z, uint32_t options);
    static HIDEventRef createRotationEvent(uint64_t timestamp, double x, double y, double z, uint32_t options);
    static HIDEventRef createButtonEvent(uint64_t timestamp, uint32_t buttonMask, uint32_t options);

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
    int64_t integerValueForField(uint32_t selector) const;
    double doubleValueForField(uint32_t selector) const;
    const std::vector<uint8_t>& dataValueForField(uint32_t selector) const;
    void setIntegerValue(int64_t value, uint32_t selector);
    void setDoubleValue(double value, uint32_t selector);
    void setDataValue(const uint8_t* bytes, size_t length, uint32_t selector);
    bool hasField(uint32_t selector) const { return findField(selector) != nullptr; }
    // Every field that was set, in ascending selector order.
    const std::vector<Field>& fields() const { return fields_; }

    // Children.
    const std::vector<HIDEventRef>& children() const { return children_; }
    void appendEvent(const HIDEventRef& child);
    // Removes the first child that is this very object; nothing when it is not a child.
    void removeEvent(const HIDEventRef& child);

    // A deep copy: fields, timestamp, sender, phase, options and children.
    HIDEventRef copy() const;

    // A one-line text for logs ("%@").
    std::string description() const;

private:
    const Field* findField(uint32_t selector) const;
    Field& fieldForWriting(uint32_t selector, HIDFieldKind kind);

    uint32_t type_;
    uint32_t options_;
    uint64_t timestamp_;
    uint64_t senderID_ = 0;
    uint16_t phase_ = 0;
    std::vector<Field> fields_;
    std::vector<HIDEventRef> children_;
};

}  // namespace orvane
