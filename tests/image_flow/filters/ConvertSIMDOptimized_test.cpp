#include "orvo/image_flow/filters/ConvertFromSIMDOptimized.h"
#include "orvo/image_flow/filters/ConvertToSIMDOptimized.h"

#include "orvo/core/exceptions/SharedException.h"
#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"
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
using Test::pixelAt;
using Test::pixels;
using Test::world;

/// A source, a converter and a sink.
template <typename Converter>
struct Road {
    Road() {
        feed(oConverter_, 0, oSource_);
        oController_.addNode(&oSource_);
        oController_.addNode(&oConverter_);
        oController_.setImageSink(oConverter_);
    }
    ~Road() {
        oConverter_.disconnect();
        oSink_.disconnect();
    }

    /// Runs a frame into an image of the graph's own.
    ImageCPU const& run(ImageCPU& image, PositionExtentInWorldSpace const& region) {
        if (oConverter_.imageOutput()->connectedInput() == nullptr) {
            feed(oSink_, 0, oConverter_);
            oController_.addNode(&oSink_);
            oController_.setImageSink(oSink_);
        }
        launch(image, region);
        return *oSink_.getImageCPU();
    }

    /// Runs a frame into the client's image.
    void runInto(ImageCPU& image, ImageCPU& target, PositionExtentInWorldSpace const& region) {
        oConverter_.setBoundOutputImage(&target);
        launch(image, region);
    }

    void launch(ImageCPU& image, PositionExtentInWorldSpace const& region) {
        oSource_.setImageCPUWithNoOwnership(&image);
        oSource_.emit();
        oController_.computeRegions(region);
        oController_.process();
    }

    ImageFlowController oController_;
    ImageCPUInput oSource_;
    Converter oConverter_;
    ImageCPUOutput oSink_;
};

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
        Road<ConvertToSIMDOptimized> road;
        ImageCPU image = makeImage(eFormat, pixels(-7, 3, 19, 6), 23);
        paint(image);
        ImageCPU const& result = road.run(image, world(-7, 3, 19, 6));
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
    Road<ConvertToSIMDOptimized> road;
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
            Road<ConvertFromSIMDOptimized> road;
            road.oConverter_.outputPrecisionHintParameter().setValue(static_cast<Hint>(hint));
            ImageCPU image = makeImage(format, pixels(2, -3, 13, 5), 16);
            paint(image);
            ImageCPU const& result = road.run(image, world(2, -3, 13, 5));
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
        Road<ConvertToSIMDOptimized> there;
        ImageCPU image = makeImage(format, pixels(0, 0, 16, 8), 16);
        paint(image);
        ImageCPU simd = makeImage(ImageCPU::PIXEL_FORMAT_RGBA32F, pixels(0, 0, 16, 8), 16);
        there.runInto(image, simd, world(0, 0, 16, 8));
        ASSERT_TRUE(simd.isInSIMDOptimizedFormat());
        Road<ConvertFromSIMDOptimized> back;
        ImageCPU result = makeImage(format, pixels(0, 0, 16, 8), 16);
        back.runInto(simd, result, world(0, 0, 16, 8));
        EXPECT_EQ(0, std::memcmp(image.pixels(), result.pixels(), 16 * 8 * pixelSizeBytes(format)));
    }
}

TEST_F(ConvertSIMDOptimizedTest, workOnTheComputeRegionAlone) {
    Road<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(-20, -10, 50, 40), 64);
    paint(image);
    ImageCPU const& result = road.run(image, world(-13, 4, 6, 9));
    EXPECT_EQ(pixels(-13, 4, 6, 9), result.positionExtent());
    EXPECT_NEAR(numberAt(image, -8, 12, 2), numberAt(result, -8, 12, 2), 1e-6);
    EXPECT_NEAR(numberAt(image, -13, 4, 0), numberAt(result, -13, 4, 0), 1e-6);

    Road<ConvertFromSIMDOptimized> back;
    back.oConverter_.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_16_BIT_INT);
    ImageCPU simd = makeImage(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, pixels(-20, -10, 50, 40), 64);
    paint(simd);
    ImageCPU const& words = back.run(simd, world(-13, 4, 6, 9));
    EXPECT_EQ(pixels(-13, 4, 6, 9), words.positionExtent());
    EXPECT_NEAR(numberAt(simd, -8, 12, 0), numberAt(words, -8, 12, 0), 0.5 / 32768 + 1e-7);
}

TEST_F(ConvertSIMDOptimizedTest, theRestOfABoundImageStaysAsItIs) {
    Road<ConvertToSIMDOptimized> road;
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

    Road<ConvertFromSIMDOptimized> back;
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
    Road<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 32, 16), 32);
    paint(image);
    ImageCPU target = makeImage(ImageCPU::PIXEL_FORMAT_RGBA32F, pixels(0, 0, 16, 16), 16);
    ORVO_EXPECT_INTERNAL(road.runInto(image, target, world(0, 0, 17, 16)),
                         "Compute region lies outside the bound output image");
    road.oController_.flushGraph();
    road.runInto(image, target, world(0, 0, 16, 16));
    EXPECT_NEAR(numberAt(image, 15, 15, 3), numberAt(target, 15, 15, 3), 1e-6);
    Road<ConvertFromSIMDOptimized> back;
    ImageCPU bytes = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 8, 8), 8);
    ORVO_EXPECT_INTERNAL(back.runInto(target, bytes, world(1, 1, 8, 7)),
                         "Compute region lies outside the bound output image");
}

TEST_F(ConvertSIMDOptimizedTest, refuseAnInputThatDoesNotCoverTheRegion) {
    Road<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 8, 8), 8);
    paint(image);
    road.oSource_.setGeneratedRegion(world(0, 0, 12, 8));
    try {
        road.run(image, world(2, 0, 8, 8));
        ADD_FAILURE() << "nothing thrown";
    } catch (SharedException const& exception) {
        auto const* const pInner = dynamic_cast<InternalException const*>(exception.exception().get());
        ASSERT_NE(nullptr, pInner);
        EXPECT_EQ("endX <= int( inputImage.position().x() + inputImage.extent().width() )",
                  std::string(pInner->message()));
    }
    // The frame after the failed one is right.
    road.oController_.flushGraph();
    ImageCPU const& result = road.run(image, world(0, 0, 8, 8));
    EXPECT_NEAR(numberAt(image, 7, 7, 3), numberAt(result, 7, 7, 3), 1e-6);
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
    Road<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 8, 4), 8);
    std::memset(image.pixels(), 255, 8 * 4 * 4);
    road.oSource_.setGeneratedRegion(world(0, 0, 12, 4));
    soilStorage(4, ExtentInPixelSpace(12, 4));
    ImageCPU const& result = road.run(image, world(0, 0, 12, 4));
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
    Road<ConvertToSIMDOptimized> road;
    road.oSource_.setOutputPixelExtent(PixelExtentInWorldSpace(2, 0.5f));
    // The columns -1 to 2 and the row 2 of pixels that are 2 wide and 0.5 high.
    ImageCPU const& result = road.run(image, world(-2, 1, 6, 0.5f));
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

TEST_F(ConvertSIMDOptimizedTest, anEmptyRegionConvertsNothing) {
    Road<ConvertToSIMDOptimized> road;
    ImageCPU image = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 8, 8), 8);
    paint(image);
    EXPECT_EQ(0u, road.run(image, world(100, 100, 4, 4)).numberOfPixels());
    ImageCPU empty = makeImage(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 0, 0), 0);
    EXPECT_EQ(0u, road.run(empty, world(0, 0, 4, 4)).numberOfPixels());
}

} // namespace

} // namespace ORVO
