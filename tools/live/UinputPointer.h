#pragma once
// The virtual pointer as a uinput device, made with libevdev's uinput API: relative x and
// y, the vertical and horizontal wheels in detents and in high-resolution units, and the
// buttons. It is destroyed with the object.

#include <cstdint>
#include <memory>
#include <string>

#include "VirtualPointer.h"

struct libevdev;
struct libevdev_uinput;

namespace orvane::live {

class UinputPointer : public VirtualPointer {
public:
    // The name the desktop sees; the udev rule in data/ matches it.
    static constexpr const char* kDeviceName = "Orvane virtual pointer";
    static constexpr const char* kUinputPath = "/dev/uinput";

    ~UinputPointer() override;
    UinputPointer(const UinputPointer&) = delete;
    UinputPointer& operator=(const UinputPointer&) = delete;

    // Creates the device with every button a touchpad can pass on (BTN_LEFT to BTN_TASK,
    // BTN_0 to BTN_9). On failure nullptr and one line saying what is missing (the module,
    // or the permission and the rule that gives it).
    static std::unique_ptr<UinputPointer> create(std::string* error);

    bool write(uint16_t type, uint16_t code, int32_t value, std::string* error) override;
    // The device node the kernel made ("/dev/input/event9"), when it says.
    std::string deviceNode() const;

private:
    UinputPointer() = default;
    libevdev* description_ = nullptr;
    libevdev_uinput* device_ = nullptr;
};

}  // namespace orvane::live
