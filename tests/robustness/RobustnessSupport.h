#pragma once
// The loaded plug-in driven the way the event system drives it, for the robustness tests:
// every dispatched and returned event is kept in the order it left the filter, with the
// number of the input that caused it, and every log line is captured.

#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "platform/HIDEvent.h"
#include "platform/HIDEventDispatcher.h"
#include "platform/HIDEventService.h"
#include "platform/Logging.h"
#include "tools/host/PlugInHost.h"

namespace orvane::robust {

// What left the filter, in order.
struct Delivery {
    enum class Via { Dispatch, Return };
    Via via;
    int64_t input;
    HIDEventRef event;  // a copy taken when it left (none for a return of nothing)
};

// A keyboard cover's trackpad, 100 x 50 (the filter sees 1000 x 500).
inline HIDEventServiceRef trackpad(const char* transport = "USB") {
    PropertyDictionary props{{"SurfaceDimensions", PropertyDictionary{{"Width", int64_t{6553600}},
                                                                      {"Height", int64_t{3276800}}}}};
    if (transport) props["Transport"] = PropertyValue(transport);
    return std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}, {13, 34}, {1, 6}}, props);
}

class PlugInSession {
public:
    explicit PlugInSession(HIDEventServiceRef service = trackpad()) : service_(std::move(service)) {
        capture_ = std::make_shared<CaptureLogSink>();
        Logging::setSink(capture_);
        dispatcher_ = std::make_shared<CallbackEventDispatcher>([this](const HIDEventRef& event) {
            deliveries_.push_back({Delivery::Via::Dispatch, input_, event ? event->copy() : nullptr});
        });
        std::string error;
        opened_ = host_.open(ORVANE_PLUGIN_MODULE, {}, service_, {}, dispatcher_, &error);
        EXPECT_TRUE(opened_) << error;
    }
    ~PlugInSession() {
        host_.unload();
        Logging::setSink(std::make_shared<StandardErrorLogSink>());
    }
    PlugInSession(const PlugInSession&) = delete;
    PlugInSession& operator=(const PlugInSession&) = delete;

    // One input record: the event through the filter. Returns what came back.
    HIDEventRef send(const HIDEventRef& event) {
        ++input_;
        HIDEventRef result;
        std::string error;
        EXPECT_TRUE(host_.filterEvent(event, &result, &error)) << error;
        deliveries_.push_back({Delivery::Via::Return, input_, result ? result->copy() : nullptr});
        return result;
    }
    bool setProperty(const PropertyValue& value, const std::string& key) {
        ++input_;
        bool accepted = false;
        std::string error;
        EXPECT_TRUE(host_.setProperty(value, key, nullptr, &accepted, &error)) << error;
        return accepted;
    }
    bool cancel() {
        std::string error;
        const bool ok = host_.cancel(&error);
        EXPECT_TRUE(ok) << error;
        return ok;
    }

    bool opened() const { return opened_; }
    const HIDEventServiceRef& service() const { return service_; }
    const std::vector<Delivery>& deliveries() const { return deliveries_; }
    std::vector<HIDEventRef> dispatched() const {
        std::vector<HIDEventRef> out;
        for (const auto& d : deliveries_)
            if (d.via == Delivery::Via::Dispatch) out.push_back(d.event);
        return out;
    }
    std::vector<CaptureLogSink::Entry> logs() const { return capture_->entries(); }
    // The log lines of one level whose message ends with `suffix`.
    size_t countLogs(LogLevel level, const std::string& suffix) const {
        size_t n = 0;
        for (const auto& e : capture_->entries())
            if (e.level == level && e.message.size() >= suffix.size() &&
                e.message.compare(e.message.size() - suffix.size(), suffix.size(), suffix) == 0)
                ++n;
        return n;
    }
    size_t countLogs(LogLevel level) const {
        size_t n = 0;
        for (const auto& e : capture_->entries()) n += e.level == level;
        return n;
    }

private:
    HIDEventServiceRef service_;
    std::shared_ptr<CaptureLogSink> capture_;
    std::vector<Delivery> deliveries_;
    std::shared_ptr<HIDEventDispatcher> dispatcher_;
    host::PlugInHost host_;
    bool opened_ = false;
    int64_t input_ = -1;
};

// The first child of `event` of the type, or none.
inline HIDEventRef childOfType(const HIDEventRef& event, uint32_t type) {
    if (!event) return nullptr;
    for (const auto& c : event->children())
        if (c->type() == type) return c;
    return nullptr;
}

}  // namespace orvane::robust
