#pragma once
// Maps finger identities to the paths that carry them and picks the innermost,
// next-innermost and outermost touching fingers, in two views: the plain view (no palms,
// no thumb resting in the thumb zone) and the WithResting view (no palms only).

#include <array>
#include <cstdint>

#include "common/HIDTypes.h"
#include "paths/HIDPathStateBasic.h"
#include "pipeline/HIDTimeState.h"

namespace orvane {

class HIDFingerToPathMap : public HIDTimeState {
public:
    static constexpr int kNumFingerIDs = 16;
    // The largest finger ID the maps hold; larger IDs are counted but not mapped.
    static constexpr uint32_t kMaxMappedFingerID = kNumFingerIDs - 1;

    HIDFingerToPathMap() = default;

    // Maps the paths found for IDs 1..14, visiting only the slots that can hold one.
    void updateFingerPathMappings(const HIDPathStateBasic& pathTable);
    // The same, asking the table for every ID from 1 to 14 in turn.
    void updateFingerPathMappingsOneByOne(const HIDPathStateBasic& pathTable);
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
    void updateMaxFingersTouching();
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

private:
    // Counts and maps one path found for an ID.
    void mapPath(const HIDParserPath& path, int pathID);

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
};

}  // namespace orvane
