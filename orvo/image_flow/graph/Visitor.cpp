#include "orvo/image_flow/graph/Visitor.h"

namespace ORVO {

Visitor::~Visitor() = default;

} // namespace ORVO
