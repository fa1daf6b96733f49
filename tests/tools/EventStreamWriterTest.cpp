#include "tools/formats/EventStreamWriter.h"

#include <gtest/gtest.h>

#include <sstream>

namespace orvane::formats {
namespace {

TEST(EventStreamWriter, HeaderComesFirst) {
    std::ostringstream out;
    EventStreamWriter writer(out);
    writer.writeHeader();
    EXPECT_EQ(out.str(), "{\"format\": \"orvane-events\", \"version\": 1}\n");
    EXPECT_EQ(writer.linesWritten(), 1u);
}

TEST(EventStreamWriter, DispatchedAndReturnedEventsNameTheirInput) {
    std::ostringstream out;
    EventStreamWriter writer(out);
    auto button = HIDEvent::createButtonEvent(10, 1, 0);
    writer.writeDispatched(4, *button);
    auto pointer = HIDEvent::pointerEvent(10, 1.0, -0.5, 0.0, 1, 0);
    pointer->appendEvent(button);
    writer.writeReturned(4, pointer.get());
    writer.writeReturned(5, nullptr);
    EXPECT_EQ(out.str(),
              "{\"input\": 4, \"via\": \"dispatch\", \"event\": {\"type\": 2, \"timestamp\": 10, \"fields\": "
              "{\"0x20000\": 1}}}\n"
              "{\"input\": 4, \"via\": \"return\", \"event\": {\"type\": 17, \"timestamp\": 10, \"fields\": "
              "{\"0x110000\": 1.0, \"0x110001\": -0.5, \"0x110002\": 0.0, \"0x110003\": 1}, \"children\": "
              "[{\"type\": 2, \"timestamp\": 10, \"fields\": {\"0x20000\": 1}}]}}\n"
              "{\"input\": 5, \"via\": \"return\", \"event\": null}\n");
}

TEST(EventStreamWriter, DispatchedEventIsWrittenAsItWasWhenSent) {
    std::ostringstream out;
    EventStreamWriter writer(out);
    auto button = HIDEvent::createButtonEvent(10, 1, 0);
    writer.writeDispatched(0, *button);
    button->setIntegerValue(0, kHIDEventFieldButtonMask);
    EXPECT_NE(out.str().find("\"0x20000\": 1}"), std::string::npos) << out.str();
}

TEST(EventStreamWriter, PropertyRecordsCarryKeyAndResult) {
    std::ostringstream out;
    EventStreamWriter writer(out);
    writer.writeSetProperty(0, "TapToClickEnabled", true);
    writer.writeSetProperty(1, "Odd \"key\"", false);
    EXPECT_EQ(out.str(),
              "{\"input\": 0, \"setProperty\": \"TapToClickEnabled\", \"result\": true}\n"
              "{\"input\": 1, \"setProperty\": \"Odd \\\"key\\\"\", \"result\": false}\n");
}

}  // namespace
}  // namespace orvane::formats
