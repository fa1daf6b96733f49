#include "GestureScriptFrames.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstring>
#include <limits>

#include "platform/HIDEvent.h"

namespace orvane::script {

namespace {

// SurfaceDimensions are centimetres in 16.16 fixed point.
constexpr double kFixedPointOne = 65536.0;
constexpr double kMillimetresPerCentimetre = 10.0;

// The relative scan time a Bluetooth trackpad attaches to each frame: a vendor-defined
// child (digitizer usage page, usage 0x56) holding a 16-bit count of 100 µs units.
constexpr int64_t kScanTimeUsagePage = 13;
constexpr int64_t kScanTimeUsage = 86;
constexpr int64_t kScanTimeLength = 2;
constexpr double kScanTimeUnit_ns = 100'000.0;

// The client that sets the script's properties.
constexpr uint64_t kSettingsClientID = 1;

// More frames than a person would write a script for: a finger left down for hours.
constexpr size_t kMaxFrames = 200'000;

constexpr int64_t kFingerTransducer = kHIDDigitizerTransducerTypeFinger;
constexpr int64_t kPalmTransducer = kHIDDigitizerTransducerTypePalm;

std::string formatNumber(double value) {
    char buffer[64];
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, value);
    return std::string(buffer, result.ptr);
}

struct Point {
    double x = 0.0, y = 0.0;
};

struct Contact {
    std::string name;
    ContactKind kind = ContactKind::Finger;
    int32_t index = 0;
    size_t downLine = 0;

    Point at;          // where it is when not moving, or where its move started
    bool moving = false;
    Point target;
    double moveStart_ms = 0.0, moveEnd_ms = 0.0;
    size_t moveLine = 0;

    bool lifting = false;   // reported once more, lifted, in the next frame
    bool reported = false;  // some frame has reported it touching
    double lastX = 0.0, lastY = 0.0;  // what the last frame reported (normalised)

    Point positionAt(double t) const {
        if (!moving || t >= moveEnd_ms || moveEnd_ms <= moveStart_ms) return moving ? target : at;
        if (t <= moveStart_ms) return at;
        const double f = (t - moveStart_ms) / (moveEnd_ms - moveStart_ms);
        return Point{at.x + (target.x - at.x) * f, at.y + (target.y - at.y) * f};
    }
};

class Converter {
public:
    // With `countOnly` the frames are counted and checked but not made: a first pass that
    // finds every error, and a session too long, without building its events.
    Converter(const GestureScript& script, formats::FrameRecording* out, std::string* error, bool countOnly)
        : script_(script), out_(out), error_(error), countOnly_(countOnly) {}

    bool convert() {
        *out_ = formats::FrameRecording{};
        out_->name = script_.name;
        out_->headerLine = script_.surfaceLine;
        writeHeader();

        // The session lasts until its last statement and the end of its last move.
        double end_ms = -1.0;
        for (const Statement& st : script_.statements) {
            if (!st.timed) continue;
            end_ms = std::max(end_ms, st.time_ms);
            if (st.kind == Statement::Kind::MoveTo || st.kind == Statement::Kind::MoveBy)
                end_ms = std::max(end_ms, st.time_ms + st.duration_ms);
        }

        size_t next = 0;
        for (; next < script_.statements.size() && !script_.statements[next].timed; ++next)
            addSetting(script_.statements[next]);
        if (end_ms < 0.0) return true;

        lastLine_ = script_.surfaceLine;
        for (uint64_t k = 0;; ++k) {
            const double t = frameTime(k);
            for (; next < script_.statements.size() && script_.statements[next].time_ms <= t; ++next)
                if (!apply(script_.statements[next])) return false;
            if (frames_ >= kMaxFrames)
                return fail(lastLine_, "the session would have more than " + std::to_string(kMaxFrames) +
                                           " frames; is a contact left down?");
            if (t >= end_ms && !anyMoveAfter(t)) {
                emitFrame(k);
                break;
            }
            if (!emitFrame(k) && next < script_.statements.size()) {
                // Nothing to report until the next statement: skip to its frame.
                const uint64_t skipTo = firstFrameAtOrAfter(script_.statements[next].time_ms);
                if (skipTo > k + 1) k = skipTo - 1;
            }
        }
        return true;
    }

private:
    bool fail(size_t line, const std::string& what) {
        *error_ = script_.name + ":" + std::to_string(line) + ": " + what;
        return false;
    }

