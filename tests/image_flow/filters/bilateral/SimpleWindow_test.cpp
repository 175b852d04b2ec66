#include "orvo/image_flow/filters/bilateral/SimpleWindow.h"

#include "tests/image_flow/support/FastBilateralTesting.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <algorithm>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using ImageFlow::bilateral::SimpleWindow;

/// A pixel of a row of the window; the fourth plane is its grey.
void expectPixel(float const* pRow, std::size_t pitch, std::size_t column, float4 const& expected) {
    EXPECT_EQ(expected.x, pRow[column]);
    EXPECT_EQ(expected.y, pRow[column + pitch]);
    EXPECT_EQ(expected.z, pRow[column + 2 * pitch]);
    EXPECT_EQ(0.39F * expected.x + 0.5F * expected.y + 0.11F * expected.z, pRow[column + 3 * pitch]);
}

TEST(SimpleWindow, NeighboursAreFoundByUnsignedCoordinatesInTheStorage) {
    Picture const source = randomPicture(-4, 7, 5, 4, 1);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 9);
    // The whole image, a part of it, and regions that reach beyond each of its edges or lie outside.
    for (Picture const& region : {Picture(-4, 7, 5, 4), Picture(-3, 8, 2, 2), Picture(-7, 3, 12, 13),
                                  Picture(5, 7, 3, 2), Picture(-4, 30, 5, 3), Picture(-20, -20, 4, 4)}) {
        for (int nHalf : {0, 1, 2, 6}) {
            SimpleWindow window(image.image(), region.rectangle(), nHalf);
            for (int row = 0; row < region.height; ++row) {
                window.moveTo(std::size_t(row));
                int const y = region.y + row - source.y;
                for (int column = -nHalf; column < region.width + nHalf; ++column) {
                    int const x = region.x + column - source.x;
                    for (int dy = -nHalf; dy <= nHalf; ++dy) {
                        unsigned const nx = std::min(unsigned(x), 5U);
                        unsigned const ny = std::min(unsigned(y + dy), 4U);
                        expectPixel(window.rows()[dy + nHalf], window.pitch(), std::size_t(column + nHalf),
                                    source.pixels[std::min(ny * 5 + nx, 19U)]);
                    }
                    bool const isInside = x >= 0 && x < 5 && y >= 0 && y < 4;
                    expectPixel(window.centres(), window.pitch(), std::size_t(column + nHalf),
                                isInside ? source.at(x, y) : float4(0.0F));
                }
            }
        }
    }
}

TEST(SimpleWindow, RowsMayBeVisitedInAnyOrder) {
    Picture const source = randomPicture(0, 0, 3, 30, 2);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 3);
    SimpleWindow window(image.image(), source.rectangle(), 1);
    for (int row : {5, 6, 20, 4, 29, 0}) {
        window.moveTo(std::size_t(row));
        expectPixel(window.centres(), window.pitch(), 1, source.at(0, row));
        expectPixel(window.rows()[0], window.pitch(), 2, row > 0 ? source.at(1, row - 1) : source.at(2, 29));
        expectPixel(window.rows()[2], window.pitch(), 2, row < 29 ? source.at(1, row + 1) : source.at(2, 29));
    }
}

TEST(SimpleWindow, ImageWithoutPixelsIsTransparentBlack) {
    for (Picture const& empty : {Picture(0, 0, 0, 0), Picture(0, 0, 3, 0), Picture(0, 0, 0, 3)}) {
        ImageCPU const none(ImageCPU::PIXEL_FORMAT_LUMINANCE8, empty.rectangle(),
                            PixelExtentInWorldSpace(1.0F, 1.0F), ExtentInPixelSpace());
        SimpleWindow window(none, Picture(0, 0, 2, 2).rectangle(), 1);
        window.moveTo(1);
        for (std::size_t column = 0; column < 4; ++column) {
            expectPixel(window.rows()[0], window.pitch(), column, float4(0.0F));
            expectPixel(window.centres(), window.pitch(), column, float4(0.0F));
        }
    }
}

TEST(SimpleWindow, OtherFormatsAreRefused) {
    ImageCPU wrong(ImageCPU::PIXEL_FORMAT_LUMINANCE8, Picture(0, 0, 4, 4).rectangle(),
                   PixelExtentInWorldSpace(1.0F, 1.0F), ExtentInPixelSpace());
    wrong.initializeToTransparentBlack();
    SimpleWindow window(wrong, Picture(0, 0, 2, 2).rectangle(), 1);
    ORVO_EXPECT_INTERNAL(window.moveTo(0), "Invalid input image type");
}

} // namespace
