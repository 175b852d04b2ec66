#include <array>
#include <cstdint>
#include <string>

#include "orvo/ogl/Texture.h"
#include "orvo/ogl/internal/TextureFormats.h"
#include "orvo/ogl/internal/TokenTable.h"

namespace ORVO::OGL {

namespace {

using Internal::fromToken;
using Internal::toToken;

constexpr std::array<unsigned, 12> aFormats{
    GL_COLOR_INDEX, GL_DEPTH_COMPONENT, GL_RED, GL_GREEN, GL_BLUE, GL_ALPHA, GL_RGB, GL_BGR, GL_RGBA, GL_BGRA,
    GL_LUMINANCE,   GL_LUMINANCE_ALPHA};

constexpr std::array<unsigned, 21> aTypes{GL_UNSIGNED_BYTE,
                                          GL_BYTE,
                                          GL_BITMAP,
                                          GL_UNSIGNED_SHORT,
                                          GL_SHORT,
                                          GL_INT,
                                          GL_UNSIGNED_INT,
                                          GL_FLOAT,
                                          GL_UNSIGNED_BYTE_3_3_2,
                                          GL_UNSIGNED_BYTE_2_3_3_REV,
                                          GL_UNSIGNED_SHORT_5_6_5,
                                          GL_UNSIGNED_SHORT_5_6_5_REV,
                                          GL_UNSIGNED_SHORT_4_4_4_4,
                                          GL_UNSIGNED_SHORT_4_4_4_4_REV,
                                          GL_UNSIGNED_SHORT_5_5_5_1,
                                          GL_UNSIGNED_SHORT_1_5_5_5_REV,
                                          GL_UNSIGNED_INT_8_8_8_8,
                                          GL_UNSIGNED_INT_8_8_8_8_REV,
                                          GL_UNSIGNED_INT_10_10_10_2,
                                          GL_UNSIGNED_INT_2_10_10_10_REV,
                                          GL_HALF_FLOAT};

constexpr std::array<unsigned, 5> aWrapModes{GL_CLAMP, GL_CLAMP_TO_EDGE, GL_CLAMP_TO_BORDER, GL_REPEAT,
                                             GL_MIRRORED_REPEAT};

constexpr std::array<unsigned, 6> aFilters{GL_NEAREST,
                                           GL_LINEAR,
                                           GL_NEAREST_MIPMAP_NEAREST,
                                           GL_LINEAR_MIPMAP_NEAREST,
                                           GL_NEAREST_MIPMAP_LINEAR,
                                           GL_LINEAR_MIPMAP_LINEAR};

constexpr std::array<unsigned, 4> aTargets{GL_TEXTURE_1D, GL_TEXTURE_2D, GL_TEXTURE_3D, GL_TEXTURE_RECTANGLE};

Internal::InternalFormatRow const& validRow(Texture::InternalFormat format) {
    Internal::InternalFormatRow const* const pRow = Internal::rowOf(format);
    if (pRow == nullptr)
        ORVO_OGL_FAIL("Unknown internal format " + std::to_string(static_cast<int>(format)), GL_INVALID_ENUM);
    return *pRow;
}

std::size_t multiplySaturated(std::size_t a, std::size_t b) noexcept {
    std::size_t product = 0;
    return __builtin_mul_overflow(a, b, &product) ? SIZE_MAX : product;
}

} // namespace

Texture::Format Texture::GL2Format(unsigned token) { return fromToken<Format>(aFormats, token, "format"); }
unsigned Texture::Format2GL(Format format) { return toToken(aFormats, format, "format"); }

Texture::Type Texture::GL2Type(unsigned token) { return fromToken<Type>(aTypes, token, "type"); }
unsigned Texture::Type2GL(Type type) { return toToken(aTypes, type, "type"); }

Texture::WrapMode Texture::GL2WrapMode(unsigned token) {
    return fromToken<WrapMode>(aWrapModes, token, "wrap mode");
}
unsigned Texture::WrapMode2GL(WrapMode mode) { return toToken(aWrapModes, mode, "wrap mode"); }

Texture::Filter Texture::GL2Filter(unsigned token) { return fromToken<Filter>(aFilters, token, "filter"); }
unsigned Texture::Filter2GL(Filter filter) { return toToken(aFilters, filter, "filter"); }

Texture::Target Texture::GL2Target(unsigned token) {
    return fromToken<Target>(aTargets, token, "texture target");
}
unsigned Texture::Target2GL(Target target) { return toToken(aTargets, target, "texture target"); }

Texture::InternalFormat Texture::GL2InternalFormat(unsigned token) {
    for (int i = INTERNAL_FORMAT_ALPHA; i <= INTERNAL_FORMAT_LUMINANCE_ALPHA16F; ++i) {
        auto const format = static_cast<InternalFormat>(i);
        if (IsValid(format) && validRow(format).nToken_ == token)
            return format;
    }
    ORVO_OGL_FAIL(std::string("Unknown internal format ") + TokenName(token), GL_INVALID_ENUM);
}

unsigned Texture::InternalFormat2GL(InternalFormat format) { return validRow(format).nToken_; }

bool Texture::IsValid(InternalFormat format) noexcept { return Internal::rowOf(format) != nullptr; }

bool Texture::IsFloat(InternalFormat format) noexcept {
    return format >= INTERNAL_FORMAT_RGBA32F && format <= INTERNAL_FORMAT_LUMINANCE_ALPHA16F;
}

bool Texture::IsLinear(Filter filter) noexcept {
    return filter == FILTER_LINEAR || filter == FILTER_LINEAR_MIPMAP_NEAREST ||
           filter == FILTER_NEAREST_MIPMAP_LINEAR || filter == FILTER_LINEAR_MIPMAP_LINEAR;
}

unsigned Texture::Channels(Format format) {
    Format2GL(format); // refuses what is no format
    if (format == FORMAT_LUMINANCE_ALPHA)
        return 2;
    if (format == FORMAT_RGB || format == FORMAT_BGR)
        return 3;
    return format == FORMAT_RGBA || format == FORMAT_BGRA ? 4 : 1;
}

unsigned Texture::Channels(InternalFormat format) { return validRow(format).nChannels_; }

std::size_t Texture::SizeInBytes(InternalFormat format, std::size_t width, std::size_t height,
                                 std::size_t depth) {
    std::size_t const nBytesOfPixel = (validRow(format).nBits_ + 7) / 8;
    if (width == 0 || height == 0 || depth == 0)
        return 0;
    return multiplySaturated(multiplySaturated(multiplySaturated(nBytesOfPixel, width), height), depth);
}

} // namespace ORVO::OGL
