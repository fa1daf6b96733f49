#pragma once
// Frame recordings (*.frames.jsonl): exactly what the filter is given, one JSON object per
// line. Blank lines and lines whose first non-blank character is '#' are skipped. The first
// object is the header:
//   {"format": "orvane-frames", "version": 1,
//    "service": {"usagePairs": [[13, 5], [13, 34], [1, 6]], "properties": {...}},
//    "timebase": [1, 1], "bundle": {"Acceleration": {}}}
// and every later object is one input record, numbered from 0 in file order: an event
// (it has "type"), {"setProperty": {"key": K, "value": V}} or {"client": {"id": N, "added": B}}.

#include <cstdint>
#include <iosfwd>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/HIDEvent.h"
#include "platform/HIDEventService.h"
#include "platform/PropertyValue.h"
#include "platform/Timebase.h"

namespace orvane::formats {

inline constexpr const char* kFrameRecordingFormat = "orvane-frames";
inline constexpr int kFrameRecordingVersion = 1;

// The HID service the host matches the filter against.
struct ServiceDescription {
    std::vector<HIDUsagePair> usagePairs;
    PropertyDictionary properties;  // initial properties; JSON true/false are booleans
};

struct FrameRecordingHeader {
    ServiceDescription service;
    TimebaseInfo timebase{1, 1};             // ticks are nanoseconds unless said otherwise
    std::optional<PropertyDictionary> bundle;  // entries of the plug-in's information dictionary
};

struct InputRecord {
    enum class Kind { Event, SetProperty, Client };
    Kind kind = Kind::Event;
    size_t line = 0;  // where it is in its file, from 1

    HIDEventRef event;  // Kind::Event

    std::string propertyKey;  // Kind::SetProperty
    PropertyValue propertyValue;

    uint64_t clientID = 0;  // Kind::Client
    bool clientAdded = false;
};

struct FrameRecording {
    std::string name;        // the file name used in messages
    size_t headerLine = 0;   // line of the header, from 1
    FrameRecordingHeader header;
    std::vector<InputRecord> records;  // record N is records[N]
};

// Reads a whole recording. On failure returns false and sets `error` to one line
// "NAME:LINE: what is wrong". No exception leaves these functions.
bool readFrameRecording(std::string_view content, const std::string& name, FrameRecording* out,
                        std::string* error);
bool readFrameRecordingFile(const std::string& path, FrameRecording* out, std::string* error);

// The header and record lines as a writer writes them (no line break at the end).
std::string frameRecordingHeaderToJson(const FrameRecordingHeader& header);
std::string inputRecordToJson(const InputRecord& record);

// Header line, then one line per record.
void writeFrameRecording(std::ostream& out, const FrameRecording& recording);

// Reads a whole file into `content`; false with "PATH: cannot be read (reason)".
bool readFileContent(const std::string& path, std::string* content, std::string* error);

}  // namespace orvane::formats
