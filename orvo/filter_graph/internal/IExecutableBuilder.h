#pragma once

#include <memory>

#include "orvo/core/Export.h"
#include "orvo/core/TargetPlatform.h"

namespace ORVO::FilterGraph::Internal {

class GraphExecutable;
class IFilterExecutable;

/// The side of a filter that the graph compiler sees: whether and how it becomes something that runs.
///
/// Threads: the thread that owns the graph.
class ORVO_API IExecutableBuilder {
public:
    virtual ~IExecutableBuilder();

    /// Whether `buildFilterExecutable` can serve this target.
    virtual bool canBuildFilterExecutable(TargetPlatform target) const = 0;

    /// Makes the executable of this filter for `target`, with its node on the controller of
    /// `graphExecutable`. The executable keeps references to this filter and to `graphExecutable`, which must
    /// both outlive it.
    virtual std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform target,
                                                                     GraphExecutable& graphExecutable) = 0;

protected:
    IExecutableBuilder() = default;
    IExecutableBuilder(IExecutableBuilder const&) = default;
    IExecutableBuilder& operator=(IExecutableBuilder const&) = default;
};

} // namespace ORVO::FilterGraph::Internal
