#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/core/utility/SharedPtr.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <climits>
#include <memory>

namespace ORVO::ImageRuntime {
namespace {

using Owned = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

PixelExtentInWorldSpace const oPixelExtent(0.5f, 2.0f);
PositionInPixelSpace const oPosition(-3, 11);

TEST(BlankSIMDOptimizedImage, HasFormatAndCapacityByItsChannels) {
    struct Row {
        int channels;
        int width;
        ImageCPU::tePixelFormat eFormat;
        int capacityWidth;
    };
    Row const rows[] = {
        {1, 1, ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 16},       // (1 + 3) * 4 = 16 bytes, 64
        {1, 13, ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 16},      // 16 * 4 = 64
        {1, 14, ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 32},      // 17 * 4 = 68, 128
        {1, 0, ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 16},       // 3 * 4 = 12, 64
        {2, 7, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 8},  // 8 * 8 = 64
        {2, 8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 16}, // 9 * 8 = 72, 128
        {3, 100, ImageCPU::PIXEL_FORMAT_RGB32F, 112},          // 101 * 12 = 1212, 1344
        {3, 15, ImageCPU::PIXEL_FORMAT_RGB32F, 16},            // 16 * 12 = 192
        {3, 16, ImageCPU::PIXEL_FORMAT_RGB32F, 32},            // 17 * 12 = 204, 384
        {4, 16, ImageCPU::PIXEL_FORMAT_RGBA32F, 16},           // 16 * 16 = 256
        {4, 17, ImageCPU::PIXEL_FORMAT_RGBA32F, 20},           // 17 * 16 = 272, 320
        {4, 1, ImageCPU::PIXEL_FORMAT_RGBA32F, 4},             // 16, 64
    };
    for (Row const& row : rows) {
        SCOPED_TRACE(testing::Message() << row.channels << " channels, width " << row.width);
        Owned const made(getBlankSIMDOptimized32FFormat(row.channels, ExtentInPixelSpace(row.width, 5),
                                                        oPixelExtent, oPosition));
        EXPECT_EQ(row.eFormat, made->pixelFormat());
        EXPECT_EQ(ExtentInPixelSpace(row.capacityWidth, 5), made->capacityExtent());
        EXPECT_EQ(PositionExtentInPixelSpace(oPosition, ExtentInPixelSpace(row.width, 5)),
                  made->positionExtent());
        EXPECT_EQ(oPixelExtent, made->pixelExtent());
        EXPECT_TRUE(made->isInSIMDOptimizedFormat());
    }
}

TEST(BlankSIMDOptimizedImage, HasRoomForWholeGroupsOfFour) {
    for (int channels = 1; channels <= 4; ++channels) {
        for (int width = 0; width < 70; ++width) {
            Owned const made(getBlankSIMDOptimized32FFormat(channels, ExtentInPixelSpace(width, 1),
                                                            oPixelExtent, oPosition));
            EXPECT_GE(made->capacityExtent().width(), (width + 3) / 4 * 4) << channels << " channels";
            EXPECT_TRUE(made->isInSIMDOptimizedFormat());
        }
    }
}

TEST(BlankSIMDOptimizedImage, RefusesOtherNumbersOfChannels) {
    for (int channels : {0, 5, -1, INT_MAX, INT_MIN}) {
        ORVO_EXPECT_INTERNAL(
            getBlankSIMDOptimized32FFormat(channels, ExtentInPixelSpace(4, 4), oPixelExtent, oPosition),
            "false");
    }
}

TEST(BlankSIMDOptimizedImage, TakesTheChannelsOfAFormat) {
    struct Row {
        ImageCPU::tePixelFormat eGiven, eExpected;
    };
    Row const rows[] = {
        {ImageCPU::PIXEL_FORMAT_BGR8, ImageCPU::PIXEL_FORMAT_RGB32F},
        {ImageCPU::PIXEL_FORMAT_BGRA8, ImageCPU::PIXEL_FORMAT_RGBA32F},
        {ImageCPU::PIXEL_FORMAT_RGB8, ImageCPU::PIXEL_FORMAT_RGB32F},
        {ImageCPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_RGBA32F},
        {ImageCPU::PIXEL_FORMAT_RGB16, ImageCPU::PIXEL_FORMAT_RGB32F},
        {ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_RGBA32F},
        {ImageCPU::PIXEL_FORMAT_RGB32F, ImageCPU::PIXEL_FORMAT_RGB32F},
        {ImageCPU::PIXEL_FORMAT_RGBA32F, ImageCPU::PIXEL_FORMAT_RGBA32F},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE8, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE16, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F},
    };
    for (Row const& row : rows) {
        Owned const made(
            getBlankSIMDOptimized32FFormat(row.eGiven, ExtentInPixelSpace(9, 2), oPixelExtent, oPosition));
        EXPECT_EQ(row.eExpected, made->pixelFormat()) << row.eGiven;

        ImageCPU const model(row.eGiven, PositionExtentInPixelSpace(oPosition, ExtentInPixelSpace(9, 2)),
                             oPixelExtent, ExtentInPixelSpace(50, 2));
        Owned const alike(getBlankSIMDOptimized32FFormat(model));
        EXPECT_EQ(row.eExpected, alike->pixelFormat()) << row.eGiven;
        EXPECT_EQ(model.positionExtent(), alike->positionExtent());
        EXPECT_EQ(model.pixelExtent(), alike->pixelExtent());
        EXPECT_EQ(made->capacityExtent(), alike->capacityExtent());
    }
}

TEST(BlankSIMDOptimizedImage, RefusesFormatsWithoutChannels) {
    for (int value : {0, 15, 16, 17, 18, 19, 20}) {
        ORVO_EXPECT_INTERNAL(getBlankSIMDOptimized32FFormat(static_cast<ImageCPU::tePixelFormat>(value),
                                                            ExtentInPixelSpace(4, 4), oPixelExtent,
                                                            oPosition),
                             "Pixel format not supported by ORVO in CPU mode");
    }
    ORVO_EXPECT_INTERNAL(getBlankSIMDOptimized32FFormat(ImageCPU()),
                         "Pixel format not supported by ORVO in CPU mode");
}

TEST(BlankSIMDOptimizedImage, RefusesSizesBeforeItAllocates) {
    std::uint64_t const nObjects = Core::MemoryStatistics::allocations(MEMORY_TYPE_OBJECT);
    std::uint64_t const nStorage = Core::MemoryStatistics::allocations(MEMORY_TYPE_IMAGE);
    auto const make = [](int channels, int width, int height) {
        return getBlankSIMDOptimized32FFormat(channels, ExtentInPixelSpace(width, height), oPixelExtent,
                                              oPosition);
    };
    ORVO_EXPECT_PARAMETER(make(1, -1, 4), "Image extent and capacity must not be negative");
    ORVO_EXPECT_PARAMETER(make(4, 4, -1), "Image extent and capacity must not be negative");
    ORVO_EXPECT_PARAMETER(make(4, INT_MAX, 1), "Image size exceeds 4294967295 bytes");
    ORVO_EXPECT_PARAMETER(make(3, INT_MAX, 1), "Image size exceeds 4294967295 bytes");
    ORVO_EXPECT_PARAMETER(make(1, INT_MAX, 1), "Image size exceeds 4294967295 bytes");
    EXPECT_EQ(nStorage, Core::MemoryStatistics::allocations(MEMORY_TYPE_IMAGE));
    EXPECT_EQ(nObjects, Core::MemoryStatistics::allocations(MEMORY_TYPE_OBJECT));
    // By its height alone, which the image finds.
    ORVO_EXPECT_PARAMETER(make(4, 16384, 16384), "Image size exceeds 4294967295 bytes");
    EXPECT_EQ(nStorage, Core::MemoryStatistics::allocations(MEMORY_TYPE_IMAGE));
}

TEST(BlankSIMDOptimizedImage, LeavesNothingBehindIfAnAllocationFails) {
    std::size_t const nObjects = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    for (std::uint64_t n = 1; n <= 2; ++n) {
        Core::AllocationFailure const failure(n);
        EXPECT_THROW(getBlankSIMDOptimized32FFormat(4, ExtentInPixelSpace(4, 4), oPixelExtent, oPosition),
                     std::bad_alloc);
        EXPECT_TRUE(failure.hasFired());
    }
    EXPECT_EQ(nObjects, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
}

} // namespace
} // namespace ORVO::ImageRuntime
