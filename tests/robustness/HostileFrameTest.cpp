// Frames a broken or hostile device could send, through the loaded plug-in. Each test states
// what the filter does with the input by its rules, not only that it survives it.
//
// The service is 100 x 50 (SurfaceDimensions 6553600 x 3276800 in 16.16), so the filter
// works on a 1000 x 500 surface. Frames come 8 ms apart.

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <cstdint>
#include <limits>
#include <ostream>
#include <string>
#include <vector>

#include "RobustnessSupport.h"
#include "tests/support/FrameBuilder.h"

namespace orvane::robust {
namespace {

using test::ContactFields;
using test::contactEvent;
using test::frameEvent;

constexpr uint64_t kStart = 1000000000;  // 1 s in ticks (1/1 timebase: nanoseconds)
constexpr uint64_t kFrame = 8000000;     // 8 ms

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInf = std::numeric_limits<double>::infinity();

// One finger (index 0) at (x, y) in digitizer fractions; the first frame of a touch reports
// range, touch and position changed (7), later ones position changed (4).
HIDEventRef finger(double x, double y, int32_t eventMask = 4, int32_t touch = 1, int32_t index = 0) {
    ContactFields c;
    c.index = index;
    c.x = x;
    c.y = y;
    c.touch = touch;
    c.range = touch;
    c.eventMask = eventMask;
    return contactEvent(c, 0);
}

HIDEventRef at(uint64_t t, std::vector<HIDEventRef> children, int32_t buttonMask = 0) {
    for (auto& c : children) c->setTimestamp(t);
    return frameEvent(t, children, buttonMask);
}

// The hand event (the digitizer child) of a returned pointer event.
HIDEventRef handEventOf(const HIDEventRef& pointer) { return childOfType(pointer, kHIDEventTypeDigitizer); }

bool sameBits(double a, double b) { return std::memcmp(&a, &b, sizeof a) == 0; }

// Every field of `b` is in `a` with the same value, and no other.
void expectSameFields(const HIDEvent& a, const HIDEvent& b, const std::string& what) {
    ASSERT_EQ(a.fields().size(), b.fields().size()) << what;
    for (size_t i = 0; i < a.fields().size(); ++i) {
        const auto& fa = a.fields()[i];
        const auto& fb = b.fields()[i];
        EXPECT_EQ(fa.selector, fb.selector) << what;
        EXPECT_EQ(fa.integer, fb.integer) << what << " field 0x" << std::hex << fa.selector;
        EXPECT_TRUE(sameBits(fa.real, fb.real)) << what << " field 0x" << std::hex << fa.selector;
        EXPECT_EQ(fa.data, fb.data) << what;
    }
}

// Two events agree: type, timestamp, phase, fields (not for the hand event, whose centre
// may differ) and their children one by one, except that `extra` trailing children of `b`
// are left out.
void expectSameTree(const HIDEventRef& a, const HIDEventRef& b, size_t extra, int depth, const std::string& what) {
    ASSERT_EQ(a == nullptr, b == nullptr) << what;
    if (!a) return;
    EXPECT_EQ(a->type(), b->type()) << what;
    EXPECT_EQ(a->timestamp(), b->timestamp()) << what;
    EXPECT_EQ(a->phase(), b->phase()) << what;
    const bool handEvent = depth == 1 && a->type() == kHIDEventTypeDigitizer;
    if (!handEvent) expectSameFields(*a, *b, what);
    const size_t skip = handEvent ? extra : 0;
    ASSERT_EQ(a->children().size() + skip, b->children().size()) << what;
    for (size_t i = 0; i < a->children().size(); ++i)
        expectSameTree(a->children()[i], b->children()[i], extra, depth + 1, what + " child " + std::to_string(i));
}

// Two returned pointer events agree, except for `extra` trailing children of b's hand event.
void expectSameOutput(const HIDEventRef& a, const HIDEventRef& b, size_t extra, const std::string& what) {
    expectSameTree(a, b, extra, 0, what);
}

// ---------------------------------------------------------------------------------------
// Contact indexes outside 0..13

class DroppedContactIndex : public testing::TestWithParam<int64_t> {};

// A contact whose index names no path of the table (above 13, below -1, or -1, which names
// slot 0 that no ID finds) is dropped by the path table. Placed after the real finger, it is
// also past the positions the hand event walks (one path, so position 0 only). So the
// pointer motion, gestures and the finger's own child are exactly those of the same session
// without it; the dropped child rides along in the hand event untouched (y not flipped, no
// identity or generation count); and it still counts in the hand centre, which averages
// every digitizer child not resting in the thumb zone.
TEST_P(DroppedContactIndex, ChildIsDroppedFromThePathsAndCarriedUntouched) {
    const int64_t index = GetParam();
    PlugInSession clean, hostile;
    ASSERT_TRUE(clean.opened() && hostile.opened());

    for (int k = 0; k < 9; ++k) {
        const uint64_t t = kStart + k * kFrame;
        const bool lifting = k == 7, gone = k == 8;
        const int32_t mask = k == 0 ? 7 : lifting ? 3 : 4;
        const double x = 0.3 + 0.02 * std::min(k, 6);
        std::vector<HIDEventRef> fingers;
        if (!gone) fingers.push_back(finger(x, 0.5, mask, lifting ? 0 : 1));

        ContactFields stray;
        stray.x = 0.8;
        stray.y = 0.125;
        stray.eventMask = 4;
        auto strayChild = contactEvent(stray, t);
        strayChild->setIntegerValue(index, kHIDEventFieldDigitizerIndex);
        const HIDEventRef sent = strayChild->copy();

        std::vector<HIDEventRef> withStray = fingers;
        for (auto& c : withStray) c = c->copy();
        withStray.push_back(strayChild);

        const HIDEventRef a = clean.send(at(t, fingers));
        const HIDEventRef b = hostile.send(at(t, withStray));
        const std::string what = "frame " + std::to_string(k);
        expectSameOutput(a, b, gone ? 0 : 1, what);
        if (gone) continue;

        const HIDEventRef hand = handEventOf(b);
        ASSERT_TRUE(hand) << what;
        ASSERT_EQ(hand->children().size(), 2u) << what;
        expectSameFields(*hand->children()[1], *sent, what + " dropped child");
        // Hand centre over both children: x = (x + 0.8) / 2; y = (0.5 + 0.125) / 2 = 0.3125,
        // flipped for the UI to 1 - 0.3125 = 0.6875.
        EXPECT_DOUBLE_EQ(hand->doubleValueForField(kHIDEventFieldDigitizerX), (x + 0.8) / 2) << what;
        EXPECT_DOUBLE_EQ(hand->doubleValueForField(kHIDEventFieldDigitizerY), 0.6875) << what;
    }
    EXPECT_TRUE(hostile.dispatched().empty());
    EXPECT_EQ(hostile.countLogs(LogLevel::Error), 0u);
}

INSTANTIATE_TEST_SUITE_P(Indexes, DroppedContactIndex,
                         // 2^31 - 1 once overflowed when the resting mark added one to it
                         testing::Values(14, 15, -1, -2, int64_t{std::numeric_limits<int32_t>::max()},
                                         int64_t{std::numeric_limits<int32_t>::min()},
                                         // read as a 32-bit value: 2^32 + 20 is index 20
                                         (int64_t{1} << 32) + 20),
                         [](const testing::TestParamInfo<int64_t>& info) {
                             const int64_t v = info.param;
                             return (v < 0 ? "minus" : "") + std::to_string(v < 0 ? -v : v);
                         });

// Thirty contacts in one frame, indexes 0 to 29: the table takes 0 to 13 and drops the
// sixteen others, which come after them and so lie past the positions the hand event walks
// (fourteen paths, positions 0 to 13). The output is that of the same frames with the
// fourteen alone, the dropped children riding along untouched; a frame with no children at
// all then clears every path in both, and both return the bare pointer event of "all
// contacts vanished".
TEST(HostileChildren, ContactsBeyondTheFourteenSlotsAreDropped) {
    PlugInSession clean, hostile;
    ASSERT_TRUE(clean.opened() && hostile.opened());
    for (int k = 0; k < 7; ++k) {
        const uint64_t t = kStart + k * kFrame;
        std::vector<HIDEventRef> fourteen, thirty;
        if (k < 6) {
            for (int i = 0; i < 30; ++i) {
                const double x = 0.02 + 0.03 * i + 0.005 * k;
                const double y = 0.2 + 0.02 * (i % 5);
                auto child = finger(x, y, k == 0 ? 7 : 4, 1, i);
                if (i < 14) fourteen.push_back(child->copy());
                thirty.push_back(child);
            }
        }
        const HIDEventRef a = clean.send(at(t, fourteen));
        const HIDEventRef b = hostile.send(at(t, thirty));
        const std::string what = "frame " + std::to_string(k);
        expectSameOutput(a, b, k < 6 ? 16 : 0, what);
        if (k < 6) {
            const HIDEventRef hand = handEventOf(b);
            ASSERT_TRUE(hand) << what;
            ASSERT_EQ(hand->children().size(), 30u) << what;
            for (int i = 14; i < 30; ++i) {
                const HIDEvent& dropped = *hand->children()[static_cast<size_t>(i)];
                EXPECT_EQ(dropped.integerValueForField(kHIDEventFieldDigitizerIndex), i) << what;
                EXPECT_FALSE(dropped.hasField(kHIDEventFieldDigitizerIdentity)) << what << " child " << i;
                EXPECT_DOUBLE_EQ(dropped.doubleValueForField(kHIDEventFieldDigitizerY), 0.2 + 0.02 * (i % 5))
                    << what << " child " << i;
            }
        } else {
            ASSERT_TRUE(b) << what;
            EXPECT_EQ(b->timestamp(), 0u);
            EXPECT_TRUE(b->children().empty());
        }
    }
}

// ---------------------------------------------------------------------------------------
// Coordinates that are not numbers, infinite, huge or off the surface

struct Coordinates {
    const char* name;
    double x, y;
};

void PrintTo(const Coordinates& c, std::ostream* os) { *os << c.name; }

class CarriedCoordinates : public testing::TestWithParam<Coordinates> {};

// The hand event carries the contact's own x, and y flipped for the UI (1 - y), whatever
// they are: NaN stays NaN, infinities and huge values stay as they came. The parent (the
// hand centre of the one child) carries the same. The lift is still reported exactly once,
// as an out-of-range child (touch 0, range 0, mask 3).
TEST_P(CarriedCoordinates, ValuesReachTheHandEventAsTheyCame) {
    const Coordinates c = GetParam();
    PlugInSession session;
    ASSERT_TRUE(session.opened());

    const HIDEventRef first = session.send(at(kStart, {finger(c.x, c.y, 7)}));
    ASSERT_TRUE(first);
    EXPECT_EQ(first->type(), kHIDEventTypePointer);
    const HIDEventRef hand = handEventOf(first);
    ASSERT_TRUE(hand);
    ASSERT_EQ(hand->children().size(), 1u);
    const HIDEvent& child = *hand->children()[0];
    EXPECT_TRUE(sameBits(child.doubleValueForField(kHIDEventFieldDigitizerX), c.x));
    EXPECT_TRUE(sameBits(child.doubleValueForField(kHIDEventFieldDigitizerY), 1.0 - c.y));
    EXPECT_EQ(child.integerValueForField(kHIDEventFieldDigitizerIdentity), 1);  // index + 1
    EXPECT_EQ(child.integerValueForField(kHIDEventFieldDigitizerGenerationCount), 0);
    EXPECT_TRUE(sameBits(hand->doubleValueForField(kHIDEventFieldDigitizerX), c.x / 1));
    EXPECT_TRUE(sameBits(hand->doubleValueForField(kHIDEventFieldDigitizerY), 1.0 - c.y / 1));

    session.send(at(kStart + kFrame, {finger(c.x, c.y)}));
    const HIDEventRef lift = session.send(at(kStart + 2 * kFrame, {finger(c.x, c.y, 3, 0)}));
    ASSERT_TRUE(lift);
    const HIDEventRef liftHand = handEventOf(lift);
    ASSERT_TRUE(liftHand);
    ASSERT_EQ(liftHand->children().size(), 1u);
    const HIDEvent& out = *liftHand->children()[0];
    EXPECT_EQ(out.integerValueForField(kHIDEventFieldDigitizerTouch), 0);
    EXPECT_EQ(out.integerValueForField(kHIDEventFieldDigitizerRange), 0);
    EXPECT_EQ(out.integerValueForField(kHIDEventFieldDigitizerEventMask), 3);
    // Third generation: the events of frames 0, 1 and 2.
    EXPECT_EQ(out.integerValueForField(kHIDEventFieldDigitizerGenerationCount), 2);
    EXPECT_EQ(session.countLogs(LogLevel::Error), 0u);
}

INSTANTIATE_TEST_SUITE_P(Values, CarriedCoordinates,
                         testing::Values(Coordinates{"NaN", kNaN, 0.25}, Coordinates{"NaNBoth", kNaN, kNaN},
                                         Coordinates{"Infinite", kInf, -kInf},
                                         Coordinates{"Huge", 1e300, -1e300},
                                         Coordinates{"OffTheSurface", -0.5, 1.5},
                                         Coordinates{"SmallestDenormal", std::numeric_limits<double>::denorm_min(),
                                                     std::numeric_limits<double>::denorm_min()}),
                         [](const testing::TestParamInfo<Coordinates>& info) { return info.param.name; });

// ---------------------------------------------------------------------------------------
// Timestamps

// Every event the filter makes carries the frame's own timestamp, even when the clock
// repeats, runs backwards, starts at 0 or sits at the largest value.
TEST(HostileTimestamps, RepeatedAndBackwardTimesStampTheEventsWithTheFrameTime) {
    PlugInSession session;
    ASSERT_TRUE(session.opened());
    const std::vector<uint64_t> times = {kStart,          kStart + kFrame, kStart + kFrame, kStart + kFrame / 2,
                                         kStart - kFrame, 0,               1,               UINT64_MAX,
                                         kStart};
    for (size_t k = 0; k < times.size(); ++k) {
        const HIDEventRef result = session.send(at(times[k], {finger(0.3 + 0.01 * k, 0.5, k == 0 ? 7 : 4)}));
        ASSERT_TRUE(result) << "frame " << k;
        EXPECT_EQ(result->type(), kHIDEventTypePointer);
        EXPECT_EQ(result->timestamp(), times[k]) << "frame " << k;
        for (const auto& child : result->children()) EXPECT_EQ(child->timestamp(), times[k]) << "frame " << k;
    }
}

// ---------------------------------------------------------------------------------------
// Children of other types

// The number of contacts counts digitizer children only, and contacts are read by
// position: children of other types after the contacts are never read. The output is that
// of the same session without them, and they ride along in the hand event untouched; the
// hand centre averages digitizer children only.
TEST(HostileChildren, ChildrenOfOtherTypesAfterTheContactsAreNotRead) {
    PlugInSession clean, hostile;
    ASSERT_TRUE(clean.opened() && hostile.opened());
    for (int k = 0; k < 8; ++k) {
        const uint64_t t = kStart + k * kFrame;
        const double x = 0.3 + 0.02 * k;
        auto keyboard = HIDEvent::create(kHIDEventTypeKeyboard, t);
        keyboard->setIntegerValue(7, kHIDEventFieldKeyboardUsagePage);
        keyboard->setIntegerValue(4, kHIDEventFieldKeyboardUsage);
        keyboard->setIntegerValue(1, kHIDEventFieldKeyboardDown);
        auto vendor = HIDEvent::create(kHIDEventTypeVendorDefined, t);
        const uint8_t bytes[] = {0xde, 0xad, 0xbe, 0xef};
        vendor->setDataValue(bytes, sizeof bytes, kHIDEventFieldVendorDefinedData);
        vendor->setIntegerValue(4, kHIDEventFieldVendorDefinedDataLength);
        auto pointer = HIDEvent::pointerEvent(t, 5.0, -5.0, 0.0, 1, 0);
        const std::vector<HIDEventRef> others = {keyboard->copy(), vendor->copy(), pointer->copy()};

        const HIDEventRef a = clean.send(at(t, {finger(x, 0.5, k == 0 ? 7 : 4)}));
        const HIDEventRef b = hostile.send(at(t, {finger(x, 0.5, k == 0 ? 7 : 4), keyboard, vendor, pointer}));
        const std::string what = "frame " + std::to_string(k);
        expectSameOutput(a, b, 3, what);
        const HIDEventRef hand = handEventOf(b);
        ASSERT_TRUE(hand) << what;
        ASSERT_EQ(hand->children().size(), 4u) << what;
        for (size_t i = 0; i < 3; ++i) {
            EXPECT_EQ(hand->children()[i + 1]->type(), others[i]->type()) << what;
            expectSameFields(*hand->children()[i + 1], *others[i], what + " other child");
        }
        EXPECT_DOUBLE_EQ(hand->doubleValueForField(kHIDEventFieldDigitizerX), x) << what;
    }
    EXPECT_TRUE(hostile.dispatched().empty());
}

// A child of another type at position 0 of a frame with one digitizer child is read as the
// contact in its place: its index field is unset (0) and so is its touch, so path 1 holds a
// contact that does not touch, and the finger behind it is never read. The hand event walk
// finds that child not touching, never reported, so it removes it from the frame (third
// case) and nothing is left: the first such frame returns the bare pointer event of "all
// contacts vanished" (timestamp 0, sender 0, no children), every later one returns none.
TEST(HostileChildren, AChildOfAnotherTypeAheadOfTheContactIsReadInItsPlace) {
    PlugInSession session;
    ASSERT_TRUE(session.opened());
    for (int k = 0; k < 6; ++k) {
        const uint64_t t = kStart + k * kFrame;
        auto keyboard = HIDEvent::create(kHIDEventTypeKeyboard, t);
        keyboard->setIntegerValue(1, kHIDEventFieldKeyboardDown);
        const HIDEventRef frame = at(t, {keyboard, finger(0.3 + 0.02 * k, 0.5, k == 0 ? 7 : 4)});
        const HIDEventRef result = session.send(frame);
        if (k == 0) {
            ASSERT_TRUE(result);
            EXPECT_EQ(result->type(), kHIDEventTypePointer);
            EXPECT_EQ(result->timestamp(), 0u);
            EXPECT_EQ(result->senderID(), 0u);
            EXPECT_TRUE(result->children().empty());
        } else {
            EXPECT_FALSE(result) << "frame " << k;
        }
        // The keyboard child was taken out of the frame; the finger is all that is left.
        ASSERT_EQ(frame->children().size(), 1u) << "frame " << k;
        EXPECT_EQ(frame->children()[0]->type(), kHIDEventTypeDigitizer);
    }
    EXPECT_TRUE(session.dispatched().empty());
}

// ---------------------------------------------------------------------------------------
// Vendor children: the wireless relative scan time

struct ScanTimeCase {
    const char* name;
    int64_t length;
    std::vector<uint8_t> data;
    bool logged;
};

void PrintTo(const ScanTimeCase& c, std::ostream* os) { *os << c.name; }

class HostileScanTime : public testing::TestWithParam<ScanTimeCase> {};

// A Bluetooth trackpad's scan-time child (vendor-defined, usage page 13, usage 86) whose
// length is not 2 logs the unexpected length at error level once per frame and the host
// time is used; one of length 2 with fewer than two bytes of data counts as no data, with
// no log. Either way the frame goes through: its pointer event carries the frame's time.
TEST_P(HostileScanTime, WrongLengthLogsAnErrorOncePerFrame) {
    const ScanTimeCase c = GetParam();
    PlugInSession session(trackpad("Bluetooth"));
    ASSERT_TRUE(session.opened());
    for (int k = 0; k < 3; ++k) {
        const uint64_t t = kStart + k * kFrame;
        auto scan = HIDEvent::create(kHIDEventTypeVendorDefined, t);
        scan->setIntegerValue(13, kHIDEventFieldVendorDefinedUsagePage);
        scan->setIntegerValue(86, kHIDEventFieldVendorDefinedUsage);
        scan->setIntegerValue(c.length, kHIDEventFieldVendorDefinedDataLength);
        scan->setDataValue(c.data.data(), c.data.size(), kHIDEventFieldVendorDefinedData);
        // The vendor child goes after the contact, so it is not read as one.
        const HIDEventRef result = session.send(at(t, {finger(0.4, 0.5, k == 0 ? 7 : 4), scan}));
        ASSERT_TRUE(result);
        EXPECT_EQ(result->timestamp(), t);
    }
    const std::string message = "-[OrvaneServiceFilter getDeviceTimestamp:] Unexpected relative scan time length "
                                "(received " +
                                std::to_string(c.length) + " bytes, expected 2 bytes)";
    size_t exact = 0;
    for (const auto& e : session.logs()) exact += e.level == LogLevel::Error && e.message == message;
    EXPECT_EQ(exact, c.logged ? 3u : 0u);
    EXPECT_EQ(session.countLogs(LogLevel::Error), c.logged ? 3u : 0u);
}

INSTANTIATE_TEST_SUITE_P(Reports, HostileScanTime,
                         testing::Values(ScanTimeCase{"LengthThree", 3, {1, 2, 3}, true},
                                         ScanTimeCase{"LengthZero", 0, {}, true},
                                         ScanTimeCase{"NegativeLength", -1, {1, 2}, true},
                                         ScanTimeCase{"HugeLength", int64_t{1} << 40, {1, 2}, true},
                                         ScanTimeCase{"TwoWithOneByte", 2, {7}, false},
                                         ScanTimeCase{"TwoWithNoData", 2, {}, false},
                                         ScanTimeCase{"TwoWithManyBytes", 2, {1, 2, 3, 4, 5, 6, 7, 8}, false}),
                         [](const testing::TestParamInfo<ScanTimeCase>& info) { return info.param.name; });

// The same wrong-length report from a wired trackpad is never looked at.
TEST(HostileScanTimeWired, AWiredTrackpadIgnoresScanTimeChildren) {
    PlugInSession session(trackpad("USB"));
    ASSERT_TRUE(session.opened());
    auto scan = HIDEvent::create(kHIDEventTypeVendorDefined, kStart);
    scan->setIntegerValue(13, kHIDEventFieldVendorDefinedUsagePage);
    scan->setIntegerValue(86, kHIDEventFieldVendorDefinedUsage);
    scan->setIntegerValue(3, kHIDEventFieldVendorDefinedDataLength);
    ASSERT_TRUE(session.send(at(kStart, {finger(0.4, 0.5, 7), scan})));
    EXPECT_EQ(session.countLogs(LogLevel::Error), 0u);
}

// ---------------------------------------------------------------------------------------
// Button masks

// The frame's button mask is the diving button's state as it comes. A finger rests; the
// mask goes 0, 6, 6, 0. At the change to 6 the pointer event carries button mask 6 and a
// button event with mask 6 (stored whole), number 2 (lowest set bit, 0x2, plus one) and
// state 1, with the error "Mask (0x6) has more than one bit set"; since the state is not 1
// it is logged as a release and no press counts as sent. So the change back to 0 sends no
// button event at all: a release follows only a press.
TEST(HostileButtons, AMaskWithSeveralBitsIsSentWholeAndNeverReleased) {
    PlugInSession session;
    ASSERT_TRUE(session.opened());
    const std::vector<int32_t> masks = {0, 0, 6, 6, 0, 0};
    std::vector<HIDEventRef> results;
    for (size_t k = 0; k < masks.size(); ++k)
        results.push_back(session.send(at(kStart + k * kFrame, {finger(0.5, 0.5, k == 0 ? 7 : 4)}, masks[k])));

    ASSERT_TRUE(results[2]);
    EXPECT_EQ(results[2]->integerValueForField(kHIDEventFieldPointerButtonMask), 6);
    const HIDEventRef button = childOfType(results[2], kHIDEventTypeButton);
    ASSERT_TRUE(button);
    EXPECT_EQ(button->integerValueForField(kHIDEventFieldButtonMask), 6);
    EXPECT_EQ(button->integerValueForField(kHIDEventFieldButtonNumber), 2);
    EXPECT_EQ(button->integerValueForField(kHIDEventFieldButtonState), 1);
    EXPECT_EQ(session.countLogs(LogLevel::Error,
                                "-[HIDEvent(HIDStatefulButtonEvent) setStatefulButtonMask:] Mask (0x6) has more than "
                                "one bit set. Button state cannot be represented correctly with just one event"),
              1u);
    EXPECT_EQ(session.countLogs(LogLevel::Default, " GESTURE BUTTON RELEASED"), 1u);
    EXPECT_EQ(session.countLogs(LogLevel::Default, " GESTURE BUTTON PRESSED"), 0u);
    for (size_t k : {0u, 1u, 3u, 4u, 5u}) EXPECT_FALSE(childOfType(results[k], kHIDEventTypeButton)) << "frame " << k;
    EXPECT_TRUE(session.dispatched().empty());
}

// The same with the click alone (mask 1): a press (mask 1, number 1, state 1) and later its
// release (mask 0, number 1, state 0), no error.
TEST(HostileButtons, TheClickAloneIsPressedAndReleased) {
    PlugInSession session;
    ASSERT_TRUE(session.opened());
    const std::vector<int32_t> masks = {0, 0, 1, 1, 0, 0};
    std::vector<HIDEventRef> results;
    for (size_t k = 0; k < masks.size(); ++k)
        results.push_back(session.send(at(kStart + k * kFrame, {finger(0.5, 0.5, k == 0 ? 7 : 4)}, masks[k])));
    const HIDEventRef press = childOfType(results[2], kHIDEventTypeButton);
    ASSERT_TRUE(press);
    EXPECT_EQ(press->integerValueForField(kHIDEventFieldButtonMask), 1);
    EXPECT_EQ(press->integerValueForField(kHIDEventFieldButtonNumber), 1);
    EXPECT_EQ(press->integerValueForField(kHIDEventFieldButtonState), 1);
    const HIDEventRef release = childOfType(results[4], kHIDEventTypeButton);
    ASSERT_TRUE(release);
    EXPECT_EQ(release->integerValueForField(kHIDEventFieldButtonMask), 0);
    EXPECT_EQ(release->integerValueForField(kHIDEventFieldButtonNumber), 1);
    EXPECT_EQ(release->integerValueForField(kHIDEventFieldButtonState), 0);
    EXPECT_EQ(session.countLogs(LogLevel::Error), 0u);
}

// ---------------------------------------------------------------------------------------
// Property records

// Values of the wrong kind change nothing and answer false; a string under "ScreenOn"
// counts as false and a missing "DigitizerSurfaceCovered" leaves the keyboard on.
TEST(HostileProperties, ValuesOfTheWrongKindAreRefusedAndChangeNothing) {
    PlugInSession session;
    ASSERT_TRUE(session.opened());
    EXPECT_FALSE(session.setProperty(PropertyValue("yes"), "TapToClickEnabled"));
    EXPECT_FALSE(session.setProperty(PropertyValue::data({1}), "TapToClickEnabled"));
    EXPECT_FALSE(session.setProperty(PropertyValue(PropertyArray{int64_t{1}}), "TapToClickEnabled"));
    EXPECT_FALSE(session.setProperty(PropertyValue(PropertyDictionary{{"a", int64_t{1}}}), "TapToClickEnabled"));
    EXPECT_FALSE(session.setProperty(PropertyValue(), "TapToClickEnabled"));
    EXPECT_FALSE(session.setProperty(PropertyValue(int64_t{0}), "TapToClickEnabled"));  // already off
    EXPECT_FALSE(session.setProperty(PropertyValue("on"), "TwoFingersSecondaryClickEnabled"));
    EXPECT_FALSE(session.setProperty(PropertyValue(int64_t{1}), "NoSuchKey"));
    EXPECT_FALSE(session.setProperty(PropertyValue(int64_t{1}), ""));
    EXPECT_FALSE(session.setProperty(PropertyValue("screen"), "HostStateNotification"));
    EXPECT_FALSE(session.service()->properties().count("DigitizerSurfaceSwitch"));

    EXPECT_TRUE(session.setProperty(PropertyValue(PropertyDictionary{{"ScreenOn", "on"}}), "HostStateNotification"));
    EXPECT_EQ(session.service()->propertyForKey("DigitizerSurfaceSwitch").integerValue(), 0);
    EXPECT_EQ(session.service()->propertyForKey("KeyboardEnabled").integerValue(), 1);

    // A NaN is a number, and its truth is that of a non-zero value.
    EXPECT_TRUE(session.setProperty(PropertyValue(kNaN), "TapToClickEnabled"));
    EXPECT_FALSE(session.setProperty(PropertyValue(true), "TapToClickEnabled"));
    EXPECT_EQ(session.countLogs(LogLevel::Error), 0u);
}

}  // namespace
}  // namespace orvane::robust
