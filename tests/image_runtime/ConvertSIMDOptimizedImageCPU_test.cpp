#include "orvo/image_runtime/ConvertSIMDOptimizedImageCPU.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <cstring>
#include <limits>
#include <memory>
#include <thread>
#include <vector>

namespace ORVO::ImageRuntime {
namespace {

using Format = ImageCPU::tePixelFormat;
using Owned = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

PixelExtentInWorldSpace const oUnit(1, 1);

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height));
}

constexpr Format INTEGERS[] = {ImageCPU::PIXEL_FORMAT_BGR8,
                               ImageCPU::PIXEL_FORMAT_BGRA8,
                               ImageCPU::PIXEL_FORMAT_RGB8,
                               ImageCPU::PIXEL_FORMAT_RGBA8,
                               ImageCPU::PIXEL_FORMAT_RGB16,
                               ImageCPU::PIXEL_FORMAT_RGBA16,
                               ImageCPU::PIXEL_FORMAT_LUMINANCE8,
                               ImageCPU::PIXEL_FORMAT_LUMINANCE16,
                               ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8,
                               ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16};

constexpr Format FLOATS[] = {ImageCPU::PIXEL_FORMAT_RGB32F, ImageCPU::PIXEL_FORMAT_RGBA32F,
                             ImageCPU::PIXEL_FORMAT_LUMINANCE32F, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F};

std::size_t storageBytes(ImageCPU const& image) {
    return static_cast<std::size_t>(image.capacityExtent().width()) *
           static_cast<std::size_t>(image.capacityExtent().height()) * pixelSizeBytes(image.pixelFormat());
}

/// Codes that differ from place to place: bytes 0..255, words 0..32768, floats beyond 0..1.
unsigned codeAt(int x, int y, std::size_t channel, std::size_t nBits) {
    auto const code = static_cast<unsigned>((x + 50) * 37 + (y + 50) * 101 + static_cast<int>(channel) * 13);
    return nBits == 8 ? code % 256 : code * 11 % 32769;
}

/// An image whose storage is numbered by codeAt, padding marked.
ImageCPU numbered(Format eFormat, PositionExtentInPixelSpace const& where, ExtentInPixelSpace capacity) {
    ImageCPU image(eFormat, where, oUnit, capacity);
    std::memset(image.pixels(), 0xee, storageBytes(image));
    std::size_t const nPixelChannels = nChannels(eFormat);
    for (int row = 0; row < where.extent().height(); ++row) {
        for (int column = 0; column < where.extent().width(); ++column) {
            for (std::size_t channel = 0; channel < nPixelChannels; ++channel) {
                int const pixel = row * image.capacityExtent().width() + column;
                std::size_t const i = static_cast<std::size_t>(pixel) * nPixelChannels + channel;
                std::size_t const nBits = channelSizeBits(eFormat);
                unsigned const code =
                    codeAt(where.position().x() + column, where.position().y() + row, channel, nBits);
                if (nBits == 8) {
                    image.pixels()[i] = static_cast<unsigned char>(code);
                } else if (nBits == 16) {
                    reinterpret_cast<std::uint16_t*>(image.pixels())[i] = static_cast<std::uint16_t>(code);
                } else {
                    reinterpret_cast<float*>(image.pixels())[i] = static_cast<float>(code) / 16384.0f - 0.5f;
                }
            }
        }
    }
    return image;
}

float floatAt(ImageCPU const& image, int x, int y, std::size_t channel) {
    int const pixel = (y - image.position().y()) * image.capacityExtent().width() + x - image.position().x();
    return reinterpret_cast<float const*>(
        image.pixels())[static_cast<std::size_t>(pixel) * nChannels(image.pixelFormat()) + channel];
}

/// The value of a code, and how far a conversion may be from it: the groups multiply by a rounded reciprocal.
void expectConverted(ImageCPU const& output, Format eFormat, int beginX, int endX, int beginY, int endY) {
    std::size_t const nBits = channelSizeBits(eFormat);
    for (int y = beginY; y < endY; ++y) {
        for (int x = beginX; x < endX; ++x) {
            for (std::size_t channel = 0; channel < nChannels(eFormat); ++channel) {
                unsigned const code = codeAt(x, y, channel, nBits);
                float const actual = floatAt(output, x, y, channel);
                if (nBits == 8) {
                    ASSERT_NEAR(code / 255.0, actual, 1.2e-7) << x << " " << y << " " << channel;
                } else if (nBits == 16) {
                    ASSERT_EQ(static_cast<float>(code / 32768.0), actual) << x << " " << y << " " << channel;
                } else {
                    ASSERT_EQ(static_cast<float>(code) / 16384.0f - 0.5f, actual)
                        << x << " " << y << " " << channel;
                }
            }
        }
    }
}

