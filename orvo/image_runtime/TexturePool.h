#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/PBOQueue.h"
#include "orvo/image_runtime/TextureFreeList.h"
#include "orvo/image_runtime/VideoMemoryListener.h"
#include "orvo/ogl/Texture.h"

#include <cstddef>
#include <list>
#include <memory>

namespace ORVO {

namespace OGL {
class Context;
class ContextOffscreen;
class Texture1D;
class Texture2D;
class Texture3D;
class TextureRECT;
} // namespace OGL

namespace ImageRuntime {
class Library;
}

/// Keeps the textures that nobody uses, under one budget of bytes, and hands them out again, since making a
/// texture in the middle of a frame is expensive. Also runs the queue of buffers through which uploads go.
///
///     TexturePool* pPool = TexturePool::Instance();
///     OGL::Texture2D* pTexture =
///         pPool->getTexture2DFromPool(300, 200, OGL::Texture::INTERNAL_FORMAT_RGBA8, false); // 512 by 256
///     ...
///     pPool->returnTexture2DToPool(pTexture);
///
/// There is one pool for each context that the library was started with. Who takes a texture owns it until it
/// is returned to the same pool. A texture that comes back out holds the pixels, filters and border colour
/// that it was returned with. Sizes are in pixels, budgets in bytes.
///
/// Threads: the pool takes no locks. Any thread whose current context shares with the pool's, one at a time;
/// returnTexture2DLater() from any thread.
class ORVO_API TexturePool {
public:
    /// What a pool is made with.
    ///
    /// Threads: a plain value.
    class ORVO_API Configuration {
    public:
        /// 128 MiB, the default listener, no context, larger textures may be reused.
        Configuration();

        /// The bytes that unused textures may hold.
        std::size_t maximumFreelistSize() const;
        void setMaximumFreelistSize(std::size_t nBytes);

        /// Who is told of allocations. Not owned; null counts as the default listener.
        VideoMemory::VideoMemoryListener* videoMemoryListener() const;
        void setVideoMemoryListener(VideoMemory::VideoMemoryListener* pListener);

        /// The context that the pool's own hidden context shares with. Not owned.
        OGL::Context const* context() const;
        void setContext(OGL::Context const* pContext);

        /// Whether every texture is handed out in exactly the size that is asked for.
        bool prohibitReuseLargerTextures() const;
        void setProhibitReuseLargerTextures(bool bProhibit);

    private:
        std::size_t nMaximumFreelistSize_;
        VideoMemory::VideoMemoryListener* pVideoMemoryListener_;
        OGL::Context const* pContext_;
        bool bProhibitReuseLargerTextures_;
    };

    /// The pool that serves the current context: ImageRuntime::Library::texturePool(), with its exceptions.
    /// Null where there is none.
    static TexturePool* Instance();

    /// Deletes what the pool holds. Textures that are still in use stay their holders'.
    ~TexturePool();

    TexturePool(TexturePool const&) = delete;
    TexturePool& operator=(TexturePool const&) = delete;

    /// A texture from the pool, made if none of its lists matches. Unless exact is true, or the pool
    /// prohibits larger textures, each size is rounded up to its size class (nextSizeUp), and the texture is
    /// that large. Of the textures of the same kind, sizes and format the one that came back first is taken.
    /// A 2D texture that is handed out again has wrap mode WRAP_MODE_CLAMP_TO_BORDER on both axes, and only
    /// making a 2D texture is told to the listener. The context that is current stays so; what is bound stays
    /// bound.
    /// @return never null; the caller's until it is returned to this pool.
    /// @throws ParameterException "Texture size is too large", ExceptionOGL for what the driver refuses. The
    ///         lists are then as they were. ExceptionOGL "The current context could not be made current
    ///         again", with the new texture on its list, where the driver refuses that.
    OGL::Texture1D* getTexture1DFromPool(unsigned width, OGL::Texture::InternalFormat format, bool exact);
    OGL::Texture2D* getTexture2DFromPool(unsigned width, unsigned height, OGL::Texture::InternalFormat format,
                                         bool exact);
    OGL::Texture3D* getTexture3DFromPool(unsigned width, unsigned height, unsigned depth,
                                         OGL::Texture::InternalFormat format, bool exact);
    OGL::TextureRECT* getTextureRECTFromPool(unsigned width, unsigned height,
                                             OGL::Texture::InternalFormat format, bool exact);

    /// Gives a texture back; it is the pool's from now on. If the unused textures then reach the budget, the
    /// oldest are deleted until they hold at most three quarters of it.
    /// @throws InternalException "Enforce pTexture != NULL".
    void returnTexture1DToPool(OGL::Texture1D* pTexture);
    void returnTexture2DToPool(OGL::Texture2D* pTexture);
    void returnTexture3DToPool(OGL::Texture3D* pTexture);
    void returnTextureRECTToPool(OGL::TextureRECT* pTexture);

    /// Gives a texture back where no context is current, or one that no pool serves: the texture goes to the
    /// pool of its share group when that pool next makes its hidden context current, or is deleted with the
    /// library. Null is allowed. Threads: any.
    static void returnTexture2DLater(OGL::Texture2D* pTexture) noexcept;

