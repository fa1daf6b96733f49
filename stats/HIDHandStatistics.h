#pragma once
// Per-hand counts and how-long-since times that the gesture stage reads: fingers touching
// or resting, recent touch-downs and lift-offs, taps, gesture ends and button activity.
// Times are frame times in ticks; 0 means never.

#include "common/HIDTypes.h"
#include "pipeline/HIDTimeState.h"

namespace orvane {

class HIDPathStates;
class HIDParserPath;

class HIDHandStatistics : public HIDTimeState {
public:
    HIDHandStatistics() = default;

    // The frame's statistics from the paths found for IDs 1..14, visiting only the slots
    // that can hold one. True when there is any path.
    bool processHandState(const HIDPathStates& pathStates);
    // The same, asking the table for every ID from 1 to 14 in turn.
    bool processHandStateOneByOne(const HIDPathStates& pathStates);
    void updateStatsWithPath(const HIDParserPath& path);
    void updateStatsWithFingerPath(int pathID, HIDPoint contactLoc, const HIDPathTimestamps& timestamps,
                                   bool isTouching, bool wasTouching, bool isResting, bool wasResting,
                                   bool wasNearEdge);
    void updateCumulativeMaxStats();
    // true: the per-frame clear; false: the full reset.
    void clear(bool perFrame);

    double timeSince(double time) const { return currentTimestamp() - time; }
    double timeSinceFingerTouch() const { return timeSince(t_recentFingerTouchDown_); }
    double timeSinceScrollEnd() const { return timeSince(t_recentScrollEnd_); }
    double timeSinceScaleEnd() const { return timeSince(t_recentScaleEnd_); }
    double timeSinceRotateEnd() const { return timeSince(t_recentRotateEnd_); }
    double timeSinceSwipeEnd() const { return timeSince(t_recentSwipeEnd_); }
    double timeSinceTwoFingerTap() const { return timeSince(t_recentTwoFingerTap_); }
    double timeSinceSingleFingerTap() const { return timeSince(t_recentSingleFingerTap_); }
    double timeSinceLastReset() const { return timeSince(t_recentReset_); }
    double timeSinceRecentFingerLiftoff() const { return timeSince(t_recentFingerLiftoff_); }
    double timeSinceLastButtonActivity() const { return timeSince(t_recentButtonActivity_); }

    void setTimeofTwoFingerTap(double t) { t_recentTwoFingerTap_ = t; }
    void setTimeofSingleFingerTap(double t) { t_recentSingleFingerTap_ = t; }
    void setTimeofScrollEnd(double t) { t_recentScrollEnd_ = t; }
    void setTimeofSwipeEnd(double t) { t_recentSwipeEnd_ = t; }
    void setTimeofScaleEnd(double t) { t_recentScaleEnd_ = t; }
    void setTimeofRotateEnd(double t) { t_recentRotateEnd_ = t; }

    bool lastFingerLiftedWasOnEdge() const { return recentFingerLiftedWasOnEdge_; }
    bool lastFingerLiftedWasThumb() const { return recentFingerLiftedWasThumb_; }
    bool lastFingerLiftedWasLastFingerTouched() const {
        return pathID_recentFingerTouched_ == pathID_recentFingerLifted_;
    }
    int numFingersTouchingOrResting() const { return numFingersTouching_ + numFingersRestingInZone_; }
    double timeBetweenMostRecentTouches() const { return t_recentFingerTouchDown_ - t_previousRecentFingerTouchDown_; }

