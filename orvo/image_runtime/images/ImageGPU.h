#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/images/ImageBase.h"
#include "orvo/ogl/TextureUnit.h"

#include <cstddef>
#include <cstdint>
#include <iosfwd>

namespace ORVO {

namespace OGL {
class Texture2D;
}
class TexturePool;

/// An image in an OpenGL 2D texture.
///
/// Texel (c, r) of the texture is the pixel at (position.x + c, position.y + r). What a CPU image calls its
/// capacity is here the size of the texture, which may be larger than the rectangle: the pool hands out size
/// classes.
///
/// Scales: 8-bit and 16-bit integer textures hold 0.0 to 1.0, as OpenGL normalises them (a 16-bit texel of
/// 65535 is 1.0); halves and floats are stored as they are. Channels are in the order of the format's name.
///
/// An image owns its texture. It dies with a context current that shares with the pool's, and the texture
/// goes back to the pool at once; else it goes back when the pool next works, and no failure leaves the
/// destructor. Images are made, and all that speaks to OpenGL is called, with such a context current; without
/// one it throws ExceptionOGL "No OpenGL context is current", or what TexturePool::Instance() throws.
///
/// What needs a texture throws InternalException "No Texture Object specified" where there is none, unless
/// said otherwise.
///
/// Threads: no locks; an image is bound and drawn to by one thread at a time.
class ORVO_API ImageGPU : public ImageBase {
public:
    /// Channels and their precision. The names are those of ImageCPU's formats in another order: never
    /// convert by value. The numbers are stored in parameters, and modulo 4 they are the precision.
    enum tePixelFormat : std::int32_t {
        PIXEL_FORMAT_RGBA8 = 0,
        PIXEL_FORMAT_RGBA16 = 1,
        PIXEL_FORMAT_RGBA16F = 2,
        PIXEL_FORMAT_RGBA32F = 3,
        PIXEL_FORMAT_RGB8 = 4,
        PIXEL_FORMAT_RGB16 = 5,
        PIXEL_FORMAT_RGB16F = 6,
        PIXEL_FORMAT_RGB32F = 7,
        PIXEL_FORMAT_LUMINANCE8 = 8,
        PIXEL_FORMAT_LUMINANCE16 = 9,
        PIXEL_FORMAT_LUMINANCE16F = 10,
        PIXEL_FORMAT_LUMINANCE32F = 11,
        PIXEL_FORMAT_LUMINANCE_ALPHA8 = 12,
        /// Has a name only: no texture can be of it.
        PIXEL_FORMAT_LUMINANCE_ALPHA16 = 13,
        PIXEL_FORMAT_LUMINANCE_ALPHA16F = 14,
        PIXEL_FORMAT_LUMINANCE_ALPHA32F = 15,
        PIXEL_FORMAT_UNDEFINED = 16
    };

    /// An image of PIXEL_FORMAT_UNDEFINED without a texture, with an empty rectangle and pixels of 1.0
    /// by 1.0.
    ImageGPU();

    /// An image with a texture of the current context's pool. Its pixels are undefined.
    /// @param positionExtent the meaningful pixels, in pixel space; an undefined extent counts as 0 by 0.
    /// @param ePixelFormat any format that PixelFormatORVO2GL() serves.
    /// @param pixelExtent the world size of one pixel, positive.
    /// @param exact whether the texture is to be just as large as the rectangle.
    /// @throws ParameterException "invalid pixel format", "Image extent must not be negative", "Image size
    ///         exceeds 4294967295 bytes"; InternalException as ImageBase and TexturePool::Instance() do, and
    ///         "Enforce TexturePool::Instance() != NULL" where there is no pool; ExceptionOGL if the driver
    ///         cannot make the texture.
    ImageGPU(PositionExtentInPixelSpace const& positionExtent, tePixelFormat ePixelFormat,
             PixelExtentInWorldSpace const& pixelExtent, bool exact);

