#include "orvo/image_runtime/kernels/Rows.h"

#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "orvo/image_runtime/kernels/InstructionSet.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <limits>
#include <random>
#include <utility>
#include <vector>

namespace ORVO::ImageRuntime {
namespace {

using Format = ImageCPU::tePixelFormat;

constexpr Format SERVED[] = {ImageCPU::PIXEL_FORMAT_BGR8,   ImageCPU::PIXEL_FORMAT_BGRA8,
                             ImageCPU::PIXEL_FORMAT_RGB8,   ImageCPU::PIXEL_FORMAT_RGBA8,
                             ImageCPU::PIXEL_FORMAT_RGB32F, ImageCPU::PIXEL_FORMAT_RGBA32F,
                             ImageCPU::PIXEL_FORMAT_RGB16F, ImageCPU::PIXEL_FORMAT_RGBA16F};

/// The same bits, so that a NaN equals itself.
bool sameBits(float const* pLeft, float const* pRight, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        std::uint32_t left;
        std::uint32_t right;
        std::memcpy(&left, pLeft + i, sizeof(left));
        std::memcpy(&right, pRight + i, sizeof(right));
        if (left != right) {
            return false;
        }
    }
    return true;
}

/// Sets the instructions for a scope.
class UseInstructionSet {
public:
    explicit UseInstructionSet(InstructionSet eSet) : eBefore_(activeInstructionSet()) {
        setActiveInstructionSet(eSet);
    }
    ~UseInstructionSet() { setActiveInstructionSet(eBefore_); }
    UseInstructionSet(UseInstructionSet const&) = delete;
    UseInstructionSet& operator=(UseInstructionSet const&) = delete;

private:
    InstructionSet eBefore_;
};

/// 300 by 3 pixels at (-10, 20), with two columns of padding and bits at random.
ImageCPU randomImage(Format eFormat) {
    ImageCPU image(eFormat,
                   PositionExtentInPixelSpace(PositionInPixelSpace(-10, 20), ExtentInPixelSpace(300, 3)),
                   PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace(302, 3));
    std::mt19937 generator(static_cast<unsigned>(eFormat));
    for (std::size_t i = 0; i < 302 * 3 * pixelSizeBytes(eFormat); ++i) {
        image.pixels()[i] = static_cast<unsigned char>(generator());
    }
    return image;
}

/// Callers' own accessors: the library's, hidden in a class of another type that counts.
class CountingReader : public ImageCPUReadAccessor {
public:
    using ImageCPUReadAccessor::ImageCPUReadAccessor;
    float4 getRGBAFloat4PixelAt(int x, int y) const override {
        aAsked_.emplace_back(x, y);
        return ImageCPUReadAccessor::getRGBAFloat4PixelAt(x, y);
    }
    mutable std::vector<std::pair<int, int>> aAsked_;
};

class CountingWriter : public ImageCPUWriteAccessor {
public:
    using ImageCPUWriteAccessor::ImageCPUWriteAccessor;
    void writeRGBAFloatPixel4At(float4 pixel, int x, int y) override {
        aAsked_.emplace_back(x, y);
        ImageCPUWriteAccessor::writeRGBAFloatPixel4At(pixel, x, y);
    }
    std::vector<std::pair<int, int>> aAsked_;
};

std::vector<InstructionSet> supportedSets() {
    std::vector<InstructionSet> sets;
    for (int i = 0; i <= static_cast<int>(bestInstructionSet()); ++i) {
        sets.push_back(static_cast<InstructionSet>(i));
    }
    return sets;
}

class RowsOf : public testing::TestWithParam<InstructionSet> {};

TEST_P(RowsOf, AreReadAsTheAccessorReadsPixels) {
    UseInstructionSet const use(GetParam());
    for (Format const eFormat : SERVED) {
        SCOPED_TRACE(testing::Message() << eFormat);
        ImageCPU const image = randomImage(eFormat);
        ImageCPUReadAccessor const reader(image);
        for (auto const& [beginX, endX] : {std::pair(-10, 290), std::pair(-10, -9), std::pair(-9, -4),
                                           std::pair(3, 131), std::pair(3, 132), std::pair(100, 100)}) {
            std::size_t const n = 4 * static_cast<std::size_t>(endX - beginX);
            // One float past a boundary, and a mark behind the row.
            std::vector<float> row(n + 2, 42.0f);
            readRowAsRGBAFloat(reader, 21, beginX, endX, row.data() + 1);
            EXPECT_EQ(42.0f, row[0]);
            EXPECT_EQ(42.0f, row[n + 1]);
            for (int x = beginX; x < endX; ++x) {
                float4 pixel = reader.getRGBAFloat4PixelAt(x, 21);
                float const aPixel[] = {pixel[0], pixel[1], pixel[2], pixel[3]};
                ASSERT_TRUE(sameBits(aPixel, row.data() + 1 + 4 * (x - beginX), 4)) << x;
            }
        }
    }
}

TEST_P(RowsOf, AreWrittenAsTheAccessorWritesPixels) {
    UseInstructionSet const use(GetParam());
    std::mt19937 generator(3);
    std::uniform_real_distribution<float> distribution(-0.5f, 1.5f);
    std::vector<float> row(4 * 300);
    for (float& value : row) {
        value = distribution(generator);
    }
    row[5] = std::numeric_limits<float>::quiet_NaN();
    row[6] = std::numeric_limits<float>::infinity();
    for (Format const eFormat : SERVED) {
        SCOPED_TRACE(testing::Message() << eFormat);
        for (auto const& [beginX, endX] : {std::pair(-10, 290), std::pair(-10, -9), std::pair(-9, -4),
                                           std::pair(3, 131), std::pair(3, 132), std::pair(100, 100)}) {
            ImageCPU expected = randomImage(eFormat);
            ImageCPU actual = randomImage(eFormat);
            ImageCPUWriteAccessor byPixel(expected);
            for (int x = beginX; x < endX; ++x) {
                float const* const pPixel = row.data() + 4 * (x - beginX);
                byPixel.writeRGBAFloatPixel4At(float4(pPixel[0], pPixel[1], pPixel[2], pPixel[3]), x, 21);
            }
            ImageCPUWriteAccessor byRow(actual);
            writeRowFromRGBAFloat(byRow, 21, beginX, endX, row.data());
            // The whole storage: nothing beside the row changes.
            ASSERT_EQ(0, std::memcmp(expected.pixels(), actual.pixels(), 302 * 3 * pixelSizeBytes(eFormat)));
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Sets, RowsOf, testing::ValuesIn(supportedSets()));

TEST(Rows, AreReadFromAnImageDirectly) {
    unsigned char const aPixels[] = {0, 51, 102, 255, 153, 204};
    ImageCPU const image(ImageCPU::PIXEL_FORMAT_BGR8, aPixels,
                         PositionExtentInPixelSpace(ExtentInPixelSpace(2, 1)), PixelExtentInWorldSpace(1, 1),
                         ExtentInPixelSpace());
    float aRow[8];
    readRowAsRGBAFloat(image, 0, 0, 2, aRow);
    float const expected[] = {0.4f, 0.2f, 0.0f, 1.0f, 0.8f, 0.6f, 1.0f, 1.0f};
    for (int i = 0; i < 8; ++i) {
        EXPECT_EQ(expected[i], aRow[i]) << i;
    }
}

TEST(Rows, OfOtherAccessorsAreAskedPixelByPixel) {
    ImageCPU const image = randomImage(ImageCPU::PIXEL_FORMAT_RGBA8);
    CountingReader const reader(image);
    EXPECT_EQ(nullptr, imageBehind(reader));
    float aOwn[12];
    float aLibrary[12];
    readRowAsRGBAFloat(reader, 22, -10, -7, aOwn);
    readRowAsRGBAFloat(image, 22, -10, -7, aLibrary);
    EXPECT_EQ((std::vector<std::pair<int, int>>{{-10, 22}, {-9, 22}, {-8, 22}}), reader.aAsked_);
    EXPECT_TRUE(sameBits(aOwn, aLibrary, 12));

    ImageCPU target = randomImage(ImageCPU::PIXEL_FORMAT_RGBA32F);
    CountingWriter writer(target);
    EXPECT_EQ(nullptr, imageBehind(writer));
    writeRowFromRGBAFloat(writer, 22, 5, 8, aOwn);
    EXPECT_EQ((std::vector<std::pair<int, int>>{{5, 22}, {6, 22}, {7, 22}}), writer.aAsked_);
    readRowAsRGBAFloat(target, 22, 5, 8, aLibrary);
    EXPECT_TRUE(sameBits(aOwn, aLibrary, 12));
}

TEST(Rows, RecogniseTheAccessorsOfTheLibrary) {
    ImageCPU image = randomImage(ImageCPU::PIXEL_FORMAT_RGBA8);
    ImageCPUWriteAccessor writer(image);
    EXPECT_EQ(&image, imageBehind(ImageCPUReadAccessor(image)));
    EXPECT_EQ(&image, imageBehind(writer));
}

TEST(Rows, RefuseFormatsThatAccessorsDoNotServe) {
    float aRow[4] = {};
    for (int value : {5, 6, 9, 10, 11, 12, 13, 14}) {
        ImageCPU image(static_cast<Format>(value), PositionExtentInPixelSpace(ExtentInPixelSpace(1, 1)),
                       PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
        ORVO_EXPECT_INTERNAL(readRowAsRGBAFloat(image, 0, 0, 1, aRow), "Invalid input image type");
        ORVO_EXPECT_INTERNAL(writeRowFromRGBAFloat(image, 0, 0, 1, aRow), "Invalid input image type");
    }
}

TEST(Rows, OfAnEmptyRangeAreLeftAlone) {
    ImageCPU image = randomImage(ImageCPU::PIXEL_FORMAT_RGBA8);
    EXPECT_NO_THROW(readRowAsRGBAFloat(image, 20, 5, 5, nullptr));
    EXPECT_NO_THROW(readRowAsRGBAFloat(image, 20, 5, -5, nullptr));
    EXPECT_NO_THROW(writeRowFromRGBAFloat(image, 20, 5, 5, nullptr));
    EXPECT_NO_THROW(writeRowFromRGBAFloat(image, 20, 5, -5, nullptr));
}

} // namespace
} // namespace ORVO::ImageRuntime
