#pragma once
// The HID service a filter is attached to: properties that can be read and written
// (a write may be refused) and usage-pair conformance.

#include <cstdint>
#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "PropertyValue.h"

namespace orvane {

struct HIDUsagePair {
    uint32_t page;
    uint32_t usage;
    bool operator==(const HIDUsagePair&) const = default;
};

class HIDEventService {
public:
    // The usage pairs become the service's "DeviceUsagePairs" property.
    HIDEventService(std::vector<HIDUsagePair> usagePairs, PropertyDictionary properties, uint64_t serviceID = 1);

    uint64_t serviceID() const { return serviceID_; }

    // The property, or a none value when absent.
    PropertyValue propertyForKey(const std::string& key) const;
    // Stores the property; false when the service refuses this key.
    bool setPropertyForKey(const PropertyValue& value, const std::string& key);
    const PropertyDictionary& properties() const { return properties_; }

    // Conformance reads the "DeviceUsagePairs" property, so rewriting it changes the answer.
    bool conformsToUsagePage(uint32_t page, uint32_t usage) const;
    std::vector<HIDUsagePair> usagePairs() const;

    // Makes later writes of this key fail, as a device that does not take it would.
    void refuseProperty(const std::string& key) { refused_.insert(key); }

    std::string description() const;

private:
    uint64_t serviceID_;
    PropertyDictionary properties_;
    std::set<std::string> refused_;
};

using HIDEventServiceRef = std::shared_ptr<HIDEventService>;

// A client of the event system.
class HIDConnection {
public:
    explicit HIDConnection(uint64_t connectionID) : connectionID_(connectionID) {}
    uint64_t connectionID() const { return connectionID_; }
    std::string description() const;

private:
    uint64_t connectionID_;
};

using HIDConnectionRef = std::shared_ptr<HIDConnection>;

}  // namespace orvane
