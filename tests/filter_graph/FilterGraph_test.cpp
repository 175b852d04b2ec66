// A host that includes nothing but the umbrella header of the layer.
#include "orvo/filter_graph/FilterGraph.h"

#include <gtest/gtest.h>

#include "tests/support/FilterGraphLayers.h"

namespace ORVO::FilterGraph {
namespace {

TEST(FilterGraphHeaderTest, IsEnoughForAHostToBlurAnImage) {
    ORVO::Test::FilterGraphLayers const layers;
    FilterFactory::Instance()->insert(Internal::Bilateral());
    auto const blur =
        FilterFactory::Instance()->create({"FastBilateralBlur", "Motion Loft", "Norvane Works"});
    blur->parameter("colorize")->as<bool>().setValue(true);

    // Every pixel of a picture of one colour is the mean of its neighbours.
    std::vector<unsigned char> input(3 * 8 * 6, 100);
    std::vector<unsigned char> output(3 * 8 * 6, 0);
    ImageDescriptorCPU const rgb8({3, ImageDescriptor::CHANNEL_TYPE_UINT8}, PixelExtentInWorldSpace(1, 1));
    PositionExtentInPixelSpace const rect(ExtentInPixelSpace(8, 6));
    ImageCPU inputImage(rgb8, rect, input.data(), 0);
    ImageCPU outputImage(rgb8, rect, output.data(), 0);
    auto const source = createInputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    auto const sink = createOutputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    source->setImage(&inputImage);
    sink->setImage(&outputImage);
    Connect(source, blur);
    Connect(blur, sink);
    OptimizationOptions options;
    options.setProcessingMode(OptimizationOptions::CPU_PROCESSING);
    createProcessor(sink, nullptr)->processFrame(options);
    for (std::size_t i = 0; i < output.size(); ++i) {
        ASSERT_NEAR(output[i], 100, 1) << i; // a value just below a whole number is cut off
    }
}

} // namespace
} // namespace ORVO::FilterGraph
