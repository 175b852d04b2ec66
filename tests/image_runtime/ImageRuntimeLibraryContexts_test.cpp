// The runtime started with contexts: which pool and which manager serve the current one.
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "tests/image_runtime/support/PoolTest.h"

#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/NativeContext.h"
#include "tests/support/gl/ExpectOGL.h"

#include <gtest/gtest.h>

#include <sstream>

namespace ORVO::ImageRuntime {
namespace {

using Test::GLHooks;

using Contexts = std::vector<OGL::Context const*>;

/// A context that takes its orders apart: it counts, or refuses.
class HostClass : public OGL::Context {
public:
    explicit HostClass(Test::HostContext& host) : host_(host) {}

    void makeCurrent() const override {
        ++nMade_;
        if (bRefuses_)
            throw OGL::ExceptionOGL(__FILE__, __LINE__, "The host refuses", 7);
        host_.makeCurrent();
    }
    bool isSharingWithCurrentContext() const override {
        return OGL::NativeContext::currentHandle() == host_.handle();
    }

    mutable int nMade_ = 0;
    bool bRefuses_ = false;

private:
    Test::HostContext& host_;
};

class LibraryContexts : public Test::GLTestOnEachInterface {
protected:
    void SetUp() override {
        GLTest::SetUp();
        pContext_ = OGL::Context::adoptCurrent();
    }
    void TearDown() override {
        pContext_.reset();
        GLTest::TearDown();
    }

    static std::string foreignText() {
        std::ostringstream text;
        text << "Current context of value " << OGL::NativeContext::currentHandle()
             << " does not share with any context used to initialize image_runtime";
        return text.str();
    }

