#pragma once

#include "orvo/core/Export.h"
#include "orvo/ogl/Texture.h"

#include <memory>
#include <string>

namespace ORVO {

namespace OGL {
class Program;
class Texture1D;
} // namespace OGL

/// An array of floats that a shader reads through a 1D texture of one 32-bit float channel, nearest filter,
/// clamped to the edge. Of an array `name` the shader declares what it wants of
///
///     uniform sampler1D name_sampler;
///     uniform float name_delta;       // 1.0 divided by the number of elements
///
/// and reads element i with `texture1D(name_sampler, (i + 0.5) * name_delta).r`.
///
/// Threads: one at a time, with a context current that shares with the texture pool's.
class ORVO_API UniformArray {
public:
    /// Uploads the array into a texture that it binds and enables on a texture unit, and tells the program of
    /// it; the active unit stays.
    /// @param oProgram the program that will read it; it has to be enabled.
    /// @param name prefix of the uniforms; those that the program does not have are left out.
    /// @param data count floats, copied.
    /// @param count at least 1.
    /// @throws InternalException "Enforce data != NULL".
    /// @throws ParameterException "count > 0".
    /// @throws OGL::ExceptionOGL, and what TexturePool::Instance() throws. Nothing stays bound then.
    static std::shared_ptr<UniformArray> construct(OGL::Program& oProgram, std::string const& name,
                                                   float const* data, unsigned count, unsigned unit);

    /// Takes a texture of exactly that width from the pool and binds it on the unit; its pixels are
    /// undefined.
    /// @throws InternalException "Enforce pPool != NULL" without a texture pool.
    UniformArray(unsigned width, unsigned unit, OGL::Texture::InternalFormat internalFormat);
    UniformArray(UniformArray const&) = delete;
    UniformArray& operator=(UniformArray const&) = delete;
    /// Unbinds the unit, switches its 1D texturing off, and returns the texture to the pool. The active unit
    /// stays.
    ~UniformArray();

    /// The texture; this object's.
    OGL::Texture1D* getTexture() const noexcept { return pTexture_; }

private:
    unsigned nUnit_;
    OGL::Texture1D* pTexture_;
};

} // namespace ORVO
