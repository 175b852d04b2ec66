#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/graph/Visitor.h"

#include <vector>

namespace ORVO {

/// Collects the nodes of a depth-first walk in post-order: each stands after all its producers. Read from its
/// end the stack is a topological order from the sink: each node comes after all its consumers.
///
/// Threads: the walk's.
class ORVO_API DFSPostStackVisitor : public Visitor {
public:
    ~DFSPostStackVisitor() override;
    void preVisitImageNode(ImageFilter* pImageFilter) override;
    void postVisitImageNode(ImageFilter* pImageFilter) override;
    /// The nodes in post-order; they stay the graph's.
    std::vector<ImageFilter*> const& stack() const;

private:
    std::vector<ImageFilter*> aStack_;
};

} // namespace ORVO
