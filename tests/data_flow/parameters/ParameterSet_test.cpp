#include "orvo/data_flow/parameters/ParameterSet.h"

#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/data_flow/parameters/ParameterNameEquals.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <iterator>
#include <memory>
#include <ostream>
#include <sstream>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <vector>

namespace {

using namespace ORVO::DataFlow;

int valueOf(std::shared_ptr<ParameterBase> const& spParameter) {
    return dynamic_cast<Parameter<int> const&>(*spParameter).value();
}

/// The values of a set of integers, in order.
std::vector<int> values(ParameterSet const& oSet) {
    std::vector<int> aValues;
    for (auto const& spParameter : oSet) {
        aValues.push_back(valueOf(spParameter));
    }
    return aValues;
}

ParameterSet makeSet(std::vector<int> const& aValues, std::string const& sPrefix) {
    ParameterSet oSet;
    for (int const iValue : aValues) {
        oSet.insert(Parameter<int>::create(iValue, sPrefix + std::to_string(iValue)));
    }
    return oSet;
}

static_assert(std::has_virtual_destructor_v<ParameterSet>);

TEST(ParameterSetTest, IsEmptyAtFirst) {
    ParameterSet const oSet;
    EXPECT_EQ(0u, oSet.size());
    EXPECT_TRUE(oSet.begin() == oSet.end());
    EXPECT_EQ(nullptr, oSet.getParameter("a"));
    ORVO_EXPECT_INTERNAL(oSet.parameter(0), "Range error: iParameter < size()");
}

TEST(ParameterSetTest, HoldsTheParameterItselfInOrder) {
    ParameterSet oSet;
    auto const spFirst = Parameter<int>::create(1, "a");
    auto const spSecond = Parameter<int>::create(2, "b");
    oSet.insert(spFirst);
    oSet.insert(spSecond);
    oSet.insert(spFirst);
    EXPECT_EQ(3u, oSet.size());
    EXPECT_EQ(spFirst, oSet.parameter(0));
    EXPECT_EQ(spSecond, oSet.parameter(1));
    EXPECT_EQ(spFirst, oSet.parameter(2));
    ORVO_EXPECT_INTERNAL(oSet.parameter(3), "Range error: iParameter < size()");
    ORVO_EXPECT_INTERNAL(oSet.parameter(~std::size_t(0)), "Range error: iParameter < size()");
    spFirst->setValue(7);
    EXPECT_EQ((std::vector<int>{7, 2, 7}), values(oSet));
}

TEST(ParameterSetTest, FindsTheFirstOfAName) {
    ParameterSet oSet;
    auto const spFirst = Parameter<int>::create(1, "a");
    oSet.insert(spFirst);
    oSet.insert(Parameter<int>::create(2, "a"));
    oSet.insert(Parameter<int>::create(3, ""));
    EXPECT_EQ(spFirst, oSet.getParameter("a"));
    EXPECT_EQ(3, valueOf(oSet.getParameter("")));
    EXPECT_EQ(nullptr, oSet.getParameter("A"));
    EXPECT_EQ(nullptr, oSet.getParameter("a "));
}

TEST(ParameterSetTest, InsertAtAPositionAppends) {
    ParameterSet oSet = makeSet({1, 2}, "p");
    auto const spThird = Parameter<int>::create(3, "p3");
    ParameterSet::iterator const it = oSet.insert(oSet.begin(), spThird);
    EXPECT_EQ(spThird, *it);
    EXPECT_TRUE(it == std::prev(oSet.end()));
    EXPECT_EQ((std::vector<int>{1, 2, 3}), values(oSet));
    ParameterSet oEmpty;
    ParameterSet::iterator const itOnly = oEmpty.insert(oEmpty.end(), spThird);
    EXPECT_TRUE(itOnly == oEmpty.begin());
}

TEST(ParameterSetTest, RefusesNull) {
    ParameterSet oSet;
    ORVO_EXPECT_INTERNAL(oSet.insert(std::shared_ptr<ParameterBase>()), "Enforce spParameter.get() != NULL");
    ORVO_EXPECT_INTERNAL(oSet.insert(oSet.begin(), std::shared_ptr<ParameterBase>()),
                         "Enforce spParameter.get() != NULL");
    std::vector<std::shared_ptr<ParameterBase>> const aOthers = {Parameter<int>::create(1, "a"), nullptr};
    ORVO_EXPECT_INTERNAL(oSet.insert(aOthers.begin(), aOthers.end()), "Enforce spParameter.get() != NULL");
    EXPECT_EQ(0u, oSet.size());
}

TEST(ParameterSetTest, InsertingARangeClones) {
    ParameterSet oSource = makeSet({1, 2}, "p");
    ParameterSet oSet = makeSet({0}, "p");
    oSet.insert(oSource.begin(), oSource.end());
    EXPECT_EQ((std::vector<int>{0, 1, 2}), values(oSet));
    EXPECT_NE(oSource.parameter(0), oSet.parameter(1));
    oSet.insert(oSource.end(), oSource.end());
    EXPECT_EQ(3u, oSet.size());
    // Also a range of its own.
    oSet.insert(oSet.begin(), oSet.end());
    EXPECT_EQ((std::vector<int>{0, 1, 2, 0, 1, 2}), values(oSet));
    EXPECT_NE(oSet.parameter(0), oSet.parameter(3));
}

TEST(ParameterSetTest, CopiesAreIndependent) {
    ParameterSet oSource;
    auto const spParameter = Parameter<int>::create(1, "a");
    oSource.insert(spParameter);
    oSource.insert(IntervalParameter<int>::create(5, 0, 9, "b", "text"));
    spParameter->setClean();
    ParameterSet oCopy(oSource);
    ParameterSet oAssigned = makeSet({8, 9}, "p");
    oAssigned = oSource;
    for (ParameterSet const* const pCopy : {&oCopy, &oAssigned}) {
        EXPECT_EQ((std::vector<int>{1, 5}), values(*pCopy));
        EXPECT_NE(spParameter, pCopy->parameter(0));
        EXPECT_TRUE(pCopy->parameter(0)->isDirty()) << "a clone is new";
        EXPECT_TRUE(pCopy->parameter(1)->isInterval());
        EXPECT_EQ("text", pCopy->parameter(1)->description());
    }
    dynamic_cast<Parameter<int>&>(*oCopy.parameter(0)).setValue(3);
    EXPECT_EQ(1, spParameter->value());
    EXPECT_FALSE(spParameter->isDirty());
    ParameterSet& oSelf = oAssigned;
    oAssigned = oSelf;
    EXPECT_EQ((std::vector<int>{1, 5}), values(oAssigned));
}

TEST(ParameterSetTest, ClearAndSwap) {
    ParameterSet oFirst = makeSet({1, 2}, "p");
    ParameterSet oSecond = makeSet({3}, "p");
    auto const spParameter = oSecond.parameter(0);
    oFirst.swap(oSecond);
    EXPECT_EQ((std::vector<int>{3}), values(oFirst));
    EXPECT_EQ((std::vector<int>{1, 2}), values(oSecond));
    EXPECT_EQ(spParameter, oFirst.parameter(0));
    oFirst.clear();
    EXPECT_EQ(0u, oFirst.size());
    EXPECT_EQ(3, valueOf(spParameter));
}

TEST(ParameterSetTest, CombineClonesBothAndKeepsDuplicates) {
    ParameterSet const oFirst = makeSet({1, 2}, "p");
    ParameterSet oSecond = makeSet({3}, "p");
    auto const spDuplicate = Parameter<int>::create(4, "p1");
    oSecond.insert(spDuplicate);
    ParameterSet const oCombined = combine(oFirst, oSecond);
    EXPECT_EQ((std::vector<int>{1, 2, 3, 4}), values(oCombined));
    EXPECT_NE(oFirst.parameter(0), oCombined.parameter(0));
    EXPECT_NE(spDuplicate, oCombined.parameter(3));
    EXPECT_EQ(oCombined.parameter(0), oCombined.getParameter("p1"));
    EXPECT_EQ(2u, oFirst.size());
    EXPECT_EQ(0u, combine(ParameterSet(), ParameterSet()).size());
    EXPECT_EQ((std::vector<int>{1, 2, 1, 2}), values(combine(oFirst, oFirst)));
}

TEST(ParameterSetTest, WritesALineForEach) {
    ParameterSet oSet;
    std::ostringstream oEmpty;
    oEmpty << oSet;
    EXPECT_EQ("", oEmpty.str());
    oSet.insert(Parameter<int>::create(1, "a", "first"));
    oSet.insert(Parameter<float>::create(0.5f, "b"));
    std::ostringstream oText;
    oText << oSet;
    EXPECT_EQ("a first 1\nb  0.5\n", oText.str());
}

/// A value whose copies fail on demand.
struct Fragile {
    Fragile() = default;
    Fragile(Fragile const&) {
        if (bFails) {
            throw std::runtime_error("no copy");
        }
    }
    Fragile& operator=(Fragile const&) = default;
    friend bool operator==(Fragile const&, Fragile const&) { return true; }
    friend std::ostream& operator<<(std::ostream& oStream, Fragile const&) { return oStream << "fragile"; }
    inline static bool bFails = false;
};

TEST(ParameterSetTest, AFailedCloneLeavesTheSetAsItWas) {
    ParameterSet oSource = makeSet({1}, "p");
    oSource.insert(Parameter<Fragile>::create(Fragile(), "fragile"));
    ParameterSet oSet = makeSet({7}, "p");
    auto const spParameter = oSet.parameter(0);
    Fragile::bFails = true;
    EXPECT_THROW(oSet = oSource, std::runtime_error);
    EXPECT_THROW(oSet.insert(oSource.begin(), oSource.end()), std::runtime_error);
    EXPECT_THROW(combine(oSet, oSource), std::runtime_error);
    Fragile::bFails = false;
    EXPECT_EQ(1u, oSet.size());
    EXPECT_EQ(spParameter, oSet.parameter(0));
}

TEST(ParameterNameEqualsTest, ComparesNamesByteForByte) {
    Parameter<int> const oParameter(1, "radius");
    std::shared_ptr<ParameterBase> const spParameter = Parameter<int>::create(1, "radius");
    EXPECT_TRUE(ParameterNameEquals("radius")(&oParameter));
    EXPECT_TRUE(ParameterNameEquals("radius")(spParameter));
    EXPECT_FALSE(ParameterNameEquals("Radius")(&oParameter));
    EXPECT_FALSE(ParameterNameEquals(std::string("radius\0", 7))(&oParameter));
    EXPECT_FALSE(ParameterNameEquals("")(&oParameter));
    EXPECT_FALSE(ParameterNameEquals("")(std::shared_ptr<ParameterBase>()));
}

} // namespace
