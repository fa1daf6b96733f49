#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

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

namespace {

// Every selector the platform knows, in ascending order.
std::vector<uint32_t> knownSelectors() {
    std::vector<uint32_t> selectors;
    for (uint32_t type = 0; type <= 0x20; ++type) {
        for (uint32_t index = 0; index <= 0x40; ++index) {
            if (hidFieldIsKnown(hidFieldSelector(type, index))) selectors.push_back(hidFieldSelector(type, index));
        }
    }
    return selectors;
}

}  // namespace

TEST(HIDEvent, EveryKnownFieldReadsZeroUnsetAndKeepsItsKind) {
    const std::vector<uint32_t> selectors = knownSelectors();
    ASSERT_EQ(selectors.size(), 35u);  // 34 numbers and the vendor data
    for (uint32_t selector : selectors) {
        SCOPED_TRACE(testing::Message() << std::hex << "0x" << selector);
        const HIDFieldKind kind = hidFieldKind(selector, HIDFieldKind::Integer);
        auto e = HIDEvent::create(selector >> 16, 0);
        EXPECT_EQ(e->integerValueForField(selector), 0);
        EXPECT_EQ(e->doubleValueForField(selector), 0.0);
        EXPECT_TRUE(e->dataValueForField(selector).empty());
        EXPECT_FALSE(e->hasField(selector));

        e->setDoubleValue(2.9, selector);
        if (kind == HIDFieldKind::Data) {
            EXPECT_FALSE(e->hasField(selector));  // numbers do not go into the data field
            const uint8_t bytes[] = {9, 8};
            e->setDataValue(bytes, 2, selector);
            ASSERT_EQ(e->fields().size(), 1u);
            EXPECT_EQ(e->fields()[0].kind, HIDFieldKind::Data);
            EXPECT_EQ(e->dataValueForField(selector), std::vector<uint8_t>({9, 8}));
            EXPECT_EQ(e->integerValueForField(selector), 0);
            continue;
        }
        ASSERT_TRUE(e->hasField(selector));
        ASSERT_EQ(e->fields().size(), 1u);
        EXPECT_EQ(e->fields()[0].selector, selector);
        EXPECT_EQ(e->fields()[0].kind, kind);
        if (kind == HIDFieldKind::Double) {
            EXPECT_EQ(e->doubleValueForField(selector), 2.9);
            EXPECT_EQ(e->integerValueForField(selector), 2);
        } else {
            EXPECT_EQ(e->integerValueForField(selector), 2);  // truncated when written
            EXPECT_EQ(e->doubleValueForField(selector), 2.0);
        }
        e->setIntegerValue(-7, selector);
        EXPECT_EQ(e->fields()[0].kind, kind);
        EXPECT_EQ(e->integerValueForField(selector), -7);
        EXPECT_EQ(e->doubleValueForField(selector), -7.0);
        // Data never goes into a number field.
        const uint8_t bytes[] = {1};
        e->setDataValue(bytes, 1, selector);
        EXPECT_TRUE(e->dataValueForField(selector).empty());
        EXPECT_EQ(e->integerValueForField(selector), -7);
        EXPECT_EQ(e->fields().size(), 1u);
    }
}

TEST(HIDEvent, UnknownFieldsKeepTheLastSettersKind) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    e->setIntegerValue(5, 0xb000a);
    e->setDoubleValue(-1.75, 0xb000a);
    EXPECT_EQ(e->fields()[0].kind, HIDFieldKind::Double);
    EXPECT_EQ(e->integerValueForField(0xb000a), -1);
    const uint8_t bytes[] = {0xab};
    e->setDataValue(bytes, 1, 0xb000a);
    EXPECT_EQ(e->fields()[0].kind, HIDFieldKind::Data);
    EXPECT_EQ(e->doubleValueForField(0xb000a), 0.0);
    EXPECT_EQ(e->dataValueForField(0xb000a), std::vector<uint8_t>({0xab}));
    e->setIntegerValue(3, 0xb000a);
    EXPECT_EQ(e->integerValueForField(0xb000a), 3);
    EXPECT_TRUE(e->dataValueForField(0xb000a).empty());
    EXPECT_EQ(e->fields().size(), 1u);
}

