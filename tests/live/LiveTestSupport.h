#pragma once
// Helpers the live bridge's tests share: evemu recordings as event sources (with a
// SYN_DROPPED or a vanishing device where a test wants one), a device provider that hands
// out such sources, the filter's own deliveries for a frame recording, and a scratch folder.

#include <gtest/gtest.h>
#include <sys/eventfd.h>
#include <unistd.h>

#include <cstdlib>
#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "platform/HIDEventDispatcher.h"
#include "platform/HIDEventService.h"
#include "platform/Logging.h"
#include "tests/support/ScratchFolder.h"
#include "tools/evemu/EvdevCodes.h"
#include "tools/evemu/EvemuConversion.h"
#include "tools/evemu/EvemuParser.h"
#include "tools/formats/FrameRecording.h"
#include "tools/host/PlugInHost.h"
#include "tools/live/DeviceProvider.h"
#include "tools/live/EventSource.h"

namespace orvane::live::test {

inline constexpr const char* kRecordingFolder = ORVANE_TEST_EVEMU_RECORDINGS;
inline constexpr const char* kOrvaneCommand = ORVANE_TEST_ORVANE_COMMAND;
inline constexpr const char* kPlugInModule = ORVANE_PLUGIN_MODULE;

// A recording of data/evemu: the device its description gives and its events.
struct Recording {
    std::string path;
    std::string content;
    evemu::EvdevDevice device;
    std::vector<evemu::EvdevEvent> events;
};

// Reads a recording by file name; a .events file takes the description beside it.
inline bool loadRecording(const std::string& fileName, Recording* out) {
    Recording r;
    r.path = std::string(kRecordingFolder) + "/" + fileName;
    std::string error;
    if (!formats::readFileContent(r.path, &r.content, &error)) {
        ADD_FAILURE() << error;
        return false;
    }
    evemu::EvemuFile file;
    if (!evemu::parseEvemu(r.content, r.path, &file, &error)) {
        ADD_FAILURE() << error;
        return false;
    }
    r.events = file.events;
    if (file.hasDescription()) {
        r.device = file.device;
    } else {
        for (const std::string& candidate : evemu::siblingDescriptionPaths(r.path)) {
            std::string text;
            evemu::EvemuFile description;
            if (!formats::readFileContent(candidate, &text, &error)) continue;
            if (!evemu::parseEvemu(text, candidate, &description, &error)) {
                ADD_FAILURE() << error;
                return false;
            }
            r.device = description.device;
            break;
        }
    }
    *out = std::move(r);
    return true;
}

// The slots, keys and axes of a multitouch device as libevdev keeps them, so that a test
// source can say after a SYN_DROPPED what libevdev would.
struct DeviceState {
    std::map<uint16_t, int32_t> keys;
    std::map<uint16_t, int32_t> axes;  // below ABS_MT_SLOT
    int32_t slot = 0;
    std::vector<std::map<uint16_t, int32_t>> slots;  // per slot: ABS_MT_* code to value

    explicit DeviceState(int32_t slotCount) : slots(static_cast<size_t>(slotCount)) {
        for (auto& s : slots) s[evemu::kAbsMtTrackingId] = -1;
    }
    void apply(const evemu::EvdevEvent& e) {
        if (e.type == evemu::kEvKey) keys[e.code] = e.value;
        if (e.type != evemu::kEvAbs) return;
        if (e.code == evemu::kAbsMtSlot) slot = e.value;
        else if (e.code > evemu::kAbsMtSlot) slots[static_cast<size_t>(slot)][e.code] = e.value;
        else axes[e.code] = e.value;
    }
};

// Plays a recording's events back as a live device would hand them over.
class RecordingSource : public EventSource {
public:
    RecordingSource(evemu::EvdevDevice device, std::vector<evemu::EvdevEvent> events,
                    std::string path = "/dev/input/event-recording")
        : device_(std::move(device)), path_(std::move(path)), events_(std::move(events)) {}

