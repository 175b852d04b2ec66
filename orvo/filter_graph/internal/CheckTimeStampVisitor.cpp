#include "orvo/filter_graph/internal/CheckTimeStampVisitor.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/internal/Filter.h"

namespace ORVO::FilterGraph::Internal {

CheckTimeStampVisitor::CheckTimeStampVisitor(std::map<Filter*, std::shared_ptr<Filter>> const* pClones)
    : pClones_(pClones) {}

CheckTimeStampVisitor::~CheckTimeStampVisitor() = default;

void CheckTimeStampVisitor::preVisit(Filter* pFilter) {
    if (!bUpToDate_) {
        return;
    }
    auto const iClone = pClones_->find(pFilter);
    if (iClone == pClones_->end()) {
        bUpToDate_ = false;
        return;
    }
    std::shared_ptr<Filter> const& spClone = iClone->second;
    ORVO_ENFORCE(spClone.get());
    if (pFilter->getTimeStamp() != spClone->getClonedTimeStamp()) {
        bUpToDate_ = false;
    }
}

} // namespace ORVO::FilterGraph::Internal
