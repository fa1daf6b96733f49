// The scale, rotation and stateful button constructors.

#include "filter/HIDScaleEvent.h"

#include <gtest/gtest.h>

#include <memory>

#include "platform/Logging.h"

namespace orvane {
namespace {

class HIDScaleEventTest : public ::testing::Test {
protected:
    void SetUp() override { Logging::setSink(sink); }
    void TearDown() override { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }

    std::shared_ptr<CaptureLogSink> sink = std::make_shared<CaptureLogSink>();
};

TEST_F(HIDScaleEventTest, ScaleEventCarriesItsValuesUnchanged) {
    HIDEventRef e = HIDScaleEvent::scaleEvent(123456789, 0.25, -1.5, 0.015, 7);
    ASSERT_NE(e, nullptr);
    EXPECT_EQ(e->type(), kHIDEventTypeScale);
    EXPECT_EQ(e->timestamp(), 123456789u);
    EXPECT_EQ(e->options(), 7u);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldScaleX), 0.25);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldScaleY), -1.5);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldScaleZ), 0.015);
    EXPECT_EQ(e->phase(), 0);
    EXPECT_TRUE(e->children().empty());
}

TEST_F(HIDScaleEventTest, RotationEventCarriesItsValuesUnchanged) {
    HIDEventRef e = HIDScaleEvent::rotationEvent(42, 1.0, 2.0, -0.0125, 0);
    ASSERT_NE(e, nullptr);
    EXPECT_EQ(e->type(), kHIDEventTypeRotation);
    EXPECT_EQ(e->timestamp(), 42u);
    EXPECT_EQ(e->options(), 0u);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldRotationX), 1.0);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldRotationY), 2.0);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldRotationZ), -0.0125);
}

TEST_F(HIDScaleEventTest, EachCallMakesANewEvent) {
    HIDEventRef a = HIDScaleEvent::scaleEvent(1, 0, 0, 0, 0);
    HIDEventRef b = HIDScaleEvent::scaleEvent(1, 0, 0, 0, 0);
    EXPECT_NE(a.get(), b.get());
}

TEST_F(HIDScaleEventTest, StatefulButtonEventKeepsTimestampAndOptions) {
    HIDEventRef e = HIDScaleEvent::statefulButtonEvent(987654321, 1, 3);
    ASSERT_NE(e, nullptr);
    EXPECT_EQ(e->type(), kHIDEventTypeButton);
    EXPECT_EQ(e->timestamp(), 987654321u);
    EXPECT_EQ(e->options(), 3u);
}

TEST_F(HIDScaleEventTest, MaskOneIsButtonOnePressedWithoutLog) {
    HIDEventRef e = HIDScaleEvent::statefulButtonEvent(10, 0x1, 0);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonMask), 0x1);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonNumber), 1);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonState), 1);
    EXPECT_TRUE(sink->entries().empty());
}

TEST_F(HIDScaleEventTest, MaskTwoIsButtonTwoPressed) {
    HIDEventRef e = HIDScaleEvent::statefulButtonEvent(10, 0x2, 0);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonMask), 0x2);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonNumber), 2);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonState), 1);
    EXPECT_TRUE(sink->entries().empty());
}

TEST_F(HIDScaleEventTest, MaskWithTwoButtonsLogsAnErrorAndNamesTheLowest) {
    HIDEventRef e = HIDScaleEvent::statefulButtonEvent(10, 0x6, 0);
    // 0x6 = buttons 2 and 3: the whole mask is kept, the number is that of bit 1, plus one.
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonMask), 0x6);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonNumber), 2);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonState), 1);
    const auto entries = sink->entries();
    ASSERT_EQ(entries.size(), 1u);
    EXPECT_EQ(entries[0].level, LogLevel::Error);
    EXPECT_EQ(entries[0].category, "ServiceFilter");
    EXPECT_EQ(entries[0].message,
              "-[HIDEvent(HIDStatefulButtonEvent) setStatefulButtonMask:] Mask (0x6) has more than one bit set. "
              "Button state cannot be represented correctly with just one event");
}

TEST_F(HIDScaleEventTest, MaskZeroIsReleaseOfButtonOneWithoutLog) {
    HIDEventRef e = HIDScaleEvent::statefulButtonEvent(10, 0, 0);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonMask), 0);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonNumber), 1);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonState), 0);
    EXPECT_TRUE(e->hasField(kHIDEventFieldButtonNumber));
    EXPECT_TRUE(e->hasField(kHIDEventFieldButtonState));
    EXPECT_TRUE(sink->entries().empty());
}

TEST_F(HIDScaleEventTest, HighestButtonGetsNumberThirtyTwo) {
    HIDEventRef e = HIDScaleEvent::statefulButtonEvent(10, 0x80000000u, 0);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonMask), 0x80000000ll);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonNumber), 32);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonState), 1);
}

TEST_F(HIDScaleEventTest, SettingMaskZeroTurnsAPressIntoARelease) {
    HIDEventRef e = HIDScaleEvent::statefulButtonEvent(10, 0x2, 0);
    HIDStatefulButtonEvent::setStatefulButtonMask(*e, 0);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonMask), 0);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonNumber), 1);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonState), 0);
    EXPECT_EQ(e->timestamp(), 10u);
}

TEST_F(HIDScaleEventTest, SettingAMaskOnAnyButtonEventFillsAllThreeFields) {
    HIDEventRef e = HIDEvent::create(kHIDEventTypeButton, 5);
    HIDStatefulButtonEvent::setStatefulButtonMask(*e, 0x8);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonMask), 0x8);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonNumber), 4);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonState), 1);
    EXPECT_TRUE(sink->entries().empty());
}

}  // namespace
}  // namespace orvane
