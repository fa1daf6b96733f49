// The evemu recordings of real touchpads through the live path: a source that plays the
// recording back as the device would hand it over, the bridge's loop, and a captured
// virtual pointer. What the pointer is given is checked against the filter's own event
// stream for the same recording (converted by `orvane frames` and run as `orvane replay`
// runs it): every pointer delta with its remainder carried, every scroll step and every
// click, and the gesture stream's lines against the scale, rotation and scroll events.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/input-event-codes.h>
#include <unistd.h>

#include <cmath>
#include <sstream>

#include "LiveTestSupport.h"
#include "tools/evemu/TouchFrameConverter.h"
#include "tools/formats/EventJson.h"
#include "tools/live/GestureStream.h"
#include "tools/live/LatencyStats.h"
#include "tools/live/LiveBridge.h"
#include "tools/live/LiveRunner.h"
#include "tools/live/PointerOutput.h"
#include "tools/live/TouchpadService.h"

namespace orvane::live {
namespace {

using W = CapturePointer::Written;
using test::FakeDevices;
using test::Recording;
using test::RecordingSource;

constexpr double kFactor = PointerOutput::kDefaultScrollFactor;  // 12

// What the virtual pointer must be given for the filter's deliveries, report by report:
// - pointer x and y add up per axis and each report takes the whole part (toward zero) of
//   what is not written yet: REL_X, REL_Y;
// - scroll y × 12 and scroll x × -12 add up the same way into REL_WHEEL_HI_RES and
//   REL_HWHEEL_HI_RES, starting from zero when a scroll begins (phase 1) or may begin
//   (0x80); whole 120s of what was written become REL_WHEEL / REL_HWHEEL detents;
// - the mask of the filter's button event: bit 0 BTN_LEFT, 1 BTN_RIGHT, 2 BTN_MIDDLE,
//   written when it changes; a button event on its own is a separate button: its number
//   (1 left, 2 right, 3 middle) pressed or released as its state says;
// - a SYN_REPORT after each delivered event that wrote anything.
std::vector<W> writesForDeliveries(const std::vector<HIDEventRef>& delivered) {
    std::vector<W> out;
    double x = 0, y = 0, wheel = 0, hwheel = 0;
    int32_t wheelUnits = 0, hwheelUnits = 0;
    uint32_t filterMask = 0, separate = 0, down = 0;
    const uint16_t codes[3] = {BTN_LEFT, BTN_RIGHT, BTN_MIDDLE};
    for (const HIDEventRef& e : delivered) {
        std::vector<W> r;
        auto whole = [](double* acc) {
            const double w = std::trunc(*acc);
            *acc -= w;
            return static_cast<int32_t>(w);
        };
        auto buttons = [&] {
            for (int b = 0; b < 3; ++b) {
                const uint32_t bit = 1u << b;
                if (((filterMask | separate) & bit) != (down & bit)) {
                    down ^= bit;
                    r.push_back({EV_KEY, codes[b], (down & bit) ? 1 : 0});
                }
            }
        };
        if (e->type() == kHIDEventTypePointer) {
            x += e->doubleValueForField(kHIDEventFieldPointerX);
            y += e->doubleValueForField(kHIDEventFieldPointerY);
            if (int32_t dx = whole(&x)) r.push_back({EV_REL, REL_X, dx});
            if (int32_t dy = whole(&y)) r.push_back({EV_REL, REL_Y, dy});
            for (const HIDEventRef& c : e->children()) {
                if (c->type() == kHIDEventTypeButton) {
                    filterMask = static_cast<uint32_t>(c->integerValueForField(kHIDEventFieldButtonMask));
                    buttons();
                }
                if (c->type() != kHIDEventTypeScroll) continue;
                if (c->phase() == 1 || c->phase() == 0x80) wheel = hwheel = 0, wheelUnits = hwheelUnits = 0;
                wheel += c->doubleValueForField(kHIDEventFieldScrollY) * kFactor;
                hwheel -= c->doubleValueForField(kHIDEventFieldScrollX) * kFactor;
                if (int32_t v = whole(&wheel)) {
                    r.push_back({EV_REL, REL_WHEEL_HI_RES, v});
                    wheelUnits += v;
                    if (int32_t d = wheelUnits / 120) r.push_back({EV_REL, REL_WHEEL, d}), wheelUnits -= d * 120;
                }
                if (int32_t v = whole(&hwheel)) {
                    r.push_back({EV_REL, REL_HWHEEL_HI_RES, v});
                    hwheelUnits += v;
                    if (int32_t d = hwheelUnits / 120) r.push_back({EV_REL, REL_HWHEEL, d}), hwheelUnits -= d * 120;
                }
            }
        } else if (e->type() == kHIDEventTypeButton) {
            const int64_t n = e->integerValueForField(kHIDEventFieldButtonNumber);
            const uint32_t bit = 1u << (n - 1);
            separate = e->integerValueForField(kHIDEventFieldButtonState) ? separate | bit : separate & ~bit;
            buttons();
        }
        if (!r.empty()) {
            out.insert(out.end(), r.begin(), r.end());
            out.push_back({EV_SYN, SYN_REPORT, 0});
        }
    }
    return out;
}

// The gesture stream's lines for the filter's deliveries.
std::vector<std::string> linesForDeliveries(const std::vector<HIDEventRef>& delivered) {
    std::vector<std::string> lines;
    for (const HIDEventRef& e : delivered)
        for (const HIDEventRef& c : e->children())
            if (c->type() == kHIDEventTypeScale || c->type() == kHIDEventTypeRotation ||
                c->type() == kHIDEventTypeScroll)
                lines.push_back(formats::eventToJson(*c));
    return lines;
}

std::vector<std::string> splitLines(const std::string& text) {
    std::vector<std::string> lines;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) lines.push_back(line);
    return lines;
}

int32_t total(const std::vector<W>& writes, uint16_t code) {
    int32_t sum = 0;
    for (const W& w : writes)
        if (w.type == EV_REL && w.code == code) sum += w.value;
    return sum;
}

int count(const std::vector<W>& writes, W what) { return static_cast<int>(std::count(writes.begin(), writes.end(), what)); }

// One live run: sources from a fake provider, the bridge's loop, the captured pointer, and
// the gesture stream printed into a pipe the test reads afterwards.
struct LiveRun {
    LiveRun() {
        EXPECT_EQ(::pipe2(pipe, O_NONBLOCK | O_CLOEXEC), 0);
        ::fcntl(pipe[1], F_SETPIPE_SZ, 1 << 20);
        gestures.printTo(pipe[1]);
    }
    ~LiveRun() {
        ::close(pipe[0]);
        ::close(pipe[1]);
    }
    int run(const BridgeSettings& settings, bool wait = false) {
        LiveRunner runner(devices, bridge, &gestures, messages);
        status = runner.run(settings, wait, -1);
        disappearances = runner.disappearances();
        return status;
    }
    std::vector<std::string> lines() {
        std::string text;
        char buffer[4096];
        for (ssize_t n; (n = ::read(pipe[0], buffer, sizeof buffer)) > 0;) text.append(buffer, static_cast<size_t>(n));
        return splitLines(text);
    }

