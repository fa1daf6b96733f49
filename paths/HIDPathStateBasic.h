#pragma once
// The path table: 15 finger paths made once (slot 0 never used, slots 1..14 for contact
// indices 0..13), the unpacking of each contact frame into it, and the per-frame counts,
// bottom-most path, diving-button membership, fastest-finger speeds and centroid.

#include <array>
#include <bit>
#include <memory>
#include <type_traits>
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
    HIDParserPath* getParserPath(int slot) const {
        if (slot < 0 || slot >= kNumPaths) return nullptr;
        return slots_[static_cast<size_t>(slot)];
    }
    // The first path of slots 1..14 whose current contact has this ID; nullptr for none (and for 0).
    HIDParserPath* getParserPathforPathID(int pathID) const {
        // While no contact carries another slot's ID, the path is the ID's own slot's when its
        // contact carries the ID (a cleared path carries 0, which no slot's bit stands for).
        if (marks_.looseSlots == 0) {
            return static_cast<unsigned>(pathID) < static_cast<unsigned>(kNumPaths) && (marks_.ownSlots >> pathID & 1u)
                       ? slots_[static_cast<size_t>(pathID)]
                       : nullptr;
        }
        // A cleared path has ID 0; it is never found.
        if (pathID == 0) return nullptr;
        // While the slots before this ID's own slot carry their own IDs or none, none of them
        // has this one, and the first slot that does is the ID's own, when it does. The table
        // only ever reads contacts into their own slots, so the search is for paths changed
        // from outside.
        if (pathID >= 1 && pathID < kNumPaths) {
            HIDParserPath* own = slots_[static_cast<size_t>(pathID)];
            if ((marks_.looseSlots & ((1u << pathID) - 1)) == 0 && own->currentContact().path_id == pathID) return own;
        }
        return findParserPathforPathIDBySearch(pathID);
    }
    // The same answer found by looking at every slot in turn.
    HIDParserPath* findParserPathforPathIDBySearch(int pathID) const;

    // Calls visit(path, id) for every ID from 1 to 14 for which getParserPathforPathID finds a
    // path, in ascending ID order, as asking for each ID in turn would. While every contact
    // carries its own slot's ID or none, these are exactly the slots whose contact carries
    // their own ID, so only those are visited. A visit that returns bool stops the walk by
    // returning true, and the walk then returns true. Visits must not change a contact's ID.
    template <typename Visit>
    bool forEachPathByID(Visit&& visit) const {
        if (marks_.looseSlots == 0) {
            for (uint32_t bits = marks_.ownSlots; bits != 0; bits &= bits - 1) {
                const int id = std::countr_zero(bits);
                if (visitStops(visit, slots_[static_cast<size_t>(id)], id)) return true;
            }
            return false;
        }
        for (int id = kFirstSlot; id <= kLastSlot; ++id) {
            HIDParserPath* path = getParserPathforPathID(id);
            if (path && visitStops(visit, path, id)) return true;
        }
        return false;
    }
    // The same walk, asking getParserPathforPathID for every ID in turn.
    template <typename Visit>
    bool forEachPathByIDOneByOne(Visit&& visit) const {
        for (int id = kFirstSlot; id <= kLastSlot; ++id) {
            HIDParserPath* path = getParserPathforPathID(id);
            if (path && visitStops(visit, path, id)) return true;
        }
        return false;
    }
    // Calls visit(path, slot) for every slot from 1 to 14 whose contact carries the slot's own
    // ID, in ascending order. Visits must not change a contact's ID.
    template <typename Visit>
    void forEachPathInOwnSlot(Visit&& visit) const {
        // A slot outside ownSlots carries its own ID only while it is loose.
        for (uint32_t bits = marks_.ownSlots | marks_.looseSlots; bits != 0; bits &= bits - 1) {
            const int slot = std::countr_zero(bits);
            HIDParserPath* path = slots_[static_cast<size_t>(slot)];
            if (path->currentContact().path_id == slot) visitStops(visit, path, slot);
        }
    }
    // The same walk, looking at every slot.
    template <typename Visit>
    void forEachPathInOwnSlotOneByOne(Visit&& visit) const {
        for (int slot = kFirstSlot; slot <= kLastSlot; ++slot) {
            HIDParserPath* path = slots_[static_cast<size_t>(slot)];
            if (path->currentContact().path_id == slot) visitStops(visit, path, slot);
        }
    }
    // Slots whose path may differ from a cleared one (bit s for slot s); every other path of
    // slots 1..14 is exactly as clear() leaves it.
    uint32_t slotsNotClear() const { return marks_.dirtySlots; }
    // The lift-off clearing that looks at every slot: clears every path of slots 1..14 when
    // the frame has no contacts, else every path that does not touch.
    void clearExistingPathLiftoffsAndMasksOneByOne(const HIDEventRef& frame);

    int countFingersOnDivingButton();
    bool anyNewContact() const { return numNewContacts_ > 0; }
    // Keeps the touching paths' damped speeds and velocities for the fastest finger's
    // figures, which are worked out when read (nothing of the frame reads them), and works out
    // maxFingerSpeed.
    void updateFastestFingerSpeed();
    // The same, working the fastest finger's figures out at once: the reference for the one
    // above.
    void updateFastestFingerSpeedLiteral();
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
    float dampedSpeedOfFastestFinger() const;
    void setDampedSpeedOfFastestFinger(float value) {
        dampedSpeedOfFastestFinger_ = value;
        fastestSpeedKept_ = false;
    }
    HIDPoint dampedVelocityOfFastestFinger() const;
    void setDampedVelocityOfFastestFinger(HIDPoint value) {
        dampedVelocityOfFastestFinger_ = value;
        fastestVelocityKept_ = false;
    }
    HID_PROPERTY(float, maxFingerSpeed, setMaxFingerSpeed)
    HID_PROPERTY(unsigned int, currentlyTouchedZones, setCurrentlyTouchedZones)

