#include "tools/formats/FrameRecording.h"

#include <gtest/gtest.h>

#include <sstream>

#include "ToolTestSupport.h"

namespace orvane::formats {
namespace {

const std::string kHeader =
    "{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": [[13, 5], [13, 34], [1, 6]], "
    "\"properties\": {\"SurfaceDimensions\": {\"Width\": 655360, \"Height\": 327680}, \"Transport\": \"USB\"}}}";

FrameRecording read(const std::string& content) {
    FrameRecording recording;
    std::string error;
    EXPECT_TRUE(readFrameRecording(content, "t.frames.jsonl", &recording, &error)) << error;
    return recording;
}

std::string readError(const std::string& content) {
    FrameRecording recording;
    std::string error;
    EXPECT_FALSE(readFrameRecording(content, "t.frames.jsonl", &recording, &error));
    return error;
}

TEST(FrameRecording, HeaderDescribesTheServiceWithDefaults) {
    const FrameRecording r = read(kHeader + "\n");
    EXPECT_EQ(r.headerLine, 1u);
    ASSERT_EQ(r.header.service.usagePairs.size(), 3u);
    EXPECT_EQ(r.header.service.usagePairs[0], (HIDUsagePair{13, 5}));
    EXPECT_EQ(r.header.service.usagePairs[2], (HIDUsagePair{1, 6}));
    const PropertyDictionary& p = r.header.service.properties;
    ASSERT_TRUE(p.count("SurfaceDimensions"));
    const PropertyValue* width = p.at("SurfaceDimensions").find("Width");
    ASSERT_TRUE(width);
    EXPECT_EQ(width->kind(), PropertyValue::Kind::Integer);
    EXPECT_EQ(width->integerValue(), 655360);
    EXPECT_EQ(p.at("Transport").stringValue(), "USB");
    EXPECT_EQ(r.header.timebase.numer, 1u);
    EXPECT_EQ(r.header.timebase.denom, 1u);
    EXPECT_FALSE(r.header.bundle.has_value());
    EXPECT_TRUE(r.records.empty());
}

TEST(FrameRecording, PropertiesBecomeBooleansIntegersAndReals) {
    const FrameRecording r = read(
        "{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": [], \"properties\": "
        "{\"A\": true, \"B\": 3, \"C\": 2.5, \"D\": [1, \"x\"], \"E\": 1.0}}, \"timebase\": [125, 3], "
        "\"bundle\": {\"Acceleration\": {\"Speed\": 0.5}}}");
    const PropertyDictionary& p = r.header.service.properties;
    EXPECT_EQ(p.at("A").kind(), PropertyValue::Kind::Boolean);
    EXPECT_TRUE(p.at("A").isBooleanTrue());
    EXPECT_EQ(p.at("B").kind(), PropertyValue::Kind::Integer);
    EXPECT_EQ(p.at("C").kind(), PropertyValue::Kind::Real);
    EXPECT_EQ(p.at("E").kind(), PropertyValue::Kind::Real);
    EXPECT_EQ(p.at("D").arrayValue().size(), 2u);
    EXPECT_EQ(r.header.timebase.numer, 125u);
    EXPECT_EQ(r.header.timebase.denom, 3u);
    ASSERT_TRUE(r.header.bundle.has_value());
    EXPECT_EQ(r.header.bundle->at("Acceleration").find("Speed")->doubleValue(), 0.5);
}

TEST(FrameRecording, RecordsOfEveryKindAreNumberedInFileOrder) {
    const FrameRecording r = read("# a comment\n\n" + kHeader +
                                  "\n"
                                  "{\"client\": {\"id\": 3, \"added\": true}}\n"
                                  "   # indented comment\n"
                                  "{\"setProperty\": {\"key\": \"TapToClickEnabled\", \"value\": true}}\n"
                                  "\r\n"
                                  "{\"type\": 11, \"timestamp\": 8000000, \"fields\": {\"0xb0003\": 0}, \"children\": "
                                  "[{\"type\": 11, \"timestamp\": 8000000, \"fields\": {\"0xb0000\": 0.5}}]}\r\n"
                                  "{\"client\": {\"id\": 3, \"added\": false}}");
    EXPECT_EQ(r.headerLine, 3u);
    ASSERT_EQ(r.records.size(), 4u);
    EXPECT_EQ(r.records[0].kind, InputRecord::Kind::Client);
    EXPECT_EQ(r.records[0].clientID, 3u);
    EXPECT_TRUE(r.records[0].clientAdded);
    EXPECT_EQ(r.records[0].line, 4u);
    EXPECT_EQ(r.records[1].kind, InputRecord::Kind::SetProperty);
    EXPECT_EQ(r.records[1].propertyKey, "TapToClickEnabled");
    EXPECT_TRUE(r.records[1].propertyValue.isBooleanTrue());
    EXPECT_EQ(r.records[1].line, 6u);
    EXPECT_EQ(r.records[2].kind, InputRecord::Kind::Event);
    ASSERT_TRUE(r.records[2].event);
    EXPECT_EQ(r.records[2].event->timestamp(), 8000000u);
    ASSERT_EQ(r.records[2].event->children().size(), 1u);
    EXPECT_EQ(r.records[2].event->children()[0]->doubleValueForField(kHIDEventFieldDigitizerX), 0.5);
    EXPECT_EQ(r.records[2].line, 8u);
    EXPECT_EQ(r.records[3].kind, InputRecord::Kind::Client);
    EXPECT_FALSE(r.records[3].clientAdded);
}

TEST(FrameRecording, WriterRepeatsWhatItRead) {
    const std::string content = tooltest::readFile(tooltest::kDemoRecording);
    const FrameRecording r = read(content);
    std::ostringstream out;
    writeFrameRecording(out, r);
    std::string expected;
    for (const std::string& line : tooltest::lines(content))
        if (!line.empty() && line[0] != '#') expected += line + "\n";
    EXPECT_EQ(out.str(), expected);
}

TEST(FrameRecording, BadJsonNamesFileAndLine) {
    EXPECT_EQ(readError(kHeader + "\n{\"type\": 11,\n"),
              "t.frames.jsonl:2: invalid JSON at column 13: syntax error while parsing object key - unexpected end "
              "of input; expected string literal");
}

TEST(FrameRecording, MissingHeaderIsReported) {
    EXPECT_EQ(readError("# only a comment\n{\"type\": 11, \"timestamp\": 1}\n"),
              "t.frames.jsonl:2: missing header: the first record must be the header {\"format\": \"orvane-frames\", "
              "\"version\": 1, ...}");
    EXPECT_EQ(readError(""), "t.frames.jsonl:1: missing header: the file has no records");
}

TEST(FrameRecording, UnknownFormatOrVersionIsReported) {
    EXPECT_EQ(readError("{\"format\": \"orvane-events\", \"version\": 1}"),
              "t.frames.jsonl:1: unknown format \"orvane-events\" (expected \"orvane-frames\")");
    EXPECT_EQ(readError("{\"format\": \"orvane-frames\", \"version\": 2, \"service\": {\"usagePairs\": []}}"),
              "t.frames.jsonl:1: unsupported version 2 of \"orvane-frames\" (this program reads version 1)");
    EXPECT_EQ(readError("{\"format\": \"orvane-frames\", \"service\": {\"usagePairs\": []}}"),
              "t.frames.jsonl:1: the header needs \"version\": 1");
}

TEST(FrameRecording, HeaderErrorsAreReported) {
    EXPECT_EQ(readError("{\"format\": \"orvane-frames\", \"version\": 1}"),
              "t.frames.jsonl:1: the header needs \"service\" with the service's \"usagePairs\" and \"properties\"");
    EXPECT_EQ(readError("{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": [[13]]}}"),
              "t.frames.jsonl:1: usagePairs[0] must be [page, usage], not an array");
    EXPECT_EQ(readError("{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": []}, "
                        "\"timebase\": [1, 0]}"),
              "t.frames.jsonl:1: the timebase parts must not be 0");
    EXPECT_EQ(readError("{\"format\": \"orvane-frames\", \"version\": 1, \"service\": {\"usagePairs\": []}, "
                        "\"timeBase\": [1, 1]}"),
              "t.frames.jsonl:1: unknown key \"timeBase\" in the header (it may have format, version, service, "
              "timebase, bundle)");
}

