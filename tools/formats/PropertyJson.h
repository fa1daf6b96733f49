#pragma once
// Property-list values as JSON, as recordings carry them: booleans as true/false,
// integers as JSON integers, reals as double tokens, strings, arrays and objects as
// themselves. Data has no JSON form and is written as a lowercase hex string (it reads
// back as a string); a none value is written as null (and is refused on reading).

#include <string>
#include <string_view>

#include "platform/PropertyValue.h"

namespace orvane::formats {

std::string propertyValueToJson(const PropertyValue& value);
void appendPropertyValueJson(std::string& out, const PropertyValue& value);

// False with a message (no file or line; the caller adds them) on bad input.
bool propertyValueFromJson(std::string_view text, PropertyValue* out, std::string* error);

}  // namespace orvane::formats
