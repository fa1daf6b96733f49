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
    mappedFingerIDs_ = 0;
    clearPicks();
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

HIDParserPath* HIDFingerToPathMap::getNextInnermostTouchingPath(const HIDPathStateBasic& pathTable) const {
    return pathTable.getParserPathforPathID(getPathIndexforFingerID(asFingerID(nextInnermostTouchingFingerID_), false));
}

bool HIDFingerToPathMap::innermostOrOutermostIsThumb() const {
    return innermostTouchingFingerID_ == 1 || outermostTouchingFingerID_ == 1;
}

}  // namespace orvane
