#pragma once
// Maps finger identities to the paths that carry them and picks the innermost,
// next-innermost and outermost touching fingers, in two views: the plain view (no palms,
// no thumb resting in the thumb zone) and the WithResting view (no palms only).

#include <array>
#include <bit>
#include <cstdint>

#include "common/HIDTypes.h"
#include "paths/HIDPathStateBasic.h"
#include "pipeline/HIDParserPath.h"
#include "pipeline/HIDTimeState.h"

namespace orvane {

class HIDFingerToPathMap : public HIDTimeState {
public:
    static constexpr int kNumFingerIDs = 16;
    // The largest finger ID the maps hold; larger IDs are counted but not mapped.
    static constexpr uint32_t kMaxMappedFingerID = kNumFingerIDs - 1;

    HIDFingerToPathMap() = default;

    // Maps the paths found for IDs 1..14, visiting only the slots that can hold one, after
    // clearing only the entries the last mapping set. Inline, as it runs on every frame.
    void updateFingerPathMappings(const HIDPathStateBasic& pathTable) {
        clearMappedEntries();
        // Only the slots that can hold a contact are looked at, in the same ascending ID order.
        pathTable.forEachPathByID([this](const HIDParserPath* path, int pathID) { mapPath(*path, pathID); });
        updateMaxFingersTouching();
    }
    // The same, clearing every entry and asking the table for every ID from 1 to 14 in turn.
    void updateFingerPathMappingsOneByOne(const HIDPathStateBasic& pathTable);
    // Clears every entry of both maps and the per-frame picks.
    void clearFingerPathMappings();
    int32_t getPathIndexforFingerID(uint32_t fingerID, bool withResting) const {
        if (fingerID > kMaxMappedFingerID) return 0;
        return withResting ? fingersToPathIDsWithResting_[fingerID] : fingersToPathIDs_[fingerID];
    }
    // Inline, as the motion stage asks for these on every frame.
    HIDParserPath* getInnermostTouchingPath(const HIDPathStateBasic& pathTable, bool withResting) const {
        const int32_t fingerID = withResting ? innermostTouchingFingerIDWithResting_ : innermostTouchingFingerID_;
        return pathTable.getParserPathforPathID(getPathIndexforFingerID(static_cast<uint32_t>(fingerID), withResting));
    }
    HIDParserPath* getOutermostTouchingPath(const HIDPathStateBasic& pathTable, bool withResting) const {
        const int32_t fingerID = withResting ? outermostTouchingFingerIDWithResting_ : outermostTouchingFingerID_;
        return pathTable.getParserPathforPathID(getPathIndexforFingerID(static_cast<uint32_t>(fingerID), withResting));
    }
    HIDParserPath* getNextInnermostTouchingPath(const HIDPathStateBasic& pathTable) const;
    bool innermostOrOutermostIsThumb() const;
    void updateMaxFingersTouching() {
        if (numFingersTouching_ > maxFingersTouching_) {
            maxFingersTouching_ = numFingersTouching_;
        } else if (numFingersTouching_ == 0) {
            clearMaxFingersTouching();
        }
    }
    void clearMaxFingersTouching() { maxFingersTouching_ = 0; }

    const std::array<int32_t, kNumFingerIDs>& fingersToPathIDs() const { return fingersToPathIDs_; }
    const std::array<int32_t, kNumFingerIDs>& fingersToPathIDsWithResting() const {
        return fingersToPathIDsWithResting_;
    }
    HID_PROPERTY(uint8_t, numFingersTouching, setNumFingersTouching)
    HID_PROPERTY(uint8_t, numFingersTouchingWithResting, setNumFingersTouchingWithResting)
    HID_PROPERTY(uint8_t, maxFingersTouching, setMaxFingersTouching)
    HID_PROPERTY(uint8_t, numFingersStraddlingEdge, setNumFingersStraddlingEdge)
    HID_PROPERTY(uint8_t, numPalmContacts, setNumPalmContacts)
    HID_PROPERTY(int32_t, handIdentity, setHandIdentity)
    HID_PROPERTY(int32_t, innermostTouchingFingerID, setInnermostTouchingFingerID)
    HID_PROPERTY(int32_t, nextInnermostTouchingFingerID, setNextInnermostTouchingFingerID)
    HID_PROPERTY(int32_t, outermostTouchingFingerID, setOutermostTouchingFingerID)
    HID_PROPERTY(int32_t, innermostTouchingFingerIDWithResting, setInnermostTouchingFingerIDWithResting)
    HID_PROPERTY(int32_t, outermostTouchingFingerIDWithResting, setOutermostTouchingFingerIDWithResting)

