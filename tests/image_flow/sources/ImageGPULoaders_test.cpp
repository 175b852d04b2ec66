// Raw pixels that a source on the GPU loads into textures.

#include "orvo/image_flow/sources/ImageGPUInput.h"

#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/ExtensionManager.h"
#include "tests/image_flow/support/GPURoads.h"

#include <climits>

namespace ORVO {

namespace {

using Test::bytesOf;
using Test::GLHooks;
using Test::pixels;
using Test::readTexels;
using Test::textureImage;

using Bytes = std::vector<unsigned char>;
using Hint = ImageFilter::teOutputPrecisionHint;

class ImageGPULoadersTest : public Test::GLFlowTest {};

/// With what subclasses reach made public.
class Source : public ImageGPUInput {
public:
    using ImageGPUInput::ConvertToPixelFormatGL;
    using ImageGPUInput::recommendedImageGPUPixelFormat;
};

/// The loaders under one interface.
using Loader = void (*)(ImageGPUInput&, void const*, PositionExtentInPixelSpace const&,
                        PixelExtentInWorldSpace const&, tePixelFormat, unsigned);

template <typename T, void (ImageGPUInput::*pLoad)(T const*, PositionExtentInPixelSpace const&,
                                                   PixelExtentInWorldSpace const&, tePixelFormat, unsigned)>
void load(ImageGPUInput& source, void const* pPixels, PositionExtentInPixelSpace const& region,
          PixelExtentInWorldSpace const& pixelExtent, tePixelFormat layout, unsigned rowLength) {
    (source.*pLoad)(static_cast<T const*>(pPixels), region, pixelExtent, layout, rowLength);
}

struct Row {
    char const* pName;
    Loader pfnLoad;
    unsigned nType;
    std::size_t nBytes;
    ImageGPU::tePixelFormat eDefault;
    bool bDirect;
};

using In = ImageGPUInput;

constexpr Row aRows[] = {
    {"8 bits", load<unsigned char, &In::load8BitUnsignedImageData>, GL_UNSIGNED_BYTE, 1,
     ImageGPU::PIXEL_FORMAT_RGBA8, false},
    {"16 bits", load<unsigned short, &In::load16BitUnsignedImageData>, GL_UNSIGNED_SHORT, 2,
     ImageGPU::PIXEL_FORMAT_RGBA16F, false},
    {"16 bit floats", load<unsigned short, &In::load16BitFloatImageData>, GL_HALF_FLOAT, 2,
     ImageGPU::PIXEL_FORMAT_RGBA16F, false},
    {"32 bit floats", load<float, &In::load32BitFloatImageData>, GL_FLOAT, 4, ImageGPU::PIXEL_FORMAT_RGBA32F,
     false},
    {"8 bits at once", load<unsigned char, &In::load8BitUnsignedImageData_DEPRECATED_2_0>, GL_UNSIGNED_BYTE,
     1, ImageGPU::PIXEL_FORMAT_RGBA8, true},
    {"16 bits at once", load<unsigned short, &In::load16BitUnsignedImageData_DEPRECATED_2_0>,
     GL_UNSIGNED_SHORT, 2, ImageGPU::PIXEL_FORMAT_RGBA16F, true},
    {"16 bit floats at once", load<unsigned short, &In::load16BitFloatImageData_DEPRECATED_2_0>,
     GL_HALF_FLOAT, 2, ImageGPU::PIXEL_FORMAT_RGBA16F, true},
    {"32 bit floats at once", load<float, &In::load32BitFloatImageData_DEPRECATED_2_0>, GL_FLOAT, 4,
     ImageGPU::PIXEL_FORMAT_RGBA32F, true}};

struct Layout {
    tePixelFormat eLayout;
    std::size_t nChannels;
    int aSource[4]; ///< the channel in memory of red, green, blue and alpha; -1 is 1.0
};

constexpr Layout aLayouts[] = {{PIXEL_LAYOUT_BGRA, 4, {2, 1, 0, 3}},
                               {PIXEL_LAYOUT_RGBA, 4, {0, 1, 2, 3}},
                               {PIXEL_LAYOUT_RGB, 3, {0, 1, 2, -1}},
                               {PIXEL_LAYOUT_LUMINANCE, 1, {0, 0, 0, -1}}};

/// A channel in memory as OpenGL reads it.
float valueOf(Bytes const& aBytes, std::size_t iChannel, unsigned nType) {
    if (nType == GL_UNSIGNED_BYTE)
        return float(aBytes[iChannel]) / 255.0f;
    if (nType == GL_FLOAT) {
        float value;
        std::memcpy(&value, &aBytes[iChannel * 4], 4);
        return value;
    }
    std::uint16_t bits;
    std::memcpy(&bits, &aBytes[iChannel * 2], 2);
    if (nType == GL_UNSIGNED_SHORT)
        return float(bits) / 65535.0f;
    return float(half::fromBits(bits));
}

TEST_F(ImageGPULoadersTest, everyLoaderTakesEveryLayout) {
    PixelExtentInWorldSpace const pixelExtent(3, 0.25f);
    for (Row const& row : aRows) {
        for (Layout const& layout : aLayouts) {
            for (unsigned const rowLength : {0u, 5u, 8u}) {
                SCOPED_TRACE(testing::Message()
                             << row.pName << ", layout " << layout.eLayout << ", " << rowLength);
                std::size_t const nPitch = rowLength == 0 ? 5 : rowLength;
                Bytes const aMemory = ORVO::Test::channelBytes(row.nType, nPitch * 3 * layout.nChannels);
                ImageGPUInput source;
                row.pfnLoad(source, aMemory.data(), pixels(-2, 7, 5, 3), pixelExtent, layout.eLayout,
                            rowLength);
                ImageGPU const* const pImage = source.getImageGPU();
                ASSERT_NE(nullptr, pImage);
                EXPECT_EQ(row.eDefault, pImage->pixelFormat());
                EXPECT_EQ(pixels(-2, 7, 5, 3), pImage->positionExtent());
                EXPECT_EQ(pixelExtent, pImage->pixelExtent());
                EXPECT_TRUE(source.hasBufferChanged());
                Bytes const aTexels = readTexels(*pImage, ImageGPU::PIXEL_FORMAT_RGBA32F);
                for (std::size_t i = 0; i < 5 * 3 * 4; ++i) {
                    std::size_t const y = i / 20;
                    std::size_t const x = i / 4 % 5;
                    int const nFrom = layout.aSource[i % 4];
                    float const expected =
                        nFrom < 0 ? 1.0f
                                  : valueOf(aMemory, (y * nPitch + x) * layout.nChannels + std::size_t(nFrom),
                                            row.nType);
                    float value;
                    std::memcpy(&value, &aTexels[i * 4], 4);
                    if (row.nType == GL_UNSIGNED_SHORT)
                        EXPECT_NEAR(expected, value, 0x1p-11) << i; // held as a half
                    else
                        EXPECT_FLOAT_EQ(expected, value) << i;
                }
            }
        }
    }
}

TEST_F(ImageGPULoadersTest, theImageCanBeReleased) {
    Bytes const aMemory(16 * 4, 1);
    ImageGPUInput source;
    source.load8BitUnsignedImageData(aMemory.data(), pixels(0, 0, 4, 4), PixelExtentInWorldSpace(),
                                     PIXEL_LAYOUT_RGBA, 0);
    ImageGPU* const pImage = const_cast<ImageGPU*>(source.getImageGPU());
    for (Row const& row : aRows)
        ORVO_EXPECT_INTERNAL(row.pfnLoad(source, aMemory.data(), pixels(0, 0, 1, 1),
                                         PixelExtentInWorldSpace(), PIXEL_LAYOUT_RGBA, 0),
                             "ImageGPU already set on input");
    ORVO::Test::ImageGPUPtr const upImage(source.releaseImageGPU());
    EXPECT_EQ(pImage, upImage.get());
    source.load8BitUnsignedImageData(aMemory.data(), pixels(0, 0, 4, 4), PixelExtentInWorldSpace(),
                                     PIXEL_LAYOUT_RGBA, 0);
    source.clear();
    source.load8BitUnsignedImageData(aMemory.data(), pixels(0, 0, 4, 4), PixelExtentInWorldSpace(),
                                     PIXEL_LAYOUT_RGBA, 0);
}

TEST_F(ImageGPULoadersTest, theHintDecidesTheTexture) {
    Source source;
    auto const fallback = ImageGPU::PIXEL_FORMAT_RGB16;
    EXPECT_EQ(fallback, source.recommendedImageGPUPixelFormat(fallback));
    source.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGBA8, source.recommendedImageGPUPixelFormat(fallback));
    source.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGBA16F, source.recommendedImageGPUPixelFormat(fallback));
    for (Hint const hint :
         {ImageFilter::OUTPUT_PRECISION_16_BIT_INT, ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT,
          ImageFilter::OUTPUT_PRECISION_UNDEFINED}) {
        source.outputPrecisionHintParameter().setValue(hint);
        ORVO_EXPECT_PARAMETER(source.recommendedImageGPUPixelFormat(fallback),
                              "Invalid output precision hint.");
    }
    float const aPixel[] = {0.5f, 0.25f, 1.0f, 0.0f};
    source.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
    source.load32BitFloatImageData(aPixel, pixels(0, 0, 1, 1), PixelExtentInWorldSpace(), PIXEL_LAYOUT_RGBA,
                                   0);
    ASSERT_NE(nullptr, source.getImageGPU());
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGBA16F, source.getImageGPU()->pixelFormat());
}

