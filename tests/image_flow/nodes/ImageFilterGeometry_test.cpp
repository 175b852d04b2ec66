#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

namespace ORVO {

namespace {

using Test::feed;
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

/// A consumer whose producer is no image node.
class ForeignNode : public DataFlow::Node {
public:
    ForeignNode() : Node("foreign"), oOutput_("out", this) { addOutput(&oOutput_); }
    ~ForeignNode() override { disconnect(); }
    DataFlow::ConstOutput<ImageCPU> oOutput_;
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
    TestFilter a(0);
    TestFilter b(0);
    TestFilter filter(2);
    a.setOutputPixelExtent(PixelExtentInWorldSpace(3, 4));
    b.setOutputPixelExtent(PixelExtentInWorldSpace(5, 6));
    feed(filter, 0, b);
    feed(filter, 1, a);
    a.computePixelExtents();
    b.computePixelExtents();
    filter.computePixelExtents();
    EXPECT_EQ(PixelExtentInWorldSpace(5, 6), inputExtent(filter, "in0"));
    EXPECT_EQ(PixelExtentInWorldSpace(3, 4), inputExtent(filter, "in1"));
    EXPECT_EQ(PixelExtentInWorldSpace(5, 6), filter.outputPixelExtent());
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
    TestFilter a(0);
    TestFilter b(0);
    TestFilter filter(2);
    filter.iRadius_ = 1;
    feed(filter, 0, b);
    feed(filter, 1, a);
    a.setDomainOfDefinition(world(0, 0, 10, 10));
    b.setDomainOfDefinition(world(20, 0, 5, 5));
    EXPECT_EQ(world(-1, -1, 27, 12), filter.computeDomainOfDefinition());
    EXPECT_EQ((std::vector<std::string>{"in0", "in1"}), filter.aChanged_);
    filter.setGeneratedRegion(world(-10, 0, 1, 1));
    EXPECT_EQ(world(-10, -1, 36, 12), filter.computeDomainOfDefinition());
    // A node without an output generates nothing.
    TestFilter sink(1, false);
    feed(sink, 0, filter);
    filter.setDomainOfDefinition(world(0, 0, 2, 2));
    sink.setGeneratedRegion(world(-10, 0, 1, 1));
    EXPECT_EQ(world(0, 0, 2, 2), sink.computeDomainOfDefinition());
}

TEST_F(ImageFilterGeometryTest, undefinedDomainsContributeNothingAndInfiniteOnesStay) {
    TestFilter a(0);
    TestFilter b(0);
    TestFilter filter(2);
    feed(filter, 0, a);
    feed(filter, 1, b);
    EXPECT_FALSE(filter.computeDomainOfDefinition().extent().isDefined());
    a.setDomainOfDefinition(world(1, 1, 2, 2));
    EXPECT_EQ(world(1, 1, 2, 2), filter.computeDomainOfDefinition());
    b.setDomainOfDefinition(infiniteWorld());
    EXPECT_TRUE(filter.computeDomainOfDefinition().isInfinite());
}

TEST_F(ImageFilterGeometryTest, handsItsROIToTheProducers) {
    TestFilter a(0);
    TestFilter b(0);
    TestFilter filter(2);
    filter.iRadius_ = 2;
    feed(filter, 0, a);
    feed(filter, 1, b);
    filter.setRegionOfInterest(world(0, 0, 4, 4));
    filter.computeAndSetChildROIs();
    ASSERT_EQ(1u, a.aParentROIs_.size());
    EXPECT_EQ(world(-2, -2, 8, 8), a.aParentROIs_[0]);
    ASSERT_EQ(1u, b.aParentROIs_.size());
}

TEST_F(ImageFilterGeometryTest, takesOneParentROIForEachOutput) {
    TestFilter filter(0);
    filter.cloneImageOutput();
    filter.setRegionOfInterest(world(50, 50, 1, 1));
    filter.setParentROI(world(0, 0, 1, 1));
    ORVO_EXPECT_INTERNAL(filter.computeUnionOfParentROIs(),
                         "aParentROIs_.size() == totalNumberOfAllImageOutputs()");
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
