#include "orvo/image_flow/graph/DFSPostStackVisitor.h"
#include "orvo/image_flow/graph/PropagateDODVisitor.h"
#include "orvo/image_flow/graph/PropagatePixelExtentVisitor.h"
#include "orvo/image_flow/graph/PropagateROIVisitor.h"
#include "orvo/image_flow/graph/SetDirtyStateVisitor.h"
#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"
#include "tests/support/Slots.h"

namespace ORVO {

namespace {

using Test::feed;
using Test::plant;
using Test::TestFilter;
using Test::world;

class VisitorsTest : public testing::Test {
protected:
    ORVO::Test::ImageFlowLayers oLayers_;
};

TEST(VisitorTest, hasItsOperationsInOrder) {
    // The destructor stands first.
    EXPECT_EQ(2, ORVO::Test::slotOf(&Visitor::preVisitImageNode));
    EXPECT_EQ(3, ORVO::Test::slotOf(&Visitor::postVisitImageNode));
}

TEST_F(VisitorsTest, nodesThatAreNoImageNodesAreReported) {
    constexpr char const* pText = "Enforce pImageFilter != NULL";
    PropagatePixelExtentVisitor pixelExtents;
    ORVO_EXPECT_INTERNAL(pixelExtents.postVisitImageNode(nullptr), pText);
    PropagateDODVisitor dods;
    ORVO_EXPECT_INTERNAL(dods.postVisitImageNode(nullptr), pText);
    PropagateROIVisitor rois;
    ORVO_EXPECT_INTERNAL(rois.preVisitImageNode(nullptr), pText);
    SetDirtyStateVisitor dirty;
    ORVO_EXPECT_INTERNAL(dirty.postVisitImageNode(nullptr), pText);
    // The other visit of each does nothing at all.
    pixelExtents.preVisitImageNode(nullptr);
    dods.preVisitImageNode(nullptr);
    rois.postVisitImageNode(nullptr);
    dirty.preVisitImageNode(nullptr);
}

TEST_F(VisitorsTest, workOnlyOnTheirSideOfTheVisit) {
    TestFilter filter(0);
    filter.setGeneratedRegion(world(0, 0, 2, 2));
    PropagatePixelExtentVisitor pixelExtents;
    pixelExtents.preVisitImageNode(&filter);
    EXPECT_TRUE(filter.spPixelExtentSet()->aOutputPixelExtents_.empty());
    pixelExtents.postVisitImageNode(&filter);
    EXPECT_EQ(1u, filter.spPixelExtentSet()->aOutputPixelExtents_.size());
    PropagateDODVisitor dods;
    dods.preVisitImageNode(&filter);
    EXPECT_FALSE(filter.domainOfDefinition().extent().isDefined());
    dods.postVisitImageNode(&filter);
    EXPECT_EQ(world(0, 0, 2, 2), filter.domainOfDefinition());
    SetDirtyStateVisitor dirty;
    dirty.preVisitImageNode(&filter);
    EXPECT_FALSE(filter.isDirty());
    dirty.postVisitImageNode(&filter);
    EXPECT_TRUE(filter.isDirty());
}

TEST_F(VisitorsTest, theROIVisitorHandsRegionsOnWhileEntering) {
    TestFilter source(0);
    TestFilter filter;
    feed(filter, 0, source);
    filter.setRegionOfInterest(world(1, 1, 2, 2));
    PropagateROIVisitor visitor;
    visitor.postVisitImageNode(&filter);
    EXPECT_TRUE(source.aParentROIs_.empty());
    visitor.preVisitImageNode(&filter);
    ASSERT_EQ(1u, source.aParentROIs_.size());
    EXPECT_EQ(world(1, 1, 2, 2), source.aParentROIs_[0]);
}

TEST_F(VisitorsTest, theStackHoldsEachNodeOnceAfterItsProducers) {
    TestFilter a(0, true, "a");
    TestFilter b(1, true, "b");
    TestFilter c(1, true, "c");
    TestFilter d(2, false, "d");
    feed(b, 0, a);
    feed(c, 0, a);
    feed(d, 0, b);
    feed(d, 1, c);
    ImageFlowController controller;
    plant(controller, {&d, &c, &b, &a}, d);
    DFSPostStackVisitor visitor;
    controller.depthFirstSearch(visitor);
    EXPECT_EQ((std::vector<ImageFilter*>{&a, &b, &c, &d}), visitor.stack());
}

TEST_F(VisitorsTest, aDirtySourceMakesAllDownstreamDirtyAndNothingElse) {
    TestFilter up(0, true, "up");
    TestFilter changed(1, true, "changed");
    TestFilter down(1, true, "down");
    TestFilter sink(1, false, "sink");
    feed(changed, 0, up);
    feed(down, 0, changed);
    feed(sink, 0, down);
    ImageFlowController controller;
    plant(controller, {&up, &changed, &down, &sink}, sink);
    controller.setDirtyState();
    EXPECT_TRUE(up.isDirty()); // parameters are born dirty
    controller.setDirtyState();
    for (TestFilter* pFilter : {&up, &changed, &down, &sink}) {
        EXPECT_FALSE(pFilter->isDirty()) << pFilter->name();
    }
    changed.oOffset_.setValue(1.0f);
    controller.setDirtyState();
    EXPECT_FALSE(up.isDirty());
    EXPECT_TRUE(changed.isDirty());
    EXPECT_TRUE(down.isDirty());
    EXPECT_TRUE(sink.isDirty());
}

} // namespace

} // namespace ORVO
