#pragma once
// Services, dispatchers and captured logs for the filter's tests.

#include <memory>
#include <string>
#include <vector>

#include "filter/OrvaneServiceFilter.h"
#include "platform/HIDEventService.h"
#include "platform/Logging.h"

namespace orvane::test {

// A keyboard cover's trackpad: touch pad, finger and keyboard usages.
inline HIDEventServiceRef trackpadService(int64_t width = 655360, int64_t height = 327680,
                                          const char* transport = "USB") {
    PropertyDictionary props{{"SurfaceDimensions", PropertyDictionary{{"Width", width}, {"Height", height}}}};
    if (transport) props["Transport"] = PropertyValue(transport);
    return std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}, {13, 34}, {1, 6}}, props);
}

// Captures every log line while alive, then restores standard error.
class LogCapture {
public:
    LogCapture() : sink_(std::make_shared<CaptureLogSink>()) { Logging::setSink(sink_); }
    ~LogCapture() { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }
    std::vector<std::string> messages() const { return sink_->messages(); }
    std::vector<CaptureLogSink::Entry> entries() const { return sink_->entries(); }
    void clear() { sink_->clear(); }
    bool contains(const std::string& message) const {
        for (const auto& m : messages())
            if (m == message) return true;
        return false;
    }

private:
    std::shared_ptr<CaptureLogSink> sink_;
};

// Keeps every dispatched event.
class RecordingDispatcher : public HIDEventDispatcher {
public:
    void dispatchEvent(const HIDEventRef& event) override { events.push_back(event->copy()); }
    std::string description() const override { return "<RecordingDispatcher>"; }
    std::vector<HIDEventRef> events;
};

}  // namespace orvane::test
