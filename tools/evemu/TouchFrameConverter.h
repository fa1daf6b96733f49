#pragma once
// Turns the input events of a multitouch (protocol B) touchpad into the contact frames the
// filter is given, one digitizer frame per SYN_REPORT, the way the platform's own digitizer
// driver would. It knows nothing of files: events go in one at a time, frames come out.
//
// A frame (digitizer event, type 11, timestamped with the SYN_REPORT's time in ns):
//   - one child per slot that has a tracking ID, in slot order: index = slot, x and y
//     normalised to 0..1 by the axis ranges (values outside the range are clamped) with y
//     flipped (1 - y), so that the bottom edge of a clickpad becomes the edge of the click;
//     touch and range 1; transducer type 3 for MT_TOOL_PALM, 1 otherwise;
//   - a slot whose tracking ID ended is reported once more, touch 0 and range 0, and then no
//     longer; a slot whose tracking ID was replaced by another within one frame ends in
//     that frame and its new contact starts in the next;
//   - per child the event mask: 1 range changed, 2 touch changed, 4 position changed; the
//     parent carries their OR, touch (any child touching), range (any child in range) and
//     its button mask: bit 0 while a clickpad's click (BTN_LEFT) is down;
//   - for a Bluetooth device, a frame that carried MSC_TIMESTAMP gets a last child: the
//     vendor-defined relative scan time (usage page 13, usage 86, two bytes in host order,
//     a 16-bit count of 100 us).
// Every other physical button (BTN_RIGHT, BTN_MIDDLE, BTN_LEFT of a pad with separate
// buttons, ...) becomes a platform button event (type 2: mask of the separate buttons down,
// button number, state), placed just before the frame of its SYN_REPORT.

#include <cstdint>
#include <string>
#include <vector>

#include "EvdevDevice.h"
#include "platform/HIDEvent.h"

namespace orvane::evemu {

// What the conversion needs to know of a device.
struct TouchpadLayout {
    EvdevDevice device;      // the axes and keys it has
    EvdevAxis x;             // ABS_MT_POSITION_X
    EvdevAxis y;             // ABS_MT_POSITION_Y
    int32_t slots = 0;       // ABS_MT_SLOT maximum + 1
    bool clickpad = false;   // the click lies under the surface (INPUT_PROP_BUTTONPAD, or BTN_LEFT alone)
    bool wireless = false;   // Bluetooth: frames carry the device's scan time
    std::vector<uint16_t> buttons;  // the physical buttons the device has, in code order
};

// The layout of a multitouch protocol-B touchpad, or false with a message naming what the
// description lacks (single-touch and protocol-A devices have no slots).
bool touchpadLayoutFor(const EvdevDevice& device, TouchpadLayout* layout, std::string* error);

class TouchFrameConverter {
public:
    explicit TouchFrameConverter(TouchpadLayout layout);

    // Takes one event. At a SYN_REPORT appends to `out` the frame's button events and then
    // its digitizer frame. False with a message (no file or line) for an event the device
    // cannot have sent or that the conversion cannot follow: protocol-A SYN_MT_REPORT,
    // SYN_DROPPED, an axis or button the device does not have, a slot out of range.
    bool feed(const EvdevEvent& event, std::vector<HIDEventRef>* out, std::string* error);

    // Frames made so far.
    uint64_t frames() const { return frames_; }

private:
    struct Slot {
        int32_t trackingId = -1;  // as the events left it
        int32_t x = 0, y = 0;
        int32_t toolType = 0;
        int32_t reportedId = -1;  // the contact reported touching in the last frame, or -1
        bool endedInFrame = false;
        double reportedX = 0.0, reportedY = 0.0;
    };

    bool absolute(const EvdevEvent& event, std::string* error);
    bool key(const EvdevEvent& event, std::string* error);
    void report(uint64_t time, std::vector<HIDEventRef>* out);
    double normalised(int32_t value, const EvdevAxis& axis) const;

    TouchpadLayout layout_;
    std::vector<Slot> slots_;
    int32_t currentSlot_ = 0;
    bool clickDown_ = false;
    uint32_t buttonsDown_ = 0;      // separate buttons, bit (number - 1)
    uint32_t buttonsReported_ = 0;  // as the last button events said
    bool haveScanTime_ = false;     // an MSC_TIMESTAMP was seen
    bool scanTimeInFrame_ = false;
    uint32_t lastDeviceMicroseconds_ = 0;
    uint64_t deviceMicroseconds_ = 0;  // MSC_TIMESTAMP unwrapped from its 32 bits
    uint64_t frames_ = 0;
};

}  // namespace orvane::evemu
