#include "AllocationCounter.h"

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <new>

#if defined(__SANITIZE_ADDRESS__)
#define ORVANE_COUNT_MALLOC 0
#else
#define ORVANE_COUNT_MALLOC 1
#endif

namespace {

std::atomic<uint64_t> gAllocations{0};
std::atomic<uint64_t> gBytes{0};

inline void count(size_t bytes) {
    gAllocations.fetch_add(1, std::memory_order_relaxed);
    gBytes.fetch_add(bytes, std::memory_order_relaxed);
}

}  // namespace

#if ORVANE_COUNT_MALLOC
// glibc's own entry points, so that the wrappers below neither recurse nor need dlsym.
extern "C" {
void* __libc_malloc(size_t);
void* __libc_calloc(size_t, size_t);
void* __libc_realloc(void*, size_t);
void* __libc_memalign(size_t, size_t);
void __libc_free(void*);

void* malloc(size_t size) {
    count(size);
    return __libc_malloc(size);
}
void* calloc(size_t n, size_t size) {
    count(n * size);
    return __libc_calloc(n, size);
}
void* realloc(void* p, size_t size) {
    count(size);
    return __libc_realloc(p, size);
}
void free(void* p) { __libc_free(p); }
void* memalign(size_t alignment, size_t size) {
    count(size);
    return __libc_memalign(alignment, size);
}
void* aligned_alloc(size_t alignment, size_t size) {
    count(size);
    return __libc_memalign(alignment, size);
}
int posix_memalign(void** out, size_t alignment, size_t size) {
    count(size);
    void* p = __libc_memalign(alignment, size);
    if (!p) return 12;  // ENOMEM
    *out = p;
    return 0;
}
}

namespace {
// operator new counts for itself and takes its memory from glibc directly, so it is not
// counted twice.
inline void* rawAllocate(size_t size) { return __libc_malloc(size ? size : 1); }
inline void* rawAllocateAligned(size_t size, size_t alignment) { return __libc_memalign(alignment, size ? size : 1); }
inline void rawFree(void* p) { __libc_free(p); }
}  // namespace
#else
namespace {
inline void* rawAllocate(size_t size) { return std::malloc(size ? size : 1); }
inline void* rawAllocateAligned(size_t size, size_t alignment) {
    return std::aligned_alloc(alignment, (size + alignment - 1) / alignment * alignment);
}
inline void rawFree(void* p) { std::free(p); }
}  // namespace
#endif

namespace {
void* newOrThrow(size_t size) {
    count(size);
    void* p = rawAllocate(size);
    if (!p) throw std::bad_alloc();
    return p;
}
void* newAlignedOrThrow(size_t size, std::align_val_t alignment) {
    count(size);
    void* p = rawAllocateAligned(size, static_cast<size_t>(alignment));
    if (!p) throw std::bad_alloc();
    return p;
}
void* newNoThrow(size_t size) noexcept {
    count(size);
    return rawAllocate(size);
}
void* newAlignedNoThrow(size_t size, std::align_val_t alignment) noexcept {
    count(size);
    return rawAllocateAligned(size, static_cast<size_t>(alignment));
}
}  // namespace

void* operator new(size_t size) { return newOrThrow(size); }
void* operator new[](size_t size) { return newOrThrow(size); }
void* operator new(size_t size, const std::nothrow_t&) noexcept { return newNoThrow(size); }
void* operator new[](size_t size, const std::nothrow_t&) noexcept { return newNoThrow(size); }
void* operator new(size_t size, std::align_val_t a) { return newAlignedOrThrow(size, a); }
void* operator new[](size_t size, std::align_val_t a) { return newAlignedOrThrow(size, a); }
void* operator new(size_t size, std::align_val_t a, const std::nothrow_t&) noexcept {
    return newAlignedNoThrow(size, a);
}
void* operator new[](size_t size, std::align_val_t a, const std::nothrow_t&) noexcept {
    return newAlignedNoThrow(size, a);
}
void operator delete(void* p) noexcept { rawFree(p); }
void operator delete[](void* p) noexcept { rawFree(p); }
void operator delete(void* p, size_t) noexcept { rawFree(p); }
void operator delete[](void* p, size_t) noexcept { rawFree(p); }
void operator delete(void* p, std::align_val_t) noexcept { rawFree(p); }
void operator delete[](void* p, std::align_val_t) noexcept { rawFree(p); }
void operator delete(void* p, size_t, std::align_val_t) noexcept { rawFree(p); }
void operator delete[](void* p, size_t, std::align_val_t) noexcept { rawFree(p); }
void operator delete(void* p, const std::nothrow_t&) noexcept { rawFree(p); }
void operator delete[](void* p, const std::nothrow_t&) noexcept { rawFree(p); }

namespace orvane::perf {

AllocationCount allocationCount() {
    return AllocationCount{gAllocations.load(std::memory_order_relaxed), gBytes.load(std::memory_order_relaxed)};
}

bool countsMallocFamily() { return ORVANE_COUNT_MALLOC != 0; }

}  // namespace orvane::perf
