#pragma once
// The frames the performance programs drive the filter with. A source yields frames one at
// a time, each a new event that nobody else holds, for as long as it is asked: the made-up
// hands move back and forth for ever, and a recording is replayed again and again with its
// times moved on, so the filter always sees time advance.

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "platform/HIDEvent.h"
#include "platform/PropertyValue.h"
#include "tools/formats/FrameRecording.h"

namespace orvane::perf {

class FrameSource {
public:
    virtual ~FrameSource() = default;
    // The next input record: a frame, or a property a client sets.
    struct Record {
        HIDEventRef event;          // a frame, or nullptr for a property record
        std::string propertyKey;    // when event is nullptr
        PropertyValue propertyValue;
    };
    virtual Record next() = 0;
    // The trackpad the frames come from.
    virtual const formats::ServiceDescription& service() const = 0;
};

// The made-up hands, on a wired 10 x 5 trackpad, frames 8 ms apart, with tap-to-click and the
// two-finger secondary click on:
//   one-finger         one finger circling
//   two-finger-scroll  two fingers side by side moving up and down together
//   pinch              two fingers moving apart and together
//   three-fingers      three fingers moving together
std::vector<std::string> madeUpCaseNames();
std::unique_ptr<FrameSource> makeMadeUpSource(const std::string& name);

// A frame recording, replayed in a loop. Its setProperty records are passed on each time
// round; client records are left out.
std::unique_ptr<FrameSource> makeRecordingSource(formats::FrameRecording recording);

// The default service of the made-up hands.
formats::ServiceDescription madeUpService();

}  // namespace orvane::perf
