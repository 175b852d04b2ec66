// Client images in host memory: rectangles, storage, pitches, and what is refused.
#include "orvo/filter_graph/impl/ImageCPU.h"

#include <gtest/gtest.h>

#include <array>
#include <limits>
#include <vector>

#include "orvo/core/exceptions/InternalException.h"
#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph {
namespace {

constexpr int intMax = std::numeric_limits<int>::max();
constexpr int intMin = std::numeric_limits<int>::min();
constexpr char const* tooSmallText = "paddedWidthInBytes >= width()* numBytesPerPixel()";
constexpr char const* errorA =
    "Not implemented: Only 8uint/16uint/32f supported in ImageCPU::mapDescriptorToImageCPU()";
constexpr char const* errorB =
    "Not implemented: Data type not supported in ImageCPU::mapDescriptorToImageCPU()";

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return {PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height)};
}

ImageDescriptorCPU descriptorOf(std::size_t nChannel, ImageDescriptor::eChannelType channelType,
                                PixelExtentInWorldSpace const& pixelExtent = PixelExtentInWorldSpace()) {
    return {{nChannel, channelType}, pixelExtent};
}

ImageDescriptorCPU grey8() { return descriptorOf(1, ImageDescriptor::CHANNEL_TYPE_UINT8); }

ORVO::ImageCPU const* wrapped(ImageCPU const& image) {
    return Internal::ImageAccessor::getImpl<ORVO::ImageCPU>(&image);
}

class ClientImageCPUTest : public testing::Test {
protected:
    unsigned char* pixels() { return aStorage_.data(); }

    alignas(64) std::array<unsigned char, 4096> aStorage_{};
};

TEST_F(ClientImageCPUTest, IsWithoutAnythingAtFirst) {
    ImageCPU image(descriptorOf(4, ImageDescriptor::CHANNEL_TYPE_FLOAT32));
    EXPECT_EQ(image.width(), 0u);
    EXPECT_EQ(image.height(), 0u);
    EXPECT_TRUE(image.size() == size2(0, 0));
    EXPECT_TRUE(image.offset() == int2(0, 0));
    EXPECT_FALSE(image.region().extent().isDefined());
    EXPECT_EQ(image.numBytesPerPixel(), 16u);
    EXPECT_EQ(image.paddedWidthInBytes(), 0u);
    EXPECT_EQ(image.getPixelStorage(), nullptr);
    EXPECT_EQ(static_cast<ImageCPU const&>(image).getPixelStorage(), nullptr);
    EXPECT_EQ(image.contentStamp(), 0u);
    image.clear();
    ORVO_EXPECT_INTERNAL(image.isInSIMDOptimizedFormat(), "Enforce pImage_ != NULL");
}

TEST_F(ClientImageCPUTest, DerivesItsRegionFromRectangleAndPixelExtent) {
    ImageCPU image(descriptorOf(1, ImageDescriptor::CHANNEL_TYPE_UINT8, PixelExtentInWorldSpace(2.0F, 0.5F)));
    image.setRect(rectangle(-3, 4, 10, 6));
    EXPECT_TRUE(image.rect() == rectangle(-3, 4, 10, 6));
    EXPECT_EQ(image.width(), 10u);
    EXPECT_EQ(image.height(), 6u);
    EXPECT_TRUE(image.size() == size2(10, 6));
    EXPECT_TRUE(image.offset() == int2(-3, 4));
    EXPECT_TRUE(image.region() == PositionExtentInWorldSpace(PositionInWorldSpace(-6.0F, 2.0F),
                                                             ExtentInWorldSpace(20.0F, 3.0F)));
    // A new rectangle makes a new region instead of adding to the old one.
    image.setRect(rectangle(0, 0, 1, 1));
    EXPECT_TRUE(image.region() ==
                PositionExtentInWorldSpace(PositionInWorldSpace(0.0F, 0.0F), ExtentInWorldSpace(2.0F, 0.5F)));
    image.setRect(PositionExtentInPixelSpace());
    EXPECT_FALSE(image.region().extent().isDefined());
}

TEST_F(ClientImageCPUTest, RefusesRectanglesThatAreNone) {
    constexpr char const* negativeText = "Image extent must not be negative";
    constexpr char const* rangeText = "Image rectangle exceeds the range of pixel positions";
    ImageCPU image(grey8());
    image.setRect(rectangle(1, 2, 3, 4));
    ORVO_EXPECT_PARAMETER(image.setRect(rectangle(0, 0, -1, 1)), negativeText);
    ORVO_EXPECT_PARAMETER(image.setRect(rectangle(0, 0, 1, intMin)), negativeText);
    ORVO_EXPECT_PARAMETER(image.setRect(rectangle(intMax, 0, 1, 1)), rangeText);
    ORVO_EXPECT_PARAMETER(image.setRect(rectangle(0, 2, 1, intMax - 1)), rangeText);
    ORVO_EXPECT_PARAMETER(ImageCPU(grey8(), rectangle(0, 0, -1, 0), pixels(), 0), negativeText);
    EXPECT_TRUE(image.rect() == rectangle(1, 2, 3, 4));
    image.setRect(rectangle(1, intMin, intMax - 1, intMax));
    EXPECT_EQ(image.width(), static_cast<std::size_t>(intMax) - 1);
}

