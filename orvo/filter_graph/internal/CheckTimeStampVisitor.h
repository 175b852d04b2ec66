#pragma once

#include <map>
#include <memory>

#include "orvo/filter_graph/internal/INodeVisitor.h"

namespace ORVO::FilterGraph::Internal {

/// Finds out whether the clones of a graph still stand for it: each filter visited must have a clone that was
/// made at the filter's present time stamp.
///
/// Threads: the thread that owns the graph.
class ORVO_API CheckTimeStampVisitor : public INodeVisitor {
public:
    /// `pClones`: from filter to clone; not owned.
    explicit CheckTimeStampVisitor(std::map<Filter*, std::shared_ptr<Filter>> const* pClones);

    /// Throws InternalException "Enforce spClone.get() != NULL" if the filter's entry holds no clone.
    void preVisit(Filter* pFilter) override;

    /// False as soon as a visited filter had no clone, or one of an older state.
    bool isUpToDate() const { return bUpToDate_; }

    ~CheckTimeStampVisitor() override;

private:
    std::map<Filter*, std::shared_ptr<Filter>> const* pClones_;
    bool bUpToDate_ = true;
};

} // namespace ORVO::FilterGraph::Internal
