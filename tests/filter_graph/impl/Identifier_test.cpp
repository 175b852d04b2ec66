#include "orvo/filter_graph/impl/Identifier.h"

#include <gtest/gtest.h>

#include <sstream>

#include "orvo/filter_graph/impl/FilterEquality.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph {
namespace {

using ORVO::Test::makePlain;
using ORVO::Test::PlainFilter;

IODataDescriptors grey() {
    return {{DataDescriptor(COLOR_SPACE_LUMINANCE)}, {DataDescriptor(COLOR_SPACE_LUMINANCE)}};
}

IODataDescriptors colour() { return {{DataDescriptor(COLOR_SPACE_RGB)}, {DataDescriptor(COLOR_SPACE_RGB)}}; }

TEST(IdentifierTest, IsAnyVersionOfNothingByDefault) {
    Identifier const identifier;
    EXPECT_EQ(identifier.name(), "");
    EXPECT_EQ(identifier.nameSpace(), "");
    EXPECT_EQ(identifier.vendor(), "");
    EXPECT_EQ(identifier.version(), 0);
    EXPECT_TRUE(identifier.ignoresVersion());
    EXPECT_FALSE(identifier.ioDataDescriptors().isInitialized());
}

TEST(IdentifierTest, KeepsWhatEachConstructorIsGiven) {
    struct Row {
        char const* what;
        Identifier identifier;
        bool ignoresVersion;
        bool hasDescriptors;
    };
    Row const rows[] = {{"three strings", Identifier("n", "s", "v"), true, false},
                        {"descriptors", Identifier("n", "s", "v", grey()), true, true},
                        {"version", Identifier("n", "s", "v", 7), false, false},
                        {"version and descriptors", Identifier("n", "s", "v", 7, grey()), false, true}};
    for (Row const& row : rows) {
        EXPECT_EQ(row.identifier.name(), "n") << row.what;
        EXPECT_EQ(row.identifier.nameSpace(), "s") << row.what;
        EXPECT_EQ(row.identifier.vendor(), "v") << row.what;
        EXPECT_EQ(row.identifier.ignoresVersion(), row.ignoresVersion) << row.what;
        EXPECT_EQ(row.identifier.ioDataDescriptors().isInitialized(), row.hasDescriptors) << row.what;
        EXPECT_EQ(row.identifier.ioDataDescriptors() == grey(), row.hasDescriptors) << row.what;
        EXPECT_EQ(row.ignoresVersion || row.identifier.version() == 7, true) << row.what;
    }
}

TEST(IdentifierTest, MatchesByTheRule) {
    struct Row {
        char const* what;
        Identifier left;
        Identifier right;
        bool match;
    };
    Row const rows[] = {
        {"all equal", {"n", "s", "v", 1}, {"n", "s", "v", 1}, true},
        {"another name", {"n", "s", "v", 1}, {"m", "s", "v", 1}, false},
        {"another name space", {"n", "s", "v", 1}, {"n", "t", "v", 1}, false},
        {"another vendor", {"n", "s", "v", 1}, {"n", "s", "w", 1}, false},
        {"the case of a letter", {"n", "s", "v", 1}, {"N", "s", "v", 1}, false},
        {"another version", {"n", "s", "v", 1}, {"n", "s", "v", 2}, false},
        {"any version", {"n", "s", "v"}, {"n", "s", "v", 2}, true},
        {"any version of another name", {"n", "s", "v"}, {"m", "s", "v", 2}, false},
        {"equal descriptors", {"n", "s", "v", 1, grey()}, {"n", "s", "v", 1, grey()}, true},
        {"other descriptors", {"n", "s", "v", 1, grey()}, {"n", "s", "v", 1, colour()}, false},
        {"other descriptors, any version", {"n", "s", "v", grey()}, {"n", "s", "v", 1, colour()}, false},
        {"descriptors on one side", {"n", "s", "v", 1, grey()}, {"n", "s", "v", 1}, true},
        {"empty descriptors are descriptors",
         {"n", "s", "v", 1, grey()},
         {"n", "s", "v", 1, IODataDescriptors({}, {})},
         false},
        {"descriptors and another version", {"n", "s", "v", 1, grey()}, {"n", "s", "v", 2, grey()}, false},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(row.left == row.right, row.match) << row.what;
        EXPECT_EQ(row.right == row.left, row.match) << row.what << ", the other way round";
        EXPECT_EQ(row.left != row.right, !row.match) << row.what;
    }
}

TEST(IdentifierTest, WritesALineForEachField) {
    std::ostringstream stream;
    stream << Identifier("blur", "example", "me", 3);
    EXPECT_EQ(stream.str(),
              "Filter name:blur\nFilter namespace:example\nFilter vendor:me\nFilter version:3\n");
}

TEST(IdentifierTest, WritesInitialisedDescriptors) {
    std::ostringstream stream;
    stream << Identifier("blur", "example", "me", 3, IODataDescriptors({DataDescriptor(std::size_t(1))}, {}));
    EXPECT_EQ(stream.str(),
              "Filter name:blur\nFilter namespace:example\nFilter vendor:me\nFilter version:3\n"
              "Filter Data descriptors:\n"
              "Input data descriptors:{ Number of channels:1\nColorspace:COLOR_SPACE_UNNAMED\n}   \n"
              "Output data descriptors:{}   \n");
}

TEST(FilterEqualityTest, AcceptsTheFiltersThatMatchAnIdentifier) {
    IFilter::Equality const isAnyVersion(Identifier("plain", "test", "ORVO"));
    EXPECT_TRUE(isAnyVersion(std::make_shared<PlainFilter>(Identifier("plain", "test", "ORVO", 1))));
    EXPECT_TRUE(isAnyVersion(std::make_shared<PlainFilter>(Identifier("plain", "test", "ORVO", 2))));
    EXPECT_FALSE(isAnyVersion(std::make_shared<PlainFilter>(Identifier("other", "test", "ORVO", 1))));
}

TEST(FilterEqualityTest, CopiesTheIdentifierOfAFilter) {
    auto filter = makePlain("before");
    IFilter::Equality const isLike(filter.get());
    filter->setIdentifier(Identifier("after", "test", "ORVO", 1));
    EXPECT_TRUE(isLike(makePlain("before")));
    EXPECT_FALSE(isLike(filter));
}

TEST(FilterEqualityTest, RefusesNullAndAcceptsNoEmptyPointer) {
    ORVO_EXPECT_INTERNAL(IFilter::Equality(static_cast<IFilter const*>(nullptr)), "Enforce pFilter != NULL");
    EXPECT_FALSE(IFilter::Equality(Identifier())(std::shared_ptr<IFilter>()));
}

} // namespace
} // namespace ORVO::FilterGraph
