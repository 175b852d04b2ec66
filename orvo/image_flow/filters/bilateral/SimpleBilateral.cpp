#include "orvo/image_flow/filters/bilateral/SimpleBilateral.h"

#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/image_flow/filters/bilateral/SimpleKernels.h"
#include "orvo/image_flow/filters/bilateral/SimpleWindow.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/kernels/Rows.h"

#include <algorithm>
#include <cmath>

namespace ORVO::ImageFlow::bilateral {

int halfWindowOf(float spatialSigma) {
    return std::clamp(saturatingCast<int>(std::ceil(spatialSigma * 2.146F)) / 2, 0, kMaximalHalfWindow);
}

SimpleBilateral::SimpleBilateral(float spatialSigma, float rangeSigma, bool bColorize)
    : fRangeSigma_(rangeSigma), bColorize_(bColorize), nHalf_(halfWindowOf(spatialSigma)) {
    double const divisor = static_cast<double>(spatialSigma) * 2.0 * static_cast<double>(spatialSigma);
    for (int i = 0; i <= nHalf_; ++i) {
        for (int j = 0; j <= nHalf_; ++j) {
            double const square = static_cast<double>(i) * i + static_cast<double>(j) * j;
            aSpatialWeights_.push_back(static_cast<float>(std::exp(square * -1.0 / divisor)));
        }
    }
}

void SimpleBilateral::filterRows(ImageCPU const& input, ImageCPU& output,
                                 PositionExtentInPixelSpace const& region, std::size_t begin,
                                 std::size_t end) const {
    SimpleKernel const pfnKernel = simpleKernel(ImageRuntime::activeInstructionSet());
    SimpleWindow window(input, region, nHalf_);
    int const beginX = region.position().x();
    int const endX = beginX + region.extent().width();
    std::vector<float> aRow(4 * static_cast<std::size_t>(region.extent().width()));
    SimpleJob job = {};
    job.nPitch = window.pitch();
    job.nPixels = aRow.size() / 4;
    job.nHalf = nHalf_;
    job.bColorize = bColorize_;
    job.fRangeDivisor = fRangeSigma_ * 2.0F * fRangeSigma_;
    job.pSpatialWeights = aSpatialWeights_.data();
    job.pRGBA = aRow.data();
    for (std::size_t row = begin; row < end; ++row) {
        window.moveTo(row);
        job.apRows = window.rows();
        job.pCentres = window.centres();
        pfnKernel(job);
        ImageRuntime::writeRowFromRGBAFloat(output, region.position().y() + static_cast<int>(row), beginX,
                                            endX, aRow.data());
    }
}

} // namespace ORVO::ImageFlow::bilateral
