#include "HIDParserPath.h"

#include <cmath>

#include "common/TickConversion.h"
#include "filter/FilterLogging.h"

namespace orvane {

namespace {

// How far (surface units) a finger may wander before its steadied UI position follows.
constexpr float kHysteresisRadius_mm = 0.05f;
// The extra step a moved hysteresis centre takes so it never repeats the previous value.
constexpr double kHysteresisMinimumIncrement_mm = 0.025;
// The damped velocity loses half its old weight every this many milliseconds.
constexpr double kDampingHalfLife_ms = 14.0;
// Strong damping halves the damped velocity before the decay step.
constexpr float kStrongDampingFactor = 0.5f;
// A transducer of this type is a hand or palm, not a finger.
constexpr int64_t kPalmTransducerType = 3;

float lengthOf(HIDPoint p) { return sqrtf(p.x * p.x + p.y * p.y); }

constexpr const char* kFilterSignature = "-[HIDParserPath filterContactForScreenUI:]";

// The diagnostics of the screen-UI filter, out of its way: each is called when the diagnostics
// are enabled and logs what logVerbose would.
__attribute__((noinline, cold)) void logHysteresisMove(HIDPoint center, HIDPoint oldCenter, int32_t pathID) {
    LoggingServiceFilterVerbose()->log(LogLevel::Debug,
                                       "%s hysteresis center (%f,%f), pulled_hysteresis_center (%f,%f) path_id %d",
                                       kFilterSignature, center.x, center.y, oldCenter.x, oldCenter.y, pathID);
}

__attribute__((noinline, cold)) void logFilteredContact(const HIDContact& cur, const HIDContact& prev,
                                                        HIDPoint pixelDelta) {
    LoggingServiceFilterVerbose()->log(
        LogLevel::Debug, "%s Current position (%f,%f), Previous position (%f,%f) pixel delta (%f, %f) path_id %d",
        kFilterSignature, cur.position.x, cur.position.y, prev.position.x, prev.position.y, pixelDelta.x,
        pixelDelta.y, cur.path_id);
}

}  // namespace

float HIDParserPath::engagedSpeed() const { return engagedSpeedIsLength_ ? lengthOf(engagedVelocity_) : engagedSpeed_; }

void HIDParserPath::setEngagedVelocity(HIDPoint value) {
    engagedSpeed_ = engagedSpeed();
    engagedSpeedIsLength_ = false;
    engagedVelocity_ = value;
}

HIDParserPath::HIDParserPath(float height, float width)
    : surfaceDimensions_{width, height}, bounds_(EdgeBounds::of(surfaceDimensions_)) {}

void HIDParserPath::setPeakDisplacement() {
    link_.markDirty();
    raisePeakDisplacement();
}

inline void HIDParserPath::raisePeakDisplacement() {
    const HIDPoint d{currentContact_.position.x - initialPosition_.x, currentContact_.position.y - initialPosition_.y};
    const float distance = lengthOf(d);
    link_.marks->diagnostics.logVerbose("%s initial position (%f, %f) current (%f, %f)",
                                        "-[HIDParserPath setPeakDisplacement]", initialPosition_.x, initialPosition_.y,
                                        currentContact_.position.x, currentContact_.position.y);
    if (distance > peakDisplacement_) peakDisplacement_ = distance;
}

void HIDParserPath::readContact(const HIDEvent& contact, double time) {
    link_.markDirty();
    previousContact_ = currentContact_;
    currentContact_.device_timestamp = time;

    currentContact_.fingerConfidence =
        contact.integerValueForField(kHIDEventFieldDigitizerType) != kPalmTransducerType ? 1 : 0;
    currentContact_.fingerTipSwitch = static_cast<int32_t>(contact.integerValueForField(kHIDEventFieldDigitizerTouch));
    const int32_t index = static_cast<int32_t>(contact.integerValueForField(kHIDEventFieldDigitizerIndex));
    // The finger ID is one more than the path ID, on purpose.
    currentContact_.path_id = index + 1;
    currentContact_.finger_id = index + 2;
    link_.noteID(currentContact_.path_id);

    const float x = static_cast<float>(contact.doubleValueForField(kHIDEventFieldDigitizerX));
    const float y = static_cast<float>(contact.doubleValueForField(kHIDEventFieldDigitizerY));
    currentContact_.position.x = x * surfaceDimensions_.x;
    // Flipped, so that a larger y lies nearer the diving-button edge.
    currentContact_.position.y = (1 - y) * surfaceDimensions_.y;

    // Without a previous position the velocity keeps the value it already had.
    if (previousContact_.position.x != 0 && previousContact_.position.y != 0) {
        currentContact_.velocity.x = currentContact_.position.x - previousContact_.position.x;
        currentContact_.velocity.y = currentContact_.position.y - previousContact_.position.y;
    }

    if (previousContact_.fingerTipSwitch == 0) {
        initialPosition_ = currentContact_.position;
        longTermPosition_ = currentContact_.position;
        peakDisplacement_ = 0.0f;
    }
}

void HIDParserPath::updateCurPrevContactsWith(const HIDEvent& contact, double time) {
    readContact(contact, time);
    // The table is marked by the reading for the whole step.
    raisePeakDisplacement();
    updatePathStageTimestamps(time);
}

void HIDParserPath::updateCurPrevContactsWithLiteral(const HIDEvent& contact, double time) {
    readContact(contact, time);
    setPeakDisplacement();
    updatePathStageTimestamps(time);
}

void HIDParserPath::setRestingContact(bool resting) { isResting_ = resting; }

void HIDParserPath::setRestingInThumbZone(bool resting) {
    wasRestingInThumbZone_ = isRestingInThumbZone_;
    isRestingInThumbZone_ = resting;
}

void HIDParserPath::clearPathSpeedSymmetry() { _2F_speed_symmetry_ = 0.0f; }

void HIDParserPath::updatePathStageTimestamps(double time) {
    if (currentContact_.fingerTipSwitch == 1 && previousContact_.fingerTipSwitch == 0) {
        timestamps_.t_makeTouch = time;
    } else if (timestamps_.t_makeTouch >= timestamps_.t_breakTouch && currentContact_.fingerTipSwitch == 0 &&
               previousContact_.fingerTipSwitch == 1) {
        timestamps_.t_breakTouch = time;
    }
}

bool HIDParserPath::applyMinimumIncrementHysteresis(float value, float& center, float prevValueQuantized,
                                                    float hysteresisRadius) {
    const float diff = value - center;
    float newCenter;
    bool rose;
    if (diff > hysteresisRadius) {
        newCenter = value - hysteresisRadius;
        rose = true;
    } else if (diff < -hysteresisRadius) {
        newCenter = value + hysteresisRadius;
        rose = false;
    } else {
        return false;
    }
    // A moved centre never repeats the previous quantized value: it steps on a little further.
    if (newCenter == prevValueQuantized) {
        newCenter = static_cast<float>(rose ? newCenter + kHysteresisMinimumIncrement_mm
                                            : newCenter - kHysteresisMinimumIncrement_mm);
    }
    center = newCenter;
    return true;
}

bool HIDParserPath::applyAbsolutePixelHysteresis(HIDPoint value, HIDPoint& hysteresisCenter,
                                                 HIDPoint prevValueQuantized, float hysteresisRadius) {
    // Both axes always run.
    const bool movedX =
        applyMinimumIncrementHysteresis(value.x, hysteresisCenter.x, prevValueQuantized.x, hysteresisRadius);
    const bool movedY =
        applyMinimumIncrementHysteresis(value.y, hysteresisCenter.y, prevValueQuantized.y, hysteresisRadius);
    return movedX || movedY;
}

void HIDParserPath::updateDampedVelocity(bool strongDamping) {
    link_.markDirty();
    dampVelocity(strongDamping);
}

void HIDParserPath::updateDampingWeights(float dt) {
    const double dt_ms = ticksToMilliseconds(static_cast<double>(dt));
    const double exponent = -dt_ms / kDampingHalfLife_ms;
    dampingKeep_ = static_cast<float>(std::pow(2.0, exponent));
    dampingInterval_ = dt;
}

inline void HIDParserPath::dampVelocity(bool strongDamping) {
    const bool lifted = isMakeStage();
    if (lifted || strongDamping) {
        const float factor = lifted ? 0.0f : kStrongDampingFactor;
        dampedVelocity_.x *= factor;
        dampedVelocity_.y *= factor;
        dampedSpeed_ *= factor;
    }

    const float dt = previousContact_.device_timestamp == 0
                         ? 0.0f
                         : static_cast<float>(currentContact_.device_timestamp - previousContact_.device_timestamp);
    // Frames mostly come at one interval, so the weights are worked out again only when the
    // interval changes: one interval always gives one exponent, and 2 to the power of 0 and
    // of -0 are both 1. A NaN interval equals nothing and is worked out every time.
    if (!(dt == dampingInterval_)) [[unlikely]] updateDampingWeights(dt);

    const float k = dampingKeep_;
    dampedVelocity_.x = dampedVelocity_.x * k + currentContact_.velocity.x * (1 - k);
    dampedVelocity_.y = dampedVelocity_.y * k + currentContact_.velocity.y * (1 - k);
    dampedSpeed_ = lengthOf(dampedVelocity_);
}

void HIDParserPath::filterContactForScreenUI(bool strongDamping) {
    link_.markDirty();
    HIDContact& cur = currentContact_;
    const HIDContact& prev = previousContact_;

    // The conditions of filterContactForScreenUILiteral, the cheaper ones asked first.
    const bool isNew = cur.fingerTipSwitch == 1 && prev.fingerTipSwitch == 0;
    if (cur.fingerTipSwitch != 0 && cur.path_id == prev.path_id && !isNew &&
        (cur.position.x != 0 || cur.position.y != 0) && (prev.position.x != 0 || prev.position.y != 0)) {
        const HIDPoint oldCenter = hysteresisCenter_;
        applyAbsolutePixelHysteresis(cur.position, hysteresisCenter_, prev.position, kHysteresisRadius_mm);
        if (link_.marks->diagnostics.verboseDebugEnabled()) [[unlikely]]
            logHysteresisMove(hysteresisCenter_, oldCenter, cur.path_id);
        pixelDelta_.x = hysteresisCenter_.x - oldCenter.x;
        pixelDelta_.y = hysteresisCenter_.y - oldCenter.y;
        cumulativeDeltas_.x += pixelDelta_.x;
        cumulativeDeltas_.y += pixelDelta_.y;
        // Every later stage sees the steadied position.
        cur.position = hysteresisCenter_;
    } else {
        previousStablePositionForUI_ = stablePositionForUI_;
        hysteresisCenter_ = cur.position;
        stablePositionForUI_ = cur.position;
        pixelDelta_ = HIDPoint{0.0f, 0.0f};
        cumulativeDeltas_ = HIDPoint{0.0f, 0.0f};
        initialPosition_ = cur.position;
        longTermPosition_ = cur.position;
    }

    engagedVelocity_ = cur.velocity;
    engagedSpeedIsLength_ = true;
    // The table is marked above for the whole filter.
    dampVelocity(strongDamping);
    if (link_.marks->diagnostics.verboseDebugEnabled()) [[unlikely]]
        logFilteredContact(cur, prev, pixelDelta_);
}

void HIDParserPath::filterContactForScreenUILiteral(bool strongDamping) {
    link_.markDirty();
    static constexpr const char* kSignature = kFilterSignature;
    HIDContact& cur = currentContact_;
    const HIDContact& prev = previousContact_;

    const bool isNew = cur.fingerTipSwitch == 1 && prev.fingerTipSwitch == 0;
    const bool hasPosition = cur.position.x != 0 || cur.position.y != 0;
    const bool hadPosition = prev.position.x != 0 || prev.position.y != 0;
    if (!isNew && hasPosition && hadPosition && cur.path_id == prev.path_id && cur.fingerTipSwitch != 0) {
        const HIDPoint oldCenter = hysteresisCenter_;
        applyAbsolutePixelHysteresis(cur.position, hysteresisCenter_, prev.position, kHysteresisRadius_mm);
        logVerbose("%s hysteresis center (%f,%f), pulled_hysteresis_center (%f,%f) path_id %d", kSignature,
                   hysteresisCenter_.x, hysteresisCenter_.y, oldCenter.x, oldCenter.y, cur.path_id);
        pixelDelta_.x = hysteresisCenter_.x - oldCenter.x;
        pixelDelta_.y = hysteresisCenter_.y - oldCenter.y;
        cumulativeDeltas_.x += pixelDelta_.x;
        cumulativeDeltas_.y += pixelDelta_.y;
        // Every later stage sees the steadied position.
        cur.position = hysteresisCenter_;
    } else {
        previousStablePositionForUI_ = stablePositionForUI_;
        hysteresisCenter_ = cur.position;
        stablePositionForUI_ = cur.position;
        pixelDelta_ = HIDPoint{0.0f, 0.0f};
        cumulativeDeltas_ = HIDPoint{0.0f, 0.0f};
        initialPosition_ = cur.position;
        longTermPosition_ = cur.position;
    }

    engagedVelocity_ = cur.velocity;
    engagedSpeed_ = lengthOf(cur.velocity);
    engagedSpeedIsLength_ = false;
    updateDampedVelocityLiteral(strongDamping);
    logVerbose("%s Current position (%f,%f), Previous position (%f,%f) pixel delta (%f, %f) path_id %d", kSignature,
               cur.position.x, cur.position.y, prev.position.x, prev.position.y, pixelDelta_.x, pixelDelta_.y,
               cur.path_id);
}

void HIDParserPath::updateDampedVelocityLiteral(bool strongDamping) {
    link_.markDirty();
    const bool lifted = isMakeStage();
    if (lifted || strongDamping) weakenDampedVelocity(lifted ? 0.0f : kStrongDampingFactor);

    const float dt = previousContact_.device_timestamp == 0
                         ? 0.0f
                         : static_cast<float>(currentContact_.device_timestamp - previousContact_.device_timestamp);
    const double dt_ms = ticksToMilliseconds(static_cast<double>(dt));
    const double exponent = -dt_ms / kDampingHalfLife_ms;
    const float k = static_cast<float>(std::pow(2.0, exponent));

    dampedVelocity_.x = dampedVelocity_.x * k + currentContact_.velocity.x * (1 - k);
    dampedVelocity_.y = dampedVelocity_.y * k + currentContact_.velocity.y * (1 - k);
    dampedSpeed_ = lengthOf(dampedVelocity_);
}

void HIDParserPath::weakenDampedVelocity(float factor) {
    link_.markDirty();
    dampedVelocity_.x *= factor;
    dampedVelocity_.y *= factor;
    dampedSpeed_ *= factor;
}

bool HIDParserPath::fingerLiftoffNearEdgeframeInterval() const {
    if (isTouching() || !wasTouching() || !wasFingerOrRestingContact()) return false;
    const double dt = currentContact_.device_timestamp - previousContact_.device_timestamp;
    // A per-frame velocity times a tick interval: the units are mixed on purpose.
    const float predictedY = static_cast<float>(static_cast<double>(previousContact_.velocity.y) * dt +
                                                static_cast<double>(previousContact_.position.y));
    // Heading out through the bottom quarter of the surface.
    return predictedY <= surfaceDimensions_.y * 0.25;
}

void HIDParserPath::clear() {
    // The flags, the engaged velocity and speed, the ellipse offset, the speed symmetry and the
    // stage times survive a clear on purpose.
    currentContact_ = HIDContact{};
    link_.noteID(0);
    previousContact_ = HIDContact{};
    dampedVelocity_ = HIDPoint{0.0f, 0.0f};
    dampedSpeed_ = 0.0f;
    peakDisplacement_ = 0.0f;
    initialPosition_ = HIDPoint{0.0f, 0.0f};
    longTermPosition_ = HIDPoint{0.0f, 0.0f};
    stablePositionForUI_ = HIDPoint{0.0f, 0.0f};
    previousStablePositionForUI_ = HIDPoint{0.0f, 0.0f};
    hysteresisCenter_ = HIDPoint{0.0f, 0.0f};
    pixelDelta_ = HIDPoint{0.0f, 0.0f};
    cumulativeDeltas_ = HIDPoint{0.0f, 0.0f};
    link_.markClear();
}

void HIDParserPath::clearTimestamps(HIDPathTimestamps& timestamps) {
    // t_cleanStartInRange is left as it was, on purpose.
    timestamps.t_startInRange = 0.0;
    timestamps.t_makeTouch = 0.0;
    timestamps.t_startHover = 0.0;
    timestamps.t_endHover = 0.0;
    timestamps.t_breakTouch = 0.0;
    timestamps.t_endOutRange = 0.0;
}

}  // namespace orvane
