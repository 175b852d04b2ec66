#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"

#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/PixelStructures.h"
#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <vector>

namespace ORVO {
namespace {

using Format = ImageCPU::tePixelFormat;

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height));
}

/// 4 by 3 pixels at (-2, 5), 7 to a row.
ImageCPU image(Format eFormat) {
    ImageCPU made(eFormat, rectangle(-2, 5, 4, 3), PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace(7, 3));
    made.initializeToTransparentBlack();
    return made;
}

void expectPixel(float r, float g, float b, float a, float4 pixel) {
    EXPECT_EQ(r, pixel[0]);
    EXPECT_EQ(g, pixel[1]);
    EXPECT_EQ(b, pixel[2]);
    EXPECT_EQ(a, pixel[3]);
}

TEST(ImageAccessors, AnswerForTheirImage) {
    ImageCPU made = image(ImageCPU::PIXEL_FORMAT_RGBA8);
    ImageCPUReadAccessor const reader(made);
    ImageCPUWriteAccessor const writer(made);
    ImageAccessorBase const* const accessors[] = {&reader, &writer};
    for (ImageAccessorBase const* pAccessor : accessors) {
        EXPECT_EQ(rectangle(-2, 5, 4, 3), pAccessor->positionExtent());
        EXPECT_EQ(PositionInPixelSpace(-2, 5), pAccessor->position());
        EXPECT_EQ(ExtentInPixelSpace(4, 3), pAccessor->extent());
        EXPECT_EQ(7, pAccessor->physicalWidth());
    }
    EXPECT_EQ(&made, &reader.image());
    EXPECT_EQ(&made, &writer.image());
}

TEST(ImageAccessors, HaveTheirOperationsInOrder) {
    // The destructor stands last.
    EXPECT_EQ(0, ORVO::Test::constSlotOf(&ImageAccessorBase::positionExtent));
    EXPECT_EQ(1, ORVO::Test::constSlotOf(&ImageAccessorBase::position));
    EXPECT_EQ(2, ORVO::Test::constSlotOf(&ImageAccessorBase::extent));
    EXPECT_EQ(3, ORVO::Test::constSlotOf(&ImageAccessorBase::physicalWidth));
}

TEST(ImageReadAccessor, ReadsEachFormat) {
    auto const read = [](Format eFormat, auto const&... pixel) {
        ImageCPU made = image(eFormat);
        // The pixel at column 1, row 2.
        unsigned char* const pPixel = made.pixels() + (2 * 7 + 1) * pixelSizeBytes(eFormat);
        std::size_t nOffset = 0;
        ((std::memcpy(pPixel + nOffset, &pixel, sizeof(pixel)), nOffset += sizeof(pixel)), ...);
        EXPECT_EQ(pixelSizeBytes(eFormat), nOffset);
        return ImageCPUReadAccessor(made).getRGBAFloat4PixelAt(-1, 7);
    };
    using Byte = unsigned char;
    float const f51 = 51 / 255.0f;
    float const f100 = 100 / 255.0f;
    float const f254 = 254 / 255.0f;
    expectPixel(f254, f100, f51, 1, read(ImageCPU::PIXEL_FORMAT_BGR8, Byte(51), Byte(100), Byte(254)));
    expectPixel(f254, f100, f51, 0,
                read(ImageCPU::PIXEL_FORMAT_BGRA8, Byte(51), Byte(100), Byte(254), Byte(0)));
    expectPixel(f51, f100, f254, 1, read(ImageCPU::PIXEL_FORMAT_RGB8, Byte(51), Byte(100), Byte(254)));
    expectPixel(f51, f100, f254, 1,
                read(ImageCPU::PIXEL_FORMAT_RGBA8, Byte(51), Byte(100), Byte(254), Byte(255)));
    expectPixel(-3, 0.5f, 1e30f, 1, read(ImageCPU::PIXEL_FORMAT_RGB32F, -3.0f, 0.5f, 1e30f));
    expectPixel(-3, 0.5f, 1e30f, 7, read(ImageCPU::PIXEL_FORMAT_RGBA32F, -3.0f, 0.5f, 1e30f, 7.0f));
    // 0x3c00 is 1, 0xc000 is -2, 0x3555 is 0x555 / 2^12 = 0.333251953125, 0x7bff is 65504.
    using Half = std::uint16_t;
    expectPixel(1, -2, 0.333251953125f, 1,
                read(ImageCPU::PIXEL_FORMAT_RGB16F, Half(0x3c00), Half(0xc000), Half(0x3555)));
    expectPixel(1, -2, 0.333251953125f, 65504,
                read(ImageCPU::PIXEL_FORMAT_RGBA16F, Half(0x3c00), Half(0xc000), Half(0x3555), Half(0x7bff)));
}

