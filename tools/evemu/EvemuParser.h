#pragma once
// A small, strict reader of evemu recordings: the device description (N:, I:, P:, B:, A:,
// L:, S: lines) and the events (E: lines), with '#' comments and blank lines between them
// and a '#' comment allowed at the end of a line. Anything else is refused with the file,
// the line and what is wrong, so that a damaged recording never turns into wrong frames.
//
//   N: name                          the device name (the rest of the line)
//   I: bus vendor product version    four hex numbers of up to four digits
//   P: bb bb ...                     property bits, bytes of two hex digits, several lines add up
//   B: tt bb bb ...                  the codes of event type tt, as P:
//   A: cc min max fuzz flat [res]    an absolute axis: hex code, decimal numbers
//   L: / S:  cc value                LED and switch states (read and checked, not used)
//   E: sec.usec type code value      an event: six digits of microseconds, hex type and code,
//                                    decimal value
//
// Every description line comes before the first E: line.

#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "EvdevDevice.h"

namespace orvane::evemu {

struct EvemuFile {
    std::string name;       // the file name used in messages
    EvdevDevice device;     // what the description says
    size_t firstDescriptionLine = 0;  // 0 when the file has no description
    size_t nameLine = 0;              // the N: line, or 0
    size_t identityLine = 0;          // the I: line, or 0
    std::map<uint16_t, size_t> axisLines;  // the A: line of each axis
    std::vector<EvdevEvent> events;
    std::vector<size_t> eventLines;   // the line of each event

    bool hasDescription() const { return firstDescriptionLine != 0; }
};

// Reads a whole recording. On failure returns false and sets `error` to one line
// "NAME:LINE: what is wrong".
bool parseEvemu(std::string_view content, const std::string& name, EvemuFile* out, std::string* error);

}  // namespace orvane::evemu
