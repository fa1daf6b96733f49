#include "FrameDecoder.h"

#include <limits>

#include "ByteReader.h"

namespace orvane::fuzz {

namespace {

constexpr uint64_t kTicksPer100us = 100000;  // with the usual 1/1 timebase

// Mostly ordinary fractions of the surface, sometimes the values a broken device sends.
double coordinate(ByteReader& in) {
    const uint8_t pick = in.u8();
    if (pick < 160) return in.u16() / 65535.0;
    switch (pick % 10) {
    case 0: return 0.0;
    case 1: return 1.0;
    case 2: return std::numeric_limits<double>::quiet_NaN();
    case 3: return std::numeric_limits<double>::infinity();
    case 4: return -std::numeric_limits<double>::infinity();
    case 5: return -0.0;
    case 6: return 1e300;
    case 7: return -1e300;
    case 8: return std::numeric_limits<double>::denorm_min();
    default: return in.rawDouble();
    }
}

// Mostly 0..13 with -1 and 14 at the edges, sometimes far outside.
int64_t contactIndex(ByteReader& in) {
    const uint8_t pick = in.u8();
    if (pick < 224) return static_cast<int64_t>(pick % 16) - 1;
    switch (pick % 8) {
    case 0: return -2;
    case 1: return 15;
    case 2: return std::numeric_limits<int32_t>::min();
    case 3: return std::numeric_limits<int32_t>::max();
    case 4: return int64_t{1} << 32;  // 0 once cut to 32 bits
    case 5: return -(int64_t{1} << 32) - 1;
    case 6: return std::numeric_limits<int64_t>::min();
    default: return in.i64();
    }
}

// Small values mostly, any 64-bit value sometimes.
int64_t smallOrAny(ByteReader& in, uint8_t modulus) {
    const uint8_t pick = in.u8();
    if (pick < 224) return pick % modulus;
    return in.i64();
}

PropertyValue propertyValue(ByteReader& in, int depth) {
    switch (in.u8() % 9) {
    case 0: return PropertyValue(in.i64());
    case 1: return PropertyValue(coordinate(in));
    case 2: return PropertyValue(in.flag());
    case 3: {
        const std::vector<uint8_t> bytes = in.bytes(in.u8() % 12);
        return PropertyValue(std::string(bytes.begin(), bytes.end()));
    }
    case 4: return PropertyValue::data(in.bytes(in.u8() % 8));
    case 5: {
        PropertyArray array;
        if (depth < 3)
            for (int n = in.u8() % 4; n > 0; --n) array.push_back(propertyValue(in, depth + 1));
        return PropertyValue(std::move(array));
    }
    case 6: {
        static const char* const kKeys[] = {"ScreenOn", "DigitizerSurfaceCovered", "Width", "Height", "x"};
        PropertyDictionary dictionary;
        if (depth < 3)
            for (int n = in.u8() % 4; n > 0; --n) dictionary[kKeys[in.u8() % 5]] = propertyValue(in, depth + 1);
        return PropertyValue(std::move(dictionary));
    }
    case 7: return PropertyValue(static_cast<int64_t>(in.u8() % 3));
    default: return PropertyValue();
    }
}

std::string propertyKey(ByteReader& in) {
    static const char* const kKeys[] = {"TapToClickEnabled", "TwoFingersSecondaryClickEnabled",
                                        "HostStateNotification", "ServiceFilterDebug", "Acceleration",
                                        "SurfaceDimensions"};
    const uint8_t pick = in.u8();
    if (pick < 240) return kKeys[pick % 6];
    const std::vector<uint8_t> bytes = in.bytes(in.u8() % 16);
    return std::string(bytes.begin(), bytes.end());
}

HIDEventRef digitizerContact(ByteReader& in, uint64_t timestamp) {
    auto child = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
    // Which fields the contact carries: usually all of the five the filter reads.
    const uint8_t absent = in.u8() < 200 ? 0 : in.u8();
    if (!(absent & 0x01)) child->setIntegerValue(contactIndex(in), kHIDEventFieldDigitizerIndex);
    if (!(absent & 0x02)) child->setIntegerValue(smallOrAny(in, 2), kHIDEventFieldDigitizerTouch);
    if (!(absent & 0x04)) child->setIntegerValue(smallOrAny(in, 4), kHIDEventFieldDigitizerType);
    if (!(absent & 0x08)) child->setDoubleValue(coordinate(in), kHIDEventFieldDigitizerX);
    if (!(absent & 0x10)) child->setDoubleValue(coordinate(in), kHIDEventFieldDigitizerY);
    if (!(absent & 0x20)) child->setIntegerValue(smallOrAny(in, 2), kHIDEventFieldDigitizerRange);
    if (!(absent & 0x40)) child->setIntegerValue(smallOrAny(in, 8), kHIDEventFieldDigitizerEventMask);
    if (absent & 0x80) {
        child->setIntegerValue(in.i64(), kHIDEventFieldDigitizerIdentity);
        child->setIntegerValue(in.i64(), kHIDEventFieldDigitizerGenerationCount);
        child->setDoubleValue(coordinate(in), kHIDEventFieldDigitizerZ);
    }
    return child;
}

HIDEventRef vendorChild(ByteReader& in, uint64_t timestamp) {
    auto child = HIDEvent::create(kHIDEventTypeVendorDefined, timestamp);
    const bool scanTime = in.u8() < 192;
    child->setIntegerValue(scanTime ? 13 : in.u16(), kHIDEventFieldVendorDefinedUsagePage);
    child->setIntegerValue(scanTime ? 86 : in.u16(), kHIDEventFieldVendorDefinedUsage);
    const uint8_t pick = in.u8();
    const size_t dataSize = pick % 5;
    const int64_t length = pick < 200 ? static_cast<int64_t>(dataSize) : in.i64();
    child->setIntegerValue(length, kHIDEventFieldVendorDefinedDataLength);
    const std::vector<uint8_t> bytes = in.bytes(dataSize);
    if (in.u8() < 240) child->setDataValue(bytes.data(), bytes.size(), kHIDEventFieldVendorDefinedData);
    return child;
}

HIDEventRef otherEvent(ByteReader& in, uint64_t timestamp) {
    static const uint32_t kTypes[] = {kHIDEventTypeButton, kHIDEventTypeKeyboard, kHIDEventTypeRotation,
                                      kHIDEventTypeScroll, kHIDEventTypeScale,    kHIDEventTypePointer};
    const uint8_t pick = in.u8();
    const uint32_t type = pick < 240 ? kTypes[pick % 6] : in.u32();
    auto event = HIDEvent::create(type, timestamp);
    const uint32_t selectorBase = (type & 0xffff) << 16;
    for (int n = in.u8() % 4; n > 0; --n) {
        const uint32_t selector = selectorBase | (in.u8() % 8);
        if (in.flag()) event->setDoubleValue(coordinate(in), selector);
        else event->setIntegerValue(in.i64(), selector);
    }
    return event;
}

uint64_t nextTimestamp(ByteReader& in, uint64_t last) {
    switch (in.u8() % 8) {
    case 0:
    case 1:
    case 2:
    case 3: return last + (static_cast<uint64_t>(in.u8()) + 1) * 10 * kTicksPer100us;  // 1 to 256 ms on
    case 4: return last;                                                               // repeated
    case 5: return last - static_cast<uint64_t>(in.u16()) * kTicksPer100us;            // backwards (may wrap)
    case 6: return in.u64();
    default: return 0;
    }
}

HIDEventRef frame(ByteReader& in, uint64_t timestamp) {
    auto parent = HIDEvent::create(kHIDEventTypeDigitizer, timestamp);
    parent->setSenderID(in.u8() < 250 ? 0x100000001 : in.u64());
    const uint8_t parentFields = in.u8();
    if (parentFields & 0x01) {
        // Usually the click alone; sometimes several buttons at once, or any value.
        const int64_t mask = (parentFields & 0x02) ? in.i64() : (in.u8() & 7);
        parent->setIntegerValue(mask, kHIDEventFieldDigitizerButtonMask);
    }
    if (parentFields & 0x04) parent->setIntegerValue(smallOrAny(in, 2), kHIDEventFieldDigitizerTouch);
    if (parentFields & 0x08) {
        parent->setDoubleValue(coordinate(in), kHIDEventFieldDigitizerX);
        parent->setDoubleValue(coordinate(in), kHIDEventFieldDigitizerY);
    }
    if (parentFields & 0x10) parent->setIntegerValue(in.i64(), kHIDEventFieldDigitizerEventMask);
    if (parentFields & 0x20) parent->appendEvent(vendorChild(in, timestamp));
    if (parentFields & 0x40) parent->setIntegerValue(smallOrAny(in, 2), kHIDEventFieldDigitizerRange);

    const int children = in.u8() % 24;
    for (int i = 0; i < children && !in.empty(); ++i) {
        const uint8_t kind = in.u8() % 16;
        if (kind < 12) {
            parent->appendEvent(digitizerContact(in, timestamp));
        } else if (kind == 12) {
            parent->appendEvent(vendorChild(in, timestamp));
        } else if (kind < 15) {
            parent->appendEvent(otherEvent(in, timestamp));
        } else {
            // A contact that carries contacts of its own.
            auto contact = digitizerContact(in, timestamp);
            for (int n = in.u8() % 3 + 1; n > 0; --n) contact->appendEvent(digitizerContact(in, timestamp));
            parent->appendEvent(contact);
        }
    }
    return parent;
}

}  // namespace

FuzzSession decodeFuzzSession(const uint8_t* data, size_t size) {
    ByteReader in(data, size);
    FuzzSession session;

    const uint8_t setup = in.u8();
    switch (setup & 3) {
    case 0: session.transport = "USB"; break;
    case 1: session.transport = "Bluetooth"; break;
    case 2: session.transport = "Bluetooth Low Energy"; break;
    default: break;
    }
    session.debugLogging = (setup & 4) != 0;
    switch ((setup >> 3) & 7) {
    case 4: session.dimensions = std::make_pair(in.i32(), in.i32()); break;
    case 5:
        // The 32-bit minimum stands for an unknown size.
        session.dimensions = std::make_pair(std::numeric_limits<int32_t>::min(), std::numeric_limits<int32_t>::min());
        break;
    case 6: session.dimensions = std::make_pair(0, 0); break;
    case 7: break;  // no "SurfaceDimensions" at all
    default: session.dimensions = std::make_pair(655360, 327680); break;
    }

    uint64_t timestamp = 1000000000;
    HIDEventRef last;
    while (!in.empty() && session.records.size() < kMaximumFuzzRecords) {
        FuzzRecord record;
        const uint8_t op = in.u8() % 16;
        if (op < 10) {
            timestamp = nextTimestamp(in, timestamp);
            record.event = frame(in, timestamp);
        } else if (op == 10) {
            record.event = otherEvent(in, timestamp);
        } else if (op == 11) {
            record.kind = in.u8() < 224 ? FuzzRecord::Kind::SetProperty : FuzzRecord::Kind::GetProperty;
            record.key = propertyKey(in);
            if (record.kind == FuzzRecord::Kind::SetProperty) record.value = propertyValue(in, 0);
        } else if (op == 12) {
            record.kind = FuzzRecord::Kind::Client;
            record.clientID = in.u8() % 4;
            record.added = in.flag();
        } else if (op == 13) {
            record.kind = FuzzRecord::Kind::NoEvent;
        } else if (last) {
            // The very same event object again (the filter writes into contacts it has seen),
            // or a copy of it with another timestamp.
            if (op == 14) {
                record.event = last;
            } else {
                record.event = last->copy();
                timestamp = nextTimestamp(in, timestamp);
                record.event->setTimestamp(timestamp);
            }
        } else {
            continue;
        }
        if (record.event && record.event->type() == kHIDEventTypeDigitizer) last = record.event;
        session.records.push_back(std::move(record));
    }
    return session;
}

}  // namespace orvane::fuzz