    VideoMemory::Configuration oConfiguration_;
    std::unique_ptr<OGL::Context> pContext_;
};
ORVO_INSTANTIATE_ON_EACH_INTERFACE(LibraryContexts);

TEST_P(LibraryContexts, MakesAPoolAndAManager) {
    ORVO::Test::RecordingListener listener;
    oConfiguration_.setMaximumTexturePoolSize(100);
    oConfiguration_.setVideoMemoryListener(&listener);
    oConfiguration_.setProhibitReuseLargerTextures(true);
    AutoInitializer const runtime(pContext_.get(), oConfiguration_);
    EXPECT_TRUE(Library::isInitialized());
    EXPECT_EQ(Contexts(1, pContext_.get()), Library::initializationContextList());
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
    ASSERT_NE(nullptr, Library::texturePool());
    ASSERT_NE(nullptr, Library::shaderManager());
    EXPECT_EQ(Library::texturePool(), TexturePool::Instance());
    EXPECT_EQ(Library::shaderManager(), ShaderManagerOGL::Instance());

    // What the pool was made with.
    TexturePool& pool = *TexturePool::Instance();
    EXPECT_TRUE(pool.prohibitReuseLargerTextures());
    OGL::Texture2D* const pTexture =
        pool.getTexture2DFromPool(99, 1, OGL::Texture::INTERNAL_FORMAT_LUMINANCE8, false);
    EXPECT_EQ(99u, pTexture->width(0));
    EXPECT_EQ((ORVO::Test::Events{{"impending", 99}, {"allocated", 99}}), listener.take());
    pool.returnTexture2DToPool(pTexture);
    EXPECT_EQ(99u, TexturePoolProbe::freeListBytes(pool));
    pool.returnTexture1DToPool(pool.getTexture1DFromPool(1, OGL::Texture::INTERNAL_FORMAT_LUMINANCE8, true));
    EXPECT_EQ(0u, TexturePoolProbe::freeListBytes(pool));
}

TEST_P(LibraryContexts, AnswersTheFirstContextThatShares) {
    auto const pSecondHost = host().another(true);
    pSecondHost->makeCurrent();
    auto pSecond = OGL::Context::adoptCurrent();
    auto const pForeignHost = host().another(false);
    pForeignHost->makeCurrent();
    auto pForeign = OGL::Context::adoptCurrent();
    host().makeCurrent();
    {
        AutoInitializer const runtime(Contexts{pContext_.get(), pSecond.get(), pForeign.get()},
                                      oConfiguration_);
        EXPECT_EQ((Contexts{pContext_.get(), pSecond.get(), pForeign.get()}),
                  Library::initializationContextList());
        TexturePool* const pPool = Library::texturePool();
        ShaderManagerOGL* const pManager = Library::shaderManager();
        pSecondHost->makeCurrent();
        EXPECT_EQ(pPool, Library::texturePool());
        EXPECT_EQ(pManager, Library::shaderManager());
        pForeignHost->makeCurrent();
        EXPECT_NE(nullptr, Library::texturePool());
        EXPECT_NE(pPool, Library::texturePool());
        EXPECT_NE(nullptr, Library::shaderManager());
        EXPECT_NE(pManager, Library::shaderManager());
        EXPECT_EQ(pForeignHost->handle(), OGL::NativeContext::currentHandle());
        // A context that the library made itself is served, too.
        OGL::ContextOffscreen const offscreen(pSecond.get());
        offscreen.makeCurrent();
        EXPECT_EQ(pPool, Library::texturePool());
        host().makeCurrent();
    }
    // Each handle ends where its sync object can be deleted.
    pForeignHost->makeCurrent();
    pForeign.reset();
    pSecondHost->makeCurrent();
    pSecond.reset();
    host().makeCurrent();
}

TEST_P(LibraryContexts, RefusesAForeignContext) {
    AutoInitializer const runtime(pContext_.get(), oConfiguration_);
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    ORVO_EXPECT_INTERNAL(Library::texturePool(), foreignText());
    ORVO_EXPECT_INTERNAL(Library::shaderManager(), foreignText());
    ORVO_EXPECT_INTERNAL(TexturePool::Instance(), foreignText());
    host().makeCurrent();
}

TEST_P(LibraryContexts, RefusesWorkWithoutAContext) {
    AutoInitializer const runtime(pContext_.get(), oConfiguration_);
    host().release();
    char const* const sText = "Current context of value 0 does not share with any context used to "
                              "initialize image_runtime";
    ORVO_EXPECT_INTERNAL(Library::texturePool(), sText);
    ORVO_EXPECT_INTERNAL(Library::shaderManager(), sText);
    host().makeCurrent();
}

TEST_P(LibraryContexts, LeavesWhatIsCurrent) {
    host().release();
    {
        AutoInitializer const runtime(pContext_.get(), oConfiguration_);
        EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    }
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    {
        AutoInitializer const runtime(pContext_.get(), oConfiguration_);
        EXPECT_EQ(pForeign->handle(), OGL::NativeContext::currentHandle());
    }
    EXPECT_EQ(pForeign->handle(), OGL::NativeContext::currentHandle());
    host().makeCurrent();
}

TEST_P(LibraryContexts, GivesEverythingBack) {
    auto const before = GLHooks::objects();
    for (int i = 0; i < 3; ++i) {
        AutoInitializer const runtime(pContext_.get(), oConfiguration_);
        TexturePool& pool = *TexturePool::Instance();
        pool.returnTexture2DToPool(
            pool.getTexture2DFromPool(8, 8, OGL::Texture::INTERNAL_FORMAT_RGBA8, false));
        EXPECT_NE(before, GLHooks::objects());
    }
    EXPECT_EQ(before, GLHooks::objects());
}

TEST_P(LibraryContexts, TakesLateTexturesDownWithIt) {
    {
        AutoInitializer const runtime(pContext_.get(), oConfiguration_);
        OGL::Texture2D* const pTexture =
            TexturePool::Instance()->getTexture2DFromPool(8, 8, OGL::Texture::INTERNAL_FORMAT_RGBA8, false);
        host().release();
        TexturePool::returnTexture2DLater(pTexture);
    }
    host().makeCurrent();
}

TEST_P(LibraryContexts, HasNoPoolWhereTexturesArePowersOfTwo) {
    auto& manager = *OGL::ExtensionManager::Instance();
    manager.overrideVersion(1, 5);
    manager.overrideSupport(OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, false);
    AutoInitializer const runtime(pContext_.get(), oConfiguration_);
    EXPECT_EQ(nullptr, Library::texturePool());
    EXPECT_NE(nullptr, Library::shaderManager());
    // A record without a pool ends the search, also in a context that no record shares with.
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    EXPECT_EQ(nullptr, Library::texturePool());
    ORVO_EXPECT_INTERNAL(Library::shaderManager(), foreignText());
    host().makeCurrent();
}

TEST_P(LibraryContexts, MakesHostsContextsCurrentInOrder) {
    HostClass first(host());
    {
        AutoInitializer const runtime(Contexts{&first}, oConfiguration_);
        EXPECT_LT(0, first.nMade_);
        EXPECT_NE(nullptr, Library::texturePool());
        first.nMade_ = 0;
    }
    EXPECT_EQ(1, first.nMade_);
}

TEST_P(LibraryContexts, StaysAsItWasWhereAContextRefuses) {
    auto const before = GLHooks::objects();
    HostClass second(host());
    second.bRefuses_ = true;
    host().release();
    ORVO_EXPECT_OGL(Library::initialize(Contexts{pContext_.get(), &second}, oConfiguration_),
                    "The host refuses");
    EXPECT_FALSE(Library::isInitialized());
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    host().makeCurrent();
    EXPECT_EQ(before, GLHooks::objects());
    second.bRefuses_ = false;
    AutoInitializer const runtime(Contexts{pContext_.get(), &second}, oConfiguration_);
    EXPECT_TRUE(Library::isInitialized());
}

TEST_P(LibraryContexts, StopsAfterAContextWasLost) {
    HostClass context(host());
    Library::initialize(&context, oConfiguration_);
    context.bRefuses_ = true;
    EXPECT_NO_THROW(Library::terminate());
    EXPECT_FALSE(Library::isInitialized());
}

TEST_P(LibraryContexts, StopsAfterTheHostDestroyedItsContext) {
    Library::initialize(pContext_.get(), oConfiguration_);
    TexturePool& pool = *TexturePool::Instance();
    pool.returnTexture2DToPool(pool.getTexture2DFromPool(8, 8, OGL::Texture::INTERNAL_FORMAT_RGBA8, false));
    host().destroyContext();
    EXPECT_THROW(Library::texturePool(), InternalException);
    EXPECT_NO_THROW(Library::terminate());
    EXPECT_FALSE(Library::isInitialized());
    pContext_.reset();
    GLHooks::forgetObjects();
    loseHost();
}

/// A class of the host's that does nothing when it is made current.
class IdleContext : public OGL::Context {
public:
    void makeCurrent() const override {}
    bool isSharingWithCurrentContext() const override { return false; }
};

TEST_P(LibraryContexts, RefusesAContextThatIsNotMadeCurrent) {
    IdleContext const idle;
    host().release();
    ORVO_EXPECT_INTERNAL(Library::initialize(&idle, oConfiguration_), "Enforce gc != NULL");
    EXPECT_FALSE(Library::isInitialized());
    host().makeCurrent();
}

TEST_P(LibraryContexts, SurvivesEveryFailureOfTheDriver) {
    auto const code = [this] { Library::initialize(pContext_.get(), oConfiguration_); };
    auto const end = [this] {
        drainErrors();
        host().makeCurrent();
        Library::terminate();
        EXPECT_FALSE(Library::isInitialized());
    };
    // A refusal to go back to the caller's context has nobody to tell.
    std::set<std::string> const aFailed =
        ORVO::Test::failEveryCallBefore(code, end, {"eglMakeCurrent", "glXMakeContextCurrent"});
    EXPECT_EQ(1u, aFailed.count("glGenFramebuffers"));
    EXPECT_EQ(1u, aFailed.count("eglCreateContext") + aFailed.count("glXCreateNewContext"));
}

} // namespace
} // namespace ORVO::ImageRuntime
