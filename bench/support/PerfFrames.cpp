#include "PerfFrames.h"

#include <algorithm>
#include <array>
#include <span>
#include <cmath>

namespace orvane::perf {

namespace {

constexpr uint64_t kStart_ns = 1'000'000'000;
constexpr uint64_t kFrameInterval_ns = 8'000'000;

// A triangle wave between 0 and 1 with the given period in frames.
double triangle(uint64_t frame, uint64_t period) {
    const double phase = static_cast<double>(frame % period) / static_cast<double>(period);
    return phase < 0.5 ? phase * 2.0 : 2.0 - phase * 2.0;
}

// Four decimals, as a digitizer reports them.
double quantised(double v) { return std::round(v * 10000.0) / 10000.0; }

struct Contact {
    int32_t index;
    double x, y;
};

HIDEventRef contactEvent(uint64_t t, const Contact& c, bool first) {
    HIDEventRef e = HIDEvent::create(kHIDEventTypeDigitizer, t);
    e->setDoubleValue(quantised(c.x), kHIDEventFieldDigitizerX);
    e->setDoubleValue(quantised(c.y), kHIDEventFieldDigitizerY);
    e->setIntegerValue(kHIDDigitizerTransducerTypeFinger, kHIDEventFieldDigitizerType);
    e->setIntegerValue(c.index, kHIDEventFieldDigitizerIndex);
    e->setIntegerValue(first ? kHIDDigitizerEventRange | kHIDDigitizerEventTouch | kHIDDigitizerEventPosition
                             : kHIDDigitizerEventPosition,
                       kHIDEventFieldDigitizerEventMask);
    e->setIntegerValue(1, kHIDEventFieldDigitizerRange);
    e->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    return e;
}

HIDEventRef frameEvent(uint64_t t, std::span<const Contact> contacts, bool first) {
    HIDEventRef frame = HIDEvent::create(kHIDEventTypeDigitizer, t);
    frame->setIntegerValue(0, kHIDEventFieldDigitizerButtonMask);
    frame->setIntegerValue(first ? kHIDDigitizerEventRange | kHIDDigitizerEventTouch | kHIDDigitizerEventPosition
                                 : kHIDDigitizerEventPosition,
                           kHIDEventFieldDigitizerEventMask);
    frame->setIntegerValue(1, kHIDEventFieldDigitizerRange);
    frame->setIntegerValue(1, kHIDEventFieldDigitizerTouch);
    for (const Contact& c : contacts) frame->appendEvent(contactEvent(t, c, first));
    return frame;
}

class MadeUpSource : public FrameSource {
public:
    explicit MadeUpSource(std::string name) : name_(std::move(name)), service_(madeUpService()) {}

