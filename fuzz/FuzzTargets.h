#pragma once
// The entry functions of the fuzz targets. Each takes one input of any bytes and returns 0;
// a broken rule aborts. The libFuzzer programs call them from LLVMFuzzerTestOneInput, and the
// robustness tests feed them every file of the seed corpora, so the corpora replay in every
// test run with the ordinary compiler too.

#include <cstddef>
#include <cstdint>

namespace orvane::fuzz {

// One HID event as JSON: read it; what reads must write and read back to the same text.
int fuzzEventJson(const uint8_t* data, size_t size);

// A whole frame recording: read it; what reads must write and read back to the same text.
int fuzzFrameRecording(const uint8_t* data, size_t size);

// The filter fed a session decoded from the bytes (see FrameDecoder.h): frames with any
// children and any field values, other events, property records and client notifications.
int fuzzFilterFrames(const uint8_t* data, size_t size);

// An evemu recording of a touchpad: read and converted into frames, as it is and as a
// keyboard cover's trackpad of a given size; what converts must write and read back.
int fuzzEvemu(const uint8_t* data, size_t size);

// A gesture script: read and turned into frames; what is accepted must write and read back.
int fuzzGestureScript(const uint8_t* data, size_t size);

// Called when a rule the target checks is broken: prints the rule and aborts.
[[noreturn]] void fuzzFinding(const char* rule);

}  // namespace orvane::fuzz
