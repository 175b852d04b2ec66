#include "orvo/image_flow/controllers/ImageFlowController.h"

#include "orvo/image_flow/graph/DFSPostStackVisitor.h"
#include "orvo/image_flow/graph/PropagateROIVisitor.h"
#include "orvo/image_flow/graph/Visitor.h"
#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <array>
#include <deque>
#include <limits>

namespace ORVO {

namespace {

using DataFlow::Node;
using Hint = ImageFilter::teOutputPrecisionHint;
using Test::feed;
using Test::ForeignNode;
using Test::infiniteWorld;
using Test::pixels;
using Test::plant;
using Test::TestFilter;
using Test::world;

class ImageFlowControllerTest : public testing::Test {
protected:
    ORVO::Test::ImageFlowLayers oLayers_;
};

/// Writes down the visits: "+a" on entering, "-a" on leaving.
class Recorder : public Visitor {
public:
    void preVisitImageNode(ImageFilter* pImageFilter) override { note("+", pImageFilter); }
    void postVisitImageNode(ImageFilter* pImageFilter) override { note("-", pImageFilter); }
    std::string sVisits_;

private:
    void note(char const* pPrefix, ImageFilter* pImageFilter) {
        sVisits_ += (sVisits_.empty() ? "" : " ") + std::string(pPrefix) +
                    (pImageFilter == nullptr ? "null" : pImageFilter->name());
    }
};

/// a feeds b, and c on a clone; both feed d. x stands apart.
struct Diamond {
    Diamond() : a(0, true, "a"), b(1, true, "b"), c(1, true, "c"), d(2, true, "d"), x(0, true, "x") {
        feed(b, 0, a);
        feed(c, 0, a);
        feed(d, 0, b);
        feed(d, 1, c);
        plant(oController_, {&a, &b, &x, &c, &d}, d);
        a.setGeneratedRegion(world(0, 0, 100, 100));
    }

    /// The nodes that the sink reaches.
    std::array<TestFilter*, 4> reached() { return {&a, &b, &c, &d}; }
    std::array<TestFilter*, 5> all() { return {&a, &b, &c, &d, &x}; }

