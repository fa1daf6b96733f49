// orvane_soak: a long random session through the loaded plug-in, with the resident memory
// sampled as it goes. Run in a build with AddressSanitizer (the debug preset), its
// LeakSanitizer checks at exit that nothing the filter made was left behind; the samples
// show that nothing piles up while the filter runs either.
//
//   orvane_soak [--frames N] [--seed S] [--wireless] [--samples K] [--max-growth-mb M] [--plugin PATH]
//
// Frames and other records come from RandomSession. The resident size is read from
// /proc/self/statm K times over the run; after the first tenth of the frames (when every
// pool and cache has reached its size) it may grow by at most M MiB. Exit 0 when every
// check holds; 1 with one line saying what failed otherwise.

#include <unistd.h>

#include <chrono>
#include <cinttypes>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "RandomSession.h"
#include "platform/HIDEventDispatcher.h"
#include "platform/HIDEventService.h"
#include "platform/Logging.h"
#include "tools/host/PlugInHost.h"

namespace {

using namespace orvane;

// Every log line is formatted by the filter and dropped here, counted by level.
class CountingLogSink : public LogSink {
public:
    void write(const LogRecord& record) override { ++counts[static_cast<int>(record.level)]; }
    uint64_t counts[3] = {0, 0, 0};
};

double residentMiB() {
    FILE* f = std::fopen("/proc/self/statm", "r");
    if (!f) return 0.0;
    unsigned long size = 0, resident = 0;
    const int read = std::fscanf(f, "%lu %lu", &size, &resident);
    std::fclose(f);
    if (read != 2) return 0.0;
    return static_cast<double>(resident) * static_cast<double>(::sysconf(_SC_PAGESIZE)) / (1024.0 * 1024.0);
}

int usage(const char* message) {
    std::fprintf(stderr, "orvane_soak: %s\nusage: orvane_soak [--frames N] [--seed S] [--wireless] [--samples K] "
                         "[--max-growth-mb M] [--plugin PATH]\n", message);
    return 2;
}

}  // namespace

int main(int argc, char** argv) {
    uint64_t frames = 1000000;
    uint64_t seed = 1;
    bool wireless = false;
    int samples = 20;
    double maxGrowthMiB = 16.0;
    std::string plugIn = ORVANE_PLUGIN_MODULE;
    for (int i = 1; i < argc; ++i) {
        const std::string arg = argv[i];
        const bool hasValue = i + 1 < argc;
        if (arg == "--frames" && hasValue) frames = std::strtoull(argv[++i], nullptr, 10);
        else if (arg == "--seed" && hasValue) seed = std::strtoull(argv[++i], nullptr, 10);
        else if (arg == "--samples" && hasValue) samples = std::atoi(argv[++i]);
        else if (arg == "--max-growth-mb" && hasValue) maxGrowthMiB = std::atof(argv[++i]);
        else if (arg == "--plugin" && hasValue) plugIn = argv[++i];
        else if (arg == "--wireless") wireless = true;
        else return usage(("unknown argument " + arg).c_str());
    }
    if (frames < 10 || samples < 2) return usage("at least 10 frames and 2 samples");

    auto logs = std::make_shared<CountingLogSink>();
    Logging::setSink(logs);

    robust::RandomSession session(seed, wireless);
    const formats::FrameRecordingHeader header = session.header();
    auto service = std::make_shared<HIDEventService>(header.service.usagePairs, header.service.properties);
    uint64_t dispatched = 0;
    auto dispatcher = std::make_shared<CallbackEventDispatcher>([&](const HIDEventRef& event) {
        if (event) ++dispatched;
    });
    std::string error;
    std::vector<std::pair<uint64_t, double>> rss;
    uint64_t frameCount = 0, records = 0, returned = 0, none = 0, properties = 0;
    const auto start = std::chrono::steady_clock::now();
    {
        host::PlugInHost host;
        if (!host.open(plugIn, {}, service, {}, dispatcher, &error)) {
            std::fprintf(stderr, "orvane_soak: %s\n", error.c_str());
            return 1;
        }
        std::map<uint64_t, HIDConnectionRef> clients;
        HIDConnectionRef client;
        const uint64_t sampleEvery = frames / static_cast<uint64_t>(samples - 1);
        rss.emplace_back(0, residentMiB());
        while (frameCount < frames) {
            formats::InputRecord record = session.next();
            ++records;
            bool ok = true;
            switch (record.kind) {
            case formats::InputRecord::Kind::Event: {
                HIDEventRef result;
                ok = host.filterEvent(record.event, &result, &error);
                result ? ++returned : ++none;
                if (record.event->type() == kHIDEventTypeDigitizer && ++frameCount % sampleEvery == 0)
                    rss.emplace_back(frameCount, residentMiB());
                break;
            }
            case formats::InputRecord::Kind::SetProperty: {
                bool accepted = false;
                ok = host.setProperty(record.propertyValue, record.propertyKey, client, &accepted, &error);
                ++properties;
                break;
            }
            case formats::InputRecord::Kind::Client: {
                HIDConnectionRef& c = clients[record.clientID];
                if (!c) c = std::make_shared<HIDConnection>(record.clientID);
                client = record.clientAdded ? c : nullptr;
                ok = host.clientNotification(c, record.clientAdded, &error);
                break;
            }
            }
            if (!ok) {
                std::fprintf(stderr, "orvane_soak: record %" PRIu64 ": %s\n", records - 1, error.c_str());
                return 1;
            }
        }
        if (!host.cancel(&error)) {
            std::fprintf(stderr, "orvane_soak: %s\n", error.c_str());
            return 1;
        }
        host.unload();
    }
    const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    Logging::setSink(std::make_shared<StandardErrorLogSink>());

    std::printf("soak: %" PRIu64 " frames (%" PRIu64 " records) in %.1f s, %.2f us a frame\n", frameCount, records,
                seconds, seconds * 1e6 / static_cast<double>(frameCount));
    std::printf("soak: returned %" PRIu64 ", none %" PRIu64 ", dispatched %" PRIu64 ", property records %" PRIu64
                ", log lines default %" PRIu64 " debug %" PRIu64 " error %" PRIu64 "\n",
                returned, none, dispatched, properties, logs->counts[0], logs->counts[1], logs->counts[2]);
    std::printf("soak: resident MiB by frame:");
    for (const auto& [frame, mib] : rss) std::printf(" %" PRIu64 ":%.1f", frame, mib);
    std::printf("\n");

    // From the first sample at or after a tenth of the run to the largest later one.
    double settled = -1.0, peak = 0.0;
    for (const auto& [frame, mib] : rss) {
        if (frame * 10 < frames) continue;
        if (settled < 0) settled = mib;
        if (mib > peak) peak = mib;
    }
    const double growth = peak - settled;
    std::printf("soak: resident memory grew %.1f MiB after the first tenth (limit %.1f MiB)\n", growth, maxGrowthMiB);
    if (growth > maxGrowthMiB) {
        std::fprintf(stderr, "orvane_soak: resident memory grew %.1f MiB after the first tenth of the run\n", growth);
        return 1;
    }
    if (returned + none + properties == 0 || returned == 0) {
        std::fprintf(stderr, "orvane_soak: the filter returned nothing\n");
        return 1;
    }
    return 0;
}
