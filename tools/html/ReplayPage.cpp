#include "ReplayPage.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <map>
#include <ostream>

namespace orvane::html {

namespace {

// The filter's zones, as fractions of the surface height measured from the edge away from
// the click: the click half lies below 0.5, the thumb rest zone from 0.45 down.
constexpr double kClickHalfFrom = 0.5;
constexpr double kThumbZoneFrom = 0.45;

// Drawing sizes, in CSS pixels.
constexpr double kSurfaceWidth_px = 640.0;
constexpr double kTimelineWidth = 1000.0;
constexpr double kTimelineLabels = 96.0;
constexpr double kTimelineRight = 16.0;
constexpr double kRowHeight = 34.0;
constexpr double kAxisHeight = 30.0;

const char* const kFingerColours[] = {"#1f77b4", "#d62728", "#2ca02c", "#9467bd", "#ff7f0e",
                                      "#17becf", "#e377c2", "#8c564b", "#bcbd22", "#7f7f7f"};

std::string number(double v, int decimals = 1) {
    char text[64];
    std::snprintf(text, sizeof text, "%.*f", decimals, v);
    std::string s = text;
    if (s == "-0.0" || s == "-0.00" || s == "-0") s.erase(0, 1);
    return s;
}

std::string signedNumber(double v, int decimals = 2) {
    std::string s = number(v, decimals);
    return (s[0] == '-' ? "" : "+") + s;
}

const char* gestureKind(uint32_t type) {
    switch (type) {
    case kHIDEventTypeScroll: return "scroll";
    case kHIDEventTypeScale: return "scale";
    case kHIDEventTypeRotation: return "rotation";
    default: return nullptr;
    }
}

const char* phaseClass(uint16_t phase) {
    switch (phase) {
    case 0x80: return "may-begin";
    case 1: return "began";
    case 2: return "changed";
    case 4: return "ended";
    case 8: return "cancelled";
    default: return "none";
    }
}

// A step of 1, 2 or 5 times a power of ten that gives at most about ten ticks.
double tickStep(double span) {
    if (!(span > 0.0)) return 1.0;
    const double raw = span / 10.0;
    const double power = std::pow(10.0, std::floor(std::log10(raw)));
    for (double m : {1.0, 2.0, 5.0, 10.0})
        if (m * power >= raw) return m * power;
    return 10.0 * power;
}

const char* const kStyle = R"css(
:root { color-scheme: light; }
body { font: 14px/1.45 system-ui, -apple-system, "Segoe UI", Roboto, sans-serif; margin: 24px auto; max-width: 1100px;
       padding: 0 20px 140px; color: #1d2330; background: #f6f7f9; }
h1 { font-size: 22px; margin: 0 0 4px; }
h2 { font-size: 16px; margin: 28px 0 8px; }
.sub { color: #5b6474; margin: 0 0 16px; }
.card { background: #fff; border: 1px solid #dde1e8; border-radius: 10px; padding: 16px 18px; }
.surface-wrap { display: flex; gap: 24px; align-items: flex-start; flex-wrap: wrap; }
svg text { font: 12px system-ui, sans-serif; fill: #39414f; }
.pad { fill: #fbfbfd; stroke: #8a93a3; stroke-width: 1.5; }
.zone-thumb { fill: #f6d58a; fill-opacity: 0.35; }
.zone-click { fill: url(#click-hatch); }
.zone-line { stroke-width: 1; stroke-dasharray: 5 4; fill: none; }
.zone-line.thumb { stroke: #c9962b; }
.zone-line.click { stroke: #4a6fd6; }
.finger-path { fill: none; stroke-width: 2.5; stroke-linejoin: round; stroke-linecap: round; }
.finger-path.palm { stroke-dasharray: 6 4; stroke-width: 2; opacity: 0.7; }
.touch-down { stroke: #fff; stroke-width: 1.5; }
.lift { fill: #fff; stroke-width: 2; }
.mark { fill-opacity: 0; stroke: none; cursor: crosshair; }
.mark:hover { fill-opacity: 0.9; }
.legend { min-width: 250px; }
.legend ul { list-style: none; padding: 0; margin: 0; }
.legend li { margin: 4px 0; display: flex; align-items: center; gap: 8px; }
.swatch { width: 22px; height: 10px; border-radius: 3px; display: inline-block; }
.row-label { font-weight: 600; }
.row-line { stroke: #e3e6ec; }
.axis { stroke: #8a93a3; }
.tick { stroke: #c4c9d3; }
.episode { stroke: none; rx: 4; cursor: pointer; }
.episode:hover, .phase:hover, .gesture-mark:hover { stroke: #1d2330; stroke-width: 1.5; }
.k-pointer { fill: #7fa7d9; } .k-scroll { fill: #5fb38a; } .k-scale { fill: #c78bd6; } .k-rotation { fill: #e0a35a; }
.k-click { fill: #d9686b; } .k-tap { fill: #e8505b; } .k-setting { fill: #9aa3b2; }
.phase { stroke: #fff; stroke-width: 1; cursor: pointer; }
.p-may-begin { fill: #9aa3b2; } .p-began { fill: #1e9e5a; } .p-changed { fill: #3b7dd8; } .p-ended { fill: #d6453d; }
.p-cancelled { fill: #f08c00; } .p-none { fill: #5b6474; }
.gesture-mark { cursor: pointer; }
table { border-collapse: collapse; width: 100%; background: #fff; }
th, td { text-align: left; padding: 5px 10px; border-bottom: 1px solid #e6e9ef; vertical-align: top; }
th { font-size: 12px; text-transform: uppercase; letter-spacing: .04em; color: #5b6474; }
tr[data-detail]:hover { background: #eef3fb; }
#details { position: fixed; right: 18px; bottom: 18px; width: 380px; max-height: 45vh; overflow: auto;
           white-space: pre-wrap; font: 12px/1.45 ui-monospace, SFMono-Regular, Menlo, monospace;
           background: #1d2330; color: #f3f5f8; border-radius: 10px; padding: 12px 14px;
           box-shadow: 0 6px 24px rgba(0,0,0,.25); }
#page-status { color: #8a93a3; font-size: 12px; margin-top: 24px; }
)css";

const char* const kErrorScript = R"js(
window.addEventListener('error', function (e) {
  var b = document.body || document.documentElement;
  b.setAttribute('data-errors', (b.getAttribute('data-errors') || '') + e.message + ';');
});
)js";

const char* const kPageScript = R"js(
(function () {
  var panel = document.getElementById('details');
  function show(e) {
    var t = e.target && e.target.closest ? e.target.closest('[data-detail]') : null;
    if (t) panel.textContent = t.getAttribute('data-detail');
  }
  document.addEventListener('mouseover', show);
  document.addEventListener('focusin', show);
  var status = document.getElementById('page-status');
  status.textContent = 'ready: ' + document.querySelectorAll('.finger-path').length + ' finger paths, ' +
    document.querySelectorAll('.episode').length + ' timeline entries, ' +
    document.querySelectorAll('.phase, .gesture-mark').length + ' gesture marks, ' +
    document.querySelectorAll('.mark').length + ' path marks';
  status.setAttribute('data-ready', '1');
})();
)js";

}  // namespace

std::string escapeHtml(const std::string& text) {
    std::string out;
    out.reserve(text.size());
    for (char c : text) {
        switch (c) {
        case '&': out += "&amp;"; break;
        case '<': out += "&lt;"; break;
        case '>': out += "&gt;"; break;
        case '"': out += "&quot;"; break;
        case '\'': out += "&#39;"; break;
        default: out += c;
        }
    }
    return out;
}

ReplayPage::ReplayPage(std::string name, const PropertyDictionary& properties, TimebaseInfo timebase)
    : name_(std::move(name)), timebase_(timebase) {
    auto size = properties.find("SurfaceDimensions");
    if (size != properties.end() && size->second.isDictionary()) {
        const PropertyValue* w = size->second.find("Width");
        const PropertyValue* h = size->second.find("Height");
        if (w && h && w->isNumber() && h->isNumber() && w->integerValue() > 0 && h->integerValue() > 0) {
            // 16.16 fixed-point centimetres, as millimetres.
            width_mm_ = double(w->integerValue()) / 65536.0 * 10.0;
            height_mm_ = double(h->integerValue()) / 65536.0 * 10.0;
            sizeKnown_ = true;
        }
    }
    auto product = properties.find("Product");
    if (product != properties.end() && product->second.isString()) product_ = product->second.stringValue();
}

double ReplayPage::millisecondsOf(uint64_t timestamp) const {
    const double ticks = timestamp >= origin_ ? double(timestamp - origin_) : -double(origin_ - timestamp);
    return ticks * double(timebase_.numer) / (double(timebase_.denom) * 1e6);
}

ReplayPage::Frame* ReplayPage::frameFor(int64_t input) {
    for (auto it = frames_.rbegin(); it != frames_.rend(); ++it)
        if (it->input == input) return &*it;
    return nullptr;
}

void ReplayPage::addFrame(int64_t input, const HIDEvent& frame) {
    if (!haveOrigin_) {
        origin_ = frame.timestamp();
        haveOrigin_ = true;
    }
    Frame f;
    f.input = input;
    f.ms = millisecondsOf(frame.timestamp());
    f.click = frame.integerValueForField(kHIDEventFieldDigitizerButtonMask);
    for (const HIDEventRef& child : frame.children()) {
        if (!child || child->type() != kHIDEventTypeDigitizer) continue;
        Contact c;
        c.index = child->integerValueForField(kHIDEventFieldDigitizerIndex);
        c.x_mm = child->doubleValueForField(kHIDEventFieldDigitizerX) * width_mm_;
        // The digitizer's y grows away from the click edge; the filter flips it.
        c.y_mm = (1.0 - child->doubleValueForField(kHIDEventFieldDigitizerY)) * height_mm_;
        c.touching = child->integerValueForField(kHIDEventFieldDigitizerTouch) != 0;
        c.palm = child->integerValueForField(kHIDEventFieldDigitizerType) == kHIDDigitizerTransducerTypePalm;
        f.contacts.push_back(c);
    }
    frames_.push_back(std::move(f));
}

void ReplayPage::describeOutput(int64_t input, const HIDEvent& event, bool dispatched) {
    Frame* frame = frameFor(input);
    const double ms = frame ? frame->ms : 0.0;
    std::vector<std::string> lines;
    if (event.type() == kHIDEventTypePointer) {
        const double x = event.doubleValueForField(kHIDEventFieldPointerX);
        const double y = event.doubleValueForField(kHIDEventFieldPointerY);
        if (x != 0.0 || y != 0.0) lines.push_back("pointer moved x " + signedNumber(x) + " y " + signedNumber(y));
    }
    for (const HIDEventRef& child : event.children()) {
        if (!child) continue;
        if (const char* kind = gestureKind(child->type())) {
            const uint32_t base = child->type() << 16;
            std::string text = std::string(kind) + " " + analysis::phaseName(child->phase());
            if (child->type() == kHIDEventTypeScroll)
                text += " x " + signedNumber(child->doubleValueForField(base)) + " y " +
                        signedNumber(child->doubleValueForField(base | 1));
            else
                text += " z " + signedNumber(child->doubleValueForField(base | 2), 4);
            lines.push_back(text);
            marks_.push_back({input, ms, kind, child->phase(), text});
        } else if (child->type() == kHIDEventTypeButton) {
            const int64_t mask = child->integerValueForField(kHIDEventFieldButtonMask);
            std::string text = "button mask " + std::to_string(mask) + (dispatched ? " sent at once" : "");
            if (dispatched && mask != 0) text = "tap: press of button mask " + std::to_string(mask) + " sent at once";
            lines.push_back(text);
            // The release of a tap comes back with the same frame whose press was dispatched.
            bool tapRelease = false;
            for (const GestureMark& m : marks_) tapRelease = tapRelease || (m.input == input && m.kind == "tap");
            if (tapRelease && !dispatched && mask == 0) text = "tap: release returned";
            marks_.push_back({input, ms, dispatched || tapRelease ? "tap" : "click", uint16_t(mask != 0 ? 1 : 4), text});
        }
    }
    if (event.type() == kHIDEventTypeButton && event.hasField(kHIDEventFieldButtonNumber))
        lines.push_back("button " + std::to_string(event.integerValueForField(kHIDEventFieldButtonNumber)) + " " +
                        (event.integerValueForField(kHIDEventFieldButtonState) ? "down" : "up") + ", passed on");
    if (frame)
        for (std::string& line : lines) frame->output.push_back((dispatched ? "dispatched: " : "") + line);
}

void ReplayPage::addDispatched(int64_t input, const HIDEvent& event) { describeOutput(input, event, true); }

void ReplayPage::addReturned(int64_t input, const HIDEvent* event) {
    if (event) describeOutput(input, *event, false);
}

std::string ReplayPage::frameDetails(const Frame& frame) const {
    std::string s = "frame #" + std::to_string(frame.input) + " at " + number(frame.ms) + " ms";
    if (frame.click) s += ", click down";
    s += "\n";
    if (frame.contacts.empty()) s += "no contacts\n";
    for (const Contact& c : frame.contacts)
        s += "  contact " + std::to_string(c.index) + " at (" + number(c.x_mm) + ", " + number(c.y_mm) + ") mm" +
             (c.palm ? ", palm" : "") + (c.touching ? "" : ", lifted") + "\n";
    if (frame.output.empty()) s += "left the filter: no gesture";
    else s += "left the filter:";
    for (const std::string& line : frame.output) s += "\n  " + line;
    return s;
}

void ReplayPage::write(std::ostream& out, const analysis::Timeline& timeline) const {
    const std::string title = "Orvane replay of " + name_.substr(name_.rfind('/') == std::string::npos ? 0 : name_.rfind('/') + 1);
    out << "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n"
        << "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\">\n"
        << "<title>" << escapeHtml(title) << "</title>\n<style>" << kStyle << "</style>\n<script>" << kErrorScript
        << "</script>\n</head>\n<body>\n";
    out << "<h1>" << escapeHtml(title) << "</h1>\n<p class=\"sub\">" << escapeHtml(name_) << "<br>";
    if (!product_.empty()) out << escapeHtml(product_) << " &middot; ";
    out << (sizeKnown_ ? number(width_mm_) + " &times; " + number(height_mm_) + " mm" : "surface size unknown")
        << " &middot; " << frames_.size() << " frames";
    if (!frames_.empty()) out << " over " << number(frames_.back().ms) << " ms";
    out << " &middot; " << escapeHtml(analysis::describeCounts(timeline.counts)) << "</p>\n";

    // The surface: millimetres, y toward the click edge.
    const double scale = kSurfaceWidth_px / width_mm_;
    const double svgHeight = height_mm_ * scale;
    out << "<h2>Surface and finger paths</h2>\n<div class=\"card surface-wrap\">\n";
    out << "<svg id=\"surface\" role=\"img\" aria-label=\"The surface with each finger's path\" width=\""
        << number(kSurfaceWidth_px + 2) << "\" height=\"" << number(svgHeight + 24) << "\" viewBox=\"-1 -1 "
        << number(kSurfaceWidth_px + 2) << " " << number(svgHeight + 24) << "\">\n";
    out << "<defs><pattern id=\"click-hatch\" width=\"10\" height=\"10\" patternUnits=\"userSpaceOnUse\" "
           "patternTransform=\"rotate(45)\"><rect width=\"10\" height=\"10\" fill=\"#6b8ff3\" "
           "fill-opacity=\"0.07\"/><line x1=\"0\" y1=\"0\" x2=\"0\" y2=\"10\" stroke=\"#6b8ff3\" "
           "stroke-opacity=\"0.35\" stroke-width=\"2\"/></pattern></defs>\n";
    out << "<rect class=\"pad\" x=\"0\" y=\"0\" width=\"" << number(kSurfaceWidth_px) << "\" height=\""
        << number(svgHeight) << "\" rx=\"8\"/>\n";
    const double thumbY = kThumbZoneFrom * svgHeight, clickY = kClickHalfFrom * svgHeight;
    out << "<rect class=\"zone-thumb\" x=\"0\" y=\"" << number(thumbY) << "\" width=\"" << number(kSurfaceWidth_px)
        << "\" height=\"" << number(svgHeight - thumbY)
        << "\" data-detail=\"thumb rest zone: y from 0.45 of the height to the click edge\"/>\n";
    out << "<rect class=\"zone-click\" x=\"0\" y=\"" << number(clickY) << "\" width=\"" << number(kSurfaceWidth_px)
        << "\" height=\"" << number(svgHeight - clickY)
        << "\" data-detail=\"click half: y above 0.5 of the height, the half with the click\"/>\n";
    out << "<line class=\"zone-line thumb\" x1=\"0\" x2=\"" << number(kSurfaceWidth_px) << "\" y1=\"" << number(thumbY)
        << "\" y2=\"" << number(thumbY) << "\"/>\n";
    out << "<line class=\"zone-line click\" x1=\"0\" x2=\"" << number(kSurfaceWidth_px) << "\" y1=\"" << number(clickY)
        << "\" y2=\"" << number(clickY) << "\"/>\n";
    out << "<text x=\"8\" y=\"" << number(thumbY - 6) << "\">thumb rest zone (y &#8805; 0.45)</text>\n";
    out << "<text x=\"8\" y=\"" << number(svgHeight - 8) << "\">click half (y &gt; 0.5)</text>\n";
    out << "<text x=\"" << number(kSurfaceWidth_px / 2) << "\" y=\"" << number(svgHeight + 17)
        << "\" text-anchor=\"middle\">click edge</text>\n";

    // Strokes: one per touch of one contact index, from touch-down to lift.
    struct Stroke {
        int64_t index;
        bool palm;
        std::vector<std::pair<const Frame*, const Contact*>> points;
        bool lifted = false;
    };
    std::vector<Stroke> strokes;
    std::map<int64_t, size_t> open;  // contact index -> stroke
    size_t totalPoints = 0;
    for (const Frame& frame : frames_) {
        std::map<int64_t, bool> seen;
        for (const Contact& c : frame.contacts) {
            seen[c.index] = true;
            auto it = open.find(c.index);
            if (it == open.end()) {
                if (!c.touching) continue;
                strokes.push_back(Stroke{c.index, c.palm, {}, false});
                it = open.emplace(c.index, strokes.size() - 1).first;
            }
            Stroke& s = strokes[it->second];
            s.palm = s.palm || c.palm;
            s.points.push_back({&frame, &c});
            ++totalPoints;
            if (!c.touching) {
                s.lifted = true;
                open.erase(it);
            }
        }
        // A contact no longer reported has ended too.
        for (auto it = open.begin(); it != open.end();) it = seen.count(it->first) ? std::next(it) : open.erase(it);
    }
    const size_t every = totalPoints > kMaxPathMarks ? (totalPoints + kMaxPathMarks - 1) / kMaxPathMarks : 1;
    size_t pointNumber = 0;
    for (size_t n = 0; n < strokes.size(); ++n) {
        const Stroke& s = strokes[n];
        const char* colour = kFingerColours[n % std::size(kFingerColours)];
        const Frame& first = *s.points.front().first;
        const Frame& last = *s.points.back().first;
        const std::string label = "touch " + std::to_string(n + 1) + ", contact " + std::to_string(s.index) + (s.palm ? " (palm)" : "") + ": frames #" +
                                  std::to_string(first.input) + " to #" + std::to_string(last.input) + ", " +
                                  number(first.ms) + " to " + number(last.ms) + " ms";
        out << "<g class=\"stroke\" data-index=\"" << s.index << "\">\n<polyline class=\"finger-path"
            << (s.palm ? " palm" : "") << "\" stroke=\"" << colour << "\" data-detail=\"" << escapeHtml(label)
            << "\" points=\"";
        for (size_t i = 0; i < s.points.size(); ++i)
            out << (i ? " " : "") << number(s.points[i].second->x_mm * scale) << ","
                << number(s.points[i].second->y_mm * scale);
        out << "\"/>\n";
        const Contact& start = *s.points.front().second;
        out << "<circle class=\"touch-down\" fill=\"" << colour << "\" cx=\"" << number(start.x_mm * scale)
            << "\" cy=\"" << number(start.y_mm * scale) << "\" r=\"5\" data-detail=\""
            << escapeHtml("touch-down of " + label + "\n" + frameDetails(first)) << "\"/>\n";
        if (s.lifted) {
            const Contact& end = *s.points.back().second;
            out << "<circle class=\"lift\" stroke=\"" << colour << "\" cx=\"" << number(end.x_mm * scale) << "\" cy=\""
                << number(end.y_mm * scale) << "\" r=\"4\" data-detail=\""
                << escapeHtml("lift of " + label + "\n" + frameDetails(last)) << "\"/>\n";
        }
        for (const auto& [frame, contact] : s.points) {
            if (pointNumber++ % every != 0) continue;
            out << "<circle class=\"mark\" fill=\"" << colour << "\" cx=\"" << number(contact->x_mm * scale)
                << "\" cy=\"" << number(contact->y_mm * scale) << "\" r=\"3.5\" data-detail=\""
                << escapeHtml(frameDetails(*frame)) << "\"/>\n";
        }
        out << "</g>\n";
    }
    out << "</svg>\n<div class=\"legend\"><ul>\n";
    // One colour per touch; the legend names the first dozen.
    constexpr size_t kLegendTouches = 12;
    for (size_t n = 0; n < strokes.size() && n < kLegendTouches; ++n) {
        const Stroke& st = strokes[n];
        out << "<li><span class=\"swatch\" style=\"background:" << kFingerColours[n % std::size(kFingerColours)]
            << "\"></span>touch " << n + 1 << ": contact " << st.index << (st.palm ? ", palm (dashed)" : "") << ", "
            << number(st.points.front().first->ms, 0) << "&ndash;" << number(st.points.back().first->ms, 0)
            << " ms</li>\n";
    }
    if (strokes.size() > kLegendTouches)
        out << "<li>and " << strokes.size() - kLegendTouches << " more touches</li>\n";
    if (strokes.empty()) out << "<li>no finger touched</li>\n";
    out << "<li><span class=\"swatch\" style=\"background:#f6d58a\"></span>thumb rest zone (y &#8805; 0.45 of the "
           "height)</li>\n"
        << "<li><span class=\"swatch\" style=\"background:repeating-linear-gradient(45deg,#a9bdf6 0 2px,#eef2fd 2px "
           "6px)\"></span>click half (y &gt; 0.5 of the height)</li>\n"
        << "<li>filled dot: touch-down &middot; open dot: lift</li>\n"
        << "<li>hover a path for each frame's details</li>\n</ul></div>\n</div>\n";

    // The timeline.
    static const char* const kRows[] = {"pointer", "scroll", "scale", "rotation", "click", "tap", "setting"};
    const size_t rowCount = std::size(kRows);
    double span = frames_.empty() ? 0.0 : frames_.back().ms;
    for (const auto& e : timeline.episodes) span = std::max(span, e.end.ms);
    if (!(span > 0.0)) span = 1.0;
    const double plot = kTimelineWidth - kTimelineLabels - kTimelineRight;
    auto xOf = [&](double ms) { return kTimelineLabels + std::clamp(ms / span, 0.0, 1.0) * plot; };
    const double height = kAxisHeight + rowCount * kRowHeight + 8;
    out << "<h2>Gesture timeline</h2>\n<div class=\"card\">\n<svg id=\"timeline\" role=\"img\" aria-label=\"Gesture "
           "timeline\" width=\"100%\" viewBox=\"0 0 "
        << number(kTimelineWidth) << " " << number(height) << "\">\n";
    const double step = tickStep(span);
    for (double t = 0.0; t <= span + step * 1e-9; t += step) {
        out << "<line class=\"tick\" x1=\"" << number(xOf(t)) << "\" x2=\"" << number(xOf(t)) << "\" y1=\"18\" y2=\""
            << number(height - 4) << "\"/><text x=\"" << number(xOf(t)) << "\" y=\"13\" text-anchor=\"middle\">"
            << number(t, step < 1.0 ? 1 : 0) << "</text>\n";
    }
    out << "<text x=\"8\" y=\"13\">ms</text>\n";
    auto rowY = [&](const std::string& kind) {
        for (size_t i = 0; i < rowCount; ++i)
            if (kind == kRows[i]) return kAxisHeight + double(i) * kRowHeight;
        return kAxisHeight;
    };
    for (size_t i = 0; i < rowCount; ++i) {
        const double y = kAxisHeight + double(i) * kRowHeight;
        out << "<line class=\"row-line\" x1=\"" << number(kTimelineLabels) << "\" x2=\""
            << number(kTimelineWidth - kTimelineRight) << "\" y1=\"" << number(y + kRowHeight) << "\" y2=\""
            << number(y + kRowHeight) << "\"/><text class=\"row-label\" x=\"8\" y=\"" << number(y + kRowHeight / 2 + 4)
            << "\">" << kRows[i] << "</text>\n";
    }
    for (const analysis::Episode& e : timeline.episodes) {
        const std::string kind = analysis::episodeKindName(e.kind);
        const double y = rowY(kind);
        const double x0 = xOf(e.start.ms), x1 = std::max(xOf(e.end.ms), x0 + 4.0);
        std::string detail = kind + ", " + number(e.start.ms) + " to " + number(e.end.ms) + " ms (frames #" +
                             std::to_string(e.start.input) + " to #" + std::to_string(e.end.input) + ")\n" +
                             analysis::describeEpisode(e);
        out << "<rect class=\"episode k-" << kind << "\" x=\"" << number(x0 - 2) << "\" y=\"" << number(y + 8)
            << "\" width=\"" << number(x1 - x0) << "\" height=\"" << number(kRowHeight - 16) << "\" data-detail=\""
            << escapeHtml(detail) << "\"><title>" << escapeHtml(detail) << "</title></rect>\n";
    }
    for (const GestureMark& m : marks_) {
        const double y = rowY(m.kind) + kRowHeight / 2;
        const std::string detail = m.text + " at " + number(m.ms) + " ms, frame #" + std::to_string(m.input);
        if (m.kind == "tap" || m.kind == "click") {
            const double x = xOf(m.ms);
            out << "<path class=\"gesture-mark " << (m.phase == 1 ? "p-began" : "p-ended") << "\" d=\"M" << number(x)
                << " " << number(y - 7) << " l6 7 l-6 7 l-6 -7 z\" data-detail=\"" << escapeHtml(detail)
                << "\"/>\n";
        } else {
            out << "<circle class=\"phase p-" << phaseClass(m.phase) << "\" cx=\"" << number(xOf(m.ms)) << "\" cy=\""
                << number(y) << "\" r=\"4\" data-detail=\"" << escapeHtml(detail) << "\"/>\n";
        }
    }
    out << "</svg>\n<p class=\"sub\">Phases: <span style=\"color:#9aa3b2\">&#9679;</span> may begin "
           "<span style=\"color:#1e9e5a\">&#9679;</span> began <span style=\"color:#3b7dd8\">&#9679;</span> changed "
           "<span style=\"color:#d6453d\">&#9679;</span> ended <span style=\"color:#f08c00\">&#9679;</span> "
           "cancelled &middot; &#9670; press and release of a click or a tap</p>\n</div>\n";

    // The episodes as a table.
    out << "<h2>Episodes</h2>\n<table id=\"episodes\">\n<tr><th>gesture</th><th>time (ms)</th><th>frames</th>"
           "<th>what</th></tr>\n";
    for (const analysis::Episode& e : timeline.episodes) {
        const std::string kind = analysis::episodeKindName(e.kind);
        const std::string when =
            e.start.ms == e.end.ms ? number(e.start.ms) : number(e.start.ms) + " &ndash; " + number(e.end.ms);
        const std::string inputs = e.start.input == e.end.input
                                       ? "#" + std::to_string(e.start.input)
                                       : "#" + std::to_string(e.start.input) + " &ndash; #" + std::to_string(e.end.input);
        out << "<tr class=\"entry\" data-detail=\"" << escapeHtml(kind + ": " + analysis::describeEpisode(e))
            << "\"><td>" << kind << "</td><td>" << when << "</td><td>" << inputs << "</td><td>"
            << escapeHtml(analysis::describeEpisode(e)) << "</td></tr>\n";
    }
    if (timeline.episodes.empty()) out << "<tr><td colspan=\"4\">no gesture</td></tr>\n";
    out << "</table>\n<div id=\"details\">Hover a path, a mark or an entry for its details.</div>\n"
        << "<p id=\"page-status\">The page's script did not run.</p>\n<script>" << kPageScript
        << "</script>\n</body>\n</html>\n";
}

}  // namespace orvane::html
