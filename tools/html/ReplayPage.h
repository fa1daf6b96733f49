#pragma once
// One self-contained HTML page of a replay (inline SVG, CSS and a little script; nothing
// is fetched): the surface with each finger's path, the click half (y > 0.5 of the height)
// and the thumb rest zone (y >= 0.45 of the height) drawn in the filter's own orientation,
// where a larger y lies nearer the click edge; under it the gesture timeline with the
// phases of every scroll, scale and rotation event, the clicks and the taps, and a table
// of the episodes. Hovering a mark shows that frame's details.
//
// Feed it like the timeline: every frame before the filter sees it (the filter changes
// the frame it is given), every event dispatched and every event returned.

#include <cstdint>
#include <iosfwd>
#include <string>
#include <vector>

#include "platform/HIDEvent.h"
#include "platform/PropertyValue.h"
#include "platform/Timebase.h"
#include "tools/analysis/Timeline.h"

namespace orvane::html {

class ReplayPage {
public:
    // `properties` are the service's: "SurfaceDimensions" (16.16 fixed-point centimetres)
    // gives the size drawn, "Product" the device's name.
    ReplayPage(std::string name, const PropertyDictionary& properties, TimebaseInfo timebase);

    void addFrame(int64_t input, const HIDEvent& frame);
    void addDispatched(int64_t input, const HIDEvent& event);
    void addReturned(int64_t input, const HIDEvent* event);

    // The page, with the timeline the same replay built.
    void write(std::ostream& out, const analysis::Timeline& timeline) const;

    // At most this many hover marks are drawn on the finger paths; longer recordings get
    // every n-th point marked (the paths themselves keep every point).
    static constexpr size_t kMaxPathMarks = 4000;

private:
    struct Contact {
        int64_t index = 0;
        double x_mm = 0.0, y_mm = 0.0;  // y grows toward the click edge
        bool touching = false;
        bool palm = false;
    };
    struct Frame {
        int64_t input = 0;
        double ms = 0.0;
        int64_t click = 0;  // the frame's button mask
        std::vector<Contact> contacts;
        std::vector<std::string> output;  // what left the filter for it, one line per event
    };
    struct GestureMark {
        int64_t input = 0;
        double ms = 0.0;
        std::string kind;  // "scroll", "scale", "rotation", "click", "tap"
        uint16_t phase = 0;
        std::string text;
    };

    Frame* frameFor(int64_t input);
    void describeOutput(int64_t input, const HIDEvent& event, bool dispatched);
    std::string frameDetails(const Frame& frame) const;
    double millisecondsOf(uint64_t timestamp) const;

    std::string name_;
    std::string product_;
    double width_mm_ = 100.0, height_mm_ = 100.0;
    bool sizeKnown_ = false;
    TimebaseInfo timebase_;
    bool haveOrigin_ = false;
    uint64_t origin_ = 0;
    std::vector<Frame> frames_;
    std::vector<GestureMark> marks_;
};

// Text made safe for HTML element content and attribute values.
std::string escapeHtml(const std::string& text);

}  // namespace orvane::html
