#pragma once
// The path table with the diving button's state and the post-filtering of each frame:
// resting thumb, thumb-zone flags, speed symmetries, the resting mark written into the
// contact events and the hand centre written into the frame event.

#include <array>
#include <cstddef>
#include <span>
#include <vector>

#include "common/HIDTypes.h"
#include "paths/HIDPathStateBasic.h"

namespace orvane {

class HIDPathStates : public HIDPathStateBasic {
public:
    HIDPathStates(float height, float width) : HIDPathStateBasic(height, width) {}

    void updateButtonState(const HIDEventRef& frame);
    // A query with a side effect: a change is time-stamped and marked unhandled.
    bool buttonStateChanged();
    void postFilteringTasks(const HIDEventRef& frame);
    // The same steps one after the other, each walking the table on its own.
    void postFilteringTasksOneByOne(const HIDEventRef& frame);
    bool makeOrBreakTouchHappened(const HIDEventRef& frame) const;
    void setRestingFlag(const HIDEventRef& frame);
    void updateDivingBoardDisplacements();

    void checkForRestingThumb();
    float getMaxThumbRestingHeight(const HIDParserPath* path) const;
    // Every touching finger's speed symmetry against the other touching fingers, the fingers
    // gathered once for the frame.
    void updateSpeedSymmetriesOfAllPaths();
    // The same, asking computePathAndFingerSpeedSymmetries of each path in turn.
    void updateSpeedSymmetriesOfAllPathsOneByOne();
    void computePathAndFingerSpeedSymmetries(int pathID);
    static float compute_2F_path_speed_symmetry(std::span<const float> speeds, std::span<const float> cosineThetas,
                                                float desiredPathSpeed);
    float computeSpeedSimilarity() const;
    void breakOutOfRestingThumbBasedOnSymmetry();
    void calculateNewHandCenter(const HIDEventRef& frame);

    HID_PROPERTY(int, buttonState, setButtonState)
    HID_PROPERTY(int, previousButtonState, setPreviousButtonState)
    HID_PROPERTY(double, divingButtonChangeTimestamp, setDivingButtonChangeTimestamp)
    HID_PROPERTY(bool, handledDivingButtonStateChange, setHandledDivingButtonStateChange)
    HID_PROPERTY(double, earliestNonDivingTimestamp, setEarliestNonDivingTimestamp)
    HID_PROPERTY(bool, engagedinGesture, setEngagedinGesture)
    HID_PROPERTY(bool, restingThumbExists, setRestingThumbExists)
    HID_PROPERTY(bool, restingThumbDidExist, setRestingThumbDidExist)
    HID_PROPERTY(float, speedSimilarity, setSpeedSimilarity)
    HID_PROPERTY(HIDMotion, motionDeltas, setMotionDeltas)
    HID_PROPERTY(HIDMotion, motionDeltasResting, setMotionDeltasResting)
    HID_PROPERTY(float, maxMotionDeltas, setMaxMotionDeltas)
    HID_PROPERTY(float, maxMotionDeltasResting, setMaxMotionDeltasResting)

    // The symmetry of one finger's damped motion with the other fingers' (given in path order).
    static float speedSymmetryAmongFingers(HIDPoint desiredVelocity, float desiredSpeed,
                                           const HIDPoint* otherVelocities, const float* otherSpeeds,
                                           size_t numOthers);
    // The symmetry of a finger with exactly one other finger, given the cosine between them.
    static float twoFingerSymmetry(float desiredSpeed, float otherSpeed, float cosine);
    // The same, always sorting the other fingers and working out every cosine.
    static float speedSymmetryAmongFingersInFull(HIDPoint desiredVelocity, float desiredSpeed,
                                                 const HIDPoint* otherVelocities, const float* otherSpeeds,
                                                 size_t numOthers);

private:
    // The touching fingers of the table gathered for their speed symmetries, in ID order.
    struct SpeedSymmetryFingers {
        // Only the entries written are read, so none is set beforehand.
        std::array<HIDParserPath*, kNumPaths - 1> fingers;
        std::array<HIDPoint, kNumPaths - 1> velocities;
        std::array<float, kNumPaths - 1> speeds;
        size_t numFingers = 0;
        // Takes a path found for this ID: gathered when it is a touching finger of its own
        // slot, its symmetry cleared when it does not touch.
        void add(HIDParserPath* path, int id);
        // Sets every gathered finger's symmetry against the others.
        // diagnostics: the table's copy of the diagnostics flag (the cosines are logged when on).
        void finish(const FrameDiagnostics& diagnostics);
    };
    // The slowest and fastest average speed of the touching fingers.
    struct SpeedRange {
        // The minimum starts far above any speed.
        float minimum = 10000.0f;
        float maximum = 0.0f;
        void add(const HIDParserPath* path);
        float similarity() const;
    };
    // The thumb-zone flag of a tracked path in a frame where no finger touched down or lifted.
    void setThumbZoneFlag(HIDParserPath* path, int id);
    // The steps of post-filtering, each able to take what the frame's walk already found.
    void checkForRestingThumb(bool* makeOrBreak);
    void updateDivingBoardDisplacements(bool* makeOrBreak);
    void breakOutOfRestingThumb(const float* knownSimilarity);


    int buttonState_ = 0;
    int previousButtonState_ = 0;
    double divingButtonChangeTimestamp_ = 0.0;
    bool handledDivingButtonStateChange_ = false;
    double earliestNonDivingTimestamp_ = 0.0;
    bool engagedinGesture_ = false;
    bool restingThumbExists_ = false;
    bool restingThumbDidExist_ = false;
    float speedSimilarity_ = 0.0f;
    HIDMotion motionDeltas_{};
    HIDMotion motionDeltasResting_{};
    float maxMotionDeltas_ = 0.0f;
    float maxMotionDeltasResting_ = 0.0f;
};

// The cosine of the angle between every pair of points, pairs in the order (0,1), (0,2) …
// (0,n−1), (1,2) …; 1 where either length is 0. Writes n·(n−1)/2 values into `cosines`
// (which must hold them) and returns that count.
size_t getCosineThetas(std::span<const HIDPoint> points, std::span<float> cosines);
std::vector<float> getCosineThetas(const std::vector<HIDPoint>& points);

}  // namespace orvane

// The exported form: a new array of count·(count−1)/2 floats (free() it), its length in
// *outCount; NULL for fewer than two points.
extern "C" float* getCosineThetas(const orvane::HIDPoint* points, size_t count, size_t* outCount);
