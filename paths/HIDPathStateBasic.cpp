#include "HIDPathStateBasic.h"

namespace orvane {

HIDPathStateBasic::HIDPathStateBasic(float height, float width) {
    paths_.reserve(kNumPaths);
    for (int i = 0; i < kNumPaths; ++i) paths_.push_back(HIDParserPath::initWithHeight(height, width));
}

bool HIDPathStateBasic::unpackContactFrame(const HIDEventRef&, double time) {
    updateFrameTimestamp(time);
    return true;
}

}  // namespace orvane
