#include "orvo/filter_graph/internal/ImageFlowFilterWrapperBase.h"

#include "orvo/core/Check.h"
#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/parameters/ParameterBase.h"
#include "orvo/filter_graph/impl/ParameterBase.h"
#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"
#include "orvo/filter_graph/internal/ParameterSet.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO::FilterGraph::Internal {

ImageFlowFilterWrapperBase::ImageFlowFilterWrapperBase(IFilter::Identifier const& identifier) {
    setIdentifier(identifier);
}

ImageFlowFilterWrapperBase::ImageFlowFilterWrapperBase(ImageFlowFilterWrapperBase const& other)
    : Filter(other) {}

ImageFlowFilterWrapperBase::~ImageFlowFilterWrapperBase() {
    for (ImageFilter* const pFilter : pFilters_) {
        ImageNodeDeleter{}(pFilter);
    }
}

void ImageFlowFilterWrapperBase::finishLazyInitialization() {
    ImageFilter* pNode = nullptr;
    for (std::size_t iTarget = 0; iTarget < pFilters_.size() && !pNode; ++iTarget) {
        pNode = createFilter(static_cast<TargetPlatform>(iTarget));
        pFilters_[iTarget] = pNode;
    }
    if (pNode) {
        adoptInterface(*pNode);
    } else {
        ORVO_CHECK(ORVO::ImageFlow::Library::cpuOnlyMode(),
                   "There must be at least one buildable target for the filter");
    }
    Filter::finishLazyInitialization();
}

void ImageFlowFilterWrapperBase::adoptInterface(ImageFilter& node) {
    for (std::size_t iInput = 0; iInput < node.numberOfImageInputs(); ++iInput) {
        addInput(node.imageInput(iInput)->name(), 0);
    }
    for (std::size_t iParameter = 0; iParameter < node.numberOfParameters(); ++iParameter) {
        OwnedParameter parameter(ParameterSet::createParameterFromDataFlow(node.parameter(iParameter)));
        if (parameter) {
            addParameter(std::move(parameter));
        }
    }
}

std::shared_ptr<IFilterExecutable>
ImageFlowFilterWrapperBase::buildFilterExecutable(TargetPlatform target, GraphExecutable& graphExecutable) {
    std::unique_ptr<ImageFilter, ImageNodeDeleter> filter(createFilter(target));
    if (filter) {
        pFilters_.at(static_cast<std::size_t>(target)) = nullptr;
    }
    ORVO_CHECK(filter, "filter");
    auto const spExecutable =
        std::make_shared<ImageFlowFilterExecutable>(graphExecutable, *this, filter.get());
    static_cast<void>(filter.release());
    return spExecutable;
}

} // namespace ORVO::FilterGraph::Internal
