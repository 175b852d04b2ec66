#include "orvo/image_flow/filters/BufferCPU.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/sources/ImageRegionCopy.h"

namespace ORVO {

BufferCPU::BufferCPU() : BufferCPU("BufferCPU") {}

BufferCPU::BufferCPU(char const* name)
    : ImageFilter(name, OUTPUT_PRECISION_DEFAULT),
      bPassThrough_(true),
      oInputImage_("InputImage", this),
      oOutputImage_("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&oInputImage_);
    setImageOutput(&oOutputImage_);
}

BufferCPU::~BufferCPU() = default;

void BufferCPU::emit() { bPassThrough_ = false; }

bool BufferCPU::canEmit() const { return true; }

bool BufferCPU::hasData() const { return oBuffered_.get() != nullptr; }

bool BufferCPU::isReady() const {
    if (bPassThrough_) {
        return ImageFilter::isReady();
    }
    return hasData() && outputsAreFree();
}

PositionExtentInPixelSpace BufferCPU::bufferDOD() const {
    return hasData() ? oBuffered_->positionExtent() : PositionExtentInPixelSpace();
}

void BufferCPU::internalProcess() {
    bPreparedForRender_ = false;
    bool const bPass = bPassThrough_;
    bPassThrough_ = true;
    if (bPass) {
        passOn();
    } else if (hasData()) {
        handOut();
    }
}

void BufferCPU::passOn() {
    ImageCPU const* const pImage = oInputImage_.get();
    ORVO_ENFORCE(pImage);
    oInputImage_.moveTo(oBuffered_);
    handOut();
}

void BufferCPU::handOut() {
    if (!oOutputImage_.bound()) {
        oOutputImage_ = oBuffered_;
        return;
    }
    allocateOutputImage();
    ImageRegionCopy const copy(*oBuffered_, *spOutputImage_, oOutputRegionInPixels_);
    copy.copyRows(0, rangeToProcess().items);
    spOutputImage_.reset();
}

void BufferCPU::postProcess() { ImageFilter::postProcess(); }

} // namespace ORVO
