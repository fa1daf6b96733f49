#include "HIDGestureParser.h"

#include <cmath>
#include <cstring>
#include <utility>

#include "common/TickConversion.h"
#include "filter/FilterLogging.h"
#include "filter/HIDScaleEvent.h"
#include "motion/HIDHandMotion.h"
#include "stats/HIDHandStatistics.h"

namespace orvane {

namespace {

constexpr const char* kCreateGestureEventsSignature =
    "-[HIDGestureParser createGestureEvents:handMotion:handEvent:pointerEvent:gestureEvent:dispatcher:"
    "tapToClickEnabled:twoFingersSecondaryClickEnabled:]";
constexpr const char* kCancelScrollMayBeginSignature = "-[HIDGestureParser cancelScrollMayBegin:pointerEvent:]";

// The button mask of the secondary button, and of the primary one.
constexpr uint32_t kPrimaryButtonMask = 1;
constexpr uint32_t kSecondaryButtonMask = 2;

// Accumulated motion, in pixels, that a hand must exceed before it moves anything.
constexpr float kGestureMotionThreshold_px = 5.0f;

// One finger moves the pointer only once it has been down this long, and this long after
// the last lift-off, scale end and scroll end, so that taps and the ends of two-finger
// gestures do not nudge the pointer.
constexpr double kPointerAfterTouchDown_ms = 40.0;
constexpr double kPointerAfterLiftoff_ms = 20.0;
constexpr double kPointerAfterScaleEnd_ms = 70.0;
constexpr double kPointerAfterScrollEnd_ms = 50.0;

// Two fingers count as close together (one hand's neighbouring fingers) below these.
constexpr float kFingersCloseSeparation_mm = 260.0f;
constexpr float kFingersCloseVerticalSeparation_mm = 120.0f;

// Two fingers scroll only this long after a lift-off, so that a lifting hand does not scroll.
constexpr double kScrollAfterLiftoff_ms = 14.0;
// Scrolling moves the content against the fingers, at twice the pixel motion.
constexpr float kScrollGain = -2.0f;
// Pinch and rotation pixels to scale and rotation units (applied in double precision).
constexpr double kScaleRotateGain = 0.005;

// The pixel quantum of the pointer's and the scroll's motion.
constexpr float kMotionQuantum_px = 0.635f;

// Touches this close together in time are one two-finger touch.
constexpr double kTwoFingerTouchInterval_ms = 60.0;
// A tap of the same kind is not repeated within this time.
constexpr double kTapRepeatInterval_ms = 100.0;
// A two-finger tap is ignored this soon after a scale, scroll or rotation ended.
constexpr double kTwoFingerTapAfterGestureEnd_ms = 250.0;

// A tap is a touch shorter than this, lifted within the last few milliseconds, away from
// a reset and from the diving button, by fingers that barely moved.
constexpr double kTapMaxTouch_ms = 250.0;
constexpr double kTapRecentLiftoff_ms = 30.0;
constexpr double kTapMinTouch_ms = 0.02;  // deliberately tiny: almost any contact counts
constexpr double kTapAfterReset_ms = 250.0;
constexpr double kTapAfterButtonActivity_ms = 250.0;
constexpr float kTapMaxFingerSpeed = 5.0f;

}  // namespace

HIDGestureParser::HIDGestureParser() {
    // 0x01010101 in each entry, on purpose: neither 0 nor 1, so a contact index seen for the
    // first time counts as neither previously touching nor previously lifted.
    std::memset(prevFingerType_.data(), 1, sizeof(int32_t) * prevFingerType_.size());
}

// ---------------------------------------------------------------------------------------
// The hand event for the UI

void HIDGestureParser::sendOutOfRange(HIDEvent& child) const {
    child.setIntegerValue(0, kHIDEventFieldDigitizerTouch);
    child.setIntegerValue(0, kHIDEventFieldDigitizerRange);
    child.setIntegerValue(kHIDDigitizerEventRange | kHIDDigitizerEventTouch, kHIDEventFieldDigitizerEventMask);
}

void HIDGestureParser::fillChildDigitizerFields(HIDEvent& child) const {
    child.setIntegerValue(child.integerValueForField(kHIDEventFieldDigitizerIndex) + 1,
                          kHIDEventFieldDigitizerIdentity);
    child.setIntegerValue(generationCount_, kHIDEventFieldDigitizerGenerationCount);
    child.setDoubleValue(1.0 - child.doubleValueForField(kHIDEventFieldDigitizerY), kHIDEventFieldDigitizerY);
}

void HIDGestureParser::fillParentDigitizerFields(HIDEvent& parent) const {
    bool anyTouch = false;
    bool anyRange = false;
    int64_t eventMask = 0;
    for (const HIDEventRef& child : parent.children()) {
        if (child->integerValueForField(kHIDEventFieldDigitizerTouch) != 0) anyTouch = true;
        if (child->integerValueForField(kHIDEventFieldDigitizerRange) != 0) anyRange = true;
        eventMask |= child->integerValueForField(kHIDEventFieldDigitizerEventMask);
    }
    parent.setIntegerValue(anyTouch ? 1 : 0, kHIDEventFieldDigitizerTouch);
    parent.setIntegerValue(anyRange ? 1 : 0, kHIDEventFieldDigitizerRange);
    parent.setIntegerValue(eventMask, kHIDEventFieldDigitizerEventMask);
    parent.setIntegerValue(generationCount_, kHIDEventFieldDigitizerGenerationCount);
    parent.setDoubleValue(1.0 - parent.doubleValueForField(kHIDEventFieldDigitizerY), kHIDEventFieldDigitizerY);
}

[[gnu::flatten]] HIDEventRef HIDGestureParser::prepareHandEventforUI(HIDHandStatistics& handStats, const HIDEventRef& frame) {
    int remaining = handStats.numPaths();
    handStats.setWerePalmsRemoved(handStats.palmsRemoved());
    handStats.setPalmsRemoved(false);

    const bool buttonChanged = handStats.currentButtonState() != handStats.lastButtonState();
    for (int i = handStats.numPaths() - 1; i >= 0; --i) {
        if (!frame || static_cast<size_t>(i) >= frame->children().size()) continue;
        // Held by reference: the child is last used before it may be removed.
        const HIDEventRef& childRef = frame->children()[static_cast<size_t>(i)];
        HIDEvent& child = *childRef;
        const int32_t idx = static_cast<int32_t>(child.integerValueForField(kHIDEventFieldDigitizerIndex));
        if (idx < 0 || idx >= kNumContactIndexes) continue;  // passed through untouched

        const bool touching =
            child.integerValueForField(kHIDEventFieldDigitizerType) != kHIDDigitizerTransducerTypeHand &&
            child.integerValueForField(kHIDEventFieldDigitizerTouch) != 0;
        if (touching) {
            if (prevFingerType_[idx] == 0) {
                const int64_t mask = child.integerValueForField(kHIDEventFieldDigitizerEventMask);
                child.setIntegerValue(mask | kHIDDigitizerEventTouch, kHIDEventFieldDigitizerEventMask);
            }
            sentOutOfRange_[idx] = false;
            prevFingerType_[idx] = 1;
        } else if (prevFingerType_[idx] == 1 && !sentOutOfRange_[idx]) {
            // The lift is reported once; the child stays in the event.
            sentOutOfRange_[idx] = true;
            sendOutOfRange(child);
            prevFingerType_[idx] = 0;
        } else if (buttonChanged && buttonStateWasSent_) {
            // Kept, unchanged, while a button transition is reported; its lift comes later.
            sentOutOfRange_[idx] = false;
            prevFingerType_[idx] = 1;
        } else {
            sentOutOfRange_[idx] = false;
            frame->removeEvent(childRef);
            --remaining;
            prevFingerType_[idx] = 0;
        }

        // The child now at this position: after a removal it is the one that moved up, and
        // stamping it a second time flips its y back, on purpose. Nothing moved up when the
        // removed child was the last one.
        if (static_cast<size_t>(i) < frame->children().size()) {
            fillChildDigitizerFields(*frame->children()[static_cast<size_t>(i)]);
        }
    }

    if (remaining == 0) {
        handStats.setPalmsRemoved(true);
        return nullptr;
    }
    if (!frame) return nullptr;
    const int64_t frameMask = frame->integerValueForField(kHIDEventFieldDigitizerEventMask);
    const int64_t changeBits = kHIDDigitizerEventRange | kHIDDigitizerEventTouch | kHIDDigitizerEventPosition;
    if ((frameMask & changeBits) == 0 && !buttonChanged) return nullptr;

    fillParentDigitizerFields(*frame);
    ++generationCount_;
    return frame;
}

// ---------------------------------------------------------------------------------------
// The recogniser

[[gnu::flatten]] HIDEventRef HIDGestureParser::parseHandGesturesCreateHIDEvents(HIDHandStatistics& handStats, HIDHandMotion& handMotion,
                                                               const HIDEventRef& handEvent,
                                                               const HIDDispatchHandler& dispatcher,
                                                               bool tapToClickEnabled,
                                                               bool twoFingersSecondaryClickEnabled) {
    // Without a hand event only the first frame after every contact vanished gets a (bare)
    // pointer event; the others get nothing, so none is made for them.
    if (!handEvent && !(handStats.palmsRemoved() && !handStats.werePalmsRemoved())) return nullptr;

    HIDEventRef pointerEvent = HIDEvent::pointerEvent(handEvent ? handEvent->timestamp() : 0, 0.0, 0.0, 0.0, 0, 0);
    pointerEvent->setSenderID(handEvent ? handEvent->senderID() : 0);
    pointerEvent->setIntegerValue(handStats.currentButtonState(), kHIDEventFieldPointerButtonMask);
    if (!handEvent) return pointerEvent;

    parseGesture(handStats, handMotion);
    if (!appendGestureEvents(handStats, handMotion, handEvent, pointerEvent, dispatcher, tapToClickEnabled,
                             twoFingersSecondaryClickEnabled)) {
        return nullptr;
    }
    return pointerEvent;
}

void HIDGestureParser::quantizeMotion(HIDHandMotion& handMotion) const {
    HIDMotion deltas = handMotion.pixelDeltas();
    deltas.x = std::trunc(deltas.x / kMotionQuantum_px) * kMotionQuantum_px;
    deltas.y = std::trunc(deltas.y / kMotionQuantum_px) * kMotionQuantum_px;
    handMotion.setPixelDeltas(deltas);
}

bool HIDGestureParser::tapHasValidTimingAndStrength(const HIDHandStatistics& handStats, const HIDHandMotion& handMotion,
                                                    bool /*withAdjacentFinger*/) const {
    const double sinceTouch_ms = ticksToMilliseconds(handStats.timeSinceFingerTouch());
    return sinceTouch_ms < kTapMaxTouch_ms &&
           ticksToMilliseconds(handStats.timeSinceRecentFingerLiftoff()) < kTapRecentLiftoff_ms &&
           sinceTouch_ms > kTapMinTouch_ms &&
           ticksToMilliseconds(handStats.timeSinceLastReset()) >= kTapAfterReset_ms &&
           ticksToMilliseconds(handStats.timeSinceLastButtonActivity()) >= kTapAfterButtonActivity_ms &&
           handMotion.lastMaxFingerSpeed() < kTapMaxFingerSpeed;
}

void HIDGestureParser::updateTwoFingersClose(HIDHandStatistics& handStats, const HIDHandMotion& handMotion) {
    handStats.setTwoFingersClose(handMotion.innermostOutermostSeparation_mm() < kFingersCloseSeparation_mm &&
                                 handMotion.innermostOutermostVerticalSeparation_mm() <
                                     kFingersCloseVerticalSeparation_mm);
}

void HIDGestureParser::parseGesture(HIDHandStatistics& handStats, HIDHandMotion& handMotion) {
    const float maxAccum = handMotion.maxAccumPixelDelta();
    const double now = handStats.currentTimestamp();
    const int fingers = handStats.numFingersTouching();

    // Start of frame.
    prevGesture_ = currentGesture_;
    prevPhase_ = currentPhase_;
    handMotion.setMotionDelta(0.0f, 0.0f, 0.0f, 0.0f);
    quantizeMotion(handMotion);
    const HIDMotion pixels = handMotion.pixelDeltas();
    const HIDMotion accumulated = handMotion.accumulatedDeltas();

    // One finger: the pointer.
    if (fingers == 1) {
        const bool pointerRule =
            ticksToMilliseconds(now - handStats.t_firstFingerTouchDown()) > kPointerAfterTouchDown_ms &&
            ticksToMilliseconds(now - handStats.t_recentFingerLiftoff()) > kPointerAfterLiftoff_ms &&
            maxAccum > kGestureMotionThreshold_px &&
            ticksToMilliseconds(now - handStats.t_recentScaleEnd()) > kPointerAfterScaleEnd_ms &&
            ticksToMilliseconds(now - handStats.t_recentScrollEnd()) > kPointerAfterScrollEnd_ms;
        if (pointerRule) {
            if (currentGesture_ < kHIDGestureTypeScroll) {
                currentGesture_ = kHIDGestureTypePointer;
                handMotion.setMotionDelta(pixels.x, pixels.y, 0.0f, 0.0f);
            } else {
                currentGesture_ = kHIDGestureTypeNone;
                currentPhase_ = kHIDGesturePhaseNone;
            }
        } else if (handStats.numFingersRestingInZone() == 1) {
            updateTwoFingersClose(handStats, handMotion);
        }
    }

    // Two fingers: scroll, scale, rotate.
    if (fingers == 2) {
        if (maxAccum <= kGestureMotionThreshold_px) {
            updateTwoFingersClose(handStats, handMotion);
        } else {
            handStats.setEngagedinGesture(true);
            if ((maxAccum == accumulated.x || maxAccum == accumulated.y) && currentGesture_ <= kHIDGestureTypeScroll &&
                ticksToMilliseconds(now - handStats.t_recentFingerLiftoff()) > kScrollAfterLiftoff_ms) {
                currentGesture_ = kHIDGestureTypeScroll;
                handMotion.setMotionDelta(pixels.x * kScrollGain, pixels.y * kScrollGain, 0.0f, 0.0f);
            }
            if ((maxAccum == accumulated.scale || maxAccum == accumulated.rotate) &&
                currentGesture_ <= kHIDGestureTypeRotate && currentGesture_ != kHIDGestureTypeScroll &&
                handStats.numFingersRestingInZone() == 0 && handStats.maxFingersTouching() <= 2) {
                const float scaleMagnitude = std::fabs(pixels.scale);
                const float rotateMagnitude = std::fabs(pixels.rotate);
                const float largest = scaleMagnitude >= rotateMagnitude ? scaleMagnitude : rotateMagnitude;
                // The gain is applied in double precision and the result stored as float.
                if (largest == scaleMagnitude) {  // a tie goes to scale
                    currentGesture_ = kHIDGestureTypeScale;
                    const float scale = static_cast<float>(static_cast<double>(pixels.scale) * kScaleRotateGain);
                    handMotion.setMotionDelta(0.0f, 0.0f, scale, 0.0f);
                } else if (largest == rotateMagnitude) {
                    currentGesture_ = kHIDGestureTypeRotate;
                    const float rotate = static_cast<float>(static_cast<double>(pixels.rotate) * kScaleRotateGain);
                    handMotion.setMotionDelta(0.0f, 0.0f, 0.0f, rotate);
                }
            }
        }
    }

    // A still hand of two fingers, or one finger beside a resting thumb: a scroll may begin.
    const bool scrollHand = (handStats.numFingersRestingInZone() == 1 && fingers == 1) || fingers == 2;
    if (scrollHand && prevGesture_ != kHIDGestureTypeScroll && currentGesture_ == kHIDGestureTypeNone &&
        maxAccum == 0.0f && currentPhase_ != kHIDGesturePhaseMayBegin) {
        currentGesture_ = kHIDGestureTypeScroll;
        handMotion.setMotionDelta(0.0f, 0.0f, 0.0f, 0.0f);
    }

    // No finger or one finger: ends and taps.
    if (fingers <= 1) {
        if (fingers == 0 || fingers < handStats.lastNumFingersTouching()) {
            currentGesture_ = kHIDGestureTypeNone;
            currentPhase_ = kHIDGesturePhaseNone;
            handStats.setEngagedinGesture(false);
        }
        if (fingers == 0) handStats.setTwoFingersClose(false);
        if (tapHasValidTimingAndStrength(handStats, handMotion, true)) {
            if (ticksToMilliseconds(handStats.timeBetweenMostRecentTouches()) >= kTwoFingerTouchInterval_ms) {
                if (prevGesture_ <= kHIDGestureTypePointer &&
                    ticksToMilliseconds(handStats.timeSinceSingleFingerTap()) > kTapRepeatInterval_ms) {
                    handStats.setTimeofSingleFingerTap(now);
                    currentGesture_ = kHIDGestureTypeOneFingerTap;
                }
            } else if (prevGesture_ <= kHIDGestureTypePointer &&
                       ticksToMilliseconds(handStats.timeSinceTwoFingerTap()) > kTapRepeatInterval_ms &&
                       ticksToMilliseconds(handStats.timeSinceScaleEnd()) > kTwoFingerTapAfterGestureEnd_ms &&
                       ticksToMilliseconds(handStats.timeSinceScrollEnd()) > kTwoFingerTapAfterGestureEnd_ms &&
                       ticksToMilliseconds(handStats.timeSinceRotateEnd()) > kTwoFingerTapAfterGestureEnd_ms) {
                handStats.setTimeofTwoFingerTap(now);
                currentGesture_ = kHIDGestureTypeTwoFingerTap;
            }
        }
    }

    // End of frame.
    if (fingers > 2 && currentGesture_ != kHIDGestureTypeNone) currentGesture_ = kHIDGestureTypeNone;
    if (fingers == 0) currentPhase_ = kHIDGesturePhaseNone;
}

// ---------------------------------------------------------------------------------------
// Gesture events

HIDEventRef HIDGestureParser::cancelScrollMayBegin(HIDHandStatistics& handStats, const HIDEventRef& pointerEvent) {
    if (!shouldCancelScrollMayBegin_) return nullptr;
    HIDEventRef cancel = HIDEvent::scrollEvent(pointerEvent->timestamp(), 0.0, 0.0, 0.0, 0);
    cancel->setPhase(kHIDGesturePhaseCancelled);
    pointerEvent->appendEvent(cancel);
    handStats.setTimeofScrollEnd(handStats.currentTimestamp());
    LoggingServiceFilter()->log("%s GESTURE SCROLL CANCELLED", kCancelScrollMayBeginSignature);
    shouldCancelScrollMayBegin_ = false;
    return cancel;
}

HIDEventRef HIDGestureParser::createGestureEvents(HIDHandStatistics& handStats, HIDHandMotion& handMotion,
                                                  const HIDEventRef& handEvent, const HIDEventRef& pointerEvent,
                                                  const HIDEventRef& /*gestureEvent*/,
                                                  const HIDDispatchHandler& dispatcher, bool tapToClickEnabled,
                                                  bool twoFingersSecondaryClickEnabled) {
    if (!handEvent || !pointerEvent) return nullptr;
    if (!appendGestureEvents(handStats, handMotion, handEvent, pointerEvent, dispatcher, tapToClickEnabled,
                             twoFingersSecondaryClickEnabled)) {
        return nullptr;
    }
    return pointerEvent;
}

bool HIDGestureParser::appendGestureEvents(HIDHandStatistics& handStats, HIDHandMotion& handMotion,
                                           const HIDEventRef& handEvent, const HIDEventRef& pointerEvent,
                                           const HIDDispatchHandler& dispatcher, bool tapToClickEnabled,
                                           bool twoFingersSecondaryClickEnabled) {
    const uint64_t timestamp = handEvent->timestamp();
    const double now = handStats.currentTimestamp();
    const int32_t gesture = currentGesture_;
    const int32_t previous = prevGesture_;
    const HIDMotion deltas = handMotion.motionDeltas();
    // The pointer event is the result when it carries anything.
    const auto finish = [&pointerEvent]() { return !pointerEvent->children().empty(); };

    // The diving button. The pointer event's own mask stays the button state even when the
    // button event names the secondary button; intended.
    if (handStats.currentButtonState() != handStats.lastButtonState()) {
        uint32_t mask = static_cast<uint32_t>(handStats.currentButtonState());
        if (handStats.twoFingersClose() && twoFingersSecondaryClickEnabled && handStats.currentButtonState() == 1) {
            mask = kSecondaryButtonMask;
        }
        HIDEventRef button = HIDScaleEvent::statefulButtonEvent(timestamp, mask, 0);
        // A release goes out only after a press did.
        if (mask != 0 || buttonStateWasSent_) {
            pointerEvent->appendEvent(std::move(button));
            if (handStats.currentButtonState() == 1) {
                LoggingServiceFilter()->log("%s GESTURE BUTTON PRESSED", kCreateGestureEventsSignature);
                buttonStateWasSent_ = true;
            } else {
                LoggingServiceFilter()->log("%s GESTURE BUTTON RELEASED", kCreateGestureEventsSignature);
                buttonStateWasSent_ = false;
            }
        }
    }

    // Ending gestures, one frame after the recogniser dropped them.
    if (gesture == kHIDGestureTypeNone) {
        if (previous == kHIDGestureTypePointer) {
            LoggingServiceFilter()->log("%s GESTURE POINTER ENDED", kCreateGestureEventsSignature);
            handStats.setTimeofSwipeEnd(now);
        }
        const bool scrollEnds = previous == kHIDGestureTypeScroll && currentPhase_ != kHIDGesturePhaseMayBegin;
        if (scrollEnds) {
            currentPhase_ = kHIDGesturePhaseEnded;
            HIDEventRef scroll = HIDEvent::scrollEvent(timestamp, 0.0, 0.0, 0.0, 0);
            scroll->setPhase(kHIDGesturePhaseEnded);
            pointerEvent->appendEvent(handEvent);
            pointerEvent->appendEvent(std::move(scroll));
            handStats.setTimeofScrollEnd(now);
            LoggingServiceFilter()->log("%s GESTURE END SCROLL", kCreateGestureEventsSignature);
            return true;
        }
        HIDEventRef scaleEnd;
        HIDEventRef rotationEnd;
        if (previous == kHIDGestureTypeScale || shouldEndScale_) {
            currentPhase_ = kHIDGesturePhaseEnded;
            scaleEnd = HIDScaleEvent::scaleEvent(timestamp, 0.0, 0.0, 0.0, 0);
            handStats.setTimeofScaleEnd(now);
            scaleEnd->setPhase(kHIDGesturePhaseEnded);
            shouldEndScale_ = false;
            LoggingServiceFilter()->log("%s GESTURE END SCALE", kCreateGestureEventsSignature);
        }
        if (previous == kHIDGestureTypeRotate || shouldEndRotate_) {
            currentPhase_ = kHIDGesturePhaseEnded;
            rotationEnd = HIDScaleEvent::rotationEvent(timestamp, 0.0, 0.0, 0.0, 0);
            handStats.setTimeofRotateEnd(now);
            rotationEnd->setPhase(kHIDGesturePhaseEnded);
            shouldEndRotate_ = false;
            LoggingServiceFilter()->log("%s GESTURE END ROTATION", kCreateGestureEventsSignature);
        }
        if (scaleEnd || rotationEnd) {
            pointerEvent->appendEvent(handEvent);
            if (scaleEnd) pointerEvent->appendEvent(std::move(scaleEnd));
            if (rotationEnd) pointerEvent->appendEvent(std::move(rotationEnd));
            return true;
        }
    }

    // The gesture of this frame.
    if (gesture == kHIDGestureTypePointer) {
        pointerEvent->setDoubleValue(deltas.x, kHIDEventFieldPointerX);
        pointerEvent->setDoubleValue(deltas.y, kHIDEventFieldPointerY);
        pointerEvent->appendEvent(handEvent);
        if (previous != kHIDGestureTypePointer) {
            cancelScrollMayBegin(handStats, pointerEvent);
            LoggingServiceFilter()->log("%s GESTURE POINTER BEGAN", kCreateGestureEventsSignature);
        }
        return true;
    }

    if (gesture == kHIDGestureTypeScroll) {
        HIDEventRef scroll = HIDEvent::scrollEvent(timestamp, deltas.x, deltas.y, 0.0, 0);
        pointerEvent->appendEvent(handEvent);
        const bool still = deltas.x == 0.0f && deltas.y == 0.0f;
        if (previous == kHIDGestureTypeNone || previous == kHIDGestureTypePointer) {
            if (still && currentPhase_ != kHIDGesturePhaseMayBegin) {
                cancelScrollMayBegin(handStats, pointerEvent);
                currentPhase_ = kHIDGesturePhaseMayBegin;
                // The may-begin is a phase, not a gesture: the next frame starts from none.
                currentGesture_ = kHIDGestureTypeNone;
                LoggingServiceFilter()->log("%s GESTURE SCROLL MAY BEGIN", kCreateGestureEventsSignature);
                shouldCancelScrollMayBegin_ = true;
            } else {
                currentPhase_ = kHIDGesturePhaseBegan;
                LoggingServiceFilter()->log("%s GESTURE SCROLL BEGAN", kCreateGestureEventsSignature);
                shouldCancelScrollMayBegin_ = false;
            }
        } else {
            // A still frame in the middle of a scroll sends nothing but keeps the scroll.
            if (still) return true;
            currentPhase_ = kHIDGesturePhaseChanged;
        }
        scroll->setPhase(currentPhase_);
        pointerEvent->appendEvent(std::move(scroll));
        return true;
    }

    if (gesture == kHIDGestureTypeRotate && deltas.rotate != 0.0f) {
        HIDEventRef rotation = HIDScaleEvent::rotationEvent(timestamp, 0.0, 0.0, deltas.rotate, 0);
        if (previous == kHIDGestureTypeRotate || shouldEndRotate_) {
            currentPhase_ = kHIDGesturePhaseChanged;
        } else {
            cancelScrollMayBegin(handStats, pointerEvent);
            currentPhase_ = kHIDGesturePhaseBegan;
            LoggingServiceFilter()->log("%s GESTURE ROTATE BEGAN", kCreateGestureEventsSignature);
        }
        shouldEndRotate_ = true;
        rotation->setPhase(currentPhase_);
        pointerEvent->appendEvent(handEvent);
        pointerEvent->appendEvent(std::move(rotation));
        return finish();
    }

    if (gesture == kHIDGestureTypeScale && deltas.scale != 0.0f) {
        HIDEventRef scale = HIDScaleEvent::scaleEvent(timestamp, 0.0, 0.0, deltas.scale, 0);
        if (previous == kHIDGestureTypeScale || shouldEndScale_) {
            currentPhase_ = kHIDGesturePhaseChanged;
        } else {
            cancelScrollMayBegin(handStats, pointerEvent);
            currentPhase_ = kHIDGesturePhaseBegan;
            LoggingServiceFilter()->log("%s GESTURE SCALE BEGAN", kCreateGestureEventsSignature);
        }
        shouldEndScale_ = true;
        scale->setPhase(currentPhase_);
        pointerEvent->appendEvent(handEvent);
        pointerEvent->appendEvent(std::move(scale));
        return finish();
    }

    if (gesture == kHIDGestureTypeOneFingerTap && tapToClickEnabled) {
        HIDEventRef button = HIDScaleEvent::statefulButtonEvent(timestamp, kPrimaryButtonMask, 0);
        pointerEvent->appendEvent(handEvent);
        pointerEvent->appendEvent(button);
        // The press goes out now, complete; the same event then returns carrying the release.
        if (dispatcher) dispatcher(pointerEvent);
        HIDStatefulButtonEvent::setStatefulButtonMask(*button, 0);
        LoggingServiceFilter()->log("%s GESTURE 1F TAP", kCreateGestureEventsSignature);
        currentGesture_ = kHIDGestureTypeNone;
        currentPhase_ = kHIDGesturePhaseNone;
        return finish();
    }

    if (gesture == kHIDGestureTypeTwoFingerTap && tapToClickEnabled && twoFingersSecondaryClickEnabled) {
        HIDEventRef cancel = cancelScrollMayBegin(handStats, pointerEvent);
        HIDEventRef button = HIDScaleEvent::statefulButtonEvent(timestamp, kSecondaryButtonMask, 0);
        pointerEvent->appendEvent(handEvent);
        pointerEvent->appendEvent(button);
        if (dispatcher) dispatcher(pointerEvent);
        // The cancel goes out with the press only.
        if (cancel) pointerEvent->removeEvent(cancel);
        HIDStatefulButtonEvent::setStatefulButtonMask(*button, 0);
        LoggingServiceFilter()->log("%s GESTURE 2F TAP", kCreateGestureEventsSignature);
        currentGesture_ = kHIDGestureTypeNone;
        currentPhase_ = kHIDGesturePhaseNone;
        return finish();
    }

    // Nothing else to send: withdraw a may-begin that the hand left without scrolling.
    if (currentPhase_ == kHIDGesturePhaseNone && prevPhase_ == kHIDGesturePhaseMayBegin) {
        cancelScrollMayBegin(handStats, pointerEvent);
        currentPhase_ = kHIDGesturePhaseCancelled;
    }
    pointerEvent->appendEvent(handEvent);
    return finish();
}

}  // namespace orvane
