#include "orvo/image_flow/filters/BufferGPU.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/sources/TextureRegionCopy.h"

namespace ORVO {

BufferGPU::BufferGPU()
    : ImageFilter("BufferGPU", OUTPUT_PRECISION_DEFAULT),
      bPassThrough_(true),
      oInputImage_("InputImage", this),
      oOutputImage_("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_GL;
    outputTarget_ = ORVO_TARGET_GL;
    addImageInput(&oInputImage_);
    setImageOutput(&oOutputImage_);
}

BufferGPU::~BufferGPU() = default;

void BufferGPU::emit() { bPassThrough_ = false; }

bool BufferGPU::canEmit() const { return true; }

bool BufferGPU::willRunInHardware() { return true; }

bool BufferGPU::hasData() const { return oBuffered_.get() != nullptr; }

bool BufferGPU::isReady() const {
    if (bPassThrough_) {
        return ImageFilter::isReady();
    }
    return hasData() && outputsAreFree();
}

PositionExtentInPixelSpace BufferGPU::bufferDOD() const {
    return hasData() ? oBuffered_->positionExtent() : PositionExtentInPixelSpace();
}

void BufferGPU::internalProcess() {
    bPreparedForRender_ = false;
    bool const bPass = bPassThrough_;
    bPassThrough_ = true;
    if (bPass) {
        passOn();
    } else if (hasData()) {
        handOut();
    }
}

void BufferGPU::passOn() {
    ImageGPU const* const pImage = oInputImage_.get();
    ORVO_ENFORCE(pImage);
    oInputImage_.moveTo(oBuffered_);
    handOut();
}

void BufferGPU::handOut() {
    if (!oOutputImage_.bound()) {
        oOutputImage_ = oBuffered_;
        return;
    }
    allocateOutputImage();
    copyTextureRegion(*oBuffered_, *boundOutputImageGPU(), oOutputRegionInPixels_);
}

} // namespace ORVO
