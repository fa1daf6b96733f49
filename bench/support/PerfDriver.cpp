#include "PerfDriver.h"

#include "platform/HIDEventDispatcher.h"
#include "platform/HIDEventService.h"

namespace orvane::perf {

PerfDriver::~PerfDriver() {
    std::string error;
    if (filter_) host_.cancel(&error);
    host_.unload();
}

bool PerfDriver::open(const formats::ServiceDescription& service, std::string* error, const std::string& plugInPath) {
    auto hidService = std::make_shared<HIDEventService>(service.usagePairs, service.properties);
    std::shared_ptr<uint64_t> counter = dispatched_;
    auto dispatcher = std::make_shared<CallbackEventDispatcher>([counter](const HIDEventRef&) { ++*counter; });
    const std::string path = plugInPath.empty() ? host::PlugInHost::defaultPlugInPath() : plugInPath;
    if (!host_.open(path, {}, hidService, {}, dispatcher, error)) return false;
    filter_ = host_.filter().get();
    return filter_ != nullptr;
}

bool PerfDriver::setProperty(const std::string& key, const PropertyValue& value) {
    bool result = false;
    std::string error;
    host_.setProperty(value, key, nullptr, &result, &error);
    return result;
}

HIDEventRef PerfDriver::feed(const FrameSource::Record& record) {
    if (record.event) return filterEvent(record.event);
    setProperty(record.propertyKey, record.propertyValue);
    return nullptr;
}

}  // namespace orvane::perf
