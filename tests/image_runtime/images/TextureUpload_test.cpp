// Uploads of every format, size and place; bands; the paths with and without buffers.
#include <epoxy/gl.h>

#include <climits>
#include <cstring>
#include <memory>
#include <random>
#include <vector>

#include "orvo/image_runtime/TexturePool.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/image_runtime/images/TextureUpload.h"
#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureRECT.h"
#include "tests/image_runtime/support/GLRuntimeTest.h"
#include "tests/support/gl/ExpectOGL.h"

namespace {

using namespace ORVO;
using Bytes = std::vector<unsigned char>;
using Texture = OGL::Texture;
using ORVO::Test::GLHooks;

constexpr auto eRGBA = Texture::FORMAT_RGBA;
constexpr auto eGrey = Texture::FORMAT_LUMINANCE;
constexpr auto eByte = Texture::TYPE_UNSIGNED_BYTE;
constexpr char const* pOutside = "The rectangle lies outside the texture";

Bytes randomBytes(std::size_t n, unsigned nSeed = 1) {
    std::mt19937 generator(nSeed);
    Bytes aBytes(n);
    for (unsigned char& byte : aBytes)
        byte = static_cast<unsigned char>(generator());
    return aBytes;
}

/// Random numbers of the type, finite, also outside 0..1.
Bytes randomPixels(std::size_t nValues, Texture::Type type) {
    if (type == Texture::TYPE_FLOAT) {
        std::mt19937 generator(7);
        std::uniform_real_distribution<float> values(-3.0F, 1000.0F);
        Bytes aBytes(nValues * sizeof(float));
        for (std::size_t i = 0; i < nValues; ++i) {
            float const value = values(generator);
            std::memcpy(&aBytes[i * sizeof(float)], &value, sizeof(float));
        }
        return aBytes;
    }
    Bytes aBytes = randomBytes(nValues * (type == eByte ? 1 : 2));
    if (type == Texture::TYPE_HALF_FLOAT)
        for (std::size_t i = 1; i < aBytes.size(); i += 2)
            // An exponent with a bit of 0 is neither infinite nor no number, one with a bit of 1 not
            // subnormal.
            aBytes[i] = static_cast<unsigned char>((aBytes[i] | 0x04U) & 0xBFU);
    return aBytes;
}

Bytes readBack(Texture const& texture, Texture::Format format, Texture::Type type, std::size_t nPixelBytes,
               int level = 0) {
    auto const nLevel = static_cast<unsigned>(level);
    Bytes aRead(texture.width(nLevel) * texture.height(nLevel) * nPixelBytes);
    glBindTexture(texture.target(), texture.objectID());
    dynamic_cast<OGL::Texture2 const&>(texture).getPixelData(aRead.data(), level, format, type, 1);
    glBindTexture(texture.target(), 0);
    return aRead;
}

class TextureUploadTest : public ORVO::Test::GLRuntimeTest {
protected:
    /// A grey texture of zeros.
    static std::unique_ptr<OGL::Texture2D> grey(std::size_t width, std::size_t height) {
        Bytes aZero(width * height, 0);
        return std::make_unique<OGL::Texture2D>(Texture::INTERNAL_FORMAT_LUMINANCE8, width, height, false,
                                                aZero.data());
    }
    static Bytes read(Texture const& texture, int level = 0) {
        return readBack(texture, eGrey, eByte, 1, level);
    }
    static void withoutBuffers() {
        OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT, false);
        OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT, false);
    }
    /// Bands since some other number of them.
    static std::uint64_t bands() { return GLHooks::calls("glMapBuffer"); }
};

struct FormatRow {
    char const* pName;
    ImageGPU::tePixelFormat eImage;
    Texture::Format eFormat;
    Texture::Type eType;
    std::size_t nChannels;
    std::size_t nPixelBytes;
};

