#include "HIDPathStates.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <limits>

#include "filter/FilterLogging.h"

namespace orvane {

namespace {

constexpr int kFirstPathID = 1;
constexpr int kLastPathID = 14;

// The path ID a contact names: its 32-bit index plus one. The largest index names no path
// (0) instead of overflowing.
int pathIDOfContact(const HIDEvent& contact) {
    const int32_t index = static_cast<int32_t>(contact.integerValueForField(kHIDEventFieldDigitizerIndex));
    return index == std::numeric_limits<int32_t>::max() ? 0 : index + 1;
}

constexpr int kMaxPaths = 14;
constexpr size_t kMaxCosines = kMaxPaths * (kMaxPaths - 1) / 2;

// The thumb rest zone starts this far down the surface (a larger y lies nearer the
// diving-button edge); a thumb above it is not taken for a resting one.
constexpr double kThumbRestZoneFraction = 0.45;
// A button change is acted on by the resting-thumb check only this soon after it was
// noticed (frame-clock ticks, so in practice within the frame that noticed it).
constexpr double kButtonChangeReactionWindow_ticks = 0.1;
// Three or more fingers away from the edges are a hand at work, not a resting thumb.
constexpr int kMaxNonEdgeTouchesForRestingThumb = 3;

// Two fingers alone on the surface and both slower than 1 mm per frame count three times
// as symmetric.
constexpr float kSlowFingerSpeed_mm = 1.0f;
constexpr float kSlowPairSymmetryBoost = 3.0f;

// Average velocities below this are treated as standing still.
constexpr float kStillFingerSpeed_mm_s = 1.0f;

// Break-out of the thumb zone: the thumb moves with the other fingers.
// The fractional thresholds are compared in double against the single-precision values.
constexpr double kBreakOutMinSymmetry = 0.6;
constexpr float kBreakOutMaxHandMotion_mm = 55.0f;
constexpr float kBreakOutMinHandMotionLow_mm = 10.0f;
constexpr float kBreakOutLowBoundary_mm = 450.0f;   // absolute surface position, not a fraction
constexpr double kBreakOutMinSimilarityAboveBoundary = 0.3;  // pinch or turn, thumb farther from the edge
constexpr double kBreakOutMinSimilarityBelowBoundary = 0.6;  // pinch or turn, thumb nearer the edge
constexpr float kTranslationBreakOutBoundary_mm = 400.0f;  // absolute surface position
constexpr double kTranslationBreakOutMinSymmetry = 0.8;
constexpr double kTranslationBreakOutMinSimilarity = 0.7;

// The float length of a vector, as the cosines and the similarity use it.
float lengthOf(HIDPoint p) { return sqrtf(p.x * p.x + p.y * p.y); }

// The velocity length by which the other fingers are ordered: computed in double, compared as float.
float sortLengthOf(HIDPoint p) {
    const double x = p.x;
    const double y = p.y;
    return static_cast<float>(std::sqrt(x * x + y * y));
}

// The cosine of the angle between two velocities as getCosineThetas works it out.
float cosineBetween(HIDPoint a, HIDPoint b) {
    const float lengthA = lengthOf(a);
    const float lengthB = lengthOf(b);
    if (lengthA == 0.0f || lengthB == 0.0f) return 1.0f;
    const double dot = static_cast<double>(a.x) * b.x + static_cast<double>(a.y) * b.y;
    const double lengths = static_cast<double>(lengthA) * static_cast<double>(lengthB);
    return static_cast<float>(dot / lengths);
}

// Orders velocities by sortLengthOf, keeping the order of equal lengths. Any stable sort
// gives the same order when no length is NaN, and an insertion sort needs no buffer from the
// heap; with a NaN among them the order depends on the algorithm, so the library's is used.
void stableSortByLength(HIDPoint* first, HIDPoint* last) {
    const auto shorter = [](HIDPoint a, HIDPoint b) { return sortLengthOf(a) < sortLengthOf(b); };
    for (const HIDPoint* p = first; p != last; ++p) {
        if (std::isnan(sortLengthOf(*p))) {
            std::stable_sort(first, last, shorter);
            return;
        }
    }
    for (HIDPoint* i = first + (first != last ? 1 : 0); i < last; ++i) {
        const HIDPoint v = *i;
        HIDPoint* j = i;
        for (; j != first && shorter(v, *(j - 1)); --j) *j = *(j - 1);
        *j = v;
    }
}

}  // namespace

void HIDPathStates::updateButtonState(const HIDEventRef& frame) {
    frameDiagnostics().logVerbose("%s _previous button state %d ", "-[HIDPathStates updateButtonState:]",
                                  previousButtonState_);
    // Compares the two values the previous frame left, so a change read in one frame is
    // time-stamped with the next frame's time; the one-frame lag is intended.
    if (previousButtonState_ != buttonState_) {
        divingButtonChangeTimestamp_ = currentTimestamp();
        handledDivingButtonStateChange_ = false;
    }
    previousButtonState_ = buttonState_;
    buttonState_ = frame ? static_cast<int>(frame->integerValueForField(kHIDEventFieldDigitizerButtonMask)) : 0;
}

bool HIDPathStates::buttonStateChanged() {
    if (previousButtonState_ == buttonState_) return false;
    divingButtonChangeTimestamp_ = currentTimestamp();
    handledDivingButtonStateChange_ = false;
    return true;
}

bool HIDPathStates::makeOrBreakTouchHappened(const HIDEventRef&) const {
    return forEachPathByID(
        [](const HIDParserPath* path, int) { return path->isMakeStage() || path->isLiftOffStage(); });
}

void HIDPathStates::updateDivingBoardDisplacements() { updateDivingBoardDisplacements(nullptr); }

void HIDPathStates::updateDivingBoardDisplacements(bool* makeOrBreak) {
    earliestNonDivingTimestamp_ = 0.0;
    const int bottom = bottomDivingPathIndex();
    forEachPathByID([this, bottom, makeOrBreak](const HIDParserPath* path, int id) {
        if (makeOrBreak && (path->isMakeStage() || path->isLiftOffStage())) *makeOrBreak = true;
        if (!path->isTouching() || !path->isFingerContact() || id == bottom) return;
        const double tMake = path->timestamps().t_makeTouch;
        if (earliestNonDivingTimestamp_ == 0.0 || tMake < earliestNonDivingTimestamp_) earliestNonDivingTimestamp_ = tMake;
    });
}

[[gnu::flatten]] void HIDPathStates::postFilteringTasks(const HIDEventRef& frame) {
    // Whether a finger touched down or lifted is seen in the walk of the resting-thumb check:
    // nothing between the two changes a contact.
    bool makeOrBreak = false;
    checkForRestingThumb(&makeOrBreak);
    // One walk sets the thumb-zone flags, gathers the fingers for the speed symmetries and
    // their speed range for the similarity: each reads nothing the others write.
    SpeedSymmetryFingers gathered;
    SpeedRange range;
    forEachPathByID([&](HIDParserPath* path, int id) {
        // The thumb-zone decision never changes in a frame where a finger touches down or lifts.
        if (!makeOrBreak && !path->isNoTrackingStage()) setThumbZoneFlag(path, id);
        gathered.add(path, id);
        range.add(path);
    });
    gathered.finish(frameDiagnostics());
    const float similarity = range.similarity();
    breakOutOfRestingThumb(&similarity);
    setRestingFlag(frame);
    calculateNewHandCenter(frame);
}

void HIDPathStates::setThumbZoneFlag(HIDParserPath* path, int id) {
    const bool resting =
        restingThumbExists_ && id == bottomDivingPathIndex() && !(engagedinGesture_ && numTouches() == 2);
    path->setIsRestingInThumbZone(resting);
    frameDiagnostics().logVerbose("%s restingthumexists %d divingpathID %d pathID %d isRestingthumbinzone %d",
                                  "-[HIDPathStates postFilteringTasks:]", restingThumbExists_, bottomDivingPathIndex(),
                                  id, path->isRestingInThumbZone());
}

void HIDPathStates::postFilteringTasksOneByOne(const HIDEventRef& frame) {
    checkForRestingThumb();
    if (!makeOrBreakTouchHappened(frame)) {
        forEachPathByIDOneByOne([this](HIDParserPath* path, int id) {
            if (!path->isNoTrackingStage()) setThumbZoneFlag(path, id);
        });
    }
    updateSpeedSymmetriesOfAllPathsOneByOne();
    breakOutOfRestingThumbBasedOnSymmetry();
    setRestingFlag(frame);
    calculateNewHandCenter(frame);
}

void HIDPathStates::setRestingFlag(const HIDEventRef& frame) {
    if (!frame) return;
    for (const HIDEventRef& child : frame->children()) {
        const int id = pathIDOfContact(*child);
        const HIDParserPath* path = getParserPathforPathID(id);
        if (path && path->isRestingInThumbZone() && path->isTouching() && path->wasTouching()) {
            const int64_t mask = child->integerValueForField(kHIDEventFieldDigitizerEventMask);
            child->setIntegerValue(mask | kHIDDigitizerEventResting, kHIDEventFieldDigitizerEventMask);
            frameDiagnostics().logVerbose("%s restingthumb path index %d eventmask %d",
                                          "-[HIDPathStates setRestingFlag:]", id, static_cast<int>(mask));
        }
        // Asked first, so the mask is read back only for the diagnostics.
        if (frameDiagnostics().verboseDebugEnabled()) {
            frameDiagnostics().logVerbose(
                "%s after eventmask %d path index %d", "-[HIDPathStates setRestingFlag:]",
                static_cast<int>(child->integerValueForField(kHIDEventFieldDigitizerEventMask)), id);
        }
    }
}

float HIDPathStates::getMaxThumbRestingHeight(const HIDParserPath* path) const {
    if (!path) return 0.0f;
    return static_cast<float>(kThumbRestZoneFraction * static_cast<double>(path->surfaceDimensions().y));
}

void HIDPathStates::checkForRestingThumb() { checkForRestingThumb(nullptr); }

void HIDPathStates::checkForRestingThumb(bool* makeOrBreak) {
    restingThumbDidExist_ = restingThumbExists_;
    restingThumbExists_ = false;
    updateDivingBoardDisplacements(makeOrBreak);

    const int bottom = bottomDivingPathIndex();
    if (bottom < 1) return;
    HIDParserPath* thumb = getParserPath(bottom);
    const double tMake = thumb ? thumb->timestamps().t_makeTouch : 0.0;
    frameDiagnostics().logVerbose("%s possibly diving path %d", "-[HIDPathStates checkForRestingThumb]", bottom);

    // Another finger touches, and not three or more away from the edges.
    const bool otherFingerTouches =
        earliestNonDivingTimestamp_ > 0.0 && numNonEdgeTouches() < kMaxNonEdgeTouchesForRestingThumb;
    const float restZoneStart = getMaxThumbRestingHeight(thumb);
    const float thumbY = thumb ? thumb->currentContact().position.y : 0.0f;
    const bool thumbLike = otherFingerTouches && (thumbY < restZoneStart || numFingersOnDivingButton() == 1);
    const bool buttonDown = buttonState_ != 0;
    const double now = currentTimestamp();

    // A release of the button re-arms the thumb timer, once per noticed change.
    if (!handledDivingButtonStateChange_ && now - divingButtonChangeTimestamp_ < kButtonChangeReactionWindow_ticks) {
        if (buttonState_ == 0 && thumb) thumb->setThumbMovementTimedOut(false);
        handledDivingButtonStateChange_ = true;
    }

    // Exactly the frame of the later of the two touch-downs: an exact comparison, on purpose.
    if (now - std::max(tMake, earliestNonDivingTimestamp_) == 0.0 && thumb) {
        thumb->setThumbAboveTRZOnTouchdown(thumb->currentContact().position.y < restZoneStart);
    }

    const bool pressedWithOtherFinger = buttonDown && otherFingerTouches;
    const bool thumbAboveZone = thumb && thumb->thumbAboveTRZOnTouchdown();
    bool restedInZone = false;
    if (thumbLike) {
        if ((!thumbAboveZone || pressedWithOtherFinger) && thumb) thumb->setThumbMovementTimedOut(true);
        restedInZone = !thumbAboveZone;
    } else if (pressedWithOtherFinger && thumb) {
        thumb->setThumbMovementTimedOut(true);
    }

    const bool timedOut = thumb && thumb->thumbMovementTimedOut();
    if ((thumbLike && restedInZone) || (buttonDown && otherFingerTouches) ||
        (!buttonDown && timedOut && otherFingerTouches)) {
        restingThumbExists_ = true;
        frameDiagnostics().logVerbose("%s RESTING THUMB divingpathID %d", "-[HIDPathStates checkForRestingThumb]",
                                      bottom);
    }
}

void HIDPathStates::updateSpeedSymmetriesOfAllPaths() {
    // The touching fingers are gathered once; each one's symmetry is then worked out against
    // the others of the same list, which is what asking every path in turn would gather.
    SpeedSymmetryFingers gathered;
    forEachPathByID([&gathered](HIDParserPath* path, int id) { gathered.add(path, id); });
    gathered.finish(frameDiagnostics());
}

void HIDPathStates::SpeedSymmetryFingers::add(HIDParserPath* path, int id) {
    if (path->currentContact().path_id == id && path->isFingerOrRestingContact() && path->isTouching()) {
        fingers[numFingers] = path;
        velocities[numFingers] = path->dampedVelocity();
        speeds[numFingers] = path->dampedSpeed();
        ++numFingers;
    } else if (!path->isTouching()) {
        path->clearPathSpeedSymmetry();
    }
}

void HIDPathStates::SpeedSymmetryFingers::finish(const FrameDiagnostics& diagnostics) {
    if (numFingers == 2 && !diagnostics.verboseDebugEnabled()) {
        // Two fingers: each one's symmetry is against the other alone, and the cosine between
        // them is the same both ways round (the products and their sums are the same numbers).
        const float cosine = cosineBetween(velocities[0], velocities[1]);
        fingers[0]->set_2F_speed_symmetry(twoFingerSymmetry(speeds[0], speeds[1], cosine));
        fingers[1]->set_2F_speed_symmetry(twoFingerSymmetry(speeds[1], speeds[0], cosine));
        return;
    }

    std::array<HIDPoint, kMaxPaths> otherVelocities;
    std::array<float, kMaxPaths> otherSpeeds;
    for (size_t k = 0; k < numFingers; ++k) {
        size_t numOthers = 0;
        for (size_t j = 0; j < numFingers; ++j) {
            if (j == k) continue;
            otherVelocities[numOthers] = velocities[j];
            otherSpeeds[numOthers] = speeds[j];
            ++numOthers;
        }
        fingers[k]->set_2F_speed_symmetry(
            speedSymmetryAmongFingers(velocities[k], speeds[k], otherVelocities.data(), otherSpeeds.data(), numOthers));
    }
}

void HIDPathStates::updateSpeedSymmetriesOfAllPathsOneByOne() {
    for (int id = kFirstPathID; id <= kLastPathID; ++id) {
        HIDParserPath* path = getParserPathforPathID(id);
        if (!path) continue;
        if (path->currentContact().path_id == id && path->isFingerOrRestingContact() && path->isTouching()) {
            computePathAndFingerSpeedSymmetries(id);
        }
        if (!path->isTouching()) path->clearPathSpeedSymmetry();
    }
}

void HIDPathStates::computePathAndFingerSpeedSymmetries(int pathID) {
    std::array<HIDPoint, kMaxPaths> otherVelocities{};
    std::array<float, kMaxPaths> otherSpeeds{};
    size_t numOthers = 0;
    float desiredSpeed = 0.0f;
    HIDPoint desiredVelocity{};
    HIDParserPath* desired = nullptr;

    for (int id = kFirstPathID; id <= kLastPathID; ++id) {
        HIDParserPath* path = getParserPathforPathID(id);
        if (!path || path->currentContact().path_id != id || !path->isFingerOrRestingContact() || !path->isTouching()) {
            continue;
        }
        if (id == pathID) {
            desired = path;
            desiredSpeed = path->dampedSpeed();
            desiredVelocity = path->dampedVelocity();
        } else if (numOthers < kMaxPaths) {
            otherVelocities[numOthers] = path->dampedVelocity();
            otherSpeeds[numOthers] = path->dampedSpeed();
            ++numOthers;
        }
    }

    if (!desired) desired = getParserPathforPathID(pathID);
    if (!desired) return;
    desired->set_2F_speed_symmetry(speedSymmetryAmongFingers(desiredVelocity, desiredSpeed, otherVelocities.data(),
                                                             otherSpeeds.data(), numOthers));
}

float HIDPathStates::speedSymmetryAmongFingers(HIDPoint desiredVelocity, float desiredSpeed,
                                               const HIDPoint* otherVelocities, const float* otherSpeeds,
                                               size_t numOthers) {
    // With one other finger there is nothing to sort, and of the cosines only the first (the
    // one between the two fingers) is read. The cosines are logged as they are worked out, so
    // with the diagnostics on every one is.
    if (numOthers == 1 && !verboseDebugEnabled()) {
        return twoFingerSymmetry(desiredSpeed, otherSpeeds[0], cosineBetween(desiredVelocity, otherVelocities[0]));
    }
    return speedSymmetryAmongFingersInFull(desiredVelocity, desiredSpeed, otherVelocities, otherSpeeds, numOthers);
}

[[gnu::noinline]] float HIDPathStates::speedSymmetryAmongFingersInFull(HIDPoint desiredVelocity, float desiredSpeed,
                                                     const HIDPoint* otherVelocities, const float* otherSpeeds,
                                                     size_t numOthers) {
    // Slot 0 of the velocities is kept for the desired path's own velocity.
    std::array<HIDPoint, kMaxPaths + 1> velocities;
    std::array<float, kMaxPaths> speeds;
    std::copy(otherVelocities, otherVelocities + numOthers, velocities.begin() + 1);
    std::copy(otherSpeeds, otherSpeeds + numOthers, speeds.begin());

    std::sort(speeds.begin(), speeds.begin() + numOthers, [](float a, float b) { return a > b; });
    // Slowest first and then reversed, so of equally fast fingers the higher path ID leads.
    HIDPoint* others = velocities.data() + 1;
    stableSortByLength(others, others + numOthers);
    std::reverse(others, others + numOthers);
    velocities[0] = desiredVelocity;

    std::array<float, kMaxCosines> cosines;
    const size_t numCosines =
        getCosineThetas(std::span<const HIDPoint>(velocities.data(), numOthers + 1), std::span<float>(cosines));

    if (desiredSpeed > 0.0f) {
        return compute_2F_path_speed_symmetry(std::span<const float>(speeds.data(), numOthers),
                                              std::span<const float>(cosines.data(), numCosines), desiredSpeed);
    }
    return 0.0f;
}

float HIDPathStates::twoFingerSymmetry(float desiredSpeed, float otherSpeed, float cosine) {
    if (!(desiredSpeed > 0.0f)) return 0.0f;
    return compute_2F_path_speed_symmetry(std::span<const float>(&otherSpeed, 1), std::span<const float>(&cosine, 1),
                                          desiredSpeed);
}

float HIDPathStates::compute_2F_path_speed_symmetry(std::span<const float> speeds, std::span<const float> cosineThetas,
                                                    float desiredPathSpeed) {
    if (speeds.empty()) return 0.0f;
    const float fastest = speeds[0];
    const float d = desiredPathSpeed;
    const float geometricMean = sqrtf(fastest * d);
    const float boost = (d < kSlowFingerSpeed_mm && fastest < kSlowFingerSpeed_mm && speeds.size() == 1)
                            ? kSlowPairSymmetryBoost
                            : 1.0f;
    // The geometric mean of the two speeds over their arithmetic mean plus one; divided in double.
    const float numerator = geometricMean * boost;
    const double denominator = static_cast<double>(fastest + d) * 0.5 + 1.0;
    const float symmetry = static_cast<float>(static_cast<double>(numerator) / denominator);
    if (cosineThetas.empty() || cosineThetas[0] > 0.0f) return symmetry;
    return -symmetry;
}

float HIDPathStates::computeSpeedSimilarity() const {
    SpeedRange range;
    forEachPathByID([&range](const HIDParserPath* path, int) { range.add(path); });
    return range.similarity();
}

void HIDPathStates::SpeedRange::add(const HIDParserPath* path) {
    if (!path->isTouching() || !path->isFingerOrRestingContact()) return;
    float speed = lengthOf(path->getAverageVelocity_mm_s());
    if (speed < kStillFingerSpeed_mm_s) speed = 0.0f;
    minimum = std::min(minimum, speed);
    maximum = std::max(maximum, speed);
}

float HIDPathStates::SpeedRange::similarity() const { return maximum > 0.0f ? minimum / maximum : 1.0f; }

void HIDPathStates::breakOutOfRestingThumbBasedOnSymmetry() { breakOutOfRestingThumb(nullptr); }

void HIDPathStates::breakOutOfRestingThumb(const float* knownSimilarity) {
    const bool restingHandScalesOrTurns = maxMotionDeltasResting_ == motionDeltasResting_.scale ||
                                          maxMotionDeltasResting_ == motionDeltasResting_.rotate;
    // The similarity depends on no thumb-zone flag, so the loop changes it nowhere: it is
    // worked out once, at the first tracked path.
    bool similarityKnown = false;
    float similarity = 0.0f;
    forEachPathByID([&](HIDParserPath* path, int) {
        if (path->isNoTrackingStage()) return;
        if (!similarityKnown) {
            similarity = knownSimilarity ? *knownSimilarity : computeSpeedSimilarity();
            similarityKnown = true;
        }
        speedSimilarity_ = similarity;
        const float y = path->currentContact().position.y;
        const float symmetry = path->_2F_speed_symmetry();

        if (path->isRestingInThumbZone() && static_cast<double>(std::fabs(symmetry)) > kBreakOutMinSymmetry && !engagedinGesture_ &&
            maxMotionDeltas_ < kBreakOutMaxHandMotion_mm) {
            if (restingHandScalesOrTurns) {
                if (y < kBreakOutLowBoundary_mm && speedSimilarity_ != 1.0f &&
                    speedSimilarity_ > kBreakOutMinSimilarityAboveBoundary) {
                    path->setIsRestingInThumbZone(false);
                }
                if (y > kBreakOutLowBoundary_mm && maxMotionDeltas_ > kBreakOutMinHandMotionLow_mm &&
                    speedSimilarity_ != 1.0f && speedSimilarity_ > kBreakOutMinSimilarityBelowBoundary) {
                    path->setIsRestingInThumbZone(false);
                }
            } else {
                // The resting hand's largest motion is a translation: the thumb moves along.
                path->setIsRestingInThumbZone(false);
            }
        }

        // Asked of every tracked path, resting or not; the setter runs each time it holds.
        if (y > kTranslationBreakOutBoundary_mm && !restingHandScalesOrTurns &&
            symmetry > kTranslationBreakOutMinSymmetry && speedSimilarity_ > kTranslationBreakOutMinSimilarity) {
            path->setIsRestingInThumbZone(false);
        }
    });
}

void HIDPathStates::calculateNewHandCenter(const HIDEventRef& frame) {
    if (!frame) {
        frameDiagnostics().logVerbose("%s hand center (%f, %f)", "-[HIDPathStates calculateNewHandCenter:]", 0.0, 0.0);
        return;
    }
    double sumX = 0.0;
    double sumY = 0.0;
    int count = 0;
    for (const HIDEventRef& child : frame->children()) {
        if (!child->conformsToEventType(kHIDEventTypeDigitizer)) continue;
        const int id = pathIDOfContact(*child);
        const HIDParserPath* path = getParserPathforPathID(id);
        if (path && path->isRestingInThumbZone()) continue;
        // The raw digitizer values: normalised, y not flipped.
        sumX += child->doubleValueForField(kHIDEventFieldDigitizerX);
        sumY += child->doubleValueForField(kHIDEventFieldDigitizerY);
        ++count;
    }
    if (count > 0) {
        frame->setDoubleValue(sumX / count, kHIDEventFieldDigitizerX);
        frame->setDoubleValue(sumY / count, kHIDEventFieldDigitizerY);
    }
    if (frameDiagnostics().verboseDebugEnabled()) {
        frameDiagnostics().logVerbose("%s hand center (%f, %f)", "-[HIDPathStates calculateNewHandCenter:]",
                                      frame->doubleValueForField(kHIDEventFieldDigitizerX),
                                      frame->doubleValueForField(kHIDEventFieldDigitizerY));
    }
}

size_t getCosineThetas(std::span<const HIDPoint> points, std::span<float> cosines) {
    size_t written = 0;
    const size_t n = points.size();
    for (size_t i = 0; i + 1 < n; ++i) {
        const HIDPoint a = points[i];
        for (size_t j = i + 1; j < n; ++j) {
            const HIDPoint b = points[j];
            logVerbose("%s vel_inner (%f,%f)", "getCosineThetas", a.x, a.y);
            const float lengthA = lengthOf(a);
            const float lengthB = lengthOf(b);
            float cosine = 1.0f;
            if (lengthA != 0.0f && lengthB != 0.0f) {
                const double dot = static_cast<double>(a.x) * b.x + static_cast<double>(a.y) * b.y;
                const double lengths = static_cast<double>(lengthA) * static_cast<double>(lengthB);
                cosine = static_cast<float>(dot / lengths);
            }
            if (written < cosines.size()) cosines[written++] = cosine;
            logVerbose("%s cosine theta %f", "getCosineThetas", cosine);
        }
    }
    return written;
}

std::vector<float> getCosineThetas(const std::vector<HIDPoint>& points) {
    const size_t n = points.size();
    std::vector<float> cosines(n < 2 ? 0 : n * (n - 1) / 2);
    cosines.resize(getCosineThetas(std::span<const HIDPoint>(points), std::span<float>(cosines)));
    return cosines;
}

}  // namespace orvane

extern "C" __attribute__((visibility("default"))) float* getCosineThetas(const orvane::HIDPoint* points, size_t count,
                                                                         size_t* outCount) {
    if (outCount) *outCount = 0;
    if (!points || count < 2) return nullptr;
    const size_t pairs = count * (count - 1) / 2;
    auto* cosines = static_cast<float*>(std::malloc(pairs * sizeof(float)));
    if (!cosines) return nullptr;
    const size_t written =
        orvane::getCosineThetas(std::span<const orvane::HIDPoint>(points, count), std::span<float>(cosines, pairs));
    if (outCount) *outCount = written;
    return cosines;
}
