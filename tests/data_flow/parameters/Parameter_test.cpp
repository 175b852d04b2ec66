#include "orvo/data_flow/parameters/Parameter.h"

#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "tests/data_flow/parameters/ParameterFlags.h"
#include "tests/data_flow/parameters/ParameterSamples.h"
#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <memory>
#include <sstream>
#include <string>
#include <type_traits>
#include <typeinfo>
#include <utility>
#include <vector>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::expectAllFlags;
using ORVO::Test::Samples;
using ORVO::Test::setAllClean;

template <typename T>
class ParameterTest : public testing::Test {};
TYPED_TEST_SUITE(ParameterTest, ORVO::Test::AllParameterTypes);

TYPED_TEST(ParameterTest, IsMadeDirtyWithItsValueAsDefault) {
    using T = TypeParam;
    Parameter<T> const oParameter(Samples<T>::first(), "name", "what it is");
    EXPECT_TRUE(oParameter.value() == Samples<T>::first());
    EXPECT_TRUE(oParameter.defaultValue() == Samples<T>::first());
    EXPECT_EQ("name", oParameter.name());
    EXPECT_EQ("what it is", oParameter.description());
    EXPECT_TRUE(oParameter.datatype() == typeid(T));
    EXPECT_EQ(typeid(T).name(), oParameter.data_type_name());
    EXPECT_FALSE(oParameter.isInterval());
    expectAllFlags(oParameter, true);
    Parameter<T> const oShort(Samples<T>::first(), "name");
    EXPECT_EQ("", oShort.description());
}

TYPED_TEST(ParameterTest, CreateDoesTheSame) {
    using T = TypeParam;
    std::shared_ptr<Parameter<T>> const spParameter = Parameter<T>::create(Samples<T>::first(), "n", "d");
    EXPECT_TRUE(spParameter->value() == Samples<T>::first());
    EXPECT_EQ("n", spParameter->name());
    EXPECT_EQ("d", spParameter->description());
    EXPECT_EQ("", Parameter<T>::create(Samples<T>::first(), "n")->description());
}

TYPED_TEST(ParameterTest, OnlyAChangeSetsTheFlags) {
    using T = TypeParam;
    Parameter<T> oParameter(Samples<T>::first(), "name");
    setAllClean(oParameter);
    oParameter.setValue(Samples<T>::first());
    expectAllFlags(oParameter, false);
    oParameter.setValue(oParameter.value());
    expectAllFlags(oParameter, false);
    oParameter.setValue(Samples<T>::second());
    expectAllFlags(oParameter, true);
    EXPECT_TRUE(oParameter.value() == Samples<T>::second());
    EXPECT_TRUE(oParameter.defaultValue() == Samples<T>::first());
}

TYPED_TEST(ParameterTest, ResetsToTheDefault) {
    using T = TypeParam;
    Parameter<T> oParameter(Samples<T>::first(), "name");
    setAllClean(oParameter);
    oParameter.resetToDefaultValue();
    expectAllFlags(oParameter, false);
    oParameter.setValue(Samples<T>::second());
    setAllClean(oParameter);
    oParameter.resetToDefaultValue();
    expectAllFlags(oParameter, true);
    EXPECT_TRUE(oParameter.value() == Samples<T>::first());
}

TYPED_TEST(ParameterTest, ClonesValueAndDefaultWithAllFlagsSet) {
    using T = TypeParam;
    Parameter<T> oParameter(Samples<T>::first(), "name", "text");
    oParameter.setValue(Samples<T>::second());
    setAllClean(oParameter);
    std::shared_ptr<Parameter<T>> const spTyped = oParameter.cloneParameter();
    std::shared_ptr<ParameterBase> const spClone = oParameter.clone();
    std::shared_ptr<ParameterBase> const spRenamed = oParameter.clone("other");
    auto const* const pClone = dynamic_cast<Parameter<T> const*>(spClone.get());
    auto const* const pRenamed = dynamic_cast<Parameter<T> const*>(spRenamed.get());
    for (Parameter<T> const* const pParameter :
         {static_cast<Parameter<T> const*>(spTyped.get()), pClone, pRenamed}) {
        ASSERT_NE(nullptr, pParameter);
        EXPECT_NE(&oParameter, pParameter);
        EXPECT_TRUE(pParameter->value() == Samples<T>::second());
        EXPECT_TRUE(pParameter->defaultValue() == Samples<T>::first());
        EXPECT_EQ("text", pParameter->description());
        EXPECT_EQ(pParameter == pRenamed ? "other" : "name", pParameter->name());
        expectAllFlags(*pParameter, true);
    }
    EXPECT_EQ("name", oParameter.name());
    expectAllFlags(oParameter, false);
    spTyped->setValue(Samples<T>::first());
    EXPECT_TRUE(oParameter.value() == Samples<T>::second());
}

