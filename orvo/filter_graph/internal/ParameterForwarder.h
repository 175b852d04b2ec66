#pragma once

#include "orvo/core/Export.h"

#include <memory>
#include <utility>
#include <vector>

namespace ORVO::DataFlow {
class Node;
class ParameterBase;
} // namespace ORVO::DataFlow

namespace ORVO::FilterGraph {
class ParameterBase;
}

namespace ORVO::FilterGraph::Internal {

class Filter;

/// Copies parameter values along pairs of parameters: from the client's filters to their clones, and from
/// those to the nodes of the compiled graph, before each frame.
///
/// The parameters are plain pointers: whoever adds a pair keeps both alive.
///
/// Threads: the thread that owns the graph.
class ORVO_API ParameterForwarder {
public:
    ParameterForwarder();

    /// Copies the values of all pairs, in the order in which they were added. The children are not visited.
    /// @throws InternalException "isOfType<T>()" if the two of a pair are of different types.
    virtual void forwardStuff();

    /// Nothing flows back by default.
    virtual void returnStuff();

    /// Forgets pairs and children.
    virtual void clear();

    virtual ~ParameterForwarder();

    ParameterForwarder(ParameterForwarder const&) = delete;
    ParameterForwarder& operator=(ParameterForwarder const&) = delete;

    /// Adds one pair.
    void addForward(FilterGraph::ParameterBase const& source, FilterGraph::ParameterBase& destination);

    /// Adds a pair for each parameter of the node of which the filter has a namesake.
    void addForward(Filter const& source, DataFlow::Node& destination);

    /// Adds a pair for each parameter of the destination of which the source has a namesake.
    void addForward(Filter const& source, Filter& destination);

    /// Adds one pair.
    /// @throws InternalException "Enforce source != NULL" or "Enforce destination != NULL" for null.
    void addForwardPtr(DataFlow::ParameterBase const* source, DataFlow::ParameterBase* destination);

    /// Adds a forwarder that `forwardChildren` runs.
    /// @throws InternalException "Enforce spChild.get() != NULL" for an empty pointer.
    void addChild(std::shared_ptr<ParameterForwarder> spChild);

    /// Runs the forwarder behind a pointer; for use on lists of them.
    static void forwardByPtr(std::shared_ptr<ParameterForwarder> const& spForwarder);

protected:
    /// Source and destination.
    using Pair = std::pair<DataFlow::ParameterBase const*, DataFlow::ParameterBase*>;

    /// Copies the value of one pair.
    /// @throws InternalException "isOfType<T>()" if the two are of different types.
    static void doForward(Pair const& pair);

    /// Runs the children in the order in which they were added.
    void forwardChildren();

private:
    std::vector<Pair> aForwards_;
    std::vector<std::shared_ptr<ParameterForwarder>> aChildren_;
};

} // namespace ORVO::FilterGraph::Internal
