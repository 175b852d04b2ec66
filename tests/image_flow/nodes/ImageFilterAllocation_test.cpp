#include "orvo/core/exceptions/LogicalException.h"
#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <cstring>
#include <limits>

namespace ORVO {

namespace {

using Hint = ImageFilter::teOutputPrecisionHint;
using Test::feed;
using Test::pixels;
using Test::TestFilter;
using Test::world;

class ImageFilterAllocationTest : public testing::Test {
protected:
    ORVO::Test::ImageFlowLayers oLayers_;
};

constexpr char const* pBadType =
    "Not implemented: Data type not supported in ImageFilter::allocateOutputImage()";
constexpr char const* pBadChannels =
    "Not implemented: pixelFormat not supported in ImageFilter::allocateOutputImage()";

TEST_F(ImageFilterAllocationTest, mapsChannelsAndHintToAFormat) {
    ImageCPU::tePixelFormat const aFormats[4][4] = {
        {ImageCPU::PIXEL_FORMAT_LUMINANCE8, ImageCPU::PIXEL_FORMAT_LUMINANCE16,
         ImageCPU::PIXEL_FORMAT_LUMINANCE16F, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16,
         ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F},
        {ImageCPU::PIXEL_FORMAT_RGB8, ImageCPU::PIXEL_FORMAT_RGB16, ImageCPU::PIXEL_FORMAT_RGB16F,
         ImageCPU::PIXEL_FORMAT_RGB32F},
        {ImageCPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_RGBA16F,
         ImageCPU::PIXEL_FORMAT_RGBA32F}};
    for (std::size_t channels = 1; channels <= 4; ++channels) {
        for (int hint = 0; hint < 4; ++hint) {
            EXPECT_EQ(aFormats[channels - 1][hint],
                      TestFilter::pixelFormatFor(static_cast<Hint>(hint), channels))
                << channels << " channels, hint " << hint;
        }
        ORVO_EXPECT_INTERNAL(TestFilter::pixelFormatFor(ImageFilter::OUTPUT_PRECISION_DEFAULT, channels),
                             pBadType);
        ORVO_EXPECT_INTERNAL(TestFilter::pixelFormatFor(ImageFilter::OUTPUT_PRECISION_UNDEFINED, channels),
                             pBadType);
    }
    ORVO_EXPECT_INTERNAL(TestFilter::pixelFormatFor(ImageFilter::OUTPUT_PRECISION_8_BIT_INT, 0),
                         pBadChannels);
    ORVO_EXPECT_INTERNAL(TestFilter::pixelFormatFor(ImageFilter::OUTPUT_PRECISION_8_BIT_INT, 5),
                         pBadChannels);
}

TEST_F(ImageFilterAllocationTest, allocatesEveryFormatThatImagesHave) {
    for (std::size_t channels = 1; channels <= 4; ++channels) {
        for (int hint = 0; hint < 4; ++hint) {
            TestFilter filter(0, true, "f", static_cast<Hint>(hint));
            filter.nForcedChannels_ = channels;
            filter.computeRegionParameter().setValue(world(-5, 7, 13, 3));
            if (hint == 2 && channels < 3) {
                ORVO_EXPECT_INTERNAL(filter.allocateOutputImage(),
                                     "Not implemented: ePixelFormat in pixelSizeBytes().");
                EXPECT_EQ(nullptr, filter.spOutputImage_.get());
                continue;
            }
            filter.allocateOutputImage();
            ImageCPU const& image = *filter.spOutputImage_;
            EXPECT_EQ(TestFilter::pixelFormatFor(static_cast<Hint>(hint), channels), image.pixelFormat());
            EXPECT_EQ(pixels(-5, 7, 13, 3), image.positionExtent());
            EXPECT_EQ(hint == 3, channelSizeBits(image.pixelFormat()) == 32);
            if (hint == 3) {
                EXPECT_TRUE(image.isInSIMDOptimizedFormat());
            } else {
                EXPECT_EQ(ExtentInPixelSpace(13, 3), image.capacityExtent());
            }
        }
    }
}

TEST_F(ImageFilterAllocationTest, aFailureLeavesNoImage) {
    TestFilter filter(0, true, "f", ImageFilter::OUTPUT_PRECISION_DEFAULT);
    filter.computeRegionParameter().setValue(world(0, 0, 4, 4));
    ORVO_EXPECT_INTERNAL(filter.allocateOutputImage(), pBadType);
    EXPECT_EQ(nullptr, filter.spOutputImage_.get());
    ORVO_EXPECT_INTERNAL(filter.prepareForRender(), pBadType);
    EXPECT_FALSE(filter.preparedForRender());
    filter.nForcedChannels_ = 7;
    ORVO_EXPECT_INTERNAL(filter.allocateOutputImage(), pBadChannels);
    EXPECT_EQ(nullptr, filter.spOutputImage_.get());
}

TEST_F(ImageFilterAllocationTest, usesTheOutputsPixelExtent) {
    TestFilter filter(0);
    filter.setOutputPixelExtent(PixelExtentInWorldSpace(0.5f, 2.0f));
    filter.computePixelExtents();
    filter.computeRegionParameter().setValue(world(-1, 4, 3, 6));
    filter.allocateOutputImage();
    EXPECT_EQ(pixels(-2, 2, 6, 3), filter.spOutputImage_->positionExtent());
    EXPECT_EQ(PixelExtentInWorldSpace(0.5f, 2.0f), filter.spOutputImage_->pixelExtent());
}

TEST_F(ImageFilterAllocationTest, anUndefinedOrEmptyRegionHasNoPixels) {
    TestFilter filter(0);
    filter.allocateOutputImage();
    ASSERT_NE(nullptr, filter.spOutputImage_.get());
    EXPECT_EQ(0u, filter.spOutputImage_->numberOfPixels());
    EXPECT_EQ(0u, filter.rangeToProcess().items);
    filter.flush();
    filter.computeRegionParameter().setValue(world(3, 3, 0, 0));
    filter.allocateOutputImage();
    EXPECT_EQ(0u, filter.spOutputImage_->numberOfPixels());
    EXPECT_EQ(0u, filter.rangeToProcess().items);
}

TEST_F(ImageFilterAllocationTest, aRegionThatNoImageHoldsIsRefused) {
    TestFilter filter(0);
    filter.computeRegionParameter().setValue(world(0, 0, 100000, 100000));
    ORVO_EXPECT_PARAMETER(filter.allocateOutputImage(), "Image size exceeds 4294967295 bytes");
    EXPECT_EQ(nullptr, filter.spOutputImage_.get());
}

TEST_F(ImageFilterAllocationTest, pixelsThatHaveNoSizeAreRefused) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    for (auto const& pixelExtent : {PixelExtentInWorldSpace(0, 1), PixelExtentInWorldSpace(1, 0),
                                    PixelExtentInWorldSpace(-1, 1), PixelExtentInWorldSpace(nan, 1)}) {
        TestFilter filter(0);
        filter.setOutputPixelExtent(pixelExtent);
        filter.computePixelExtents();
        filter.computeRegionParameter().setValue(world(0, 0, 4, 4));
        EXPECT_THROW(filter.allocateOutputImage(), LogicalException) << pixelExtent;
        EXPECT_EQ(nullptr, filter.spOutputImage_.get());
    }
}

TEST_F(ImageFilterAllocationTest, aRegionOfNoNumbersHasNoPixels) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    TestFilter filter(0);
    filter.computeRegionParameter().setValue(world(nan, nan, nan, nan));
    filter.allocateOutputImage();
    EXPECT_EQ(0u, filter.spOutputImage_->numberOfPixels());
    EXPECT_EQ(0u, filter.rangeToProcess().items);
}

