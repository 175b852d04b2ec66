#include "orvo/core/math/Size.h"

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

TEST(Size, GivesItsComponentsByIndex) {
    size2 const two(3, 4);
    EXPECT_EQ(3u, two[0]);
    EXPECT_EQ(4u, two[1]);
    size3 const three(5, 6, std::size_t(1) << 40);
    EXPECT_EQ(5u, three[0]);
    EXPECT_EQ(6u, three[1]);
    EXPECT_EQ(std::size_t(1) << 40, three[2]);
    EXPECT_EQ(size2(0, 0), size2());
    EXPECT_EQ(size3(0, 0, 0), size3());
}

TEST(Size, Adds) {
    size3 sum(1, 2, 3);
    sum += size3(10, 20, 30);
    EXPECT_EQ(size3(11, 22, 33), sum);
    EXPECT_EQ(size3(12, 24, 36), sum + size3(1, 2, 3));
    EXPECT_EQ(size2(4, 6), size2(1, 2) + size2(3, 4));
}

TEST(Size, OrdersByTheFirstComponentThatDiffers) {
    size3 const ordered[] = {{0, 0, 0}, {0, 0, 1}, {0, 1, 0}, {0, 2, 0}, {1, 0, 0}, {1, 0, 5}, {2, 0, 0}};
    for (size3 const& a : ordered) {
        for (size3 const& b : ordered) {
            EXPECT_EQ(&a < &b, a < b) << a << b;
            EXPECT_EQ(&a == &b, a == b) << a << b;
            EXPECT_EQ(&a != &b, a != b) << a << b;
        }
    }
    EXPECT_TRUE(size2(1, 9) < size2(2, 0));
    EXPECT_TRUE(size2(1, 1) < size2(1, 2));
    EXPECT_FALSE(size2(1, 1) < size2(1, 1));
}

TEST(Size, Prints) {
    EXPECT_EQ("(1, 2)", printed(size2(1, 2)));
    EXPECT_EQ("(1, 2, 3)", printed(size3(1, 2, 3)));
}

} // namespace
