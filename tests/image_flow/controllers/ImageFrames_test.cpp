// Whole frames of image graphs: failures and cancellation and the frames after them, threads, caching,
// fan-out.

#include "orvo/core/exceptions/SharedException.h"
#include "orvo/core/memory/AllocationFailure.h"
#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <deque>
#include <new>
#include <random>
#include <thread>

namespace ORVO {

namespace {

using DataFlow::Controller;
using Test::emitAll;
using Test::feed;
using Test::floatImage;
using Test::pixelAt;
using Test::pixels;
using Test::plant;
using Test::TestFilter;
using Test::world;
using ImagePtr = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

/// source -> blur -> left and right -> join -> sink.
struct Graph {
    Graph()
        : upImage_(picture()),
          oBlur_(1, true, "blur"),
          oLeft_(1, true, "left"),
          oRight_(1, true, "right"),
          oJoin_(2, true, "join") {
        feed(oBlur_, 0, oSource_);
        feed(oLeft_, 0, oBlur_);
        feed(oRight_, 0, oBlur_);
        feed(oJoin_, 0, oLeft_);
        feed(oJoin_, 1, oRight_);
        feed(oSink_, 0, oJoin_);
        oBlur_.iRadius_ = 2;
        oLeft_.iRadius_ = 1;
        oRight_.oOffset_.setValue(8.0f);
        plant(oController_, {&oSource_, &oBlur_, &oLeft_, &oRight_, &oJoin_, &oSink_}, oSink_);
        oSource_.setImageCPUWithNoOwnership(upImage_.get());
    }
    ~Graph() { oSink_.disconnect(); }

    static ImagePtr picture() {
        return floatImage(pixels(-8, -4, 40, 30), [](int x, int y) { return float((x * 5 + y * 11) % 17); });
    }

    void prepare() {
        emitAll(oController_);
        oController_.computeRegions(world(-8, -4, 40, 30));
    }

    /// A frame of the whole picture.
    void run() {
        prepare();
        oController_.process();
    }

    /// Waits for an asynchronous frame and throws its failure.
    void finish() {
        ASSERT_TRUE(oController_.wait(60, 0.0005));
        oController_.checkException();
    }

    /// The picture's mean over 5 by 5 pixels, cut off at its edges.
    static double blurred(int x, int y) {
        double sum = 0;
        int n = 0;
        for (int v = std::max(-4, y - 2); v <= std::min(25, y + 2); ++v) {
            for (int u = std::max(-8, x - 2); u <= std::min(31, x + 2); ++u) {
                sum += (u * 5 + v * 11) % 17;
                ++n;
            }
        }
        return sum / n;
    }

    /// The mean of that over 3 by 3 pixels: the blur reaches beyond the picture, so that nothing is cut off
    /// here.
    static double blurredTwice(int x, int y) {
        double sum = 0;
        for (int v = y - 1; v <= y + 1; ++v) {
            for (int u = x - 1; u <= x + 1; ++u) {
                sum += blurred(u, v);
            }
        }
        return sum / 9;
    }

    /// A frame after whatever went before is right.
    void expectNextFrameRight() {
        run();
        expectRight();
    }

    /// Whether the sink holds what an evaluation by hand gives.
    void expectRight() const {
        ImageCPU const* const pResult = oSink_.getImageCPU();
        ASSERT_NE(nullptr, pResult);
        ASSERT_EQ(pixels(-8, -4, 40, 30), pResult->positionExtent());
        for (int y = -4; y < 26; y += 3) {
            for (int x = -8; x < 32; x += 3) {
                double const left = blurredTwice(x, y);
                double const right = blurred(x, y) + 8;
                ASSERT_NEAR((left + right) / 2, double(*pixelAt(*pResult, x, y)), 1e-5) << x << ", " << y;
            }
        }
    }

