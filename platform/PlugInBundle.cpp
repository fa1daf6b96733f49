#include "PlugInBundle.h"

#include <map>
#include <mutex>

namespace orvane::PlugInBundle {

namespace {
std::mutex gMutex;
std::map<std::string, PropertyDictionary>& bundles() {
    static std::map<std::string, PropertyDictionary> b;
    return b;
}
}  // namespace

void setInfoDictionary(const std::string& identifier, PropertyDictionary info) {
    std::lock_guard<std::mutex> lock(gMutex);
    bundles()[identifier] = std::move(info);
}

PropertyValue objectForInfoDictionaryKey(const std::string& identifier, const std::string& key) {
    std::lock_guard<std::mutex> lock(gMutex);
    auto b = bundles().find(identifier);
    if (b == bundles().end()) return {};
    auto it = b->second.find(key);
    return it == b->second.end() ? PropertyValue() : it->second;
}

}  // namespace orvane::PlugInBundle
