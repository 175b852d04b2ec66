// Uploads into textures, copies and reading back.
#include <epoxy/gl.h>

#include <array>
#include <climits>
#include <vector>

#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/GLTest.h"

namespace {

using namespace ORVO;
using OGL::Texture;

constexpr auto eBytes = Texture::TYPE_UNSIGNED_BYTE;
constexpr char const* pOutside = "The rectangle lies outside the texture";
constexpr char const* pNoLevel = "The level does not exist";

/// Bytes that count up from a number.
std::vector<unsigned char> bytes(std::size_t n, unsigned first = 1) {
    std::vector<unsigned char> aBytes(n);
    for (std::size_t i = 0; i < n; ++i)
        aBytes[i] = static_cast<unsigned char>(first + i);
    return aBytes;
}

class SubImage : public ORVO::Test::GLTest {
protected:
    static std::vector<unsigned char> read(OGL::Texture2 const& texture, Texture::Format format) {
        std::vector<unsigned char> aRead(texture.width(0) * texture.height(0) * Texture::Channels(format));
        texture.getPixelData(aRead.data(), 0, format, eBytes, 1);
        return aRead;
    }
};

TEST_F(SubImage, UploadsTightRowsOfOddWidth) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGB8, 5, 3, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    auto const before = ORVO::Test::GLState::capture();
    auto const aPixels = bytes(45);
    texture.subImage(0, 0, 0, 5, 3, Texture::FORMAT_RGB, eBytes, aPixels.data(), {});
    EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture()));
    EXPECT_EQ(aPixels, read(texture, Texture::FORMAT_RGB));
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(SubImage, HonoursTheRowLength) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_LUMINANCE8, 2, 2, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    auto const aPixels = bytes(5);
    OGL::PixelUnpackParameters parameters;
    parameters.setRowLength(3);
    texture.subImage(0, 0, 0, 2, 2, Texture::FORMAT_LUMINANCE, eBytes, aPixels.data(), parameters);
    EXPECT_EQ((std::vector<unsigned char>{1, 2, 4, 5}), read(texture, Texture::FORMAT_LUMINANCE));
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(SubImage, IgnoresWhatTheHostHasSet) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_LUMINANCE8, 3, 1, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    glPixelStorei(GL_UNPACK_SKIP_PIXELS, 1);
    glPixelStorei(GL_UNPACK_SKIP_ROWS, 1);
    glPixelStorei(GL_UNPACK_ROW_LENGTH, 9);
    glPixelStorei(GL_PACK_SKIP_PIXELS, 1);
    glPixelStorei(GL_PACK_ROW_LENGTH, 9);
    auto const aPixels = bytes(3);
    texture.subImage(0, 0, 0, 3, 1, Texture::FORMAT_LUMINANCE, eBytes, aPixels.data(), {});
    EXPECT_EQ(aPixels, read(texture, Texture::FORMAT_LUMINANCE));
    GLint nSkip = 0;
    glGetIntegerv(GL_UNPACK_SKIP_ROWS, &nSkip);
    EXPECT_EQ(1, nSkip);
    glPixelStorei(GL_UNPACK_SKIP_PIXELS, 0);
    glPixelStorei(GL_UNPACK_SKIP_ROWS, 0);
    glPixelStorei(GL_UNPACK_ROW_LENGTH, 0);
    glPixelStorei(GL_PACK_SKIP_PIXELS, 0);
    glPixelStorei(GL_PACK_ROW_LENGTH, 0);
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(SubImage, UploadsARectangleInside) {
    auto aZero = std::vector<unsigned char>(12, 0);
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_LUMINANCE8, 4, 3, false, aZero.data());
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    auto const aPixels = bytes(4);
    texture.subImage(0, 2, 1, 2, 2, Texture::FORMAT_LUMINANCE, eBytes, aPixels.data(), {});
    EXPECT_EQ((std::vector<unsigned char>{0, 0, 0, 0, 0, 0, 1, 2, 0, 0, 3, 4}),
              read(texture, Texture::FORMAT_LUMINANCE));
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(SubImage, UploadsFromABufferAtAnOffset) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA8, 2, 1, false, nullptr);
    auto const aPixels = bytes(12);
    OGL::Buffer buffer(12, OGL::Buffer::TYPE_PIXEL_UNPACK, OGL::Buffer::USAGE_STREAM_DRAW, aPixels.data());
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    auto const before = ORVO::Test::GLState::capture();
    texture.subImage(0, 0, 0, 2, 1, Texture::FORMAT_RGBA, eBytes, &buffer, 4, {});
    EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture()));
    EXPECT_EQ(bytes(8, 5), read(texture, Texture::FORMAT_RGBA));
    buffer.bind();
    texture.subImage(0, 0, 0, 2, 1, Texture::FORMAT_RGBA, eBytes, &buffer, 0, {});
    EXPECT_TRUE(buffer.isBound());
    OGL::Buffer::bindDefaultUnpackBuffer();
    EXPECT_EQ(bytes(8, 1), read(texture, Texture::FORMAT_RGBA));
    ORVO_EXPECT_INTERNAL(texture.subImage(0, 0, 0, 2, 1, Texture::FORMAT_RGBA, eBytes,
                                          static_cast<OGL::Buffer*>(nullptr), 0, {}),
                         "Enforce pBuffer != NULL");
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(SubImage, RefusesRectanglesOutside) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA8, 4, 3, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    auto const aPixels = bytes(64);
    struct Row {
        int x, y;
        std::size_t w, h;
    };
    for (Row const& r :
         {Row{-1, 0, 1, 1}, Row{0, -1, 1, 1}, Row{4, 0, 1, 1}, Row{0, 3, 1, 1}, Row{3, 0, 2, 1},
          Row{0, 0, 5, 1}, Row{0, 0, 1, 4}, Row{0, 0, SIZE_MAX, 1}, Row{INT_MAX, 0, 1, 1}}) {
        ORVO_EXPECT_PARAMETER(
            texture.subImage(0, r.x, r.y, r.w, r.h, Texture::FORMAT_RGBA, eBytes, aPixels.data(), {}),
            pOutside);
        ORVO_EXPECT_PARAMETER(texture.copyTexSubImage(0, r.x, r.y, 0, 0, r.w, r.h), pOutside);
    }
    texture.subImage(0, 4, 3, 0, 0, Texture::FORMAT_RGBA, eBytes, aPixels.data(), {});
    for (int const level : {-1, 1, INT_MAX}) {
        ORVO_EXPECT_PARAMETER(
            texture.subImage(level, 0, 0, 1, 1, Texture::FORMAT_RGBA, eBytes, aPixels.data(), {}), pNoLevel);
        ORVO_EXPECT_PARAMETER(texture.copyTexSubImage(level, 0, 0, 0, 0, 1, 1), pNoLevel);
        ORVO_EXPECT_PARAMETER(texture.getPixelData(nullptr, level, Texture::FORMAT_RGBA, eBytes, 1),
                              pNoLevel);
    }
    ORVO_EXPECT_OGL(
        texture.subImage(0, 0, 0, 1, 1, static_cast<Texture::Format>(12), eBytes, aPixels.data(), {}),
        "Unknown format 12");
    ORVO_EXPECT_OGL(texture.subImage(0, 0, 0, 1, 1, Texture::FORMAT_RGBA, static_cast<Texture::Type>(21),
                                     aPixels.data(), {}),
                    "Unknown type 21");
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(SubImage, UploadsLines) {
    OGL::Texture1D line(Texture::INTERNAL_FORMAT_LUMINANCE32F, 4, true);
    glBindTexture(GL_TEXTURE_1D, line.objectID());
    constexpr std::array<float, 4> aValues{-1.5F, 0.0F, 2.0F, 1000.25F};
    line.subImage(0, 0, 4, Texture::FORMAT_LUMINANCE, Texture::TYPE_FLOAT, aValues.data(), {});
    constexpr std::array<float, 1> aOne{7.0F};
    line.subImage(0, 2, 1, Texture::FORMAT_LUMINANCE, Texture::TYPE_FLOAT, aOne.data(), {});
    std::array<float, 4> aRead{};
    glGetTexImage(GL_TEXTURE_1D, 0, GL_LUMINANCE, GL_FLOAT, aRead.data());
    EXPECT_EQ((std::array<float, 4>{-1.5F, 0.0F, 7.0F, 1000.25F}), aRead);
    ORVO_EXPECT_PARAMETER(
        line.subImage(0, 4, 1, Texture::FORMAT_LUMINANCE, Texture::TYPE_FLOAT, aOne.data(), {}), pOutside);
    ORVO_EXPECT_PARAMETER(
        line.subImage(1, 0, 3, Texture::FORMAT_LUMINANCE, Texture::TYPE_FLOAT, aOne.data(), {}), pOutside);
    ORVO_EXPECT_PARAMETER(
        line.subImage(3, 0, 1, Texture::FORMAT_LUMINANCE, Texture::TYPE_FLOAT, aOne.data(), {}), pNoLevel);
    line.subImage(0, 4, 0, Texture::FORMAT_LUMINANCE, Texture::TYPE_FLOAT, nullptr, {});
    glBindTexture(GL_TEXTURE_1D, 0);
}

