// Per-frame cost of the filter's event entry: time, instructions (under callgrind) and heap
// allocations per frame, for made-up hands and for recordings.
//
//   orvane_frame_bench [benchmark options] [--recording=PATH ...]
//       Google Benchmark cases: the made-up hands, and every recording named (the
//       demonstration session when none is). Counters: ns_per_frame, frames_per_s,
//       allocs_per_frame.
//   orvane_frame_bench --count CASE FRAMES
//       Warms the filter up, then passes FRAMES prepared frames through the event entry with
//       callgrind's collection on around the calls only; prints "CASE FRAMES ALLOCATIONS".
//       CASE is a made-up hand or a recording's path. Run it under
//       valgrind --tool=callgrind --collect-atstart=no (scripts/callgrind-frames does).
//   orvane_frame_bench --soak CASE FRAMES
//       Passes FRAMES frames one by one and prints the resident memory every tenth of the way.

#include <benchmark/benchmark.h>
// The client requests cost a few instructions when the program does not run under valgrind;
// without valgrind's headers they are left out and --count measures nothing.
#if __has_include(<valgrind/callgrind.h>)
#include <valgrind/callgrind.h>
#else
#define CALLGRIND_START_INSTRUMENTATION
#define CALLGRIND_TOGGLE_COLLECT
#endif

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <string>
#include <vector>

#include "bench/support/AllocationCounter.h"
#include "bench/support/PerfDriver.h"
#include "bench/support/PerfFrames.h"
#include "platform/Logging.h"

#ifndef ORVANE_DEMO_RECORDING
#define ORVANE_DEMO_RECORDING "data/demo.frames.jsonl"
#endif

using namespace orvane;
using namespace orvane::perf;

