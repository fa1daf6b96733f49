#pragma once
// Where a filter sends the events it makes besides its return value.

#include <functional>
#include <memory>
#include <string>

#include "HIDEvent.h"

namespace orvane {

class HIDEventDispatcher {
public:
    virtual ~HIDEventDispatcher() = default;
    // Sends the event at once; the event may be changed afterwards by its maker.
    virtual void dispatchEvent(const HIDEventRef& event) = 0;
    virtual std::string description() const { return "<HIDEventDispatcher>"; }
};

// A dispatcher that hands every event to a callback.
class CallbackEventDispatcher : public HIDEventDispatcher {
public:
    explicit CallbackEventDispatcher(std::function<void(const HIDEventRef&)> callback)
        : callback_(std::move(callback)) {}
    void dispatchEvent(const HIDEventRef& event) override {
        if (callback_) callback_(event);
    }

private:
    std::function<void(const HIDEventRef&)> callback_;
};

}  // namespace orvane
