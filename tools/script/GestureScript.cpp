#include "GestureScript.h"

#include <cctype>
#include <charconv>
#include <cmath>
#include <optional>

#include "tools/formats/LineReader.h"
#include "tools/formats/PropertyJson.h"

namespace orvane::script {

namespace {

// Limits that keep a hand-written session within what a touchpad and its clock can be.
constexpr double kMaxSurface_mm = 2000.0;
constexpr double kMaxRate_Hz = 1000.0;
constexpr double kMaxScriptTime_ms = 86'400'000.0;  // a day

std::string formatNumber(double value) {
    char buffer[64];
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, value);
    return std::string(buffer, result.ptr);
}

bool isWordCharacter(char c) { return std::isalpha(static_cast<unsigned char>(c)) != 0; }
bool isNameCharacter(char c) {
    return std::isalnum(static_cast<unsigned char>(c)) != 0 || c == '_' || c == '-' || c == '.';
}

// The line without its comment: a '#' outside a double-quoted string starts one.
std::string_view withoutComment(std::string_view line) {
    bool quoted = false;
    bool escaped = false;
    for (size_t i = 0; i < line.size(); ++i) {
        const char c = line[i];
        if (quoted) {
            if (escaped) escaped = false;
            else if (c == '\\') escaped = true;
            else if (c == '"') quoted = false;
        } else if (c == '"') {
            quoted = true;
        } else if (c == '#') {
            return line.substr(0, i);
        }
    }
    return line;
}

// Reads one statement's words and numbers from left to right. Blanks and commas separate.
class Scanner {
public:
    explicit Scanner(std::string_view text) : text_(text) {}

    void skipBlanks() {
        while (pos_ < text_.size() && (text_[pos_] == ' ' || text_[pos_] == '\t' || text_[pos_] == ','))
            ++pos_;
    }
    bool atEnd() {
        skipBlanks();
        return pos_ >= text_.size();
    }
    // A word of letters, or empty.
    std::string_view word() {
        skipBlanks();
        const size_t start = pos_;
        while (pos_ < text_.size() && isWordCharacter(text_[pos_])) ++pos_;
        return text_.substr(start, pos_ - start);
    }
    // The next word when it is `expected` (consumed); otherwise nothing is consumed.
    bool accept(std::string_view expected) {
        const size_t saved = pos_;
        if (word() == expected) return true;
        pos_ = saved;
        return false;
    }
    // A name: letters, digits, '_', '-' and '.'.
    std::string_view name() {
        skipBlanks();
        const size_t start = pos_;
        while (pos_ < text_.size() && isNameCharacter(text_[pos_])) ++pos_;
        return text_.substr(start, pos_ - start);
    }
    // A decimal number with an optional sign; `sign` receives '+', '-' or 0.
    std::optional<double> number(char* sign = nullptr) {
        skipBlanks();
        size_t p = pos_;
        char s = 0;
        if (p < text_.size() && (text_[p] == '+' || text_[p] == '-')) s = text_[p++];
        const char* begin = text_.data() + p;
        const char* end = text_.data() + text_.size();
        if (begin == end || !(std::isdigit(static_cast<unsigned char>(*begin)) || *begin == '.')) return std::nullopt;
        double value = 0.0;
        const auto result = std::from_chars(begin, end, value, std::chars_format::fixed);
        if (result.ec != std::errc() || !std::isfinite(value)) return std::nullopt;
        pos_ = static_cast<size_t>(result.ptr - text_.data());
        if (sign) *sign = s;
        return s == '-' ? -value : value;
    }
    // What comes next, for messages: the next run of non-blank characters.
    std::string next() {
        skipBlanks();
        size_t end = pos_;
        while (end < text_.size() && text_[end] != ' ' && text_[end] != '\t') ++end;
        return std::string(text_.substr(pos_, end - pos_));
    }
    std::string_view rest() {
        skipBlanks();
        std::string_view r = text_.substr(pos_);
        while (!r.empty() && (r.back() == ' ' || r.back() == '\t')) r.remove_suffix(1);
        pos_ = text_.size();
        return r;
    }

private:
    std::string_view text_;
    size_t pos_ = 0;
};

std::string quoted(std::string_view text) { return "\"" + std::string(text) + "\""; }

class Parser {
public:
    Parser(const std::string& name, GestureScript* out, std::string* error) : name_(name), out_(out), error_(error) {}

