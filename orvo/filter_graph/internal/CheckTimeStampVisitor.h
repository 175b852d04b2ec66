#pragma once

#include <cstddef>
#include <map>
#include <memory>
#include <vector>

#include "orvo/filter_graph/internal/INodeVisitor.h"

namespace ORVO::FilterGraph::Internal {

/// Finds out whether the clones of a graph still stand for it: each filter visited must have a clone that was
/// made at the filter's present time stamp.
///
/// Threads: the thread that owns the graph.
class ORVO_API CheckTimeStampVisitor : public INodeVisitor {
public:
    /// A filter and the time stamp at which its clone was made.
    struct Entry {
        Filter const* pFilter;
        int clonedTimeStamp;
    };

    /// What a walk found, in the order of its visits. The next walk over the same clones meets the same
    /// filters in the same order, unless the graph changed, and then needs no search. To be emptied together
    /// with the clones.
    using Memory = std::vector<Entry>;

    /// `pClones`: from filter to clone. `pMemory`: that of the last walk over the same clones, or null.
    /// Neither is owned.
    explicit CheckTimeStampVisitor(std::map<Filter*, std::shared_ptr<Filter>> const* pClones,
                                   Memory* pMemory = nullptr);

    /// Throws InternalException "Enforce spClone.get() != NULL" if the filter's entry holds no clone.
    void preVisit(Filter* pFilter) override;

    /// False as soon as a visited filter had no clone, or one of an older state.
    bool isUpToDate() const { return bUpToDate_; }

    ~CheckTimeStampVisitor() override;

private:
    bool isRemembered(Filter const* pFilter) const;

    std::map<Filter*, std::shared_ptr<Filter>> const* pClones_;
    bool bUpToDate_ = true;
    Memory* pMemory_;
    std::size_t nVisited_ = 0;
};

} // namespace ORVO::FilterGraph::Internal
