#include "LibevdevSource.h"

#include <fcntl.h>
#include <libevdev/libevdev.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <ctime>

#include "DeviceAccess.h"

namespace orvane::live {

namespace {

void setBit(std::vector<uint8_t>& bits, unsigned n) {
    if (bits.size() <= n / 8) bits.resize(n / 8 + 1, 0);
    bits[n / 8] = static_cast<uint8_t>(bits[n / 8] | (1u << (n % 8)));
}

// What the device says about itself, in the same form an evemu description gives: the
// properties, for EV_SYN the event types (as evemu's "B: 00" line), for every other type
// its codes, and the absolute axes.
evemu::EvdevDevice describe(const libevdev* dev) {
    evemu::EvdevDevice d;
    const char* name = libevdev_get_name(dev);
    d.name = name ? name : "";
    d.bus = static_cast<uint16_t>(libevdev_get_id_bustype(dev));
    d.vendor = static_cast<uint16_t>(libevdev_get_id_vendor(dev));
    d.product = static_cast<uint16_t>(libevdev_get_id_product(dev));
    d.version = static_cast<uint16_t>(libevdev_get_id_version(dev));
    d.properties.assign((INPUT_PROP_MAX + 1 + 7) / 8, 0);
    for (unsigned p = 0; p <= INPUT_PROP_MAX; ++p)
        if (libevdev_has_property(dev, p)) setBit(d.properties, p);
    for (unsigned type = 0; type <= EV_MAX; ++type) {
        if (!libevdev_has_event_type(dev, type)) continue;
        const int max = libevdev_event_type_get_max(type);
        if (max < 0) continue;
        std::vector<uint8_t>& bits = d.codes[static_cast<uint16_t>(type)];
        bits.assign(static_cast<size_t>(max) / 8 + 1, 0);
        if (type == EV_SYN) {
            for (unsigned t = 0; t <= EV_MAX; ++t)
                if (libevdev_has_event_type(dev, t)) setBit(bits, t);
            continue;
        }
        for (unsigned code = 0; code <= static_cast<unsigned>(max); ++code) {
            if (!libevdev_has_event_code(dev, type, code)) continue;
            setBit(bits, code);
            if (type != EV_ABS) continue;
            const input_absinfo* info = libevdev_get_abs_info(dev, code);
            if (!info) continue;
            evemu::EvdevAxis& axis = d.axes[static_cast<uint16_t>(code)];
            axis.minimum = info->minimum;
            axis.maximum = info->maximum;
            axis.fuzz = info->fuzz;
            axis.flat = info->flat;
            axis.resolution = info->resolution;
        }
    }
    return d;
}

// The device's state as libevdev read it when it was opened, as events (see the header).
std::vector<evemu::EvdevEvent> stateEvents(const libevdev* dev) {
    std::vector<evemu::EvdevEvent> events;
    timespec now{};
    ::clock_gettime(CLOCK_MONOTONIC, &now);
    const uint64_t t = static_cast<uint64_t>(now.tv_sec) * 1'000'000'000ull + static_cast<uint64_t>(now.tv_nsec);
    auto add = [&](unsigned type, unsigned code, int value) {
        events.push_back({t, static_cast<uint16_t>(type), static_cast<uint16_t>(code), value});
    };
    const int slots = libevdev_get_num_slots(dev);
    for (int slot = 0; slot < slots; ++slot) {
        const int id = libevdev_get_slot_value(dev, static_cast<unsigned>(slot), ABS_MT_TRACKING_ID);
        if (id < 0) continue;
        add(EV_ABS, ABS_MT_SLOT, slot);
        add(EV_ABS, ABS_MT_TRACKING_ID, id);
        for (unsigned code = ABS_MT_SLOT + 1; code <= ABS_MAX; ++code)
            if (code != ABS_MT_TRACKING_ID && libevdev_has_event_code(dev, EV_ABS, code))
                add(EV_ABS, code, libevdev_get_slot_value(dev, static_cast<unsigned>(slot), code));
    }
    for (unsigned code = BTN_MISC; code <= BTN_TASK; ++code)
        if (libevdev_has_event_code(dev, EV_KEY, code) && libevdev_get_event_value(dev, EV_KEY, code) != 0)
            add(EV_KEY, code, 1);
    if (slots > 0) add(EV_ABS, ABS_MT_SLOT, libevdev_get_current_slot(dev));
    return events;
}

}  // namespace

LibevdevSource::~LibevdevSource() {
    ungrab();
    if (dev_) libevdev_free(dev_);
    if (descriptor_ >= 0) ::close(descriptor_);
}

std::unique_ptr<LibevdevSource> LibevdevSource::open(const std::string& path, bool grab, std::string* error) {
    std::unique_ptr<LibevdevSource> source(new LibevdevSource());
    source->path_ = path;
    source->descriptor_ = ::open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    if (source->descriptor_ < 0) {
        *error = describeOpenFailure(path, errno);
        return nullptr;
    }
    const int rc = libevdev_new_from_fd(source->descriptor_, &source->dev_);
    if (rc != 0) {
        source->dev_ = nullptr;
        *error = path + ": not an input device libevdev can read (" + std::strerror(-rc) + ")";
        return nullptr;
    }
    // Event times on the clock the filter's ticks count.
    if (libevdev_set_clock_id(source->dev_, CLOCK_MONOTONIC) != 0) {
        *error = path + ": cannot have events stamped with CLOCK_MONOTONIC";
        return nullptr;
    }
    if (grab) {
        const int g = libevdev_grab(source->dev_, LIBEVDEV_GRAB);
        if (g != 0) {
            *error = path + (g == -EBUSY ? ": another program has taken the device for itself (grabbed it)"
                                         : ": cannot take the device for Orvane alone: " + std::string(std::strerror(-g)));
            return nullptr;
        }
        source->grabbed_ = true;
    }
    source->device_ = describe(source->dev_);
    source->state_ = stateEvents(source->dev_);
    return source;
}

void LibevdevSource::ungrab() {
    if (grabbed_ && dev_) libevdev_grab(dev_, LIBEVDEV_UNGRAB);
    grabbed_ = false;
}

int LibevdevSource::value(uint16_t type, uint16_t code) const { return libevdev_get_event_value(dev_, type, code); }

ReadStatus LibevdevSource::next(evemu::EvdevEvent* event, std::string* error) {
    if (stateHandedOver_ < state_.size()) {
        *event = state_[stateHandedOver_++];
        return ReadStatus::Event;
    }
    for (;;) {
        input_event ev{};
        const int rc = libevdev_next_event(dev_, syncing_ ? LIBEVDEV_READ_FLAG_SYNC : LIBEVDEV_READ_FLAG_NORMAL, &ev);
        if (syncing_ && rc == -EAGAIN) {
            syncing_ = false;  // the state is up to date; read on normally
            continue;
        }
        if (rc == LIBEVDEV_READ_STATUS_SUCCESS || rc == LIBEVDEV_READ_STATUS_SYNC) {
            if (!syncing_ && rc == LIBEVDEV_READ_STATUS_SYNC) {
                // The SYN_DROPPED itself; what brings the state up to date follows.
                syncing_ = true;
                ++resynchronisations_;
            }
            event->time_ns = static_cast<uint64_t>(ev.input_event_sec) * 1'000'000'000ull +
                             static_cast<uint64_t>(ev.input_event_usec) * 1'000ull;
            event->type = ev.type;
            event->code = ev.code;
            event->value = ev.value;
            return ReadStatus::Event;
        }
        if (rc == -EAGAIN) return ReadStatus::Again;
        if (rc == -EINTR) continue;
        if (rc == -ENODEV) return ReadStatus::Gone;
        *error = path_ + ": cannot be read: " + std::strerror(-rc);
        return ReadStatus::Failed;
    }
}

}  // namespace orvane::live
