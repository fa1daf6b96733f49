#pragma once
// The hand's motion from its innermost and outermost touching fingers: translation,
// scale and rotation, smoothed, clipped to the dominant kind and accumulated, and written
// back into the path table.

#include <cmath>
#include <cstdint>
#include <limits>

#include "common/HIDTypes.h"
#include "filter/FilterLogging.h"
#include "motion/HIDFingerToPathMap.h"

namespace orvane {

class HIDPathStates;

struct HIDSeparationVector {
    float x;
    float y;
    float magnitude;
    float direction;
};

class HIDHandMotion : public HIDFingerToPathMap {
public:
    HIDHandMotion() = default;

    // Vector operations.
    static float getVectorMagnitudeX(float x, float y);
    static float getVectorDirectionX(float x, float y);
    static float getVectorDotProduct(HIDPoint a, float unitVectorBdirection);
    static HIDSeparationVector computeSeparationVector(const HIDContact& innermostCurContact,
                                                      const HIDContact& outermostCurContact);
    // The same x, y and magnitude, with the direction left at 0 (for callers that never read it).
    static HIDSeparationVector computeSeparationVectorWithoutDirection(const HIDContact& innermostCurContact,
                                                                      const HIDContact& outermostCurContact);
    void computeSeparation_mm(const HIDContact& innermostCurContact, const HIDContact& outermostCurContact);
    static float scalingFromDotProduct(HIDPoint unitSeparation, HIDPoint innermostMotionV, HIDPoint outermostMotionV);
    static float rotationFromVectorProduct(HIDPoint unitSeparation, HIDPoint innermostMotionV,
                                           HIDPoint outermostMotionV);
    static float getWeightedAverage(float weight, float inputA, float inputB);
    void setMotionDelta(float x, float y, float scale, float rotate);
    static void clear2DPlaneMotion(HIDMotion& motion);

    // Extraction.
    void extractHandMotion(const HIDPathStates& pathTable, HIDParserPath* innermostPath, HIDParserPath* outermostPath,
                           bool areTouching, bool wereTouching);
    void extractHandMotionWithResting(const HIDPathStates& pathTable, HIDParserPath* innermostPath,
                                      HIDParserPath* outermostPath, bool areTouching, bool wereTouching);

    // The per-frame entry.
    void processHandMotion(HIDPathStates& pathTable, int32_t nTouching, int32_t lastnTouching, uint32_t touchingMask);
    void clearHandMotion(bool clearLocation);
    void accumulateHandMotion();
    void clearAccumulateHandMotion();
    void resetAccumulateHandMotion();
    void updateFastestFingerSpeed(const HIDPathStates& pathTable);
    void clipMotionToDominantAxes(double frameInterval);
    void computeTrackpadDominanceWeights(float& scaleDominanceWeight, float& rotationDominanceWeight) const;
    void printExtractedMotion(int numFingers) const;
    // Inline, as the gesture stage asks for these on every frame.
    bool anyPixelDeltas() const {
        return pixelDeltas_.x != 0.0f || pixelDeltas_.y != 0.0f || pixelDeltas_.scale != 0.0f ||
               pixelDeltas_.rotate != 0.0f;
    }
    float maxPixelDelta() const { return largestMagnitude(pixelDeltas_); }
    float maxAccumPixelDelta() const { return largestMagnitude(accumulatedDeltas_); }
    float maxAccumPixelDeltaResting() const { return largestMagnitude(accumulatedDeltasWithResting_); }

