// The frame recording reader on any text. A recording that reads must write, read back and
// write again to the very same text, with as many records; one that does not read gets one
// line naming the file and, where there is one, the line.

#include <sstream>
#include <string>
#include <string_view>

#include "FuzzTargets.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::fuzz {

namespace {

std::string written(const formats::FrameRecording& recording) {
    std::ostringstream out;
    formats::writeFrameRecording(out, recording);
    return out.str();
}

}  // namespace

int fuzzFrameRecording(const uint8_t* data, size_t size) {
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    formats::FrameRecording recording;
    std::string error;
    if (!formats::readFrameRecording(text, "fuzz.frames.jsonl", &recording, &error)) {
        if (error.rfind("fuzz.frames.jsonl:", 0) != 0) fuzzFinding("a message starts with the file's name");
        if (error.find('\n') != std::string::npos) fuzzFinding("a message is one line");
        return 0;
    }
    const std::string first = written(recording);
    formats::FrameRecording reread;
    if (!formats::readFrameRecording(first, "written.frames.jsonl", &reread, &error))
        fuzzFinding("what the writer writes reads back");
    if (reread.records.size() != recording.records.size()) fuzzFinding("a written recording keeps every record");
    if (written(reread) != first) fuzzFinding("a recording written, read and written again is the same text");
    return 0;
}

}  // namespace orvane::fuzz
