#include "orvo/filter_graph/internal/CloneGraphVisitor.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/IAdapter.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"

namespace ORVO::FilterGraph::Internal {

CloneGraphVisitor::CloneGraphVisitor(std::map<Filter*, std::shared_ptr<Filter>>* pClones,
                                     ParameterForwarder* pForwarder)
    : pClones_(pClones), pForwarder_(pForwarder) {}

CloneGraphVisitor::~CloneGraphVisitor() = default;

void CloneGraphVisitor::preVisit(Filter* pFilter) {
    std::shared_ptr<Filter> const spClone = pFilter->clone();
    ORVO_ENFORCE(spClone.get());
    ORVO_CHECK(pFilter->getTimeStamp() == spClone->getClonedTimeStamp());
    (*pClones_)[pFilter] = spClone;
    if (!dynamic_cast<IAdapter*>(pFilter)) {
        pForwarder_->addForward(*pFilter, *spClone);
    }
}

} // namespace ORVO::FilterGraph::Internal
