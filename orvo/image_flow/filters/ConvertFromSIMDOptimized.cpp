#include "orvo/image_flow/filters/ConvertFromSIMDOptimized.h"

#include "orvo/core/Check.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/image_runtime/ConvertSIMDOptimizedImageCPU.h"

#include <algorithm>
#include <cstdint>

namespace ORVO {

ConvertFromSIMDOptimized::ConvertFromSIMDOptimized()
    : ImageFilter("ConvertFromSIMDOptimized", OUTPUT_PRECISION_DEFAULT),
      nBeginX_(0),
      nEndX_(0),
      pOutputImage_(nullptr),
      oInput_("input", this),
      oOutput_("output", this) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&oInput_);
    setImageOutput(&oOutput_);
}

ConvertFromSIMDOptimized::~ConvertFromSIMDOptimized() = default;

void ConvertFromSIMDOptimized::allocateOutputImage() {
    ImageFilter::allocateOutputImage();
    nBeginX_ = oOutputRegionInPixels_.position().x();
    nEndX_ = saturatingCast<int>(std::int64_t(nBeginX_) + oOutputRegionInPixels_.extent().width());
}

void ConvertFromSIMDOptimized::prepareForRender() {
    ImageFilter::prepareForRender();
    pOutputImage_ = spOutputImage_.get();
    ORVO_CHECK(pOutputImage_);
}

void ConvertFromSIMDOptimized::processSlice(std::size_t begin, std::size_t end) {
    ImageCPU const& input = *oInput_;
    int const beginX = std::max(nBeginX_, input.position().x());
    int const endX = beginX + std::min(nEndX_ - nBeginX_, input.extent().width());
    int const top = std::max(oOutputRegionInPixels_.position().y(), input.position().y());
    ImageRuntime::convertImageFromSIMDOptimized32FFormat(
        input, pOutputImage_, beginX, endX, top + static_cast<int>(begin), top + static_cast<int>(end));
}

} // namespace ORVO
