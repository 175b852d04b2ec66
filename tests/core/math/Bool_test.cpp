#include "orvo/core/math/Bool.h"

#include <gtest/gtest.h>

#include <sstream>

namespace {

using namespace ORVO;

template <typename Vector>
std::string printed(Vector const& value) {
    std::ostringstream stream;
    stream << value;
    return stream.str();
}

TEST(Bool, IsFalseByDefaultAndFilledFromOneValue) {
    EXPECT_EQ(bool2(false, false), bool2());
    EXPECT_EQ(bool3(false, false, false), bool3());
    EXPECT_EQ(bool4(false, false, false, false), bool4());
    EXPECT_EQ(bool2(true, true), bool2(true));
    EXPECT_EQ(bool3(true, true, true), bool3(true));
    EXPECT_EQ(bool4(true, true, true, true), bool4(true));
}

TEST(Bool, ComparesEveryComponent) {
    EXPECT_FALSE(bool2(true) == bool2(false, true));
    EXPECT_FALSE(bool2(true) == bool2(true, false));
    EXPECT_TRUE(bool3(true) != bool3(false, true, true));
    EXPECT_TRUE(bool3(true) != bool3(true, false, true));
    EXPECT_TRUE(bool3(true) != bool3(true, true, false));
    EXPECT_TRUE(bool4(true) != bool4(false, true, true, true));
    EXPECT_TRUE(bool4(true) != bool4(true, false, true, true));
    EXPECT_TRUE(bool4(true) != bool4(true, true, false, true));
    EXPECT_TRUE(bool4(true) != bool4(true, true, true, false));
    EXPECT_FALSE(bool4(true) != bool4(true));
}

TEST(Bool, Prints) {
    EXPECT_EQ("(1, 0)", printed(bool2(true, false)));
    EXPECT_EQ("(0, 1, 1)", printed(bool3(false, true, true)));
    EXPECT_EQ("(1, 0, 0, 1)", printed(bool4(true, false, false, true)));
}

} // namespace