    double frameInterval_ms() const { return 1000.0 / script_.rate_Hz; }
    double frameTime(uint64_t k) const { return static_cast<double>(k) * 1000.0 / script_.rate_Hz; }
    uint64_t firstFrameAtOrAfter(double t) const {
        uint64_t k = static_cast<uint64_t>(std::max(0.0, std::floor(t * script_.rate_Hz / 1000.0)));
        while (k > 0 && frameTime(k - 1) >= t) --k;
        while (frameTime(k) < t) ++k;
        return k;
    }
    uint64_t frameTimestamp(uint64_t k) const {
        return static_cast<uint64_t>(std::llround(script_.clock_ms * 1e6)) +
               static_cast<uint64_t>(std::llround(static_cast<double>(k) * 1e9 / script_.rate_Hz));
    }
    bool anyMoveAfter(double t) const {
        for (const Contact& c : contacts_)
            if (c.moving && c.moveEnd_ms > t) return true;
        return false;
    }

    void writeHeader() {
        formats::FrameRecordingHeader& header = out_->header;
        for (const auto& pair : kScriptUsagePairs) header.service.usagePairs.push_back(HIDUsagePair{pair[0], pair[1]});
        const Surface& surface = script_.surface;
        PropertyDictionary dimensions;
        dimensions["Width"] =
            PropertyValue(static_cast<int64_t>(std::llround(surface.width_mm / kMillimetresPerCentimetre * kFixedPointOne)));
        dimensions["Height"] =
            PropertyValue(static_cast<int64_t>(std::llround(surface.height_mm / kMillimetresPerCentimetre * kFixedPointOne)));
        header.service.properties["SurfaceDimensions"] = PropertyValue(std::move(dimensions));
        header.service.properties["Transport"] =
            PropertyValue(surface.transport == Transport::Bluetooth ? "Bluetooth" : "USB");
        header.timebase = TimebaseInfo{1, 1};  // ticks are nanoseconds
    }

    void addSetting(const Statement& st) {
        if (countOnly_) return;
        if (!clientAdded_) {
            // Settings come from a client: the first one connects before it sets anything.
            formats::InputRecord client;
            client.kind = formats::InputRecord::Kind::Client;
            client.line = st.line;
            client.clientID = kSettingsClientID;
            client.clientAdded = true;
            out_->records.push_back(std::move(client));
            clientAdded_ = true;
        }
        formats::InputRecord record;
        record.kind = formats::InputRecord::Kind::SetProperty;
        record.line = st.line;
        record.propertyKey = st.key;
        record.propertyValue = st.value;
        out_->records.push_back(std::move(record));
    }

    Contact* active(const std::string& name) {
        for (Contact& c : contacts_)
            if (!c.lifting && c.name == name) return &c;
        return nullptr;
    }

    Contact* touching(const Statement& st) {
        Contact* c = active(st.contact);
        if (!c) {
            fail(st.line, std::string("there is no ") + contactKindName(st.contactKind) + " " + st.contact +
                              " on the surface at " + formatNumber(st.time_ms) + " ms");
            return nullptr;
        }
        if (c->kind != st.contactKind) {
            fail(st.line, st.contact + " went down as a " + contactKindName(c->kind) + " (line " +
                              std::to_string(c->downLine) + "), not a " + contactKindName(st.contactKind));
            return nullptr;
        }
        return c;
    }

    bool onSurface(size_t line, Point p) {
        const Surface& surface = script_.surface;
        if (p.x < 0.0 || p.y < 0.0 || p.x > surface.width_mm || p.y > surface.height_mm)
            return fail(line, "position (" + formatNumber(p.x) + ", " + formatNumber(p.y) + ") mm is off the " +
                                  formatNumber(surface.width_mm) + " x " + formatNumber(surface.height_mm) +
                                  " mm surface");
        return true;
    }

