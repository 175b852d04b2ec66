#pragma once

#include <cstddef>
#include <vector>

#include "orvo/core/spaces/PixelExtentInWorldSpace.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/filter_graph/impl/ImageCPU.h"

namespace ORVO::Test {

/// A client image of 32-bit floats with pixels of its own, without padding.
class FloatImage {
public:
    FloatImage(int x, int y, int width, int height, std::size_t channels = 1, float fill = 0.0f,
               PixelExtentInWorldSpace const& pixelExtent = PixelExtentInWorldSpace())
        : x_(x),
          y_(y),
          width_(width),
          height_(height),
          channels_(channels),
          aPixels_(static_cast<std::size_t>(width) * static_cast<std::size_t>(height) * channels, fill),
          oHandle_(FilterGraph::ImageDescriptorCPU(
                       {channels, FilterGraph::ImageDescriptor::CHANNEL_TYPE_FLOAT32}, pixelExtent),
                   PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height)),
                   reinterpret_cast<unsigned char const*>(aPixels_.data()), 0) {}

    FloatImage(int width, int height) : FloatImage(0, 0, width, height) {}

    FloatImage(FloatImage const&) = delete;
    FloatImage& operator=(FloatImage const&) = delete;

    /// A channel of a pixel by its position in pixel space, which must lie inside.
    float& at(int x, int y, std::size_t channel = 0) {
        return aPixels_.at((static_cast<std::size_t>(y - y_) * static_cast<std::size_t>(width_) +
                            static_cast<std::size_t>(x - x_)) *
                               channels_ +
                           channel);
    }

    std::vector<float>& pixels() { return aPixels_; }
    std::vector<float> const& pixels() const { return aPixels_; }

    /// What is bound to an adapter.
    FilterGraph::ImageCPU* handle() { return &oHandle_; }

    int left() const { return x_; }
    int top() const { return y_; }
    int width() const { return width_; }
    int height() const { return height_; }
    std::size_t channels() const { return channels_; }

private:
    int x_;
    int y_;
    int width_;
    int height_;
    std::size_t channels_;
    std::vector<float> aPixels_;
    FilterGraph::ImageCPU oHandle_;
};

} // namespace ORVO::Test
