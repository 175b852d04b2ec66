#include "orvo/filter_graph/internal/CloneGraphVisitor.h"

#include <gtest/gtest.h>

#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"
#include "tests/support/Expect.h"
#include "tests/support/Layers.h"
#include "tests/support/TestFilters.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;

/// A filter whose `clone` does what the test says.
class OddFilter : public Filter {
public:
    std::shared_ptr<Filter> clone() override { return spAnswer; }
    std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform, GraphExecutable&) override {
        return nullptr;
    }
    std::shared_ptr<Filter> spAnswer;
};

class CloneGraphVisitorTest : public testing::Test {
protected:
    FilterGraphLayers oLayers_;
    std::map<Filter*, std::shared_ptr<Filter>> oClones_;
    ParameterForwarder oForwarder_;
    CloneGraphVisitor oVisitor_{&oClones_, &oForwarder_};
};

TEST_F(CloneGraphVisitorTest, StoresACloneThatTheForwarderFeeds) {
    auto const spFilter = makeFilter<GainNode>("gain");
    oVisitor_.preVisit(spFilter.get());
    ASSERT_EQ(oClones_.size(), 1u);
    Filter& clone = *oClones_.at(spFilter.get());
    EXPECT_NE(&clone, spFilter.get());
    EXPECT_EQ(clone.identifier().name(), "gain");
    setParameter(*spFilter, "gain", 2.5f);
    oForwarder_.forwardStuff();
    EXPECT_EQ(clone.parameter("gain")->as<float>().value(), 2.5f);
}

TEST_F(CloneGraphVisitorTest, ClonesAnAdapter) {
    auto const spAdapter = OutputAdapter::create(IAdapter::REGION_SYNC_EXPLICIT);
    oVisitor_.preVisit(spAdapter.get());
    auto* const pClone = dynamic_cast<OutputAdapter*>(oClones_.at(spAdapter.get()).get());
    ASSERT_TRUE(pClone);
    EXPECT_EQ(pClone->mode(), IAdapter::REGION_SYNC_EXPLICIT);
}

TEST_F(CloneGraphVisitorTest, RefusesAnEmptyClone) {
    OddFilter filter;
    ORVO_EXPECT_INTERNAL(oVisitor_.preVisit(&filter), "Enforce spClone.get() != NULL");
    EXPECT_TRUE(oClones_.empty());
}

TEST_F(CloneGraphVisitorTest, RefusesACloneThatIsNoCopy) {
    OddFilter filter;
    filter.updateTimeStamp();
    filter.spAnswer = std::make_shared<OddFilter>();
    ORVO_EXPECT_INTERNAL(oVisitor_.preVisit(&filter),
                         "pFilter->getTimeStamp() == spClone->getClonedTimeStamp()");
    EXPECT_TRUE(oClones_.empty());
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
