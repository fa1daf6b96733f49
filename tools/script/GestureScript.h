#pragma once
// Gesture scripts: a touchpad session written by hand, one statement per line, times in
// milliseconds and positions in millimetres (docs/gesture-scripts.md describes the format):
//
//   # orvane gesture script
//   surface 100 x 64 mm usb
//   rate 125 Hz
//   set TapToClickEnabled on
//   0     finger a down at 30 40
//   0     finger a move to 70 40 over 300 ms
//   300   finger a up
//   +200  click down
//
// parseGestureScript reads the text into statements; gestureScriptToFrames (in
// GestureScriptFrames.h) turns them into the frame recording the platform's digitizer
// driver would report. No exception leaves these functions.

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "platform/PropertyValue.h"

namespace orvane::script {

// The comment that marks a gesture script on its first line.
inline constexpr const char* kGestureScriptMark = "# orvane gesture script";

enum class Transport { Wired, Bluetooth };

struct Surface {
    double width_mm = 0.0;
    double height_mm = 0.0;
    Transport transport = Transport::Wired;
};

// What a contact is: fingers and thumbs are reported as fingers (transducer type 1); the
// name only says what the writer meant. A palm is transducer type 3.
enum class ContactKind { Finger, Thumb, Palm };

const char* contactKindName(ContactKind kind);

struct Statement {
    enum class Kind {
        Set,        // a client sets a property
        Down,       // a contact touches at (x, y)
        MoveTo,     // a contact moves in a straight line to (x, y) over duration_ms
        MoveBy,     // the same, by (x, y) from where it is
        Up,         // a contact lifts
        ClickDown,  // the click under the surface is pressed
        ClickUp,    // and released
        End,        // the session lasts at least until here
    };
    Kind kind = Kind::End;
    size_t line = 0;       // from 1
    bool timed = false;    // false only for a `set` before the first timed line
    double time_ms = 0.0;  // script time; 0 for an untimed `set`

    ContactKind contactKind = ContactKind::Finger;  // Down, MoveTo, MoveBy, Up
    std::string contact;                            // the contact's name
    double x_mm = 0.0;                              // Down, MoveTo: position; MoveBy: offset
    double y_mm = 0.0;
    double duration_ms = 0.0;  // MoveTo, MoveBy

    std::string key;  // Set
    PropertyValue value;
};

struct GestureScript {
    std::string name;  // the file name used in messages
    Surface surface;
    size_t surfaceLine = 0;  // 0 when no surface was given
    double rate_Hz = 125.0;  // frames per second while anything is reported
    double clock_ms = 1000.0;  // the device clock at script time 0
    std::vector<Statement> statements;  // in file order; timed ones never go back in time
};

// True when the content is a gesture script: its first line that is not blank is the mark
// comment (any case, more text may follow), or its first line that is neither blank nor a
// comment starts with the word "surface".
bool isGestureScript(std::string_view content);

// Reads a whole script. On failure returns false and sets `error` to one line
// "NAME:LINE: what is wrong".
bool parseGestureScript(std::string_view content, const std::string& name, GestureScript* out,
                        std::string* error);

}  // namespace orvane::script
