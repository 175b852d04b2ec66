#include "orvo/image_flow/filters/lab/LabRows.h"

#include "tests/image_flow/support/FastBilateralTesting.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using ImageFlow::lab::convertRows;

/// Halves the first channel, so that every pixel shows where it came from.
void halveFirst(float* pOutput, float const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < 4 * n; ++i) {
        pOutput[i] = i % 4 == 0 ? 0.5F * pInput[i] : pInput[i];
    }
}

TEST(LabRows, RowsOfTheRegionAreConvertedAndNoOthers) {
    Picture source(2, 3, 4, 5);
    for (int i = 0; i < 20; ++i) {
        float const v = float(i) / 32.0F;
        source.pixels[std::size_t(i)] = float4(v, 0.25F, 0.5F, 1.0F);
    }
    FilterImage input(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 7);
    Picture const before(0, 0, 8, 9, float4(0.75F));
    FilterImage output(ImageCPU::PIXEL_FORMAT_RGBA32F, before, 10);
    // The region begins one column left of the input and ends one before its last: rows 4 and 5 of 3 .. 7.
    PositionExtentInPixelSpace const region(PositionInPixelSpace(1, 3), ExtentInPixelSpace(4, 5));
    convertRows(halveFirst, input.image(), output.image(), region, 1, 3);
    Picture expected = before;
    for (int y = 4; y < 6; ++y) {
        expected.at(1, y) = float4(0.0F);
        for (int x = 2; x < 5; ++x) {
            expected.at(x, y) = float4(float((y - 3) * 4 + x - 2) / 64.0F, 0.25F, 0.5F, 1.0F);
        }
    }
    EXPECT_TRUE(areIdentical(expected, output.picture()));
    EXPECT_TRUE(output.paddingIsUntouched());
}

TEST(LabRows, FormatsThatAccessorsDoNotServeAreRefusedBeforeAnythingIsWritten) {
    Picture const picture(0, 0, 2, 2, float4(0.75F));
    FilterImage good(ImageCPU::PIXEL_FORMAT_RGBA32F, picture, 2);
    ImageCPU wrong(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, picture.rectangle(),
                   PixelExtentInWorldSpace(1.0F, 1.0F), ExtentInPixelSpace());
    wrong.initializeToTransparentBlack();
    ORVO_EXPECT_INTERNAL(convertRows(halveFirst, wrong, good.image(), picture.rectangle(), 0, 2),
                         "Invalid input image type");
    ORVO_EXPECT_INTERNAL(convertRows(halveFirst, good.image(), wrong, picture.rectangle(), 0, 2),
                         "Invalid input image type");
    EXPECT_TRUE(areIdentical(picture, good.picture()));
}

} // namespace
