#pragma once
// Turns a gesture script into the frame recording the platform's digitizer driver would
// report for it: a frame every 1/rate seconds while a contact touches, a contact's lift
// is reported or the click is held or changes; one digitizer parent per frame with one
// child per contact (and, for a Bluetooth surface, the relative scan-time child last);
// settings as setProperty records before the first frame at or after their time, from a
// client (ID 1) whose connection is announced before the first of them.

#include <cstdint>
#include <string>
#include <string_view>

#include "GestureScript.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::script {

// The usage pairs of the keyboard cover's trackpad: touch pad, finger, keyboard.
inline constexpr uint32_t kScriptUsagePairs[3][2] = {{13, 5}, {13, 34}, {1, 6}};

// Frame times are script times on the frame grid 0, 1/rate, 2/rate, ... seconds; a
// statement takes effect in the first frame at or after its time.
bool gestureScriptToFrames(const GestureScript& script, formats::FrameRecording* out, std::string* error);

// parseGestureScript and gestureScriptToFrames in one.
bool readGestureScript(std::string_view content, const std::string& name, formats::FrameRecording* out,
                       std::string* error);

}  // namespace orvane::script
