#pragma once

#include "orvo/ogl/Texture2.h"

namespace ORVO::OGL {

/// A 2D texture.
///
/// Threads: as Object.
class ORVO_API Texture2D : public Texture2 {
public:
    /// A texture with linear filters; with mipmaps all levels down to one pixel are allocated. Level 0 takes
    /// its pixels from pData, tight rows in the memory format nearest to the texture's own (bytes, shorts,
    /// halves or floats of its channels); null leaves them undefined. Either size may be 0. Leaves bindings
    /// and pixel store as they were. Throws ParameterException "Texture size is too large", ExceptionOGL.
    Texture2D(InternalFormat format, std::size_t width, std::size_t height, bool bMipmaps, void* pData);
    ~Texture2D() override;
};

} // namespace ORVO::OGL
