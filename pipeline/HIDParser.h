#pragma once
// The per-frame pipeline: owns the four stage objects and the two user settings, and runs
// every stage on every frame in a fixed order.

#include <memory>

#include "common/HIDTypes.h"
#include "platform/HIDEvent.h"

namespace orvane {

class HIDPathStates;
class HIDHandStatistics;
class HIDHandMotion;
class HIDGestureParser;

class HIDParser {
public:
    // initWithDispatchHandler:height:width: — note the order, height first.
    HIDParser(HIDDispatchHandler dispatchHandler, float height, float width);
    ~HIDParser();

    // The event to pass on in place of the frame, or nullptr.
    HIDEventRef handleContactFrame(double timestamp, const HIDEventRef& baseEvent);

    HID_PROPERTY(bool, tapToClickEnabled, setTapToClickEnabled)
    HID_PROPERTY(bool, twoFingersSecondaryClickEnabled, setTwoFingersSecondaryClickEnabled)
    const HIDDispatchHandler& dispatchHandler() const { return dispatchHandler_; }
    void setDispatchHandler(HIDDispatchHandler handler) { dispatchHandler_ = std::move(handler); }
    const std::shared_ptr<HIDPathStates>& pathStates() const { return pathStates_; }
    void setPathStates(std::shared_ptr<HIDPathStates> v) { pathStates_ = std::move(v); }
    const std::shared_ptr<HIDHandStatistics>& handStats() const { return handStats_; }
    void setHandStats(std::shared_ptr<HIDHandStatistics> v) { handStats_ = std::move(v); }
    const std::shared_ptr<HIDHandMotion>& handMotionExtractor() const { return handMotionExtractor_; }
    void setHandMotionExtractor(std::shared_ptr<HIDHandMotion> v) { handMotionExtractor_ = std::move(v); }
    const std::shared_ptr<HIDGestureParser>& gestureParser() const { return gestureParser_; }
    void setGestureParser(std::shared_ptr<HIDGestureParser> v) { gestureParser_ = std::move(v); }

private:
    bool tapToClickEnabled_ = false;
    bool twoFingersSecondaryClickEnabled_ = false;
    HIDDispatchHandler dispatchHandler_;
    std::shared_ptr<HIDPathStates> pathStates_;
    std::shared_ptr<HIDHandStatistics> handStats_;
    std::shared_ptr<HIDHandMotion> handMotionExtractor_;
    std::shared_ptr<HIDGestureParser> gestureParser_;
};

}  // namespace orvane
