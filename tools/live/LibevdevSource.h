#pragma once
// A live input device read with libevdev.
//
// Times are CLOCK_MONOTONIC (the clock the kernel is asked to stamp events with), in
// nanoseconds. After a SYN_DROPPED the source follows libevdev's documented way: it hands
// over the SYN_DROPPED, then the events libevdev makes in sync mode to bring the device's
// state up to date (they end with a SYN_REPORT), then reads on normally.
//
// A device may be opened while fingers are on it or buttons are down. The first events a
// source hands over describe that state as libevdev read it: every slot that has a contact
// (ABS_MT_SLOT, its tracking ID and its other axes), the buttons that are down, and last the
// slot the device sends to next. No SYN_REPORT follows them: they belong to the first
// frame, as though the device had just reported them.

#include <memory>
#include <string>
#include <vector>

#include "EventSource.h"

struct libevdev;

namespace orvane::live {

class LibevdevSource : public EventSource {
public:
    ~LibevdevSource() override;
    LibevdevSource(const LibevdevSource&) = delete;
    LibevdevSource& operator=(const LibevdevSource&) = delete;

    // Opens the device node without blocking. With `grab`, takes it for this process alone
    // (EVIOCGRAB), so the desktop does not see it twice. On failure nullptr and one line
    // naming the node and, for a permission problem, the group or rule.
    static std::unique_ptr<LibevdevSource> open(const std::string& path, bool grab, std::string* error);

    const evemu::EvdevDevice& device() const override { return device_; }
    const std::string& path() const override { return path_; }
    int pollDescriptor() const override { return descriptor_; }
    ReadStatus next(evemu::EvdevEvent* event, std::string* error) override;

    // The device's current value of a code as libevdev keeps it (a switch, a key).
    int value(uint16_t type, uint16_t code) const;
    // Gives the device back to everyone (done by the destructor too).
    void ungrab();
    // SYN_DROPPEDs seen.
    uint64_t resynchronisations() const { return resynchronisations_; }

private:
    LibevdevSource() = default;

    std::string path_;
    int descriptor_ = -1;
    libevdev* dev_ = nullptr;
    bool grabbed_ = false;
    bool syncing_ = false;
    uint64_t resynchronisations_ = 0;
    evemu::EvdevDevice device_;
    std::vector<evemu::EvdevEvent> state_;  // the state at opening, handed over first
    size_t stateHandedOver_ = 0;
};

}  // namespace orvane::live