constexpr FormatRow aRows[] = {
    {"RGBA8", ImageGPU::PIXEL_FORMAT_RGBA8, eRGBA, eByte, 4, 4},
    {"BGRA8", ImageGPU::PIXEL_FORMAT_RGBA8, Texture::FORMAT_BGRA, eByte, 4, 4},
    {"RGBA16", ImageGPU::PIXEL_FORMAT_RGBA16, eRGBA, Texture::TYPE_UNSIGNED_SHORT, 4, 8},
    {"RGBA16F", ImageGPU::PIXEL_FORMAT_RGBA16F, eRGBA, Texture::TYPE_HALF_FLOAT, 4, 8},
    {"RGBA32F", ImageGPU::PIXEL_FORMAT_RGBA32F, eRGBA, Texture::TYPE_FLOAT, 4, 16},
    {"RGB8", ImageGPU::PIXEL_FORMAT_RGB8, Texture::FORMAT_RGB, eByte, 3, 3},
    {"BGR8", ImageGPU::PIXEL_FORMAT_RGB8, Texture::FORMAT_BGR, eByte, 3, 3},
    {"RGB16", ImageGPU::PIXEL_FORMAT_RGB16, Texture::FORMAT_RGB, Texture::TYPE_UNSIGNED_SHORT, 3, 6},
    {"RGB16F", ImageGPU::PIXEL_FORMAT_RGB16F, Texture::FORMAT_RGB, Texture::TYPE_HALF_FLOAT, 3, 6},
    {"RGB32F", ImageGPU::PIXEL_FORMAT_RGB32F, Texture::FORMAT_RGB, Texture::TYPE_FLOAT, 3, 12},
    {"LUMINANCE8", ImageGPU::PIXEL_FORMAT_LUMINANCE8, eGrey, eByte, 1, 1},
    {"LUMINANCE16", ImageGPU::PIXEL_FORMAT_LUMINANCE16, eGrey, Texture::TYPE_UNSIGNED_SHORT, 1, 2},
    {"LUMINANCE16F", ImageGPU::PIXEL_FORMAT_LUMINANCE16F, eGrey, Texture::TYPE_HALF_FLOAT, 1, 2},
    {"LUMINANCE32F", ImageGPU::PIXEL_FORMAT_LUMINANCE32F, eGrey, Texture::TYPE_FLOAT, 1, 4},
    {"LUMINANCE_ALPHA8", ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, Texture::FORMAT_LUMINANCE_ALPHA, eByte, 2,
     2},
    {"LUMINANCE_ALPHA16F", ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F, Texture::FORMAT_LUMINANCE_ALPHA,
     Texture::TYPE_HALF_FLOAT, 2, 4},
    {"LUMINANCE_ALPHA32F", ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, Texture::FORMAT_LUMINANCE_ALPHA,
     Texture::TYPE_FLOAT, 2, 8},
};

class TextureUploadFormat : public TextureUploadTest, public testing::WithParamInterface<FormatRow> {
protected:
    /// Up and down again.
    static void roundTrip() {
        FormatRow const& row = GetParam();
        constexpr int nWidth = 7, nHeight = 5;
        ImageGPU image({{3, -2}, {nWidth, nHeight}}, row.eImage, {1.0F, 1.0F}, true);
        Bytes const aPixels = randomPixels(nWidth * nHeight * row.nChannels, row.eType);
        TextureUpload upload;
        upload.asyncUpload(image.texture(), 0, {{0, 0}, {nWidth, nHeight}}, row.eFormat, row.eType,
                           aPixels.data(), 0);
        EXPECT_EQ(aPixels, readBack(*image.texture(), row.eFormat, row.eType, row.nPixelBytes));
    }
};

TEST_P(TextureUploadFormat, ComesDownAgainBitForBit) { roundTrip(); }

TEST_P(TextureUploadFormat, ComesDownAgainBitForBitWithoutBuffers) {
    withoutBuffers();
    std::uint64_t const nBands = bands();
    roundTrip();
    EXPECT_EQ(nBands, bands());
}

std::string rowName(testing::TestParamInfo<FormatRow> const& row) { return row.param.pName; }

INSTANTIATE_TEST_SUITE_P(, TextureUploadFormat, testing::ValuesIn(aRows), rowName);

TEST_F(TextureUploadTest, UploadsARectangleInside) {
    auto const pTexture = grey(4, 3);
    Bytes const aPixels{1, 2, 3, 4};
    TextureUpload upload;
    upload.asyncUpload(pTexture.get(), 0, {{2, 1}, {2, 2}}, eGrey, eByte, aPixels.data(), 0);
    EXPECT_EQ((Bytes{0, 0, 0, 0, 0, 0, 1, 2, 0, 0, 3, 4}), read(*pTexture));
}

