#include "orvo/image_flow/sources/ImageCPUOutput.h"

#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"
#include "tests/support/Slots.h"

namespace ORVO {

namespace {

using Test::feed;
using Test::floatImage;
using Test::pixelAt;
using Test::pixels;
using Test::plant;
using Test::TestFilter;
using Test::world;

class ImageCPUOutputTest : public testing::Test {
protected:
    ORVO::Test::ImageFlowLayers oLayers_;
};

using ImagePtr = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

/// A client's image, a filter and a sink.
struct Graph {
    Graph() : upImage_(floatImage(pixels(0, 0, 4, 3), [](int x, int y) { return float(x + 10 * y); })) {
        feed(oFilter_, 0, oSource_);
        feed(oSink_, 0, oFilter_);
        plant(oController_, {&oSource_, &oFilter_, &oSink_}, oSink_);
        oSource_.setImageCPUWithNoOwnership(upImage_.get());
    }
    ~Graph() { oSink_.disconnect(); }

    void run() {
        oSource_.emit();
        oController_.computeRegions(world(0, 0, 4, 3));
        oController_.process();
    }

    ImagePtr upImage_;
    ImageFlowController oController_;
    ImageCPUInput oSource_;
    TestFilter oFilter_;
    ImageCPUOutput oSink_;
};

TEST_F(ImageCPUOutputTest, addsItsOperationsInOrder) {
    std::ptrdiff_t const last = ORVO::Test::slotOf(&TestFilter::outputPrecisionHint);
    EXPECT_EQ(last + 1, ORVO::Test::constSlotOf(&ImageCPUOutput::getImageCPU));
    EXPECT_EQ(last + 2, ORVO::Test::slotOf(&ImageCPUOutput::releaseImageCPU));
}

TEST_F(ImageCPUOutputTest, hasNamesAndNoOutput) {
    ImageCPUOutput sink;
    EXPECT_EQ("ImageCPUOutput", sink.name());
    EXPECT_NE(nullptr, sink.imageInput("InputImage"));
    EXPECT_EQ(nullptr, sink.imageOutput());
    EXPECT_EQ(0u, sink.numberOfOutputs());
    EXPECT_EQ(ORVO_TARGET_CPU, sink.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_CPU, sink.getOutputTargetPlatform());
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, sink.outputPrecisionHintParameter().value());
    ImageCPUOutput named("node", "input");
    EXPECT_EQ("node", named.name());
    EXPECT_NE(nullptr, named.imageInput("input"));
}

TEST_F(ImageCPUOutputTest, keepsTheResultUntilTheGraphIsFlushed) {
    Graph graph;
    EXPECT_EQ(nullptr, graph.oSink_.getImageCPU());
    graph.run();
    ImageCPU const* const pResult = graph.oSink_.getImageCPU();
    ASSERT_NE(nullptr, pResult);
    EXPECT_EQ(pixels(0, 0, 4, 3), pResult->positionExtent());
    EXPECT_EQ(23.0f, *pixelAt(*pResult, 3, 2));
    graph.oController_.flushGraph();
    EXPECT_EQ(nullptr, graph.oSink_.getImageCPU());
}

TEST_F(ImageCPUOutputTest, theNextFrameReplacesTheResult) {
    Graph graph;
    graph.run();
    graph.oFilter_.oOffset_.setValue(100.0f);
    graph.run();
    EXPECT_EQ(123.0f, *pixelAt(*graph.oSink_.getImageCPU(), 3, 2));
    // Nothing new to emit: the pull stops at the source and the result stays.
    graph.oFilter_.oOffset_.setValue(200.0f);
    graph.oController_.process();
    EXPECT_EQ(123.0f, *pixelAt(*graph.oSink_.getImageCPU(), 3, 2));
}

TEST_F(ImageCPUOutputTest, givesTheResultAway) {
    Graph graph;
    EXPECT_EQ(nullptr, graph.oSink_.releaseImageCPU());
    graph.run();
    ImageCPU const* const pResult = graph.oSink_.getImageCPU();
    ImagePtr const upResult(graph.oSink_.releaseImageCPU());
    EXPECT_EQ(pResult, upResult.get());
    EXPECT_EQ(nullptr, graph.oSink_.getImageCPU());
    EXPECT_FALSE(graph.oSink_.imageInput(0)->hasData());
    EXPECT_EQ(nullptr, graph.oSink_.releaseImageCPU());
    graph.run();
    EXPECT_NE(nullptr, graph.oSink_.getImageCPU());
    EXPECT_EQ(23.0f, *pixelAt(*upResult, 3, 2));
}

TEST_F(ImageCPUOutputTest, neverHandsOutTheClientsOwnImage) {
    auto const upImage = floatImage(pixels(0, 0, 2, 2), [](int, int) { return 4.0f; });
    ImageFlowController controller;
    ImageCPUInput source;
    ImageCPUOutput sink;
    feed(sink, 0, source);
    plant(controller, {&source, &sink}, sink);
    source.setImageCPUWithNoOwnership(upImage.get());
    source.emit();
    controller.process();
    EXPECT_NE(upImage.get(), sink.getImageCPU()); // a mutable input gets a copy of what others hold
    ImagePtr const upResult(sink.releaseImageCPU());
    EXPECT_EQ(4.0f, *pixelAt(*upResult, 1, 1));
    sink.disconnect();
}

TEST_F(ImageCPUOutputTest, anImageThatIsNotTheGraphsStaysWhereItIs) {
    auto const upImage = floatImage(pixels(0, 0, 2, 2), [](int, int) { return 4.0f; });
    ImageCPUOutput sink;
    auto& input = static_cast<DataFlow::Input<ImageCPU>&>(*sink.imageInput(0));
    DataFlow::ConstDataPointer<ImageCPU> spImage;
    spImage.setDataWithNoOwnership(upImage.get());
    input.setData(spImage);
    ORVO_EXPECT_INTERNAL(sink.releaseImageCPU(), "Enforce deleter != NULL");
    EXPECT_EQ(upImage.get(), sink.getImageCPU());
}

} // namespace

} // namespace ORVO
