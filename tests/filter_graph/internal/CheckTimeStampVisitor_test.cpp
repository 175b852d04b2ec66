#include "orvo/filter_graph/internal/CheckTimeStampVisitor.h"

#include <gtest/gtest.h>

#include "orvo/filter_graph/internal/Filter.h"
#include "tests/support/Expect.h"
#include "tests/support/Layers.h"
#include "tests/support/TestFilters.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;

class CheckTimeStampVisitorTest : public testing::Test {
protected:
    FilterGraphLayers oLayers_;
    std::map<Filter*, std::shared_ptr<Filter>> oClones_;
};

TEST_F(CheckTimeStampVisitorTest, IsUpToDateAtFirstAndForAFreshClone) {
    auto const spFilter = makeFilter<GainNode>();
    spFilter->updateTimeStamp();
    oClones_[spFilter.get()] = spFilter->clone();
    CheckTimeStampVisitor visitor(&oClones_);
    EXPECT_TRUE(visitor.isUpToDate());
    visitor.preVisit(spFilter.get());
    EXPECT_TRUE(visitor.isUpToDate());
}

TEST_F(CheckTimeStampVisitorTest, MissesAFilterWithoutAClone) {
    auto const spFilter = makeFilter<GainNode>();
    CheckTimeStampVisitor visitor(&oClones_);
    visitor.preVisit(spFilter.get());
    EXPECT_FALSE(visitor.isUpToDate());
}

TEST_F(CheckTimeStampVisitorTest, SeesAStampThatMovedAfterTheClone) {
    auto const spFilter = makeFilter<GainNode>();
    oClones_[spFilter.get()] = spFilter->clone();
    spFilter->updateTimeStamp();
    CheckTimeStampVisitor visitor(&oClones_);
    visitor.preVisit(spFilter.get());
    EXPECT_FALSE(visitor.isUpToDate());
}

TEST_F(CheckTimeStampVisitorTest, RefusesAnEmptyEntryUnlessItHasFailedAlready) {
    auto const spFilter = makeFilter<GainNode>();
    auto const spUnknown = makeFilter<GainNode>();
    oClones_[spFilter.get()] = nullptr;
    CheckTimeStampVisitor visitor(&oClones_);
    ORVO_EXPECT_INTERNAL(visitor.preVisit(spFilter.get()), "Enforce spClone.get() != NULL");
    visitor.preVisit(spUnknown.get());
    visitor.preVisit(spFilter.get());
    EXPECT_FALSE(visitor.isUpToDate());
}

TEST_F(CheckTimeStampVisitorTest, RemembersTheOrderOfTheLastWalkAndNoticesAnother) {
    auto const spA = makeFilter<GainNode>();
    auto const spB = makeFilter<GainNode>();
    auto const spC = makeFilter<GainNode>();
    for (auto const& spFilter : {spA, spB, spC}) {
        oClones_[spFilter.get()] = spFilter->clone();
    }
    CheckTimeStampVisitor::Memory memory;
    auto const upToDate = [&](std::vector<Filter*> const& aVisits) {
        CheckTimeStampVisitor visitor(&oClones_, &memory);
        for (Filter* const pFilter : aVisits) {
            visitor.preVisit(pFilter);
        }
        return visitor.isUpToDate();
    };
    EXPECT_TRUE(upToDate({spA.get(), spB.get(), spC.get()}));
    EXPECT_EQ(memory.size(), 3u);
    EXPECT_TRUE(upToDate({spA.get(), spB.get(), spC.get()}));
    EXPECT_TRUE(upToDate({spA.get(), spC.get()}));
    EXPECT_TRUE(upToDate({spC.get(), spB.get(), spA.get()}));
    auto const spStranger = makeFilter<GainNode>();
    EXPECT_FALSE(upToDate({spC.get(), spStranger.get(), spA.get()}));
    spB->updateTimeStamp();
    EXPECT_TRUE(upToDate({spC.get(), spA.get()}));
    EXPECT_FALSE(upToDate({spC.get(), spA.get(), spB.get()}));
    EXPECT_FALSE(upToDate({spC.get(), spA.get(), spB.get()}));
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
