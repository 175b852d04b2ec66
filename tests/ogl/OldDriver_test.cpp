// A driver of OpenGL 1.5, played by replaced texts: without sync objects, shaders and pixel buffers.
#include <epoxy/gl.h>

#include <array>
#include <memory>
#include <string>

#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureRECT.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;

std::string sVersion;
std::string sExtensions;
decltype(epoxy_glGetString) pDriverGetString = nullptr;

GLubyte const* getString(GLenum name) {
    if (name == GL_VERSION)
        return reinterpret_cast<GLubyte const*>(sVersion.c_str());
    if (name == GL_EXTENSIONS)
        return reinterpret_cast<GLubyte const*>(sExtensions.c_str());
    return pDriverGetString(name);
}

class OldDriver : public ORVO::Test::GLTest {
protected:
    void SetUp() override {
        GLTest::SetUp();
        pDriverGetString = epoxy_glGetString;
        become("1.5 played", "");
    }
    void TearDown() override {
        epoxy_glGetString = pDriverGetString;
        GLTest::TearDown();
    }

    /// Answers are kept for each driver: each version is another one.
    static void become(char const* pVersion, char const* pExtensions) {
        sVersion = pVersion;
        sExtensions = pExtensions;
        epoxy_glGetString = &getString;
    }
};

TEST_F(OldDriver, HasWhatItsVersionContains) {
    OGL::ExtensionManager const& manager = *OGL::ExtensionManager::Instance();
    EXPECT_EQ(1U, manager.majorVersion());
    EXPECT_EQ(5U, manager.minorVersion());
    EXPECT_TRUE(manager.supportsTexture3D());
    EXPECT_TRUE(manager.supportsClampToEdge());
    EXPECT_FALSE(manager.supportsNonPowerOfTwoTextures());
    EXPECT_FALSE(manager.supportsFloatingPointTextures());
    EXPECT_FALSE(manager.supports16BitFloat());
    EXPECT_FALSE(OGL::TextureRECT::isSupported());
    EXPECT_FALSE(OGL::Program::isSupported());
    for (int const nExtension : {6, 36, 45, 63, 123, 127, 141, 228})
        EXPECT_FALSE(manager.isSupported(static_cast<OGL::teExtension>(nExtension))) << nExtension;
    GLint nUnits = 0;
    glGetIntegerv(GL_MAX_TEXTURE_UNITS, &nUnits);
    EXPECT_EQ(static_cast<unsigned>(nUnits), manager.numberOfTextureUnits());
}

TEST_F(OldDriver, HasWhatItNames) {
    struct Row {
        OGL::teExtension eExtension;
        char const* pName;
    };
    constexpr Row aRows[] = {
        {OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT, "GL_ARB_pixel_buffer_object"},
        {OGL::EXTENSION_ARB_TEXTURE_FLOAT, "GL_ARB_texture_float"},
        {OGL::EXTENSION_ATI_TEXTURE_FLOAT, "GL_ATI_texture_float"},
        {OGL::EXTENSION_ARB_HALF_FLOAT_PIXEL, "GL_ARB_half_float_pixel"},
        {OGL::EXTENSION_EXT_FRAMEBUFFER_OBJECT, "GL_EXT_framebuffer_object"},
        {OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT, "GL_EXT_pixel_buffer_object"},
        {OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT, "GL_ARB_framebuffer_object"},
        {OGL::EXTENSION_APPLE_FLOAT_PIXELS, "GL_APPLE_float_pixels"},
        {OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, "GL_ARB_texture_non_power_of_two"},
        {OGL::EXTENSION_ARB_TEXTURE_RECTANGLE, "GL_ARB_texture_rectangle"},
        {OGL::EXTENSION_EXT_TEXTURE3D, "GL_EXT_texture3D"},
        {OGL::EXTENSION_SGIS_TEXTURE_EDGE_CLAMP, "GL_SGIS_texture_edge_clamp"},
        {OGL::EXTENSION_ARB_SHADER_OBJECTS, "GL_ARB_shader_objects"},
        {OGL::EXTENSION_APPLE_FENCE, "GL_APPLE_fence"},
    };
    OGL::ExtensionManager const& manager = *OGL::ExtensionManager::Instance();
    for (Row const& row : aRows) {
        become((std::string("1.1 with ") + row.pName).c_str(), row.pName);
        for (Row const& other : aRows)
            EXPECT_EQ(&row == &other, manager.isSupported(other.eExtension))
                << row.pName << ' ' << other.pName;
    }
}

