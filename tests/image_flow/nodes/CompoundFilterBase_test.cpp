// Nodes that run a graph of their own, on images in host memory.

#include "orvo/image_flow/nodes/CompoundFilterBase.h"

#include "orvo/core/exceptions/SharedException.h"
#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/image_flow/filters/BufferCPU.h"
#include "tests/image_flow/support/Compounds.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>

#include <functional>
#include <utility>

namespace ORVO {

namespace {

using DataFlow::Node;
using Test::feed;
using Test::floatImage;
using Test::HostCompound;
using Test::pixelAt;
using Test::pixels;
using Test::TestFilter;
using Test::world;
using Hint = ImageFilter::teOutputPrecisionHint;

/// An inner graph without anything around it.
class BareCompound : public CompoundFilterBase {
public:
    using CompoundFilterBase::aEmitters_;
    using CompoundFilterBase::aImageFilters_;
    using CompoundFilterBase::computeRegionsAndProcess;
    using CompoundFilterBase::eHint_;
    using CompoundFilterBase::emitAndProcess;
    using CompoundFilterBase::internalProcess;
    using CompoundFilterBase::pBedding_;
    using CompoundFilterBase::pController_;
    using CompoundFilterBase::plantMasterTree;
    using CompoundFilterBase::propagatePrecisionHint;

