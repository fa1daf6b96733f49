// Pooled events behave as events always did: shared by every holder, recycled only when the
// last strong reference goes, reset when they come back.

#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "platform/HIDEvent.h"
#include "platform/HIDEventPool.h"

namespace orvane {
namespace {

TEST(HIDEventPool, ReleasedEventComesBackResetAndEmpty) {
    HIDEventRef first = HIDEvent::create(kHIDEventTypeDigitizer, 100, 3);
    first->setSenderID(7);
    first->setPhase(kHIDDigitizerEventTouch);
    first->setIntegerValue(4, kHIDEventFieldDigitizerIndex);
    first->appendEvent(HIDEvent::create(kHIDEventTypeDigitizer, 100));
    const HIDEvent* address = first.get();
    first.reset();

    // The pool hands out the event it took back last.
    HIDEventRef second = HIDEvent::scrollEvent(200, 1.5, 0.0, 0.0, 0);
    EXPECT_EQ(second.get(), address);
    EXPECT_EQ(second->type(), static_cast<uint32_t>(kHIDEventTypeScroll));
    EXPECT_EQ(second->timestamp(), 200u);
    EXPECT_EQ(second->options(), 0u);
    EXPECT_EQ(second->senderID(), 0u);
    EXPECT_EQ(second->phase(), 0);
    EXPECT_TRUE(second->children().empty());
    ASSERT_EQ(second->fields().size(), 3u);  // scroll x, y, z and nothing left over
    EXPECT_EQ(second->doubleValueForField(kHIDEventFieldScrollX), 1.5);
    EXPECT_FALSE(second->hasField(kHIDEventFieldDigitizerIndex));
}

TEST(HIDEventPool, ChildStaysAliveWhileItsParentHoldsIt) {
    HIDEventRef parent = HIDEvent::create(kHIDEventTypePointer, 1);
    HIDEventRef child = HIDEvent::create(kHIDEventTypeDigitizer, 1);
    child->setIntegerValue(9, kHIDEventFieldDigitizerIndex);
    parent->appendEvent(child);
    const size_t idle = HIDEventPool::statistics().idle;
    child.reset();
    EXPECT_EQ(HIDEventPool::statistics().idle, idle);  // the parent still holds it
    EXPECT_EQ(parent->children()[0]->integerValueForField(kHIDEventFieldDigitizerIndex), 9);
    parent.reset();
    EXPECT_EQ(HIDEventPool::statistics().idle, idle + 2);  // both came back
}

TEST(HIDEventPool, SameEventHeldTwiceIsOneObject) {
    // A tap dispatches the pointer event and returns the same one, changed afterwards.
    HIDEventRef pointer = HIDEvent::pointerEvent(5, 0.0, 0.0, 0.0, 0, 0);
    HIDEventRef dispatched = pointer;
    pointer->setIntegerValue(1, kHIDEventFieldPointerButtonMask);
    EXPECT_EQ(dispatched.get(), pointer.get());
    EXPECT_EQ(dispatched->integerValueForField(kHIDEventFieldPointerButtonMask), 1);
    const size_t idle = HIDEventPool::statistics().idle;
    pointer.reset();
    EXPECT_EQ(HIDEventPool::statistics().idle, idle);
    EXPECT_EQ(dispatched->timestamp(), 5u);
}

TEST(HIDEventPool, WeakReferenceExpiresWhenTheEventIsTakenBack) {
    HIDEventRef event = HIDEvent::create(kHIDEventTypeButton, 1);
    std::weak_ptr<HIDEvent> weak = event;
    EXPECT_FALSE(weak.expired());
    event.reset();
    EXPECT_TRUE(weak.expired());
    EXPECT_EQ(weak.lock(), nullptr);
    // A new event from the pool does not bring the weak reference back.
    HIDEventRef again = HIDEvent::create(kHIDEventTypeButton, 2);
    EXPECT_TRUE(weak.expired());
}

TEST(HIDEventPool, CopyIsDeepAndPooled) {
    HIDEventRef frame = HIDEvent::create(kHIDEventTypeDigitizer, 10);
    HIDEventRef contact = HIDEvent::create(kHIDEventTypeDigitizer, 10);
    contact->setDoubleValue(0.25, kHIDEventFieldDigitizerX);
    frame->appendEvent(contact);
    HIDEventRef copy = frame->copy();
    ASSERT_EQ(copy->children().size(), 1u);
    EXPECT_NE(copy->children()[0].get(), contact.get());
    copy->children()[0]->setDoubleValue(0.5, kHIDEventFieldDigitizerX);
    EXPECT_EQ(contact->doubleValueForField(kHIDEventFieldDigitizerX), 0.25);
    const size_t idle = HIDEventPool::statistics().idle;
    copy.reset();
    EXPECT_EQ(HIDEventPool::statistics().idle, idle + 2);
}

TEST(HIDEventPool, StorageThatGrewPastTheLimitIsNotKept) {
    HIDEventRef big = HIDEvent::create(17, 1);
    // Unknown selectors of type 0x40: a hundred fields, far more than any event has.
    for (uint32_t i = 0; i < 100; ++i) big->setIntegerValue(i, 0x400000 + i);
    ASSERT_GE(big->fields().capacity(), 100u);
    big.reset();
    HIDEventRef next = HIDEvent::create(17, 2);
    EXPECT_TRUE(next->fields().empty());
    EXPECT_LE(next->fields().capacity(), HIDEventPool::kKeepFields);
}

TEST(HIDEventPool, FieldsWrittenOutOfOrderStayInSelectorOrder) {
    HIDEventRef e = HIDEvent::create(kHIDEventTypeDigitizer, 1);
    e->setIntegerValue(5, kHIDEventFieldDigitizerTouch);       // 0xb0009
    e->setDoubleValue(0.5, kHIDEventFieldDigitizerX);          // 0xb0000, before it
    e->setIntegerValue(2, kHIDEventFieldDigitizerIdentity);    // 0xb0006, between
    e->setIntegerValue(6, kHIDEventFieldDigitizerTouch);       // rewritten in place
    ASSERT_EQ(e->fields().size(), 3u);
    EXPECT_EQ(e->fields()[0].selector, static_cast<uint32_t>(kHIDEventFieldDigitizerX));
    EXPECT_EQ(e->fields()[1].selector, static_cast<uint32_t>(kHIDEventFieldDigitizerIdentity));
    EXPECT_EQ(e->fields()[2].selector, static_cast<uint32_t>(kHIDEventFieldDigitizerTouch));
    EXPECT_EQ(e->integerValueForField(kHIDEventFieldDigitizerTouch), 6);
}

TEST(HIDEventPool, EveryKindOfFieldIsGoneWhenTheEventComesBack) {
    HIDEventRef first = HIDEvent::create(kHIDEventTypeVendorDefined, 1);
    const uint8_t bytes[] = {7, 7, 7};
    first->setDataValue(bytes, sizeof bytes, kHIDEventFieldVendorDefinedData);
    first->setIntegerValue(3, kHIDEventFieldVendorDefinedUsage);
    first->setDoubleValue(-0.0, kHIDEventFieldScrollY);
    first->setIntegerValue(9, 0xb0042);
    ASSERT_EQ(first->fields().size(), 4u);
    const HIDEvent* address = first.get();
    first.reset();
    HIDEventRef second = HIDEvent::create(kHIDEventTypeVendorDefined, 2);
    ASSERT_EQ(second.get(), address);
    EXPECT_TRUE(second->fields().empty());
    EXPECT_TRUE(second->dataValueForField(kHIDEventFieldVendorDefinedData).empty());
    EXPECT_FALSE(second->hasField(kHIDEventFieldVendorDefinedUsage));
    EXPECT_FALSE(second->hasField(kHIDEventFieldScrollY));
    EXPECT_FALSE(second->hasField(0xb0042));
    EXPECT_EQ(second->integerValueForField(0xb0042), 0);
    EXPECT_EQ(second->description(), "{type 1 ts 2 sender 0 phase 0}");
}

TEST(HIDEventPool, MakingAWarmEventTakesOneIdleEventAndOneIdleBlock) {
    // Warm: an event and its block made and given back.
    HIDEvent::create(kHIDEventTypePointer, 1).reset();
    const HIDEventPool::Statistics before = HIDEventPool::statistics();
    ASSERT_GE(before.idle, 1u);
    ASSERT_GE(before.blocksIdle, 1u);
    HIDEventRef e = HIDEvent::pointerEvent(2, 1.0, 2.0, 0.0, 0, 0);
    std::weak_ptr<HIDEvent> weak = e;
    const HIDEventPool::Statistics during = HIDEventPool::statistics();
    EXPECT_EQ(during.created, before.created);
    EXPECT_EQ(during.blocksCreated, before.blocksCreated);
    EXPECT_EQ(during.idle, before.idle - 1);
    EXPECT_EQ(during.blocksIdle, before.blocksIdle - 1);
    e.reset();
    // The event is back at once, its block once the weak reference goes too.
    EXPECT_EQ(HIDEventPool::statistics().idle, before.idle);
    EXPECT_EQ(HIDEventPool::statistics().blocksIdle, before.blocksIdle - 1);
    weak.reset();
    EXPECT_EQ(HIDEventPool::statistics().blocksIdle, before.blocksIdle);
}

TEST(HIDEventPool, WrittenOutAndLibraryFormsShareOnePool) {
    // An event made where it is called goes back to the pool the library's make draws from,
    // and the other way round.
    HIDEventRef inlined = HIDEventPool::makeInline(kHIDEventTypeScroll, 3, 5);
    const HIDEvent* address = inlined.get();
    EXPECT_EQ(inlined->type(), static_cast<uint32_t>(kHIDEventTypeScroll));
    EXPECT_EQ(inlined->timestamp(), 3u);
    EXPECT_EQ(inlined->options(), 5u);
    inlined->setIntegerValue(4, kHIDEventFieldDigitizerIndex);
    inlined.reset();
    HIDEventRef made = HIDEventPool::make(kHIDEventTypePointer, 4, 0);
    EXPECT_EQ(made.get(), address);
    EXPECT_FALSE(made->hasField(kHIDEventFieldDigitizerIndex));
    EXPECT_EQ(made->type(), static_cast<uint32_t>(kHIDEventTypePointer));
    made.reset();
    const HIDEventPool::Statistics before = HIDEventPool::statistics();
    HIDEventRef again = HIDEvent::scrollEvent(6, 1.0, 2.0, 0.0, 0);
    EXPECT_EQ(again.get(), address);
    EXPECT_EQ(HIDEventPool::statistics().created, before.created);
    EXPECT_EQ(HIDEventPool::statistics().blocksCreated, before.blocksCreated);
    again.reset();
    EXPECT_EQ(HIDEventPool::statistics().idle, before.idle);
    EXPECT_EQ(HIDEventPool::statistics().blocksIdle, before.blocksIdle);
}

TEST(HIDEventPool, AllocatorGivenABlockUsesItOnceThenAsksThePool) {
    void* block = HIDEventPool::allocateBlock(HIDEventPool::kBlockSize);
    HIDEventBlockAllocator<uint64_t> allocator(block);
    uint64_t* first = allocator.allocate(2);
    EXPECT_EQ(static_cast<void*>(first), block);
    EXPECT_EQ(allocator.block, nullptr);
    uint64_t* second = allocator.allocate(2);
    EXPECT_NE(second, first);
    allocator.deallocate(first, 2);
    allocator.deallocate(second, 2);
    // A block too small for the request goes back to the pool and a large one comes from the heap.
    const size_t idleBlocks = HIDEventPool::statistics().blocksIdle;
    HIDEventBlockAllocator<uint64_t> small(HIDEventPool::allocateBlock(8));
    EXPECT_EQ(HIDEventPool::statistics().blocksIdle, idleBlocks - 1);
    uint64_t* large = small.allocate(HIDEventPool::kBlockSize);
    EXPECT_EQ(HIDEventPool::statistics().blocksIdle, idleBlocks);
    small.deallocate(large, HIDEventPool::kBlockSize);
}

TEST(HIDEventPool, EventsMadeAndDroppedOnSeveralThreadsAllComeBack) {
    auto work = [] {
        for (int i = 0; i < 20000; ++i) {
            HIDEventRef parent = HIDEvent::pointerEvent(static_cast<uint64_t>(i), 1.0, 2.0, 0.0, 0, 0);
            parent->appendEvent(HIDEvent::scrollEvent(static_cast<uint64_t>(i), 0.0, 1.0, 0.0, 0));
            ASSERT_EQ(parent->children()[0]->doubleValueForField(kHIDEventFieldScrollY), 1.0);
        }
    };
    std::thread a(work), b(work);
    a.join();
    b.join();
    const HIDEventPool::Statistics s = HIDEventPool::statistics();
    // Nothing is held any more: every event made is idle (none was over the idle limit).
    EXPECT_EQ(s.idle, s.created);
    EXPECT_EQ(s.blocksIdle, s.blocksCreated);
}

}  // namespace
}  // namespace orvane
