#include "orvo/image_flow/graph/PropagatePixelExtentVisitor.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO {

PropagatePixelExtentVisitor::~PropagatePixelExtentVisitor() = default;

void PropagatePixelExtentVisitor::preVisitImageNode(ImageFilter* /*pImageFilter*/) {}

void PropagatePixelExtentVisitor::postVisitImageNode(ImageFilter* pImageFilter) {
    ORVO_ENFORCE(pImageFilter);
    pImageFilter->computePixelExtents();
}

} // namespace ORVO
