#include "orvo/core/ColorSpace.h"

#include <sstream>

#include "tests/support/Expect.h"

namespace {

using namespace ORVO;

struct Row {
    ColorSpace eSpace_;
    int iValue_;
    int nChannels_;
    char const* pName_;
};

Row const rows[] = {
    {COLOR_SPACE_LUMINANCE, 0, 1, "COLOR_SPACE_LUMINANCE"},
    {COLOR_SPACE_LUMINANCE_ALPHA, 1, 2, "COLOR_SPACE_LUMINANCE_ALPHA"},
    {COLOR_SPACE_RGB, 2, 3, "COLOR_SPACE_RGB"},
    {COLOR_SPACE_RGBA, 3, 4, "COLOR_SPACE_RGBA"},
    {COLOR_SPACE_LAB, 4, 3, "COLOR_SPACE_LAB"},
    {COLOR_SPACE_LABA, 5, 4, "COLOR_SPACE_LABA"},
    {COLOR_SPACE_UNNAMED, 6, 0, "COLOR_SPACE_UNNAMED"},
};

TEST(ColorSpace, HasValuesChannelsAndNames) {
    static_assert(sizeof(ColorSpace) == 4);
    for (Row const& row : rows) {
        SCOPED_TRACE(row.pName_);
        EXPECT_EQ(row.iValue_, static_cast<int>(row.eSpace_));
        EXPECT_EQ(row.nChannels_, getNumChannels(row.eSpace_));
        std::ostringstream stream;
        stream << row.eSpace_;
        EXPECT_EQ(row.pName_, stream.str());
    }
}

TEST(ColorSpace, RefusesAndPrintsOtherValues) {
    for (int value : {-1, 7, 1000}) {
        ORVO_EXPECT_PARAMETER(getNumChannels(static_cast<ColorSpace>(value)), "Unknown color space");
        std::ostringstream stream;
        stream << static_cast<ColorSpace>(value);
        EXPECT_EQ("ColorSpace(" + std::to_string(value) + ")", stream.str());
    }
}

} // namespace
