#include "orvo/filter_graph/internal/ImageAccessor.h"

#include <gtest/gtest.h>

#include <array>
#include <limits>

#include "orvo/filter_graph/impl/ImageCPU.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using CPU = ORVO::ImageCPU;

constexpr char const* channelsText = "Not implemented: pixelFormat in ImageCPU::mapDescriptorToImageCPU()";
constexpr char const* errorA =
    "Not implemented: Only 8uint/16uint/32f supported in ImageCPU::mapDescriptorToImageCPU()";
constexpr char const* errorB =
    "Not implemented: Data type not supported in ImageCPU::mapDescriptorToImageCPU()";
constexpr char const* unsupportedText = "Pixel format not supported by ORVO in CPU mode";
constexpr char const* noFormatText = "Not implemented: ePixelFormat in mapPixelFormatToDescriptorFormat";

CPU::tePixelFormat formatOf(std::size_t nChannel, int channelType) {
    return ImageAccessor::mapDescriptorToCPUPixelFormat(
        nChannel, static_cast<ImageDescriptor::eChannelType>(channelType));
}

ImageDescriptor::Format descriptionOf(int ePixelFormat) {
    return ImageAccessor::mapPixelFormatToDescriptorFormat(static_cast<CPU::tePixelFormat>(ePixelFormat));
}

TEST(ImageAccessorTest, MapsDescriptorsToPixelFormats) {
    struct Row {
        std::size_t nChannel;
        CPU::tePixelFormat e8;
        CPU::tePixelFormat e16;
        CPU::tePixelFormat e32F;
    };
    Row const rows[] = {
        {1, CPU::PIXEL_FORMAT_LUMINANCE8, CPU::PIXEL_FORMAT_LUMINANCE16, CPU::PIXEL_FORMAT_LUMINANCE32F},
        {2, CPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16,
         CPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F},
        {3, CPU::PIXEL_FORMAT_RGB8, CPU::PIXEL_FORMAT_RGB16, CPU::PIXEL_FORMAT_RGB32F},
        {4, CPU::PIXEL_FORMAT_RGBA8, CPU::PIXEL_FORMAT_RGBA16, CPU::PIXEL_FORMAT_RGBA32F},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(formatOf(row.nChannel, 0), row.e8) << row.nChannel;
        EXPECT_EQ(formatOf(row.nChannel, 2), row.e16) << row.nChannel;
        EXPECT_EQ(formatOf(row.nChannel, 3), row.e16) << row.nChannel;
        EXPECT_EQ(formatOf(row.nChannel, 6), row.e32F) << row.nChannel;
        ORVO_EXPECT_INTERNAL(formatOf(row.nChannel, 4), errorA);
        ORVO_EXPECT_INTERNAL(formatOf(row.nChannel, 1), errorB);
        ORVO_EXPECT_INTERNAL(formatOf(row.nChannel, 5), errorB);
        ORVO_EXPECT_INTERNAL(formatOf(row.nChannel, 7), errorB);
        ORVO_EXPECT_INTERNAL(formatOf(row.nChannel, -1), errorB);
    }
}

TEST(ImageAccessorTest, RefusesOtherNumbersOfChannels) {
    for (std::size_t nChannel : {std::size_t(0), std::size_t(5), std::numeric_limits<std::size_t>::max()})
        for (int channelType = 0; channelType <= 7; ++channelType)
            ORVO_EXPECT_INTERNAL(formatOf(nChannel, channelType), channelsText);
}

TEST(ImageAccessorTest, MapsPixelFormatsToDescriptions) {
    struct Row {
        CPU::tePixelFormat ePixelFormat;
        std::size_t nChannel;
        int channelType;
    };
    Row const rows[] = {
        {CPU::PIXEL_FORMAT_BGR8, 3, 0},
        {CPU::PIXEL_FORMAT_BGRA8, 4, 0},
        {CPU::PIXEL_FORMAT_RGB8, 3, 0},
        {CPU::PIXEL_FORMAT_RGBA8, 4, 0},
        {CPU::PIXEL_FORMAT_RGB16, 3, 2},
        {CPU::PIXEL_FORMAT_RGBA16, 4, 2},
        {CPU::PIXEL_FORMAT_RGB32F, 3, 6},
        {CPU::PIXEL_FORMAT_RGBA32F, 4, 6},
        {CPU::PIXEL_FORMAT_LUMINANCE8, 1, 0},
        {CPU::PIXEL_FORMAT_LUMINANCE16, 1, 2},
        {CPU::PIXEL_FORMAT_LUMINANCE32F, 1, 6},
        {CPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, 2, 0},
        {CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, 2, 2},
        {CPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 2, 6},
    };
    for (Row const& row : rows) {
        ImageDescriptor::Format const format = descriptionOf(row.ePixelFormat);
        EXPECT_EQ(format.nChannel, row.nChannel) << row.ePixelFormat;
        EXPECT_EQ(static_cast<int>(format.channelType), row.channelType) << row.ePixelFormat;
    }
}

