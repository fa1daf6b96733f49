#include "InputKind.h"

#include "LineReader.h"

namespace orvane::formats {

namespace {
bool isEvemuLine(std::string_view line) {
    if (line.size() < 2 || line[1] != ':') return false;
    switch (line[0]) {
    case 'N':
    case 'I':
    case 'P':
    case 'B':
    case 'A':
    case 'L':
    case 'S':
    case 'E': return true;
    default: return false;
    }
}
}  // namespace

InputKindResult detectInputKind(std::string_view content) {
    LineReader lines(content);
    std::string_view line;
    size_t number = 0;
    while (lines.nextLine(&line, &number)) {
        const std::string_view t = LineReader::trimLeft(line);
        if (t.empty()) continue;
        if (t.substr(0, 7) == "# EVEMU") return {InputKind::Evemu, number};
        if (t.front() == '#') continue;
        if (isEvemuLine(t)) return {InputKind::Evemu, number};
        if (t.front() == '{') return {InputKind::FrameRecording, number};
        return {InputKind::Unknown, number};
    }
    return {InputKind::FrameRecording, 1};
}

}  // namespace orvane::formats
