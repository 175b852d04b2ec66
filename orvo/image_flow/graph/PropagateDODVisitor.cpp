#include "orvo/image_flow/graph/PropagateDODVisitor.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO {

PropagateDODVisitor::~PropagateDODVisitor() = default;

void PropagateDODVisitor::preVisitImageNode(ImageFilter* /*pImageFilter*/) {}

void PropagateDODVisitor::postVisitImageNode(ImageFilter* pImageFilter) {
    ORVO_ENFORCE(pImageFilter);
    pImageFilter->setDomainOfDefinition(pImageFilter->computeDomainOfDefinition());
}

} // namespace ORVO