TEST_F(TextureUploadTest, HonoursTheRowLengthOnBothPaths) {
    for (bool const bBuffers : {true, false}) {
        if (!bBuffers)
            withoutBuffers();
        auto const pTexture = grey(3, 2);
        Bytes const aPixels{1, 2, 3, 90, 91, 4, 5, 6};
        TextureUpload upload;
        upload.asyncUpload(pTexture.get(), 0, {{0, 0}, {3, 2}}, eGrey, eByte, aPixels.data(), 5);
        EXPECT_EQ((Bytes{1, 2, 3, 4, 5, 6}), read(*pTexture)) << bBuffers;
        // Rows as long as the rectangle is wide.
        upload.asyncUpload(pTexture.get(), 0, {{0, 0}, {3, 2}}, eGrey, eByte, aPixels.data(), 3);
        EXPECT_EQ((Bytes{1, 2, 3, 90, 91, 4}), read(*pTexture)) << bBuffers;
    }
}

TEST_F(TextureUploadTest, UploadsALevelAndARectangleTexture) {
    OGL::Texture2D mipmapped(Texture::INTERNAL_FORMAT_LUMINANCE8, 8, 4, true, nullptr);
    Bytes const aPixels = randomBytes(8);
    TextureUpload upload;
    upload.asyncUpload(&mipmapped, 1, {{0, 0}, {4, 2}}, eGrey, eByte, aPixels.data(), 0);
    EXPECT_EQ(aPixels, read(mipmapped, 1));
    OGL::TextureRECT rectangle(Texture::INTERNAL_FORMAT_LUMINANCE8, 4, 2, nullptr);
    upload.asyncUpload(&rectangle, 0, {{0, 0}, {4, 2}}, eGrey, eByte, aPixels.data(), 0);
    EXPECT_EQ(aPixels, read(rectangle));
}

TEST_F(TextureUploadTest, CutsTheImageIntoBands) {
    struct Row {
        int nHeight;
        std::uint64_t nBands;
    };
    // Rows of 4096 bytes: 1024 of them are 4 MiB.
    for (Row const& row : {Row{1, 1}, Row{1023, 1}, Row{1024, 1}, Row{1025, 2}, Row{2048, 2}, Row{2049, 3}}) {
        auto const nHeight = static_cast<std::size_t>(row.nHeight);
        OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA8, 1024, nHeight, false, nullptr);
        Bytes const aPixels = randomBytes(4096 * nHeight);
        std::uint64_t const nBefore = bands();
        TextureUpload upload;
        upload.asyncUpload(&texture, 0, {{0, 0}, {1024, row.nHeight}}, eRGBA, eByte, aPixels.data(), 0);
        EXPECT_EQ(row.nBands, bands() - nBefore) << row.nHeight;
        EXPECT_TRUE(aPixels == readBack(texture, eRGBA, eByte, 4)) << row.nHeight;
    }
}

TEST_F(TextureUploadTest, CutsRowsThatLieApartIntoBands) {
    // 1000 rows of 5004 bytes each: 838 of them fit into 4 MiB.
    constexpr int nWidth = 1251, nHeight = 1000;
    constexpr unsigned nRowLength = 1300;
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA8, nWidth + 2, nHeight + 1, false, nullptr);
    Bytes const aPixels = randomBytes(std::size_t{nRowLength} * nHeight * 4);
    std::uint64_t const nBefore = bands();
    TextureUpload upload;
    upload.asyncUpload(&texture, 0, {{2, 1}, {nWidth, nHeight}}, eRGBA, eByte, aPixels.data(), nRowLength);
    EXPECT_EQ(2U, bands() - nBefore);
    Bytes const aRead = readBack(texture, eRGBA, eByte, 4);
    for (std::size_t row = 0; row < nHeight; ++row)
        ASSERT_EQ(0, std::memcmp(&aPixels[row * nRowLength * 4], &aRead[((row + 1) * (nWidth + 2) + 2) * 4],
                                 std::size_t{nWidth} * 4))
            << row;
}

TEST(TextureUploadBands, HoldFourMebibytesOrOneRow) {
    EXPECT_EQ(4194304U, TextureUpload::rowsPerBand(1));
    EXPECT_EQ(1398101U, TextureUpload::rowsPerBand(3));
    EXPECT_EQ(1024U, TextureUpload::rowsPerBand(4096));
    EXPECT_EQ(2U, TextureUpload::rowsPerBand(2097152));
    EXPECT_EQ(1U, TextureUpload::rowsPerBand(2097153));
    EXPECT_EQ(1U, TextureUpload::rowsPerBand(4194304));
    EXPECT_EQ(1U, TextureUpload::rowsPerBand(4194305));
    EXPECT_EQ(1U, TextureUpload::rowsPerBand(std::size_t{1} << 40));
}

