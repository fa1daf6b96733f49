#pragma once
// One HID event as one JSON object:
//   {"type": 11, "timestamp": 1000000, "sender": 7, "phase": 0,
//    "fields": {"0xb0000": 0.5, "0xb0005": 0}, "children": [ ... ]}
// Field keys are "0x" and the selector in lowercase hex without leading zeros, in ascending
// order, and only the fields that were set. Integer fields are JSON integers, double fields
// always carry a '.' or an exponent with the fewest digits that read back exactly
// ("NaN", "Infinity", "-Infinity" as strings), data fields are lowercase hex strings.
// "sender", "phase" and "children" are written only when they are not 0, 0 and empty.

#include <cstdint>
#include <string>
#include <string_view>

#include "platform/HIDEvent.h"

namespace orvane::formats {

std::string eventToJson(const HIDEvent& event);
void appendEventJson(std::string& out, const HIDEvent& event);

// The event, or nullptr with a message (no file or line; the caller adds them).
// A field's kind comes from the platform's table; a field the platform does not know takes
// the kind of its JSON token: an integer, a number with a fraction or exponent (or one of
// the strings "NaN", "Infinity", "-Infinity"), or a hex string for data. Field keys may use
// either case of hex digits. Keys other than the six above are refused.
HIDEventRef eventFromJson(std::string_view text, std::string* error);

// "digitizer", "pointer", ... or "type N" for a type the platform does not name.
std::string eventTypeName(uint32_t type);

}  // namespace orvane::formats
