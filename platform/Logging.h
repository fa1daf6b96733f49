#pragma once
// Structured logging: handles made from a subsystem and a category, three levels,
// printf-style formats in which "%@" takes an object's description, pluggable sinks.

#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <type_traits>
#include <vector>

#include "PropertyValue.h"

namespace orvane {

enum class LogLevel { Default, Debug, Error };
const char* logLevelName(LogLevel level);

struct LogRecord {
    const std::string& subsystem;
    const std::string& category;
    LogLevel level;
    const std::string& message;
};

class LogSink {
public:
    virtual ~LogSink() = default;
    virtual void write(const LogRecord& record) = 0;
};

// Writes "category: message" lines to standard error.
class StandardErrorLogSink : public LogSink {
public:
    void write(const LogRecord& record) override;
};

// Keeps every record, for tests.
class CaptureLogSink : public LogSink {
public:
    struct Entry {
        std::string subsystem;
        std::string category;
        LogLevel level;
        std::string message;
    };
    void write(const LogRecord& record) override;
    std::vector<Entry> entries() const;
    std::vector<std::string> messages() const;
    void clear();

private:
    mutable std::mutex mutex_;
    std::vector<Entry> entries_;
};

// One argument of a log format, already reduced to what printf needs.
struct LogArgument {
    enum class Kind { Signed, Unsigned, Real, Text, Pointer } kind;
    int64_t s = 0;
    uint64_t u = 0;
    double d = 0.0;
    const void* p = nullptr;
    std::string text;
};

namespace detail {
template <typename T, typename = void>
struct HasDescription : std::false_type {};
template <typename T>
struct HasDescription<T, std::void_t<decltype(std::declval<const T&>().description())>> : std::true_type {};

template <typename T>
LogArgument makeLogArgument(const T& v) {
    LogArgument a{};
    using D = std::decay_t<T>;
    if constexpr (std::is_same_v<D, bool>) {
        a.kind = LogArgument::Kind::Signed;
        a.s = v ? 1 : 0;
    } else if constexpr (std::is_integral_v<D> && std::is_signed_v<D>) {
        a.kind = LogArgument::Kind::Signed;
        a.s = v;
    } else if constexpr (std::is_integral_v<D>) {
        a.kind = LogArgument::Kind::Unsigned;
        a.u = v;
    } else if constexpr (std::is_enum_v<D>) {
        a.kind = LogArgument::Kind::Signed;
        a.s = static_cast<int64_t>(v);
    } else if constexpr (std::is_floating_point_v<D>) {
        a.kind = LogArgument::Kind::Real;
        a.d = v;
    } else if constexpr (std::is_same_v<D, std::string>) {
        a.kind = LogArgument::Kind::Text;
        a.text = v;
    } else if constexpr (std::is_convertible_v<D, const char*>) {
        a.kind = LogArgument::Kind::Text;
        const char* text = v;
        a.text = text ? text : "(null)";
    } else if constexpr (HasDescription<D>::value) {
        a.kind = LogArgument::Kind::Text;
        a.text = v.description();
    } else if constexpr (requires { v.get(); v->description(); }) {
        a.kind = LogArgument::Kind::Text;
        a.text = v ? v->description() : std::string("(null)");
    } else if constexpr (std::is_pointer_v<D>) {
        a.kind = LogArgument::Kind::Pointer;
        a.p = static_cast<const void*>(v);
    } else {
        static_assert(sizeof(D) == 0, "no log conversion for this argument");
    }
    return a;
}
}  // namespace detail

// printf-style formatting with "%@" for an object's description.
std::string formatLogMessage(const char* format, const std::vector<LogArgument>& args);

class LogHandle {
public:
    LogHandle(std::string subsystem, std::string category);

    const std::string& subsystem() const { return subsystem_; }
    const std::string& category() const { return category_; }
    bool isEnabled(LogLevel level) const;

    template <typename... Args>
    void log(LogLevel level, const char* format, const Args&... args) const {
        if (!isEnabled(level)) return;
        write(level, formatLogMessage(format, {detail::makeLogArgument(args)...}));
    }
    template <typename... Args>
    void log(const char* format, const Args&... args) const {
        log(LogLevel::Default, format, args...);
    }

    void write(LogLevel level, const std::string& message) const;

private:
    std::string subsystem_;
    std::string category_;
};

namespace Logging {
// The sink every handle writes to; standard error until a host sets another.
void setSink(std::shared_ptr<LogSink> sink);
std::shared_ptr<LogSink> sink();
// Debug level: off unless turned on, for every category or for one.
void setDebugEnabled(bool enabled);
void setDebugEnabled(const std::string& category, bool enabled);
bool debugEnabled(const std::string& category);
}  // namespace Logging

}  // namespace orvane