TEST_F(ClientImageCPUTest, WrapsTheMemoryOfTheHost) {
    ImageCPU image(descriptorOf(3, ImageDescriptor::CHANNEL_TYPE_UINT8, PixelExtentInWorldSpace(2.0F, 3.0F)),
                   rectangle(-5, 7, 4, 2), pixels(), 0);
    EXPECT_EQ(image.getPixelStorage(), pixels());
    EXPECT_EQ(static_cast<ImageCPU const&>(image).getPixelStorage(), pixels());
    EXPECT_EQ(image.paddedWidthInBytes(), 12u);
    ORVO::ImageCPU const* pWrapped = wrapped(image);
    ASSERT_TRUE(pWrapped);
    EXPECT_EQ(pWrapped->pixelFormat(), ORVO::ImageCPU::PIXEL_FORMAT_RGB8);
    EXPECT_TRUE(pWrapped->positionExtent() == rectangle(-5, 7, 4, 2));
    EXPECT_TRUE(pWrapped->pixelExtent() == PixelExtentInWorldSpace(2.0F, 3.0F));
    EXPECT_TRUE(pWrapped->capacityExtent() == ExtentInPixelSpace(4, 2));
    EXPECT_EQ(Internal::ImageAccessor::getImpl<ORVO::ImageCPU>(nullptr), nullptr);
}

TEST_F(ClientImageCPUTest, ServesTheRowsOfTheFormatTable) {
    using CPU = ORVO::ImageCPU;
    struct Row {
        std::size_t nChannel;
        int channelType;
        CPU::tePixelFormat ePixelFormat;
    };
    for (Row const& row :
         {Row{1, 0, CPU::PIXEL_FORMAT_LUMINANCE8}, Row{2, 2, CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16},
          Row{3, 3, CPU::PIXEL_FORMAT_RGB16}, Row{4, 6, CPU::PIXEL_FORMAT_RGBA32F}}) {
        auto const channelType = static_cast<ImageDescriptor::eChannelType>(row.channelType);
        ImageCPU const image(descriptorOf(row.nChannel, channelType), rectangle(0, 0, 2, 2), pixels(), 0);
        EXPECT_EQ(wrapped(image)->pixelFormat(), row.ePixelFormat);
    }
}

TEST_F(ClientImageCPUTest, CutsAPitchToWholePixels) {
    ImageCPU const image(descriptorOf(4, ImageDescriptor::CHANNEL_TYPE_FLOAT32), rectangle(0, 0, 5, 2),
                         pixels(), 1000);
    EXPECT_EQ(image.paddedWidthInBytes(), 1000u);
    EXPECT_TRUE(wrapped(image)->capacityExtent() == ExtentInPixelSpace(62, 2));
}

TEST_F(ClientImageCPUTest, RefusesPitchesThatAreTooSmall) {
    ORVO_EXPECT_PARAMETER(ImageCPU(grey8(), rectangle(0, 0, 4, 4), pixels(), -1), "paddedWidthInBytes >= 0");
    ORVO_EXPECT_PARAMETER(ImageCPU(grey8(), rectangle(0, 0, 4, 4), pixels(), intMin),
                          "paddedWidthInBytes >= 0");
    ORVO_EXPECT_PARAMETER(ImageCPU(grey8(), rectangle(0, 0, 4, 4), pixels(), 3), tooSmallText);

    ImageCPU image(descriptorOf(4, ImageDescriptor::CHANNEL_TYPE_UINT15_1), rectangle(0, 0, 4, 4), pixels(),
                   0);
    ORVO::ImageCPU const* const pBefore = wrapped(image);
    ORVO_EXPECT_PARAMETER(image.setPixelStorage(pixels() + 64, 31), tooSmallText);
    EXPECT_EQ(wrapped(image), pBefore);
    EXPECT_EQ(image.paddedWidthInBytes(), 32u);
    EXPECT_EQ(image.getPixelStorage(), pixels());
    image.setPixelStorage(pixels() + 64, 32);
    EXPECT_EQ(image.getPixelStorage(), pixels() + 64);
}