TEST_F(SubImage, UploadsBoxes) {
    OGL::Texture3D box(Texture::INTERNAL_FORMAT_LUMINANCE8, 3, 2, 2, false);
    glBindTexture(GL_TEXTURE_3D, box.objectID());
    auto const aPixels = bytes(12);
    box.subImage(0, 0, 0, 0, 3, 2, 2, Texture::FORMAT_LUMINANCE, eBytes, aPixels.data(), {});
    constexpr unsigned char nOne = 99;
    box.subImage(0, 2, 1, 1, 1, 1, 1, Texture::FORMAT_LUMINANCE, eBytes, &nOne, {});
    std::vector<unsigned char> aRead(12);
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    glGetTexImage(GL_TEXTURE_3D, 0, GL_LUMINANCE, GL_UNSIGNED_BYTE, aRead.data());
    glPixelStorei(GL_PACK_ALIGNMENT, 4);
    auto aExpected = aPixels;
    aExpected.back() = nOne;
    EXPECT_EQ(aExpected, aRead);
    ORVO_EXPECT_PARAMETER(box.subImage(0, 0, 0, 2, 1, 1, 1, Texture::FORMAT_LUMINANCE, eBytes, &nOne, {}),
                          pOutside);
    ORVO_EXPECT_PARAMETER(box.subImage(0, 0, 2, 0, 1, 1, 1, Texture::FORMAT_LUMINANCE, eBytes, &nOne, {}),
                          pOutside);
    ORVO_EXPECT_PARAMETER(box.subImage(0, 3, 0, 0, 1, 1, 1, Texture::FORMAT_LUMINANCE, eBytes, &nOne, {}),
                          pOutside);
    ORVO_EXPECT_PARAMETER(box.subImage(1, 0, 0, 0, 1, 1, 1, Texture::FORMAT_LUMINANCE, eBytes, &nOne, {}),
                          pNoLevel);
    box.subImage(0, 0, 0, 0, 0, 2, 2, Texture::FORMAT_LUMINANCE, eBytes, nullptr, {});
    glBindTexture(GL_TEXTURE_3D, 0);
}

