// The device-information library for Linux. It answers "InternalBuild" from the
// ORVANE_INTERNAL_BUILD environment variable ("1", "true" or "yes" mean an internal build).

#include <cstdlib>
#include <cstring>

#include "../DeviceInformation.h"

extern "C" __attribute__((visibility("default"))) orvane::PropertyValue* OrvaneDeviceInformationCopyAnswer(
    const char* question) {
    if (!question) return nullptr;
    if (std::strcmp(question, "InternalBuild") == 0) {
        const char* v = std::getenv(orvane::kInternalBuildEnvironment);
        bool internal = v && (std::strcmp(v, "1") == 0 || std::strcmp(v, "true") == 0 || std::strcmp(v, "yes") == 0);
        return new orvane::PropertyValue(internal);
    }
    return nullptr;
}
