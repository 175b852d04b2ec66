#pragma once

#include <cstddef>
#include <vector>

#include "orvo/filter_graph/impl/ImageCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"

namespace ORVO::Test {

/// A rectangle of pixels with its values, as the reference computes them.
struct RasterValues {
    int x = 0;
    int y = 0;
    int width = 0;
    int height = 0;
    std::size_t channels = 1;
    std::vector<float> values;

    bool contains(int px, int py) const { return px >= x && py >= y && px < x + width && py < y + height; }
    std::size_t index(int px, int py, std::size_t channel) const;

    /// 0 outside.
    float at(int px, int py, std::size_t channel) const;
};

/// A client image of one of the channel types, with pixels of its own.
class AnyImage {
public:
    AnyImage(FilterGraph::ImageDescriptor::eChannelType type, float pixelSize, RasterValues const& picture);

    FilterGraph::ImageCPU* handle() { return &oHandle_; }
    unsigned char* bytes() { return aBytes_.data(); }
    RasterValues const& rect() const { return oRect_; }

    void store(RasterValues const& picture);
    RasterValues load() const;

private:
    FilterGraph::ImageDescriptor::eChannelType eType_;
    RasterValues oRect_; // without values
    std::vector<unsigned char> aBytes_;
    FilterGraph::ImageCPU oHandle_;
};

} // namespace ORVO::Test
