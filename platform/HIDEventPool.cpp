#include "HIDEventPool.h"

#include <atomic>
#include <new>
#include <thread>
#include <type_traits>

#include "HIDEvent.h"

namespace orvane {

namespace {

// A block on the idle list.
struct IdleBlock {
    IdleBlock* next;
};
static_assert(HIDEventPool::kBlockSize >= sizeof(IdleBlock));

class SpinLock {
public:
    void lock() noexcept {
        if (flag_.test_and_set(std::memory_order_acquire)) waitAndLock(flag_);
    }
    void unlock() noexcept { flag_.clear(std::memory_order_release); }

private:
    // Held by another thread: yields until it is free and takes it. Kept apart from lock()
    // so that the uncontended path needs no registers saved.
    static void waitAndLock(std::atomic_flag& flag) noexcept;

    std::atomic_flag flag_ = ATOMIC_FLAG_INIT;
};

void SpinLock::waitAndLock(std::atomic_flag& flag) noexcept {
    do {
        while (flag.test(std::memory_order_relaxed)) std::this_thread::yield();
    } while (flag.test_and_set(std::memory_order_acquire));
}

struct PoolState {
    SpinLock lock;
    HIDEvent* idleEvents = nullptr;
    IdleBlock* idleBlocks = nullptr;
    size_t created = 0;
    size_t idle = 0;
    size_t blocksCreated = 0;
    size_t blocksIdle = 0;
};

// Constant-initialised and never destroyed (there is nothing to destroy): events may be
// released by other objects' destructors at exit.
static_assert(std::is_trivially_destructible_v<PoolState>);
constinit PoolState poolState;
PoolState& state() { return poolState; }

struct Guard {
    explicit Guard(SpinLock& l) : lock(l) { lock.lock(); }
    ~Guard() { lock.unlock(); }
    SpinLock& lock;
};

struct Recycler {
    void operator()(HIDEvent* event) const noexcept { HIDEventPool::recycle(event); }
};

}  // namespace

void* HIDEventPool::allocateBlock(size_t size) {
    if (size <= kBlockSize) {
        PoolState& s = state();
        Guard guard(s.lock);
        if (IdleBlock* block = s.idleBlocks) {
            s.idleBlocks = block->next;
            --s.blocksIdle;
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
    PoolState& s = state();
    Guard guard(s.lock);
    auto* idle = static_cast<IdleBlock*>(block);
    idle->next = s.idleBlocks;
    s.idleBlocks = idle;
    ++s.blocksIdle;
}

void HIDEventPool::recycle(HIDEvent* event) noexcept {
    // Releasing the children may recycle them in turn, so it happens outside the lock.
    event->resetForPool();
    PoolState& s = state();
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
    PoolState& s = state();
    HIDEvent* event;
    void* block = nullptr;
    {
        // An idle event and the block that will count its references, under one lock.
        Guard guard(s.lock);
        if ((event = s.idleEvents) != nullptr) {
            s.idleEvents = event->poolNext_;
            --s.idle;
            if (IdleBlock* idle = s.idleBlocks) {
                s.idleBlocks = idle->next;
                --s.blocksIdle;
                block = idle;
            }
        } else {
            ++s.created;
        }
    }
    if (event) {
        event->poolNext_ = nullptr;
        event->type_ = type;
        event->options_ = options;
        event->timestamp_ = timestamp;
    } else {
        event = newEvent(type, timestamp, options);
    }
    // Without a block taken here the allocator gets one from allocateBlock.
    return std::shared_ptr<HIDEvent>(event, Recycler{}, HIDEventBlockAllocator<HIDEvent>(block));
}

HIDEventPool::Statistics HIDEventPool::statistics() {
    PoolState& s = state();
    Guard guard(s.lock);
    return Statistics{s.created, s.idle, s.blocksCreated, s.blocksIdle};
}

}  // namespace orvane
