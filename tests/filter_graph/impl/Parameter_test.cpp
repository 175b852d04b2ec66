// Parameters and metadata items, for each type that they can hold.
#include "orvo/filter_graph/impl/Parameter.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/parameters/ParameterBase.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/internal/ParameterSet.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph {
namespace {

using OwnedParameter = std::unique_ptr<ParameterBase, ORVODeleter<ParameterBase>>;
using OwnedItem = std::unique_ptr<MetadataItemBase, ORVODeleter<MetadataItemBase>>;

constexpr char const* wrongParameterText = "Data type retrieved must match parameter exactly";
constexpr char const* wrongItemText = "Data type retrieved must match metadata item exactly";

/// The tag of a type, and two different values of it.
template <class T>
struct Sample;

// clang-format off
template <> struct Sample<bool> { static constexpr int tag = 0; static bool one() { return false; } static bool two() { return true; } };
template <> struct Sample<bool2> { static constexpr int tag = 1; static bool2 one() { return {false, true}; } static bool2 two() { return {true, true}; } };
template <> struct Sample<bool3> { static constexpr int tag = 2; static bool3 one() { return {false, true, false}; } static bool3 two() { return {false, true, true}; } };
template <> struct Sample<bool4> { static constexpr int tag = 3; static bool4 one() { return {true, true, false, false}; } static bool4 two() { return {true, true, false, true}; } };
template <> struct Sample<int> { static constexpr int tag = 4; static int one() { return -7; } static int two() { return std::numeric_limits<int>::max(); } };
template <> struct Sample<int2> { static constexpr int tag = 5; static int2 one() { return {1, 2}; } static int2 two() { return {1, 3}; } };
template <> struct Sample<int3> { static constexpr int tag = 6; static int3 one() { return {1, 2, 3}; } static int3 two() { return {1, 2, 4}; } };
template <> struct Sample<int4> { static constexpr int tag = 7; static int4 one() { return {1, 2, 3, 4}; } static int4 two() { return {1, 2, 3, 5}; } };
template <> struct Sample<float> { static constexpr int tag = 8; static float one() { return 0.25F; } static float two() { return std::numeric_limits<float>::infinity(); } };
template <> struct Sample<float2> { static constexpr int tag = 9; static float2 one() { return {1.0F, 2.0F}; } static float2 two() { return {1.0F, 2.5F}; } };
template <> struct Sample<float3> { static constexpr int tag = 10; static float3 one() { return {1.0F, 2.0F, 3.0F}; } static float3 two() { return {1.0F, 2.0F, 3.5F}; } };
template <> struct Sample<float4> { static constexpr int tag = 11; static float4 one() { return {1.0F, 2.0F, 3.0F, 4.0F}; } static float4 two() { return {1.0F, 2.0F, 3.0F, 4.5F}; } };
// clang-format on

/// The identity, and with one other element.
template <class T, int Tag>
struct MatrixSample {
    static constexpr int tag = Tag;
    static T one() { return T(); }
    static T two() {
        T matrix;
        *matrix.begin() += 2.0F;
        return matrix;
    }
};

template <>
struct Sample<float2x2> : MatrixSample<float2x2, 12> {};
template <>
struct Sample<float3x3> : MatrixSample<float3x3, 13> {};
template <>
struct Sample<float4x4> : MatrixSample<float4x4, 14> {};

template <>
struct Sample<std::vector<float>> {
    static constexpr int tag = 15;
    static std::vector<float> one() { return {}; }
    static std::vector<float> two() { return {1.0F, 2.0F}; }
};

template <>
struct Sample<std::string> {
    static constexpr int tag = 16;
    static std::string one() { return ""; }
    static std::string two() { return "a text that is too long for any short string buffer"; }
};

template <>
struct Sample<void*> {
    static constexpr int tag = 18;
    static void* one() { return nullptr; }
    static void* two() {
        static int target;
        return &target;
    }
};

template <class T>
class ParameterTypeTest : public testing::Test {};

using AllTypes = testing::Types<bool, bool2, bool3, bool4, int, int2, int3, int4, float, float2, float3,
                                float4, float2x2, float3x3, float4x4, std::vector<float>, std::string, void*>;
TYPED_TEST_SUITE(ParameterTypeTest, AllTypes);

TYPED_TEST(ParameterTypeTest, HasItsTag) {
    EXPECT_EQ(static_cast<int>(DataItemType<TypeParam>::value), Sample<TypeParam>::tag);
    EXPECT_EQ(static_cast<int>(Parameter<TypeParam>("p", TypeParam(), false).type()), Sample<TypeParam>::tag);
    EXPECT_EQ(static_cast<int>(MetadataItem<TypeParam>("m", TypeParam()).type()), Sample<TypeParam>::tag);
}

TYPED_TEST(ParameterTypeTest, KeepsWhatItIsGiven) {
    TypeParam const one = Sample<TypeParam>::one();
    TypeParam const two = Sample<TypeParam>::two();
    ASSERT_FALSE(one == two);
    Parameter<TypeParam> parameter("name", one, true);
    EXPECT_EQ(parameter.name(), "name");
    EXPECT_TRUE(parameter.isAutoPin());
    EXPECT_FALSE(parameter.isPinned());
    EXPECT_TRUE(parameter.value() == one);
    parameter.setValue(two);
    EXPECT_TRUE(parameter.value() == two);
    EXPECT_EQ(parameter.getNumberOfMetadataItems(), 0u);
}

TYPED_TEST(ParameterTypeTest, ClonesNameValueAutoPinAndMetadata) {
    Parameter<TypeParam> parameter("name", Sample<TypeParam>::one(), true);
    parameter.setValue(Sample<TypeParam>::two());
    parameter.pin();
    parameter.addMetadataItem(ORVO_NEW MetadataItem<TypeParam>("Default Value", Sample<TypeParam>::one()));

    OwnedParameter const clone(static_cast<ParameterBase const&>(parameter).clone());
    parameter.setValue(Sample<TypeParam>::one());
    EXPECT_EQ(clone->name(), "name");
    EXPECT_TRUE(clone->isAutoPin());
    EXPECT_FALSE(clone->isPinned());
    EXPECT_TRUE(clone->template as<TypeParam>().value() == Sample<TypeParam>::two());
    ASSERT_EQ(clone->getNumberOfMetadataItems(), 1u);
    EXPECT_NE(clone->metadataItem("Default Value"), parameter.metadataItem("Default Value"));
    EXPECT_TRUE(clone->metadataItem("Default Value")->template as<TypeParam>().value() ==
                Sample<TypeParam>::one());
    EXPECT_NE(Internal::ParameterSet::getDataPtr(*clone), Internal::ParameterSet::getDataPtr(parameter));
}

TYPED_TEST(ParameterTypeTest, TakesTheValueOfAnotherParameterOfItsType) {
    Parameter<TypeParam> one("one", Sample<TypeParam>::one(), false);
    Parameter<TypeParam> const two("two", Sample<TypeParam>::two(), false);
    static_cast<ParameterBase&>(one).setValue(two);
    EXPECT_TRUE(one.value() == Sample<TypeParam>::two());
    EXPECT_EQ(one.name(), "one");
}

TYPED_TEST(ParameterTypeTest, IsGivenOutAsItsOwnTypeAlone) {
    Parameter<TypeParam> parameter("p", Sample<TypeParam>::two(), false);
    ParameterBase& base = parameter;
    ParameterBase const& constant = parameter;
    EXPECT_EQ(&base.template as<TypeParam>(), &parameter);
    EXPECT_EQ(&constant.template as<TypeParam>(), &parameter);
    using Other = std::conditional_t<std::is_same_v<TypeParam, float>, int, float>;
    ORVO_EXPECT_INTERNAL(base.template as<Other>(), wrongParameterText);
    ORVO_EXPECT_INTERNAL(constant.template as<Other>(), wrongParameterText);

    Parameter<Other> other("o", Other(), false);
    ORVO_EXPECT_INTERNAL(base.setValue(other), "isOfType<T>()");
    EXPECT_TRUE(parameter.value() == Sample<TypeParam>::two());
}

TYPED_TEST(ParameterTypeTest, HasMetadataItemsOfItsType) {
    MetadataItem<TypeParam> const item("item", Sample<TypeParam>::two());
    MetadataItemBase const& base = item;
    EXPECT_EQ(base.name(), "item");
    EXPECT_EQ(&base.template as<TypeParam>(), &item);
    EXPECT_TRUE(item.value() == Sample<TypeParam>::two());
    using Other = std::conditional_t<std::is_same_v<TypeParam, float>, int, float>;
    ORVO_EXPECT_INTERNAL(base.template as<Other>(), wrongItemText);

    OwnedItem const clone(base.clone());
    EXPECT_NE(clone.get(), &item);
    EXPECT_EQ(clone->name(), "item");
    EXPECT_TRUE(clone->template as<TypeParam>().value() == Sample<TypeParam>::two());
}

TEST(ParameterTest, KeepsNumbersThatAreNone) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    float const infinity = std::numeric_limits<float>::infinity();
    Parameter<float> parameter("p", nan, false);
    EXPECT_TRUE(std::isnan(parameter.value()));
    for (float value : {infinity, -infinity, nan, std::numeric_limits<float>::denorm_min(), -0.0F}) {
        parameter.setValue(value);
        EXPECT_EQ(std::isnan(parameter.value()), std::isnan(value));
        EXPECT_TRUE(std::isnan(value) || parameter.value() == value);
    }
    Parameter<float2> pair("p", float2(nan, -infinity), false);
    OwnedParameter const clone(pair.clone());
    EXPECT_TRUE(std::isnan(clone->as<float2>().value().x));
    EXPECT_EQ(clone->as<float2>().value().y, -infinity);
    MetadataItem<float> const item("m", infinity);
    EXPECT_EQ(item.value(), infinity);
}

