#include "orvo/ogl/Texture.h"

#include <epoxy/gl.h>

#include <array>
#include <climits>
#include <cstdint>
#include <memory>
#include <vector>

#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "orvo/ogl/TextureRECT.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/FailEveryCall.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using OGL::Texture;

constexpr auto eRGBA8 = Texture::INTERNAL_FORMAT_RGBA8;

GLint parameterOf(GLenum target, GLenum name) {
    GLint value = 0;
    glGetTexParameteriv(target, name, &value);
    return value;
}

class TextureTest : public ORVO::Test::GLTest {};

TEST_F(TextureTest, KnowsItsSizes) {
    OGL::Texture1D const line(eRGBA8, 5, false);
    EXPECT_EQ(5U, line.width(0));
    EXPECT_EQ(1U, line.height(0));
    EXPECT_EQ(1U, line.depth(0));
    EXPECT_EQ(20, line.sizeInBytes());
    OGL::Texture2D const plane(Texture::INTERNAL_FORMAT_RGB16F, 7, 3, false, nullptr);
    EXPECT_EQ(7U, plane.width(0));
    EXPECT_EQ(3U, plane.height(0));
    EXPECT_EQ(1U, plane.depth(0));
    EXPECT_EQ(0U, plane.width(1));
    EXPECT_EQ(7 * 3 * 6, plane.sizeInBytes());
    EXPECT_EQ(Texture::INTERNAL_FORMAT_RGB16F, plane.format());
    OGL::Texture3D const box(Texture::INTERNAL_FORMAT_LUMINANCE8, 4, 3, 2, false);
    EXPECT_EQ(4U, box.width(0));
    EXPECT_EQ(3U, box.height(0));
    EXPECT_EQ(2U, box.depth(0));
    EXPECT_EQ(24, box.sizeInBytes());
    OGL::TextureRECT const rectangle(eRGBA8, 9, 2, nullptr);
    EXPECT_EQ(9U, rectangle.width(0));
    EXPECT_EQ(2U, rectangle.height(0));
    EXPECT_EQ(72, rectangle.sizeInBytes());
    EXPECT_EQ(nullptr, rectangle.clientMemory());
}

TEST_F(TextureTest, HasTheTargetsOfItsKind) {
    EXPECT_EQ(0x0DE0U, OGL::Texture1D(eRGBA8, 1, false).target());
    EXPECT_EQ(0x0DE1U, OGL::Texture2D(eRGBA8, 1, 1, false, nullptr).target());
    EXPECT_EQ(0x806FU, OGL::Texture3D(eRGBA8, 1, 1, 1, false).target());
    EXPECT_EQ(0x84F5U, OGL::TextureRECT(eRGBA8, 1, 1, nullptr).target());
}

TEST_F(TextureTest, AllocatesLevelsDownToOnePixel) {
    OGL::Texture2D texture(eRGBA8, 8, 5, true, nullptr);
    constexpr std::size_t aSizes[4][2] = {{8, 5}, {4, 2}, {2, 1}, {1, 1}};
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    for (unsigned level = 0; level < 4; ++level) {
        EXPECT_EQ(aSizes[level][0], texture.width(level));
        EXPECT_EQ(aSizes[level][1], texture.height(level));
        GLint nWidth = 0;
        glGetTexLevelParameteriv(GL_TEXTURE_2D, static_cast<GLint>(level), GL_TEXTURE_WIDTH, &nWidth);
        EXPECT_EQ(static_cast<GLint>(aSizes[level][0]), nWidth);
    }
    EXPECT_EQ(0U, texture.width(4));
    EXPECT_EQ(0U, texture.width(UINT_MAX));
    EXPECT_EQ((40 + 8 + 2 + 1) * 4, texture.sizeInBytes());
    EXPECT_EQ(3, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_MAX_LEVEL));
    glBindTexture(GL_TEXTURE_2D, 0);
    OGL::Texture1D const line(eRGBA8, 4, true);
    EXPECT_EQ((4 + 2 + 1) * 4, line.sizeInBytes());
    OGL::Texture3D const box(eRGBA8, 4, 2, 1, true);
    EXPECT_EQ((8 + 2 + 1) * 4, box.sizeInBytes());
    EXPECT_EQ(1U, box.depth(2));
}

