// Evemu recordings turned into the contact frames the filter is given, frame by frame, on
// small hand-written recordings (tests/tools/data), and the events the conversion refuses.
// Positions are worked out from the axis ranges: x = (value - min) / (max - min), and y the
// same, then 1 - y; values outside the range are clamped to it first.

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "ToolTestSupport.h"
#include "tools/evemu/EvdevCodes.h"
#include "tools/evemu/EvemuConversion.h"
#include "tools/evemu/TouchFrameConverter.h"

namespace orvane::evemu {
namespace {

using tooltest::readFile;

const std::string kData = ORVANE_TEST_TOOLS_DATA;

formats::FrameRecording converted(const std::string& file, const EvemuOptions& options = {}) {
    const std::string path = kData + "/" + file;
    formats::FrameRecording recording;
    std::string error;
    EXPECT_TRUE(convertEvemuRecording(readFile(path), path, file, options, &recording, &error)) << error;
    return recording;
}

struct Contact {
    int64_t index;
    double x, y;
    int64_t transducer;
    int64_t mask;
    int64_t touch;  // range is the same
};

struct Frame {
    uint64_t time;
    int64_t click;  // the parent's button mask
    int64_t mask;   // the parent's event mask
    int64_t touch;  // the parent's touch and range
    std::vector<Contact> contacts;
};

void expectFrame(const HIDEventRef& event, const Frame& want, size_t row) {
    SCOPED_TRACE("frame " + std::to_string(row));
    ASSERT_TRUE(event);
    ASSERT_EQ(event->type(), kHIDEventTypeDigitizer);
    EXPECT_EQ(event->timestamp(), want.time);
    EXPECT_EQ(event->integerValueForField(kHIDEventFieldDigitizerButtonMask), want.click);
    EXPECT_EQ(event->integerValueForField(kHIDEventFieldDigitizerEventMask), want.mask);
    EXPECT_EQ(event->integerValueForField(kHIDEventFieldDigitizerTouch), want.touch);
    EXPECT_EQ(event->integerValueForField(kHIDEventFieldDigitizerRange), want.touch);
    EXPECT_FALSE(event->hasField(kHIDEventFieldDigitizerX));
    ASSERT_EQ(event->children().size(), want.contacts.size());
    for (size_t i = 0; i < want.contacts.size(); ++i) {
        SCOPED_TRACE("contact " + std::to_string(i));
        const HIDEvent& c = *event->children()[i];
        const Contact& w = want.contacts[i];
        EXPECT_EQ(c.type(), kHIDEventTypeDigitizer);
        EXPECT_EQ(c.timestamp(), want.time);
        EXPECT_EQ(c.integerValueForField(kHIDEventFieldDigitizerIndex), w.index);
        EXPECT_DOUBLE_EQ(c.doubleValueForField(kHIDEventFieldDigitizerX), w.x);
        EXPECT_DOUBLE_EQ(c.doubleValueForField(kHIDEventFieldDigitizerY), w.y);
        EXPECT_EQ(c.integerValueForField(kHIDEventFieldDigitizerType), w.transducer);
        EXPECT_EQ(c.integerValueForField(kHIDEventFieldDigitizerEventMask), w.mask);
        EXPECT_EQ(c.integerValueForField(kHIDEventFieldDigitizerTouch), w.touch);
        EXPECT_EQ(c.integerValueForField(kHIDEventFieldDigitizerRange), w.touch);
        // Exactly the fields a contact carries.
        EXPECT_EQ(c.fields().size(), 7u);
        EXPECT_TRUE(c.children().empty());
    }
}

std::vector<HIDEventRef> events(const formats::FrameRecording& recording) {
    std::vector<HIDEventRef> out;
    for (const auto& r : recording.records) {
        EXPECT_EQ(r.kind, formats::InputRecord::Kind::Event);
        out.push_back(r.event);
    }
    return out;
}

constexpr int64_t kFinger = 1, kPalm = 3;
constexpr int64_t kRange = 1, kTouch = 2, kPosition = 4;

TEST(EvemuFrameConversion, ClickpadFrameByFrame) {
    const formats::FrameRecording recording = converted("clickpad.evemu");
    const std::vector<HIDEventRef> frames = events(recording);
    // Axes 0..1000 and 0..500. A contact's first frame has all three bits; a lift reports
    // touch and range changed at the last position; 1 - 450/500 is the flipped y of 450.
    const double y100 = 1.0 - 100.0 / 500.0, y400 = 1.0 - 400.0 / 500.0, y450 = 1.0 - 450.0 / 500.0;
    const std::vector<Frame> want = {
        // 0: a finger touches in slot 0 at (250, 100).
        {1000000000, 0, 7, 1, {{0, 0.25, y100, kFinger, kRange | kTouch | kPosition, 1}}},
        // 1: a second finger in slot 1 at (750, 400); the first did not change.
        {1010000000, 0, 7, 1, {{0, 0.25, y100, kFinger, 0, 1}, {1, 0.75, y400, kFinger, 7, 1}}},
        // 2: the first moves to x 300.
        {1020000000, 0, kPosition, 1, {{0, 0.3, y100, kFinger, kPosition, 1}, {1, 0.75, y400, kFinger, 0, 1}}},
        // 3: the click goes down: bit 0 of the parent's button mask; no contact changed.
        {1030000000, 1, 0, 1, {{0, 0.3, y100, kFinger, 0, 1}, {1, 0.75, y400, kFinger, 0, 1}}},
        // 4: the click comes up; the first finger lifts and is reported once more.
        {1040000000, 0, kRange | kTouch, 1,
         {{0, 0.3, y100, kFinger, kRange | kTouch, 0}, {1, 0.75, y400, kFinger, 0, 1}}},
        // 5: slot 0 is no longer reported; slot 1 moves to y 450; a palm lands in slot 15,
        // past the 14 contacts the filter reads (passed on all the same), at (1200, -30):
        // clamped to x 1 and y 0, which flips to 1.
        {1050000000, 0, 7, 1,
         {{1, 0.75, y450, kFinger, kPosition, 1}, {15, 1.0, 1.0, kPalm, kRange | kTouch | kPosition, 1}}},
        // 6: slot 1 changes its tracking ID: the old contact lifts now...
        {1060000000, 0, kRange | kTouch, 1,
         {{1, 0.75, y450, kFinger, kRange | kTouch, 0}, {15, 1.0, 1.0, kPalm, 0, 1}}},
        // 7: ...and the new one at (500, 250) starts in the next frame.
        {1070000000, 0, 7, 1, {{1, 0.5, 1.0 - 250.0 / 500.0, kFinger, 7, 1}, {15, 1.0, 1.0, kPalm, 0, 1}}},
        // 8: both lift: nothing touches any more.
        {1080000000, 0, kRange | kTouch, 0,
         {{1, 0.5, 0.5, kFinger, kRange | kTouch, 0}, {15, 1.0, 1.0, kPalm, kRange | kTouch, 0}}},
        // 9: an empty report is an empty frame. The events after it never reach a
        // SYN_REPORT and make no frame.
        {1090000000, 0, 0, 0, {}},
    };
    ASSERT_EQ(frames.size(), want.size());
    for (size_t i = 0; i < want.size(); ++i) expectFrame(frames[i], want[i], i);
    // A frame record points at its SYN_REPORT line.
    EXPECT_EQ(recording.records[0].line, 32u);
}

TEST(EvemuFrameConversion, ClickpadService) {
    const formats::FrameRecording recording = converted("clickpad.evemu");
    EXPECT_EQ(recording.name, "clickpad.evemu");
    EXPECT_EQ(recording.headerLine, 4u);  // the N: line
    const auto& service = recording.header.service;
    EXPECT_EQ(service.usagePairs, (std::vector<HIDUsagePair>{{13, 5}, {13, 34}}));
    // 1000 units at 10 per mm: 100 mm = 10 cm = 10 * 65536; 500 units: 5 cm.
    const PropertyValue* size = &service.properties.at("SurfaceDimensions");
    EXPECT_EQ(size->find("Width")->integerValue(), 655360);
    EXPECT_EQ(size->find("Height")->integerValue(), 327680);
    EXPECT_EQ(service.properties.at("Transport").stringValue(), "USB");  // bus 0003
    EXPECT_EQ(service.properties.at("Product").stringValue(), "Hand-written Clickpad");
    EXPECT_EQ(service.properties.size(), 3u);
    EXPECT_EQ(recording.header.timebase.numer, 1u);
    EXPECT_EQ(recording.header.timebase.denom, 1u);
    EXPECT_FALSE(recording.header.bundle.has_value());
}

TEST(EvemuFrameConversion, KeyboardCoverAddsTheKeyboardUsage) {
    EvemuOptions options;
    options.keyboardCover = true;
    EXPECT_EQ(converted("clickpad.evemu", options).header.service.usagePairs,
              (std::vector<HIDUsagePair>{{13, 5}, {13, 34}, {1, 6}}));
}

TEST(EvemuFrameConversion, SettingsAreSetByAClientBeforeTheFirstFrame) {
    EvemuOptions options;
    options.tapToClick = true;
    options.secondaryClick = true;
    const formats::FrameRecording recording = converted("clickpad.evemu", options);
    ASSERT_GE(recording.records.size(), 4u);
    EXPECT_EQ(recording.records[0].kind, formats::InputRecord::Kind::Client);
    EXPECT_EQ(recording.records[0].clientID, 1u);
    EXPECT_TRUE(recording.records[0].clientAdded);
    EXPECT_EQ(recording.records[1].kind, formats::InputRecord::Kind::SetProperty);
    EXPECT_EQ(recording.records[1].propertyKey, "TapToClickEnabled");
    EXPECT_TRUE(recording.records[1].propertyValue.isBooleanTrue());
    EXPECT_EQ(recording.records[2].propertyKey, "TwoFingersSecondaryClickEnabled");
    EXPECT_TRUE(recording.records[2].propertyValue.isBooleanTrue());
    EXPECT_EQ(recording.records[3].kind, formats::InputRecord::Kind::Event);
    EXPECT_EQ(recording.records.size(), 3u + 10u);

    EvemuOptions tapOnly;
    tapOnly.tapToClick = true;
    const formats::FrameRecording tap = converted("clickpad.evemu", tapOnly);
    EXPECT_EQ(tap.records.size(), 2u + 10u);
    EXPECT_EQ(tap.records[1].propertyKey, "TapToClickEnabled");
}

struct Button {
    int64_t mask, number, state;
};

void expectButton(const HIDEventRef& event, uint64_t time, const Button& want) {
    ASSERT_TRUE(event);
    ASSERT_EQ(event->type(), kHIDEventTypeButton);
    EXPECT_EQ(event->timestamp(), time);
    EXPECT_EQ(event->integerValueForField(kHIDEventFieldButtonMask), want.mask);
    EXPECT_EQ(event->integerValueForField(kHIDEventFieldButtonNumber), want.number);
    EXPECT_EQ(event->integerValueForField(kHIDEventFieldButtonState), want.state);
    EXPECT_EQ(event->fields().size(), 3u);
}

TEST(EvemuFrameConversion, SeparateButtonsBecomeButtonEventsBeforeTheirFrame) {
    EvemuOptions options;
    options.size = SurfaceSize{70.0, 40.0};
    // buttons.two-presses.events finds buttons.desc beside it (the shorter stem).
    const std::vector<HIDEventRef> out = events(converted("buttons.two-presses.events", options));
    ASSERT_EQ(out.size(), 11u);  // five frames and six button changes
    // Axes 0..2000 and 0..1000: the finger at (500, 500) is x 0.25, y 1 - 0.5.
    const Contact still{0, 0.25, 0.5, kFinger, 0, 1};
    expectFrame(out[0], {0, 0, 7, 1, {{0, 0.25, 0.5, kFinger, 7, 1}}}, 0);
    // Left (number 1, mask bit 0) down; the parent's button mask stays 0: these are not
    // the click under the surface.
    expectButton(out[1], 12000000, {1, 1, 1});
    expectFrame(out[2], {12000000, 0, 0, 1, {still}}, 1);
    // Right (number 2) down while left is down: mask 1 | 2.
    expectButton(out[3], 24000000, {3, 2, 1});
    expectFrame(out[4], {24000000, 0, 0, 1, {still}}, 2);
    // Left up and middle (number 3) down in one frame, in code order: left first.
    expectButton(out[5], 36000000, {2, 1, 0});
    expectButton(out[6], 36000000, {2 | 4, 3, 1});
    expectFrame(out[7], {36000000, 0, 0, 1, {still}}, 3);
    // Right and middle up: right (0x111) before middle (0x112), whatever the event order.
    expectButton(out[8], 48000000, {4, 2, 0});
    expectButton(out[9], 48000000, {0, 3, 0});
    expectFrame(out[10], {48000000, 0, 0, 1, {still}}, 4);
}

TEST(EvemuFrameConversion, SizeGivenInMillimetresIsFixedPointCentimetres) {
    EvemuOptions options;
    options.size = SurfaceSize{70.0, 40.0};
    const formats::FrameRecording recording = converted("buttons.two-presses.events", options);
    const PropertyValue& size = recording.header.service.properties.at("SurfaceDimensions");
    EXPECT_EQ(size.find("Width")->integerValue(), 7 * 65536);   // 70 mm = 7 cm
    EXPECT_EQ(size.find("Height")->integerValue(), 4 * 65536);  // 40 mm = 4 cm
    EXPECT_EQ(recording.header.service.properties.at("Transport").stringValue(), "PS/2");  // bus 0011
    EXPECT_EQ(recording.headerLine, 1u);  // the description is another file's
}

TEST(EvemuFrameConversion, SizeReplacesTheOneFromTheResolutions) {
    EvemuOptions options;
    options.size = SurfaceSize{99.5, 62.25};
    const formats::FrameRecording recording = converted("clickpad.evemu", options);
    const PropertyValue& size = recording.header.service.properties.at("SurfaceDimensions");
    // 9.95 cm * 65536 = 652083.2 -> 652083; 6.225 cm * 65536 = 407961.6 -> 407962.
    EXPECT_EQ(size.find("Width")->integerValue(), 652083);
    EXPECT_EQ(size.find("Height")->integerValue(), 407962);
}

std::vector<uint8_t> scanBytes(uint16_t count) {
    std::vector<uint8_t> bytes(2);
    std::memcpy(bytes.data(), &count, 2);  // the filter reads them in the host's order
    return bytes;
}

TEST(EvemuFrameConversion, BluetoothFramesCarryTheDeviceScanTime) {
    const formats::FrameRecording recording = converted("bluetooth.evemu");
    EXPECT_EQ(recording.header.service.properties.at("Transport").stringValue(), "Bluetooth");
    // 1600 and 1000 units at 20 per mm: 80 x 50 mm.
    const PropertyValue& size = recording.header.service.properties.at("SurfaceDimensions");
    EXPECT_EQ(size.find("Width")->integerValue(), 8 * 65536);
    EXPECT_EQ(size.find("Height")->integerValue(), 5 * 65536);

    const std::vector<HIDEventRef> frames = events(recording);
    ASSERT_EQ(frames.size(), 7u);
    // The scan time is the device's microseconds in 100 us units, kept to 16 bits; the
    // 32-bit microsecond count is followed across its own wrap.
    struct Scan {
        bool present;
        uint16_t count;
    };
    const Scan want[] = {
        {true, 65534},   // 6553400 us / 100
        {true, 1},       // 6553700 / 100 = 65537, past 16 bits: 65537 - 65536
        {false, 0},      // no MSC_TIMESTAMP in this frame
        {true, 0xae14},  // 2147483600 / 100 = 21474836 = 0x147ae14
        {true, 0xae15},  // -2147483596 is 2147483700 as 32 bits: 21474837
        {true, 0x5c28},  // -50 is 4294967246: 42949672 = 0x28f5c28
        {true, 0x5c29},  // 50 is 100 us later, 4294967346 in all: 42949673
    };
    for (size_t i = 0; i < frames.size(); ++i) {
        SCOPED_TRACE("frame " + std::to_string(i));
        const auto& children = frames[i]->children();
        ASSERT_EQ(children.size(), want[i].present ? 2u : 1u);
        EXPECT_EQ(children[0]->type(), kHIDEventTypeDigitizer);
        // x 800, 810, ... 860 of 1600.
        EXPECT_DOUBLE_EQ(children[0]->doubleValueForField(kHIDEventFieldDigitizerX), (800.0 + 10.0 * double(i)) / 1600.0);
        if (!want[i].present) continue;
        const HIDEvent& scan = *children[1];  // after the contacts
        EXPECT_EQ(scan.type(), kHIDEventTypeVendorDefined);
        EXPECT_EQ(scan.timestamp(), frames[i]->timestamp());
        EXPECT_EQ(scan.integerValueForField(kHIDEventFieldVendorDefinedUsagePage), 13);
        EXPECT_EQ(scan.integerValueForField(kHIDEventFieldVendorDefinedUsage), 86);
        EXPECT_EQ(scan.integerValueForField(kHIDEventFieldVendorDefinedDataLength), 2);
        EXPECT_EQ(scan.dataValueForField(kHIDEventFieldVendorDefinedData), scanBytes(want[i].count));
        EXPECT_EQ(scan.fields().size(), 4u);
    }
    // The frame's own time stays the recorded one: 20.000300 s.
    EXPECT_EQ(frames[1]->timestamp(), 20000300000u);
}

EvdevDevice multitouchDevice();

TEST(EvemuFrameConversion, WiredDevicesIgnoreTheirScanTime) {
    // The same MSC_TIMESTAMP on a USB device adds nothing.
    EvdevDevice device = multitouchDevice();
    device.bus = 0x03;
    TouchpadLayout layout;
    std::string error;
    ASSERT_TRUE(touchpadLayoutFor(device, &layout, &error)) << error;
    TouchFrameConverter converter(layout);
    std::vector<HIDEventRef> out;
    ASSERT_TRUE(converter.feed({5, kEvAbs, kAbsMtTrackingId, 3}, &out, &error));
    ASSERT_TRUE(converter.feed({5, kEvMsc, kMscTimestamp, 6553400}, &out, &error));
    ASSERT_TRUE(converter.feed({5, kEvSyn, kSynReport, 0}, &out, &error));
    ASSERT_EQ(out.size(), 1u);
    EXPECT_EQ(out[0]->children().size(), 1u);
    EXPECT_EQ(converter.frames(), 1u);
}

EvdevDevice multitouchDevice() {
    EvdevDevice device;
    device.bus = 0x18;
    device.axes[kAbsMtSlot] = EvdevAxis{0, 1, 0, 0, 0};
    device.axes[kAbsMtPositionX] = EvdevAxis{-500, 500, 0, 0, 10};
    device.axes[kAbsMtPositionY] = EvdevAxis{0, 400, 0, 0, 10};
    device.axes[kAbsMtTrackingId] = EvdevAxis{0, 65535, 0, 0, 0};
    device.axes[kAbsMtToolType] = EvdevAxis{0, 2, 0, 0, 0};
    device.codes[kEvKey].assign(kKeyMax / 8 + 1, 0);
    return device;
}

void addKey(EvdevDevice& device, uint16_t code) { device.codes[kEvKey][code / 8] |= uint8_t(1u << (code % 8)); }

TEST(EvemuFrameConversion, AClickpadIsAButtonpadOrAPadWhoseOnlyButtonIsLeft) {
    std::string error;
    TouchpadLayout layout;
    EvdevDevice leftOnly = multitouchDevice();
    addKey(leftOnly, kBtnLeft);
    addKey(leftOnly, 0x14a);  // BTN_TOUCH is no button
    ASSERT_TRUE(touchpadLayoutFor(leftOnly, &layout, &error)) << error;
    EXPECT_TRUE(layout.clickpad);
    EXPECT_EQ(layout.buttons, std::vector<uint16_t>{kBtnLeft});
    EXPECT_EQ(layout.slots, 2);
    EXPECT_FALSE(layout.wireless);

    EvdevDevice separate = leftOnly;
    addKey(separate, kBtnRight);
    ASSERT_TRUE(touchpadLayoutFor(separate, &layout, &error));
    EXPECT_FALSE(layout.clickpad);
    EXPECT_EQ(layout.buttons, (std::vector<uint16_t>{kBtnLeft, kBtnRight}));

    EvdevDevice buttonpad = separate;
    buttonpad.properties = {1u << kInputPropButtonpad};
    ASSERT_TRUE(touchpadLayoutFor(buttonpad, &layout, &error));
    EXPECT_TRUE(layout.clickpad);

    EvdevDevice none = multitouchDevice();
    ASSERT_TRUE(touchpadLayoutFor(none, &layout, &error));
    EXPECT_FALSE(layout.clickpad);
    EXPECT_TRUE(layout.buttons.empty());
}

TEST(EvemuFrameConversion, TheRightButtonOfAClickpadIsAButtonEventAndNeverTheClick) {
    EvdevDevice device = multitouchDevice();
    device.properties = {1u << kInputPropButtonpad};
    addKey(device, kBtnLeft);
    addKey(device, kBtnRight);
    TouchpadLayout layout;
    std::string error;
    ASSERT_TRUE(touchpadLayoutFor(device, &layout, &error));
    TouchFrameConverter converter(layout);
    std::vector<HIDEventRef> out;
    ASSERT_TRUE(converter.feed({7, kEvKey, kBtnRight, 1}, &out, &error));
    ASSERT_TRUE(converter.feed({7, kEvSyn, kSynReport, 0}, &out, &error));
    ASSERT_EQ(out.size(), 2u);
    expectButton(out[0], 7, {2, 2, 1});
    EXPECT_EQ(out[1]->integerValueForField(kHIDEventFieldDigitizerButtonMask), 0);
    out.clear();
    // A held key (value 2) changes nothing; the click is the parent's bit 0.
    ASSERT_TRUE(converter.feed({8, kEvKey, kBtnRight, 2}, &out, &error));
    ASSERT_TRUE(converter.feed({8, kEvKey, kBtnLeft, 1}, &out, &error));
    ASSERT_TRUE(converter.feed({8, kEvSyn, kSynReport, 0}, &out, &error));
    ASSERT_EQ(out.size(), 1u);
    EXPECT_EQ(out[0]->integerValueForField(kHIDEventFieldDigitizerButtonMask), 1);
}

TEST(EvemuFrameConversion, AxesWithANegativeMinimumNormaliseFromTheMinimum) {
    EvdevDevice device = multitouchDevice();
    TouchpadLayout layout;
    std::string error;
    ASSERT_TRUE(touchpadLayoutFor(device, &layout, &error));
    TouchFrameConverter converter(layout);
    std::vector<HIDEventRef> out;
    for (const EvdevEvent& e : std::vector<EvdevEvent>{{1, kEvAbs, kAbsMtTrackingId, 0},
                                                       {1, kEvAbs, kAbsMtPositionX, -250},
                                                       {1, kEvAbs, kAbsMtPositionY, 100},
                                                       {1, kEvSyn, kSynReport, 0}})
        ASSERT_TRUE(converter.feed(e, &out, &error)) << error;
    ASSERT_EQ(out.size(), 1u);
    // x: (-250 - -500) / 1000 = 0.25; y: 1 - 100 / 400 = 0.75.
    expectFrame(out[0], {1, 0, 7, 1, {{0, 0.25, 0.75, kFinger, 7, 1}}}, 0);
}

struct EventRefusal {
    EvdevEvent event;
    const char* error;
};

class EvemuConverterRefuses : public ::testing::TestWithParam<EventRefusal> {};

TEST_P(EvemuConverterRefuses, EventsItCannotFollow) {
    EvdevDevice device = multitouchDevice();
    addKey(device, kBtnLeft);
    TouchpadLayout layout;
    std::string error;
    ASSERT_TRUE(touchpadLayoutFor(device, &layout, &error));
    TouchFrameConverter converter(layout);
    std::vector<HIDEventRef> out;
    EXPECT_FALSE(converter.feed(GetParam().event, &out, &error));
    EXPECT_EQ(error, GetParam().error);
    EXPECT_TRUE(out.empty());
}

INSTANTIATE_TEST_SUITE_P(
    EvemuEveryEventItRefuses, EvemuConverterRefuses,
    ::testing::Values(
        EventRefusal{{0, kEvSyn, kSynMtReport, 0},
                     "SYN_MT_REPORT belongs to multitouch protocol A; the conversion needs slots with tracking IDs "
                     "(protocol B)"},
        EventRefusal{{0, kEvSyn, kSynDropped, 0},
                     "SYN_DROPPED: events were lost here, so the touchpad's state after it is unknown"},
        EventRefusal{{0, kEvAbs, 0x3a, 50}, "ABS_MT_PRESSURE is not an axis of this device (it has no A: line)"},
        EventRefusal{{0, kEvAbs, kAbsMtSlot, 2}, "slot 2 is outside the device's slots 0 to 1"},
        EventRefusal{{0, kEvAbs, kAbsMtSlot, -1}, "slot -1 is outside the device's slots 0 to 1"},
        EventRefusal{{0, kEvAbs, kAbsMtTrackingId, -2},
                     "tracking ID -2 is neither -1 (the contact ends) nor a contact"},
        EventRefusal{{0, kEvKey, kBtnRight, 1}, "BTN_RIGHT is not a key of this device (its B: 01 lines)"},
        EventRefusal{{0, kEvKey, 0x14a, 1}, "BTN_TOUCH is not a key of this device (its B: 01 lines)"},
        EventRefusal{{0, kEvKey, kBtnLeft, 3}, "BTN_LEFT has the value 3 (0 up, 1 down, 2 held)"}));

struct LayoutRefusal {
    const char* name;
    std::vector<uint16_t> axes;  // these, 0..100 at 1 unit per mm, slots 0..1
    const char* error;
};

TEST(EvemuFrameConversion, DevicesWithoutSlotsAreRefusedNamingWhatIsMissing) {
    const LayoutRefusal cases[] = {
        {"single touch", {kAbsX, kAbsY},
         "a single-touch device: its description has no A: line for ABS_MT_POSITION_X, ABS_MT_POSITION_Y, "
         "ABS_MT_SLOT and ABS_MT_TRACKING_ID, and the conversion needs multitouch slots with tracking IDs (protocol "
         "B)"},
        {"protocol A", {kAbsX, kAbsY, kAbsMtPositionX, kAbsMtPositionY},
         "a protocol-A multitouch device: its description has no A: line for ABS_MT_SLOT and ABS_MT_TRACKING_ID, and "
         "the conversion needs multitouch slots with tracking IDs (protocol B)"},
        {"no tracking ID", {kAbsMtPositionX, kAbsMtPositionY, kAbsMtSlot},
         "an incomplete multitouch device: its description has no A: line for ABS_MT_TRACKING_ID, and the "
         "conversion needs multitouch slots with tracking IDs (protocol B)"},
        {"no y", {kAbsMtPositionX, kAbsMtSlot, kAbsMtTrackingId},
         "an incomplete multitouch device: its description has no A: line for ABS_MT_POSITION_Y, and the conversion needs "
         "multitouch slots with tracking IDs (protocol B)"},
    };
    for (const LayoutRefusal& c : cases) {
        SCOPED_TRACE(c.name);
        EvdevDevice device;
        for (uint16_t code : c.axes) device.axes[code] = EvdevAxis{0, code == kAbsMtSlot ? 1 : 100, 0, 0, 1};
        TouchpadLayout layout;
        std::string error;
        EXPECT_FALSE(touchpadLayoutFor(device, &layout, &error));
        EXPECT_EQ(error, c.error);
    }
}

TEST(EvemuFrameConversion, EmptyAxisRangesAndImpossibleSlotsAreRefused) {
    TouchpadLayout layout;
    std::string error;
    EvdevDevice flat = multitouchDevice();
    flat.axes[kAbsMtPositionY] = EvdevAxis{7, 7, 0, 0, 1};
    EXPECT_FALSE(touchpadLayoutFor(flat, &layout, &error));
    EXPECT_EQ(error, "ABS_MT_POSITION_Y has an empty range (minimum and maximum 7)");

    EvdevDevice fromOne = multitouchDevice();
    fromOne.axes[kAbsMtSlot] = EvdevAxis{1, 4, 0, 0, 0};
    EXPECT_FALSE(touchpadLayoutFor(fromOne, &layout, &error));
    EXPECT_EQ(error, "ABS_MT_SLOT must count from 0 to at most 63, not from 1 to 4");

    EvdevDevice tooMany = multitouchDevice();
    tooMany.axes[kAbsMtSlot] = EvdevAxis{0, 64, 0, 0, 0};
    EXPECT_FALSE(touchpadLayoutFor(tooMany, &layout, &error));
    EXPECT_EQ(error, "ABS_MT_SLOT must count from 0 to at most 63, not from 0 to 64");

    EvdevDevice most = multitouchDevice();
    most.axes[kAbsMtSlot] = EvdevAxis{0, 63, 0, 0, 0};
    EXPECT_TRUE(touchpadLayoutFor(most, &layout, &error));
    EXPECT_EQ(layout.slots, 64);
}

}  // namespace
}  // namespace orvane::evemu