    HID_PROPERTY(bool, engagedinGesture, setEngagedinGesture)
    HID_PROPERTY(bool, twoFingersClose, setTwoFingersClose)
    HID_PROPERTY(bool, palmsRemoved, setPalmsRemoved)
    HID_PROPERTY(bool, werePalmsRemoved, setWerePalmsRemoved)
    HID_PROPERTY(bool, recentFingerLiftedWasOnEdge, setRecentFingerLiftedWasOnEdge)
    HID_PROPERTY(bool, recentFingerLiftedWasThumb, setRecentFingerLiftedWasThumb)
    HID_PROPERTY(int, handsign, setHandsign)
    HID_PROPERTY(int, pathID_recentFingerTouched, setPathID_recentFingerTouched)
    HID_PROPERTY(int, pathID_recentFingerLifted, setPathID_recentFingerLifted)
    HID_PROPERTY(int, numFingersTouching, setNumFingersTouching)
    HID_PROPERTY(int, numFingersRestingInZone, setNumFingersRestingInZone)
    HID_PROPERTY(int, lastNumFingersTouching, setLastNumFingersTouching)
    HID_PROPERTY(int, maxFingersTouching, setMaxFingersTouching)
    HID_PROPERTY(int, numFingersReidentifiedAsPalms, setNumFingersReidentifiedAsPalms)
    HID_PROPERTY(int, numConsecutiveLiftoffsCountingThumb, setNumConsecutiveLiftoffsCountingThumb)
    HID_PROPERTY(int, numPaths, setNumPaths)
    HID_PROPERTY(int, lastNumPaths, setLastNumPaths)
    HID_PROPERTY(int, currentButtonState, setCurrentButtonState)
    HID_PROPERTY(int, lastButtonState, setLastButtonState)
    HID_PROPERTY(double, t_recentReset, setT_recentReset)
    HID_PROPERTY(double, t_firstFingerTouchDown, setT_firstFingerTouchDown)
    HID_PROPERTY(double, t_recentFingerTouchDown, setT_recentFingerTouchDown)
    HID_PROPERTY(double, t_previousRecentFingerTouchDown, setT_previousRecentFingerTouchDown)
    HID_PROPERTY(double, t_recentTwoFingerTap, setT_recentTwoFingerTap)
    HID_PROPERTY(double, t_recentSingleFingerTap, setT_recentSingleFingerTap)
    HID_PROPERTY(double, t_recentScrollEnd, setT_recentScrollEnd)
    HID_PROPERTY(double, t_recentSwipeEnd, setT_recentSwipeEnd)
    HID_PROPERTY(double, t_recentRotateEnd, setT_recentRotateEnd)
    HID_PROPERTY(double, t_recentScaleEnd, setT_recentScaleEnd)
    HID_PROPERTY(double, t_recentFingerLiftoff, setT_recentFingerLiftoff)
    HID_PROPERTY(double, t_recentButtonActivity, setT_recentButtonActivity)
    HID_PROPERTY(HIDPoint, previousFingerLiftoffLocation, setPreviousFingerLiftoffLocation)
    HID_PROPERTY(HIDPoint, recentFingerLiftoffLocation, setRecentFingerLiftoffLocation)

private:
    // The clock, the per-frame clear and the button state, before the paths are counted.
    void beginFrame(const HIDPathStates& pathStates);
    // Counts one path found for an ID.
    void countPath(const HIDParserPath& path, int id);

    bool engagedinGesture_ = false;
    bool twoFingersClose_ = false;
    bool palmsRemoved_ = false;
    bool werePalmsRemoved_ = false;
    bool recentFingerLiftedWasOnEdge_ = false;
    bool recentFingerLiftedWasThumb_ = false;
    int handsign_ = 0;
    int pathID_recentFingerTouched_ = 0;
    int pathID_recentFingerLifted_ = 0;
    int numFingersTouching_ = 0;
    int numFingersRestingInZone_ = 0;
    int lastNumFingersTouching_ = 0;
    int maxFingersTouching_ = 0;
    int numFingersReidentifiedAsPalms_ = 0;
    int numConsecutiveLiftoffsCountingThumb_ = 0;
    int numPaths_ = 0;
    int lastNumPaths_ = 0;
    int currentButtonState_ = 0;
    int lastButtonState_ = 0;
    double t_recentReset_ = 0.0;
    double t_firstFingerTouchDown_ = 0.0;
    double t_recentFingerTouchDown_ = 0.0;
    double t_previousRecentFingerTouchDown_ = 0.0;
    double t_recentTwoFingerTap_ = 0.0;
    double t_recentSingleFingerTap_ = 0.0;
    double t_recentScrollEnd_ = 0.0;
    double t_recentSwipeEnd_ = 0.0;
    double t_recentRotateEnd_ = 0.0;
    double t_recentScaleEnd_ = 0.0;
    double t_recentFingerLiftoff_ = 0.0;
    double t_recentButtonActivity_ = 0.0;
    HIDPoint previousFingerLiftoffLocation_{};
    HIDPoint recentFingerLiftoffLocation_{};
};

}  // namespace orvane
