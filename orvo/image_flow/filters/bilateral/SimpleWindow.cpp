#include "orvo/image_flow/filters/bilateral/SimpleWindow.h"

#include "orvo/image_flow/filters/bilateral/SimpleKernels.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/kernels/Rows.h"

#include <algorithm>

namespace ORVO::ImageFlow::bilateral {

SimpleWindow::SimpleWindow(ImageCPU const& image, PositionExtentInPixelSpace const& region, int nHalf)
    : oImage_(image),
      nHalf_(nHalf),
      nWidth_(std::max(image.extent().width(), 0)),
      nHeight_(nWidth_ > 0 ? std::max(image.extent().height(), 0) : 0),
      nColumns_(std::max(region.extent().width(), 0) + 2 * nHalf_),
      iColumn_(static_cast<long long>(region.position().x()) - image.position().x() - nHalf_),
      iTop_(static_cast<long long>(region.position().y()) - image.position().y()),
      nPitch_(static_cast<std::size_t>(nColumns_) + kSimpleSlack),
      nSlots_(std::min(2 * nHalf_ + 1, nHeight_)),
      aRows_(4 * nPitch_ * static_cast<std::size_t>(nSlots_)),
      aSlotRows_(static_cast<std::size_t>(nSlots_), -1),
      aCentres_(4 * nPitch_),
      apRows_(static_cast<std::size_t>(2 * nHalf_ + 1)) {}

void SimpleWindow::moveTo(std::size_t row) {
    long long const centre = iTop_ + static_cast<long long>(row);
    for (std::size_t i = 0; i < apRows_.size(); ++i) {
        apRows_[i] = rowAt(centre - nHalf_ + static_cast<long long>(i));
    }
    fillCentres(apRows_[static_cast<std::size_t>(nHalf_)], centre);
}

float const* SimpleWindow::rowAt(long long row) {
    if (row < 0 || row >= nHeight_) {
        if (aBeyond_.empty()) {
            std::vector<float> aBeyond(4 * nPitch_);
            fillRow(aBeyond.data(), nHeight_);
            aBeyond_.swap(aBeyond);
        }
        return aBeyond_.data();
    }
    std::size_t const slot = static_cast<std::size_t>(row % nSlots_);
    float* const pRow = aRows_.data() + 4 * nPitch_ * slot;
    if (aSlotRows_[slot] != row) {
        aSlotRows_[slot] = -1;
        fillRow(pRow, row);
        aSlotRows_[slot] = row;
    }
    return pRow;
}

void SimpleWindow::fillRow(float* pRow, long long row) {
    // Column `width` of a row is the first pixel of the next one.
    float beyond[4] = {};
    if (row + 1 < nHeight_) {
        readPixel(0, row + 1, beyond);
    } else if (nHeight_ > 0) {
        readPixel(nWidth_ - 1, nHeight_ - 1, beyond);
    }
    for (long long column = 0; column < nColumns_; ++column) {
        setPixel(pRow, static_cast<std::size_t>(column), beyond);
    }
    long long const begin = std::max(iColumn_, 0LL);
    long long const end = std::min(iColumn_ + nColumns_, nWidth_);
    if (row >= nHeight_ || begin >= end) {
        return;
    }
    aPixels_.resize(4 * static_cast<std::size_t>(end - begin));
    int const x = oImage_.position().x();
    ImageRuntime::readRowAsRGBAFloat(oImage_, static_cast<int>(oImage_.position().y() + row),
                                     static_cast<int>(x + begin), static_cast<int>(x + end), aPixels_.data());
    for (long long column = begin; column < end; ++column) {
        setPixel(pRow, static_cast<std::size_t>(column - iColumn_),
                 aPixels_.data() + 4 * static_cast<std::size_t>(column - begin));
    }
}

void SimpleWindow::fillCentres(float const* pRow, long long row) {
    std::fill(aCentres_.begin(), aCentres_.end(), 0.0F);
    long long const begin = std::max(iColumn_, 0LL) - iColumn_;
    long long const end = std::min(iColumn_ + nColumns_, nWidth_) - iColumn_;
    if (row < 0 || row >= nHeight_ || begin >= end) {
        return;
    }
    for (std::size_t plane = 0; plane < 4; ++plane) {
        float const* const pPlane = pRow + plane * nPitch_;
        std::copy(pPlane + begin, pPlane + end,
                  aCentres_.begin() + static_cast<std::ptrdiff_t>(plane * nPitch_) + begin);
    }
}

void SimpleWindow::setPixel(float* pRow, std::size_t column, float const* pRGBA) const {
    float* const p = pRow + column;
    p[0] = pRGBA[0];
    p[nPitch_] = pRGBA[1];
    p[2 * nPitch_] = pRGBA[2];
    p[3 * nPitch_] = 0.39F * pRGBA[0] + 0.5F * pRGBA[1] + 0.11F * pRGBA[2] + 0.0F * pRGBA[3];
}

void SimpleWindow::readPixel(long long column, long long row, float* pRGBA) const {
    int const x = static_cast<int>(oImage_.position().x() + column);
    ImageRuntime::readRowAsRGBAFloat(oImage_, static_cast<int>(oImage_.position().y() + row), x, x + 1,
                                     pRGBA);
}

} // namespace ORVO::ImageFlow::bilateral