    HID_PROPERTY(HIDMotion, pixelDeltas, setPixelDeltas)
    HID_PROPERTY(HIDMotion, velocity, setVelocity)
    // The hand's location: x and y, the innermost-outermost separation in scale and its
    // direction in rotate. The direction is worked out when the location is read, from the
    // separation kept by the extraction, as nothing on the frame path reads it.
    HIDMotion absoluteLocation() const;
    void setAbsoluteLocation(HIDMotion value) {
        absoluteLocation_ = value;
        locationDirectionPending_ = false;
    }
    HID_PROPERTY(float, innermostOutermostSeparation_mm, setInnermostOutermostSeparation_mm)
    HID_PROPERTY(float, innermostOutermostVerticalSeparation_mm, setInnermostOutermostVerticalSeparation_mm)
    HID_PROPERTY(float, maxInnermostOutermostVerticalSeparation_mm, setMaxInnermostOutermostVerticalSeparation_mm)
    HID_PROPERTY(float, speedSimilarity, setSpeedSimilarity)
    HID_PROPERTY(HIDMotion, pixelDeltasWithResting, setPixelDeltasWithResting)
    HID_PROPERTY(bool, startedWithTwoWidelySeparatedFingers, setStartedWithTwoWidelySeparatedFingers)
    HID_PROPERTY(float, smoothedTranslationSpeed, setSmoothedTranslationSpeed)
    HID_PROPERTY(float, maxFingerSpeed, setMaxFingerSpeed)
    HID_PROPERTY(float, averageMaxFingerSpeed, setAverageMaxFingerSpeed)
    HID_PROPERTY(float, lastMaxFingerSpeed, setLastMaxFingerSpeed)
    HID_PROPERTY(float, nondominantAxesRatio, setNondominantAxesRatio)
    HID_PROPERTY(double, tLastPixelDelta, setTLastPixelDelta)
    HID_PROPERTY(HIDPoint, handCentroid, setHandCentroid)
    HIDMotion smoothedVelocity() const { return smoothedVelocity_; }
    // Leaves smoothedClippedVelocity as it was.
    void setSmoothedVelocity(HIDMotion value) {
        smoothedClippedVelocity_ = smoothedClippedVelocity();
        clippedAxes_ = ClippedAxes::Kept;
        smoothedVelocity_ = value;
    }
    // The smoothed velocity with the axes that did not dominate cleared and the dead zone
    // applied. Worked out when read, from the smoothed velocity and the axes the last clipping
    // kept, as nothing on the frame path reads it.
    HIDMotion smoothedClippedVelocity() const;
    void setSmoothedClippedVelocity(HIDMotion value) {
        smoothedClippedVelocity_ = value;
        clippedAxes_ = ClippedAxes::Kept;
    }
    // The same clipping with every value worked out as it goes: the reference for the one above.
    void clipMotionToDominantAxesLiteral(double frameInterval);
    HID_PROPERTY(HIDMotion, accumulatedDeltas, setAccumulatedDeltas)
    HID_PROPERTY(HIDMotion, accumulatedDeltasWithResting, setAccumulatedDeltasWithResting)
    HID_PROPERTY(HIDMotion, motionDeltas, setMotionDeltas)
    HID_PROPERTY(HIDMotion, deltas_mm_s, setDeltas_mm_s)
    HID_PROPERTY(HIDMotion, velocity_mm_s, setVelocity_mm_s)

private:
    // The largest of the four magnitudes, compared in this order.
    static float largestMagnitude(const HIDMotion& m) {
        float largest = std::fabs(m.x);
        if (std::fabs(m.y) > largest) largest = std::fabs(m.y);
        if (std::fabs(m.scale) > largest) largest = std::fabs(m.scale);
        if (std::fabs(m.rotate) > largest) largest = std::fabs(m.rotate);
        return largest;
    }
    // What the clipping compares: the weighted scale and rotation speeds, the larger of the
    // two, and the translation speed.
    struct DominantAxes {
        float scale, rotation, scaleOrRotation, translation;
    };
    // The smoothing that comes before the clipping, with the speeds the clipping compares.
    DominantAxes smoothVelocity(double frameInterval);
    // The separations of computeSeparation_mm from the vertical difference and the magnitude.
    void noteSeparation_mm(float dy, float magnitude);

    // The diagnostics flag as the stage last started on a frame.
    FrameDiagnostics diagnostics_;
    HIDMotion pixelDeltas_{};
    HIDMotion velocity_{};
    HIDMotion absoluteLocation_{};
    // While pending, absoluteLocation_.rotate stands for the direction of this separation.
    HIDPoint locationSeparation_{};
    bool locationDirectionPending_ = false;
    float innermostOutermostSeparation_mm_ = 0.0f;
    float innermostOutermostVerticalSeparation_mm_ = 0.0f;
    float maxInnermostOutermostVerticalSeparation_mm_ = 0.0f;
    float speedSimilarity_ = 0.0f;
    HIDMotion pixelDeltasWithResting_{};
    bool startedWithTwoWidelySeparatedFingers_ = false;
    float smoothedTranslationSpeed_ = 0.0f;
    float maxFingerSpeed_ = 0.0f;
    float averageMaxFingerSpeed_ = 0.0f;
    float lastMaxFingerSpeed_ = 0.0f;
    float nondominantAxesRatio_ = 0.0f;
    double tLastPixelDelta_ = 0.0;
    HIDPoint handCentroid_{};
    HIDMotion smoothedVelocity_{};
    // Which axes the last clipping kept of smoothedVelocity_; Kept: smoothedClippedVelocity_
    // holds the value itself.
    enum class ClippedAxes : uint8_t { Kept, Translation, Scale, Rotation, ScaleAndRotation };
    HIDMotion smoothedClippedVelocity_{};
    ClippedAxes clippedAxes_ = ClippedAxes::Kept;
    HIDMotion accumulatedDeltas_{};
    HIDMotion accumulatedDeltasWithResting_{};
    HIDMotion motionDeltas_{};
    HIDMotion deltas_mm_s_{};
    HIDMotion velocity_mm_s_{};
    // The last exponents of the speed blend and of the smoothing, and their powers.
    double speedBlendExponent_ = std::numeric_limits<double>::quiet_NaN();
    double speedBlendPower_ = 0.0;
    double smoothingExponent_ = std::numeric_limits<double>::quiet_NaN();
    double smoothingPower_ = 0.0;
};

}  // namespace orvane
