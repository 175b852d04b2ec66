#include "orvo/filter_graph/impl/FilterFactory.h"

#include <gtest/gtest.h>

#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "tests/filter_graph/support/ForeignFilter.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"
#include "tests/support/Layers.h"

namespace ORVO::FilterGraph {
namespace {

using ORVO::Test::ForeignFilter;
using ORVO::Test::PlainFilter;

IODataDescriptors channels(std::size_t n) { return {{DataDescriptor(n)}, {DataDescriptor(n)}}; }

Identifier plain(int version) { return {"plain", "test", "ORVO", version}; }

Identifier plain(int version, std::size_t nChannels) {
    return {"plain", "test", "ORVO", version, channels(nChannels)};
}

Identifier const anyPlain("plain", "test", "ORVO");

/// A filter that counts the runs of its deferred set-up, which adds an input and a parameter.
class LazyFilter : public PlainFilter {
public:
    using PlainFilter::PlainFilter;
    std::shared_ptr<Filter> clone() override { return std::make_shared<LazyFilter>(*this); }

    static inline int nSetUps = 0;

protected:
    void finishLazyInitialization() override {
        ++nSetUps;
        addInput("late", 0);
        addParameter(OwnedParameter(new Parameter<int>("late", 3, false)));
        PlainFilter::finishLazyInitialization();
    }
};

class FilterFactoryTest : public testing::Test {
protected:
    ORVO::Test::FilterGraphLayers oLayers_;
    FilterFactory& factory_ = *FilterFactory::Instance();

    void insert(Identifier const& identifier) { factory_.insert(PlainFilter(identifier)); }

