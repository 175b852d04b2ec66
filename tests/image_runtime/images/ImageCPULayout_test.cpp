#include "orvo/image_runtime/images/ImageCPU.h"

#include "orvo/image_runtime/images/PixelStructures.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <cstring>
#include <sstream>
#include <vector>

namespace ORVO {
namespace {

using Format = ImageCPU::tePixelFormat;

PixelExtentInWorldSpace const oUnit(1, 1);

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height));
}

ImageCPU image(Format eFormat, int width, int height, ExtentInPixelSpace capacity = ExtentInPixelSpace()) {
    return ImageCPU(eFormat, rectangle(0, 0, width, height), oUnit, capacity);
}

TEST(ImageCPULayout, IsOptimisedIfAllRowsBeginOnLinesOf64Bytes) {
    struct Row {
        Format eFormat;
        int width, capacity;
        bool bOptimised;
    };
    Row const rows[] = {
        {ImageCPU::PIXEL_FORMAT_RGBA32F, 100, 100, true}, // 1600 bytes
        {ImageCPU::PIXEL_FORMAT_RGB32F, 100, 100, false}, // 1200 bytes
        {ImageCPU::PIXEL_FORMAT_RGB32F, 100, 112, true},  // 1344 bytes
        {ImageCPU::PIXEL_FORMAT_RGBA32F, 3, 3, false},    // 48 bytes
        {ImageCPU::PIXEL_FORMAT_RGBA32F, 3, 4, true},     // 64 bytes
        {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 15, 15, false},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 15, 16, true},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 7, 7, false},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 7, 8, true},
        // Rows that would do, of formats that do not.
        {ImageCPU::PIXEL_FORMAT_RGBA8, 16, 16, false},
        {ImageCPU::PIXEL_FORMAT_RGBA16, 16, 16, false},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE8, 64, 64, false},
        {ImageCPU::PIXEL_FORMAT_RGBA16F, 16, 16, false},
        {ImageCPU::PIXEL_FORMAT_RGB16F, 32, 32, false},
    };
    for (Row const& row : rows) {
        SCOPED_TRACE(testing::Message() << row.eFormat << " " << row.capacity);
        EXPECT_EQ(
            row.bOptimised,
            image(row.eFormat, row.width, 4, ExtentInPixelSpace(row.capacity, 4)).isInSIMDOptimizedFormat());
    }
}

TEST(ImageCPULayout, IsNotOptimisedInUnalignedMemory) {
    alignas(64) unsigned char aPixels[4 * 16 * 4 + 64] = {};
    for (std::size_t nOffset : {0, 4, 16, 32, 60, 64}) {
        ImageCPU const wrapping(ImageCPU::PIXEL_FORMAT_RGBA32F, aPixels + nOffset, rectangle(0, 0, 4, 4),
                                oUnit, ExtentInPixelSpace());
        EXPECT_EQ(nOffset % 64 == 0, wrapping.isInSIMDOptimizedFormat()) << nOffset;
    }
}

/// Derived classes may present other storage: the image looks at itself through its virtual operations.
class RedirectedImage : public ImageCPU {
public:
    RedirectedImage(unsigned char* pRedirected, ExtentInPixelSpace capacity)
        : ImageCPU(PIXEL_FORMAT_RGBA32F, rectangle(0, 0, 1, 1), oUnit, ExtentInPixelSpace()),
          pRedirected_(pRedirected),
          oRedirectedCapacity_(capacity) {}

    unsigned char* pixels() override { return pRedirected_; }
    unsigned char const* pixels() const override { return pRedirected_; }
    ExtentInPixelSpace capacityExtent() const override { return oRedirectedCapacity_; }

private:
    unsigned char* pRedirected_;
    ExtentInPixelSpace oRedirectedCapacity_;
};

TEST(ImageCPULayout, IsAskedOfTheVirtualPixelsAndCapacity) {
    alignas(64) unsigned char aPixels[64 * 2 + 64] = {};
    EXPECT_TRUE(RedirectedImage(aPixels, ExtentInPixelSpace(4, 2)).isInSIMDOptimizedFormat());
    EXPECT_FALSE(RedirectedImage(aPixels + 16, ExtentInPixelSpace(4, 2)).isInSIMDOptimizedFormat());
    EXPECT_FALSE(RedirectedImage(aPixels, ExtentInPixelSpace(3, 2)).isInSIMDOptimizedFormat());
}

TEST(ImageCPUDump, AddsThreeLinesToThoseOfTheBase) {
    ImageCPU const made(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(-3, 4, 6, 2),
                        PixelExtentInWorldSpace(0.5f, 0.25f), ExtentInPixelSpace(8, 2));
    std::ostringstream expected;
    expected << "Image address : " << static_cast<void const*>(static_cast<ImageBase const*>(&made))
             << "\n"
                "Image extent : (6, 2)\n"
                "Image position : (-3, 4)\n"
                "Image # pixels : 12\n"
                "Image capacity : (8, 2)\n"
                "Image pixel extent : (0.5, 0.25)\n"
                "Pixel format : PIXEL_FORMAT_RGBA32F\n"
                "Physical size (8, 2)\n"
                "isInSIMDOptimizedFormat 1\n";
    std::ostringstream stream;
    made.doWrite(stream);
    EXPECT_EQ(expected.str(), stream.str());
}