    TestFilter a, b, c, d, x;
    ImageFlowController oController_;
};

TEST_F(ImageFlowControllerTest, walksReachEachNodeOnce) {
    struct Row {
        void (ImageFlowController::*pWalk)(Visitor&);
        char const* visits;
        Node::teColor color;
    };
    for (Row const& row :
         {Row{&ImageFlowController::depthFirstSearch, "+d +b +a -a -b +c -c -d", Node::COLOR_DISCOVERED},
          Row{&ImageFlowController::breadthFirstSearch, "+d -d +b -b +c -c +a -a", Node::COLOR_FINISHED}}) {
        Diamond graph;
        Recorder recorder;
        (graph.oController_.*row.pWalk)(recorder);
        EXPECT_EQ(row.visits, recorder.sVisits_);
        for (TestFilter const* pFilter : graph.reached()) {
            EXPECT_EQ(row.color, pFilter->color()) << row.visits;
        }
        EXPECT_EQ(Node::COLOR_NOT_VISITED, graph.x.color());
    }
}

/// A controller whose walks can be begun at any node.
class OpenController : public ImageFlowController {
public:
    using ImageFlowController::depthFirstVisit;
};

/// Begins a walk of its own in the middle of one.
class Wanderer : public Visitor {
public:
    explicit Wanderer(ImageFlowController& controller) : controller_(controller) {}
    void preVisitImageNode(ImageFilter* /*pImageFilter*/) override { ++nVisits_; }
    void postVisitImageNode(ImageFilter* /*pImageFilter*/) override {
        Recorder recorder;
        controller_.depthFirstSearch(recorder);
    }
    ImageFlowController& controller_;
    int nVisits_ = 0;
};

TEST_F(ImageFlowControllerTest, thereIsNoVisitorBetweenWalks) {
    constexpr char const* pText = "Enforce pVisitor_ != NULL";
    TestFilter sink(0, false, "sink");
    OpenController controller;
    plant(controller, {&sink}, sink);
    ORVO_EXPECT_INTERNAL(controller.depthFirstVisit(&sink), pText);
    Recorder recorder;
    controller.depthFirstSearch(recorder);
    ORVO_EXPECT_INTERNAL(controller.depthFirstVisit(&sink), pText);
    controller.breadthFirstSearch(recorder);
    ORVO_EXPECT_INTERNAL(controller.depthFirstVisit(&sink), pText);
    EXPECT_EQ("+sink -sink +sink -sink", recorder.sVisits_);
}

TEST_F(ImageFlowControllerTest, aWalkWithinAWalkEndsTheOuterOne) {
    constexpr char const* pText = "Enforce pVisitor_ != NULL";
    Diamond graph;
    Wanderer depth(graph.oController_);
    ORVO_EXPECT_INTERNAL(graph.oController_.depthFirstSearch(depth), pText);
    EXPECT_EQ(3, depth.nVisits_); // d, b and a, on leaving which the other walk begins
    Wanderer breadth(graph.oController_);
    ORVO_EXPECT_INTERNAL(graph.oController_.breadthFirstSearch(breadth), pText);
    EXPECT_EQ(1, breadth.nVisits_);
}

TEST_F(ImageFlowControllerTest, walksNeedASinkAndFullInputs) {
    ImageFlowController controller;
    Recorder recorder;
    ORVO_EXPECT_INTERNAL(controller.depthFirstSearch(recorder), "Enforce imageSink() != NULL");
    ORVO_EXPECT_INTERNAL(controller.breadthFirstSearch(recorder), "Enforce imageSink() != NULL");
    ORVO_EXPECT_INTERNAL(controller.propagatePixelExtents(), "Enforce imageSink() != NULL");
    ORVO_EXPECT_INTERNAL(controller.propagateDODs(), "Enforce imageSink() != NULL");
    ORVO_EXPECT_INTERNAL(controller.propagateROIs(world(0, 0, 1, 1)), "Enforce imageSink() != NULL");
    ORVO_EXPECT_INTERNAL(controller.computeRegions(world(0, 0, 1, 1)), "Enforce imageSink() != NULL");
    ORVO_EXPECT_INTERNAL(controller.setDirtyState(), "Enforce imageSink() != NULL");
    EXPECT_EQ(nullptr, controller.imageSink());
    EXPECT_EQ("", recorder.sVisits_);

    TestFilter sink(1, false, "sink");
    plant(controller, {&sink}, sink);
    EXPECT_EQ(&sink, static_cast<ImageFlowController const&>(controller).imageSink());
    ORVO_EXPECT_INTERNAL(controller.depthFirstSearch(recorder), "Enforce pOutput != NULL");
    ORVO_EXPECT_INTERNAL(controller.breadthFirstSearch(recorder), "Enforce pOutput != NULL");
    DataFlow::ConstOutput<ImageCPU> orphan("out", nullptr);
    DataFlow::Connect(sink.in(), orphan);
    ORVO_EXPECT_INTERNAL(controller.depthFirstSearch(recorder), "Enforce pSource != NULL");
    ORVO_EXPECT_INTERNAL(controller.breadthFirstSearch(recorder), "Enforce pSource != NULL");
    sink.disconnect();
}

TEST_F(ImageFlowControllerTest, aSinkOfAnotherKindIsNoImageSink) {
    ForeignNode foreign;
    ImageFlowController controller;
    controller.addNode(&foreign);
    controller.setSinkNode(&foreign);
    EXPECT_EQ(nullptr, controller.imageSink());
    ORVO_EXPECT_INTERNAL(controller.setDirtyState(), "Enforce imageSink() != NULL");
}

TEST_F(ImageFlowControllerTest, walksPassNodesOfAnotherKindAsNull) {
    ForeignNode foreign;
    TestFilter sink(1, false, "sink");
    DataFlow::Connect(sink.in(), foreign.oOutput_);
    ImageFlowController controller;
    plant(controller, {&foreign, &sink}, sink);
    Recorder depth;
    controller.depthFirstSearch(depth);
    EXPECT_EQ("+sink +null -null -sink", depth.sVisits_);
    Recorder breadth;
    controller.breadthFirstSearch(breadth);
    EXPECT_EQ("+sink -sink +null -null", breadth.sVisits_);
    ORVO_EXPECT_INTERNAL(controller.propagateDODs(), "Enforce pImageFilter != NULL");
    ORVO_EXPECT_INTERNAL(controller.propagateROIs(world(0, 0, 1, 1)), "Enforce pImageFilter != NULL");
    ORVO_EXPECT_INTERNAL(controller.setNodeImageDescriptorInfo(false), "iff!=0");
    ORVO_EXPECT_INTERNAL(controller.setNodeImageDescriptorInfo(true), "iff!=0");
    ORVO_EXPECT_INTERNAL(controller.process(), "iff!=0");
}

TEST_F(ImageFlowControllerTest, aCycleEndsTheWalk) {
    TestFilter a(1, true, "a");
    TestFilter b(1, true, "b");
    feed(a, 0, b);
    feed(b, 0, a);
    ImageFlowController controller;
    plant(controller, {&a, &b}, a);
    Recorder depth;
    controller.depthFirstSearch(depth);
    EXPECT_EQ("+a +b -b -a", depth.sVisits_);
    Recorder breadth;
    controller.breadthFirstSearch(breadth);
    EXPECT_EQ("+a -a +b -b", breadth.sVisits_);
}

TEST_F(ImageFlowControllerTest, aFailedWalkLeavesTheControllerFit) {
    Diamond graph;
    Recorder recorder;
    graph.c.disconnect();
    ORVO_EXPECT_INTERNAL(graph.oController_.depthFirstSearch(recorder), "Enforce pOutput != NULL");
    feed(graph.d, 1, graph.c);
    DataFlow::Connect(graph.c.in(), *graph.a.clonedImageOutput(0));
    Recorder second;
    graph.oController_.depthFirstSearch(second);
    EXPECT_EQ("+d +b +a -a -b +c -c -d", second.sVisits_);
}

TEST_F(ImageFlowControllerTest, chainsOfAnyLengthAreWalkedOnTheHeap) {
    std::deque<TestFilter> chain;
    ImageFlowController controller;
    chain.emplace_back(0);
    for (int i = 1; i < 50000; ++i) {
        chain.emplace_back();
        feed(chain.back(), 0, chain[chain.size() - 2]);
    }
    for (TestFilter& filter : chain) {
        filter.iRadius_ = &filter == &chain.front() ? 0 : 1;
        controller.addNode(&filter);
    }
    chain.front().setGeneratedRegion(world(0, 0, 4, 4));
    controller.setImageSink(chain.back());
    controller.computeRegions(world(0, 0, 2, 2));
    controller.setDirtyState();
    // 49,999 filters grow the region by one pixel on each side.
    EXPECT_EQ(world(-49999, -49999, 2 + 2 * 49999, 2 + 2 * 49999), chain.front().regionOfInterest());
    EXPECT_EQ(world(-49999, -49999, 4 + 2 * 49999, 4 + 2 * 49999), chain.back().domainOfDefinition());
    EXPECT_TRUE(chain.back().isDirty());
    Recorder recorder;
    controller.breadthFirstSearch(recorder);
    EXPECT_EQ("+TestFilter", recorder.sVisits_.substr(0, 11));
    EXPECT_EQ(50000u * std::string("+TestFilter -TestFilter ").size() - 1, recorder.sVisits_.size());
    for (TestFilter& filter : chain) {
        EXPECT_EQ(&filter == &chain.front() ? 0 : 1, filter.nNeeded_);
        filter.disconnect();
    }
}

TEST_F(ImageFlowControllerTest, regionsOfInterestUniteOverAllConsumers) {
    Diamond graph;
    graph.b.iRadius_ = 3;
    graph.c.iRadius_ = 1;
    graph.oController_.computeRegions(world(10, 20, 30, 40));
    EXPECT_EQ(world(10, 20, 30, 40), graph.d.regionOfInterest());
    EXPECT_EQ(world(10, 20, 30, 40), graph.b.regionOfInterest());
    EXPECT_EQ(world(10, 20, 30, 40), graph.c.regionOfInterest());
    EXPECT_EQ(world(7, 17, 36, 46), graph.a.regionOfInterest());
    EXPECT_EQ(world(7, 17, 36, 46), graph.a.computeRegionParameter().value());
    EXPECT_EQ(world(-3, -3, 106, 106), graph.d.domainOfDefinition());
    EXPECT_EQ(1, graph.b.nNeeded_);
    EXPECT_EQ(1, graph.c.nNeeded_);
    EXPECT_TRUE(graph.a.aParentROIs_.empty());
}

TEST_F(ImageFlowControllerTest, computeRegionsAreCutToTheDomain) {
    Diamond graph;
    graph.a.setGeneratedRegion(world(0, 0, 15, 15));
    graph.oController_.computeRegions(world(10, 10, 30, 40));
    EXPECT_EQ(world(10, 10, 5, 5), graph.a.computeRegionParameter().value());
    graph.oController_.computeRegions(world(20, 20, 5, 5));
    EXPECT_EQ(ExtentInWorldSpace(0, 0).width(), graph.a.computeRegionParameter().value().extent().width());
    EXPECT_TRUE(graph.a.computeRegionParameter().value().isEmpty());
}

TEST_F(ImageFlowControllerTest, nodesOutOfReachKeepTheirRegionsButGetAComputeRegion) {
    Diamond graph;
    graph.x.setDomainOfDefinition(world(0, 0, 10, 10));
    graph.x.setRegionOfInterest(world(5, 5, 10, 10));
    graph.oController_.computeRegions(world(0, 0, 1, 1));
    EXPECT_EQ(world(0, 0, 10, 10), graph.x.domainOfDefinition());
    EXPECT_EQ(world(5, 5, 10, 10), graph.x.regionOfInterest());
    EXPECT_EQ(world(5, 5, 5, 5), graph.x.computeRegionParameter().value());
}

TEST_F(ImageFlowControllerTest, theSameRegionsMakeNothingDirty) {
    Diamond graph;
    graph.oController_.computeRegions(world(0, 0, 10, 10));
    graph.oController_.setDirtyState();
    graph.oController_.computeRegions(world(0, 0, 10, 10));
    graph.oController_.setDirtyState();
    for (TestFilter* pFilter : graph.reached()) {
        EXPECT_FALSE(pFilter->isDirty()) << pFilter->name();
    }
    graph.oController_.computeRegions(world(0, 0, 10, 11));
    graph.oController_.setDirtyState();
    for (TestFilter* pFilter : graph.reached()) {
        EXPECT_TRUE(pFilter->isDirty()) << pFilter->name();
    }
}

TEST_F(ImageFlowControllerTest, infiniteComputeRegionsAreRefused) {
    Diamond graph;
    graph.oController_.computeRegions(infiniteWorld());
    EXPECT_EQ(world(0, 0, 100, 100), graph.d.computeRegionParameter().value());
    graph.a.setGeneratedRegion(infiniteWorld());
    graph.oController_.computeRegions(world(0, 0, 8, 8));
    EXPECT_EQ(world(0, 0, 8, 8), graph.a.computeRegionParameter().value());
    // One endless direction is enough.
    float const infinity = std::numeric_limits<float>::infinity();
    for (auto const& asked : {world(0, 0, infinity, 8), world(0, 0, 8, infinity)}) {
        ORVO_EXPECT_INTERNAL(graph.oController_.computeRegions(asked), "Output region can't be infinite.");
    }
    ORVO_EXPECT_INTERNAL(graph.oController_.computeRegions(infiniteWorld()),
                         "Output region can't be infinite.");
    // The first node in the list has its region; those after it keep their old one.
    EXPECT_TRUE(graph.a.computeRegionParameter().value().isInfinite());
    EXPECT_EQ(world(0, 0, 8, 8), graph.b.computeRegionParameter().value());
    graph.oController_.computeRegions(world(1, 1, 8, 8));
    EXPECT_EQ(world(1, 1, 8, 8), graph.a.computeRegionParameter().value());
}

/// A filter that cannot say what it needs.
class HelplessFilter : public TestFilter {
public:
    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string inputName,
                                      RegionMap const& inputDODs) override {
        ORVO_CHECK(!bHelpless_, "helpless");
        return TestFilter::needed(outputRegion, inputName, inputDODs);
    }
    bool bHelpless_ = true;
};

TEST_F(ImageFlowControllerTest, regionsOfAFailedPassAreForgotten) {
    TestFilter source(0, true, "source");
    HelplessFilter first;
    TestFilter second(1, true, "second");
    TestFilter sink(2, false, "sink");
    feed(first, 0, source);
    feed(second, 0, source);
    feed(sink, 0, first);
    feed(sink, 1, second);
    ImageFlowController controller;
    plant(controller, {&source, &first, &second, &sink}, sink);
    source.setGeneratedRegion(world(0, 0, 100, 100));
    ORVO_EXPECT_INTERNAL(controller.computeRegions(world(50, 50, 4, 4)), "helpless");
    // The source is left with the region of one consumer of two.
    EXPECT_EQ(1u, source.aParentROIs_.size());
    first.bHelpless_ = false;
    controller.computeRegions(world(0, 0, 4, 4));
    EXPECT_EQ(world(0, 0, 4, 4), source.regionOfInterest());
    EXPECT_EQ(world(0, 0, 4, 4), source.computeRegionParameter().value());
    EXPECT_TRUE(source.aParentROIs_.empty());
}

TEST_F(ImageFlowControllerTest, theSinkKeepsTheRegionOfAPassThatFailed) {
    TestFilter source(0, true, "source");
    TestFilter sink(2, false, "sink");
    feed(sink, 0, source);
    ImageFlowController controller;
    plant(controller, {&source, &sink}, sink);
    ORVO_EXPECT_INTERNAL(controller.propagateROIs(world(1, 2, 3, 4)), "Enforce pOutput != NULL");
    EXPECT_EQ(world(1, 2, 3, 4), sink.regionOfInterest());
    EXPECT_FALSE(source.regionOfInterest().extent().isDefined());
}

TEST_F(ImageFlowControllerTest, anOutputThatNobodyConsumesFailsThePass) {
    Diamond graph;
    graph.a.cloneImageOutput();
    ORVO_EXPECT_INTERNAL(graph.oController_.computeRegions(world(0, 0, 4, 4)),
                         "aParentROIs_.size() == totalNumberOfAllImageOutputs()");
    TestFilter e(1, true, "e");
    feed(e, 0, graph.x);
    DataFlow::Connect(e.in(), *graph.a.clonedImageOutput(1));
    ORVO_EXPECT_INTERNAL(graph.oController_.computeRegions(world(0, 0, 4, 4)),
                         "aParentROIs_.size() == totalNumberOfAllImageOutputs()");
}

TEST_F(ImageFlowControllerTest, aTreeCanBeAskedBreadthFirst) {
    TestFilter a(0, true, "a");
    TestFilter b(0, true, "b");
    TestFilter sink(2, false, "sink");
    feed(sink, 0, a);
    feed(sink, 1, b);
    ImageFlowController controller;
    plant(controller, {&a, &b, &sink}, sink);
    sink.setRegionOfInterest(world(0, 0, 3, 3));
    PropagateROIVisitor visitor;
    controller.breadthFirstSearch(visitor);
    EXPECT_EQ(1u, a.aParentROIs_.size());
    EXPECT_EQ(1u, b.aParentROIs_.size());
}

TEST_F(ImageFlowControllerTest, theSinksImageDecidesThePrecisionOfAllNodes) {
    struct Row {
        ImageCPU::tePixelFormat format;
        int hint;
    };
    for (Row const& row :
         {Row{ImageCPU::PIXEL_FORMAT_RGB8, 0}, Row{ImageCPU::PIXEL_FORMAT_RGBA8, 0},
          Row{ImageCPU::PIXEL_FORMAT_LUMINANCE8, 0}, Row{ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, 0},
          Row{ImageCPU::PIXEL_FORMAT_RGB16, 1}, Row{ImageCPU::PIXEL_FORMAT_RGBA16, 1},
          Row{ImageCPU::PIXEL_FORMAT_LUMINANCE16, 1}, Row{ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, 1},
          Row{ImageCPU::PIXEL_FORMAT_RGB32F, 3}, Row{ImageCPU::PIXEL_FORMAT_RGBA32F, 3},
          Row{ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 3}, Row{ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 3},
          Row{ImageCPU::PIXEL_FORMAT_BGR8, -1}, Row{ImageCPU::PIXEL_FORMAT_BGRA8, -1},
          Row{ImageCPU::PIXEL_FORMAT_RGB16F, -1}, Row{ImageCPU::PIXEL_FORMAT_RGBA16F, -1}}) {
        Diamond graph;
        ImageCPU image(row.format, pixels(0, 0, 2, 2), PixelExtentInWorldSpace(), ExtentInPixelSpace());
        graph.d.setBoundOutputImage(&image);
        for (TestFilter* pFilter : graph.all()) {
            pFilter->outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_DEFAULT);
        }
        graph.c.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
        if (row.hint < 0) {
            ORVO_EXPECT_INTERNAL(graph.oController_.setNodeImageDescriptorInfo(true),
                                 "Not implemented: ImageCPU Pixel format not supported");
            continue;
        }
        graph.oController_.setNodeImageDescriptorInfo(true);
        for (TestFilter* pFilter : {&graph.a, &graph.b, &graph.d, &graph.x}) {
            EXPECT_EQ(row.hint, pFilter->outputPrecisionHint()) << row.format << " at " << pFilter->name();
        }
        EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT, graph.c.outputPrecisionHint());
    }
}

