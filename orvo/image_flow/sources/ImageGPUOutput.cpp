#include "orvo/image_flow/sources/ImageGPUOutput.h"

namespace ORVO {

ImageGPUOutput::ImageGPUOutput() : ImageGPUOutput("ImageGPUOutput", "InputImage") {}

ImageGPUOutput::ImageGPUOutput(char const* nodeName, char const* inputName)
    : ImageFilter(nodeName, OUTPUT_PRECISION_DEFAULT), oInputImage_(inputName, this) {
    inputTarget_ = ORVO_TARGET_GL;
    outputTarget_ = ORVO_TARGET_GL;
    addImageInput(&oInputImage_);
}

ImageGPUOutput::~ImageGPUOutput() = default;

bool ImageGPUOutput::willRunInHardware() { return true; }

ImageGPU* ImageGPUOutput::releaseImageGPU() {
    ImageGPU* const pImage = imageDataPtr_.get();
    imageDataPtr_.release();
    return pImage;
}

ImageGPU const* ImageGPUOutput::getImageGPU() const { return imageDataPtr_.get(); }

void ImageGPUOutput::internalProcess() {
    bPreparedForRender_ = false;
    imageDataPtr_.setDataWithReleasableOwnership(oInputImage_.releaseData());
    oInputImage_.setDataPtr(nullptr);
}

} // namespace ORVO