TEST_F(ImageFilterAllocationTest, allocatesNothingWithoutAnOutputOrOnAnotherPlatform) {
    TestFilter sink(0, false);
    sink.computeRegionParameter().setValue(world(0, 0, 4, 4));
    sink.allocateOutputImage();
    EXPECT_EQ(nullptr, sink.spOutputImage_.get());
    TestFilter other(0);
    other.outputTarget_ = ORVO_TARGET_GL;
    other.computeRegionParameter().setValue(world(0, 0, 4, 4));
    other.allocateOutputImage();
    EXPECT_EQ(nullptr, other.spOutputImage_.get());
    EXPECT_EQ(pixels(0, 0, 4, 4), other.oOutputRegionInPixels_);
    other.prepareForRender();
    EXPECT_TRUE(other.preparedForRender());
    EXPECT_EQ(nullptr, other.spOutputImage_.get());
}

TEST_F(ImageFilterAllocationTest, keepsAnImageThatCoversTheRegion) {
    TestFilter filter(0);
    filter.computeRegionParameter().setValue(world(0, 0, 8, 8));
    filter.allocateOutputImage();
    ImageCPU const* const pImage = filter.spOutputImage_.get();
    filter.computeRegionParameter().setValue(world(2, 2, 4, 4));
    filter.allocateOutputImage();
    EXPECT_EQ(pImage, filter.spOutputImage_.get());
    EXPECT_EQ(pixels(2, 2, 4, 4), filter.oOutputRegionInPixels_);
    // Rows of the larger region would lie outside its storage.
    filter.computeRegionParameter().setValue(world(0, 0, 9, 8));
    filter.allocateOutputImage();
    EXPECT_EQ(pixels(0, 0, 9, 8), filter.spOutputImage_->positionExtent());
}

