#include "orvo/image_flow/sources/ImageCPUOutput.h"

namespace ORVO {

ImageCPUOutput::ImageCPUOutput() : ImageCPUOutput("ImageCPUOutput", "InputImage") {}

ImageCPUOutput::ImageCPUOutput(char const* nodeName, char const* inputName)
    : ImageFilter(nodeName, OUTPUT_PRECISION_DEFAULT), oInputImage_(inputName, this) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&oInputImage_);
}

ImageCPUOutput::~ImageCPUOutput() = default;

ImageCPU const* ImageCPUOutput::getImageCPU() const { return oInputImage_.get(); }

ImageCPU* ImageCPUOutput::releaseImageCPU() {
    ImageCPU* const pImage = oInputImage_.releaseData();
    oInputImage_.setDataPtr(nullptr);
    return pImage;
}

void ImageCPUOutput::internalProcess() { bPreparedForRender_ = false; }

void ImageCPUOutput::postProcess() {}

} // namespace ORVO
