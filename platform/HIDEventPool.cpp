#include "HIDEventPool.h"

#include <atomic>
#include <new>
#include <thread>
#include <type_traits>

#include "HIDEvent.h"

namespace orvane {

constinit HIDEventPool::State HIDEventPool::state_;

void HIDEventPool::SpinLock::waitAndLock(std::atomic_flag& flag) noexcept {
    do {
        while (flag.test(std::memory_order_relaxed)) std::this_thread::yield();
    } while (flag.test_and_set(std::memory_order_acquire));
}

void* HIDEventPool::allocateBlock(size_t size) {
    if (size <= kBlockSize) {
        State& s = state_;
        Guard guard(s.lock);
        if (IdleBlock* block = s.idleBlocks) {
            s.idleBlocks = block->next;
            return block;
        }
        ++s.blocksCreated;
    }
    return ::operator new(size <= kBlockSize ? kBlockSize : size);
}

void HIDEventPool::deallocateBlock(void* block, size_t size) noexcept {
    if (size > kBlockSize) {
        ::operator delete(block);
        return;
    }
    State& s = state_;
    Guard guard(s.lock);
    auto* idle = static_cast<IdleBlock*>(block);
    idle->next = s.idleBlocks;
    s.idleBlocks = idle;
}

void HIDEventPool::recycle(HIDEvent* event) noexcept {
    // Releasing the children may recycle them in turn, so it happens outside the lock.
    event->resetForPool();
    State& s = state_;
    {
        Guard guard(s.lock);
        if (s.idle < kMaxIdleEvents) {
            event->poolNext_ = s.idleEvents;
            s.idleEvents = event;
            ++s.idle;
            return;
        }
        --s.created;
    }
    delete event;
}

HIDEvent* HIDEventPool::newEvent(uint32_t type, uint64_t timestamp, uint32_t options) {
    auto* event = new HIDEvent(type, timestamp, options);
    event->list_.reserve(kInitialFields);
    event->children_.reserve(kInitialChildren);
    return event;
}

std::shared_ptr<HIDEvent> HIDEventPool::make(uint32_t type, uint64_t timestamp, uint32_t options) {
    return makeInline(type, timestamp, options);
}

HIDEventPool::Statistics HIDEventPool::statistics() {
    State& s = state_;
    Guard guard(s.lock);
    size_t blocksIdle = 0;
    for (const IdleBlock* block = s.idleBlocks; block; block = block->next) ++blocksIdle;
    return Statistics{s.created, s.idle, s.blocksCreated, blocksIdle};
}

}  // namespace orvane
