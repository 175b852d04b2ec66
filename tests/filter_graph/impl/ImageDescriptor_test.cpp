#include "orvo/filter_graph/impl/ImageDescriptor.h"

#include <gtest/gtest.h>

#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"

namespace ORVO::FilterGraph {
namespace {

using Format = ImageDescriptor::Format;

Format rgba(ImageDescriptor::eChannelType channelType) { return {4, channelType}; }

TEST(ImageDescriptorTest, KnowsTheBytesOfEveryChannelType) {
    struct Row {
        int channelType;
        std::uint32_t bytes;
    };
    // The last two are no channel types.
    for (Row const& row : {Row{0, 1}, Row{1, 1}, Row{2, 2}, Row{3, 2}, Row{4, 2}, Row{5, 4}, Row{6, 4},
                           Row{7, 0}, Row{-1, 0}}) {
        auto const channelType = static_cast<ImageDescriptor::eChannelType>(row.channelType);
        ImageDescriptorCPU const descriptor({3, channelType}, PixelExtentInWorldSpace());
        EXPECT_EQ(descriptor.numBytesPerChannel(), row.bytes) << row.channelType;
        EXPECT_EQ(descriptor.numBytesPerPixel(), 3 * row.bytes) << row.channelType;
    }
}

TEST(ImageDescriptorTest, NamesTheChannelTypes) {
    EXPECT_EQ(static_cast<int>(ImageDescriptor::CHANNEL_TYPE_UINT8), 0);
    EXPECT_EQ(static_cast<int>(ImageDescriptor::CHANNEL_TYPE_RESERVED8), 1);
    EXPECT_EQ(static_cast<int>(ImageDescriptor::CHANNEL_TYPE_UINT15_1), 2);
    EXPECT_EQ(static_cast<int>(ImageDescriptor::CHANNEL_TYPE_UINT16), 3);
    EXPECT_EQ(static_cast<int>(ImageDescriptor::CHANNEL_TYPE_FLOAT16), 4);
    EXPECT_EQ(static_cast<int>(ImageDescriptor::CHANNEL_TYPE_INT32), 5);
    EXPECT_EQ(static_cast<int>(ImageDescriptor::CHANNEL_TYPE_FLOAT32), 6);
}

TEST(ImageDescriptorTest, KeepsWhatItIsGiven) {
    ImageDescriptorCPU const cpu({2, ImageDescriptor::CHANNEL_TYPE_UINT16},
                                 PixelExtentInWorldSpace(0.5F, 2.0F));
    EXPECT_EQ(cpu.format().nChannel, 2u);
    EXPECT_EQ(cpu.format().channelType, ImageDescriptor::CHANNEL_TYPE_UINT16);
    EXPECT_EQ(cpu.type(), ORVO_TARGET_CPU);
    EXPECT_TRUE(cpu.pixelExtent() == PixelExtentInWorldSpace(0.5F, 2.0F));
    // Also what no image can have.
    ImageDescriptorGL const gl({0, ImageDescriptor::CHANNEL_TYPE_RESERVED8},
                               PixelExtentInWorldSpace(-1.0F, 0.0F));
    EXPECT_EQ(gl.type(), ORVO_TARGET_GL);
    EXPECT_EQ(gl.format().nChannel, 0u);
    EXPECT_EQ(gl.numBytesPerPixel(), 0u);
}

TEST(ImageDescriptorTest, ComparesFormatTargetAndPixelExtent) {
    PixelExtentInWorldSpace const one;
    ImageDescriptorCPU const descriptor(rgba(ImageDescriptor::CHANNEL_TYPE_UINT8), one);
    EXPECT_TRUE(descriptor.equals(descriptor));
    EXPECT_TRUE(descriptor.equals(ImageDescriptorCPU(rgba(ImageDescriptor::CHANNEL_TYPE_UINT8), one)));
    EXPECT_FALSE(descriptor.equals(ImageDescriptorCPU({3, ImageDescriptor::CHANNEL_TYPE_UINT8}, one)));
    EXPECT_FALSE(descriptor.equals(ImageDescriptorCPU(rgba(ImageDescriptor::CHANNEL_TYPE_FLOAT32), one)));
    EXPECT_FALSE(descriptor.equals(ImageDescriptorGL(rgba(ImageDescriptor::CHANNEL_TYPE_UINT8), one)));
    EXPECT_FALSE(descriptor.equals(
        ImageDescriptorCPU(rgba(ImageDescriptor::CHANNEL_TYPE_UINT8), PixelExtentInWorldSpace(1.0F, 1.5F))));
    EXPECT_FALSE(descriptor.equals(
        ImageDescriptorCPU(rgba(ImageDescriptor::CHANNEL_TYPE_UINT8), PixelExtentInWorldSpace(2.0F, 1.0F))));
}

TEST(ImageDescriptorTest, CopiesMemberByMember) {
    ImageDescriptorGL const gl({3, ImageDescriptor::CHANNEL_TYPE_FLOAT16},
                               PixelExtentInWorldSpace(3.0F, 4.0F));
    ImageDescriptor const copy(gl);
    EXPECT_TRUE(copy.equals(gl));
    EXPECT_EQ(copy.numBytesPerPixel(), 6u);
    ImageDescriptorCPU assigned(rgba(ImageDescriptor::CHANNEL_TYPE_UINT8), PixelExtentInWorldSpace());
    static_cast<ImageDescriptor&>(assigned) = gl;
    EXPECT_TRUE(assigned.equals(gl));
}

} // namespace
} // namespace ORVO::FilterGraph
