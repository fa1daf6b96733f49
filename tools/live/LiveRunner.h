#pragma once
// The bridge's main loop: opens the touchpad, starts the filter for it and moves its events
// through as they arrive, while the gesture stream takes clients and the lid switch is
// watched, all on one thread, waiting in poll(2) and never blocking on a client.
//
// It ends when the stop descriptor becomes readable (SIGINT and SIGTERM write to it), when a
// source has no more events, or when the touchpad goes away; with `wait` it then waits for
// the touchpad to come back instead, as it waits for one that is not there at the start.
// Each end releases the virtual pointer's buttons and cancels the filter.

#include <iosfwd>
#include <string>

#include "DeviceProvider.h"
#include "GestureStream.h"
#include "LiveBridge.h"

namespace orvane::live {

class LiveRunner {
public:
    // Events read in one go from a source without a descriptor before the loop looks at its
    // other descriptors again.
    static constexpr int kEventsPerRound = 512;

    // Messages for a person (one line each, "orvane: ...") go to `messages`.
    LiveRunner(DeviceProvider& devices, LiveBridge& bridge, GestureStream* gestures, std::ostream& messages);

    // The exit status: 0 when stopped or when the source ended; 1 after a failure, or when
    // the touchpad went away or is not there and `wait` is false.
    int run(const BridgeSettings& settings, bool wait, int stopDescriptor);

    uint64_t disappearances() const { return disappearances_; }

private:
    enum class End { Stopped, Ended, Gone, Failed };

    End pump(EventSource& source, int stopDescriptor, std::string* error);
    void watchLid();
    // Waits for a change of the input devices or a second; false when asked to stop.
    bool waitForDevices(int stopDescriptor);
    void say(const std::string& line);

    DeviceProvider& devices_;
    LiveBridge& bridge_;
    GestureStream* gestures_;
    std::ostream& messages_;
    std::unique_ptr<LidSwitch> lid_;
    uint64_t disappearances_ = 0;
};

}  // namespace orvane::live
