#include "orvo/ogl/ExtensionManager.h"

#include <epoxy/gl.h>

#include <array>
#include <cstring>
#include <string>

#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using OGL::ExtensionManager;

constexpr OGL::teExtension aExtensions[] = {OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT,
                                            OGL::EXTENSION_ARB_TEXTURE_FLOAT,
                                            OGL::EXTENSION_ATI_TEXTURE_FLOAT,
                                            OGL::EXTENSION_ARB_HALF_FLOAT_PIXEL,
                                            OGL::EXTENSION_EXT_FRAMEBUFFER_OBJECT,
                                            OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT,
                                            OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT,
                                            OGL::EXTENSION_APPLE_FLOAT_PIXELS,
                                            OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO,
                                            OGL::EXTENSION_ARB_TEXTURE_RECTANGLE,
                                            OGL::EXTENSION_EXT_TEXTURE3D,
                                            OGL::EXTENSION_SGIS_TEXTURE_EDGE_CLAMP,
                                            OGL::EXTENSION_ARB_SHADER_OBJECTS};

class ExtensionManagerTest : public ORVO::Test::GLTestOnEachInterface {
protected:
    static ExtensionManager& manager() { return *ExtensionManager::Instance(); }
};

TEST_P(ExtensionManagerTest, IsOneObject) {
    ASSERT_NE(nullptr, ExtensionManager::Instance());
    EXPECT_EQ(ExtensionManager::Instance(), ExtensionManager::Instance());
}

TEST_P(ExtensionManagerTest, KeepsTheNumbersOfExtensions) {
    EXPECT_EQ(6, OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT);
    EXPECT_EQ(127, OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT);
    EXPECT_EQ(63, OGL::EXTENSION_ARB_HALF_FLOAT_PIXEL);
    EXPECT_EQ(36, OGL::EXTENSION_ARB_TEXTURE_FLOAT);
    EXPECT_EQ(228, OGL::EXTENSION_APPLE_FLOAT_PIXELS);
    EXPECT_EQ(45, OGL::EXTENSION_ATI_TEXTURE_FLOAT);
    EXPECT_EQ(123, OGL::EXTENSION_EXT_FRAMEBUFFER_OBJECT);
    EXPECT_EQ(141, OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT);
    EXPECT_EQ(2, ExtensionManager::VENDOR_NVIDIA);
}

TEST_P(ExtensionManagerTest, TellsWhatTheDriverCan) {
    GLint nMajor = 0;
    GLint nMinor = 0;
    glGetIntegerv(GL_MAJOR_VERSION, &nMajor);
    glGetIntegerv(GL_MINOR_VERSION, &nMinor);
    EXPECT_EQ(static_cast<unsigned>(nMajor), manager().majorVersion());
    EXPECT_EQ(static_cast<unsigned>(nMinor), manager().minorVersion());
    ASSERT_GE(nMajor * 10 + nMinor, 31);
    for (OGL::teExtension const extension : aExtensions)
        EXPECT_TRUE(manager().isSupported(extension)) << extension;
    EXPECT_TRUE(manager().isSupported(OGL::EXTENSION_ARB_VERTEX_PROGRAM));
    EXPECT_TRUE(manager().isSupported(OGL::EXTENSION_ARB_FRAGMENT_PROGRAM));
    EXPECT_FALSE(manager().isSupported(OGL::EXTENSION_APPLE_FENCE));
    EXPECT_FALSE(manager().isSupported(static_cast<OGL::teExtension>(1)));
    EXPECT_TRUE(manager().supportsNonPowerOfTwoTextures());
    EXPECT_TRUE(manager().supportsFloatingPointTextures());
    EXPECT_TRUE(manager().supports16BitFloat());
    EXPECT_TRUE(manager().supportsClampToEdge());
    EXPECT_TRUE(manager().supportsTexture3D());
    GLint nUnits = 0;
    glGetIntegerv(GL_MAX_TEXTURE_IMAGE_UNITS, &nUnits);
    EXPECT_EQ(static_cast<unsigned>(nUnits), manager().numberOfTextureUnits());
}

TEST_P(ExtensionManagerTest, AnswersForTheLastDriverWhereNoneIsCurrent) {
    unsigned const nMajor = manager().majorVersion();
    host().release();
    EXPECT_EQ(nMajor, manager().majorVersion());
    EXPECT_TRUE(manager().isSupported(OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT));
}

