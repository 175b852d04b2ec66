#include "orvo/image_flow/graph/DFSPostStackVisitor.h"

namespace ORVO {

DFSPostStackVisitor::~DFSPostStackVisitor() = default;

void DFSPostStackVisitor::preVisitImageNode(ImageFilter* /*pImageFilter*/) {}

void DFSPostStackVisitor::postVisitImageNode(ImageFilter* pImageFilter) { aStack_.push_back(pImageFilter); }

std::vector<ImageFilter*> const& DFSPostStackVisitor::stack() const { return aStack_; }

} // namespace ORVO
