#include "orvo/image_flow/filters/ConvertFromSIMDOptimized.h"
#include "orvo/image_flow/filters/ConvertToSIMDOptimized.h"

#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"
#include "tests/image_flow/support/FilterRoad.h"
#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <cmath>
#include <cstring>
#include <memory>

namespace ORVO {

namespace {

using Hint = ImageFilter::teOutputPrecisionHint;
using Test::feed;
using Test::FilterRoad;
using Test::pixelAt;
using Test::pixels;
using Test::world;

ImageCPU makeImage(ImageCPU::tePixelFormat format, PositionExtentInPixelSpace const& region,
                   int capacityWidth) {
    return {format, region, PixelExtentInWorldSpace(),
            ExtentInPixelSpace(capacityWidth, region.extent().height())};
}

/// The scale of an integer format: its number for 1.0; 1 for floats.
double whiteOf(ImageCPU::tePixelFormat format) {
    return channelSizeBits(format) == 8 ? 255.0 : channelSizeBits(format) == 16 ? 32768.0 : 1.0;
}

/// Channel `c` (in the order of the memory) of a pixel of any 8, 16 or 32-bit format, on the 0.0 to 1.0
/// scale.
double numberAt(ImageCPU const& image, int x, int y, std::size_t c) {
    std::size_t const nBytes = channelSizeBits(image.pixelFormat()) / 8;
    unsigned char const* const p =
        image.pixels() +
        ((std::size_t(y - image.position().y()) * std::size_t(image.capacityExtent().width()) +
          std::size_t(x - image.position().x())) *
             nChannels(image.pixelFormat()) +
         c) *
            nBytes;
    if (nBytes == 4) {
        float value;
        std::memcpy(&value, p, 4);
        return double(value);
    }
    std::uint16_t value = *p;
    if (nBytes == 2) {
        std::memcpy(&value, p, 2);
    }
    return value / whiteOf(image.pixelFormat());
}

void paint(ImageCPU& image) {
    std::size_t const nBytes = channelSizeBits(image.pixelFormat()) / 8;
    std::size_t const n = std::size_t(image.capacityExtent().width()) *
                          std::size_t(image.capacityExtent().height()) * nChannels(image.pixelFormat());
    for (std::size_t i = 0; i < n; ++i) {
        unsigned char* const p = image.pixels() + i * nBytes;
        if (nBytes == 1) {
            *p = static_cast<unsigned char>(i * 37 % 256);
        } else if (nBytes == 2) {
            auto const value = static_cast<std::uint16_t>(i * 977 % 32769);
            std::memcpy(p, &value, 2);
        } else {
            float const value = float(i % 33) / 32;
            std::memcpy(p, &value, 4);
        }
    }
}

class ConvertSIMDOptimizedTest : public testing::Test {
protected:
    ORVO::Test::ImageFlowLayers oLayers_;
};

TEST_F(ConvertSIMDOptimizedTest, haveNamesAndTargets) {
    ConvertToSIMDOptimized to;
    ConvertFromSIMDOptimized from;
    EXPECT_EQ("ConvertToSIMDOptimized", to.name());
    EXPECT_EQ("ConvertFromSIMDOptimized", from.name());
    for (ImageFilter* pFilter : std::initializer_list<ImageFilter*>{&to, &from}) {
        EXPECT_NE(nullptr, pFilter->imageInput("input"));
        EXPECT_EQ("output", pFilter->imageOutput()->name());
        EXPECT_EQ(ORVO_TARGET_CPU, pFilter->getInputTargetPlatform());
        EXPECT_EQ(ORVO_TARGET_CPU, pFilter->getOutputTargetPlatform());
    }
}

TEST_F(ConvertSIMDOptimizedTest, everyFormatBecomesFloat) {
    for (int format = 1; format <= 14; ++format) {
        auto const eFormat = static_cast<ImageCPU::tePixelFormat>(format);
        SCOPED_TRACE(testing::Message() << eFormat);
        FilterRoad<ConvertToSIMDOptimized> road;
        ImageCPU image = makeImage(eFormat, pixels(-7, 3, 19, 6), 23);
        paint(image);
        ImageCPU const& result = *road.run(image, world(-7, 3, 19, 6));
        EXPECT_EQ(32u, channelSizeBits(result.pixelFormat()));
        ASSERT_EQ(nChannels(eFormat), nChannels(result.pixelFormat()));
        ASSERT_EQ(pixels(-7, 3, 19, 6), result.positionExtent());
        for (int y = 3; y < 9; ++y) {
            for (int x = -7; x < 12; ++x) {
                for (std::size_t c = 0; c < nChannels(eFormat); ++c) {
                    EXPECT_NEAR(numberAt(image, x, y, c), numberAt(result, x, y, c), 1e-6) << x << ", " << y;
                }
            }
        }
    }
}

TEST_F(ConvertSIMDOptimizedTest, halfFloatsAreRefused) {
    FilterRoad<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA16F, pixels(0, 0, 4, 4), 4);
    ORVO_EXPECT_INTERNAL(road.run(image, world(0, 0, 4, 4)),
                         "Pixel format not supported by ORVO in CPU mode");
}

TEST_F(ConvertSIMDOptimizedTest, floatBecomesEveryFormatOfTheHints) {
    for (int hint : {0, 1, 3}) {
        for (ImageCPU::tePixelFormat const format :
             {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F,
              ImageCPU::PIXEL_FORMAT_RGB32F, ImageCPU::PIXEL_FORMAT_RGBA32F}) {
            SCOPED_TRACE(testing::Message() << format << ", hint " << hint);
            FilterRoad<ConvertFromSIMDOptimized> road;
            road.filter().outputPrecisionHintParameter().setValue(static_cast<Hint>(hint));
            ImageCPU image = makeImage(format, pixels(2, -3, 13, 5), 16);
            paint(image);
            ImageCPU const& result = *road.run(image, world(2, -3, 13, 5));
            EXPECT_EQ(hint == 0 ? 8u : hint == 1 ? 16u : 32u, channelSizeBits(result.pixelFormat()));
            ASSERT_EQ(nChannels(format), nChannels(result.pixelFormat()));
            // The first and last few bytes of a row are truncated, the others rounded.
            double const accuracy = hint == 0 ? 1.0 / 255 : hint == 1 ? 0.5 / 32768 : 0.0;
            for (int y = -3; y < 2; ++y) {
                for (int x = 2; x < 15; ++x) {
                    for (std::size_t c = 0; c < nChannels(format); ++c) {
                        EXPECT_NEAR(numberAt(image, x, y, c), numberAt(result, x, y, c), accuracy + 1e-7);
                    }
                }
            }
        }
    }
}

TEST_F(ConvertSIMDOptimizedTest, backAndForthBytesAndWordsStayWhatTheyAre) {
    for (ImageCPU::tePixelFormat const format :
         {ImageCPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_RGBA16}) {
        FilterRoad<ConvertToSIMDOptimized> there;
        ImageCPU image = makeImage(format, pixels(0, 0, 16, 8), 16);
        paint(image);
        ImageCPU simd = makeImage(ImageCPU::PIXEL_FORMAT_RGBA32F, pixels(0, 0, 16, 8), 16);
        there.runInto(image, simd, world(0, 0, 16, 8));
        ASSERT_TRUE(simd.isInSIMDOptimizedFormat());
        FilterRoad<ConvertFromSIMDOptimized> back;
        ImageCPU result = makeImage(format, pixels(0, 0, 16, 8), 16);
        back.runInto(simd, result, world(0, 0, 16, 8));
        EXPECT_EQ(0, std::memcmp(image.pixels(), result.pixels(), 16 * 8 * pixelSizeBytes(format)));
    }
}

TEST_F(ConvertSIMDOptimizedTest, workOnTheComputeRegionAlone) {
    FilterRoad<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(-20, -10, 50, 40), 64);
    paint(image);
    ImageCPU const& result = *road.run(image, world(-13, 4, 6, 9));
    EXPECT_EQ(pixels(-13, 4, 6, 9), result.positionExtent());
    EXPECT_NEAR(numberAt(image, -8, 12, 2), numberAt(result, -8, 12, 2), 1e-6);
    EXPECT_NEAR(numberAt(image, -13, 4, 0), numberAt(result, -13, 4, 0), 1e-6);

