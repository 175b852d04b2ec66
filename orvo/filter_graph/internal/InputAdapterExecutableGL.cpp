#include "orvo/filter_graph/internal/InputAdapterExecutableGL.h"

#include <memory>

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/filter_graph/impl/ImageBase.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/filter_graph/internal/ClientTextureSource.h"
#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/image_runtime/images/ImageGPU.h"

namespace ORVO::FilterGraph::Internal {

InputAdapterExecutableGL::InputAdapterExecutableGL(GraphExecutable& graphExecutable, InputAdapter& adapter)
    : ImageFlowFilterExecutable(graphExecutable, adapter, nullptr), pAdapter_(&adapter) {
    std::unique_ptr<ClientTextureSource, ImageNodeDeleter> pSource(ORVO_NEW ClientTextureSource());
    setImageFlowFilter(pSource.get());
    pNode_ = pSource.release();
}

InputAdapterExecutableGL::~InputAdapterExecutableGL() = default;

void InputAdapterExecutableGL::forwardStuff() {
    if (FilterGraph::ImageBase* const pImage = pAdapter_->getImage()) {
        auto* const pTexture = ImageAccessor::getImpl<ORVO::ImageGPU>(pImage);
        pNode_->noteContent(pTexture, pImage->contentStamp());
        pNode_->setImageGPUWithNoOwnership(pTexture);
        pNode_->setOutputPixelExtent(pImage->imageDescriptor().pixelExtent());
        pNode_->emit();
    }
    pNode_->setGeneratedRegion(pAdapter_->getDomainOfDefinition());
}

void InputAdapterExecutableGL::returnStuff() { pAdapter_->updateROI(pNode_->regionOfInterest()); }

TargetPlatform InputAdapterExecutableGL::getOutputTargetPlatform() { return ORVO_TARGET_GL; }

} // namespace ORVO::FilterGraph::Internal
