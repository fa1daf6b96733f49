#include "SystemDevices.h"

#include <sys/inotify.h>
#include <unistd.h>

#include "LibevdevSource.h"

namespace orvane::live {

namespace {

constexpr const char* kInputDirectory = "/dev/input";
constexpr uint16_t kEvSw = 0x05;
constexpr uint16_t kSwLid = 0x00;

class LibevdevLidSwitch : public LidSwitch {
public:
    explicit LibevdevLidSwitch(std::unique_ptr<LibevdevSource> source) : source_(std::move(source)) {}
    int pollDescriptor() const override { return source_->pollDescriptor(); }
    bool isClosed() const override { return source_->value(kEvSw, kSwLid) != 0; }
    bool update() override {
        evemu::EvdevEvent event;
        std::string error;
        for (;;) {
            // libevdev keeps the switch's state; the events only need reading.
            switch (source_->next(&event, &error)) {
            case ReadStatus::Event: continue;
            case ReadStatus::Again: return true;
            default: return false;
            }
        }
    }

private:
    std::unique_ptr<LibevdevSource> source_;
};

}  // namespace

SystemDevices::SystemDevices(std::string wanted, bool grab, bool lidSwitch)
    : wanted_(std::move(wanted)), grab_(grab), lidSwitch_(lidSwitch) {
    watch_ = ::inotify_init1(IN_NONBLOCK | IN_CLOEXEC);
    if (watch_ >= 0 && ::inotify_add_watch(watch_, kInputDirectory, IN_CREATE | IN_ATTRIB | IN_DELETE) < 0) {
        ::close(watch_);
        watch_ = -1;
    }
}

SystemDevices::~SystemDevices() {
    if (watch_ >= 0) ::close(watch_);
}

void SystemDevices::takeChanges() {
    alignas(inotify_event) char buffer[4096];
    while (watch_ >= 0 && ::read(watch_, buffer, sizeof(buffer)) > 0) {
    }
}

std::unique_ptr<EventSource> SystemDevices::openTouchpad(std::string* announcement, bool* absent,
                                                         std::string* error) {
    *absent = false;
    const InputDeviceScan scan = scanInputDevices();
    const InputDeviceInfo* chosen = nullptr;
    if (taken_) {
        for (const InputDeviceInfo* d : scan.touchpads())
            if (d->sameDevice(*taken_)) chosen = d;
        if (!chosen) {
            *absent = true;
            *error = "the touchpad " + taken_->describe() + " is not there";
            return nullptr;
        }
    } else {
        chosen = chooseTouchpad(scan, wanted_);
        if (!chosen) {
            *absent = true;
            if (wanted_.empty())
                *error = "no touchpad found among " + std::to_string(scan.devices.size()) +
                         " input devices (orvane devices lists what there is)";
            else if (wanted_.find('/') != std::string::npos)
                *error = wanted_ + ": no such input device";
            else
                *error = "no touchpad has \"" + wanted_ + "\" in its name (orvane devices lists them)";
            return nullptr;
        }
        if (!chosen->touchpad) {
            *error = chosen->node + ": " + chosen->describe() +
                     " is not a multitouch touchpad (it needs multitouch slots and INPUT_PROP_POINTER)";
            return nullptr;
        }
    }
    if (!chosen->readable) {
        *error = chosen->problem;
        *absent = ::access(chosen->node.c_str(), F_OK) != 0;
        return nullptr;
    }
    std::unique_ptr<LibevdevSource> source = LibevdevSource::open(chosen->node, grab_, error);
    if (!source) {
        *absent = ::access(chosen->node.c_str(), F_OK) != 0;
        return nullptr;
    }
    const size_t count = scan.touchpads().size();
    *announcement = "reading the touchpad " + chosen->node + " " + chosen->describe();
    if (!taken_ && wanted_.empty() && count > 1)
        *announcement += ", the first of " + std::to_string(count) + " (orvane devices lists them)";
    if (!grab_) *announcement += "; not grabbed, so the desktop sees it too";
    taken_ = *chosen;
    return source;
}

std::unique_ptr<LidSwitch> SystemDevices::openLidSwitch(std::string* note) {
    if (!lidSwitch_) return nullptr;
    const InputDeviceScan scan = scanInputDevices();
    for (const InputDeviceInfo* d : scan.lidSwitches()) {
        if (!d->readable) {
            *note = "the lid is not reported: " + d->problem;
            continue;
        }
        std::string error;
        std::unique_ptr<LibevdevSource> source = LibevdevSource::open(d->node, false, &error);
        if (!source) {
            *note = "the lid is not reported: " + error;
            continue;
        }
        note->clear();
        return std::make_unique<LibevdevLidSwitch>(std::move(source));
    }
    return nullptr;
}

}  // namespace orvane::live
