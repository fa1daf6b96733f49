#pragma once
// The machine's own input devices: the touchpad found in sysfs and read with libevdev, the
// lid switch, and an inotify watch on /dev/input that says when devices come and go.

#include <optional>
#include <string>

#include "DeviceDiscovery.h"
#include "DeviceProvider.h"

namespace orvane::live {

class SystemDevices : public DeviceProvider {
public:
    // `wanted`: a node path, part of a touchpad's name, or empty for the first touchpad.
    SystemDevices(std::string wanted, bool grab, bool lidSwitch);
    ~SystemDevices() override;
    SystemDevices(const SystemDevices&) = delete;
    SystemDevices& operator=(const SystemDevices&) = delete;

    std::unique_ptr<EventSource> openTouchpad(std::string* announcement, bool* absent, std::string* error) override;
    std::unique_ptr<LidSwitch> openLidSwitch(std::string* note) override;
    int changeDescriptor() const override { return watch_; }
    void takeChanges() override;

private:
    std::string wanted_;
    bool grab_;
    bool lidSwitch_;
    int watch_ = -1;
    // The touchpad first opened: when it goes away, the same device is waited for.
    std::optional<InputDeviceInfo> taken_;
};

}  // namespace orvane::live
