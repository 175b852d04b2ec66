#include "orvo/ogl/ContextOffscreen.h"

#include <epoxy/gl.h>

#include <array>
#include <thread>

#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "orvo/ogl/Texture2D.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;

/// A host's own class of context, which the library knows nothing of.
class ForeignContext final : public OGL::Context {
public:
    explicit ForeignContext(ORVO::Test::HostContext& host) : oHost_(host) {}
    void makeCurrent() const override { oHost_.makeCurrent(); }
    bool isSharingWithCurrentContext() const override { return false; }

private:
    ORVO::Test::HostContext& oHost_;
};

class ContextOffscreen : public ORVO::Test::GLTestOnEachInterface {};

TEST_P(ContextOffscreen, SharesWithTheHostsContextAndLeavesItCurrent) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
    EXPECT_TRUE(offscreen.isSharingWithCurrentContext());
    offscreen.makeCurrent();
    EXPECT_NE(host().handle(), OGL::NativeContext::currentHandle());
    EXPECT_TRUE(pHost->isSharingWithCurrentContext());
    EXPECT_TRUE(offscreen.isSharingWithCurrentContext());
}

TEST_P(ContextOffscreen, SeesTheHostsTextures) {
    auto const pHost = OGL::Context::adoptCurrent();
    std::array<unsigned char, 4> aPixel{1, 2, 3, 4};
    OGL::Texture2D const texture(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, aPixel.data());
    OGL::ContextOffscreen const offscreen(pHost.get());
    offscreen.makeCurrent();
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    std::array<unsigned char, 4> aRead{};
    texture.getPixelData(aRead.data(), 0, OGL::Texture::FORMAT_RGBA, OGL::Texture::TYPE_UNSIGNED_BYTE, 1);
    EXPECT_EQ(aPixel, aRead);
    glBindTexture(GL_TEXTURE_2D, 0);
    pHost->makeCurrent();
}

TEST_P(ContextOffscreen, SharesWithAnotherOffscreenContext) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const first(pHost.get());
    host().release();
    OGL::ContextOffscreen const second(&first);
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    second.makeCurrent();
    EXPECT_TRUE(first.isSharingWithCurrentContext());
    EXPECT_TRUE(pHost->isSharingWithCurrentContext());
}

TEST_P(ContextOffscreen, SharesWithAContextOfTheHostsOwnClass) {
    ForeignContext const foreign(host());
    host().release();
    OGL::ContextOffscreen const offscreen(&foreign);
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    host().makeCurrent();
    EXPECT_TRUE(offscreen.isSharingWithCurrentContext());
}

TEST_P(ContextOffscreen, RefusesNoContext) {
    ORVO_EXPECT_INTERNAL(OGL::ContextOffscreen(nullptr), "Enforce pShareWith != NULL");
}

TEST_P(ContextOffscreen, RefusesAContextThatDoesNotBecomeCurrent) {
    struct Idle final : OGL::Context {
        void makeCurrent() const override {}
        bool isSharingWithCurrentContext() const override { return false; }
    };
    host().release();
    Idle const idle;
    ORVO_EXPECT_OGL(OGL::ContextOffscreen const offscreen(&idle), "No OpenGL context is current");
}

TEST_P(ContextOffscreen, DoesNotClampColours) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    offscreen.makeCurrent();
    GLint nValue = -1;
    glGetIntegerv(GL_CLAMP_VERTEX_COLOR, &nValue);
    EXPECT_EQ(GL_FALSE, nValue);
    glGetIntegerv(GL_CLAMP_FRAGMENT_COLOR, &nValue);
    EXPECT_EQ(GL_FIXED_ONLY, nValue);
    glGetIntegerv(GL_CLAMP_READ_COLOR, &nValue);
    EXPECT_EQ(GL_FIXED_ONLY, nValue);
    EXPECT_EQ(0U, drainErrors());
}

