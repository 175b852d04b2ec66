#pragma once

#include <cstddef>

#include "orvo/ogl/Object.h"
#include "orvo/ogl/PixelUnpackParameters.h"

namespace ORVO::OGL {

/// Base of all textures: their sizes, their format, and the conversions between this layer's enumerations and
/// OpenGL's tokens.
///
/// Operations "on the bound texture" throw InternalException "isBound()" if the texture is not bound on the
/// active unit.
///
/// Threads: as Object. The static conversions: any.
class ORVO_API Texture : public Object {
public:
    /// Channels of pixels in memory.
    enum Format : int {
        FORMAT_COLOR_INDEX = 0,
        FORMAT_DEPTH = 1,
        FORMAT_RED = 2,
        FORMAT_GREEN = 3,
        FORMAT_BLUE = 4,
        FORMAT_ALPHA = 5,
        FORMAT_RGB = 6,
        FORMAT_BGR = 7,
        FORMAT_RGBA = 8,
        FORMAT_BGRA = 9,
        FORMAT_LUMINANCE = 10,
        FORMAT_LUMINANCE_ALPHA = 11
    };

    /// Type of a channel, or of a packed pixel, in memory.
    enum Type : int {
        TYPE_UNSIGNED_BYTE = 0,
        TYPE_BYTE = 1,
        TYPE_BITMAP = 2,
        TYPE_UNSIGNED_SHORT = 3,
        TYPE_SHORT = 4,
        TYPE_INT = 5,
        TYPE_UNSIGNED_INT = 6,
        TYPE_FLOAT = 7,
        TYPE_UNSIGNED_BYTE_3_3_2 = 8,
        TYPE_UNSIGNED_BYTE_2_3_3_REV = 9,
        TYPE_UNSIGNED_SHORT_5_6_5 = 10,
        TYPE_UNSIGNED_SHORT_5_6_5_REV = 11,
        TYPE_UNSIGNED_SHORT_4_4_4_4 = 12,
        TYPE_UNSIGNED_SHORT_4_4_4_4_REV = 13,
        TYPE_UNSIGNED_SHORT_5_5_5_1 = 14,
        TYPE_UNSIGNED_SHORT_1_5_5_5_REV = 15,
        TYPE_UNSIGNED_INT_8_8_8_8 = 16,
        TYPE_UNSIGNED_INT_8_8_8_8_REV = 17,
        TYPE_UNSIGNED_INT_10_10_10_2 = 18,
        TYPE_UNSIGNED_INT_2_10_10_10_REV = 19,
        TYPE_HALF_FLOAT = 20
    };

    /// Format of the texture itself. The values 26 to 29 are not valid; 46 to 57 are the float formats.
    enum InternalFormat : int {
        INTERNAL_FORMAT_ALPHA = 0,
        INTERNAL_FORMAT_ALPHA4,
        INTERNAL_FORMAT_ALPHA8,
        INTERNAL_FORMAT_ALPHA12,
        INTERNAL_FORMAT_ALPHA16,
        INTERNAL_FORMAT_LUMINANCE = 5,
        INTERNAL_FORMAT_LUMINANCE4,
        INTERNAL_FORMAT_LUMINANCE8,
        INTERNAL_FORMAT_LUMINANCE12,
        INTERNAL_FORMAT_LUMINANCE16,
        INTERNAL_FORMAT_LUMINANCE_ALPHA = 10,
        INTERNAL_FORMAT_LUMINANCE4_ALPHA4,
        INTERNAL_FORMAT_LUMINANCE6_ALPHA2,
        INTERNAL_FORMAT_LUMINANCE8_ALPHA8,
        INTERNAL_FORMAT_LUMINANCE12_ALPHA4,
        INTERNAL_FORMAT_LUMINANCE12_ALPHA12,
        INTERNAL_FORMAT_LUMINANCE16_ALPHA16,
        INTERNAL_FORMAT_INTENSITY = 17,
        INTERNAL_FORMAT_INTENSITY4,
        INTERNAL_FORMAT_INTENSITY8,
        INTERNAL_FORMAT_INTENSITY12,
        INTERNAL_FORMAT_INTENSITY16,
        INTERNAL_FORMAT_DEPTH_COMPONENT = 22,
        INTERNAL_FORMAT_DEPTH_COMPONENT16,
        INTERNAL_FORMAT_DEPTH_COMPONENT24,
        INTERNAL_FORMAT_DEPTH_COMPONENT32,
        INTERNAL_FORMAT_R3_G3_B2 = 30,
        INTERNAL_FORMAT_RGB = 31,
        INTERNAL_FORMAT_RGB4,
        INTERNAL_FORMAT_RGB5,
        INTERNAL_FORMAT_RGB8,
        INTERNAL_FORMAT_RGB10,
        INTERNAL_FORMAT_RGB12,
        INTERNAL_FORMAT_RGB16,
        INTERNAL_FORMAT_RGBA = 38,
        INTERNAL_FORMAT_RGBA2,
        INTERNAL_FORMAT_RGBA4,
        INTERNAL_FORMAT_RGB5_A1,
        INTERNAL_FORMAT_RGBA8,
        INTERNAL_FORMAT_RGB10_A2,
        INTERNAL_FORMAT_RGBA12,
        INTERNAL_FORMAT_RGBA16,
        INTERNAL_FORMAT_RGBA32F = 46,
        INTERNAL_FORMAT_RGB32F,
        INTERNAL_FORMAT_ALPHA32F,
        INTERNAL_FORMAT_INTENSITY32F,
        INTERNAL_FORMAT_LUMINANCE32F,
        INTERNAL_FORMAT_LUMINANCE_ALPHA32F,
        INTERNAL_FORMAT_RGBA16F = 52,
        INTERNAL_FORMAT_RGB16F,
        INTERNAL_FORMAT_ALPHA16F,
        INTERNAL_FORMAT_INTENSITY16F,
        INTERNAL_FORMAT_LUMINANCE16F,
        INTERNAL_FORMAT_LUMINANCE_ALPHA16F
    };

