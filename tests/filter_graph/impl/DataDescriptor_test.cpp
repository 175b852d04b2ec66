#include "orvo/filter_graph/impl/DataDescriptor.h"

#include <gtest/gtest.h>

#include <sstream>

#include "orvo/filter_graph/impl/IODataDescriptors.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph {
namespace {

template <class T>
std::string textOf(T const& value) {
    std::ostringstream stream;
    stream << value;
    return stream.str();
}

TEST(DataDescriptorTest, TakesTheChannelsFromTheColorSpace) {
    struct Row {
        ColorSpace space;
        std::size_t channels;
    };
    for (Row const& row : {Row{COLOR_SPACE_LUMINANCE, 1}, Row{COLOR_SPACE_LUMINANCE_ALPHA, 2},
                           Row{COLOR_SPACE_RGB, 3}, Row{COLOR_SPACE_RGBA, 4}, Row{COLOR_SPACE_LAB, 3},
                           Row{COLOR_SPACE_LABA, 4}, Row{COLOR_SPACE_UNNAMED, 0}}) {
        DataDescriptor const descriptor(row.space);
        EXPECT_EQ(descriptor.colorSpace(), row.space);
        EXPECT_EQ(descriptor.numChannels(), row.channels) << row.space;
    }
}

TEST(DataDescriptorTest, RefusesAnUnknownColorSpace) {
    ORVO_EXPECT_PARAMETER(DataDescriptor(static_cast<ColorSpace>(7)), "Unknown color space");
    ORVO_EXPECT_PARAMETER(DataDescriptor(static_cast<ColorSpace>(-1)), "Unknown color space");
}

TEST(DataDescriptorTest, HasNoNamedColorSpaceWithChannelsAlone) {
    for (std::size_t channels : {std::size_t(0), std::size_t(1), std::size_t(4), ~std::size_t(0)}) {
        DataDescriptor const descriptor(channels);
        EXPECT_EQ(static_cast<int>(descriptor.colorSpace()), 6);
        EXPECT_EQ(descriptor.numChannels(), channels);
    }
}

TEST(DataDescriptorTest, ComparesBothFields) {
    EXPECT_TRUE(DataDescriptor(std::size_t(3)) == DataDescriptor(std::size_t(3)));
    EXPECT_FALSE(DataDescriptor(std::size_t(3)) != DataDescriptor(std::size_t(3)));
    EXPECT_FALSE(DataDescriptor(std::size_t(3)) == DataDescriptor(std::size_t(4)));
    EXPECT_FALSE(DataDescriptor(std::size_t(3)) == DataDescriptor(COLOR_SPACE_RGB));
    EXPECT_FALSE(DataDescriptor(COLOR_SPACE_LAB) == DataDescriptor(COLOR_SPACE_RGB));
    EXPECT_TRUE(DataDescriptor(COLOR_SPACE_LAB) != DataDescriptor(COLOR_SPACE_RGB));
}

TEST(DataDescriptorTest, SortsByChannelsFirstAndByColorSpaceSecond) {
    DataDescriptor const ordered[] = {DataDescriptor(COLOR_SPACE_LUMINANCE), DataDescriptor(std::size_t(1)),
                                      DataDescriptor(COLOR_SPACE_RGB),       DataDescriptor(COLOR_SPACE_LAB),
                                      DataDescriptor(std::size_t(3)),        DataDescriptor(COLOR_SPACE_RGBA),
                                      DataDescriptor(std::size_t(5))};
    for (std::size_t i = 0; i < std::size(ordered); ++i)
        for (std::size_t k = 0; k < std::size(ordered); ++k) {
            EXPECT_EQ(ordered[i] < ordered[k], i < k) << i << " and " << k;
            EXPECT_EQ(DataDescriptorCompare()(ordered[i], ordered[k]), i < k) << i << " and " << k;
        }
}

TEST(DataDescriptorTest, WritesChannelsAndColorSpace) {
    EXPECT_EQ(textOf(DataDescriptor(COLOR_SPACE_RGB)), "Number of channels:3\nColorspace:COLOR_SPACE_RGB\n");
    EXPECT_EQ(textOf(DataDescriptor(std::size_t(2))),
              "Number of channels:2\nColorspace:COLOR_SPACE_UNNAMED\n");
}

TEST(IODataDescriptorsTest, AreNotInitialisedByDefault) {
    IODataDescriptors const descriptors;
    EXPECT_FALSE(descriptors.isInitialized());
    EXPECT_TRUE(descriptors.inputDataDescriptors().empty());
    EXPECT_TRUE(descriptors.outputDataDescriptors().empty());
}

TEST(IODataDescriptorsTest, KeepBothSetsInOrderWithEqualElements) {
    IODataDescriptors const descriptors(
        {DataDescriptor(COLOR_SPACE_RGBA), DataDescriptor(std::size_t(1)), DataDescriptor(COLOR_SPACE_RGBA)},
        {DataDescriptor(COLOR_SPACE_LAB)});
    EXPECT_TRUE(descriptors.isInitialized());
    ASSERT_EQ(descriptors.inputDataDescriptors().size(), 3u);
    auto input = descriptors.inputDataDescriptors().begin();
    EXPECT_TRUE(*input++ == DataDescriptor(std::size_t(1)));
    EXPECT_TRUE(*input++ == DataDescriptor(COLOR_SPACE_RGBA));
    EXPECT_TRUE(*input++ == DataDescriptor(COLOR_SPACE_RGBA));
    ASSERT_EQ(descriptors.outputDataDescriptors().size(), 1u);
    EXPECT_TRUE(*descriptors.outputDataDescriptors().begin() == DataDescriptor(COLOR_SPACE_LAB));
}

TEST(IODataDescriptorsTest, CompareTheSetsAndNotWhetherTheyWereGiven) {
    IODataDescriptors const oneIn({DataDescriptor(std::size_t(1))}, {});
    IODataDescriptors const sameOneIn({DataDescriptor(std::size_t(1))}, {});
    IODataDescriptors const twoIn({DataDescriptor(std::size_t(1)), DataDescriptor(std::size_t(1))}, {});
    IODataDescriptors const oneOut({}, {DataDescriptor(std::size_t(1))});
    IODataDescriptors const otherIn({DataDescriptor(std::size_t(2))}, {});
    EXPECT_TRUE(oneIn == sameOneIn);
    EXPECT_FALSE(oneIn != sameOneIn);
    EXPECT_TRUE(oneIn != twoIn);
    EXPECT_TRUE(oneIn != oneOut);
    EXPECT_TRUE(oneIn != otherIn);
    EXPECT_TRUE(IODataDescriptors() == IODataDescriptors({}, {}));
}

TEST(IODataDescriptorsTest, WriteBothSetsInBraces) {
    EXPECT_EQ(textOf(IODataDescriptors({}, {})),
              "Input data descriptors:{}   \nOutput data descriptors:{}   ");
    IODataDescriptors const descriptors({DataDescriptor(COLOR_SPACE_RGB), DataDescriptor(std::size_t(1))},
                                        {DataDescriptor(std::size_t(4))});
    EXPECT_EQ(textOf(descriptors),
              "Input data descriptors:{ Number of channels:1\nColorspace:COLOR_SPACE_UNNAMED\n"
              " Number of channels:3\nColorspace:COLOR_SPACE_RGB\n}   \n"
              "Output data descriptors:{ Number of channels:4\nColorspace:COLOR_SPACE_UNNAMED\n}   ");
}

} // namespace
} // namespace ORVO::FilterGraph
