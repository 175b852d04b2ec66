#include "orvo/image_flow/filters/bilateral/PixelBuffer.h"

#include <vector>

namespace ORVO::ImageFlow::bilateral {

namespace {

long long pixelsIn(ExtentInPixelSpace const& extent) {
    return static_cast<long long>(extent.width()) * extent.height();
}

} // namespace

PixelBuffer::PixelBuffer(ExtentInPixelSpace const& extent, unsigned nFloats, float const* pData,
                         OGL::Buffer::Usage usage)
    : oExtent_(extent),
      oBuffer_(pixelsIn(extent) * nFloats * static_cast<long long>(sizeof(float)), OGL::Buffer::TYPE_ARRAY,
               usage, pData) {}

std::unique_ptr<PixelBuffer> PixelBuffer::ofPositions(ExtentInPixelSpace const& extent) {
    std::vector<float> aPositions;
    aPositions.reserve(2 * static_cast<std::size_t>(pixelsIn(extent)));
    for (int y = 0; y < extent.height(); ++y) {
        for (int x = 0; x < extent.width(); ++x) {
            aPositions.push_back(static_cast<float>(x));
            aPositions.push_back(static_cast<float>(y));
        }
    }
    return std::make_unique<PixelBuffer>(extent, 2, aPositions.data(), OGL::Buffer::USAGE_STATIC_DRAW);
}

bool PixelBuffer::serves(ExtentInPixelSpace const& extent) noexcept {
    return oExtent_ == extent && oBuffer_.isShareGroupCurrent();
}

} // namespace ORVO::ImageFlow::bilateral