TEST_F(SubImage, CopiesFromTheReadFramebuffer) {
    auto aSource = bytes(3 * 2 * 4);
    OGL::Texture2D source(Texture::INTERNAL_FORMAT_RGBA8, 3, 2, false, aSource.data());
    std::vector<unsigned char> aZero(16, 0);
    OGL::Texture2D destination(Texture::INTERNAL_FORMAT_RGBA8, 2, 2, false, aZero.data());
    OGL::Framebuffer framebuffer;
    framebuffer.bind();
    framebuffer.attach(&source, 0, 0);
    glBindTexture(GL_TEXTURE_2D, destination.objectID());
    destination.copyTexSubImage(0, 1, 0, 2, 0, 1, 2);
    destination.copyTexSubImage(0, 0, 0, 0, 0, 0, 2);
    std::vector<unsigned char> aExpected(16, 0);
    for (std::size_t i = 0; i < 4; ++i) {
        aExpected[4 + i] = aSource[8 + i];
        aExpected[12 + i] = aSource[20 + i];
    }
    EXPECT_EQ(aExpected, read(destination, Texture::FORMAT_RGBA));
    framebuffer.detach(&source, 0);
    framebuffer.unbind();
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(SubImage, ReadsWithTheAlignmentGiven) {
    auto aPixels = bytes(6);
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_LUMINANCE8, 3, 2, false, aPixels.data());
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    auto const before = ORVO::Test::GLState::capture();
    std::vector<unsigned char> aRead(11, 0xEE);
    texture.getPixelData(aRead.data(), 0, Texture::FORMAT_LUMINANCE, eBytes, 8);
    EXPECT_EQ((std::vector<unsigned char>{1, 2, 3, 0xEE, 0xEE, 0xEE, 0xEE, 0xEE, 4, 5, 6}), aRead);
    EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture()));
    for (unsigned const alignment : {0U, 3U, 16U})
        ORVO_EXPECT_PARAMETER(
            texture.getPixelData(aRead.data(), 0, Texture::FORMAT_LUMINANCE, eBytes, alignment),
            "alignment is 1, 2, 4 or 8");
    {
        ORVO::Test::GLCallFailure const failure("glGetTexImage", 1);
        ORVO_EXPECT_OGL(texture.getPixelData(aRead.data(), 0, Texture::FORMAT_LUMINANCE, eBytes, 1),
                        "The texture could not be read (GL_OUT_OF_MEMORY)");
    }
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(SubImage, KeepsFloatsBitForBit) {
    constexpr std::array<float, 4> aValues{-2.5F, 1e-3F, 65504.0F, 3.25F};
    OGL::Texture2D full(Texture::INTERNAL_FORMAT_RGBA32F, 1, 1, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, full.objectID());
    full.subImage(0, 0, 0, 1, 1, Texture::FORMAT_RGBA, Texture::TYPE_FLOAT, aValues.data(), {});
    std::array<float, 4> aRead{};
    full.getPixelData(aRead.data(), 0, Texture::FORMAT_RGBA, Texture::TYPE_FLOAT, 1);
    EXPECT_EQ(aValues, aRead);
    constexpr std::array<std::uint16_t, 4> aHalves{0xC100, 0x3C00, 0x7BFF, 0x0001};
    OGL::Texture2D half(Texture::INTERNAL_FORMAT_RGBA16F, 1, 1, false, nullptr);
    glBindTexture(GL_TEXTURE_2D, half.objectID());
    half.subImage(0, 0, 0, 1, 1, Texture::FORMAT_RGBA, Texture::TYPE_HALF_FLOAT, aHalves.data(), {});
    std::array<std::uint16_t, 4> aReadHalves{};
    half.getPixelData(aReadHalves.data(), 0, Texture::FORMAT_RGBA, Texture::TYPE_HALF_FLOAT, 1);
    EXPECT_EQ(aHalves, aReadHalves);
    glBindTexture(GL_TEXTURE_2D, 0);
}

