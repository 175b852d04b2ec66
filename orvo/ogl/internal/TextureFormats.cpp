#include "orvo/ogl/internal/TextureFormats.h"

#include <array>

#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO::OGL::Internal {

namespace {

constexpr std::array<InternalFormatRow, 58> aRows{{
    {GL_ALPHA, 1, 8},
    {GL_ALPHA4, 1, 4},
    {GL_ALPHA8, 1, 8},
    {GL_ALPHA12, 1, 12},
    {GL_ALPHA16, 1, 16},
    {GL_LUMINANCE, 1, 8},
    {GL_LUMINANCE4, 1, 4},
    {GL_LUMINANCE8, 1, 8},
    {GL_LUMINANCE12, 1, 12},
    {GL_LUMINANCE16, 1, 16},
    {GL_LUMINANCE_ALPHA, 2, 16},
    {GL_LUMINANCE4_ALPHA4, 2, 8},
    {GL_LUMINANCE6_ALPHA2, 2, 8},
    {GL_LUMINANCE8_ALPHA8, 2, 16},
    {GL_LUMINANCE12_ALPHA4, 2, 16},
    {GL_LUMINANCE12_ALPHA12, 2, 24},
    {GL_LUMINANCE16_ALPHA16, 2, 32},
    {GL_INTENSITY, 1, 8},
    {GL_INTENSITY4, 1, 4},
    {GL_INTENSITY8, 1, 8},
    {GL_INTENSITY12, 1, 12},
    {GL_INTENSITY16, 1, 16},
    {GL_DEPTH_COMPONENT, 1, 8},
    {GL_DEPTH_COMPONENT16, 1, 16},
    {GL_DEPTH_COMPONENT24, 1, 24},
    {GL_DEPTH_COMPONENT32, 1, 32},
    {0, 0, 0},
    {0, 0, 0},
    {0, 0, 0},
    {0, 0, 0},
    {GL_R3_G3_B2, 3, 8},
    {GL_RGB, 3, 24},
    {GL_RGB4, 3, 12},
    {GL_RGB5, 3, 15},
    {GL_RGB8, 3, 24},
    {GL_RGB10, 3, 30},
    {GL_RGB12, 3, 36},
    {GL_RGB16, 3, 48},
    {GL_RGBA, 4, 32},
    {GL_RGBA2, 4, 8},
    {GL_RGBA4, 4, 16},
    {GL_RGB5_A1, 4, 16},
    {GL_RGBA8, 4, 32},
    {GL_RGB10_A2, 4, 32},
    {GL_RGBA12, 4, 48},
    {GL_RGBA16, 4, 64},
    {GL_RGBA32F, 4, 128},
    {GL_RGB32F, 3, 96},
    {GL_ALPHA32F_ARB, 1, 32},
    {GL_INTENSITY32F_ARB, 1, 32},
    {GL_LUMINANCE32F_ARB, 1, 32},
    {GL_LUMINANCE_ALPHA32F_ARB, 2, 64},
    {GL_RGBA16F, 4, 64},
    {GL_RGB16F, 3, 48},
    {GL_ALPHA16F_ARB, 1, 16},
    {GL_INTENSITY16F_ARB, 1, 16},
    {GL_LUMINANCE16F_ARB, 1, 16},
    {GL_LUMINANCE_ALPHA16F_ARB, 2, 32},
}};

Texture::Format naturalFormat(Texture::InternalFormat format, InternalFormatRow const& row) {
    if (format <= Texture::INTERNAL_FORMAT_ALPHA16 || format == Texture::INTERNAL_FORMAT_ALPHA32F ||
        format == Texture::INTERNAL_FORMAT_ALPHA16F)
        return Texture::FORMAT_ALPHA;
    if (format >= Texture::INTERNAL_FORMAT_DEPTH_COMPONENT &&
        format <= Texture::INTERNAL_FORMAT_DEPTH_COMPONENT32)
        return Texture::FORMAT_DEPTH;
    static constexpr std::array<Texture::Format, 4> aByChannels{Texture::FORMAT_LUMINANCE,
                                                                Texture::FORMAT_LUMINANCE_ALPHA,
                                                                Texture::FORMAT_RGB, Texture::FORMAT_RGBA};
    return aByChannels[row.nChannels_ - 1];
}

Texture::Type naturalType(Texture::InternalFormat format, InternalFormatRow const& row) {
    unsigned const nBitsOfChannel = row.nBits_ / row.nChannels_;
    if (Texture::IsFloat(format))
        return nBitsOfChannel == 32 ? Texture::TYPE_FLOAT : Texture::TYPE_HALF_FLOAT;
    if (nBitsOfChannel > 16)
        return Texture::TYPE_UNSIGNED_INT;
    return nBitsOfChannel > 8 ? Texture::TYPE_UNSIGNED_SHORT : Texture::TYPE_UNSIGNED_BYTE;
}

} // namespace

InternalFormatRow const* rowOf(Texture::InternalFormat format) noexcept {
    auto const nIndex = static_cast<std::size_t>(format);
    if (nIndex >= aRows.size() || aRows[nIndex].nChannels_ == 0)
        return nullptr;
    return &aRows[nIndex];
}

NaturalPixels naturalPixels(Texture::InternalFormat format) {
    InternalFormatRow const* const pRow = rowOf(format);
    if (pRow == nullptr)
        ORVO_OGL_FAIL("Unknown internal format " + std::to_string(static_cast<int>(format)), GL_INVALID_ENUM);
    return {naturalFormat(format, *pRow), naturalType(format, *pRow)};
}

} // namespace ORVO::OGL::Internal
