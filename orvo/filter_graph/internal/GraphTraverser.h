#pragma once

#include <vector>

#include "orvo/core/Export.h"

namespace ORVO::FilterGraph {
class IFilter;
} // namespace ORVO::FilterGraph

namespace ORVO::FilterGraph::Internal {

class Filter;
class INodeVisitor;

/// Walks a graph of filters upstream, from one filter to the producers of its inputs, and finds cycles and
/// inputs without a producer on the way. The walk keeps its own stack, so that the depth of a graph is
/// bounded by memory alone.
///
/// The marks of a walk stand in the filters. A walk that succeeds leaves all of them at 0, and so does a walk
/// that a visitor (or a lack of memory) ended. A walk that found a cycle or an unconnected input leaves its
/// marks behind, and a later walk over such a graph reports a cycle that is not there: call `resetGraph` once
/// the graph is whole again, or `clearMarks` on the object that made the failed walk.
///
/// Threads: the thread that owns the graph; no two walks over one graph at a time.
class ORVO_API GraphTraverser {
public:
    /// Neither argument is owned; both must live while a walk goes on. `graph` is where the walk starts.
    /// Throws InternalException "Enforce pGraph_ != NULL" on a null graph.
    GraphTraverser(IFilter* graph, INodeVisitor* visitor);

    /// Visits each reachable filter once: `preVisit` before its producers, `postVisit` after all of them.
    /// Throws FilterGraph::Exception "<filter>: circular reference detected in filter", where the filter is
    /// the one at which the path closes, or "<filter>::<input> is not connected" for the first such input
    /// that the walk meets.
    void depthFirstTraversal();

    /// Not offered: always throws InternalException "Not implemented.".
    void breadthFirstTraversal();

    /// Sets the marks of the start and of all marked filters above it back to 0. Inputs must be connected:
    /// throws InternalException "Enforce pSource != NULL" otherwise.
    void resetGraph();

    /// Sets the marks that the last walk of this object left back to 0, also in a graph that is not whole.
    /// All filters of that walk must still live.
    void clearMarks() noexcept;

private:
    void traverseDepthFirst(Filter* pFilter);
    void traverseAndResetGraph(Filter* pFilter);

    IFilter* pGraph_;
    INodeVisitor* pVisitor_;
    std::vector<Filter*> aMarked_; // in the order of marking, so that marks can be taken back without a walk
};

} // namespace ORVO::FilterGraph::Internal
