#pragma once
// The events a frame produced, as short text that a table of expectations can hold.

#include <string>

#include "platform/HIDEvent.h"

namespace orvane::test {

// A number as %g, with −0 written as 0.
std::string numberText(double v);
// "none", "began", "changed", "ended", "cancelled", "maybegin", or "phaseN".
std::string phaseText(uint16_t phase);

struct PointerTextOptions {
    bool scaleRotateValues = true;  // "scale:began(0.01)" rather than "scale:began"
    const char* bare = "bare";      // the text of a pointer event with nothing in it
};

// "none" for no event; otherwise "move(dx,dy)" when the pointer moves, then each child:
// "hand", "button:MASK", "scroll:PHASE(x,y)", "scale:PHASE(z)", "rotate:PHASE(z)".
std::string pointerEventText(const HIDEventRef& pointer, const PointerTextOptions& options = {});

}  // namespace orvane::test