TEST(ImageCPUDump, IsRefusedForAnImageOfUndefinedFormat) {
    std::ostringstream stream;
    ORVO_EXPECT_INTERNAL(ImageCPU().doWrite(stream), "Not implemented: ePixelFormat in channelSizeBits().");
    ORVO_EXPECT_INTERNAL(ImageCPU().writeFull(stream), "Not implemented: ePixelFormat in channelSizeBits().");
}

template <class Channel>
void fill(ImageCPU& target, std::vector<Channel> const& values) {
    std::copy(values.begin(), values.end(), reinterpret_cast<Channel*>(target.pixels()));
}

std::string dataOf(ImageCPU const& source, int maxWidth, int maxHeight) {
    std::ostringstream stream;
    source.writeImageData(stream, maxWidth, maxHeight);
    return stream.str();
}

TEST(ImageCPUDump, WritesBytesAsNumbers) {
    ImageCPU rgb = image(ImageCPU::PIXEL_FORMAT_RGB8, 2, 2);
    fill<unsigned char>(rgb, {0, 1, 2, 10, 11, 12, 65, 66, 67, 253, 254, 255});
    EXPECT_EQ("0 1 2 10 11 12 \n"
              "65 66 67 253 254 255 \n",
              dataOf(rgb, 9, 9));

    ImageCPU rgba = image(ImageCPU::PIXEL_FORMAT_RGBA8, 2, 1);
    fill<unsigned char>(rgba, {0, 1, 2, 3, 65, 66, 67, 255});
    EXPECT_EQ("0 1 2 3  65 66 67 255  \n", dataOf(rgba, 9, 9));
}

TEST(ImageCPUDump, WritesFloatsWithTwoDecimals) {
    ImageCPU rgb = image(ImageCPU::PIXEL_FORMAT_RGB32F, 2, 1);
    fill<float>(rgb, {0.0f, 0.25f, 1.0f, -2.5f, 1000.0f, 0.126f});
    EXPECT_EQ("0.00 0.25 1.00  -2.50 1000.00 0.13  \n", dataOf(rgb, 9, 9));

    ImageCPU rgba = image(ImageCPU::PIXEL_FORMAT_RGBA32F, 1, 2);
    fill<float>(rgba, {0.0f, 0.25f, 1.0f, 0.5f, 1.0f, 2.0f, 3.0f, 4.0f});
    EXPECT_EQ("0.00 0.25 1.00 0.50  \n"
              "1.00 2.00 3.00 4.00  \n",
              dataOf(rgba, 9, 9));
}

TEST(ImageCPUDump, ReadsMemoryOfTheCallerAtAnyAddress) {
    float const values[] = {0.0f, 0.25f, 1.0f};
    unsigned char aPixels[sizeof(values) + 1] = {};
    std::memcpy(aPixels + 1, values, sizeof(values));
    ImageCPU const odd(ImageCPU::PIXEL_FORMAT_RGB32F, aPixels + 1, rectangle(0, 0, 1, 1), oUnit,
                       ExtentInPixelSpace());
    EXPECT_EQ("0.00 0.25 1.00  \n", dataOf(odd, 9, 9));
}

TEST(ImageCPUDump, IsBoundByItsLimitsAndByTheCapacity) {
    ImageCPU rgb = image(ImageCPU::PIXEL_FORMAT_RGB8, 1, 1, ExtentInPixelSpace(3, 2));
    fill<unsigned char>(rgb, {1, 1, 1, 2, 2, 2, 3, 3, 3, 4, 4, 4, 5, 5, 5, 6, 6, 6});
    std::string const sAll = "1 1 1 2 2 2 3 3 3 \n4 4 4 5 5 5 6 6 6 \n";
    EXPECT_EQ(sAll, dataOf(rgb, 3, 2));
    EXPECT_EQ(sAll, dataOf(rgb, 1000, 1000));
    EXPECT_EQ("1 1 1 2 2 2 \n4 4 4 5 5 5 \n", dataOf(rgb, 2, 5));
    EXPECT_EQ("1 1 1 2 2 2 3 3 3 \n", dataOf(rgb, 3, 1));
    EXPECT_EQ("\n\n", dataOf(rgb, 0, 2));
    EXPECT_EQ("", dataOf(rgb, 3, 0));
    EXPECT_EQ("", dataOf(rgb, -1, -1));

    std::ostringstream stream;
    rgb.writeImageData(stream);
    EXPECT_EQ(sAll, stream.str());
}

TEST(ImageCPUDump, RefusesOtherFormatsInOneLine) {
    for (int value = 1; value <= 16; ++value) {
        auto const eFormat = static_cast<Format>(value);
        if (eFormat == ImageCPU::PIXEL_FORMAT_RGB8 || eFormat == ImageCPU::PIXEL_FORMAT_RGBA8 ||
            eFormat == ImageCPU::PIXEL_FORMAT_RGB32F || eFormat == ImageCPU::PIXEL_FORMAT_RGBA32F) {
            continue;
        }
        EXPECT_EQ("Image format not handled\n", dataOf(image(eFormat, 2, 2), 9, 9)) << eFormat;
    }
    EXPECT_EQ("Image format not handled\n", dataOf(ImageCPU(), 9, 9));
}

TEST(ImageCPUDump, WritesDescriptionAndDataInFull) {
    ImageCPU rgb = image(ImageCPU::PIXEL_FORMAT_RGB8, 1, 1);
    fill<unsigned char>(rgb, {7, 8, 9});
    std::ostringstream expected;
    rgb.doWrite(expected);
    std::ostringstream stream;
    rgb.writeFull(stream);
    EXPECT_EQ(expected.str() + "7 8 9 \n", stream.str());
}

} // namespace
} // namespace ORVO