    // The lowest contact index that no contact on the surface (or still to be reported
    // lifted) holds, as a driver hands out its slots.
    int32_t freeIndex() const {
        for (int32_t index = 0;; ++index) {
            bool used = false;
            for (const Contact& c : contacts_) used = used || c.index == index;
            if (!used) return index;
        }
    }

    bool apply(const Statement& st) {
        lastLine_ = st.line;
        switch (st.kind) {
        case Statement::Kind::Set: addSetting(st); return true;
        case Statement::Kind::End: return true;
        case Statement::Kind::ClickDown:
        case Statement::Kind::ClickUp: {
            const bool down = st.kind == Statement::Kind::ClickDown;
            if (clickDown_ == down)
                return fail(st.line, std::string("the click is already ") + (down ? "down" : "up") +
                                         (clickLine_ ? " (line " + std::to_string(clickLine_) + ")" : ""));
            clickDown_ = down;
            clickLine_ = st.line;
            return true;
        }
        case Statement::Kind::Down: {
            if (const Contact* c = active(st.contact))
                return fail(st.line, std::string(contactKindName(c->kind)) + " " + st.contact +
                                         " is already down (line " + std::to_string(c->downLine) + ")");
            Contact c;
            c.name = st.contact;
            c.kind = st.contactKind;
            c.index = freeIndex();
            c.downLine = st.line;
            c.at = Point{st.x_mm, st.y_mm};
            contacts_.push_back(std::move(c));
            std::sort(contacts_.begin(), contacts_.end(),
                      [](const Contact& a, const Contact& b) { return a.index < b.index; });
            return true;
        }
        case Statement::Kind::MoveTo:
        case Statement::Kind::MoveBy: {
            Contact* c = touching(st);
            if (!c) return false;
            if (c->moving && c->moveEnd_ms > st.time_ms)
                return fail(st.line, st.contact + " is still moving until " + formatNumber(c->moveEnd_ms) +
                                         " ms (line " + std::to_string(c->moveLine) + ")");
            const Point from = c->positionAt(st.time_ms);
            const Point to = st.kind == Statement::Kind::MoveTo ? Point{st.x_mm, st.y_mm}
                                                                 : Point{from.x + st.x_mm, from.y + st.y_mm};
            if (!onSurface(st.line, to)) return false;
            c->at = from;
            c->target = to;
            c->moving = true;
            c->moveStart_ms = st.time_ms;
            c->moveEnd_ms = st.time_ms + st.duration_ms;
            c->moveLine = st.line;
            return true;
        }
        case Statement::Kind::Up: {
            Contact* c = touching(st);
            if (!c) return false;
            if (!c->reported)
                return fail(st.line, st.contact + " goes up before any frame has reported it down (line " +
                                         std::to_string(c->downLine) + "); frames are " +
                                         formatNumber(frameInterval_ms()) + " ms apart");
            c->at = c->positionAt(st.time_ms);
            c->moving = false;
            c->lifting = true;
            return true;
        }
        }
        return true;
    }

    HIDEventRef scanTimeChild(uint64_t timestamp) const {
        HIDEventRef child = HIDEvent::create(kHIDEventTypeVendorDefined, timestamp);
        child->setIntegerValue(kScanTimeUsagePage, kHIDEventFieldVendorDefinedUsagePage);
        child->setIntegerValue(kScanTimeUsage, kHIDEventFieldVendorDefinedUsage);
        child->setIntegerValue(kScanTimeLength, kHIDEventFieldVendorDefinedDataLength);
        const auto count = static_cast<uint16_t>(
            static_cast<uint64_t>(std::floor(static_cast<double>(timestamp) / kScanTimeUnit_ns)) & 0xffffu);
        uint8_t bytes[2];
        std::memcpy(bytes, &count, sizeof bytes);  // the host's byte order
        child->setDataValue(bytes, sizeof bytes, kHIDEventFieldVendorDefinedData);
        return child;
    }

