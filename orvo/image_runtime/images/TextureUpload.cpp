#include "orvo/image_runtime/images/TextureUpload.h"

#include "orvo/core/Check.h"
#include "orvo/image_runtime/GLStateUtils.h"
#include "orvo/image_runtime/PixelDataSize.h"
#include "orvo/image_runtime/SampleQueries.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "orvo/ogl/Texture2.h"
#include "orvo/ogl/internal/ContextNames.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/Scopes.h"
#include "orvo/ogl/internal/TextureRange.h"

#include <algorithm>
#include <array>
#include <climits>
#include <cstring>

#include <tbb/blocked_range.h>
#include <tbb/parallel_for.h>
#include <tbb/partitioner.h>

namespace ORVO {

using OGL::Internal::ContextName;

struct TextureUpload::Source {
    OGL::Texture::Format eFormat_;
    OGL::Texture::Type eType_;
    unsigned char const* pPixels_;
    std::size_t nRowBytes_;
    std::size_t nStride_;
};

struct TextureUpload::Names {
    ContextName oQueries_;
    ContextName oClientTextures_;
};

namespace {

constexpr std::size_t nBandBytes = 0x400000;
constexpr float fByteToFloat = 0.003921568859f;

OGL::FunctionTable const& gl() noexcept { return *OGL::ExtensionManager::Instance()->table(); }

bool hasPixelBuffers() {
    OGL::ExtensionManager const& manager = *OGL::ExtensionManager::Instance();
    return manager.isSupported(OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT) ||
           manager.isSupported(OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT);
}

/// Begins and ends each query, so that all have a result. Left out while a query is active, since only one
/// may be.
void giveResults(ContextName const& queries) {
    if (isAnySampleQueryActive())
        return;
    for (unsigned const nQuery : queries.aNames_) {
        gl().glBeginQuery(GL_SAMPLES_PASSED, nQuery);
        gl().glEndQuery(GL_SAMPLES_PASSED);
    }
    glFinish();
    ORVO_OGL_THROW_ON_ERROR("The queries could not be prepared");
}

/// A name that is a query, or one that is fit to become one: the pool deletes the queries of the buffers that
/// it clears.
unsigned usableQuery(unsigned& nQuery) {
    if (!gl().glIsQuery(nQuery)) {
        gl().glDeleteQueries(1, &nQuery);
        gl().glGenQueries(1, &nQuery);
    }
    return nQuery;
}

/// On a software driver, one query over all bands of an upload: beside it the queue begins none, so that each
/// band finds the buffer free that the one before has left, still warm in the cache. Such a driver has done
/// with a buffer when the upload from it returns, but tells so by its queries much later, and every band
/// would take another buffer. Elsewhere nothing.
class SpanningQuery {
public:
    explicit SpanningQuery(unsigned& nQuery) {
        if (!OGL::ExtensionManager::Instance()->isSoftwareDriver() || isAnySampleQueryActive())
            return;
        gl().glBeginQuery(GL_SAMPLES_PASSED, usableQuery(nQuery));
        ORVO_OGL_THROW_ON_ERROR("The query of an upload could not be begun");
        bActive_ = true;
    }
    ~SpanningQuery() {
        if (bActive_ && currentSampleQuery() != 0)
            gl().glEndQuery(GL_SAMPLES_PASSED);
    }
    SpanningQuery(SpanningQuery const&) = delete;
    SpanningQuery& operator=(SpanningQuery const&) = delete;

    bool isActive() const noexcept { return bActive_; }

    void end() {
        if (!bActive_)
            return;
        gl().glEndQuery(GL_SAMPLES_PASSED);
        ORVO_OGL_THROW_ON_ERROR("The query of an upload could not be ended");
        bActive_ = false;
    }

private:
    bool bActive_ = false;
};

/// Copies rows into memory without gaps.
class ArrayMemCopy {
public:
    ArrayMemCopy(unsigned char* pDestination, std::size_t nDestinationStride, unsigned char const* pSource,
                 std::size_t nSourceStride, std::size_t nRowBytes) noexcept
        : pDestination_(pDestination),
          nDestinationStride_(nDestinationStride),
          pSource_(pSource),
          nSourceStride_(nSourceStride),
          nRowBytes_(nRowBytes) {}