TYPED_TEST(ParameterTest, CopiesTakeTheFlagsOver) {
    using T = TypeParam;
    Parameter<T> oParameter(Samples<T>::first(), "name", "text");
    oParameter.setClean();
    oParameter.setCleanGlyphcast();
    Parameter<T> const oCopy(oParameter);
    Parameter<T> oAssigned(Samples<T>::second(), "other");
    oAssigned = oParameter;
    for (Parameter<T> const* const pParameter : {&oCopy, static_cast<Parameter<T> const*>(&oAssigned)}) {
        EXPECT_FALSE(pParameter->isDirty());
        EXPECT_TRUE(pParameter->isDirtySimpleCaching());
        EXPECT_FALSE(pParameter->isDirtyGlyphcast());
        EXPECT_EQ("name", pParameter->name());
        EXPECT_EQ("text", pParameter->description());
        EXPECT_TRUE(pParameter->value() == Samples<T>::first());
        EXPECT_TRUE(pParameter->defaultValue() == Samples<T>::first());
    }
}

TYPED_TEST(ParameterTest, TakesTheValueOfAnotherOfItsType) {
    using T = TypeParam;
    Parameter<T> oParameter(Samples<T>::first(), "name");
    Parameter<T> const oSource(Samples<T>::second(), "source");
    setAllClean(oParameter);
    oParameter.setValueFromParameter(oSource);
    EXPECT_TRUE(oParameter.value() == Samples<T>::second());
    EXPECT_TRUE(oParameter.defaultValue() == Samples<T>::first());
    EXPECT_EQ("name", oParameter.name());
    expectAllFlags(oParameter, true);
    setAllClean(oParameter);
    oParameter.setValueFromParameter(oParameter);
    oParameter.setValueFromParameter(oSource);
    expectAllFlags(oParameter, false);
}

TYPED_TEST(ParameterTest, RefusesTheValueOfAnotherType) {
    using T = TypeParam;
    Parameter<T> oParameter(Samples<T>::first(), "name");
    setAllClean(oParameter);
    Parameter<short> const oForeign(1, "foreign");
    ORVO_EXPECT_INTERNAL(oParameter.setValueFromParameter(oForeign), "isOfType<T>()");
    EXPECT_TRUE(oParameter.value() == Samples<T>::first());
    expectAllFlags(oParameter, false);
}

TYPED_TEST(ParameterTest, WritesNameDescriptionAndValue) {
    using T = TypeParam;
    Parameter<T> const oParameter(Samples<T>::first(), "name", "some text");
    std::ostringstream oText;
    oText << oParameter;
    EXPECT_EQ(std::string("name some text ") + Samples<T>::text(), oText.str());
    std::ostringstream oShort;
    Parameter<T>(Samples<T>::first(), "").write(oShort);
    EXPECT_EQ(std::string("  ") + Samples<T>::text(), oShort.str());
}

TYPED_TEST(ParameterTest, MakesAnInputOfItsNameAndType) {
    using T = TypeParam;
    Parameter<T> oParameter(Samples<T>::first(), "name");
    std::unique_ptr<InputConnector, ORVO::ORVODeleter<InputConnector>> const spInput(
        oParameter.createProxyConnector(nullptr));
    EXPECT_NE(nullptr, dynamic_cast<ParameterInput<T>*>(spInput.get()));
    EXPECT_EQ("name", spInput->name());
    EXPECT_TRUE(spInput->datatype() == typeid(T));
}

