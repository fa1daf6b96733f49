#include "LogStreamSink.h"

#include <ostream>

#include "JsonText.h"

namespace orvane::formats {

LogStreamSink::LogStreamSink(std::ostream& out) : out_(out) {}

std::string LogStreamSink::line(int64_t input, const LogRecord& record) {
    std::string s = "{\"input\": ";
    appendJsonInteger(s, input);
    s += ", \"category\": ";
    appendJsonString(s, record.category);
    s += ", \"level\": ";
    appendJsonString(s, logLevelName(record.level));
    s += ", \"message\": ";
    appendJsonString(s, record.message);
    s += '}';
    return s;
}

void LogStreamSink::write(const LogRecord& record) {
    const std::string text = line(input(), record);
    std::lock_guard<std::mutex> lock(mutex_);
    out_ << text << '\n';
    ++lines_;
}

size_t LogStreamSink::linesWritten() const {
    std::lock_guard<std::mutex> lock(mutex_);
    return lines_;
}

}  // namespace orvane::formats
