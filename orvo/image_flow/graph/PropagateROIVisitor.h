#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/graph/Visitor.h"

namespace ORVO {

/// Hands the region of interest of each node on to its producers on entering it. Suits trees and
/// breadth-first walks: where a node has several consumers, plain pre-order would hand it on before all of
/// them have asked. Throws `InternalException` "Enforce pImageFilter != NULL" for a node that is no image
/// node, and what the operation of the node throws.
///
/// Threads: the walk's.
class ORVO_API PropagateROIVisitor : public Visitor {
public:
    ~PropagateROIVisitor() override;
    void preVisitImageNode(ImageFilter* pImageFilter) override;
    void postVisitImageNode(ImageFilter* pImageFilter) override;
};

} // namespace ORVO