TEST_F(ImageFlowControllerTest, channelCountsFlowFromTheSourcesWhateverTheOrderOfTheList) {
    TestFilter source(0, true, "source");
    TestFilter middle(1, true, "middle");
    TestFilter sink(1, true, "sink");
    source.nForcedChannels_ = 3;
    middle.nForcedChannels_ = 0;
    sink.nForcedChannels_ = 0;
    feed(middle, 0, source);
    feed(sink, 0, middle);
    ImageFlowController controller;
    plant(controller, {&sink, &middle, &source}, sink); // as a compiler adds its converters: last
    ImageCPU image(ImageCPU::PIXEL_FORMAT_RGB8, pixels(0, 0, 2, 2), PixelExtentInWorldSpace(),
                   ExtentInPixelSpace());
    sink.setBoundOutputImage(&image);
    controller.setNodeImageDescriptorInfo(true);
    EXPECT_EQ(3u, middle.nChannels_);
    EXPECT_EQ(3u, sink.nChannels_);
}

TEST_F(ImageFlowControllerTest, formatsFromTheSinkNeedAnImageThere) {
    ImageFlowController controller;
    ORVO_EXPECT_INTERNAL(controller.setNodeImageDescriptorInfo(true), "Enforce pSink != NULL");
    ORVO_EXPECT_INTERNAL(controller.setNodeImageDescriptorInfo(false), "Enforce pSink != NULL");
    Diamond graph;
    constexpr char const* pText = "(pSink->imageOutput()->hasData()) == true";
    ORVO_EXPECT_INTERNAL(graph.oController_.setNodeImageDescriptorInfo(true), pText);
    // The image is asked for before the walk finds the gap.
    graph.c.in().disconnect();
    ORVO_EXPECT_INTERNAL(graph.oController_.setNodeImageDescriptorInfo(true), pText);
    TestFilter sink(1, false, "sink");
    feed(sink, 0, graph.d);
    graph.oController_.addNode(&sink);
    graph.oController_.setImageSink(sink);
    ORVO_EXPECT_INTERNAL(graph.oController_.setNodeImageDescriptorInfo(true), pText);
}

