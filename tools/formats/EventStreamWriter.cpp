#include "EventStreamWriter.h"

#include <ostream>

#include "EventJson.h"
#include "JsonText.h"

namespace orvane::formats {

EventStreamWriter::EventStreamWriter(std::ostream& out) : out_(out) {}

std::string EventStreamWriter::headerLine() { return "{\"format\": \"orvane-events\", \"version\": 1}"; }

namespace {
std::string eventLine(int64_t input, const char* via, const HIDEvent* event) {
    std::string s = "{\"input\": ";
    appendJsonInteger(s, input);
    s += ", \"via\": \"";
    s += via;
    s += "\", \"event\": ";
    if (event) appendEventJson(s, *event);
    else s += "null";
    s += '}';
    return s;
}
}  // namespace

std::string EventStreamWriter::dispatchedLine(int64_t input, const HIDEvent& event) {
    return eventLine(input, "dispatch", &event);
}

std::string EventStreamWriter::returnedLine(int64_t input, const HIDEvent* event) {
    return eventLine(input, "return", event);
}

std::string EventStreamWriter::setPropertyLine(int64_t input, const std::string& key, bool result) {
    std::string s = "{\"input\": ";
    appendJsonInteger(s, input);
    s += ", \"setProperty\": ";
    appendJsonString(s, key);
    s += result ? ", \"result\": true}" : ", \"result\": false}";
    return s;
}

void EventStreamWriter::writeLine(const std::string& line) {
    out_ << line << '\n';
    ++lines_;
}

void EventStreamWriter::writeHeader() { writeLine(headerLine()); }

void EventStreamWriter::writeDispatched(int64_t input, const HIDEvent& event) {
    writeLine(dispatchedLine(input, event));
}

void EventStreamWriter::writeReturned(int64_t input, const HIDEvent* event) { writeLine(returnedLine(input, event)); }

void EventStreamWriter::writeSetProperty(int64_t input, const std::string& key, bool result) {
    writeLine(setPropertyLine(input, key, result));
}

}  // namespace orvane::formats
