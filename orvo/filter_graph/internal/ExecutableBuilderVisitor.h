#pragma once

#include <map>
#include <memory>

#include "orvo/core/TargetPlatform.h"
#include "orvo/filter_graph/internal/INodeVisitor.h"

namespace ORVO::FilterGraph::Internal {

class GraphExecutable;
class IFilterExecutable;

/// Builds the executable of each filter visited, producers first.
///
/// Threads: the thread that builds the graph.
class ORVO_API ExecutableBuilderVisitor : public INodeVisitor {
public:
    /// `pExecutables` receives the executables; the nodes join the controller of `pGraphExecutable`. Neither
    /// is owned.
    ExecutableBuilderVisitor(std::map<Filter*, std::shared_ptr<IFilterExecutable>>* pExecutables,
                             GraphExecutable* pGraphExecutable, TargetPlatform target);

    /// A filter that has an executable is left alone. Throws InternalException with "pFilter" on null,
    /// "Filter will not run on selected target!" if the filter cannot be built for the target or its node
    /// does not run on the hardware at hand, "filterExecutable.get()" if the filter gives nothing, and
    /// "imageFlowFilterExecutable" or "pImageFlowFilter" if what it gives for a GL graph has no image node.
    void postVisit(Filter* pFilter) override;

    ~ExecutableBuilderVisitor() override;

private:
    std::map<Filter*, std::shared_ptr<IFilterExecutable>>* pExecutables_;
    GraphExecutable* pGraphExecutable_;
    TargetPlatform target_;
};

} // namespace ORVO::FilterGraph::Internal
