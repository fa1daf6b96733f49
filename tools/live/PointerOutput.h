#pragma once
// Turns what the filter delivers into the events of one virtual pointing device.
//
// - A pointer event's x and y become REL_X and REL_Y. The filter's unit is the millimetre
//   of finger travel (in steps of 0.635 mm); each axis keeps its fractional remainder and
//   carries it into the next event, so the counts written add up to the motion delivered.
// - A scroll event's y becomes REL_WHEEL_HI_RES and its x REL_HWHEEL_HI_RES, times the
//   scroll factor (high-resolution units per unit of the filter's scroll), with the
//   fractional remainder carried; every full 120 of a wheel's high-resolution units also
//   writes one REL_WHEEL or REL_HWHEEL detent. The filter's scroll says where the content
//   goes, the wheel where the view goes: y keeps its sign (positive: the wheel turned away
//   from the user, scrolling up) and x changes it (positive REL_HWHEEL: scrolling right).
//   A scroll that begins or may begin starts both wheels from zero.
// - A stateful button event inside a pointer event (the click, a secondary click, a tap)
//   gives the buttons the filter holds down: mask bit 0 BTN_LEFT, bit 1 BTN_RIGHT, bit 2
//   BTN_MIDDLE. The pointer event's own button mask is not used: for a secondary click it
//   still says 1 while the button event says 2.
// - A button event on its own is a separate physical button of the touchpad passed through
//   the filter unchanged; its button number (1 BTN_LEFT, 2 BTN_RIGHT, 3 BTN_MIDDLE ... 8
//   BTN_TASK, 9 to 18 BTN_0 to BTN_9) is pressed or released as its state says.
// A button is down on the virtual device while the filter or the touchpad holds it.
// Everything one delivered event changes is closed by one SYN_REPORT; an event that changes
// nothing writes nothing (the kernel drops an empty report anyway).

#include <array>
#include <cstdint>
#include <string>

#include "VirtualPointer.h"
#include "platform/HIDEvent.h"

namespace orvane::live {

class PointerOutput {
public:
    // One wheel detent is 120 high-resolution units.
    static constexpr int32_t kHighResolutionPerDetent = 120;
    // High-resolution wheel units per unit of the filter's scroll. A scroll unit is half a
    // millimetre of finger travel, so 12 makes one detent per 5 mm.
    static constexpr double kDefaultScrollFactor = 12.0;

    explicit PointerOutput(VirtualPointer& pointer, double scrollFactor = kDefaultScrollFactor);

    // One event the filter delivered, dispatched or returned. False with a message when the
    // virtual device refused a write.
    bool deliver(const HIDEvent& event, std::string* error);
    // Releases every button still down, closed by one SYN_REPORT (nothing when none is).
    bool releaseAll(std::string* error);

    double scrollFactor() const { return scrollFactor_; }
    // True while the virtual device has this button code down.
    bool isDown(uint16_t code) const;
    // SYN_REPORTs written so far.
    uint64_t reports() const { return reports_; }

    // The evdev code of a platform button number, or 0 for a number without one.
    static uint16_t buttonCode(int64_t number);

private:
    // Buttons by platform number 1..18, bit (number - 1).
    static constexpr int kButtons = 18;

    void pointerMotion(const HIDEvent& event);
    void scroll(const HIDEvent& event);
    bool writeButtons();
    bool emit(uint16_t type, uint16_t code, int32_t value);
    static int32_t takeWhole(double* remainder);

    VirtualPointer& pointer_;
    double scrollFactor_;
    double remainderX_ = 0.0, remainderY_ = 0.0;
    double wheelRemainder_ = 0.0, hwheelRemainder_ = 0.0;
    int32_t wheelUnits_ = 0, hwheelUnits_ = 0;  // towards the next detent
    uint32_t filterButtons_ = 0;
    uint32_t physicalButtons_ = 0;
    uint32_t written_ = 0;  // as the virtual device has them
    bool pending_ = false;  // something written since the last SYN_REPORT
    bool failed_ = false;
    std::string error_;
    uint64_t reports_ = 0;
};

}  // namespace orvane::live