TEST_F(ClientImageCPUTest, RefusesPitchesAndSizesBeyondAllBounds) {
    ImageCPU image(grey8());
    image.setRect(rectangle(0, 0, 1, 1));
    ORVO_EXPECT_PARAMETER(image.setPixelStorage(pixels(), std::size_t(intMax) + 1),
                          "paddedWidthInBytes / numBytesPerPixel() <= 2147483647");
    ORVO_EXPECT_PARAMETER(image.setPixelStorage(pixels(), std::numeric_limits<std::size_t>::max()),
                          "paddedWidthInBytes / numBytesPerPixel() <= 2147483647");
    image.setPixelStorage(pixels(), std::size_t(intMax));
    EXPECT_EQ(wrapped(image)->capacityExtent().width(), intMax);

    // 65,536 by 65,535 is the last size below the bound; one row more reaches 2^32.
    image.setRect(rectangle(0, 0, 65536, 65535));
    image.setPixelStorage(pixels(), 0);
    EXPECT_EQ(image.paddedWidthInBytes(), 65536u);
    image.setRect(rectangle(0, 0, 65536, 65536));
    ORVO_EXPECT_PARAMETER(image.setPixelStorage(pixels(), 0), "Image size exceeds 4294967295 bytes");
    image.setRect(rectangle(intMin, intMin, intMax, intMax));
    ORVO_EXPECT_PARAMETER(image.setPixelStorage(pixels(), 0), "Image size exceeds 4294967295 bytes");
    EXPECT_EQ(image.paddedWidthInBytes(), 65536u);
    EXPECT_TRUE(wrapped(image)->capacityExtent() == ExtentInPixelSpace(65536, 65535));
}

TEST_F(ClientImageCPUTest, RefusesFormatsThatItCannotHave) {
    constexpr char const* channelsText =
        "Not implemented: pixelFormat in ImageCPU::mapDescriptorToImageCPU()";
    ImageCPU half(descriptorOf(3, ImageDescriptor::CHANNEL_TYPE_FLOAT16));
    half.setRect(rectangle(0, 0, 2, 2));
    ORVO_EXPECT_INTERNAL(half.setPixelStorage(pixels(), 0), errorA);
    ORVO_EXPECT_INTERNAL(half.setPixelStorage(nullptr, 0), errorA);
    EXPECT_EQ(half.getPixelStorage(), nullptr);
    EXPECT_EQ(half.paddedWidthInBytes(), 0u);
    for (auto channelType : {ImageDescriptor::CHANNEL_TYPE_RESERVED8, ImageDescriptor::CHANNEL_TYPE_INT32,
                             static_cast<ImageDescriptor::eChannelType>(7)})
        ORVO_EXPECT_INTERNAL(ImageCPU(descriptorOf(1, channelType), rectangle(0, 0, 2, 2), pixels(), 0),
                             errorB);
    for (std::size_t nChannel : {std::size_t(0), std::size_t(5), std::numeric_limits<std::size_t>::max()})
        ORVO_EXPECT_INTERNAL(ImageCPU(descriptorOf(nChannel, ImageDescriptor::CHANNEL_TYPE_UINT8),
                                      rectangle(0, 0, 2, 2), pixels(), 0),
                             channelsText);
}

TEST_F(ClientImageCPUTest, RefusesPixelsWithoutASize) {
    EXPECT_THROW(
        ImageCPU(descriptorOf(1, ImageDescriptor::CHANNEL_TYPE_UINT8, PixelExtentInWorldSpace(0.0F, 1.0F)),
                 rectangle(0, 0, 2, 2), pixels(), 0),
        InternalException);
    EXPECT_THROW(
        ImageCPU(descriptorOf(1, ImageDescriptor::CHANNEL_TYPE_UINT8,
                              PixelExtentInWorldSpace(1.0F, std::numeric_limits<float>::quiet_NaN())),
                 rectangle(0, 0, 2, 2), pixels(), 0),
        InternalException);
}

TEST_F(ClientImageCPUTest, TakesImagesWithoutPixelsAndOfOnePixel) {
    ImageCPU const empty(grey8(), rectangle(3, 4, 0, 0), pixels(), 0);
    EXPECT_EQ(empty.paddedWidthInBytes(), 0u);
    EXPECT_TRUE(empty.region().extent().isDefined());
    ImageCPU const flat(grey8(), rectangle(0, 0, 8, 0), pixels(), 0);
    EXPECT_EQ(flat.paddedWidthInBytes(), 8u);
    ImageCPU undefined(grey8());
    undefined.setPixelStorage(pixels(), 0);
    undefined.clear();

    aStorage_[0] = 9;
    aStorage_[1] = 9;
    ImageCPU one(grey8(), rectangle(intMin, intMax - 1, 1, 1), pixels(), 0);
    one.clear();
    EXPECT_EQ(aStorage_[0], 0);
    EXPECT_EQ(aStorage_[1], 9);
}

