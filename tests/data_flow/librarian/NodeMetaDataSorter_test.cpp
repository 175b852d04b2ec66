#include "orvo/data_flow/librarian/NodeMetaDataSorter.h"

#include "orvo/data_flow/librarian/NodeMetaData.h"

#include <gtest/gtest.h>

#include <limits>
#include <sstream>
#include <vector>

namespace ORVO::Test {

using DataFlow::NodeMetaData;
using DataFlow::NodeMetaDataSorter;

TEST(NodeMetaDataSorterTest, OrdersByVendorThenNamespaceThenNameThenVersion) {
    std::uint32_t const iLast = std::numeric_limits<std::uint32_t>::max();
    // In strictly rising order. The description and the client ID fall, and count for nothing.
    std::vector<NodeMetaData> const aRising{
        NodeMetaData("z", "z", "A", 9, "9", "9"),     NodeMetaData("z", "z", "B", 9, "8", "8"),
        NodeMetaData("z", "y", "a", 9, "7", "7"),     NodeMetaData("a", "z", "a", 9, "6", "6"),
        NodeMetaData("b", "z", "a", "5", "5"),        NodeMetaData("b", "z", "a", 1, "4", "4"),
        NodeMetaData("b", "z", "a", 2, "3", "3"),     NodeMetaData("b", "z", "a", 10, "2", "2"),
        NodeMetaData("b", "z", "a", iLast, "1", "1"), NodeMetaData("bb", "z", "a", 0, "0", "0"),
        NodeMetaData("a", "zz", "a", 0, "", ""),      NodeMetaData("", "", "aa", "", ""),
    };
    NodeMetaDataSorter const sorter;
    for (std::size_t i = 0; i < aRising.size(); ++i) {
        for (std::size_t j = 0; j < aRising.size(); ++j) {
            EXPECT_EQ(i < j, sorter(&aRising[i], &aRising[j])) << aRising[i] << " and " << aRising[j];
            EXPECT_EQ(i < j, sorter(aRising[i], aRising[j])) << aRising[i] << " and " << aRising[j];
        }
    }
}

TEST(NodeMetaDataSorterTest, NoVersionEqualsVersionZero) {
    NodeMetaData const none("n", "s", "v", "text", "id");
    NodeMetaData const zero("n", "s", "v", 0, "other", "other");
    NodeMetaDataSorter const sorter;
    EXPECT_FALSE(sorter(&none, &zero));
    EXPECT_FALSE(sorter(&zero, &none));
}

} // namespace ORVO::Test
