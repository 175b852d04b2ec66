#include "orvo/image_runtime/TexturePool.h"

#include "orvo/core/Check.h"
#include "orvo/core/utility/Integers.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/LateReturns.h"
#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "orvo/ogl/TextureRECT.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO {

namespace {

using OGL::ExtensionManager;
using OGL::Texture;

template <typename TextureT>
using Key = typename TextureFreeList<TextureT>::Key;

template <typename TextureT>
Key<TextureT> keyOf(TextureT const& texture) noexcept {
    return {texture.width(0), texture.height(0), texture.depth(0), texture.format()};
}

/// What a texture counts with: also beyond 2 GiB, where its own answer ends.
std::size_t countedBytes(Texture const& texture) {
    return Texture::SizeInBytes(texture.format(), texture.width(0), texture.height(0), texture.depth(0));
}

/// Sets the wrap mode of a texture that is handed out again, and binds again what was bound. Nothing in
/// between can fail, and the context is asked for once: that costs more than all the rest.
void resetWrap(OGL::Texture2D& texture) {
    ORVO_OGL_REQUIRE_CONTEXT();
    GLint nBound = 0;
    glGetIntegerv(GL_TEXTURE_BINDING_2D, &nBound);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, GL_CLAMP_TO_BORDER);
    glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, GL_CLAMP_TO_BORDER);
    glBindTexture(GL_TEXTURE_2D, static_cast<GLuint>(nBound));
}

} // namespace

TexturePool* TexturePool::Instance() { return ImageRuntime::Library::texturePool(); }

TexturePool::TexturePool(Configuration const& configuration)
    : nMaximumPoolSize_(configuration.maximumFreelistSize()),
      bProhibitReuseLargerTextures_(configuration.prohibitReuseLargerTextures()),
      pListener_(configuration.videoMemoryListener() ? configuration.videoMemoryListener()
                                                     : VideoMemory::GlobalDefaultListener()) {
    ORVO_CHECK(ExtensionManager::Instance()->supportsNonPowerOfTwoTextures());
    void const* const gc = OGL::NativeContext::currentHandle();
    ORVO_ENFORCE(gc);
    spContext_ = std::make_shared<OGL::ContextOffscreen>(configuration.context());

    OGL::ScopedContextWrapper const restore;
    prepareOpenGLContext();
    ExtensionManager::Instance()->table()->glGenFramebuffers(1, &nFramebufferID_);
    if (nFramebufferID_ == 0)
        ORVO_OGL_FAIL("The framebuffer of the texture pool could not be created", GL_OUT_OF_MEMORY);
}

template <typename Code>
void TexturePool::inHiddenContext(Code const& code) {
    OGL::ScopedContextWrapper const restore;
    prepareOpenGLContext();
    code();
}

TexturePool::~TexturePool() {
    auto const attempt = [](auto const& code) {
        try {
            code();
        } catch (...) {
            // The hidden context cannot be made current any more, or the listener threw.
        }
    };
    attempt([this] { clearAll(); });
    // What is left by a failure; names without a context go with their share group.
    deleteAll(oFreeList1D_);
    deleteAll(oFreeList2D_);
    deleteAll(oFreeList3D_);
    deleteAll(oFreeListRECT_);
    deleteAllClientStorage();
    attempt([this] { inHiddenContext([this] { glDeleteFramebuffers(1, &nFramebufferID_); }); });
}

void TexturePool::prepareOpenGLContext() {
    ORVO_CHECK(spContext_.get());
    spContext_->makeCurrent();
    bool bAny = false;
    while (OGL::Texture2D* const pTexture = LateReturns::takeOneOfCurrentContext()) {
        put(oFreeList2D_, pTexture);
        bAny = true;
    }
    if (bAny && isOverBudget())
        evict();
}

std::size_t TexturePool::nextSizeUp(std::size_t nPixels) noexcept {
    if (nPixels < 1024)
        return nPixels == 0 ? 0 : nextPowerOfTwo(static_cast<unsigned>(nPixels));
    return (nPixels + 511) / 512 * 512;
}

std::size_t TexturePool::sizeToUse(unsigned nPixels, bool exact) const noexcept {
    return bProhibitReuseLargerTextures_ || exact ? nPixels : nextSizeUp(nPixels);
}

