#include "Logging.h"

#include <algorithm>
#include <cinttypes>
#include <cstdio>
#include <map>
#include <string_view>

namespace orvane {

const char* logLevelName(LogLevel level) {
    switch (level) {
    case LogLevel::Default: return "default";
    case LogLevel::Debug: return "debug";
    case LogLevel::Error: return "error";
    }
    return "default";
}

void StandardErrorLogSink::write(const LogRecord& r) {
    std::fprintf(stderr, "%s [%s] %s\n", r.category.c_str(), logLevelName(r.level), r.message.c_str());
}

void CaptureLogSink::write(const LogRecord& r) {
    std::lock_guard<std::mutex> lock(mutex_);
    entries_.push_back(Entry{r.subsystem, r.category, r.level, r.message});
}

std::vector<CaptureLogSink::Entry> CaptureLogSink::entries() const {
    std::lock_guard<std::mutex> lock(mutex_);
    return entries_;
}

std::vector<std::string> CaptureLogSink::messages() const {
    std::lock_guard<std::mutex> lock(mutex_);
    std::vector<std::string> out;
    for (const auto& e : entries_) out.push_back(e.message);
    return out;
}

void CaptureLogSink::clear() {
    std::lock_guard<std::mutex> lock(mutex_);
    entries_.clear();
}

namespace {

struct LoggingState {
    std::mutex mutex;
    std::shared_ptr<LogSink> sink = std::make_shared<StandardErrorLogSink>();
    bool debugAll = false;
    std::map<std::string, bool> debugByCategory;
};

LoggingState& state() {
    static LoggingState s;
    return s;
}

void appendFormatted(std::string& out, const std::string& directive, const LogArgument& a, char conv) {
    char buf[512];
    int n = 0;
    switch (conv) {
    case 'd':
    case 'i': {
        int64_t v = a.kind == LogArgument::Kind::Signed     ? a.s
                    : a.kind == LogArgument::Kind::Unsigned ? static_cast<int64_t>(a.u)
                    : a.kind == LogArgument::Kind::Real     ? static_cast<int64_t>(a.d)
                                                            : 0;
        n = std::snprintf(buf, sizeof buf, (directive + PRId64).c_str(), v);
        break;
    }
    case 'u':
    case 'x':
    case 'X':
    case 'o': {
        uint64_t v = a.kind == LogArgument::Kind::Unsigned ? a.u
                     : a.kind == LogArgument::Kind::Signed ? static_cast<uint64_t>(a.s)
                     : a.kind == LogArgument::Kind::Real   ? static_cast<uint64_t>(a.d)
                                                           : 0;
        std::string f = directive + (conv == 'u' ? PRIu64 : conv == 'x' ? PRIx64 : conv == 'X' ? PRIX64 : PRIo64);
        n = std::snprintf(buf, sizeof buf, f.c_str(), v);
        break;
    }
    case 'c': {
        int v = static_cast<int>(a.kind == LogArgument::Kind::Unsigned ? a.u : a.s);
        n = std::snprintf(buf, sizeof buf, (directive + "c").c_str(), v);
        break;
    }
    case 'f':
    case 'F':
    case 'e':
    case 'E':
    case 'g':
    case 'G':
    case 'a':
    case 'A': {
        double v = a.kind == LogArgument::Kind::Real       ? a.d
                   : a.kind == LogArgument::Kind::Signed   ? static_cast<double>(a.s)
                   : a.kind == LogArgument::Kind::Unsigned ? static_cast<double>(a.u)
                                                           : 0.0;
        n = std::snprintf(buf, sizeof buf, (directive + conv).c_str(), v);
        break;
    }
    case 's':
    case '@': {
        if (a.kind == LogArgument::Kind::Text) {
            if (directive == "%") {
                out += a.text;
                return;
            }
            n = std::snprintf(buf, sizeof buf, (directive + "s").c_str(), a.text.c_str());
        } else if (a.kind == LogArgument::Kind::Pointer) {
            out += a.p ? "<object>" : "(null)";
            return;
        } else {
            out += formatLogMessage(a.kind == LogArgument::Kind::Real ? "%g"
                                    : a.kind == LogArgument::Kind::Unsigned ? "%u"
                                                                            : "%d",
                                    {a});
            return;
        }
        break;
    }
    case 'p': {
        const void* p = a.kind == LogArgument::Kind::Pointer ? a.p
                                                             : reinterpret_cast<const void*>(static_cast<uintptr_t>(a.u));
        n = std::snprintf(buf, sizeof buf, (directive + "p").c_str(), p);
        break;
    }
    default: out += directive; out += conv; return;
    }
    if (n > 0) out.append(buf, std::min<size_t>(static_cast<size_t>(n), sizeof buf - 1));
}

}  // namespace

std::string formatLogMessage(const char* format, const std::vector<LogArgument>& args) {
    std::string out;
    size_t next = 0;
    for (const char* p = format; *p; ++p) {
        if (*p != '%') {
            out += *p;
            continue;
        }
        if (p[1] == '%') {
            out += '%';
            ++p;
            continue;
        }
        std::string directive = "%";
        const char* q = p + 1;
        while (*q && std::string_view("-+ #0123456789.*").find(*q) != std::string_view::npos) directive += *q++;
        while (*q && std::string_view("hlLqjzt").find(*q) != std::string_view::npos) ++q;  // lengths: ours are 64-bit
        if (!*q) {
            out += directive;
            break;
        }
        const char conv = *q;
        if (next < args.size()) {
            appendFormatted(out, directive, args[next++], conv);
        } else {
            out += directive;
            out += conv;
        }
        p = q;
    }
    return out;
}

LogHandle::LogHandle(std::string subsystem, std::string category)
    : subsystem_(std::move(subsystem)), category_(std::move(category)) {}

bool LogHandle::isEnabled(LogLevel level) const {
    return level != LogLevel::Debug || Logging::debugEnabled(category_);
}

void LogHandle::write(LogLevel level, const std::string& message) const {
    std::shared_ptr<LogSink> s = Logging::sink();
    if (s) s->write(LogRecord{subsystem_, category_, level, message});
}

namespace Logging {

void setSink(std::shared_ptr<LogSink> sink) {
    std::lock_guard<std::mutex> lock(state().mutex);
    state().sink = std::move(sink);
}

std::shared_ptr<LogSink> sink() {
    std::lock_guard<std::mutex> lock(state().mutex);
    return state().sink;
}

void setDebugEnabled(bool enabled) {
    std::lock_guard<std::mutex> lock(state().mutex);
    state().debugAll = enabled;
    state().debugByCategory.clear();
}

void setDebugEnabled(const std::string& category, bool enabled) {
    std::lock_guard<std::mutex> lock(state().mutex);
    state().debugByCategory[category] = enabled;
}

bool debugEnabled(const std::string& category) {
    std::lock_guard<std::mutex> lock(state().mutex);
    auto it = state().debugByCategory.find(category);
    return it != state().debugByCategory.end() ? it->second : state().debugAll;
}

}  // namespace Logging
}  // namespace orvane
