#pragma once
// The last stage of the pipeline: the hand event cleaned for the UI, the gesture state
// machine with its tap rules, and the pointer, scroll, scale, rotation and button events.

#include <array>
#include <cstdint>

#include "common/HIDTypes.h"
#include "platform/HIDEvent.h"

namespace orvane {

class HIDHandStatistics;
class HIDHandMotion;

class HIDGestureParser {
public:
    static constexpr int kNumContactIndexes = 15;

    // Flags, out-of-range reports and the generation count start cleared; every byte of
    // prevFingerType starts as 1.
    HIDGestureParser();

    // The UI hand event: the frame event changed in place, or nullptr.
    HIDEventRef prepareHandEventforUI(HIDHandStatistics& handStats, const HIDEventRef& frame);
    void sendOutOfRange(HIDEvent& child) const;
    void fillChildDigitizerFields(HIDEvent& child) const;
    void fillParentDigitizerFields(HIDEvent& parent) const;

    HIDEventRef parseHandGesturesCreateHIDEvents(HIDHandStatistics& handStats, HIDHandMotion& handMotion,
                                                 const HIDEventRef& handEvent, const HIDDispatchHandler& dispatcher,
                                                 bool tapToClickEnabled, bool twoFingersSecondaryClickEnabled);
    void parseGesture(HIDHandStatistics& handStats, HIDHandMotion& handMotion);
    void quantizeMotion(HIDHandMotion& handMotion) const;
    bool tapHasValidTimingAndStrength(const HIDHandStatistics& handStats, const HIDHandMotion& handMotion,
                                      bool withAdjacentFinger) const;
    HIDEventRef createGestureEvents(HIDHandStatistics& handStats, HIDHandMotion& handMotion,
                                    const HIDEventRef& handEvent, const HIDEventRef& pointerEvent,
                                    const HIDEventRef& gestureEvent, const HIDDispatchHandler& dispatcher,
                                    bool tapToClickEnabled, bool twoFingersSecondaryClickEnabled);
    HIDEventRef cancelScrollMayBegin(HIDHandStatistics& handStats, const HIDEventRef& pointerEvent);

    HID_PROPERTY(bool, shouldEndRotate, setShouldEndRotate)
    HID_PROPERTY(bool, shouldEndScale, setShouldEndScale)
    HID_PROPERTY(bool, shouldCancelScrollMayBegin, setShouldCancelScrollMayBegin)
    HID_PROPERTY(bool, buttonStateWasSent, setButtonStateWasSent)
    HID_PROPERTY(int32_t, generationCount, setGenerationCount)
    HID_PROPERTY(uint16_t, currentPhase, setCurrentPhase)
    HID_PROPERTY(uint16_t, prevPhase, setPrevPhase)
    HID_PROPERTY(int32_t, currentGesture, setCurrentGesture)
    HID_PROPERTY(int32_t, prevGesture, setPrevGesture)
    const std::array<bool, kNumContactIndexes>& sentOutOfRange() const { return sentOutOfRange_; }
    const std::array<int32_t, kNumContactIndexes>& prevFingerType() const { return prevFingerType_; }

private:
    // The events of this frame's gesture appended to the pointer event (with the hand event);
    // true when the pointer event is the result, false when nothing is to be sent.
    bool appendGestureEvents(HIDHandStatistics& handStats, HIDHandMotion& handMotion, const HIDEventRef& handEvent,
                             const HIDEventRef& pointerEvent, const HIDDispatchHandler& dispatcher,
                             bool tapToClickEnabled, bool twoFingersSecondaryClickEnabled);
    // The closeness of the two fingers that selects the secondary button.
    static void updateTwoFingersClose(HIDHandStatistics& handStats, const HIDHandMotion& handMotion);

    bool shouldEndRotate_ = false;
    bool shouldEndScale_ = false;
    bool shouldCancelScrollMayBegin_ = false;
    bool buttonStateWasSent_ = false;
    std::array<bool, kNumContactIndexes> sentOutOfRange_{};
    std::array<int32_t, kNumContactIndexes> prevFingerType_{};
    int32_t generationCount_ = 0;
    uint16_t currentPhase_ = 0;
    uint16_t prevPhase_ = 0;
    int32_t currentGesture_ = 0;
    int32_t prevGesture_ = 0;
};

}  // namespace orvane