bool TexturePool::prohibitReuseLargerTextures() const { return bProhibitReuseLargerTextures_; }

template <typename TextureT, typename Prepare, typename Make>
TextureT* TexturePool::get(TextureFreeList<TextureT>& oFreeList,
                           typename TextureFreeList<TextureT>::Key const& key, Prepare const& prepare,
                           Make const& make) {
    if (TextureT* const pTexture = oFreeList.takeFirstMatch(key, prepare)) {
        nFreeListBytes_ -= countedBytes(*pTexture);
        return pTexture;
    }
    OGL::NativeContext const before = OGL::NativeContext::current();
    TextureT* pTexture = nullptr;
    {
        OGL::ScopedContextWrapper const restore;
        pTexture = make();
    }
    if (!OGL::NativeContext::current().isSameContext(before)) {
        // A pass that went on in the pool's context would leave its state and its programs there.
        put(oFreeList, pTexture);
        ORVO_OGL_FAIL("The current context could not be made current again", 0);
    }
    return pTexture;
}

OGL::Texture1D* TexturePool::getTexture1DFromPool(unsigned width, Texture::InternalFormat format,
                                                  bool exact) {
    Key<OGL::Texture1D> const key{sizeToUse(width, exact), 1, 1, format};
    auto const keep = [](OGL::Texture1D&) {};
    return get(oFreeList1D_, key, keep, [&] {
        prepareOpenGLContext();
        return ORVO_NEW OGL::Texture1D(format, key.nWidth_, false);
    });
}

OGL::Texture2D* TexturePool::getTexture2DFromPool(unsigned width, unsigned height,
                                                  Texture::InternalFormat format, bool exact) {
    Key<OGL::Texture2D> const key{sizeToUse(width, exact), sizeToUse(height, exact), 1, format};
    return get(oFreeList2D_, key, resetWrap, [&] {
        std::size_t const sizeInBytes = Texture::SizeInBytes(format, key.nWidth_, key.nHeight_, 1);
        pListener_->impendingMemoryAllcation(sizeInBytes);
        prepareOpenGLContext();
        ScopedPtr<OGL::Texture2D> ret(
            ORVO_NEW OGL::Texture2D(format, key.nWidth_, key.nHeight_, false, nullptr));
        pListener_->memoryAllocated(sizeInBytes);
        return ret.release();
    });
}

OGL::Texture3D* TexturePool::getTexture3DFromPool(unsigned width, unsigned height, unsigned depth,
                                                  Texture::InternalFormat format, bool exact) {
    Key<OGL::Texture3D> const key{sizeToUse(width, exact), sizeToUse(height, exact), sizeToUse(depth, exact),
                                  format};
    auto const keep = [](OGL::Texture3D&) {};
    return get(oFreeList3D_, key, keep, [&] {
        prepareOpenGLContext();
        return ORVO_NEW OGL::Texture3D(format, key.nWidth_, key.nHeight_, key.nDepth_, false);
    });
}

OGL::TextureRECT* TexturePool::getTextureRECTFromPool(unsigned width, unsigned height,
                                                      Texture::InternalFormat format, bool exact) {
    Key<OGL::TextureRECT> const key{sizeToUse(width, exact), sizeToUse(height, exact), 1, format};
    auto const keep = [](OGL::TextureRECT&) {};
    return get(oFreeListRECT_, key, keep, [&] {
        prepareOpenGLContext();
        return ORVO_NEW OGL::TextureRECT(format, key.nWidth_, key.nHeight_, nullptr);
    });
}

template <typename TextureT>
void TexturePool::put(TextureFreeList<TextureT>& oFreeList, TextureT* pTexture) {
    // If there is no memory to keep it, the texture goes.
    ScopedPtr<TextureT> pOwned(pTexture);
    oFreeList.pushBack(keyOf(*pTexture), pTexture);
    nFreeListBytes_ += countedBytes(*pOwned.release());
}

void TexturePool::returnTexture1DToPool(OGL::Texture1D* pTexture) {
    ORVO_ENFORCE(pTexture);
    put(oFreeList1D_, pTexture);
    enforceMaximumPoolSize();
}

void TexturePool::returnTexture2DToPool(OGL::Texture2D* pTexture) {
    ORVO_ENFORCE(pTexture);
    put(oFreeList2D_, pTexture);
    enforceMaximumPoolSize();
}

