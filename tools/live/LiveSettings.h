#pragma once
// The settings of `orvane run`, from its flags and from a small configuration file.
//
// The file has one `key = value` per line; blank lines and lines starting with '#' are
// skipped, and " #" after a value starts a comment. Each key is the `orvane run` flag of the
// same name:
//
//   device          = /dev/input/event5   the touchpad (a path, or part of its name)
//   tap-to-click    = true | false        the filter's "TapToClickEnabled"
//   secondary-click = true | false        the filter's "TwoFingersSecondaryClickEnabled"
//   scroll-factor   = 12                  wheel high-resolution units per unit of the filter's
//                                         scroll; negative reverses scrolling, 0 is refused
//   keyboard-cover  = true | false        present the touchpad as a keyboard cover's trackpad
//   size            = 100x60              the surface in mm, when the device does not say
//   gesture-socket  = /run/user/1000/orvane/gestures.sock
//   print           = true | false        the gesture lines on standard output too
//   wait            = true | false        wait for the touchpad to appear and to come back
//   grab            = true | false        take the touchpad for Orvane alone (default true)
//   lid-switch      = true | false        report the lid to the filter (default true)
//
// Truth values are true/false, yes/no, on/off or 1/0. A flag on the command line wins over
// the file. An unknown key, a value of the wrong form or a key given twice is refused with
// one line naming the file, the line and the problem.

#include <optional>
#include <string>

#include "tools/evemu/EvemuConversion.h"

namespace orvane::live {

struct LiveSettings {
    std::optional<std::string> device;
    std::optional<bool> tapToClick;
    std::optional<bool> twoFingerSecondaryClick;
    std::optional<double> scrollFactor;
    std::optional<bool> keyboardCover;
    std::optional<evemu::SurfaceSize> size;
    std::optional<std::string> gestureSocket;
    std::optional<bool> print;
    std::optional<bool> wait;
    std::optional<bool> grab;
    std::optional<bool> lidSwitch;

    // Every setting given here replaces the one in `base`.
    LiveSettings over(const LiveSettings& base) const;
};

// Reads a configuration file's text. `name` is used in messages ("NAME:LINE: ...").
bool parseLiveSettings(const std::string& text, const std::string& name, LiveSettings* out, std::string* error);
// Reads a configuration file; "PATH: cannot be read (...)" when it cannot.
bool readLiveSettingsFile(const std::string& path, LiveSettings* out, std::string* error);

// "true", "false", "yes", "no", "on", "off", "1", "0".
bool parseTruth(const std::string& text, bool* out);

}  // namespace orvane::live
