#include "orvo/image_runtime/images/ImageCPU.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/core/utility/Integers.h"
#include "orvo/image_runtime/images/PixelStructures.h"
#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstring>
#include <memory>
#include <numeric>
#include <sstream>
#include <vector>

namespace ORVO {
namespace {

using Format = ImageCPU::tePixelFormat;
using Core::MemoryStatistics;

PixelExtentInWorldSpace const oUnit(1, 1);

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height));
}

ImageCPU image(Format eFormat, int width, int height, ExtentInPixelSpace capacity = ExtentInPixelSpace()) {
    return ImageCPU(eFormat, rectangle(0, 0, width, height), oUnit, capacity);
}

/// What each format is to answer; -1 where the function refuses it.
struct FormatRow {
    int value;
    char const* sName;
    int nChannels;
    int nChannelBits;
    int nPixelBytes;
    bool bInt;
};

constexpr FormatRow FORMAT_ROWS[] = {
    {1, "PIXEL_FORMAT_BGR8", 3, 8, 3, true},
    {2, "PIXEL_FORMAT_BGRA8", 4, 8, 4, true},
    {3, "PIXEL_FORMAT_RGB8", 3, 8, 3, true},
    {4, "PIXEL_FORMAT_RGBA8", 4, 8, 4, true},
    {5, "PIXEL_FORMAT_RGB16", 3, 16, 6, true},
    {6, "PIXEL_FORMAT_RGBA16", 4, 16, 8, true},
    {7, "PIXEL_FORMAT_RGB32F", 3, 32, 12, false},
    {8, "PIXEL_FORMAT_RGBA32F", 4, 32, 16, false},
    {9, "PIXEL_FORMAT_LUMINANCE8", 1, 8, 1, true},
    {10, "PIXEL_FORMAT_LUMINANCE16", 1, 16, 2, true},
    {11, "PIXEL_FORMAT_LUMINANCE32F", 1, 32, 4, false},
    {12, "PIXEL_FORMAT_LUMINANCE_ALPHA8", 2, 8, 2, true},
    {13, "PIXEL_FORMAT_LUMINANCE_ALPHA16", 2, 16, 4, true},
    {14, "PIXEL_FORMAT_LUMINANCE_ALPHA32F", 2, 32, 8, false},
    {15, "PIXEL_FORMAT_RGB16F", -1, 16, 6, false},
    {16, "PIXEL_FORMAT_RGBA16F", -1, 16, 8, false},
    {17, "PIXEL_FORMAT_LUMINANCE16F", -1, 16, -1, false},
    {18, "PIXEL_FORMAT_LUMINANCE_ALPHA16F", -1, 16, -1, false},
    {19, "PIXEL_FORMAT_UNDEFINED", -1, -1, -1, false},
    {0, "UNKNOWN", -1, -1, -1, false},
    {20, "UNKNOWN", -1, -1, -1, false},
    {-1, "UNKNOWN", -1, -1, -1, false},
    {INT_MAX, "UNKNOWN", -1, -1, -1, false},
    {INT_MIN, "UNKNOWN", -1, -1, -1, false},
};

class PixelFormat : public testing::TestWithParam<FormatRow> {
protected:
    Format format() const { return static_cast<Format>(GetParam().value); }
};

TEST_P(PixelFormat, HasItsName) {
    std::ostringstream stream;
    stream << format();
    EXPECT_EQ(GetParam().sName, stream.str());
}

TEST_P(PixelFormat, HasItsChannels) {
    if (GetParam().nChannels < 0) {
        ORVO_EXPECT_INTERNAL(nChannels(format()), "Pixel format not supported by ORVO in CPU mode");
    } else {
        EXPECT_EQ(static_cast<std::size_t>(GetParam().nChannels), nChannels(format()));
    }
}

TEST_P(PixelFormat, HasItsChannelBits) {
    if (GetParam().nChannelBits < 0) {
        ORVO_EXPECT_INTERNAL(channelSizeBits(format()),
                             "Not implemented: ePixelFormat in channelSizeBits().");
    } else {
        EXPECT_EQ(static_cast<std::size_t>(GetParam().nChannelBits), channelSizeBits(format()));
    }
}

