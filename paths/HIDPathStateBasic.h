#pragma once
// The path table: 15 finger paths made once (slot 0 never used, slots 1..14 for contact
// indices 0..13), the unpacking of each contact frame into it, and the per-frame counts,
// bottom-most path, diving-button membership, fastest-finger speeds and centroid.

#include <memory>
#include <vector>

#include "common/HIDTypes.h"
#include "pipeline/HIDParserPath.h"
#include "pipeline/HIDTimeState.h"
#include "platform/HIDEvent.h"

namespace orvane {

class HIDPathStateBasic : public HIDTimeState {
public:
    static constexpr int kNumPaths = 15;

    // initWithHeight:width: — makes the 15 paths.
    HIDPathStateBasic(float height, float width);
    ~HIDPathStateBasic() override;
    HIDPathStateBasic(const HIDPathStateBasic&) = delete;
    HIDPathStateBasic& operator=(const HIDPathStateBasic&) = delete;

    bool unpackContactFrame(const HIDEventRef& frame, double time);
    void clearExistingPathLiftoffsAndMasks(const HIDEventRef& frame);
    void expandAndFilterPackedContacts(const HIDEventRef& frame);
    int getNumberOfContacts(const HIDEventRef& frame) const;
    // The path at a slot; nullptr outside the table.
    HIDParserPath* getParserPath(int slot) const;
    // The first path of slots 1..14 whose current contact has this ID; nullptr for none (and for 0).
    HIDParserPath* getParserPathforPathID(int pathID) const {
        // A cleared path has ID 0; it is never found.
        if (pathID == 0) return nullptr;
        // While the slots before this ID's own slot carry their own IDs or none, none of them
        // has this one, and the first slot that does is the ID's own, when it does; while no
        // slot carries another's ID, no other slot has it at all. The table only ever reads
        // contacts into their own slots, so the search is for paths changed from outside.
        if (pathID >= 1 && pathID < kNumPaths) {
            HIDParserPath* own = paths_[static_cast<size_t>(pathID)].get();
            if ((looseSlots_ & ((1u << pathID) - 1)) == 0 && own->currentContact().path_id == pathID) return own;
        }
        if (looseSlots_ == 0) return nullptr;
        return findParserPathforPathIDBySearch(pathID);
    }
    // The same answer found by looking at every slot in turn.
    HIDParserPath* findParserPathforPathIDBySearch(int pathID) const;

    int countFingersOnDivingButton();
    bool anyNewContact() const { return numNewContacts_ > 0; }
    void updateFastestFingerSpeed();
    bool calculateCentroidOfPaths(HIDPoint* centroid) const;

    const std::vector<std::shared_ptr<HIDParserPath>>& paths() const { return paths_; }
    HID_PROPERTY(int, numNewContacts, setNumNewContacts)
    HID_PROPERTY(int, numNonEdgeTouches, setNumNonEdgeTouches)
    HID_PROPERTY(int, numTouches, setNumTouches)
    HID_PROPERTY(int, lastNumTouches, setLastNumTouches)
    HID_PROPERTY(int, numPalms, setNumPalms)
    HID_PROPERTY(int, bottomDivingPathIndex, setBottomDivingPathIndex)
    HID_PROPERTY(int, numFingersOnDivingButton, setNumFingersOnDivingButton)
    HID_PROPERTY(int, numEdgeTouchesOnDivingButton, setNumEdgeTouchesOnDivingButton)
    HID_PROPERTY(float, dampedSpeedOfFastestFinger, setDampedSpeedOfFastestFinger)
    HID_PROPERTY(HIDPoint, dampedVelocityOfFastestFinger, setDampedVelocityOfFastestFinger)
    HID_PROPERTY(float, maxFingerSpeed, setMaxFingerSpeed)
    HID_PROPERTY(unsigned int, currentlyTouchedZones, setCurrentlyTouchedZones)

private:
    std::vector<std::shared_ptr<HIDParserPath>> paths_;
    // Bit s is set while the contact of slot s may carry an ID other than s or 0 (the paths
    // keep it up to date, see HIDParserPath::linkToTable).
    uint32_t looseSlots_ = 0;
    int numNewContacts_ = 0;
    int numNonEdgeTouches_ = 0;
    int numTouches_ = 0;
    int lastNumTouches_ = 0;
    int numPalms_ = 0;
    int bottomDivingPathIndex_ = 0;
    int numFingersOnDivingButton_ = 0;
    int numEdgeTouchesOnDivingButton_ = 0;
    float dampedSpeedOfFastestFinger_ = 0.0f;
    HIDPoint dampedVelocityOfFastestFinger_{};
    float maxFingerSpeed_ = 0.0f;
    unsigned int currentlyTouchedZones_ = 0;
};

}  // namespace orvane
