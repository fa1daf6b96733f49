// The event JSON reader on any text. An event that reads must write, read back and write
// again to the very same text: the writer's layout is a fixed point of the reader.

#include <string>
#include <string_view>

#include "FuzzTargets.h"
#include "tools/formats/EventJson.h"

namespace orvane::fuzz {

int fuzzEventJson(const uint8_t* data, size_t size) {
    const std::string_view text(reinterpret_cast<const char*>(data), size);
    std::string error;
    const HIDEventRef event = formats::eventFromJson(text, &error);
    if (!event) {
        if (error.empty()) fuzzFinding("a refused event says why");
        if (error.find('\n') != std::string::npos) fuzzFinding("a message is one line");
        return 0;
    }
    const std::string written = formats::eventToJson(*event);
    std::string again;
    const HIDEventRef reread = formats::eventFromJson(written, &again);
    if (!reread) fuzzFinding("what the writer writes reads back");
    if (formats::eventToJson(*reread) != written) fuzzFinding("an event written, read and written again is the same text");
    // The description of any event that reads is one line (it goes into log lines).
    if (event->description().find('\n') != std::string::npos) fuzzFinding("a description is one line");
    return 0;
}

}  // namespace orvane::fuzz