    /// An image that takes over a texture, with the format of the texture. The texture goes to the pool when
    /// the image dies, unless release() or forgetTexture() is called before.
    /// @throws InternalException "Enforce pTexture != NULL", and as ImageBase and TexturePool::Instance() do;
    ///         ParameterException "invalid pixel format" if the texture's format is none of an image. The
    ///         texture then stays the caller's.
    ImageGPU(PositionExtentInPixelSpace const& positionExtent, OGL::Texture2D* pTexture,
             PixelExtentInWorldSpace const& pixelExtent);

    /// Images are not copied. @throws InternalException "Not implemented: no copying of ImageGPU allowed".
    ImageGPU(ImageGPU const& other);
    /// As the copy constructor.
    ImageGPU& operator=(ImageGPU const& other);

    /// Unbinds the texture and gives it back to the pool that serves the current context. No exception leaves
    /// the destructor.
    ~ImageGPU() override;

    tePixelFormat pixelFormat() const { return ePixelFormat_; }
    /// The texture, which stays the image's; null if there is none.
    OGL::Texture2D* texture() { return pTexture_; }
    OGL::Texture2D const* texture() const { return pTexture_; }
    /// The texture's width and height in pixels; undefined without a texture.
    ExtentInPixelSpace capacityExtent() const override;
    /// The texture unit that the image was bound to by bind(); -1 if it is not.
    int boundTexUnit() const { return nBoundTexUnit_; }

    /// Hands the texture to the caller and forgets it, also the pool; null if there was none. Unbind it
    /// first: a bound image can not be unbound any more without its texture.
    OGL::Texture2D* release();
    /// Forgets texture and pool: for holders that keep the texture themselves.
    void forgetTexture() noexcept;

    /// Binds the texture to a unit, which becomes the active one. Binding again to the same unit is allowed.
    /// @throws InternalException "Image currently bound to a different unit", "Enforce pTexture != NULL"
    ///         without a texture; ParameterException "The texture unit does not exist".
    void bind(unsigned unit) const;
    /// Binds no texture to the unit that the image is bound to; does nothing for an unbound image.
    void bindDefault() const;
    /// Counts as unbound, without a call to OpenGL: for holders whose context is gone, and with it what was
    /// bound there.
    void forgetBinding() const noexcept { nBoundTexUnit_ = -1; }
    /// Switch texturing of fixed function on a unit, which becomes the active one.
    /// @throws ParameterException "The texture unit does not exist".
    void enable(unsigned unit) const;
    void disable(unsigned unit) const;
    /// What fixed function does with texels, on the unit that the image is bound to.
    /// @throws ParameterException "The texture unit does not exist" for an unbound image.
    void setEnvironment(OGL::TextureUnit::Environment environment) const;

    /// Filters of the texture, as OpenGL's tokens. The texture has to be bound on the active unit.
    /// @throws ExceptionOGL for a token that is none; InternalException "isBound()".
    void setFilter(unsigned min, unsigned mag) const;
    /// Wrap modes of the texture, likewise.
    void setWrap(unsigned s, unsigned t) const;
    /// Border colour of the texture, likewise: four floats, red first.
    void setBorderColor(float const* pColor) const;

    /// Uploads a rectangle of pixels, rows without gaps, from memory or, while a pixel unpack buffer is
    /// bound, from there: pPixels is then an offset. Sets the pixel extent after the upload. Leaves bindings
    /// and pixel store as they were.
    /// @param targetPositionExtent the rectangle in pixel space, inside the image's own.
    /// @param format @param type OpenGL's tokens for the pixels' channels and their type.
    /// @throws ParameterException with the condition for a rectangle that lies outside; InternalException
    ///         "Enforce pPixels != NULL" without memory and buffer; ExceptionOGL for a token that is none and
    ///         for the driver's failures.
    void copyImageData(PositionExtentInPixelSpace const& targetPositionExtent, unsigned format, unsigned type,
                       void const* pPixels, PixelExtentInWorldSpace const& pixelExtent);
    /// The same from memory alone, where rows are rowLength pixels apart (0: as long as the rectangle is
    /// wide). Sets the pixel extent before the upload.
    void copyImageData(unsigned char const* pPixels, PositionExtentInPixelSpace const& targetPositionExtent,
                       PixelExtentInWorldSpace const& pixelExtent, unsigned format, unsigned type,
                       unsigned rowLength);
    /// Copies a rectangle of the read framebuffer into the texture; both positions are in texels. Leaves the
    /// bindings as they were.
    /// @throws ParameterException "The rectangle lies outside the texture"; ExceptionOGL for the driver's
    ///         failures.
    void copyFrameBufferData(PositionInPixelSpace const& destination, PositionInPixelSpace const& source,
                             ExtentInPixelSpace const& extent);

