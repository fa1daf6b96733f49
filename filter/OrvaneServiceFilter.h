#pragma once
// The plug-in's principal class: matches the keyboard cover's trackpad service, configures
// it, gives every contact frame its device time and runs it through the frame pipeline.

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "pipeline/HIDParser.h"
#include "platform/HIDServiceFilter.h"

namespace orvane {

// The plug-in's bundle identifier, under which the host registers its information dictionary.
inline constexpr const char* kOrvaneBundleIdentifier = "org.orvane.OrvaneServiceFilter";

class OrvaneServiceFilter : public HIDServiceFilter, public std::enable_shared_from_this<OrvaneServiceFilter> {
public:
    static bool matchService(const HIDEventServiceRef& service, const PropertyDictionary& options, int64_t* score);
    // A new filter, or nullptr for a trackpad whose dimensions are unknown.
    static std::shared_ptr<OrvaneServiceFilter> initWithService(const HIDEventServiceRef& service);
    ~OrvaneServiceFilter() override;

    std::string description() const override;
    void activate() override;
    void cancel() override;
    void setCancelHandler(std::function<void()> handler) override;
    void setDispatchQueue(const DispatchQueueRef& queue) override;
    void setEventDispatcher(const std::shared_ptr<HIDEventDispatcher>& dispatcher) override;
    void clientNotification(const HIDConnectionRef& client, bool added) override;

    HIDEventRef filterEvent(const HIDEventRef& event) override;
    HIDEventRef filterEventMatching(const PropertyDictionary& matching, const HIDEventRef& event,
                                    const HIDConnectionRef& client) override;
    uint64_t getDeviceTimestamp(const HIDEvent& event);
    static uint64_t relativeScanDeltaToTicks(uint16_t delta);

    PropertyValue propertyForKey(const std::string& key, const HIDConnectionRef& client) override;
    bool setProperty(const PropertyValue& value, const std::string& key, const HIDConnectionRef& client) override;
    void configureService();

    HIDEventServiceRef service() const { return service_.lock(); }
    void setService(const HIDEventServiceRef& s) { service_ = s; }
    const std::shared_ptr<HIDParser>& parser() const { return parser_; }
    void setParser(std::shared_ptr<HIDParser> p) { parser_ = std::move(p); }
    HIDConnectionRef client() const { return client_.lock(); }
    void setClient(const HIDConnectionRef& c) { client_ = c; }
    std::shared_ptr<HIDEventDispatcher> dispatcher() const { return dispatcher_.lock(); }
    void setDispatcher(const std::shared_ptr<HIDEventDispatcher>& d) { dispatcher_ = d; }
    const PropertyValue& accelSettings() const { return accelSettings_; }
    void setAccelSettings(PropertyValue settings) { accelSettings_ = std::move(settings); }

    bool activated() const { return activated_; }
    bool clientAdded() const { return clientAdded_; }
    bool isWireless() const { return isWireless_; }
    uint64_t lastDeviceTstamp() const { return lastDeviceTstamp_; }
    uint16_t lastTscan() const { return lastTscan_; }
    bool hasCancelHandler() const { return static_cast<bool>(cancelHandler_); }
    const DispatchQueueRef& queue() const { return queue_; }

    OrvaneServiceFilter() = default;

private:
    bool initWithServiceSteps(const HIDEventServiceRef& service);

    std::function<void()> cancelHandler_;
    DispatchQueueRef queue_;
    bool activated_ = false;
    bool clientAdded_ = false;
    bool isWireless_ = false;
    uint64_t lastDeviceTstamp_ = 0;
    uint16_t lastTscan_ = 0;
    std::weak_ptr<HIDEventService> service_;
    std::shared_ptr<HIDParser> parser_;
    std::weak_ptr<HIDConnection> client_;
    std::weak_ptr<HIDEventDispatcher> dispatcher_;
    PropertyValue accelSettings_;
};

}  // namespace orvane

extern "C" {
// The plug-in's version, 27.0, and its version text.
__attribute__((visibility("default"))) extern const double OrvaneServiceFilterVersionNumber;
__attribute__((visibility("default"))) extern const unsigned char OrvaneServiceFilterVersionString[];
// The record the host loads the filter through.
__attribute__((visibility("default"))) const orvane::HIDServiceFilterPlugIn* OrvaneServiceFilterPlugIn(void);
}
