#pragma once
// Lines of a text, numbered from 1, as the line-based formats read them: a trailing
// carriage return is dropped, a leading byte-order mark ignored, and "content" lines are
// those that are not blank and do not start (after blanks) with '#'.

#include <cstddef>
#include <string_view>

namespace orvane::formats {

class LineReader {
public:
    explicit LineReader(std::string_view text);

    // The next line, without its line break; false at the end.
    bool nextLine(std::string_view* line, size_t* number);
    // The next line that is neither blank nor a '#' comment.
    bool nextContentLine(std::string_view* line, size_t* number);

    static bool isBlankOrComment(std::string_view line);
    static std::string_view trimLeft(std::string_view line);

private:
    std::string_view text_;
    size_t position_ = 0;
    size_t number_ = 0;
};

}  // namespace orvane::formats
