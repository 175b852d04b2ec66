#include "orvo/image_runtime/images/ImageCPU.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/core/utility/Integers.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <numeric>
#include <vector>

namespace ORVO {
namespace {

using Core::MemoryStatistics;

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height));
}

constexpr std::size_t STORAGE_BYTES = 8 * 3 * 4;

/// 5 by 2 pixels in a storage of 8 by 3, each byte its own number, padding included.
ImageCPU numbered() {
    ImageCPU image(ImageCPU::PIXEL_FORMAT_RGBA8, rectangle(-4, 9, 5, 2), PixelExtentInWorldSpace(0.5f, 0.25f),
                   ExtentInPixelSpace(8, 3));
    std::iota(image.pixels(), image.pixels() + STORAGE_BYTES, static_cast<unsigned char>(1));
    return image;
}

void expectNumbered(ImageCPU const& image) {
    EXPECT_EQ(ImageCPU::PIXEL_FORMAT_RGBA8, image.pixelFormat());
    EXPECT_EQ(rectangle(-4, 9, 5, 2), image.positionExtent());
    EXPECT_EQ(PixelExtentInWorldSpace(0.5f, 0.25f), image.pixelExtent());
    EXPECT_EQ(ExtentInPixelSpace(8, 3), image.capacityExtent());
    EXPECT_EQ(ORVO_TARGET_CPU, image.targetPlatform());
    for (std::size_t i = 0; i < STORAGE_BYTES; ++i) {
        ASSERT_EQ(i + 1, image.pixels()[i]);
    }
}

TEST(ImageCPUCopy, TakesTheWholeStorage) {
    ImageCPU const source = numbered();
    ImageCPU copy(source);
    expectNumbered(copy);
    EXPECT_NE(source.pixels(), copy.pixels());
    EXPECT_TRUE(isAligned(copy.pixels(), 16));
    copy.initializeToTransparentBlack();
    expectNumbered(source);
}

TEST(ImageCPUCopy, OwnsItsStorageAlsoIfItsSourceDoesNot) {
    std::size_t const nBlocks = MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    std::vector<unsigned char> aPixels(STORAGE_BYTES);
    std::iota(aPixels.begin(), aPixels.end(), static_cast<unsigned char>(1));
    {
        ImageCPU const source(ImageCPU::PIXEL_FORMAT_RGBA8, aPixels.data(), rectangle(-4, 9, 5, 2),
                              PixelExtentInWorldSpace(0.5f, 0.25f), ExtentInPixelSpace(8, 3));
        auto const pCopy = std::make_unique<ImageCPU>(source);
        std::fill(aPixels.begin(), aPixels.end(), static_cast<unsigned char>(0));
        expectNumbered(*pCopy);
        EXPECT_EQ(nBlocks + 1, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
    }
    EXPECT_EQ(nBlocks, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

TEST(ImageCPUCopy, OfAnImageWithoutPixelsHasNoneToShow) {
    ImageCPU const empty;
    auto const pCopy = std::make_unique<ImageCPU>(empty);
    EXPECT_EQ(ImageCPU::PIXEL_FORMAT_UNDEFINED, pCopy->pixelFormat());
    EXPECT_FALSE(pCopy->capacityExtent().isDefined());
    ImageCPU assigned = numbered();
    assigned = empty;
    EXPECT_EQ(ImageCPU::PIXEL_FORMAT_UNDEFINED, assigned.pixelFormat());
    EXPECT_EQ(0u, assigned.numberOfPixels());
}

TEST(ImageCPUCopy, ByAssignmentReplacesWhatTheImageOwned) {
    std::size_t const nBlocks = MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    {
        ImageCPU const source = numbered();
        ImageCPU target(ImageCPU::PIXEL_FORMAT_RGB32F, rectangle(0, 0, 100, 100),
                        PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
        EXPECT_EQ(&target, &(target = source));
        expectNumbered(target);
        EXPECT_TRUE(isAligned(target.pixels(), 16));
        EXPECT_EQ(nBlocks + 2, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
    }
    EXPECT_EQ(nBlocks, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

TEST(ImageCPUCopy, ByAssignmentLeavesWrappedMemoryAlone) {
    std::vector<unsigned char> aPixels(16, 3);
    ImageCPU target(ImageCPU::PIXEL_FORMAT_RGBA8, aPixels.data(), rectangle(0, 0, 2, 2),
                    PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
    target = numbered();
    expectNumbered(target);
    EXPECT_EQ(std::vector<unsigned char>(16, 3), aPixels);
}

TEST(ImageCPUCopy, ToItselfDoesNothing) {
    ImageCPU image = numbered();
    unsigned char const* const pPixels = image.pixels();
    std::uint64_t const nAllocations = MemoryStatistics::allocations(MEMORY_TYPE_IMAGE);
    ImageCPU const& same = image;
    image = same;
    EXPECT_EQ(pPixels, image.pixels());
    EXPECT_EQ(nAllocations, MemoryStatistics::allocations(MEMORY_TYPE_IMAGE));
    expectNumbered(image);
}

TEST(ImageCPUCopy, FromAnImageAroundItsOwnStorageKeepsThePixels) {
    ImageCPU image = numbered();
    ImageCPU const around(ImageCPU::PIXEL_FORMAT_RGBA8, image.pixels(), rectangle(-4, 9, 5, 2),
                          PixelExtentInWorldSpace(0.5f, 0.25f), ExtentInPixelSpace(8, 3));
    image = around;
    expectNumbered(image);
}

TEST(ImageCPUCopy, ThatFailsLeavesTheTargetAsItWas) {
    ImageCPU const source(ImageCPU::PIXEL_FORMAT_RGB32F, rectangle(0, 0, 100, 100),
                          PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
    ImageCPU target = numbered();
    std::size_t const nBlocks = MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    {
        Core::AllocationFailure const failure(1);
        EXPECT_THROW(target = source, std::bad_alloc);
    }
    expectNumbered(target);
    {
        Core::AllocationFailure const failure(1);
        EXPECT_THROW(ImageCPU{source}, std::bad_alloc);
    }
    EXPECT_EQ(nBlocks, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

} // namespace
} // namespace ORVO