    // The kernel loses the events from `from` (in the middle of a frame) up to `resumeAt`
    // (after a SYN_REPORT): the source hands over a SYN_DROPPED, then what libevdev makes in
    // sync mode from the difference between what it handed over and where the device is,
    // then goes on at `resumeAt`. Sync events carry the time of the first lost event.
    void dropEvents(size_t from, size_t resumeAt) {
        const int32_t slotCount = device_.axis(evemu::kAbsMtSlot)->maximum + 1;
        DeviceState handed(slotCount), kernel(slotCount);
        for (size_t i = 0; i < from; ++i) handed.apply(events_[i]);
        for (size_t i = 0; i < resumeAt; ++i) kernel.apply(events_[i]);
        const uint64_t t = events_[from].time_ns;
        auto ev = [t](uint16_t type, uint16_t code, int32_t value) { return evemu::EvdevEvent{t, type, code, value}; };
        std::vector<evemu::EvdevEvent> out(events_.begin(), events_.begin() + static_cast<std::ptrdiff_t>(from));
        out.push_back(ev(evemu::kEvSyn, evemu::kSynDropped, 0));
        // First the contacts that ended (or were replaced) end, in a frame of their own.
        bool ended = false;
        for (size_t s = 0; s < handed.slots.size(); ++s) {
            const int32_t was = handed.slots[s][evemu::kAbsMtTrackingId];
            const int32_t is = kernel.slots[s][evemu::kAbsMtTrackingId];
            if (was == -1 || was == is) continue;
            out.push_back(ev(evemu::kEvAbs, evemu::kAbsMtSlot, static_cast<int32_t>(s)));
            out.push_back(ev(evemu::kEvAbs, evemu::kAbsMtTrackingId, -1));
            handed.slots[s][evemu::kAbsMtTrackingId] = -1;
            ended = true;
        }
        if (ended) out.push_back(ev(evemu::kEvSyn, evemu::kSynReport, 0));
        // Then keys, axes and every slot's changes, the current slot, and a SYN_REPORT.
        for (const auto& [code, value] : kernel.keys)
            if (handed.keys[code] != value) out.push_back(ev(evemu::kEvKey, code, value));
        for (const auto& [code, value] : kernel.axes)
            if (handed.axes[code] != value) out.push_back(ev(evemu::kEvAbs, code, value));
        for (size_t s = 0; s < kernel.slots.size(); ++s) {
            std::vector<evemu::EvdevEvent> changes;
            for (const auto& [code, value] : kernel.slots[s])
                if (handed.slots[s][code] != value) changes.push_back(ev(evemu::kEvAbs, code, value));
            if (changes.empty()) continue;
            out.push_back(ev(evemu::kEvAbs, evemu::kAbsMtSlot, static_cast<int32_t>(s)));
            out.insert(out.end(), changes.begin(), changes.end());
        }
        out.push_back(ev(evemu::kEvAbs, evemu::kAbsMtSlot, kernel.slot));
        out.push_back(ev(evemu::kEvSyn, evemu::kSynReport, 0));
        out.insert(out.end(), events_.begin() + static_cast<std::ptrdiff_t>(resumeAt), events_.end());
        events_ = std::move(out);
    }
    // The device goes away instead of handing over event `at`.
    void vanishAt(size_t at) { vanishAt_ = at; }
    // Calls `what` when event `at` is handed over.
    void whenHandingOver(size_t at, std::function<void()> what) {
        hookAt_ = at;
        hook_ = std::move(what);
    }