TEST(ConvertToSIMDOptimized, MakesAnImageOfEachFormat) {
    auto const check = [](Format eFormat) {
        SCOPED_TRACE(testing::Message() << eFormat);
        for (int width : {1, 2, 3, 5, 16, 33}) {
            ImageCPU const input =
                numbered(eFormat, rectangle(-7, 3, width, 4), ExtentInPixelSpace(width + 3, 5));
            Owned const output(convertImageToSIMDOptimized32FFormat(input));
            EXPECT_TRUE(output->isInSIMDOptimizedFormat());
            EXPECT_EQ(nChannels(eFormat), nChannels(output->pixelFormat()));
            EXPECT_EQ(input.positionExtent(), output->positionExtent());
            EXPECT_EQ(input.pixelExtent(), output->pixelExtent());
            expectConverted(*output, eFormat, -7, -7 + width, 3, 7);
        }
    };
    for (Format const eFormat : INTEGERS) {
        check(eFormat);
    }
    for (Format const eFormat : FLOATS) {
        check(eFormat);
    }
}

TEST(ConvertToSIMDOptimized, TouchesItsRectangleAlone) {
    for (Format const eFormat : INTEGERS) {
        SCOPED_TRACE(testing::Message() << eFormat);
        ImageCPU const input = numbered(eFormat, rectangle(-2, -1, 19, 6), ExtentInPixelSpace(23, 6));
        // The images overlap in columns -2 .. 16 and rows 1 .. 4.
        Owned const output(getBlankSIMDOptimized32FFormat(eFormat, ExtentInPixelSpace(30, 8), oUnit,
                                                          PositionInPixelSpace(-5, 1)));
        std::memset(output->pixels(), 0, storageBytes(*output));
        std::vector<float> before(storageBytes(*output) / sizeof(float), -9.0f);
        std::memcpy(output->pixels(), before.data(), storageBytes(*output));

        convertImageToSIMDOptimized32FFormat(input, output.get(), 1, 12, 2, 4);
        expectConverted(*output, eFormat, 1, 12, 2, 4);
        for (int y = 1; y < 9; ++y) {
            for (int x = -5; x < 25; ++x) {
                bool const bInside = x >= 1 && x < 12 && y >= 2 && y < 4;
                ASSERT_TRUE(bInside || floatAt(*output, x, y, 0) == -9.0f) << x << " " << y;
            }
        }
    }
}

TEST(ConvertToSIMDOptimized, PassesTheChannelOrderThrough) {
    unsigned char const aPixels[] = {0, 51, 255};
    ImageCPU const bgr(ImageCPU::PIXEL_FORMAT_BGR8, aPixels, rectangle(0, 0, 1, 1), oUnit,
                       ExtentInPixelSpace());
    Owned const output(convertImageToSIMDOptimized32FFormat(bgr));
    EXPECT_EQ(0.0f, floatAt(*output, 0, 0, 0));
    EXPECT_EQ(0.2f, floatAt(*output, 0, 0, 1));
    EXPECT_EQ(1.0f, floatAt(*output, 0, 0, 2));
}

TEST(ConvertToSIMDOptimized, IsExactAtBlackAndWhiteOf16Bits) {
    std::uint16_t const aPixels[] = {0, 32768, 16384, 65535, 0, 32768, 16384, 1};
    ImageCPU const words(ImageCPU::PIXEL_FORMAT_LUMINANCE16, reinterpret_cast<unsigned char const*>(aPixels),
                         rectangle(0, 0, 8, 1), oUnit, ExtentInPixelSpace());
    Owned const output(convertImageToSIMDOptimized32FFormat(words));
    float const expected[] = {0.0f, 1.0f, 0.5f, 1.999969482421875f, 0.0f, 1.0f, 0.5f, 3.0517578125e-05f};
    for (int x = 0; x < 8; ++x) {
        EXPECT_EQ(expected[x], floatAt(*output, x, 0, 0)) << x;
    }
}

