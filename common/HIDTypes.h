#pragma once
// The records every stage shares.

#include <cstdint>

#include "platform/HIDEvent.h"

namespace orvane {

struct HIDPoint {
    float x;
    float y;
};

// The record of every motion result: deltas, velocities, accumulated motion, maxima.
struct HIDMotion {
    float x;
    float y;
    float scale;
    float rotate;
};

// One contact of one frame.
struct HIDContact {
    int32_t fingerTipSwitch;   // 1 while the contact touches
    int32_t fingerConfidence;  // 0 for a palm, else 1
    int32_t path_id;           // contact index + 1
    int32_t finger_id;         // contact index + 2
    HIDPoint velocity;         // position change since the previous frame, surface units per frame
    double device_timestamp;   // the frame time
    HIDPoint position;         // surface units; larger y lies nearer the diving-button edge
};

// The stage times of a path.
struct HIDPathTimestamps {
    double t_cleanStartInRange;
    double t_startInRange;
    double t_makeTouch;
    double t_startHover;
    double t_endHover;
    double t_breakTouch;
    double t_endOutRange;
};

enum HIDGestureType : int32_t {
    kHIDGestureTypeNone = 0,
    kHIDGestureTypePointer = 1,
    kHIDGestureTypeScroll = 2,
    kHIDGestureTypeScale = 3,
    kHIDGestureTypeRotate = 4,
    kHIDGestureTypeOneFingerTap = 5,
    kHIDGestureTypeTwoFingerTap = 6,
};

// The platform's phase bits, written into events unchanged.
enum HIDGesturePhase : uint16_t {
    kHIDGesturePhaseNone = 0,
    kHIDGesturePhaseBegan = 1,
    kHIDGesturePhaseChanged = 2,
    kHIDGesturePhaseEnded = 4,
    kHIDGesturePhaseCancelled = 8,
    kHIDGesturePhaseMayBegin = 0x80,
};

}  // namespace orvane

// A plain property: getter `name()` and setter `Setter(value)` over the field `name_`.
#define HID_PROPERTY(Type, name, Setter)      \
    Type name() const { return name##_; }     \
    void Setter(Type value) { name##_ = value; }

#include <functional>

namespace orvane {
// The callback that sends one event at once through the event system's dispatcher.
using HIDDispatchHandler = std::function<void(const HIDEventRef&)>;
}  // namespace orvane