TEST_F(TextureTest, IsCompleteWithoutFurtherCalls) {
    OGL::Texture2D texture(eRGBA8, 4, 4, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    EXPECT_EQ(GL_LINEAR, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER));
    EXPECT_EQ(GL_LINEAR, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER));
    EXPECT_EQ(0, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_MAX_LEVEL));
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(TextureTest, MayBeEmpty) {
    OGL::Texture2D texture(eRGBA8, 0, 0, false, nullptr);
    EXPECT_EQ(0U, texture.width(0));
    EXPECT_EQ(0U, texture.height(0));
    EXPECT_EQ(0, texture.sizeInBytes());
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    texture.subImage(0, 0, 0, 0, 0, Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_BYTE, nullptr, {});
    texture.getPixelData(nullptr, 0, Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_BYTE, 1);
    glBindTexture(GL_TEXTURE_2D, 0);
    OGL::Texture2D const withoutRows(eRGBA8, 5, 0, false, nullptr);
    EXPECT_EQ(5U, withoutRows.width(0));
    EXPECT_EQ(0U, withoutRows.height(0));
}

TEST_F(TextureTest, AllocatesEveryInternalFormat) {
    for (int i = 0; i < 58; ++i) {
        auto const format = static_cast<Texture::InternalFormat>(i);
        if (!Texture::IsValid(format))
            continue;
        SCOPED_TRACE(i);
        std::vector<unsigned char> aMemory(4 * 2 * 16, 0x11);
        OGL::Texture2D const texture(format, 4, 2, false, aMemory.data());
        EXPECT_EQ(0U, drainErrors());
        EXPECT_EQ(format, texture.format());
    }
}

TEST_F(TextureTest, RefusesFormatsThatAreNone) {
    ORVO_EXPECT_OGL(OGL::Texture2D(static_cast<Texture::InternalFormat>(26), 1, 1, false, nullptr),
                    "Unknown internal format 26");
}

TEST_F(TextureTest, RefusesSizesBeyondFourGigabytes) {
    ORVO_EXPECT_PARAMETER(OGL::Texture2D(eRGBA8, 32768, 32768, false, nullptr), "Texture size is too large");
    ORVO_EXPECT_PARAMETER(OGL::Texture2D(eRGBA8, std::size_t{INT_MAX} + 1, 0, false, nullptr),
                          "Texture size is too large");
    ORVO_EXPECT_PARAMETER(OGL::Texture3D(eRGBA8, SIZE_MAX, SIZE_MAX, SIZE_MAX, false),
                          "Texture size is too large");
    ORVO_EXPECT_PARAMETER(OGL::Texture1D(eRGBA8, SIZE_MAX, false), "Texture size is too large");
}

TEST_F(TextureTest, ReportsWhatTheDriverRefuses) {
    GLint nLimit = 0;
    glGetIntegerv(GL_MAX_TEXTURE_SIZE, &nLimit);
    auto const nTooWide = static_cast<std::size_t>(nLimit) + 1;
    ORVO_EXPECT_OGL(OGL::Texture2D(eRGBA8, nTooWide, 1, false, nullptr),
                    "The texture could not be allocated (GL_INVALID_VALUE)");
    EXPECT_EQ(0U, drainErrors());
}

TEST_F(TextureTest, NeedsAContext) {
    host().release();
    ORVO_EXPECT_OGL(OGL::Texture2D(eRGBA8, 1, 1, false, nullptr), "No OpenGL context is current");
}

TEST_F(TextureTest, LeavesNothingWhereACallFails) {
    auto const make = [] {
        OGL::Texture1D const line(eRGBA8, 2, true);
        OGL::Texture2D const plane(eRGBA8, 2, 2, true, nullptr);
        OGL::Texture3D const box(eRGBA8, 2, 2, 2, false);
        OGL::TextureRECT const rectangle(eRGBA8, 2, 2, nullptr);
    };
    auto const aFailed = ORVO::Test::failEveryCall(make, &drainErrors);
    EXPECT_EQ((std::set<std::string>{"glFenceSync", "glGenTextures", "glTexImage1D", "glTexImage2D",
                                     "glTexImage3D"}),
              aFailed);
}

