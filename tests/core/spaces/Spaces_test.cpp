#include "orvo/core/spaces/Spaces.h"

#include <gtest/gtest.h>

#include <limits>
#include <sstream>

namespace {

using namespace ORVO;

constexpr float fInfinity = std::numeric_limits<float>::infinity();

template <typename Value>
std::string printed(Value const& value) {
    std::ostringstream stream;
    stream << value;
    return stream.str();
}

TEST(PositionInWorldSpace, HoldsAPoint) {
    EXPECT_EQ(float2(0.0f, 0.0f), PositionInWorldSpace().positionAsFloat2());
    PositionInWorldSpace const position(1.5f, -2.0f);
    EXPECT_EQ(1.5f, position.x());
    EXPECT_EQ(-2.0f, position.y());
    EXPECT_EQ(float2(1.5f, -2.0f), position.positionAsFloat2());
    EXPECT_TRUE(position == PositionInWorldSpace(float2(1.5f, -2.0f)));
    EXPECT_TRUE(position != PositionInWorldSpace(1.5f, 2.0f));
    EXPECT_EQ("(1.5, -2)", printed(position));
}

TEST(PositionInWorldSpace, DiffersByAnExtentAndMovesByOne) {
    ExtentInWorldSpace const difference = PositionInWorldSpace(5.0f, 1.0f) - PositionInWorldSpace(2.0f, 4.0f);
    EXPECT_EQ(ExtentInWorldSpace(3.0f, -3.0f), difference);
    EXPECT_TRUE(difference.isDefined());
    EXPECT_EQ(PositionInWorldSpace(4.0f, 6.0f),
              PositionInWorldSpace(1.0f, 2.0f) + ExtentInWorldSpace(3.0f, 4.0f));
    EXPECT_EQ(PositionInWorldSpace(1.0f, 2.0f), PositionInWorldSpace(1.0f, 2.0f) + ExtentInWorldSpace());
}

TEST(ExtentInWorldSpace, IsUndefinedByDefault) {
    ExtentInWorldSpace const extent;
    EXPECT_FALSE(extent.isDefined());
    EXPECT_FALSE(extent.isInfinite());
    EXPECT_EQ(0.0f, extent.width());
    EXPECT_EQ(0.0f, extent.height());
    EXPECT_EQ("undefined", printed(extent));
}

TEST(ExtentInWorldSpace, HoldsWidthAndHeight) {
    ExtentInWorldSpace const extent(2.5f, 3.0f);
    EXPECT_TRUE(extent.isDefined());
    EXPECT_EQ(2.5f, extent.width());
    EXPECT_EQ(3.0f, extent.height());
    EXPECT_EQ(float2(2.5f, 3.0f), extent.extentAsFloat2());
    EXPECT_EQ("(2.5, 3)", printed(extent));
    EXPECT_TRUE(extent == ExtentInWorldSpace(float2(2.5f, 3.0f)));
    EXPECT_TRUE(extent != ExtentInWorldSpace(2.5f, 4.0f));
}

TEST(ExtentInWorldSpace, TellsAnEmptyOneFromAnUndefinedOne) {
    EXPECT_TRUE(ExtentInWorldSpace(0.0f, 0.0f).isDefined());
    EXPECT_FALSE(ExtentInWorldSpace(0.0f, 0.0f) == ExtentInWorldSpace());
    EXPECT_TRUE(ExtentInWorldSpace() == ExtentInWorldSpace());
}

TEST(ExtentInWorldSpace, IsInfiniteInOneDirectionOrBoth) {
    EXPECT_TRUE(ExtentInWorldSpace::infinite().isInfinite());
    EXPECT_TRUE(ExtentInWorldSpace::infinite().isDefined());
    EXPECT_TRUE(ExtentInWorldSpace(fInfinity, 1.0f).isInfinite());
    EXPECT_TRUE(ExtentInWorldSpace(1.0f, fInfinity).isInfinite());
    EXPECT_FALSE(ExtentInWorldSpace(std::numeric_limits<float>::max(), 1.0f).isInfinite());
}

TEST(PixelExtentInWorldSpace, IsOneByOneByDefault) {
    PixelExtentInWorldSpace const unit;
    EXPECT_EQ(1.0f, unit.width());
    EXPECT_EQ(1.0f, unit.height());
    EXPECT_TRUE(unit.pixelExtent().isDefined());
}

TEST(PixelExtentInWorldSpace, HoldsWidthAndHeight) {
    PixelExtentInWorldSpace const pixel(0.5f, 2.0f);
    EXPECT_EQ(0.5f, pixel.width());
    EXPECT_EQ(2.0f, pixel.height());
    EXPECT_EQ(ExtentInWorldSpace(0.5f, 2.0f), pixel.pixelExtent());
    EXPECT_TRUE(pixel == PixelExtentInWorldSpace(0.5f, 2.0f));
    EXPECT_FALSE(pixel == PixelExtentInWorldSpace(0.5f, 1.0f));
    EXPECT_TRUE(pixel != PixelExtentInWorldSpace());
    EXPECT_EQ("(0.5, 2)", printed(pixel));
}

TEST(PositionInPixelSpace, HoldsAPixel) {
    EXPECT_EQ(int2(0, 0), PositionInPixelSpace().positionAsInt2());
    PositionInPixelSpace const position(3, -4);
    EXPECT_EQ(3, position.x());
    EXPECT_EQ(-4, position.y());
    EXPECT_TRUE(position == PositionInPixelSpace(int2(3, -4)));
    EXPECT_TRUE(position != PositionInPixelSpace(3, 4));
    EXPECT_EQ("(3, -4)", printed(position));
}

TEST(ExtentInPixelSpace, IsUndefinedByDefaultAndHoldsWidthAndHeight) {
    ExtentInPixelSpace const undefined;
    EXPECT_FALSE(undefined.isDefined());
    EXPECT_EQ(0, undefined.width());
    EXPECT_EQ(0, undefined.height());
    EXPECT_EQ("undefined", printed(undefined));

    ExtentInPixelSpace const extent(640, 480);
    EXPECT_TRUE(extent.isDefined());
    EXPECT_EQ(640, extent.width());
    EXPECT_EQ(480, extent.height());
    EXPECT_EQ(int2(640, 480), extent.extentAsInt2());
    EXPECT_EQ("(640, 480)", printed(extent));
    EXPECT_TRUE(extent == ExtentInPixelSpace(int2(640, 480)));
    EXPECT_FALSE(extent != ExtentInPixelSpace(640, 480));
    EXPECT_TRUE(extent != ExtentInPixelSpace(640, 481));
    EXPECT_FALSE(ExtentInPixelSpace(0, 0) == undefined);
    EXPECT_TRUE(ExtentInPixelSpace(0, 0) != undefined);
}

TEST(PositionExtentInPixelSpace, HoldsARectangle) {
    PositionExtentInPixelSpace const undefined;
    EXPECT_EQ(PositionInPixelSpace(0, 0), undefined.position());
    EXPECT_FALSE(undefined.extent().isDefined());
    PositionExtentInPixelSpace const atOrigin(ExtentInPixelSpace(2, 3));
    EXPECT_EQ(PositionInPixelSpace(0, 0), atOrigin.position());
    EXPECT_EQ(ExtentInPixelSpace(2, 3), atOrigin.extent());
    PositionExtentInPixelSpace const rectangle(PositionInPixelSpace(-1, 4), ExtentInPixelSpace(2, 3));
    EXPECT_EQ(PositionInPixelSpace(-1, 4), rectangle.position());
    EXPECT_EQ("(-1, 4) (2, 3)", printed(rectangle));
    EXPECT_EQ("(0, 0) undefined", printed(undefined));
    EXPECT_TRUE(rectangle != atOrigin);
    EXPECT_TRUE(rectangle ==
                PositionExtentInPixelSpace(PositionInPixelSpace(-1, 4), ExtentInPixelSpace(2, 3)));
}

TEST(PositionExtentInPixelSpace, MovesBackByAPosition) {
    PositionExtentInPixelSpace const rectangle(PositionInPixelSpace(10, 20), ExtentInPixelSpace(5, 6));
    EXPECT_EQ(PositionExtentInPixelSpace(PositionInPixelSpace(7, 24), ExtentInPixelSpace(5, 6)),
              rectangle - PositionInPixelSpace(3, -4));
    EXPECT_FALSE((PositionExtentInPixelSpace() - PositionInPixelSpace(1, 1)).extent().isDefined());
}

TEST(PositionExtentInPixelSpace, SaturatesWhereItLeavesTheIntegers) {
    constexpr int least = std::numeric_limits<int>::min();
    constexpr int most = std::numeric_limits<int>::max();
    PositionExtentInPixelSpace const rectangle(PositionInPixelSpace(least, most), ExtentInPixelSpace(1, 1));
    EXPECT_EQ(PositionInPixelSpace(least, most), (rectangle - PositionInPixelSpace(1, -1)).position());
    EXPECT_EQ(PositionInPixelSpace(0, 0), (rectangle - PositionInPixelSpace(least, most)).position());
}

} // namespace
