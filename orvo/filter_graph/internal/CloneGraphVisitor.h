#pragma once

#include <map>
#include <memory>

#include "orvo/filter_graph/internal/INodeVisitor.h"

namespace ORVO::FilterGraph::Internal {

class ParameterForwarder;

/// Clones each filter visited. The clones are not connected: the walk meets consumers before producers.
///
/// Threads: the thread that owns the graph.
class ORVO_API CloneGraphVisitor : public INodeVisitor {
public:
    /// `pClones` receives a clone for each filter, `pForwarder` a pair for each parameter of each filter that
    /// is no adapter. Neither is owned.
    CloneGraphVisitor(std::map<Filter*, std::shared_ptr<Filter>>* pClones, ParameterForwarder* pForwarder);

    /// Throws InternalException "Enforce spClone.get() != NULL" if `clone` gives nothing, and
    /// "pFilter->getTimeStamp() == spClone->getClonedTimeStamp()" if it gives something that is no copy.
    void preVisit(Filter* pFilter) override;

    ~CloneGraphVisitor() override;

private:
    std::map<Filter*, std::shared_ptr<Filter>>* pClones_;
    ParameterForwarder* pForwarder_;
};

} // namespace ORVO::FilterGraph::Internal