    test::QuietLogs quiet;
    int pipe[2] = {-1, -1};
    CapturePointer capture;
    PointerOutput output{capture};
    GestureStream gestures;
    LatencyStats stats;
    LiveBridge bridge{output, &gestures, &stats};
    FakeDevices devices;
    std::ostringstream messages;
    int status = -1;
    uint64_t disappearances = 0;
};

struct RecordingCase {
    const char* file;
    bool needsSize;  // the description gives no resolution
};

void PrintTo(const RecordingCase& c, std::ostream* os) { *os << c.file; }

BridgeSettings settingsFor(const RecordingCase& c) {
    BridgeSettings s;
    s.plugInPath = test::kPlugInModule;
    s.keyboardCover = true;
    s.tapToClick = true;
    s.secondaryClick = true;
    if (c.needsSize) s.size = evemu::SurfaceSize{100.0, 60.0};
    return s;
}

evemu::EvemuOptions evemuOptionsFor(const RecordingCase& c) {
    evemu::EvemuOptions o;
    o.keyboardCover = true;
    o.tapToClick = true;
    o.secondaryClick = true;
    if (c.needsSize) o.size = evemu::SurfaceSize{100.0, 60.0};
    return o;
}

// The filter's deliveries for a recording converted as `orvane frames` converts it.
std::vector<HIDEventRef> referenceDeliveries(const Recording& r, const RecordingCase& c) {
    formats::FrameRecording frames;
    std::string error;
    EXPECT_TRUE(evemu::convertEvemuRecording(r.content, r.path, r.path, evemuOptionsFor(c), &frames, &error)) << error;
    return test::filterDeliveries(frames);
}

class LiveRecordingTest : public ::testing::TestWithParam<RecordingCase> {};

TEST_P(LiveRecordingTest, ThePointerGetsEveryDeltaScrollStepAndClickTheFilterDelivered) {
    Recording r;
    ASSERT_TRUE(test::loadRecording(GetParam().file, &r));
    LiveRun live;
    live.devices.sources.push_back(std::make_unique<RecordingSource>(r.device, r.events));
    ASSERT_EQ(live.run(settingsFor(GetParam())), 0) << live.messages.str();

    const std::vector<HIDEventRef> reference = referenceDeliveries(r, GetParam());
    ASSERT_FALSE(reference.empty());
    EXPECT_EQ(live.capture.written, writesForDeliveries(reference));
    EXPECT_EQ(live.lines(), linesForDeliveries(reference));
    // One frame per SYN_REPORT, each timed.
    const auto reports = std::count_if(r.events.begin(), r.events.end(), [](const evemu::EvdevEvent& e) {
        return e.type == evemu::kEvSyn && e.code == evemu::kSynReport;
    });
    EXPECT_EQ(live.bridge.framesHandled(), static_cast<uint64_t>(reports));
    EXPECT_EQ(live.stats.count(), static_cast<uint64_t>(reports));
    // The recording ends with every finger up: nothing is left pressed.
    for (uint16_t code : {BTN_LEFT, BTN_RIGHT, BTN_MIDDLE}) EXPECT_FALSE(live.output.isDown(code));
}

INSTANTIATE_TEST_SUITE_P(Recordings, LiveRecordingTest,
                         ::testing::Values(RecordingCase{"alps-glidepoint.one-finger-tap.events", true},
                                           RecordingCase{"alps-glidepoint.two-finger-tap.events", true},
                                           RecordingCase{"synaptics.two-finger-scroll-vertical.events", true},
                                           RecordingCase{"cypress.two-finger-tap.evemu", false},
                                           RecordingCase{"elantech.mixed.events", true}));

// What a person did on each recording, as the pointer sees it.
TEST(LiveRecordings, TwoFingersScrollingVerticallyTurnTheWheelsAndNothingElse) {
    Recording r;
    ASSERT_TRUE(test::loadRecording("synaptics.two-finger-scroll-vertical.events", &r));
    LiveRun live;
    live.devices.sources.push_back(std::make_unique<RecordingSource>(r.device, r.events));
    ASSERT_EQ(live.run(settingsFor({"", true})), 0) << live.messages.str();
    // Mostly the vertical wheel; the fingers also drift sideways a little. No pointer
    // motion and no button.
    int vertical = 0, horizontal = 0;
    for (const W& w : live.capture.written) {
        if (w.type == EV_SYN) continue;
        ASSERT_EQ(w.type, EV_REL) << w.code;
        if (w.code == REL_WHEEL_HI_RES) ++vertical;
        else if (w.code == REL_HWHEEL_HI_RES) ++horizontal;
        else EXPECT_TRUE(w.code == REL_WHEEL || w.code == REL_HWHEEL) << w.code;
    }
    EXPECT_GT(vertical, horizontal);
    // The fingers go up and down the pad several times; the gesture's lines run from may
    // begin (0x80) through began (1) to ended (4).
    const std::vector<std::string> lines = live.lines();
    ASSERT_GE(lines.size(), 3u);
    EXPECT_NE(lines.front().find("\"phase\": 128"), std::string::npos) << lines.front();
    EXPECT_NE(lines[1].find("\"phase\": 1,"), std::string::npos) << lines[1];
    EXPECT_NE(lines.back().find("\"phase\": 4,"), std::string::npos) << lines.back();
}

TEST(LiveRecordings, ATwoFingerTapWithSecondaryClickOnIsARightClick) {
    Recording r;
    ASSERT_TRUE(test::loadRecording("cypress.two-finger-tap.evemu", &r));
    LiveRun live;
    live.devices.sources.push_back(std::make_unique<RecordingSource>(r.device, r.events));
    ASSERT_EQ(live.run(settingsFor({"", false})), 0) << live.messages.str();
    // The press goes out when the filter dispatches it, the release with the returned event.
    EXPECT_EQ(count(live.capture.written, {EV_KEY, BTN_RIGHT, 1}), 1);
    EXPECT_EQ(count(live.capture.written, {EV_KEY, BTN_RIGHT, 0}), 1);
    EXPECT_EQ(count(live.capture.written, {EV_KEY, BTN_LEFT, 1}), 0);
}

TEST(LiveRecordings, TheMixedSessionMovesThePointerByWhatTheFilterDeliveredWithinOneCount) {
    Recording r;
    ASSERT_TRUE(test::loadRecording("elantech.mixed.events", &r));
    LiveRun live;
    live.devices.sources.push_back(std::make_unique<RecordingSource>(r.device, r.events));
    ASSERT_EQ(live.run(settingsFor({"", true})), 0) << live.messages.str();
    double x = 0, y = 0;
    for (const HIDEventRef& e : referenceDeliveries(r, {"", true})) {
        if (e->type() != kHIDEventTypePointer) continue;
        x += e->doubleValueForField(kHIDEventFieldPointerX);
        y += e->doubleValueForField(kHIDEventFieldPointerY);
    }
    ASSERT_NE(x, 0.0);
    ASSERT_NE(y, 0.0);
    // The remainders carried: what was written misses less than one count of the total.
    EXPECT_LT(std::fabs(x - total(live.capture.written, REL_X)), 1.0);
    EXPECT_LT(std::fabs(y - total(live.capture.written, REL_Y)), 1.0);
}

// The live service is the one the evemu conversion makes for a recording of the device.
TEST_P(LiveRecordingTest, TheServiceIsTheOneTheEvemuConversionMakes) {
    Recording r;
    ASSERT_TRUE(test::loadRecording(GetParam().file, &r));
    formats::FrameRecording frames;
    std::string error;
    ASSERT_TRUE(evemu::convertEvemuRecording(r.content, r.path, r.path, evemuOptionsFor(GetParam()), &frames, &error))
        << error;
    formats::ServiceDescription service;
    ASSERT_TRUE(touchpadService(r.device, evemuOptionsFor(GetParam()).size, true, &service, &error)) << error;
    EXPECT_EQ(service.usagePairs, frames.header.service.usagePairs);
    EXPECT_EQ(PropertyValue(service.properties), PropertyValue(frames.header.service.properties));
}

TEST(LiveService, WithoutResolutionOrSizeTheErrorAsksForTheSize) {
    Recording r;
    ASSERT_TRUE(test::loadRecording("synaptics.two-finger-scroll-vertical.events", &r));
    formats::ServiceDescription service;
    std::string error;
    EXPECT_FALSE(touchpadService(r.device, std::nullopt, true, &service, &error));
    EXPECT_EQ(error,
              "ABS_MT_POSITION_X gives no resolution, so the surface size is unknown: give it with --size "
              "WIDTHxHEIGHT in millimetres (for example --size 100x60)");
}

TEST(LiveService, WithoutKeyboardCoverTheFilterDoesNotMatchAndTheMessageSaysHowToAsk) {
    Recording r;
    ASSERT_TRUE(test::loadRecording("cypress.two-finger-tap.evemu", &r));
    LiveRun live;
    live.devices.sources.push_back(std::make_unique<RecordingSource>(r.device, r.events));
    BridgeSettings s = settingsFor({"", false});
    s.keyboardCover = false;
    EXPECT_EQ(live.run(s), 1);
    const std::string said = live.messages.str();
    EXPECT_NE(said.find("ask for that with --keyboard-cover"), std::string::npos) << said;
    EXPECT_EQ(std::count(said.begin(), said.end(), '\n'), 1) << said;
}

// The indices of a recording's SYN_REPORTs.
std::vector<size_t> reportIndices(const std::vector<evemu::EvdevEvent>& events) {
    std::vector<size_t> at;
    for (size_t i = 0; i < events.size(); ++i)
        if (events[i].type == evemu::kEvSyn && events[i].code == evemu::kSynReport) at.push_back(i);
    return at;
}

TEST(LiveResynchronisation, SynDroppedInTheMiddleOfATwoFingerScrollLetsTheScrollGoOn) {
    Recording r;
    ASSERT_TRUE(test::loadRecording("synaptics.two-finger-scroll-vertical.events", &r));
    const std::vector<size_t> reports = reportIndices(r.events);
    ASSERT_GT(reports.size(), 60u);
    // Lost: from the second event of frame 31 (its first events were handed over) to the
    // end of frame 40; both fingers are down and moving all along.
    const size_t from = reports[29] + 2, resumeAt = reports[39] + 1;
    auto source = std::make_unique<RecordingSource>(r.device, r.events);
    source->dropEvents(from, resumeAt);
    const uint64_t resumedAt = r.events[resumeAt].time_ns;

    LiveRun live;
    live.devices.sources.push_back(std::move(source));
    ASSERT_EQ(live.run(settingsFor({"", true})), 0) << live.messages.str();
    EXPECT_EQ(live.bridge.resynchronisations(), 1u);
    // 10 frames lost, one made by the resynchronisation: 82 - 10 + 1.
    EXPECT_EQ(live.bridge.framesHandled(), reports.size() - 10 + 1);

    // The scroll goes on after it and ends when the fingers lift.
    const std::vector<std::string> lines = live.lines();
    int changedAfter = 0;
    for (const std::string& line : lines) {
        const HIDEventRef e = formats::eventFromJson(line, nullptr);
        ASSERT_NE(e, nullptr) << line;
        if (e->timestamp() >= resumedAt && e->phase() == 2) ++changedAfter;
    }
    EXPECT_GT(changedAfter, 0);
    ASSERT_FALSE(lines.empty());
    EXPECT_NE(lines.back().find("\"phase\": 4,"), std::string::npos) << lines.back();
}

TEST(LiveResynchronisation, AnEndOfTouchLostInTheDropIsStillSeen) {
    Recording r;
    ASSERT_TRUE(test::loadRecording("synaptics.two-finger-scroll-vertical.events", &r));
    const std::vector<size_t> reports = reportIndices(r.events);
    // Lost: from the middle of the third frame from the end through the last, which ends
    // both contacts (tracking ID -1): only the resynchronisation can say they lifted.
    const size_t from = reports[reports.size() - 3] + 2, resumeAt = r.events.size();
    auto source = std::make_unique<RecordingSource>(r.device, r.events);
    source->dropEvents(from, resumeAt);

    LiveRun live;
    live.devices.sources.push_back(std::move(source));
    ASSERT_EQ(live.run(settingsFor({"", true})), 0) << live.messages.str();
    EXPECT_EQ(live.bridge.resynchronisations(), 1u);
    const std::vector<std::string> lines = live.lines();
    ASSERT_FALSE(lines.empty());
    // The scroll ends (phase 4) because the resynchronisation reported both contacts ending.
    EXPECT_NE(lines.back().find("\"phase\": 4,"), std::string::npos) << lines.back();
}

TEST(LiveResynchronisation, TheFramesAfterItAreTheFramesOfTheDevice) {
    // The events a resynchronisation hands over, applied like all others (the SYN_DROPPED
    // itself skipped), bring the conversion to the device's state: from the frame that ends
    // the resynchronisation on, every contact is where the recording without loss has it.
    Recording r;
    ASSERT_TRUE(test::loadRecording("synaptics.two-finger-scroll-vertical.events", &r));
    const std::vector<size_t> reports = reportIndices(r.events);
    const size_t from = reports[29] + 2, resumeAt = reports[39] + 1;
    RecordingSource dropped(r.device, r.events);
    dropped.dropEvents(from, resumeAt);

    evemu::TouchpadLayout layout;
    std::string error;
    ASSERT_TRUE(evemu::touchpadLayoutFor(r.device, &layout, &error)) << error;
    auto framesOf = [&](const std::vector<evemu::EvdevEvent>& events) {
        evemu::TouchFrameConverter converter(layout);
        std::vector<HIDEventRef> frames;
        std::string why;
        for (const evemu::EvdevEvent& e : events) {
            if (e.type == evemu::kEvSyn && e.code == evemu::kSynDropped) continue;
            EXPECT_TRUE(converter.feed(e, &frames, &why)) << why;
        }
        return frames;
    };
    const std::vector<HIDEventRef> whole = framesOf(r.events), live = framesOf(dropped.events());
    // Frames 0..29 the same; then the resynchronisation's frame stands for frames 30..39.
    ASSERT_EQ(live.size(), whole.size() - 9);
    auto contacts = [](const HIDEventRef& frame) {
        std::vector<std::tuple<int64_t, double, double, int64_t>> c;
        for (const HIDEventRef& child : frame->children())
            c.emplace_back(child->integerValueForField(kHIDEventFieldDigitizerIndex),
                           child->doubleValueForField(kHIDEventFieldDigitizerX),
                           child->doubleValueForField(kHIDEventFieldDigitizerY),
                           child->integerValueForField(kHIDEventFieldDigitizerTouch));
        return c;
    };
    for (size_t i = 0; i < 30; ++i) EXPECT_EQ(contacts(live[i]), contacts(whole[i])) << "frame " << i;
    for (size_t i = 30; i < live.size(); ++i)
        EXPECT_EQ(contacts(live[i]), contacts(whole[i + 9])) << "frame " << i << " of the live run";
}

// A touchpad with two separate buttons (left and right), 100 × 60 mm.
evemu::EvdevDevice padWithButtons() {
    evemu::EvdevDevice d;
    d.name = "Test pad with buttons";
    d.bus = 0x18;  // I2C
    d.properties = {0x01};  // INPUT_PROP_POINTER
    auto setBit = [](std::vector<uint8_t>& bits, unsigned n) {
        if (bits.size() <= n / 8) bits.resize(n / 8 + 1, 0);
        bits[n / 8] = static_cast<uint8_t>(bits[n / 8] | 1u << (n % 8));
    };
    for (unsigned t : {evemu::kEvSyn, evemu::kEvKey, evemu::kEvAbs}) setBit(d.codes[0], t);
    for (unsigned k : {BTN_LEFT, BTN_RIGHT, BTN_TOUCH}) setBit(d.codes[evemu::kEvKey], k);
    for (unsigned a : {evemu::kAbsMtSlot, evemu::kAbsMtPositionX, evemu::kAbsMtPositionY, evemu::kAbsMtTrackingId})
        setBit(d.codes[evemu::kEvAbs], a);
    d.axes[evemu::kAbsMtSlot] = {0, 1, 0, 0, 0};
    d.axes[evemu::kAbsMtPositionX] = {0, 1000, 0, 0, 10};
    d.axes[evemu::kAbsMtPositionY] = {0, 600, 0, 0, 10};
    d.axes[evemu::kAbsMtTrackingId] = {0, 65535, 0, 0, 0};
    return d;
}

// A finger that touches and moves, with the right button pressed at the second frame.
std::vector<evemu::EvdevEvent> fingerWithRightButtonHeld() {
    std::vector<evemu::EvdevEvent> e;
    uint64_t t = 1'000'000'000;
    auto at = [&](uint16_t type, uint16_t code, int32_t value) { e.push_back({t, type, code, value}); };
    at(evemu::kEvAbs, evemu::kAbsMtSlot, 0);
    at(evemu::kEvAbs, evemu::kAbsMtTrackingId, 1);
    at(evemu::kEvAbs, evemu::kAbsMtPositionX, 400);
    at(evemu::kEvAbs, evemu::kAbsMtPositionY, 300);
    at(evemu::kEvKey, BTN_TOUCH, 1);
    at(evemu::kEvSyn, evemu::kSynReport, 0);
    for (int i = 1; i <= 10; ++i) {
        t += 8'000'000;
        if (i == 2) at(evemu::kEvKey, BTN_RIGHT, 1);
        at(evemu::kEvAbs, evemu::kAbsMtPositionX, 400 + 10 * i);
        at(evemu::kEvSyn, evemu::kSynReport, 0);
    }
    return e;
}

TEST(LiveVanishing, ADeviceThatGoesAwayIsReportedAndLeavesNoButtonPressed) {
    const std::vector<evemu::EvdevEvent> events = fingerWithRightButtonHeld();
    auto source = std::make_unique<RecordingSource>(padWithButtons(), events, "/dev/input/event42");
    source->vanishAt(events.size() - 4);  // the right button is down, the finger moving
    LiveRun live;
    live.devices.sources.push_back(std::move(source));
    BridgeSettings s;
    s.plugInPath = test::kPlugInModule;
    s.keyboardCover = true;
    EXPECT_EQ(live.run(s), 1);
    EXPECT_EQ(live.messages.str(),
              "orvane: reading the touchpad /dev/input/event42\n"
              "orvane: /dev/input/event42 went away (--wait waits for it to come back)\n");
    EXPECT_EQ(live.disappearances, 1u);
    // The separate right button went down as it was, and came up when the device went.
    EXPECT_EQ(count(live.capture.written, {EV_KEY, BTN_RIGHT, 1}), 1);
    ASSERT_GE(live.capture.written.size(), 2u);
    EXPECT_EQ(std::vector<W>(live.capture.written.end() - 2, live.capture.written.end()),
              (std::vector<W>{{EV_KEY, BTN_RIGHT, 0}, {EV_SYN, SYN_REPORT, 0}}));
    EXPECT_FALSE(live.output.isDown(BTN_RIGHT));
    // The filter was cancelled as the event system cancels it.
    EXPECT_FALSE(live.bridge.isRunning());
    EXPECT_FALSE(live.bridge.host().isLoaded());
}

TEST(LiveVanishing, WithWaitTheBridgeWaitsForTheDeviceAndGoesOnWhenItIsBack) {
    const std::vector<evemu::EvdevEvent> events = fingerWithRightButtonHeld();
    auto first = std::make_unique<RecordingSource>(padWithButtons(), events, "/dev/input/event42");
    first->vanishAt(events.size() - 4);
    LiveRun live;
    live.devices.sources.push_back(std::move(first));
    live.devices.sources.push_back(std::make_unique<RecordingSource>(padWithButtons(), events, "/dev/input/event43"));
    live.devices.absentBetween = 2;  // not there the first two times it is looked for
    BridgeSettings s;
    s.plugInPath = test::kPlugInModule;
    s.keyboardCover = true;
    EXPECT_EQ(live.run(s, true), 0);
    EXPECT_EQ(live.messages.str(),
              "orvane: reading the touchpad /dev/input/event42\n"
              "orvane: /dev/input/event42 went away; waiting for it to come back\n"
              "orvane: reading the touchpad /dev/input/event43\n");
    EXPECT_EQ(live.devices.opens, 4);  // first, twice not there, then back
    // Pressed on the first device, released when it went; pressed and released again by the
    // second, which plays the whole session.
    EXPECT_EQ(count(live.capture.written, {EV_KEY, BTN_RIGHT, 1}), 2);
    EXPECT_EQ(count(live.capture.written, {EV_KEY, BTN_RIGHT, 0}), 2);
    EXPECT_FALSE(live.output.isDown(BTN_RIGHT));
}

TEST(LiveVanishing, ATouchpadThatIsNotThereEndsTheRunWithTheReason) {
    LiveRun live;
    BridgeSettings s;
    s.plugInPath = test::kPlugInModule;
    EXPECT_EQ(live.run(s), 1);
    EXPECT_EQ(live.messages.str(), "orvane: no touchpad found\n");
}

TEST(LiveVanishing, WithWaitATouchpadThatIsNotThereYetIsWaitedFor) {
    LiveRun live;
    live.devices.absentBefore = 3;
    live.devices.sources.push_back(
        std::make_unique<RecordingSource>(padWithButtons(), fingerWithRightButtonHeld(), "/dev/input/event7"));
    BridgeSettings s;
    s.plugInPath = test::kPlugInModule;
    s.keyboardCover = true;
    EXPECT_EQ(live.run(s, true), 0);
    // Said once, however often it looks.
    EXPECT_EQ(live.messages.str(),
              "orvane: no touchpad found; waiting for it (--wait)\n"
              "orvane: reading the touchpad /dev/input/event7\n");
    EXPECT_EQ(live.devices.opens, 4);
    EXPECT_EQ(count(live.capture.written, {EV_KEY, BTN_RIGHT, 1}), 1);
}

TEST(LiveStop, AStopRequestEndsTheRunReleasesTheButtonsAndCancelsTheFilter) {
    // A finger moves for 600 frames with the right button held from the second frame on.
    // SIGINT and SIGTERM write to the stop descriptor; here that happens while event 600
    // is read, and the loop stops when it next looks around (after event 1023: a source
    // without a descriptor is read 512 events at a time).
    std::vector<evemu::EvdevEvent> events = fingerWithRightButtonHeld();
    for (int i = 0; i < 600; ++i) {
        const uint64_t t = events.back().time_ns + 8'000'000;
        events.push_back({t, evemu::kEvAbs, evemu::kAbsMtPositionX, 500 + (i % 2)});
        events.push_back({t, evemu::kEvSyn, evemu::kSynReport, 0});
    }
    int stop[2];
    ASSERT_EQ(::pipe(stop), 0);
    auto source = std::make_unique<RecordingSource>(padWithButtons(), events);
    source->whenHandingOver(600, [&] {
        const char byte = 1;
        EXPECT_EQ(::write(stop[1], &byte, 1), 1);
    });
    LiveRun live;
    live.devices.sources.push_back(std::move(source));
    BridgeSettings s;
    s.plugInPath = test::kPlugInModule;
    s.keyboardCover = true;
    LiveRunner runner(live.devices, live.bridge, &live.gestures, live.messages);
    EXPECT_EQ(runner.run(s, false, stop[0]), 0) << live.messages.str();
    ::close(stop[0]);
    ::close(stop[1]);
    // Events 0 to 1023 were read: the first 11 frames are 27 events (6 for the touch, 2 a
    // frame after it, 1 more for the button), then each frame is 2 events, its SYN_REPORT
    // at 28 + 2k: k = 0 to 497 are read, 498 frames. 11 + 498 = 509 of the 611.
    EXPECT_EQ(live.bridge.framesHandled(), 509u);
    // The button was down when the stop came, and the stop released it.
    EXPECT_EQ(count(live.capture.written, {EV_KEY, BTN_RIGHT, 1}), 1);
    ASSERT_GE(live.capture.written.size(), 2u);
    EXPECT_EQ(std::vector<W>(live.capture.written.end() - 2, live.capture.written.end()),
              (std::vector<W>{{EV_KEY, BTN_RIGHT, 0}, {EV_SYN, SYN_REPORT, 0}}));
    // The filter was cancelled and the plug-in unloaded.
    EXPECT_FALSE(live.bridge.isRunning());
    EXPECT_FALSE(live.bridge.host().isLoaded());
}

TEST(LiveLid, TheLidIsReportedAsTheSurfaceCovered) {
    const std::vector<evemu::EvdevEvent> events = fingerWithRightButtonHeld();
    LiveRun live;
    auto lid = std::make_unique<test::FakeLid>();
    lid->closed = true;
    live.devices.lid = std::move(lid);
    live.devices.sources.push_back(std::make_unique<RecordingSource>(padWithButtons(), events));
    BridgeSettings s;
    s.plugInPath = test::kPlugInModule;
    s.keyboardCover = true;
    ASSERT_EQ(live.run(s), 0) << live.messages.str();
    // "HostStateNotification" with "DigitizerSurfaceCovered" 1: the filter turns the
    // service's keyboard off.
    ASSERT_NE(live.bridge.service(), nullptr);
    EXPECT_EQ(live.bridge.service()->propertyForKey("KeyboardEnabled"), PropertyValue(0));
}

TEST(LiveLid, ALidSwitchEventFromTheTouchpadItselfIsReportedToo) {
    // SW_LID (EV_SW 0x05, code 0) arriving among the touchpad's own events.
    std::vector<evemu::EvdevEvent> events = fingerWithRightButtonHeld();
    events.insert(events.begin() + 6, evemu::EvdevEvent{events[6].time_ns, 0x05, 0x00, 0});
    evemu::EvdevDevice pad = padWithButtons();
    pad.codes[0][0] = static_cast<uint8_t>(pad.codes[0][0] | 1u << 5);
    pad.codes[0x05] = {0x01};
    LiveRun live;
    live.devices.sources.push_back(std::make_unique<RecordingSource>(pad, events));
    BridgeSettings s;
    s.plugInPath = test::kPlugInModule;
    s.keyboardCover = true;
    ASSERT_EQ(live.run(s), 0) << live.messages.str();
    // Open: not covered, so the keyboard is on.
    EXPECT_EQ(live.bridge.service()->propertyForKey("KeyboardEnabled"), PropertyValue(1));
}

}  // namespace
}  // namespace orvane::live