TEST_P(PixelFormat, HasItsPixelBytes) {
    if (GetParam().value == 19) {
        ORVO_EXPECT_INTERNAL(pixelSizeBytes(format()), "!\"PIXEL_FORMAT_UNDEFINED\"");
    } else if (GetParam().nPixelBytes < 0) {
        ORVO_EXPECT_INTERNAL(pixelSizeBytes(format()), "Not implemented: ePixelFormat in pixelSizeBytes().");
    } else {
        EXPECT_EQ(static_cast<std::size_t>(GetParam().nPixelBytes), pixelSizeBytes(format()));
    }
}

TEST_P(PixelFormat, IsFloatUnlessItIsInt) {
    EXPECT_EQ(GetParam().bInt, isInt(format()));
    EXPECT_EQ(!GetParam().bInt, isFloat(format()));
}

TEST_P(PixelFormat, MakesAnImageWhereItHasASize) {
    auto const make = [this] {
        return ImageCPU(format(), rectangle(2, 3, 5, 7), oUnit, ExtentInPixelSpace(11, 9));
    };
    if (GetParam().nPixelBytes < 0) {
        EXPECT_THROW(make(), InternalException);
        return;
    }
    std::size_t const nBytesBefore = MemoryStatistics::bytes(MEMORY_TYPE_IMAGE);
    ImageCPU const made = make();
    EXPECT_EQ(99u * static_cast<unsigned>(GetParam().nPixelBytes),
              MemoryStatistics::bytes(MEMORY_TYPE_IMAGE) - nBytesBefore);
    EXPECT_EQ(format(), made.pixelFormat());
    EXPECT_EQ(ORVO_TARGET_CPU, made.targetPlatform());
    EXPECT_EQ(rectangle(2, 3, 5, 7), made.positionExtent());
    EXPECT_EQ(ExtentInPixelSpace(11, 9), made.capacityExtent());
    EXPECT_TRUE(isAligned(made.pixels(), 64));
}

INSTANTIATE_TEST_SUITE_P(All, PixelFormat, testing::ValuesIn(FORMAT_ROWS),
                         [](testing::TestParamInfo<FormatRow> const& parameters) {
                             std::string const sName = parameters.param.sName;
                             return sName + "_" +
                                    std::to_string(static_cast<unsigned>(parameters.param.value));
                         });

TEST(ImageCPU, HasNothingByDefault) {
    ImageCPU empty;
    EXPECT_EQ(ImageCPU::PIXEL_FORMAT_UNDEFINED, empty.pixelFormat());
    EXPECT_EQ(nullptr, empty.pixels());
    EXPECT_FALSE(empty.capacityExtent().isDefined());
    EXPECT_EQ(ORVO_TARGET_CPU, empty.targetPlatform());
    EXPECT_NO_THROW(empty.initializeToTransparentBlack());
    ORVO_EXPECT_INTERNAL(pixelSizeBytes(empty.pixelFormat()), "!\"PIXEL_FORMAT_UNDEFINED\"");
    ORVO_EXPECT_INTERNAL(empty.isInSIMDOptimizedFormat(),
                         "Not implemented: ePixelFormat in channelSizeBits().");
}

TEST(ImageCPU, TakesItsExtentForAnAbsentCapacity) {
    EXPECT_EQ(ExtentInPixelSpace(5, 7), image(ImageCPU::PIXEL_FORMAT_RGB8, 5, 7).capacityExtent());
    EXPECT_EQ(ExtentInPixelSpace(5, 7),
              image(ImageCPU::PIXEL_FORMAT_RGB8, 5, 7, ExtentInPixelSpace(0, 99)).capacityExtent());
}

TEST(ImageCPU, TakesAnyOtherCapacityAsGiven) {
    EXPECT_EQ(ExtentInPixelSpace(9, 0),
              image(ImageCPU::PIXEL_FORMAT_RGB8, 5, 7, ExtentInPixelSpace(9, 0)).capacityExtent());
    EXPECT_EQ(ExtentInPixelSpace(2, 3),
              image(ImageCPU::PIXEL_FORMAT_RGB8, 5, 7, ExtentInPixelSpace(2, 3)).capacityExtent());
}

