#include "orvo/image_runtime/images/ImageBase.h"

#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

#include <gtest/gtest.h>

#include <limits>
#include <sstream>

namespace ORVO {
namespace {

/// An image without pixels, to see the base alone.
class EmptyImage : public ImageBase {
public:
    EmptyImage() = default;
    using ImageBase::ImageBase;

    ExtentInPixelSpace capacityExtent() const override { return ExtentInPixelSpace(64, 48); }
    void initializeToTransparentBlack() override {}
};

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height));
}

TEST(ImageBase, IsEmptyWithPixelsOfOneByOneByDefault) {
    EmptyImage const image;
    EXPECT_EQ(0, image.extent().width());
    EXPECT_EQ(0, image.extent().height());
    EXPECT_EQ(0, image.position().x());
    EXPECT_EQ(0, image.position().y());
    EXPECT_EQ(1.0f, image.pixelExtent().width());
    EXPECT_EQ(1.0f, image.pixelExtent().height());
    EXPECT_EQ(0u, image.numberOfPixels());
}

TEST(ImageBase, HasItsOperationsInOrder) {
    // The destructor stands first.
    EXPECT_EQ(2, ORVO::Test::constSlotOf(&ImageBase::capacityExtent));
    EXPECT_EQ(3, ORVO::Test::slotOf(&ImageBase::initializeToTransparentBlack));
    EXPECT_EQ(4, ORVO::Test::constSlotOf(&ImageBase::doWrite));
}

TEST(ImageBase, KeepsRectangleAndPixelExtent) {
    EmptyImage image(rectangle(-7, 5, 30, 20), PixelExtentInWorldSpace(0.5f, 2.0f));
    EXPECT_EQ(rectangle(-7, 5, 30, 20), image.positionExtent());
    EXPECT_EQ(PositionInPixelSpace(-7, 5), image.position());
    EXPECT_EQ(ExtentInPixelSpace(30, 20), image.extent());
    EXPECT_EQ(PixelExtentInWorldSpace(0.5f, 2.0f), image.pixelExtent());
    EXPECT_EQ(600u, image.numberOfPixels());

    image.setPixelExtent(PixelExtentInWorldSpace(3.0f, 4.0f));
    EXPECT_EQ(PixelExtentInWorldSpace(3.0f, 4.0f), image.pixelExtent());
    EXPECT_EQ(rectangle(-7, 5, 30, 20), image.positionExtent());
}

TEST(ImageBase, RefusesPixelExtentsThatAreNotPositive) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    float const refused[][2] = {{0, 1}, {1, 0}, {-1, 1}, {1, -1}, {0, 0}, {nan, 1}, {1, nan}};
    for (auto const& extent : refused) {
        SCOPED_TRACE(testing::Message() << extent[0] << " by " << extent[1]);
        ORVO_EXPECT_INTERNAL(EmptyImage(rectangle(0, 0, 4, 4), PixelExtentInWorldSpace(extent[0], extent[1])),
                             "pixelExtent.pixelExtent().extentAsFloat2().x > 0");
    }
}

TEST(ImageBase, ReportsTheFileOfItsFailures) {
    try {
        EmptyImage const image(rectangle(0, 0, 1, 1), PixelExtentInWorldSpace(0, 0));
        FAIL() << "nothing was thrown";
    } catch (InternalException const& exception) {
        EXPECT_STREQ("orvo/image_runtime/images/ImageBase.cpp", exception.file());
        EXPECT_GT(exception.line(), 0);
    }
}

TEST(ImageBase, CountsPixelsIn32Bits) {
    // 65536 * 65537 is 2^32 + 65536.
    EmptyImage const image(rectangle(0, 0, 65536, 65537), PixelExtentInWorldSpace(1, 1));
    EXPECT_EQ(65536u, image.numberOfPixels());
}

TEST(ImageBase, DescribesItselfInSixLines) {
    EmptyImage const image(rectangle(-3, 4, 60, 40), PixelExtentInWorldSpace(0.5f, 0.25f));
    std::ostringstream address;
    address << static_cast<void const*>(&image);

    std::ostringstream stream;
    image.doWrite(stream);
    EXPECT_EQ("Image address : " + address.str() +
                  "\n"
                  "Image extent : (60, 40)\n"
                  "Image position : (-3, 4)\n"
                  "Image # pixels : 2400\n"
                  "Image capacity : (64, 48)\n"
                  "Image pixel extent : (0.5, 0.25)\n",
              stream.str());
}

} // namespace
} // namespace ORVO