TEST(HIDEvent, KnownAndOtherFieldsAreListedTogetherInSelectorOrder) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    const uint8_t bytes[] = {1, 2};
    e->setIntegerValue(1, 0x400000);                          // unknown type
    e->setIntegerValue(2, kHIDEventFieldPointerButtonMask);  // 0x110003
    e->setIntegerValue(3, 0xb001c);                          // unknown digitizer index
    e->setIntegerValue(4, kHIDEventFieldDigitizerGenerationCount);
    e->setIntegerValue(5, 0xb000a);
    e->setDoubleValue(0.25, kHIDEventFieldDigitizerX);
    e->setDataValue(bytes, 2, kHIDEventFieldVendorDefinedData);
    e->setIntegerValue(6, kHIDEventFieldVendorDefinedUsagePage);
    e->setIntegerValue(7, 0x5);
    const std::vector<uint32_t> expected = {0x5,     0x10000, 0x10004, 0xb0000, 0xb000a,
                                            0xb001b, 0xb001c, 0x110003, 0x400000};
    ASSERT_EQ(e->fields().size(), expected.size());
    for (size_t i = 0; i < expected.size(); ++i) EXPECT_EQ(e->fields()[i].selector, expected[i]) << i;
    EXPECT_EQ(e->description(),
              "{type 11 ts 0 sender 0 phase 0 0x5=7 0x10000=6 0x10004=<0102> 0xb0000=0.25 0xb000a=5 0xb001b=4 "
              "0xb001c=3 0x110003=2 0x400000=1}");
}

TEST(HIDEvent, TheListOfFieldsFollowsEveryChange) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    const std::vector<HIDEvent::Field>& list = e->fields();
    EXPECT_TRUE(list.empty());
    e->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    EXPECT_EQ(&e->fields(), &list);  // the same storage, listed again
    ASSERT_EQ(list.size(), 1u);
    EXPECT_EQ(list[0].integer, 1);
    e->setIntegerValue(0, kHIDEventFieldDigitizerTouch);
    EXPECT_EQ(e->fields()[0].integer, 0);
    e->setDoubleValue(0.5, 0xb0042);
    ASSERT_EQ(e->fields().size(), 2u);
    EXPECT_EQ(e->fields()[1].real, 0.5);
    auto copy = e->copy();
    ASSERT_EQ(copy->fields().size(), 2u);
    EXPECT_EQ(copy->fields()[1].selector, 0xb0042u);
}

TEST(HIDEvent, ManyFieldsAtOnceAllReadBackInOrder) {
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 0);
    const std::vector<uint32_t> known = knownSelectors();
    std::vector<uint32_t> all = known;
    for (uint32_t i = 0; i < 60; ++i) all.push_back(0x300000 + i * 0x3001);  // unknown, among none of the known
    // Written from the highest selector down, each the index of its place.
    std::vector<uint32_t> sorted = all;
    std::sort(sorted.begin(), sorted.end());
    for (size_t i = sorted.size(); i-- > 0;) {
        const uint8_t byte = static_cast<uint8_t>(i);
        if (sorted[i] == kHIDEventFieldVendorDefinedData) {
            e->setDataValue(&byte, 1, sorted[i]);
        } else {
            e->setIntegerValue(static_cast<int64_t>(i), sorted[i]);
        }
    }
    ASSERT_EQ(e->fields().size(), sorted.size());
    for (size_t i = 0; i < sorted.size(); ++i) {
        EXPECT_EQ(e->fields()[i].selector, sorted[i]);
        if (sorted[i] != kHIDEventFieldVendorDefinedData) {
            EXPECT_EQ(e->integerValueForField(sorted[i]), static_cast<int64_t>(i));
        }
    }
    auto copy = e->copy();
    EXPECT_EQ(copy->description(), e->description());
}
