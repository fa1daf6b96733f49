// The filter fed arbitrary sessions. Besides the sanitizers' findings, it checks what the
// filter promises for any input: events of other types come back as the same object, a
// digitizer frame comes back as a pointer event or not at all, nothing comes back for no
// event, every dispatched event exists, the cancel handler runs exactly once, and nothing
// keeps the filter alive once its host lets go.

#include <cstdlib>
#include <map>
#include <memory>

#include "FrameDecoder.h"
#include "FuzzTargets.h"
#include "filter/OrvaneServiceFilter.h"
#include "platform/DeviceInformation.h"
#include "platform/DispatchQueue.h"
#include "platform/HIDEventDispatcher.h"
#include "platform/HIDEventService.h"
#include "platform/Logging.h"

namespace orvane::fuzz {

namespace {

// Formats every line (so the formatting runs on whatever the frames hold) and drops it.
class DroppingLogSink : public LogSink {
public:
    void write(const LogRecord& record) override { bytes_ += record.message.size(); }

private:
    size_t bytes_ = 0;
};

// Puts logging back as it was found, however the session ends.
struct LoggingScope {
    explicit LoggingScope(bool debug) {
        Logging::setSink(std::make_shared<DroppingLogSink>());
        Logging::setDebugEnabled(debug);
    }
    ~LoggingScope() {
        Logging::setDebugEnabled(false);
        Logging::setSink(std::make_shared<StandardErrorLogSink>());
    }
};

HIDEventServiceRef serviceFor(const FuzzSession& session) {
    PropertyDictionary properties;
    if (session.dimensions)
        properties["SurfaceDimensions"] = PropertyDictionary{{"Width", int64_t{session.dimensions->first}},
                                                             {"Height", int64_t{session.dimensions->second}}};
    if (session.transport) properties["Transport"] = PropertyValue(*session.transport);
    return std::make_shared<HIDEventService>(std::vector<HIDUsagePair>{{13, 5}, {13, 34}, {1, 6}}, properties);
}

}  // namespace

int fuzzFilterFrames(const uint8_t* data, size_t size) {
    // The diagnostics behind the internal-build answer are fuzzed too, in the sessions that
    // turn debug logging on. The answer is read once per process; a test run may have set it.
    ::setenv(kInternalBuildEnvironment, "1", 0);

    const FuzzSession session = decodeFuzzSession(data, size);
    LoggingScope logging(session.debugLogging);

    const HIDEventServiceRef service = serviceFor(session);
    int64_t score = 0;
    if (!OrvaneServiceFilter::matchService(service, {}, &score)) fuzzFinding("the keyboard cover's trackpad matches");
    std::shared_ptr<OrvaneServiceFilter> filter = OrvaneServiceFilter::initWithService(service);
    if (!session.dimensions) {
        if (filter) fuzzFinding("a service without SurfaceDimensions gets no filter");
        return 0;
    }
    if (!filter) fuzzFinding("a service with SurfaceDimensions gets a filter");

    auto queue = std::make_shared<DispatchQueue>("fuzz");
    size_t dispatched = 0;
    auto dispatcher = std::make_shared<CallbackEventDispatcher>([&](const HIDEventRef& event) {
        if (!event) fuzzFinding("a dispatched event exists");
        ++dispatched;
    });
    int cancelCalls = 0;
    filter->setDispatchQueue(queue);
    filter->setEventDispatcher(dispatcher);
    filter->setCancelHandler([&cancelCalls] { ++cancelCalls; });
    filter->activate();
    queue->drain();

    std::map<uint64_t, HIDConnectionRef> clients;
    HIDConnectionRef current;
    for (const FuzzRecord& record : session.records) {
        switch (record.kind) {
        case FuzzRecord::Kind::Event: {
            const HIDEventRef result = filter->filterEvent(record.event);
            if (record.event->type() != kHIDEventTypeDigitizer) {
                if (result.get() != record.event.get()) fuzzFinding("an event of another type passes unchanged");
            } else if (result && result->type() != kHIDEventTypePointer) {
                fuzzFinding("a contact frame becomes a pointer event or nothing");
            }
            break;
        }
        case FuzzRecord::Kind::NoEvent:
            if (filter->filterEvent(nullptr)) fuzzFinding("no event in, no event out");
            break;
        case FuzzRecord::Kind::SetProperty: filter->setProperty(record.value, record.key, current); break;
        case FuzzRecord::Kind::GetProperty: filter->propertyForKey(record.key, current); break;
        case FuzzRecord::Kind::Client: {
            HIDConnectionRef& client = clients[record.clientID];
            if (!client) client = std::make_shared<HIDConnection>(record.clientID);
            filter->clientNotification(client, record.added);
            current = record.added ? client : nullptr;
            break;
        }
        }
        queue->drain();
    }

    filter->cancel();
    queue->drain();
    if (cancelCalls != 1) fuzzFinding("the cancel handler runs exactly once");
    std::weak_ptr<OrvaneServiceFilter> weak = filter;
    filter.reset();
    if (!weak.expired()) fuzzFinding("nothing keeps the filter alive once its host lets go");
    (void)dispatched;
    return 0;
}

}  // namespace orvane::fuzz