    Record next() override {
        // Two client settings first, then the frames.
        if (settings_ < 2) {
            Record r;
            r.propertyKey = settings_++ == 0 ? "TapToClickEnabled" : "TwoFingersSecondaryClickEnabled";
            r.propertyValue = PropertyValue(true);
            return r;
        }
        const uint64_t k = frame_++;
        const uint64_t t = kStart_ns + k * kFrameInterval_ns;
        // At most three contacts, kept off the heap so that making a frame allocates nothing
        // once the event pool is warm.
        std::array<Contact, 3> contacts{};
        size_t n = 0;
        if (name_ == "one-finger") {
            // Three degrees a frame: about 1.5 surface units.
            const double a = static_cast<double>(k % 120) * (3.0 * 3.14159265358979 / 180.0);
            contacts[n++] = Contact{0, 0.5 + 0.3 * std::cos(a), 0.5 + 0.3 * std::sin(a)};
        } else if (name_ == "two-finger-scroll") {
            // About 0.7 surface units a frame, enough to move the scroll every frame.
            const double y = 0.25 + 0.5 * triangle(k, 72);
            contacts[n++] = Contact{1, 0.4, y};
            contacts[n++] = Contact{2, 0.6, y + 0.01};
        } else if (name_ == "pinch") {
            const double half = 0.05 + 0.15 * triangle(k, 60);
            contacts[n++] = Contact{1, 0.5 - half, 0.5 - half * 0.5};
            contacts[n++] = Contact{2, 0.5 + half, 0.5 + half * 0.5};
        } else {
            const double x = 0.2 + 0.3 * triangle(k, 100);
            contacts[n++] = Contact{1, x, 0.6};
            contacts[n++] = Contact{2, x + 0.15, 0.65};
            contacts[n++] = Contact{3, x + 0.3, 0.6};
        }
        Record r;
        r.event = frameEvent(t, std::span<const Contact>(contacts.data(), n), k == 0);
        return r;
    }
    const formats::ServiceDescription& service() const override { return service_; }

private:
    std::string name_;
    formats::ServiceDescription service_;
    int settings_ = 0;
    uint64_t frame_ = 0;
};

void shiftTimestamps(HIDEvent& event, uint64_t by) {
    event.setTimestamp(event.timestamp() + by);
    for (const HIDEventRef& child : event.children()) shiftTimestamps(*child, by);
}

class RecordingSource : public FrameSource {
public:
    explicit RecordingSource(formats::FrameRecording recording) : recording_(std::move(recording)) {
        // A converted touchpad recording may lack the keyboard cover's usages; they are added
        // so that the filter attaches to it.
        for (const HIDUsagePair pair : madeUpService().usagePairs) {
            auto& pairs = recording_.header.service.usagePairs;
            if (std::find(pairs.begin(), pairs.end(), pair) == pairs.end()) pairs.push_back(pair);
        }
        uint64_t first = 0, last = 0;
        bool any = false;
        for (const auto& r : recording_.records) {
            if (r.kind != formats::InputRecord::Kind::Event) continue;
            if (!any) first = r.event->timestamp();
            last = r.event->timestamp();
            any = true;
        }
        // One round later by the recording's length and one frame interval more.
        lap_ = last - first + kFrameInterval_ns;
    }

    Record next() override {
        for (;;) {
            if (position_ == recording_.records.size()) {
                position_ = 0;
                offset_ += lap_;
            }
            const formats::InputRecord& r = recording_.records[position_++];
            Record out;
            if (r.kind == formats::InputRecord::Kind::Event) {
                out.event = r.event->copy();
                if (offset_) shiftTimestamps(*out.event, offset_);
                return out;
            }
            if (r.kind == formats::InputRecord::Kind::SetProperty) {
                out.propertyKey = r.propertyKey;
                out.propertyValue = r.propertyValue;
                return out;
            }
        }
    }
    const formats::ServiceDescription& service() const override { return recording_.header.service; }

private:
    formats::FrameRecording recording_;
    size_t position_ = 0;
    uint64_t offset_ = 0;
    uint64_t lap_ = 0;
};

}  // namespace

std::vector<std::string> madeUpCaseNames() { return {"one-finger", "two-finger-scroll", "pinch", "three-fingers"}; }

formats::ServiceDescription madeUpService() {
    formats::ServiceDescription s;
    s.usagePairs = {{13, 5}, {13, 34}, {1, 6}};
    s.properties = PropertyDictionary{
        {"SurfaceDimensions", PropertyDictionary{{"Width", int64_t{655360}}, {"Height", int64_t{327680}}}},
        {"Transport", "USB"}};
    return s;
}

std::unique_ptr<FrameSource> makeMadeUpSource(const std::string& name) {
    for (const std::string& known : madeUpCaseNames()) {
        if (known == name) return std::make_unique<MadeUpSource>(name);
    }
    return nullptr;
}

std::unique_ptr<FrameSource> makeRecordingSource(formats::FrameRecording recording) {
    return std::make_unique<RecordingSource>(std::move(recording));
}

}  // namespace orvane::perf