TEST(ImageCPU, MayBeEmpty) {
    ImageCPU empty = image(ImageCPU::PIXEL_FORMAT_RGBA32F, 0, 0);
    EXPECT_EQ(0u, empty.numberOfPixels());
    EXPECT_NO_THROW(empty.initializeToTransparentBlack());
    EXPECT_EQ(0u, std::make_unique<ImageCPU>(empty)->numberOfPixels());
    EXPECT_TRUE(empty.isInSIMDOptimizedFormat());
}

TEST(ImageCPU, RefusesSizesBeyond32BitsBeforeItAllocates) {
    struct Row {
        Format eFormat;
        int width, height;
    };
    // 2^32 bytes; the smallest that is too large by a pixel; products that wrap 32 and 64 bits to something
    // small.
    Row const refused[] = {{ImageCPU::PIXEL_FORMAT_LUMINANCE8, 65536, 65536},
                           {ImageCPU::PIXEL_FORMAT_RGBA32F, 16384, 16384},
                           {ImageCPU::PIXEL_FORMAT_RGB8, 1, 1431655766},
                           {ImageCPU::PIXEL_FORMAT_RGBA32F, 16385, 65536},
                           {ImageCPU::PIXEL_FORMAT_RGBA32F, INT_MAX, INT_MAX}};
    for (Row const& row : refused) {
        SCOPED_TRACE(testing::Message() << row.eFormat << " " << row.width << " by " << row.height);
        std::uint64_t const nBefore = MemoryStatistics::allocations(MEMORY_TYPE_IMAGE);
        ORVO_EXPECT_PARAMETER(image(row.eFormat, row.width, row.height),
                              "Image size exceeds 4294967295 bytes");
        // The same by the capacity alone, and around memory of the caller.
        ORVO_EXPECT_PARAMETER(image(row.eFormat, 1, 1, ExtentInPixelSpace(row.width, row.height)),
                              "Image size exceeds 4294967295 bytes");
        unsigned char aPixels[16] = {};
        ORVO_EXPECT_PARAMETER(ImageCPU(row.eFormat, aPixels, rectangle(0, 0, row.width, row.height), oUnit,
                                       ExtentInPixelSpace()),
                              "Image size exceeds 4294967295 bytes");
        EXPECT_EQ(nBefore, MemoryStatistics::allocations(MEMORY_TYPE_IMAGE));
    }
}

TEST(ImageCPU, AcceptsTheLargestSize) {
    // 65535 * 65537 is 2^32 - 1. The memory is the caller's and not touched.
    unsigned char aPixels[1] = {};
    EXPECT_NO_THROW(ImageCPU(ImageCPU::PIXEL_FORMAT_LUMINANCE8, aPixels, rectangle(0, 0, 65535, 65537), oUnit,
                             ExtentInPixelSpace()));
}

TEST(ImageCPU, RefusesNegativeSizes) {
    char const* const sText = "Image extent and capacity must not be negative";
    ORVO_EXPECT_PARAMETER(image(ImageCPU::PIXEL_FORMAT_RGBA8, -1, 4), sText);
    ORVO_EXPECT_PARAMETER(image(ImageCPU::PIXEL_FORMAT_RGBA8, 4, -1), sText);
    ORVO_EXPECT_PARAMETER(image(ImageCPU::PIXEL_FORMAT_RGBA8, -4, -4), sText);
    ORVO_EXPECT_PARAMETER(image(ImageCPU::PIXEL_FORMAT_RGBA8, 4, 4, ExtentInPixelSpace(-4, 4)), sText);
    ORVO_EXPECT_PARAMETER(image(ImageCPU::PIXEL_FORMAT_RGBA8, 4, 4, ExtentInPixelSpace(4, -4)), sText);
}

TEST(ImageCPU, RefusesPixelExtentsThatAreNotPositive) {
    ORVO_EXPECT_INTERNAL(ImageCPU(ImageCPU::PIXEL_FORMAT_RGBA8, rectangle(0, 0, 1, 1),
                                  PixelExtentInWorldSpace(0, 1), ExtentInPixelSpace()),
                         "pixelExtent.pixelExtent().extentAsFloat2().x > 0");
}

