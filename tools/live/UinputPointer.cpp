#include "UinputPointer.h"

#include <libevdev/libevdev-uinput.h>
#include <libevdev/libevdev.h>

#include <cerrno>
#include <cstring>

#include "DeviceAccess.h"

namespace orvane::live {

namespace {

// BUS_VIRTUAL, and an identity of its own so a udev rule or hwdb entry can match the device.
constexpr int kBusVirtual = 0x06;
constexpr int kVendor = 0x4f56;   // "OV"
constexpr int kProduct = 0x0001;

}  // namespace

UinputPointer::~UinputPointer() {
    if (device_) libevdev_uinput_destroy(device_);
    if (description_) libevdev_free(description_);
}

std::unique_ptr<UinputPointer> UinputPointer::create(std::string* error) {
    std::unique_ptr<UinputPointer> pointer(new UinputPointer());
    pointer->description_ = libevdev_new();
    if (!pointer->description_) {
        *error = "cannot describe the virtual pointer: out of memory";
        return nullptr;
    }
    libevdev* dev = pointer->description_;
    libevdev_set_name(dev, kDeviceName);
    libevdev_set_id_bustype(dev, kBusVirtual);
    libevdev_set_id_vendor(dev, kVendor);
    libevdev_set_id_product(dev, kProduct);
    libevdev_enable_property(dev, INPUT_PROP_POINTER);
    libevdev_enable_event_type(dev, EV_REL);
    for (unsigned code : {REL_X, REL_Y, REL_WHEEL, REL_HWHEEL, REL_WHEEL_HI_RES, REL_HWHEEL_HI_RES})
        libevdev_enable_event_code(dev, EV_REL, code, nullptr);
    libevdev_enable_event_type(dev, EV_KEY);
    for (unsigned code = BTN_LEFT; code <= BTN_TASK; ++code) libevdev_enable_event_code(dev, EV_KEY, code, nullptr);
    for (unsigned code = BTN_0; code <= BTN_9; ++code) libevdev_enable_event_code(dev, EV_KEY, code, nullptr);

    const int rc = libevdev_uinput_create_from_device(dev, LIBEVDEV_UINPUT_OPEN_MANAGED, &pointer->device_);
    if (rc != 0) {
        pointer->device_ = nullptr;
        *error = "cannot make the virtual pointer: " + describeOpenFailure(kUinputPath, -rc);
        return nullptr;
    }
    return pointer;
}

bool UinputPointer::write(uint16_t type, uint16_t code, int32_t value, std::string* error) {
    const int rc = libevdev_uinput_write_event(device_, type, code, value);
    if (rc == 0) return true;
    *error = std::string("the virtual pointer refused an event: ") + std::strerror(-rc);
    return false;
}

std::string UinputPointer::deviceNode() const {
    const char* node = device_ ? libevdev_uinput_get_devnode(device_) : nullptr;
    return node ? node : "";
}

}  // namespace orvane::live
