#include "orvo/filter_graph/internal/ExecutableBuilderVisitor.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO::FilterGraph::Internal {

ExecutableBuilderVisitor::ExecutableBuilderVisitor(
    std::map<Filter*, std::shared_ptr<IFilterExecutable>>* pExecutables, GraphExecutable* pGraphExecutable,
    TargetPlatform target)
    : pExecutables_(pExecutables), pGraphExecutable_(pGraphExecutable), target_(target) {}

ExecutableBuilderVisitor::~ExecutableBuilderVisitor() = default;

void ExecutableBuilderVisitor::postVisit(Filter* pFilter) {
    ORVO_CHECK(pFilter, "pFilter");
    if (pExecutables_->find(pFilter) != pExecutables_->end()) {
        return;
    }
    ORVO_CHECK(pFilter->canBuildFilterExecutable(target_), "Filter will not run on selected target!");
    std::shared_ptr<IFilterExecutable> const filterExecutable =
        pFilter->buildFilterExecutable(target_, *pGraphExecutable_);
    ORVO_CHECK(filterExecutable.get(), "filterExecutable.get()");
    (*pExecutables_)[pFilter] = filterExecutable;

    if (target_ == ORVO_TARGET_CPU || dynamic_cast<InputAdapter*>(pFilter) ||
        dynamic_cast<OutputAdapter*>(pFilter)) {
        return;
    }
    auto const* const imageFlowFilterExecutable =
        dynamic_cast<ImageFlowFilterExecutable*>(filterExecutable.get());
    ORVO_CHECK(imageFlowFilterExecutable, "imageFlowFilterExecutable");
    ImageFilter* const pImageFlowFilter = imageFlowFilterExecutable->getImageFlowFilter();
    ORVO_CHECK(pImageFlowFilter, "pImageFlowFilter");
    ORVO_CHECK(pImageFlowFilter->willRunInHardware(), "Filter will not run on selected target!");
}

} // namespace ORVO::FilterGraph::Internal