TEST_F(ImageGPULoadersTest, layoutsHaveTokens) {
    EXPECT_EQ(unsigned(GL_BGRA), Source::ConvertToPixelFormatGL(PIXEL_LAYOUT_BGRA));
    EXPECT_EQ(unsigned(GL_RGBA), Source::ConvertToPixelFormatGL(PIXEL_LAYOUT_RGBA));
    EXPECT_EQ(unsigned(GL_RGB), Source::ConvertToPixelFormatGL(PIXEL_LAYOUT_RGB));
    EXPECT_EQ(unsigned(GL_LUMINANCE), Source::ConvertToPixelFormatGL(PIXEL_LAYOUT_LUMINANCE));
    for (int const nLayout : {-1, 4, 100})
        ORVO_EXPECT_PARAMETER(Source::ConvertToPixelFormatGL(static_cast<tePixelFormat>(nLayout)),
                              "Invalid pixel format.");
}

TEST_F(ImageGPULoadersTest, badArgumentsAreRefusedAndChangeNothing) {
    float const aPixels[16] = {};
    PixelExtentInWorldSpace const one;
    for (Row const& row : aRows) {
        ImageGPUInput source;
        std::uint64_t const nTextures = GLHooks::calls("glGenTextures");
        ORVO_EXPECT_PARAMETER(row.pfnLoad(source, nullptr, pixels(0, 0, 2, 2), one, PIXEL_LAYOUT_RGBA, 0),
                              "Image has no pixels");
        ORVO_EXPECT_PARAMETER(row.pfnLoad(source, aPixels, pixels(0, 0, -1, 2), one, PIXEL_LAYOUT_RGBA, 0),
                              "Image extent must not be negative");
        ORVO_EXPECT_PARAMETER(row.pfnLoad(source, aPixels, pixels(0, 0, 2, -1), one, PIXEL_LAYOUT_RGBA, 0),
                              "Image extent must not be negative");
        for (unsigned const rowLength : {1u, unsigned(INT_MAX) + 1u})
            ORVO_EXPECT_PARAMETER(
                row.pfnLoad(source, aPixels, pixels(0, 0, 2, 2), one, PIXEL_LAYOUT_RGBA, rowLength),
                "Row length does not fit the width of the image");
        ORVO_EXPECT_PARAMETER(
            row.pfnLoad(source, aPixels, pixels(0, 0, 2, 2), one, static_cast<tePixelFormat>(4), 0),
            "Invalid pixel format.");
        source.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT);
        ORVO_EXPECT_PARAMETER(row.pfnLoad(source, aPixels, pixels(0, 0, 2, 2), one, PIXEL_LAYOUT_RGBA, 0),
                              "Invalid output precision hint.");
        EXPECT_EQ(nullptr, source.getImageGPU());
        EXPECT_FALSE(source.hasBufferChanged());
        EXPECT_EQ(nTextures, GLHooks::calls("glGenTextures"));
    }
}

