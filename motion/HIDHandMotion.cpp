#include "HIDHandMotion.h"

#include "paths/HIDPathStates.h"

namespace orvane {

void HIDHandMotion::processHandMotion(HIDPathStates&, int32_t, int32_t, uint32_t) {}

}  // namespace orvane
