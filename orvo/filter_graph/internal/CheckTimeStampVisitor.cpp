#include "orvo/filter_graph/internal/CheckTimeStampVisitor.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/internal/Filter.h"

namespace ORVO::FilterGraph::Internal {

CheckTimeStampVisitor::CheckTimeStampVisitor(std::map<Filter*, std::shared_ptr<Filter>> const* pClones,
                                             Memory* pMemory)
    : pClones_(pClones), pMemory_(pMemory) {}

CheckTimeStampVisitor::~CheckTimeStampVisitor() = default;

bool CheckTimeStampVisitor::isRemembered(Filter const* pFilter) const {
    return pMemory_ && nVisited_ < pMemory_->size() && (*pMemory_)[nVisited_].pFilter == pFilter;
}

void CheckTimeStampVisitor::preVisit(Filter* pFilter) {
    if (!bUpToDate_) {
        return;
    }
    int clonedTimeStamp = 0;
    if (isRemembered(pFilter)) {
        clonedTimeStamp = (*pMemory_)[nVisited_].clonedTimeStamp;
    } else {
        auto const iClone = pClones_->find(pFilter);
        if (iClone == pClones_->end()) {
            bUpToDate_ = false;
            return;
        }
        std::shared_ptr<Filter> const& spClone = iClone->second;
        ORVO_ENFORCE(spClone.get());
        clonedTimeStamp = spClone->getClonedTimeStamp();
        if (pMemory_) {
            pMemory_->resize(nVisited_);
            pMemory_->push_back({pFilter, clonedTimeStamp});
        }
    }
    ++nVisited_;
    if (pFilter->getTimeStamp() != clonedTimeStamp) {
        bUpToDate_ = false;
    }
}

} // namespace ORVO::FilterGraph::Internal