class PixelUnpackParameters : public ORVO::Test::GLTest {};

TEST_F(PixelUnpackParameters, WritesAlignmentOneAndTheRowLength) {
    glPixelStorei(GL_UNPACK_SKIP_ROWS, 3);
    OGL::PixelUnpackParameters parameters;
    EXPECT_EQ(0U, parameters.rowLength());
    parameters.setRowLength(37);
    EXPECT_EQ(37U, parameters.rowLength());
    parameters.apply();
    auto const valueOf = [](GLenum name) {
        GLint value = -1;
        glGetIntegerv(name, &value);
        return value;
    };
    EXPECT_EQ(1, valueOf(GL_UNPACK_ALIGNMENT));
    EXPECT_EQ(37, valueOf(GL_UNPACK_ROW_LENGTH));
    EXPECT_EQ(0, valueOf(GL_UNPACK_SKIP_ROWS));
    OGL::PixelUnpackParameters().apply();
    EXPECT_EQ(0, valueOf(GL_UNPACK_ROW_LENGTH));
    glPixelStorei(GL_UNPACK_ALIGNMENT, 4);
}

TEST_F(PixelUnpackParameters, RefusesRowsThatOpenGLCannotTake) {
    OGL::PixelUnpackParameters parameters;
    parameters.setRowLength(std::size_t{INT_MAX} + 1);
    ORVO_EXPECT_PARAMETER(parameters.apply(), "rowLength <= INT_MAX");
    host().release();
    ORVO_EXPECT_OGL(OGL::PixelUnpackParameters().apply(), "No OpenGL context is current");
}

} // namespace