TEST_P(ExtensionManagerTest, GivesOverriddenAnswers) {
    for (OGL::teExtension const extension : aExtensions) {
        manager().overrideSupport(extension, false);
        EXPECT_FALSE(manager().isSupported(extension)) << extension;
    }
    manager().overrideSupport(OGL::EXTENSION_APPLE_FENCE, true);
    EXPECT_TRUE(manager().isSupported(OGL::EXTENSION_APPLE_FENCE));
    manager().overrideVersion(1, 4);
    EXPECT_EQ(1U, manager().majorVersion());
    EXPECT_EQ(4U, manager().minorVersion());
    manager().overrideVendor(ExtensionManager::VENDOR_NVIDIA);
    EXPECT_EQ(2, manager().vendor());
    manager().overrideNumberOfTextureUnits(3);
    EXPECT_EQ(3U, manager().numberOfTextureUnits());
    for (bool const bSoftware : {true, false}) {
        manager().overrideSoftwareDriver(bSoftware);
        EXPECT_EQ(bSoftware, manager().isSoftwareDriver());
    }
    manager().clearOverrides();
    for (OGL::teExtension const extension : aExtensions)
        EXPECT_TRUE(manager().isSupported(extension)) << extension;
    EXPECT_FALSE(manager().isSupported(OGL::EXTENSION_APPLE_FENCE));
    EXPECT_LT(2U, manager().majorVersion());
    EXPECT_NE(3U, manager().numberOfTextureUnits());
}

TEST_P(ExtensionManagerTest, BuildsCapabilitiesOnExtensions) {
    manager().overrideSupport(OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, false);
    EXPECT_FALSE(manager().supportsNonPowerOfTwoTextures());
    manager().overrideSupport(OGL::EXTENSION_EXT_TEXTURE3D, false);
    EXPECT_FALSE(manager().supportsTexture3D());
    manager().overrideSupport(OGL::EXTENSION_SGIS_TEXTURE_EDGE_CLAMP, false);
    EXPECT_FALSE(manager().supportsClampToEdge());
    manager().overrideSupport(OGL::EXTENSION_ARB_HALF_FLOAT_PIXEL, false);
    EXPECT_FALSE(manager().supports16BitFloat());
    manager().overrideSupport(OGL::EXTENSION_ARB_HALF_FLOAT_PIXEL, true);
    EXPECT_TRUE(manager().supports16BitFloat());
    constexpr OGL::teExtension aFloat[] = {OGL::EXTENSION_ARB_TEXTURE_FLOAT, OGL::EXTENSION_ATI_TEXTURE_FLOAT,
                                           OGL::EXTENSION_APPLE_FLOAT_PIXELS};
    for (OGL::teExtension const only : aFloat) {
        for (OGL::teExtension const extension : aFloat)
            manager().overrideSupport(extension, extension == only);
        EXPECT_TRUE(manager().supportsFloatingPointTextures()) << only;
        EXPECT_TRUE(manager().supports16BitFloat()) << only;
    }
    for (OGL::teExtension const extension : aFloat)
        manager().overrideSupport(extension, false);
    EXPECT_FALSE(manager().supportsFloatingPointTextures());
    EXPECT_FALSE(manager().supports16BitFloat());
}

TEST_P(ExtensionManagerTest, NeverLacksAnEntryPoint) {
    OGL::FunctionTable const* const pTable = manager().table();
    ASSERT_NE(nullptr, pTable);
    constexpr std::size_t nEntries = 17;
    static_assert(sizeof(OGL::FunctionTable) == nEntries * sizeof(void*));
    std::array<void*, nEntries> aEntries{};
    std::memcpy(aEntries.data(), pTable, sizeof *pTable);
    for (void* const pEntry : aEntries)
        EXPECT_NE(nullptr, pEntry);
}

// The names of the entries are macros of the loader's here.
#undef glActiveTexture
#undef glMultiTexCoord2f
#undef glMultiTexCoord2fv
#undef glGenQueries
#undef glDeleteQueries
#undef glIsQuery
#undef glBeginQuery
#undef glEndQuery
#undef glGetQueryObjectuiv
#undef glGenBuffers
#undef glDeleteBuffers
#undef glBindBuffer
#undef glBufferData
#undef glGenFramebuffers
#undef glBindFramebuffer
#undef glTestObjectAPPLE
#undef glFinishObjectAPPLE