template <typename T>
class ParameterArrayTest : public testing::Test {};
TYPED_TEST_SUITE(ParameterArrayTest, ORVO::Test::ArrayParameterTypes);

TYPED_TEST(ParameterArrayTest, HoldsADefaultMadeValue) {
    using T = TypeParam;
    auto const spParameter = Parameter<T>::createArray("name", "text", 16);
    EXPECT_TRUE(spParameter->value() == T());
    EXPECT_TRUE(spParameter->defaultValue() == T());
    EXPECT_EQ("name", spParameter->name());
    EXPECT_EQ("text", spParameter->description());
    spParameter->setValue(Samples<T>::second());
    EXPECT_TRUE(spParameter->value() == Samples<T>::second());
}

template <typename T, typename = void>
struct HasCreateArray : std::false_type {};
template <typename T>
struct HasCreateArray<T, std::void_t<decltype(Parameter<T>::createArray(std::string(), std::string(), 1))>>
    : std::true_type {};

static_assert(HasCreateArray<float>::value);
static_assert(HasCreateArray<std::vector<ORVO::float2>>::value);
static_assert(!HasCreateArray<std::vector<float>>::value);
static_assert(!HasCreateArray<ORVO::PositionExtentInWorldSpace>::value);

static_assert(std::is_same_v<decltype(std::declval<ParameterBase const&>().name()), std::string>);
static_assert(std::is_same_v<decltype(std::declval<ParameterBase const&>().description()), std::string>);

TEST(ParameterSlotsTest, HasItsOperationsInOrder) {
    using ORVO::Test::constSlotOf;
    using ORVO::Test::slotOf;
    // The destructor stands first.
    EXPECT_EQ(
        2, slotOf(static_cast<std::shared_ptr<ParameterBase> (ParameterBase::*)()>(&ParameterBase::clone)));
    EXPECT_EQ(3, constSlotOf(&ParameterBase::datatype));
    EXPECT_EQ(4, constSlotOf(&ParameterBase::isInterval));
    EXPECT_EQ(5, slotOf(&ParameterBase::createProxyConnector));
    EXPECT_EQ(6, constSlotOf(&ParameterBase::write));
    EXPECT_EQ(7, slotOf(&ParameterBase::setValueFromParameter));
    EXPECT_EQ(8, slotOf(&ParameterBase::resetToDefaultValue));
    EXPECT_EQ(9, slotOf(&ParameterBase::visit));
    EXPECT_EQ(10, slotOf(&Parameter<int>::cloneParameter));
    EXPECT_EQ(11, constSlotOf(&Parameter<int>::value));
    EXPECT_EQ(12, slotOf(&Parameter<int>::setValue));
    EXPECT_EQ(13, constSlotOf(&Parameter<int>::defaultValue));
}

TEST(ParameterOverrideTest, EveryChangeOfTheValueGoesThroughTheSlot) {
    struct Even : Parameter<int> {
        Even() : Parameter<int>(0, "even") {}
        void setValue(int const& value) override { Parameter<int>::setValue(value / 2 * 2); }
        int const& defaultValue() const override { return iDefault_; }
        int iDefault_ = 9;
    };
    Even oParameter;
    oParameter.setValueFromParameter(Parameter<int>(5, "source"));
    EXPECT_EQ(4, oParameter.value());
    oParameter.resetToDefaultValue();
    EXPECT_EQ(8, oParameter.value());
    EXPECT_EQ(9, oParameter.cloneParameter()->defaultValue());

    std::unique_ptr<InputConnector, ORVO::ORVODeleter<InputConnector>> const spInput(
        oParameter.createProxyConnector(nullptr));
    ConstOutput<int> oOutput("out", nullptr);
    Connect(*spInput, oOutput);
    oOutput.setData(ORVO_NEW int(7));
    spInput->fetchInput();
    EXPECT_EQ(6, oParameter.value());
    spInput->disconnect();
}

