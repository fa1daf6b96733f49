// libFuzzer's entry point for one target; ORVANE_FUZZ_ENTRY names the target's function.

#include <cstddef>
#include <cstdint>

#include "FuzzTargets.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    return orvane::fuzz::ORVANE_FUZZ_ENTRY(data, size);
}
