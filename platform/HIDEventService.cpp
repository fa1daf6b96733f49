#include "HIDEventService.h"

#include <cstdio>

namespace orvane {

namespace {
const char* const kDeviceUsagePairs = "DeviceUsagePairs";
const char* const kDeviceUsagePage = "DeviceUsagePage";
const char* const kDeviceUsage = "DeviceUsage";
}  // namespace

HIDEventService::HIDEventService(std::vector<HIDUsagePair> usagePairs, PropertyDictionary properties,
                                 uint64_t serviceID)
    : serviceID_(serviceID), properties_(std::move(properties)) {
    PropertyArray pairs;
    for (const HIDUsagePair& p : usagePairs) {
        pairs.push_back(PropertyDictionary{{kDeviceUsagePage, static_cast<int64_t>(p.page)},
                                           {kDeviceUsage, static_cast<int64_t>(p.usage)}});
    }
    properties_[kDeviceUsagePairs] = PropertyValue(std::move(pairs));
}

PropertyValue HIDEventService::propertyForKey(const std::string& key) const {
    auto it = properties_.find(key);
    return it == properties_.end() ? PropertyValue() : it->second;
}

bool HIDEventService::setPropertyForKey(const PropertyValue& value, const std::string& key) {
    if (refused_.count(key)) return false;
    properties_[key] = value;
    return true;
}

std::vector<HIDUsagePair> HIDEventService::usagePairs() const {
    std::vector<HIDUsagePair> out;
    auto it = properties_.find(kDeviceUsagePairs);
    if (it == properties_.end()) return out;
    for (const PropertyValue& entry : it->second.arrayValue()) {
        const PropertyValue* page = entry.find(kDeviceUsagePage);
        const PropertyValue* usage = entry.find(kDeviceUsage);
        if (page && usage && page->isNumber() && usage->isNumber()) {
            out.push_back(HIDUsagePair{static_cast<uint32_t>(page->integerValue()),
                                       static_cast<uint32_t>(usage->integerValue())});
        }
    }
    return out;
}

bool HIDEventService::conformsToUsagePage(uint32_t page, uint32_t usage) const {
    for (const HIDUsagePair& p : usagePairs()) {
        if (p.page == page && p.usage == usage) return true;
    }
    return false;
}

std::string HIDEventService::description() const {
    char buf[64];
    std::snprintf(buf, sizeof buf, "<HIDEventService %llu usages", static_cast<unsigned long long>(serviceID_));
    std::string s = buf;
    for (const HIDUsagePair& p : usagePairs()) {
        std::snprintf(buf, sizeof buf, " %u/%u", p.page, p.usage);
        s += buf;
    }
    s += '>';
    return s;
}

std::string HIDConnection::description() const {
    char buf[48];
    std::snprintf(buf, sizeof buf, "<HIDConnection %llu>", static_cast<unsigned long long>(connectionID_));
    return buf;
}

}  // namespace orvane
