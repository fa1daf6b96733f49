#include "PropertyJson.h"

#include "JsonRead.h"
#include "JsonText.h"

namespace orvane::formats {

void appendPropertyValueJson(std::string& out, const PropertyValue& value) {
    switch (value.kind()) {
    case PropertyValue::Kind::None: out += "null"; return;
    case PropertyValue::Kind::Integer: appendJsonInteger(out, value.integerValue()); return;
    case PropertyValue::Kind::Real: appendJsonDouble(out, value.doubleValue()); return;
    case PropertyValue::Kind::Boolean: out += value.truth() ? "true" : "false"; return;
    case PropertyValue::Kind::String: appendJsonString(out, value.stringValue()); return;
    case PropertyValue::Kind::Data:
        out += '"';
        appendHex(out, value.dataValue().data(), value.dataValue().size());
        out += '"';
        return;
    case PropertyValue::Kind::Array: {
        out += '[';
        bool first = true;
        for (const PropertyValue& element : value.arrayValue()) {
            if (!first) out += ", ";
            first = false;
            appendPropertyValueJson(out, element);
        }
        out += ']';
        return;
    }
    case PropertyValue::Kind::Dictionary: {
        out += '{';
        bool first = true;
        for (const auto& [key, element] : value.dictionaryValue()) {
            if (!first) out += ", ";
            first = false;
            appendJsonString(out, key);
            out += ": ";
            appendPropertyValueJson(out, element);
        }
        out += '}';
        return;
    }
    }
}

std::string propertyValueToJson(const PropertyValue& value) {
    std::string s;
    appendPropertyValueJson(s, value);
    return s;
}

bool propertyValueFromJson(std::string_view text, PropertyValue* out, std::string* error) {
    detail::Json json;
    if (!detail::parseJson(text, &json, error)) return false;
    return detail::propertyValueFromJsonValue(json, out, error);
}

}  // namespace orvane::formats
