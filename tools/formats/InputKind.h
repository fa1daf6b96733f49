#pragma once
// What kind of input a file is, told from its content.

#include <cstddef>
#include <string_view>

namespace orvane::formats {

enum class InputKind {
    FrameRecording,  // the first content line is a JSON object (the frame reader judges it)
    Evemu,           // "# EVEMU ..." or evemu's "N:", "I:", "P:", "B:", "A:", "L:", "S:", "E:" lines
    Unknown,         // anything else
};

struct InputKindResult {
    InputKind kind;
    size_t line;  // the line that decided, from 1
};

// Blank lines and '#' comments (other than evemu's "# EVEMU" mark) are passed over; an
// empty file counts as a frame recording, so that its reader reports the missing header.
InputKindResult detectInputKind(std::string_view content);

}  // namespace orvane::formats
