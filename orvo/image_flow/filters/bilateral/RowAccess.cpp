#include "orvo/image_flow/filters/bilateral/RowAccess.h"

#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageReadAccessor.h"
#include "orvo/image_runtime/images/ImageWriteAccessor.h"
#include "orvo/image_runtime/kernels/RowKernels.h"
#include "orvo/image_runtime/kernels/Rows.h"

#include <algorithm>
#include <cstdint>

namespace ORVO::ImageFlow::bilateral {

namespace {

std::size_t rowOffset(ImageCPU const& image, std::size_t row) {
    return 4 * row * static_cast<std::size_t>(image.capacityExtent().width());
}

long long endX(PositionExtentInPixelSpace const& rectangle) {
    return static_cast<long long>(rectangle.position().x()) + std::max(rectangle.extent().width(), 0);
}

long long endY(PositionExtentInPixelSpace const& rectangle) {
    return static_cast<long long>(rectangle.position().y()) + std::max(rectangle.extent().height(), 0);
}

} // namespace

RowSource::RowSource(ImageReadAccessor const& source, PositionExtentInPixelSpace const& rectangle)
    : oSource_(source), pImage_(ImageRuntime::imageBehind(source)), oRectangle_(rectangle), bDirect_(false) {
    PositionExtentInPixelSpace const available = source.positionExtent();
    nBeginX_ = std::max(available.position().x(), rectangle.position().x());
    nEndX_ = static_cast<int>(std::max<long long>(nBeginX_, std::min(endX(available), endX(rectangle))));
    nBeginY_ = std::max(available.position().y(), rectangle.position().y());
    nEndY_ = std::min(endY(available), endY(rectangle));
    bool const readsPixels = nBeginX_ < nEndX_ && nBeginY_ < nEndY_;
    if (pImage_ != nullptr && readsPixels) {
        // An empty row refuses a wrong format too, here, before anything is done and on the caller's thread.
        float none[4];
        ImageRuntime::readRowAsRGBAFloat(*pImage_, static_cast<int>(nBeginY_), nBeginX_, nBeginX_, none);
        bDirect_ = pImage_->pixelFormat() == ImageCPU::PIXEL_FORMAT_RGBA32F &&
                   nBeginX_ == rectangle.position().x() && nEndX_ == endX(rectangle);
    }
}

float const* RowSource::row(std::size_t row, float* pBuffer) const {
    std::size_t const nWidth = static_cast<std::size_t>(oRectangle_.extent().width());
    long long const y = static_cast<long long>(oRectangle_.position().y()) + static_cast<long long>(row);
    if (y < nBeginY_ || y >= nEndY_ || nBeginX_ >= nEndX_) {
        std::fill_n(pBuffer, 4 * nWidth, 0.0F);
        return pBuffer;
    }
    if (bDirect_) {
        std::size_t const left =
            static_cast<std::size_t>(nBeginX_ - static_cast<long long>(pImage_->position().x()));
        std::size_t const offset = rowOffset(*pImage_, static_cast<std::size_t>(y - pImage_->position().y()));
        return reinterpret_cast<float const*>(pImage_->pixels()) + offset + 4 * left;
    }
    std::size_t const before =
        static_cast<std::size_t>(nBeginX_ - static_cast<long long>(oRectangle_.position().x()));
    std::size_t const inside = static_cast<std::size_t>(static_cast<long long>(nEndX_) - nBeginX_);
    std::fill_n(pBuffer, 4 * before, 0.0F);
    std::fill_n(pBuffer + 4 * (before + inside), 4 * (nWidth - before - inside), 0.0F);
    ImageRuntime::readRowAsRGBAFloat(oSource_, static_cast<int>(y), nBeginX_, nEndX_, pBuffer + 4 * before);
    return pBuffer;
}

RowTarget::RowTarget(ImageWriteAccessor& destination)
    : oDestination_(destination),
      pImage_(ImageRuntime::imageBehind(destination)),
      oRectangle_(destination.positionExtent()),
      bDirect_(false),
      bStream_(false) {
    if (pImage_ == nullptr) {
        return;
    }
    int const x = oRectangle_.position().x();
    float const none[4] = {};
    ImageRuntime::writeRowFromRGBAFloat(*pImage_, oRectangle_.position().y(), x, x, none);
    bDirect_ = pImage_->pixelFormat() == ImageCPU::PIXEL_FORMAT_RGBA32F;
    std::uint64_t const nBytes = static_cast<std::uint64_t>(pImage_->numberOfPixels()) * 16;
    bStream_ = bDirect_ && ImageRuntime::storeModeForOutput(nBytes) == ImageRuntime::StoreMode::STREAM;
}

float* RowTarget::rowBuffer(std::size_t row, float* pBuffer) const {
    return bDirect_ ? reinterpret_cast<float*>(pImage_->pixels()) + rowOffset(*pImage_, row) : pBuffer;
}

void RowTarget::finishRow(std::size_t row, float const* pRow) const {
    if (!bDirect_) {
        long long const y = static_cast<long long>(oRectangle_.position().y()) + static_cast<long long>(row);
        ImageRuntime::writeRowFromRGBAFloat(oDestination_, static_cast<int>(y), oRectangle_.position().x(),
                                            static_cast<int>(endX(oRectangle_)), pRow);
    }
}

} // namespace ORVO::ImageFlow::bilateral
