#include "HIDFingerToPathMap.h"

#include "paths/HIDPathStateBasic.h"
#include "pipeline/HIDParserPath.h"

namespace orvane {

namespace {

// Path IDs that carry contacts; slot 0 of the table is never used.
constexpr int kFirstPathID = 1;
constexpr int kLastPathID = 14;

// Finger IDs are compared as unsigned numbers; 0 stands for no finger.
inline uint32_t asFingerID(int32_t id) { return static_cast<uint32_t>(id); }

}  // namespace

void HIDFingerToPathMap::clearFingerPathMappings() {
    fingersToPathIDs_.fill(0);
    fingersToPathIDsWithResting_.fill(0);
    innermostTouchingFingerIDWithResting_ = 0;
    outermostTouchingFingerIDWithResting_ = 0;
    innermostTouchingFingerID_ = 0;
    nextInnermostTouchingFingerID_ = 0;
    outermostTouchingFingerID_ = 0;
    numFingersTouching_ = 0;
    numFingersStraddlingEdge_ = 0;
    numPalmContacts_ = 0;
    // numFingersTouchingWithResting, maxFingersTouching and handIdentity stay as they are,
    // on purpose: the WithResting count keeps running across frames.
}

void HIDFingerToPathMap::updateFingerPathMappings(const HIDPathStateBasic& pathTable) {
    clearFingerPathMappings();
    // Only the slots that can hold a contact are looked at, in the same ascending ID order.
    pathTable.forEachPathByID([this](const HIDParserPath* path, int pathID) { mapPath(*path, pathID); });
    updateMaxFingersTouching();
}

void HIDFingerToPathMap::updateFingerPathMappingsOneByOne(const HIDPathStateBasic& pathTable) {
    clearFingerPathMappings();
    for (int pathID = kFirstPathID; pathID <= kLastPathID; ++pathID) {
        const HIDParserPath* path = pathTable.getParserPathforPathID(pathID);
        if (path == nullptr) continue;
        mapPath(*path, pathID);
    }
    updateMaxFingersTouching();
}

void HIDFingerToPathMap::mapPath(const HIDParserPath& path, int pathID) {
    const HIDContact& contact = path.currentContact();
    if (contact.path_id != pathID) return;

    const uint32_t fingerID = asFingerID(contact.finger_id);
    if (fingerID <= kMaxMappedFingerID) {
        // A later path with the same finger ID takes the entry over.
        fingersToPathIDs_[fingerID] = pathID;
        fingersToPathIDsWithResting_[fingerID] = pathID;
    }

    if (path.isPalmContact()) {
        numPalmContacts_ = static_cast<uint8_t>(numPalmContacts_ + 1);
    } else if (path.isTouching() && !path.isRestingInThumbZone()) {
        numFingersTouching_ = static_cast<uint8_t>(numFingersTouching_ + 1);

        if (innermostTouchingFingerID_ == 0 || fingerID < asFingerID(innermostTouchingFingerID_)) {
            nextInnermostTouchingFingerID_ = innermostTouchingFingerID_;
            innermostTouchingFingerID_ = static_cast<int32_t>(fingerID);
            handIdentity_ = 1;
        } else if (nextInnermostTouchingFingerID_ == 0) {
            // A finger that is not the new innermost never fills an empty next-innermost
            // slot, on purpose: fingers met in ascending ID order leave it at 0.
        } else if (fingerID < asFingerID(nextInnermostTouchingFingerID_)) {
            nextInnermostTouchingFingerID_ = static_cast<int32_t>(fingerID);
            handIdentity_ = 1;
        }

        if (outermostTouchingFingerID_ == 0 || fingerID > asFingerID(outermostTouchingFingerID_)) {
            outermostTouchingFingerID_ = static_cast<int32_t>(fingerID);
            handIdentity_ = 1;
        }
    }

    // The WithResting view: every touching non-palm contact, a resting thumb included.
    if (path.isTouching() && !path.isPalmContact()) {
        // An 8-bit count that is never cleared, so it wraps past 255.
        numFingersTouchingWithResting_ = static_cast<uint8_t>(numFingersTouchingWithResting_ + 1);
        if (innermostTouchingFingerIDWithResting_ == 0 ||
            fingerID < asFingerID(innermostTouchingFingerIDWithResting_)) {
            innermostTouchingFingerIDWithResting_ = static_cast<int32_t>(fingerID);
        }
        if (outermostTouchingFingerIDWithResting_ == 0 ||
            fingerID > asFingerID(outermostTouchingFingerIDWithResting_)) {
            outermostTouchingFingerIDWithResting_ = static_cast<int32_t>(fingerID);
        }
    }
}

HIDParserPath* HIDFingerToPathMap::getNextInnermostTouchingPath(const HIDPathStateBasic& pathTable) const {
    return pathTable.getParserPathforPathID(getPathIndexforFingerID(asFingerID(nextInnermostTouchingFingerID_), false));
}

bool HIDFingerToPathMap::innermostOrOutermostIsThumb() const {
    return innermostTouchingFingerID_ == 1 || outermostTouchingFingerID_ == 1;
}

void HIDFingerToPathMap::updateMaxFingersTouching() {
    if (numFingersTouching_ > maxFingersTouching_) {
        maxFingersTouching_ = numFingersTouching_;
    } else if (numFingersTouching_ == 0) {
        clearMaxFingersTouching();
    }
}

}  // namespace orvane
