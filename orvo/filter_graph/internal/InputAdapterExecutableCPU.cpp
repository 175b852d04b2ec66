#include "orvo/filter_graph/internal/InputAdapterExecutableCPU.h"

#include <memory>

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/filter_graph/impl/ImageBase.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/filter_graph/internal/ClientImageSource.h"
#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/image_runtime/images/ImageCPU.h"

namespace ORVO::FilterGraph::Internal {

InputAdapterExecutableCPU::InputAdapterExecutableCPU(GraphExecutable& graphExecutable, InputAdapter& adapter)
    : ImageFlowFilterExecutable(graphExecutable, adapter, nullptr), pAdapter_(&adapter) {
    std::unique_ptr<ClientImageSource, ImageNodeDeleter> pSource(ORVO_NEW ClientImageSource());
    setImageFlowFilter(pSource.get());
    pNode_ = pSource.release();
}

InputAdapterExecutableCPU::~InputAdapterExecutableCPU() = default;

void InputAdapterExecutableCPU::forwardStuff() {
    if (FilterGraph::ImageBase* const pImage = pAdapter_->getImage()) {
        auto* const pPixels = ImageAccessor::getImpl<ORVO::ImageCPU>(pImage);
        pNode_->noteContent(pPixels, pImage->contentStamp());
        pNode_->setImageCPUWithNoOwnership(pPixels);
        pNode_->setOutputPixelExtent(pImage->imageDescriptor().pixelExtent());
        pNode_->emit();
    }
    pNode_->setGeneratedRegion(pAdapter_->getDomainOfDefinition());
}

void InputAdapterExecutableCPU::returnStuff() { pAdapter_->updateROI(pNode_->regionOfInterest()); }

TargetPlatform InputAdapterExecutableCPU::getOutputTargetPlatform() { return ORVO_TARGET_CPU; }

} // namespace ORVO::FilterGraph::Internal
