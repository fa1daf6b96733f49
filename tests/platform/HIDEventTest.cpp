#include <gtest/gtest.h>

#include <cmath>

#include "platform/HIDEvent.h"

using namespace orvane;

TEST(HIDEvent, UnsetFieldsReadAsZero) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 5);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldDigitizerIndex), 0);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldDigitizerX), 0.0);
    EXPECT_TRUE(e->dataValueForField(kHIDEventFieldVendorDefinedData).empty());
    EXPECT_TRUE(e->fields().empty());
    EXPECT_EQ(e->phase(), 0);
    EXPECT_EQ(e->senderID(), 0u);
}

TEST(HIDEvent, FieldsAreKeptInAscendingSelectorOrder) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    e->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    e->setDoubleValue(0.5, kHIDEventFieldDigitizerX);
    e->setIntegerValue(3, kHIDEventFieldDigitizerIndex);
    ASSERT_EQ(e->fields().size(), 3u);
    EXPECT_EQ(e->fields()[0].selector, 0xb0000u);
    EXPECT_EQ(e->fields()[1].selector, 0xb0005u);
    EXPECT_EQ(e->fields()[2].selector, 0xb0009u);
}

TEST(HIDEvent, KnownFieldsKeepTheirKindWhateverSetterIsUsed) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    e->setDoubleValue(2.9, kHIDEventFieldDigitizerIndex);  // an integer field: truncated
    e->setIntegerValue(3, kHIDEventFieldDigitizerX);       // a double field: widened
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldDigitizerIndex), 2);
    EXPECT_EQ(e->fields()[0].kind, HIDFieldKind::Double);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldDigitizerX), 3.0);
    EXPECT_EQ(e->fields()[1].kind, HIDFieldKind::Integer);
}

TEST(HIDEvent, UnknownFieldsTakeTheSettersKind) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    e->setDoubleValue(1.25, 0xb0042);
    e->setIntegerValue(7, 0xb0043);
    EXPECT_EQ(e->doubleValueForField(0xb0042), 1.25);
    EXPECT_EQ(e->integerValueForField(0xb0043), 7);
    EXPECT_EQ(hidFieldKind(0xb0042, HIDFieldKind::Data), HIDFieldKind::Data);
    EXPECT_FALSE(hidFieldIsKnown(0xb0042));
    EXPECT_TRUE(hidFieldIsKnown(0xb001b));
}

TEST(HIDEvent, NaNWrittenToAnIntegerFieldReadsAsZero) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    e->setDoubleValue(std::nan(""), kHIDEventFieldDigitizerTouch);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldDigitizerTouch), 0);
}

TEST(HIDEvent, DataFieldsHoldBytesInOrder) {
    auto e = HIDEvent::create(kHIDEventTypeVendorDefined, 0);
    const uint8_t bytes[] = {0x34, 0x12};
    e->setDataValue(bytes, 2, kHIDEventFieldVendorDefinedData);
    ASSERT_EQ(e->dataValueForField(kHIDEventFieldVendorDefinedData).size(), 2u);
    EXPECT_EQ(e->dataValueForField(kHIDEventFieldVendorDefinedData)[0], 0x34);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldVendorDefinedData), 0);
}

TEST(HIDEvent, PointerCreationSetsExactlyItsFourFields) {
    auto e = HIDEvent::pointerEvent(42, 1.5, -2.5, 0.0, 1, 0);
    EXPECT_EQ(e->type(), kHIDEventTypePointer);
    EXPECT_EQ(e->timestamp(), 42u);
    ASSERT_EQ(e->fields().size(), 4u);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldPointerX), 1.5);
    EXPECT_EQ(e->doubleValueForField(kHIDEventFieldPointerY), -2.5);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldPointerButtonMask), 1);
}

TEST(HIDEvent, ScrollScaleRotationCreationSetThreeAxes) {
    for (auto make : {&HIDEvent::scrollEvent, &HIDEvent::createScaleEvent, &HIDEvent::createRotationEvent}) {
        auto e = make(9, 1.0, 2.0, 3.0, 0);
        ASSERT_EQ(e->fields().size(), 3u);
        EXPECT_EQ(e->doubleValueForField(hidFieldSelector(e->type(), 2)), 3.0);
    }
    EXPECT_EQ(HIDEvent::scrollEvent(0, 0, 0, 0, 0)->type(), kHIDEventTypeScroll);
    EXPECT_EQ(HIDEvent::createScaleEvent(0, 0, 0, 0, 0)->type(), kHIDEventTypeScale);
    EXPECT_EQ(HIDEvent::createRotationEvent(0, 0, 0, 0, 0)->type(), kHIDEventTypeRotation);
}

TEST(HIDEvent, ButtonCreationSetsOnlyTheMask) {
    auto e = HIDEvent::createButtonEvent(1, 2, 0);
    ASSERT_EQ(e->fields().size(), 1u);
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldButtonMask), 2);
}

TEST(HIDEvent, RemoveEventTakesOutThatVeryChild) {
    auto parent = HIDEvent::create(kHIDEventTypePointer, 0);
    auto a = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    auto b = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    parent->appendEvent(a);
    parent->appendEvent(b);
    parent->removeEvent(HIDEvent::create(kHIDEventTypeDigitizer, 0));  // not a child: nothing
    ASSERT_EQ(parent->children().size(), 2u);
    parent->removeEvent(a);
    ASSERT_EQ(parent->children().size(), 1u);
    EXPECT_EQ(parent->children()[0], b);
}

TEST(HIDEvent, CopyIsDeep) {
    auto parent = HIDEvent::create(kHIDEventTypeDigitizer, 3);
    parent->setSenderID(9);
    parent->setPhase(2);
    auto child = HIDEvent::create(kHIDEventTypeDigitizer, 3);
    child->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    parent->appendEvent(child);
    auto copy = parent->copy();
    child->setIntegerValue(0, kHIDEventFieldDigitizerTouch);
    EXPECT_EQ(copy->senderID(), 9u);
    EXPECT_EQ(copy->phase(), 2);
    EXPECT_EQ(copy->children()[0]->integerValueForField(kHIDEventFieldDigitizerTouch), 1);
}

TEST(HIDEvent, ConformsOnlyToItsOwnType) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    EXPECT_TRUE(e->conformsToEventType(kHIDEventTypeDigitizer));
    EXPECT_FALSE(e->conformsToEventType(kHIDEventTypePointer));
}

TEST(HIDEvent, DescriptionNamesTypeFieldsAndChildren) {
    auto parent = HIDEvent::create(kHIDEventTypeDigitizer, 7);
    parent->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    parent->appendEvent(HIDEvent::create(kHIDEventTypeDigitizer, 7));
    EXPECT_EQ(parent->description(), "{type 11 ts 7 sender 0 phase 0 0xb0009=1 children [{type 11 ts 7 sender 0 phase 0}]}");
}
