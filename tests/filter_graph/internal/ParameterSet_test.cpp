#include "orvo/filter_graph/internal/ParameterSet.h"

#include <gtest/gtest.h>

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using OwnedParameter = std::unique_ptr<ParameterBase, ORVODeleter<ParameterBase>>;

class ParameterSetTest : public testing::Test {
protected:
    std::string names() const {
        std::string text;
        for (ParameterBase const* pParameter : oSet_.parameters())
            text += pParameter->name();
        return text;
    }

    Parameter<int> oA_{"a", 1, false};
    Parameter<float> oB_{"b", 2.0F, false};
    Parameter<bool> oOtherA_{"a", true, false};
    ParameterSet oSet_;
};

TEST_F(ParameterSetTest, KeepsTheOrderOfInsertion) {
    EXPECT_EQ(oSet_.size(), 0u);
    EXPECT_FALSE(oSet_.parameters().isValid());
    oSet_.insert(&oB_);
    oSet_.insert(&oA_);
    EXPECT_EQ(names(), "ba");
    EXPECT_EQ(oSet_.size(), 2u);
    EXPECT_EQ(*oSet_.parameters(), &oB_);
}

TEST_F(ParameterSetTest, RefusesNullAndASecondParameterOfAName) {
    oSet_.insert(&oA_);
    ORVO_EXPECT_INTERNAL(oSet_.insert(&oA_), "!iParameter");
    ORVO_EXPECT_INTERNAL(oSet_.insert(&oOtherA_), "!iParameter");
    ORVO_EXPECT_INTERNAL(oSet_.insert(nullptr), "Enforce pParameter != NULL");
    EXPECT_EQ(names(), "a");
}

TEST_F(ParameterSetTest, FindsByName) {
    oSet_.insert(&oA_);
    oSet_.insert(&oB_);
    ParameterSet const& constant = oSet_;
    EXPECT_EQ(oSet_.parameter("b"), &oB_);
    EXPECT_EQ(constant.parameter("a"), &oA_);
    EXPECT_EQ(oSet_.parameter("c"), nullptr);
    EXPECT_EQ(constant.parameter(""), nullptr);
}

TEST_F(ParameterSetTest, RemovesAndIgnoresWhatItDoesNotHold) {
    oSet_.insert(&oA_);
    oSet_.insert(&oB_);
    oSet_.remove(&oOtherA_);
    oSet_.remove(nullptr);
    EXPECT_EQ(names(), "ab");
    oSet_.remove(&oA_);
    EXPECT_EQ(names(), "b");
    oSet_.insert(&oOtherA_);
    EXPECT_EQ(names(), "ba");
    EXPECT_EQ(oA_.value(), 1);
}

TEST_F(ParameterSetTest, ForgetsOrDeletes) {
    oSet_.insert(&oA_);
    oSet_.clear();
    EXPECT_EQ(oSet_.size(), 0u);
    oSet_.insert(ORVO_NEW Parameter<int>("tracked", 1, false));
    oSet_.insert(new Parameter<int>("plain", 1, false));
    oSet_.deleteAll();
    EXPECT_EQ(oSet_.size(), 0u);
    oSet_.deleteAll();
    oSet_.clear();
}

TEST_F(ParameterSetTest, ComparesNames) {
    ParameterSet::NameEquals const isA("a");
    EXPECT_TRUE(isA(&oA_));
    EXPECT_TRUE(isA(&oOtherA_));
    EXPECT_FALSE(isA(&oB_));
    EXPECT_FALSE(isA(nullptr));
}

TEST_F(ParameterSetTest, ReachesTheDataInsideAParameter) {
    auto const& spData = ParameterSet::getDataPtr(oA_);
    ASSERT_TRUE(spData);
    EXPECT_EQ(spData->name(), "a");
    EXPECT_EQ(ParameterSet::getDataPtr(static_cast<ParameterBase const&>(oA_)), spData);

    ParameterSet::setValue(oA_, DataFlow::Parameter<int>(12, "elsewhere"));
    EXPECT_EQ(oA_.value(), 12);
    ORVO_EXPECT_INTERNAL(ParameterSet::setValue(oA_, DataFlow::Parameter<float>(1.0F, "elsewhere")),
                         "isOfType<T>()");
    EXPECT_EQ(oA_.value(), 12);
}

// What a client sees of a node's parameter.

template <class T>
class CreateParameterTest : public testing::Test {};

using GroupTypes = testing::Types<int, float, bool, int2, bool2, float2, int3, bool3, float3, int4, bool4,
                                  float4, float2x2, float3x3, float4x4, std::vector<float>, void*>;
TYPED_TEST_SUITE(CreateParameterTest, GroupTypes);