TEST_F(TextureTest, KeepsBindingsAndUnpackStateWhereItIsMade) {
    OGL::Buffer buffer(64, OGL::Buffer::TYPE_PIXEL_UNPACK, OGL::Buffer::USAGE_STREAM_DRAW, nullptr);
    OGL::Texture2D bound(eRGBA8, 1, 1, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, bound.objectID());
    buffer.bind();
    glPixelStorei(GL_UNPACK_ALIGNMENT, 8);
    glPixelStorei(GL_UNPACK_ROW_LENGTH, 17);
    auto const before = ORVO::Test::GLState::capture();
    std::array<unsigned char, 3 * 3 * 2> aPixels{};
    for (std::size_t i = 0; i < aPixels.size(); ++i)
        aPixels[i] = static_cast<unsigned char>(i);
    OGL::Texture2D made(Texture::INTERNAL_FORMAT_RGB8, 3, 2, false, aPixels.data());
    EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture()));
    EXPECT_TRUE(bound.isBound());
    EXPECT_TRUE(buffer.isBound());
    OGL::Buffer::bindDefaultUnpackBuffer();
    glPixelStorei(GL_UNPACK_ALIGNMENT, 4);
    glPixelStorei(GL_UNPACK_ROW_LENGTH, 0);
    glBindTexture(GL_TEXTURE_2D, made.objectID());
    std::array<unsigned char, 3 * 3 * 2> aRead{};
    made.getPixelData(aRead.data(), 0, Texture::FORMAT_RGB, Texture::TYPE_UNSIGNED_BYTE, 1);
    EXPECT_EQ(aPixels, aRead);
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(TextureTest, KnowsWhetherItIsBound) {
    OGL::Texture2D const a(eRGBA8, 1, 1, false, nullptr);
    OGL::Texture2D const b(eRGBA8, 1, 1, false, nullptr);
    EXPECT_FALSE(a.isBound());
    EXPECT_EQ(0U, a.getBoundID());
    glBindTexture(GL_TEXTURE_2D, a.objectID());
    EXPECT_TRUE(a.isBound());
    EXPECT_FALSE(b.isBound());
    EXPECT_EQ(a.objectID(), b.getBoundID());
    glBindTexture(GL_TEXTURE_2D, 0);
    OGL::TextureRECT const rectangle(eRGBA8, 1, 1, nullptr);
    glBindTexture(GL_TEXTURE_RECTANGLE, rectangle.objectID());
    EXPECT_TRUE(rectangle.isBound());
    glBindTexture(GL_TEXTURE_RECTANGLE, 0);
    OGL::Texture1D const line(eRGBA8, 1, false);
    glBindTexture(GL_TEXTURE_1D, line.objectID());
    EXPECT_TRUE(line.isBound());
    glBindTexture(GL_TEXTURE_1D, 0);
    OGL::Texture3D const box(eRGBA8, 1, 1, 1, false);
    glBindTexture(GL_TEXTURE_3D, box.objectID());
    EXPECT_TRUE(box.isBound());
    glBindTexture(GL_TEXTURE_3D, 0);
}