TEST(ImageCPU, ReportsTheFileOfItsFailures) {
    try {
        nChannels(ImageCPU::PIXEL_FORMAT_UNDEFINED);
        FAIL() << "nothing was thrown";
    } catch (InternalException const& exception) {
        EXPECT_STREQ("orvo/image_runtime/images/ImageCPU.cpp", exception.file());
    }
}

TEST(ImageCPU, LeavesNothingBehindIfItsStorageFails) {
    std::size_t const nBlocks = MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    Core::AllocationFailure const failure(1);
    EXPECT_THROW(image(ImageCPU::PIXEL_FORMAT_RGBA8, 4, 4), std::bad_alloc);
    EXPECT_TRUE(failure.hasFired());
    EXPECT_EQ(nBlocks, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

TEST(ImageCPU, FreesItsStorage) {
    std::size_t const nBlocks = MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    {
        ImageCPU const made = image(ImageCPU::PIXEL_FORMAT_RGBA8, 4, 4);
        EXPECT_EQ(nBlocks + 1, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
    }
    EXPECT_EQ(nBlocks, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

TEST(ImageCPU, WrapsMemoryOfTheCaller) {
    std::size_t const nBlocks = MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    std::vector<unsigned char> aPixels(4 * 6 * 3, 7);
    {
        ImageCPU wrapping(ImageCPU::PIXEL_FORMAT_RGBA8, aPixels.data(), rectangle(-2, -1, 5, 3), oUnit,
                          ExtentInPixelSpace(6, 3));
        EXPECT_EQ(aPixels.data(), wrapping.pixels());
        EXPECT_EQ(nBlocks, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
        wrapping.initializeToTransparentBlack();
    }
    EXPECT_EQ(std::vector<unsigned char>(72, 0), aPixels);
}

TEST(ImageCPU, WrapsNoMemory) {
    ImageCPU wrapping(ImageCPU::PIXEL_FORMAT_RGBA8, nullptr, rectangle(0, 0, 5, 3), oUnit,
                      ExtentInPixelSpace());
    EXPECT_EQ(nullptr, wrapping.pixels());
    EXPECT_NO_THROW(wrapping.initializeToTransparentBlack());
    std::ostringstream stream;
    wrapping.writeImageData(stream);
    EXPECT_EQ("", stream.str());
    EXPECT_NO_THROW(ImageCPU{wrapping});
}

TEST(ImageCPU, ClearsItsWholeStorage) {
    ImageCPU made = image(ImageCPU::PIXEL_FORMAT_RGBA8, 3, 2, ExtentInPixelSpace(8, 4));
    std::memset(made.pixels(), 0xff, 128);
    made.initializeToTransparentBlack();
    EXPECT_TRUE(
        std::all_of(made.pixels(), made.pixels() + 128, [](unsigned char value) { return value == 0; }));
}

template <class Pixel>
void expectSlots(std::ptrdiff_t slot, Pixel* (ImageCPU::*pMutable)(),
                 Pixel const* (ImageCPU::*pConst)() const) {
    EXPECT_EQ(slot, ORVO::Test::slotOf(pMutable));
    EXPECT_EQ(slot + 1, ORVO::Test::constSlotOf(pConst));
}

TEST(ImageCPU, HasItsOperationsInOrderBehindThoseOfTheBase) {
    expectSlots<PixelBGRA8>(5, &ImageCPU::pixels_BGRA8, &ImageCPU::pixels_BGRA8);
    expectSlots<PixelBGR8>(7, &ImageCPU::pixels_BGR8, &ImageCPU::pixels_BGR8);
    expectSlots<PixelRGB16F>(9, &ImageCPU::pixels_RGB16F, &ImageCPU::pixels_RGB16F);
    expectSlots<PixelRGBA16F>(11, &ImageCPU::pixels_RGBA16F, &ImageCPU::pixels_RGBA16F);
    expectSlots<PixelRGB32F>(13, &ImageCPU::pixels_RGB32F, &ImageCPU::pixels_RGB32F);
    expectSlots<PixelRGBA32F>(15, &ImageCPU::pixels_RGBA32F, &ImageCPU::pixels_RGBA32F);
    expectSlots<PixelRGB8>(17, &ImageCPU::pixels_RGB8, &ImageCPU::pixels_RGB8);
    expectSlots<PixelRGBA8>(19, &ImageCPU::pixels_RGBA8, &ImageCPU::pixels_RGBA8);
    expectSlots<PixelLuminance8>(21, &ImageCPU::pixels_Luminance8, &ImageCPU::pixels_Luminance8);
    expectSlots<PixelLuminanceAlpha8>(23, &ImageCPU::pixels_LuminanceAlpha8,
                                      &ImageCPU::pixels_LuminanceAlpha8);
    expectSlots<PixelLuminance16F>(25, &ImageCPU::pixels_Luminance16F, &ImageCPU::pixels_Luminance16F);
    expectSlots<PixelLuminanceAlpha16F>(27, &ImageCPU::pixels_LuminanceAlpha16F,
                                        &ImageCPU::pixels_LuminanceAlpha16F);
    expectSlots<PixelLuminance32F>(29, &ImageCPU::pixels_Luminance32F, &ImageCPU::pixels_Luminance32F);
    expectSlots<PixelLuminanceAlpha32F>(31, &ImageCPU::pixels_LuminanceAlpha32F,
                                        &ImageCPU::pixels_LuminanceAlpha32F);
    expectSlots<unsigned char>(33, &ImageCPU::pixels, &ImageCPU::pixels);
}

TEST(ImageCPU, ReinterpretsItsFirstPixel) {
    ImageCPU made = image(ImageCPU::PIXEL_FORMAT_RGB8, 8, 8);
    ImageCPU const& constant = made;
    void const* const pFirst = made.pixels();
    EXPECT_EQ(pFirst, constant.pixels());
    EXPECT_EQ(pFirst, made.pixels_BGRA8());
    EXPECT_EQ(pFirst, constant.pixels_BGRA8());
    EXPECT_EQ(pFirst, made.pixels_BGR8());
    EXPECT_EQ(pFirst, constant.pixels_BGR8());
    EXPECT_EQ(pFirst, made.pixels_RGB16F());
    EXPECT_EQ(pFirst, constant.pixels_RGB16F());
    EXPECT_EQ(pFirst, made.pixels_RGBA16F());
    EXPECT_EQ(pFirst, constant.pixels_RGBA16F());
    EXPECT_EQ(pFirst, made.pixels_RGB32F());
    EXPECT_EQ(pFirst, constant.pixels_RGB32F());
    EXPECT_EQ(pFirst, made.pixels_RGBA32F());
    EXPECT_EQ(pFirst, constant.pixels_RGBA32F());
    EXPECT_EQ(pFirst, made.pixels_RGB8());
    EXPECT_EQ(pFirst, constant.pixels_RGB8());
    EXPECT_EQ(pFirst, made.pixels_RGBA8());
    EXPECT_EQ(pFirst, constant.pixels_RGBA8());
    EXPECT_EQ(pFirst, made.pixels_Luminance8());
    EXPECT_EQ(pFirst, constant.pixels_Luminance8());
    EXPECT_EQ(pFirst, made.pixels_LuminanceAlpha8());
    EXPECT_EQ(pFirst, constant.pixels_LuminanceAlpha8());
    EXPECT_EQ(pFirst, made.pixels_Luminance16F());
    EXPECT_EQ(pFirst, constant.pixels_Luminance16F());
    EXPECT_EQ(pFirst, made.pixels_LuminanceAlpha16F());
    EXPECT_EQ(pFirst, constant.pixels_LuminanceAlpha16F());
    EXPECT_EQ(pFirst, made.pixels_Luminance32F());
    EXPECT_EQ(pFirst, constant.pixels_Luminance32F());
    EXPECT_EQ(pFirst, made.pixels_LuminanceAlpha32F());
    EXPECT_EQ(pFirst, constant.pixels_LuminanceAlpha32F());
}

} // namespace
} // namespace ORVO
