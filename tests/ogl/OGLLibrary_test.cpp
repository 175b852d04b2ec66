#include "orvo/ogl/OGLLibrary.h"

#include <epoxy/gl.h>

#include "orvo/ogl/Texture2D.h"
#include "tests/support/CoreLayer.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;

TEST(OGLLibrary, DemandsTheBaseLibrary) {
    ASSERT_FALSE(Core::Library::isInitialized());
    ORVO_EXPECT_INTERNAL(OGL::Library::initialize(), "Core::Library::isInitialized()");
    EXPECT_FALSE(OGL::Library::isInitialized());
    ORVO_EXPECT_INTERNAL(OGL::Library::terminate(), "Core::Library::isInitialized()");
}

TEST(OGLLibrary, StartsAndStopsWithoutAContext) {
    ORVO::Test::CoreLayer const core;
    EXPECT_FALSE(OGL::Library::isInitialized());
    OGL::Library::initialize();
    EXPECT_TRUE(OGL::Library::isInitialized());
    OGL::Library::terminate();
    EXPECT_FALSE(OGL::Library::isInitialized());
}

TEST(OGLLibrary, RefusesASecondStartAndASecondStop) {
    ORVO::Test::CoreLayer const core;
    OGL::Library::initialize();
    ORVO_EXPECT_INTERNAL(OGL::Library::initialize(), "!isInitialized()");
    EXPECT_TRUE(OGL::Library::isInitialized());
    OGL::Library::terminate();
    ORVO_EXPECT_INTERNAL(OGL::Library::terminate(), "isInitialized()");
}

TEST(OGLAutoInitializer, KeepsTheLayerUpForItsScope) {
    ORVO::Test::CoreLayer const core;
    {
        OGL::AutoInitializer const ogl;
        EXPECT_TRUE(OGL::Library::isInitialized());
    }
    EXPECT_FALSE(OGL::Library::isInitialized());
}

TEST(OGLAutoInitializer, LeavesTheLayerUpAfterRelease) {
    ORVO::Test::CoreLayer const core;
    {
        OGL::AutoInitializer ogl;
        ogl.release();
    }
    EXPECT_TRUE(OGL::Library::isInitialized());
    OGL::Library::terminate();
}

TEST(OGLAutoInitializer, SwallowsAFailureToStop) {
    ORVO::Test::CoreLayer const core;
    {
        OGL::AutoInitializer const ogl;
        OGL::Library::terminate();
    }
    EXPECT_FALSE(OGL::Library::isInitialized());
}

TEST(OGLAutoInitializer, PassesAFailureToStartOn) {
    ORVO_EXPECT_INTERNAL(OGL::AutoInitializer(), "Core::Library::isInitialized()");
}

class AbsentEntryPoint : public ORVO::Test::GLTest {};

TEST_F(AbsentEntryPoint, DoesNothingAndIsReportedByTheNextCheck) {
    ASSERT_FALSE(epoxy_has_gl_extension("GL_APPLE_fence"));
    glFinishObjectAPPLE(GL_TEXTURE, 1);
    ORVO_EXPECT_OGL(OGL::Texture2D(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, nullptr),
                    "The texture could not be allocated (no entry point glFinishObjectAPPLE)");
    OGL::Texture2D const texture(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, nullptr);
    EXPECT_NE(0U, texture.objectID());
}

epoxy_resolver_failure_handler_t ownHandler() {
    return [](char const*) -> void (*)() { return nullptr; };
}

TEST(OGLLibrary, GivesTheLoadersFailureHandlerBack) {
    ORVO::Test::CoreLayer const core;
    auto const handler = ownHandler();
    auto const former = epoxy_set_resolver_failure_handler(handler);
    OGL::Library::initialize();
    OGL::Library::terminate();
    EXPECT_EQ(handler, epoxy_set_resolver_failure_handler(former));
}

} // namespace