using Conversion = void (*)(ImageCPU const&, ImageCPU*, int, int, int, int);

struct Direction {
    char const* sName;
    Conversion convert;
    Format eInput, eOutput;
};

class Conversions : public testing::TestWithParam<Direction> {
protected:
    ImageCPU input(PositionExtentInPixelSpace const& where) const {
        ImageCPU image(GetParam().eInput, where, oUnit, ExtentInPixelSpace());
        image.initializeToTransparentBlack();
        return image;
    }
    ImageCPU output(PositionExtentInPixelSpace const& where) const {
        ImageCPU image(GetParam().eOutput, where, oUnit, ExtentInPixelSpace(32, where.extent().height()));
        image.initializeToTransparentBlack();
        return image;
    }
};

TEST_P(Conversions, CheckTheRectangleInOrder) {
    struct Row {
        PositionExtentInPixelSpace oInput, oOutput;
        int beginX, endX, beginY, endY;
        char const* sText;
    };
    auto const small = rectangle(2, 3, 8, 8);
    auto const large = rectangle(0, 0, 16, 16);
    Row const rows[] = {
        {small, large, 1, 10, 3, 11, "beginX >= inputImage.position().x()"},
        {small, large, 2, 11, 3, 11,
         "endX <= int( inputImage.position().x() + inputImage.extent().width() )"},
        {large, small, 1, 10, 3, 11, "beginX >= pOutputImage->position().x()"},
        {large, small, 2, 11, 3, 11,
         "endX <= int( pOutputImage->position().x() + pOutputImage->extent().width() )"},
        {small, large, 2, 10, 2, 11, "beginY >= inputImage.position().y()"},
        {small, large, 2, 10, 3, 12,
         "endY <= int( inputImage.position().y() + inputImage.extent().height() )"},
        {large, small, 2, 10, 2, 11, "beginY >= pOutputImage->position().y()"},
        {large, small, 2, 10, 3, 12,
         "endY <= int( pOutputImage->position().y() + pOutputImage->extent().height() )"},
        // The first of several; the columns come before the rows.
        {small, small, 1, 11, 2, 12, "beginX >= inputImage.position().x()"},
        {small, small, 2, 11, 2, 12,
         "endX <= int( inputImage.position().x() + inputImage.extent().width() )"},
        {small, small, 2, 10, 2, 12, "beginY >= inputImage.position().y()"},
        // Empty ranges are checked too.
        {small, large, 2, 10, 2, 2, "beginY >= inputImage.position().y()"},
        {small, large, 1, 1, 3, 11, "beginX >= inputImage.position().x()"},
        {small, large, INT_MIN, INT_MAX, 3, 11, "beginX >= inputImage.position().x()"},
        {small, large, 2, INT_MAX, 3, 11,
         "endX <= int( inputImage.position().x() + inputImage.extent().width() )"},
    };
    for (Row const& row : rows) {
        SCOPED_TRACE(testing::Message()
                     << row.beginX << " " << row.endX << " " << row.beginY << " " << row.endY);
        ImageCPU const from = input(row.oInput);
        ImageCPU to = output(row.oOutput);
        ORVO_EXPECT_INTERNAL(GetParam().convert(from, &to, row.beginX, row.endX, row.beginY, row.endY),
                             row.sText);
    }
    ImageCPU const from = input(small);
    ImageCPU to = output(large);
    EXPECT_NO_THROW(GetParam().convert(from, &to, 2, 10, 3, 11));
    EXPECT_NO_THROW(GetParam().convert(from, &to, 2, 10, 5, 5));
    EXPECT_NO_THROW(GetParam().convert(from, &to, 4, 4, 3, 11));
    EXPECT_NO_THROW(GetParam().convert(from, &to, 6, 4, 5, 3));
}

TEST_P(Conversions, RefuseToHaveNoOutput) {
    ImageCPU const from = input(rectangle(0, 0, 4, 4));
    ORVO_EXPECT_INTERNAL(GetParam().convert(from, nullptr, 0, 4, 0, 4), "Enforce pOutputImage != NULL");
}

