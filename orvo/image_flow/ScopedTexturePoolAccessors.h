#pragma once

/// Textures of the pool for a scope: taken at construction, in just the size that is asked for, and returned
/// at the end.
///
/// Constructors throw InternalException "Enforce TexturePool::Instance() != NULL" where there is no pool, and
/// what TexturePool::Instance() and the pool throw. Destructors let nothing out; where the pool cannot be
/// reached then, a 2D texture waits for it, and others are deleted, or left to the end of their contexts.
///
/// Threads: as TexturePool.

#include "orvo/core/Export.h"
#include "orvo/ogl/Texture.h"

namespace ORVO {

namespace OGL {
class Texture1D;
class Texture2D;
class Texture3D;
} // namespace OGL

/// A 1D texture of the pool.
///
/// Threads: as the file says.
class ORVO_API ScopedTexture1D {
public:
    /// @param width in pixels.
    ScopedTexture1D(unsigned width, OGL::Texture::InternalFormat internalFormat);
    ScopedTexture1D(ScopedTexture1D const&) = delete;
    ScopedTexture1D& operator=(ScopedTexture1D const&) = delete;
    ~ScopedTexture1D();

    /// The texture, which stays the scope's. @throws InternalException "internalTexture_ != NULL".
    OGL::Texture1D* get() const;

private:
    OGL::Texture1D* internalTexture_;
};

/// A 2D texture of the pool. Each member throws InternalException "internalTexture_ != NULL" first if there
/// is none.
///
/// Threads: as the file says.
class ORVO_API ScopedTexture2D {
public:
    /// @param width @param height in pixels.
    ScopedTexture2D(unsigned width, unsigned height, OGL::Texture::InternalFormat internalFormat);
    ScopedTexture2D(ScopedTexture2D const&) = delete;
    ScopedTexture2D& operator=(ScopedTexture2D const&) = delete;
    ~ScopedTexture2D();

    /// Binds the texture to a unit, or name 0; the unit becomes the active one.
    /// @throws ParameterException "The texture unit does not exist".
    void bind(unsigned unit) const;
    void unbind(unsigned unit) const;

    /// Filters and wrap modes of the texture, which has to be bound on the active unit.
    /// @throws InternalException "isBound()".
    void setFilter(OGL::Texture::Filter min, OGL::Texture::Filter mag) const;
    void setWrap(OGL::Texture::WrapMode s, OGL::Texture::WrapMode t) const;

    /// The texture, which stays the scope's.
    OGL::Texture2D* get() const;

private:
    OGL::Texture2D* internalTexture_;
};

/// A 3D texture that somebody keeps for a scope; this base keeps none.
///
/// Threads: as the file says.
class ORVO_API ScopedTexture3D {
public:
    ScopedTexture3D(ScopedTexture3D const&) = delete;
    ScopedTexture3D& operator=(ScopedTexture3D const&) = delete;
    virtual ~ScopedTexture3D();

    /// The texture, which stays the scope's. @throws InternalException "internalTexture_ != NULL".
    OGL::Texture3D* get() const;

protected:
    explicit ScopedTexture3D(OGL::Texture3D* pTexture) noexcept;

    OGL::Texture3D* internalTexture_;
};

/// A 3D texture of the pool.
///
/// Threads: as the file says.
class ORVO_API ScopedTexture3DFromPool : public ScopedTexture3D {
public:
    /// @param width @param height @param depth in pixels.
    ScopedTexture3DFromPool(unsigned width, unsigned height, unsigned depth,
                            OGL::Texture::InternalFormat internalFormat);
    ~ScopedTexture3DFromPool() override;
};

} // namespace ORVO
