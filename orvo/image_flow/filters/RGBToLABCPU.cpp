#include "orvo/image_flow/filters/RGBToLABCPU.h"

#include "orvo/image_flow/filters/bilateral/RowAccess.h"
#include "orvo/image_flow/filters/lab/LabKernels.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/kernels/Rows.h"

#include <vector>

namespace ORVO {

RGBToLABCPU::RGBToLABCPU()
    : ImageFilter("ORVO::RGBToLABCPU", OUTPUT_PRECISION_DEFAULT),
      oInputImage_("InputImage", this),
      oOutputImage_("OutputImage", this) {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&oInputImage_);
    setImageOutput(&oOutputImage_);
}

RGBToLABCPU::~RGBToLABCPU() = default;

void RGBToLABCPU::processSlice(std::size_t begin, std::size_t end) {
    ImageCPUReadAccessor const read(*oInputImage_);
    ImageCPU& output = *spOutputImage_;
    ImageFlow::bilateral::RowSource const source(read, oOutputRegionInPixels_);
    ImageFlow::lab::LabKernels const& kernels = ImageFlow::lab::labKernels();
    PositionInPixelSpace const corner = oOutputRegionInPixels_.position();
    int const width = oOutputRegionInPixels_.extent().width();
    std::vector<float> aRow(4 * static_cast<std::size_t>(width));
    for (std::size_t row = begin; row < end; ++row) {
        kernels.labFromRGB(aRow.data(), source.row(row, aRow.data()), static_cast<std::size_t>(width));
        ImageRuntime::writeRowFromRGBAFloat(output, corner.y() + static_cast<int>(row), corner.x(),
                                            corner.x() + width, aRow.data());
    }
}

} // namespace ORVO
