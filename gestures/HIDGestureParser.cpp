#include "HIDGestureParser.h"

#include "motion/HIDHandMotion.h"
#include "stats/HIDHandStatistics.h"

namespace orvane {

HIDGestureParser::HIDGestureParser() {}

HIDEventRef HIDGestureParser::prepareHandEventforUI(HIDHandStatistics&, const HIDEventRef&) { return nullptr; }

HIDEventRef HIDGestureParser::parseHandGesturesCreateHIDEvents(HIDHandStatistics&, HIDHandMotion&, const HIDEventRef&,
                                                               const HIDDispatchHandler&, bool, bool) {
    return nullptr;
}

}  // namespace orvane
