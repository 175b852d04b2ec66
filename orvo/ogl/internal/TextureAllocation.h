#pragma once

#include "orvo/ogl/Texture.h"
#include "orvo/ogl/internal/Scopes.h"
#include "orvo/ogl/internal/TextureFormats.h"

namespace ORVO::OGL::Internal {

/// Scope in which a texture's constructor allocates its levels: the texture is bound, no unpack buffer is,
/// and tight rows are read. Restores all of that at its end.
class TextureAllocation {
public:
    /// Also sets the highest level and linear filters: without them a texture that has one level would not be
    /// complete, and read as black.
    TextureAllocation(Texture const& texture, unsigned nLevels);

    int internalFormat() const noexcept { return nInternalFormat_; }
    unsigned format() const noexcept { return nFormat_; }
    unsigned type() const noexcept { return nType_; }

private:
    int nInternalFormat_;
    unsigned nFormat_;
    unsigned nType_;
    ScopedTextureBinding oTexture_;
    ScopedPixelStore oPixelStore_;
    ScopedBufferBinding oUnpackBuffer_;
};

} // namespace ORVO::OGL::Internal