    FilterRoad<ConvertFromSIMDOptimized> back;
    back.filter().outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_16_BIT_INT);
    ImageCPU simd = makeImage(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, pixels(-20, -10, 50, 40), 64);
    paint(simd);
    ImageCPU const& words = *back.run(simd, world(-13, 4, 6, 9));
    EXPECT_EQ(pixels(-13, 4, 6, 9), words.positionExtent());
    EXPECT_NEAR(numberAt(simd, -8, 12, 0), numberAt(words, -8, 12, 0), 0.5 / 32768 + 1e-7);
}

TEST_F(ConvertSIMDOptimizedTest, theRestOfABoundImageStaysAsItIs) {
    FilterRoad<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 32, 16), 32);
    paint(image);
    ImageCPU target = makeImage(ImageCPU::PIXEL_FORMAT_RGBA32F, pixels(-4, -4, 40, 24), 40);
    std::size_t const nBytes = 40 * 24 * 16;
    std::memset(target.pixels(), 0x41, nBytes);
    road.runInto(image, target, world(8, 4, 5, 6));
    std::size_t nTouched = 0;
    for (std::size_t i = 0; i < nBytes; i += 16) {
        nTouched += std::memcmp(target.pixels() + i, "AAAAAAAAAAAAAAAA", 16) != 0;
    }
    EXPECT_EQ(30u, nTouched);
    for (int y = 4; y < 10; ++y) {
        for (int x = 8; x < 13; ++x) {
            EXPECT_NEAR(numberAt(image, x, y, 1), numberAt(target, x, y, 1), 1e-6) << x << ", " << y;
        }
    }

    FilterRoad<ConvertFromSIMDOptimized> back;
    ImageCPU bytes = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(-1, -1, 40, 30), 43);
    std::memset(bytes.pixels(), 0x41, 43 * 30 * 4);
    paint(target);
    back.runInto(target, bytes, world(1, 2, 3, 4));
    nTouched = 0;
    for (std::size_t i = 0; i < 43 * 30 * 4; i += 4) {
        nTouched += std::memcmp(bytes.pixels() + i, "AAAA", 4) != 0;
    }
    EXPECT_LE(nTouched, 12u);
    EXPECT_NEAR(numberAt(target, 3, 5, 0), numberAt(bytes, 3, 5, 0), 1.0 / 255);
}

