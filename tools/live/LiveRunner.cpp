#include "LiveRunner.h"

#include <poll.h>
#include <unistd.h>

#include <cerrno>
#include <ostream>
#include <vector>

namespace orvane::live {

namespace {

constexpr int kLookAgain_ms = 1000;

bool readable(const pollfd& p) { return (p.revents & (POLLIN | POLLERR | POLLHUP)) != 0; }

}  // namespace

LiveRunner::LiveRunner(DeviceProvider& devices, LiveBridge& bridge, GestureStream* gestures, std::ostream& messages)
    : devices_(devices), bridge_(bridge), gestures_(gestures), messages_(messages) {}

void LiveRunner::say(const std::string& line) { messages_ << "orvane: " << line << std::endl; }

bool LiveRunner::waitForDevices(int stopDescriptor) {
    std::vector<pollfd> fds;
    if (stopDescriptor >= 0) fds.push_back({stopDescriptor, POLLIN, 0});
    const int changes = devices_.changeDescriptor();
    if (changes >= 0) fds.push_back({changes, POLLIN, 0});
    if (gestures_) gestures_->appendPollDescriptors(&fds);
    const int n = ::poll(fds.data(), fds.size(), kLookAgain_ms);
    if (n < 0 && errno != EINTR) return false;
    if (stopDescriptor >= 0 && readable(fds[0])) return false;
    if (changes >= 0) devices_.takeChanges();
    if (gestures_) gestures_->service();
    return true;
}

void LiveRunner::watchLid() {
    if (!lid_) return;
    const bool before = lid_->isClosed();
    if (!lid_->update()) {
        say("the lid switch went away; the lid is no longer reported");
        lid_.reset();
        return;
    }
    std::string error;
    if (lid_->isClosed() != before && !bridge_.setLidClosed(lid_->isClosed(), &error))
        say("the lid could not be reported to the filter: " + error);
}

LiveRunner::End LiveRunner::pump(EventSource& source, int stopDescriptor, std::string* error) {
    std::vector<pollfd> fds;
    evemu::EvdevEvent event;
    for (;;) {
        fds.clear();
        if (stopDescriptor >= 0) fds.push_back({stopDescriptor, POLLIN, 0});
        const size_t sourceAt = fds.size();
        const int sourceDescriptor = source.pollDescriptor();
        if (sourceDescriptor >= 0) fds.push_back({sourceDescriptor, POLLIN, 0});
        const size_t lidAt = fds.size();
        const int lidDescriptor = lid_ ? lid_->pollDescriptor() : -1;
        if (lidDescriptor >= 0) fds.push_back({lidDescriptor, POLLIN, 0});
        if (gestures_) gestures_->appendPollDescriptors(&fds);

        // A source without a descriptor always has something to read: only look around.
        if (::poll(fds.data(), fds.size(), sourceDescriptor >= 0 ? -1 : 0) < 0 && errno != EINTR) {
            *error = "cannot wait for input";
            return End::Failed;
        }
        if (stopDescriptor >= 0 && readable(fds[0])) return End::Stopped;
        if (gestures_) gestures_->service();
        if (lidDescriptor >= 0 && readable(fds[lidAt])) watchLid();
        if (sourceDescriptor >= 0 && !readable(fds[sourceAt])) continue;

        // A device is read until it has nothing more (libevdev may hold events its descriptor
        // no longer shows); a source that is always ready gives the loop a turn now and then.
        for (int n = 0; sourceDescriptor >= 0 || n < kEventsPerRound; ++n) {
            switch (source.next(&event, error)) {
            case ReadStatus::Event:
                if (!bridge_.feed(event, error)) {
                    *error = source.path() + ": " + *error;
                    return End::Failed;
                }
                continue;
            case ReadStatus::Again: break;
            case ReadStatus::End: return End::Ended;
            case ReadStatus::Gone: return End::Gone;
            case ReadStatus::Failed: return End::Failed;
            }
            break;
        }
    }
}

int LiveRunner::run(const BridgeSettings& settings, bool wait, int stopDescriptor) {
    std::string note;
    lid_ = devices_.openLidSwitch(&note);
    if (!note.empty()) say(note);
    bool waiting = false;  // said so already
    for (;;) {
        std::string announcement, error;
        bool absent = false;
        std::unique_ptr<EventSource> source = devices_.openTouchpad(&announcement, &absent, &error);
        if (!source) {
            if (!(absent && wait)) {
                say(error);
                return 1;
            }
            if (!waiting) say(error + "; waiting for it (--wait)");
            waiting = true;
            if (!waitForDevices(stopDescriptor)) return 0;
            continue;
        }
        waiting = false;
        if (!bridge_.start(source->device(), settings, &error)) {
            say(source->path() + ": " + error);
            return 1;
        }
        if (lid_ && !bridge_.setLidClosed(lid_->isClosed(), &error))
            say("the lid could not be reported to the filter: " + error);
        if (!announcement.empty()) say(announcement);

        const End end = pump(*source, stopDescriptor, &error);
        std::string stopError;
        const bool stopped = bridge_.stop(&stopError);
        if (!stopped) say(stopError);
        switch (end) {
        case End::Stopped:
        case End::Ended: return stopped ? 0 : 1;
        case End::Failed: say(error); return 1;
        case End::Gone:
            ++disappearances_;
            if (!wait) {
                say(source->path() + " went away (--wait waits for it to come back)");
                return 1;
            }
            say(source->path() + " went away; waiting for it to come back");
            waiting = true;
            source.reset();
            if (!waitForDevices(stopDescriptor)) return 0;
            continue;
        }
    }
}

}  // namespace orvane::live