TEST(FrameRecording, WrongFieldKindNamesFileAndLine) {
    EXPECT_EQ(readError(kHeader + "\n\n{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xb0009\": \"yes\"}}\n"),
              "t.frames.jsonl:3: field \"0xb0009\" must be an integer, not a string");
    EXPECT_EQ(readError(kHeader + "\n{\"type\": 11, \"timestamp\": \"soon\"}\n"),
              "t.frames.jsonl:2: \"timestamp\" must be a non-negative integer, not a string");
}

TEST(FrameRecording, NonObjectAndUnknownRecordsAreReported) {
    EXPECT_EQ(readError(kHeader + "\n[1, 2]\n"), "t.frames.jsonl:2: a record must be a JSON object, not an array");
    EXPECT_EQ(readError(kHeader + "\n{\"setProprety\": {}}\n"),
              "t.frames.jsonl:2: unknown record kind (keys: \"setProprety\"); a record is an event with \"type\", "
              "{\"setProperty\": ...} or {\"client\": ...}");
    EXPECT_EQ(readError(kHeader + "\n" + kHeader + "\n"),
              "t.frames.jsonl:2: a second header; records are events, setProperty or client records");
}

TEST(FrameRecording, MalformedPropertyAndClientRecordsAreReported) {
    EXPECT_EQ(readError(kHeader + "\n{\"setProperty\": {\"value\": true}}\n"),
              "t.frames.jsonl:2: \"setProperty\" needs \"key\", a string");
    EXPECT_EQ(readError(kHeader + "\n{\"setProperty\": {\"key\": \"K\", \"value\": null}}\n"),
              "t.frames.jsonl:2: \"setProperty\" value: null is not a property value");
    EXPECT_EQ(readError(kHeader + "\n{\"client\": {\"id\": 1, \"added\": 1}}\n"),
              "t.frames.jsonl:2: \"client\" needs \"added\", true or false, not an integer");
    EXPECT_EQ(readError(kHeader + "\n{\"client\": {\"id\": -1, \"added\": true}}\n"),
              "t.frames.jsonl:2: the client \"id\" must be an integer from 0 to 18446744073709551615, not -1");
}

TEST(FrameRecording, MissingFileIsReportedByName) {
    FrameRecording recording;
    std::string error;
    EXPECT_FALSE(readFrameRecordingFile("/nonexistent/x.frames.jsonl", &recording, &error));
    EXPECT_EQ(error, "/nonexistent/x.frames.jsonl: cannot be read (No such file or directory)");
}

TEST(FrameRecording, RecordsAreWrittenAsRead) {
    InputRecord property;
    property.kind = InputRecord::Kind::SetProperty;
    property.propertyKey = "TwoFingersSecondaryClickEnabled";
    property.propertyValue = PropertyValue(false);
    EXPECT_EQ(inputRecordToJson(property),
              "{\"setProperty\": {\"key\": \"TwoFingersSecondaryClickEnabled\", \"value\": false}}");
    InputRecord client;
    client.kind = InputRecord::Kind::Client;
    client.clientID = 3;
    client.clientAdded = true;
    EXPECT_EQ(inputRecordToJson(client), "{\"client\": {\"id\": 3, \"added\": true}}");
}

}  // namespace
}  // namespace orvane::formats