    bool parse(std::string_view content) {
        formats::LineReader reader(content);
        std::string_view line;
        size_t number = 0;
        while (reader.nextLine(&line, &number)) {
            line_ = number;
            Scanner scanner(withoutComment(line));
            if (scanner.atEnd()) continue;
            if (!statement(scanner)) return false;
        }
        if (out_->surfaceLine == 0) {
            line_ = number == 0 ? 1 : number;
            if (!out_->statements.empty()) line_ = out_->statements.front().line;
            return fail("no surface: a script starts with \"surface WIDTH x HEIGHT mm\" (and usb or bluetooth)");
        }
        return true;
    }

private:
    bool fail(const std::string& what) {
        *error_ = name_ + ":" + std::to_string(line_) + ": " + what;
        return false;
    }

    bool statement(Scanner& s) {
        char sign = 0;
        if (std::optional<double> time = s.number(&sign)) return timedStatement(s, *time, sign);
        const std::string first = s.next();
        const std::string_view word = s.word();
        if (word == "surface") return setupOnce(surfaceLine_, "surface") && surface(s);
        if (word == "rate") return setupOnce(rateLine_, "rate") && rate(s);
        if (word == "clock") return setupOnce(clockLine_, "clock") && clock(s);
        if (word == "set") {
            if (!beforeTimedLines("set without a time")) return false;
            Statement st = newStatement(Statement::Kind::Set, false, 0.0);
            return setting(s, &st) && finish(s, std::move(st));
        }
        if (word == "finger" || word == "thumb" || word == "palm" || word == "click" || word == "end")
            return fail("\"" + std::string(word) + "\" needs a time first (milliseconds, or +N after the previous line)");
        return fail("unknown statement " + quoted(first) +
                    "; a line is surface, rate, clock, set, or a time in ms followed by what happens");
    }

    bool setupOnce(size_t& seen, const char* what) {
        if (!beforeTimedLines(what)) return false;
        if (seen != 0) return fail(std::string(what) + " is given twice (first on line " + std::to_string(seen) + ")");
        seen = line_;
        return true;
    }

    bool beforeTimedLines(const std::string& what) {
        if (firstTimedLine_ != 0)
            return fail(what + " must come before the first timed line (line " + std::to_string(firstTimedLine_) +
                        ")");
        return true;
    }

    bool endOfLine(Scanner& s, const std::string& after) {
        if (s.atEnd()) return true;
        return fail("unexpected " + quoted(s.next()) + " after " + after);
    }

    bool surface(Scanner& s) {
        const char* usage = "surface WIDTH x HEIGHT mm, then usb or bluetooth (for example \"surface 100 x 64 mm usb\")";
        std::optional<double> width = s.number();
        if (!width) return fail("expected the width in mm: " + std::string(usage));
        s.accept("mm");
        if (!s.accept("x")) return fail("expected \"x\" between the width and the height: " + std::string(usage));
        std::optional<double> height = s.number();
        if (!height) return fail("expected the height in mm: " + std::string(usage));
        s.accept("mm");
        for (double v : {*width, *height})
            if (!(v > 0.0) || v > kMaxSurface_mm)
                return fail("a surface side must be more than 0 and at most " + formatNumber(kMaxSurface_mm) +
                            " mm, not " + formatNumber(v));
        Transport transport = Transport::Wired;
        if (!s.atEnd()) {
            const std::string next = s.next();
            const std::string_view w = s.word();
            if (w == "usb" || w == "wired") transport = Transport::Wired;
            else if (w == "bluetooth") transport = Transport::Bluetooth;
            else return fail("unknown connection " + quoted(next) + "; expected usb (or wired) or bluetooth");
        }
        if (!endOfLine(s, "the surface")) return false;
        out_->surface = Surface{*width, *height, transport};
        out_->surfaceLine = line_;
        return true;
    }

