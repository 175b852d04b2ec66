#include "orvo/image_flow/controllers/Bedding.h"

#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"
#include "tests/support/Slots.h"

namespace ORVO {

namespace {

using Test::feed;
using Test::TestFilter;
using Test::world;

class BeddingTest : public testing::Test {
protected:
    ORVO::Test::ImageFlowLayers oLayers_;
};

/// A source and a sink in a bedding.
struct Planted {
    Planted() : oSource_(0, true, "source"), oSink_(1, false, "sink"), oBedding_(oController_) {
        feed(oSink_, 0, oSource_);
        oSource_.setGeneratedRegion(world(0, 0, 8, 8));
        oController_.addNode(&oSource_);
        oController_.addNode(&oSink_);
    }
    TestFilter oSource_;
    TestFilter oSink_;
    ImageFlowController oController_;
    Bedding oBedding_;
};

TEST_F(BeddingTest, hasItsOperationsInOrder) {
    // The destructor stands first.
    EXPECT_EQ(2, ORVO::Test::slotOf(&Bedding::process));
    EXPECT_EQ(3, ORVO::Test::slotOf(&Bedding::processAsync));
    EXPECT_EQ(4, ORVO::Test::slotOf(&Bedding::wait));
}

TEST_F(BeddingTest, theMasterTreeIsTheSink) {
    Planted graph;
    EXPECT_EQ(nullptr, graph.oBedding_.masterTree());
    graph.oBedding_.plantMasterTree(graph.oSink_);
    EXPECT_EQ(&graph.oSink_, graph.oBedding_.masterTree());
    EXPECT_EQ(&graph.oSink_, static_cast<Bedding const&>(graph.oBedding_).masterTree());
    EXPECT_EQ(&graph.oSink_, graph.oController_.imageSink());
}

TEST_F(BeddingTest, forwardsTheRegionPasses) {
    Planted graph;
    graph.oBedding_.plantMasterTree(graph.oSink_);
    graph.oBedding_.propagatePixelExtents();
    EXPECT_EQ(1u, graph.oSource_.spPixelExtentSet()->aOutputPixelExtents_.size());
    graph.oBedding_.propagateDODs();
    EXPECT_EQ(world(0, 0, 8, 8), graph.oSink_.domainOfDefinition());
    graph.oBedding_.propagateROIs(world(2, 2, 4, 4));
    EXPECT_EQ(world(2, 2, 4, 4), graph.oSource_.regionOfInterest());
    graph.oBedding_.computeRegions(world(1, 1, 2, 2));
    EXPECT_EQ(world(1, 1, 2, 2), graph.oSource_.computeRegionParameter().value());
    graph.oBedding_.setDirtyState();
    EXPECT_TRUE(graph.oSink_.isDirty());
}

TEST_F(BeddingTest, forwardsFrames) {
    Planted graph;
    graph.oBedding_.plantMasterTree(graph.oSink_);
    graph.oBedding_.computeRegions(world(0, 0, 8, 8));
    graph.oBedding_.process();
    EXPECT_EQ(1, graph.oSource_.nRuns_);
    graph.oBedding_.processAsync();
    EXPECT_TRUE(graph.oBedding_.wait(60, 0.001));
    EXPECT_EQ(2, graph.oSource_.nRuns_);
    graph.oBedding_.sleep(0);
    EXPECT_EQ(DataFlow::Controller::CONTROLLER_STOPPED, graph.oController_.controllerStatus());
}

TEST_F(BeddingTest, failuresOfTheControllerPass) {
    Planted graph;
    ORVO_EXPECT_INTERNAL(graph.oBedding_.process(), "Enforce pSink != NULL");
    ORVO_EXPECT_INTERNAL(graph.oBedding_.propagateDODs(), "Enforce imageSink() != NULL");
}

} // namespace

} // namespace ORVO