/// A source image of the given format in front of a filter that takes its format from it.
struct FromSource {
    explicit FromSource(ImageCPU::tePixelFormat format, Hint hint) : oFilter_(1, true, "f", hint) {
        oFilter_.nForcedChannels_ = 0;
        oFilter_.setImageDescInfoFromSource(true);
        oFilter_.in().setData(
            ORVO_NEW ImageCPU(format, pixels(0, 0, 3, 3), PixelExtentInWorldSpace(), ExtentInPixelSpace()));
        oFilter_.computeRegionParameter().setValue(world(0, 0, 3, 3));
    }
    ImageCPU::tePixelFormat allocated() {
        oFilter_.allocateOutputImage();
        return oFilter_.spOutputImage_->pixelFormat();
    }
    TestFilter oFilter_;
};

TEST_F(ImageFilterAllocationTest, aDefaultHintTakesTheFormatOfTheFirstInput) {
    for (int format = 1; format <= 14; ++format) {
        auto const eFormat = static_cast<ImageCPU::tePixelFormat>(format);
        FromSource graph(eFormat, ImageFilter::OUTPUT_PRECISION_DEFAULT);
        EXPECT_EQ(eFormat, graph.allocated());
        EXPECT_EQ(nChannels(eFormat), graph.oFilter_.nChannels_);
    }
    FromSource half(ImageCPU::PIXEL_FORMAT_RGBA16F, ImageFilter::OUTPUT_PRECISION_DEFAULT);
    ORVO_EXPECT_INTERNAL(half.allocated(), "Pixel format not supported by ORVO in CPU mode");
}

TEST_F(ImageFilterAllocationTest, aFloatHintMakesASIMDImageOfAByteSource) {
    FromSource graph(ImageCPU::PIXEL_FORMAT_RGB8, ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT);
    EXPECT_EQ(ImageCPU::PIXEL_FORMAT_RGB32F, graph.allocated());
    EXPECT_TRUE(graph.oFilter_.spOutputImage_->isInSIMDOptimizedFormat());
    EXPECT_EQ(3u, graph.oFilter_.nChannels_);
}

TEST_F(ImageFilterAllocationTest, forcedChannelsWinOverTheSource) {
    FromSource graph(ImageCPU::PIXEL_FORMAT_RGBA8, ImageFilter::OUTPUT_PRECISION_16_BIT_INT);
    graph.oFilter_.nForcedChannels_ = 1;
    EXPECT_EQ(ImageCPU::PIXEL_FORMAT_LUMINANCE16, graph.allocated());
    EXPECT_EQ(1u, graph.oFilter_.nChannels_);
}