TEST(ImageAccessorTest, RefusesHalfFloatUndefinedAndUnknownFormats) {
    for (int ePixelFormat : {15, 16, 17, 18, 19})
        ORVO_EXPECT_INTERNAL(descriptionOf(ePixelFormat), unsupportedText);
    for (int ePixelFormat : {-1, 0, 20, std::numeric_limits<int>::max()})
        ORVO_EXPECT_INTERNAL(descriptionOf(ePixelFormat), noFormatText);
}

TEST(ImageAccessorTest, WrapsARuntimeImage) {
    std::array<unsigned char, 64> storage{};
    PositionExtentInPixelSpace const rect(PositionInPixelSpace(-2, 3), ExtentInPixelSpace(4, 2));
    CPU runtime(CPU::PIXEL_FORMAT_RGB16, storage.data(), rect, PixelExtentInWorldSpace(2.0F, 0.5F),
                ExtentInPixelSpace());
    auto const handle = ImageAccessor::wrapImageFlowImage(&runtime);
    auto const* image = dynamic_cast<FilterGraph::ImageCPU const*>(handle.get());
    ASSERT_TRUE(image);
    EXPECT_EQ(image->getPixelStorage(), storage.data());
    EXPECT_EQ(image->paddedWidthInBytes(), 24u);
    EXPECT_TRUE(image->rect() == rect);
    EXPECT_EQ(image->imageDescriptor().format().nChannel, 3u);
    EXPECT_EQ(image->imageDescriptor().format().channelType, ImageDescriptor::CHANNEL_TYPE_UINT15_1);
    EXPECT_EQ(image->imageDescriptor().type(), ORVO_TARGET_CPU);
    EXPECT_TRUE(image->imageDescriptor().pixelExtent() == PixelExtentInWorldSpace(2.0F, 0.5F));
    EXPECT_NE(ImageAccessor::getImpl<CPU>(image), &runtime);
}

TEST(ImageAccessorTest, WrapsABGRImageAsRGB) {
    // The formats in BGR order have no description of their own.
    std::array<unsigned char, 64> storage{};
    PositionExtentInPixelSpace const rect(ExtentInPixelSpace(4, 4));
    CPU runtime(CPU::PIXEL_FORMAT_BGR8, storage.data(), rect, PixelExtentInWorldSpace(),
                ExtentInPixelSpace());
    auto const handle = ImageAccessor::wrapImageFlowImage(&runtime);
    ASSERT_TRUE(ImageAccessor::getImpl<CPU>(handle.get()));
    EXPECT_EQ(ImageAccessor::getImpl<CPU>(handle.get())->pixelFormat(), CPU::PIXEL_FORMAT_RGB8);
}

/// An image that lives nowhere.
class HomelessImage : public ORVO::ImageBase {
public:
    ExtentInPixelSpace capacityExtent() const override { return {}; }
    void initializeToTransparentBlack() override {}
};

TEST(ImageAccessorTest, RefusesToWrapWhatIsNotInHostMemory) {
    HomelessImage homeless;
    ORVO_EXPECT_INTERNAL(ImageAccessor::wrapImageFlowImage(&homeless),
                         "Not implemented: ePixelFormat in wrapImageFlowImage");
    ORVO_EXPECT_INTERNAL(ImageAccessor::wrapImageFlowImage(nullptr), "Enforce pImage != NULL");
    CPU undefined;
    ORVO_EXPECT_INTERNAL(ImageAccessor::wrapImageFlowImage(&undefined), unsupportedText);
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
