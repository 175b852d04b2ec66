#include "orvo/ogl/Context.h"

#include <epoxy/gl.h>

#include <memory>
#include <type_traits>

#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/NativeContext.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;

TEST(Context, IsAnAbstractHandle) {
    static_assert(std::is_abstract_v<OGL::Context>);
    static_assert(std::has_virtual_destructor_v<OGL::Context>);
    static_assert(!std::is_copy_constructible_v<OGL::Context>);
}

TEST(Context, IsImplementedAndDestroyedThroughItsBase) {
    static bool bDestroyed = false;
    struct HostContext : OGL::Context {
        explicit HostContext(int& nCurrent) : nCurrent_(nCurrent) {}
        ~HostContext() override { bDestroyed = true; }
        void makeCurrent() const override { ++nCurrent_; }
        bool isSharingWithCurrentContext() const override { return nCurrent_ > 0; }
        int& nCurrent_;
    };
    int nCurrent = 0;
    {
        std::unique_ptr<OGL::Context const> const pContext = std::make_unique<HostContext>(nCurrent);
        EXPECT_FALSE(pContext->isSharingWithCurrentContext());
        pContext->makeCurrent();
        EXPECT_TRUE(pContext->isSharingWithCurrentContext());
    }
    EXPECT_TRUE(bDestroyed);
}

TEST(Context, IsNotAdoptedWhereNoneIsCurrent) {
    ORVO_EXPECT_OGL(OGL::Context::adoptCurrent(), "No OpenGL context is current");
}

class AdoptedContext : public ORVO::Test::GLTestOnEachInterface {};

TEST_P(AdoptedContext, IsTheHosts) {
    auto const pContext = OGL::Context::adoptCurrent();
    EXPECT_TRUE(pContext->isSharingWithCurrentContext());
    host().release();
    EXPECT_FALSE(pContext->isSharingWithCurrentContext());
    pContext->makeCurrent();
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
    EXPECT_TRUE(pContext->isSharingWithCurrentContext());
}

TEST_P(AdoptedContext, TellsSharingContextsFromOthers) {
    auto const pContext = OGL::Context::adoptCurrent();
    auto const pSharing = host().another(true);
    auto const pForeign = host().another(false);
    pSharing->makeCurrent();
    EXPECT_TRUE(pContext->isSharingWithCurrentContext());
    pForeign->makeCurrent();
    EXPECT_FALSE(pContext->isSharingWithCurrentContext());
    // Names of objects agree between unrelated contexts: the answer does not rest on them.
    GLuint nTexture = 0;
    glGenTextures(1, &nTexture);
    EXPECT_FALSE(pContext->isSharingWithCurrentContext());
    glDeleteTextures(1, &nTexture);
}

TEST_P(AdoptedContext, TakesItsSyncObjectBackFromWhereverItDies) {
    ORVO::Test::ObjectCounts const before = ORVO::Test::GLHooks::objects();
    { auto const pContext = OGL::Context::adoptCurrent(); }
    EXPECT_EQ(before, ORVO::Test::GLHooks::objects());

    auto pContext = OGL::Context::adoptCurrent();
    host().release();
    pContext.reset();
    EXPECT_EQ(before, ORVO::Test::GLHooks::objects());
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());

    host().makeCurrent();
    pContext = OGL::Context::adoptCurrent();
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    pContext.reset();
    EXPECT_EQ(pForeign->handle(), OGL::NativeContext::currentHandle());
    pForeign->destroyContext();
    EXPECT_EQ(before, ORVO::Test::GLHooks::objects());
}

TEST_P(AdoptedContext, IsAdoptedTwice) {
    auto const pFirst = OGL::Context::adoptCurrent();
    auto pSecond = OGL::Context::adoptCurrent();
    pSecond.reset();
    EXPECT_TRUE(pFirst->isSharingWithCurrentContext());
}