namespace {

// The filter's log lines are formatted as usual and then dropped, so that the figures do
// not depend on a terminal.
class DroppingLogSink : public LogSink {
public:
    void write(const LogRecord&) override {}
};

// Frames passed before anything is measured, so that the hand is in its steady state and
// every pool has grown to what the hand needs.
constexpr int kWarmUpFrames = 600;
// Frames prepared, then timed together.
constexpr size_t kBatchFrames = 256;

std::string baseName(const std::string& path) {
    std::string name = path.substr(path.find_last_of('/') + 1);
    for (const char* suffix : {".frames.jsonl", ".jsonl"}) {
        const size_t n = std::strlen(suffix);
        if (name.size() > n && name.compare(name.size() - n, n, suffix) == 0) return name.substr(0, name.size() - n);
    }
    return name;
}

// A source for a case: a made-up hand by name, else a recording by path.
std::unique_ptr<FrameSource> sourceFor(const std::string& name, std::string* error) {
    if (auto source = makeMadeUpSource(name)) return source;
    formats::FrameRecording recording;
    if (!formats::readFrameRecordingFile(name, &recording, error)) return nullptr;
    return makeRecordingSource(std::move(recording));
}

bool openFor(PerfDriver& driver, FrameSource& source, std::string* error) {
    if (!driver.open(source.service(), error)) return false;
    for (int i = 0; i < kWarmUpFrames; ++i) {
        HIDEventRef result = driver.feed(source.next());
        benchmark::DoNotOptimize(result);
    }
    return true;
}

// The records of the next batch: frames, and the rare property record between them.
void prepare(FrameSource& source, std::vector<FrameSource::Record>& batch, size_t frames) {
    batch.clear();
    size_t n = 0;
    while (n < frames) {
        batch.push_back(source.next());
        if (batch.back().event) ++n;
    }
}

void runCase(benchmark::State& state, const std::string& name) {
    std::string error;
    std::unique_ptr<FrameSource> source = sourceFor(name, &error);
    PerfDriver driver;
    if (!source || !openFor(driver, *source, &error)) {
        state.SkipWithError(error.c_str());
        return;
    }
    std::vector<FrameSource::Record> batch;
    std::vector<HIDEventRef> results;
    batch.reserve(kBatchFrames * 2);
    results.reserve(kBatchFrames * 2);
    // One batch as it will be measured, so that the pools hold what a batch needs: the
    // prepared frames and the results are all alive at the end of one.
    prepare(*source, batch, kBatchFrames);
    for (const FrameSource::Record& record : batch) results.push_back(driver.feed(record));
    results.clear();
    double seconds = 0.0;
    uint64_t frames = 0;
    uint64_t allocations = 0;
    for (auto _ : state) {
        prepare(*source, batch, kBatchFrames);
        results.clear();
        const AllocationCount before = allocationCount();
        const auto t0 = std::chrono::steady_clock::now();
        for (const FrameSource::Record& record : batch) results.push_back(driver.feed(record));
        const auto t1 = std::chrono::steady_clock::now();
        const AllocationCount after = allocationCount();
        // The results vector never grows inside the timed part (reserved), so every
        // allocation counted here is the filter's.
        allocations += after.allocations - before.allocations;
        const double elapsed = std::chrono::duration<double>(t1 - t0).count();
        state.SetIterationTime(elapsed);
        seconds += elapsed;
        frames += kBatchFrames;
        results.clear();
    }
    if (frames == 0) return;
    state.counters["ns_per_frame"] = seconds * 1e9 / static_cast<double>(frames);
    state.counters["frames_per_s"] = static_cast<double>(frames) / seconds;
    state.counters["allocs_per_frame"] = static_cast<double>(allocations) / static_cast<double>(frames);
}

int countMode(const std::string& name, long frames) {
    std::string error;
    std::unique_ptr<FrameSource> source = sourceFor(name, &error);
    PerfDriver driver;
    if (!source || !openFor(driver, *source, &error)) {
        std::fprintf(stderr, "orvane_frame_bench: %s\n", error.c_str());
        return 1;
    }
    // Rounds of one batch each: the batch is prepared, then passed with collection on.
    // One unmeasured round first, so that the pools hold what a round needs.
    std::vector<FrameSource::Record> batch;
    std::vector<HIDEventRef> results;
    batch.reserve(kBatchFrames * 2);
    results.reserve(kBatchFrames * 2);
    prepare(*source, batch, kBatchFrames);
    for (const FrameSource::Record& record : batch) results.push_back(driver.feed(record));
    results.clear();
    CALLGRIND_START_INSTRUMENTATION;
    AllocationCount counted{};
    for (long done = 0; done < frames;) {
        const size_t round = static_cast<size_t>(std::min<long>(frames - done, static_cast<long>(kBatchFrames)));
        prepare(*source, batch, round);
        const AllocationCount before = allocationCount();
        CALLGRIND_TOGGLE_COLLECT;
        for (const FrameSource::Record& record : batch) results.push_back(driver.feed(record));
        CALLGRIND_TOGGLE_COLLECT;
        const AllocationCount after = allocationCount();
        counted.allocations += after.allocations - before.allocations;
        results.clear();
        done += static_cast<long>(round);
    }
    const AllocationCount before{}, after = counted;
    std::printf("%s %ld %llu\n", baseName(name).c_str(), frames,
                static_cast<unsigned long long>(after.allocations - before.allocations));
    return 0;
}

long residentKiB() {
    std::ifstream status("/proc/self/status");
    std::string line;
    while (std::getline(status, line)) {
        if (line.rfind("VmRSS:", 0) == 0) return std::strtol(line.c_str() + 6, nullptr, 10);
    }
    return -1;
}

int soakMode(const std::string& name, long frames) {
    std::string error;
    std::unique_ptr<FrameSource> source = sourceFor(name, &error);
    PerfDriver driver;
    if (!source || !openFor(driver, *source, &error)) {
        std::fprintf(stderr, "orvane_frame_bench: %s\n", error.c_str());
        return 1;
    }
    const long step = frames / 10 > 0 ? frames / 10 : 1;
    std::printf("%-12s %-12s %s\n", "frames", "rss_KiB", "allocations");
    const AllocationCount start = allocationCount();
    std::printf("%-12d %-12ld %llu\n", 0, residentKiB(), 0ULL);
    for (long i = 1; i <= frames; ++i) {
        FrameSource::Record record = source->next();
        HIDEventRef result = driver.feed(record);
        benchmark::DoNotOptimize(result);
        if (i % step == 0) {
            std::printf("%-12ld %-12ld %llu\n", i, residentKiB(),
                        static_cast<unsigned long long>(allocationCount().allocations - start.allocations));
            std::fflush(stdout);
        }
    }
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    Logging::setSink(std::make_shared<DroppingLogSink>());
    if (argc == 4 && (std::strcmp(argv[1], "--count") == 0 || std::strcmp(argv[1], "--soak") == 0)) {
        const long frames = std::strtol(argv[3], nullptr, 10);
        if (frames <= 0) {
            std::fprintf(stderr, "orvane_frame_bench: FRAMES must be a positive number\n");
            return 2;
        }
        return std::strcmp(argv[1], "--count") == 0 ? countMode(argv[2], frames) : soakMode(argv[2], frames);
    }

    std::vector<std::string> recordings;
    std::vector<char*> rest;
    for (int i = 0; i < argc; ++i) {
        if (i > 0 && std::strncmp(argv[i], "--recording=", 12) == 0) {
            recordings.emplace_back(argv[i] + 12);
        } else {
            rest.push_back(argv[i]);
        }
    }
    if (recordings.empty()) recordings.emplace_back(ORVANE_DEMO_RECORDING);
    int restCount = static_cast<int>(rest.size());
    benchmark::Initialize(&restCount, rest.data());

    std::vector<std::string> cases = madeUpCaseNames();
    cases.insert(cases.end(), recordings.begin(), recordings.end());
    for (const std::string& name : cases) {
        benchmark::RegisterBenchmark(("frames/" + baseName(name)).c_str(), runCase, name)->UseManualTime();
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
