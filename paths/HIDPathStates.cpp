#include "HIDPathStates.h"

namespace orvane {

void HIDPathStates::updateButtonState(const HIDEventRef&) {}
void HIDPathStates::postFilteringTasks(const HIDEventRef&) {}

}  // namespace orvane
