#pragma once
// Counts heap allocations of the whole process: every global operator new, and (outside
// AddressSanitizer builds, which own malloc) malloc, calloc, realloc and the aligned
// allocators. Linking AllocationCounter.cpp into a program replaces them for that program
// and for every module it loads.

#include <cstdint>

namespace orvane::perf {

struct AllocationCount {
    uint64_t allocations = 0;  // calls that may have taken memory from the heap
    uint64_t bytes = 0;        // bytes asked for
};

AllocationCount allocationCount();
// True when the malloc family is counted too, not only operator new.
bool countsMallocFamily();

}  // namespace orvane::perf