TEST(ConvertSIMDOptimized, RefusesToHaveNoOutputForAWholeImage) {
    ImageCPU const from(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(0, 0, 4, 4), oUnit, ExtentInPixelSpace());
    ImageCPU* const pNone = nullptr;
    ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(from, pNone), "Enforce pOutputImage != NULL");
    ORVO_EXPECT_INTERNAL(convertImageFromSIMDOptimized32FFormat(from, pNone), "Enforce pOutputImage != NULL");
}

TEST(ConvertSIMDOptimized, AsksForTheChannelBitsFirstOfAllPropertiesOfTheFormats) {
    ImageCPU undefined;
    ImageCPU floats(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(0, 0, 0, 0), oUnit, ExtentInPixelSpace());
    char const* const sText = "Not implemented: ePixelFormat in channelSizeBits().";
    ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(undefined, &floats), sText);
    ORVO_EXPECT_INTERNAL(convertImageFromSIMDOptimized32FFormat(floats, &undefined), sText);
}

TEST_P(Conversions, RefuseImagesOfDifferentChannels) {
    ImageCPU const from = input(rectangle(0, 0, 4, 4));
    for (Format const eFormat : FLOATS) {
        ImageCPU to(eFormat, rectangle(0, 0, 4, 4), oUnit, ExtentInPixelSpace());
        if (nChannels(eFormat) != nChannels(from.pixelFormat())) {
            ORVO_EXPECT_INTERNAL(
                GetParam().convert(from, &to, 0, 4, 0, 4),
                "nChannels( inputImage.pixelFormat() ) == nChannels( pOutputImage->pixelFormat() )");
        }
    }
}

TEST_P(Conversions, RefuseStorageThatDoesNotHoldTheRectangle) {
    ImageCPU const from = input(rectangle(0, 0, 8, 8));
    ImageCPU const narrow(GetParam().eInput, rectangle(0, 0, 8, 8), oUnit, ExtentInPixelSpace(7, 8));
    ImageCPU const low(GetParam().eInput, rectangle(0, 0, 8, 8), oUnit, ExtentInPixelSpace(8, 7));
    ImageCPU const absent(GetParam().eInput, nullptr, rectangle(0, 0, 8, 8), oUnit, ExtentInPixelSpace());
    ImageCPU to = output(rectangle(0, 0, 8, 8));
    ImageCPU lowTo(GetParam().eOutput, rectangle(0, 0, 8, 8), oUnit, ExtentInPixelSpace(8, 7));
    char const* const sInput = "The rectangle lies inside the storage of inputImage";
    ORVO_EXPECT_INTERNAL(GetParam().convert(narrow, &to, 0, 8, 0, 8), sInput);
    ORVO_EXPECT_INTERNAL(GetParam().convert(low, &to, 0, 8, 0, 8), sInput);
    ORVO_EXPECT_INTERNAL(GetParam().convert(absent, &to, 0, 8, 0, 8), sInput);
    ORVO_EXPECT_INTERNAL(GetParam().convert(from, &lowTo, 0, 8, 0, 8),
                         "The rectangle lies inside the storage of pOutputImage");
    EXPECT_NO_THROW(GetParam().convert(narrow, &to, 0, 7, 0, 8));
}

INSTANTIATE_TEST_SUITE_P(
    Directions, Conversions,
    testing::Values(Direction{"To", &convertImageToSIMDOptimized32FFormat, ImageCPU::PIXEL_FORMAT_LUMINANCE8,
                              ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
                    Direction{"From", &convertImageFromSIMDOptimized32FFormat,
                              ImageCPU::PIXEL_FORMAT_LUMINANCE32F, ImageCPU::PIXEL_FORMAT_LUMINANCE8}),
    [](testing::TestParamInfo<Direction> const& parameters) { return parameters.param.sName; });

TEST(ConvertToSIMDOptimized, ChecksTheOutputBehindTheRectangle) {
    ImageCPU const input =
        numbered(ImageCPU::PIXEL_FORMAT_RGBA8, rectangle(0, 0, 5, 2), ExtentInPixelSpace());
    char const* const sCapacity =
        "int( pOutputImage->capacityExtent().width() ) >= incrementToBoundary( int( "
        "pOutputImage->extent().width() ), 4 )";
    ImageCPU tight(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(0, 0, 5, 2), oUnit, ExtentInPixelSpace(7, 2));
    ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(input, &tight), sCapacity);
    // The rectangle is checked first, and an empty one does not save the output.
    ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(input, &tight, -1, 5, 0, 2),
                         "beginX >= inputImage.position().x()");
    ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(input, &tight, 0, 5, 1, 1), sCapacity);

    ImageCPU enough(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(0, 0, 5, 2), oUnit, ExtentInPixelSpace(8, 2));
    EXPECT_NO_THROW(convertImageToSIMDOptimized32FFormat(input, &enough));

    alignas(64) float aPixels[8 * 2 * 4 + 4] = {};
    ImageCPU shifted(ImageCPU::PIXEL_FORMAT_RGBA32F, reinterpret_cast<unsigned char*>(aPixels + 1),
                     rectangle(0, 0, 5, 2), oUnit, ExtentInPixelSpace(8, 2));
    ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(input, &shifted),
                         "isAligned( pOutputImage->pixels(), 16 )");

    ImageCPU bytes(ImageCPU::PIXEL_FORMAT_RGBA8, rectangle(0, 0, 5, 2), oUnit, ExtentInPixelSpace(8, 2));
    ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(input, &bytes),
                         "channelSizeBits( pOutputImage->pixelFormat() ) == 32");
}

