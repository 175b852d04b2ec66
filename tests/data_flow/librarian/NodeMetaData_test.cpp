#include "orvo/data_flow/librarian/NodeMetaData.h"

#include <gtest/gtest.h>

#include <limits>
#include <sstream>

namespace ORVO::Test {

using DataFlow::MetaDataBase;
using DataFlow::NodeMetaData;

namespace {

std::string text(NodeMetaData const& metaData) {
    std::ostringstream stream;
    stream << metaData;
    return stream.str();
}

} // namespace

TEST(MetaDataBaseTest, HoldsTheIdentityWithoutAVersion) {
    MetaDataBase const metaData("blur", "com.example", "Maker");
    EXPECT_EQ("blur", metaData.name());
    EXPECT_EQ("com.example", metaData.nameSpace());
    EXPECT_EQ("Maker", metaData.vendor());
    EXPECT_FALSE(metaData.hasVersion());
    EXPECT_EQ(0u, metaData.version());
}

TEST(MetaDataBaseTest, HoldsTheIdentityWithAVersion) {
    for (std::uint32_t const iVersion : {0u, 1u, std::numeric_limits<std::uint32_t>::max()}) {
        MetaDataBase const metaData("blur", "com.example", "Maker", iVersion);
        EXPECT_TRUE(metaData.hasVersion());
        EXPECT_EQ(iVersion, metaData.version());
    }
}

TEST(NodeMetaDataTest, HoldsDescriptionAndClientID) {
    NodeMetaData const plain("blur", "com.example", "Maker", "Softens.", "Blur");
    EXPECT_FALSE(plain.hasVersion());
    EXPECT_EQ("Softens.", plain.description());
    EXPECT_EQ("Blur", plain.clientID());
    NodeMetaData const versioned("blur", "com.example", "Maker", 3, "Softens.", "Blur");
    EXPECT_TRUE(versioned.hasVersion());
    EXPECT_EQ(3u, versioned.version());
    EXPECT_EQ("Softens.", versioned.description());
    EXPECT_EQ("Blur", versioned.clientID());
}

TEST(NodeMetaDataTest, IsWrittenWithoutAVersion) {
    EXPECT_EQ("name(blur) namespace(com.example) vendor(Maker) description(Softens.) clientID(Blur)",
              text(NodeMetaData("blur", "com.example", "Maker", "Softens.", "Blur")));
}

TEST(NodeMetaDataTest, IsWrittenWithAVersion) {
    EXPECT_EQ(
        "name(blur) namespace(com.example) vendor(Maker) version(12) description(Softens.) clientID(Blur)",
        text(NodeMetaData("blur", "com.example", "Maker", 12, "Softens.", "Blur")));
    EXPECT_EQ("name() namespace() vendor() version(0) description() clientID()",
              text(NodeMetaData("", "", "", 0, "", "")));
}

} // namespace ORVO::Test