TEST_F(TextureUploadTest, UsesItsQueriesInTurn) {
    EXPECT_EQ(16U, TextureUpload::nQueryObject_);
    EXPECT_EQ(4U, TextureUpload::nClientTex_);
    auto const pTexture = grey(3, 2);
    TextureUpload upload;
    for (unsigned i = 0; i < 40; ++i) {
        Bytes const aPixels = randomBytes(6, i);
        upload.asyncUpload(pTexture.get(), 0, {{0, 0}, {3, 2}}, eGrey, eByte, aPixels.data(), 0);
        ASSERT_EQ(aPixels, read(*pTexture)) << i;
    }
}

TEST_F(TextureUploadTest, DoesNothingWithoutPixels) {
    TextureUpload upload;
    auto const pTexture = grey(3, 2);
    host().release(); // no call to OpenGL, and no pool
    upload.asyncUpload(pTexture.get(), 0, {{0, 0}, {3, 0}}, eGrey, eByte, nullptr, 0);
    upload.asyncUpload(pTexture.get(), 0, {{0, 0}, {0, 2}}, eGrey, eByte, nullptr, 0);
    upload.asyncUpload(nullptr, 5, {{-3, 8}, {0, 0}}, eGrey, Texture::TYPE_INT, nullptr, 0);
    upload.asyncUpload(nullptr, 0, PositionExtentInPixelSpace(), eGrey, eByte, nullptr, 0);
    host().makeCurrent();
}

TEST_F(TextureUploadTest, TakesNoBufferWithoutEitherExtension) {
    auto const pTexture = grey(3, 2);
    Bytes const aPixels = randomBytes(6);
    withoutBuffers();
    auto const before = GLHooks::objects();
    {
        TextureUpload upload;
        upload.asyncUpload(pTexture.get(), 0, {{0, 0}, {3, 2}}, eGrey, eByte, aPixels.data(), 0);
        EXPECT_EQ(before, GLHooks::objects());
    }
    EXPECT_EQ(aPixels, read(*pTexture));
}

TEST_F(TextureUploadTest, TakesABufferWithEitherExtension) {
    for (auto const eExtension :
         {OGL::EXTENSION_ARB_PIXEL_BUFFER_OBJECT, OGL::EXTENSION_EXT_PIXEL_BUFFER_OBJECT}) {
        withoutBuffers();
        OGL::ExtensionManager::Instance()->overrideSupport(eExtension, true);
        auto const pTexture = grey(3, 2);
        Bytes const aPixels = randomBytes(6);
        std::uint64_t const nBefore = bands();
        TextureUpload upload;
        upload.asyncUpload(pTexture.get(), 0, {{0, 0}, {3, 2}}, eGrey, eByte, aPixels.data(), 0);
        EXPECT_EQ(1U, bands() - nBefore) << eExtension;
        EXPECT_EQ(aPixels, read(*pTexture));
    }
}

TEST_F(TextureUploadTest, KnowsTheSizesOfTypes) {
    auto const pTexture = grey(2, 1);
    Bytes const aPixels(64, 0);
    TextureUpload upload;
    PositionExtentInPixelSpace const all({0, 0}, {2, 1});
    struct Row {
        int nType;
        char const* pName;
    };
    for (Row const& row :
         {Row{2, "GL_BITMAP"}, Row{5, "GL_INT"}, Row{6, "GL_UNSIGNED_INT"}, Row{8, "GL_UNSIGNED_BYTE_3_3_2"},
          Row{10, "GL_UNSIGNED_SHORT_5_6_5"}, Row{15, "GL_UNSIGNED_SHORT_1_5_5_5_REV"},
          Row{18, "GL_UNSIGNED_INT_10_10_10_2"}, Row{19, "GL_UNSIGNED_INT_2_10_10_10_REV"},
          Row{21, "0x00000015"}, Row{-1, "0xFFFFFFFF"}})
        for (bool const bBuffers : {true, false}) {
            if (!bBuffers)
                withoutBuffers();
            ORVO_EXPECT_INTERNAL(upload.asyncUpload(pTexture.get(), 0, all, eGrey,
                                                    static_cast<Texture::Type>(row.nType), aPixels.data(), 0),
                                 std::string("pixelDataSize: Unknown type ") + row.pName);
            OGL::ExtensionManager::Instance()->clearOverrides();
        }
    for (auto const eType : {Texture::TYPE_UNSIGNED_BYTE, Texture::TYPE_BYTE, Texture::TYPE_UNSIGNED_SHORT,
                             Texture::TYPE_SHORT, Texture::TYPE_HALF_FLOAT, Texture::TYPE_FLOAT})
        upload.asyncUpload(pTexture.get(), 0, all, eGrey, eType, aPixels.data(), 0);
    ORVO_EXPECT_OGL(upload.asyncUpload(pTexture.get(), 0, all, static_cast<Texture::Format>(12), eByte,
                                       aPixels.data(), 0),
                    "Unknown format 12");
}

