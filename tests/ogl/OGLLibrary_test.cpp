#include "orvo/ogl/OGLLibrary.h"

#include "tests/support/CoreLayer.h"
#include "tests/support/Expect.h"

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

} // namespace
