#include "orvo/data_flow/parameters/IntervalParameter.h"

#include "tests/data_flow/parameters/ParameterFlags.h"
#include "tests/data_flow/parameters/ParameterSamples.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <memory>
#include <ostream>
#include <sstream>
#include <stdexcept>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::expectAllFlags;
using ORVO::Test::Samples;
using ORVO::Test::setAllClean;

template <typename T>
class IntervalParameterTest : public testing::Test {};
TYPED_TEST_SUITE(IntervalParameterTest, ORVO::Test::IntervalParameterTypes);

TYPED_TEST(IntervalParameterTest, HasBoundsBesideItsValue) {
    using T = TypeParam;
    IntervalParameter<T> const oParameter(Samples<T>::first(), Samples<T>::second(), Samples<T>::first(),
                                          "name", "text");
    EXPECT_TRUE(oParameter.isInterval());
    EXPECT_TRUE(oParameter.value() == Samples<T>::first());
    EXPECT_TRUE(oParameter.defaultValue() == Samples<T>::first());
    EXPECT_TRUE(oParameter.lowerBound() == Samples<T>::second());
    EXPECT_TRUE(oParameter.upperBound() == Samples<T>::first());
    EXPECT_EQ("name", oParameter.name());
    EXPECT_EQ("text", oParameter.description());
    EXPECT_TRUE(oParameter.datatype() == typeid(T));
    expectAllFlags(oParameter, true);
    IntervalParameter<T> const oShort(Samples<T>::first(), Samples<T>::second(), Samples<T>::first(), "name");
    EXPECT_EQ("", oShort.description());
    auto const spCreated = IntervalParameter<T>::create(Samples<T>::first(), Samples<T>::first(),
                                                        Samples<T>::second(), "n", "d");
    EXPECT_TRUE(spCreated->upperBound() == Samples<T>::second());
    EXPECT_EQ("d", spCreated->description());
}

TYPED_TEST(IntervalParameterTest, ClonesItsBounds) {
    using T = TypeParam;
    IntervalParameter<T> oParameter(Samples<T>::first(), Samples<T>::first(), Samples<T>::second(), "name",
                                    "text");
    oParameter.setValue(Samples<T>::second());
    setAllClean(oParameter);
    std::shared_ptr<ParameterBase> const spClone = oParameter.clone();
    ASSERT_TRUE(spClone->isInterval());
    auto const& oClone = dynamic_cast<IntervalParameter<T> const&>(*spClone);
    EXPECT_TRUE(oClone.value() == Samples<T>::second());
    EXPECT_TRUE(oClone.defaultValue() == Samples<T>::first());
    EXPECT_TRUE(oClone.lowerBound() == Samples<T>::first());
    EXPECT_TRUE(oClone.upperBound() == Samples<T>::second());
    EXPECT_EQ("name", oClone.name());
    EXPECT_EQ("text", oClone.description());
    expectAllFlags(oClone, true);
    std::shared_ptr<ParameterBase> const spRenamed = oParameter.clone("other");
    EXPECT_EQ("other", spRenamed->name());
    EXPECT_TRUE(spRenamed->isInterval());
}

TYPED_TEST(IntervalParameterTest, CloneParameterGivesAPlainOne) {
    using T = TypeParam;
    IntervalParameter<T> oParameter(Samples<T>::first(), Samples<T>::first(), Samples<T>::second(), "name",
                                    "text");
    std::shared_ptr<Parameter<T>> const spClone = oParameter.cloneParameter();
    EXPECT_FALSE(spClone->isInterval());
    EXPECT_TRUE(spClone->value() == Samples<T>::first());
    EXPECT_EQ("text", spClone->description());
}

TYPED_TEST(IntervalParameterTest, TakesTheBoundsOfAnIntervalWithoutAFlag) {
    using T = TypeParam;
    IntervalParameter<T> oParameter(Samples<T>::first(), Samples<T>::first(), Samples<T>::first(), "name");
    IntervalParameter<T> const oSource(Samples<T>::first(), Samples<T>::second(), Samples<T>::second(),
                                       "source");
    setAllClean(oParameter);
    oParameter.setValueFromParameter(oSource);
    EXPECT_TRUE(oParameter.lowerBound() == Samples<T>::second());
    EXPECT_TRUE(oParameter.upperBound() == Samples<T>::second());
    expectAllFlags(oParameter, false);
}

TYPED_TEST(IntervalParameterTest, KeepsItsBoundsWhenTheSourceHasNone) {
    using T = TypeParam;
    IntervalParameter<T> oParameter(Samples<T>::first(), Samples<T>::first(), Samples<T>::first(), "name");
    Parameter<T> const oSource(Samples<T>::second(), "source");
    setAllClean(oParameter);
    oParameter.setValueFromParameter(oSource);
    EXPECT_TRUE(oParameter.value() == Samples<T>::second());
    EXPECT_TRUE(oParameter.lowerBound() == Samples<T>::first());
    EXPECT_TRUE(oParameter.upperBound() == Samples<T>::first());
    expectAllFlags(oParameter, true);
}