TEST_F(TextureUploadTest, CountsTheTypesOfWholePixelsAsOneByteAChannel) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA8, 2, 1, false, nullptr);
    Bytes const aPixels{1, 2, 3, 4, 5, 6, 7, 8};
    TextureUpload upload;
    upload.asyncUpload(&texture, 0, {{0, 0}, {2, 1}}, eRGBA, Texture::TYPE_UNSIGNED_INT_8_8_8_8_REV,
                       aPixels.data(), 0);
    EXPECT_EQ(aPixels, readBack(texture, eRGBA, eByte, 4));
    upload.asyncUpload(&texture, 0, {{0, 0}, {2, 1}}, eRGBA, Texture::TYPE_UNSIGNED_INT_8_8_8_8,
                       aPixels.data(), 0);
    EXPECT_EQ((Bytes{4, 3, 2, 1, 8, 7, 6, 5}), readBack(texture, eRGBA, eByte, 4));
}

TEST_F(TextureUploadTest, RefusesShortRows) {
    auto const pTexture = grey(4, 2);
    Bytes const aPixels = randomBytes(8);
    std::uint64_t const nBefore = bands();
    TextureUpload upload;
    ORVO_EXPECT_INTERNAL(
        upload.asyncUpload(pTexture.get(), 0, {{0, 0}, {4, 2}}, eGrey, eByte, aPixels.data(), 3),
        "srcWidth >= imageWidth");
    EXPECT_EQ(nBefore, bands());
    EXPECT_EQ(Bytes(8, 0), read(*pTexture));
}

TEST_F(TextureUploadTest, RefusesWhatIsNotThere) {
    auto const pTexture = grey(4, 3);
    Bytes const aPixels = randomBytes(64);
    TextureUpload upload;
    auto const tryAt = [&](PositionExtentInPixelSpace const& rect, int level = 0) {
        upload.asyncUpload(pTexture.get(), level, rect, eGrey, eByte, aPixels.data(), 0);
    };
    for (bool const bBuffers : {true, false}) {
        if (!bBuffers)
            withoutBuffers();
        for (PositionExtentInPixelSpace const& rect :
             {PositionExtentInPixelSpace({-1, 0}, {1, 1}), PositionExtentInPixelSpace({0, -1}, {1, 1}),
              PositionExtentInPixelSpace({4, 0}, {1, 1}), PositionExtentInPixelSpace({0, 3}, {1, 1}),
              PositionExtentInPixelSpace({0, 0}, {5, 1}), PositionExtentInPixelSpace({0, 0}, {1, 4}),
              PositionExtentInPixelSpace({0, 0}, {-1, 1}), PositionExtentInPixelSpace({0, 0}, {1, -1}),
              PositionExtentInPixelSpace({INT_MAX, INT_MAX}, {INT_MAX, INT_MAX})})
            ORVO_EXPECT_PARAMETER(tryAt(rect), pOutside);
        for (int const level : {-1, 1, INT_MAX})
            ORVO_EXPECT_PARAMETER(tryAt({{0, 0}, {1, 1}}, level), "The level does not exist");
        PositionExtentInPixelSpace const all({0, 0}, {4, 3});
        ORVO_EXPECT_INTERNAL(upload.asyncUpload(nullptr, 0, all, eGrey, eByte, aPixels.data(), 0),
                             "Enforce pTexture != NULL");
        ORVO_EXPECT_INTERNAL(upload.asyncUpload(pTexture.get(), 0, all, eGrey, eByte, nullptr, 0),
                             "Enforce pPixels != NULL");
    }
    EXPECT_EQ(Bytes(12, 0), read(*pTexture));
    host().release();
    ORVO_EXPECT_OGL(tryAt({{0, 0}, {1, 1}}), "No OpenGL context is current");
    host().makeCurrent();
}

