// The part of the pool that deals with textures of client memory.
#include "orvo/image_runtime/TexturePool.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/AlignedMemory.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/image_runtime/PixelDataSize.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "orvo/ogl/TextureRECT.h"
#include "orvo/ogl/internal/GL.h"

#include <algorithm>
#include <cstdint>
#include <memory>

namespace ORVO {

namespace {

using OGL::Texture;

/// Sizes are made in steps of so many pixels, and a texture that is larger by more is not taken. Rows of such
/// a width are multiples of 32 bytes, whatever a pixel takes.
constexpr std::size_t nPixelStep = 64;
static_assert(nPixelStep % 32 == 0);

struct AlignedDeleter {
    void operator()(void* pMemory) const { ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, pMemory); }
};

std::size_t bytesOf(OGL::TextureRECT const& texture) {
    return Texture::SizeInBytes(texture.format(), texture.width(0), texture.height(0), 1);
}

void deleteWithMemory(OGL::TextureRECT* pTexture) noexcept {
    std::unique_ptr<void, AlignedDeleter> const pMemory(pTexture->clientMemory());
    trackedDelete(pTexture);
}

/// The first internal format that holds pixels of the format and type as they are.
Texture::InternalFormat internalFormatFor(Texture::Format format, Texture::Type type) {
    std::size_t const nPixelBytes = pixelDataSize(format, type);
    bool const bFloat = type == Texture::TYPE_FLOAT || type == Texture::TYPE_HALF_FLOAT;
    for (int i = 0; i <= Texture::INTERNAL_FORMAT_LUMINANCE16F; ++i) {
        auto const candidate = static_cast<Texture::InternalFormat>(i);
        if (Texture::IsValid(candidate) && Texture::Channels(candidate) == Texture::Channels(format) &&
            Texture::SizeInBytes(candidate, 1, 1, 1) == nPixelBytes && Texture::IsFloat(candidate) == bFloat)
            return candidate;
    }
    ORVO_FAIL_PARAMETER("No internal format fits the format and type");
}

std::size_t roundUp(std::size_t nPixels) noexcept {
    return (nPixels + nPixelStep - 1) / nPixelStep * nPixelStep;
}

bool isLargeEnough(std::size_t nHave, std::size_t nWanted) noexcept {
    return nHave >= nWanted && nHave - nWanted <= nPixelStep;
}

} // namespace

OGL::TextureRECT* TexturePool::getClientStorageTextureRECTFromPool(unsigned width, unsigned height,
                                                                   Texture::Format format,
                                                                   Texture::Type type) {
    Texture::InternalFormat const internalFormat = internalFormatFor(format, type);
    auto const isFree = [=](OGL::TextureRECT const* pTexture) {
        return isLargeEnough(pTexture->width(0), width) && isLargeEnough(pTexture->height(0), height) &&
               pTexture->format() == internalFormat &&
               OGL::ExtensionManager::Instance()->table()->glTestObjectAPPLE(GL_TEXTURE,
                                                                             pTexture->objectID()) != 0;
    };
    auto const found = std::find_if(vpTransferClientStorage_.begin(), vpTransferClientStorage_.end(), isFree);
    if (found == vpTransferClientStorage_.end())
        return makeClientStorageTexture(roundUp(width), roundUp(height), internalFormat);
    OGL::TextureRECT* const pTexture = *found;
    vpTransferClientStorage_.erase(found);
    nFreeListBytes_ -= bytesOf(*pTexture);
    return pTexture;
}

OGL::TextureRECT* TexturePool::makeClientStorageTexture(std::size_t nWidth, std::size_t nHeight,
                                                        Texture::InternalFormat format) {
    std::size_t const nBytes = Texture::SizeInBytes(format, nWidth, nHeight, 1);
    // Asked here, since no memory of such a size is to be allocated first.
    ORVO_CHECK_PARAMETER(nBytes <= UINT32_MAX, "Texture size is too large");
    OGL::ScopedContextWrapper wrapper;
    prepareOpenGLContext();
    std::unique_ptr<void, AlignedDeleter> pMemory(
        ORVO_private::newAlignedMemory(MEMORY_TYPE_IMAGE, nBytes, 64));
    ScopedPtr<OGL::TextureRECT> pTexture(ORVO_NEW OGL::TextureRECT(format, nWidth, nHeight, pMemory.get()));
    wrapper.restore();
    static_cast<void>(pMemory.release());
    return pTexture.release();
}

void TexturePool::returnClientStorageTextureRECTToPool(OGL::TextureRECT* pTexture) {
    ORVO_ENFORCE(pTexture);
    try {
        vpTransferClientStorage_.push_back(pTexture);
    } catch (...) {
        // Without memory to keep it, the texture goes.
        deleteWithMemory(pTexture);
        throw;
    }
    nFreeListBytes_ += bytesOf(*pTexture);
    enforceMaximumPoolSize();
}

void TexturePool::deleteFrontOfClientStorage() noexcept {
    if (vpTransferClientStorage_.empty())
        return;
    OGL::TextureRECT* const pTexture = vpTransferClientStorage_.front();
    // The driver reads the memory until it has done with the texture.
    if (pTexture->isShareGroupCurrent())
        OGL::ExtensionManager::Instance()->table()->glFinishObjectAPPLE(
            GL_TEXTURE, static_cast<int>(pTexture->objectID()));
    nFreeListBytes_ -= bytesOf(*pTexture);
    vpTransferClientStorage_.pop_front();
    deleteWithMemory(pTexture);
}

void TexturePool::deleteAllClientStorage() noexcept {
    while (!vpTransferClientStorage_.empty())
        deleteFrontOfClientStorage();
}

} // namespace ORVO
