#include "orvo/image_flow/filters/SimpleBilateralFilterCPU.h"

#include "orvo/core/math/Float.h"
#include "orvo/image_flow/filters/bilateral/SimpleBilateral.h"
#include "orvo/image_runtime/kernels/Rows.h"

#include <cmath>
#include <utility>
#include <vector>

namespace ORVO {

SimpleBilateralFilterCPU::SimpleBilateralFilterCPU()
    : ImageFilter("ORVO::SimpleBilateralFilterCPU", OUTPUT_PRECISION_DEFAULT),
      oInputImage_("InputImage", this),
      oOutputImage_("OutputImage", this),
      oSpatialSigma_(0.1F, 0.0F, 100.0F, "spatialSigma", "Reach of the smoothing, in pixels"),
      oRangeSigma_(0.1F, 0.0F, 1.0F, "rangeSigma", "Difference of intensity that counts as an edge"),
      oColorize_(false, "colorize", "Keep the colours; without it the result is grey") {
    inputTarget_ = ORVO_TARGET_CPU;
    outputTarget_ = ORVO_TARGET_CPU;
    addImageInput(&oInputImage_);
    setImageOutput(&oOutputImage_);
    registerParameter(&oSpatialSigma_);
    registerParameter(&oRangeSigma_);
    registerParameter(&oColorize_);
}

SimpleBilateralFilterCPU::~SimpleBilateralFilterCPU() = default;

DataFlow::IntervalParameter<float>& SimpleBilateralFilterCPU::spatialSigma() { return oSpatialSigma_; }

DataFlow::IntervalParameter<float>& SimpleBilateralFilterCPU::rangeSigma() { return oRangeSigma_; }

DataFlow::Parameter<bool>& SimpleBilateralFilterCPU::colorize() { return oColorize_; }

PositionExtentInWorldSpace SimpleBilateralFilterCPU::needed(PositionExtentInWorldSpace const& outputRegion,
                                                            std::string /*inputName*/,
                                                            RegionMap const& /*inputDODs*/) {
    float const sigma = oSpatialSigma_.value();
    PositionExtentInWorldSpace region = outputRegion;
    region.outset(float2(std::isnan(sigma) ? 0.0F : sigma));
    return region;
}

PositionExtentInWorldSpace SimpleBilateralFilterCPU::changed(PositionExtentInWorldSpace const& inputRegion,
                                                             std::string inputName,
                                                             RegionMap const& inputDODs) {
    return needed(inputRegion, std::move(inputName), inputDODs);
}

void SimpleBilateralFilterCPU::processSlice(std::size_t begin, std::size_t end) {
    ImageFlow::bilateral::SimpleBilateral const filter(oSpatialSigma_.value(), oRangeSigma_.value(),
                                                       oColorize_.value());
    ImageCPU& output = *spOutputImage_;
    ImageFlow::bilateral::PixelWindow window(*oInputImage_, filter.halfWindow());
    PositionInPixelSpace const corner = oOutputRegionInPixels_.position();
    int const width = oOutputRegionInPixels_.extent().width();
    std::vector<float> aRow(4 * static_cast<std::size_t>(width));
    for (std::size_t row = begin; row < end; ++row) {
        int const y = corner.y() + static_cast<int>(row);
        window.moveTo(y);
        for (int column = 0; column < width; ++column) {
            float4 const pixel = filter.resultAt(window, corner.x() + column);
            float* const pPixel = aRow.data() + 4 * static_cast<std::size_t>(column);
            pPixel[0] = pixel.x;
            pPixel[1] = pixel.y;
            pPixel[2] = pixel.z;
            pPixel[3] = pixel.w;
        }
        ImageRuntime::writeRowFromRGBAFloat(output, y, corner.x(), corner.x() + width, aRow.data());
    }
}

} // namespace ORVO
