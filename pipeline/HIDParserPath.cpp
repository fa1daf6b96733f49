#include "HIDParserPath.h"

namespace orvane {

HIDParserPath::HIDParserPath(float height, float width) : surfaceDimensions_{width, height} {}

}  // namespace orvane
