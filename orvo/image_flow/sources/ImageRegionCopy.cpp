#include "orvo/image_flow/sources/ImageRegionCopy.h"

#include "orvo/core/Check.h"
#include "orvo/core/math/Half.h"
#include "orvo/image_runtime/images/ImageCPU.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <type_traits>

namespace ORVO {

namespace {

enum class ChannelType { UINT8, UINT16, HALF, FLOAT };

/// What a pixel format means, for all formats, the half-float ones included.
struct PixelLayout {
    std::size_t nChannels_;
    ChannelType eType_;
    bool bBlueFirst_;
};

PixelLayout layoutOf(ImageCPU::tePixelFormat format) {
    switch (format) {
    case ImageCPU::PIXEL_FORMAT_BGR8:
        return {3, ChannelType::UINT8, true};
    case ImageCPU::PIXEL_FORMAT_BGRA8:
        return {4, ChannelType::UINT8, true};
    case ImageCPU::PIXEL_FORMAT_RGB8:
        return {3, ChannelType::UINT8, false};
    case ImageCPU::PIXEL_FORMAT_RGBA8:
        return {4, ChannelType::UINT8, false};
    case ImageCPU::PIXEL_FORMAT_RGB16:
        return {3, ChannelType::UINT16, false};
    case ImageCPU::PIXEL_FORMAT_RGBA16:
        return {4, ChannelType::UINT16, false};
    case ImageCPU::PIXEL_FORMAT_RGB32F:
        return {3, ChannelType::FLOAT, false};
    case ImageCPU::PIXEL_FORMAT_RGBA32F:
        return {4, ChannelType::FLOAT, false};
    case ImageCPU::PIXEL_FORMAT_LUMINANCE8:
        return {1, ChannelType::UINT8, false};
    case ImageCPU::PIXEL_FORMAT_LUMINANCE16:
        return {1, ChannelType::UINT16, false};
    case ImageCPU::PIXEL_FORMAT_LUMINANCE32F:
        return {1, ChannelType::FLOAT, false};
    case ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8:
        return {2, ChannelType::UINT8, false};
    case ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16:
        return {2, ChannelType::UINT16, false};
    case ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F:
        return {2, ChannelType::FLOAT, false};
    case ImageCPU::PIXEL_FORMAT_RGB16F:
        return {3, ChannelType::HALF, false};
    case ImageCPU::PIXEL_FORMAT_RGBA16F:
        return {4, ChannelType::HALF, false};
    case ImageCPU::PIXEL_FORMAT_LUMINANCE16F:
        return {1, ChannelType::HALF, false};
    case ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F:
        return {2, ChannelType::HALF, false};
    case ImageCPU::PIXEL_FORMAT_UNDEFINED:
        break;
    }
    return {0, ChannelType::UINT8, false};
}

std::size_t bytesOf(ChannelType eType) {
    return eType == ChannelType::UINT8 ? 1 : eType == ChannelType::FLOAT ? 4 : 2;
}

/// The scale of an integer channel: its number for 1.0.
template <typename Channel>
constexpr float whiteOf() {
    return std::is_same_v<Channel, std::uint8_t> ? 255.0f : 32768.0f;
}

template <typename Channel>
float toFloat(Channel value) {
    if constexpr (std::is_integral_v<Channel>) {
        return static_cast<float>(value) / whiteOf<Channel>();
    } else {
        return static_cast<float>(value);
    }
}

template <typename Channel>
Channel fromFloat(float value) {
    if constexpr (std::is_integral_v<Channel>) {
        // The comparison is false for a NaN, which so becomes 0.
        float const bounded = value > 0.0f ? std::min(value, 1.0f) : 0.0f;
        // Never negative, and unlike a call of the library it runs in vectors.
        return static_cast<Channel>(
            static_cast<int>(bounded * whiteOf<Channel>() + 0.5f)); // NOLINT(bugprone-incorrect-roundings)
    } else {
        return Channel(value);
    }
}

template <typename From, typename To>
To convertChannel(From value) {
    if constexpr (std::is_same_v<From, To>) {
        return value;
    } else {
        return fromFloat<To>(toFloat(value));
    }
}

/// Converts a row of `nPixels` pixels, exchanging the first and the third channel if asked to.
template <typename From, typename To>
void convertRow(unsigned char const* pFrom, unsigned char* pTo, std::size_t nPixels, std::size_t nChannels,
                bool bSwap) {
    auto const* const aFrom = reinterpret_cast<From const*>(pFrom);
    auto* const aTo = reinterpret_cast<To*>(pTo);
    if (!bSwap) {
        std::transform(aFrom, aFrom + nPixels * nChannels, aTo, convertChannel<From, To>);
        return;
    }
    for (std::size_t i = 0; i < nPixels * nChannels; i += nChannels) {
        // Read before they are written: a row may be converted onto itself.
        From const first = aFrom[i];
        From const third = aFrom[i + 2];
        aTo[i + 1] = convertChannel<From, To>(aFrom[i + 1]);
        aTo[i] = convertChannel<From, To>(third);
        aTo[i + 2] = convertChannel<From, To>(first);
        if (nChannels == 4) {
            aTo[i + 3] = convertChannel<From, To>(aFrom[i + 3]);
        }
    }
}

using RowConverter = void (*)(unsigned char const*, unsigned char*, std::size_t, std::size_t, bool);

template <typename From>
RowConverter converterTo(ChannelType eTo) {
    switch (eTo) {
    case ChannelType::UINT8:
        return convertRow<From, std::uint8_t>;
    case ChannelType::UINT16:
        return convertRow<From, std::uint16_t>;
    case ChannelType::HALF:
        return convertRow<From, half>;
    case ChannelType::FLOAT:
        break;
    }
    return convertRow<From, float>;
}

RowConverter converter(ChannelType eFrom, ChannelType eTo) {
    switch (eFrom) {
    case ChannelType::UINT8:
        return converterTo<std::uint8_t>(eTo);
    case ChannelType::UINT16:
        return converterTo<std::uint16_t>(eTo);
    case ChannelType::HALF:
        return converterTo<half>(eTo);
    case ChannelType::FLOAT:
        break;
    }
    return converterTo<float>(eTo);
}

/// The end of a stretch of pixels, for which there are no numbers beyond those of int.
int endOf(int begin, int length) {
    return static_cast<int>(std::min<std::int64_t>(std::int64_t(begin) + length, INT32_MAX));
}

std::size_t byteOffset(ImageCPU const& image, int x, int y, std::size_t pixelBytes) {
    auto const column = static_cast<std::size_t>(std::int64_t(x) - image.position().x());
    auto const row = static_cast<std::size_t>(std::int64_t(y) - image.position().y());
    return (row * static_cast<std::size_t>(image.capacityExtent().width()) + column) * pixelBytes;
}

} // namespace

ImageRegionCopy::ImageRegionCopy(ImageCPU const& source, ImageCPU& destination,
                                 PositionExtentInPixelSpace const& region)
    : source_(source), destination_(destination), oRegion_(region) {
    std::size_t const nChannels = layoutOf(source.pixelFormat()).nChannels_;
    ORVO_CHECK_PARAMETER(nChannels != 0 && nChannels == layoutOf(destination.pixelFormat()).nChannels_,
                         "Source and bound output image differ in their channels");
    PositionExtentInPixelSpace const& covered = source.positionExtent();
    // A storage that is smaller than the image ends the picture.
    int const width = std::min(covered.extent().width(), source.capacityExtent().width());
    int const height = std::min(covered.extent().height(), source.capacityExtent().height());
    nBeginX_ = std::max(region.position().x(), covered.position().x());
    nBeginY_ = std::max(region.position().y(), covered.position().y());
    nEndX_ =
        std::min(endOf(region.position().x(), region.extent().width()), endOf(covered.position().x(), width));
    nEndY_ = std::min(endOf(region.position().y(), region.extent().height()),
                      endOf(covered.position().y(), height));
}

void ImageRegionCopy::copyRows(std::size_t begin, std::size_t end) const {
    PixelLayout const from = layoutOf(source_.pixelFormat());
    PixelLayout const to = layoutOf(destination_.pixelFormat());
    std::size_t const fromBytes = bytesOf(from.eType_) * from.nChannels_;
    std::size_t const toBytes = bytesOf(to.eType_) * to.nChannels_;
    bool const bSwap = from.bBlueFirst_ != to.bBlueFirst_;
    bool const bSame = from.eType_ == to.eType_ && !bSwap;
    RowConverter const convert = converter(from.eType_, to.eType_);
    int const top = oRegion_.position().y();
    int const lastY = std::min(nEndY_, endOf(top, static_cast<int>(end)));
    if (nBeginX_ >= nEndX_) {
        return;
    }
    auto const nPixels = static_cast<std::size_t>(std::int64_t(nEndX_) - nBeginX_);
    for (int y = std::max(nBeginY_, endOf(top, static_cast<int>(begin))); y < lastY; ++y) {
        unsigned char const* const pFrom = source_.pixels() + byteOffset(source_, nBeginX_, y, fromBytes);
        unsigned char* const pTo = destination_.pixels() + byteOffset(destination_, nBeginX_, y, toBytes);
        if (bSame) {
            // The client may have bound the image that is also the source.
            std::memmove(pTo, pFrom, nPixels * toBytes);
        } else {
            convert(pFrom, pTo, nPixels, from.nChannels_, bSwap);
        }
    }
}

} // namespace ORVO
