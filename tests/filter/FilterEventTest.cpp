#include <gtest/gtest.h>

#include <bit>

#include "FilterTestSupport.h"
#include "platform/Timebase.h"
#include "platform/Trace.h"

using namespace orvane;
using namespace orvane::test;

namespace {

// A digitizer frame with a parent touch field and, when `scan` is given, the wireless
// scan-time child (usage page 13, usage 86) with `length` and the data bytes.
HIDEventRef frameAt(uint64_t timestamp, int touch, int scan = -1, int64_t length = 2, int dataBytes = 2) {
    auto frame = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
    frame->setIntegerValue(touch, kHIDEventFieldDigitizerTouch);
    if (scan >= 0) {
        auto v = HIDEvent::create(kHIDEventTypeVendorDefined, timestamp);
        v->setIntegerValue(13, kHIDEventFieldVendorDefinedUsagePage);
        v->setIntegerValue(86, kHIDEventFieldVendorDefinedUsage);
        v->setIntegerValue(length, kHIDEventFieldVendorDefinedDataLength);
        const uint8_t bytes[2] = {static_cast<uint8_t>(scan & 0xff), static_cast<uint8_t>((scan >> 8) & 0xff)};
        v->setDataValue(bytes, static_cast<size_t>(dataBytes), kHIDEventFieldVendorDefinedData);
        frame->appendEvent(v);
    }
    return frame;
}

std::shared_ptr<OrvaneServiceFilter> wirelessFilter() {
    return OrvaneServiceFilter::initWithService(trackpadService(655360, 327680, "Bluetooth"));
}

// Ticks of n units of 100 µs: n × 100,000 ns × denominator / numerator.
uint64_t scanTicks(uint64_t units) {
    const TimebaseInfo tb = Timebase::info();
    return units * 100000 * tb.denom / tb.numer;
}

}  // namespace

TEST(DeviceTimestamp, WiredDevicesUseTheEventTimestamp) {
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(5000, 1, 100)), 5000u);
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(6000, 1, 300)), 6000u);
    EXPECT_EQ(filter->lastDeviceTstamp(), 0u);
}

TEST(DeviceTimestamp, FirstWirelessFrameReturnsItsOwnTimeAndAnchorsThere) {
    auto filter = wirelessFilter();
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(5000, 1, 100)), 5000u);
    EXPECT_EQ(filter->lastDeviceTstamp(), 5000u);
    EXPECT_EQ(filter->lastTscan(), 100);
}

TEST(DeviceTimestamp, AnchoredFramesAdvanceByTheScanTimeIgnoringHostTime) {
    auto filter = wirelessFilter();
    filter->getDeviceTimestamp(*frameAt(5000, 1, 100));
    // 80 units of 100 µs later, whatever the host says.
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(999999999, 1, 180)), 5000u + scanTicks(80));
    EXPECT_EQ(filter->lastTscan(), 180);
}

TEST(DeviceTimestamp, WrapAroundIsOneShortOfTheModularDifference) {
    auto filter = wirelessFilter();
    filter->getDeviceTimestamp(*frameAt(5000, 1, 65530));
    // 65535 − 65530 + 4 = 9, not 10.
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(6000, 1, 4)), 5000u + scanTicks(9));
}

TEST(DeviceTimestamp, TheSameScanTimeGivesTheSameTime) {
    auto filter = wirelessFilter();
    filter->getDeviceTimestamp(*frameAt(5000, 1, 200));
    const uint64_t second = filter->getDeviceTimestamp(*frameAt(7000, 1, 300));
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(9000, 1, 300)), second);
}

TEST(DeviceTimestamp, AFrameWithoutTouchClearsTheAnchor) {
    auto filter = wirelessFilter();
    filter->getDeviceTimestamp(*frameAt(5000, 1, 100));
    // Reconstructed, but the anchor goes.
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(8000, 0, 150)), 5000u + scanTicks(50));
    EXPECT_EQ(filter->lastDeviceTstamp(), 0u);
    // The next frame starts again from its own host timestamp.
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(20000, 1, 900)), 20000u);
    EXPECT_EQ(filter->lastDeviceTstamp(), 20000u);
}

TEST(DeviceTimestamp, AWrongLengthIsLoggedAndTheHostTimeUsed) {
    LogCapture logs;
    auto filter = wirelessFilter();
    filter->getDeviceTimestamp(*frameAt(5000, 1, 100));
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(6000, 1, 120, 3)), 6000u);
    EXPECT_EQ(filter->lastDeviceTstamp(), 5000u);  // the anchor is kept
    EXPECT_EQ(filter->lastTscan(), 100);
    bool found = false;
    for (const auto& e : logs.entries()) {
        if (e.message == "-[OrvaneServiceFilter getDeviceTimestamp:] Unexpected relative scan time length "
                         "(received 3 bytes, expected 2 bytes)") {
            found = true;
            EXPECT_EQ(e.level, LogLevel::Error);
        }
    }
    EXPECT_TRUE(found);
}

