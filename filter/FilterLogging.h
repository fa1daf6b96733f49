#pragma once
// The plug-in's two log handles and its internal-build test, shared by every class.

#include <atomic>

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

// _isInternalBuild's answer, kept here after the first call (-1 until then); two threads that
// ask at once both get the one answer _isInternalBuild keeps.
inline std::atomic<int> internalBuildAnswer{-1};
inline bool internalBuild() {
    int answer = internalBuildAnswer.load(std::memory_order_relaxed);
    if (answer < 0) [[unlikely]] {
        answer = _isInternalBuild() ? 1 : 0;
        internalBuildAnswer.store(answer, std::memory_order_relaxed);
    }
    return answer != 0;
}

// False once the build is known not to be an internal one: the diagnostics are then off for
// good, and the checks of every frame are one test of this flag.
inline std::atomic<bool> diagnosticsMayBeOn{true};

// Per-frame diagnostics run only on an internal build with the verbose handle at debug level.
inline bool verboseDebugEnabled() {
    if (!diagnosticsMayBeOn.load(std::memory_order_relaxed)) return false;
    if (!internalBuild()) {
        diagnosticsMayBeOn.store(false, std::memory_order_relaxed);
        return false;
    }
    return LoggingServiceFilterVerbose()->isEnabled(LogLevel::Debug);
}

// Logs at debug level on the verbose handle when verboseDebugEnabled().
template <typename... Args>
inline void logVerbose(const char* format, const Args&... args) {
    if (verboseDebugEnabled()) LoggingServiceFilterVerbose()->log(LogLevel::Debug, format, args...);
}

// A stage's copy of diagnosticsMayBeOn, taken when the stage starts on a frame. The flag only
// ever goes from true to false, so a copy that says false stays right for good and a copy that
// says true only sends the test on to the flag. The copy is a plain value: testing it lets the
// compiler keep the frame's other values in registers, where every load of the flag (an atomic)
// makes it load them again.
class FrameDiagnostics {
public:
    void takeCopy() { mayBeOn_ = diagnosticsMayBeOn.load(std::memory_order_relaxed); }
    bool verboseDebugEnabled() const { return mayBeOn_ && orvane::verboseDebugEnabled(); }
    template <typename... Args>
    void logVerbose(const char* format, const Args&... args) const {
        if (mayBeOn_) orvane::logVerbose(format, args...);
    }

private:
    bool mayBeOn_ = true;
};

}  // namespace orvane