TEST_F(ClientImageCPUTest, GivesUpItsStorageForNull) {
    ImageCPU image(descriptorOf(4, ImageDescriptor::CHANNEL_TYPE_UINT8), rectangle(0, 0, 5, 2), pixels(), 0);
    image.setPixelStorage(nullptr, 0);
    EXPECT_EQ(image.getPixelStorage(), nullptr);
    EXPECT_EQ(wrapped(image), nullptr);
    EXPECT_EQ(image.paddedWidthInBytes(), 20u);
    image.clear();
    ORVO_EXPECT_INTERNAL(image.isInSIMDOptimizedFormat(), "Enforce pImage_ != NULL");
    // Without pixels the pitch is only noted.
    image.setPixelStorage(nullptr, 3);
    EXPECT_EQ(image.paddedWidthInBytes(), 3u);
    ImageCPU const never(grey8(), rectangle(0, 0, 7, 2), nullptr, 0);
    EXPECT_EQ(never.paddedWidthInBytes(), 7u);
}

TEST_F(ClientImageCPUTest, ClearsTheWholeStorageAndNoMore) {
    aStorage_.fill(7);
    ImageCPU image(descriptorOf(1, ImageDescriptor::CHANNEL_TYPE_UINT15_1), rectangle(0, 0, 3, 2), pixels(),
                   16);
    image.clear();
    for (std::size_t i = 0; i < 40; ++i)
        EXPECT_EQ(aStorage_[i], i < 32 ? 0 : 7) << i;
}

TEST_F(ClientImageCPUTest, KnowsTheSIMDOptimisedLayout) {
    ImageDescriptorCPU const rgba32F = descriptorOf(4, ImageDescriptor::CHANNEL_TYPE_FLOAT32);
    EXPECT_TRUE(ImageCPU(rgba32F, rectangle(0, 0, 4, 2), pixels(), 0).isInSIMDOptimizedFormat());
    EXPECT_FALSE(ImageCPU(rgba32F, rectangle(0, 0, 3, 2), pixels(), 0).isInSIMDOptimizedFormat());
    EXPECT_TRUE(ImageCPU(rgba32F, rectangle(0, 0, 3, 2), pixels(), 64).isInSIMDOptimizedFormat());
    EXPECT_FALSE(ImageCPU(rgba32F, rectangle(0, 0, 4, 2), pixels() + 16, 0).isInSIMDOptimizedFormat());
    ImageDescriptorCPU const rgba16 = descriptorOf(4, ImageDescriptor::CHANNEL_TYPE_UINT15_1);
    EXPECT_FALSE(ImageCPU(rgba16, rectangle(0, 0, 8, 2), pixels(), 0).isInSIMDOptimizedFormat());
}

TEST_F(ClientImageCPUTest, SharesItsStorageWithCopies) {
    ImageCPU copy(grey8());
    {
        ImageCPU const image(grey8(), rectangle(1, 2, 4, 4), pixels(), 0);
        ImageCPU const second(image);
        copy = image;
        EXPECT_EQ(wrapped(copy), wrapped(image));
        EXPECT_EQ(wrapped(second), wrapped(image));
    }
    EXPECT_EQ(copy.getPixelStorage(), pixels());
    EXPECT_TRUE(copy.rect() == rectangle(1, 2, 4, 4));
    ImageCPU other(copy);
    other.setPixelStorage(pixels() + 64, 0);
    EXPECT_EQ(copy.getPixelStorage(), pixels());
    other.setRect(rectangle(0, 0, 1, 1));
    EXPECT_TRUE(copy.rect() == rectangle(1, 2, 4, 4));
}

TEST_F(ClientImageCPUTest, LosesItsContentStampWithNewStorageAndANewRectangle) {
    ImageCPU image(grey8(), rectangle(0, 0, 4, 4), pixels(), 0);
    EXPECT_EQ(image.contentStamp(), 0u);
    image.setContentStamp(17);
    EXPECT_EQ(image.contentStamp(), 17u);
    ImageCPU const copy(image);
    EXPECT_EQ(copy.contentStamp(), 17u);

    EXPECT_THROW(image.setPixelStorage(pixels(), 3), ParameterException);
    EXPECT_THROW(image.setRect(rectangle(0, 0, -1, 1)), ParameterException);
    EXPECT_EQ(image.contentStamp(), 17u);
    image.setPixelStorage(pixels() + 64, 0);
    EXPECT_EQ(image.contentStamp(), 0u);
    image.setContentStamp(std::numeric_limits<std::uint64_t>::max());
    EXPECT_EQ(image.contentStamp(), std::numeric_limits<std::uint64_t>::max());
    image.setRect(rectangle(0, 0, 2, 2));
    EXPECT_EQ(image.contentStamp(), 0u);
    image.setContentStamp(1);
    image.setPixelStorage(nullptr, 0);
    EXPECT_EQ(image.contentStamp(), 0u);
}

} // namespace
} // namespace ORVO::FilterGraph
