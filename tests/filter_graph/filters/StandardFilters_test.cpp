#include "orvo/filter_graph/filters/StandardFilters.h"

#include <gtest/gtest.h>

#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"
#include "tests/support/Layers.h"

namespace ORVO::FilterGraph {
namespace {

using ORVO::Test::PlainFilter;

constexpr char const* bilateralParameters[] = {"spatialSigma", "rangeSigma", "colorize"};

struct StandardFilter {
    char const* name;
    char const* nameSpace;
    char const* vendor;
    char const* input; // null for what shows its inputs where there is OpenGL alone
    bool isBilateral;
};

constexpr StandardFilter standardFilters[] = {
    {"FastBilateralBlur", "Motion Loft", "Norvane Works", "src", true},
    {"ColorspaceTransformer", "com.norvane.orvo", "Norvane", "src", false},
    {"FastBilateralFilter", "ImageFlow", "Norvane", "InputImage", true},
    {"SimpleBilateralCPU", "ImageFlow", "Norvane", "InputImage", true},
    {"RGBToLABCPU", "ImageFlow", "Norvane", "InputImage", false},
    {"LABToRGBCPU", "ImageFlow", "Norvane", "InputImage", false},
    {"VantleFilterCPU", "ImageFlow", "Norvane", "InputImage", false},
    {"MirelCheckerBoardGPU", "ImageFlow", "Norvane", nullptr, false},
    {"MirelGamutComposite", "ImageFlow", "Norvane", nullptr, false},
    {"ConvertToSIMDOptimized", "ImageFlow", "Norvane", "input", false},
    {"ConvertFromSIMDOptimized", "ImageFlow", "Norvane", "input", false},
    {"MirelToneMappingGPU", "ImageFlow", "Norvane", "InputImage", false},
    {"premultiply", "ORVO", "Norvane", "src", false},
    {"unpremultiply", "ORVO", "Norvane", "src", false},
    {"scaleUp1channel", "ORVO", "Norvane", "src", false},
    {"scaleUp2channel", "ORVO", "Norvane", "src", false},
    {"scaleUp3channel", "ORVO", "Norvane", "src", false},
    {"scaleUp4channel", "ORVO", "Norvane", "src", false},
    {"scaleDown1channel", "ORVO", "Norvane", "src", false},
    {"scaleDown2channel", "ORVO", "Norvane", "src", false},
    {"scaleDown3channel", "ORVO", "Norvane", "src", false},
    {"scaleDown4channel", "ORVO", "Norvane", "src", false},
};

std::string alreadyExists(StandardFilter const& filter) {
    return std::string("Cannot insert filter into the factory :  id Filter name:") + filter.name +
           "\nFilter namespace:" + filter.nameSpace + "\nFilter vendor:" + filter.vendor +
           "\nFilter version:1\n already exists";
}

class StandardFiltersTest : public testing::Test {
protected:
    ORVO::Test::FilterGraphLayers oLayers_;
    FilterFactory& factory_ = *FilterFactory::Instance();
};

TEST_F(StandardFiltersTest, AreNotThereByThemselves) { EXPECT_EQ(factory_.numberOfPrototypes(), 0u); }

TEST_F(StandardFiltersTest, AreCreatedByName) {
    insertStandardFilters();
    EXPECT_EQ(factory_.numberOfPrototypes(), std::size(standardFilters));
    for (StandardFilter const& row : standardFilters) {
        SCOPED_TRACE(row.name);
        std::shared_ptr<IFilter> const filter = factory_.create({row.name, row.nameSpace, row.vendor});
        EXPECT_EQ(filter->identifier().version(), 1);
        if (!row.input) {
            EXPECT_EQ(filter->getNumberOfInputs(), 0u);
            EXPECT_EQ(filter->getNumberOfParameters(), 0u);
            continue;
        }
        ASSERT_EQ(filter->getNumberOfInputs(), 1u);
        EXPECT_EQ((*filter->inputs())->name(), row.input);
        EXPECT_TRUE(filter->input(row.input));
        if (!row.isBilateral)
            continue;
        for (char const* name : bilateralParameters)
            EXPECT_TRUE(filter->parameter(name)) << name;
        EXPECT_FALSE(filter->parameter("colorize")->as<bool>().value());
    }
}

TEST_F(StandardFiltersTest, DescribeTheParametersOfTheBilateralFilter) {
    insertStandardFilters();
    auto const filter = factory_.create({"FastBilateralBlur", "Motion Loft", "Norvane Works"});
    ASSERT_EQ(filter->getNumberOfParameters(), 3u);
    ParameterBase const& spatial = *filter->parameter("spatialSigma");
    ParameterBase const& range = *filter->parameter("rangeSigma");
    EXPECT_TRUE(spatial.as<float2>().value() == float2(10.0F, 10.0F));
    EXPECT_TRUE(spatial.metadataItem("Default Value")->as<float2>().value() == float2(10.0F, 10.0F));
    EXPECT_EQ(range.as<float>().value(), 0.15F);
    EXPECT_EQ(range.metadataItem("Default Value")->as<float>().value(), 0.15F);
    for (char const* name : bilateralParameters) {
        ASSERT_TRUE(filter->parameter(name)->metadataItem("Description")) << name;
        EXPECT_NE(filter->parameter(name)->metadataItem("Description")->as<std::string>().value(), "")
            << name;
        EXPECT_EQ(filter->parameter(name)->metadataItem("Name")->as<std::string>().value(), name);
    }
}

TEST_F(StandardFiltersTest, CanBeWiredToOneAnother) {
    insertStandardFilters();
    std::shared_ptr<IFilter> previous;
    for (StandardFilter const& row : standardFilters) {
        if (!row.input)
            continue;
        std::shared_ptr<IFilter> const filter = factory_.create({row.name, row.nameSpace, row.vendor});
        if (previous)
            Connect(previous, filter);
        previous = filter;
    }
    EXPECT_EQ((*previous->inputs())->producerFilter(), nullptr);
}

TEST_F(StandardFiltersTest, AreRefusedASecondTimeWithTheFactoryAsItWas) {
    insertStandardFilters();
    ORVO_EXPECT_FILTERGRAPH(insertStandardFilters(), alreadyExists(standardFilters[0]));
    EXPECT_EQ(factory_.numberOfPrototypes(), std::size(standardFilters));
    for (StandardFilter const& row : standardFilters)
        EXPECT_TRUE(factory_.find({row.name, row.nameSpace, row.vendor})) << row.name;
}

TEST_F(StandardFiltersTest, AreTakenBackWhereOneOfThemIsTheHostsOwn) {
    for (StandardFilter const& row : standardFilters) {
        factory_.removeAll();
        factory_.insert(PlainFilter(Identifier(row.name, row.nameSpace, row.vendor, 1)));
        factory_.insert(PlainFilter(Identifier(row.name, row.nameSpace, row.vendor, 2)));
        ORVO_EXPECT_FILTERGRAPH(insertStandardFilters(), alreadyExists(row));
        EXPECT_EQ(factory_.numberOfPrototypes(), 2u) << row.name;
        EXPECT_TRUE(
            dynamic_cast<PlainFilter const*>(factory_.find({row.name, row.nameSpace, row.vendor, 1})));
    }
}

TEST_F(StandardFiltersTest, StandBesideOtherVersions) {
    factory_.insert(PlainFilter(Identifier("RGBToLABCPU", "ImageFlow", "Norvane", 2)));
    insertStandardFilters();
    EXPECT_EQ(factory_.numberOfPrototypes(), std::size(standardFilters) + 1);
    EXPECT_EQ(factory_.find({"RGBToLABCPU", "ImageFlow", "Norvane"})->identifier().version(), 2);
    removeStandardFilters();
    ASSERT_EQ(factory_.numberOfPrototypes(), 1u);
    EXPECT_EQ((*factory_.prototypes())->identifier().version(), 2);
}

TEST_F(StandardFiltersTest, AreRemovedWhileTheirFiltersLive) {
    insertStandardFilters();
    auto const filter = factory_.create({"FastBilateralFilter", "ImageFlow", "Norvane"});
    removeStandardFilters();
    EXPECT_EQ(factory_.numberOfPrototypes(), 0u);
    EXPECT_TRUE(filter->parameter("rangeSigma"));
    insertStandardFilters();
    EXPECT_EQ(factory_.numberOfPrototypes(), std::size(standardFilters));
}

TEST_F(StandardFiltersTest, AreRemovedAllOrNotAtAll) {
    ORVO_EXPECT_INTERNAL(removeStandardFilters(), "iter != aFilters_.end()");
    insertStandardFilters();
    factory_.remove({"LABToRGBCPU", "ImageFlow", "Norvane", 1});
    ORVO_EXPECT_INTERNAL(removeStandardFilters(), "iter != aFilters_.end()");
    EXPECT_EQ(factory_.numberOfPrototypes(), std::size(standardFilters) - 1);
}

TEST(StandardFiltersWithoutLibraryTest, AreRefused) {
    ORVO_EXPECT_INTERNAL(insertStandardFilters(), "isInitialized()");
    ORVO_EXPECT_INTERNAL(removeStandardFilters(), "isInitialized()");
}

} // namespace
} // namespace ORVO::FilterGraph