TEST_P(ExtensionManagerTest, ReachesTheDriverThroughItsTable) {
    OGL::FunctionTable const& gl = *manager().table();
    gl.glActiveTexture(GL_TEXTURE1);
    constexpr std::array<float, 2> aCoordinates{0.25F, 0.5F};
    gl.glMultiTexCoord2fv(GL_TEXTURE1, aCoordinates.data());
    std::array<float, 4> aRead{};
    glGetFloatv(GL_CURRENT_TEXTURE_COORDS, aRead.data());
    EXPECT_EQ(0.5F, aRead[1]);
    gl.glMultiTexCoord2f(GL_TEXTURE1, 0.0F, 0.0F);
    glGetFloatv(GL_CURRENT_TEXTURE_COORDS, aRead.data());
    EXPECT_EQ(0.0F, aRead[1]);
    gl.glActiveTexture(GL_TEXTURE0);

    unsigned nQuery = 0;
    gl.glGenQueries(1, &nQuery);
    gl.glBeginQuery(GL_SAMPLES_PASSED, nQuery);
    gl.glEndQuery(GL_SAMPLES_PASSED);
    EXPECT_EQ(GL_TRUE, gl.glIsQuery(nQuery));
    unsigned nResult = 1;
    gl.glGetQueryObjectuiv(nQuery, GL_QUERY_RESULT, &nResult);
    EXPECT_EQ(0U, nResult);
    gl.glDeleteQueries(1, &nQuery);
    EXPECT_EQ(GL_FALSE, gl.glIsQuery(nQuery));

    unsigned nBuffer = 0;
    gl.glGenBuffers(1, &nBuffer);
    gl.glBindBuffer(GL_ARRAY_BUFFER, nBuffer);
    gl.glBufferData(GL_ARRAY_BUFFER, 12, nullptr, GL_STATIC_DRAW);
    GLint nSize = 0;
    glGetBufferParameteriv(GL_ARRAY_BUFFER, GL_BUFFER_SIZE, &nSize);
    EXPECT_EQ(12, nSize);
    gl.glBindBuffer(GL_ARRAY_BUFFER, 0);
    gl.glDeleteBuffers(1, &nBuffer);

    unsigned nFramebuffer = 0;
    gl.glGenFramebuffers(1, &nFramebuffer);
    gl.glBindFramebuffer(GL_FRAMEBUFFER, nFramebuffer);
    EXPECT_EQ(GL_TRUE, glIsFramebuffer(nFramebuffer));
    gl.glBindFramebuffer(GL_FRAMEBUFFER, 0);
    glDeleteFramebuffers(1, &nFramebuffer);

    // The driver has no fences of its own for textures: nothing is ever waited for.
    EXPECT_EQ(1, gl.glTestObjectAPPLE(GL_TEXTURE, 1));
    gl.glFinishObjectAPPLE(GL_TEXTURE, 1);
    EXPECT_EQ(0U, drainErrors());
}

ORVO_INSTANTIATE_ON_EACH_INTERFACE(ExtensionManagerTest);

/// Texts that a replaced entry point gives out.
struct GivenTexts {
    char const* pVendor;
    char const* pRenderer;
};
GivenTexts oGiven;
decltype(epoxy_glGetString) pDriverGetString = nullptr;

GLubyte const* getString(GLenum name) {
    if (name == GL_VENDOR)
        return reinterpret_cast<GLubyte const*>(oGiven.pVendor);
    if (name == GL_RENDERER)
        return reinterpret_cast<GLubyte const*>(oGiven.pRenderer);
    return pDriverGetString(name);
}

class Vendor : public ORVO::Test::GLTest {};

TEST_F(Vendor, IsToldByTheDriversTexts) {
    struct Row {
        GivenTexts oTexts;
        ExtensionManager::teVendor eVendor;
        bool bSoftware = false;
    };
    constexpr Row aRows[] = {
        {{"NVIDIA Corporation", "GeForce/PCIe/SSE2"}, ExtensionManager::VENDOR_NVIDIA},
        {{"ATI Technologies Inc.", "Radeon"}, ExtensionManager::VENDOR_ATI},
        {{"AMD", "AMD Radeon (radeonsi)"}, ExtensionManager::VENDOR_ATI},
        {{"Intel", "Mesa Intel(R) Graphics"}, ExtensionManager::VENDOR_INTEL},
        {{"Mesa/X.org", "llvmpipe (LLVM 15.0.6, 256 bits)"}, ExtensionManager::VENDOR_MESA, true},
        {{"Mesa", "softpipe on Intel"}, ExtensionManager::VENDOR_MESA, true},
        {{"Mesa Project", "Software Rasterizer"}, ExtensionManager::VENDOR_MESA, true},
        {{"X.Org", "some"}, ExtensionManager::VENDOR_MESA},
        {{"Somebody Corporation", "Something"}, ExtensionManager::VENDOR_UNKNOWN},
        {{"", ""}, ExtensionManager::VENDOR_UNKNOWN},
    };
    pDriverGetString = epoxy_glGetString;
    for (Row const& row : aRows) {
        oGiven = row.oTexts;
        epoxy_glGetString = &getString;
        EXPECT_EQ(row.eVendor, ExtensionManager::Instance()->vendor()) << row.oTexts.pVendor;
        EXPECT_EQ(row.bSoftware, ExtensionManager::Instance()->isSoftwareDriver()) << row.oTexts.pRenderer;
        // Each driver keeps its own answers.
        EXPECT_EQ(row.eVendor, ExtensionManager::Instance()->vendor()) << row.oTexts.pVendor;
        epoxy_glGetString = pDriverGetString;
    }
}

} // namespace
