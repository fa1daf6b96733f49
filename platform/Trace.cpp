#include "Trace.h"

#include <atomic>

#if __has_include(<sys/sdt.h>)
#include <sys/sdt.h>
#define ORVANE_HAVE_USDT 1
#endif

namespace orvane {

void CaptureTraceSink::emit(const TracePoint& point) {
    std::lock_guard<std::mutex> lock(mutex_);
    points_.push_back(point);
}

std::vector<TracePoint> CaptureTraceSink::points() const {
    std::lock_guard<std::mutex> lock(mutex_);
    return points_;
}

void CaptureTraceSink::clear() {
    std::lock_guard<std::mutex> lock(mutex_);
    points_.clear();
}

namespace {
std::mutex gSinkMutex;
std::shared_ptr<TraceSink> gSink;
std::atomic<bool> gHaveSink{false};
}  // namespace

namespace Trace {

void setSink(std::shared_ptr<TraceSink> sink) {
    std::lock_guard<std::mutex> lock(gSinkMutex);
    gSink = std::move(sink);
    gHaveSink.store(gSink != nullptr, std::memory_order_release);
}

void emit(uint32_t code, uint64_t arg1, uint64_t arg2, uint64_t arg3, uint64_t arg4) {
#ifdef ORVANE_HAVE_USDT
    DTRACE_PROBE5(orvane, trace, code, arg1, arg2, arg3, arg4);
#endif
    if (!gHaveSink.load(std::memory_order_acquire)) return;
    std::shared_ptr<TraceSink> sink;
    {
        std::lock_guard<std::mutex> lock(gSinkMutex);
        sink = gSink;
    }
    if (sink) sink->emit(TracePoint{code, arg1, arg2, arg3, arg4});
}

}  // namespace Trace
}  // namespace orvane