    const evemu::EvdevDevice& device() const override { return device_; }
    const std::string& path() const override { return path_; }
    int pollDescriptor() const override { return -1; }
    ReadStatus next(evemu::EvdevEvent* event, std::string*) override {
        if (next_ == vanishAt_) return ReadStatus::Gone;
        if (next_ >= events_.size()) return ReadStatus::End;
        if (next_ == hookAt_ && hook_) hook_();
        *event = events_[next_++];
        return ReadStatus::Event;
    }
    const std::vector<evemu::EvdevEvent>& events() const { return events_; }

private:
    evemu::EvdevDevice device_;
    std::string path_;
    std::vector<evemu::EvdevEvent> events_;
    size_t next_ = 0;
    size_t vanishAt_ = static_cast<size_t>(-1);
    size_t hookAt_ = static_cast<size_t>(-1);
    std::function<void()> hook_;
};

class FakeLid : public LidSwitch {
public:
    int pollDescriptor() const override { return -1; }
    bool isClosed() const override { return closed; }
    bool update() override { return true; }
    bool closed = false;
};

// Hands out the sources a test queued, one per openTouchpad; before the first it answers
// "not there" `absentBefore` times, between two `absentBetween` times, and after the last
// always. Device changes are always waiting, so waits end at once.
class FakeDevices : public DeviceProvider {
public:
    FakeDevices() : changes_(::eventfd(1, EFD_NONBLOCK | EFD_CLOEXEC)) {}
    ~FakeDevices() override { ::close(changes_); }

    std::unique_ptr<EventSource> openTouchpad(std::string* announcement, bool* absent, std::string* error) override {
        ++opens;
        if (opens == 1) absentLeft_ = absentBefore;
        if (absentLeft_ > 0 || sources.empty()) {
            if (absentLeft_ > 0) --absentLeft_;
            *absent = true;
            *error = "no touchpad found";
            return nullptr;
        }
        std::unique_ptr<EventSource> s = std::move(sources.front());
        sources.pop_front();
        absentLeft_ = absentBetween;
        *announcement = "reading the touchpad " + s->path();
        return s;
    }
    std::unique_ptr<LidSwitch> openLidSwitch(std::string*) override { return std::move(lid); }
    int changeDescriptor() const override { return changes_; }

    std::deque<std::unique_ptr<EventSource>> sources;
    std::unique_ptr<LidSwitch> lid;
    int absentBefore = 0;
    int absentBetween = 0;
    int opens = 0;

private:
    int changes_;
    int absentLeft_ = 0;
};

// Runs a frame recording through the plug-in the way `orvane replay` does and keeps a copy
// of every event the filter delivered, dispatched or returned, as it was at that moment.
inline std::vector<HIDEventRef> filterDeliveries(const formats::FrameRecording& recording) {
    std::vector<HIDEventRef> delivered;
    auto dispatcher = std::make_shared<CallbackEventDispatcher>(
        [&delivered](const HIDEventRef& e) { delivered.push_back(e->copy()); });
    auto service = std::make_shared<HIDEventService>(recording.header.service.usagePairs,
                                                     recording.header.service.properties);
    host::PlugInHost host;
    std::string error;
    if (!host.open(kPlugInModule, recording.header.bundle.value_or(PropertyDictionary{}), service, {}, dispatcher,
                   &error)) {
        ADD_FAILURE() << error;
        return {};
    }
    HIDConnectionRef client;
    for (const formats::InputRecord& record : recording.records) {
        switch (record.kind) {
        case formats::InputRecord::Kind::Event: {
            HIDEventRef result;
            EXPECT_TRUE(host.filterEvent(record.event, &result, &error)) << error;
            if (result) delivered.push_back(result->copy());
            break;
        }
        case formats::InputRecord::Kind::SetProperty: {
            bool accepted = false;
            EXPECT_TRUE(host.setProperty(record.propertyValue, record.propertyKey, client, &accepted, &error));
            break;
        }
        case formats::InputRecord::Kind::Client:
            client = std::make_shared<HIDConnection>(record.clientID);
            EXPECT_TRUE(host.clientNotification(client, record.clientAdded, &error));
            break;
        }
    }
    EXPECT_TRUE(host.cancel(&error)) << error;
    host.unload();
    return delivered;
}

// The filter's log lines are kept out of the test output.
class QuietLogs {
public:
    QuietLogs() { Logging::setSink(capture); }
    ~QuietLogs() { Logging::setSink(std::make_shared<StandardErrorLogSink>()); }
    std::shared_ptr<CaptureLogSink> capture = std::make_shared<CaptureLogSink>();
};

using testsupport::ScratchFolder;

}  // namespace orvane::live::test
