#include "orvo/image_flow/filters/FormatEnumConversionUtil.h"

#include "tests/support/Expect.h"

#include <epoxy/gl.h>

namespace ORVO {

namespace {

constexpr char const* pRefused = "Not implemented: pixelFormat in CPU2GPU::internaProcess()";
constexpr char const* pUndefined = "!\"PIXEL_FORMAT_UNDEFINED\"";

struct Row {
    ImageCPU::tePixelFormat eFrom;
    ImageGPU::tePixelFormat eTo;
    int nFormat; ///< as numbered by the object layer
    int nType;
};

constexpr Row aRows[] = {
    {ImageCPU::PIXEL_FORMAT_BGR8, ImageGPU::PIXEL_FORMAT_RGB8, 7, 0},
    {ImageCPU::PIXEL_FORMAT_BGRA8, ImageGPU::PIXEL_FORMAT_RGBA8, 9, 0},
    {ImageCPU::PIXEL_FORMAT_RGB8, ImageGPU::PIXEL_FORMAT_RGB8, 6, 0},
    {ImageCPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA8, 8, 0},
    {ImageCPU::PIXEL_FORMAT_RGBA16, ImageGPU::PIXEL_FORMAT_RGBA16F, 8, 20},
    {ImageCPU::PIXEL_FORMAT_RGBA16F, ImageGPU::PIXEL_FORMAT_RGBA16F, 8, 20},
    {ImageCPU::PIXEL_FORMAT_RGB32F, ImageGPU::PIXEL_FORMAT_RGB32F, 6, 7},
    {ImageCPU::PIXEL_FORMAT_RGBA32F, ImageGPU::PIXEL_FORMAT_RGBA32F, 8, 7},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE8, ImageGPU::PIXEL_FORMAT_LUMINANCE8, 10, 0},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, ImageGPU::PIXEL_FORMAT_LUMINANCE32F, 10, 7},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, 11, 0},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 11, 7},
    {ImageCPU::PIXEL_FORMAT_RGB16F, ImageGPU::PIXEL_FORMAT_RGB16F, 6, 20},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE16F, ImageGPU::PIXEL_FORMAT_LUMINANCE16F, 10, 20},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F, 11, 20}};

TEST(FormatEnumConversionUtilTest, mapsEveryFormat) {
    for (Row const& row : aRows) {
        ImageGPU::tePixelFormat formatGPU = ImageGPU::PIXEL_FORMAT_UNDEFINED;
        OGL::Texture::Format format = OGL::Texture::FORMAT_DEPTH;
        OGL::Texture::Type type = OGL::Texture::TYPE_BITMAP;
        MapImageCPUToGPU(row.eFrom, formatGPU, format, type);
        EXPECT_EQ(row.eTo, formatGPU) << row.eFrom;
        EXPECT_EQ(row.nFormat, int(format)) << row.eFrom;
        EXPECT_EQ(row.nType, int(type)) << row.eFrom;
    }
}

struct TokenRow {
    ImageCPU::tePixelFormat eFrom;
    ImageGPU::tePixelFormat eTo;
    unsigned nFormat;
    unsigned nType;
};

constexpr TokenRow aTokenRows[] = {
    {ImageCPU::PIXEL_FORMAT_BGR8, ImageGPU::PIXEL_FORMAT_RGB8, GL_BGR, GL_UNSIGNED_BYTE},
    {ImageCPU::PIXEL_FORMAT_BGRA8, ImageGPU::PIXEL_FORMAT_RGBA8, GL_BGRA, GL_UNSIGNED_BYTE},
    {ImageCPU::PIXEL_FORMAT_RGB8, ImageGPU::PIXEL_FORMAT_RGB8, GL_RGB, GL_UNSIGNED_BYTE},
    {ImageCPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA8, GL_RGBA, GL_UNSIGNED_BYTE},
    {ImageCPU::PIXEL_FORMAT_RGB16, ImageGPU::PIXEL_FORMAT_RGB16F, GL_RGB, GL_HALF_FLOAT},
    {ImageCPU::PIXEL_FORMAT_RGBA16, ImageGPU::PIXEL_FORMAT_RGBA16F, GL_RGBA, GL_HALF_FLOAT},
    {ImageCPU::PIXEL_FORMAT_RGB32F, ImageGPU::PIXEL_FORMAT_RGB32F, GL_RGB, GL_FLOAT},
    {ImageCPU::PIXEL_FORMAT_RGBA32F, ImageGPU::PIXEL_FORMAT_RGBA32F, GL_RGBA, GL_FLOAT},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE8, ImageGPU::PIXEL_FORMAT_LUMINANCE8, GL_LUMINANCE, GL_UNSIGNED_BYTE},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE16, ImageGPU::PIXEL_FORMAT_LUMINANCE16F, GL_LUMINANCE, GL_HALF_FLOAT},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, ImageGPU::PIXEL_FORMAT_LUMINANCE32F, GL_LUMINANCE, GL_FLOAT},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, GL_LUMINANCE_ALPHA,
     GL_UNSIGNED_BYTE},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F, GL_LUMINANCE_ALPHA,
     GL_HALF_FLOAT},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, GL_LUMINANCE_ALPHA,
     GL_FLOAT}};

TEST(FormatEnumConversionUtilTest, mapsTheFirstFourteenToTokens) {
    for (TokenRow const& row : aTokenRows) {
        ImageGPU::tePixelFormat formatGPU = ImageGPU::PIXEL_FORMAT_UNDEFINED;
        unsigned format = 0;
        unsigned type = 0;
        MapImageCPUToGPU(row.eFrom, formatGPU, format, type);
        EXPECT_EQ(row.eTo, formatGPU) << row.eFrom;
        EXPECT_EQ(row.nFormat, format) << row.eFrom;
        EXPECT_EQ(row.nType, type) << row.eFrom;
    }
}

TEST(FormatEnumConversionUtilTest, refusesTheRestAndLeavesTheResultsAlone) {
    ImageGPU::tePixelFormat formatGPU = ImageGPU::PIXEL_FORMAT_RGB16;
    OGL::Texture::Format format = OGL::Texture::FORMAT_DEPTH;
    OGL::Texture::Type type = OGL::Texture::TYPE_BITMAP;
    for (int const nFrom : {5, 10, 13, 0, -1, 20, 1000})
        ORVO_EXPECT_INTERNAL(
            MapImageCPUToGPU(static_cast<ImageCPU::tePixelFormat>(nFrom), formatGPU, format, type), pRefused);
    ORVO_EXPECT_INTERNAL(MapImageCPUToGPU(ImageCPU::PIXEL_FORMAT_UNDEFINED, formatGPU, format, type),
                         pUndefined);
    EXPECT_EQ(OGL::Texture::FORMAT_DEPTH, format);
    EXPECT_EQ(OGL::Texture::TYPE_BITMAP, type);

    unsigned nFormat = 7;
    unsigned nType = 8;
    for (int const nFrom : {15, 16, 17, 18, 0, -1, 20, 1000})
        ORVO_EXPECT_INTERNAL(
            MapImageCPUToGPU(static_cast<ImageCPU::tePixelFormat>(nFrom), formatGPU, nFormat, nType),
            pRefused);
    ORVO_EXPECT_INTERNAL(MapImageCPUToGPU(ImageCPU::PIXEL_FORMAT_UNDEFINED, formatGPU, nFormat, nType),
                         pUndefined);
    EXPECT_EQ(7u, nFormat);
    EXPECT_EQ(8u, nType);
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGB16, formatGPU);
}

} // namespace

} // namespace ORVO