    /// Sets all channels of a texture that is larger than the rectangle to zero; a texture of just that size
    /// is left as it is, for the pass that draws over all of it. The texture has to be attached to the bound
    /// framebuffer. Leaves all state as it was.
    void initializeToTransparentBlack() override;

    /// The lines of the base, then the pixel format.
    void doWrite(std::ostream& stream) const override;

    /// The OpenGL internal format of a texture of the given pixel format.
    /// @throws ParameterException "invalid pixel format" for PIXEL_FORMAT_LUMINANCE_ALPHA16,
    ///         PIXEL_FORMAT_UNDEFINED and any number that is no format.
    static unsigned PixelFormatORVO2GL(tePixelFormat ePixelFormat);
    /// The pixel format of a texture of the given OpenGL internal format.
    /// @throws ParameterException "invalid pixel format" for any that is not the internal format of a pixel
    ///         format; GL_LUMINANCE8 is PIXEL_FORMAT_LUMINANCE8, too.
    static tePixelFormat PixelFormatGL2ORVO(unsigned internalFormat);

    // The older surface for fixed function. It does not know of bind() and bindDefault(). A unit of -1 is the
    // active one; another becomes the active one, except in disable_DEPRECATED_2_0. Each throws
    // ParameterException "The texture unit does not exist".

    void bind_DEPRECATED_2_0(int unit) const;
    /// Nothing is switched on a unit that serves shaders alone.
    void enable_DEPRECATED_2_0(int unit) const;
    /// @throws InternalException "Texture target is not enabled..can't disable texture" if it is not enabled
    ///         on the unit; not asked for a unit of -1.
    void disable_DEPRECATED_2_0(int unit) const;
    /// Binds no texture on the active unit.
    /// @throws InternalException "Texture not bound" if the texture is not bound there.
    void unbind_DEPRECATED_2_0() const;
    /// The texture environment mode of the active unit, as OpenGL's token.
    /// @throws ExceptionOGL for a token that is none.
    void setEnvironment_DEPRECATED_2_0(unsigned mode) const;

private:
    OGL::Texture2D& requiredTexture() const;
    void uploadRectangle(PositionExtentInPixelSpace const& targetPositionExtent, unsigned format,
                         unsigned type, void const* pPixels, unsigned rowLength);
    void requireInside(PositionExtentInPixelSpace const& targetPositionExtent) const;
    void returnTexture() noexcept;

    TexturePool* pPool_ = nullptr;
    OGL::Texture2D* pTexture_ = nullptr;
    tePixelFormat ePixelFormat_ = PIXEL_FORMAT_UNDEFINED;
    mutable std::int32_t nBoundTexUnit_ = -1;
};

/// Channels of a pixel.
/// @throws InternalException "Pixel format not supported by ORVO in GPU mode" for PIXEL_FORMAT_RGBA16,
///         PIXEL_FORMAT_RGB16, PIXEL_FORMAT_LUMINANCE16F, PIXEL_FORMAT_LUMINANCE_ALPHA16,
///         PIXEL_FORMAT_UNDEFINED and any number that is no format.
ORVO_API std::size_t nChannels(ImageGPU::tePixelFormat ePixelFormat);

/// Writes the identifier of the format, or "UNKNOWN" for a number that is no format.
ORVO_API std::ostream& operator<<(std::ostream& stream, ImageGPU::tePixelFormat ePixelFormat);

} // namespace ORVO
