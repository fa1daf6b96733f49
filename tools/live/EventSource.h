#pragma once
// Where the touchpad's input events come from: a live evdev device read with libevdev, or,
// in tests, a recording played back. The bridge reads one event at a time.
//
// Events arrive as libevdev hands them over. After an EV_SYN SYN_DROPPED (the kernel's
// buffer overflowed and events were lost) come the events that bring the device's state up
// to date, ending with a SYN_REPORT; then normal events go on. The state these events bring
// up to date is the state of every event handed over before, the unfinished frame in front
// of the SYN_DROPPED included, so a reader that applies every event it gets (and skips only
// the SYN_DROPPED itself) ends up exactly where the device is.

#include <string>

#include "tools/evemu/EvdevDevice.h"

namespace orvane::live {

enum class ReadStatus {
    Event,   // `event` holds the next event
    Again,   // nothing to read now; wait for the source's descriptor to become readable
    End,     // the source has no more events (the end of a recording)
    Gone,    // the device went away (unplugged, or the driver was unbound)
    Failed,  // a read error; `error` says what
};

class EventSource {
public:
    virtual ~EventSource() = default;

    // What the device says about itself: name, identity, properties, codes and axes.
    virtual const evemu::EvdevDevice& device() const = 0;
    // Where it is, for messages ("/dev/input/event5").
    virtual const std::string& path() const = 0;
    // A descriptor to wait on for input, or -1 for a source that is always ready.
    virtual int pollDescriptor() const = 0;
    // The next event, or why there is none.
    virtual ReadStatus next(evemu::EvdevEvent* event, std::string* error) = 0;
};

}  // namespace orvane::live
