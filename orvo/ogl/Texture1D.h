#pragma once

#include "orvo/ogl/Texture1.h"

namespace ORVO::OGL {

/// A 1D texture.
///
/// Threads: as Object.
class ORVO_API Texture1D : public Texture1 {
public:
    /// A texture with undefined pixels and linear filters; with mipmaps all levels down to one pixel are
    /// allocated. Leaves the bindings as they were. Throws ParameterException "Texture size is too large",
    /// ExceptionOGL.
    Texture1D(InternalFormat format, std::size_t width, bool bMipmaps);
    ~Texture1D() override;
};

} // namespace ORVO::OGL
