#include "HIDHandStatistics.h"

#include "paths/HIDPathStates.h"

namespace orvane {

namespace {
constexpr int kFirstPathID = 1;
constexpr int kLastPathID = 14;
}  // namespace

bool HIDHandStatistics::processHandState(const HIDPathStates& pathStates) {
    beginFrame(pathStates);
    // Only the slots that can hold a contact are looked at, in the same ascending ID order.
    pathStates.forEachPathByID([this](const HIDParserPath* path, int id) { countPath(*path, id); });
    updateCumulativeMaxStats();
    return numPaths_ > 0;
}

bool HIDHandStatistics::processHandStateOneByOne(const HIDPathStates& pathStates) {
    beginFrame(pathStates);
    for (int id = kFirstPathID; id <= kLastPathID; ++id) {
        const HIDParserPath* path = pathStates.getParserPathforPathID(id);
        if (!path || path->currentContact().path_id != id) continue;
        const HIDPathTimestamps timestamps = path->timestamps();
        const bool isTouching = path->isTouching();
        updateStatsWithPath(*path);
        if (path->isFingerOrRestingContact()) {
            updateStatsWithFingerPath(id, path->currentContact().position, timestamps, isTouching,
                                      path->wasTouching() && path->wasFingerOrRestingContact(),
                                      path->isRestingInThumbZone(), path->wasResting(),
                                      path->fingerLiftoffNearEdgeframeInterval());
        }
    }
    updateCumulativeMaxStats();
    return numPaths_ > 0;
}

void HIDHandStatistics::beginFrame(const HIDPathStates& pathStates) {
    // The statistics' clock follows the path table's.
    updateFrameTimestamp(pathStates.currentTimestamp());
    clear(true);

    // A change is time-stamped one frame after it is read, like the path table's; intended.
    if (lastButtonState_ != currentButtonState_) t_recentButtonActivity_ = currentTimestamp();
    lastButtonState_ = currentButtonState_;
    currentButtonState_ = pathStates.buttonState();
}

void HIDHandStatistics::countPath(const HIDParserPath& path, int id) {
    if (path.currentContact().path_id != id) return;
    updateStatsWithPath(path);
    if (path.isFingerOrRestingContact()) {
        const bool isTouching = path.isTouching();
        // The lift-off edge test answers false for a touching path, so it is asked only of
        // the others; the timestamps are read in place.
        updateStatsWithFingerPath(id, path.currentContact().position, path.timestamps(), isTouching,
                                  path.wasTouching() && path.wasFingerOrRestingContact(),
                                  path.isRestingInThumbZone(), path.wasResting(),
                                  !isTouching && path.fingerLiftoffNearEdgeframeInterval());
    }
}

void HIDHandStatistics::updateStatsWithPath(const HIDParserPath& path) {
    ++numPaths_;
    if (path.wasFingerOrRestingContact() && path.isPalmContact()) ++numFingersReidentifiedAsPalms_;
}

void HIDHandStatistics::updateStatsWithFingerPath(int pathID, HIDPoint contactLoc, const HIDPathTimestamps& timestamps,
                                                  bool isTouching, bool wasTouching, bool isResting, bool wasResting,
                                                  bool wasNearEdge) {
    if (isTouching) {
        if (isResting) {
            ++numFingersRestingInZone_;
        } else {
            ++numFingersTouching_;
        }
        if (!wasTouching) {
            t_previousRecentFingerTouchDown_ = t_recentFingerTouchDown_;
            t_recentFingerTouchDown_ = timestamps.t_makeTouch;
            pathID_recentFingerTouched_ = pathID;
            if (lastNumFingersTouching_ == 0) t_firstFingerTouchDown_ = timestamps.t_makeTouch;
        }
    } else if (wasTouching) {
        // Strictly later only: of several lifts with one break time the lowest path ID stays.
        if (t_recentFingerLiftoff_ < timestamps.t_breakTouch) {
            t_recentFingerLiftoff_ = timestamps.t_breakTouch;
            pathID_recentFingerLifted_ = pathID;
            previousFingerLiftoffLocation_ = recentFingerLiftoffLocation_;
            recentFingerLiftedWasThumb_ = wasResting;
            recentFingerLiftedWasOnEdge_ = wasNearEdge;
            recentFingerLiftoffLocation_ = contactLoc;
        }
        ++numConsecutiveLiftoffsCountingThumb_;
    }
}

void HIDHandStatistics::updateCumulativeMaxStats() {
    // The most fingers of the current touch sequence: gone once no finger touches (a resting
    // thumb does not count), on purpose.
    if (numFingersTouching_ < 1) {
        maxFingersTouching_ = 0;
    } else if (numFingersTouching_ > maxFingersTouching_) {
        maxFingersTouching_ = numFingersTouching_;
    }
}

void HIDHandStatistics::clear(bool perFrame) {
    if (perFrame) {
        lastNumPaths_ = numPaths_;
        lastNumFingersTouching_ = numFingersTouching_;
    } else {
        maxFingersTouching_ = 0;
        lastNumPaths_ = 0;
        lastNumFingersTouching_ = 0;
        t_previousRecentFingerTouchDown_ = 0.0;
        pathID_recentFingerTouched_ = 0;
        pathID_recentFingerLifted_ = 0;
        t_recentReset_ = currentTimestamp();
        t_recentButtonActivity_ = 0.0;
        t_firstFingerTouchDown_ = 0.0;
        t_recentFingerTouchDown_ = 0.0;
        t_recentFingerLiftoff_ = 0.0;
        recentFingerLiftedWasThumb_ = false;
        recentFingerLiftedWasOnEdge_ = false;
        numConsecutiveLiftoffsCountingThumb_ = 0;
    }
    numPaths_ = 0;
    numFingersTouching_ = 0;
    numFingersRestingInZone_ = 0;
    numFingersReidentifiedAsPalms_ = 0;
}

}  // namespace orvane