TEST_F(ImageGPULoadersTest, nothingIsUploadedForARegionWithoutPixels) {
    for (Row const& row : aRows) {
        ImageGPUInput source;
        std::uint64_t const nUploads = GLHooks::calls("glTexSubImage2D");
        row.pfnLoad(source, nullptr, pixels(3, 4, 0, 2), PixelExtentInWorldSpace(), PIXEL_LAYOUT_RGBA, 0);
        ASSERT_NE(nullptr, source.getImageGPU()) << row.pName;
        EXPECT_EQ(pixels(3, 4, 0, 2), source.getImageGPU()->positionExtent());
        EXPECT_EQ(nUploads, GLHooks::calls("glTexSubImage2D"));
    }
}

TEST_F(ImageGPULoadersTest, halfFloatsNeedTheirExtensions) {
    struct Support {
        bool bHalf, bApple, bFloat, bSupported;
    };
    constexpr Support aSupport[] = {{true, true, true, true},   {true, true, false, true},
                                    {true, false, true, true},  {true, false, false, false},
                                    {false, true, true, false}, {false, false, false, false}};
    unsigned short const aPixel[4] = {};
    auto& manager = *OGL::ExtensionManager::Instance();
    for (Support const& support : aSupport) {
        for (Row const& row : aRows) {
            if (row.nType != GL_HALF_FLOAT)
                continue;
            manager.overrideSupport(OGL::EXTENSION_ARB_HALF_FLOAT_PIXEL, support.bHalf);
            manager.overrideSupport(OGL::EXTENSION_APPLE_FLOAT_PIXELS, support.bApple);
            manager.overrideSupport(OGL::EXTENSION_ARB_TEXTURE_FLOAT, support.bFloat);
            ImageGPUInput source;
            auto const run = [&] {
                row.pfnLoad(source, aPixel, pixels(0, 0, 1, 1), PixelExtentInWorldSpace(), PIXEL_LAYOUT_RGBA,
                            0);
            };
            if (support.bSupported) {
                run();
                EXPECT_NE(nullptr, source.getImageGPU());
            } else {
                ORVO_EXPECT_INTERNAL(run(), "load16BitFloatImageData not supported for this graphic card");
                EXPECT_EQ(nullptr, source.getImageGPU());
            }
            manager.clearOverrides();
        }
    }
}