TYPED_TEST(CreateParameterTest, GivesAPlainParameterNameDescriptionAndDefault) {
    DataFlow::Parameter<TypeParam> const source(TypeParam(), "gain", "How loud");
    OwnedParameter const parameter(ParameterSet::createParameterFromDataFlow(&source));
    ASSERT_TRUE(parameter);
    EXPECT_EQ(parameter->name(), "gain");
    EXPECT_EQ(parameter->type(), DataItemType<TypeParam>::value);
    EXPECT_FALSE(parameter->isAutoPin());
    EXPECT_TRUE(parameter->as<TypeParam>().value() == TypeParam());
    ASSERT_EQ(parameter->getNumberOfMetadataItems(), 3u);
    EXPECT_EQ(parameter->metadataItem("Name")->as<std::string>().value(), "gain");
    EXPECT_EQ(parameter->metadataItem("Description")->as<std::string>().value(), "How loud");
    EXPECT_TRUE(parameter->metadataItem("Default Value")->as<TypeParam>().value() == TypeParam());
}

template <class T>
class CreateIntervalTest : public testing::Test {};

using IntervalTypes = testing::Types<int, float, bool, int2, bool2, float2, int3, bool3, float3, int4, bool4,
                                     float4, float2x2, float3x3, float4x4, std::vector<float>>;
TYPED_TEST_SUITE(CreateIntervalTest, IntervalTypes);

TYPED_TEST(CreateIntervalTest, GivesAnIntervalItsBounds) {
    DataFlow::IntervalParameter<TypeParam> const source(TypeParam(), TypeParam(), TypeParam(), "gain",
                                                        "How loud");
    OwnedParameter const parameter(ParameterSet::createParameterFromDataFlow(&source));
    ASSERT_TRUE(parameter);
    ASSERT_EQ(parameter->getNumberOfMetadataItems(), 5u);
    EXPECT_TRUE(parameter->metadataItem("Minimum Value")->as<TypeParam>().value() == TypeParam());
    EXPECT_TRUE(parameter->metadataItem("Maximum Value")->as<TypeParam>().value() == TypeParam());
}

std::string itemNames(ParameterBase const& parameter) {
    std::string names;
    for (MetadataItemBase const* pItem : parameter.metadata())
        names += pItem->name() + ",";
    return names;
}

TEST(CreateParameterFromDataFlowTest, TakesValueDefaultAndBoundsApart) {
    DataFlow::IntervalParameter<float> source(2.0F, 0.5F, 8.0F, "gain", "How loud");
    source.setValue(100.0F);
    OwnedParameter const parameter(ParameterSet::createParameterFromDataFlow(&source));
    EXPECT_EQ(parameter->as<float>().value(), 100.0F);
    EXPECT_EQ(itemNames(*parameter), "Name,Description,Default Value,Minimum Value,Maximum Value,");
    EXPECT_EQ(parameter->metadataItem("Default Value")->as<float>().value(), 2.0F);
    EXPECT_EQ(parameter->metadataItem("Minimum Value")->as<float>().value(), 0.5F);
    EXPECT_EQ(parameter->metadataItem("Maximum Value")->as<float>().value(), 8.0F);
    // The bounds inform: the client's parameter takes what lies outside them as well.
    parameter->as<float>().setValue(-1.0F);
    EXPECT_EQ(parameter->as<float>().value(), -1.0F);
    EXPECT_EQ(source.value(), 100.0F);
}

TEST(CreateParameterFromDataFlowTest, LeavesOutEmptyTexts) {
    OwnedParameter parameter(ParameterSet::createParameterFromDataFlow(
        std::make_shared<DataFlow::Parameter<int>>(1, "gain").get()));
    EXPECT_EQ(itemNames(*parameter), "Name,Default Value,");
    DataFlow::Parameter<int> const nameless(1, "", "described");
    parameter.reset(ParameterSet::createParameterFromDataFlow(&nameless));
    EXPECT_EQ(parameter->name(), "");
    EXPECT_EQ(itemNames(*parameter), "Description,Default Value,");
    DataFlow::IntervalParameter<int> const bare(1, 0, 2, "");
    parameter.reset(ParameterSet::createParameterFromDataFlow(&bare));
    EXPECT_EQ(itemNames(*parameter), "Default Value,Minimum Value,Maximum Value,");
}

TEST(CreateParameterFromDataFlowTest, HasNoFormForOtherTypes) {
    DataFlow::Parameter<std::string> const text("text", "title");
    EXPECT_EQ(ParameterSet::createParameterFromDataFlow(&text), nullptr);
    DataFlow::Parameter<unsigned int> const number(1u, "count");
    EXPECT_EQ(ParameterSet::createParameterFromDataFlow(&number), nullptr);
    DataFlow::Parameter<std::vector<float2>> const curve({}, "curve");
    EXPECT_EQ(ParameterSet::createParameterFromDataFlow(&curve), nullptr);
    ORVO_EXPECT_INTERNAL(ParameterSet::createParameterFromDataFlow(nullptr), "Enforce source != NULL");
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
