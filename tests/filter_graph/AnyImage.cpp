#include "tests/filter_graph/AnyImage.h"

#include <cstdint>
#include <cstring>

#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"

namespace ORVO::Test {

using FilterGraph::ImageDescriptor;

namespace {

std::size_t bytesOf(ImageDescriptor::eChannelType type) {
    return type == ImageDescriptor::CHANNEL_TYPE_UINT8      ? 1
           : type == ImageDescriptor::CHANNEL_TYPE_UINT15_1 ? 2
                                                            : 4;
}

} // namespace

std::size_t RasterValues::index(int px, int py, std::size_t channel) const {
    return (static_cast<std::size_t>(py - y) * static_cast<std::size_t>(width) +
            static_cast<std::size_t>(px - x)) *
               channels +
           channel;
}

float RasterValues::at(int px, int py, std::size_t channel) const {
    return contains(px, py) ? values[index(px, py, channel)] : 0.0f;
}

AnyImage::AnyImage(ImageDescriptor::eChannelType type, float pixelSize, RasterValues const& picture)
    : eType_(type),
      oRect_(picture),
      aBytes_(static_cast<std::size_t>(picture.width) * static_cast<std::size_t>(picture.height) *
              picture.channels * bytesOf(type)),
      oHandle_(FilterGraph::ImageDescriptorCPU({picture.channels, type},
                                               PixelExtentInWorldSpace(pixelSize, pixelSize)),
               PositionExtentInPixelSpace(PositionInPixelSpace(picture.x, picture.y),
                                          ExtentInPixelSpace(picture.width, picture.height)),
               aBytes_.data(), 0) {
    oRect_.values.clear();
    store(picture);
}

void AnyImage::store(RasterValues const& picture) {
    for (std::size_t i = 0; i < picture.values.size(); ++i) {
        unsigned char* const pChannel = aBytes_.data() + i * bytesOf(eType_);
        float const value = picture.values[i];
        if (eType_ == ImageDescriptor::CHANNEL_TYPE_UINT8) {
            *pChannel = static_cast<unsigned char>(value);
        } else if (eType_ == ImageDescriptor::CHANNEL_TYPE_UINT15_1) {
            auto const word = static_cast<std::uint16_t>(value);
            std::memcpy(pChannel, &word, sizeof word);
        } else {
            std::memcpy(pChannel, &value, sizeof value);
        }
    }
}

RasterValues AnyImage::load() const {
    RasterValues picture = oRect_;
    picture.values.resize(aBytes_.size() / bytesOf(eType_));
    for (std::size_t i = 0; i < picture.values.size(); ++i) {
        unsigned char const* const pChannel = aBytes_.data() + i * bytesOf(eType_);
        if (eType_ == ImageDescriptor::CHANNEL_TYPE_UINT8) {
            picture.values[i] = *pChannel;
        } else if (eType_ == ImageDescriptor::CHANNEL_TYPE_UINT15_1) {
            std::uint16_t word = 0;
            std::memcpy(&word, pChannel, sizeof word);
            picture.values[i] = word;
        } else {
            std::memcpy(&picture.values[i], pChannel, sizeof(float));
        }
    }
    return picture;
}

} // namespace ORVO::Test