TEST_F(ConvertSIMDOptimizedTest, refuseABoundImageThatDoesNotHoldTheRegion) {
    FilterRoad<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 32, 16), 32);
    paint(image);
    ImageCPU target = makeImage(ImageCPU::PIXEL_FORMAT_RGBA32F, pixels(0, 0, 16, 16), 16);
    ORVO_EXPECT_INTERNAL(road.runInto(image, target, world(0, 0, 17, 16)),
                         "Compute region lies outside the bound output image");
    road.runInto(image, target, world(0, 0, 16, 16));
    EXPECT_NEAR(numberAt(image, 15, 15, 3), numberAt(target, 15, 15, 3), 1e-6);
    FilterRoad<ConvertFromSIMDOptimized> back;
    ImageCPU bytes = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 8, 8), 8);
    ORVO_EXPECT_INTERNAL(back.runInto(target, bytes, world(1, 1, 8, 7)),
                         "Compute region lies outside the bound output image");
}

template <typename Converter>
void expectRefusals() {
    struct Row {
        PositionExtentInWorldSpace region;
        char const* text;
    };
    // Columns are counted from the input's left edge where the region begins before it, and rows likewise.
    for (Row const& row :
         {Row{world(2, 0, 8, 8), "endX <= int( inputImage.position().x() + inputImage.extent().width() )"},
          Row{world(-4, 0, 8, 8),
              "endX <= int( pOutputImage->position().x() + pOutputImage->extent().width() )"},
          Row{world(-9, 0, 8, 8),
              "endX <= int( pOutputImage->position().x() + pOutputImage->extent().width() )"},
          Row{world(9, 0, 8, 8), "endX <= int( inputImage.position().x() + inputImage.extent().width() )"},
          Row{world(0, 2, 8, 8), "endY <= int( inputImage.position().y() + inputImage.extent().height() )"},
          Row{world(0, -4, 8, 8),
              "endY <= int( pOutputImage->position().y() + pOutputImage->extent().height() )"}}) {
        SCOPED_TRACE(testing::Message() << row.region);
        FilterRoad<Converter> road;
        ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA32F, pixels(0, 0, 8, 8), 8);
        paint(image);
        road.source().setGeneratedRegion(world(-20, -20, 40, 40));
        road.filter().outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT);
        road.controller().setSingleThreadMode(true);
        ORVO_EXPECT_INTERNAL(road.run(image, row.region), row.text);
        // The frame after the failed one is right.
        ImageCPU const& result = *road.run(image, world(0, 0, 8, 8));
        EXPECT_EQ(numberAt(image, 7, 7, 3), numberAt(result, 7, 7, 3));
    }
}

TEST_F(ConvertSIMDOptimizedTest, refuseAnInputThatDoesNotCoverTheRegion) {
    expectRefusals<ConvertToSIMDOptimized>();
    expectRefusals<ConvertFromSIMDOptimized>();
}

/// The converter with its image in the making.
class OpenConverter : public ConvertToSIMDOptimized {
public:
    ~OpenConverter() override { disconnect(); }
    void setInput(ImageCPU* pImage) {
        static_cast<DataFlow::ConstInput<ImageCPU>&>(*imageInput(0)).setData(pImage);
    }
    using ConvertToSIMDOptimized::spOutputImage_;
};

