// Uses every layer of the installed package through its umbrella headers: a frame of the public graph, an
// exception and a type test across the library's border.
#include <orvo/core/Core.h>
#include <orvo/data_flow/DataFlow.h>
#include <orvo/filter_graph/FilterGraph.h>
#include <orvo/image_flow/ImageFlow.h>
#include <orvo/image_runtime/ImageRuntime.h>
#include <orvo/ogl/OGL.h>
#include <orvo/orvo.h>

#include <cmath>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

namespace FG = ORVO::FilterGraph;

namespace {

int check(bool condition, char const* what) {
    if (!condition)
        std::fprintf(stderr, "consumer: failed: %s\n", what);
    return condition ? 0 : 1;
}

// The bilateral filter of an image of one value gives that value again, in every pixel.
int filterConstantImage() {
    ORVO::PositionExtentInPixelSpace const rectangle(ORVO::PositionInPixelSpace(0, 0),
                                                     ORVO::ExtentInPixelSpace(20, 10));
    FG::ImageDescriptorCPU const descriptor({4, FG::ImageDescriptor::CHANNEL_TYPE_FLOAT32},
                                            ORVO::PixelExtentInWorldSpace());
    std::vector<float> source(20 * 10 * 4, 0.5F);
    for (std::size_t alpha = 3; alpha < source.size(); alpha += 4)
        source[alpha] = 1.0F;
    std::vector<float> result(source.size(), -1.0F);
    auto bytes = [](std::vector<float>& pixels) { return reinterpret_cast<unsigned char*>(pixels.data()); };
    FG::ImageCPU sourceImage(descriptor, rectangle, bytes(source), 0);
    FG::ImageCPU resultImage(descriptor, rectangle, bytes(result), 0);

    auto const input = FG::createInputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    auto const output = FG::createOutputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    auto const filter = FG::FilterFactory::Instance()->create(
        FG::IFilter::Identifier("FastBilateralBlur", "Motion Loft", "Norvane Works"));
    FG::Connect(input, filter);
    FG::Connect(filter, output);
    input->setImage(&sourceImage);
    output->setImage(&resultImage);

    FG::OptimizationOptions options;
    options.setProcessingMode(FG::OptimizationOptions::CPU_PROCESSING);
    FG::createProcessor(output, nullptr)->processFrame(options);

    for (std::size_t i = 0; i < result.size(); ++i)
        if (std::fabs(result[i] - source[i]) > 1e-5F)
            return check(false, "a constant image stays constant");
    return 0;
}

int catchAcrossTheBorder() {
    try {
        FG::FilterFactory::Instance()->create(FG::IFilter::Identifier("no such filter", "", ""));
    } catch (ORVO::InternalException const& failure) {
        return check(failure.message() == std::string("Enforce pPrototype != NULL"),
                     "the message of an unknown filter");
    }
    return check(false, "an unknown filter is refused");
}

} // namespace

int main() {
    ORVO::Core::AutoInitializer core;
    ORVO::OGL::AutoInitializer ogl;
    ORVO::ImageRuntime::AutoInitializer runtime(nullptr, ORVO::VideoMemory::Configuration());
    ORVO::DataFlow::AutoInitializer dataFlow;
    ORVO::ImageFlow::AutoInitializer imageFlow(false);
    FG::AutoInitializer filterGraph{FG::Library::InitializationOptions()};
    FG::insertStandardFilters();

    int const failures = filterConstantImage() + catchAcrossTheBorder();
    if (failures == 0)
        std::puts("consumer: all checks passed");
    return failures;
}
