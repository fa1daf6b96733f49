#include "FrameRecording.h"

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <limits>
#include <ostream>
#include <sstream>

#include "EventJson.h"
#include "EventJsonRead.h"
#include "JsonRead.h"
#include "JsonText.h"
#include "LineReader.h"
#include "PropertyJson.h"

namespace orvane::formats {

namespace {

using detail::Json;

std::string keyList(const Json& object) {
    std::string s;
    for (const auto& item : object.items()) {
        if (!s.empty()) s += ", ";
        s += jsonString(item.key());
    }
    return s.empty() ? "none" : s;
}

bool onlyKeys(const Json& object, std::initializer_list<const char*> allowed, const std::string& what,
              std::string* error) {
    for (const auto& item : object.items()) {
        bool ok = false;
        for (const char* key : allowed) ok = ok || item.key() == key;
        if (!ok) {
            std::string names;
            for (const char* key : allowed) names += std::string(names.empty() ? "" : ", ") + key;
            *error = "unknown key " + jsonString(item.key()) + " in " + what + " (it may have " + names + ")";
            return false;
        }
    }
    return true;
}

bool readUnsignedValue(const Json& value, uint64_t maximum, const std::string& what, uint64_t* out,
                       std::string* error) {
    if (!value.is_number_unsigned() || value.get<uint64_t>() > maximum) {
        *error = what + " must be an integer from 0 to " + std::to_string(maximum) + ", not " +
                 (value.is_number_integer() ? std::to_string(value.get<int64_t>()) : detail::describeJson(value));
        return false;
    }
    *out = value.get<uint64_t>();
    return true;
}

bool readService(const Json& json, ServiceDescription* service, std::string* error) {
    if (!json.is_object()) {
        *error = "\"service\" must be an object, not " + detail::describeJson(json);
        return false;
    }
    if (!onlyKeys(json, {"usagePairs", "properties"}, "\"service\"", error)) return false;
    auto pairs = json.find("usagePairs");
    if (pairs == json.end()) {
        *error = "\"service\" needs \"usagePairs\", a list of [page, usage]";
        return false;
    }
    if (!pairs->is_array()) {
        *error = "\"usagePairs\" must be an array of [page, usage], not " + detail::describeJson(*pairs);
        return false;
    }
    for (size_t i = 0; i < pairs->size(); ++i) {
        const Json& pair = (*pairs)[i];
        const std::string where = "usagePairs[" + std::to_string(i) + "]";
        if (!pair.is_array() || pair.size() != 2) {
            *error = where + " must be [page, usage], not " + detail::describeJson(pair);
            return false;
        }
        uint64_t page, usage;
        if (!readUnsignedValue(pair[0], std::numeric_limits<uint32_t>::max(), where + " page", &page, error) ||
            !readUnsignedValue(pair[1], std::numeric_limits<uint32_t>::max(), where + " usage", &usage, error))
            return false;
        service->usagePairs.push_back(HIDUsagePair{static_cast<uint32_t>(page), static_cast<uint32_t>(usage)});
    }
    auto properties = json.find("properties");
    if (properties != json.end()) {
        if (!properties->is_object()) {
            *error = "\"properties\" must be an object, not " + detail::describeJson(*properties);
            return false;
        }
        PropertyValue value;
        std::string inner;
        if (!detail::propertyValueFromJsonValue(*properties, &value, &inner)) {
            *error = "service property " + inner;
            return false;
        }
        service->properties = value.dictionaryValue();
    }
    return true;
}

bool readHeader(const Json& json, FrameRecordingHeader* header, std::string* error) {
    static const std::string kExpected =
        "the first record must be the header {\"format\": \"orvane-frames\", \"version\": 1, ...}";
    if (!json.is_object()) {
        *error = "missing header: " + kExpected + ", not " + detail::describeJson(json);
        return false;
    }
    auto format = json.find("format");
    if (format == json.end()) {
        *error = "missing header: " + kExpected;
        return false;
    }
    if (!format->is_string() || format->get_ref<const std::string&>() != kFrameRecordingFormat) {
        *error = "unknown format " + (format->is_string() ? jsonString(format->get_ref<const std::string&>())
                                                          : detail::describeJson(*format)) +
                 " (expected \"orvane-frames\")";
        return false;
    }
    auto version = json.find("version");
    if (version == json.end()) {
        *error = "the header needs \"version\": 1";
        return false;
    }
    if (!version->is_number_integer() || version->get<int64_t>() != kFrameRecordingVersion) {
        *error = "unsupported version " +
                 (version->is_number_integer() ? std::to_string(version->get<int64_t>())
                                               : detail::describeJson(*version)) +
                 " of \"orvane-frames\" (this program reads version 1)";
        return false;
    }
    if (!onlyKeys(json, {"format", "version", "service", "timebase", "bundle"}, "the header", error)) return false;

    auto service = json.find("service");
    if (service == json.end()) {
        *error = "the header needs \"service\" with the service's \"usagePairs\" and \"properties\"";
        return false;
    }
    if (!readService(*service, &header->service, error)) return false;

    auto timebase = json.find("timebase");
    if (timebase != json.end()) {
        if (!timebase->is_array() || timebase->size() != 2) {
            *error = "\"timebase\" must be [numerator, denominator], not " + detail::describeJson(*timebase);
            return false;
        }
        uint64_t numer, denom;
        if (!readUnsignedValue((*timebase)[0], std::numeric_limits<uint32_t>::max(), "the timebase numerator",
                               &numer, error) ||
            !readUnsignedValue((*timebase)[1], std::numeric_limits<uint32_t>::max(), "the timebase denominator",
                               &denom, error))
            return false;
        if (numer == 0 || denom == 0) {
            *error = "the timebase parts must not be 0";
            return false;
        }
        header->timebase = TimebaseInfo{static_cast<uint32_t>(numer), static_cast<uint32_t>(denom)};
    }

    auto bundle = json.find("bundle");
    if (bundle != json.end()) {
        if (!bundle->is_object()) {
            *error = "\"bundle\" must be an object, not " + detail::describeJson(*bundle);
            return false;
        }
        PropertyValue value;
        std::string inner;
        if (!detail::propertyValueFromJsonValue(*bundle, &value, &inner)) {
            *error = "bundle entry " + inner;
            return false;
        }
        header->bundle = value.dictionaryValue();
    }
    return true;
}

bool readRecord(const Json& json, InputRecord* record, std::string* error) {
    if (!json.is_object()) {
        *error = "a record must be a JSON object, not " + detail::describeJson(json);
        return false;
    }
    if (json.contains("type")) {
        record->kind = InputRecord::Kind::Event;
        record->event = detail::eventFromJsonValue(json, error);
        return record->event != nullptr;
    }
    if (json.contains("setProperty")) {
        if (!onlyKeys(json, {"setProperty"}, "a setProperty record", error)) return false;
        const Json& body = json["setProperty"];
        if (!body.is_object()) {
            *error = "\"setProperty\" must be an object {\"key\": ..., \"value\": ...}, not " +
                     detail::describeJson(body);
            return false;
        }
        if (!onlyKeys(body, {"key", "value"}, "\"setProperty\"", error)) return false;
        auto key = body.find("key");
        if (key == body.end() || !key->is_string()) {
            *error = "\"setProperty\" needs \"key\", a string";
            return false;
        }
        auto value = body.find("value");
        if (value == body.end()) {
            *error = "\"setProperty\" needs \"value\"";
            return false;
        }
        record->kind = InputRecord::Kind::SetProperty;
        record->propertyKey = key->get<std::string>();
        std::string inner;
        if (!detail::propertyValueFromJsonValue(*value, &record->propertyValue, &inner)) {
            *error = "\"setProperty\" value: " + inner;
            return false;
        }
        return true;
    }
    if (json.contains("client")) {
        if (!onlyKeys(json, {"client"}, "a client record", error)) return false;
        const Json& body = json["client"];
        if (!body.is_object()) {
            *error = "\"client\" must be an object {\"id\": ..., \"added\": ...}, not " + detail::describeJson(body);
            return false;
        }
        if (!onlyKeys(body, {"id", "added"}, "\"client\"", error)) return false;
        auto id = body.find("id");
        if (id == body.end()) {
            *error = "\"client\" needs \"id\"";
            return false;
        }
        if (!readUnsignedValue(*id, std::numeric_limits<uint64_t>::max(), "the client \"id\"", &record->clientID,
                               error))
            return false;
        auto added = body.find("added");
        if (added == body.end() || !added->is_boolean()) {
            *error = "\"client\" needs \"added\", true or false" +
                     (added == body.end() ? std::string() : ", not " + detail::describeJson(*added));
            return false;
        }
        record->kind = InputRecord::Kind::Client;
        record->clientAdded = added->get<bool>();
        return true;
    }
    if (json.contains("format")) {
        *error = "a second header; records are events, setProperty or client records";
        return false;
    }
    *error = "unknown record kind (keys: " + keyList(json) +
             "); a record is an event with \"type\", {\"setProperty\": ...} or {\"client\": ...}";
    return false;
}

std::string located(const std::string& name, size_t line, const std::string& what) {
    return name + ":" + std::to_string(line) + ": " + what;
}

}  // namespace

bool readFrameRecording(std::string_view content, const std::string& name, FrameRecording* out,
                        std::string* error) {
    try {
        FrameRecording recording;
        recording.name = name;
        LineReader lines(content);
        std::string_view line;
        size_t number = 0;
        bool haveHeader = false;
        while (lines.nextContentLine(&line, &number)) {
            Json json;
            std::string what;
            if (!detail::parseJson(line, &json, &what)) {
                *error = located(name, number, what);
                return false;
            }
            if (!haveHeader) {
                if (!readHeader(json, &recording.header, &what)) {
                    *error = located(name, number, what);
                    return false;
                }
                recording.headerLine = number;
                haveHeader = true;
                continue;
            }
            InputRecord record;
            record.line = number;
            if (!readRecord(json, &record, &what)) {
                *error = located(name, number, what);
                return false;
            }
            recording.records.push_back(std::move(record));
        }
        if (!haveHeader) {
            *error = located(name, 1, "missing header: the file has no records");
            return false;
        }
        *out = std::move(recording);
        return true;
    } catch (const std::exception& e) {
        *error = name + ": cannot be read (" + e.what() + ")";
        return false;
    }
}

bool readFileContent(const std::string& path, std::string* content, std::string* error) {
    try {
        // A folder opens as a stream that reads nothing; say what it is instead.
        std::error_code ec;
        if (std::filesystem::is_directory(path, ec)) {
            *error = path + ": cannot be read (" + std::strerror(EISDIR) + ")";
            return false;
        }
        std::ifstream file(path, std::ios::binary);
        if (!file) {
            *error = path + ": cannot be read (" + std::strerror(errno) + ")";
            return false;
        }
        std::ostringstream buffer;
        buffer << file.rdbuf();
        if (file.bad()) {
            *error = path + ": cannot be read (" + std::strerror(errno) + ")";
            return false;
        }
        *content = std::move(buffer).str();
        return true;
    } catch (const std::exception& e) {
        *error = path + ": cannot be read (" + e.what() + ")";
        return false;
    }
}

bool readFrameRecordingFile(const std::string& path, FrameRecording* out, std::string* error) {
    std::string content;
    if (!readFileContent(path, &content, error)) return false;
    return readFrameRecording(content, path, out, error);
}

std::string frameRecordingHeaderToJson(const FrameRecordingHeader& header) {
    std::string s = "{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": [";
    bool first = true;
    for (const HIDUsagePair& pair : header.service.usagePairs) {
        if (!first) s += ", ";
        first = false;
        s += '[';
        appendJsonUnsigned(s, pair.page);
        s += ", ";
        appendJsonUnsigned(s, pair.usage);
        s += ']';
    }
    s += "], \"properties\": ";
    appendPropertyValueJson(s, PropertyValue(header.service.properties));
    s += "}, \"timebase\": [";
    appendJsonUnsigned(s, header.timebase.numer);
    s += ", ";
    appendJsonUnsigned(s, header.timebase.denom);
    s += ']';
    if (header.bundle) {
        s += ", \"bundle\": ";
        appendPropertyValueJson(s, PropertyValue(*header.bundle));
    }
    s += '}';
    return s;
}

std::string inputRecordToJson(const InputRecord& record) {
    std::string s;
    switch (record.kind) {
    case InputRecord::Kind::Event:
        if (record.event) appendEventJson(s, *record.event);
        else s = "null";
        break;
    case InputRecord::Kind::SetProperty:
        s = "{\"setProperty\": {\"key\": ";
        appendJsonString(s, record.propertyKey);
        s += ", \"value\": ";
        appendPropertyValueJson(s, record.propertyValue);
        s += "}}";
        break;
    case InputRecord::Kind::Client:
        s = "{\"client\": {\"id\": ";
        appendJsonUnsigned(s, record.clientID);
        s += record.clientAdded ? ", \"added\": true}}" : ", \"added\": false}}";
        break;
    }
    return s;
}

void writeFrameRecording(std::ostream& out, const FrameRecording& recording) {
    out << frameRecordingHeaderToJson(recording.header) << '\n';
    for (const InputRecord& record : recording.records) out << inputRecordToJson(record) << '\n';
}

}  // namespace orvane::formats
