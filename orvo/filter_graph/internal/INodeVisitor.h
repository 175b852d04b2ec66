#pragma once

#include "orvo/core/Export.h"

namespace ORVO::FilterGraph::Internal {

class Filter;

/// What a `GraphTraverser` does at each filter. Both hooks do nothing unless overridden; what they throw ends
/// the walk.
///
/// Threads: the thread that owns the graph.
class ORVO_API INodeVisitor {
public:
    /// On entering `pFilter`, before its producers.
    virtual void preVisit(Filter* pFilter);

    /// On leaving `pFilter`, after all its producers.
    virtual void postVisit(Filter* pFilter);

    virtual ~INodeVisitor();

protected:
    INodeVisitor() = default;
    INodeVisitor(INodeVisitor const&) = default;
    INodeVisitor& operator=(INodeVisitor const&) = default;
};

} // namespace ORVO::FilterGraph::Internal
