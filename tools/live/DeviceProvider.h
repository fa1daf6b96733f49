#pragma once
// Where the runner gets its touchpad and lid switch: the machine's devices, or in tests
// recordings played back.

#include <memory>
#include <string>

#include "EventSource.h"

namespace orvane::live {

// The lid of a laptop: closed, or open.
class LidSwitch {
public:
    virtual ~LidSwitch() = default;
    // A descriptor that becomes readable when the switch has something to say, or -1.
    virtual int pollDescriptor() const = 0;
    virtual bool isClosed() const = 0;
    // Reads what the switch sent; false when it has gone away.
    virtual bool update() = 0;
};

class DeviceProvider {
public:
    virtual ~DeviceProvider() = default;

    // The touchpad to read now, with `announcement` saying which one it is for a person.
    // nullptr with one line in `error` when it cannot be had; `absent` is set when it is
    // just not there (not yet, or no longer), so that waiting for it makes sense.
    virtual std::unique_ptr<EventSource> openTouchpad(std::string* announcement, bool* absent,
                                                      std::string* error) = 0;
    // The lid switch, or nullptr when there is none to read (with `note` saying why, when
    // there is one that cannot be read).
    virtual std::unique_ptr<LidSwitch> openLidSwitch(std::string* note) = 0;
    // A descriptor that becomes readable when input devices come or go, or -1 (the runner
    // then looks again every second); takeChanges() reads what it says.
    virtual int changeDescriptor() const { return -1; }
    virtual void takeChanges() {}
};

}  // namespace orvane::live
