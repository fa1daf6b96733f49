#include "Timeline.h"

#include <algorithm>
#include <cstdio>
#include <ostream>

#include "tools/formats/PropertyJson.h"

namespace orvane::analysis {

namespace {

constexpr uint16_t kPhaseBegan = 1;
constexpr uint16_t kPhaseChanged = 2;
constexpr uint16_t kPhaseEnded = 4;
constexpr uint16_t kPhaseCancelled = 8;
constexpr uint16_t kPhaseMayBegin = 0x80;

constexpr uint32_t kSecondaryButtonMask = 2;

std::string format(const char* pattern, double value) {
    char buffer[64];
    std::snprintf(buffer, sizeof buffer, pattern, value);
    return buffer;
}

std::string hexMask(uint32_t mask) {
    char buffer[16];
    std::snprintf(buffer, sizeof buffer, "0x%x", mask);
    return buffer;
}

std::string plural(size_t n, const char* one, const char* many) {
    return std::to_string(n) + " " + (n == 1 ? one : many);
}

std::string phaseList(const Episode& episode) {
    std::string out;
    for (const PhaseRun& run : episode.phases) {
        if (!out.empty()) out += ", ";
        if (run.count > 1) out += std::to_string(run.count) + " ";
        out += phaseName(run.phase);
    }
    if (!episode.finished) out += out.empty() ? "not ended" : ", not ended";
    return out;
}

}  // namespace

const char* episodeKindName(EpisodeKind kind) {
    switch (kind) {
    case EpisodeKind::Setting: return "setting";
    case EpisodeKind::Pointer: return "pointer";
    case EpisodeKind::Scroll: return "scroll";
    case EpisodeKind::Scale: return "scale";
    case EpisodeKind::Rotation: return "rotation";
    case EpisodeKind::Button: return "click";
    case EpisodeKind::Tap: return "tap";
    }
    return "?";
}

std::string phaseName(uint16_t phase) {
    switch (phase) {
    case 0: return "none";
    case kPhaseBegan: return "began";
    case kPhaseChanged: return "changed";
    case kPhaseEnded: return "ended";
    case kPhaseCancelled: return "cancelled";
    case kPhaseMayBegin: return "may-begin";
    default: return hexMask(phase);
    }
}

TimelineBuilder::TimelineBuilder(TimebaseInfo timebase, std::string name) {
    timeline_.timebase = timebase;
    timeline_.name = std::move(name);
}

Moment TimelineBuilder::moment(int64_t input) const {
    Moment m;
    m.input = input;
    if (!haveFrame_) return m;
    m.hasTime = true;
    m.timestamp = frameTimestamp_;
    const double ticks = frameTimestamp_ >= timeline_.origin.timestamp
                             ? static_cast<double>(frameTimestamp_ - timeline_.origin.timestamp)
                             : -static_cast<double>(timeline_.origin.timestamp - frameTimestamp_);
    m.ms = ticks * timeline_.timebase.numer / (static_cast<double>(timeline_.timebase.denom) * 1'000'000.0);
    return m;
}

Episode& TimelineBuilder::begin(EpisodeKind kind, int64_t input) {
    Episode episode;
    episode.kind = kind;
    episode.start = episode.end = moment(input);
    episode.inputs.push_back(input);
    timeline_.episodes.push_back(std::move(episode));
    return timeline_.episodes.back();
}

void TimelineBuilder::touch(Episode& episode, int64_t input) {
    episode.end = moment(input);
    if (episode.inputs.empty() || episode.inputs.back() != input) episode.inputs.push_back(input);
}

void TimelineBuilder::addPhase(Episode& episode, uint16_t phase) {
    if (!episode.phases.empty() && episode.phases.back().phase == phase) ++episode.phases.back().count;
    else episode.phases.push_back(PhaseRun{phase, 1});
}

void TimelineBuilder::closePointer() { open_.pointer = -1; }

void TimelineBuilder::addFrame(int64_t input, uint64_t timestamp) {
    ++timeline_.counts.inputs;
    ++timeline_.counts.frames;
    frameTimestamp_ = timestamp;
    if (!haveFrame_) {
        haveFrame_ = true;
        timeline_.origin = Moment{input, timestamp, 0.0, true};
    }
    // Settings since the last frame took effect before this one: they get its time.
    for (size_t index : pendingSettings_) {
        Episode& setting = timeline_.episodes[index];
        const int64_t settingInput = setting.start.input;
        setting.start = setting.end = moment(settingInput);
    }
    pendingSettings_.clear();
}

void TimelineBuilder::addSetting(int64_t input, const std::string& key, const PropertyValue& value, bool accepted) {
    ++timeline_.counts.inputs;
    ++timeline_.counts.settings;
    Episode& episode = begin(EpisodeKind::Setting, input);
    episode.key = key;
    episode.value = value;
    episode.accepted = accepted;
    episode.finished = true;
    pendingSettings_.push_back(timeline_.episodes.size() - 1);
}

void TimelineBuilder::addOtherRecord(int64_t) { ++timeline_.counts.inputs; }

void TimelineBuilder::gestureChild(const HIDEvent& child, int64_t input) {
    const uint16_t phase = child.phase();
    int* open = nullptr;
    EpisodeKind kind;
    switch (child.type()) {
    case kHIDEventTypeScroll: open = &open_.scroll; kind = EpisodeKind::Scroll; break;
    case kHIDEventTypeScale: open = &open_.scale; kind = EpisodeKind::Scale; break;
    case kHIDEventTypeRotation: open = &open_.rotation; kind = EpisodeKind::Rotation; break;
    default: return;
    }
    // Withdrawing a may-begin goes with the pointer's start; everything else ends the pointer.
    if (phase != kPhaseCancelled) closePointer();

    bool fresh = *open < 0;
    if (!fresh) {
        const Episode& current = timeline_.episodes[static_cast<size_t>(*open)];
        if (phase == kPhaseMayBegin) fresh = true;
        if (phase == kPhaseBegan) {
            // A scroll that may begin continues into its beginning; anything else starts anew.
            const bool onlyMayBegin = kind == EpisodeKind::Scroll && !current.phases.empty() &&
                                      std::all_of(current.phases.begin(), current.phases.end(), [](const PhaseRun& r) {
                                          return r.phase == kPhaseMayBegin;
                                      });
            fresh = !onlyMayBegin;
        }
    }
    if (fresh) {
        begin(kind, input);
        *open = static_cast<int>(timeline_.episodes.size() - 1);
    }
    Episode& episode = timeline_.episodes[static_cast<size_t>(*open)];
    touch(episode, input);
    addPhase(episode, phase);
    ++episode.events;
    if (kind == EpisodeKind::Scroll) {
        episode.x += child.doubleValueForField(kHIDEventFieldScrollX);
        episode.y += child.doubleValueForField(kHIDEventFieldScrollY);
    } else if (kind == EpisodeKind::Scale) {
        episode.z += child.doubleValueForField(kHIDEventFieldScaleZ);
    } else {
        episode.z += child.doubleValueForField(kHIDEventFieldRotationZ);
    }
    if (phase == kPhaseEnded || phase == kPhaseCancelled) {
        episode.finished = true;
        episode.cancelled = phase == kPhaseCancelled;
        *open = -1;
    }
}

void TimelineBuilder::addDispatched(int64_t input, const HIDEvent& event) {
    ++timeline_.counts.dispatched;
    auto press = [&](const HIDEvent& button) {
        const auto mask = static_cast<uint32_t>(button.integerValueForField(kHIDEventFieldButtonMask));
        if (mask == 0) return;
        closePointer();
        Episode& tap = begin(EpisodeKind::Tap, input);
        tap.buttonMask = mask;
        tap.events = 1;
        tapInput_ = input;
        tapEpisode_ = static_cast<int>(timeline_.episodes.size() - 1);
    };
    if (event.type() == kHIDEventTypeButton) {
        press(event);
        return;
    }
    for (const HIDEventRef& child : event.children()) {
        if (child->type() == kHIDEventTypeButton) press(*child);
        else gestureChild(*child, input);
    }
}

void TimelineBuilder::addReturned(int64_t input, const HIDEvent* event) {
    if (!event) {
        ++timeline_.counts.returnedNone;
        return;
    }
    ++timeline_.counts.returned;

    auto button = [&](const HIDEvent& b) {
        const auto mask = static_cast<uint32_t>(b.integerValueForField(kHIDEventFieldButtonMask));
        if (tapInput_ == input && tapEpisode_ >= 0 && mask == 0) {
            Episode& tap = timeline_.episodes[static_cast<size_t>(tapEpisode_)];
            tap.finished = true;
            ++tap.events;
            tapInput_ = -1;
            tapEpisode_ = -1;
            return;
        }
        if (mask != 0) {
            Episode& click = begin(EpisodeKind::Button, input);
            click.buttonMask = mask;
            click.events = 1;
            open_.button = static_cast<int>(timeline_.episodes.size() - 1);
            return;
        }
        if (open_.button >= 0) {
            Episode& click = timeline_.episodes[static_cast<size_t>(open_.button)];
            touch(click, input);
            click.release = moment(input);
            click.finished = true;
            ++click.events;
            open_.button = -1;
            return;
        }
        // A release without a press the timeline saw.
        Episode& click = begin(EpisodeKind::Button, input);
        click.release = moment(input);
        click.finished = true;
        click.events = 1;
    };

    if (event->type() == kHIDEventTypeButton) {
        button(*event);
        return;
    }
    if (event->type() != kHIDEventTypePointer) return;

    const double x = event->doubleValueForField(kHIDEventFieldPointerX);
    const double y = event->doubleValueForField(kHIDEventFieldPointerY);
    if (x != 0.0 || y != 0.0) {
        if (open_.pointer < 0) {
            begin(EpisodeKind::Pointer, input);
            open_.pointer = static_cast<int>(timeline_.episodes.size() - 1);
        }
        Episode& pointer = timeline_.episodes[static_cast<size_t>(open_.pointer)];
        touch(pointer, input);
        pointer.x += x;
        pointer.y += y;
        ++pointer.events;
    }
    bool handLifted = event->children().empty();  // a bare pointer: every contact has gone
    for (const HIDEventRef& child : event->children()) {
        switch (child->type()) {
        case kHIDEventTypeButton: button(*child); break;
        case kHIDEventTypeDigitizer:
            if (child->integerValueForField(kHIDEventFieldDigitizerTouch) == 0) handLifted = true;
            break;
        default: gestureChild(*child, input); break;
        }
    }
    if (handLifted) closePointer();
}

Timeline TimelineBuilder::finish() const {
    Timeline out = timeline_;
    TimelineCounts& c = out.counts;
    for (const Episode& e : out.episodes) {
        switch (e.kind) {
        case EpisodeKind::Setting: break;
        case EpisodeKind::Pointer: ++c.pointer; break;
        case EpisodeKind::Scroll:
            ++c.scroll;
            if (e.cancelled) ++c.scrollCancelled;
            break;
        case EpisodeKind::Scale: ++c.scale; break;
        case EpisodeKind::Rotation: ++c.rotation; break;
        case EpisodeKind::Button:
            ++c.clicks;
            if (e.buttonMask == kSecondaryButtonMask) ++c.secondaryClicks;
            break;
        case EpisodeKind::Tap:
            ++c.taps;
            if (e.buttonMask == kSecondaryButtonMask) ++c.twoFingerTaps;
            break;
        }
    }
    return out;
}

std::string describeEpisode(const Episode& e) {
    switch (e.kind) {
    case EpisodeKind::Setting:
        return e.key + " = " + formats::propertyValueToJson(e.value) + (e.accepted ? " (accepted)" : " (refused)");
    case EpisodeKind::Pointer:
        return "moved x " + format("%+.2f", e.x) + " y " + format("%+.2f", e.y) + " (" +
               plural(e.events, "event", "events") + ")";
    case EpisodeKind::Scroll:
        if (e.cancelled && e.x == 0.0 && e.y == 0.0) return phaseList(e) + " (withdrawn)";
        return phaseList(e) + " | x " + format("%+.2f", e.x) + " y " + format("%+.2f", e.y);
    case EpisodeKind::Scale:
    case EpisodeKind::Rotation: return phaseList(e) + " | z " + format("%+.4f", e.z);
    case EpisodeKind::Button: {
        std::string out = e.buttonMask == 0 ? std::string("released (no press seen)")
                                            : "mask " + hexMask(e.buttonMask) +
                                                  (e.buttonMask == kSecondaryButtonMask ? " (secondary)" : "") +
                                                  " pressed";
        if (e.buttonMask != 0) {
            if (e.finished && e.release.hasTime && e.start.hasTime)
                out += ", released after " + format("%.1f", e.release.ms - e.start.ms) + " ms";
            else if (e.finished) out += ", released";
            else out += ", not released";
        }
        return out;
    }
    case EpisodeKind::Tap:
        return std::string(e.buttonMask == kSecondaryButtonMask ? "two fingers" : "one finger") + ": press " +
               hexMask(e.buttonMask) + " dispatched, " + (e.finished ? "release returned" : "no release returned");
    }
    return "";
}

std::string describeCounts(const TimelineCounts& c) {
    std::vector<std::string> parts;
    if (c.pointer) parts.push_back(std::to_string(c.pointer) + " pointer");
    if (c.scroll) {
        std::string s = plural(c.scroll, "scroll", "scrolls");
        if (c.scrollCancelled) s += " (" + std::to_string(c.scrollCancelled) + " withdrawn)";
        parts.push_back(s);
    }
    if (c.scale) parts.push_back(plural(c.scale, "scale", "scales"));
    if (c.rotation) parts.push_back(plural(c.rotation, "rotation", "rotations"));
    if (c.clicks) {
        std::string s = plural(c.clicks, "click", "clicks");
        if (c.secondaryClicks) s += " (" + std::to_string(c.secondaryClicks) + " secondary)";
        parts.push_back(s);
    }
    if (c.taps) {
        std::string s = plural(c.taps, "tap", "taps");
        if (c.twoFingerTaps) s += " (" + std::to_string(c.twoFingerTaps) + " two-finger)";
        parts.push_back(s);
    }
    if (c.settings) parts.push_back(plural(c.settings, "setting", "settings"));
    if (parts.empty()) return "no gestures";
    std::string out;
    for (const std::string& p : parts) out += (out.empty() ? "" : ", ") + p;
    return out;
}

void writeTimeline(std::ostream& out, const Timeline& timeline) {
    out << "Timeline" << (timeline.name.empty() ? "" : " of " + timeline.name)
        << " (ms from the first frame, #N = input record N)\n";
    if (timeline.episodes.empty()) {
        out << "  no gestures\n";
        out << "Counts: " << describeCounts(timeline.counts) << '\n';
        return;
    }

    struct Row {
        std::string from, to, first, last, kind, what;
    };
    std::vector<Row> rows;
    for (const Episode& e : timeline.episodes) {
        Row r;
        if (e.start.hasTime) r.from = format("%.1f", e.start.ms);
        if (e.end.hasTime && e.end.input != e.start.input) r.to = format("%.1f", e.end.ms);
        r.first = "#" + std::to_string(e.start.input);
        if (e.end.input != e.start.input) r.last = "#" + std::to_string(e.end.input);
        r.kind = episodeKindName(e.kind);
        r.what = describeEpisode(e);
        rows.push_back(std::move(r));
    }
    size_t wFrom = 0, wTo = 0, wFirst = 0, wLast = 0;
    for (const Row& r : rows) {
        wFrom = std::max(wFrom, r.from.size());
        wTo = std::max(wTo, r.to.size());
        wFirst = std::max(wFirst, r.first.size());
        wLast = std::max(wLast, r.last.size());
    }
    auto padLeft = [](const std::string& s, size_t w) { return std::string(w > s.size() ? w - s.size() : 0, ' ') + s; };
    auto padRight = [](const std::string& s, size_t w) { return s + std::string(w > s.size() ? w - s.size() : 0, ' '); };
    // "from - to" with the numbers of every row lined up.
    auto span = [&](const std::string& a, const std::string& b, size_t wa, size_t wb, bool alignRight) {
        std::string s = alignRight ? padLeft(a, wa) : padRight(a, wa);
        if (wb) s += b.empty() ? std::string(wb + 3, ' ') : " - " + padRight(b, wb);
        return s;
    };
    std::vector<std::string> times, inputs;
    size_t wTime = 4, wInputs = 6, wKind = 7;  // "time", "inputs", "gesture"
    for (const Row& r : rows) {
        times.push_back(span(r.from, r.to, wFrom, wTo, true));
        inputs.push_back(span(r.first, r.last, wFirst, wLast, false));
        wTime = std::max(wTime, times.back().size());
        wInputs = std::max(wInputs, inputs.back().size());
        wKind = std::max(wKind, r.kind.size());
    }
    out << "  " << padRight("time", wTime) << "  " << padRight("inputs", wInputs) << "  " << padRight("gesture", wKind)
        << "  what\n";
    for (size_t i = 0; i < rows.size(); ++i) {
        std::string line = "  " + padRight(times[i], wTime) + "  " + padRight(inputs[i], wInputs) + "  " +
                           padRight(rows[i].kind, wKind) + "  " + rows[i].what;
        out << line << '\n';
    }
    out << "Counts: " << describeCounts(timeline.counts) << '\n';
}

}  // namespace orvane::analysis