TEST(DeviceTimestamp, DataShorterThanTwoBytesCountsAsNone) {
    auto filter = wirelessFilter();
    EXPECT_EQ(filter->getDeviceTimestamp(*frameAt(5000, 1, 100, 2, 1)), 5000u);
    EXPECT_EQ(filter->lastDeviceTstamp(), 0u);
}

TEST(DeviceTimestamp, TheScanTimeChildMustBeVendorDefinedWithPage13AndUsage86) {
    auto filter = wirelessFilter();
    filter->getDeviceTimestamp(*frameAt(5000, 1, 100));
    // A vendor child with another usage, then a digitizer child with the right page and usage
    // fields: neither is the scan time.
    auto frame = frameAt(7000, 1);
    auto other = HIDEvent::create(kHIDEventTypeVendorDefined, 7000);
    other->setIntegerValue(13, kHIDEventFieldVendorDefinedUsagePage);
    other->setIntegerValue(87, kHIDEventFieldVendorDefinedUsage);
    frame->appendEvent(other);
    auto digitizer = HIDEvent::create(kHIDEventTypeDigitizer, 7000);
    digitizer->setIntegerValue(13, kHIDEventFieldVendorDefinedUsagePage);
    digitizer->setIntegerValue(86, kHIDEventFieldVendorDefinedUsage);
    frame->appendEvent(digitizer);
    EXPECT_EQ(filter->getDeviceTimestamp(*frame), 7000u);
    // The first matching child wins over a later one.
    auto both = frameAt(7000, 1, 110);
    auto later = frameAt(0, 1, 500)->children()[0];
    both->appendEvent(later);
    EXPECT_EQ(filter->getDeviceTimestamp(*both), 5000u + scanTicks(10));
}

TEST(DeviceTimestamp, ScanDeltasConvertThroughTheTimebase) {
    const TimebaseInfo tb = Timebase::info();
    if (tb.numer == 1 && tb.denom == 1) {
        EXPECT_EQ(OrvaneServiceFilter::relativeScanDeltaToTicks(9), 900000u);  // 9 × 100 µs in ns
    } else if (tb.numer == 125 && tb.denom == 3) {
        EXPECT_EQ(OrvaneServiceFilter::relativeScanDeltaToTicks(9), 21600u);  // 900,000 × 3 / 125
        EXPECT_EQ(OrvaneServiceFilter::relativeScanDeltaToTicks(65535), 157284000u);
    } else {
        GTEST_SKIP() << "no worked value for this timebase";
    }
    EXPECT_EQ(OrvaneServiceFilter::relativeScanDeltaToTicks(0), 0u);
}

TEST(FilterEvent, OtherEventTypesPassThroughAsTheSameObjectWithoutTracePoints) {
    auto traces = std::make_shared<CaptureTraceSink>();
    Trace::setSink(traces);
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    auto keyboard = HIDEvent::create(kHIDEventTypeKeyboard, 10);
    EXPECT_EQ(filter->filterEvent(keyboard), keyboard);
    Trace::setSink(nullptr);
    EXPECT_TRUE(traces->points().empty());
}

TEST(FilterEvent, TracePointsCarryTheRawBitsOfTheDoubles) {
    auto traces = std::make_shared<CaptureTraceSink>();
    Trace::setSink(traces);
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    auto frame = frameAt(1000, 0);
    frame->setDoubleValue(0.25, kHIDEventFieldDigitizerX);
    frame->setDoubleValue(-1.5, kHIDEventFieldDigitizerY);
    HIDEventRef result = filter->filterEvent(frame);
    Trace::setSink(nullptr);
    const auto points = traces->points();
    ASSERT_EQ(points.size(), 2u);
    EXPECT_EQ(points[0], (TracePoint{0x2b150400, 0x3fd0000000000000ull, 0xbff8000000000000ull, 0, 0}));
    const uint64_t rx = result ? std::bit_cast<uint64_t>(result->doubleValueForField(kHIDEventFieldPointerX)) : 0;
    const uint64_t ry = result ? std::bit_cast<uint64_t>(result->doubleValueForField(kHIDEventFieldPointerY)) : 0;
    EXPECT_EQ(points[1], (TracePoint{0x2b150404, rx, ry, 0, 0}));
}

TEST(FilterEvent, FilterEventMatchingReturnsTheEventUnchanged) {
    auto filter = OrvaneServiceFilter::initWithService(trackpadService());
    auto e = HIDEvent::create(kHIDEventTypeDigitizer, 1);
    EXPECT_EQ(filter->filterEventMatching({}, e, nullptr), e);
}
