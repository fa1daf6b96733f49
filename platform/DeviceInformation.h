#pragma once
// The device-information query. A library exporting these two C functions answers
// questions about the running system; plug-ins load it at run time by path.

#include "PropertyValue.h"

namespace orvane {
// Names the query function is looked up by.
inline constexpr const char* kDeviceInformationCopyAnswerSymbol = "OrvaneDeviceInformationCopyAnswer";
// Environment variable naming the library's path (overrides the built-in path).
inline constexpr const char* kDeviceInformationLibraryEnvironment = "ORVANE_DEVICE_INFORMATION_LIBRARY";
// Environment variable the shipped library reads for its "InternalBuild" answer.
inline constexpr const char* kInternalBuildEnvironment = "ORVANE_INTERNAL_BUILD";

// The query: a new answer the caller deletes, or nullptr for an unknown question.
using DeviceInformationCopyAnswer = PropertyValue* (*)(const char* question);
}  // namespace orvane