    /// "name version" of every prototype, in the order of the factory.
    std::string order() const {
        std::string text;
        for (auto const& filter : static_cast<FilterFactory const&>(factory_).prototypes())
            text += filter->identifier().name() + std::to_string(filter->identifier().version()) + " ";
        return text;
    }
};

TEST_F(FilterFactoryTest, FindsNothingWhileEmpty) {
    EXPECT_EQ(factory_.numberOfPrototypes(), 0u);
    EXPECT_EQ(factory_.find(anyPlain), nullptr);
    EXPECT_FALSE(factory_.prototypes().isValid());
    ORVO_EXPECT_INTERNAL(factory_.prototype(anyPlain), "Enforce pPrototype != NULL");
    ORVO_EXPECT_INTERNAL(factory_.create(anyPlain), "Enforce pPrototype != NULL");
    ORVO_EXPECT_INTERNAL(factory_.remove(anyPlain), "iter != aFilters_.end()");
    ORVO_EXPECT_INTERNAL(factory_.create(Identifier()), "Enforce pPrototype != NULL");
    factory_.removeAll();
    EXPECT_EQ(factory_.numberOfPrototypes(), 0u);
}

TEST_F(FilterFactoryTest, StoresACloneOfAPrototype) {
    PlainFilter prototype(plain(1));
    prototype.addInput("src", 0);
    Identifier const inserted = factory_.insert(prototype);
    EXPECT_TRUE(inserted == prototype.identifier());
    EXPECT_FALSE(inserted.ignoresVersion());
    EXPECT_EQ(factory_.numberOfPrototypes(), 1u);

    IFilter const* stored = factory_.find(anyPlain);
    ASSERT_TRUE(stored);
    EXPECT_NE(stored, &prototype);
    EXPECT_EQ(factory_.prototype(anyPlain), stored);
    prototype.addInput("later", 0);
    EXPECT_EQ(stored->getNumberOfInputs(), 1u);
}

TEST_F(FilterFactoryTest, RefusesAPrototypeWithoutAVersion) {
    ORVO_EXPECT_FILTERGRAPH(factory_.insert(PlainFilter(anyPlain)),
                            "Error inserting filter in the filter library: invalid id:\nf->identifier()\n"
                            "Must have version >=0");
    EXPECT_EQ(factory_.numberOfPrototypes(), 0u);
}

TEST_F(FilterFactoryTest, TakesANegativeVersion) {
    insert(plain(-5));
    EXPECT_EQ(factory_.prototype(anyPlain)->identifier().version(), -5);
}

TEST_F(FilterFactoryTest, RefusesAFilterOfAnotherKind) {
    ORVO_EXPECT_INTERNAL(factory_.insert(ForeignFilter()), "pPrototypeFilter");
    EXPECT_EQ(factory_.numberOfPrototypes(), 0u);
}

TEST_F(FilterFactoryTest, RefusesAVersionThatItHas) {
    insert(plain(1));
    insert(plain(2));
    ORVO_EXPECT_FILTERGRAPH(insert(plain(2)),
                            "Cannot insert filter into the factory :  id Filter name:plain\n"
                            "Filter namespace:test\nFilter vendor:ORVO\nFilter version:2\n already exists");
    ORVO_EXPECT_FILTERGRAPH(insert(plain(1)),
                            "Cannot insert filter into the factory :  id Filter name:plain\n"
                            "Filter namespace:test\nFilter vendor:ORVO\nFilter version:1\n already exists");
    EXPECT_EQ(order(), "plain2 plain1 ");
}

TEST_F(FilterFactoryTest, WritesTheDescriptorsOfAVersionThatItHas) {
    insert(plain(1, 3));
    ORVO_EXPECT_FILTERGRAPH(
        insert(plain(1, 3)),
        "Cannot insert filter into the factory :  id Filter name:plain\n"
        "Filter namespace:test\nFilter vendor:ORVO\nFilter version:1\nFilter Data descriptors:\n"
        "Input data descriptors:{ Number of channels:3\nColorspace:COLOR_SPACE_UNNAMED\n}   \n"
        "Output data descriptors:{ Number of channels:3\nColorspace:COLOR_SPACE_UNNAMED\n}   \n"
        " already exists");
    insert(plain(1, 4));
    EXPECT_EQ(factory_.numberOfPrototypes(), 2u);
}

TEST_F(FilterFactoryTest, KeepsFamiliesTogetherWithHigherVersionsFirst) {
    insert({"a", "test", "ORVO", 3});
    insert({"b", "test", "ORVO", 1});
    insert({"a", "test", "ORVO", 1});
    insert({"a", "test", "ORVO", 7});
    insert({"b", "test", "ORVO", 9});
    insert({"a", "test", "ORVO", 2});
    EXPECT_EQ(order(), "a7 a3 a2 a1 b9 b1 ");
    // Another name space or vendor is another family.
    insert({"a", "other", "ORVO", 8});
    insert({"a", "test", "other", 5});
    EXPECT_EQ(order(), "a7 a3 a2 a1 b9 b1 a8 a5 ");
}

TEST_F(FilterFactoryTest, FindsTheHighestVersionWhateverTheOrderOfInsertion) {
    for (bool ascending : {true, false}) {
        factory_.removeAll();
        insert(plain(ascending ? 1 : 2));
        insert(plain(ascending ? 2 : 1));
        ASSERT_TRUE(factory_.find(anyPlain));
        EXPECT_EQ(factory_.find(anyPlain)->identifier().version(), 2);

        factory_.removeAll();
        insert(plain(ascending ? 1 : 2, 3));
        insert(plain(ascending ? 2 : 1, 3));
        ASSERT_TRUE(factory_.find(anyPlain));
        EXPECT_EQ(factory_.find(anyPlain)->identifier().version(), 2);
    }
}

TEST_F(FilterFactoryTest, FindsNothingWhereDescriptorsDiffer) {
    for (bool ascending : {true, false}) {
        factory_.removeAll();
        insert(ascending ? plain(1, 1) : plain(2, 4));
        insert(ascending ? plain(2, 4) : plain(1, 1));
        EXPECT_EQ(factory_.find(anyPlain), nullptr);
        ORVO_EXPECT_INTERNAL(factory_.create(anyPlain), "Enforce pPrototype != NULL");
    }
}

TEST_F(FilterFactoryTest, FindsTheVersionWithTheDescriptorsOfTheQuery) {
    insert(plain(1, 1));
    insert(plain(2, 4));
    insert(plain(3, 1));
    auto const find = [this](std::size_t n) { return factory_.find({"plain", "test", "ORVO", channels(n)}); };
    ASSERT_TRUE(find(1));
    EXPECT_EQ(find(1)->identifier().version(), 3);
    ASSERT_TRUE(find(4));
    EXPECT_EQ(find(4)->identifier().version(), 2);
    EXPECT_EQ(find(2), nullptr);
    EXPECT_EQ(factory_.find(plain(2, 1)), nullptr);
    EXPECT_EQ(factory_.find(plain(1, 1))->identifier().version(), 1);
}

TEST_F(FilterFactoryTest, FindsAVersionWhateverTheDescriptorsOfTheOthersAre) {
    insert(plain(1, 1));
    insert(plain(2, 4));
    ASSERT_TRUE(factory_.find(plain(1)));
    EXPECT_EQ(factory_.find(plain(1))->identifier().version(), 1);
    EXPECT_EQ(factory_.find(plain(2))->identifier().version(), 2);
    EXPECT_EQ(factory_.find(plain(3)), nullptr);
}

TEST_F(FilterFactoryTest, IsAmbiguousWhereOneVersionHasSeveralDescriptors) {
    insert(plain(1, 1));
    insert(plain(1, 4));
    EXPECT_EQ(factory_.numberOfPrototypes(), 2u);
    EXPECT_EQ(factory_.find(plain(1)), nullptr);
    EXPECT_TRUE(factory_.find(plain(1, 4)));
}

TEST_F(FilterFactoryTest, CreatesUnconnectedClones) {
    PlainFilter prototype(plain(1));
    prototype.addInput("src", 0);
    prototype.addParameter(PlainFilter::OwnedParameter(new Parameter<float>("gain", 2.0F, false)));
    factory_.insert(prototype);
    std::shared_ptr<IFilter> const one = factory_.create(anyPlain);
    std::shared_ptr<IFilter> const two = factory_.create(plain(1));
    EXPECT_NE(one, two);
    EXPECT_NE(one.get(), factory_.find(anyPlain));
    Connect(one, two);
    one->parameter("gain")->as<float>().setValue(5.0F);
    EXPECT_EQ(two->parameter("gain")->as<float>().value(), 2.0F);
    EXPECT_EQ(factory_.create(anyPlain)->parameter("gain")->as<float>().value(), 2.0F);
    EXPECT_EQ((*factory_.create(anyPlain)->inputs())->producerFilter(), nullptr);
}

TEST_F(FilterFactoryTest, FinishesAPrototypeOnceAndOnlyWhenItIsUsed) {
    LazyFilter::nSetUps = 0;
    factory_.insert(LazyFilter("lazy"));
    Identifier const anyLazy("lazy", "test", "ORVO");
    EXPECT_EQ(factory_.prototype(anyLazy)->getNumberOfInputs(), 0u);
    EXPECT_EQ(LazyFilter::nSetUps, 0);

    std::shared_ptr<IFilter> const one = factory_.create(anyLazy);
    std::shared_ptr<IFilter> const two = factory_.create(anyLazy);
    EXPECT_EQ(LazyFilter::nSetUps, 1);
    EXPECT_TRUE(one->input("late"));
    EXPECT_EQ(two->parameter("late")->as<int>().value(), 3);
    EXPECT_TRUE(dynamic_cast<Internal::Filter&>(*one).isInitialized());
    EXPECT_EQ(factory_.prototype(anyLazy)->getNumberOfInputs(), 1u);
}

TEST_F(FilterFactoryTest, RemovesTheFirstMatch) {
    insert(plain(1));
    insert(plain(3));
    insert(plain(2));
    ORVO_EXPECT_INTERNAL(factory_.remove(plain(4)), "iter != aFilters_.end()");
    ORVO_EXPECT_INTERNAL(factory_.remove({"plain", "test", "nobody"}), "iter != aFilters_.end()");
    EXPECT_EQ(factory_.numberOfPrototypes(), 3u);

    EXPECT_EQ(factory_.remove(plain(2))->identifier().version(), 2);
    EXPECT_EQ(order(), "plain3 plain1 ");
    EXPECT_EQ(factory_.remove(anyPlain)->identifier().version(), 3);
    EXPECT_EQ(order(), "plain1 ");
    EXPECT_EQ(factory_.remove(anyPlain)->identifier().version(), 1);
    EXPECT_EQ(factory_.numberOfPrototypes(), 0u);
}

TEST_F(FilterFactoryTest, RemovesByTheDescriptorsOfTheQuery) {
    insert(plain(1, 1));
    insert(plain(1, 4));
    ORVO_EXPECT_INTERNAL(factory_.remove(plain(1, 2)), "iter != aFilters_.end()");
    EXPECT_TRUE(factory_.remove(plain(1, 4))->identifier().ioDataDescriptors() == channels(4));
    EXPECT_TRUE((*factory_.prototypes())->identifier().ioDataDescriptors() == channels(1));
}

TEST_F(FilterFactoryTest, LetsFiltersLiveOnAfterTheirPrototype) {
    insert(plain(1));
    std::shared_ptr<IFilter> const filter = factory_.create(anyPlain);
    std::shared_ptr<IFilter> const prototype = factory_.remove(anyPlain);
    EXPECT_EQ(factory_.find(anyPlain), nullptr);
    EXPECT_EQ(filter->identifier().name(), "plain");
    EXPECT_EQ(prototype->identifier().name(), "plain");
    // A prototype that was taken out is an ordinary filter: it can be put back.
    factory_.insert(*prototype);
    EXPECT_TRUE(factory_.find(anyPlain));
    factory_.removeAll();
    EXPECT_EQ(factory_.numberOfPrototypes(), 0u);
    EXPECT_EQ(filter->identifier().version(), 1);
}

TEST_F(FilterFactoryTest, ListsItsPrototypes) {
    insert({"a", "test", "ORVO", 1});
    insert({"b", "test", "ORVO", 1});
    IFilterIterator range = factory_.prototypes();
    IFilterConstIterator const constRange(range);
    ASSERT_TRUE(range.isValid());
    EXPECT_EQ(range->identifier().name(), "a");
    ++range;
    EXPECT_EQ((*range)->identifier().name(), "b");
    ++range;
    EXPECT_FALSE(range.isValid());
    EXPECT_EQ(*range, nullptr);
    ORVO_EXPECT_INTERNAL(++range, "iCurrent_ != iLast_");
    EXPECT_EQ(constRange.end() - constRange.begin(), 2);
}

} // namespace
} // namespace ORVO::FilterGraph
