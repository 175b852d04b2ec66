#include "orvo/image_flow/filters/bilateral/SimpleBilateral.h"

#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/kernels/Rows.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

namespace ORVO::ImageFlow::bilateral {

namespace {

float4 const kDirectWeights(0.39F, 0.5F, 0.11F, 0.0F);

/// The smaller of the two as unsigned numbers.
long long unsignedMinimum(long long coordinate, long long limit) {
    return coordinate < 0 || coordinate > limit ? limit : coordinate;
}

} // namespace

PixelWindow::PixelWindow(ImageCPU const& image, int nHalf)
    : oImage_(image),
      nHalf_(nHalf),
      nWidth_(std::max(image.extent().width(), 0)),
      nHeight_(std::max(image.extent().height(), 0)),
      nSlots_(std::min<long long>(2LL * nHalf + 2, nHeight_)),
      iRow_(0),
      aRows_(static_cast<std::size_t>(4 * nWidth_ * nSlots_)),
      aSlotRows_(static_cast<std::size_t>(nSlots_), -1),
      bHasLastPixel_(false) {}

void PixelWindow::cacheRow(long long row) {
    std::size_t const slot = static_cast<std::size_t>(row % nSlots_);
    if (aSlotRows_[slot] == row) {
        return;
    }
    int const x = oImage_.position().x();
    int const y = static_cast<int>(oImage_.position().y() + row);
    aSlotRows_[slot] = -1;
    ImageRuntime::readRowAsRGBAFloat(oImage_, y, x, static_cast<int>(x + nWidth_),
                                     aRows_.data() + 4 * slot * static_cast<std::size_t>(nWidth_));
    aSlotRows_[slot] = row;
}

float const* PixelWindow::cachedRow(long long row) const {
    return aRows_.data() + 4 * static_cast<std::size_t>(row % nSlots_ * nWidth_);
}

void PixelWindow::moveTo(int y) {
    iRow_ = static_cast<long long>(y) - oImage_.position().y();
    if (nWidth_ == 0 || nHeight_ == 0) {
        return;
    }
    if (!bHasLastPixel_) {
        int const x = static_cast<int>(oImage_.position().x() + nWidth_ - 1);
        int const lastY = static_cast<int>(oImage_.position().y() + nHeight_ - 1);
        ImageRuntime::readRowAsRGBAFloat(oImage_, lastY, x, x + 1, oLastPixel_.begin());
        bHasLastPixel_ = true;
    }
    long long const last = std::min(iRow_ + nHalf_ + 1, nHeight_ - 1);
    for (long long row = std::max(iRow_ - nHalf_, 0LL); row <= last; ++row) {
        cacheRow(row);
    }
}

float4 PixelWindow::centreAt(int x) const {
    long long const column = static_cast<long long>(x) - oImage_.position().x();
    if (column < 0 || column >= nWidth_ || iRow_ < 0 || iRow_ >= nHeight_) {
        return float4(0.0F);
    }
    float const* const p = cachedRow(iRow_) + 4 * column;
    return {p[0], p[1], p[2], p[3]};
}

float4 PixelWindow::neighbourAt(int x, int dx, int dy) const {
    if (nWidth_ == 0 || nHeight_ == 0) {
        return float4(0.0F);
    }
    long long column = unsignedMinimum(static_cast<long long>(x) - oImage_.position().x() + dx, nWidth_);
    long long row = unsignedMinimum(iRow_ + dy, nHeight_);
    if (column == nWidth_) {
        column = 0;
        ++row;
    }
    if (row >= nHeight_) {
        return oLastPixel_;
    }
    float const* const p = cachedRow(row) + 4 * column;
    return {p[0], p[1], p[2], p[3]};
}

SimpleBilateral::SimpleBilateral(float spatialSigma, float rangeSigma, bool bColorize)
    : fRangeSigma_(rangeSigma),
      bColorize_(bColorize),
      nHalf_(std::clamp(saturatingCast<int>(std::ceil(spatialSigma * 2.146F)) / 2, 0, kMaximalHalfWindow)) {
    double const divisor = static_cast<double>(spatialSigma) * 2.0 * static_cast<double>(spatialSigma);
    for (int i = 0; i <= nHalf_; ++i) {
        for (int j = 0; j <= nHalf_; ++j) {
            double const square = static_cast<double>(i) * i + static_cast<double>(j) * j;
            aSpatialWeights_.push_back(static_cast<float>(std::exp(square * -1.0 / divisor)));
        }
    }
}

float4 SimpleBilateral::resultAt(PixelWindow const& window, int x) const {
    float4 const centre = window.centreAt(x);
    float4 sum(0.0F);
    float total = 0.0F;
    for (int i = -nHalf_; i <= nHalf_; ++i) {
        for (int j = -nHalf_; j <= nHalf_; ++j) {
            float4 sample = window.neighbourAt(x, i, j);
            float4 difference(std::fabs(sample.x - centre.x), std::fabs(sample.y - centre.y),
                              std::fabs(sample.z - centre.z), std::fabs(sample.w - centre.w));
            float distance = 0.0F;
            if (bColorize_) {
                difference.w = 0.0F;
                distance = dot(difference, difference);
            } else {
                distance = dot(difference, kDirectWeights);
                float const grey = dot(sample, kDirectWeights);
                sample = float4(grey, grey, grey, sample.w);
            }
            float const range = std::exp(distance * distance * -1.0F / (fRangeSigma_ * 2.0F * fRangeSigma_));
            std::size_t const nRow =
                static_cast<std::size_t>(std::abs(i)) * (static_cast<std::size_t>(nHalf_) + 1);
            float const weight = range * aSpatialWeights_[nRow + static_cast<std::size_t>(std::abs(j))];
            sum += weight * sample;
            total += weight;
        }
    }
    return {sum.x / total, sum.y / total, sum.z / total, 0.0F};
}

} // namespace ORVO::ImageFlow::bilateral
