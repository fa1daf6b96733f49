// The evemu reader and its conversion into frames, on any text: once as given, once as a
// keyboard cover's trackpad of a given size with tap-to-click. A refused recording gets one
// line naming the file; a converted one is a frame recording that writes and reads back
// with every record.

#include <sstream>
#include <string>
#include <string_view>

#include "FuzzTargets.h"
#include "tools/evemu/EvemuConversion.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::fuzz {

namespace {

void convertOnce(std::string_view text, const evemu::EvemuOptions& options) {
    formats::FrameRecording recording;
    std::string error;
    // "-" is standard input: no description file is looked for beside it.
    if (!evemu::convertEvemuRecording(text, "-", "fuzz.evemu", options, &recording, &error)) {
        if (error.rfind("fuzz.evemu", 0) != 0) fuzzFinding("a message starts with the file's name");
        if (error.find('\n') != std::string::npos) fuzzFinding("a message is one line");
        return;
    }
    std::ostringstream out;
    formats::writeFrameRecording(out, recording);
    formats::FrameRecording reread;
    if (!formats::readFrameRecording(out.str(), "converted.frames.jsonl", &reread, &error))
        fuzzFinding("a converted recording reads back");
    if (reread.records.size() != recording.records.size()) fuzzFinding("a converted recording keeps every record");
}

}  // namespace

int fuzzEvemu(const uint8_t* data, size_t size) {
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    convertOnce(text, evemu::EvemuOptions{});
    evemu::EvemuOptions cover;
    cover.size = evemu::SurfaceSize{100.0, 60.0};
    cover.keyboardCover = true;
    cover.tapToClick = true;
    convertOnce(text, cover);
    return 0;
}

}  // namespace orvane::fuzz
