#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

namespace ORVO {

namespace {

using Test::feed;
using Test::ForeignNode;
using Test::infiniteWorld;
using Test::TestFilter;
using Test::world;

class ImageFilterGeometryTest : public testing::Test {
protected:
    ORVO::Test::ImageFlowLayers oLayers_;
};

PixelExtentInWorldSpace inputExtent(TestFilter const& filter, char const* name = "in0") {
    return filter.spPixelExtentSet()->aInputPixelExtents_.at(name);
}

/// Two producers of one filter.
struct Pair {
    Pair() : a(0), b(0), filter(2) {
        feed(filter, 0, a);
        feed(filter, 1, b);
    }
    TestFilter a, b, filter;
};

TEST_F(ImageFilterGeometryTest, aSourceHasPixelsOfOne) {
    TestFilter source(0);
    source.computePixelExtents();
    EXPECT_EQ(PixelExtentInWorldSpace(1, 1), source.outputPixelExtent());
    EXPECT_TRUE(source.spPixelExtentSet()->aInputPixelExtents_.empty());
}

TEST_F(ImageFilterGeometryTest, aForcedPixelExtentIsInherited) {
    TestFilter source(0);
    TestFilter middle;
    TestFilter last;
    feed(middle, 0, source);
    feed(last, 0, middle);
    middle.setOutputPixelExtent(PixelExtentInWorldSpace(2, 2));
    source.computePixelExtents();
    middle.computePixelExtents();
    last.computePixelExtents();
    EXPECT_EQ(PixelExtentInWorldSpace(1, 1), inputExtent(middle));
    EXPECT_EQ(PixelExtentInWorldSpace(2, 2), middle.outputPixelExtent());
    EXPECT_EQ(PixelExtentInWorldSpace(2, 2), inputExtent(last));
    EXPECT_EQ(PixelExtentInWorldSpace(2, 2), last.outputPixelExtent());
}

TEST_F(ImageFilterGeometryTest, theFirstInputDecides) {
    Pair graph;
    graph.a.setOutputPixelExtent(PixelExtentInWorldSpace(5, 6));
    graph.b.setOutputPixelExtent(PixelExtentInWorldSpace(3, 4));
    graph.b.computePixelExtents();
    graph.a.computePixelExtents();
    graph.filter.computePixelExtents();
    EXPECT_EQ(PixelExtentInWorldSpace(5, 6), inputExtent(graph.filter, "in0"));
    EXPECT_EQ(PixelExtentInWorldSpace(3, 4), inputExtent(graph.filter, "in1"));
    EXPECT_EQ(PixelExtentInWorldSpace(5, 6), graph.filter.outputPixelExtent());
}

TEST_F(ImageFilterGeometryTest, aSinkHasInputExtentsOnly) {
    TestFilter source(0);
    TestFilter sink(1, false);
    source.setOutputPixelExtent(PixelExtentInWorldSpace(7, 8));
    feed(sink, 0, source);
    source.computePixelExtents();
    sink.computePixelExtents();
    EXPECT_EQ(PixelExtentInWorldSpace(7, 8), inputExtent(sink));
    EXPECT_TRUE(sink.spPixelExtentSet()->aOutputPixelExtents_.empty());
}

TEST_F(ImageFilterGeometryTest, consumersOfClonesInheritToo) {
    TestFilter source(0);
    TestFilter first;
    TestFilter second;
    feed(first, 0, source);
    feed(second, 0, source);
    source.setOutputPixelExtent(PixelExtentInWorldSpace(4, 4));
    source.computePixelExtents();
    second.computePixelExtents();
    EXPECT_EQ(PixelExtentInWorldSpace(4, 4), inputExtent(second));
}

TEST_F(ImageFilterGeometryTest, gapsAreReported) {
    TestFilter filter;
    ORVO_EXPECT_INTERNAL(filter.computePixelExtents(), "Enforce pOutput != NULL");
    ORVO_EXPECT_INTERNAL(filter.computeDomainOfDefinition(), "Enforce pOutput != NULL");
    ORVO_EXPECT_INTERNAL(filter.computeAndSetChildROIs(), "Enforce pOutput != NULL");
    DataFlow::ConstOutput<ImageCPU> orphan("out", nullptr);
    DataFlow::Connect(filter.in(), orphan);
    ORVO_EXPECT_INTERNAL(filter.computePixelExtents(), "Enforce pSource != NULL");
    ORVO_EXPECT_INTERNAL(filter.computeDomainOfDefinition(), "Enforce pSource != NULL");
    ORVO_EXPECT_INTERNAL(filter.computeAndSetChildROIs(), "Enforce pSource != NULL");
    filter.disconnect();
    ForeignNode foreign;
    DataFlow::Connect(filter.in(), foreign.oOutput_);
    ORVO_EXPECT_INTERNAL(filter.computePixelExtents(), "Enforce pSource != NULL");
}

TEST_F(ImageFilterGeometryTest, neededAndChangedPassTheRegionThrough) {
    TestFilter filter;
    EXPECT_EQ(world(1, 2, 3, 4), filter.ImageFilter::needed(world(1, 2, 3, 4), "in0", {}));
    EXPECT_TRUE(filter.ImageFilter::needed(infiniteWorld(), "in0", {}).isInfinite());
    EXPECT_TRUE(filter.ImageFilter::changed(infiniteWorld(), "in0", {}).isInfinite());
    EXPECT_FALSE(filter.ImageFilter::needed({}, "in0", {}).extent().isDefined());
    EXPECT_EQ(world(1, 2, 3, 4), filter.ImageFilter::changed(world(1, 2, 3, 4), "in0", {}));
}

TEST_F(ImageFilterGeometryTest, theDomainIsTheUnionOfWhatInputsAndNodeContribute) {
    Pair graph;
    graph.filter.iRadius_ = 1;
    graph.a.setDomainOfDefinition(world(20, 0, 5, 5));
    graph.b.setDomainOfDefinition(world(0, 0, 10, 10));
    EXPECT_EQ(world(-1, -1, 27, 12), graph.filter.computeDomainOfDefinition());
    EXPECT_EQ((std::vector<std::string>{"in0", "in1"}), graph.filter.aChanged_);
    graph.filter.setGeneratedRegion(world(-10, 0, 1, 1));
    EXPECT_EQ(world(-10, -1, 36, 12), graph.filter.computeDomainOfDefinition());
    // A node without an output generates nothing.
    TestFilter sink(1, false);
    feed(sink, 0, graph.filter);
    graph.filter.setDomainOfDefinition(world(0, 0, 2, 2));
    sink.setGeneratedRegion(world(-10, 0, 1, 1));
    EXPECT_EQ(world(0, 0, 2, 2), sink.computeDomainOfDefinition());
}

TEST_F(ImageFilterGeometryTest, inputsContributeInTheOrderOfTheirNames) {
    TestFilter producer(0);
    TestFilter filter(11); // "in10" stands between "in1" and "in2"
    for (std::size_t i = 0; i < 11; ++i) {
        feed(filter, i, producer);
    }
    filter.computeDomainOfDefinition();
    EXPECT_EQ((std::vector<std::string>{"in0", "in1", "in10", "in2", "in3", "in4", "in5", "in6", "in7", "in8",
                                        "in9"}),
              filter.aChanged_);
}

TEST_F(ImageFilterGeometryTest, undefinedDomainsContributeNothingAndInfiniteOnesStay) {
    Pair graph;
    EXPECT_FALSE(graph.filter.computeDomainOfDefinition().extent().isDefined());
    graph.a.setDomainOfDefinition(world(1, 1, 2, 2));
    EXPECT_EQ(world(1, 1, 2, 2), graph.filter.computeDomainOfDefinition());
    graph.b.setDomainOfDefinition(infiniteWorld());
    EXPECT_TRUE(graph.filter.computeDomainOfDefinition().isInfinite());
}

TEST_F(ImageFilterGeometryTest, handsItsROIToTheProducers) {
    Pair graph;
    graph.filter.iRadius_ = 2;
    graph.filter.setRegionOfInterest(world(0, 0, 4, 4));
    graph.filter.computeAndSetChildROIs();
    ASSERT_EQ(1u, graph.a.aParentROIs_.size());
    EXPECT_EQ(world(-2, -2, 8, 8), graph.a.aParentROIs_[0]);
    ASSERT_EQ(1u, graph.b.aParentROIs_.size());
    EXPECT_EQ(world(-2, -2, 8, 8), graph.b.aParentROIs_[0]);
}

TEST_F(ImageFilterGeometryTest, handsNothingOnWhereAnInputIsUnconnected) {
    Pair graph;
    graph.filter.in(1).disconnect();
    ORVO_EXPECT_INTERNAL(graph.filter.computeAndSetChildROIs(), "Enforce pOutput != NULL");
    EXPECT_TRUE(graph.a.aParentROIs_.empty());
}

TEST_F(ImageFilterGeometryTest, takesOneParentROIForEachOutput) {
    TestFilter filter(0);
    filter.cloneImageOutput();
    filter.setRegionOfInterest(world(50, 50, 1, 1));
    filter.setParentROI(world(0, 0, 1, 1));
    ORVO_EXPECT_INTERNAL(filter.computeUnionOfParentROIs(),
                         "aParentROIs_.size() == totalNumberOfAllImageOutputs()");
    EXPECT_EQ(world(50, 50, 1, 1), filter.regionOfInterest());
    filter.setParentROI(world(2, 2, 1, 1));
    ORVO_EXPECT_INTERNAL(filter.setParentROI(world(4, 4, 1, 1)),
                         "aParentROIs_.size() < totalNumberOfAllImageOutputs()");
    EXPECT_EQ(2u, filter.aParentROIs_.size());
    filter.computeUnionOfParentROIs();
    EXPECT_EQ(world(0, 0, 3, 3), filter.regionOfInterest());
    EXPECT_TRUE(filter.aParentROIs_.empty());
    TestFilter sink(0, false);
    ORVO_EXPECT_INTERNAL(sink.setParentROI(world(0, 0, 1, 1)),
                         "aParentROIs_.size() < totalNumberOfAllImageOutputs()");
}

TEST_F(ImageFilterGeometryTest, withoutParentsTheROIStays) {
    TestFilter filter(0);
    filter.setRegionOfInterest(world(1, 1, 5, 5));
    filter.computeUnionOfParentROIs();
    EXPECT_EQ(world(1, 1, 5, 5), filter.regionOfInterest());
    filter.setParentROI(world(9, 9, 1, 1));
    filter.clearParentROIs();
    filter.computeUnionOfParentROIs();
    EXPECT_EQ(world(1, 1, 5, 5), filter.regionOfInterest());
}

TEST_F(ImageFilterGeometryTest, generatesWhatItWasTold) {
    TestFilter filter(0);
    filter.setGeneratedRegion(world(1, 2, 3, 4));
    EXPECT_EQ(world(1, 2, 3, 4), filter.generated({}));
    EXPECT_EQ(world(1, 2, 3, 4), filter.computeDomainOfDefinition());
}

} // namespace

} // namespace ORVO