void TexturePool::returnTexture3DToPool(OGL::Texture3D* pTexture) {
    ORVO_ENFORCE(pTexture);
    put(oFreeList3D_, pTexture);
    enforceMaximumPoolSize();
}

void TexturePool::returnTextureRECTToPool(OGL::TextureRECT* pTexture) {
    ORVO_ENFORCE(pTexture);
    put(oFreeListRECT_, pTexture);
    enforceMaximumPoolSize();
}

void TexturePool::returnTexture2DLater(OGL::Texture2D* pTexture) noexcept {
    if (pTexture)
        LateReturns::add(pTexture);
}

OGL::Buffer* TexturePool::getPBOFromQueue(unsigned sizeInBytes, unsigned queryID) {
    return oPBOQueue_.take(sizeInBytes, queryID);
}

void TexturePool::returnPBOToQueue(OGL::Buffer* pBuffer) { oPBOQueue_.giveBack(pBuffer); }

bool TexturePool::isOverBudget() const noexcept {
    return nFreeListBytes_ >= nMaximumPoolSize_ && nFreeListBytes_ > evictionTarget(nMaximumPoolSize_);
}

std::size_t TexturePool::evictionTarget(std::size_t nMaximum) noexcept {
    // Three quarters, without passing through a product that budgets near the largest number would overflow.
    return nMaximum / 4 * 3 + nMaximum % 4 * 3 / 4;
}

void TexturePool::enforceMaximumPoolSize() {
    if (isOverBudget())
        inHiddenContext([this] { evict(); });
}

void TexturePool::evict() {
    while (!oFreeList1D_.empty() || !oFreeList2D_.empty() || !oFreeList3D_.empty() ||
           !oFreeListRECT_.empty() || !vpTransferClientStorage_.empty()) {
        deleteFront(oFreeList1D_);
        std::size_t const nFreed2D = deleteFront(oFreeList2D_);
        deleteFront(oFreeList3D_);
        deleteFront(oFreeListRECT_);
        deleteFrontOfClientStorage();
        pListener_->memoryFreed(nFreed2D);
        if (nFreeListBytes_ <= evictionTarget(nMaximumPoolSize_))
            return;
    }
    ORVO_FAIL("oFreeList1D_.size() != 0 || oFreeList2D_.size() != 0 || oFreeList3D_.size() != 0 || "
              "oFreeListRECT_.size() != 0 || vpTransferClientStorage_.size() != 0");
}

template <typename TextureT>
std::size_t TexturePool::deleteFront(TextureFreeList<TextureT>& oFreeList) noexcept {
    TextureT* const pTexture = oFreeList.takeFront();
    if (!pTexture)
        return 0;
    std::size_t const nBytes = countedBytes(*pTexture);
    nFreeListBytes_ -= nBytes;
    trackedDelete(pTexture);
    return nBytes;
}

template <typename TextureT>
std::size_t TexturePool::deleteAll(TextureFreeList<TextureT>& oFreeList) noexcept {
    std::size_t nBytes = 0;
    while (!oFreeList.empty())
        nBytes += deleteFront(oFreeList);
    return nBytes;
}

void TexturePool::clear1DPool() {
    inHiddenContext([this] { deleteAll(oFreeList1D_); });
}

void TexturePool::clear2DPool() {
    inHiddenContext([this] { pListener_->memoryFreed(deleteAll(oFreeList2D_)); });
}

void TexturePool::clear3DPool() {
    inHiddenContext([this] { deleteAll(oFreeList3D_); });
}

void TexturePool::clearRECTPool() {
    inHiddenContext([this] {
        deleteAll(oFreeListRECT_);
        deleteAllClientStorage();
    });
}

void TexturePool::clearPBOQueue() {
    // Queries are not shared: only those of the caller's context can be deleted.
    oPBOQueue_.deleteQueries();
    inHiddenContext([this] { oPBOQueue_.clear(); });
}

void TexturePool::clearAll() {
    clear1DPool();
    clear2DPool();
    clear3DPool();
    clearRECTPool();
    clearPBOQueue();
}

void TexturePool::setMaximumPoolSize(std::size_t nBytes) {
    nMaximumPoolSize_ = nBytes;
    enforceMaximumPoolSize();
}

} // namespace ORVO
