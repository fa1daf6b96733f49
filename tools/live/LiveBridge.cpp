#include "LiveBridge.h"

#include "TouchpadService.h"
#include "platform/HIDEventDispatcher.h"
#include "platform/Timebase.h"
#include "tools/evemu/EvdevCodes.h"

namespace orvane::live {

namespace {

constexpr uint16_t kEvSw = 0x05;
constexpr uint16_t kSwLid = 0x00;
// The connection the bridge's settings come from.
constexpr uint64_t kBridgeClientID = 1;

}  // namespace

LiveBridge::LiveBridge(PointerOutput& pointer, GestureStream* gestures, LatencyStats* stats)
    : pointer_(pointer), gestures_(gestures), stats_(stats) {
    made_.reserve(16);
}

LiveBridge::~LiveBridge() {
    std::string ignored;
    stop(&ignored);
}

bool LiveBridge::start(const evemu::EvdevDevice& device, const BridgeSettings& settings, std::string* error) {
    evemu::TouchpadLayout layout;
    if (!evemu::touchpadLayoutFor(device, &layout, error)) return false;
    formats::ServiceDescription service;
    if (!touchpadService(device, settings.size, settings.keyboardCover, &service, error)) return false;
    if (!startWithService(service, settings, error)) return false;
    converter_ = std::make_unique<evemu::TouchFrameConverter>(std::move(layout));
    return true;
}

bool LiveBridge::startWithService(const formats::ServiceDescription& description, const BridgeSettings& settings,
                                  std::string* error) {
    if (running_ && !stop(error)) return false;
    converter_.reset();
    // Ticks are CLOCK_MONOTONIC nanoseconds.
    if (!Timebase::set(1, 1)) {
        const TimebaseInfo fixed = Timebase::info();
        if (fixed.numer != 1 || fixed.denom != 1) {
            *error = "the platform timebase is already fixed at " + std::to_string(fixed.numer) + "/" +
                     std::to_string(fixed.denom) + ", not 1/1";
            return false;
        }
    }
    service_ = std::make_shared<HIDEventService>(description.usagePairs, description.properties);
    auto dispatcher = std::make_shared<CallbackEventDispatcher>([this](const HIDEventRef& event) { deliver(event); });
    const std::string path = settings.plugInPath.empty() ? host::PlugInHost::defaultPlugInPath() : settings.plugInPath;
    std::string why;
    if (!host_.load(path, {}, &why)) {
        *error = why;
        return false;
    }
    int64_t score = 0;
    if (!host_.matchService(service_, {}, &score, &why)) {
        host_.unload();
        const bool keyboard = service_->conformsToUsagePage(1, 6);
        *error = why + (keyboard ? "" : "; it matches only the trackpad of a keyboard cover: ask for that with "
                                        "--keyboard-cover");
        return false;
    }
    if (!host_.createFilter(service_, &why) || !host_.activate(dispatcher, &why)) {
        host_.unload();
        *error = why;
        return false;
    }
    running_ = true;
    deliveryFailed_ = false;
    if (!applySettings(settings, error)) {
        std::string ignored;
        stop(&ignored);
        return false;
    }
    return true;
}

bool LiveBridge::applySettings(const BridgeSettings& settings, std::string* error) {
    client_ = std::make_shared<HIDConnection>(kBridgeClientID);
    if (!host_.clientNotification(client_, true, error)) return false;
    for (const auto& [value, key] : {std::pair{settings.tapToClick, "TapToClickEnabled"},
                                     std::pair{settings.secondaryClick, "TwoFingersSecondaryClickEnabled"}}) {
        if (!value) continue;
        // The answer says whether the setting changed; setting the filter's default changes nothing.
        bool changed = false;
        if (!host_.setProperty(PropertyValue(*value), key, client_, &changed, error)) return false;
    }
    return true;
}

void LiveBridge::deliver(const HIDEventRef& event) {
    if (!event) return;
    ++delivered_;
    std::string why;
    if (!pointer_.deliver(*event, &why) && !deliveryFailed_) {
        deliveryFailed_ = true;
        deliveryError_ = why;
    }
    if (gestures_) gestures_->deliver(*event);
}

bool LiveBridge::filter(const HIDEventRef& event, std::string* error) {
    if (!running_) {
        *error = "no filter is running";
        return false;
    }
    HIDEventRef result;
    if (!host_.filterEvent(event, &result, error)) return false;
    deliver(result);
    if (event->type() == kHIDEventTypeDigitizer) ++frames_;
    if (deliveryFailed_) {
        *error = deliveryError_;
        return false;
    }
    return true;
}

bool LiveBridge::setLidClosed(bool closed, std::string* error) {
    if (!running_) return true;
    PropertyDictionary state;
    state["DigitizerSurfaceCovered"] = PropertyValue(closed ? 1 : 0);
    bool accepted = false;
    return host_.setProperty(PropertyValue(std::move(state)), "HostStateNotification", client_, &accepted, error);
}

bool LiveBridge::feed(const evemu::EvdevEvent& event, std::string* error) {
    if (!converter_) {
        *error = "no touchpad is being read";
        return false;
    }
    if (event.type == evemu::kEvSyn && event.code == evemu::kSynDropped) {
        ++resynchronisations_;
        return true;
    }
    if (event.type == kEvSw && event.code == kSwLid && !setLidClosed(event.value != 0, error)) return false;
    const bool report = event.type == evemu::kEvSyn && event.code == evemu::kSynReport;
    const auto readAt = report ? std::chrono::steady_clock::now() : std::chrono::steady_clock::time_point{};
    made_.clear();
    if (!converter_->feed(event, &made_, error)) return false;
    for (const HIDEventRef& made : made_)
        if (!filter(made, error)) return false;
    if (report && stats_) {
        const auto took = std::chrono::steady_clock::now() - readAt;
        stats_->add(static_cast<uint64_t>(std::chrono::duration_cast<std::chrono::nanoseconds>(took).count()));
    }
    return true;
}

bool LiveBridge::stop(std::string* error) {
    if (!running_) return true;
    running_ = false;
    converter_.reset();
    bool ok = pointer_.releaseAll(error);
    std::string why;
    if (!host_.cancel(&why) && ok) {
        *error = why;
        ok = false;
    }
    host_.unload();
    client_.reset();
    return ok;
}

}  // namespace orvane::live
