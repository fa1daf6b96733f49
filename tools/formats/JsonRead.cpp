#include "JsonRead.h"

#include <cstdint>
#include <limits>

#include "JsonText.h"

namespace orvane::formats::detail {

bool parseJson(std::string_view text, Json* out, std::string* error) {
    try {
        *out = Json::parse(text.begin(), text.end());
        return true;
    } catch (const Json::parse_error& e) {
        // nlohmann's text starts with "[json.exception.parse_error.N] parse error at line L,
        // column C: "; keep only what is wrong and say where on the line.
        std::string what = e.what();
        const size_t colon = what.find(": ");
        if (colon != std::string::npos) what = what.substr(colon + 2);
        *error = "invalid JSON at column ";
        *error += std::to_string(e.byte);
        *error += ": " + what;
        return false;
    } catch (const std::exception& e) {
        *error = std::string("invalid JSON: ") + e.what();
        return false;
    }
}

bool jsonIsInteger(const Json& value) { return value.is_number_integer(); }

std::string describeJson(const Json& value) {
    switch (value.type()) {
    case Json::value_t::null: return "null";
    case Json::value_t::boolean: return value.get<bool>() ? "true" : "false";
    case Json::value_t::number_integer:
    case Json::value_t::number_unsigned: return "an integer";
    case Json::value_t::number_float: return "a number with a fraction or exponent";
    case Json::value_t::string: return "a string";
    case Json::value_t::array: return "an array";
    case Json::value_t::object: return "an object";
    default: return "a value of another kind";
    }
}

namespace {

// Deeper property values are refused: converting, copying and describing them recurses, and a
// hostile file must not exhaust the stack.
constexpr int kMaximumPropertyDepth = 64;

bool convertPropertyValue(const Json& value, int depth, PropertyValue* out, std::string* error) {
    if ((value.is_array() || value.is_object()) && !value.empty() && depth >= kMaximumPropertyDepth) {
        *error = "property values are nested more than " + std::to_string(kMaximumPropertyDepth) + " deep";
        return false;
    }
    switch (value.type()) {
    case Json::value_t::boolean: *out = PropertyValue(value.get<bool>()); return true;
    case Json::value_t::number_integer: *out = PropertyValue(value.get<int64_t>()); return true;
    case Json::value_t::number_unsigned: {
        const uint64_t u = value.get<uint64_t>();
        if (u > static_cast<uint64_t>(std::numeric_limits<int64_t>::max())) {
            *error = "integer ";
            *error += std::to_string(u);
            *error += " is out of range";
            return false;
        }
        *out = PropertyValue(static_cast<int64_t>(u));
        return true;
    }
    case Json::value_t::number_float: *out = PropertyValue(value.get<double>()); return true;
    case Json::value_t::string: *out = PropertyValue(value.get<std::string>()); return true;
    case Json::value_t::array: {
        PropertyArray array;
        array.reserve(value.size());
        for (size_t i = 0; i < value.size(); ++i) {
            PropertyValue element;
            std::string inner;
            if (!convertPropertyValue(value[i], depth + 1, &element, &inner)) {
                *error = "[";
                *error += std::to_string(i);
                *error += "]: " + inner;
                return false;
            }
            array.push_back(std::move(element));
        }
        *out = PropertyValue(std::move(array));
        return true;
    }
    case Json::value_t::object: {
        PropertyDictionary dictionary;
        for (const auto& [key, element] : value.items()) {
            PropertyValue converted;
            std::string inner;
            if (!convertPropertyValue(element, depth + 1, &converted, &inner)) {
                *error = jsonString(key) + ": " + inner;
                return false;
            }
            dictionary.emplace(key, std::move(converted));
        }
        *out = PropertyValue(std::move(dictionary));
        return true;
    }
    default:
        *error = describeJson(value) + " is not a property value";
        return false;
    }
}

}  // namespace

bool propertyValueFromJsonValue(const Json& value, PropertyValue* out, std::string* error) {
    return convertPropertyValue(value, 0, out, error);
}

}  // namespace orvane::formats::detail
