#pragma once
// The event reader on an already parsed JSON value, inside this library only.

#include <string>

#include "JsonRead.h"
#include "platform/HIDEvent.h"

namespace orvane::formats::detail {

HIDEventRef eventFromJsonValue(const Json& json, std::string* error);

}  // namespace orvane::formats::detail