    enum WrapMode : int {
        WRAP_MODE_CLAMP = 0,
        WRAP_MODE_CLAMP_TO_EDGE = 1,
        /// The clamp that reads the border colour outside.
        WRAP_MODE_CLAMP_TO_BORDER = 2,
        WRAP_MODE_REPEAT = 3,
        WRAP_MODE_MIRRORED_REPEAT = 4
    };

    enum Filter : int {
        FILTER_NEAREST = 0,
        FILTER_LINEAR = 1,
        FILTER_NEAREST_MIPMAP_NEAREST = 2,
        FILTER_LINEAR_MIPMAP_NEAREST = 3,
        FILTER_NEAREST_MIPMAP_LINEAR = 4,
        FILTER_LINEAR_MIPMAP_LINEAR = 5
    };

    enum Target : int { TARGET_1D = 0, TARGET_2D = 1, TARGET_3D = 2, TARGET_RECTANGLE = 3 };

    /// Deletes the texture, if a context of its share group is current.
    ~Texture() override;

    unsigned getBoundID() const override;

    /// Size of a level in pixels, at least 1 for levels of a texture that is not empty; 0 for a level that
    /// the texture does not have. Absent dimensions are 1.
    std::size_t width(unsigned level) const noexcept;
    std::size_t height(unsigned level) const noexcept;
    virtual std::size_t depth(unsigned level) const noexcept;

    InternalFormat format() const noexcept { return eFormat_; }

    /// Nominal size of all levels in bytes; INT_MAX if it is larger.
    int sizeInBytes() const noexcept;

    /// Filters of the bound texture. Throws ExceptionOGL for a magnification filter with mipmaps.
    void setFilter(Filter min, Filter mag);
    /// Border colour of the bound texture: four floats, red first.
    void setBorderColor(float const* pColor);

    // Conversions. Each throws ExceptionOGL, naming the value, for one that has no counterpart.

    static Format GL2Format(unsigned token);
    static unsigned Format2GL(Format format);
    static Type GL2Type(unsigned token);
    static unsigned Type2GL(Type type);
    static InternalFormat GL2InternalFormat(unsigned token);
    static unsigned InternalFormat2GL(InternalFormat format);
    static WrapMode GL2WrapMode(unsigned token);
    static unsigned WrapMode2GL(WrapMode mode);
    static Filter GL2Filter(unsigned token);
    static unsigned Filter2GL(Filter filter);
    static Target GL2Target(unsigned token);
    static unsigned Target2GL(Target target);

    /// Whether the value stands for a format.
    static bool IsValid(InternalFormat format) noexcept;
    /// Whether the value is one of the float formats.
    static bool IsFloat(InternalFormat format) noexcept;
    /// Whether the filter interpolates between texels.
    static bool IsLinear(Filter filter) noexcept;
    /// Number of channels of a pixel.
    static unsigned Channels(Format format);
    static unsigned Channels(InternalFormat format);
    /// Nominal size of an image in bytes: the bits of a pixel rounded up to bytes, times the number of
    /// pixels. Unsized formats count 8 bits a channel. Saturates at SIZE_MAX.
    static std::size_t SizeInBytes(InternalFormat format, std::size_t width, std::size_t height,
                                   std::size_t depth);

protected:
    /// Size of level 0 in pixels.
    struct Extent {
        std::size_t nWidth_;
        std::size_t nHeight_;
        std::size_t nDepth_;
    };

    /// Checks the size, makes the name and, with mipmaps, counts the levels down to one pixel. Throws
    /// ParameterException "Texture size is too large" for what 2^32 - 1 bytes or OpenGL's integers do not
    /// hold, ExceptionOGL.
    Texture(unsigned nTarget, InternalFormat format, Extent const& extent, bool bMipmaps);

    unsigned levels() const noexcept { return nLevels_; }
    /// Throws InternalException "isBound()" if this texture is not bound on the active unit.
    void requireBound() const;
    /// Throws ParameterException "The level does not exist".
    void requireLevel(int level) const;

private:
    InternalFormat eFormat_;
    Extent oExtent_;
    unsigned nLevels_ = 1;
};

} // namespace ORVO::OGL