    /// A rectangle texture with client memory of at least the given size, for pixels of the format and type:
    /// one that the driver has done with and that is less than 65 pixels larger each way, else a new one, its
    /// sizes rounded up to multiples of 64 and its rows to multiples of 32 bytes. Not told to the listener.
    /// @throws InternalException "pixelDataSize: Unknown type <name>" for a type that is neither bytes,
    ///         shorts, halves nor floats; ParameterException "No internal format fits the format and type"
    ///         (as for two channels of halves), "Texture size is too large"; ExceptionOGL.
    OGL::TextureRECT* getClientStorageTextureRECTFromPool(unsigned width, unsigned height,
                                                          OGL::Texture::Format format,
                                                          OGL::Texture::Type type);
    /// Gives such a texture back, with its memory. @throws as returnTextureRECTToPool().
    void returnClientStorageTextureRECTToPool(OGL::TextureRECT* pTexture);

    /// Takes a pixel unpack buffer of at least sizeInBytes bytes, and begins the query, by which the queue
    /// sees later whether the driver has done with the buffer. Buffers in use and those whose query has no
    /// result yet are passed over. A query of the queue's that is active is ended first; beside an active
    /// query of somebody else none is begun.
    /// @param queryID name of a query object of the current context, the caller's; not used elsewhere until
    ///        the buffer was returned.
    /// @return the pool's; to be given back with returnPBOToQueue(), the buffer taken last first.
    /// @throws ParameterException "queryID != 0"; ExceptionOGL; std::length_error "list<T> too long".
    OGL::Buffer* getPBOFromQueue(unsigned sizeInBytes, unsigned queryID);
    /// Gives the buffer back and ends its query. While the queue then holds more than 128 MiB, the buffers
    /// used longest ago are deleted, each after the driver has done with it; those in use are kept.
    /// @throws InternalException "!pBuffer->isBound()", "Buffer never created in Pool", "Buffer NOT the last
    ///         one taken from the queue", "Context has changed since buffer was taken from Pool", in this
    ///         order; "Enforce pBuffer != NULL". The queue is then as it was.
    void returnPBOToQueue(OGL::Buffer* pBuffer);

    /// Delete what the lists hold; the RECT one also those with client memory. Only the 2D one tells the
    /// listener, once, the sum.
    void clear1DPool();
    void clear2DPool();
    void clear3DPool();
    void clearRECTPool();
    /// Deletes all buffers of the queue and, of their queries, those of the current context. None may be in
    /// use.
    void clearPBOQueue();
    /// All five, in the order above.
    void clearAll();

    /// Sets the budget of unused textures, in bytes, and keeps to it at once.
    void setMaximumPoolSize(std::size_t nBytes);

    /// Whether every texture is handed out in exactly the size that is asked for.
    bool prohibitReuseLargerTextures() const;

    /// The size class of a number of pixels: below 1024 the next power of two (0 stays 0), from there on the
    /// next multiple of 512. Threads: any.
    static std::size_t nextSizeUp(std::size_t nPixels) noexcept;

private:
    friend class ImageRuntime::Library;
    /// Tests reach what the library alone reaches.
    friend class TexturePoolProbe;

    /// @throws InternalException "ExtensionManager::Instance()->supportsNonPowerOfTwoTextures()",
    ///         "Enforce gc != NULL" (no context is current); ExceptionOGL.
    explicit TexturePool(Configuration const& configuration);

    /// Makes the hidden context current. @throws InternalException "spContext_.get()"; ExceptionOGL.
    void prepareOpenGLContext();
    /// Runs the code with the hidden context current, and makes the caller's current again.
    template <typename Code>
    void inHiddenContext(Code const& code);

    std::size_t sizeToUse(unsigned nPixels, bool exact) const noexcept;
    template <typename TextureT, typename Prepare, typename Make>
    TextureT* get(TextureFreeList<TextureT>& oFreeList, typename TextureFreeList<TextureT>::Key const& key,
                  Prepare const& prepare, Make const& make);
    template <typename TextureT>
    void put(TextureFreeList<TextureT>& oFreeList, TextureT* pTexture);
    OGL::TextureRECT* makeClientStorageTexture(std::size_t nWidth, std::size_t nHeight,
                                               OGL::Texture::InternalFormat format);

    void enforceMaximumPoolSize();
    bool isOverBudget() const noexcept;
    /// The bytes that eviction leaves, for a budget.
    static std::size_t evictionTarget(std::size_t nMaximum) noexcept;
    /// The loop of eviction; the hidden context is current.
    void evict();
    /// Deletes the oldest texture of a list, if there is one; its bytes.
    template <typename TextureT>
    std::size_t deleteFront(TextureFreeList<TextureT>& oFreeList) noexcept;
    void deleteFrontOfClientStorage() noexcept;
    /// Deletes all textures of a list; their bytes.
    template <typename TextureT>
    std::size_t deleteAll(TextureFreeList<TextureT>& oFreeList) noexcept;
    void deleteAllClientStorage() noexcept;

    TextureFreeList<OGL::Texture1D> oFreeList1D_;
    TextureFreeList<OGL::Texture2D> oFreeList2D_;
    TextureFreeList<OGL::Texture3D> oFreeList3D_;
    TextureFreeList<OGL::TextureRECT> oFreeListRECT_;
    std::size_t nFreeListBytes_ = 0;
    std::size_t nMaximumPoolSize_;
    bool bProhibitReuseLargerTextures_;
    /// Scratch framebuffer of the hidden context.
    unsigned nFramebufferID_ = 0;
    VideoMemory::VideoMemoryListener* pListener_;
    std::shared_ptr<OGL::ContextOffscreen> spContext_;
    PBOQueue oPBOQueue_;
    std::list<OGL::TextureRECT*> vpTransferClientStorage_;
};

} // namespace ORVO