    // The finger IDs whose entries are set in the maps (bit n for ID n): every entry outside
    // it is 0.
    uint32_t mappedFingerIDs() const { return mappedFingerIDs_; }

private:
    // What clearFingerPathMappings leaves, clearing only the entries in mappedFingerIDs.
    void clearMappedEntries() {
        for (uint32_t bits = mappedFingerIDs_; bits != 0; bits &= bits - 1) {
            const auto fingerID = static_cast<size_t>(std::countr_zero(bits));
            fingersToPathIDs_[fingerID] = 0;
            fingersToPathIDsWithResting_[fingerID] = 0;
        }
        mappedFingerIDs_ = 0;
        clearPicks();
    }
    // The per-frame picks and counts that clearFingerPathMappings clears.
    void clearPicks() {
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
    // Counts and maps one path found for an ID.
    void mapPath(const HIDParserPath& path, int pathID) {
        const HIDContact& contact = path.currentContact();
        if (contact.path_id != pathID) return;

        // Finger IDs are compared as unsigned numbers; 0 stands for no finger.
        const auto fingerID = static_cast<uint32_t>(contact.finger_id);
        if (fingerID <= kMaxMappedFingerID) {
            // A later path with the same finger ID takes the entry over.
            fingersToPathIDs_[fingerID] = pathID;
            fingersToPathIDsWithResting_[fingerID] = pathID;
            mappedFingerIDs_ |= 1u << fingerID;
        }

        const bool isPalm = path.isPalmContact();
        const bool isTouching = path.isTouching();
        if (isPalm) {
            numPalmContacts_ = static_cast<uint8_t>(numPalmContacts_ + 1);
        } else if (isTouching && !path.isRestingInThumbZone()) {
            numFingersTouching_ = static_cast<uint8_t>(numFingersTouching_ + 1);

            if (innermostTouchingFingerID_ == 0 || fingerID < static_cast<uint32_t>(innermostTouchingFingerID_)) {
                nextInnermostTouchingFingerID_ = innermostTouchingFingerID_;
                innermostTouchingFingerID_ = static_cast<int32_t>(fingerID);
                handIdentity_ = 1;
            } else if (nextInnermostTouchingFingerID_ == 0) {
                // A finger that is not the new innermost never fills an empty next-innermost
                // slot, on purpose: fingers met in ascending ID order leave it at 0.
            } else if (fingerID < static_cast<uint32_t>(nextInnermostTouchingFingerID_)) {
                nextInnermostTouchingFingerID_ = static_cast<int32_t>(fingerID);
                handIdentity_ = 1;
            }

            if (outermostTouchingFingerID_ == 0 || fingerID > static_cast<uint32_t>(outermostTouchingFingerID_)) {
                outermostTouchingFingerID_ = static_cast<int32_t>(fingerID);
                handIdentity_ = 1;
            }
        }

        // The WithResting view: every touching non-palm contact, a resting thumb included.
        if (isTouching && !isPalm) {
            // An 8-bit count that is never cleared, so it wraps past 255.
            numFingersTouchingWithResting_ = static_cast<uint8_t>(numFingersTouchingWithResting_ + 1);
            if (innermostTouchingFingerIDWithResting_ == 0 ||
                fingerID < static_cast<uint32_t>(innermostTouchingFingerIDWithResting_)) {
                innermostTouchingFingerIDWithResting_ = static_cast<int32_t>(fingerID);
            }
            if (outermostTouchingFingerIDWithResting_ == 0 ||
                fingerID > static_cast<uint32_t>(outermostTouchingFingerIDWithResting_)) {
                outermostTouchingFingerIDWithResting_ = static_cast<int32_t>(fingerID);
            }
        }
    }

    std::array<int32_t, kNumFingerIDs> fingersToPathIDs_{};
    std::array<int32_t, kNumFingerIDs> fingersToPathIDsWithResting_{};
    uint8_t numFingersTouching_ = 0;
    uint8_t numFingersTouchingWithResting_ = 0;
    uint8_t maxFingersTouching_ = 0;
    uint8_t numFingersStraddlingEdge_ = 0;
    uint8_t numPalmContacts_ = 0;
    int32_t handIdentity_ = 0;
    int32_t innermostTouchingFingerID_ = 0;
    int32_t nextInnermostTouchingFingerID_ = 0;
    int32_t outermostTouchingFingerID_ = 0;
    int32_t innermostTouchingFingerIDWithResting_ = 0;
    int32_t outermostTouchingFingerIDWithResting_ = 0;
    uint32_t mappedFingerIDs_ = 0;
};

}  // namespace orvane
