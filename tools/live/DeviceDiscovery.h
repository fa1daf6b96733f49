#pragma once
// Finds the input devices the bridge can use from what the kernel publishes in sysfs
// (/sys/class/input/event*/device: name, id, properties, capabilities), which any user may
// read, so a touchpad is found, and named, even when its node is not readable yet.
//
// A touchpad: multitouch slots with tracking IDs and positions (ABS_MT_SLOT,
// ABS_MT_TRACKING_ID, ABS_MT_POSITION_X and _Y) and INPUT_PROP_POINTER (it moves a pointer,
// unlike a touchscreen). A lid switch: SW_LID.

#include <cstdint>
#include <string>
#include <vector>

namespace orvane::live {

struct InputDeviceInfo {
    std::string node;  // "/dev/input/event5"
    int number = -1;   // 5
    std::string name;
    uint16_t bus = 0, vendor = 0, product = 0;
    bool touchpad = false;
    bool lidSwitch = false;
    bool readable = false;  // the node opens for reading
    std::string problem;    // why it does not, in one line

    // "SynPS/2 Synaptics TouchPad (bus 0011, 0002:0007)" for messages.
    std::string describe() const;
    // Same name and identity: the same device, maybe on another node after it came back.
    bool sameDevice(const InputDeviceInfo& other) const;
};

struct InputDeviceScan {
    std::vector<InputDeviceInfo> devices;  // every input device, in node order
    std::vector<const InputDeviceInfo*> touchpads() const;
    std::vector<const InputDeviceInfo*> lidSwitches() const;
};

// Reads `sysfs` (normally /sys/class/input); nodes are `devices` + "/eventN". Touchpads and
// lid switches are tried for reading.
InputDeviceScan scanInputDevices(const std::string& sysfs = "/sys/class/input",
                                 const std::string& devices = "/dev/input");

// The touchpad to use: `wanted` empty takes the first readable touchpad (the first one when
// none is readable); otherwise `wanted` is a node path, or a part of a touchpad's name in
// any case. nullptr when none fits.
const InputDeviceInfo* chooseTouchpad(const InputDeviceScan& scan, const std::string& wanted);

}  // namespace orvane::live