TYPED_TEST(IntervalParameterTest, RefusesAnotherTypeAndKeepsItsBounds) {
    using T = TypeParam;
    IntervalParameter<T> oParameter(Samples<T>::first(), Samples<T>::first(), Samples<T>::first(), "name");
    IntervalParameter<short> const oForeign(1, 0, 2, "foreign");
    setAllClean(oParameter);
    ORVO_EXPECT_INTERNAL(oParameter.setValueFromParameter(oForeign), "isOfType<T>()");
    EXPECT_TRUE(oParameter.value() == Samples<T>::first());
    EXPECT_TRUE(oParameter.lowerBound() == Samples<T>::first());
    expectAllFlags(oParameter, false);
}

TEST(IntervalParameterValueTest, BoundsAreNotEnforced) {
    IntervalParameter<float> oParameter(0.5f, 0.0f, 1.0f, "mix");
    oParameter.setValue(2.0f);
    EXPECT_EQ(2.0f, oParameter.value());
    oParameter.setValueFromParameter(Parameter<float>(-3.0f, "source"));
    EXPECT_EQ(-3.0f, oParameter.value());
    EXPECT_EQ(0.0f, oParameter.lowerBound());
    EXPECT_EQ(1.0f, oParameter.upperBound());
    IntervalParameter<int> const oOutside(7, 1, 0, "outside");
    EXPECT_EQ(7, oOutside.value());
    EXPECT_EQ(1, oOutside.lowerBound());
    EXPECT_EQ(0, oOutside.upperBound());
}

TEST(IntervalParameterValueTest, APlainParameterTakesTheValueAlone) {
    Parameter<float> oParameter(0.0f, "plain");
    oParameter.setValueFromParameter(IntervalParameter<float>(0.5f, 0.0f, 1.0f, "mix"));
    EXPECT_EQ(0.5f, oParameter.value());
    EXPECT_FALSE(oParameter.isInterval());
}

/// A number whose copies can be made to fail. Assignments work.
struct Fragile {
    explicit Fragile(int iValue) : iValue_(iValue) {}
    Fragile(Fragile const& oOther) : iValue_(oOther.iValue_) {
        if (--nCopiesLeft < 0) {
            throw std::runtime_error("no copy");
        }
    }
    Fragile& operator=(Fragile const&) = default;
    friend bool operator==(Fragile const& a, Fragile const& b) { return a.iValue_ == b.iValue_; }
    friend std::ostream& operator<<(std::ostream& oStream, Fragile const& o) { return oStream << o.iValue_; }

    int iValue_;
    inline static int nCopiesLeft = 0;
};

TEST(IntervalParameterValueTest, BoundsThatCannotBeCopiedLeaveValueAndBounds) {
    Fragile::nCopiesLeft = 1000;
    IntervalParameter<Fragile> oParameter(Fragile(5), Fragile(0), Fragile(9), "name");
    IntervalParameter<Fragile> const oSource(Fragile(6), Fragile(1), Fragile(8), "source");
    setAllClean(oParameter);
    // The lower bound is copied first.
    for (int const nCopies : {0, 1}) {
        Fragile::nCopiesLeft = nCopies;
        EXPECT_THROW(oParameter.setValueFromParameter(oSource), std::runtime_error);
        EXPECT_EQ(5, oParameter.value().iValue_);
        EXPECT_EQ(0, oParameter.lowerBound().iValue_);
        EXPECT_EQ(9, oParameter.upperBound().iValue_);
        expectAllFlags(oParameter, false);
    }
    Fragile::nCopiesLeft = 1000;
    oParameter.setValueFromParameter(oSource);
    EXPECT_EQ(6, oParameter.value().iValue_);
    EXPECT_EQ(1, oParameter.lowerBound().iValue_);
    EXPECT_EQ(8, oParameter.upperBound().iValue_);
}

TEST(IntervalParameterValueTest, WritesAsAPlainOne) {
    std::ostringstream oText;
    oText << IntervalParameter<float>(0.5f, 0.0f, 1.0f, "mix", "of both");
    EXPECT_EQ("mix of both 0.5", oText.str());
}

TEST(IntervalParameterValueTest, CopiesTakeBoundsAndFlagsOver) {
    IntervalParameter<int> oParameter(1, 0, 2, "name");
    setAllClean(oParameter);
    IntervalParameter<int> const oCopy(oParameter);
    IntervalParameter<int> oAssigned(5, 5, 5, "other");
    oAssigned = oParameter;
    for (IntervalParameter<int> const* const pCopy :
         {&oCopy, static_cast<IntervalParameter<int> const*>(&oAssigned)}) {
        EXPECT_EQ(1, pCopy->value());
        EXPECT_EQ(0, pCopy->lowerBound());
        EXPECT_EQ(2, pCopy->upperBound());
        EXPECT_EQ("name", pCopy->name());
        expectAllFlags(*pCopy, false);
    }
}

} // namespace
