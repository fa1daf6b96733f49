#pragma once
// Where the platform's events come from: a pool of event objects and of the reference-count
// blocks that share them. An event goes back to the pool when its last strong reference
// goes, with its field and child storage kept, so that once a steady stream of frames has
// been seen, making and dropping events takes nothing from the heap. Ordinary shared
// ownership throughout: the same event may be held, dispatched, returned and made a child
// of another, and weak references see it expire as usual.
//
// Safe to use from any thread; the lists are guarded by a spin lock held for a few
// instructions only. The pool lives for the whole process (it is never destroyed, so events
// released during exit are still taken back).

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <type_traits>

namespace orvane {

class HIDEvent;

class HIDEventPool {
public:
    // A reset event of this type, timestamp and options, from the pool or new.
    static std::shared_ptr<HIDEvent> make(uint32_t type, uint64_t timestamp, uint32_t options);
    // The same, written out where it is called (defined in HIDEvent.h): the creation calls of
    // the frame path use it, so that their events are made without a call into this library.
    static inline std::shared_ptr<HIDEvent> makeInline(uint32_t type, uint64_t timestamp, uint32_t options);

    struct Statistics {
        size_t created = 0;      // event objects ever made
        size_t idle = 0;         // event objects waiting in the pool
        size_t blocksCreated = 0;  // reference-count blocks ever made
        size_t blocksIdle = 0;     // reference-count blocks waiting in the pool
    };
    static Statistics statistics();

    // Room kept in a new event for a list of this many fields and for this many children;
    // more grows the storage, which the event keeps while it is pooled unless it grew beyond
    // the keep limits (which also bound the list of unknown fields kept).
    static constexpr size_t kInitialFields = 12;
    static constexpr size_t kInitialChildren = 6;
    static constexpr size_t kKeepFields = 64;
    static constexpr size_t kKeepChildren = 64;
    // At most this many idle events are kept; more are freed.
    static constexpr size_t kMaxIdleEvents = 4096;

    // The size of a reference-count block the pool keeps; larger requests go to the heap.
    static constexpr size_t kBlockSize = 64;
    static void* allocateBlock(size_t size);
    static void deallocateBlock(void* block, size_t size) noexcept;
    // Takes back an event whose last strong reference went.
    static void recycle(HIDEvent* event) noexcept;

private:
    // A new event, for when none is idle.
    static HIDEvent* newEvent(uint32_t type, uint64_t timestamp, uint32_t options);

    // A block on the idle list.
    struct IdleBlock {
        IdleBlock* next;
    };
    static_assert(kBlockSize >= sizeof(IdleBlock));

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

    struct Guard {
        explicit Guard(SpinLock& l) : lock(l) { lock.lock(); }
        ~Guard() { lock.unlock(); }
        SpinLock& lock;
    };

    struct State {
        SpinLock lock;
        HIDEvent* idleEvents = nullptr;
        IdleBlock* idleBlocks = nullptr;
        size_t created = 0;
        size_t idle = 0;
        size_t blocksCreated = 0;
        // The idle blocks are counted by statistics(), which walks their list: nothing on the
        // frame path keeps a count of them.
    };
    // Constant-initialised and never destroyed (there is nothing to destroy): events may be
    // released by other objects' destructors at exit.
    static State state_;
    static_assert(std::is_trivially_destructible_v<State>);
};

// What a pooled event's last strong reference does: hands the event back to the pool.
struct HIDEventRecycler {
    void operator()(HIDEvent* event) const noexcept { HIDEventPool::recycle(event); }
};

// The allocator of the reference-count blocks of pooled events. It may be given a block
// already taken from the pool, which its first allocation that fits then uses.
template <typename T>
struct HIDEventBlockAllocator {
    using value_type = T;
    HIDEventBlockAllocator() = default;
    explicit HIDEventBlockAllocator(void* block) noexcept : block(block) {}
    template <typename U>
    HIDEventBlockAllocator(const HIDEventBlockAllocator<U>& other) noexcept : block(other.block) {}
    T* allocate(size_t n) {
        if (void* taken = block) {
            block = nullptr;
            if (n * sizeof(T) <= HIDEventPool::kBlockSize) return static_cast<T*>(taken);
            HIDEventPool::deallocateBlock(taken, HIDEventPool::kBlockSize);
        }
        return static_cast<T*>(HIDEventPool::allocateBlock(n * sizeof(T)));
    }
    void deallocate(T* p, size_t n) noexcept { HIDEventPool::deallocateBlock(p, n * sizeof(T)); }
    template <typename U>
    bool operator==(const HIDEventBlockAllocator<U>&) const noexcept { return true; }

    // A pool block not yet handed out, or nullptr.
    void* block = nullptr;
};

}  // namespace orvane
