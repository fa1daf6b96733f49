#include "TouchpadService.h"

#include "tools/evemu/EvdevCodes.h"

namespace orvane::live {

namespace {

constexpr HIDUsagePair kTouchPadUsage{13, 5};
constexpr HIDUsagePair kFingerUsage{13, 34};
constexpr HIDUsagePair kKeyboardUsage{1, 6};

}  // namespace

bool touchpadService(const evemu::EvdevDevice& device, const std::optional<evemu::SurfaceSize>& size,
                     bool keyboardCover, formats::ServiceDescription* service, std::string* error) {
    PropertyDictionary dimensions;
    if (size) {
        dimensions["Width"] = PropertyValue(evemu::fixedPointCentimetres(size->width_mm));
        dimensions["Height"] = PropertyValue(evemu::fixedPointCentimetres(size->height_mm));
    } else {
        for (uint16_t code : {evemu::kAbsMtPositionX, evemu::kAbsMtPositionY}) {
            const evemu::EvdevAxis* axis = device.axis(code);
            if (!axis || axis->resolution == 0) {
                *error = evemu::eventCodeName(evemu::kEvAbs, code) +
                         " gives no resolution, so the surface size is unknown: give it with --size WIDTHxHEIGHT in "
                         "millimetres (for example --size 100x60)";
                return false;
            }
            dimensions[code == evemu::kAbsMtPositionX ? "Width" : "Height"] =
                PropertyValue(evemu::fixedPointCentimetres(*axis));
        }
    }
    formats::ServiceDescription s;
    s.usagePairs = {kTouchPadUsage, kFingerUsage};
    if (keyboardCover) s.usagePairs.push_back(kKeyboardUsage);
    s.properties["SurfaceDimensions"] = PropertyValue(std::move(dimensions));
    s.properties["Transport"] = PropertyValue(evemu::transportForBus(device.bus));
    if (!device.name.empty()) s.properties["Product"] = PropertyValue(device.name);
    *service = std::move(s);
    return true;
}

}  // namespace orvane::live
