#pragma once
// The plug-in's two log handles and its internal-build test, shared by every class.

#include "platform/Logging.h"

#define ORVANE_EXPORT __attribute__((visibility("default")))

// The log subsystem of every handle of the plug-in.
inline constexpr const char* kOrvaneLogSubsystem = "org.orvane.trackpad";

extern "C" {
// The normal handle, category "ServiceFilter", made once.
ORVANE_EXPORT orvane::LogHandle* LoggingServiceFilter(void);
// The verbose handle, category "ServiceFilterVerbose", made once.
ORVANE_EXPORT orvane::LogHandle* LoggingServiceFilterVerbose(void);
// True on an internal (development) build: asked once of the device-information library.
ORVANE_EXPORT bool _isInternalBuild(void);
}

namespace orvane {

// _isInternalBuild's answer, kept here after the first call.
inline bool internalBuild() {
    static const bool internal = _isInternalBuild();
    return internal;
}

// Per-frame diagnostics run only on an internal build with the verbose handle at debug level.
inline bool verboseDebugEnabled() {
    return internalBuild() && LoggingServiceFilterVerbose()->isEnabled(LogLevel::Debug);
}

// Logs at debug level on the verbose handle when verboseDebugEnabled().
template <typename... Args>
inline void logVerbose(const char* format, const Args&... args) {
    if (verboseDebugEnabled()) LoggingServiceFilterVerbose()->log(LogLevel::Debug, format, args...);
}

}  // namespace orvane
