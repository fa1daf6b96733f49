#include "EvemuParser.h"

#include <charconv>
#include <limits>

#include "EvdevCodes.h"
#include "tools/formats/LineReader.h"

namespace orvane::evemu {

namespace {

// The largest number of seconds whose nanoseconds, microseconds included, fit 64 bits.
constexpr uint64_t kMaxSeconds = (std::numeric_limits<uint64_t>::max() - 999'999'000ull) / 1'000'000'000ull;
// Bytes of one code bitmap: enough for every key code (KEY_MAX 0x2ff).
constexpr size_t kMaxBitmapBytes = (kKeyMax + 1) / 8;
// Property bytes: evemu writes them eight to a line; more lines than this are not a device.
constexpr size_t kMaxPropertyBytes = 64;

bool isBlank(char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\f' || c == '\v'; }

// The fields of a line after its "X:", up to a '#' that starts a field (a comment).
std::vector<std::string_view> fieldsOf(std::string_view rest) {
    std::vector<std::string_view> fields;
    size_t i = 0;
    while (i < rest.size()) {
        while (i < rest.size() && isBlank(rest[i])) ++i;
        if (i >= rest.size() || rest[i] == '#') break;
        size_t end = i;
        while (end < rest.size() && !isBlank(rest[end])) ++end;
        fields.push_back(rest.substr(i, end - i));
        i = end;
    }
    return fields;
}

std::string quoted(std::string_view text) {
    std::string s = "\"";
    for (char c : text.substr(0, 40)) s += (static_cast<unsigned char>(c) < 0x20 || c == 0x7f) ? '?' : c;
    if (text.size() > 40) s += "...";
    return s + "\"";
}

template <typename T>
bool parseHex(std::string_view text, size_t maxDigits, T maximum, T* out) {
    if (text.empty() || text.size() > maxDigits) return false;
    uint64_t value = 0;
    auto [end, ec] = std::from_chars(text.data(), text.data() + text.size(), value, 16);
    if (ec != std::errc() || end != text.data() + text.size() || value > uint64_t(maximum)) return false;
    *out = static_cast<T>(value);
    return true;
}

// A decimal signed 32-bit number, as evemu writes it ("0595", "-001").
bool parseDecimal32(std::string_view text, int32_t* out) {
    if (text.empty() || text.size() > 16) return false;
    bool negative = false;
    if (text.front() == '-') {
        negative = true;
        text.remove_prefix(1);
    }
    if (text.empty()) return false;
    uint64_t magnitude = 0;
    auto [end, ec] = std::from_chars(text.data(), text.data() + text.size(), magnitude, 10);
    if (ec != std::errc() || end != text.data() + text.size()) return false;
    if (negative ? magnitude > uint64_t(std::numeric_limits<int32_t>::max()) + 1
                 : magnitude > uint64_t(std::numeric_limits<int32_t>::max()))
        return false;
    *out = negative ? static_cast<int32_t>(-static_cast<int64_t>(magnitude)) : static_cast<int32_t>(magnitude);
    return true;
}

// "SECONDS.MICROSECONDS" with exactly six digits of microseconds, as nanoseconds.
bool parseTime(std::string_view text, uint64_t* ns) {
    const size_t dot = text.find('.');
    if (dot == std::string_view::npos || dot == 0 || text.size() - dot - 1 != 6) return false;
    const std::string_view secondsText = text.substr(0, dot), microText = text.substr(dot + 1);
    for (char c : text.substr(0, dot))
        if (c < '0' || c > '9') return false;
    for (char c : microText)
        if (c < '0' || c > '9') return false;
    uint64_t seconds = 0, micro = 0;
    auto s = std::from_chars(secondsText.data(), secondsText.data() + secondsText.size(), seconds, 10);
    if (s.ec != std::errc() || seconds > kMaxSeconds) return false;
    std::from_chars(microText.data(), microText.data() + microText.size(), micro, 10);
    *ns = seconds * 1'000'000'000ull + micro * 1'000ull;
    return true;
}

class Parser {
public:
    Parser(const std::string& name, EvemuFile* out, std::string* error) : name_(name), out_(out), error_(error) {}

    bool line(std::string_view text, size_t number) {
        number_ = number;
        const std::string_view t = formats::LineReader::trimLeft(text);
        if (t.empty() || t.front() == '#') return true;
        if (t.size() < 2 || t[1] != ':' || (t.size() > 2 && !isBlank(t[2])))
            return fail("not an evemu line: " + quoted(t) +
                        " (expected N:, I:, P:, B:, A:, L:, S:, E: or a # comment)");
        const char kind = t[0];
        const std::string_view rest = t.substr(2);
        if (kind == 'E') return event(rest);
        if (!out_->events.empty())
            return fail(std::string("a description line (") + kind + ":) after the events; the description comes first");
        switch (kind) {
        case 'N': return nameLine(rest);
        case 'I': return identity(rest);
        case 'P': return properties(rest);
        case 'B': return bitmap(rest);
        case 'A': return axis(rest);
        case 'L':
        case 'S': return state(kind, rest);
        default:
            return fail("not an evemu line: " + quoted(t) +
                        " (expected N:, I:, P:, B:, A:, L:, S:, E: or a # comment)");
        }
    }

private:
    bool fail(const std::string& what) {
        *error_ = name_ + ":" + std::to_string(number_) + ": " + what;
        return false;
    }
    void description() {
        if (!out_->firstDescriptionLine) out_->firstDescriptionLine = number_;
    }

    bool nameLine(std::string_view rest) {
        if (out_->nameLine) return fail("a second N: line (the first is line " + std::to_string(out_->nameLine) + ")");
        description();
        out_->nameLine = number_;
        size_t b = 0, e = rest.size();
        while (b < e && isBlank(rest[b])) ++b;
        while (e > b && isBlank(rest[e - 1])) --e;
        out_->device.name = std::string(rest.substr(b, e - b));
        return true;
    }

    bool identity(std::string_view rest) {
        if (out_->identityLine)
            return fail("a second I: line (the first is line " + std::to_string(out_->identityLine) + ")");
        const auto f = fieldsOf(rest);
        if (f.size() != 4) return fail("I: needs four hex numbers: bus, vendor, product and version");
        uint16_t v[4];
        static const char* const kWhat[] = {"bus", "vendor", "product", "version"};
        for (size_t i = 0; i < 4; ++i)
            if (!parseHex<uint16_t>(f[i], 4, 0xffff, &v[i]))
                return fail(std::string("the ") + kWhat[i] + " of I: must be a hex number of up to four digits, not " +
                            quoted(f[i]));
        description();
        out_->identityLine = number_;
        out_->device.bus = v[0];
        out_->device.vendor = v[1];
        out_->device.product = v[2];
        out_->device.version = v[3];
        return true;
    }

    bool bytes(const std::vector<std::string_view>& f, size_t from, std::vector<uint8_t>* into, size_t maximum,
               const char* what) {
        if (f.size() <= from) return fail(std::string(what) + " needs at least one byte (two hex digits)");
        for (size_t i = from; i < f.size(); ++i) {
            uint8_t b;
            if (f[i].size() != 2 || !parseHex<uint8_t>(f[i], 2, 0xff, &b))
                return fail(std::string("the bytes of ") + what + " are two hex digits each, not " + quoted(f[i]));
            if (into->size() >= maximum)
                return fail(std::string(what) + " has more than " + std::to_string(maximum) + " bytes");
            into->push_back(b);
        }
        return true;
    }

    bool properties(std::string_view rest) {
        description();
        return bytes(fieldsOf(rest), 0, &out_->device.properties, kMaxPropertyBytes, "P:");
    }

    bool bitmap(std::string_view rest) {
        const auto f = fieldsOf(rest);
        uint16_t type;
        if (f.empty() || f[0].size() != 2 || !parseHex<uint16_t>(f[0], 2, kEvMax, &type))
            return fail("B: starts with the event type, two hex digits from 00 to 1f, not " +
                        (f.empty() ? std::string("nothing") : quoted(f[0])));
        description();
        return bytes(f, 1, &out_->device.codes[type], kMaxBitmapBytes, "B:");
    }

    bool axis(std::string_view rest) {
        const auto f = fieldsOf(rest);
        if (f.size() != 5 && f.size() != 6)
            return fail("A: needs the axis code and its minimum, maximum, fuzz, flat and, where known, resolution");
        uint16_t code;
        if (!parseHex<uint16_t>(f[0], 2, kAbsMax, &code))
            return fail("the axis code of A: must be a hex number from 00 to 3f, not " + quoted(f[0]));
        int32_t v[5] = {0, 0, 0, 0, 0};
        static const char* const kWhat[] = {"minimum", "maximum", "fuzz", "flat", "resolution"};
        for (size_t i = 1; i < f.size(); ++i)
            if (!parseDecimal32(f[i], &v[i - 1]))
                return fail(std::string("the ") + kWhat[i - 1] + " of A: " + eventCodeName(kEvAbs, code) +
                            " must be a decimal number, not " + quoted(f[i]));
        if (v[0] > v[1])
            return fail("A: " + eventCodeName(kEvAbs, code) + " has its minimum " + std::to_string(v[0]) +
                        " above its maximum " + std::to_string(v[1]));
        if (v[4] < 0)
            return fail("A: " + eventCodeName(kEvAbs, code) + " has a negative resolution " + std::to_string(v[4]));
        auto seen = out_->axisLines.find(code);
        if (seen != out_->axisLines.end())
            return fail("a second A: line for " + eventCodeName(kEvAbs, code) + " (the first is line " +
                        std::to_string(seen->second) + ")");
        description();
        out_->axisLines[code] = number_;
        out_->device.axes[code] = EvdevAxis{v[0], v[1], v[2], v[3], v[4]};
        return true;
    }

    bool state(char kind, std::string_view rest) {
        const auto f = fieldsOf(rest);
        uint16_t code;
        int32_t value;
        if (f.size() != 2 || !parseHex<uint16_t>(f[0], 4, 0xffff, &code) || !parseDecimal32(f[1], &value))
            return fail(std::string(1, kind) + ": needs a hex code and a decimal value");
        description();
        return true;
    }

    bool event(std::string_view rest) {
        const auto f = fieldsOf(rest);
        if (f.size() != 4) return fail("E: needs the time (seconds.microseconds), type, code and value");
        EvdevEvent e;
        if (!parseTime(f[0], &e.time_ns))
            return fail("the time of E: must be seconds and six digits of microseconds (1.000250), not " +
                        quoted(f[0]));
        if (!parseHex<uint16_t>(f[1], 4, kEvMax, &e.type))
            return fail("the type of E: must be a hex number from 0000 to 001f, not " + quoted(f[1]));
        if (!parseHex<uint16_t>(f[2], 4, kKeyMax, &e.code))
            return fail("the code of E: must be a hex number from 0000 to 02ff, not " + quoted(f[2]));
        if (!parseDecimal32(f[3], &e.value))
            return fail("the value of E: must be a decimal 32-bit number, not " + quoted(f[3]));
        if (!out_->events.empty() && e.time_ns < out_->events.back().time_ns)
            return fail("the time " + std::string(f[0]) + " goes back before the previous event's (line " +
                        std::to_string(out_->eventLines.back()) + ")");
        out_->events.push_back(e);
        out_->eventLines.push_back(number_);
        return true;
    }

    const std::string& name_;
    EvemuFile* out_;
    std::string* error_;
    size_t number_ = 0;
};

}  // namespace

bool parseEvemu(std::string_view content, const std::string& name, EvemuFile* out, std::string* error) {
    *out = EvemuFile{};
    out->name = name;
    Parser parser(name, out, error);
    formats::LineReader lines(content);
    std::string_view line;
    size_t number = 0;
    while (lines.nextLine(&line, &number))
        if (!parser.line(line, number)) return false;
    return true;
}

}  // namespace orvane::evemu
