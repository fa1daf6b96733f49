#include "LiveSettings.h"

#include <charconv>
#include <cmath>
#include <map>
#include <set>
#include <sstream>

#include "tools/formats/FrameRecording.h"

namespace orvane::live {

namespace {

std::string trim(const std::string& s) {
    const char* blanks = " \t\r\f\v";
    const size_t first = s.find_first_not_of(blanks);
    if (first == std::string::npos) return "";
    return s.substr(first, s.find_last_not_of(blanks) - first + 1);
}

bool parseNumber(const std::string& text, double* out) {
    if (text.empty()) return false;
    const char* begin = text.data();
    const char* end = begin + text.size();
    if (*begin == '+') ++begin;
    auto [stop, ec] = std::from_chars(begin, end, *out);
    return ec == std::errc() && stop == end && std::isfinite(*out);
}

template <typename T>
void take(std::optional<T>& into, const std::optional<T>& from) {
    if (from) into = from;
}

enum class Kind { Truth, Text, Number, Size };

const std::map<std::string, Kind>& keys() {
    static const std::map<std::string, Kind> k{
        {"device", Kind::Text},          {"tap-to-click", Kind::Truth}, {"secondary-click", Kind::Truth},
        {"scroll-factor", Kind::Number}, {"keyboard-cover", Kind::Truth}, {"size", Kind::Size},
        {"gesture-socket", Kind::Text},  {"print", Kind::Truth},        {"wait", Kind::Truth},
        {"grab", Kind::Truth},           {"lid-switch", Kind::Truth},
    };
    return k;
}

void store(const std::string& key, bool truth, const std::string& text, double number, const evemu::SurfaceSize& size,
           LiveSettings* out) {
    if (key == "device") out->device = text;
    else if (key == "tap-to-click") out->tapToClick = truth;
    else if (key == "secondary-click") out->twoFingerSecondaryClick = truth;
    else if (key == "scroll-factor") out->scrollFactor = number;
    else if (key == "keyboard-cover") out->keyboardCover = truth;
    else if (key == "size") out->size = size;
    else if (key == "gesture-socket") out->gestureSocket = text;
    else if (key == "print") out->print = truth;
    else if (key == "wait") out->wait = truth;
    else if (key == "grab") out->grab = truth;
    else if (key == "lid-switch") out->lidSwitch = truth;
}

}  // namespace

LiveSettings LiveSettings::over(const LiveSettings& base) const {
    LiveSettings s = base;
    take(s.device, device);
    take(s.tapToClick, tapToClick);
    take(s.twoFingerSecondaryClick, twoFingerSecondaryClick);
    take(s.scrollFactor, scrollFactor);
    take(s.keyboardCover, keyboardCover);
    take(s.size, size);
    take(s.gestureSocket, gestureSocket);
    take(s.print, print);
    take(s.wait, wait);
    take(s.grab, grab);
    take(s.lidSwitch, lidSwitch);
    return s;
}

bool parseTruth(const std::string& text, bool* out) {
    static const std::set<std::string> yes{"true", "yes", "on", "1"};
    static const std::set<std::string> no{"false", "no", "off", "0"};
    if (yes.count(text)) *out = true;
    else if (no.count(text)) *out = false;
    else return false;
    return true;
}

bool parseLiveSettings(const std::string& text, const std::string& name, LiveSettings* out, std::string* error) {
    std::istringstream in(text);
    std::string raw;
    std::set<std::string> seen;
    size_t lineNumber = 0;
    auto fail = [&](const std::string& what) {
        *error = name + ":" + std::to_string(lineNumber) + ": " + what;
        return false;
    };
    while (std::getline(in, raw)) {
        ++lineNumber;
        std::string line = trim(raw);
        if (line.empty() || line[0] == '#') continue;
        const size_t hash = line.find(" #");
        if (hash != std::string::npos) line = trim(line.substr(0, hash));
        const size_t equals = line.find('=');
        if (equals == std::string::npos) return fail("expected key = value, found \"" + line + "\"");
        const std::string key = trim(line.substr(0, equals));
        const std::string value = trim(line.substr(equals + 1));
        const auto known = keys().find(key);
        if (known == keys().end()) return fail("unknown key \"" + key + "\"");
        if (!seen.insert(key).second) return fail("\"" + key + "\" is given twice");
        if (value.empty()) return fail("\"" + key + "\" has no value");
        bool truth = false;
        double number = 0.0;
        evemu::SurfaceSize size;
        std::string problem;
        switch (known->second) {
        case Kind::Truth:
            if (!parseTruth(value, &truth)) return fail("\"" + key + "\" must be true or false, not \"" + value + "\"");
            break;
        case Kind::Number:
            if (!parseNumber(value, &number)) return fail("\"" + key + "\" must be a number, not \"" + value + "\"");
            if (number == 0.0) return fail("\"" + key + "\" must not be 0");
            break;
        case Kind::Size:
            if (!evemu::parseSurfaceSize(value, &size, &problem))
                return fail("\"" + key + "\" must be WIDTHxHEIGHT in millimetres, each above 0 and at most 10000 "
                            "(for example 100x60), not \"" + value + "\"");
            break;
        case Kind::Text: break;
        }
        store(key, truth, value, number, size, out);
    }
    return true;
}

bool readLiveSettingsFile(const std::string& path, LiveSettings* out, std::string* error) {
    std::string content;
    if (!formats::readFileContent(path, &content, error)) return false;
    return parseLiveSettings(content, path, out, error);
}

}  // namespace orvane::live
