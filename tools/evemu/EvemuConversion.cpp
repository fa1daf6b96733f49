#include "EvemuConversion.h"

#include <unistd.h>

#include <charconv>
#include <cmath>

#include "EvdevCodes.h"
#include "EvemuParser.h"
#include "TouchFrameConverter.h"

namespace orvane::evemu {

namespace {

constexpr double kMaxSurfaceSide_mm = 10000.0;

// The usage pairs the filter looks for.
constexpr HIDUsagePair kTouchPadUsage{13, 5};
constexpr HIDUsagePair kFingerUsage{13, 34};
constexpr HIDUsagePair kKeyboardUsage{1, 6};

bool parseMillimetres(std::string_view text, double* out) {
    if (text.empty()) return false;
    for (char c : text)
        if ((c < '0' || c > '9') && c != '.') return false;
    double value = 0.0;
    auto [end, ec] = std::from_chars(text.data(), text.data() + text.size(), value, std::chars_format::fixed);
    if (ec != std::errc() || end != text.data() + text.size()) return false;
    if (!(value > 0.0) || value > kMaxSurfaceSide_mm) return false;
    *out = value;
    return true;
}

bool fileExists(const std::string& path) { return ::access(path.c_str(), R_OK) == 0; }

std::string located(const std::string& name, size_t line, const std::string& what) {
    return line ? name + ":" + std::to_string(line) + ": " + what : name + ": " + what;
}

std::string list(const std::vector<std::string>& paths) {
    std::string s;
    for (size_t i = 0; i < paths.size(); ++i) s += (i ? ", " : "") + paths[i];
    return s;
}

}  // namespace

bool parseSurfaceSize(std::string_view text, SurfaceSize* size, std::string* error) {
    const size_t x = text.find('x');
    SurfaceSize s;
    if (x == std::string_view::npos || !parseMillimetres(text.substr(0, x), &s.width_mm) ||
        !parseMillimetres(text.substr(x + 1), &s.height_mm)) {
        *error = "--size must be WIDTHxHEIGHT in millimetres, each above 0 and at most 10000 (for example 100x60), "
                 "not \"" + std::string(text) + "\"";
        return false;
    }
    *size = s;
    return true;
}

int64_t fixedPointCentimetres(double millimetres) { return std::llround(millimetres * 65536.0 / 10.0); }

int64_t fixedPointCentimetres(const EvdevAxis& axis) {
    const int64_t range = int64_t(axis.maximum) - int64_t(axis.minimum);
    const int64_t unitsPerCentimetre = int64_t(axis.resolution) * 10;
    return (range * 65536 * 2 + unitsPerCentimetre) / (2 * unitsPerCentimetre);
}

std::vector<std::string> siblingDescriptionPaths(const std::string& eventsPath) {
    std::vector<std::string> paths;
    const size_t slash = eventsPath.rfind('/');
    const size_t nameStart = slash == std::string::npos ? 0 : slash + 1;
    std::string stem = eventsPath;
    // Drop the last extension, then try the stem and each shorter stem ending before a dot.
    size_t dot = stem.rfind('.');
    if (dot == std::string::npos || dot <= nameStart) return paths;
    stem.resize(dot);
    for (;;) {
        paths.push_back(stem + ".desc");
        dot = stem.rfind('.');
        if (dot == std::string::npos || dot <= nameStart) break;
        stem.resize(dot);
    }
    return paths;
}

bool convertEvemuRecording(std::string_view content, const std::string& path, const std::string& name,
                           const EvemuOptions& options, formats::FrameRecording* recording, std::string* error) {
    EvemuFile input;
    if (!parseEvemu(content, name, &input, error)) return false;

    // Where the description is.
    EvemuFile separate;
    const EvemuFile* description = &input;
    if (input.hasDescription()) {
        if (!options.descriptionPath.empty()) {
            *error = located(name, input.firstDescriptionLine,
                             "the recording has its own device description; --desc is for an events file without one");
            return false;
        }
    } else {
        std::string descriptionPath = options.descriptionPath;
        if (descriptionPath.empty()) {
            const std::vector<std::string> tried = path == "-" ? std::vector<std::string>{} : siblingDescriptionPaths(path);
            for (const std::string& candidate : tried) {
                if (fileExists(candidate)) {
                    descriptionPath = candidate;
                    break;
                }
            }
            if (descriptionPath.empty()) {
                *error = name + ": has no device description (N:, I:, P:, B:, A: lines): give it with --desc FILE" +
                         (tried.empty() ? std::string() : " or put it beside the recording (looked for " + list(tried) + ")");
                return false;
            }
        }
        std::string text;
        if (!formats::readFileContent(descriptionPath, &text, error)) return false;
        if (!parseEvemu(text, descriptionPath, &separate, error)) return false;
        if (!separate.events.empty()) {
            *error = located(descriptionPath, separate.eventLines.front(),
                             "a device description has no events (E: lines); give the recording as INPUT");
            return false;
        }
        if (!separate.hasDescription()) {
            *error = descriptionPath + ": has no device description (N:, I:, P:, B:, A: lines)";
            return false;
        }
        description = &separate;
    }
    const std::string& descriptionName = description->name;
    if (!description->identityLine) {
        *error = located(descriptionName, description->firstDescriptionLine,
                         "the device description has no I: line (bus, vendor, product, version), which tells the "
                         "transport");
        return false;
    }

    TouchpadLayout layout;
    if (!touchpadLayoutFor(description->device, &layout, error)) {
        *error = located(descriptionName, description->firstDescriptionLine, *error);
        return false;
    }

    PropertyDictionary dimensions;
    if (options.size) {
        dimensions["Width"] = PropertyValue(fixedPointCentimetres(options.size->width_mm));
        dimensions["Height"] = PropertyValue(fixedPointCentimetres(options.size->height_mm));
    } else {
        for (uint16_t code : {kAbsMtPositionX, kAbsMtPositionY}) {
            const EvdevAxis& axis = *description->device.axis(code);
            if (axis.resolution == 0) {
                *error = located(descriptionName, description->axisLines.at(code),
                                 eventCodeName(kEvAbs, code) +
                                     " gives no resolution, so the surface size is unknown: give it with --size "
                                     "WIDTHxHEIGHT in millimetres (for example --size 100x60)");
                return false;
            }
            dimensions[code == kAbsMtPositionX ? "Width" : "Height"] = PropertyValue(fixedPointCentimetres(axis));
        }
    }

    formats::FrameRecording out;
    out.name = name;
    out.headerLine = input.hasDescription() ? input.firstDescriptionLine : 1;
    out.header.service.usagePairs = {kTouchPadUsage, kFingerUsage};
    if (options.keyboardCover) out.header.service.usagePairs.push_back(kKeyboardUsage);
    out.header.service.properties["SurfaceDimensions"] = PropertyValue(std::move(dimensions));
    out.header.service.properties["Transport"] = PropertyValue(transportForBus(description->device.bus));
    if (!description->device.name.empty())
        out.header.service.properties["Product"] = PropertyValue(description->device.name);
    out.header.timebase = TimebaseInfo{1, 1};

    const size_t settingsLine = input.eventLines.empty() ? out.headerLine : input.eventLines.front();
    if (options.tapToClick || options.secondaryClick) {
        formats::InputRecord client;
        client.kind = formats::InputRecord::Kind::Client;
        client.line = settingsLine;
        client.clientID = 1;
        client.clientAdded = true;
        out.records.push_back(client);
        for (const auto& [wanted, key] : {std::pair{options.tapToClick, "TapToClickEnabled"},
                                          std::pair{options.secondaryClick, "TwoFingersSecondaryClickEnabled"}}) {
            if (!wanted) continue;
            formats::InputRecord setting;
            setting.kind = formats::InputRecord::Kind::SetProperty;
            setting.line = settingsLine;
            setting.propertyKey = key;
            setting.propertyValue = PropertyValue(true);
            out.records.push_back(setting);
        }
    }

    TouchFrameConverter converter(std::move(layout));
    std::vector<HIDEventRef> made;
    for (size_t i = 0; i < input.events.size(); ++i) {
        made.clear();
        if (!converter.feed(input.events[i], &made, error)) {
            *error = located(name, input.eventLines[i], *error);
            return false;
        }
        for (HIDEventRef& event : made) {
            formats::InputRecord record;
            record.kind = formats::InputRecord::Kind::Event;
            record.line = input.eventLines[i];
            record.event = std::move(event);
            out.records.push_back(std::move(record));
        }
    }
    *recording = std::move(out);
    return true;
}

}  // namespace orvane::evemu
