#pragma once
// One finger path: the track of one contact across frames, with its current and previous
// contact, stage tests, stage times, the screen-UI position filter and velocity damping.

#include <memory>

#include "common/HIDTypes.h"
#include "platform/HIDEvent.h"

namespace orvane {

class HIDParserPath {
public:
    // initWithHeight:width: — surfaceDimensions = {width, height}, everything else zero.
    HIDParserPath(float height, float width);
    static std::shared_ptr<HIDParserPath> initWithHeight(float height, float width) {
        return std::make_shared<HIDParserPath>(height, width);
    }

    // Reads one contact (a child digitizer event) of a frame at time t.
    void updateCurPrevContactsWith(const HIDEvent& contact, double time);

    // Stage tests. isMakeStage and isLiftOffStage are deliberately reversed from their
    // plain reading: make is true on the frame of lifting, lift-off on touch-down.
    bool isTouching() const;
    bool wasTouching() const;
    bool isNoTrackingStage() const;
    bool isNewContact() const;
    bool isLiftOffStage() const;
    bool isMakeStage() const;
    bool isFingerOrRestingContact() const;
    bool wasFingerOrRestingContact() const;
    bool isPalmContact() const;
    bool isFingerContact() const;
    bool wasResting() const;
    bool isContactOnDivingButton() const;
    bool isEdgeContact() const;

    void setRestingContact(bool resting);
    // Copies the flag into wasRestingInThumbZone first, then sets it.
    void setRestingInThumbZone(bool resting);
    void setIsRestingInThumbZone(bool resting) { setRestingInThumbZone(resting); }
    void clearPathSpeedSymmetry();

    HIDContact& getCurrentContact() { return currentContact_; }
    HIDContact& getPreviousContact() { return previousContact_; }
    const HIDContact& currentContact() const { return currentContact_; }
    const HIDContact& previousContact() const { return previousContact_; }
    void setCurrentContact(const HIDContact& c) { currentContact_ = c; }
    void setPreviousContact(const HIDContact& c) { previousContact_ = c; }

    void updatePathStageTimestamps(double time);
    // Recomputes the peak displacement from the touch-down position.
    void setPeakDisplacement();
    void setPeakDisplacement(float value) { peakDisplacement_ = value; }

    // One-axis hysteresis: moves `center` to within `radius` of `value`; returns whether it moved.
    static bool applyMinimumIncrementHysteresis(float value, float& center, float prevValueQuantized,
                                                float hysteresisRadius);

    // The screen-UI position filter.
    void filterContactForScreenUI(bool strongDamping);
    static bool applyAbsolutePixelHysteresis(HIDPoint value, HIDPoint& hysteresisCenter, HIDPoint prevValueQuantized,
                                             float hysteresisRadius);
    void updateDampedVelocity(bool strongDamping);
    void weakenDampedVelocity(float factor);
    bool fingerLiftoffNearEdgeframeInterval() const;
    HIDPoint getAverageVelocity_mm_s() const;
    void clear();
    static void clearTimestamps(HIDPathTimestamps& timestamps);

    HID_PROPERTY(bool, isResting, setIsResting)
    bool isRestingInThumbZone() const { return isRestingInThumbZone_; }
    HID_PROPERTY(bool, wasRestingInThumbZone, setWasRestingInThumbZone)
    HID_PROPERTY(bool, thumbMovementTimedOut, setThumbMovementTimedOut)
    HID_PROPERTY(bool, thumbAboveTRZOnTouchdown, setThumbAboveTRZOnTouchdown)
    HID_PROPERTY(float, engagedSpeed, setEngagedSpeed)
    HID_PROPERTY(float, _2F_speed_symmetry, set_2F_speed_symmetry)
    HID_PROPERTY(float, dampedSpeed, setDampedSpeed)
    float peakDisplacement() const { return peakDisplacement_; }
    HID_PROPERTY(HIDPoint, surfaceDimensions, setSurfaceDimensions)
    HID_PROPERTY(HIDPoint, initialPosition, setInitialPosition)
    HID_PROPERTY(HIDPoint, longTermPosition, setLongTermPosition)
    HID_PROPERTY(HIDPoint, stablePositionForUI, setStablePositionForUI)
    HID_PROPERTY(HIDPoint, previousStablePositionForUI, setPreviousStablePositionForUI)
    HID_PROPERTY(HIDPoint, hysteresisCenter, setHysteresisCenter)
    HID_PROPERTY(HIDPoint, ellipseHysteresisOffset, setEllipseHysteresisOffset)
    HID_PROPERTY(HIDPoint, pixelDelta, setPixelDelta)
    HID_PROPERTY(HIDPoint, cumulativeDeltas, setCumulativeDeltas)
    HID_PROPERTY(HIDPoint, engagedVelocity, setEngagedVelocity)
    HID_PROPERTY(HIDPoint, dampedVelocity, setDampedVelocity)
    const HIDPathTimestamps& timestamps() const { return timestamps_; }
    HIDPathTimestamps& timestamps() { return timestamps_; }
    void setTimestamps(const HIDPathTimestamps& t) { timestamps_ = t; }

private:
    HIDContact currentContact_{};
    HIDContact previousContact_{};
    bool isResting_ = false;
    bool isRestingInThumbZone_ = false;
    bool wasRestingInThumbZone_ = false;
    bool thumbMovementTimedOut_ = false;
    bool thumbAboveTRZOnTouchdown_ = false;
    float engagedSpeed_ = 0.0f;
    float _2F_speed_symmetry_ = 0.0f;
    float dampedSpeed_ = 0.0f;
    float peakDisplacement_ = 0.0f;
    HIDPoint surfaceDimensions_{};
    HIDPoint initialPosition_{};
    HIDPoint longTermPosition_{};
    HIDPoint stablePositionForUI_{};
    HIDPoint previousStablePositionForUI_{};
    HIDPoint hysteresisCenter_{};
    HIDPoint ellipseHysteresisOffset_{};
    HIDPoint pixelDelta_{};
    HIDPoint cumulativeDeltas_{};
    HIDPoint engagedVelocity_{};
    HIDPoint dampedVelocity_{};
    HIDPathTimestamps timestamps_{};
};

}  // namespace orvane
