#include "orvo/image_flow/filters/ConvertToSIMDOptimized.h"

#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"
#include "orvo/image_runtime/ConvertSIMDOptimizedImageCPU.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace ORVO {

ConvertToSIMDOptimized::ConvertToSIMDOptimized()
    : ImageFilter("ConvertToSIMDOptimized", OUTPUT_PRECISION_DEFAULT),
      nBeginX_(0),
      nEndX_(0),
      oInput_("input", this),
      oOutput_("output", this) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&oInput_);
    setImageOutput(&oOutput_);
}

ConvertToSIMDOptimized::~ConvertToSIMDOptimized() = default;

void ConvertToSIMDOptimized::allocateOutputImage() {
    updateOutputRegionInPixels();
    nBeginX_ = oOutputRegionInPixels_.position().x();
    nEndX_ = saturatingCast<int>(std::int64_t(nBeginX_) + oOutputRegionInPixels_.extent().width());
    if (!takeBoundOutputImage() && !hasOutputImage()) {
        createOutputImage();
    }
}

void ConvertToSIMDOptimized::createOutputImage() {
    spOutputImage_.reset();
    ImageCPU const* const pInput = oInput_.get();
    ImageCPU::tePixelFormat const format =
        getImageDescInfoFromSource() && pInput != nullptr
            ? pInput->pixelFormat()
            : pixelFormatFor(outputPrecisionHint(), getNumChannelsOutput());
    spOutputImage_.setDataWithReleasableOwnership(ImageRuntime::getBlankSIMDOptimized32FFormat(
        format, oOutputRegionInPixels_.extent(), outputPixelExtent(), oOutputRegionInPixels_.position()));
    if (pInput != nullptr && isInside(oOutputRegionInPixels_, pInput->positionExtent())) {
        clearPadding();
    } else {
        spOutputImage_->initializeToTransparentBlack();
    }
}

void ConvertToSIMDOptimized::clearPadding() {
    ImageCPU& image = *spOutputImage_;
    std::size_t const pixelBytes = pixelSizeBytes(image.pixelFormat());
    std::size_t const usedBytes = static_cast<std::size_t>(image.extent().width()) * pixelBytes;
    std::size_t const rowBytes = static_cast<std::size_t>(image.capacityExtent().width()) * pixelBytes;
    for (int row = 0; row < image.extent().height(); ++row) {
        std::memset(image.pixels() + static_cast<std::size_t>(row) * rowBytes + usedBytes, 0,
                    rowBytes - usedBytes);
    }
}

void ConvertToSIMDOptimized::processSlice(std::size_t begin, std::size_t end) {
    ImageCPU const& input = *oInput_;
    int const beginX = std::max(nBeginX_, input.position().x());
    int const endX = beginX + std::min(nEndX_ - nBeginX_, input.extent().width());
    int const top = std::max(oOutputRegionInPixels_.position().y(), input.position().y());
    ImageRuntime::convertImageToSIMDOptimized32FFormat(input, spOutputImage_.get(), beginX, endX,
                                                       top + static_cast<int>(begin),
                                                       top + static_cast<int>(end));
}

} // namespace ORVO
