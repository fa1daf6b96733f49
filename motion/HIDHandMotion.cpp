#include "HIDHandMotion.h"

#include <cmath>

#include "common/TickConversion.h"
#include "filter/FilterLogging.h"
#include "paths/HIDPathStates.h"
#include "pipeline/HIDParserPath.h"

namespace orvane {

namespace {

// Weights of scale and rotation against translation, by finger separation: fingers closer
// than kNarrowSeparation_mm weigh kNarrowDominanceWeight, fingers wider than
// kWideSeparation_mm weigh kWideDominanceWeight, with a straight line between.
constexpr float kNarrowSeparation_mm = 35.0f;
constexpr float kWideSeparation_mm = 55.0f;
constexpr float kDominanceRamp_mm = 20.0f;
constexpr float kNarrowDominanceWeight = 0.45f;
constexpr float kWideDominanceWeight = 1.45f;

// Smoothed velocity components smaller than this are treated as no motion, and larger
// ones are reduced by it.
constexpr float kClippedVelocityDeadZone = 4.0f;

// The time constant of the velocity smoothing, in milliseconds; the single-precision value
// is widened to double, so the exponent divides by -0.030000001192092896.
constexpr float kVelocitySmoothingTimeConstant_ms = -0.03f;

// The half-life of the blended fastest-finger speed, in milliseconds.
constexpr double kFingerSpeedHalfLife_ms = 14.0;

const HIDContact kNoContact{};

const HIDContact& currentContactOf(const HIDParserPath* path) {
    return path != nullptr ? path->currentContact() : kNoContact;
}

const HIDContact& previousContactOf(const HIDParserPath* path) {
    return path != nullptr ? path->previousContact() : kNoContact;
}

// A contact is valid when its path exists and the contact carries a path ID.
bool isValid(const HIDParserPath* path, const HIDContact& contact) {
    return path != nullptr && contact.path_id != 0;
}

HIDPoint engagedVelocityOf(const HIDParserPath* path) {
    return path != nullptr ? path->engagedVelocity() : HIDPoint{};
}

// The outermost path forms a pair with the innermost when it carries a contact of its own.
bool formsPair(const HIDParserPath* outermostPath, const HIDContact& innermostCur, const HIDContact& outermostCur) {
    return outermostPath != nullptr && outermostCur.path_id != 0 && outermostCur.path_id != innermostCur.path_id;
}

float applyDeadZone(float c) {
    if (std::fabs(c) < kClippedVelocityDeadZone) return 0.0f;
    return c > 0.0f ? c - kClippedVelocityDeadZone : c + kClippedVelocityDeadZone;
}

}  // namespace

// ---------------------------------------------------------------------------------------
// Vector operations

float HIDHandMotion::getVectorMagnitudeX(float x, float y) { return sqrtf(x * x + y * y); }

float HIDHandMotion::getVectorDirectionX(float x, float y) {
    // The angle with the y axis pointing up.
    return static_cast<float>(std::atan2(-static_cast<double>(y), static_cast<double>(x)));
}

float HIDHandMotion::getVectorDotProduct(HIDPoint a, float unitVectorBdirection) {
    return a.x * std::cos(unitVectorBdirection) - a.y * std::sin(unitVectorBdirection);
}

HIDSeparationVector HIDHandMotion::computeSeparationVector(const HIDContact& innermostCurContact,
                                                           const HIDContact& outermostCurContact) {
    HIDSeparationVector s{};
    s.x = outermostCurContact.position.x - innermostCurContact.position.x;
    s.y = outermostCurContact.position.y - innermostCurContact.position.y;
    s.magnitude = getVectorMagnitudeX(s.x, s.y);
    s.direction = getVectorDirectionX(s.x, s.y);
    return s;
}

HIDSeparationVector HIDHandMotion::computeSeparationVectorWithoutDirection(const HIDContact& innermostCurContact,
                                                                          const HIDContact& outermostCurContact) {
    HIDSeparationVector s{};
    s.x = outermostCurContact.position.x - innermostCurContact.position.x;
    s.y = outermostCurContact.position.y - innermostCurContact.position.y;
    s.magnitude = getVectorMagnitudeX(s.x, s.y);
    return s;
}

HIDMotion HIDHandMotion::absoluteLocation() const {
    HIDMotion location = absoluteLocation_;
    if (locationDirectionPending_) location.rotate = getVectorDirectionX(locationSeparation_.x, locationSeparation_.y);
    return location;
}

void HIDHandMotion::computeSeparation_mm(const HIDContact& innermostCurContact,
                                         const HIDContact& outermostCurContact) {
    const float dx = outermostCurContact.position.x - innermostCurContact.position.x;
    const float dy = outermostCurContact.position.y - innermostCurContact.position.y;
    noteSeparation_mm(dy, getVectorMagnitudeX(dx, dy));
}

void HIDHandMotion::noteSeparation_mm(float dy, float magnitude) {
    innermostOutermostVerticalSeparation_mm_ = std::fabs(dy);
    if (innermostOutermostVerticalSeparation_mm_ > maxInnermostOutermostVerticalSeparation_mm_) {
        maxInnermostOutermostVerticalSeparation_mm_ = innermostOutermostVerticalSeparation_mm_;
    }
    innermostOutermostSeparation_mm_ = magnitude;
}

float HIDHandMotion::scalingFromDotProduct(HIDPoint unitSeparation, HIDPoint innermostMotionV,
                                           HIDPoint outermostMotionV) {
    const float outer = outermostMotionV.x * unitSeparation.x + outermostMotionV.y * unitSeparation.y;
    const float inner = innermostMotionV.x * unitSeparation.x + innermostMotionV.y * unitSeparation.y;
    return outer - inner;
}

float HIDHandMotion::rotationFromVectorProduct(HIDPoint unitSeparation, HIDPoint innermostMotionV,
                                               HIDPoint outermostMotionV) {
    const float outer = outermostMotionV.x * unitSeparation.y - outermostMotionV.y * unitSeparation.x;
    const float inner = innermostMotionV.x * unitSeparation.y - innermostMotionV.y * unitSeparation.x;
    return outer - inner;
}

float HIDHandMotion::getWeightedAverage(float weight, float inputA, float inputB) {
    const float weightedA = weight * inputA;
    return static_cast<float>(static_cast<double>(weightedA) +
                              (1.0 - static_cast<double>(weight)) * static_cast<double>(inputB));
}

void HIDHandMotion::setMotionDelta(float x, float y, float scale, float rotate) {
    motionDeltas_ = HIDMotion{x, y, scale, rotate};
}

void HIDHandMotion::clear2DPlaneMotion(HIDMotion& motion) { motion = HIDMotion{0.0f, 0.0f, 0.0f, 0.0f}; }

// ---------------------------------------------------------------------------------------
// Extraction

void HIDHandMotion::extractHandMotion(const HIDPathStates& pathTable, HIDParserPath* innermostPath,
                                      HIDParserPath* outermostPath, bool areTouching, bool wereTouching) {
    static const char* kSig =
        "-[HIDHandMotion extractHandMotion:innermostPath:outermostPath:areTouching:wereTouching:]";

    const HIDContact& innerCur = currentContactOf(innermostPath);
    const HIDContact& innerPrev = previousContactOf(innermostPath);
    const HIDContact& outerCur = currentContactOf(outermostPath);
    const HIDContact& outerPrev = previousContactOf(outermostPath);

    clear2DPlaneMotion(pixelDeltas_);
    clear2DPlaneMotion(velocity_);
    innermostOutermostSeparation_mm_ = 0.0f;
    innermostOutermostVerticalSeparation_mm_ = 0.0f;

    if (isValid(innermostPath, innerCur)) {
        const HIDPoint v = innermostPath->engagedVelocity();
        velocity_.x += v.x;
        velocity_.y += v.y;
        absoluteLocation_.x = innerCur.position.x;
        absoluteLocation_.y = innerCur.position.y;
        if (areTouching && isValid(innermostPath, innerPrev)) {
            const HIDPoint d = innermostPath->pixelDelta();
            pixelDeltas_.x += d.x;
            pixelDeltas_.y += d.y;
        }
    }

    if (formsPair(outermostPath, innerCur, outerCur)) {
        // The direction goes into the location's rotate, worked out when that is read.
        const HIDSeparationVector s = computeSeparationVectorWithoutDirection(innerCur, outerCur);
        const HIDPoint i = engagedVelocityOf(innermostPath);
        const HIDPoint o = outermostPath->engagedVelocity();
        // computeSeparation_mm(innerCur, outerCur), from the same difference and magnitude.
        noteSeparation_mm(s.y, s.magnitude);

        absoluteLocation_.scale = s.magnitude;
        absoluteLocation_.rotate = 0.0f;
        locationSeparation_ = HIDPoint{s.x, s.y};
        locationDirectionPending_ = true;
        // The halvings below average with whatever the innermost finger left, also when it
        // left nothing: then they hold half the outermost value, on purpose.
        absoluteLocation_.x = (outerCur.position.x + absoluteLocation_.x) * 0.5f;
        absoluteLocation_.y = (outerCur.position.y + absoluteLocation_.y) * 0.5f;
        velocity_.x = (o.x + velocity_.x) * 0.5f;
        velocity_.y = (o.y + velocity_.y) * 0.5f;

        if (s.magnitude > 0.0f) {
            const HIDPoint u{s.x / s.magnitude, s.y / s.magnitude};
            velocity_.scale = scalingFromDotProduct(u, i, o);
            velocity_.rotate = rotationFromVectorProduct(u, i, o);

            if (areTouching && wereTouching && isValid(innermostPath, innerPrev) &&
                isValid(outermostPath, outerPrev)) {
                const float previousSeparation = getVectorMagnitudeX(innerPrev.position.x - outerPrev.position.x,
                                                                     innerPrev.position.y - outerPrev.position.y);
                const HIDPoint di = innermostPath->pixelDelta();
                const HIDPoint dO = outermostPath->pixelDelta();
                pixelDeltas_.x = (dO.x + pixelDeltas_.x) * 0.5f;
                pixelDeltas_.y = (dO.y + pixelDeltas_.y) * 0.5f;
                // A change of separation in millimetres, kept in the pixel record on purpose.
                pixelDeltas_.scale = s.magnitude - previousSeparation;
                pixelDeltas_.rotate = rotationFromVectorProduct(u, di, dO);

                // One test of the log level for both lines when it is off.
                if (diagnostics_.verboseDebugEnabled()) {
                    diagnostics_.logVerbose("%s GESTURE : separation %f - previous_sep %f", kSig, s.magnitude,
                                            previousSeparation);
                    diagnostics_.logVerbose(
                        "%s GESTURE : normalized separation (%f,%f)  delta_innermost (%f,%f) "
                        "delta_outermost (%f,%f)",
                        kSig, u.x, u.y, di.x, di.y, dO.x, dO.y);
                }
            }
        }
    } else {
        absoluteLocation_.scale = 0.0f;
        absoluteLocation_.rotate = 0.0f;
        locationDirectionPending_ = false;
    }

    speedSimilarity_ = pathTable.speedSimilarity();
}

void HIDHandMotion::extractHandMotionWithResting(const HIDPathStates&, HIDParserPath* innermostPath,
                                                 HIDParserPath* outermostPath, bool areTouching,
                                                 bool wereTouching) {
    const HIDContact& innerCur = currentContactOf(innermostPath);
    const HIDContact& innerPrev = previousContactOf(innermostPath);
    const HIDContact& outerCur = currentContactOf(outermostPath);
    const HIDContact& outerPrev = previousContactOf(outermostPath);

    clear2DPlaneMotion(pixelDeltasWithResting_);

    if (isValid(innermostPath, innerCur) && areTouching && isValid(innermostPath, innerPrev)) {
        const HIDPoint d = innermostPath->pixelDelta();
        pixelDeltasWithResting_.x += d.x;
        pixelDeltasWithResting_.y += d.y;
    }

    if (formsPair(outermostPath, innerCur, outerCur)) {
        // The direction is not needed here.
        const HIDSeparationVector s = computeSeparationVectorWithoutDirection(innerCur, outerCur);
        if (s.magnitude > 0.0f && areTouching && wereTouching && isValid(innermostPath, innerPrev) &&
            isValid(outermostPath, outerPrev)) {
            const HIDPoint u{s.x / s.magnitude, s.y / s.magnitude};
            const float previousSeparation = getVectorMagnitudeX(innerPrev.position.x - outerPrev.position.x,
                                                                 innerPrev.position.y - outerPrev.position.y);
            const HIDPoint di = innermostPath->pixelDelta();
            const HIDPoint dO = outermostPath->pixelDelta();
            pixelDeltasWithResting_.x = (dO.x + pixelDeltasWithResting_.x) * 0.5f;
            pixelDeltasWithResting_.y = (dO.y + pixelDeltasWithResting_.y) * 0.5f;
            pixelDeltasWithResting_.scale = s.magnitude - previousSeparation;
            pixelDeltasWithResting_.rotate = rotationFromVectorProduct(u, di, dO);
        }
    }
}

// ---------------------------------------------------------------------------------------
// The per-frame entry

// Flattened: the steps below are inlined into this one per-frame entry.
[[gnu::flatten]] void HIDHandMotion::processHandMotion(HIDPathStates& pathTable, int32_t nTouching,
                                                       int32_t lastnTouching, uint32_t /*touchingMask*/) {
    diagnostics_.takeCopy();
    updateFingerPathMappings(pathTable);

    if (pathTable.restingThumbExists() != pathTable.restingThumbDidExist() ||
        pathTable.numTouches() != pathTable.lastNumTouches()) {
        lastMaxFingerSpeed_ = maxFingerSpeed_;
        maxFingerSpeed_ = 0.0f;
    }

    if (nTouching < 1) {
        clearHandMotion(false);
        maxInnermostOutermostVerticalSeparation_mm_ = 0.0f;
    } else {
        updateFastestFingerSpeed(pathTable);

        if (nTouching != lastnTouching) {
            clear2DPlaneMotion(smoothedVelocity_);
            clearAccumulateHandMotion();
        }

        HIDParserPath* inner = getInnermostTouchingPath(pathTable, false);
        HIDParserPath* outer = getOutermostTouchingPath(pathTable, false);
        bool areTouching = inner != nullptr && inner->isTouching() && outer != nullptr && outer->isTouching();
        bool wereTouching = inner != nullptr && inner->wasTouching() && outer != nullptr && outer->wasTouching();
        extractHandMotion(pathTable, inner, outer, areTouching, wereTouching);

        if (innermostTouchingFingerIDWithResting() == innermostTouchingFingerID() &&
            outermostTouchingFingerIDWithResting() == outermostTouchingFingerID()) {
            // Both views map a finger to the same path, so the WithResting view picked the same
            // two paths, and its extraction, the plain one's deltas under the same conditions,
            // would give exactly the deltas just worked out.
            pixelDeltasWithResting_ = pixelDeltas_;
        } else {
            HIDParserPath* innerResting = getInnermostTouchingPath(pathTable, true);
            HIDParserPath* outerResting = getOutermostTouchingPath(pathTable, true);
            areTouching = innerResting != nullptr && innerResting->isTouching() && outerResting != nullptr &&
                          outerResting->isTouching();
            wereTouching = innerResting != nullptr && innerResting->wasTouching() && outerResting != nullptr &&
                           outerResting->wasTouching();
            extractHandMotionWithResting(pathTable, innerResting, outerResting, areTouching, wereTouching);
        }

        if (nTouching == 1 && pathTable.restingThumbExists()) {
            // One finger against the resting thumb, the bottom-most path.
            const HIDParserPath* thumb = pathTable.getParserPathforPathID(pathTable.bottomDivingPathIndex());
            computeSeparation_mm(currentContactOf(inner), currentContactOf(thumb));
        }

        if (anyPixelDeltas()) tLastPixelDelta_ = pathTable.currentTimestamp();
    }

    // Runs on every frame, also with no finger touching.
    clipMotionToDominantAxes(pathTable.currentTimestamp() - pathTable.previousTimestamp());
    accumulateHandMotion();

    pathTable.setMotionDeltasResting(accumulatedDeltasWithResting_);
    pathTable.setMaxMotionDeltasResting(maxAccumPixelDeltaResting());
    printExtractedMotion(nTouching);
    pathTable.setMotionDeltas(accumulatedDeltas_);
    pathTable.setMaxMotionDeltas(maxAccumPixelDelta());
    pathTable.setSpeedSimilarity(speedSimilarity_);
    pathTable.calculateCentroidOfPaths(&handCentroid_);
}

void HIDHandMotion::updateFastestFingerSpeed(const HIDPathStates& pathTable) {
    const float currentMax = pathTable.maxFingerSpeed();
    if (maxFingerSpeed_ < currentMax) maxFingerSpeed_ = currentMax;

    const double interval_ms = ticksToMilliseconds(pathTable.frameInterval());
    // Worked out again only when the exponent changes, as frames mostly come at one interval.
    const double exponent = interval_ms / -kFingerSpeedHalfLife_ms;
    if (!(exponent == speedBlendExponent_)) {
        speedBlendPower_ = std::pow(2.0, exponent);
        speedBlendExponent_ = exponent;
    }
    const float a = static_cast<float>(speedBlendPower_);
    // Blends the running maximum with the current one, not with the previous average.
    averageMaxFingerSpeed_ = a * maxFingerSpeed_ + (1.0f - a) * currentMax;
}

HIDHandMotion::DominantAxes HIDHandMotion::smoothVelocity(double frameInterval) {
    // With a 0.03 ms time constant the weight is 1 for any ordinary frame interval, so the
    // smoothing passes the new value straight through; kept that way on purpose.
    const double interval_ms = ticksToMilliseconds(frameInterval);
    const double exponent = interval_ms / static_cast<double>(kVelocitySmoothingTimeConstant_ms);
    if (!(exponent == smoothingExponent_)) {
        smoothingPower_ = std::exp(exponent);
        smoothingExponent_ = exponent;
    }
    const float w = static_cast<float>(1.0 - smoothingPower_);

    nondominantAxesRatio_ = 1.0f;

    smoothedVelocity_.x = getWeightedAverage(w, velocity_.x, smoothedVelocity_.x);
    smoothedVelocity_.y = getWeightedAverage(w, velocity_.y, smoothedVelocity_.y);
    smoothedVelocity_.scale = getWeightedAverage(w, velocity_.scale, smoothedVelocity_.scale);
    smoothedVelocity_.rotate = getWeightedAverage(w, velocity_.rotate, smoothedVelocity_.rotate);
    // The raw velocity, not the smoothed one.
    smoothedTranslationSpeed_ =
        getWeightedAverage(w, getVectorMagnitudeX(velocity_.x, velocity_.y), smoothedTranslationSpeed_);

    float scaleWeight = 1.0f;
    float rotationWeight = 1.0f;
    computeTrackpadDominanceWeights(scaleWeight, rotationWeight);

    DominantAxes axes;
    axes.scale = scaleWeight * std::fabs(smoothedVelocity_.scale);
    axes.rotation = rotationWeight * std::fabs(smoothedVelocity_.rotate);
    axes.scaleOrRotation = axes.scale > axes.rotation ? axes.scale : axes.rotation;
    axes.translation = smoothedTranslationSpeed_;
    return axes;
}

void HIDHandMotion::clipMotionToDominantAxes(double frameInterval) {
    const DominantAxes a = smoothVelocity(frameInterval);
    const float s = a.scale;
    const float r = a.rotation;
    const float m = a.scaleOrRotation;
    const float t = a.translation;

    if (t > m) {
        // Translation dominates.
        if (t > 0.0f) nondominantAxesRatio_ = m / t;
        clippedAxes_ = ClippedAxes::Translation;
    } else {
        // Scale or rotation dominates; ties go this way.
        if (m > 0.0f) nondominantAxesRatio_ = t / m;
        pixelDeltas_.x = 0.0f;
        pixelDeltas_.y = 0.0f;
        pixelDeltasWithResting_.x = 0.0f;
        pixelDeltasWithResting_.y = 0.0f;
        if (s > r) {
            clippedAxes_ = ClippedAxes::Scale;
            pixelDeltas_.rotate = 0.0f;
            pixelDeltasWithResting_.rotate = 0.0f;
        } else if (r > s) {
            clippedAxes_ = ClippedAxes::Rotation;
            pixelDeltas_.scale = 0.0f;
            pixelDeltasWithResting_.scale = 0.0f;
        } else {
            clippedAxes_ = ClippedAxes::ScaleAndRotation;
        }
    }
}

HIDMotion HIDHandMotion::smoothedClippedVelocity() const {
    if (clippedAxes_ == ClippedAxes::Kept) return smoothedClippedVelocity_;
    HIDMotion v = smoothedVelocity_;
    if (clippedAxes_ == ClippedAxes::Translation) {
        v.scale = 0.0f;
        v.rotate = 0.0f;
    } else {
        v.x = 0.0f;
        v.y = 0.0f;
        if (clippedAxes_ == ClippedAxes::Scale) v.rotate = 0.0f;
        if (clippedAxes_ == ClippedAxes::Rotation) v.scale = 0.0f;
    }
    v.x = applyDeadZone(v.x);
    v.y = applyDeadZone(v.y);
    v.scale = applyDeadZone(v.scale);
    v.rotate = applyDeadZone(v.rotate);
    return v;
}

void HIDHandMotion::clipMotionToDominantAxesLiteral(double frameInterval) {
    const DominantAxes a = smoothVelocity(frameInterval);
    const float s = a.scale;
    const float r = a.rotation;
    const float m = a.scaleOrRotation;
    const float t = a.translation;

    smoothedClippedVelocity_ = smoothedVelocity_;
    clippedAxes_ = ClippedAxes::Kept;

    if (t > m) {
        // Translation dominates.
        if (t > 0.0f) nondominantAxesRatio_ = m / t;
        smoothedClippedVelocity_.scale = 0.0f;
        smoothedClippedVelocity_.rotate = 0.0f;
    } else {
        // Scale or rotation dominates; ties go this way.
        if (m > 0.0f) nondominantAxesRatio_ = t / m;
        smoothedClippedVelocity_.x = 0.0f;
        smoothedClippedVelocity_.y = 0.0f;
        pixelDeltas_.x = 0.0f;
        pixelDeltas_.y = 0.0f;
        pixelDeltasWithResting_.x = 0.0f;
        pixelDeltasWithResting_.y = 0.0f;
        if (s > r) {
            smoothedClippedVelocity_.rotate = 0.0f;
            pixelDeltas_.rotate = 0.0f;
            pixelDeltasWithResting_.rotate = 0.0f;
        } else if (r > s) {
            smoothedClippedVelocity_.scale = 0.0f;
            pixelDeltas_.scale = 0.0f;
            pixelDeltasWithResting_.scale = 0.0f;
        }
    }

    smoothedClippedVelocity_.x = applyDeadZone(smoothedClippedVelocity_.x);
    smoothedClippedVelocity_.y = applyDeadZone(smoothedClippedVelocity_.y);
    smoothedClippedVelocity_.scale = applyDeadZone(smoothedClippedVelocity_.scale);
    smoothedClippedVelocity_.rotate = applyDeadZone(smoothedClippedVelocity_.rotate);
}

void HIDHandMotion::computeTrackpadDominanceWeights(float& scaleDominanceWeight,
                                                    float& rotationDominanceWeight) const {
    const float d = innermostOutermostSeparation_mm_;
    float weight = kNarrowDominanceWeight;
    if (d > kWideSeparation_mm) {
        weight = kWideDominanceWeight;
    } else if (d > kNarrowSeparation_mm) {
        weight = (d - kNarrowSeparation_mm) / kDominanceRamp_mm + kNarrowDominanceWeight;
    }
    scaleDominanceWeight = weight;
    rotationDominanceWeight = weight;

    // Fingers closing while the hand moves toward the diving-button edge count less as a
    // pinch: the scale weight is divided by a factor between 1 and 2.
    const HIDMotion& v = smoothedVelocity_;
    if (v.scale < 0.0f && v.y > 0.0f) {
        const float g = v.y - v.scale;
        const float h = std::fabs(v.x) + std::fabs(v.rotate);
        if (g > 0.0f && h < g) {
            const float r = h / g;
            scaleDominanceWeight = scaleDominanceWeight / (2.0f - r * r);
        }
    }
}

void HIDHandMotion::accumulateHandMotion() {
    accumulatedDeltas_.x += std::fabs(pixelDeltas_.x);
    accumulatedDeltas_.y += std::fabs(pixelDeltas_.y);
    accumulatedDeltas_.scale = static_cast<float>(std::fma(static_cast<double>(std::fabs(pixelDeltas_.scale)),
                                                           static_cast<double>(speedSimilarity_),
                                                           static_cast<double>(accumulatedDeltas_.scale)));
    accumulatedDeltas_.rotate = static_cast<float>(std::fma(static_cast<double>(std::fabs(pixelDeltas_.rotate)),
                                                            static_cast<double>(speedSimilarity_),
                                                            static_cast<double>(accumulatedDeltas_.rotate)));

    accumulatedDeltasWithResting_.x += std::fabs(pixelDeltasWithResting_.x);
    accumulatedDeltasWithResting_.y += std::fabs(pixelDeltasWithResting_.y);
    accumulatedDeltasWithResting_.scale += std::fabs(pixelDeltasWithResting_.scale);
    accumulatedDeltasWithResting_.rotate += std::fabs(pixelDeltasWithResting_.rotate);

    diagnostics_.logVerbose("%s AccumMotion %f x %f y %f scale %f rotate speedSimilarity %f",
                            "-[HIDHandMotion accumulateHandMotion]", accumulatedDeltas_.x, accumulatedDeltas_.y,
                            accumulatedDeltas_.scale, accumulatedDeltas_.rotate, speedSimilarity_);
}

void HIDHandMotion::clearAccumulateHandMotion() {
    clear2DPlaneMotion(accumulatedDeltas_);
    clear2DPlaneMotion(accumulatedDeltasWithResting_);
    diagnostics_.logVerbose("%s AccumMotion %f x %f y %f scale %f rotate", "-[HIDHandMotion clearAccumulateHandMotion]",
                            accumulatedDeltas_.x, accumulatedDeltas_.y, accumulatedDeltas_.scale,
                            accumulatedDeltas_.rotate);
}

void HIDHandMotion::resetAccumulateHandMotion() {
    // The WithResting sum keeps running, on purpose.
    clear2DPlaneMotion(accumulatedDeltas_);
    diagnostics_.logVerbose("%s AccumMotion %f x %f y %f scale %f rotate", "-[HIDHandMotion resetAccumulateHandMotion]",
                            accumulatedDeltas_.x, accumulatedDeltas_.y, accumulatedDeltas_.scale,
                            accumulatedDeltas_.rotate);
}

void HIDHandMotion::clearHandMotion(bool clearLocation) {
    if (clearLocation) {
        clear2DPlaneMotion(absoluteLocation_);
        locationDirectionPending_ = false;
        handCentroid_ = HIDPoint{0.0f, 0.0f};
        tLastPixelDelta_ = 0.0;
    }
    clear2DPlaneMotion(pixelDeltas_);
    clear2DPlaneMotion(pixelDeltasWithResting_);
    clear2DPlaneMotion(velocity_);
    clear2DPlaneMotion(smoothedVelocity_);
    clear2DPlaneMotion(smoothedClippedVelocity_);
    clippedAxes_ = ClippedAxes::Kept;
    clear2DPlaneMotion(accumulatedDeltas_);
    clear2DPlaneMotion(accumulatedDeltasWithResting_);
    smoothedTranslationSpeed_ = 0.0f;
    startedWithTwoWidelySeparatedFingers_ = false;
    clearFingerPathMappings();
}

void HIDHandMotion::printExtractedMotion(int numFingers) const {
    static const char* kSig = "-[HIDHandMotion printExtractedMotion:]";
    // One test of the log level for both lines when it is off.
    if (!diagnostics_.verboseDebugEnabled()) return;
    const HIDMotion clipped = smoothedClippedVelocity();
    diagnostics_.logVerbose("%s Motion %dM, %d<-->%d\n", kSig, numFingers, innermostTouchingFingerID(),
                            outermostTouchingFingerID());
    diagnostics_.logVerbose(
        "%s Motion \t%4.2fdx %4.2fdy %4.2fds %4.2fdr | %5.3f/%5.3fvx %5.3f/%5.3fvy %5.3f/%5.3fvs "
        "%5.3f/%5.3fvr\n",
        kSig, pixelDeltas_.x, pixelDeltas_.y, pixelDeltas_.scale, pixelDeltas_.rotate, clipped.x, velocity_.x,
        clipped.y, velocity_.y, clipped.scale, velocity_.scale, clipped.rotate, velocity_.rotate);
}

}  // namespace orvane
