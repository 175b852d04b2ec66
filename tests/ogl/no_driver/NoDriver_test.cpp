// Runs where no OpenGL driver can be found and there is no display: hosts that work on the CPU alone.
#include <dlfcn.h>

#include "orvo/ogl/OGL.h"
#include "tests/support/CoreLayer.h"
#include "tests/support/gl/ExpectOGL.h"

namespace {

using namespace ORVO;

constexpr char const* pNone = "No OpenGL context is current";

struct OGLLayer : ORVO::Test::CoreLayer {
    OGL::AutoInitializer oOGL_;
};

TEST(NoDriver, StartsAndStops) {
    OGLLayer const layers;
    EXPECT_TRUE(OGL::Library::isInitialized());
    // Nothing of OpenGL is loaded for it.
    EXPECT_EQ(nullptr, dlopen("libEGL.so.1", RTLD_LAZY | RTLD_NOLOAD));
    EXPECT_EQ(nullptr, dlopen("libGL.so.1", RTLD_LAZY | RTLD_NOLOAD));
    EXPECT_EQ(nullptr, dlopen("libX11.so.6", RTLD_LAZY | RTLD_NOLOAD));
}

TEST(NoDriver, HasNoContext) {
    OGLLayer const layers;
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
    EXPECT_EQ(OGL::NativeContext(), OGL::NativeContext::current());
    OGL::NativeContext().makeCurrent();
    { OGL::ScopedContextWrapper const restore; }
    ORVO_EXPECT_OGL(OGL::Context::adoptCurrent(), pNone);
}

TEST(NoDriver, RefusesWhatNeedsAContext) {
    OGLLayer const layers;
    ORVO_EXPECT_OGL(OGL::Texture2D(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, nullptr), pNone);
    ORVO_EXPECT_OGL(OGL::Buffer(1, OGL::Buffer::TYPE_ARRAY, OGL::Buffer::USAGE_STATIC_DRAW, nullptr), pNone);
    ORVO_EXPECT_OGL(OGL::Framebuffer(), pNone);
    ORVO_EXPECT_OGL(OGL::Program(), pNone);
    ORVO_EXPECT_OGL(OGL::TextureState::activeTextureUnit(), pNone);
    ORVO_EXPECT_OGL(OGL::TextureUnit::Unit(0).enable2D(), pNone);
    ORVO_EXPECT_OGL(OGL::ExtensionManager::Instance()->majorVersion(), pNone);
    ORVO_EXPECT_OGL(OGL::ExtensionManager::Instance()->supportsTexture3D(), pNone);
}

TEST(NoDriver, AnswersWhatNeedsNone) {
    EXPECT_EQ(0x8058U, OGL::Texture::InternalFormat2GL(OGL::Texture::INTERNAL_FORMAT_RGBA8));
    EXPECT_STREQ("GL_RGBA8", OGL::TokenName(0x8058));
    EXPECT_NE(nullptr, OGL::ExtensionManager::Instance()->table());
    OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_EXT_TEXTURE3D, true);
    EXPECT_TRUE(OGL::ExtensionManager::Instance()->supportsTexture3D());
    OGL::ExtensionManager::Instance()->clearOverrides();
}

// The last one: it loads EGL, which then stays.
TEST(NoDriver, WithoutOneThereIsNoHeadlessContext) {
    OGLLayer const layers;
    ORVO_EXPECT_OGL(OGL::ContextOffscreen::createHeadless(), "No OpenGL driver is available");
    ORVO_EXPECT_OGL(OGL::ContextOffscreen::createHeadless(), "No OpenGL driver is available");
    EXPECT_EQ(nullptr, OGL::NativeContext::currentHandle());
}

} // namespace