    std::vector<Node*> nodes() const { return {pController_->nodesBegin(), pController_->nodesEnd()}; }
};

/// A source that counts.
class CountingSource : public ImageCPUInput {
public:
    void emit() override {
        ++nEmitted_;
        ImageCPUInput::emit();
    }
    int nEmitted_ = 0;
};

/// A filter whose runs and slices can do something more.
class HookedFilter : public TestFilter {
public:
    void internalProcess() override {
        if (onRun_)
            onRun_();
        TestFilter::internalProcess();
    }
    void processSlice(std::size_t begin, std::size_t end) override {
        if (onSlice_)
            onSlice_();
        TestFilter::processSlice(begin, end);
    }
    std::function<void()> onRun_;
    std::function<void()> onSlice_;
};

class CompoundFilterBaseTest : public testing::Test {
protected:
    ORVO::Test::ImageFlowLayers oLayers_;
};

// Lists

TEST_F(CompoundFilterBaseTest, StartsEmptyWithTheDefaultHint) {
    BareCompound const compound;
    EXPECT_NE(nullptr, compound.pController_);
    EXPECT_NE(nullptr, compound.pBedding_);
    EXPECT_TRUE(compound.nodes().empty());
    EXPECT_TRUE(compound.aEmitters_.empty());
    EXPECT_TRUE(compound.aImageFilters_.empty());
    EXPECT_EQ(Hint::OUTPUT_PRECISION_DEFAULT, compound.eHint_);
}

TEST_F(CompoundFilterBaseTest, ListsNodesByWhatTheyAre) {
    ImageCPUInput source;
    TestFilter filter;
    Node plain("plain");
    BareCompound compound;
    compound.addNode(&source);
    compound.addNode(&filter);
    compound.addNode(&plain);
    EXPECT_EQ((std::vector<Node*>{&source, &filter, &plain}), compound.nodes());
    EXPECT_EQ((std::vector<Node*>{&source}), compound.aEmitters_);
    EXPECT_EQ((std::vector<ImageFilter*>{&source, &filter}), compound.aImageFilters_);
    EXPECT_EQ(compound.pController_, plain.controller());
    compound.removeNode(&source);
    EXPECT_EQ((std::vector<Node*>{&filter, &plain}), compound.nodes());
    EXPECT_TRUE(compound.aEmitters_.empty());
    EXPECT_EQ((std::vector<ImageFilter*>{&filter}), compound.aImageFilters_);
    compound.removeNode(&source); // not there any more
    compound.removeNode(&plain);
    compound.removeNode(nullptr);
    EXPECT_EQ((std::vector<Node*>{&filter}), compound.nodes());
}

TEST_F(CompoundFilterBaseTest, ANodeThatIsAddedTwiceIsListedTwice) {
    ImageCPUInput source;
    TestFilter filter;
    BareCompound compound;
    compound.addNode(&source);
    compound.addNode(&filter);
    compound.addNode(&source);
    EXPECT_EQ((std::vector<ImageFilter*>{&source, &filter, &source}), compound.aImageFilters_);
    compound.removeNode(&source);
    EXPECT_EQ((std::vector<Node*>{&filter, &source}), compound.nodes());
    EXPECT_EQ((std::vector<ImageFilter*>{&filter, &source}), compound.aImageFilters_);
    EXPECT_EQ((std::vector<Node*>{&source}), compound.aEmitters_);
}

TEST_F(CompoundFilterBaseTest, RefusesNoNode) {
    BareCompound compound;
    ORVO_EXPECT_INTERNAL(compound.addNode(nullptr), "Enforce pNode != NULL");
    EXPECT_TRUE(compound.nodes().empty());
    EXPECT_TRUE(compound.aEmitters_.empty());
    EXPECT_TRUE(compound.aImageFilters_.empty());
}

// Hints

TEST_F(CompoundFilterBaseTest, PropagatesAHintOnceToAllImageFilters) {
    TestFilter a;
    TestFilter b;
    BareCompound compound;
    compound.addNode(&a);
    compound.addNode(&b);
    compound.propagatePrecisionHint(Hint::OUTPUT_PRECISION_DEFAULT); // the first one: nothing happens
    EXPECT_EQ(Hint::OUTPUT_PRECISION_32_BIT_FLOAT, a.outputPrecisionHint());
    compound.propagatePrecisionHint(Hint::OUTPUT_PRECISION_16_BIT_INT);
    EXPECT_EQ(Hint::OUTPUT_PRECISION_16_BIT_INT, a.outputPrecisionHint());
    EXPECT_EQ(Hint::OUTPUT_PRECISION_16_BIT_INT, b.outputPrecisionHint());
    EXPECT_EQ(Hint::OUTPUT_PRECISION_16_BIT_INT, compound.eHint_);
    a.outputPrecisionHintParameter().setValue(Hint::OUTPUT_PRECISION_8_BIT_INT);
    compound.propagatePrecisionHint(Hint::OUTPUT_PRECISION_16_BIT_INT);
    EXPECT_EQ(Hint::OUTPUT_PRECISION_8_BIT_INT, a.outputPrecisionHint());
}

// Messages

TEST_F(CompoundFilterBaseTest, SaysWhatIsMissing) {
    BareCompound compound;
    TestFilter filter(0);
    compound.addNode(&filter);
    ORVO_EXPECT_INTERNAL(compound.internalProcess(world(0, 0, 1, 1)), "pController_->getSinkNode()");
    ImageFlowController* const pController = std::exchange(compound.pController_, nullptr);
    ORVO_EXPECT_INTERNAL(compound.internalProcess(world(0, 0, 1, 1)), "pController_");
    ORVO_EXPECT_INTERNAL(compound.emitAndProcess(), "pController_");
    ORVO_EXPECT_INTERNAL(compound.computeRegionsAndProcess(), "pController_");
    ORVO_EXPECT_INTERNAL(compound.addNode(&filter), "pController_");
    ORVO_EXPECT_INTERNAL(compound.removeNode(&filter), "pController_");
    compound.pController_ = pController;
    Node plain("plain");
    compound.addNode(&plain);
    compound.plantMasterTree(filter);
    ORVO_EXPECT_INTERNAL(compound.emitAndProcess(), "iff!=0");
}

// Running

TEST_F(CompoundFilterBaseTest, RunsWithRegionsThatStandAlready) {
    CountingSource source;
    TestFilter filter;
    ImageCPUOutput sink;
    auto const upImage = floatImage(pixels(0, 0, 6, 4), [](int x, int y) { return float(x + 10 * y); });
    source.setImageCPUWithNoOwnership(upImage.get());
    feed(filter, 0, source);
    feed(sink, 0, filter);
    BareCompound compound;
    for (Node* pNode : std::initializer_list<Node*>{&source, &filter, &sink})
        compound.addNode(pNode);
    compound.plantMasterTree(sink);
    filter.setDomainOfDefinition(world(1, 1, 5, 3));
    filter.setRegionOfInterest(world(0, 0, 4, 3));
    sink.computeRegionParameter().setValue(world(7, 7, 7, 7)); // no outputs: stays
    source.setDomainOfDefinition(ORVO::Test::infiniteWorld());
    source.setRegionOfInterest(ORVO::Test::infiniteWorld()); // not refused here
    compound.computeRegionsAndProcess();
    EXPECT_EQ(world(1, 1, 3, 2), filter.computeRegionParameter().value());
    EXPECT_EQ(world(7, 7, 7, 7), sink.computeRegionParameter().value());
    EXPECT_TRUE(source.computeRegionParameter().value().isInfinite());
    EXPECT_EQ(1, source.nEmitted_);
    ASSERT_NE(nullptr, sink.getImageCPU());
    EXPECT_EQ(pixels(1, 1, 3, 2), sink.getImageCPU()->positionExtent());
    EXPECT_EQ(23.0f, *pixelAt(*sink.getImageCPU(), 3, 2));
    compound.internalProcess(world(2, 0, 2, 4));
    EXPECT_EQ(pixels(2, 0, 2, 4), sink.getImageCPU()->positionExtent());
    EXPECT_EQ(2, source.nEmitted_);
    ORVO_EXPECT_INTERNAL(
        [&] {
            source.setGeneratedRegion(ORVO::Test::infiniteWorld());
            compound.internalProcess(ORVO::Test::infiniteWorld());
        }(),
        "Output region can't be infinite.");
    filter.disconnect();
}

TEST_F(CompoundFilterBaseTest, ABufferGivesTheSameImageWhileItIsAnEmitter) {
    ImageCPUInput source;
    TestFilter filter;
    BufferCPU buffer;
    ImageCPUOutput sink;
    auto const upImage = floatImage(pixels(0, 0, 2, 1), [](int x, int) { return float(x); });
    source.setImageCPUWithNoOwnership(upImage.get());
    feed(filter, 0, source);
    feed(buffer, 0, filter);
    feed(sink, 0, buffer);
    BareCompound compound;
    for (Node* pNode : std::initializer_list<Node*>{&source, &filter, &buffer, &sink})
        compound.addNode(pNode);
    compound.plantMasterTree(sink);
    EXPECT_EQ((std::vector<Node*>{&source, &buffer}), compound.aEmitters_);
    auto const result = [&](float offset) {
        filter.oOffset_.setValue(offset);
        compound.internalProcess(world(0, 0, 2, 1));
        return *pixelAt(*sink.getImageCPU(), 1, 0);
    };
    compound.aEmitters_.pop_back();
    EXPECT_EQ(11.0f, result(10));
    compound.aEmitters_.push_back(&buffer);
    EXPECT_EQ(11.0f, result(20));
    EXPECT_EQ(11.0f, result(30));
    EXPECT_EQ(1, filter.nRuns_);
    compound.aEmitters_.pop_back();
    EXPECT_EQ(41.0f, result(40));
    filter.disconnect();
    buffer.disconnect();
}

/// source -> compound that ends in `inner()` -> filter that adds 100 -> sink.
class CompoundGraph {
public:
    explicit CompoundGraph(bool bNested) : oImage_(floatImage(pixels(-4, -3, 20, 14), value)) {
        auto upInner = std::make_unique<HookedFilter>();
        pInner_ = upInner.get();
        pInner_->iRadius_ = 2;
        pInner_->oOffset_.setValue(1.0f);
        upCompound_ = bNested ? ORVO::Test::nestedTwice<ORVO::Test::HostRoad>(std::move(upInner))
                              : std::make_unique<HostCompound>(std::move(upInner));
        oSource_.setImageCPUWithNoOwnership(oImage_.get());
        oAfter_.oOffset_.setValue(100.0f);
        feed(*upCompound_, 0, oSource_);
        feed(oAfter_, 0, *upCompound_);
        feed(oSink_, 0, oAfter_);
        ORVO::Test::plant(oController_, {&oSource_, upCompound_.get(), &oAfter_, &oSink_}, oSink_);
    }
    ~CompoundGraph() {
        oAfter_.disconnect();
        oSource_.disconnect();
    }