TEST(ParameterTest, SetsNoDirtyFlagForTheValueThatItHas) {
    Parameter<int> parameter("p", 3, false);
    DataFlow::ParameterBase& data = *Internal::ParameterSet::getDataPtr(parameter);
    EXPECT_EQ(data.name(), "p");
    data.setClean();
    parameter.setValue(3);
    EXPECT_FALSE(data.isDirty());
    parameter.setValue(4);
    EXPECT_TRUE(data.isDirty());
}

TEST(ParameterTest, PinsAndUnpins) {
    Parameter<int> parameter("p", 3, false);
    EXPECT_FALSE(parameter.isAutoPin());
    parameter.pin();
    EXPECT_TRUE(parameter.isPinned());
    parameter.pin();
    parameter.unpin();
    EXPECT_FALSE(parameter.isPinned());
}

TEST(ParameterTest, MayHaveAnEmptyName) {
    Parameter<int> parameter("", 3, false);
    EXPECT_EQ(parameter.name(), "");
}

TEST(ParameterTest, ListsMetadataInOrderAndFindsTheFirstOfAName) {
    Parameter<int> parameter("p", 3, false);
    parameter.addMetadataItem(new MetadataItem<int>("a", 1));
    parameter.addMetadataItem(ORVO_NEW MetadataItem<int>("b", 2));
    parameter.addMetadataItem(ORVO_NEW MetadataItem<int>("a", 3));
    std::string values;
    for (MetadataItemBase const* pItem : parameter.metadata())
        values += pItem->name() + std::to_string(pItem->as<int>().value()) + " ";
    for (MetadataItemBase const* pItem : static_cast<ParameterBase const&>(parameter).metadata())
        values += pItem->name();
    EXPECT_EQ(values, "a1 b2 a3 aba");
    EXPECT_EQ(parameter.getNumberOfMetadataItems(), 3u);
    EXPECT_EQ(parameter.metadataItem("a")->as<int>().value(), 1);
    EXPECT_EQ(parameter.metadataItem("c"), nullptr);
    EXPECT_EQ(parameter.metadataItem(""), nullptr);
    ORVO_EXPECT_INTERNAL(parameter.addMetadataItem(nullptr), "Enforce pItem != NULL");
    EXPECT_EQ(parameter.getNumberOfMetadataItems(), 3u);
}

TEST(DataItemTest, NamesEveryTag) {
    EXPECT_EQ(static_cast<int>(DataItemBase::TYPE_BOOL), 0);
    EXPECT_EQ(static_cast<int>(DataItemBase::TYPE_FLOAT4X4), 14);
    EXPECT_EQ(static_cast<int>(DataItemBase::TYPE_FLOAT_VECTOR), 15);
    EXPECT_EQ(static_cast<int>(DataItemBase::TYPE_STRING), 16);
    EXPECT_EQ(static_cast<int>(DataItemBase::TYPE_POINTER), 18);
}

} // namespace
} // namespace ORVO::FilterGraph