    bool rate(Scanner& s) {
        std::optional<double> hz = s.number();
        if (!hz) return fail("expected the frame rate: rate FRAMES Hz (for example \"rate 125 Hz\")");
        if (!s.accept("Hz")) s.accept("hz");
        if (!(*hz > 0.0) || *hz > kMaxRate_Hz)
            return fail("the frame rate must be more than 0 and at most " + formatNumber(kMaxRate_Hz) + " Hz, not " +
                        formatNumber(*hz));
        if (!endOfLine(s, "the frame rate")) return false;
        out_->rate_Hz = *hz;
        return true;
    }

    bool clock(Scanner& s) {
        std::optional<double> ms = s.number();
        if (!ms) return fail("expected the device clock at time 0: clock MILLISECONDS ms (for example \"clock 1000 ms\")");
        s.accept("ms");
        if (*ms < 0.0 || *ms > kMaxScriptTime_ms)
            return fail("the clock must be from 0 to " + formatNumber(kMaxScriptTime_ms) + " ms, not " +
                        formatNumber(*ms));
        if (!endOfLine(s, "the clock")) return false;
        out_->clock_ms = *ms;
        return true;
    }

    Statement newStatement(Statement::Kind kind, bool timed, double time) const {
        Statement st;
        st.kind = kind;
        st.line = line_;
        st.timed = timed;
        st.time_ms = time;
        return st;
    }

    bool finish(Scanner& s, Statement st) {
        if (!s.atEnd()) return fail("unexpected " + quoted(s.next()) + " at the end of the line");
        out_->statements.push_back(std::move(st));
        return true;
    }

    bool timedStatement(Scanner& s, double value, char sign) {
        if (out_->surfaceLine == 0)
            return fail("the surface must be given before the first timed line (surface WIDTH x HEIGHT mm)");
        s.accept("ms");
        if (sign == '-') return fail("a time cannot be negative (" + formatNumber(value) + " ms)");
        const double time = sign == '+' ? lastTime_ + value : value;
        if (time > kMaxScriptTime_ms)
            return fail("a time must be at most " + formatNumber(kMaxScriptTime_ms) + " ms, not " + formatNumber(time));
        if (time < lastTime_)
            return fail("time " + formatNumber(time) + " ms comes before the previous line's " +
                        formatNumber(lastTime_) + " ms; lines go forward in time");
        if (firstTimedLine_ == 0) firstTimedLine_ = line_;
        lastTime_ = time;

        const std::string first = s.next();
        const std::string_view word = s.word();
        if (word == "finger") return contactStatement(s, ContactKind::Finger, time);
        if (word == "thumb") return contactStatement(s, ContactKind::Thumb, time);
        if (word == "palm") return contactStatement(s, ContactKind::Palm, time);
        if (word == "click") {
            const std::string next = s.next();
            const std::string_view what = s.word();
            if (what == "down") return finish(s, newStatement(Statement::Kind::ClickDown, true, time));
            if (what == "up") return finish(s, newStatement(Statement::Kind::ClickUp, true, time));
            return fail("expected \"click down\" or \"click up\", not \"click " + next + "\"");
        }
        if (word == "set") {
            Statement st = newStatement(Statement::Kind::Set, true, time);
            return setting(s, &st) && finish(s, std::move(st));
        }
        if (word == "end") return finish(s, newStatement(Statement::Kind::End, true, time));
        if (first.empty()) return fail("expected what happens after the time");
        return fail("unknown action " + quoted(first) + "; expected finger, thumb, palm, click, set or end");
    }

    bool position(Scanner& s, const std::string& what, double* x, double* y) {
        std::optional<double> px = s.number();
        if (px) s.accept("mm");
        std::optional<double> py = px ? s.number() : std::nullopt;
        if (!px || !py) return fail("expected " + what + ": two numbers in mm, x then y");
        s.accept("mm");
        *x = *px;
        *y = *py;
        return true;
    }

    bool onSurface(double x, double y) {
        const Surface& surface = out_->surface;
        if (x < 0.0 || y < 0.0 || x > surface.width_mm || y > surface.height_mm)
            return fail("position (" + formatNumber(x) + ", " + formatNumber(y) + ") mm is off the " +
                        formatNumber(surface.width_mm) + " x " + formatNumber(surface.height_mm) + " mm surface");
        return true;
    }

