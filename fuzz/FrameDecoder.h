#pragma once
// Turns any bytes into a session for the filter: the service it is attached to and a list of
// records (events, property records, client notifications). Every byte string decodes to
// some session. The frames are what a broken or hostile device could send: any number of
// children, contact indexes far outside 0..13, NaN, infinite, huge and negative
// coordinates, timestamps that repeat or go backwards, children of other types, vendor
// children with any data, button masks with several bits, property records with any values.

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "platform/HIDEvent.h"
#include "platform/PropertyValue.h"

namespace orvane::fuzz {

struct FuzzRecord {
    enum class Kind {
        Event,        // passed to filterEvent (may be the same object as an earlier record)
        NoEvent,      // filterEvent with no event at all
        SetProperty,  // a client sets a property
        GetProperty,  // a client asks for a property
        Client,       // a client connects or leaves
    };
    Kind kind = Kind::Event;
    HIDEventRef event;
    std::string key;
    PropertyValue value;
    uint64_t clientID = 0;
    bool added = false;
};

struct FuzzSession {
    // The service's "SurfaceDimensions" (16.16 fixed point), or none: then the filter must
    // refuse to be made.
    std::optional<std::pair<int32_t, int32_t>> dimensions;  // width, height
    std::optional<std::string> transport;
    bool debugLogging = false;
    std::vector<FuzzRecord> records;
};

// At most this many records per session, so that one input stays quick.
inline constexpr size_t kMaximumFuzzRecords = 4096;

FuzzSession decodeFuzzSession(const uint8_t* data, size_t size);

}  // namespace orvane::fuzz
