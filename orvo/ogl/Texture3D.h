#pragma once

#include "orvo/ogl/Texture3.h"

namespace ORVO::OGL {

/// A 3D texture.
///
/// Threads: as Object.
class ORVO_API Texture3D : public Texture3 {
public:
    /// A texture with undefined pixels and linear filters; with mipmaps all levels down to one pixel are
    /// allocated. Leaves the bindings as they were. Throws ParameterException "Texture size is too large",
    /// ExceptionOGL.
    Texture3D(InternalFormat format, std::size_t width, std::size_t height, std::size_t depth, bool bMipmaps);
    ~Texture3D() override;
};

} // namespace ORVO::OGL
