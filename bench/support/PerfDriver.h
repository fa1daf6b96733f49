#pragma once
// Loads the filter plug-in module through the host, the way the event system does, and
// calls its event entry directly: the host's own bookkeeping (draining the queue after every
// call) stays out of what is measured.

#include <cstdint>
#include <memory>
#include <string>

#include "bench/support/PerfFrames.h"
#include "tools/host/PlugInHost.h"

namespace orvane::perf {

class PerfDriver {
public:
    PerfDriver() = default;
    PerfDriver(const PerfDriver&) = delete;
    PerfDriver& operator=(const PerfDriver&) = delete;
    ~PerfDriver();

    // Loads the module (`plugInPath`, or the host's default), matches, constructs and
    // activates a filter for `service`. False with a message on failure.
    bool open(const formats::ServiceDescription& service, std::string* error, const std::string& plugInPath = "");

    // The plug-in's event entry, and nothing else.
    HIDEventRef filterEvent(const HIDEventRef& event) { return filter_->filterEvent(event); }
    // A client's property, through the host.
    bool setProperty(const std::string& key, const PropertyValue& value);
    // Passes a record of a source on: a frame to the event entry, a property to setProperty.
    HIDEventRef feed(const FrameSource::Record& record);

    // Events the filter sent through the dispatcher so far.
    uint64_t dispatched() const { return *dispatched_; }

private:
    host::PlugInHost host_;
    HIDServiceFilter* filter_ = nullptr;
    std::shared_ptr<uint64_t> dispatched_ = std::make_shared<uint64_t>(0);
};

}  // namespace orvane::perf