/// Leaves a block without a zero in the store that the next image of this kind comes from.
void soilStorage(int channels, ExtentInPixelSpace const& extent) {
    std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>> const upImage(
        ImageRuntime::getBlankSIMDOptimized32FFormat(channels, extent, PixelExtentInWorldSpace(),
                                                     PositionInPixelSpace(0, 0)));
    ExtentInPixelSpace const capacity = upImage->capacityExtent();
    std::memset(upImage->pixels(), 0x41,
                std::size_t(capacity.width()) * std::size_t(capacity.height()) * std::size_t(channels) * 4);
}

TEST_F(ConvertSIMDOptimizedTest, aNewImageIsTransparentBlackWhereNothingIsConverted) {
    OpenConverter converter;
    converter.setImageDescInfoFromSource(true);
    converter.setInput(ORVO_NEW ImageCPU(ImageCPU::PIXEL_FORMAT_RGB8, pixels(0, 0, 100, 2),
                                         PixelExtentInWorldSpace(), ExtentInPixelSpace()));
    converter.computeRegionParameter().setValue(world(0, 0, 100, 2));
    soilStorage(3, ExtentInPixelSpace(100, 2));
    converter.allocateOutputImage();
    ImageCPU const& covered = *converter.spOutputImage_;
    // 101 pixels of 12 bytes, rounded up to whole 192 bytes, are 112 pixels.
    ASSERT_EQ(ExtentInPixelSpace(112, 2), covered.capacityExtent());
    for (int y = 0; y < 2; ++y) {
        for (int x = 100; x < 112; ++x) {
            for (int c = 0; c < 3; ++c) {
                EXPECT_EQ(0.0f, pixelAt(covered, x, y)[c]) << x << ", " << y;
            }
        }
    }
    // A region of the same size that leaves the input: its pixels too.
    converter.flush();
    converter.setInput(ORVO_NEW ImageCPU(ImageCPU::PIXEL_FORMAT_RGB8, pixels(0, 0, 100, 2),
                                         PixelExtentInWorldSpace(), ExtentInPixelSpace()));
    converter.computeRegionParameter().setValue(world(5, 0, 100, 2));
    soilStorage(3, ExtentInPixelSpace(100, 2));
    converter.allocateOutputImage();
    ImageCPU const& partly = *converter.spOutputImage_;
    for (int y = 0; y < 2; ++y) {
        for (int x = 5; x < 117; ++x) {
            EXPECT_EQ(0.0f, pixelAt(partly, x, y)[2]) << x << ", " << y;
        }
    }
}

TEST_F(ConvertSIMDOptimizedTest, columnsBeyondTheInputStayTransparentBlack) {
    FilterRoad<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 8, 4), 8);
    std::memset(image.pixels(), 255, 8 * 4 * 4);
    road.source().setGeneratedRegion(world(0, 0, 12, 4));
    soilStorage(4, ExtentInPixelSpace(12, 4));
    ImageCPU const& result = *road.run(image, world(0, 0, 12, 4));
    ASSERT_EQ(pixels(0, 0, 12, 4), result.positionExtent());
    for (int y = 0; y < 4; ++y) {
        for (int x = 0; x < 12; ++x) {
            EXPECT_NEAR(x < 8 ? 1.0f : 0.0f, pixelAt(result, x, y)[3], 1e-6f) << x << ", " << y;
        }
    }
}

