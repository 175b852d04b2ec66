#include "orvo/image_flow/filters/ImageBuffer.h"

#include "orvo/core/Check.h"

namespace ORVO {

template <class Image>
ImageBuffer<Image>::ImageBuffer(char const* name, TargetPlatform target)
    : ImageFilter(name, OUTPUT_PRECISION_DEFAULT),
      bPassThrough_(true),
      oInputImage_("InputImage", this),
      oOutputImage_("OutputImage", this) {
    inputTarget_ = target;
    outputTarget_ = target;
    addImageInput(&oInputImage_);
    setImageOutput(&oOutputImage_);
}

template <class Image>
ImageBuffer<Image>::~ImageBuffer() = default;

template <class Image>
void ImageBuffer<Image>::emit() {
    bPassThrough_ = false;
}

template <class Image>
bool ImageBuffer<Image>::canEmit() const {
    return true;
}

template <class Image>
bool ImageBuffer<Image>::hasData() const {
    return oBuffered_.get() != nullptr;
}

template <class Image>
bool ImageBuffer<Image>::isReady() const {
    if (bPassThrough_) {
        return ImageFilter::isReady();
    }
    return hasData() && outputsAreFree();
}

template <class Image>
PositionExtentInPixelSpace ImageBuffer<Image>::bufferDOD() const {
    return hasData() ? oBuffered_->positionExtent() : PositionExtentInPixelSpace();
}

template <class Image>
void ImageBuffer<Image>::internalProcess() {
    bPreparedForRender_ = false;
    bool const bPass = bPassThrough_;
    bPassThrough_ = true;
    if (bPass) {
        passOn();
    } else if (hasData()) {
        handOut();
    }
}

template <class Image>
void ImageBuffer<Image>::passOn() {
    Image const* const pImage = oInputImage_.get();
    ORVO_ENFORCE(pImage);
    oInputImage_.moveTo(oBuffered_);
    handOut();
}

template <class Image>
void ImageBuffer<Image>::handOut() {
    if (!oOutputImage_.bound()) {
        oOutputImage_ = oBuffered_;
        return;
    }
    allocateOutputImage();
    copyToBoundOutput(*oBuffered_);
}

template class ImageBuffer<ImageCPU>;
template class ImageBuffer<ImageGPU>;

} // namespace ORVO
