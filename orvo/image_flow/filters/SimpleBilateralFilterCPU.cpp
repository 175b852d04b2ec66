#include "orvo/image_flow/filters/SimpleBilateralFilterCPU.h"

#include "orvo/core/math/Float.h"
#include "orvo/image_flow/filters/bilateral/SimpleBilateral.h"

#include <cmath>
#include <utility>

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
    filter.filterRows(*oInputImage_, *spOutputImage_, oOutputRegionInPixels_, begin, end);
}

} // namespace ORVO