TEST(ParameterFlagsTest, EachSetCleanClearsItsOwnFlag) {
    Parameter<int> oParameter(1, "name");
    oParameter.setClean();
    EXPECT_FALSE(oParameter.isDirty());
    EXPECT_TRUE(oParameter.isDirtySimpleCaching());
    EXPECT_TRUE(oParameter.isDirtyGlyphcast());
    oParameter.setCleanSimpleCaching();
    EXPECT_FALSE(oParameter.isDirtySimpleCaching());
    EXPECT_TRUE(oParameter.isDirtyGlyphcast());
    oParameter.setCleanGlyphcast();
    EXPECT_FALSE(oParameter.isDirtyGlyphcast());
}

TEST(ParameterFloatTest, NaNAlwaysCountsAsAChange) {
    float const fNaN = std::numeric_limits<float>::quiet_NaN();
    Parameter<float> oParameter(fNaN, "name");
    setAllClean(oParameter);
    oParameter.setValue(fNaN);
    expectAllFlags(oParameter, true);
    setAllClean(oParameter);
    oParameter.resetToDefaultValue();
    expectAllFlags(oParameter, true);

    Parameter<ORVO::float3> oVector(ORVO::float3(1.0f, fNaN, 2.0f), "name");
    setAllClean(oVector);
    oVector.setValue(oVector.value());
    expectAllFlags(oVector, true);
}

TEST(ParameterFloatTest, ZerosOfBothSignsAreEqual) {
    Parameter<float> oParameter(0.0f, "name");
    setAllClean(oParameter);
    oParameter.setValue(-0.0f);
    expectAllFlags(oParameter, false);
}

TEST(ParameterSequenceTest, LengthsThenElementsAreCompared) {
    float const fNaN = std::numeric_limits<float>::quiet_NaN();
    Parameter<std::vector<float>> oParameter({1.0f, 2.0f}, "name");
    setAllClean(oParameter);
    oParameter.setValue({1.0f, 2.0f});
    expectAllFlags(oParameter, false);
    oParameter.setValue({1.0f});
    expectAllFlags(oParameter, true);
    setAllClean(oParameter);
    oParameter.setValue({2.0f});
    expectAllFlags(oParameter, true);
    oParameter.setValue({});
    setAllClean(oParameter);
    oParameter.setValue({});
    expectAllFlags(oParameter, false);
    oParameter.setValue({1.0f, fNaN});
    setAllClean(oParameter);
    oParameter.setValue({1.0f, fNaN});
    expectAllFlags(oParameter, true);
}

TEST(ParameterWriteTest, SequencesOfAllLengths) {
    std::ostringstream oText;
    oText << Parameter<std::vector<float>>({}, "a") << "\n" << Parameter<std::vector<float>>({1.5f}, "b");
    EXPECT_EQ("a  []\nb  [1.5]", oText.str());
}

TEST(ParameterWriteTest, PointersAreNumbers) {
    std::ostringstream oText;
    oText << Parameter<void*>(nullptr, "a") << "\n"
          << Parameter<void*>(reinterpret_cast<void*>(std::uintptr_t(255)), "b");
    EXPECT_EQ("a  0\nb  255", oText.str());
}

enum class Mode { Fast, Exact };
std::ostream& operator<<(std::ostream& oStream, Mode eMode) {
    return oStream << (eMode == Mode::Fast ? "fast" : "exact");
}

TEST(ParameterOfClientTypeTest, WorksForAnyTypeThatComparesAndWrites) {
    Parameter<Mode> oParameter(Mode::Fast, "mode");
    setAllClean(oParameter);
    oParameter.setValue(Mode::Exact);
    expectAllFlags(oParameter, true);
    std::ostringstream oText;
    oText << oParameter;
    EXPECT_EQ("mode  exact", oText.str());
    EXPECT_TRUE(oParameter.clone()->datatype() == typeid(Mode));
    EXPECT_EQ(Mode::Fast, Parameter<Mode>::createArray("mode", "", 1)->value());
}

} // namespace