protected:
    // The table's copy of the diagnostics flag (taken as each frame is unpacked), which its
    // stages and paths test.
    const FrameDiagnostics& frameDiagnostics() const { return marks_.diagnostics; }

private:
    // The two steps of unpacking, given the frame's contact count.
    void clearExistingPathLiftoffsAndMasks(int numContacts);
    void expandAndFilterPackedContacts(const HIDEvent& frame, int numContacts);
    // The diving-button count; with noteDamping, also what updateFastestFingerSpeed notes of
    // each path its walk visits (the same paths while no contact is loose).
    int countFingersOnDivingButton(bool noteDamping);
    // updateFastestFingerSpeed in two steps: before the walk, and for each path it visits.
    void startNotingDamping();
    void noteDampingOf(const HIDParserPath& path);

    static constexpr int kFirstSlot = 1;
    static constexpr int kLastSlot = 14;

    template <typename Visit>
    static bool visitStops(Visit& visit, HIDParserPath* path, int id) {
        if constexpr (std::is_same_v<std::invoke_result_t<Visit&, HIDParserPath*, int>, bool>) {
            return visit(path, id);
        } else {
            visit(path, id);
            return false;
        }
    }

    std::vector<std::shared_ptr<HIDParserPath>> paths_;
    // The same paths, for the lookups of every frame.
    std::array<HIDParserPath*, kNumPaths> slots_{};
    // Kept up to date by the paths themselves (see HIDParserPath::linkToTable).
    HIDPathTableMarks marks_;
    int numNewContacts_ = 0;
    int numNonEdgeTouches_ = 0;
    int numTouches_ = 0;
    int lastNumTouches_ = 0;
    int numPalms_ = 0;
    int bottomDivingPathIndex_ = 0;
    int numFingersOnDivingButton_ = 0;
    int numEdgeTouchesOnDivingButton_ = 0;
    // The damped speed and velocity of each touching path as updateFastestFingerSpeed found
    // them, in slot order; while a Kept flag is set, the figure is worked out from these.
    struct Damping {
        float speed;
        HIDPoint velocity;
    };
    std::array<Damping, kNumPaths> keptDamping_{};
    size_t numKeptDamping_ = 0;
    bool fastestSpeedKept_ = false;
    bool fastestVelocityKept_ = false;
    float dampedSpeedOfFastestFinger_ = 0.0f;
    HIDPoint dampedVelocityOfFastestFinger_{};
    float maxFingerSpeed_ = 0.0f;
    unsigned int currentlyTouchedZones_ = 0;
};

}  // namespace orvane
