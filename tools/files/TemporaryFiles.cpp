#include "TemporaryFiles.h"

#include <unistd.h>

#include <atomic>
#include <csignal>
#include <climits>
#include <cstring>

namespace orvane::files {

namespace {

// A slot's path is written while the slot is free and published by `used`; the handler
// reads only published paths.
struct Slot {
    std::atomic<bool> taken{false};  // owned by a caller (path being written or in use)
    std::atomic<bool> used{false};   // the path is complete and registered
    char path[PATH_MAX];
};
Slot gSlots[TemporaryFiles::kCapacity];
std::atomic<bool> gInstalled{false};

constexpr int kSignals[] = {SIGINT, SIGTERM, SIGHUP, SIGPIPE};

void removeAndRaise(int signal) {
    TemporaryFiles::unlinkAll();
    struct sigaction dfl {};
    dfl.sa_handler = SIG_DFL;
    sigemptyset(&dfl.sa_mask);
    ::sigaction(signal, &dfl, nullptr);
    ::raise(signal);
}

}  // namespace

int TemporaryFiles::add(const std::string& path) {
    if (path.size() >= PATH_MAX) return -1;
    for (int i = 0; i < kCapacity; ++i) {
        bool expected = false;
        if (!gSlots[i].taken.compare_exchange_strong(expected, true)) continue;
        std::memcpy(gSlots[i].path, path.c_str(), path.size() + 1);
        gSlots[i].used.store(true, std::memory_order_release);
        return i;
    }
    return -1;
}

void TemporaryFiles::remove(int slot) {
    if (slot < 0 || slot >= kCapacity) return;
    gSlots[slot].used.store(false, std::memory_order_release);
    gSlots[slot].taken.store(false, std::memory_order_release);
}

void TemporaryFiles::unlinkAll() {
    for (Slot& slot : gSlots)
        if (slot.used.load(std::memory_order_acquire)) ::unlink(slot.path);
}

void TemporaryFiles::removeOnSignals() {
    if (gInstalled.exchange(true)) return;
    for (int signal : kSignals) {
        struct sigaction old {};
        if (::sigaction(signal, nullptr, &old) != 0 || old.sa_handler != SIG_DFL) continue;
        struct sigaction action {};
        action.sa_handler = removeAndRaise;
        sigemptyset(&action.sa_mask);
        for (int other : kSignals) sigaddset(&action.sa_mask, other);
        ::sigaction(signal, &action, nullptr);
    }
}

}  // namespace orvane::files
