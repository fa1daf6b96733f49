#pragma once
// The HID service a live touchpad is presented as: exactly the service the evemu conversion
// makes for a recording of the same device, so that the filter cannot tell the two apart.
//   - usage pairs touch pad (13, 5) and finger (13, 34), and keyboard (1, 6) only for a
//     keyboard-cover trackpad (--keyboard-cover; the filter matches nothing else);
//   - "SurfaceDimensions" in 16.16 fixed-point centimetres from the ranges and resolutions
//     of ABS_MT_POSITION_X and _Y, or from --size;
//   - "Transport" from the bus, "Product" the device's name.

#include <optional>
#include <string>

#include "tools/evemu/EvdevDevice.h"
#include "tools/evemu/EvemuConversion.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::live {

// False with one line when the device gives no resolution and no size was given.
bool touchpadService(const evemu::EvdevDevice& device, const std::optional<evemu::SurfaceSize>& size,
                     bool keyboardCover, formats::ServiceDescription* service, std::string* error);

}  // namespace orvane::live
