// The shortest host: a noisy step edge in memory, smoothed by the bilateral filter. The noise goes, the edge
// stays.
#include "orvo/orvo.h"

#include <cstdio>
#include <cstdlib>
#include <vector>

namespace FG = ORVO::FilterGraph;

int main() {
    // 1. Start the layers, lowest first; they end in reverse order. No OpenGL context: this host uses the
    // CPU.
    ORVO::Core::AutoInitializer core;
    ORVO::OGL::AutoInitializer ogl;
    ORVO::ImageRuntime::AutoInitializer runtime(nullptr, ORVO::VideoMemory::Configuration());
    ORVO::DataFlow::AutoInitializer dataFlow;
    ORVO::ImageFlow::AutoInitializer imageFlow(false);
    FG::AutoInitializer filterGraph{FG::Library::InitializationOptions()};
    FG::insertStandardFilters();

    // 2. The host's own pixels: RGBA floats, dark on the left, light on the right.
    int const width = 64;
    int const height = 32;
    std::vector<float> pixels(width * height * 4);
    for (int i = 0; i < width * height; ++i) {
        float const noise = 0.04F * static_cast<float>(std::rand()) / static_cast<float>(RAND_MAX) - 0.02F;
        for (int channel = 0; channel < 3; ++channel)
            pixels[i * 4 + channel] = (i % width < width / 2 ? 0.25F : 0.75F) + noise;
        pixels[i * 4 + 3] = 1.0F;
    }
    std::vector<float> result(pixels.size());

    // 3. Wrap them: the engine reads and writes this memory in place.
    FG::ImageDescriptorCPU const descriptor({4, FG::ImageDescriptor::CHANNEL_TYPE_FLOAT32},
                                            ORVO::PixelExtentInWorldSpace());
    ORVO::PositionExtentInPixelSpace const rectangle(ORVO::ExtentInPixelSpace(width, height));
    FG::ImageCPU sourceImage(descriptor, rectangle, reinterpret_cast<unsigned char*>(pixels.data()), 0);
    FG::ImageCPU resultImage(descriptor, rectangle, reinterpret_cast<unsigned char*>(result.data()), 0);

    // 4. The graph: source image -> bilateral filter -> result image.
    auto const input = FG::createInputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    auto const filter =
        FG::FilterFactory::Instance()->create({"FastBilateralBlur", "Motion Loft", "Norvane Works"});
    auto const output = FG::createOutputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    FG::Connect(input, filter);
    FG::Connect(filter, output);
    input->setImage(&sourceImage);
    output->setImage(&resultImage);
    filter->parameter("spatialSigma")->as<ORVO::float2>().setValue(ORVO::float2(4.0F, 4.0F));

    // 5. One frame.
    FG::OptimizationOptions options;
    options.setProcessingMode(FG::OptimizationOptions::CPU_PROCESSING);
    FG::createProcessor(output, nullptr)->processFrame(options);

    for (int x = 0; x < width; x += 9) {
        int const red = (height / 2 * width + x) * 4;
        std::printf("x %2d: %.3f -> %.3f\n", x, pixels[red], result[red]);
    }
    return 0;
}
