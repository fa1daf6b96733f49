#include "LineReader.h"

namespace orvane::formats {

LineReader::LineReader(std::string_view text) : text_(text) {
    if (text_.substr(0, 3) == "\xef\xbb\xbf") position_ = 3;
}

bool LineReader::nextLine(std::string_view* line, size_t* number) {
    if (position_ >= text_.size()) return false;
    size_t end = text_.find('\n', position_);
    if (end == std::string_view::npos) end = text_.size();
    std::string_view l = text_.substr(position_, end - position_);
    if (!l.empty() && l.back() == '\r') l.remove_suffix(1);
    position_ = end + 1;
    *line = l;
    *number = ++number_;
    return true;
}

bool LineReader::nextContentLine(std::string_view* line, size_t* number) {
    while (nextLine(line, number)) {
        if (!isBlankOrComment(*line)) return true;
    }
    return false;
}

std::string_view LineReader::trimLeft(std::string_view line) {
    size_t i = 0;
    while (i < line.size() && (line[i] == ' ' || line[i] == '\t' || line[i] == '\r' || line[i] == '\f' ||
                               line[i] == '\v'))
        ++i;
    return line.substr(i);
}

bool LineReader::isBlankOrComment(std::string_view line) {
    const std::string_view t = trimLeft(line);
    return t.empty() || t.front() == '#';
}

}  // namespace orvane::formats
