#include "orvo/image_runtime/TexturePool.h"

#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/NativeContext.h"
#include "tests/image_runtime/support/PoolTest.h"
#include "tests/support/gl/ExpectOGL.h"

#include <epoxy/gl.h>
#include <gtest/gtest.h>

#include <climits>
#include <stdexcept>
#include <type_traits>

namespace ORVO {
namespace {

using OGL::Texture;
using Test::Events;
using Test::GLHooks;
using Test::ObjectCounts;

constexpr auto eRGBA8 = Texture::INTERNAL_FORMAT_RGBA8;

class TexturePoolTest : public Test::PoolTest {};

TEST(TexturePoolConfiguration, HasItsDefaults) {
    TexturePool::Configuration const configuration;
    EXPECT_EQ(134217728u, configuration.maximumFreelistSize());
    EXPECT_EQ(VideoMemory::GlobalDefaultListener(), configuration.videoMemoryListener());
    EXPECT_EQ(nullptr, configuration.context());
    EXPECT_FALSE(configuration.prohibitReuseLargerTextures());
}

TEST_F(TexturePoolTest, ConfigurationKeepsWhatIsSet) {
    TexturePool::Configuration configuration;
    configuration.setMaximumFreelistSize(42);
    configuration.setVideoMemoryListener(&oListener_);
    configuration.setContext(pContext_.get());
    configuration.setProhibitReuseLargerTextures(true);
    TexturePool::Configuration const copy = configuration;
    EXPECT_EQ(42u, copy.maximumFreelistSize());
    EXPECT_EQ(&oListener_, copy.videoMemoryListener());
    EXPECT_EQ(pContext_.get(), copy.context());
    EXPECT_TRUE(copy.prohibitReuseLargerTextures());
}

TEST(TexturePoolSizes, AreRoundedUpToClasses) {
    struct Row {
        std::size_t nAsked_;
        std::size_t nClass_;
    };
    Row const rows[] = {{0, 0},
                        {1, 1},
                        {2, 2},
                        {3, 4},
                        {5, 8},
                        {255, 256},
                        {256, 256},
                        {257, 512},
                        {300, 512},
                        {500, 512},
                        {512, 512},
                        {513, 1024},
                        {700, 1024},
                        {1000, 1024},
                        {1023, 1024},
                        {1024, 1024},
                        {1025, 1536},
                        {1536, 1536},
                        {1537, 2048},
                        {2000, 2048},
                        {2048, 2048},
                        {2049, 2560},
                        {UINT_MAX, std::size_t{1} << 32}};
    for (Row const& row : rows)
        EXPECT_EQ(row.nClass_, TexturePool::nextSizeUp(row.nAsked_)) << row.nAsked_;
    EXPECT_FALSE(std::is_copy_constructible_v<TexturePool>);
}

TEST_F(TexturePoolTest, RoundsEachSizeOfEachKind) {
    struct Row {
        unsigned nAsked_;
        std::size_t nMade_;
    };
    for (Row const& row : {Row{3, 4}, Row{300, 512}, Row{1030, 1536}}) {
        SCOPED_TRACE(row.nAsked_);
        OGL::Texture1D* const p1D = pool().getTexture1DFromPool(row.nAsked_, eRGBA8, false);
        EXPECT_EQ(row.nMade_, p1D->width(0));
        OGL::Texture2D* const p2D = pool().getTexture2DFromPool(row.nAsked_, 5, eRGBA8, false);
        EXPECT_EQ(row.nMade_, p2D->width(0));
        EXPECT_EQ(8u, p2D->height(0));
        OGL::Texture3D* const p3D = pool().getTexture3DFromPool(row.nAsked_, 5, 3, eRGBA8, false);
        EXPECT_EQ(row.nMade_, p3D->width(0));
        EXPECT_EQ(8u, p3D->height(0));
        EXPECT_EQ(4u, p3D->depth(0));
        OGL::TextureRECT* const pRECT = pool().getTextureRECTFromPool(row.nAsked_, 5, eRGBA8, false);
        EXPECT_EQ(row.nMade_, pRECT->width(0));
        EXPECT_EQ(8u, pRECT->height(0));
        EXPECT_EQ(nullptr, pRECT->clientMemory());
        pool().returnTexture1DToPool(p1D);
        pool().returnTexture2DToPool(p2D);
        pool().returnTexture3DToPool(p3D);
        pool().returnTextureRECTToPool(pRECT);
    }
}

TEST_F(TexturePoolTest, KeepsTheSizeWhereItIsAskedTo) {
    auto const check = [this](bool exact) {
        OGL::Texture1D* const p1D = pool().getTexture1DFromPool(3, eRGBA8, exact);
        OGL::Texture2D* const p2D = pool().getTexture2DFromPool(3, 5, eRGBA8, exact);
        OGL::Texture3D* const p3D = pool().getTexture3DFromPool(3, 5, 7, eRGBA8, exact);
        OGL::TextureRECT* const pRECT = pool().getTextureRECTFromPool(3, 5, eRGBA8, exact);
        EXPECT_EQ(3u, p1D->width(0));
        EXPECT_EQ(3u, p2D->width(0));
        EXPECT_EQ(5u, p2D->height(0));
        EXPECT_EQ(3u, p3D->width(0));
        EXPECT_EQ(5u, p3D->height(0));
        EXPECT_EQ(7u, p3D->depth(0));
        EXPECT_EQ(3u, pRECT->width(0));
        EXPECT_EQ(5u, pRECT->height(0));
        pool().returnTexture1DToPool(p1D);
        pool().returnTexture2DToPool(p2D);
        pool().returnTexture3DToPool(p3D);
        pool().returnTextureRECTToPool(pRECT);
    };
    EXPECT_FALSE(pool().prohibitReuseLargerTextures());
    check(true);
    oConfiguration_.setProhibitReuseLargerTextures(true);
    remake();
    EXPECT_TRUE(pool().prohibitReuseLargerTextures());
    check(false);
}

TEST_F(TexturePoolTest, HandsOutAReturnedTextureOfTheSameClass) {
    OGL::Texture2D* const pTexture = pool().getTexture2DFromPool(300, 700, eRGBA8, false);
    EXPECT_EQ(512u, pTexture->width(0));
    EXPECT_EQ(1024u, pTexture->height(0));
    EXPECT_EQ(0u, freeBytes());
    pool().returnTexture2DToPool(pTexture);
    EXPECT_EQ(2097152u, freeBytes()); // 512 * 1024 * 4
    EXPECT_EQ(pTexture, pool().getTexture2DFromPool(500, 1000, eRGBA8, false));
    EXPECT_EQ(0u, freeBytes());
    pool().returnTexture2DToPool(pTexture);
    // What was made for a rounded size serves an exact request of that very size.
    EXPECT_EQ(pTexture, pool().getTexture2DFromPool(512, 1024, eRGBA8, true));
    pool().returnTexture2DToPool(pTexture);
}

TEST_F(TexturePoolTest, MatchesNothingButTheSameSizesAndFormat) {
    OGL::Texture2D* const pTexture = pool().getTexture2DFromPool(64, 32, eRGBA8, true);
    pool().returnTexture2DToPool(pTexture);
    struct Row {
        unsigned nWidth_;
        unsigned nHeight_;
        Texture::InternalFormat eFormat_;
    };
    for (Row const& row : {Row{63, 32, eRGBA8}, Row{64, 31, eRGBA8}, Row{32, 64, eRGBA8},
                           Row{64, 32, Texture::INTERNAL_FORMAT_RGBA}, Row{65, 32, eRGBA8}}) {
        OGL::Texture2D* const pOther =
            pool().getTexture2DFromPool(row.nWidth_, row.nHeight_, row.eFormat_, true);
        EXPECT_NE(pTexture, pOther);
        trackedDelete(pOther);
    }
    EXPECT_EQ(pTexture, pool().getTexture2DFromPool(64, 32, eRGBA8, true));
    pool().returnTexture2DToPool(pTexture);
}

TEST_F(TexturePoolTest, HandsOutTheOneThatCameBackFirst) {
    OGL::Texture2D* aTextures[4];
    for (OGL::Texture2D*& pTexture : aTextures)
        pTexture = takeBytes(16);
    for (int i : {2, 0, 3, 1})
        pool().returnTexture2DToPool(aTextures[i]);
    for (int i : {2, 0, 3, 1})
        EXPECT_EQ(aTextures[i], takeBytes(16));
    for (OGL::Texture2D* pTexture : aTextures)
        pool().returnTexture2DToPool(pTexture);
}

TEST_F(TexturePoolTest, HandsOutEachKindAgain) {
    OGL::Texture1D* const p1D = pool().getTexture1DFromPool(9, eRGBA8, false);
    OGL::Texture3D* const p3D = pool().getTexture3DFromPool(9, 3, 3, eRGBA8, false);
    OGL::TextureRECT* const pRECT = pool().getTextureRECTFromPool(9, 3, eRGBA8, false);
    pool().returnTexture1DToPool(p1D);
    pool().returnTexture3DToPool(p3D);
    pool().returnTextureRECTToPool(pRECT);
    EXPECT_EQ(16u * 4 + 16u * 4 * 4 * 4 + 16u * 4 * 4, freeBytes());
    EXPECT_EQ(p1D, pool().getTexture1DFromPool(16, eRGBA8, false));
    EXPECT_EQ(p3D, pool().getTexture3DFromPool(16, 4, 4, eRGBA8, false));
    EXPECT_EQ(pRECT, pool().getTextureRECTFromPool(16, 4, eRGBA8, false));
    EXPECT_EQ(0u, freeBytes());
    pool().returnTexture1DToPool(p1D);
    pool().returnTexture3DToPool(p3D);
    pool().returnTextureRECTToPool(pRECT);
    EXPECT_EQ(Events(), oListener_.take());
}

/// Wrap modes, s and t, of a texture.
std::pair<GLint, GLint> wrapOf(Texture const& texture) {
    GLint nBound = 0;
    GLint s = 0;
    GLint t = 0;
    glGetIntegerv(GL_TEXTURE_BINDING_2D, &nBound);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    glGetTexParameteriv(GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, &s);
    glGetTexParameteriv(GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, &t);
    glBindTexture(GL_TEXTURE_2D, static_cast<GLuint>(nBound));
    return {s, t};
}

TEST_F(TexturePoolTest, ResetsTheWrapModeOf2DTexturesAndWhatIsBound) {
    OGL::Texture2D* const pTexture = takeBytes(8, 8);
    EXPECT_EQ(std::make_pair(GLint{GL_REPEAT}, GLint{GL_REPEAT}), wrapOf(*pTexture));
    pool().returnTexture2DToPool(pTexture);

    OGL::Texture2D* const pOther = takeBytes(4, 4);
    glBindTexture(GL_TEXTURE_2D, pOther->objectID());
    EXPECT_EQ(pTexture, takeBytes(8, 8));
    EXPECT_TRUE(pOther->isBound());
    EXPECT_EQ(std::make_pair(GLint{GL_CLAMP_TO_BORDER}, GLint{GL_CLAMP_TO_BORDER}), wrapOf(*pTexture));
    // Making one leaves the binding too.
    OGL::Texture2D* const pMade = takeBytes(2, 2);
    EXPECT_TRUE(pOther->isBound());
    glBindTexture(GL_TEXTURE_2D, 0);
    for (OGL::Texture2D* p : {pTexture, pOther, pMade})
        pool().returnTexture2DToPool(p);
}

TEST_F(TexturePoolTest, TellsOf2DTexturesAlone) {
    OGL::Texture2D* const p2D = pool().getTexture2DFromPool(300, 5, eRGBA8, false);
    EXPECT_EQ((Events{{"impending", 16384}, {"allocated", 16384}}), oListener_.take()); // 512 * 8 * 4
    pool().returnTexture2DToPool(p2D);
    pool().getTexture2DFromPool(300, 5, eRGBA8, false);
    EXPECT_EQ(Events(), oListener_.take());

    OGL::Texture1D* const p1D = pool().getTexture1DFromPool(8, eRGBA8, false);
    OGL::Texture3D* const p3D = pool().getTexture3DFromPool(8, 8, 8, eRGBA8, false);
    OGL::TextureRECT* const pRECT = pool().getTextureRECTFromPool(8, 8, eRGBA8, false);
    EXPECT_EQ(Events(), oListener_.take());
    pool().returnTexture1DToPool(p1D);
    pool().returnTexture2DToPool(p2D);
    pool().returnTexture3DToPool(p3D);
    pool().returnTextureRECTToPool(pRECT);
    EXPECT_EQ(Events(), oListener_.take());
}

TEST_F(TexturePoolTest, WorksWithoutAListener) {
    oConfiguration_.setVideoMemoryListener(nullptr);
    remake();
    pool().returnTexture2DToPool(takeBytes(8));
    pool().setMaximumPoolSize(0);
    EXPECT_EQ(0u, freeBytes());
}

/// Refuses what it is told of first.
class RefusingListener : public VideoMemory::VideoMemoryListener {
public:
    explicit RefusingListener(bool bAfter) : bAfter_(bAfter) {}
    void impendingMemoryAllcation(std::size_t) override {
        if (!bAfter_)
            throw std::runtime_error("no room");
    }
    void memoryAllocated(std::size_t) override { throw std::runtime_error("no room"); }
    void memoryFreed(std::size_t) override { throw std::runtime_error("still no room"); }

private:
    bool bAfter_;
};

TEST_F(TexturePoolTest, LosesNothingToAListenerThatThrows) {
    for (bool bAfter : {false, true}) {
        RefusingListener listener(bAfter);
        oConfiguration_.setVideoMemoryListener(&listener);
        remake();
        ObjectCounts const before = GLHooks::objects();
        EXPECT_THROW(takeBytes(8), std::runtime_error);
        EXPECT_EQ(before, GLHooks::objects());
        // One that stands on a list when it is cleared and when the pool ends.
        pool().returnTexture2DToPool(ORVO_NEW OGL::Texture2D(eRGBA8, 1, 1, false, nullptr));
        EXPECT_THROW(pool().clear2DPool(), std::runtime_error);
        EXPECT_EQ(0u, freeBytes());
        pool().returnTexture2DToPool(ORVO_NEW OGL::Texture2D(eRGBA8, 1, 1, false, nullptr));
        pPool_.reset();
    }
}

TEST_F(TexturePoolTest, TakesTexturesWithoutPixels) {
    OGL::Texture2D* const pTexture = pool().getTexture2DFromPool(0, 0, eRGBA8, false);
    EXPECT_EQ(0u, pTexture->width(0));
    EXPECT_EQ(0u, pTexture->height(0));
    pool().returnTexture2DToPool(pTexture);
    EXPECT_EQ(0u, freeBytes());
    EXPECT_EQ(pTexture, pool().getTexture2DFromPool(0, 0, eRGBA8, true));
    pool().returnTexture2DToPool(pTexture);
}

TEST_F(TexturePoolTest, RefusesNoTexture) {
    ORVO_EXPECT_INTERNAL(pool().returnTexture1DToPool(nullptr), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(pool().returnTexture2DToPool(nullptr), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(pool().returnTexture3DToPool(nullptr), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(pool().returnTextureRECTToPool(nullptr), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(pool().returnClientStorageTextureRECTToPool(nullptr), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(pool().returnPBOToQueue(nullptr), "Enforce pBuffer != NULL");
    TexturePool::returnTexture2DLater(nullptr);
}

TEST_F(TexturePoolTest, RefusesSizesBeyondWhatATextureMayHave) {
    char const* const sText = "Texture size is too large";
    ORVO_EXPECT_PARAMETER(pool().getTexture2DFromPool(UINT_MAX, UINT_MAX, eRGBA8, false), sText);
    ORVO_EXPECT_PARAMETER(pool().getTexture2DFromPool(UINT_MAX, UINT_MAX, eRGBA8, true), sText);
    ORVO_EXPECT_PARAMETER(pool().getTexture1DFromPool(UINT_MAX, eRGBA8, false), sText);
    ORVO_EXPECT_PARAMETER(pool().getTexture3DFromPool(UINT_MAX, UINT_MAX, UINT_MAX, eRGBA8, false), sText);
    ORVO_EXPECT_PARAMETER(pool().getTextureRECTFromPool(UINT_MAX, UINT_MAX, eRGBA8, false), sText);
    ORVO_EXPECT_PARAMETER(pool().getClientStorageTextureRECTFromPool(UINT_MAX, UINT_MAX, Texture::FORMAT_RGBA,
                                                                     Texture::TYPE_FLOAT),
                          sText);
    EXPECT_EQ(0u, freeBytes());
}

TEST_F(TexturePoolTest, WorksWithoutACurrentContext) {
    OGL::Texture2D* const pKept = takeBytes(8);
    host().release();
    OGL::Texture2D* const pTexture = takeBytes(16);
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    pool().returnTexture2DToPool(pTexture);
    // A texture that is handed out again is bound, which nothing can be now.
    ORVO_EXPECT_OGL(takeBytes(16), "No OpenGL context is current");
    EXPECT_EQ(16u, freeBytes());
    pool().setMaximumPoolSize(0);
    EXPECT_EQ(0u, freeBytes());
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    pool().returnTexture2DToPool(pKept);
    host().makeCurrent();
}

TEST_F(TexturePoolTest, ServesEveryContextOfTheGroup) {
    OGL::Texture2D* const pTexture = takeBytes(16);
    auto const pOther = host().another(true);
    pOther->makeCurrent();
    pool().returnTexture2DToPool(pTexture);
    EXPECT_EQ(pTexture, takeBytes(16));
    OGL::Texture2D* const pMade = takeBytes(4);
    EXPECT_EQ(pOther->handle(), OGL::NativeContext::currentHandle());
    EXPECT_TRUE(glIsTexture(pMade->objectID()));
    host().makeCurrent();
    EXPECT_TRUE(glIsTexture(pMade->objectID()));
    pool().returnTexture2DToPool(pTexture);
    pool().returnTexture2DToPool(pMade);
}

TEST_F(TexturePoolTest, TakesTexturesBackOnceItsOwnContextIsCurrent) {
    ObjectCounts const before = GLHooks::objects();
    OGL::Texture2D* const pFirst = takeBytes(16);
    OGL::Texture2D* const pSecond = takeBytes(16);
    auto const pForeign = host().another(false);
    host().release();
    TexturePool::returnTexture2DLater(pFirst);
    pForeign->makeCurrent();
    TexturePool::returnTexture2DLater(pSecond);
    // A foreign pool leaves them alone.
    {
        auto const pContext = OGL::Context::adoptCurrent();
        TexturePool::Configuration configuration;
        configuration.setContext(pContext.get());
        auto const pForeignPool = TexturePoolProbe::create(configuration);
        TexturePoolProbe::prepare(*pForeignPool);
        EXPECT_EQ(0u, TexturePoolProbe::freeListBytes(*pForeignPool));
    }
    host().makeCurrent();
    EXPECT_EQ(0u, freeBytes());
    pool().clear1DPool();
    EXPECT_EQ(32u, freeBytes());
    EXPECT_EQ(pFirst, takeBytes(16));
    EXPECT_EQ(pSecond, takeBytes(16));

    // They count against the budget at once, and go with the pool at the latest.
    pool().setMaximumPoolSize(20);
    TexturePool::returnTexture2DLater(pFirst);
    TexturePool::returnTexture2DLater(pSecond);
    OGL::Texture1D* const p1D = pool().getTexture1DFromPool(1, eRGBA8, true);
    EXPECT_EQ(0u, freeBytes());
    TexturePool::returnTexture2DLater(takeBytes(8));
    pool().returnTexture1DToPool(p1D);
    pPool_.reset();
    ObjectCounts after = GLHooks::objects();
    EXPECT_EQ(before.count("texture"), after.count("texture"));
}

TEST_F(TexturePoolTest, NeedsTexturesOfEverySize) {
    auto& manager = *OGL::ExtensionManager::Instance();
    manager.overrideVersion(1, 5);
    manager.overrideSupport(OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, false);
    ORVO_EXPECT_INTERNAL(TexturePoolProbe::create(oConfiguration_),
                         "ExtensionManager::Instance()->supportsNonPowerOfTwoTextures()");
    // That is asked first.
    host().release();
    ORVO_EXPECT_INTERNAL(TexturePoolProbe::create(oConfiguration_),
                         "ExtensionManager::Instance()->supportsNonPowerOfTwoTextures()");
    manager.clearOverrides();
    ORVO_EXPECT_INTERNAL(TexturePoolProbe::create(oConfiguration_), "Enforce gc != NULL");
    host().makeCurrent();
    oConfiguration_.setContext(nullptr);
    ORVO_EXPECT_INTERNAL(TexturePoolProbe::create(oConfiguration_), "Enforce pShareWith != NULL");
}

TEST_F(TexturePoolTest, NeedsItsOwnContextForWhatItMakes) {
    auto const spContext = std::exchange(TexturePoolProbe::context(pool()), nullptr);
    ORVO_EXPECT_INTERNAL(takeBytes(8), "spContext_.get()");
    ORVO_EXPECT_INTERNAL(pool().clear2DPool(), "spContext_.get()");
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
    TexturePoolProbe::context(pool()) = spContext;
}

TEST_F(TexturePoolTest, HasAFramebufferOfItsOwn) {
    EXPECT_NE(0u, TexturePoolProbe::framebuffer(pool()));
    ObjectCounts const with = GLHooks::objects();
    pPool_.reset();
    ObjectCounts without = GLHooks::objects();
    EXPECT_EQ(with.at("framebuffer"), ++without["framebuffer"]);
}

TEST_F(TexturePoolTest, DiesAfterTheHostsContext) {
    OGL::Texture2D* const pTexture = takeBytes(8);
    pool().returnTexture2DToPool(pTexture);
    host().destroyContext();
    // The hidden context keeps the share group alive.
    OGL::Texture2D* const pMade = takeBytes(4);
    pool().returnTexture2DToPool(pMade);
    pPool_.reset();
    pContext_.reset();
    GLHooks::forgetObjects();
    loseHost();
}

TEST_F(TexturePoolTest, SurvivesEveryFailureOfTheDriver) {
    std::unique_ptr<TexturePool> pOwn;
    auto const code = [this, &pOwn] {
        pOwn = TexturePoolProbe::create(oConfiguration_);
        OGL::Texture1D* const p1D = pOwn->getTexture1DFromPool(4, eRGBA8, false);
        pOwn->returnTexture1DToPool(p1D);
        OGL::Texture2D* const p2D = pOwn->getTexture2DFromPool(4, 4, eRGBA8, false);
        pOwn->returnTexture2DToPool(p2D);
        EXPECT_EQ(p2D, pOwn->getTexture2DFromPool(4, 4, eRGBA8, false));
        pOwn->returnTexture2DToPool(p2D);
        OGL::Texture3D* const p3D = pOwn->getTexture3DFromPool(4, 4, 4, eRGBA8, false);
        pOwn->returnTexture3DToPool(p3D);
        OGL::TextureRECT* const pRECT = pOwn->getTextureRECTFromPool(4, 4, eRGBA8, false);
        pOwn->returnTextureRECTToPool(pRECT);
        OGL::TextureRECT* const pClient = pOwn->getClientStorageTextureRECTFromPool(
            4, 4, Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_BYTE);
        pOwn->returnClientStorageTextureRECTToPool(pClient);
        pOwn->setMaximumPoolSize(0);
        EXPECT_EQ(0u, TexturePoolProbe::freeListBytes(*pOwn));
    };
    auto const end = [this, &pOwn] {
        drainErrors();
        host().makeCurrent();
        if (pOwn) {
            // The next use is right.
            pOwn->setMaximumPoolSize(100);
            pOwn->returnTexture2DToPool(
                pOwn->getTexture2DFromPool(4, 4, Texture::INTERNAL_FORMAT_LUMINANCE8, true));
            EXPECT_LE(16u, TexturePoolProbe::freeListBytes(*pOwn));
        }
        pOwn.reset();
        EXPECT_EQ(0u, drainErrors());
    };
    // A refusal to go back to the caller's context has nobody to tell.
    std::set<std::string> const aFailed = ORVO::Test::failEveryCallBefore(code, end, {"eglMakeCurrent"});
    EXPECT_EQ(1u, aFailed.count("eglCreateContext"));
    EXPECT_EQ(1u, aFailed.count("eglMakeCurrent"));
    EXPECT_EQ(1u, aFailed.count("glGenFramebuffers"));
    EXPECT_EQ(1u, aFailed.count("glGenTextures"));
    EXPECT_EQ(1u, aFailed.count("glTexImage1D"));
    EXPECT_EQ(1u, aFailed.count("glTexImage2D"));
    EXPECT_EQ(1u, aFailed.count("glTexImage3D"));
}

TEST_F(TexturePoolTest, LetsNobodyGoOnInItsOwnContext) {
    {
        // The first call makes its own context current, the second gives the host's back.
        ORVO::Test::GLCallFailure const failure("eglMakeCurrent", 2);
        ORVO_EXPECT_OGL(pPool_->getTexture2DFromPool(4, 4, eRGBA8, true),
                        "The current context could not be made current again");
        EXPECT_TRUE(failure.hasFired());
    }
    host().makeCurrent();
    // The texture is there for the next one.
    EXPECT_EQ(64u, TexturePoolProbe::freeListBytes(*pPool_));
    std::uint64_t const nMade = GLHooks::calls("glGenTextures");
    pPool_->returnTexture2DToPool(pPool_->getTexture2DFromPool(4, 4, eRGBA8, true));
    EXPECT_EQ(nMade, GLHooks::calls("glGenTextures"));
}

TEST_F(TexturePoolTest, DiesWhereItsOwnContextIsRefused) {
    pPool_.reset();
    for (std::uint64_t n = 1; n < 20; ++n) {
        auto pOwn = TexturePoolProbe::create(oConfiguration_);
        pOwn->returnTexture2DToPool(pOwn->getTexture2DFromPool(4, 4, eRGBA8, false));
        pOwn->returnTexture1DToPool(pOwn->getTexture1DFromPool(4, eRGBA8, false));
        GLuint const nFramebuffer = TexturePoolProbe::framebuffer(*pOwn);
        {
            ORVO::Test::GLCallFailure const failure("eglMakeCurrent", n);
            pOwn.reset();
        }
        host().makeCurrent();
        // It has died with the hidden context: the test's own count does not see that.
        glDeleteFramebuffers(1, &nFramebuffer);
        EXPECT_EQ(0, static_cast<int>(GLHooks::objects().count("texture"))) << n;
    }
    remake();
}

} // namespace
} // namespace ORVO