    void operator()(tbb::blocked_range<std::size_t> const& rows) const {
        // Rows without gaps on both sides are one stretch.
        if (nSourceStride_ == nRowBytes_ && nDestinationStride_ == nRowBytes_) {
            copy(rows.begin(), rows.size() * nRowBytes_);
            return;
        }
        for (std::size_t row = rows.begin(); row != rows.end(); ++row)
            copy(row, nRowBytes_);
    }

private:
    void copy(std::size_t row, std::size_t nBytes) const noexcept {
        std::memcpy(pDestination_ + row * nDestinationStride_, pSource_ + row * nSourceStride_, nBytes);
    }

    unsigned char* pDestination_;
    std::size_t nDestinationStride_;
    unsigned char const* pSource_;
    std::size_t nSourceStride_;
    std::size_t nRowBytes_;
};

void copyRows(unsigned char* pDestination, unsigned char const* pSource, std::size_t nSourceStride,
              std::size_t nRowBytes, std::size_t nRows) {
    // A thread that waits for its helpers may meanwhile run work that makes another context current.
    OGL::ScopedContextWrapper wrapper;
    tbb::affinity_partitioner partitioner;
    tbb::parallel_for(tbb::blocked_range<std::size_t>(0, nRows),
                      ArrayMemCopy(pDestination, nRowBytes, pSource, nSourceStride, nRowBytes), partitioner);
    wrapper.restore();
}

/// A buffer of the pool's queue. What fails on the way to its return leaves it unmapped, unbound and returned
/// too: its query must not stay active.
class QueuedBuffer {
public:
    QueuedBuffer(TexturePool& pool, std::size_t nBytes, unsigned nQuery)
        : oPool_(pool), pBuffer_(pool.getPBOFromQueue(static_cast<unsigned>(nBytes), nQuery)) {}

    ~QueuedBuffer() {
        if (pBuffer_ == nullptr)
            return;
        try {
            if (bMapped_)
                unmap();
        } catch (...) {
            // The contents are lost, which no longer matters.
        }
        try {
            giveBack();
        } catch (...) {
            // The queue passes over buffers that never came back.
        }
    }
    QueuedBuffer(QueuedBuffer const&) = delete;
    QueuedBuffer& operator=(QueuedBuffer const&) = delete;

    OGL::Buffer* get() const noexcept { return pBuffer_; }

    unsigned char* map() {
        pBuffer_->bind();
        void* const pMemory = pBuffer_->map(GL_WRITE_ONLY);
        bMapped_ = true;
        return static_cast<unsigned char*>(pMemory);
    }

    void unmap() {
        // What fails here is tried once more at the end: a buffer that stays mapped could not be used again.
        pBuffer_->unmap();
        bMapped_ = false;
    }

