#pragma once
// One finger path: the track of one contact across frames, with its current and previous
// contact, stage tests, stage times, the screen-UI position filter and velocity damping.

#include <limits>
#include <memory>

#include "common/HIDTypes.h"
#include "filter/FilterLogging.h"
#include "platform/HIDEvent.h"

namespace orvane {

// What a path table knows of its paths without looking at each one; every path it owns keeps
// its own bit of each mask up to date (see HIDParserPath::linkToTable).
struct HIDPathTableMarks {
    // Bit s: the contact of slot s may carry an ID other than s or 0.
    uint32_t looseSlots = 0;
    // Bit s, for a slot whose bit in looseSlots is clear: the contact of slot s carries s.
    uint32_t ownSlots = 0;
    // Bit s clear: the path of slot s is as clear() leaves it, so clearing it changes nothing.
    uint32_t dirtySlots = 0;
    // The table's copy of the diagnostics flag, which its paths test as they read contacts.
    FrameDiagnostics diagnostics;
};

// A property that clear() resets: setting it tells the path table the path is no longer clear.
#define HID_CLEARED_PROPERTY(Type, name, Setter) \
    Type name() const { return name##_; }        \
    void Setter(Type value) {                    \
        name##_ = value;                         \
        link_.markDirty();                       \
    }

class HIDParserPath {
public:
    // initWithHeight:width: — surfaceDimensions = {width, height}, everything else zero.
    HIDParserPath(float height, float width);
    static std::shared_ptr<HIDParserPath> initWithHeight(float height, float width) {
        return std::make_shared<HIDParserPath>(height, width);
    }

    // Reads one contact (a child digitizer event) of a frame at time t.
    void updateCurPrevContactsWith(const HIDEvent& contact, double time);
    // The same reading step by step through the public steps (setPeakDisplacement,
    // updatePathStageTimestamps), each marking the table on its own: the reference the
    // reading above is held to.
    void updateCurPrevContactsWithLiteral(const HIDEvent& contact, double time);

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
    bool isContactOnDivingButton() const { return currentContact_.position.y > bounds_.divingButtonTop; }
    bool isEdgeContact() const {
        const float x = currentContact_.position.x;
        const float y = currentContact_.position.y;
        const bool inside = bounds_.left < x && x < bounds_.right && bounds_.top < y && y < bounds_.bottom;
        return !inside;
    }

    void setRestingContact(bool resting);
    // Copies the flag into wasRestingInThumbZone first, then sets it.
    void setRestingInThumbZone(bool resting);
    void setIsRestingInThumbZone(bool resting) { setRestingInThumbZone(resting); }
    void clearPathSpeedSymmetry();

    // The contact to change in place; the path table stops trusting this path's ID (see
    // linkToTable) until the contact is set again.
    HIDContact& getCurrentContact() {
        link_.markLoose();
        link_.markDirty();
        return currentContact_;
    }
    HIDContact& getPreviousContact() {
        link_.markDirty();
        return previousContact_;
    }
    const HIDContact& currentContact() const { return currentContact_; }
    const HIDContact& previousContact() const { return previousContact_; }
    void setCurrentContact(const HIDContact& c) {
        currentContact_ = c;
        link_.noteID(currentContact_.path_id);
        link_.markDirty();
    }

    // A path table finds its paths by ID without searching while every path's contact carries
    // its own slot's ID or none, visits only the paths whose contact carries their own slot's
    // ID, and skips clearing paths that are already clear. Each path it owns keeps its slot's
    // bits of `marks` up to date. nullptr unlinks the path.
    void linkToTable(int slot, HIDPathTableMarks* marks) {
        link_.link(slot, marks);
        link_.noteID(currentContact_.path_id);
        link_.markDirty();
    }
    void setPreviousContact(const HIDContact& c) {
        previousContact_ = c;
        link_.markDirty();
    }

    void updatePathStageTimestamps(double time);
    // Recomputes the peak displacement from the touch-down position.
    void setPeakDisplacement();
    void setPeakDisplacement(float value) {
        peakDisplacement_ = value;
        link_.markDirty();
    }

    // One-axis hysteresis: moves `center` to within `radius` of `value`; returns whether it moved.
    static bool applyMinimumIncrementHysteresis(float value, float& center, float prevValueQuantized,
                                                float hysteresisRadius);

    // The screen-UI position filter.
    void filterContactForScreenUI(bool strongDamping);
    // The same filter through updateDampedVelocityLiteral: the reference for the one above.
    void filterContactForScreenUILiteral(bool strongDamping);
    static bool applyAbsolutePixelHysteresis(HIDPoint value, HIDPoint& hysteresisCenter, HIDPoint prevValueQuantized,
                                             float hysteresisRadius);
    void updateDampedVelocity(bool strongDamping);
    // The same damping with the power of two worked out on every call, through
    // weakenDampedVelocity: the reference for the one above.
    void updateDampedVelocityLiteral(bool strongDamping);
    void weakenDampedVelocity(float factor);
    bool fingerLiftoffNearEdgeframeInterval() const;
    HIDPoint getAverageVelocity_mm_s() const {
        return HIDPoint{
            static_cast<float>(0.5 * previousContact_.velocity.x + 0.5 * currentContact_.velocity.x),
            static_cast<float>(0.5 * previousContact_.velocity.y + 0.5 * currentContact_.velocity.y),
        };
    }
    void clear();
    static void clearTimestamps(HIDPathTimestamps& timestamps);

    HID_PROPERTY(bool, isResting, setIsResting)
    bool isRestingInThumbZone() const { return isRestingInThumbZone_; }
    HID_PROPERTY(bool, wasRestingInThumbZone, setWasRestingInThumbZone)
    HID_PROPERTY(bool, thumbMovementTimedOut, setThumbMovementTimedOut)
    HID_PROPERTY(bool, thumbAboveTRZOnTouchdown, setThumbAboveTRZOnTouchdown)
    // engagedSpeed is the length of engagedVelocity whenever the screen-UI filter last set
    // both (nothing of the frame reads it, so it is worked out when read).
    float engagedSpeed() const;
    void setEngagedSpeed(float value) {
        engagedSpeed_ = value;
        engagedSpeedIsLength_ = false;
    }
    HID_PROPERTY(float, _2F_speed_symmetry, set_2F_speed_symmetry)
    HID_CLEARED_PROPERTY(float, dampedSpeed, setDampedSpeed)
    float peakDisplacement() const { return peakDisplacement_; }
    HIDPoint surfaceDimensions() const { return surfaceDimensions_; }
    void setSurfaceDimensions(HIDPoint dimensions) {
        surfaceDimensions_ = dimensions;
        bounds_ = EdgeBounds::of(dimensions);
    }
    HID_CLEARED_PROPERTY(HIDPoint, initialPosition, setInitialPosition)
    HID_CLEARED_PROPERTY(HIDPoint, longTermPosition, setLongTermPosition)
    HID_CLEARED_PROPERTY(HIDPoint, stablePositionForUI, setStablePositionForUI)
    HID_CLEARED_PROPERTY(HIDPoint, previousStablePositionForUI, setPreviousStablePositionForUI)
    HID_CLEARED_PROPERTY(HIDPoint, hysteresisCenter, setHysteresisCenter)
    HID_PROPERTY(HIDPoint, ellipseHysteresisOffset, setEllipseHysteresisOffset)
    HID_CLEARED_PROPERTY(HIDPoint, pixelDelta, setPixelDelta)
    HID_CLEARED_PROPERTY(HIDPoint, cumulativeDeltas, setCumulativeDeltas)
    HIDPoint engagedVelocity() const { return engagedVelocity_; }
    // Leaves engagedSpeed as it was.
    void setEngagedVelocity(HIDPoint value);
    HID_CLEARED_PROPERTY(HIDPoint, dampedVelocity, setDampedVelocity)
    const HIDPathTimestamps& timestamps() const { return timestamps_; }
    HIDPathTimestamps& timestamps() { return timestamps_; }
    void setTimestamps(const HIDPathTimestamps& t) { timestamps_ = t; }

private:
    // The path's place in its table. A copy of a path belongs to no table; a path is never
    // assigned over.
    struct TableLink {
        // A path in no table keeps its marks here, where nobody reads them.
        HIDPathTableMarks spare;
        HIDPathTableMarks* marks = &spare;
        int slot = -1;
        // 1 << slot in a table, 0 outside one, so that marking changes nothing.
        uint32_t bit = 0;
        TableLink() = default;
        TableLink(const TableLink&) {}
        TableLink& operator=(const TableLink&) = delete;
        void link(int tableSlot, HIDPathTableMarks* tableMarks) {
            slot = tableMarks ? tableSlot : -1;
            marks = tableMarks ? tableMarks : &spare;
            bit = tableMarks ? 1u << tableSlot : 0;
        }
        void noteID(int32_t pathID) const {
            if (pathID == 0 || pathID == slot) {
                marks->looseSlots &= ~bit;
            } else {
                marks->looseSlots |= bit;
            }
            if (pathID == slot) {
                marks->ownSlots |= bit;
            } else {
                marks->ownSlots &= ~bit;
            }
        }
        void markLoose() const { marks->looseSlots |= bit; }
        void markDirty() const { marks->dirtySlots |= bit; }
        void markClear() const { marks->dirtySlots &= ~bit; }
    };

    // The edge band and the diving button's upper limit, worked out from the surface size as
    // the tests use them.
    struct EdgeBounds {
        float left, right, bottom;
        double top, divingButtonTop;
        static EdgeBounds of(HIDPoint surface) {
            const float w = surface.x;
            const float h = surface.y;
            // The band is one fifth wide at the left, right and top and one quarter at the
            // bottom, on purpose; the quarter and the half are worked out in double.
            return EdgeBounds{w / 5, w * 4 / 5, h * 4 / 5, h * 0.25, h * 0.5};
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
    // Read only while engagedSpeedIsLength_ is false.
    float engagedSpeed_ = 0.0f;
    bool engagedSpeedIsLength_ = false;
    float _2F_speed_symmetry_ = 0.0f;
    float dampedSpeed_ = 0.0f;
    float peakDisplacement_ = 0.0f;
    HIDPoint surfaceDimensions_{};
    EdgeBounds bounds_ = EdgeBounds::of(HIDPoint{});
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
    // The frame interval (ticks, in float) the damping weight below was worked out for, and
    // that weight: the power of two of the interval's exponent, in float. NaN equals no
    // interval, so the first damping works it out.
    float dampingInterval_ = std::numeric_limits<float>::quiet_NaN();
    float dampingKeep_ = 0.0f;

    // The steps of setPeakDisplacement and updateDampedVelocity without marking the table,
    // for callers that have marked it already.
    // The contact's fields, stage and velocity read into the path (the table marked), before
    // the peak displacement and the stage times.
    void readContact(const HIDEvent& contact, double time);
    void raisePeakDisplacement();
    void dampVelocity(bool strongDamping);
    // Works out the damping weight for a new frame interval.
    void updateDampingWeights(float dt);
};

}  // namespace orvane
