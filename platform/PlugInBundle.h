#pragma once
// Information dictionaries of loaded plug-in bundles, by bundle identifier.
// The host registers a bundle's dictionary when it loads the module; the plug-in
// reads its own entries from it.

#include <string>

#include "PropertyValue.h"

namespace orvane::PlugInBundle {

void setInfoDictionary(const std::string& identifier, PropertyDictionary info);
// The bundle's dictionary entry, or a none value.
PropertyValue objectForInfoDictionaryKey(const std::string& identifier, const std::string& key);

}  // namespace orvane::PlugInBundle
