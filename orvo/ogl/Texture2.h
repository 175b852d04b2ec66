#pragma once

#include "orvo/ogl/Texture.h"

namespace ORVO::OGL {

class Buffer;

/// Operations of textures with two dimensions. Row 0 comes first.
///
/// Threads: as Object.
class ORVO_API Texture2 : public Texture {
public:
    ~Texture2() override;

    /// Wrap modes of the bound texture.
    void setWrap(WrapMode s, WrapMode t);

    /// Uploads a rectangle of w by h pixels into the bound texture at (x, y). The pixels lie in memory as the
    /// parameters say; while a pixel unpack buffer is bound, pPixels is an offset into it. Throws
    /// ParameterException "The level does not exist", "The rectangle lies outside the texture",
    /// InternalException "isBound()". Leaves the pixel store as it was.
    void subImage(int level, int x, int y, std::size_t w, std::size_t h, Format format, Type type,
                  void const* pPixels, PixelUnpackParameters const& parameters);

    /// The same from a buffer object, beginning at an offset in bytes; what is bound to the unpack target
    /// stays so. Throws also InternalException "Enforce pBuffer != NULL".
    void subImage(int level, int x, int y, std::size_t w, std::size_t h, Format format, Type type,
                  Buffer* pBuffer, std::size_t offset, PixelUnpackParameters const& parameters);

    /// Copies a rectangle of w by h pixels of the read framebuffer, at (sourceX, sourceY), into the bound
    /// texture at (x, y). Throws as subImage.
    void copyTexSubImage(int level, int x, int y, int sourceX, int sourceY, std::size_t w, std::size_t h);

    /// Reads a whole level of the bound texture into memory, rows without gaps but for the padding of each to
    /// a multiple of alignment (1, 2, 4 or 8) bytes. While a pixel pack buffer is bound, pPixels is an offset
    /// into it. Throws ParameterException "The level does not exist", "alignment is 1, 2, 4 or 8",
    /// InternalException "isBound()", ExceptionOGL. Leaves the pixel store as it was.
    void getPixelData(void* pPixels, int level, Format format, Type type, unsigned alignment) const;

protected:
    using Texture::Texture;
};

} // namespace ORVO::OGL
