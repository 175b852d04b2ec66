#include "orvo/image_flow/filters/LABToRGBCPU.h"

#include "orvo/image_flow/filters/lab/LabKernels.h"
#include "orvo/image_flow/filters/lab/LabRows.h"

namespace ORVO {

LABToRGBCPU::LABToRGBCPU()
    : ImageFilter("ORVO::LABToRGBCPU", OUTPUT_PRECISION_DEFAULT),
      oInputImage_("InputImage", this),
      oOutputImage_("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&oInputImage_);
    setImageOutput(&oOutputImage_);
}

LABToRGBCPU::~LABToRGBCPU() = default;

void LABToRGBCPU::processSlice(std::size_t begin, std::size_t end) {
    ImageFlow::lab::convertRows(ImageFlow::lab::labKernels().rgbFromLab, *oInputImage_, *spOutputImage_,
                                oOutputRegionInPixels_, begin, end);
}

} // namespace ORVO
