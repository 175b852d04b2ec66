#include "orvo/ogl/ScopedContextWrapper.h"

#include <memory>
#include <type_traits>

#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/NativeContext.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using OGL::NativeContext;

static_assert(std::has_virtual_destructor_v<OGL::ScopedContextWrapper>);
static_assert(!std::is_copy_constructible_v<OGL::ScopedContextWrapper>);

class ScopedContextWrapper : public ORVO::Test::GLTestOnEachInterface {};

TEST_P(ScopedContextWrapper, BringsTheContextBack) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    NativeContext const before = NativeContext::current();
    {
        OGL::ScopedContextWrapper const restore;
        offscreen.makeCurrent();
        EXPECT_NE(before, NativeContext::current());
    }
    EXPECT_EQ(before, NativeContext::current());
    {
        OGL::ScopedContextWrapper const restore;
        host().release();
    }
    EXPECT_EQ(before, NativeContext::current());
}

TEST_P(ScopedContextWrapper, LeavesNoneWhereNoneWas) {
    auto const pHost = OGL::Context::adoptCurrent();
    host().release();
    {
        OGL::ScopedContextWrapper const restore;
        pHost->makeCurrent();
    }
    EXPECT_EQ(nullptr, NativeContext::currentHandle());
}

TEST_P(ScopedContextWrapper, RestoresWhenAnExceptionPasses) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    NativeContext const before = NativeContext::current();
    EXPECT_THROW(
        {
            OGL::ScopedContextWrapper const restore;
            offscreen.makeCurrent();
            throw 1;
        },
        int);
    EXPECT_EQ(before, NativeContext::current());
}

TEST_P(ScopedContextWrapper, LetsNothingOutWhenTheContextHasDied) {
    auto const pOther = host().another(false);
    pOther->makeCurrent();
    auto const pOffscreen = OGL::ContextOffscreen::createHeadless();
    {
        OGL::ScopedContextWrapper const restore;
        pOther->destroyContext();
    }
    EXPECT_NE(host().handle(), NativeContext::currentHandle());
}

TEST_P(ScopedContextWrapper, BringsTheContextBackBeforeItsEnd) {
    auto const pHost = OGL::Context::adoptCurrent();
    OGL::ContextOffscreen const offscreen(pHost.get());
    NativeContext const before = NativeContext::current();
    OGL::ScopedContextWrapper wrapper;
    offscreen.makeCurrent();
    wrapper.restore();
    EXPECT_EQ(before, NativeContext::current());
}

ORVO_INSTANTIATE_ON_EACH_INTERFACE(ScopedContextWrapper);

class ScopedContextWrapperRefused : public ORVO::Test::GLTest {
protected:
    void SetUp() override {
        GLTest::SetUp();
        pHost_ = OGL::Context::adoptCurrent();
        pOffscreen_ = std::make_unique<OGL::ContextOffscreen>(pHost_.get());
    }

    void TearDown() override {
        host().makeCurrent();
        pOffscreen_.reset();
        pHost_.reset();
        GLTest::TearDown();
    }

    std::unique_ptr<OGL::Context> pHost_;
    std::unique_ptr<OGL::ContextOffscreen> pOffscreen_;
};

TEST_F(ScopedContextWrapperRefused, LeavesNoneCurrentAtItsEnd) {
    auto pWrapper = std::make_unique<OGL::ScopedContextWrapper>();
    pOffscreen_->makeCurrent();
    {
        ORVO::Test::GLCallFailure const failure("eglMakeCurrent", 1);
        pWrapper.reset();
        EXPECT_TRUE(failure.hasFired());
    }
    EXPECT_EQ(nullptr, NativeContext::currentHandle());
}

TEST_F(ScopedContextWrapperRefused, SaysSoWhenItIsAskedToRestore) {
    {
        OGL::ScopedContextWrapper wrapper;
        pOffscreen_->makeCurrent();
        {
            ORVO::Test::GLCallFailure const failure("eglMakeCurrent", 1);
            ORVO_EXPECT_OGL(wrapper.restore(), "The OpenGL context could not be made current");
        }
        EXPECT_NE(host().handle(), NativeContext::currentHandle());
    }
    EXPECT_EQ(host().handle(), NativeContext::currentHandle()) << "the end tries once more";
}

TEST(NativeContext, IsEmptyWhereNoneIsCurrent) {
    NativeContext const none = NativeContext::current();
    EXPECT_EQ(NativeContext(), none);
    EXPECT_EQ(nullptr, NativeContext::currentHandle());
    none.makeCurrent();
    EXPECT_EQ(NativeContext(), NativeContext::current());
}

TEST(NativeContext, ComparesContextsAndSurfaces) {
    int aContexts[2] = {};
    NativeContext const a{OGL::ContextAPI::egl, nullptr, &aContexts[0], 1, 2};
    NativeContext b = a;
    EXPECT_EQ(a, b);
    b.nRead_ = 3;
    EXPECT_NE(a, b);
    EXPECT_TRUE(a.isSameContext(b));
    b = a;
    b.eAPI_ = OGL::ContextAPI::glx;
    EXPECT_FALSE(a.isSameContext(b));
    b = a;
    b.pContext_ = &aContexts[1];
    EXPECT_FALSE(a.isSameContext(b));
}

} // namespace