TEST_F(ImageFilterAllocationTest, withoutAnInputImageHintAndChannelsDecide) {
    TestFilter filter(1, true, "f", ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
    filter.nForcedChannels_ = 4;
    filter.setImageDescInfoFromSource(true);
    filter.computeRegionParameter().setValue(world(0, 0, 3, 3));
    filter.allocateOutputImage();
    EXPECT_EQ(ImageCPU::PIXEL_FORMAT_RGBA8, filter.spOutputImage_->pixelFormat());
}

/// A client's image with known bytes, bound to a filter that runs in a controller of its own.
struct Bound {
    explicit Bound(PositionExtentInPixelSpace const& region,
                   ExtentInPixelSpace capacity = ExtentInPixelSpace())
        : oImage_(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, region, PixelExtentInWorldSpace(), capacity),
          oFilter_(0) {
        nBytes_ = std::size_t(oImage_.capacityExtent().width()) *
                  std::size_t(oImage_.capacityExtent().height()) * 4;
        std::memset(oImage_.pixels(), 0x41, nBytes_);
        oFilter_.oOffset_.setValue(2.0f);
        oController_.addNode(&oFilter_);
        oFilter_.setBoundOutputImage(&oImage_);
    }

    void run(PositionExtentInWorldSpace const& region) {
        oFilter_.computeRegionParameter().setValue(region);
        oFilter_.process();
    }

    std::size_t touchedPixels() const {
        std::size_t nTouched = 0;
        for (std::size_t i = 0; i < nBytes_; i += 4) {
            nTouched += std::memcmp(oImage_.pixels() + i, "AAAA", 4) != 0;
        }
        return nTouched;
    }

    ImageFlowController oController_;
    ImageCPU oImage_;
    TestFilter oFilter_;
    std::size_t nBytes_;
};

TEST_F(ImageFilterAllocationTest, writesIntoTheBoundImageAndOwnsNothing) {
    Bound graph(pixels(-4, -3, 10, 8), ExtentInPixelSpace(13, 9));
    graph.oFilter_.computeRegionParameter().setValue(world(-2, -1, 3, 4));
    graph.oFilter_.allocateOutputImage();
    EXPECT_EQ(&graph.oImage_, graph.oFilter_.spOutputImage_.get());
    graph.run(world(-2, -1, 3, 4));
    EXPECT_EQ(&graph.oImage_, graph.oFilter_.oOutput_.data());
    EXPECT_EQ(12u, graph.touchedPixels());
    for (int y = -1; y < 3; ++y) {
        for (int x = -2; x < 1; ++x) {
            EXPECT_EQ(2.0f, *ORVO::Test::pixelAt(graph.oImage_, x, y));
        }
    }
}

TEST_F(ImageFilterAllocationTest, clonesOfABoundOutputStayWithTheClientsImage) {
    Bound graph(pixels(0, 0, 4, 4));
    DataFlow::OutputConnector const& clone = *graph.oFilter_.cloneImageOutput();
    graph.run(world(0, 0, 4, 4));
    EXPECT_EQ(16u, graph.touchedPixels());
    EXPECT_TRUE(clone.bound());
    EXPECT_EQ(&graph.oImage_, clone.data());
}

TEST_F(ImageFilterAllocationTest, refusesARegionThatLeavesTheBoundImage) {
    Bound graph(pixels(-4, -3, 10, 8));
    for (auto const& region : {world(-5, -3, 2, 2), world(-4, -4, 2, 2), world(5, 0, 2, 2), world(0, 4, 2, 2),
                               world(-100, -100, 1000, 1000), world(-4, -3, 10.5f, 8), world(20, 20, 1, 1)}) {
        ORVO_EXPECT_INTERNAL(graph.run(region), "Compute region lies outside the bound output image");
        EXPECT_EQ(0u, graph.touchedPixels());
        EXPECT_EQ(nullptr, graph.oFilter_.spOutputImage_.get());
    }
    graph.run(world(-4, -3, 10, 8));
    EXPECT_EQ(80u, graph.touchedPixels());
}

TEST_F(ImageFilterAllocationTest, aRegionWithoutPixelsFitsIntoEveryBoundImage) {
    Bound graph(pixels(0, 0, 4, 4));
    graph.run(PositionExtentInWorldSpace());
    graph.run(world(100, 100, 0, 0));
    EXPECT_EQ(0u, graph.touchedPixels());
    Bound empty(pixels(0, 0, 0, 0));
    empty.run(world(0, 0, 0, 0));
    ORVO_EXPECT_INTERNAL(empty.run(world(0, 0, 1, 1)), "Compute region lies outside the bound output image");
}

TEST_F(ImageFilterAllocationTest, theStorageBoundsABoundImageToo) {
    Bound graph(pixels(0, 0, 4, 4), ExtentInPixelSpace(4, 3));
    graph.run(world(0, 0, 4, 3));
    EXPECT_EQ(12u, graph.touchedPixels());
    ORVO_EXPECT_INTERNAL(graph.run(world(0, 0, 4, 4)), "Compute region lies outside the bound output image");
}

} // namespace

} // namespace ORVO