/// The diamond with an image bound to its sink and no precision chosen.
struct BoundDiamond : Diamond {
    BoundDiamond()
        : oImage_(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 2, 2), PixelExtentInWorldSpace(),
                  ExtentInPixelSpace()) {
        d.setBoundOutputImage(&oImage_);
        for (TestFilter* pFilter : all()) {
            pFilter->outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_DEFAULT);
        }
    }
    ImageCPU oImage_;
};

TEST_F(ImageFlowControllerTest, aFailureLeavesThePrecisionOfAllNodes) {
    BoundDiamond graph;
    auto const expectUntouched = [&] {
        for (TestFilter* pFilter : graph.all()) {
            EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, pFilter->outputPrecisionHint())
                << pFilter->name();
        }
    };
    graph.c.in().disconnect();
    ORVO_EXPECT_INTERNAL(graph.oController_.setNodeImageDescriptorInfo(true), "Enforce pOutput != NULL");
    expectUntouched();
    feed(graph.c, 0, graph.x);
    ForeignNode foreign;
    graph.oController_.addNode(&foreign);
    ORVO_EXPECT_INTERNAL(graph.oController_.setNodeImageDescriptorInfo(true), "iff!=0");
    expectUntouched();
}

TEST_F(ImageFlowControllerTest, formatsComeFromTheSourcesUnlessTheSinkHoldsAnImage) {
    BoundDiamond graph;
    ForeignNode foreign;
    graph.oController_.addNode(&foreign);
    graph.oController_.setNodeImageDescriptorInfo(false); // stops at the first node
    for (TestFilter* pFilter : graph.all()) {
        EXPECT_FALSE(pFilter->getImageDescInfoFromSource());
    }
    graph.oController_.removeNode(&foreign);
    graph.d.setBoundOutputImage(nullptr);
    graph.oController_.setNodeImageDescriptorInfo(false);
    for (TestFilter* pFilter : graph.all()) {
        EXPECT_TRUE(pFilter->getImageDescInfoFromSource());
    }
}

} // namespace

} // namespace ORVO