    static float value(int x, int y) { return float((x * 7 + y * 13) % 32) / 8.0f; }

    void prepare(PositionExtentInPixelSpace const& region) {
        oController_.flushGraph();
        ORVO::Test::emitAll(oController_);
        oController_.computeRegions(pixelToWorldSpace(region, PixelExtentInWorldSpace()));
    }
    void run(PositionExtentInPixelSpace const& region) {
        prepare(region);
        oController_.process();
    }
    void runAsync(PositionExtentInPixelSpace const& region) {
        prepare(region);
        oController_.processAsync();
        EXPECT_TRUE(oController_.wait(60, 0.0005));
    }

    /// Runs a frame; every pixel must be the mean of the window plus 101.
    void expectRight(PositionExtentInPixelSpace const& region = pixels(-2, 0, 9, 6)) {
        run(region);
        expectResult(region);
    }
    void expectResult(PositionExtentInPixelSpace const& region) {
        ImageCPU const* const pResult = oSink_.getImageCPU();
        ASSERT_NE(nullptr, pResult);
        ASSERT_EQ(region, pResult->positionExtent());
        for (int y = region.position().y(); y < region.position().y() + region.extent().height(); ++y)
            for (int x = region.position().x(); x < region.position().x() + region.extent().width(); ++x)
                ASSERT_EQ(float(windowMean(x, y) + 1.0) + 100.0f, *pixelAt(*pResult, x, y)) << x << " " << y;
    }
    /// In the window are multiples of an eighth: their sum is exact.
    static double windowMean(int x, int y) {
        double sum = 0;
        int n = 0;
        for (int v = std::max(y - 2, -3); v <= std::min(y + 2, 10); ++v)
            for (int u = std::max(x - 2, -4); u <= std::min(x + 2, 15); ++u, ++n)
                sum += double(value(u, v));
        return sum / n;
    }

