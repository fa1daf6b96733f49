#pragma once
// One finger path: the track of one contact across frames, with its current and previous
// contact, stage tests, stage times, the screen-UI position filter and velocity damping.

#include <limits>
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
    bool isTouching() const { return currentContact_.fingerTipSwitch != 0; }
    bool wasTouching() const { return previousContact_.fingerTipSwitch != 0; }
    bool isNoTrackingStage() const { return currentContact_.fingerTipSwitch == 0; }
    bool isNewContact() const { return currentContact_.fingerTipSwitch == 1 && previousContact_.fingerTipSwitch == 0; }
    // True on the frame of touching down, despite its name.
    bool isLiftOffStage() const { return currentContact_.fingerTipSwitch == 1 && previousContact_.fingerTipSwitch == 0; }
    // True on the frame after lifting, despite its name.
    bool isMakeStage() const { return currentContact_.fingerTipSwitch == 0 && previousContact_.fingerTipSwitch == 1; }
    bool isFingerOrRestingContact() const { return currentContact_.fingerConfidence != 0; }
    bool wasFingerOrRestingContact() const { return previousContact_.fingerConfidence != 0; }
    bool isPalmContact() const { return currentContact_.fingerConfidence == 0; }
    bool isFingerContact() const { return !isRestingInThumbZone_ && isFingerOrRestingContact(); }
    // Reports the thumb-zone flag of the last frame, on purpose.
    bool wasResting() const { return wasRestingInThumbZone_; }
    bool isContactOnDivingButton() const;
    bool isEdgeContact() const;

    void setRestingContact(bool resting);
    // Copies the flag into wasRestingInThumbZone first, then sets it.
    void setRestingInThumbZone(bool resting);
    void setIsRestingInThumbZone(bool resting) { setRestingInThumbZone(resting); }
    void clearPathSpeedSymmetry();

    // The contact to change in place; the path table stops trusting this path's ID (see
    // linkToTable) until the contact is set again.
    HIDContact& getCurrentContact() {
        link_.markLoose();
        return currentContact_;
    }
    HIDContact& getPreviousContact() { return previousContact_; }
    const HIDContact& currentContact() const { return currentContact_; }
    const HIDContact& previousContact() const { return previousContact_; }
    void setCurrentContact(const HIDContact& c) {
        currentContact_ = c;
        link_.noteID(currentContact_.path_id);
    }

    // A path table finds its paths by ID without searching while every path's contact carries
    // its own slot's ID or none. Each path it owns reports here, as a bit of `looseSlots`,
    // whether its contact may carry another ID. nullptr unlinks the path.
    void linkToTable(int slot, uint32_t* looseSlots) {
        link_.slot = slot;
        link_.looseSlots = looseSlots;
        link_.noteID(currentContact_.path_id);
    }
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
    // The path's place in its table. A copy of a path belongs to no table; a path is never
    // assigned over.
    struct TableLink {
        int slot = -1;
        uint32_t* looseSlots = nullptr;
        TableLink() = default;
        TableLink(const TableLink&) {}
        TableLink& operator=(const TableLink&) = delete;
        void noteID(int32_t pathID) const {
            if (!looseSlots) return;
            const uint32_t bit = 1u << slot;
            if (pathID == 0 || pathID == slot) {
                *looseSlots &= ~bit;
            } else {
                *looseSlots |= bit;
            }
        }
        void markLoose() const {
            if (looseSlots) *looseSlots |= 1u << slot;
        }
    };

    TableLink link_;
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
    // The last damping exponent and its power of two.
    double dampingExponent_ = std::numeric_limits<double>::quiet_NaN();
    double dampingPower_ = 0.0;
};

}  // namespace orvane
