// The gesture script reader and its frames, on any text. A refused script gets one line
// naming the file; an accepted one is a frame recording that writes and reads back with
// every record.

#include <sstream>
#include <string>
#include <string_view>

#include "FuzzTargets.h"
#include "tools/formats/FrameRecording.h"
#include "tools/script/GestureScriptFrames.h"

namespace orvane::fuzz {

int fuzzGestureScript(const uint8_t* data, size_t size) {
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    formats::FrameRecording recording;
    std::string error;
    if (!script::readGestureScript(text, "fuzz.gestures", &recording, &error)) {
        if (error.rfind("fuzz.gestures", 0) != 0) fuzzFinding("a message starts with the file's name");
        if (error.find('\n') != std::string::npos) fuzzFinding("a message is one line");
        return 0;
    }
    std::ostringstream out;
    formats::writeFrameRecording(out, recording);
    formats::FrameRecording reread;
    if (!formats::readFrameRecording(out.str(), "script.frames.jsonl", &reread, &error))
        fuzzFinding("a script's recording reads back");
    if (reread.records.size() != recording.records.size()) fuzzFinding("a script's recording keeps every record");
    return 0;
}

}  // namespace orvane::fuzz
