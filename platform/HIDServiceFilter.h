#pragma once
// The protocol a service filter plug-in conforms to, and the interface its module exports.

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

#include "DispatchQueue.h"
#include "HIDEvent.h"
#include "HIDEventDispatcher.h"
#include "HIDEventService.h"
#include "PropertyValue.h"

namespace orvane {

class HIDServiceFilter {
public:
    virtual ~HIDServiceFilter() = default;

    virtual HIDEventRef filterEvent(const HIDEventRef& event) = 0;
    virtual HIDEventRef filterEventMatching(const PropertyDictionary& matching, const HIDEventRef& event,
                                            const HIDConnectionRef& client) = 0;
    virtual PropertyValue propertyForKey(const std::string& key, const HIDConnectionRef& client) = 0;
    virtual bool setProperty(const PropertyValue& value, const std::string& key, const HIDConnectionRef& client) = 0;
    virtual void setDispatchQueue(const DispatchQueueRef& queue) = 0;
    virtual void setEventDispatcher(const std::shared_ptr<HIDEventDispatcher>& dispatcher) = 0;
    virtual void setCancelHandler(std::function<void()> handler) = 0;
    virtual void activate() = 0;
    virtual void cancel() = 0;
    virtual void clientNotification(const HIDConnectionRef& client, bool added) = 0;
    virtual std::string description() const = 0;
};

using HIDServiceFilterRef = std::shared_ptr<HIDServiceFilter>;

// What a plug-in module gives its host: the class name, matching and construction.
// The module exports one C function, named in its information dictionary under
// "PlugInFactory", that returns a pointer to this record.
struct HIDServiceFilterPlugIn {
    const char* className;
    bool (*matchService)(const HIDEventServiceRef& service, const PropertyDictionary& options, int64_t* score);
    HIDServiceFilterRef (*create)(const HIDEventServiceRef& service);
};

using HIDServiceFilterPlugInFactory = const HIDServiceFilterPlugIn* (*)();

}  // namespace orvane
