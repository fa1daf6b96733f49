#pragma once
// The Linux input event numbers the touchpad conversion reads: event types, the codes of
// multitouch protocol B, the buttons and the device properties, with their names for
// messages. The values are those of the kernel's input-event-codes.h.

#include <cstdint>
#include <string>

namespace orvane::evemu {

// Event types.
inline constexpr uint16_t kEvSyn = 0x00;
inline constexpr uint16_t kEvKey = 0x01;
inline constexpr uint16_t kEvRel = 0x02;
inline constexpr uint16_t kEvAbs = 0x03;
inline constexpr uint16_t kEvMsc = 0x04;
inline constexpr uint16_t kEvMax = 0x1f;

// EV_SYN codes.
inline constexpr uint16_t kSynReport = 0;
inline constexpr uint16_t kSynConfig = 1;
inline constexpr uint16_t kSynMtReport = 2;
inline constexpr uint16_t kSynDropped = 3;

// EV_ABS codes.
inline constexpr uint16_t kAbsX = 0x00;
inline constexpr uint16_t kAbsY = 0x01;
inline constexpr uint16_t kAbsMtSlot = 0x2f;
inline constexpr uint16_t kAbsMtPositionX = 0x35;
inline constexpr uint16_t kAbsMtPositionY = 0x36;
inline constexpr uint16_t kAbsMtToolType = 0x37;
inline constexpr uint16_t kAbsMtTrackingId = 0x39;
inline constexpr uint16_t kAbsMax = 0x3f;

// ABS_MT_TOOL_TYPE values.
inline constexpr int32_t kMtToolFinger = 0;
inline constexpr int32_t kMtToolPalm = 2;

// EV_KEY codes: the physical buttons (BTN_0 to BTN_9 and the mouse buttons) and the
// highest key code.
inline constexpr uint16_t kBtn0 = 0x100;
inline constexpr uint16_t kBtn9 = 0x109;
inline constexpr uint16_t kBtnLeft = 0x110;
inline constexpr uint16_t kBtnRight = 0x111;
inline constexpr uint16_t kBtnMiddle = 0x112;
inline constexpr uint16_t kBtnTask = 0x117;
inline constexpr uint16_t kKeyMax = 0x2ff;

// EV_MSC codes.
inline constexpr uint16_t kMscTimestamp = 0x05;

// Input device properties.
inline constexpr unsigned kInputPropButtonpad = 2;
inline constexpr unsigned kInputPropSemiMt = 3;
inline constexpr unsigned kInputPropMax = 0x1f;

// Bus types.
inline constexpr uint16_t kBusBluetooth = 0x05;

// True for a button a hand presses (BTN_0..BTN_9, BTN_LEFT..BTN_TASK); BTN_TOUCH and the
// BTN_TOOL_* codes say what touches the surface and are not buttons.
constexpr bool isPhysicalButton(uint16_t code) {
    return (code >= kBtn0 && code <= kBtn9) || (code >= kBtnLeft && code <= kBtnTask);
}

// The platform's number of a physical button: BTN_LEFT 1, BTN_RIGHT 2, BTN_MIDDLE 3, up to
// BTN_TASK 8; then BTN_0 to BTN_9 as 9 to 18.
constexpr uint32_t platformButtonNumber(uint16_t code) {
    return code >= kBtnLeft ? uint32_t(code - kBtnLeft) + 1 : uint32_t(code - kBtn0) + 9;
}

// "EV_ABS", or "type 0x1e" for a type without a name here.
std::string eventTypeName(uint16_t type);
// "ABS_MT_SLOT", "BTN_RIGHT", "SYN_REPORT", ... or "EV_ABS code 0x3c".
std::string eventCodeName(uint16_t type, uint16_t code);
// The transport a bus is known by: "USB", "Bluetooth", "I2C", "PS/2", ... or "bus 0x0042".
std::string transportForBus(uint16_t bus);

}  // namespace orvane::evemu