TEST_F(ConvertSIMDOptimizedTest, channelsAndHintDecideWhereTheSourceDoesNot) {
    struct Row {
        ImageCPU::tePixelFormat source;
        ImageCPU::tePixelFormat result;
    };
    for (Row const& row :
         {Row{ImageCPU::PIXEL_FORMAT_LUMINANCE8, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
          Row{ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F},
          Row{ImageCPU::PIXEL_FORMAT_RGB8, ImageCPU::PIXEL_FORMAT_RGB32F},
          Row{ImageCPU::PIXEL_FORMAT_BGRA8, ImageCPU::PIXEL_FORMAT_RGBA32F}}) {
        for (int hint = 0; hint <= 5; ++hint) {
            SCOPED_TRACE(testing::Message() << row.source << ", hint " << hint);
            ImageCPU image = makeImage(row.source, pixels(0, 0, 4, 4), 4);
            ImageCPUInput source;
            source.setImageCPUWithNoOwnership(&image);
            OpenConverter converter;
            feed(converter, 0, source);
            converter.computeImageDescriptorInfo(static_cast<Hint>(hint));
            converter.computeRegionParameter().setValue(world(0, 0, 4, 4));
            if (hint == 2) {
                ORVO_EXPECT_INTERNAL(converter.allocateOutputImage(),
                                     "Pixel format not supported by ORVO in CPU mode");
            } else if (hint > 3) {
                ORVO_EXPECT_INTERNAL(
                    converter.allocateOutputImage(),
                    "Not implemented: Data type not supported in ImageFilter::allocateOutputImage()");
            } else {
                converter.allocateOutputImage();
                ImageCPU const* const pImage = converter.spOutputImage_.get();
                ASSERT_NE(nullptr, pImage);
                EXPECT_EQ(row.result, pImage->pixelFormat());
                EXPECT_TRUE(pImage->isInSIMDOptimizedFormat());
                converter.allocateOutputImage(); // there is one already
                EXPECT_EQ(pImage, converter.spOutputImage_.get());
                continue;
            }
            EXPECT_EQ(nullptr, converter.spOutputImage_.get());
        }
    }
}

TEST_F(ConvertSIMDOptimizedTest, followThePixelExtentOfTheSource) {
    ImageCPU image(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(-2, 1, 4, 2), PixelExtentInWorldSpace(2, 0.5f),
                   ExtentInPixelSpace(4, 2));
    std::memset(image.pixels(), 255, 8);
    image.pixels()[7] = 0;
    FilterRoad<ConvertToSIMDOptimized> road;
    road.source().setOutputPixelExtent(PixelExtentInWorldSpace(2, 0.5f));
    // The columns -1 to 2 and the row 2 of pixels that are 2 wide and 0.5 high.
    ImageCPU const& result = *road.run(image, world(-2, 1, 6, 0.5f));
    EXPECT_EQ(pixels(-1, 2, 3, 1), result.positionExtent());
    EXPECT_EQ(PixelExtentInWorldSpace(2, 0.5f), result.pixelExtent());
    EXPECT_NEAR(1.0f, *pixelAt(result, -1, 2), 1e-6f);
    EXPECT_NEAR(1.0f, *pixelAt(result, 0, 2), 1e-6f);
    EXPECT_EQ(0.0f, *pixelAt(result, 1, 2));
}

TEST_F(ConvertSIMDOptimizedTest, needAChannelCountAndAHint) {
    ConvertToSIMDOptimized to;
    ORVO_EXPECT_INTERNAL(to.allocateOutputImage(),
                         "Not implemented: pixelFormat not supported in ImageFilter::allocateOutputImage()");
    ConvertFromSIMDOptimized converter;
    ORVO_EXPECT_INTERNAL(converter.prepareForRender(),
                         "Not implemented: pixelFormat not supported in ImageFilter::allocateOutputImage()");
}

TEST_F(ConvertSIMDOptimizedTest, aFailedAllocationLeavesNoImage) {
    OpenConverter converter;
    converter.setImageDescInfoFromSource(true);
    converter.setInput(ORVO_NEW ImageCPU(ImageCPU::PIXEL_FORMAT_RGB8, pixels(0, 0, 4, 4),
                                         PixelExtentInWorldSpace(), ExtentInPixelSpace()));
    converter.computeRegionParameter().setValue(world(0, 0, 4, 4));
    converter.allocateOutputImage();
    ASSERT_NE(nullptr, converter.spOutputImage_.get());
    // The image there is too small for the next region, and there is no image as large as that.
    converter.computeRegionParameter().setValue(world(0, 0, 100000, 100000));
    ORVO_EXPECT_PARAMETER(converter.allocateOutputImage(), "Image size exceeds 4294967295 bytes");
    EXPECT_EQ(nullptr, converter.spOutputImage_.get());
}

/// A converter back that makes no image.
class ImagelessConverter : public ConvertFromSIMDOptimized {
public:
    void allocateOutputImage() override {}
};

TEST_F(ConvertSIMDOptimizedTest, theWayBackNeedsAnImage) {
    ImagelessConverter converter;
    ORVO_EXPECT_INTERNAL(converter.prepareForRender(), "pOutputImage_");
}

TEST_F(ConvertSIMDOptimizedTest, anEmptyRegionConvertsNothing) {
    FilterRoad<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 8, 8), 8);
    paint(image);
    EXPECT_EQ(0u, road.run(image, world(100, 100, 4, 4))->numberOfPixels());
    ImageCPU empty = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 0, 0), 0);
    EXPECT_EQ(0u, road.run(empty, world(0, 0, 4, 4))->numberOfPixels());
}

} // namespace

} // namespace ORVO
