#pragma once
// Reading JSON with nlohmann-json, inside this library only: every failure becomes a
// message, no exception leaves these functions.

#include <string>
#include <string_view>

#include <nlohmann/json.hpp>

#include "platform/PropertyValue.h"

namespace orvane::formats::detail {

using Json = nlohmann::json;

// Parses one complete JSON text; false with "invalid JSON at column N: ..." on failure.
bool parseJson(std::string_view text, Json* out, std::string* error);

// "an integer", "a number with a fraction", "a string", "an object", ... for messages.
std::string describeJson(const Json& value);

bool jsonIsInteger(const Json& value);

// A property-list value from JSON: true/false are booleans, integers Integer, other
// numbers Real, strings, arrays and objects as themselves; null is refused.
bool propertyValueFromJsonValue(const Json& value, PropertyValue* out, std::string* error);

}  // namespace orvane::formats::detail