    // Builds frame k when it has something to report; false when it has not.
    bool emitFrame(uint64_t k) {
        const double t = frameTime(k);
        const bool clickChanged = clickDown_ != lastClickDown_;
        if (contacts_.empty() && !clickChanged && !clickDown_) return false;

        if (countOnly_) {
            for (Contact& c : contacts_) c.reported = true;
            std::erase_if(contacts_, [](const Contact& c) { return c.lifting; });
            lastClickDown_ = clickDown_;
            ++frames_;
            return true;
        }
        const uint64_t timestamp = frameTimestamp(k);
        HIDEventRef frame = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
        int64_t eventMask = 0;
        bool anyTouch = false;
        for (Contact& c : contacts_) {
            const Point p = c.lifting ? c.at : c.positionAt(t);
            const double x = p.x / script_.surface.width_mm;
            const double y = 1.0 - p.y / script_.surface.height_mm;
            int64_t mask = 0;
            if (!c.reported) {
                mask = kHIDDigitizerEventRange | kHIDDigitizerEventTouch | kHIDDigitizerEventPosition;
            } else {
                if (c.lifting) mask |= kHIDDigitizerEventRange | kHIDDigitizerEventTouch;
                if (x != c.lastX || y != c.lastY) mask |= kHIDDigitizerEventPosition;
            }
            const int64_t touch = c.lifting ? 0 : 1;
            HIDEventRef child = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
            child->setDoubleValue(x, kHIDEventFieldDigitizerX);
            child->setDoubleValue(y, kHIDEventFieldDigitizerY);
            child->setIntegerValue(c.kind == ContactKind::Palm ? kPalmTransducer : kFingerTransducer,
                                   kHIDEventFieldDigitizerType);
            child->setIntegerValue(c.index, kHIDEventFieldDigitizerIndex);
            child->setIntegerValue(mask, kHIDEventFieldDigitizerEventMask);
            child->setIntegerValue(touch, kHIDEventFieldDigitizerRange);
            child->setIntegerValue(touch, kHIDEventFieldDigitizerTouch);
            frame->appendEvent(child);
            eventMask |= mask;
            anyTouch = anyTouch || touch != 0;
            c.reported = true;
            c.lastX = x;
            c.lastY = y;
        }
        frame->setIntegerValue(clickDown_ ? 1 : 0, kHIDEventFieldDigitizerButtonMask);
        frame->setIntegerValue(eventMask, kHIDEventFieldDigitizerEventMask);
        frame->setIntegerValue(anyTouch ? 1 : 0, kHIDEventFieldDigitizerRange);
        frame->setIntegerValue(anyTouch ? 1 : 0, kHIDEventFieldDigitizerTouch);
        if (script_.surface.transport == Transport::Bluetooth) frame->appendEvent(scanTimeChild(timestamp));

        formats::InputRecord record;
        record.kind = formats::InputRecord::Kind::Event;
        record.line = lastLine_;
        record.event = frame;
        out_->records.push_back(std::move(record));

        std::erase_if(contacts_, [](const Contact& c) { return c.lifting; });
        lastClickDown_ = clickDown_;
        ++frames_;
        return true;
    }

    const GestureScript& script_;
    formats::FrameRecording* out_;
    std::string* error_;
    bool countOnly_;
    std::vector<Contact> contacts_;  // in index order
    bool clientAdded_ = false;
    bool clickDown_ = false;
    bool lastClickDown_ = false;
    size_t clickLine_ = 0;
    size_t lastLine_ = 0;
    size_t frames_ = 0;
};

}  // namespace

bool gestureScriptToFrames(const GestureScript& script, formats::FrameRecording* out, std::string* error) {
    formats::FrameRecording counted;
    Converter first(script, &counted, error, true);
    if (!first.convert()) return false;
    Converter converter(script, out, error, false);
    return converter.convert();
}

bool readGestureScript(std::string_view content, const std::string& name, formats::FrameRecording* out,
                       std::string* error) {
    GestureScript script;
    if (!parseGestureScript(content, name, &script, error)) return false;
    return gestureScriptToFrames(script, out, error);
}

}  // namespace orvane::script