TEST_F(TextureTest, SetsFiltersWrapAndBorder) {
    OGL::Texture2D texture(eRGBA8, 2, 2, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    texture.setFilter(Texture::FILTER_NEAREST, Texture::FILTER_NEAREST);
    EXPECT_EQ(GL_NEAREST, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER));
    EXPECT_EQ(GL_NEAREST, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER));
    texture.setFilter(Texture::FILTER_LINEAR_MIPMAP_NEAREST, Texture::FILTER_LINEAR);
    EXPECT_EQ(GL_LINEAR_MIPMAP_NEAREST, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER));
    EXPECT_EQ(GL_LINEAR, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER));
    ORVO_EXPECT_OGL(texture.setFilter(Texture::FILTER_NEAREST, Texture::FILTER_LINEAR_MIPMAP_LINEAR),
                    "A magnification filter has no mipmaps");
    ORVO_EXPECT_OGL(texture.setFilter(static_cast<Texture::Filter>(6), Texture::FILTER_NEAREST),
                    "Unknown filter 6");
    EXPECT_EQ(GL_LINEAR, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER));
    texture.setWrap(Texture::WRAP_MODE_CLAMP_TO_BORDER, Texture::WRAP_MODE_MIRRORED_REPEAT);
    EXPECT_EQ(GL_CLAMP_TO_BORDER, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_WRAP_S));
    EXPECT_EQ(GL_MIRRORED_REPEAT, parameterOf(GL_TEXTURE_2D, GL_TEXTURE_WRAP_T));
    constexpr std::array<float, 4> aBorder{0.25F, 0.5F, 0.75F, 1.0F};
    texture.setBorderColor(aBorder.data());
    std::array<float, 4> aRead{};
    glGetTexParameterfv(GL_TEXTURE_2D, GL_TEXTURE_BORDER_COLOR, aRead.data());
    EXPECT_EQ(aBorder, aRead);
    ORVO_EXPECT_INTERNAL(texture.setBorderColor(nullptr), "Enforce pColor != NULL");
    glBindTexture(GL_TEXTURE_2D, 0);

    OGL::Texture1D line(eRGBA8, 2, false);
    glBindTexture(GL_TEXTURE_1D, line.objectID());
    line.setWrap(Texture::WRAP_MODE_CLAMP_TO_EDGE);
    EXPECT_EQ(GL_CLAMP_TO_EDGE, parameterOf(GL_TEXTURE_1D, GL_TEXTURE_WRAP_S));
    glBindTexture(GL_TEXTURE_1D, 0);

    OGL::Texture3D box(eRGBA8, 2, 2, 2, false);
    glBindTexture(GL_TEXTURE_3D, box.objectID());
    box.setWrap(Texture::WRAP_MODE_CLAMP, Texture::WRAP_MODE_CLAMP_TO_EDGE,
                Texture::WRAP_MODE_CLAMP_TO_BORDER);
    EXPECT_EQ(GL_CLAMP, parameterOf(GL_TEXTURE_3D, GL_TEXTURE_WRAP_S));
    EXPECT_EQ(GL_CLAMP_TO_EDGE, parameterOf(GL_TEXTURE_3D, GL_TEXTURE_WRAP_T));
    EXPECT_EQ(GL_CLAMP_TO_BORDER, parameterOf(GL_TEXTURE_3D, GL_TEXTURE_WRAP_R));
    ORVO_EXPECT_OGL(
        box.setWrap(Texture::WRAP_MODE_CLAMP, static_cast<Texture::WrapMode>(5), Texture::WRAP_MODE_CLAMP),
        "Unknown wrap mode 5");
    glBindTexture(GL_TEXTURE_3D, 0);
}

TEST_F(TextureTest, ChangesNoOtherThatIsBound) {
    OGL::Texture2D texture(eRGBA8, 2, 2, false, nullptr);
    OGL::Texture2D other(eRGBA8, 2, 2, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, other.objectID());
    constexpr std::array<float, 4> aBorder{};
    std::array<unsigned char, 16> aPixels{};
    ORVO_EXPECT_INTERNAL(texture.setFilter(Texture::FILTER_NEAREST, Texture::FILTER_NEAREST), "isBound()");
    ORVO_EXPECT_INTERNAL(texture.setWrap(Texture::WRAP_MODE_CLAMP, Texture::WRAP_MODE_CLAMP), "isBound()");
    ORVO_EXPECT_INTERNAL(texture.setBorderColor(aBorder.data()), "isBound()");
    ORVO_EXPECT_INTERNAL(texture.subImage(0, 0, 0, 2, 2, Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_BYTE,
                                          aPixels.data(), {}),
                         "isBound()");
    ORVO_EXPECT_INTERNAL(texture.copyTexSubImage(0, 0, 0, 0, 0, 2, 2), "isBound()");
    ORVO_EXPECT_INTERNAL(
        texture.getPixelData(aPixels.data(), 0, Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_BYTE, 1),
        "isBound()");
    glBindTexture(GL_TEXTURE_2D, 0);
    OGL::Texture1D line(eRGBA8, 2, false);
    ORVO_EXPECT_INTERNAL(line.setWrap(Texture::WRAP_MODE_CLAMP), "isBound()");
    ORVO_EXPECT_INTERNAL(
        line.subImage(0, 0, 2, Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_BYTE, aPixels.data(), {}),
        "isBound()");
    OGL::Texture3D box(eRGBA8, 1, 1, 1, false);
    ORVO_EXPECT_INTERNAL(
        box.setWrap(Texture::WRAP_MODE_CLAMP, Texture::WRAP_MODE_CLAMP, Texture::WRAP_MODE_CLAMP),
        "isBound()");
    ORVO_EXPECT_INTERNAL(box.subImage(0, 0, 0, 0, 1, 1, 1, Texture::FORMAT_RGBA, Texture::TYPE_UNSIGNED_BYTE,
                                      aPixels.data(), {}),
                         "isBound()");
}

