#include "orvo/core/spaces/PositionExtentInWorldSpace.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>
#include <sstream>

namespace {

using namespace ORVO;

constexpr float fInfinity = std::numeric_limits<float>::infinity();

PositionExtentInWorldSpace rectangle(float x, float y, float width, float height) {
    return PositionExtentInWorldSpace(PositionInWorldSpace(x, y), ExtentInWorldSpace(width, height));
}

PositionExtentInWorldSpace undefinedAt(float x, float y) {
    return PositionExtentInWorldSpace(PositionInWorldSpace(x, y), ExtentInWorldSpace());
}

PositionExtentInWorldSpace const undefined;
PositionExtentInWorldSpace const everything(ExtentInWorldSpace::infinite());

TEST(PositionExtentInWorldSpace, HoldsARectangle) {
    EXPECT_EQ(PositionInWorldSpace(0.0f, 0.0f), undefined.position());
    EXPECT_FALSE(undefined.extent().isDefined());
    PositionExtentInWorldSpace const atOrigin(ExtentInWorldSpace(2.0f, 3.0f));
    EXPECT_EQ(PositionInWorldSpace(0.0f, 0.0f), atOrigin.position());
    EXPECT_EQ(ExtentInWorldSpace(2.0f, 3.0f), atOrigin.extent());
    PositionExtentInWorldSpace const other = rectangle(-1.0f, 4.5f, 2.0f, 3.0f);
    EXPECT_EQ(PositionInWorldSpace(-1.0f, 4.5f), other.position());
    EXPECT_EQ(PositionInWorldSpace(1.0f, 7.5f), other.bottomRightPosition());
    EXPECT_EQ(PositionInWorldSpace(3.0f, 4.0f), undefinedAt(3.0f, 4.0f).bottomRightPosition());
}

TEST(PositionExtentInWorldSpace, ComparesPositionAndExtent) {
    EXPECT_TRUE(rectangle(1, 2, 3, 4) == rectangle(1, 2, 3, 4));
    EXPECT_TRUE(rectangle(1, 2, 3, 4) != rectangle(0, 2, 3, 4));
    EXPECT_TRUE(rectangle(1, 2, 3, 4) != rectangle(1, 0, 3, 4));
    EXPECT_TRUE(rectangle(1, 2, 3, 4) != rectangle(1, 2, 0, 4));
    EXPECT_TRUE(rectangle(1, 2, 3, 4) != rectangle(1, 2, 3, 0));
    EXPECT_TRUE(undefined == PositionExtentInWorldSpace());
    EXPECT_TRUE(everything == PositionExtentInWorldSpace(ExtentInWorldSpace::infinite()));
    EXPECT_TRUE(undefined != rectangle(0, 0, 0, 0));
}

TEST(PositionExtentInWorldSpace, Prints) {
    std::ostringstream stream;
    stream << rectangle(1, 2, 3.5f, 4) << '|' << undefined << '|' << everything;
    EXPECT_EQ("(1, 2) (3.5, 4)|(0, 0) undefined|(0, 0) (inf, inf)", stream.str());
}

TEST(PositionExtentInWorldSpace, KnowsWhetherItIsInfiniteOrEmpty) {
    struct Row {
        char const* pName_;
        PositionExtentInWorldSpace oRectangle_;
        bool bInfinite_;
        bool bEmpty_;
    };
    Row const rows[] = {
        {"undefined", undefined, false, false},
        {"finite", rectangle(0, 0, 1, 1), false, false},
        {"infinite", everything, true, false},
        {"infinite in x", rectangle(0, 0, fInfinity, 1), true, false},
        {"infinite in y", rectangle(0, 0, 1, fInfinity), true, false},
        {"empty", rectangle(5, 5, 0, 0), false, true},
        {"no width", rectangle(5, 5, 0, 3), false, true},
        {"no height", rectangle(5, 5, 3, 0), false, true},
        {"negative", rectangle(5, 5, -3, 3), false, true},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(row.bInfinite_, row.oRectangle_.isInfinite()) << row.pName_;
        EXPECT_EQ(row.bEmpty_, row.oRectangle_.isEmpty()) << row.pName_;
    }
}

struct BinaryRow {
    char const* pName_;
    PositionExtentInWorldSpace oA_;
    PositionExtentInWorldSpace oB_;
    PositionExtentInWorldSpace oResult_;
};

TEST(PositionExtentInWorldSpace, IncludesByTheTable) {
    BinaryRow const rows[] = {
        {"overlapping", rectangle(0, 0, 10, 10), rectangle(5, -5, 10, 10), rectangle(0, -5, 15, 15)},
        {"disjoint", rectangle(0, 0, 1, 1), rectangle(10, 20, 2, 2), rectangle(0, 0, 12, 22)},
        {"containing", rectangle(0, 0, 10, 10), rectangle(2, 3, 4, 5), rectangle(0, 0, 10, 10)},
        {"contained", rectangle(2, 3, 4, 5), rectangle(0, 0, 10, 10), rectangle(0, 0, 10, 10)},
        {"itself", rectangle(2, 3, 4, 5), rectangle(2, 3, 4, 5), rectangle(2, 3, 4, 5)},
        {"into undefined", undefined, rectangle(2, 3, 4, 5), rectangle(2, 3, 4, 5)},
        {"into undefined elsewhere", undefinedAt(7, 7), rectangle(2, 3, 4, 5), rectangle(2, 3, 4, 5)},
        {"of undefined", rectangle(2, 3, 4, 5), undefinedAt(50, 50), rectangle(2, 3, 4, 5)},
        {"two undefined", undefinedAt(1, 2), undefinedAt(3, 4), undefinedAt(1, 2)},
        {"infinite into undefined", undefined, everything, everything},
        {"undefined into infinite", everything, undefined, everything},
        {"of infinite", rectangle(2, 3, 4, 5), everything, everything},
        {"of infinite, left of its position", rectangle(-2, -3, 4, 5), everything, everything},
        {"into infinite", everything, rectangle(2, 3, 4, 5), everything},
        {"infinite in x", rectangle(2, 3, 4, 5), rectangle(0, 10, fInfinity, 1),
         rectangle(0, 3, fInfinity, 8)},
        {"empty into undefined", undefined, rectangle(9, 9, 0, 0), rectangle(9, 9, 0, 0)},
        {"of empty", rectangle(2, 3, 4, 5), rectangle(90, 90, 0, 0), rectangle(2, 3, 4, 5)},
        {"into empty", rectangle(90, 90, 0, 0), rectangle(2, 3, 4, 5), rectangle(2, 3, 4, 5)},
        {"two empty", rectangle(90, 90, 0, 0), rectangle(2, 3, 0, 0), rectangle(90, 90, 0, 0)},
        {"infinite into empty", rectangle(9, 9, 0, 0), everything, everything},
    };
    for (BinaryRow const& row : rows) {
        PositionExtentInWorldSpace result = row.oA_;
        result.include(row.oB_);
        EXPECT_EQ(row.oResult_, result) << row.pName_;
    }
}

TEST(PositionExtentInWorldSpace, IntersectsByTheTable) {
    BinaryRow const rows[] = {
        {"overlapping", rectangle(0, 0, 10, 10), rectangle(5, -5, 10, 10), rectangle(5, 0, 5, 5)},
        {"containing", rectangle(0, 0, 10, 10), rectangle(2, 3, 4, 5), rectangle(2, 3, 4, 5)},
        {"contained", rectangle(2, 3, 4, 5), rectangle(0, 0, 10, 10), rectangle(2, 3, 4, 5)},
        {"disjoint", rectangle(0, 0, 1, 1), rectangle(10, 20, 2, 2), rectangle(10, 20, 0, 0)},
        {"disjoint in x alone", rectangle(0, 0, 1, 9), rectangle(10, 2, 2, 2), rectangle(10, 2, 0, 0)},
        {"touching", rectangle(0, 0, 10, 10), rectangle(10, 0, 5, 10), rectangle(10, 0, 0, 0)},
        {"undefined with rectangle", undefinedAt(1, 1), rectangle(0, 0, 9, 9), undefinedAt(1, 1)},
        {"rectangle with undefined", rectangle(2, 3, 9, 9), undefinedAt(1, 1), undefinedAt(2, 3)},
        {"undefined with infinite", undefined, everything, undefined},
        {"infinite with undefined", everything, undefined, undefined},
        {"two undefined", undefined, undefined, undefined},
        {"with infinite", rectangle(2, 3, 4, 5), everything, rectangle(2, 3, 4, 5)},
        {"with infinite, left of its position", rectangle(-2, -3, 4, 5), everything, rectangle(-2, -3, 4, 5)},
        {"infinite with", everything, rectangle(-2, -3, 4, 5), rectangle(-2, -3, 4, 5)},
        {"infinite elsewhere", rectangle(100, 100, fInfinity, fInfinity), rectangle(-2, -3, 4, 5),
         rectangle(-2, -3, 4, 5)},
        {"two infinite", everything, everything, everything},
        {"infinite in x", rectangle(2, 3, 4, 5), rectangle(0, 6, fInfinity, 10), rectangle(2, 6, 4, 2)},
        {"infinite in x and in y", rectangle(0, 3, fInfinity, 5), rectangle(2, 0, 4, fInfinity),
         rectangle(2, 3, 4, 5)},
        {"with empty inside", rectangle(0, 0, 10, 10), rectangle(5, 6, 0, 0), rectangle(5, 6, 0, 0)},
        {"with no width inside", rectangle(0, 0, 10, 10), rectangle(5, 6, 0, 2), rectangle(5, 6, 0, 0)},
        {"empty with infinite", rectangle(5, 6, 0, 0), everything, rectangle(5, 6, 0, 0)},
    };
    for (BinaryRow const& row : rows) {
        PositionExtentInWorldSpace result = row.oA_;
        result.intersect(row.oB_);
        EXPECT_EQ(row.oResult_, result) << row.pName_;
    }
}

TEST(PositionExtentInWorldSpace, OutsetsByTheTable) {
    struct Row {
        char const* pName_;
        PositionExtentInWorldSpace oRectangle_;
        float2 oMargin_;
        PositionExtentInWorldSpace oResult_;
    };
    Row const rows[] = {
        {"finite", rectangle(10, 20, 4, 6), float2(1, 2), rectangle(9, 18, 6, 10)},
        {"by nothing", rectangle(10, 20, 4, 6), float2(0, 0), rectangle(10, 20, 4, 6)},
        {"inwards", rectangle(10, 20, 4, 6), float2(-1, -2), rectangle(11, 22, 2, 2)},
        {"inwards beyond the centre", rectangle(10, 20, 4, 6), float2(-3, -3), rectangle(12, 23, 0, 0)},
        {"undefined", undefinedAt(3, 4), float2(1, 2), undefinedAt(3, 4)},
        {"infinite", everything, float2(1, 2), everything},
        {"infinite, inwards", everything, float2(-1, -2), everything},
        {"infinite in x", rectangle(5, 6, fInfinity, 4), float2(1, 2), rectangle(5, 4, fInfinity, 8)},
        {"empty", rectangle(5, 6, 0, 0), float2(1, 2), rectangle(4, 4, 2, 4)},
    };
    for (Row const& row : rows) {
        PositionExtentInWorldSpace result = row.oRectangle_;
        result.outset(row.oMargin_);
        EXPECT_EQ(row.oResult_, result) << row.pName_;
    }
}

TEST(PositionExtentInWorldSpace, OutsetByAnInfiniteMarginIsInfinite) {
    PositionExtentInWorldSpace grown = rectangle(1, 2, 3, 4);
    grown.outset(float2(fInfinity, 0.0f));
    EXPECT_TRUE(grown.isInfinite());
    grown.intersect(rectangle(-50, 0, 7, 100));
    EXPECT_EQ(rectangle(-50, 2, 7, 4), grown);
}

TEST(PositionExtentInWorldSpace, KeepsTheNumbersOfTheRectangleThatWins) {
    // 0.1f + 0.7f is no float: an extent that is worked out anew from the sides could be off by a unit.
    std::mt19937 random(20231);
    std::uniform_real_distribution<float> position(-1000.0f, 1000.0f);
    std::uniform_real_distribution<float> extent(0.001f, 1000.0f);
    for (int i = 0; i < 20000; ++i) {
        PositionExtentInWorldSpace const inner =
            rectangle(position(random), position(random), extent(random), extent(random));
        PositionExtentInWorldSpace outer = inner;
        outer.outset(float2(extent(random), extent(random)));

        PositionExtentInWorldSpace result = inner;
        result.intersect(outer);
        ASSERT_EQ(inner, result);
        result = outer;
        result.intersect(inner);
        ASSERT_EQ(inner, result);
        result = inner;
        result.include(outer);
        ASSERT_EQ(outer, result);
        result = outer;
        result.include(inner);
        ASSERT_EQ(outer, result);
    }
}

TEST(PositionExtentInWorldSpace, SurvivesNumbersThatAreNone) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    PositionExtentInWorldSpace result = rectangle(0, 0, 10, 10);
    result.include(rectangle(nan, nan, nan, nan));
    EXPECT_EQ(rectangle(0, 0, 10, 10), result); // it contains no point
    result.intersect(rectangle(nan, 0, 5, 5));
    EXPECT_TRUE(result.extent().isDefined());
    PositionExtentInWorldSpace grown = rectangle(0, 0, 10, 10);
    grown.outset(float2(nan, 1.0f));
    EXPECT_TRUE(std::isnan(grown.extent().width()));
    EXPECT_EQ(12.0f, grown.extent().height());
}

} // namespace
