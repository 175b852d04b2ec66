#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/graph/Visitor.h"

namespace ORVO {

/// Computes the pixel extents of each node on leaving it, so that they flow from the sources to the sink.
/// Throws `InternalException` "Enforce pImageFilter != NULL" for a node that is no image node, and what the
/// operation of the node throws.
///
/// Threads: the walk's.
class ORVO_API PropagatePixelExtentVisitor : public Visitor {
public:
    ~PropagatePixelExtentVisitor() override;
    void preVisitImageNode(ImageFilter* pImageFilter) override;
    void postVisitImageNode(ImageFilter* pImageFilter) override;
};

} // namespace ORVO