TEST_F(TextureTest, IsLeftToItsGroupWhereNoContextIsCurrent) {
    auto pTexture = std::make_unique<OGL::Texture2D>(eRGBA8, 1, 1, false, nullptr);
    GLuint const nName = pTexture->objectID();
    host().release();
    pTexture.reset();
    host().makeCurrent();
    EXPECT_EQ(GL_TRUE, glIsTexture(nName));
    loseHost();
    ORVO::Test::GLHooks::forgetObjects();
}

TEST_F(TextureTest, LeavesForeignTexturesAloneWhereItDiesInAForeignContext) {
    auto pTexture = std::make_unique<OGL::Texture2D>(eRGBA8, 1, 1, false, nullptr);
    GLuint const nName = pTexture->objectID();
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    {
        OGL::Texture2D const foreign(eRGBA8, 1, 1, false, nullptr);
        EXPECT_EQ(nName, foreign.objectID());
        pTexture.reset();
        EXPECT_EQ(GL_TRUE, glIsTexture(foreign.objectID()));
    }
    host().makeCurrent();
    EXPECT_EQ(GL_TRUE, glIsTexture(nName));
    pForeign->destroyContext();
    loseHost();
    ORVO::Test::GLHooks::forgetObjects();
}

TEST_F(TextureTest, DiesInAnotherContextOfItsGroup) {
    auto pTexture = std::make_unique<OGL::Texture2D>(eRGBA8, 1, 1, false, nullptr);
    auto const pSharing = host().another(true);
    pSharing->makeCurrent();
    pTexture.reset();
    EXPECT_EQ(0, ORVO::Test::GLHooks::objects()["texture"]);
}

TEST_F(TextureTest, HasOneSyncObjectForTheWholeGroup) {
    OGL::Texture2D const first(eRGBA8, 1, 1, false, nullptr);
    OGL::Texture2D const second(eRGBA8, 1, 1, false, nullptr);
    EXPECT_EQ(1, ORVO::Test::GLHooks::objects()["sync"]);
}

TEST_F(TextureTest, RectangleTakesItsClientMemory) {
    std::array<unsigned short, 6> aMemory{1, 2, 3, 40000, 50000, 65535};
    OGL::TextureRECT texture(Texture::INTERNAL_FORMAT_LUMINANCE16, 3, 2, aMemory.data());
    EXPECT_EQ(aMemory.data(), texture.clientMemory());
    glBindTexture(GL_TEXTURE_RECTANGLE, texture.objectID());
    std::array<unsigned short, 6> aRead{};
    texture.getPixelData(aRead.data(), 0, Texture::FORMAT_LUMINANCE, Texture::TYPE_UNSIGNED_SHORT, 1);
    EXPECT_EQ(aMemory, aRead);
    glBindTexture(GL_TEXTURE_RECTANGLE, 0);
}

TEST_F(TextureTest, RectangleIsRefusedWhereTheDriverHasNone) {
    EXPECT_TRUE(OGL::TextureRECT::isSupported());
    OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_ARB_TEXTURE_RECTANGLE, false);
    EXPECT_FALSE(OGL::TextureRECT::isSupported());
    ORVO_EXPECT_OGL(OGL::TextureRECT(eRGBA8, 1, 1, nullptr), "Rectangle textures are not supported");
}

} // namespace
