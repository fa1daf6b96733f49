#include "EventJson.h"

#include <cmath>
#include <cstdio>
#include <cstdint>
#include <limits>

#include "EventJsonRead.h"
#include "JsonText.h"

namespace orvane::formats {

void appendEventJson(std::string& out, const HIDEvent& event) {
    out += "{\"type\": ";
    appendJsonUnsigned(out, event.type());
    out += ", \"timestamp\": ";
    appendJsonUnsigned(out, event.timestamp());
    if (event.senderID() != 0) {
        out += ", \"sender\": ";
        appendJsonUnsigned(out, event.senderID());
    }
    if (event.phase() != 0) {
        out += ", \"phase\": ";
        appendJsonUnsigned(out, event.phase());
    }
    out += ", \"fields\": {";
    bool first = true;
    for (const HIDEvent::Field& field : event.fields()) {
        if (!first) out += ", ";
        first = false;
        char key[16];
        std::snprintf(key, sizeof key, "\"0x%x\": ", field.selector);
        out += key;
        switch (field.kind) {
        case HIDFieldKind::Integer: appendJsonInteger(out, field.integer); break;
        case HIDFieldKind::Double: appendJsonDouble(out, field.real); break;
        case HIDFieldKind::Data:
            out += '"';
            appendHex(out, field.data.data(), field.data.size());
            out += '"';
            break;
        }
    }
    out += '}';
    if (!event.children().empty()) {
        out += ", \"children\": [";
        bool firstChild = true;
        for (const HIDEventRef& child : event.children()) {
            if (!firstChild) out += ", ";
            firstChild = false;
            appendEventJson(out, *child);
        }
        out += ']';
    }
    out += '}';
}

std::string eventToJson(const HIDEvent& event) {
    std::string s;
    appendEventJson(s, event);
    return s;
}

std::string eventTypeName(uint32_t type) {
    switch (type) {
    case kHIDEventTypeVendorDefined: return "vendor-defined";
    case kHIDEventTypeButton: return "button";
    case kHIDEventTypeKeyboard: return "keyboard";
    case kHIDEventTypeRotation: return "rotation";
    case kHIDEventTypeScroll: return "scroll";
    case kHIDEventTypeScale: return "scale";
    case kHIDEventTypeDigitizer: return "digitizer";
    case kHIDEventTypePointer: return "pointer";
    default: return "type " + std::to_string(type);
    }
}

namespace {

using detail::Json;

// Deeper nesting than any real event has; it keeps a hostile file from exhausting the stack.
constexpr int kMaximumChildDepth = 32;

bool readUnsigned(const Json& object, const char* key, uint64_t maximum, bool required, uint64_t* out,
                  std::string* error) {
    auto it = object.find(key);
    if (it == object.end()) {
        if (required) *error = std::string("an event needs \"") + key + "\"";
        return !required;
    }
    if (!it->is_number_unsigned()) {
        *error = std::string("\"") + key + "\" must be a non-negative integer, not " +
                 (it->is_number_integer() ? "a negative integer" : detail::describeJson(*it));
        return false;
    }
    const uint64_t value = it->get<uint64_t>();
    if (value > maximum) {
        *error = std::string("\"") + key + "\" is " + std::to_string(value) + ", larger than " +
                 std::to_string(maximum);
        return false;
    }
    *out = value;
    return true;
}

bool parseSelector(const std::string& key, uint32_t* selector) {
    if (key.size() < 3 || key.size() > 10 || key[0] != '0' || (key[1] != 'x' && key[1] != 'X')) return false;
    uint32_t value = 0;
    for (size_t i = 2; i < key.size(); ++i) {
        const char c = key[i];
        uint32_t digit;
        if (c >= '0' && c <= '9') digit = static_cast<uint32_t>(c - '0');
        else if (c >= 'a' && c <= 'f') digit = static_cast<uint32_t>(c - 'a' + 10);
        else if (c >= 'A' && c <= 'F') digit = static_cast<uint32_t>(c - 'A' + 10);
        else return false;
        value = value << 4 | digit;
    }
    *selector = value;
    return true;
}

bool nonFiniteFromString(const std::string& text, double* out) {
    if (text == "NaN") *out = std::numeric_limits<double>::quiet_NaN();
    else if (text == "Infinity") *out = std::numeric_limits<double>::infinity();
    else if (text == "-Infinity") *out = -std::numeric_limits<double>::infinity();
    else return false;
    return true;
}

bool hexToBytes(const std::string& text, std::vector<uint8_t>* out) {
    if (text.size() % 2 != 0) return false;
    out->clear();
    out->reserve(text.size() / 2);
    auto nibble = [](char c) -> int {
        if (c >= '0' && c <= '9') return c - '0';
        if (c >= 'a' && c <= 'f') return c - 'a' + 10;
        if (c >= 'A' && c <= 'F') return c - 'A' + 10;
        return -1;
    };
    for (size_t i = 0; i < text.size(); i += 2) {
        const int hi = nibble(text[i]);
        const int lo = nibble(text[i + 1]);
        if (hi < 0 || lo < 0) return false;
        out->push_back(static_cast<uint8_t>(hi << 4 | lo));
    }
    return true;
}

const char* kindName(HIDFieldKind kind) {
    switch (kind) {
    case HIDFieldKind::Integer: return "an integer";
    case HIDFieldKind::Double: return "a number";
    case HIDFieldKind::Data: return "a hex string";
    }
    return "a value";
}

bool readField(HIDEvent& event, const std::string& key, const Json& value, std::string* error) {
    uint32_t selector;
    if (!parseSelector(key, &selector)) {
        *error = "field key " + jsonString(key) + " is not a selector such as \"0xb0000\"";
        return false;
    }
    const std::string where = "field \"" + key + "\"";
    const bool known = hidFieldIsKnown(selector);
    HIDFieldKind kind;
    if (known) {
        kind = hidFieldKind(selector, HIDFieldKind::Integer);
    } else if (value.is_number_integer()) {
        kind = HIDFieldKind::Integer;
    } else if (value.is_number_float()) {
        kind = HIDFieldKind::Double;
    } else if (value.is_string()) {
        double ignored;
        kind = nonFiniteFromString(value.get_ref<const std::string&>(), &ignored) ? HIDFieldKind::Double
                                                                                  : HIDFieldKind::Data;
    } else {
        *error = where + " must be an integer, a number or a hex string, not " + detail::describeJson(value);
        return false;
    }

    switch (kind) {
    case HIDFieldKind::Integer: {
        if (!value.is_number_integer()) break;
        if (value.is_number_unsigned() &&
            value.get<uint64_t>() > static_cast<uint64_t>(std::numeric_limits<int64_t>::max())) {
            *error = where + " is out of the range of a 64-bit integer";
            return false;
        }
        event.setIntegerValue(value.get<int64_t>(), selector);
        return true;
    }
    case HIDFieldKind::Double: {
        double real;
        if (value.is_number_float()) {
            real = value.get<double>();
        } else if (value.is_number_unsigned()) {
            // An integer written for a double field is taken as that number.
            real = static_cast<double>(value.get<uint64_t>());
        } else if (value.is_number_integer()) {
            real = static_cast<double>(value.get<int64_t>());
        } else if (value.is_string() && nonFiniteFromString(value.get_ref<const std::string&>(), &real)) {
        } else {
            if (value.is_string()) {
                *error = where + " must be a number or \"NaN\", \"Infinity\", \"-Infinity\", not the string " +
                         jsonString(value.get_ref<const std::string&>());
                return false;
            }
            break;
        }
        event.setDoubleValue(real, selector);
        return true;
    }
    case HIDFieldKind::Data: {
        if (!value.is_string()) break;
        std::vector<uint8_t> bytes;
        if (!hexToBytes(value.get_ref<const std::string&>(), &bytes)) {
            *error = where + " must be hex digits, two per byte";
            return false;
        }
        event.setDataValue(bytes.data(), bytes.size(), selector);
        return true;
    }
    }
    *error = where + " must be " + kindName(kind) + ", not " + detail::describeJson(value);
    return false;
}

HIDEventRef readEvent(const Json& json, int depth, std::string* error) {
    if (!json.is_object()) {
        *error = "an event must be a JSON object, not " + detail::describeJson(json);
        return nullptr;
    }
    for (const auto& item : json.items()) {
        const std::string& key = item.key();
        if (key != "type" && key != "timestamp" && key != "sender" && key != "phase" && key != "fields" &&
            key != "children") {
            *error = "unknown key " + jsonString(key) +
                     " in an event (it may have type, timestamp, sender, phase, fields, children)";
            return nullptr;
        }
    }
    uint64_t type = 0, timestamp = 0, sender = 0, phase = 0;
    if (!readUnsigned(json, "type", std::numeric_limits<uint32_t>::max(), true, &type, error)) return nullptr;
    if (!readUnsigned(json, "timestamp", std::numeric_limits<uint64_t>::max(), true, &timestamp, error))
        return nullptr;
    if (!readUnsigned(json, "sender", std::numeric_limits<uint64_t>::max(), false, &sender, error)) return nullptr;
    if (!readUnsigned(json, "phase", std::numeric_limits<uint16_t>::max(), false, &phase, error)) return nullptr;

    auto event = HIDEvent::create(static_cast<uint32_t>(type), timestamp);
    event->setSenderID(sender);
    event->setPhase(static_cast<uint16_t>(phase));

    auto fields = json.find("fields");
    if (fields != json.end()) {
        if (!fields->is_object()) {
            *error = "\"fields\" must be an object, not " + detail::describeJson(*fields);
            return nullptr;
        }
        for (const auto& item : fields->items()) {
            if (!readField(*event, item.key(), item.value(), error)) return nullptr;
        }
    }

    auto children = json.find("children");
    if (children != json.end()) {
        if (!children->is_array()) {
            *error = "\"children\" must be an array, not " + detail::describeJson(*children);
            return nullptr;
        }
        if (!children->empty() && depth >= kMaximumChildDepth) {
            *error = "children are nested more than " + std::to_string(kMaximumChildDepth) + " deep";
            return nullptr;
        }
        for (size_t i = 0; i < children->size(); ++i) {
            std::string inner;
            HIDEventRef child = readEvent((*children)[i], depth + 1, &inner);
            if (!child) {
                *error = "children[" + std::to_string(i) + "]: " + inner;
                return nullptr;
            }
            event->appendEvent(child);
        }
    }
    return event;
}

}  // namespace

namespace detail {
HIDEventRef eventFromJsonValue(const Json& json, std::string* error) {
    try {
        return readEvent(json, 0, error);
    } catch (const std::exception& e) {
        *error = std::string("unreadable event: ") + e.what();
        return nullptr;
    }
}
}  // namespace detail

HIDEventRef eventFromJson(std::string_view text, std::string* error) {
    detail::Json json;
    if (!detail::parseJson(text, &json, error)) return nullptr;
    return detail::eventFromJsonValue(json, error);
}

}  // namespace orvane::formats
