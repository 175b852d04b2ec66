// Fences: commands of one context that others wait for.
#include "orvo/ogl/Fence.h"

#include <epoxy/gl.h>

#include <optional>

#include "orvo/core/exceptions/ExceptionBase.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using ORVO::Test::GLHooks;

class FenceTest : public ORVO::Test::GLTest {};

TEST_F(FenceTest, MakesAPointAndSendsItToTheDriver) {
    auto const nFences = GLHooks::calls("glFenceSync");
    OGL::Fence const fence;
    EXPECT_EQ(nFences + 1, GLHooks::calls("glFenceSync"));
    fence.wait();
    EXPECT_EQ(0U, drainErrors());
}

TEST_F(FenceTest, IsWaitedForInAnotherContextOfTheGroup) {
    auto const pOther = host().another(true);
    OGL::Fence const fence;
    pOther->makeCurrent();
    fence.wait();
    EXPECT_EQ(0U, drainErrors());
    host().makeCurrent();
}

TEST_F(FenceTest, IsPassedOverInAForeignContextAndInNone) {
    auto const pForeign = host().another(false);
    OGL::Fence const fence;
    pForeign->makeCurrent();
    fence.wait();
    EXPECT_EQ(0U, drainErrors());
    host().release();
    fence.wait();
    OGL::finishCurrentContext();
    host().makeCurrent();
}

TEST_F(FenceTest, MayDieInAnotherContextOfTheGroup) {
    std::optional<OGL::Fence> oFence(std::in_place);
    auto const nDeleted = GLHooks::calls("glDeleteSync");
    auto const pOther = host().another(true);
    pOther->makeCurrent();
    oFence.reset();
    EXPECT_EQ(nDeleted + 1, GLHooks::calls("glDeleteSync"));
    host().makeCurrent();
}

TEST_F(FenceTest, NeedsAContext) {
    host().release();
    ORVO_EXPECT_OGL(OGL::Fence(), "No OpenGL context is current");
    host().makeCurrent();
}

} // namespace