TEST_F(OldDriver, GainsFeaturesWithCoreVersions) {
    struct Row {
        OGL::teExtension eExtension;
        unsigned nMajor, nMinor;
    };
    constexpr Row aRows[] = {
        {OGL::EXTENSION_EXT_TEXTURE3D, 1, 2},
        {OGL::EXTENSION_SGIS_TEXTURE_EDGE_CLAMP, 1, 2},
        {OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, 2, 0},
        {OGL::EXTENSION_ARB_SHADER_OBJECTS, 2, 0},
        {OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT, 2, 1},
        {OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT, 2, 1},
        {OGL::EXTENSION_ARB_TEXTURE_FLOAT, 3, 0},
        {OGL::EXTENSION_ATI_TEXTURE_FLOAT, 3, 0},
        {OGL::EXTENSION_APPLE_FLOAT_PIXELS, 3, 0},
        {OGL::EXTENSION_ARB_HALF_FLOAT_PIXEL, 3, 0},
        {OGL::EXTENSION_EXT_FRAMEBUFFER_OBJECT, 3, 0},
        {OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT, 3, 0},
        {OGL::EXTENSION_ARB_TEXTURE_RECTANGLE, 3, 1},
    };
    OGL::ExtensionManager& manager = *OGL::ExtensionManager::Instance();
    become("1.1 played", "");
    constexpr unsigned aVersions[] = {11, 12, 13, 14, 15, 20, 21, 30, 31, 32, 46};
    for (unsigned const nVersion : aVersions) {
        manager.overrideVersion(nVersion / 10, nVersion % 10);
        for (Row const& row : aRows)
            EXPECT_EQ(nVersion >= row.nMajor * 10 + row.nMinor, manager.isSupported(row.eExtension))
                << nVersion << ' ' << row.eExtension;
        EXPECT_FALSE(manager.isSupported(OGL::EXTENSION_APPLE_FENCE));
    }
}

TEST_F(OldDriver, KnowsOnlyTheContextItselfWithoutSyncObjects) {
    auto const pContext = OGL::Context::adoptCurrent();
    EXPECT_EQ(0, ORVO::Test::GLHooks::objects()["sync"]);
    EXPECT_TRUE(pContext->isSharingWithCurrentContext());
    OGL::ContextOffscreen const offscreen(pContext.get());
    EXPECT_FALSE(offscreen.isSharingWithCurrentContext());
    offscreen.makeCurrent();
    EXPECT_TRUE(offscreen.isSharingWithCurrentContext());
    EXPECT_FALSE(pContext->isSharingWithCurrentContext());
}

TEST_F(OldDriver, HasNamesOfFramebuffersByTheContextAlone) {
    OGL::Framebuffer framebuffer;
    framebuffer.bind();
    EXPECT_TRUE(framebuffer.isBound());
    framebuffer.unbind();
    EXPECT_EQ(0, ORVO::Test::GLHooks::objects()["sync"]);
}

TEST_F(OldDriver, LeavesNamesToTheirGroupRatherThanDeletingAStrangers) {
    auto pHost = OGL::Context::adoptCurrent();
    auto pTexture =
        std::make_unique<OGL::Texture2D>(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, nullptr);
    GLuint const nName = pTexture->objectID();
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    GLuint nStranger = 0;
    glGenTextures(1, &nStranger);
    // The driver counts names in each group: this is another texture of the same number.
    ASSERT_EQ(nName, nStranger);
    glBindTexture(GL_TEXTURE_2D, nStranger);
    pForeign->release();
    pTexture.reset();
    pForeign->makeCurrent();
    auto pStrange = OGL::Context::adoptCurrent();
    pStrange->makeCurrent();
    { OGL::Texture2D const next(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, nullptr); }
    EXPECT_EQ(GLboolean{GL_TRUE}, glIsTexture(nStranger));
    // Nor does the end of the group, which every context passes for.
    pHost.reset();
    pStrange.reset();
    EXPECT_EQ(GLboolean{GL_TRUE}, glIsTexture(nStranger));
    glDeleteTextures(1, &nStranger);
    host().makeCurrent();
    EXPECT_EQ(GLboolean{GL_TRUE}, glIsTexture(nName));
    glDeleteTextures(1, &nName);
}

TEST_F(OldDriver, DeletesNamesAtOnceWhereAContextIsCurrent) {
    long const nBefore = ORVO::Test::GLHooks::objects()["texture"];
    { OGL::Texture2D const texture(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, nullptr); }
    EXPECT_EQ(nBefore, ORVO::Test::GLHooks::objects()["texture"]);
}

TEST_F(OldDriver, MakesTexturesWithoutPixelBuffers) {
    std::array<unsigned char, 4> aPixels{1, 2, 3, 4};
    OGL::Texture2D const texture(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, aPixels.data());
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    std::array<unsigned char, 4> aRead{};
    texture.getPixelData(aRead.data(), 0, OGL::Texture::FORMAT_RGBA, OGL::Texture::TYPE_UNSIGNED_BYTE, 1);
    EXPECT_EQ(aPixels, aRead);
    glBindTexture(GL_TEXTURE_2D, 0);
}

} // namespace
