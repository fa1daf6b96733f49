#include "HIDParser.h"

#include "gestures/HIDGestureParser.h"
#include "motion/HIDHandMotion.h"
#include "paths/HIDPathStates.h"
#include "stats/HIDHandStatistics.h"

namespace orvane {

HIDParser::HIDParser(HIDDispatchHandler dispatchHandler, float height, float width)
    : dispatchHandler_(std::move(dispatchHandler)),
      pathStates_(std::make_shared<HIDPathStates>(height, width)),
      handStats_(std::make_shared<HIDHandStatistics>()),
      handMotionExtractor_(std::make_shared<HIDHandMotion>()),
      gestureParser_(std::make_shared<HIDGestureParser>()) {}

HIDParser::~HIDParser() = default;

[[gnu::flatten]] HIDEventRef HIDParser::handleContactFrame(double timestamp, const HIDEventRef& baseEvent) {
    pathStates_->unpackContactFrame(baseEvent, timestamp);
    pathStates_->updateButtonState(baseEvent);
    pathStates_->postFilteringTasks(baseEvent);
    handStats_->processHandState(*pathStates_);
    handMotionExtractor_->processHandMotion(*pathStates_, handStats_->numFingersTouching(),
                                            handStats_->lastNumFingersTouching(), 0);
    HIDEventRef handEvent = gestureParser_->prepareHandEventforUI(*handStats_, baseEvent);
    HIDEventRef result = gestureParser_->parseHandGesturesCreateHIDEvents(
        *handStats_, *handMotionExtractor_, handEvent, dispatchHandler_, tapToClickEnabled_,
        twoFingersSecondaryClickEnabled_);
    // The gesture state of this frame feeds the path table's filtering of the next frame.
    pathStates_->setEngagedinGesture(handStats_->engagedinGesture());
    return result;
}

}  // namespace orvane
