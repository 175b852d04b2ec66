#include "orvo/image_flow/filters/bilateral/RowAccess.h"

#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "tests/image_flow/support/BilateralReference.h"
#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <vector>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using namespace ORVO::ImageFlow::bilateral;

/// Pixel (x, y) holds (x, y, x + y, 1).
Picture coordinates(int x, int y, int width, int height) {
    Picture picture(x, y, width, height);
    for (int row = 0; row < height; ++row) {
        for (int column = 0; column < width; ++column) {
            picture.at(column, row) =
                float4(float(x + column), float(y + row), float(x + column + y + row), 1.0F);
        }
    }
    return picture;
}

ImageCPU imageOf(Picture const& picture, int pitch) {
    ImageCPU image(ImageCPU::PIXEL_FORMAT_RGBA32F, picture.rectangle(), PixelExtentInWorldSpace(1.0F, 1.0F),
                   ExtentInPixelSpace(pitch, picture.height));
    for (int row = 0; row < picture.height; ++row) {
        for (int column = 0; column < picture.width; ++column) {
            float* const p = pixelAt(image, picture.x + column, picture.y + row);
            float4 const& v = picture.at(column, row);
            std::copy(v.begin(), v.end(), p);
        }
    }
    return image;
}

void expectRows(RowSource const& source, PositionExtentInPixelSpace const& rectangle,
                Picture const& picture) {
    std::vector<float> buffer(4 * static_cast<std::size_t>(rectangle.extent().width()), -9.0F);
    for (int row = 0; row < rectangle.extent().height(); ++row) {
        float const* const p = source.row(static_cast<std::size_t>(row), buffer.data());
        for (int column = 0; column < rectangle.extent().width(); ++column) {
            int const x = rectangle.position().x() + column - picture.x;
            int const y = rectangle.position().y() + row - picture.y;
            bool const inside = x >= 0 && x < picture.width && y >= 0 && y < picture.height;
            float4 const expected = inside ? picture.at(x, y) : float4(0.0F);
            for (std::size_t c = 0; c < 4; ++c) {
                ASSERT_EQ(expected[c], p[4 * static_cast<std::size_t>(column) + c]) << column << ", " << row;
            }
        }
    }
}

TEST(RowSource, RowsAreCutAndFilledWithTransparentBlack) {
    Picture const picture = coordinates(-2, 3, 7, 5);
    ImageCPU const image = imageOf(picture, 11);
    ImageCPUReadAccessor const imageReader(image);
    PictureReader const pictureReader(picture);
    for (auto const& rectangle :
         {pixels(-2, 3, 7, 5), pixels(-4, 1, 12, 9), pixels(0, 4, 2, 2), pixels(-3, 4, 3, 1),
          pixels(3, 6, 9, 9), pixels(50, 50, 3, 3), pixels(-2, 20, 7, 2)}) {
        expectRows(RowSource(imageReader, rectangle), rectangle, picture);
        expectRows(RowSource(pictureReader, rectangle), rectangle, picture);
    }
}

TEST(RowSource, OnlyTheLibrarysImagesAreReadByThreads) {
    Picture const picture = coordinates(0, 0, 2, 2);
    ImageCPU const image = imageOf(picture, 2);
    EXPECT_TRUE(RowSource(ImageCPUReadAccessor(image), picture.rectangle()).isConcurrent());
    EXPECT_FALSE(RowSource(PictureReader(picture), picture.rectangle()).isConcurrent());
}

TEST(RowSource, RowsOfFloatImagesAreReadInPlace) {
    Picture const picture = coordinates(0, 0, 3, 2);
    ImageCPU const image = imageOf(picture, 4);
    ImageCPUReadAccessor const reader(image);
    float buffer[16];
    EXPECT_EQ(pixelAt(image, 0, 1), RowSource(reader, picture.rectangle()).row(1, buffer));
    EXPECT_EQ(buffer, RowSource(reader, pixels(0, 0, 4, 2)).row(1, buffer));
}

TEST(RowSource, FormatsThatAccessorsDoNotServeAreRefusedWherePixelsAreRead) {
    ImageCPU const image(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, pixels(0, 0, 2, 2),
                         PixelExtentInWorldSpace(1.0F, 1.0F), ExtentInPixelSpace());
    ImageCPUReadAccessor const reader(image);
    ORVO_EXPECT_INTERNAL(RowSource(reader, pixels(0, 0, 2, 2)), "Invalid input image type");
    EXPECT_NO_THROW(RowSource(reader, pixels(10, 0, 2, 2)));
}

TEST(RowTarget, FormatsThatAccessorsDoNotServeAreRefused) {
    ImageCPU image(ImageCPU::PIXEL_FORMAT_RGBA16, pixels(0, 0, 2, 2), PixelExtentInWorldSpace(1.0F, 1.0F),
                   ExtentInPixelSpace());
    ImageCPUWriteAccessor writer(image);
    ORVO_EXPECT_INTERNAL(RowTarget{writer}, "Invalid input image type");
}

TEST(RowTarget, RowsGoIntoTheImageOrThroughTheAccessor) {
    Picture picture(4, -1, 3, 2);
    ImageCPU image = imageOf(picture, 5);
    ImageCPUWriteAccessor imageWriter(image);
    RowTarget const direct(imageWriter);
    float buffer[12] = {};
    EXPECT_TRUE(direct.isConcurrent());
    EXPECT_EQ(pixelAt(image, 4, 0), direct.rowBuffer(1, buffer));

    PictureWriter pictureWriter(picture);
    RowTarget const through(pictureWriter);
    EXPECT_FALSE(through.isConcurrent());
    EXPECT_FALSE(through.prefersStreaming());
    ASSERT_EQ(buffer, through.rowBuffer(1, buffer));
    for (std::size_t i = 0; i < 12; ++i) {
        buffer[i] = float(i);
    }
    through.finishRow(1, buffer);
    EXPECT_EQ(float4(4.0F, 5.0F, 6.0F, 7.0F), picture.at(1, 1));
    EXPECT_EQ(float4(0.0F), picture.at(1, 0));
}

TEST(RowTarget, ByteImagesAreTruncated) {
    ImageCPU image(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 1, 1), PixelExtentInWorldSpace(1.0F, 1.0F),
                   ExtentInPixelSpace());
    ImageCPUWriteAccessor writer(image);
    RowTarget const target(writer);
    float buffer[4];
    float* const pRow = target.rowBuffer(0, buffer);
    ASSERT_EQ(buffer, pRow);
    pRow[0] = 0.999F;
    pRow[1] = 0.5F;
    pRow[2] = 1.0F;
    pRow[3] = 0.0F;
    target.finishRow(0, pRow);
    EXPECT_EQ(254, image.pixels()[0]);
    EXPECT_EQ(127, image.pixels()[1]);
    EXPECT_EQ(255, image.pixels()[2]);
    EXPECT_EQ(0, image.pixels()[3]);
}

} // namespace
