#pragma once
// End-to-end tests: a recording (written as a gesture script, or frame by frame) goes
// through the loaded plug-in as orvane replay drives it, and the whole event stream and the
// gesture lines of the log come back as text, one line per output:
//
//   #0 return pointer{x=0 y=0 z=0 buttons=0}[digitizer{...}[digitizer{...}], scroll@may-begin{x=0 y=0 z=0}]
//   #1 return none
//   #11 dispatch pointer{...}[digitizer{...}[...], button{mask=1 number=1 state=1}]
//
// Every field an event carries is written, by name, in selector order; doubles of the
// digitizer events (positions) with 6 significant digits, the gesture values with 4. A
// timestamp other than the frame's and a sender other than 0 are written too (t=, sender=).
// The expectations are built with the helpers below from the rules, in the same text.

#include <gtest/gtest.h>

#include <cstdio>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "platform/HIDEventDispatcher.h"
#include "platform/HIDEventService.h"
#include "platform/Logging.h"
#include "platform/Timebase.h"
#include "tools/analysis/Timeline.h"
#include "tools/formats/FrameRecording.h"
#include "tools/host/PlugInHost.h"
#include "tools/script/GestureScriptFrames.h"

namespace orvane::e2e {

inline constexpr const char* kPlugInDirectory = ORVANE_E2E_PLUGIN_DIRECTORY;

// The surface every scenario uses: 160 x 80 mm, so that positions in steps of 0.625 mm are
// exact binary fractions of it (1/256 of the width, 1/128 of the height).
inline constexpr double kWidth_mm = 160.0;
inline constexpr double kHeight_mm = 80.0;
inline const std::string kSurface = "# orvane gesture script\nsurface 160 x 80 mm usb\nrate 125 Hz\n";

// The two signatures the gesture lines are written with.
inline const std::string kCreateGestureEvents =
    "-[HIDGestureParser createGestureEvents:handMotion:handEvent:pointerEvent:gestureEvent:dispatcher:"
    "tapToClickEnabled:twoFingersSecondaryClickEnabled:]";
inline const std::string kCancelScrollMayBegin = "-[HIDGestureParser cancelScrollMayBegin:pointerEvent:]";

// ---------------------------------------------------------------------------------------
// Text

inline std::string formatted(const char* pattern, double value) {
    char buffer[64];
    std::snprintf(buffer, sizeof buffer, pattern, value);
    return buffer;
}
inline std::string position(double v) { return formatted("%.6g", v); }
inline std::string hex(uint32_t v) {
    char buffer[16];
    std::snprintf(buffer, sizeof buffer, "0x%x", v);
    return buffer;
}
inline std::string value(double v) { return formatted("%.4g", v); }

inline std::string phaseText(uint16_t phase) {
    switch (phase) {
    case 1: return "began";
    case 2: return "changed";
    case 4: return "ended";
    case 8: return "cancelled";
    case 0x80: return "may-begin";
    default: return hex(phase);
    }
}

inline std::string typeText(uint32_t type) {
    switch (type) {
    case kHIDEventTypeVendorDefined: return "vendor";
    case kHIDEventTypeButton: return "button";
    case kHIDEventTypeRotation: return "rotation";
    case kHIDEventTypeScroll: return "scroll";
    case kHIDEventTypeScale: return "scale";
    case kHIDEventTypeDigitizer: return "digitizer";
    case kHIDEventTypePointer: return "pointer";
    default: return "type" + std::to_string(type);
    }
}

inline std::string fieldName(uint32_t selector) {
    static const std::map<uint32_t, std::string> names = {
        {kHIDEventFieldButtonMask, "mask"},       {kHIDEventFieldButtonNumber, "number"},
        {kHIDEventFieldButtonState, "state"},     {kHIDEventFieldRotationX, "x"},
        {kHIDEventFieldRotationY, "y"},           {kHIDEventFieldRotationZ, "z"},
        {kHIDEventFieldScrollX, "x"},             {kHIDEventFieldScrollY, "y"},
        {kHIDEventFieldScrollZ, "z"},             {kHIDEventFieldScaleX, "x"},
        {kHIDEventFieldScaleY, "y"},              {kHIDEventFieldScaleZ, "z"},
        {kHIDEventFieldDigitizerX, "x"},          {kHIDEventFieldDigitizerY, "y"},
        {kHIDEventFieldDigitizerZ, "z"},          {kHIDEventFieldDigitizerButtonMask, "buttons"},
        {kHIDEventFieldDigitizerType, "type"},    {kHIDEventFieldDigitizerIndex, "index"},
        {kHIDEventFieldDigitizerIdentity, "id"},  {kHIDEventFieldDigitizerEventMask, "mask"},
        {kHIDEventFieldDigitizerRange, "range"},  {kHIDEventFieldDigitizerTouch, "touch"},
        {kHIDEventFieldDigitizerGenerationCount, "gen"},
        {kHIDEventFieldPointerX, "x"},            {kHIDEventFieldPointerY, "y"},
        {kHIDEventFieldPointerZ, "z"},            {kHIDEventFieldPointerButtonMask, "buttons"},
    };
    const auto it = names.find(selector);
    return it != names.end() ? it->second : hex(selector);
}

inline std::string render(const HIDEvent& e, uint64_t frameTimestamp) {
    std::string out = typeText(e.type());
    if (e.phase() != 0) out += "@" + phaseText(e.phase());
    if (e.timestamp() != frameTimestamp) out += " t=" + std::to_string(e.timestamp());
    if (e.senderID() != 0) out += " sender=" + std::to_string(e.senderID());
    out += "{";
    bool first = true;
    for (const HIDEvent::Field& f : e.fields()) {
        out += (first ? "" : " ") + fieldName(f.selector) + "=";
        first = false;
        switch (f.kind) {
        case HIDFieldKind::Integer: out += std::to_string(f.integer); break;
        case HIDFieldKind::Double:
            out += e.type() == kHIDEventTypeDigitizer ? position(f.real) : value(f.real);
            break;
        case HIDFieldKind::Data: out += std::to_string(f.data.size()) + " bytes"; break;
        }
    }
    out += "}";
    if (!e.children().empty()) {
        out += "[";
        for (size_t i = 0; i < e.children().size(); ++i)
            out += (i ? ", " : "") + render(*e.children()[i], frameTimestamp);
        out += "]";
    }
    return out;
}

// ---------------------------------------------------------------------------------------
// Expectations

// One contact of a UI hand event, in millimetres as the script wrote it.
struct Contact {
    int index = 0;
    double x_mm = 0.0, y_mm = 0.0;
    int mask = 0;          // the event mask it leaves the filter with
    int touch = 1;         // touch and range
    int type = 1;          // 1 finger, 3 palm
    bool resting = false;  // a resting thumb: left out of the hand centre
    bool yFlippedBack = false;  // stamped twice: its y is the digitizer's own again
    bool removed = false;  // taken out of the hand event after the hand centre was worked out
};

// The digitizer's y of a position: 1 - y / height. The hand event carries it flipped back
// (y / height) after one stamping.
inline double digitizerY(double y_mm) { return 1.0 - y_mm / kHeight_mm; }

inline std::string contact(const Contact& c, int gen) {
    std::string out = "digitizer{x=" + position(c.x_mm / kWidth_mm) + " y=" +
                      position(c.yFlippedBack ? digitizerY(c.y_mm) : c.y_mm / kHeight_mm);
    out += " type=" + std::to_string(c.type) + " index=" + std::to_string(c.index) + " id=" +
           std::to_string(c.index + 1) + " mask=" + std::to_string(c.mask) + " range=" + std::to_string(c.touch) +
           " touch=" + std::to_string(c.touch) + " gen=" + std::to_string(gen) + "}";
    return out;
}

// The UI hand event: the frame's parent with the hand centre (the mean digitizer x and y
// of the contacts that are not resting thumbs, y flipped once), the click as the frame
// reported it, the OR of the children's masks, touch and range when any child has them,
// and the generation count; then its children in the frame's order.
inline std::string hand(int gen, const std::vector<Contact>& contacts, int buttons = 0) {
    double sx = 0.0, sy = 0.0;
    int n = 0, mask = 0, touch = 0;
    for (const Contact& c : contacts) {
        if (!c.removed) {
            mask |= c.mask;
            touch |= c.touch;
        }
        if (c.resting) continue;
        sx += c.x_mm / kWidth_mm;
        sy += digitizerY(c.y_mm);
        ++n;
    }
    std::string out = "digitizer{x=" + position(sx / n) + " y=" + position(1.0 - sy / n) +
                      " buttons=" + std::to_string(buttons) + " mask=" + std::to_string(mask) +
                      " range=" + std::to_string(touch) + " touch=" + std::to_string(touch) +
                      " gen=" + std::to_string(gen) + "}[";
    bool first = true;
    for (const Contact& c : contacts) {
        if (c.removed) continue;
        out += (first ? "" : ", ") + contact(c, gen);
        first = false;
    }
    return out + "]";
}

inline std::string pointer(const std::vector<std::string>& children, double x = 0.0, double y = 0.0,
                           int buttons = 0) {
    std::string out = "pointer{x=" + value(x) + " y=" + value(y) + " z=0 buttons=" + std::to_string(buttons) + "}";
    if (children.empty()) return out;
    out += "[";
    for (size_t i = 0; i < children.size(); ++i) out += (i ? ", " : "") + children[i];
    return out + "]";
}

inline constexpr uint16_t kBegan = 1, kChanged = 2, kEnded = 4, kCancelled = 8, kMayBegin = 0x80;

inline std::string scroll(uint16_t phase, double x = 0.0, double y = 0.0) {
    return "scroll@" + phaseText(phase) + "{x=" + value(x) + " y=" + value(y) + " z=0}";
}
inline std::string scale(uint16_t phase, double z) { return "scale@" + phaseText(phase) + "{x=0 y=0 z=" + value(z) + "}"; }
inline std::string rotation(uint16_t phase, double z) {
    return "rotation@" + phaseText(phase) + "{x=0 y=0 z=" + value(z) + "}";
}
// A stateful button event: the mask, the number of its lowest button (1 for a release)
// and the state.
inline std::string button(int mask) {
    const int number = mask == 0 ? 1 : (mask & 1 ? 1 : (mask & 2 ? 2 : 3));
    return "button{mask=" + std::to_string(mask) + " number=" + std::to_string(number) +
           " state=" + std::to_string(mask != 0 ? 1 : 0) + "}";
}

inline std::string returned(int64_t input, const std::string& event) { return "#" + std::to_string(input) + " return " + event; }
inline std::string dispatched(int64_t input, const std::string& event) {
    return "#" + std::to_string(input) + " dispatch " + event;
}
inline std::string none(int64_t input) { return "#" + std::to_string(input) + " return none"; }
inline std::string setProperty(int64_t input, const std::string& key, bool result) {
    return "#" + std::to_string(input) + " setProperty " + key + (result ? " true" : " false");
}
// Inputs from..to (both included) that return none.
inline void nones(std::vector<std::string>& lines, int64_t from, int64_t to) {
    for (int64_t i = from; i <= to; ++i) lines.push_back(none(i));
}

// A gesture line of the log: the record it was written for and the message.
inline std::string gestureLine(int64_t input, const std::string& what, const std::string& signature = kCreateGestureEvents) {
    return "#" + std::to_string(input) + " " + signature + " GESTURE " + what;
}

// ---------------------------------------------------------------------------------------
// Running

struct Replay {
    std::vector<std::string> stream;
    std::vector<std::string> gestureLog;  // ServiceFilter lines at the default level with " GESTURE "
    std::vector<std::string> otherLog;    // the rest, for messages
    analysis::Timeline timeline;
    bool ok = false;
};

class RecordingLogSink : public LogSink {
public:
    void write(const LogRecord& record) override {
        const std::string line = "#" + std::to_string(input) + " " + record.message;
        if (record.category == "ServiceFilter" && record.level == LogLevel::Default &&
            record.message.find(" GESTURE ") != std::string::npos)
            gestures.push_back(line);
        else
            others.push_back(std::string(record.category) + " " + logLevelName(record.level) + " " + line);
    }
    int64_t input = -1;
    std::vector<std::string> gestures, others;
};

// Drives the plug-in as orvane replay does: load, match, construct, activate, one record at
// a time, cancel.
inline Replay replay(const formats::FrameRecording& recording) {
    Replay out;
    Timebase::set(recording.header.timebase.numer, recording.header.timebase.denom);
    auto sink = std::make_shared<RecordingLogSink>();
    Logging::setSink(sink);
    analysis::TimelineBuilder timeline(recording.header.timebase, recording.name);

    int64_t input = -1;
    uint64_t frameTimestamp = 0;
    auto dispatcher = std::make_shared<CallbackEventDispatcher>([&](const HIDEventRef& event) {
        out.stream.push_back(dispatched(input, render(*event, frameTimestamp)));
        timeline.addDispatched(input, *event);
    });
    auto service = std::make_shared<HIDEventService>(recording.header.service.usagePairs,
                                                     recording.header.service.properties);
    host::PlugInHost host;
    std::string error;
    int64_t score = 0;
    const bool opened = host.load(kPlugInDirectory, recording.header.bundle.value_or(PropertyDictionary{}), &error) &&
                        host.matchService(service, {}, &score, &error) && host.createFilter(service, &error) &&
                        host.activate(dispatcher, &error);
    EXPECT_TRUE(opened) << error;
    if (opened) {
        std::vector<HIDConnectionRef> clients;
        for (size_t n = 0; n < recording.records.size(); ++n) {
            const formats::InputRecord& record = recording.records[n];
            input = static_cast<int64_t>(n);
            sink->input = input;
            switch (record.kind) {
            case formats::InputRecord::Kind::Event: {
                frameTimestamp = record.event->timestamp();
                timeline.addFrame(input, frameTimestamp);
                HIDEventRef result;
                EXPECT_TRUE(host.filterEvent(record.event, &result, &error)) << error;
                out.stream.push_back(result ? returned(input, render(*result, frameTimestamp)) : none(input));
                timeline.addReturned(input, result.get());
                break;
            }
            case formats::InputRecord::Kind::SetProperty: {
                bool accepted = false;
                EXPECT_TRUE(host.setProperty(record.propertyValue, record.propertyKey,
                                             clients.empty() ? nullptr : clients.back(), &accepted, &error))
                    << error;
                out.stream.push_back(setProperty(input, record.propertyKey, accepted));
                timeline.addSetting(input, record.propertyKey, record.propertyValue, accepted);
                break;
            }
            case formats::InputRecord::Kind::Client: {
                auto client = std::make_shared<HIDConnection>(record.clientID);
                if (record.clientAdded) clients.push_back(client);
                EXPECT_TRUE(host.clientNotification(client, record.clientAdded, &error)) << error;
                timeline.addOtherRecord(input);
                break;
            }
            }
        }
        EXPECT_TRUE(host.cancel(&error)) << error;
        host.unload();
        out.ok = true;
    }
    Logging::setSink(std::make_shared<StandardErrorLogSink>());
    out.gestureLog = sink->gestures;
    out.otherLog = sink->others;
    out.timeline = timeline.finish();
    return out;
}

inline formats::FrameRecording recordingOf(const std::string& script) {
    formats::FrameRecording recording;
    std::string error;
    EXPECT_TRUE(script::readGestureScript(script, "scenario.gestures", &recording, &error)) << error;
    return recording;
}

inline Replay replayScript(const std::string& script) { return replay(recordingOf(script)); }

// Compares line by line, so that a difference names the input record.
inline void expectLines(const std::vector<std::string>& actual, const std::vector<std::string>& expected,
                        const char* what) {
    for (size_t i = 0; i < std::max(actual.size(), expected.size()); ++i) {
        const std::string a = i < actual.size() ? actual[i] : "(nothing)";
        const std::string e = i < expected.size() ? expected[i] : "(nothing)";
        EXPECT_EQ(a, e) << what << " line " << i;
    }
}

// ---------------------------------------------------------------------------------------
// Frames written directly, for what a script cannot say (a driver that keeps reporting a
// lifted contact).

struct RawContact {
    int index = 0;
    double x_mm = 0.0, y_mm = 0.0;
    int touch = 1;
    int type = 1;
    int mask = 0;
};

inline HIDEventRef rawFrame(double t_ms, const std::vector<RawContact>& contacts, int buttons = 0) {
    const auto timestamp = static_cast<uint64_t>(1'000'000'000.0 + t_ms * 1'000'000.0);
    HIDEventRef frame = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
    int64_t mask = 0;
    int64_t touch = 0;
    for (const RawContact& c : contacts) {
        HIDEventRef child = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
        child->setDoubleValue(c.x_mm / kWidth_mm, kHIDEventFieldDigitizerX);
        child->setDoubleValue(digitizerY(c.y_mm), kHIDEventFieldDigitizerY);
        child->setIntegerValue(c.type, kHIDEventFieldDigitizerType);
        child->setIntegerValue(c.index, kHIDEventFieldDigitizerIndex);
        child->setIntegerValue(c.mask, kHIDEventFieldDigitizerEventMask);
        child->setIntegerValue(c.touch, kHIDEventFieldDigitizerRange);
        child->setIntegerValue(c.touch, kHIDEventFieldDigitizerTouch);
        frame->appendEvent(child);
        mask |= c.mask;
        touch |= c.touch;
    }
    frame->setIntegerValue(buttons, kHIDEventFieldDigitizerButtonMask);
    frame->setIntegerValue(mask, kHIDEventFieldDigitizerEventMask);
    frame->setIntegerValue(touch, kHIDEventFieldDigitizerRange);
    frame->setIntegerValue(touch, kHIDEventFieldDigitizerTouch);
    return frame;
}

inline formats::FrameRecording rawRecording(const std::vector<HIDEventRef>& frames) {
    formats::FrameRecording recording = recordingOf(kSurface);  // the header
    for (const HIDEventRef& f : frames) {
        formats::InputRecord record;
        record.kind = formats::InputRecord::Kind::Event;
        record.event = f;
        recording.records.push_back(record);
    }
    return recording;
}

}  // namespace orvane::e2e