TEST(ImageReadAccessor, DividesAll256CodesBy255) {
    for (int code = 0; code < 256; ++code) {
        unsigned char const aPixel[4] = {static_cast<unsigned char>(code), 0, 0, 0};
        ImageCPU const made(ImageCPU::PIXEL_FORMAT_RGBA8, aPixel, rectangle(0, 0, 1, 1),
                            PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
        EXPECT_EQ(static_cast<float>(code / 255.0), ImageCPUReadAccessor(made).getRGBAFloat4PixelAt(0, 0)[0])
            << code;
    }
}

TEST(ImageReadAccessor, ReadsIndexZeroAtThePosition) {
    PositionInPixelSpace const positions[] = {PositionInPixelSpace(0, 0), PositionInPixelSpace(-100, -3),
                                              PositionInPixelSpace(1000000, 7)};
    for (PositionInPixelSpace const& position : positions) {
        float const aPixels[] = {1, 2, 3, 4, 5, 6, 7, 8};
        ImageCPU const made(ImageCPU::PIXEL_FORMAT_RGBA32F, reinterpret_cast<unsigned char const*>(aPixels),
                            PositionExtentInPixelSpace(position, ExtentInPixelSpace(1, 2)),
                            PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
        ImageCPUReadAccessor const reader(made);
        expectPixel(1, 2, 3, 4, reader.getRGBAFloat4PixelAt(position.x(), position.y()));
        expectPixel(5, 6, 7, 8, reader.getRGBAFloat4PixelAt(position.x(), position.y() + 1));
    }
}

TEST(ImageAccessors, ServeTheLastOfAllCoordinates) {
    int const last = std::numeric_limits<int>::max();
    ImageCPU made(ImageCPU::PIXEL_FORMAT_RGBA32F, rectangle(last - 1, last - 1, 2, 2),
                  PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
    made.initializeToTransparentBlack();
    ImageCPUWriteAccessor(made).writeRGBAFloatPixel4At(float4(0.25f, 0.5f, 0.75f, 1.0f), last, last);
    expectPixel(0.25f, 0.5f, 0.75f, 1, ImageCPUReadAccessor(made).getRGBAFloat4PixelAt(last, last));
    expectPixel(0, 0, 0, 0, ImageCPUReadAccessor(made).getRGBAFloat4PixelAt(last - 1, last));
    EXPECT_EQ(0.25f, made.pixels_RGBA32F()[3].r);
}

TEST(ImageAccessors, RefuseOtherFormats) {
    Format const refused[] = {ImageCPU::PIXEL_FORMAT_RGB16,
                              ImageCPU::PIXEL_FORMAT_RGBA16,
                              ImageCPU::PIXEL_FORMAT_LUMINANCE8,
                              ImageCPU::PIXEL_FORMAT_LUMINANCE16,
                              ImageCPU::PIXEL_FORMAT_LUMINANCE32F,
                              ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8,
                              ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16,
                              ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F};
    for (Format const eFormat : refused) {
        SCOPED_TRACE(testing::Message() << eFormat);
        ImageCPU made = image(eFormat);
        ORVO_EXPECT_INTERNAL(ImageCPUReadAccessor(made).getRGBAFloat4PixelAt(-2, 5),
                             "Invalid input image type");
        ORVO_EXPECT_INTERNAL(ImageCPUWriteAccessor(made).writeRGBAFloatPixel4At(float4(0.0f), -2, 5),
                             "Invalid input image type");
    }
    ImageCPU undefined;
    ORVO_EXPECT_INTERNAL(ImageCPUReadAccessor(undefined).getRGBAFloat4PixelAt(0, 0),
                         "Invalid input image type");
    ORVO_EXPECT_INTERNAL(ImageCPUWriteAccessor(undefined).writeRGBAFloatPixel4At(float4(0.0f), 0, 0),
                         "Invalid input image type");
}

/// The bytes of the pixel that is written at column 1, row 2; all others have to stay.
template <class Channel>
std::vector<Channel> written(Format eFormat, float4 pixel) {
    ImageCPU made = image(eFormat);
    std::size_t const nBytes = 7 * 3 * pixelSizeBytes(eFormat);
    std::memset(made.pixels(), 0x5a, nBytes);
    ImageCPUWriteAccessor(made).writeRGBAFloatPixel4At(pixel, -1, 7);
    std::size_t const nBegin = (2 * 7 + 1) * pixelSizeBytes(eFormat);
    for (std::size_t i = 0; i < nBytes; ++i) {
        if (i < nBegin || i >= nBegin + pixelSizeBytes(eFormat)) {
            EXPECT_EQ(0x5a, made.pixels()[i]) << "byte " << i << " of " << eFormat;
        }
    }
    Channel const* const pBegin = reinterpret_cast<Channel const*>(made.pixels() + nBegin);
    return std::vector<Channel>(pBegin, pBegin + pixelSizeBytes(eFormat) / sizeof(Channel));
}

TEST(ImageWriteAccessor, WritesEachFormat) {
    using Bytes = std::vector<unsigned char>;
    using Floats = std::vector<float>;
    using Halves = std::vector<std::uint16_t>;
    float4 const pixel(0.25f, 0.5f, 0.75f, 1.0f);
    // 63.75, 127.5, 191.25 and 255, truncated.
    EXPECT_EQ(Bytes({191, 127, 63}), written<unsigned char>(ImageCPU::PIXEL_FORMAT_BGR8, pixel));
    EXPECT_EQ(Bytes({191, 127, 63, 255}), written<unsigned char>(ImageCPU::PIXEL_FORMAT_BGRA8, pixel));
    EXPECT_EQ(Bytes({63, 127, 191}), written<unsigned char>(ImageCPU::PIXEL_FORMAT_RGB8, pixel));
    EXPECT_EQ(Bytes({63, 127, 191, 255}), written<unsigned char>(ImageCPU::PIXEL_FORMAT_RGBA8, pixel));
    EXPECT_EQ(Floats({0.25f, 0.5f, 0.75f}), written<float>(ImageCPU::PIXEL_FORMAT_RGB32F, pixel));
    EXPECT_EQ(Floats({0.25f, 0.5f, 0.75f, 1.0f}), written<float>(ImageCPU::PIXEL_FORMAT_RGBA32F, pixel));
    EXPECT_EQ(Halves({0x3400, 0x3800, 0x3a00}), written<std::uint16_t>(ImageCPU::PIXEL_FORMAT_RGB16F, pixel));
    EXPECT_EQ(Halves({0x3400, 0x3800, 0x3a00, 0x3c00}),
              written<std::uint16_t>(ImageCPU::PIXEL_FORMAT_RGBA16F, pixel));
}

TEST(ImageWriteAccessor, ClampsToTheUnitInterval) {
    float const infinity = std::numeric_limits<float>::infinity();
    float4 const beyond(1.5f, -0.2f, infinity, -infinity);
    EXPECT_EQ(std::vector<unsigned char>({255, 0, 255, 0}),
              written<unsigned char>(ImageCPU::PIXEL_FORMAT_RGBA8, beyond));
    EXPECT_EQ(std::vector<float>({1, 0, 1, 0}), written<float>(ImageCPU::PIXEL_FORMAT_RGBA32F, beyond));
    EXPECT_EQ(std::vector<float>({1, 0, 1}), written<float>(ImageCPU::PIXEL_FORMAT_RGB32F, beyond));
    EXPECT_EQ(std::vector<std::uint16_t>({0x3c00, 0, 0x3c00, 0}),
              written<std::uint16_t>(ImageCPU::PIXEL_FORMAT_RGBA16F, beyond));
}

TEST(ImageWriteAccessor, LetsNaNStayInFloatsAndMakesItZeroInBytes) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    float4 const pixel(nan, 0.5f, nan, nan);
    EXPECT_EQ(std::vector<unsigned char>({0, 127, 0, 0}),
              written<unsigned char>(ImageCPU::PIXEL_FORMAT_RGBA8, pixel));
    std::vector<float> const floats = written<float>(ImageCPU::PIXEL_FORMAT_RGBA32F, pixel);
    EXPECT_TRUE(std::isnan(floats[0]));
    EXPECT_EQ(0.5f, floats[1]);
    EXPECT_TRUE(std::isnan(floats[3]));
    std::vector<std::uint16_t> const halves = written<std::uint16_t>(ImageCPU::PIXEL_FORMAT_RGBA16F, pixel);
    EXPECT_EQ(0x7e00, halves[0] & 0x7e00);
    EXPECT_EQ(0x3800, halves[1]);
}

TEST(ImageWriteAccessor, TruncatesBytes) {
    struct Row {
        float value;
        unsigned char byte;
    };
    // 0.999 * 255 = 254.745; the float below 1 gives 254.99998; 0.00392 * 255 = 0.9996.
    Row const rows[] = {
        {0.999f, 254}, {0.5f, 127}, {std::nextafter(1.0f, 0.0f), 254}, {0.00392f, 0}, {1.0f, 255}};
    for (Row const& row : rows) {
        EXPECT_EQ(row.byte, written<unsigned char>(ImageCPU::PIXEL_FORMAT_RGBA8, float4(row.value))[0])
            << row.value;
    }
}

TEST(ImageAccessors, GiveAll256CodesBack) {
    for (int code = 0; code < 256; ++code) {
        unsigned char const aSource[3] = {static_cast<unsigned char>(code), 0, 255};
        unsigned char aTarget[3] = {};
        ImageCPU const source(ImageCPU::PIXEL_FORMAT_RGB8, aSource, rectangle(0, 0, 1, 1),
                              PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
        ImageCPU target(ImageCPU::PIXEL_FORMAT_RGB8, aTarget, rectangle(0, 0, 1, 1),
                        PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
        ImageCPUWriteAccessor(target).writeRGBAFloatPixel4At(
            ImageCPUReadAccessor(source).getRGBAFloat4PixelAt(0, 0), 0, 0);
        EXPECT_EQ(code, aTarget[0]);
    }
}

} // namespace
} // namespace ORVO
