#pragma once
// A gesture timeline for people: what happened in a replay, told as gesture episodes
// rather than frames. Feed a TimelineBuilder with what the replay saw, in the order it
// happened (each input record, every event the filter dispatched, every event it
// returned), then take the Timeline and write it with writeTimeline:
//
//   Timeline of demo.gestures (ms from the first frame, #N = input record N)
//     time            inputs      gesture  what
//       0.0           #0          setting  TapToClickEnabled = true (accepted)
//      48.0 - 296.0   #7 - #38    pointer  moved x +41.91 y -0.64 (31 events)
//     600.0           #80         tap      one finger: press 0x1 dispatched, release returned
//   Counts: 1 pointer, 1 tap, 1 setting
//
// Episodes:
// - pointer: returned pointer events with x or y not 0, summed; one episode lasts while the
//   hand stays down and no scroll, scale, rotation or tap comes between;
// - scroll: scroll events from a may-begin (0x80) or began (1) to ended (4) or cancelled
//   (8), with their phases in order and x, y summed;
// - scale and rotation: from began (1) to ended (4), z summed;
// - button: a button event with a mask other than 0 in a returned event (a press of the
//   click, mask 2 for the secondary button) until the button event with mask 0 after it;
// - tap: a press dispatched and a release (mask 0) returned for the same input record;
// - setting: a setProperty record and whether the filter took it.

#include <cstddef>
#include <cstdint>
#include <iosfwd>
#include <string>
#include <vector>

#include "platform/HIDEvent.h"
#include "platform/PropertyValue.h"
#include "platform/Timebase.h"

namespace orvane::analysis {

enum class EpisodeKind { Setting, Pointer, Scroll, Scale, Rotation, Button, Tap };

// "setting", "pointer", "scroll", "scale", "rotation", "click", "tap".
const char* episodeKindName(EpisodeKind kind);

// The platform's phase bits as words: "may-begin" (0x80), "began" (1), "changed" (2),
// "ended" (4), "cancelled" (8), "none" (0), or "0x.." for anything else.
std::string phaseName(uint16_t phase);

// A point of the replay: the input record and its frame's time.
struct Moment {
    int64_t input = -1;      // -1: none
    uint64_t timestamp = 0;  // the frame's timestamp in ticks (0 before the first frame)
    double ms = 0.0;         // milliseconds from the timeline's origin
    bool hasTime = false;    // false when no frame came before or after it
};

// Consecutive events of one phase: "changed ×12".
struct PhaseRun {
    uint16_t phase = 0;
    size_t count = 0;
};

struct Episode {
    EpisodeKind kind = EpisodeKind::Pointer;
    Moment start;                 // the first input that carried an event of it
    Moment end;                   // the last one
    std::vector<int64_t> inputs;  // every input that carried an event of it, ascending
    size_t events = 0;            // events of it that left the filter

    // Scroll, scale, rotation: the phases in the order they were sent.
    std::vector<PhaseRun> phases;
    // Summed motion: pointer and scroll x, y; scale and rotation z.
    double x = 0.0, y = 0.0, z = 0.0;
    // Scroll, scale, rotation: it ended or was cancelled. Button: it was released.
    // Tap: its release was returned.
    bool finished = false;
    bool cancelled = false;  // scroll: the may-begin was withdrawn (8)

    // Button: the press's mask (1 the click, 2 the secondary button); Tap: the mask of the
    // dispatched press. Button: where the release came (input -1 until released).
    uint32_t buttonMask = 0;
    Moment release;

    // Setting.
    std::string key;
    PropertyValue value;
    bool accepted = false;
};

struct TimelineCounts {
    size_t inputs = 0;      // input records seen
    size_t frames = 0;      // event records given to the filter
    size_t settings = 0;    // setProperty records
    size_t returned = 0;    // returned events
    size_t returnedNone = 0;
    size_t dispatched = 0;  // dispatched events

    size_t pointer = 0;
    size_t scroll = 0;
    size_t scrollCancelled = 0;  // of which withdrawn may-begins
    size_t scale = 0;
    size_t rotation = 0;
    size_t clicks = 0;           // button episodes
    size_t secondaryClicks = 0;  // of which with mask 2
    size_t taps = 0;
    size_t twoFingerTaps = 0;    // of which with mask 2
};

struct Timeline {
    std::string name;       // the recording's name, for the heading
    TimebaseInfo timebase{1, 1};
    Moment origin;          // the first frame; every time is counted from here
    std::vector<Episode> episodes;  // by first input, then in the order they began
    TimelineCounts counts;
};

class TimelineBuilder {
public:
    explicit TimelineBuilder(TimebaseInfo timebase = TimebaseInfo{1, 1}, std::string name = "");

    // An event record, before the filter sees it (its timestamp is the frame's time).
    void addFrame(int64_t input, uint64_t timestamp);
    // A setProperty record and the filter's answer. It takes the time of the next frame
    // (the last frame's when none follows).
    void addSetting(int64_t input, const std::string& key, const PropertyValue& value, bool accepted);
    // Any other record (a client announcement): counted only.
    void addOtherRecord(int64_t input);
    // An event the filter sent through the dispatcher, at the moment it was sent.
    void addDispatched(int64_t input, const HIDEvent& event);
    // The event entry's result for the record, or nullptr.
    void addReturned(int64_t input, const HIDEvent* event);

    // The timeline so far; episodes still open are marked not finished.
    Timeline finish() const;

private:
    struct Open {
        int pointer = -1, scroll = -1, scale = -1, rotation = -1, button = -1;
    };
    Moment moment(int64_t input) const;
    Episode& begin(EpisodeKind kind, int64_t input);
    void touch(Episode& episode, int64_t input);
    void addPhase(Episode& episode, uint16_t phase);
    void gestureChild(const HIDEvent& child, int64_t input);
    void closePointer();

    Timeline timeline_;
    Open open_;
    uint64_t frameTimestamp_ = 0;
    std::vector<size_t> pendingSettings_;  // settings waiting for the next frame's time
    bool haveFrame_ = false;
    int64_t tapInput_ = -1;  // the input whose press was dispatched
    int tapEpisode_ = -1;
};

// The timeline for a person: a heading, one aligned line per episode, counts at the end.
void writeTimeline(std::ostream& out, const Timeline& timeline);

// The "what" column of one episode ("moved x +41.9 y -0.6 (31 events)").
std::string describeEpisode(const Episode& episode);

// The closing counts line ("1 pointer, 2 scrolls (1 cancelled), ...").
std::string describeCounts(const TimelineCounts& counts);

}  // namespace orvane::analysis
