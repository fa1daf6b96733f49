#include "OrvaneServiceFilter.h"

#include <bit>
#include <cmath>
#include <limits>

#include "common/TickConversion.h"
#include "filter/FilterLogging.h"
#include "platform/PlugInBundle.h"
#include "platform/Trace.h"

extern "C" {
const double OrvaneServiceFilterVersionNumber = 27.0;
const unsigned char OrvaneServiceFilterVersionString[] =
    "@(#)PROGRAM:OrvaneServiceFilter  PROJECT:Orvane-27\n";
}

namespace orvane {

namespace {

// Trace points around the pipeline.
constexpr uint32_t kTraceFrameEntered = 0x2b150400;
constexpr uint32_t kTracePipelineReturned = 0x2b150404;

// The vendor-defined child that carries a wireless device's relative scan time.
constexpr int64_t kScanTimeUsagePage = 13;
constexpr int64_t kScanTimeUsage = 86;
constexpr int64_t kScanTimeLength = 2;

// A 16.16 fixed-point dimension; the 32-bit minimum means "unknown" and becomes NaN.
float fixedPointDimension(const PropertyValue* value) {
    const int32_t raw = value ? value->int32Value() : 0;
    if (raw == std::numeric_limits<int32_t>::min()) return std::numeric_limits<float>::quiet_NaN();
    return static_cast<float>(raw * 1.52587890625e-05);
}

// The children of an event as one loggable value.
struct ChildList {
    const std::vector<HIDEventRef>& children;
    std::string description() const {
        if (children.empty()) return "(null)";
        std::string s = "(";
        for (size_t i = 0; i < children.size(); ++i) {
            s += i ? ", " : " ";
            s += children[i]->description();
        }
        return s + " )";
    }
};

LogHandle& log() { return *LoggingServiceFilter(); }

}  // namespace

bool OrvaneServiceFilter::matchService(const HIDEventServiceRef& service, const PropertyDictionary& options,
                                       int64_t* score) {
    static const char* kSig = "+[OrvaneServiceFilter matchService:options:score:]";
    log().log("%s %@, options: %@", kSig, service, PropertyValue(options));
    // The touch pad, its fingers and the keyboard: only the keyboard cover's combined device has all three.
    const bool matched = service && service->conformsToUsagePage(13, 5) && service->conformsToUsagePage(13, 34) &&
                         service->conformsToUsagePage(1, 6);
    if (matched && score) *score = 500;
    log().log("%s matched?: %@, score: %ld", kSig, matched ? "YES" : "NO", score ? *score : 0);
    return matched;
}

std::shared_ptr<OrvaneServiceFilter> OrvaneServiceFilter::initWithService(const HIDEventServiceRef& service) {
    log().log("%s %@", "-[OrvaneServiceFilter initWithService:]", service);
    auto filter = std::make_shared<OrvaneServiceFilter>();
    if (!filter->initWithServiceSteps(service)) return nullptr;
    return filter;
}

bool OrvaneServiceFilter::initWithServiceSteps(const HIDEventServiceRef& service) {
    static const char* kSig = "-[OrvaneServiceFilter initWithService:]";
    service_ = service;
    configureService();

    const PropertyValue dimensions = service ? service->propertyForKey("SurfaceDimensions") : PropertyValue();
    if (!dimensions.isDictionary()) {
        log().log(LogLevel::Error, "%s I don't know the physical dimensions of this trackpad", kSig);
        return false;
    }
    const float width = fixedPointDimension(dimensions.find("Width"));
    const float height = fixedPointDimension(dimensions.find("Height"));
    log().log("%s Trackpad dimensions: %f x %f", kSig, width, height);

    // The handler holds the filter weakly: it may run while the filter is being destroyed.
    std::weak_ptr<OrvaneServiceFilter> weakSelf = weak_from_this();
    HIDDispatchHandler handler = [weakSelf](const HIDEventRef& event) {
        std::shared_ptr<OrvaneServiceFilter> self = weakSelf.lock();
        if (!self) return;
        std::shared_ptr<HIDEventDispatcher> dispatcher = self->dispatcher();
        if (!dispatcher) return;
        logVerbose("%s %@", "-[OrvaneServiceFilter initWithService:]_block_invoke", event);
        dispatcher->dispatchEvent(event);
    };
    // The pipeline works in tenths of the reported unit; the parser takes the height first.
    parser_ = std::make_shared<HIDParser>(std::move(handler), height * 10.0f, width * 10.0f);

    accelSettings_ = PlugInBundle::objectForInfoDictionaryKey(kOrvaneBundleIdentifier, "Acceleration");
    if (log().isEnabled(LogLevel::Debug)) {
        PropertyValue keys;
        if (accelSettings_.isDictionary()) {
            PropertyArray names;
            for (const auto& entry : accelSettings_.dictionaryValue()) names.emplace_back(entry.first);
            keys = PropertyValue(std::move(names));
        }
        log().log(LogLevel::Debug, "%s Acceleration settings contains: %@", kSig, keys);
    }

    const PropertyValue transport = service ? service->propertyForKey("Transport") : PropertyValue();
    isWireless_ = transport.isString() && transport.stringValue().find("Bluetooth") != std::string::npos;
    log().log("%s Device is wireless? %@ (transport: %@)", kSig, isWireless_ ? "yes" : "no", transport);

    lastDeviceTstamp_ = 0;
    lastTscan_ = 0;
    return true;
}

OrvaneServiceFilter::~OrvaneServiceFilter() { log().log("%s Entered", "-[OrvaneServiceFilter dealloc]"); }

std::string OrvaneServiceFilter::description() const { return "OrvaneServiceFilter"; }

void OrvaneServiceFilter::activate() {
    log().log("%s Entered", "-[OrvaneServiceFilter activate]");
    activated_ = true;
}

void OrvaneServiceFilter::cancel() {
    log().log("%s Entered", "-[OrvaneServiceFilter cancel]");
    if (!queue_) return;
    // The work holds the filter strongly until it has run.
    queue_->async([self = shared_from_this()] {
        log().log("%s Calling cancel handler", "-[OrvaneServiceFilter cancel]_block_invoke");
        std::function<void()> handler = std::move(self->cancelHandler_);
        self->cancelHandler_ = nullptr;
        if (handler) handler();
    });
}

void OrvaneServiceFilter::setCancelHandler(std::function<void()> handler) {
    log().log("%s %p", "-[OrvaneServiceFilter setCancelHandler:]", static_cast<const void*>(&handler));
    cancelHandler_ = std::move(handler);
}

void OrvaneServiceFilter::setDispatchQueue(const DispatchQueueRef& queue) {
    log().log("%s %p", "-[OrvaneServiceFilter setDispatchQueue:]", static_cast<const void*>(queue.get()));
    queue_ = queue;
}

void OrvaneServiceFilter::setEventDispatcher(const std::shared_ptr<HIDEventDispatcher>& dispatcher) {
    log().log("%s %@", "-[OrvaneServiceFilter setEventDispatcher:]", dispatcher);
    dispatcher_ = dispatcher;
}

void OrvaneServiceFilter::clientNotification(const HIDConnectionRef& client, bool added) {
    log().log("%s %@, added: %d", "-[OrvaneServiceFilter clientNotification:added:]", client, added);
    clientAdded_ = added;
    client_ = added ? client : nullptr;
}

HIDEventRef OrvaneServiceFilter::filterEvent(const HIDEventRef& event) {
    if (!event) return event;
    logVerbose("%s %@, childrens: %@", "-[OrvaneServiceFilter filterEvent:]", event, ChildList{event->children()});
    if (event->type() != kHIDEventTypeDigitizer) return event;

    Trace::emit(kTraceFrameEntered, std::bit_cast<uint64_t>(event->doubleValueForField(kHIDEventFieldDigitizerX)),
                std::bit_cast<uint64_t>(event->doubleValueForField(kHIDEventFieldDigitizerY)), 0, 0);
    const uint64_t time = getDeviceTimestamp(*event);
    HIDEventRef result = parser_ ? parser_->handleContactFrame(static_cast<double>(time), event) : nullptr;
    Trace::emit(kTracePipelineReturned,
                result ? std::bit_cast<uint64_t>(result->doubleValueForField(kHIDEventFieldPointerX)) : 0,
                result ? std::bit_cast<uint64_t>(result->doubleValueForField(kHIDEventFieldPointerY)) : 0, 0, 0);
    return result;
}

HIDEventRef OrvaneServiceFilter::filterEventMatching(const PropertyDictionary& matching, const HIDEventRef& event,
                                                     const HIDConnectionRef& client) {
    if (verboseDebugEnabled()) {
        logVerbose("%s %@, event: %@, client: %@", "-[OrvaneServiceFilter filterEventMatching:event:forClient:]",
                   PropertyValue(matching), event, client);
    }
    return event;
}

uint64_t OrvaneServiceFilter::getDeviceTimestamp(const HIDEvent& event) {
    const uint64_t hostTime = event.timestamp();
    if (!isWireless_) return hostTime;

    const HIDEvent* scanTime = nullptr;
    for (const HIDEventRef& child : event.children()) {
        if (child->type() == kHIDEventTypeVendorDefined &&
            child->integerValueForField(kHIDEventFieldVendorDefinedUsagePage) == kScanTimeUsagePage &&
            child->integerValueForField(kHIDEventFieldVendorDefinedUsage) == kScanTimeUsage) {
            scanTime = child.get();
            break;
        }
    }
    if (!scanTime) return hostTime;

    const int64_t length = scanTime->integerValueForField(kHIDEventFieldVendorDefinedDataLength);
    if (length != kScanTimeLength) {
        log().log(LogLevel::Error, "%s Unexpected relative scan time length (received %ld bytes, expected %ld bytes)",
                  "-[OrvaneServiceFilter getDeviceTimestamp:]", length, kScanTimeLength);
        return hostTime;
    }
    const std::vector<uint8_t>& data = scanTime->dataValueForField(kHIDEventFieldVendorDefinedData);
    if (data.size() < 2) return hostTime;
    const uint16_t scan = static_cast<uint16_t>(data[0] | (data[1] << 8));

    if (lastDeviceTstamp_ == 0) {
        lastDeviceTstamp_ = hostTime;
        lastTscan_ = scan;
    }
    // On wrap-around the delta is kept one short of the modular difference (0xFFFF, not
    // 0x10000), on purpose.
    const uint16_t delta = scan >= lastTscan_ ? static_cast<uint16_t>(scan - lastTscan_)
                                              : static_cast<uint16_t>(65535 - lastTscan_ + scan);
    const uint64_t result = lastDeviceTstamp_ + relativeScanDeltaToTicks(delta);
    lastTscan_ = scan;
    // Once nothing touches, the next frame re-anchors on its host timestamp.
    lastDeviceTstamp_ = event.integerValueForField(kHIDEventFieldDigitizerTouch) != 0 ? result : 0;
    return result;
}

uint64_t OrvaneServiceFilter::relativeScanDeltaToTicks(uint16_t delta) {
    const TimebaseInfo tb = cachedTimebase();
    const double nanoseconds = static_cast<double>(delta) * 100.0 * 1000.0;
    return static_cast<uint64_t>(nanoseconds * tb.denom / tb.numer);
}

PropertyValue OrvaneServiceFilter::propertyForKey(const std::string& key, const HIDConnectionRef& client) {
    PropertyValue result;
    const int64_t tapToClick = parser_ && parser_->tapToClickEnabled() ? 1 : 0;
    const int64_t secondaryClick = parser_ && parser_->twoFingersSecondaryClickEnabled() ? 1 : 0;
    if (key == "ServiceFilterDebug") {
        result = PropertyValue(PropertyDictionary{
            {"FilterName", "OrvaneServiceFilter"},
            {"cancelHandler", static_cast<bool>(cancelHandler_)},
            {"dispatchQueue", queue_ != nullptr},
            {"activated", static_cast<int64_t>(activated_)},
            {"clientAdded", static_cast<int64_t>(clientAdded_)},
            {"settings", PropertyDictionary{{"TapToClickEnabled", tapToClick},
                                            {"TwoFingersSecondaryClickEnabled", secondaryClick}}},
        });
    } else if (const PropertyValue* stored = accelSettings_.find(key)) {
        // The bundle's settings answer first, also for the two tap keys.
        result = *stored;
    } else if (key == "TapToClickEnabled") {
        result = PropertyValue(tapToClick);
    } else if (key == "TwoFingersSecondaryClickEnabled") {
        result = PropertyValue(secondaryClick);
    }
    log().log(LogLevel::Debug, "%s %@, client %@, result %@", "-[OrvaneServiceFilter propertyForKey:client:]", key,
              client, result);
    return result;
}

bool OrvaneServiceFilter::setProperty(const PropertyValue& value, const std::string& key,
                                      const HIDConnectionRef& client) {
    static const char* kSig = "-[OrvaneServiceFilter setProperty:forKey:client:]";
    bool result = false;
    if (key == "TapToClickEnabled") {
        if (parser_ && value.isNumber() && value.truth() != parser_->tapToClickEnabled()) {
            parser_->setTapToClickEnabled(value.truth());
            result = true;
        }
    } else if (key == "TwoFingersSecondaryClickEnabled") {
        if (parser_ && value.isNumber() && value.truth() != parser_->twoFingersSecondaryClickEnabled()) {
            parser_->setTwoFingersSecondaryClickEnabled(value.truth());
            result = true;
        }
    } else if (key == "HostStateNotification" && value.isDictionary()) {
        HIDEventServiceRef svc = service_.lock();
        const PropertyValue* screenOn = value.find("ScreenOn");
        const unsigned screen = (screenOn && screenOn->isNumber() && screenOn->truth()) ? 1 : 0;
        log().log("%s Setting %s to %u", kSig, "DigitizerSurfaceSwitch", screen);
        if (!svc || !svc->setPropertyForKey(PropertyValue(static_cast<int64_t>(screen)), "DigitizerSurfaceSwitch")) {
            log().log(LogLevel::Error, "%s Error setting %s to %u", kSig, "DigitizerSurfaceSwitch", screen);
        }
        const PropertyValue* covered = value.find("DigitizerSurfaceCovered");
        const unsigned keyboard = (covered && covered->isNumber()) ? (covered->truth() ? 0 : 1) : 1;
        log().log("%s Setting %s to %u", kSig, "KeyboardEnabled", keyboard);
        if (!svc || !svc->setPropertyForKey(PropertyValue(static_cast<int64_t>(keyboard)), "KeyboardEnabled")) {
            log().log(LogLevel::Error, "%s Error setting %s to %u", kSig, "KeyboardEnabled", keyboard);
            result = false;
        } else {
            result = true;
        }
    }
    log().log(LogLevel::Debug, "%s %@, key %@, client %@, result %@", kSig, value, key, client,
              PropertyValue(static_cast<int64_t>(result)));
    return result;
}

void OrvaneServiceFilter::configureService() {
    HIDEventServiceRef svc = service_.lock();
    if (!svc) return;
    if (!svc->conformsToUsagePage(13, 12)) {
        PropertyValue pairs = svc->propertyForKey("DeviceUsagePairs");
        PropertyArray list = pairs.isArray() ? pairs.arrayValue() : PropertyArray{};
        list.push_back(PropertyDictionary{{"DeviceUsagePage", int64_t{13}}, {"DeviceUsage", int64_t{12}}});
        list.push_back(PropertyDictionary{{"DeviceUsagePage", int64_t{1}}, {"DeviceUsage", int64_t{2}}});
        svc->setPropertyForKey(PropertyValue(std::move(list)), "DeviceUsagePairs");
        svc->setPropertyForKey(PropertyValue(int64_t{13}), "PrimaryUsagePage");
        svc->setPropertyForKey(PropertyValue(int64_t{12}), "PrimaryUsage");
    }
    svc->setPropertyForKey(PropertyValue("Trackpad"), "DeviceTypeHint");
    svc->setPropertyForKey(PropertyValue(PropertyArray{"Scroll", "Scale", "Rotate", "Translate", "TapToClick",
                                                       "TwoFingersSecondaryClick"}),
                           "SupportedGestures");
    svc->setPropertyForKey(PropertyValue(true), "NeedsHostState");
}

}  // namespace orvane

namespace {

bool plugInMatchService(const orvane::HIDEventServiceRef& service, const orvane::PropertyDictionary& options,
                        int64_t* score) {
    return orvane::OrvaneServiceFilter::matchService(service, options, score);
}

orvane::HIDServiceFilterRef plugInCreate(const orvane::HIDEventServiceRef& service) {
    return orvane::OrvaneServiceFilter::initWithService(service);
}

const orvane::HIDServiceFilterPlugIn kPlugIn{"OrvaneServiceFilter", plugInMatchService, plugInCreate};

}  // namespace

ORVANE_EXPORT const orvane::HIDServiceFilterPlugIn* OrvaneServiceFilterPlugIn(void) { return &kPlugIn; }
