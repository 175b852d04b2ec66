#pragma once

#include "orvo/ogl/Texture2.h"

namespace ORVO::OGL {

/// A rectangle texture: one level, addressed in pixels.
///
/// Threads: as Object.
class ORVO_API TextureRECT : public Texture2 {
public:
    /// A texture with linear filters. pClientMemory, if not null, is client storage: tight rows in the memory
    /// format nearest to the texture's own, which the host or the pool keeps alive as long as the texture.
    /// Its pixels are copied now; later changes go up with subImage. Leaves bindings and pixel store as they
    /// were. Throws ParameterException "Texture size is too large", ExceptionOGL "Rectangle textures are not
    /// supported" or with the driver's error.
    TextureRECT(InternalFormat format, std::size_t width, std::size_t height, void* pClientMemory);
    ~TextureRECT() override;

    /// The memory given at construction, not owned; null if none was.
    void* clientMemory() const noexcept { return pClientMemory_; }

    /// Whether the driver has rectangle textures.
    static bool isSupported();

private:
    void* pClientMemory_;
};

} // namespace ORVO::OGL