    bool contactStatement(Scanner& s, ContactKind kind, double time) {
        const std::string_view contact = s.name();
        if (contact.empty())
            return fail(std::string("expected the ") + contactKindName(kind) + "'s name (for example \"" +
                        contactKindName(kind) + " a down at 30 40\")");
        const std::string next = s.next();
        const std::string_view action = s.word();
        Statement st;
        if (action == "down") {
            st = newStatement(Statement::Kind::Down, true, time);
            if (!s.accept("at")) return fail("expected \"at X Y\" after \"down\"");
            if (!position(s, "the position", &st.x_mm, &st.y_mm) || !onSurface(st.x_mm, st.y_mm)) return false;
        } else if (action == "move") {
            const bool to = s.accept("to");
            if (!to && !s.accept("by")) return fail("expected \"move to X Y\" or \"move by DX DY\"");
            st = newStatement(to ? Statement::Kind::MoveTo : Statement::Kind::MoveBy, true, time);
            if (!position(s, to ? "the position to move to" : "the distance to move by", &st.x_mm, &st.y_mm))
                return false;
            if (to && !onSurface(st.x_mm, st.y_mm)) return false;
            if (!s.accept("over")) return fail("expected \"over DURATION ms\" after the position");
            std::optional<double> duration = s.number();
            if (!duration) return fail("expected the duration in ms after \"over\"");
            s.accept("ms");
            if (*duration < 0.0 || time + *duration > kMaxScriptTime_ms)
                return fail("a duration must be from 0 ms to the end of the day, not " + formatNumber(*duration));
            st.duration_ms = *duration;
        } else if (action == "up") {
            st = newStatement(Statement::Kind::Up, true, time);
        } else {
            return fail("expected down, move or up after " + std::string(contactKindName(kind)) + " " +
                        std::string(contact) + ", not " + quoted(next));
        }
        st.contactKind = kind;
        st.contact = std::string(contact);
        return finish(s, std::move(st));
    }

    bool setting(Scanner& s, Statement* st) {
        const std::string_view key = s.name();
        if (key.empty()) return fail("expected the property's name after \"set\"");
        const std::string_view text = s.rest();
        if (text.empty()) return fail("expected a value after set " + std::string(key));
        st->key = std::string(key);
        if (text == "on" || text == "true" || text == "yes") {
            st->value = PropertyValue(true);
        } else if (text == "off" || text == "false" || text == "no") {
            st->value = PropertyValue(false);
        } else {
            std::string why;
            if (!formats::propertyValueFromJson(text, &st->value, &why))
                return fail("the value of " + std::string(key) +
                            " must be on, off, a number or a JSON value: " + why);
        }
        return true;
    }

    const std::string& name_;
    GestureScript* out_;
    std::string* error_;
    size_t line_ = 0;
    size_t surfaceLine_ = 0, rateLine_ = 0, clockLine_ = 0;
    size_t firstTimedLine_ = 0;
    double lastTime_ = 0.0;
};

bool startsWithIgnoringCase(std::string_view text, std::string_view prefix) {
    if (text.size() < prefix.size()) return false;
    for (size_t i = 0; i < prefix.size(); ++i)
        if (std::tolower(static_cast<unsigned char>(text[i])) != std::tolower(static_cast<unsigned char>(prefix[i])))
            return false;
    return true;
}

}  // namespace

const char* contactKindName(ContactKind kind) {
    switch (kind) {
    case ContactKind::Finger: return "finger";
    case ContactKind::Thumb: return "thumb";
    case ContactKind::Palm: return "palm";
    }
    return "finger";
}

bool isGestureScript(std::string_view content) {
    formats::LineReader reader(content);
    std::string_view line;
    size_t number = 0;
    bool firstNonBlank = true;
    while (reader.nextLine(&line, &number)) {
        const std::string_view trimmed = formats::LineReader::trimLeft(line);
        if (trimmed.empty()) continue;
        if (firstNonBlank && startsWithIgnoringCase(trimmed, kGestureScriptMark)) return true;
        firstNonBlank = false;
        if (trimmed.front() == '#') continue;
        Scanner scanner(trimmed);
        return scanner.word() == "surface";
    }
    return false;
}

bool parseGestureScript(std::string_view content, const std::string& name, GestureScript* out, std::string* error) {
    *out = GestureScript{};
    out->name = name;
    Parser parser(name, out, error);
    return parser.parse(content);
}

}  // namespace orvane::script
