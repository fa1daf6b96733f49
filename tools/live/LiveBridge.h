#pragma once
// One touchpad through one filter instance: its input events become frames through the
// evemu conversion's TouchFrameConverter (the very frames a recording of it would give),
// each frame and button event goes through the loaded plug-in the way the event system
// drives it (tools/host/PlugInHost), and every event the filter delivers, dispatched or
// returned, goes at once to the virtual pointer and to the gesture stream.
//
// The SYN_DROPPED of a resynchronisation is not given to the converter; the events that
// follow it bring the converter's slots to the device's state (see EventSource.h), and the
// frame of their SYN_REPORT reports it. A lid switch's SW_LID is reported to the filter as
// "HostStateNotification" with "DigitizerSurfaceCovered".

#include <chrono>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "GestureStream.h"
#include "LatencyStats.h"
#include "PointerOutput.h"
#include "platform/HIDEvent.h"
#include "platform/HIDEventService.h"
#include "tools/evemu/EvdevDevice.h"
#include "tools/evemu/EvemuConversion.h"
#include "tools/evemu/TouchFrameConverter.h"
#include "tools/formats/FrameRecording.h"
#include "tools/host/PlugInHost.h"

namespace orvane::live {

struct BridgeSettings {
    std::string plugInPath;  // empty: ORVANE_PLUGIN_PATH or the build's plug-in folder
    std::optional<evemu::SurfaceSize> size;
    bool keyboardCover = false;
    std::optional<bool> tapToClick;       // unset: the filter's own default
    std::optional<bool> secondaryClick;
};

class LiveBridge {
public:
    // The pointer output is required; the gesture stream and the statistics may be null.
    LiveBridge(PointerOutput& pointer, GestureStream* gestures, LatencyStats* stats);
    ~LiveBridge();
    LiveBridge(const LiveBridge&) = delete;
    LiveBridge& operator=(const LiveBridge&) = delete;

    // Starts a filter for the touchpad `device` describes: its service, then load, match,
    // construct and activate, then the settings through the filter's setProperty. False with
    // one line (a device without slots, an unknown size, a filter that does not match).
    bool start(const evemu::EvdevDevice& device, const BridgeSettings& settings, std::string* error);
    // The same for a service given as it is; frames then come through filter().
    bool startWithService(const formats::ServiceDescription& service, const BridgeSettings& settings,
                          std::string* error);

    // One input event of the touchpad.
    bool feed(const evemu::EvdevEvent& event, std::string* error);
    // One event for the filter's event entry (a frame, a button event); what it delivers is
    // written before this returns.
    bool filter(const HIDEventRef& event, std::string* error);
    // The lid: closed covers the surface.
    bool setLidClosed(bool closed, std::string* error);

    // Releases every button still down on the virtual pointer, cancels the filter as the
    // event system does and unloads the plug-in. Nothing when not started.
    bool stop(std::string* error);

    bool isRunning() const { return running_; }
    const HIDEventServiceRef& service() const { return service_; }
    const host::PlugInHost& host() const { return host_; }
    uint64_t framesHandled() const { return frames_; }
    uint64_t resynchronisations() const { return resynchronisations_; }
    uint64_t eventsDelivered() const { return delivered_; }

private:
    void deliver(const HIDEventRef& event);
    bool applySettings(const BridgeSettings& settings, std::string* error);

    PointerOutput& pointer_;
    GestureStream* gestures_;
    LatencyStats* stats_;
    host::PlugInHost host_;
    HIDEventServiceRef service_;
    HIDConnectionRef client_;
    std::unique_ptr<evemu::TouchFrameConverter> converter_;
    std::vector<HIDEventRef> made_;
    bool running_ = false;
    bool deliveryFailed_ = false;
    std::string deliveryError_;
    uint64_t frames_ = 0;
    uint64_t resynchronisations_ = 0;
    uint64_t delivered_ = 0;
};

}  // namespace orvane::live
