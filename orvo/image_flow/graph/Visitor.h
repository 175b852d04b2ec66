#pragma once

#include "orvo/core/Export.h"

namespace ORVO {

class ImageFilter;

/// What a walk over the image nodes of a graph does at each node. The pointer is null at a node that is no
/// image node.
///
/// Threads: the walk's.
class ORVO_API Visitor {
public:
    virtual ~Visitor();
    /// Called on entering a node, before its producers are visited.
    virtual void preVisitImageNode(ImageFilter* pImageFilter) = 0;
    /// Called on leaving a node, in a depth-first walk after all its producers.
    virtual void postVisitImageNode(ImageFilter* pImageFilter) = 0;

protected:
    Visitor() = default;
    Visitor(Visitor const&) = default;
    Visitor& operator=(Visitor const&) = default;
};

} // namespace ORVO