TEST_F(TextureUploadTest, UploadsFromABuffer) {
    auto const pTexture = grey(3, 2);
    Bytes const aPixels{1, 2, 3, 90, 4, 5, 6};
    OGL::Buffer buffer(7, OGL::Buffer::TYPE_PIXEL_UNPACK, OGL::Buffer::USAGE_STREAM_DRAW, aPixels.data());
    TextureUpload::bufferUpload(pTexture.get(), &buffer, 0, {{0, 0}, {3, 2}}, eGrey, eByte, 4);
    EXPECT_EQ((Bytes{1, 2, 3, 4, 5, 6}), read(*pTexture));
    TextureUpload::bufferUpload(pTexture.get(), &buffer, 0, {{1, 0}, {2, 2}}, eGrey, eByte, 0);
    EXPECT_EQ((Bytes{1, 1, 2, 4, 3, 90}), read(*pTexture));
    ORVO_EXPECT_INTERNAL(TextureUpload::bufferUpload(nullptr, &buffer, 0, {{0, 0}, {3, 2}}, eGrey, eByte, 0),
                         "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(
        TextureUpload::bufferUpload(pTexture.get(), nullptr, 0, {{0, 0}, {3, 2}}, eGrey, eByte, 0),
        "Enforce pBuffer != NULL");
    ORVO_EXPECT_PARAMETER(
        TextureUpload::bufferUpload(pTexture.get(), &buffer, 0, {{1, 0}, {3, 2}}, eGrey, eByte, 0), pOutside);
}

TEST_F(TextureUploadTest, ExpandsBytesToFloats) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA32F, 3, 2, false, nullptr);
    Bytes aPixels(2 * 4 * 4);
    for (std::size_t i = 0; i < aPixels.size(); ++i)
        aPixels[i] = static_cast<unsigned char>(i * 8 + 7);
    TextureUpload upload;
    std::vector<float> const aZero(24, 0.0F);
    upload.asyncUpload(&texture, 0, {{0, 0}, {3, 2}}, eRGBA, Texture::TYPE_FLOAT, aZero.data(), 0);
    upload.intelUpload(&texture, 0, {{1, 0}, {2, 2}}, aPixels.data(), 4);
    Bytes const aRead = readBack(texture, eRGBA, Texture::TYPE_FLOAT, 16);
    for (std::size_t row = 0; row < 2; ++row)
        for (std::size_t column = 0; column < 3; ++column)
            for (std::size_t channel = 0; channel < 4; ++channel) {
                float value = -1.0F;
                std::memcpy(&value, &aRead[((row * 3 + column) * 4 + channel) * sizeof(float)],
                            sizeof(float));
                float const expected =
                    column == 0
                        ? 0.0F
                        : static_cast<float>(aPixels[(row * 4 + column - 1) * 4 + channel]) * 0.003921568859F;
                EXPECT_EQ(expected, value) << row << ' ' << column << ' ' << channel;
            }
}

TEST_F(TextureUploadTest, ExpandsBytesIntoOneFormatAlone) {
    auto const pGrey = grey(3, 2);
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA32F, 3, 2, false, nullptr);
    Bytes const aPixels(64, 1);
    TextureUpload upload;
    PositionExtentInPixelSpace const all({0, 0}, {3, 2});
    ORVO_EXPECT_INTERNAL(upload.intelUpload(pGrey.get(), 0, all, aPixels.data(), 0),
                         "pTexture->format() == OGL::Texture::INTERNAL_FORMAT_RGBA32F");
    ORVO_EXPECT_INTERNAL(upload.intelUpload(nullptr, 0, all, aPixels.data(), 0), "Enforce pTexture != NULL");
    ORVO_EXPECT_INTERNAL(upload.intelUpload(&texture, 0, all, nullptr, 0), "Enforce pPixels != NULL");
    ORVO_EXPECT_INTERNAL(upload.intelUpload(&texture, 0, all, aPixels.data(), 2), "srcWidth >= imageWidth");
    ORVO_EXPECT_PARAMETER(upload.intelUpload(&texture, 0, {{1, 0}, {3, 2}}, aPixels.data(), 0), pOutside);
    ORVO_EXPECT_PARAMETER(upload.intelUpload(&texture, 1, all, aPixels.data(), 0),
                          "The level does not exist");
    upload.intelUpload(&texture, 0, {{0, 0}, {0, 2}}, nullptr, 0);
    host().release();
    ORVO_EXPECT_OGL(upload.intelUpload(&texture, 0, all, aPixels.data(), 0), "No OpenGL context is current");
    host().makeCurrent();
}

} // namespace