    ORVO::Test::HostCompound& compound() { return *upCompound_; }
    /// The controller next to the hooked filter.
    ImageFlowController& innermost() {
        auto* const pMiddle = dynamic_cast<HostCompound*>(&upCompound_->inner());
        return pMiddle == nullptr ? upCompound_->innerController() : pMiddle->innerController();
    }

    std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>> oImage_;
    ImageFlowController oController_;
    ImageCPUInput oSource_;
    HookedFilter* pInner_ = nullptr;
    std::unique_ptr<HostCompound> upCompound_;
    TestFilter oAfter_;
    ImageCPUOutput oSink_;
};

/// One inner graph, and one inside another.
class CompoundFramesTest : public CompoundFilterBaseTest, public testing::WithParamInterface<bool> {};

PositionExtentInPixelSpace const oUsual = pixels(-2, 0, 9, 6);

TEST_P(CompoundFramesTest, DoWhatTheInnerGraphDoes) {
    CompoundGraph graph(GetParam());
    for (auto const& region : {oUsual, pixels(-4, -3, 20, 14), pixels(15, 10, 1, 1), oUsual})
        graph.expectRight(region);
    EXPECT_EQ(4, graph.pInner_->nRuns_);
    graph.runAsync(oUsual);
    graph.expectResult(oUsual);
}

TEST_P(CompoundFramesTest, PassTheirHintOnInward) {
    CompoundGraph graph(GetParam());
    graph.compound().outputPrecisionHintParameter().setValue(Hint::OUTPUT_PRECISION_32_BIT_FLOAT);
    graph.pInner_->outputPrecisionHintParameter().setValue(Hint::OUTPUT_PRECISION_8_BIT_INT);
    graph.expectRight();
    EXPECT_EQ(Hint::OUTPUT_PRECISION_32_BIT_FLOAT, graph.pInner_->outputPrecisionHint());
}

TEST_P(CompoundFramesTest, AFailureComesOutAsItIsAndTheNextFrameIsRight) {
    CompoundGraph graph(GetParam());
    // Outside the slices: the exception itself.
    graph.pInner_->onRun_ = [] { ORVO_FAIL("run failed"); };
    ORVO_EXPECT_INTERNAL(graph.run(oUsual), "run failed");
    EXPECT_FALSE(graph.pInner_->isProcessing());
    graph.pInner_->onRun_ = nullptr;
    graph.expectRight();
    // In a slice: shared, wrapped once for all levels.
    graph.pInner_->bThrow_ = true;
    for (bool const bAsync : {false, true}) {
        try {
            if (bAsync) {
                graph.runAsync(oUsual);
                graph.oController_.checkException();
            } else {
                graph.run(oUsual);
            }
            ADD_FAILURE() << "no exception";
        } catch (SharedException const& shared) {
            auto const* const pFailure = dynamic_cast<InternalException const*>(shared.exception().get());
            ASSERT_NE(nullptr, pFailure);
            EXPECT_STREQ("slice failed", pFailure->message());
        }
    }
    graph.pInner_->bThrow_ = false;
    graph.expectRight();
    graph.runAsync(oUsual);
    EXPECT_NO_THROW(graph.oController_.checkException());
    graph.expectResult(oUsual);
}

TEST_P(CompoundFramesTest, AFailureWithoutAFlushOfTheOuterGraphLeavesTheInnerOneReady) {
    CompoundGraph graph(GetParam());
    graph.pInner_->onRun_ = [] { ORVO_FAIL("run failed"); };
    EXPECT_THROW(graph.run(oUsual), InternalException);
    graph.pInner_->onRun_ = nullptr;
    // The compound itself counts as running until somebody flushes it; its graph does not.
    EXPECT_TRUE(graph.compound().isProcessing());
    for (auto iter = graph.innermost().nodesBegin(); iter != graph.innermost().nodesEnd(); ++iter)
        EXPECT_FALSE((*iter)->isProcessing()) << (*iter)->name();
    EXPECT_EQ(ImageFlowController::CONTROLLER_STOPPED, graph.innermost().controllerStatus());
}

TEST_P(CompoundFramesTest, ACancelledOuterFrameEndsWithTheInnerOne) {
    CompoundGraph graph(GetParam());
    for (bool const bAsync : {false, true}) {
        int const nRuns = graph.oAfter_.nRuns_;
        std::size_t const nRows = graph.pInner_->nRows_;
        graph.pInner_->onSlice_ = [&] { graph.oController_.cancelProcess(); };
        if (bAsync)
            graph.runAsync(oUsual);
        else
            graph.run(oUsual);
        graph.oController_.checkException();
        // The inner frame is one step: all its rows, and no further node outside.
        EXPECT_EQ(nRows + 6, graph.pInner_->nRows_);
        EXPECT_EQ(nRuns, graph.oAfter_.nRuns_);
        graph.pInner_->onSlice_ = nullptr;
        graph.expectRight();
    }
}

TEST_P(CompoundFramesTest, ACancelledInnerFrameGivesNoResultAndTheNextOneIsRight) {
    CompoundGraph graph(GetParam());
    graph.expectRight();
    std::vector<ImageFlowController*> aControllers{&graph.innermost(), &graph.compound().innerController()};
    for (ImageFlowController* pController : aControllers) {
        for (bool const bAsync : {false, true}) {
            int const nRuns = graph.oAfter_.nRuns_;
            // Before the first slice: none runs, and no further node inside.
            graph.pInner_->onRun_ = [&] { pController->cancelProcess(); };
            if (bAsync)
                graph.runAsync(oUsual);
            else
                graph.run(oUsual);
            graph.oController_.checkException();
            EXPECT_EQ(nRuns, graph.oAfter_.nRuns_);
            graph.pInner_->onRun_ = nullptr;
            graph.expectRight();
        }
    }
}

TEST_P(CompoundFramesTest, EveryAllocationThatFailsLeavesTheNextFrameRight) {
    CompoundGraph graph(GetParam());
    graph.expectRight();
    std::uint64_t n = 1;
    for (bool bMore = true; bMore && n < 500; ++n) {
        {
            Core::AllocationFailure const failure(n);
            try {
                graph.run(oUsual);
            } catch (std::bad_alloc const&) {
                EXPECT_TRUE(failure.hasFired());
            } catch (SharedException const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bMore = failure.hasFired();
        }
        graph.expectRight();
    }
    EXPECT_GT(n, 4U);
    EXPECT_LT(n, 500U);
}

TEST_F(CompoundFilterBaseTest, EveryAllocationOfItsConstructionMayFail) {
    std::uint64_t n = 1;
    for (bool bMore = true; bMore && n < 50; ++n) {
        std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
        Core::AllocationFailure const failure(n);
        try {
            BareCompound const compound;
        } catch (std::bad_alloc const&) {
            EXPECT_TRUE(failure.hasFired());
        }
        bMore = failure.hasFired();
        EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
    }
    EXPECT_EQ(4U, n); // controller and bedding
}

TEST_F(CompoundFilterBaseTest, AThousandFramesTakeNoMoreMemory) {
    CompoundGraph graph(true);
    auto const frames = [&](int nFrames) {
        for (int i = 0; i < nFrames; ++i)
            graph.run(pixels(-2, 0, 1 + i % 7, 1 + i % 5));
    };
    frames(35);
    std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    std::size_t const nBytes = Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT);
    std::size_t const nImages = Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    frames(980);
    EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
    EXPECT_EQ(nBytes, Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT));
    EXPECT_EQ(nImages, Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

INSTANTIATE_TEST_SUITE_P(, CompoundFramesTest, testing::Bool(), [](testing::TestParamInfo<bool> const& row) {
    return row.param ? "NestedTwice" : "Once";
});

} // namespace

} // namespace ORVO