TEST_P(AdoptedContext, IsNotAdoptedWithoutItsSyncObject) {
    ORVO::Test::GLCallFailure const failure("glFenceSync", 1);
    ORVO_EXPECT_OGL(OGL::Context::adoptCurrent(), "The context's sync object could not be created");
    drainErrors();
}

TEST_P(AdoptedContext, SurvivesTheEndOfTheHostsContext) {
    auto pContext = OGL::Context::adoptCurrent();
    host().destroyContext();
    EXPECT_FALSE(pContext->isSharingWithCurrentContext());
    EXPECT_THROW(pContext->makeCurrent(), OGL::ExceptionOGL);
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    pContext.reset();
    loseHost();
    ORVO::Test::GLHooks::forgetObjects();
}

ORVO_INSTANTIATE_ON_EACH_INTERFACE(AdoptedContext);

class EGLContext : public ORVO::Test::GLTest {};

TEST_F(EGLContext, IsRefusedWithEGLsReasonOnceItHasDied) {
    auto const pOther = host().another(false);
    pOther->makeCurrent();
    auto pContext = OGL::Context::adoptCurrent();
    pOther->destroyContext();
    host().makeCurrent();
    ORVO_EXPECT_OGL(pContext->makeCurrent(),
                    "The OpenGL context could not be made current (EGL_BAD_CONTEXT)");
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
    ORVO_EXPECT_OGL(OGL::ContextOffscreen(pContext.get()),
                    "The OpenGL context could not be created (EGL_BAD_CONTEXT)");
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
    // Its sync object died with it.
    pContext.reset();
    loseHost();
    ORVO::Test::GLHooks::forgetObjects();
}

class BothInterfaces : public ORVO::Test::GLTest {
protected:
    void SetUp() override {
        GLTest::SetUp();
        pGLX_ = ORVO::Test::HostContext::createGLX();
    }
    void TearDown() override {
        pGLX_.reset();
        GLTest::TearDown();
    }
    ORVO::Test::HostContext& glx() { return *pGLX_; }

private:
    std::unique_ptr<ORVO::Test::HostContext> pGLX_;
};

TEST_F(BothInterfaces, NeverShare) {
    auto const pEGL = OGL::Context::adoptCurrent();
    host().release();
    glx().makeCurrent();
    EXPECT_EQ(OGL::ContextAPI::glx, OGL::NativeContext::current().eAPI_);
    EXPECT_FALSE(pEGL->isSharingWithCurrentContext());
    auto const pGLX = OGL::Context::adoptCurrent();
    glx().release();
    host().makeCurrent();
    EXPECT_EQ(OGL::ContextAPI::egl, OGL::NativeContext::current().eAPI_);
    EXPECT_FALSE(pGLX->isSharingWithCurrentContext());
}

TEST_F(BothInterfaces, ReleaseEachOther) {
    auto const pEGL = OGL::Context::adoptCurrent();
    host().release();
    glx().makeCurrent();
    auto const pGLX = OGL::Context::adoptCurrent();
    pEGL->makeCurrent();
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
    pGLX->makeCurrent();
    EXPECT_EQ(glx().handle(), OGL::NativeContext::currentHandle());
    OGL::ContextOffscreen const offscreen(pEGL.get());
    EXPECT_EQ(glx().handle(), OGL::NativeContext::currentHandle());
    pEGL->makeCurrent();
    EXPECT_TRUE(offscreen.isSharingWithCurrentContext());
}

TEST_F(BothInterfaces, ComeBackWhereTheOtherRefuses) {
    auto const pEGL = OGL::Context::adoptCurrent();
    host().release();
    glx().makeCurrent();
    auto pGLX = OGL::Context::adoptCurrent();
    {
        ORVO::Test::GLCallFailure const failure("eglMakeCurrent", 1);
        ORVO_EXPECT_OGL(pEGL->makeCurrent(), "The OpenGL context could not be made current");
        EXPECT_TRUE(failure.hasFired());
    }
    EXPECT_EQ(glx().handle(), OGL::NativeContext::currentHandle());
    pGLX.reset();
    glx().release();
}

} // namespace
