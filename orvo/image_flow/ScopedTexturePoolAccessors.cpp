#include "orvo/image_flow/ScopedTexturePoolAccessors.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "orvo/ogl/TextureUnit.h"

namespace ORVO {

namespace {

TexturePool& requiredPool() {
    TexturePool* const pPool = TexturePool::Instance();
    ORVO_ENFORCE(pPool, "TexturePool::Instance()");
    return *pPool;
}

TexturePool* poolIfAny() noexcept {
    try {
        return TexturePool::Instance();
    } catch (...) {
        return nullptr;
    }
}

/// Without a pool that serves the current context, textures of two dimensions wait for theirs; the others
/// are deleted.
void giveUp(OGL::Texture2D* pTexture) noexcept { TexturePool::returnTexture2DLater(pTexture); }
template <typename TextureT>
void giveUp(TextureT* pTexture) noexcept {
    trackedDelete(pTexture);
}

template <typename TextureT>
void giveBack(TextureT* pTexture, void (TexturePool::*pReturn)(TextureT*)) noexcept {
    TexturePool* const pPool = poolIfAny();
    if (!pPool) {
        giveUp(pTexture);
        return;
    }
    try {
        (pPool->*pReturn)(pTexture);
    } catch (...) {
        // The texture is the pool's, which could not delete others to keep to its budget.
        return;
    }
}

} // namespace

ScopedTexture1D::ScopedTexture1D(unsigned width, OGL::Texture::InternalFormat internalFormat)
    : internalTexture_(requiredPool().getTexture1DFromPool(width, internalFormat, true)) {}

ScopedTexture1D::~ScopedTexture1D() { giveBack(internalTexture_, &TexturePool::returnTexture1DToPool); }

OGL::Texture1D* ScopedTexture1D::get() const {
    ORVO_CHECK(internalTexture_ != nullptr, "internalTexture_ != NULL");
    return internalTexture_;
}

ScopedTexture2D::ScopedTexture2D(unsigned width, unsigned height, OGL::Texture::InternalFormat internalFormat)
    : internalTexture_(requiredPool().getTexture2DFromPool(width, height, internalFormat, true)) {}

ScopedTexture2D::~ScopedTexture2D() { giveBack(internalTexture_, &TexturePool::returnTexture2DToPool); }

void ScopedTexture2D::bind(unsigned unit) const {
    ORVO_CHECK(internalTexture_ != nullptr, "internalTexture_ != NULL");
    OGL::TextureUnit::Unit(unit).bind(internalTexture_);
}

void ScopedTexture2D::unbind(unsigned unit) const {
    ORVO_CHECK(internalTexture_ != nullptr, "internalTexture_ != NULL");
    OGL::TextureUnit::Unit(unit).bind2DDefault();
}

void ScopedTexture2D::setFilter(OGL::Texture::Filter min, OGL::Texture::Filter mag) const {
    ORVO_CHECK(internalTexture_ != nullptr, "internalTexture_ != NULL");
    internalTexture_->setFilter(min, mag);
}

void ScopedTexture2D::setWrap(OGL::Texture::WrapMode s, OGL::Texture::WrapMode t) const {
    ORVO_CHECK(internalTexture_ != nullptr, "internalTexture_ != NULL");
    internalTexture_->setWrap(s, t);
}

OGL::Texture2D* ScopedTexture2D::get() const {
    ORVO_CHECK(internalTexture_ != nullptr, "internalTexture_ != NULL");
    return internalTexture_;
}

ScopedTexture3D::ScopedTexture3D(OGL::Texture3D* pTexture) noexcept : internalTexture_(pTexture) {}
ScopedTexture3D::~ScopedTexture3D() = default;

OGL::Texture3D* ScopedTexture3D::get() const {
    ORVO_CHECK(internalTexture_ != nullptr, "internalTexture_ != NULL");
    return internalTexture_;
}

ScopedTexture3DFromPool::ScopedTexture3DFromPool(unsigned width, unsigned height, unsigned depth,
                                                 OGL::Texture::InternalFormat internalFormat)
    : ScopedTexture3D(requiredPool().getTexture3DFromPool(width, height, depth, internalFormat, true)) {}

ScopedTexture3DFromPool::~ScopedTexture3DFromPool() {
    if (internalTexture_ != nullptr) {
        giveBack(internalTexture_, &TexturePool::returnTexture3DToPool);
    }
}

} // namespace ORVO