TEST_P(ContextOffscreen, LeavesNoneCurrentWhereItDiesCurrent) {
    auto const pHost = OGL::Context::adoptCurrent();
    {
        OGL::ContextOffscreen const offscreen(pHost.get());
        offscreen.makeCurrent();
    }
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
}

TEST_P(ContextOffscreen, DiesWithAnotherContextCurrent) {
    auto const pHost = OGL::Context::adoptCurrent();
    { OGL::ContextOffscreen const offscreen(pHost.get()); }
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
    {
        OGL::ContextOffscreen const offscreen(pHost.get());
        host().release();
    }
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
}

TEST_P(ContextOffscreen, IsMadeCurrentOnAnotherThread) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    bool bShares = false;
    std::string sVersion;
    std::thread([&] {
        OGL::ScopedContextWrapper const restore;
        offscreen.makeCurrent();
        bShares = pHost->isSharingWithCurrentContext();
        sVersion = reinterpret_cast<char const*>(glGetString(GL_VERSION));
    }).join();
    EXPECT_TRUE(bShares);
    EXPECT_EQ(reinterpret_cast<char const*>(glGetString(GL_VERSION)), sVersion);
}

TEST_P(ContextOffscreen, IsNotMadeWhereACallFails) {
    auto const pHost = OGL::Context::adoptCurrent();
    ORVO::Test::ObjectCounts const before = ORVO::Test::GLHooks::objects();
    std::uint64_t n = 1;
    for (;; ++n) {
        ORVO::Test::GLCallFailure const failure(n);
        bool bThrown = false;
        try {
            OGL::ContextOffscreen const offscreen(pHost.get());
        } catch (OGL::ExceptionOGL const&) {
            bThrown = true;
        }
        if (!failure.hasFired())
            break;
        // What fails only once the context exists may be made good by its end.
        EXPECT_TRUE(bThrown || n > 2) << failure.name();
        EXPECT_EQ(before, ORVO::Test::GLHooks::objects()) << failure.name();
        drainErrors();
        host().makeCurrent();
    }
    EXPECT_GT(n, 3U);
}

TEST_P(ContextOffscreen, ThrowsWhereItCannotBeMadeCurrent) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    ORVO::Test::GLCallFailure const failure(
        GetParam() == std::string("EGL") ? "eglMakeCurrent" : "glXMakeContextCurrent", 1);
    ORVO_EXPECT_OGL(offscreen.makeCurrent(), "The OpenGL context could not be made current");
    EXPECT_EQ(host().handle(), OGL::NativeContext::currentHandle());
}

ORVO_INSTANTIATE_ON_EACH_INTERFACE(ContextOffscreen);

class ContextHeadless : public ORVO::Test::GLTest {};

TEST_F(ContextHeadless, IsMadeFromNothing) {
    host().release();
    auto const pContext = OGL::ContextOffscreen::createHeadless();
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    EXPECT_FALSE(pContext->isSharingWithCurrentContext());
    pContext->makeCurrent();
    EXPECT_TRUE(pContext->isSharingWithCurrentContext());
    EXPECT_NE(nullptr, glGetString(GL_VERSION));
}

TEST_F(ContextHeadless, SharesWithNoOther) {
    auto const pFirst = OGL::ContextOffscreen::createHeadless();
    auto const pSecond = OGL::ContextOffscreen::createHeadless();
    auto const pHost = OGL::Context::adoptCurrent();
    EXPECT_FALSE(pFirst->isSharingWithCurrentContext());
    pSecond->makeCurrent();
    EXPECT_FALSE(pFirst->isSharingWithCurrentContext());
    EXPECT_FALSE(pHost->isSharingWithCurrentContext());
}

TEST_F(ContextHeadless, IsNotMadeWhereTheDriverRefuses) {
    ORVO::Test::GLCallFailure const failure("eglCreateContext", 1);
    ORVO_EXPECT_OGL(OGL::ContextOffscreen::createHeadless(), "The OpenGL context could not be created");
}

} // namespace
