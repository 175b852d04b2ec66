#include "tests/image_runtime/support/PoolTest.h"
#include "tests/support/Expect.h"

#include "orvo/core/memory/MemoryStatistics.h"

#include <gtest/gtest.h>

#include <epoxy/egl.h>
#include <epoxy/gl.h>

#include <algorithm>
#include <cstdint>
#include <set>
#include <utility>
#include <vector>

namespace ORVO {
namespace {

using OGL::Texture;
using Test::Events;

class TexturePoolClientStorage : public Test::PoolTest {
protected:
    OGL::TextureRECT* take(unsigned width, unsigned height, Texture::Format format = Texture::FORMAT_RGBA,
                           Texture::Type type = Texture::TYPE_UNSIGNED_BYTE) {
        return pool().getClientStorageTextureRECTFromPool(width, height, format, type);
    }
    void giveBack(OGL::TextureRECT* pTexture) { pool().returnClientStorageTextureRECTToPool(pTexture); }
};

TEST_F(TexturePoolClientStorage, PicksTheFirstInternalFormatThatFits) {
    struct Row {
        Texture::Format eFormat_;
        Texture::Type eType_;
        Texture::InternalFormat eExpected_;
    };
    // The first in the order of the enumeration with as many channels and bytes, float for float.
    Row const rows[] = {
        {Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_BYTE, Texture::INTERNAL_FORMAT_RGBA},
        {Texture::FORMAT_BGRA, Texture::TYPE_UNSIGNED_BYTE, Texture::INTERNAL_FORMAT_RGBA},
        {Texture::FORMAT_BGRA, Texture::TYPE_UNSIGNED_INT_8_8_8_8, Texture::INTERNAL_FORMAT_RGBA},
        {Texture::FORMAT_BGRA, Texture::TYPE_UNSIGNED_INT_8_8_8_8_REV, Texture::INTERNAL_FORMAT_RGBA},
        {Texture::FORMAT_RGBA, Texture::TYPE_BYTE, Texture::INTERNAL_FORMAT_RGBA},
        {Texture::FORMAT_RGB, Texture::TYPE_UNSIGNED_BYTE, Texture::INTERNAL_FORMAT_RGB},
        {Texture::FORMAT_BGR, Texture::TYPE_UNSIGNED_BYTE, Texture::INTERNAL_FORMAT_RGB},
        {Texture::FORMAT_LUMINANCE, Texture::TYPE_UNSIGNED_BYTE, Texture::INTERNAL_FORMAT_ALPHA},
        {Texture::FORMAT_LUMINANCE_ALPHA, Texture::TYPE_UNSIGNED_BYTE,
         Texture::INTERNAL_FORMAT_LUMINANCE_ALPHA},
        {Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_SHORT, Texture::INTERNAL_FORMAT_RGBA16},
        {Texture::FORMAT_RGBA, Texture::TYPE_SHORT, Texture::INTERNAL_FORMAT_RGBA16},
        {Texture::FORMAT_RGB, Texture::TYPE_UNSIGNED_SHORT, Texture::INTERNAL_FORMAT_RGB16},
        {Texture::FORMAT_LUMINANCE, Texture::TYPE_UNSIGNED_SHORT, Texture::INTERNAL_FORMAT_ALPHA12},
        {Texture::FORMAT_LUMINANCE_ALPHA, Texture::TYPE_UNSIGNED_SHORT,
         Texture::INTERNAL_FORMAT_LUMINANCE16_ALPHA16},
        {Texture::FORMAT_RGBA, Texture::TYPE_FLOAT, Texture::INTERNAL_FORMAT_RGBA32F},
        {Texture::FORMAT_RGB, Texture::TYPE_FLOAT, Texture::INTERNAL_FORMAT_RGB32F},
        {Texture::FORMAT_LUMINANCE, Texture::TYPE_FLOAT, Texture::INTERNAL_FORMAT_ALPHA32F},
        {Texture::FORMAT_LUMINANCE_ALPHA, Texture::TYPE_FLOAT, Texture::INTERNAL_FORMAT_LUMINANCE_ALPHA32F},
        {Texture::FORMAT_RGBA, Texture::TYPE_HALF_FLOAT, Texture::INTERNAL_FORMAT_RGBA16F},
        {Texture::FORMAT_RGB, Texture::TYPE_HALF_FLOAT, Texture::INTERNAL_FORMAT_RGB16F},
        {Texture::FORMAT_LUMINANCE, Texture::TYPE_HALF_FLOAT, Texture::INTERNAL_FORMAT_ALPHA16F},
    };
    for (Row const& row : rows) {
        SCOPED_TRACE(testing::Message() << "format " << row.eFormat_ << ", type " << row.eType_);
        OGL::TextureRECT* const pTexture = take(1, 1, row.eFormat_, row.eType_);
        EXPECT_EQ(row.eExpected_, pTexture->format());
        giveBack(pTexture);
    }
    // The last float format is beyond those that are looked through.
    ORVO_EXPECT_PARAMETER(take(1, 1, Texture::FORMAT_LUMINANCE_ALPHA, Texture::TYPE_HALF_FLOAT),
                          "No internal format fits the format and type");
}

TEST_F(TexturePoolClientStorage, RefusesTypesWithoutASize) {
    struct Row {
        Texture::Type eType_;
        char const* sText_;
    };
    Row const rows[] = {
        {Texture::TYPE_INT, "pixelDataSize: Unknown type GL_INT"},
        {Texture::TYPE_UNSIGNED_INT, "pixelDataSize: Unknown type GL_UNSIGNED_INT"},
        {Texture::TYPE_BITMAP, "pixelDataSize: Unknown type GL_BITMAP"},
        {Texture::TYPE_UNSIGNED_SHORT_5_6_5, "pixelDataSize: Unknown type GL_UNSIGNED_SHORT_5_6_5"},
        {Texture::TYPE_UNSIGNED_INT_10_10_10_2, "pixelDataSize: Unknown type GL_UNSIGNED_INT_10_10_10_2"}};
    for (Row const& row : rows)
        ORVO_EXPECT_INTERNAL(take(1, 1, Texture::FORMAT_RGBA, row.eType_), row.sText_);
}

TEST_F(TexturePoolClientStorage, RoundsSizesToMultiplesOf64) {
    struct Row {
        unsigned nAsked_;
        std::size_t nMade_;
    };
    for (Row const& row : {Row{0, 0}, Row{1, 64}, Row{64, 64}, Row{65, 128}, Row{300, 320}}) {
        OGL::TextureRECT* const pTexture = take(row.nAsked_, 70, Texture::FORMAT_RGB);
        EXPECT_EQ(row.nMade_, pTexture->width(0));
        EXPECT_EQ(128u, pTexture->height(0));
        giveBack(pTexture);
    }
    EXPECT_EQ(Events(), oListener_.take());
}

TEST_F(TexturePoolClientStorage, BringsItsMemory) {
    using Core::MemoryStatistics;
    std::size_t const nBefore = MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    OGL::TextureRECT* const pTexture = take(60, 60, Texture::FORMAT_RGBA, Texture::TYPE_FLOAT);
    ASSERT_NE(nullptr, pTexture->clientMemory());
    EXPECT_EQ(0u, reinterpret_cast<std::uintptr_t>(pTexture->clientMemory()) % 64);
    EXPECT_EQ(nBefore + 1, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
    // All of it may be written.
    std::fill_n(static_cast<float*>(pTexture->clientMemory()), 64 * 64 * 4, 0.5f);
    EXPECT_EQ(0u, freeBytes());
    giveBack(pTexture);
    EXPECT_EQ(65536u, freeBytes());
    pool().clearRECTPool();
    EXPECT_EQ(0u, freeBytes());
    EXPECT_EQ(nBefore, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

TEST_F(TexturePoolClientStorage, HandsOutWhatIsAtMost64PixelsLarger) {
    struct Row {
        unsigned nWidth_;
        unsigned nHeight_;
        bool bReused_;
    };
    for (Row const& row : {Row{256, 128, true}, Row{192, 64, true}, Row{191, 64, false}, Row{192, 63, false},
                           Row{257, 128, false}, Row{256, 129, false}, Row{220, 100, true}}) {
        SCOPED_TRACE(testing::Message() << row.nWidth_ << " by " << row.nHeight_);
        OGL::TextureRECT* const pTexture = take(200, 100); // 256 by 128
        giveBack(pTexture);
        OGL::TextureRECT* const pTaken = take(row.nWidth_, row.nHeight_);
        EXPECT_EQ(row.bReused_, pTaken == pTexture);
        EXPECT_EQ(row.bReused_ ? 0u : 256u * 128 * 4, freeBytes());
        giveBack(pTaken);
        pool().clearRECTPool();
    }
}

TEST_F(TexturePoolClientStorage, MatchesTheInternalFormat) {
    OGL::TextureRECT* const pTexture = take(64, 64);
    giveBack(pTexture);
    OGL::TextureRECT* const pOther = take(64, 64, Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_SHORT);
    EXPECT_NE(pTexture, pOther);
    EXPECT_EQ(pTexture, take(64, 64, Texture::FORMAT_BGRA));
    giveBack(pTexture);
    giveBack(pOther);
}

TEST_F(TexturePoolClientStorage, HandsOutTheOldestThatFits) {
    OGL::TextureRECT* const pLarge = take(128, 128);
    OGL::TextureRECT* const pSmall = take(64, 64);
    giveBack(pLarge);
    giveBack(pSmall);
    EXPECT_EQ(pLarge, take(64, 64));
    EXPECT_EQ(pSmall, take(64, 64));
    giveBack(pLarge);
    giveBack(pSmall);
}

/// A driver that tells when it has done with a texture's memory, played by replaced entry points.
class TexturePoolFencedStorage : public TexturePoolClientStorage {
protected:
    void SetUp() override {
        TexturePoolClientStorage::SetUp();
        aBusy_.clear();
        aFinished_.clear();
        pGetStringi_ = reinterpret_cast<decltype(pGetStringi_)>(eglGetProcAddress("glGetStringi"));
        ASSERT_NE(nullptr, pGetStringi_);
        epoxy_glGetStringi = [](GLenum name, GLuint i) {
            bool const bFence = name == GL_EXTENSIONS && i == 0;
            return bFence ? reinterpret_cast<GLubyte const*>("GL_APPLE_fence") : pGetStringi_(name, i);
        };
        pTestObject_ = std::exchange(epoxy_glTestObjectAPPLE, [](GLenum object, GLuint name) -> GLboolean {
            EXPECT_EQ(static_cast<GLenum>(GL_TEXTURE), object);
            return aBusy_.count(name) == 0;
        });
        pFinishObject_ = std::exchange(epoxy_glFinishObjectAPPLE, [](GLenum object, GLint name) {
            EXPECT_EQ(static_cast<GLenum>(GL_TEXTURE), object);
            EXPECT_TRUE(glIsTexture(static_cast<GLuint>(name)));
            aFinished_.push_back(static_cast<GLuint>(name));
        });
    }
    void TearDown() override {
        pPool_.reset();
        epoxy_glGetStringi = pGetStringi_;
        epoxy_glTestObjectAPPLE = pTestObject_;
        epoxy_glFinishObjectAPPLE = pFinishObject_;
        TexturePoolClientStorage::TearDown();
    }

    static inline std::set<GLuint> aBusy_;
    static inline std::vector<GLuint> aFinished_;
    static inline PFNGLGETSTRINGIPROC pGetStringi_ = nullptr;
    static inline PFNGLTESTOBJECTAPPLEPROC pTestObject_ = nullptr;
    static inline PFNGLFINISHOBJECTAPPLEPROC pFinishObject_ = nullptr;
};

TEST_F(TexturePoolFencedStorage, PassesOverWhatTheDriverStillReads) {
    OGL::TextureRECT* const pFirst = take(64, 64);
    OGL::TextureRECT* const pSecond = take(64, 64);
    giveBack(pFirst);
    giveBack(pSecond);
    aBusy_ = {pFirst->objectID()};
    EXPECT_EQ(pSecond, take(64, 64));
    OGL::TextureRECT* const pThird = take(64, 64);
    EXPECT_NE(pFirst, pThird);
    aBusy_.clear();
    EXPECT_EQ(pFirst, take(64, 64));
    EXPECT_EQ(std::vector<GLuint>(), aFinished_);
    for (OGL::TextureRECT* p : {pFirst, pSecond, pThird})
        giveBack(p);
}

TEST_F(TexturePoolFencedStorage, WaitsBeforeItDeletes) {
    OGL::TextureRECT* const pFirst = take(64, 64);
    OGL::TextureRECT* const pSecond = take(64, 64);
    std::vector<GLuint> const aNames{pFirst->objectID(), pSecond->objectID()};
    giveBack(pFirst);
    giveBack(pSecond);
    // 32 KiB: the first goes, which leaves half.
    pool().setMaximumPoolSize(32768);
    EXPECT_EQ(std::vector<GLuint>(1, aNames[0]), aFinished_);
    EXPECT_EQ(16384u, freeBytes());
    pool().clearRECTPool();
    EXPECT_EQ(aNames, aFinished_);
}

} // namespace
} // namespace ORVO
