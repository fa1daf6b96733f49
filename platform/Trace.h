#pragma once
// Kernel-style trace points: a 32-bit code and four 64-bit arguments.

#include <cstdint>
#include <memory>
#include <mutex>
#include <vector>

namespace orvane {

struct TracePoint {
    uint32_t code;
    uint64_t arg1, arg2, arg3, arg4;
    bool operator==(const TracePoint&) const = default;
};

class TraceSink {
public:
    virtual ~TraceSink() = default;
    virtual void emit(const TracePoint& point) = 0;
};

// Keeps every trace point, for tests.
class CaptureTraceSink : public TraceSink {
public:
    void emit(const TracePoint& point) override;
    std::vector<TracePoint> points() const;
    void clear();

private:
    mutable std::mutex mutex_;
    std::vector<TracePoint> points_;
};

namespace Trace {
// With no sink set a trace point costs a load and a branch (and fires a USDT probe
// "orvane:trace" where the system headers provide them).
void setSink(std::shared_ptr<TraceSink> sink);
void emit(uint32_t code, uint64_t arg1, uint64_t arg2, uint64_t arg3, uint64_t arg4);
}  // namespace Trace

}  // namespace orvane
