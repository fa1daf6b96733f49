#include "tools/formats/EventJson.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace orvane::formats {
namespace {

HIDEventRef read(const std::string& text) {
    std::string error;
    HIDEventRef event = eventFromJson(text, &error);
    EXPECT_TRUE(event) << error;
    return event;
}

std::string readError(const std::string& text) {
    std::string error;
    HIDEventRef event = eventFromJson(text, &error);
    EXPECT_FALSE(event) << "read " << text;
    return error;
}

TEST(EventJson, DigitizerFrameIsWrittenWithFieldsInAscendingOrder) {
    auto frame = HIDEvent::create(kHIDEventTypeDigitizer, 1000000);
    frame->setSenderID(7);
    auto child = HIDEvent::create(kHIDEventTypeDigitizer, 1000000);
    child->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    child->setIntegerValue(0, kHIDEventFieldDigitizerIndex);
    child->setDoubleValue(0.25, kHIDEventFieldDigitizerY);
    child->setDoubleValue(0.5, kHIDEventFieldDigitizerX);
    frame->appendEvent(child);
    EXPECT_EQ(eventToJson(*frame),
              "{\"type\": 11, \"timestamp\": 1000000, \"sender\": 7, \"fields\": {}, \"children\": "
              "[{\"type\": 11, \"timestamp\": 1000000, \"fields\": {\"0xb0000\": 0.5, \"0xb0001\": 0.25, "
              "\"0xb0005\": 0, \"0xb0009\": 1}}]}");
}

TEST(EventJson, SenderPhaseAndChildrenAreLeftOutWhenZeroOrEmpty) {
    auto event = HIDEvent::createButtonEvent(5, 1, 0);
    EXPECT_EQ(eventToJson(*event), "{\"type\": 2, \"timestamp\": 5, \"fields\": {\"0x20000\": 1}}");
    event->setPhase(4);
    EXPECT_EQ(eventToJson(*event), "{\"type\": 2, \"timestamp\": 5, \"phase\": 4, \"fields\": {\"0x20000\": 1}}");
}

TEST(EventJson, DoubleFieldsAlwaysShowTheyAreDoubles) {
    auto event = HIDEvent::scrollEvent(1, 1.0, 0.1, 1e300, 0);
    EXPECT_EQ(eventToJson(*event),
              "{\"type\": 6, \"timestamp\": 1, \"fields\": {\"0x60000\": 1.0, \"0x60001\": 0.1, \"0x60002\": 1e+300}}");
}

TEST(EventJson, NonFiniteDoublesRoundTripAsStrings) {
    auto event = HIDEvent::pointerEvent(1, std::numeric_limits<double>::quiet_NaN(),
                                        std::numeric_limits<double>::infinity(),
                                        -std::numeric_limits<double>::infinity(), 0, 0);
    const std::string text = eventToJson(*event);
    EXPECT_EQ(text,
              "{\"type\": 17, \"timestamp\": 1, \"fields\": {\"0x110000\": \"NaN\", \"0x110001\": \"Infinity\", "
              "\"0x110002\": \"-Infinity\", \"0x110003\": 0}}");
    auto back = read(text);
    ASSERT_TRUE(back);
    EXPECT_TRUE(std::isnan(back->doubleValueForField(kHIDEventFieldPointerX)));
    EXPECT_EQ(back->doubleValueForField(kHIDEventFieldPointerY), std::numeric_limits<double>::infinity());
    EXPECT_EQ(back->doubleValueForField(kHIDEventFieldPointerZ), -std::numeric_limits<double>::infinity());
    EXPECT_EQ(eventToJson(*back), text);
}

TEST(EventJson, DataFieldsAreLowercaseHex) {
    auto event = HIDEvent::create(kHIDEventTypeVendorDefined, 9);
    event->setIntegerValue(13, kHIDEventFieldVendorDefinedUsagePage);
    event->setIntegerValue(86, kHIDEventFieldVendorDefinedUsage);
    event->setIntegerValue(2, kHIDEventFieldVendorDefinedDataLength);
    const uint8_t bytes[] = {0x34, 0xab};
    event->setDataValue(bytes, sizeof bytes, kHIDEventFieldVendorDefinedData);
    const std::string text = eventToJson(*event);
    EXPECT_EQ(text,
              "{\"type\": 1, \"timestamp\": 9, \"fields\": {\"0x10000\": 13, \"0x10001\": 86, \"0x10003\": 2, "
              "\"0x10004\": \"34ab\"}}");
    auto back = read(text);
    ASSERT_TRUE(back);
    EXPECT_EQ(back->dataValueForField(kHIDEventFieldVendorDefinedData), std::vector<uint8_t>({0x34, 0xab}));
}

TEST(EventJson, EveryFieldKindRoundTripsExactly) {
    auto event = HIDEvent::create(kHIDEventTypeDigitizer, 18446744073709551615ull);
    event->setSenderID(18446744073709551615ull);
    event->setPhase(0x80);
    event->setDoubleValue(0.1, kHIDEventFieldDigitizerX);
    event->setDoubleValue(-0.0, kHIDEventFieldDigitizerY);
    event->setDoubleValue(5e-324, kHIDEventFieldDigitizerZ);
    event->setIntegerValue(-9223372036854775807 - 1, kHIDEventFieldDigitizerButtonMask);
    event->setIntegerValue(9223372036854775807, kHIDEventFieldDigitizerEventMask);
    event->setIntegerValue(3, kHIDEventFieldDigitizerGenerationCount);
    auto child = HIDEvent::createButtonEvent(2, 1, 0);
    child->appendEvent(HIDEvent::scrollEvent(3, 0.0, 1.5, 0.0, 0));
    event->appendEvent(child);
    const std::string text = eventToJson(*event);
    auto back = read(text);
    ASSERT_TRUE(back);
    EXPECT_EQ(eventToJson(*back), text);
    EXPECT_EQ(back->timestamp(), 18446744073709551615ull);
    EXPECT_EQ(back->senderID(), 18446744073709551615ull);
    EXPECT_EQ(back->phase(), 0x80);
    EXPECT_TRUE(std::signbit(back->doubleValueForField(kHIDEventFieldDigitizerY)));
    EXPECT_EQ(back->doubleValueForField(kHIDEventFieldDigitizerZ), 5e-324);
    EXPECT_EQ(back->integerValueForField(kHIDEventFieldDigitizerButtonMask), -9223372036854775807 - 1);
    ASSERT_EQ(back->children().size(), 1u);
    ASSERT_EQ(back->children()[0]->children().size(), 1u);
    EXPECT_EQ(back->children()[0]->children()[0]->doubleValueForField(kHIDEventFieldScrollY), 1.5);
}

TEST(EventJson, UnknownFieldsTakeTheKindOfTheirToken) {
    auto event = read(
        "{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xb0040\": 3, \"0xb0041\": 2.5, \"0xb0042\": \"0a0b\", "
        "\"0xb0043\": \"NaN\", \"0xb0044\": 1e3}}");
    ASSERT_TRUE(event);
    const auto& fields = event->fields();
    ASSERT_EQ(fields.size(), 5u);
    EXPECT_EQ(fields[0].kind, HIDFieldKind::Integer);
    EXPECT_EQ(fields[0].integer, 3);
    EXPECT_EQ(fields[1].kind, HIDFieldKind::Double);
    EXPECT_EQ(fields[1].real, 2.5);
    EXPECT_EQ(fields[2].kind, HIDFieldKind::Data);
    EXPECT_EQ(fields[2].data, std::vector<uint8_t>({0x0a, 0x0b}));
    EXPECT_EQ(fields[3].kind, HIDFieldKind::Double);
    EXPECT_TRUE(std::isnan(fields[3].real));
    EXPECT_EQ(fields[4].kind, HIDFieldKind::Double);
    EXPECT_EQ(fields[4].real, 1000.0);
    EXPECT_EQ(eventToJson(*event),
              "{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xb0040\": 3, \"0xb0041\": 2.5, \"0xb0042\": \"0a0b\", "
              "\"0xb0043\": \"NaN\", \"0xb0044\": 1000.0}}");
}

TEST(EventJson, KnownDoubleFieldAcceptsAnIntegerToken) {
    auto event = read("{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xb0000\": 1}}");
    ASSERT_TRUE(event);
    EXPECT_EQ(event->fields()[0].kind, HIDFieldKind::Double);
    EXPECT_EQ(eventToJson(*event), "{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xb0000\": 1.0}}");
}

TEST(EventJson, FieldKeysAcceptUppercaseHexAndAreWrittenLowercase) {
    auto event = read("{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xB001B\": 4}}");
    ASSERT_TRUE(event);
    EXPECT_EQ(event->integerValueForField(kHIDEventFieldDigitizerGenerationCount), 4);
    EXPECT_EQ(eventToJson(*event), "{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xb001b\": 4}}");
}

TEST(EventJson, StringForAnIntegerFieldIsRefused) {
    EXPECT_EQ(readError("{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xb0009\": \"1\"}}"),
              "field \"0xb0009\" must be an integer, not a string");
}

TEST(EventJson, FractionForAnIntegerFieldIsRefused) {
    EXPECT_EQ(readError("{\"type\": 2, \"timestamp\": 1, \"fields\": {\"0x20000\": 1.5}}"),
              "field \"0x20000\" must be an integer, not a number with a fraction or exponent");
}

TEST(EventJson, WordForADoubleFieldIsRefused) {
    EXPECT_EQ(readError("{\"type\": 11, \"timestamp\": 1, \"fields\": {\"0xb0000\": \"half\"}}"),
              "field \"0xb0000\" must be a number or \"NaN\", \"Infinity\", \"-Infinity\", not the string \"half\"");
}

TEST(EventJson, BadHexForADataFieldIsRefused) {
    EXPECT_EQ(readError("{\"type\": 1, \"timestamp\": 1, \"fields\": {\"0x10004\": \"abc\"}}"),
              "field \"0x10004\" must be hex digits, two per byte");
    EXPECT_EQ(readError("{\"type\": 1, \"timestamp\": 1, \"fields\": {\"0x10004\": 12}}"),
              "field \"0x10004\" must be a hex string, not an integer");
}

TEST(EventJson, MalformedSelectorIsRefused) {
    EXPECT_EQ(readError("{\"type\": 11, \"timestamp\": 1, \"fields\": {\"x\": 1}}"),
              "field key \"x\" is not a selector such as \"0xb0000\"");
}

TEST(EventJson, MissingOrNegativeHeaderValuesAreRefused) {
    EXPECT_EQ(readError("{\"timestamp\": 1, \"fields\": {}}"), "an event needs \"type\"");
    EXPECT_EQ(readError("{\"type\": 11, \"fields\": {}}"), "an event needs \"timestamp\"");
    EXPECT_EQ(readError("{\"type\": 11, \"timestamp\": -1}"),
              "\"timestamp\" must be a non-negative integer, not a negative integer");
    EXPECT_EQ(readError("{\"type\": 11, \"timestamp\": 1, \"phase\": 65536}"),
              "\"phase\" is 65536, larger than 65535");
}

TEST(EventJson, UnknownKeysAreRefused) {
    EXPECT_EQ(readError("{\"type\": 11, \"timestamp\": 1, \"fileds\": {}}"),
              "unknown key \"fileds\" in an event (it may have type, timestamp, sender, phase, fields, children)");
}

TEST(EventJson, ChildErrorsSayWhichChild) {
    EXPECT_EQ(readError("{\"type\": 11, \"timestamp\": 1, \"children\": [{\"type\": 11, \"timestamp\": 1}, 3]}"),
              "children[1]: an event must be a JSON object, not an integer");
}

TEST(EventJson, InvalidJsonSaysWhere) {
    const std::string error = readError("{\"type\": 11,");
    EXPECT_EQ(error.rfind("invalid JSON at column 13: ", 0), 0u) << error;
}

TEST(EventJson, TypesHaveNames) {
    EXPECT_EQ(eventTypeName(kHIDEventTypeDigitizer), "digitizer");
    EXPECT_EQ(eventTypeName(kHIDEventTypePointer), "pointer");
    EXPECT_EQ(eventTypeName(42), "type 42");
}

}  // namespace
}  // namespace orvane::formats
