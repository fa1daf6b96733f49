#pragma once
// An evemu recording of a touchpad as the frame recording the filter would be given.
//
// The description comes from the recording itself when it has one; otherwise from the file
// given with --desc, or from a .desc file beside it: for "a.b.events" the first of
// "a.b.desc" and "a.desc" that exists. The service:
//   - usage pairs touch pad (13, 5) and finger (13, 34); keyboard (1, 6) too only for a
//     keyboard-cover trackpad (the filter matches nothing else);
//   - "SurfaceDimensions": width and height in 16.16 fixed-point centimetres, from the
//     ranges and resolutions of ABS_MT_POSITION_X and _Y, or from --size when given;
//   - "Transport" from the bus ("USB", "Bluetooth", "I2C", "PS/2", ...), "Product" the name.
// Tap-to-click and two-finger secondary click, when asked for, are set by a client before
// the first frame. Timestamps stay as recorded (nanoseconds, timebase 1/1).

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "EvdevDevice.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::evemu {

struct SurfaceSize {
    double width_mm = 0.0;
    double height_mm = 0.0;
};

struct EvemuOptions {
    std::string descriptionPath;      // --desc FILE: the description of an events-only file
    std::optional<SurfaceSize> size;  // --size WIDTHxHEIGHT: the surface in millimetres
    bool keyboardCover = false;       // --keyboard-cover: present the touchpad as a keyboard-cover trackpad
    bool tapToClick = false;          // --tap-to-click
    bool secondaryClick = false;      // --secondary-click: two-finger secondary click

    // True when any option was given (they apply to evemu recordings only).
    bool any() const { return !descriptionPath.empty() || size || keyboardCover || tapToClick || secondaryClick; }
};

// "100x60" or "99.5x62.25": two positive sizes in millimetres, at most 10 m each.
bool parseSurfaceSize(std::string_view text, SurfaceSize* size, std::string* error);

// A size in millimetres as 16.16 fixed-point centimetres, rounded to the nearest unit.
int64_t fixedPointCentimetres(double millimetres);
// The width of an axis's range at its resolution (units per mm) as 16.16 fixed-point
// centimetres, rounded to the nearest unit; the resolution must not be 0.
int64_t fixedPointCentimetres(const EvdevAxis& axis);

// The description files looked for beside an events file, in order.
std::vector<std::string> siblingDescriptionPaths(const std::string& eventsPath);

// Converts the recording `content`, read from `path` ("-" for standard input, which has no
// files beside it) and called `name` in messages. On failure returns false and sets `error`
// to one line naming the file and, where there is one, the line.
bool convertEvemuRecording(std::string_view content, const std::string& path, const std::string& name,
                           const EvemuOptions& options, formats::FrameRecording* recording, std::string* error);

}  // namespace orvane::evemu
