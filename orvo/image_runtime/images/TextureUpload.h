#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/ogl/Texture.h"

#include <cstddef>
#include <vector>

namespace ORVO {

namespace OGL {
class Buffer;
class Texture2;
} // namespace OGL

/// Moves pixels from host memory into textures. Where the driver has pixel buffer objects, the image goes up
/// in bands of at most 4 MiB: worker threads copy a band into a mapped buffer of the texture pool, from which
/// the GPU pulls it while the next one is being filled. Otherwise it goes up directly. On a software driver,
/// which has no GPU to wait for, all bands share one buffer.
///
/// An object belongs to each node that uploads. It may be made without a context; its OpenGL names are made
/// when it is first used in a context, one set for each context, and go when that context is current: at
/// once, or the next time that it is.
///
/// Threads: one thread at a time, with a context current that shares with one of those that the image runtime
/// was started with. Only the copy of a band runs on several threads, and it makes no call to OpenGL.
class ORVO_API TextureUpload {
public:
    /// Bands that may be in flight before a query is used again.
    static constexpr std::size_t nQueryObject_ = 16;
    /// Texture names kept for client storage.
    static constexpr std::size_t nClientTex_ = 4;

    TextureUpload() noexcept;
    ~TextureUpload();
    TextureUpload(TextureUpload const&) = delete;
    TextureUpload& operator=(TextureUpload const&) = delete;

    /// Uploads a rectangle; does nothing for one without pixels. When it returns, the memory has been read,
    /// but the GPU may still be at work: commands that follow see the new pixels. Leaves bindings and pixel
    /// store as they were.
    /// @param pTexture not owned.
    /// @param rect in texels, relative to the texture's first one.
    /// @param pPixels the first pixel in memory, rows rowLength pixels apart (0: as long as the rectangle is
    ///        wide), without padding to a multiple of bytes.
    /// @throws InternalException "Enforce pTexture != NULL", "Enforce pPixels != NULL", "srcWidth >=
    ///         imageWidth" for a row length below the width, "pixelDataSize: Unknown type " and the type's
    ///         name for packed and 32-bit integer types, and as TexturePool::Instance() does;
    ///         ParameterException "The level does not exist", "The rectangle lies outside the texture";
    ///         ExceptionOGL for the driver's failures, after which part of the rectangle may have gone up.
    void asyncUpload(OGL::Texture2* pTexture, int level, PositionExtentInPixelSpace rect,
                     OGL::Texture::Format format, OGL::Texture::Type type, void const* pPixels,
                     unsigned rowLength);

    /// Uploads a rectangle from the beginning of a buffer object, where rows are rowLength pixels apart (0:
    /// as long as the rectangle is wide). Leaves bindings and pixel store as they were.
    /// @throws InternalException "Enforce pTexture != NULL", "Enforce pBuffer != NULL"; ParameterException as
    ///         asyncUpload.
    static void bufferUpload(OGL::Texture2* pTexture, OGL::Buffer* pBuffer, int level,
                             PositionExtentInPixelSpace const& rect, OGL::Texture::Format format,
                             OGL::Texture::Type type, std::size_t rowLength);

    /// Uploads RGBA pixels of unsigned bytes into a texture of four 32-bit floats, expanded to floats (255 is
    /// 1.0) on the way: for drivers that do so wrongly. Rows are rowLength pixels apart (0: as long as the
    /// rectangle is wide). Leaves bindings and pixel store as they were.
    /// @throws InternalException "pTexture->format() == OGL::Texture::INTERNAL_FORMAT_RGBA32F"; else as
    ///         asyncUpload.
    void intelUpload(OGL::Texture2* pTexture, int level, PositionExtentInPixelSpace const& rect,
                     void const* pPixels, std::size_t rowLength);

    /// Rows of a band, for rows of the given number of bytes (above 0): as many as 4 MiB hold, at least one.
    static std::size_t rowsPerBand(std::size_t nRowBytes) noexcept;

private:
    /// The names in one context.
    struct Names;
    /// Pixels in memory: a row's bytes, and bytes from row to row.
    struct Source;

    Names& namesHere();
    void uploadInBands(OGL::Texture2& texture, int level, PositionExtentInPixelSpace rect,
                       Source const& source);

    std::vector<Names> aNames_;
    std::size_t nQueryIndex_ = 0;
    std::vector<float> vfConversionBuffer_;
};

} // namespace ORVO
