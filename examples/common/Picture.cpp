#include "common/Picture.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace example {

namespace {

// Calls operation(source pixel, destination pixel) for every pixel, with T the type of one channel.
template <typename T, typename Operation>
void forEachPixel(Picture const& source, Picture& destination, Operation operation) {
    std::size_t const count = source.width * source.height;
    auto const* from = reinterpret_cast<T const*>(source.pixels.data());
    auto* to = reinterpret_cast<T*>(destination.pixels.data());
    for (std::size_t i = 0; i < count; ++i)
        operation(from + i * source.channels, to + i * destination.channels);
}

template <typename Operation>
void forEachPixelOfDepth(Picture const& source, Picture& destination, Operation operation) {
    switch (source.depth) {
    case Depth::uint8:
        return forEachPixel<std::uint8_t>(source, destination, operation);
    case Depth::uint15_1:
        return forEachPixel<std::uint16_t>(source, destination, operation);
    case Depth::float32:
        return forEachPixel<float>(source, destination, operation);
    }
}

float meanOf(float const* rgb) { return (rgb[0] + rgb[1] + rgb[2]) / 3.0F; }

template <typename Integer>
Integer meanOf(Integer const* rgb) {
    return static_cast<Integer>((rgb[0] + rgb[1] + rgb[2] + 1) / 3);
}

// The value of a full channel; the argument only names the type.
std::uint8_t opaque(std::uint8_t const* /*channel*/) { return 255; }

std::uint16_t opaque(std::uint16_t const* /*channel*/) { return 32768; }

float opaque(float const* /*channel*/) { return 1.0F; }

} // namespace

std::size_t bytesPerChannel(Depth depth) {
    switch (depth) {
    case Depth::uint8:
        return 1;
    case Depth::uint15_1:
        return 2;
    case Depth::float32:
        break;
    }
    return 4;
}

Picture::Picture(std::size_t pictureWidth, std::size_t pictureHeight, std::size_t channelCount,
                 Depth pictureDepth)
    : width(pictureWidth),
      height(pictureHeight),
      channels(channelCount),
      depth(pictureDepth),
      pixels(pictureWidth * pictureHeight * channelCount * bytesPerChannel(pictureDepth)) {}

void Picture::resize(std::size_t pictureWidth, std::size_t pictureHeight, std::size_t channelCount,
                     Depth pictureDepth) {
    width = pictureWidth;
    height = pictureHeight;
    channels = channelCount;
    depth = pictureDepth;
    pixels.resize(pictureWidth * pictureHeight * channelCount * bytesPerChannel(pictureDepth));
}

std::size_t Picture::rowBytes() const { return width * channels * bytesPerChannel(depth); }

Picture widenedToColour(Picture const& picture) {
    if (picture.channels > 2)
        return picture;
    Picture result(picture.width, picture.height, picture.channels + 2, picture.depth);
    bool const alpha = picture.hasAlpha();
    forEachPixelOfDepth(picture, result, [alpha](auto const* from, auto* to) {
        to[0] = to[1] = to[2] = from[0];
        if (alpha)
            to[3] = from[1];
    });
    return result;
}

Picture reducedToGrey(Picture const& picture) {
    if (picture.channels < 3)
        return picture;
    Picture result(picture.width, picture.height, picture.channels - 2, picture.depth);
    bool const alpha = picture.hasAlpha();
    forEachPixelOfDepth(picture, result, [alpha](auto const* from, auto* to) {
        to[0] = meanOf(from);
        if (alpha)
            to[1] = from[3];
    });
    return result;
}

Picture withAlpha(Picture const& picture) {
    if (picture.hasAlpha())
        return picture;
    Picture result(picture.width, picture.height, picture.channels + 1, picture.depth);
    std::size_t const colours = picture.channels;
    forEachPixelOfDepth(picture, result, [colours](auto const* from, auto* to) {
        std::copy_n(from, colours, to);
        to[colours] = opaque(from);
    });
    return result;
}

Picture withoutAlpha(Picture const& picture) {
    if (!picture.hasAlpha())
        return picture;
    Picture result(picture.width, picture.height, picture.channels - 1, picture.depth);
    std::size_t const colours = result.channels;
    forEachPixelOfDepth(picture, result,
                        [colours](auto const* from, auto* to) { std::copy_n(from, colours, to); });
    return result;
}

Picture upsideDown(Picture const& picture) {
    Picture result = picture;
    std::size_t const rowBytes = picture.rowBytes();
    for (std::size_t row = 0; row < picture.height; ++row)
        std::memcpy(result.pixels.data() + row * rowBytes,
                    picture.pixels.data() + (picture.height - 1 - row) * rowBytes, rowBytes);
    return result;
}

} // namespace example
