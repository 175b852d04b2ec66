#include "orvo/image_flow/controllers/Bedding.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"

namespace ORVO {

Bedding::Bedding(ImageFlowController& controller) : pController_(&controller) {}

Bedding::Bedding(OGL::Context const& context, ImageFlowController& controller) : pController_(&controller) {
    setContextGPU_DEPRECATED_1_0(context);
}

Bedding::~Bedding() = default;

void Bedding::process() {
    ORVO_ENFORCE(pController_);
    pController_->process();
}

void Bedding::processAsync() {
    ORVO_ENFORCE(pController_);
    pController_->processAsync();
}

bool Bedding::wait(double timeout, double interval) {
    ORVO_ENFORCE(pController_);
    return pController_->wait(timeout, interval);
}

void Bedding::sleep(double seconds) {
    ORVO_ENFORCE(pController_);
    pController_->sleep(seconds);
}

void Bedding::computeRegions(PositionExtentInWorldSpace const& region) {
    ORVO_ENFORCE(pController_);
    pController_->computeRegions(region);
}

void Bedding::propagateDODs() {
    ORVO_ENFORCE(pController_);
    pController_->propagateDODs();
}

void Bedding::propagatePixelExtents() {
    ORVO_ENFORCE(pController_);
    pController_->propagatePixelExtents();
}

void Bedding::propagateROIs(PositionExtentInWorldSpace const& region) {
    ORVO_ENFORCE(pController_);
    pController_->propagateROIs(region);
}

void Bedding::setDirtyState() {
    ORVO_ENFORCE(pController_);
    pController_->setDirtyState();
}

OGL::Context const* Bedding::contextGPU() const {
    ORVO_ENFORCE(pController_);
    return static_cast<ImageFlowController const*>(pController_)->contextGPU();
}

void Bedding::setContextGPU_DEPRECATED_1_0(OGL::Context const& context) {
    ORVO_ENFORCE(pController_);
    pController_->setContextGPU(context);
}

void Bedding::plantMasterTree(ImageFilter& sink) {
    ORVO_ENFORCE(pController_);
    pController_->setImageSink(sink);
}

ImageFilter* Bedding::masterTree() {
    ORVO_ENFORCE(pController_);
    return pController_->imageSink();
}

ImageFilter const* Bedding::masterTree() const {
    ORVO_ENFORCE(pController_);
    return static_cast<ImageFlowController const*>(pController_)->imageSink();
}

} // namespace ORVO