TEST(ConvertToSIMDOptimized, RefusesInputsWithoutChannels) {
    Format const halves[] = {ImageCPU::PIXEL_FORMAT_RGB16F, ImageCPU::PIXEL_FORMAT_RGBA16F};
    for (Format const eFormat : halves) {
        ImageCPU const input(eFormat, rectangle(0, 0, 4, 4), oUnit, ExtentInPixelSpace());
        ImageCPU output(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(0, 0, 4, 4), oUnit, ExtentInPixelSpace());
        ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(input),
                             "Pixel format not supported by ORVO in CPU mode");
        ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(input, &output),
                             "Pixel format not supported by ORVO in CPU mode");
    }
    ORVO_EXPECT_INTERNAL(convertImageToSIMDOptimized32FFormat(ImageCPU()),
                         "Pixel format not supported by ORVO in CPU mode");
}

TEST(ConvertToSIMDOptimized, RefusesAnImageWhoseEndHasNoCoordinates) {
    ImageCPU image(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(INT_MAX - 3, 0, 8, 2), oUnit,
                   ExtentInPixelSpace());
    ORVO_EXPECT_PARAMETER(convertImageToSIMDOptimized32FFormat(image),
                          "Image lies beyond the range of pixel coordinates");
    ORVO_EXPECT_PARAMETER(convertImageFromSIMDOptimized32FFormat(image, ImageCPU::PIXEL_FORMAT_RGBA8),
                          "Image lies beyond the range of pixel coordinates");
}