    void giveBack() {
        OGL::Buffer* const pBuffer = pBuffer_;
        pBuffer_ = nullptr;
        OGL::Buffer::bindDefaultUnpackBuffer();
        oPool_.returnPBOToQueue(pBuffer);
    }

private:
    TexturePool& oPool_;
    OGL::Buffer* pBuffer_;
    bool bMapped_ = false;
};

/// Asked before anything goes up, so that a rectangle which is refused leaves the texture as it was.
void requireInside(OGL::Texture2 const& texture, int level, PositionExtentInPixelSpace const& rect) {
    auto const nLevel = static_cast<unsigned>(level);
    // Only levels that do not exist have no depth.
    ORVO_CHECK_PARAMETER(level >= 0 && texture.depth(nLevel) != 0, "The level does not exist");
    OGL::Internal::requireRange(rect.position().x(), static_cast<std::size_t>(rect.extent().width()),
                                texture.width(nLevel));
    OGL::Internal::requireRange(rect.position().y(), static_cast<std::size_t>(rect.extent().height()),
                                texture.height(nLevel));
}

bool hasPixels(PositionExtentInPixelSpace const& rect) {
    return rect.extent().width() != 0 && rect.extent().height() != 0;
}

void directUpload(OGL::Texture2& texture, int level, PositionExtentInPixelSpace const& rect,
                  OGL::Texture::Format format, OGL::Texture::Type type, void const* pPixels,
                  std::size_t rowLength) {
    // A buffer of the host's would turn the pointer into an offset.
    OGL::Internal::ScopedBufferBinding const noBuffer(GL_PIXEL_UNPACK_BUFFER, 0);
    ScopedTextureBindRestore<OGL::Texture2> const binding(&texture);
    OGL::PixelUnpackParameters parameters;
    parameters.setRowLength(rowLength);
    texture.subImage(level, rect.position().x(), rect.position().y(),
                     static_cast<std::size_t>(rect.extent().width()),
                     static_cast<std::size_t>(rect.extent().height()), format, type, pPixels, parameters);
    ORVO_OGL_THROW_ON_ERROR("The pixels could not be uploaded");
}

} // namespace

TextureUpload::TextureUpload() noexcept = default;

TextureUpload::~TextureUpload() {
    for (Names const& names : aNames_) {
        OGL::Internal::ContextNames::destroy(names.oQueries_);
        OGL::Internal::ContextNames::destroy(names.oClientTextures_);
    }
}

TextureUpload::Names& TextureUpload::namesHere() {
    namespace ContextNames = OGL::Internal::ContextNames;
    for (Names& names : aNames_)
        if (names.oQueries_.isOfCurrentContext())
            return names;
    // Names of an earlier context at the same address have died with it.
    void const* const pContext = OGL::NativeContext::currentHandle();
    aNames_.erase(std::remove_if(aNames_.begin(), aNames_.end(),
                                 [pContext](Names const& n) { return n.oQueries_.pContext_ == pContext; }),
                  aNames_.end());
    // Room first, so that the new names cannot be lost.
    aNames_.reserve(aNames_.size() + 1);
    ContextName const queries = ContextNames::create(ContextName::Kind::query, nQueryObject_);
    try {
        giveResults(queries);
        aNames_.push_back({queries, ContextNames::create(ContextName::Kind::texture, nClientTex_)});
    } catch (...) {
        ContextNames::destroy(queries);
        throw;
    }
    return aNames_.back();
}

std::size_t TextureUpload::rowsPerBand(std::size_t nRowBytes) noexcept {
    return std::max<std::size_t>(1, nBandBytes / nRowBytes);
}

void TextureUpload::asyncUpload(OGL::Texture2* pTexture, int level, PositionExtentInPixelSpace rect,
                                OGL::Texture::Format format, OGL::Texture::Type type, void const* pPixels,
                                unsigned rowLength) {
    if (!hasPixels(rect))
        return;
    ORVO_ENFORCE(pTexture);
    ORVO_ENFORCE(pPixels);
    std::size_t const nPixelBytes = pixelDataSize(format, type);
    requireInside(*pTexture, level, rect);
    ORVO_OGL_REQUIRE_CONTEXT();
    if (!hasPixelBuffers()) {
        directUpload(*pTexture, level, rect, format, type, pPixels, rowLength);
        return;
    }
    auto const nWidth = static_cast<std::size_t>(rect.extent().width());
    std::size_t const nRowBytes = nWidth * nPixelBytes;
    std::size_t const nSourceStride = (rowLength != 0 ? rowLength : nWidth) * nPixelBytes;
    ORVO_CHECK(nSourceStride >= nRowBytes, "srcWidth >= imageWidth");

    uploadInBands(*pTexture, level, rect,
                  {format, type, static_cast<unsigned char const*>(pPixels), nRowBytes, nSourceStride});
}

void TextureUpload::uploadInBands(OGL::Texture2& texture, int level, PositionExtentInPixelSpace rect,
                                  Source const& source) {
    TexturePool* const pPool = TexturePool::Instance();
    ORVO_ENFORCE(pPool, "TexturePool::Instance()");
    std::array<unsigned, nQueryObject_>& aQueries = namesHere().oQueries_.aNames_;
    OGL::Internal::ScopedBufferBinding const restoreBuffer(GL_PIXEL_UNPACK_BUFFER, 0);
    SpanningQuery span(aQueries[0]);
    int const nBandRows = static_cast<int>(std::min<std::size_t>(rowsPerBand(source.nRowBytes_), INT_MAX));
    unsigned char const* pBand = source.pPixels_;
    while (rect.extent().height() != 0) {
        PositionExtentInPixelSpace const band(
            rect.position(), {rect.extent().width(), std::min(rect.extent().height(), nBandRows)});
        auto const nRows = static_cast<std::size_t>(band.extent().height());
        // The spanning query must not be that of a band: nothing is in flight beside it, so one will do.
        std::size_t const iQuery = span.isActive() ? 1 : nQueryIndex_ & (nQueryObject_ - 1);
        QueuedBuffer buffer(*pPool, source.nRowBytes_ * nRows, usableQuery(aQueries[iQuery]));
        ++nQueryIndex_;
        copyRows(buffer.map(), pBand, source.nStride_, source.nRowBytes_, nRows);
        buffer.unmap();
        bufferUpload(&texture, buffer.get(), level, band, source.eFormat_, source.eType_, 0);
        ORVO_OGL_THROW_ON_ERROR("The pixels could not be uploaded");
        buffer.giveBack();
        pBand += source.nStride_ * nRows;
        rect = {{rect.position().x(), rect.position().y() + band.extent().height()},
                {rect.extent().width(), rect.extent().height() - band.extent().height()}};
    }
    span.end();
}

void TextureUpload::bufferUpload(OGL::Texture2* pTexture, OGL::Buffer* pBuffer, int level,
                                 PositionExtentInPixelSpace const& rect, OGL::Texture::Format format,
                                 OGL::Texture::Type type, std::size_t rowLength) {
    ScopedTextureBindRestore<OGL::Texture2> const binding(pTexture);
    OGL::PixelUnpackParameters parameters;
    parameters.setRowLength(rowLength);
    pTexture->subImage(
        level, rect.position().x(), rect.position().y(), static_cast<std::size_t>(rect.extent().width()),
        static_cast<std::size_t>(rect.extent().height()), format, type, pBuffer, 0, parameters);
}

void TextureUpload::intelUpload(OGL::Texture2* pTexture, int level, PositionExtentInPixelSpace const& rect,
                                void const* pPixels, std::size_t rowLength) {
    ORVO_ENFORCE(pTexture);
    ORVO_CHECK(pTexture->format() == OGL::Texture::INTERNAL_FORMAT_RGBA32F);
    if (!hasPixels(rect))
        return;
    ORVO_ENFORCE(pPixels);
    requireInside(*pTexture, level, rect);
    ORVO_OGL_REQUIRE_CONTEXT();
    constexpr std::size_t nChannels = 4;
    std::size_t const nRowValues = static_cast<std::size_t>(rect.extent().width()) * nChannels;
    auto const nRows = static_cast<std::size_t>(rect.extent().height());
    std::size_t const nStride = rowLength != 0 ? rowLength * nChannels : nRowValues;
    ORVO_CHECK(nStride >= nRowValues, "srcWidth >= imageWidth");
    if (vfConversionBuffer_.size() < nRowValues * nRows)
        vfConversionBuffer_.resize(nRowValues * nRows);
    float* pValue = vfConversionBuffer_.data();
    auto const* pRow = static_cast<unsigned char const*>(pPixels);
    for (std::size_t row = 0; row < nRows; ++row, pRow += nStride)
        pValue = std::transform(pRow, pRow + nRowValues, pValue,
                                [](unsigned char n) { return static_cast<float>(n) * fByteToFloat; });
    directUpload(*pTexture, level, rect, OGL::Texture::FORMAT_RGBA, OGL::Texture::TYPE_FLOAT,
                 vfConversionBuffer_.data(), 0);
}

} // namespace ORVO
