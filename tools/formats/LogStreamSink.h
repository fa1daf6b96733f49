#pragma once
// Log streams (*.log.jsonl): every log line the filter writes that its level lets through,
//   {"input": N, "category": "ServiceFilter", "level": "default", "message": "..."}
// where N is the input record being processed, or -1 before the first.

#include <atomic>
#include <cstdint>
#include <iosfwd>
#include <mutex>
#include <string>

#include "platform/Logging.h"

namespace orvane::formats {

class LogStreamSink : public LogSink {
public:
    // Writes to `out`, which must outlive the sink.
    explicit LogStreamSink(std::ostream& out);

    // The record being processed from now on.
    void setInput(int64_t input) { input_.store(input); }
    int64_t input() const { return input_.load(); }

    void write(const LogRecord& record) override;
    size_t linesWritten() const;

    static std::string line(int64_t input, const LogRecord& record);

private:
    mutable std::mutex mutex_;
    std::ostream& out_;
    std::atomic<int64_t> input_{-1};
    size_t lines_ = 0;
};

}  // namespace orvane::formats
