#pragma once
// Event streams (*.events.jsonl): what left the filter, one JSON object per line.
//   {"format": "orvane-events", "version": 1}
//   {"input": N, "via": "dispatch", "event": {...}}   an event sent through the dispatcher
//   {"input": N, "via": "return", "event": {...}}     the event entry's result, or null
//   {"input": N, "setProperty": "KEY", "result": true}

#include <cstdint>
#include <iosfwd>
#include <string>

#include "platform/HIDEvent.h"

namespace orvane::formats {

class EventStreamWriter {
public:
    // Writes to `out`, which must outlive the writer. Nothing is written until writeHeader.
    explicit EventStreamWriter(std::ostream& out);

    void writeHeader();
    // Serialises the event now: the filter may change it once it has been sent.
    void writeDispatched(int64_t input, const HIDEvent& event);
    // The returned event, or "event": null for none.
    void writeReturned(int64_t input, const HIDEvent* event);
    void writeSetProperty(int64_t input, const std::string& key, bool result);

    // Lines written, header included.
    size_t linesWritten() const { return lines_; }

    static std::string headerLine();
    static std::string dispatchedLine(int64_t input, const HIDEvent& event);
    static std::string returnedLine(int64_t input, const HIDEvent* event);
    static std::string setPropertyLine(int64_t input, const std::string& key, bool result);

private:
    void writeLine(const std::string& line);

    std::ostream& out_;
    size_t lines_ = 0;
};

}  // namespace orvane::formats
