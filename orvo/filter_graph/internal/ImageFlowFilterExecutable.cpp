#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO::FilterGraph::Internal {

void ImageNodeDeleter::operator()(ImageFilter* pNode) const noexcept {
    if (pNode) {
        pNode->disconnect();
        trackedDelete(pNode);
    }
}

ImageFlowFilterExecutable::ImageFlowFilterExecutable(GraphExecutable& graphExecutable, Filter& filter,
                                                     ImageFilter* pImageFlowFilter)
    : pFilterGraphFilter_(&filter), pGraphExecutable_(&graphExecutable) {
    if (pImageFlowFilter) {
        adopt(pImageFlowFilter);
    }
}

ImageFlowFilterExecutable::~ImageFlowFilterExecutable() { ImageNodeDeleter{}(pImageFlowFilter_); }

void ImageFlowFilterExecutable::adopt(ImageFilter* pImageFlowFilter) {
    forwarder_.addForward(*pFilterGraphFilter_, *pImageFlowFilter);
    pGraphExecutable_->controller()->addNode(pImageFlowFilter);
    pImageFlowFilter_ = pImageFlowFilter;
    bGenerator_ =
        pImageFlowFilter->numberOfImageInputs() == 0 && !dynamic_cast<InputAdapter*>(pFilterGraphFilter_);
}

void ImageFlowFilterExecutable::setImageFlowFilter(ImageFilter* pImageFlowFilter) {
    ORVO_ENFORCE(pImageFlowFilter);
    if (pImageFlowFilter_) {
        pGraphExecutable_->controller()->removeNode(pImageFlowFilter_);
        forwarder_.clear();
        ImageNodeDeleter{}(pImageFlowFilter_);
        pImageFlowFilter_ = nullptr;
    }
    adopt(pImageFlowFilter);
}

void ImageFlowFilterExecutable::forwardStuff() {
    forwarder_.forwardStuff();
    if (bGenerator_) {
        pImageFlowFilter_->setOutputPixelExtent(pGraphExecutable_->outputPixelExtentInWorldSpace());
    }
}

void ImageFlowFilterExecutable::returnStuff() {}

DataFlow::InputConnector* ImageFlowFilterExecutable::getImageFlowInputConnector(std::string const& name) {
    ORVO_ENFORCE(pImageFlowFilter_);
    return pImageFlowFilter_->imageInput(name);
}

DataFlow::OutputConnector* ImageFlowFilterExecutable::getImageFlowOutputConnector() {
    ORVO_ENFORCE(pImageFlowFilter_);
    return pImageFlowFilter_->imageOutput();
}

DataFlow::OutputConnector* ImageFlowFilterExecutable::cloneImageFlowOutputConnector() {
    ORVO_ENFORCE(pImageFlowFilter_);
    return pImageFlowFilter_->cloneImageOutput();
}

DataFlow::OutputConnector* ImageFlowFilterExecutable::getClonedImageFlowOutputConnector(std::size_t index) {
    ORVO_ENFORCE(pImageFlowFilter_);
    return pImageFlowFilter_->clonedImageOutput(index);
}

TargetPlatform ImageFlowFilterExecutable::getInputTargetPlatform() {
    ORVO_ENFORCE(pImageFlowFilter_);
    return pImageFlowFilter_->getInputTargetPlatform();
}

TargetPlatform ImageFlowFilterExecutable::getOutputTargetPlatform() {
    ORVO_ENFORCE(pImageFlowFilter_);
    return pImageFlowFilter_->getOutputTargetPlatform();
}

bool ImageFlowFilterExecutable::hasSIMDInput() {
    ORVO_ENFORCE(pImageFlowFilter_);
    return pImageFlowFilter_->isSIMD();
}

bool ImageFlowFilterExecutable::hasSIMDOutput() {
    ORVO_ENFORCE(pImageFlowFilter_);
    return pImageFlowFilter_->isSIMD();
}

} // namespace ORVO::FilterGraph::Internal