TEST_F(ImageGPULoadersTest, onlyTheNewFormsGoThroughBuffers) {
    Bytes const aMemory(16 * 16, 1);
    for (Row const& row : aRows) {
        TexturePool::Instance()->clearAll();
        ImageGPUInput source;
        std::uint64_t const nBuffers = GLHooks::calls("glMapBuffer");
        row.pfnLoad(source, aMemory.data(), pixels(0, 0, 2, 2), PixelExtentInWorldSpace(), PIXEL_LAYOUT_RGBA,
                    0);
        EXPECT_EQ(row.bDirect, nBuffers == GLHooks::calls("glMapBuffer")) << row.pName;
    }
}

TEST_F(ImageGPULoadersTest, everyCallMayFail) {
    Bytes const aMemory(4 * 16, 1);
    for (Row const& row : aRows) {
        ImageGPUInput source;
        auto const run = [&] {
            source.clear();
            TexturePool::Instance()->clear2DPool();
            row.pfnLoad(source, aMemory.data(), pixels(0, 0, 2, 2), PixelExtentInWorldSpace(),
                        PIXEL_LAYOUT_RGBA, 0);
        };
        auto const check = [&] {
            host().makeCurrent();
            run();
            EXPECT_NE(nullptr, source.getImageGPU());
        };
        ORVO::Test::failEveryCallBeforeThePool(run, check,
                                               {"glGenTextures", "glTexImage2D", "glTexSubImage2D"});
    }
}

} // namespace

} // namespace ORVO
