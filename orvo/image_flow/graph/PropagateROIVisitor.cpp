#include "orvo/image_flow/graph/PropagateROIVisitor.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO {

PropagateROIVisitor::~PropagateROIVisitor() = default;

void PropagateROIVisitor::preVisitImageNode(ImageFilter* pImageFilter) {
    ORVO_ENFORCE(pImageFilter);
    pImageFilter->computeAndSetChildROIs();
}

void PropagateROIVisitor::postVisitImageNode(ImageFilter* /*pImageFilter*/) {}

} // namespace ORVO
