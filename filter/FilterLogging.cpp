#include "FilterLogging.h"

#include <dlfcn.h>

#include <cstdlib>
#include <memory>
#include <mutex>

#include "platform/DeviceInformation.h"

using orvane::LogHandle;

LogHandle* LoggingServiceFilter(void) {
    static LogHandle* handle = new LogHandle(kOrvaneLogSubsystem, "ServiceFilter");
    return handle;
}

LogHandle* LoggingServiceFilterVerbose(void) {
    static LogHandle* handle = new LogHandle(kOrvaneLogSubsystem, "ServiceFilterVerbose");
    return handle;
}

namespace {

// Where the device-information library lives: the environment may name another one.
const char* deviceInformationLibraryPath() {
    const char* path = std::getenv(orvane::kDeviceInformationLibraryEnvironment);
    if (path && *path) return path;
#ifdef ORVANE_DEFAULT_DEVICE_INFORMATION_LIBRARY
    return ORVANE_DEFAULT_DEVICE_INFORMATION_LIBRARY;
#else
    return nullptr;
#endif
}

bool askInternalBuild() {
    const char* path = deviceInformationLibraryPath();
    if (!path) return false;
    void* library = dlopen(path, RTLD_LAZY | RTLD_GLOBAL);
    if (!library) return false;
    auto copyAnswer = reinterpret_cast<orvane::DeviceInformationCopyAnswer>(
        dlsym(library, orvane::kDeviceInformationCopyAnswerSymbol));
    if (!copyAnswer) return false;
    std::unique_ptr<orvane::PropertyValue> answer(copyAnswer("InternalBuild"));
    // Only the boolean true object counts; the answer is released either way.
    return answer && answer->isBooleanTrue();
}

}  // namespace

bool _isInternalBuild(void) {
    static std::once_flag once;
    static bool internal = false;
    std::call_once(once, [] { internal = askInternalBuild(); });
    return internal;
}