TEST(ConvertToSIMDOptimized, LeavesNothingBehindIfAnAllocationFails) {
    ImageCPU const input =
        numbered(ImageCPU::PIXEL_FORMAT_RGBA8, rectangle(0, 0, 5, 2), ExtentInPixelSpace());
    ImageCPU const floats =
        numbered(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(0, 0, 5, 2), ExtentInPixelSpace());
    std::size_t const nObjects = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    std::size_t const nStorage = Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    for (std::uint64_t n = 1; n <= 2; ++n) {
        Core::AllocationFailure const failure(n);
        EXPECT_THROW(convertImageToSIMDOptimized32FFormat(input), std::bad_alloc);
    }
    for (std::uint64_t n = 1; n <= 2; ++n) {
        Core::AllocationFailure const failure(n);
        EXPECT_THROW(convertImageFromSIMDOptimized32FFormat(floats, ImageCPU::PIXEL_FORMAT_RGBA8),
                     std::bad_alloc);
    }
    EXPECT_EQ(nObjects, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
    EXPECT_EQ(nStorage, Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

TEST(ConvertFromSIMDOptimized, GivesEachFormatBack) {
    for (Format const eFormat : INTEGERS) {
        SCOPED_TRACE(testing::Message() << eFormat);
        for (int width : {1, 4, 33}) {
            ImageCPU const input =
                numbered(eFormat, rectangle(-7, 3, width, 4), ExtentInPixelSpace(width + 3, 5));
            Owned const floats(convertImageToSIMDOptimized32FFormat(input));
            Owned const back(convertImageFromSIMDOptimized32FFormat(*floats, eFormat));
            EXPECT_EQ(eFormat, back->pixelFormat());
            EXPECT_EQ(floats->positionExtent(), back->positionExtent());
            EXPECT_EQ(floats->pixelExtent(), back->pixelExtent());
            EXPECT_EQ(floats->capacityExtent(), back->capacityExtent());
            std::size_t const nRowBytes = static_cast<std::size_t>(width) * pixelSizeBytes(eFormat);
            for (std::size_t y = 0; y < 4; ++y) {
                auto const rowOf = [y, eFormat](ImageCPU const& image) {
                    return image.pixels() + y * static_cast<std::size_t>(image.capacityExtent().width()) *
                                                pixelSizeBytes(eFormat);
                };
                ASSERT_EQ(0, std::memcmp(rowOf(input), rowOf(*back), nRowBytes)) << "row " << y;
            }
        }
    }
}

TEST(ConvertFromSIMDOptimized, CopiesFloats) {
    for (Format const eFormat : FLOATS) {
        ImageCPU const input = numbered(eFormat, rectangle(5, -9, 13, 3), ExtentInPixelSpace(20, 3));
        Owned const output(convertImageFromSIMDOptimized32FFormat(input, eFormat));
        expectConverted(*output, eFormat, 5, 18, -9, -6);
    }
}

TEST(ConvertFromSIMDOptimized, SaturatesWhatLiesOutsideTheScale) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    float const infinity = std::numeric_limits<float>::infinity();
    alignas(64) float aPixels[16] = {1.5f, -0.5f, nan,  infinity, -infinity, 0.5f,  1.0f,   2.0f,
                                     0.0f, 0.1f,  0.2f, 0.3f,     0.4f,      1e30f, -1e30f, 0.75f};
    ImageCPU const floats(ImageCPU::PIXEL_FORMAT_RGBA32F, reinterpret_cast<unsigned char*>(aPixels),
                          rectangle(0, 0, 4, 1), oUnit, ExtentInPixelSpace());
    Owned const bytes(convertImageFromSIMDOptimized32FFormat(floats, ImageCPU::PIXEL_FORMAT_RGBA8));
    // As float products: 127.5 goes to the even 128, 25.5 to the even 26, 76.5 to the even 76, 191.25 to 191.
    unsigned char const expectedBytes[] = {255, 0, 0, 255, 0, 128, 255, 255, 0, 26, 51, 76, 102, 255, 0, 191};
    for (int i = 0; i < 16; ++i) {
        EXPECT_EQ(expectedBytes[i], bytes->pixels()[i]) << i;
    }
    Owned const words(convertImageFromSIMDOptimized32FFormat(floats, ImageCPU::PIXEL_FORMAT_RGBA16));
    // 3276.8, 6553.6, 9830.4 and 13107.2.
    unsigned const expectedWords[] = {32768, 0,    0,    32768, 0,     16384, 32768, 32768,
                                      0,     3277, 6554, 9830,  13107, 32768, 0,     24576};
    for (int i = 0; i < 16; ++i) {
        EXPECT_EQ(expectedWords[i], reinterpret_cast<std::uint16_t const*>(words->pixels())[i]) << i;
    }
}

TEST(ConvertFromSIMDOptimized, TruncatesAndWrapsBesideTheGroups) {
    // Two luminance rows that begin one float past a boundary: a head of three, a group, a tail of one.
    alignas(64) float aPixels[9] = {0, 1.5f, 0.5f, 0.999f, 1.5f, 0.5f, 0.999f, 0.25f, 0.5f};
    ImageCPU const floats(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, reinterpret_cast<unsigned char*>(aPixels + 1),
                          rectangle(0, 0, 8, 1), oUnit, ExtentInPixelSpace());
    Owned const bytes(convertImageFromSIMDOptimized32FFormat(floats, ImageCPU::PIXEL_FORMAT_LUMINANCE8));
    // 382 mod 256, 127.5 and 254.745 truncated; saturated, to even, to nearest, 63.75 to nearest; 127.5
    // truncated.
    unsigned char const expected[] = {126, 127, 254, 255, 128, 255, 64, 127};
    for (int i = 0; i < 8; ++i) {
        EXPECT_EQ(expected[i], bytes->pixels()[i]) << i;
    }
}

TEST(ConvertSIMDOptimized, TakesMemoryOfTheCallerAtAnyAddress) {
    std::uint16_t const words[] = {0, 32768, 16384, 8192, 1, 24576, 4096};
    unsigned char aInput[sizeof(words) + 1] = {};
    std::memcpy(aInput + 1, words, sizeof(words));
    ImageCPU const odd(ImageCPU::PIXEL_FORMAT_LUMINANCE16, aInput + 1, rectangle(0, 0, 7, 1), oUnit,
                       ExtentInPixelSpace());
    Owned const floats(convertImageToSIMDOptimized32FFormat(odd));
    EXPECT_EQ(0.25f, floatAt(*floats, 3, 0, 0));

    unsigned char aOutput[sizeof(words) + 1] = {};
    ImageCPU back(ImageCPU::PIXEL_FORMAT_LUMINANCE16, aOutput + 1, rectangle(0, 0, 7, 1), oUnit,
                  ExtentInPixelSpace());
    convertImageFromSIMDOptimized32FFormat(*floats, &back);
    EXPECT_EQ(0, std::memcmp(words, aOutput + 1, sizeof(words)));
}

TEST(ConvertFromSIMDOptimized, RefusesInputsThatAreNoFloats) {
    ImageCPU const bytes(ImageCPU::PIXEL_FORMAT_RGBA8, rectangle(0, 0, 4, 4), oUnit, ExtentInPixelSpace());
    ORVO_EXPECT_INTERNAL(convertImageFromSIMDOptimized32FFormat(bytes, ImageCPU::PIXEL_FORMAT_RGBA8),
                         "channelSizeBits( inputImage.pixelFormat() ) == 32");
    ImageCPU const halves(ImageCPU::PIXEL_FORMAT_RGBA16F, rectangle(0, 0, 4, 4), oUnit, ExtentInPixelSpace());
    ORVO_EXPECT_INTERNAL(convertImageFromSIMDOptimized32FFormat(halves, ImageCPU::PIXEL_FORMAT_RGBA8),
                         "channelSizeBits( inputImage.pixelFormat() ) == 32");
}

TEST(ConvertFromSIMDOptimized, RefusesFormatsThatItCanNotMake) {
    ImageCPU const floats(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(0, 0, 4, 4), oUnit, ExtentInPixelSpace());
    ORVO_EXPECT_INTERNAL(convertImageFromSIMDOptimized32FFormat(floats, ImageCPU::PIXEL_FORMAT_UNDEFINED),
                         "!\"PIXEL_FORMAT_UNDEFINED\"");
    ORVO_EXPECT_INTERNAL(convertImageFromSIMDOptimized32FFormat(floats, ImageCPU::PIXEL_FORMAT_LUMINANCE16F),
                         "Not implemented: ePixelFormat in pixelSizeBytes().");
    ORVO_EXPECT_INTERNAL(convertImageFromSIMDOptimized32FFormat(floats, ImageCPU::PIXEL_FORMAT_RGBA16F),
                         "Pixel format not supported by ORVO in CPU mode");
    ORVO_EXPECT_INTERNAL(convertImageFromSIMDOptimized32FFormat(floats, ImageCPU::PIXEL_FORMAT_RGB8),
                         "nChannels( inputImage.pixelFormat() ) == nChannels( pOutputImage->pixelFormat() )");
}

TEST(ConvertSIMDOptimized, MayRunOnDisjointRowsAtOnce) {
    ImageCPU const input =
        numbered(ImageCPU::PIXEL_FORMAT_RGBA16, rectangle(0, 0, 61, 64), ExtentInPixelSpace(64, 64));
    Owned const floats(getBlankSIMDOptimized32FFormat(input));
    ImageCPU back(ImageCPU::PIXEL_FORMAT_RGBA16, rectangle(0, 0, 61, 64), oUnit, ExtentInPixelSpace(64, 64));
    auto const convertRows = [&](int beginY, int endY) {
        convertImageToSIMDOptimized32FFormat(input, floats.get(), 0, 61, beginY, endY);
        convertImageFromSIMDOptimized32FFormat(*floats, &back, 0, 61, beginY, endY);
    };
    std::vector<std::thread> threads;
    threads.reserve(4);
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back(convertRows, 16 * i, 16 * i + 16);
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    for (std::size_t y = 0; y < 64; ++y) {
        ASSERT_EQ(0, std::memcmp(input.pixels() + y * 64 * 8, back.pixels() + y * 64 * 8, 61 * 8));
    }
}

} // namespace
} // namespace ORVO::ImageRuntime