    ImagePtr upImage_;
    ImageFlowController oController_;
    ImageCPUInput oSource_;
    TestFilter oBlur_, oLeft_, oRight_, oJoin_;
    ImageCPUOutput oSink_;
};

class ImageFramesTest : public testing::Test {
protected:
    ~ImageFramesTest() override {
        Controller::setNumberOfThreads(nThreads_);
        Controller::setMinimumGrainSize(1);
    }
    ORVO::Test::ImageFlowLayers oLayers_;
    std::size_t const nThreads_ = Controller::getNumberOfThreads();
};

TEST_F(ImageFramesTest, resultsDoNotDependOnThreadsOrGrain) {
    for (std::size_t nThreads : {1u, 2u, 8u}) {
        for (std::size_t nGrain : {0u, 1u, 100u, 1000000u}) {
            for (bool bSingle : {false, true}) {
                Controller::setNumberOfThreads(nThreads);
                Controller::setMinimumGrainSize(nGrain);
                Graph graph;
                graph.oController_.setSingleThreadMode(bSingle);
                graph.expectNextFrameRight();
                graph.prepare();
                graph.oController_.processAsync();
                graph.finish();
                graph.expectRight();
            }
        }
    }
}

TEST_F(ImageFramesTest, everyNodeRunsOnceAFrame) {
    Graph graph;
    graph.run();
    for (TestFilter* pFilter : {&graph.oBlur_, &graph.oLeft_, &graph.oRight_, &graph.oJoin_}) {
        EXPECT_EQ(1, pFilter->nRuns_) << pFilter->name();
        // The window of `left` reaches one row beyond the picture on each side, and so does the blur before
        // it.
        EXPECT_EQ(pFilter == &graph.oBlur_ ? 32u : 30u, pFilter->nRows_) << pFilter->name();
    }
}

TEST_F(ImageFramesTest, theFrameAfterAFailedOneIsRight) {
    for (bool bAsync : {false, true}) {
        for (TestFilter Graph::*pFailing :
             {&Graph::oBlur_, &Graph::oLeft_, &Graph::oRight_, &Graph::oJoin_}) {
            Graph graph;
            (graph.*pFailing).bThrow_ = true;
            graph.prepare();
            auto const frame = [&] {
                if (bAsync) {
                    graph.oController_.processAsync();
                    graph.finish();
                } else {
                    graph.oController_.process();
                }
            };
            EXPECT_THROW(frame(), SharedException);
            EXPECT_EQ(nullptr, graph.oSink_.getImageCPU());
            (graph.*pFailing).bThrow_ = false;
            graph.oController_.wait(60, 0.0005); // collects the cancelled slices
            EXPECT_TRUE(graph.oController_.flushGraph());
            graph.prepare();
            frame();
            graph.expectRight();
        }
    }
}

TEST_F(ImageFramesTest, aFailureInSingleThreadModeComesOutAsItIs) {
    Graph graph;
    graph.oController_.setSingleThreadMode(true);
    graph.oRight_.bThrow_ = true;
    graph.prepare();
    ORVO_EXPECT_INTERNAL(graph.oController_.process(), "slice failed");
    graph.oRight_.bThrow_ = false;
    graph.oController_.flushGraph();
    graph.expectNextFrameRight();
}

TEST_F(ImageFramesTest, theFrameAfterABadRegionIsRight) {
    Graph graph;
    graph.prepare();
    float const infinity = std::numeric_limits<float>::infinity();
    graph.oSource_.setGeneratedRegion(PositionExtentInWorldSpace(ExtentInWorldSpace(infinity, infinity)));
    ORVO_EXPECT_INTERNAL(
        graph.oController_.computeRegions(PositionExtentInWorldSpace(ExtentInWorldSpace(infinity, infinity))),
        "Output region can't be infinite.");
    graph.oSource_.setGeneratedRegion(world(-8, -4, 40, 30));
    graph.expectNextFrameRight();
}

TEST_F(ImageFramesTest, regionsWithoutPixelsGiveEmptyImages) {
    Graph graph;
    for (auto const& region : {world(500, 500, 10, 10), world(0, 0, 0, 0), PositionExtentInWorldSpace()}) {
        emitAll(graph.oController_);
        graph.oController_.computeRegions(region);
        graph.oController_.process();
        ASSERT_NE(nullptr, graph.oSink_.getImageCPU());
        EXPECT_EQ(0u, graph.oSink_.getImageCPU()->numberOfPixels());
        EXPECT_EQ(0u, graph.oJoin_.nRows_);
    }
    graph.expectNextFrameRight();
}

TEST_F(ImageFramesTest, cancelledFramesLeaveNothingBehind) {
    Graph graph;
    std::mt19937 random(3);
    for (int i = 0; i < 200; ++i) {
        graph.prepare();
        graph.oController_.processAsync();
        std::this_thread::sleep_for(std::chrono::microseconds(random() % 300));
        graph.oController_.cancelProcess();
        ASSERT_TRUE(graph.oController_.wait(60, 0.0005));
        graph.oController_.flushGraph();
        if (i % 20 == 0) {
            graph.expectNextFrameRight();
        }
    }
}

TEST_F(ImageFramesTest, aRelaunchWaitsForTheFrameUnderWay) {
    Graph graph;
    for (int i = 0; i < 50; ++i) {
        graph.prepare();
        graph.oController_.processAsync();
        graph.oController_.processAsync(); // joins the one before
        graph.finish();
        graph.expectRight();
    }
}

TEST_F(ImageFramesTest, onlyWhatChangedRunsAgain) {
    Graph graph;
    auto const frame = [&] {
        graph.prepare();
        graph.oController_.setDirtyState();
        graph.oController_.process();
    };
    frame();
    frame();
    graph.oLeft_.oOffset_.setValue(1.0f); // from here on its clean producer keeps its result
    frame();
    int const nBlurRuns = graph.oBlur_.nRuns_;
    graph.oLeft_.oOffset_.setValue(0.0f);
    frame();
    EXPECT_EQ(nBlurRuns, graph.oBlur_.nRuns_);
    graph.expectRight();
}

/// Halves the resolution: each pixel is the mean of the four that lie under it.
class HalvingFilter : public TestFilter {
public:
    HalvingFilter() { setOutputPixelExtent(PixelExtentInWorldSpace(2, 2)); }
    void processSlice(std::size_t begin, std::size_t end) override {
        PositionInPixelSpace const corner = oOutputRegionInPixels_.position();
        for (int y = corner.y() + int(begin); y < corner.y() + int(end); ++y) {
            for (int x = corner.x(); x < corner.x() + oOutputRegionInPixels_.extent().width(); ++x) {
                float const* const pUpper = pixelAt(*in(), 2 * x, 2 * y);
                float const* const pLower = pixelAt(*in(), 2 * x, 2 * y + 1);
                *pixelAt(*spOutputImage_, x, y) = (pUpper[0] + pUpper[1] + pLower[0] + pLower[1]) / 4;
            }
        }
    }
};

TEST_F(ImageFramesTest, aChainMayChangeTheResolution) {
    ImagePtr const upImage =
        floatImage(pixels(-4, -6, 12, 16), [](int x, int y) { return float(x + 100 * y); });
    ImageFlowController controller;
    ImageCPUInput source;
    HalvingFilter halving;
    TestFilter after;
    ImageCPUOutput sink;
    after.iRadius_ = 1;
    feed(halving, 0, source);
    feed(after, 0, halving);
    feed(sink, 0, after);
    plant(controller, {&source, &halving, &after, &sink}, sink);
    source.setImageCPUWithNoOwnership(upImage.get());
    source.emit();
    controller.computeRegions(world(0, 0, 4, 2));
    // One pixel of 2 by 2 on each side.
    EXPECT_EQ(world(-2, -2, 8, 6), halving.regionOfInterest());
    controller.process();
    ImageCPU const& result = *sink.getImageCPU();
    EXPECT_EQ(pixels(0, 0, 2, 1), result.positionExtent());
    EXPECT_EQ(PixelExtentInWorldSpace(2, 2), result.pixelExtent());
    // The mean of a linear picture over the window's pixels -2 to 3 (x) and -2 to 3 (y) is its value in the
    // middle.
    EXPECT_FLOAT_EQ(0.5f + 50.0f, *pixelAt(result, 0, 0));
    EXPECT_FLOAT_EQ(2.5f + 50.0f, *pixelAt(result, 1, 0));
    sink.disconnect();
}

TEST_F(ImageFramesTest, everyAllocationOfAFrameMayFail) {
    int nFailures = 0;
    for (std::uint64_t n = 1;; ++n) {
        ASSERT_LT(n, 1000u);
        Graph graph;
        bool bFired = false;
        {
            Core::AllocationFailure failure(n);
            try {
                graph.run();
                graph.run();
            } catch (std::exception const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bFired = failure.hasFired();
        }
        if (!bFired) {
            graph.expectRight();
            break;
        }
        ++nFailures;
        graph.oController_.flushGraph();
        graph.expectNextFrameRight();
    }
    EXPECT_GE(nFailures, 10); // four images of two blocks each, and the sink's copies
}

TEST_F(ImageFramesTest, aGraphThatCannotBeBuiltLeavesNothing) {
    for (std::uint64_t n = 1;; ++n) {
        ASSERT_LT(n, 1000u);
        Core::AllocationFailure failure(n);
        try {
            Graph const graph;
        } catch (std::bad_alloc const&) {
            EXPECT_TRUE(failure.hasFired());
        }
        if (!failure.hasFired()) {
            break;
        }
    }
}

TEST_F(ImageFramesTest, chainsOfThousandsOfFiltersRun) {
    std::deque<TestFilter> chain;
    ImageFlowController controller;
    ImagePtr const upImage = floatImage(pixels(0, 0, 1, 1), [](int, int) { return 3.0f; });
    ImageCPUInput source;
    ImageCPUOutput sink;
    source.setImageCPUWithNoOwnership(upImage.get());
    ImageFilter* pLast = &source;
    controller.addNode(&source);
    for (int i = 0; i < 5000; ++i) {
        chain.emplace_back();
        chain.back().oOffset_.setValue(1.0f);
        feed(chain.back(), 0, *pLast);
        pLast = &chain.back();
        controller.addNode(pLast);
    }
    feed(sink, 0, *pLast);
    controller.addNode(&sink);
    controller.setImageSink(sink);
    for (bool bAsync : {false, true}) {
        source.emit();
        controller.computeRegions(world(0, 0, 1, 1));
        controller.setDirtyState();
        if (bAsync) {
            controller.processAsync();
            ASSERT_TRUE(controller.wait(60, 0.0005));
            controller.checkException();
        } else {
            controller.process();
        }
        ASSERT_NE(nullptr, sink.getImageCPU());
        EXPECT_EQ(5003.0f, *pixelAt(*sink.getImageCPU(), 0, 0));
    }
    for (TestFilter& filter : chain) {
        filter.disconnect();
    }
    sink.disconnect();
}

} // namespace

} // namespace ORVO
