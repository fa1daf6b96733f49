// A stand-in plug-in module for the host and command tests. Every call it receives is
// written to the log (category "FakeServiceFilter", default level), so a test reads the
// order of calls from a captured log or a log stream.
//
// What it does:
// - matches a service that conforms to usage page 13 usage 5, with score 500;
// - refuses (no instance) a service without "SurfaceDimensions";
// - for a digitizer event, sends a button event (mask 1) through the dispatcher and then
//   changes that event's mask to 7, and returns a pointer event (x 1.5, y -2.0) carrying
//   the incoming event as its child; for a vendor-defined event returns none; any other
//   event comes back unchanged;
// - accepts every property except "Refused";
// - on cancel calls its cancel handler from the queue as many times as the service
//   property "FakeCancelHandlerCalls" says (once when it is absent);
// - with the internal-build answer on (ORVANE_INTERNAL_BUILD=1), also writes a debug line
//   per event to the category "FakeServiceFilterVerbose".

#include <cstdlib>
#include <cstring>
#include <memory>

#include "platform/DeviceInformation.h"
#include "platform/HIDServiceFilter.h"
#include "platform/Logging.h"
#include "platform/PlugInBundle.h"

namespace {

using namespace orvane;

const char* const kBundleIdentifier = "org.orvane.tests.FakeServiceFilter";

const LogHandle& log() {
    static const LogHandle handle("org.orvane.tests", "FakeServiceFilter");
    return handle;
}

const LogHandle& verboseLog() {
    static const LogHandle handle("org.orvane.tests", "FakeServiceFilterVerbose");
    return handle;
}

bool internalBuild() {
    const char* v = std::getenv(kInternalBuildEnvironment);
    return v && std::strcmp(v, "1") == 0;
}

class FakeServiceFilter : public HIDServiceFilter, public std::enable_shared_from_this<FakeServiceFilter> {
public:
    explicit FakeServiceFilter(const HIDEventServiceRef& service) : service_(service) {
        const PropertyValue calls = service->propertyForKey("FakeCancelHandlerCalls");
        cancelHandlerCalls_ = calls.isNumber() ? static_cast<int>(calls.integerValue()) : 1;
        service->setPropertyForKey(PropertyValue("FakeServiceFilter"), "FilteredBy");
    }
    ~FakeServiceFilter() override { log().log("dealloc"); }

    HIDEventRef filterEvent(const HIDEventRef& event) override {
        log().log("filterEvent %u", event->type());
        if (internalBuild()) verboseLog().log(LogLevel::Debug, "event %@", event);
        if (event->type() == kHIDEventTypeVendorDefined) return nullptr;
        if (event->type() != kHIDEventTypeDigitizer) return event;
        auto button = HIDEvent::createButtonEvent(event->timestamp(), 1, 0);
        if (auto dispatcher = dispatcher_.lock()) dispatcher->dispatchEvent(button);
        button->setIntegerValue(7, kHIDEventFieldButtonMask);
        auto pointer = HIDEvent::pointerEvent(event->timestamp(), 1.5, -2.0, 0.0, 0, 0);
        pointer->appendEvent(event);
        return pointer;
    }
    HIDEventRef filterEventMatching(const PropertyDictionary&, const HIDEventRef& event,
                                    const HIDConnectionRef&) override {
        return event;
    }
    PropertyValue propertyForKey(const std::string& key, const HIDConnectionRef&) override {
        log().log("propertyForKey %s", key);
        return key == "ClassName" ? PropertyValue("FakeServiceFilter") : PropertyValue();
    }
    bool setProperty(const PropertyValue& value, const std::string& key, const HIDConnectionRef& client) override {
        log().log("setProperty %s = %@ client %@", key, value, client);
        return key != "Refused";
    }
    void setDispatchQueue(const DispatchQueueRef& queue) override {
        log().log("setDispatchQueue");
        queue_ = queue;
    }
    void setEventDispatcher(const std::shared_ptr<HIDEventDispatcher>& dispatcher) override {
        log().log("setEventDispatcher");
        dispatcher_ = dispatcher;
    }
    void setCancelHandler(std::function<void()> handler) override {
        log().log("setCancelHandler");
        cancelHandler_ = std::move(handler);
    }
    void activate() override {
        const PropertyValue acceleration = PlugInBundle::objectForInfoDictionaryKey(kBundleIdentifier, "Acceleration");
        log().log("activate Acceleration %@", acceleration);
    }
    void cancel() override {
        log().log("cancel");
        auto self = shared_from_this();
        queue_->async([self] {
            log().log("cancel handler");
            for (int i = 0; i < self->cancelHandlerCalls_; ++i)
                if (self->cancelHandler_) self->cancelHandler_();
            self->cancelHandler_ = nullptr;
        });
    }
    void clientNotification(const HIDConnectionRef& client, bool added) override {
        log().log("clientNotification %@ added %d", client, added);
    }
    std::string description() const override { return "FakeServiceFilter"; }

private:
    std::weak_ptr<HIDEventService> service_;
    DispatchQueueRef queue_;
    std::weak_ptr<HIDEventDispatcher> dispatcher_;
    std::function<void()> cancelHandler_;
    int cancelHandlerCalls_ = 1;
};

bool matchService(const HIDEventServiceRef& service, const PropertyDictionary&, int64_t* score) {
    log().log("matchService score %lld", static_cast<long long>(*score));
    if (!service->conformsToUsagePage(13, 5)) return false;
    *score = 500;
    return true;
}

HIDServiceFilterRef create(const HIDEventServiceRef& service) {
    log().log("create");
    if (service->propertyForKey("SurfaceDimensions").isNone()) return nullptr;
    return std::make_shared<FakeServiceFilter>(service);
}

const HIDServiceFilterPlugIn kPlugIn{"FakeServiceFilter", &matchService, &create};

}  // namespace

extern "C" __attribute__((visibility("default"))) const orvane::HIDServiceFilterPlugIn* FakeServiceFilterPlugIn(void) {
    return &kPlugIn;
}
