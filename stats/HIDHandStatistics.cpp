#include "HIDHandStatistics.h"

#include "paths/HIDPathStates.h"

namespace orvane {

bool HIDHandStatistics::processHandState(const HIDPathStates& pathStates) {
    updateFrameTimestamp(pathStates.currentTimestamp());
    return false;
}

}  // namespace orvane
