#include "orvo/image_flow/graph/SetDirtyStateVisitor.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO {

SetDirtyStateVisitor::~SetDirtyStateVisitor() = default;

void SetDirtyStateVisitor::preVisitImageNode(ImageFilter* /*pImageFilter*/) {}

void SetDirtyStateVisitor::postVisitImageNode(ImageFilter* pImageFilter) {
    ORVO_ENFORCE(pImageFilter);
    pImageFilter->updateDirtyState();
}

} // namespace ORVO
