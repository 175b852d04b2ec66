// The bilateral grid on OpenGL on an RGBA8 picture of 1920 by 1080, sigma 10 / 0.15, luminance and colorize,
// from a texture into a texture, beside the CPU's on the same picture in memory; in a context without a
// display: on a GPU where there is one, else on the software driver. The label names it.
//
// Both are frames of a standard processor with the same filter, run by turns so that both see the same
// machine, and each ends when the driver has done with it. Counters: "cpu_ms" is the frame on the CPU,
// "to_cpu" that divided by the frame on OpenGL; "difference" the largest between the two results, in steps of
// 8 bits. GB/s counts the picture read once and written once; to_memcpy is the time in times of a copy of
// those bytes.
#include "benchmarks/support/GLLayers.h"
#include "benchmarks/support/Timing.h"

#include "orvo/orvo.h"

#include <benchmark/benchmark.h>
#include <epoxy/gl.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <vector>

namespace {

using namespace ORVO;
using Benchmarks::medianOf;
using Benchmarks::secondsOf;
using FilterGraph::OptimizationOptions;

constexpr int kWidth = 1920;
constexpr int kHeight = 1080;

using Bytes = std::vector<unsigned char>;

/// Gradients, edges and some noise; opaque, so that premultiplying changes nothing.
Bytes makePicture() {
    Bytes pixels;
    pixels.reserve(static_cast<std::size_t>(kWidth) * kHeight * 4);
    unsigned noise = 1;
    for (int y = 0; y < kHeight; ++y) {
        for (int x = 0; x < kWidth; ++x) {
            noise = noise * 1664525U + 1013904223U;
            int const base = x * 120 / kWidth + ((x / 160 + y / 120) % 2 == 0 ? 20 : 110) + int(noise >> 28U);
            for (int const channel : {base, base * 3 / 4, base / 2 + 20}) {
                pixels.push_back(static_cast<unsigned char>(channel));
            }
            pixels.push_back(255);
        }
    }
    return pixels;
}

PositionExtentInPixelSpace frame() { return PositionExtentInPixelSpace(ExtentInPixelSpace(kWidth, kHeight)); }
FilterGraph::ImageDescriptor::Format bytesRGBA() {
    return {4, FilterGraph::ImageDescriptor::CHANNEL_TYPE_UINT8};
}

/// source -> filter -> result.
class Road {
public:
    Road(char const* pFilter, char const* pNameSpace, char const* pVendor, FilterGraph::ImageBase& source,
         FilterGraph::ImageBase& result, OGL::Context const* pContext, bool bColorize) {
        auto const spFilter = FilterGraph::FilterFactory::Instance()->create({pFilter, pNameSpace, pVendor});
        spFilter->parameter("colorize")->as<bool>().setValue(bColorize);
        FilterGraph::Connect(spInput_, spFilter);
        FilterGraph::Connect(spFilter, spOutput_);
        spFilter_ = spFilter;
        spInput_->setImage(&source);
        spOutput_->setImage(&result);
        spProcessor_ = FilterGraph::createProcessor(spOutput_, pContext);
    }

    void run(OptimizationOptions::eProcessingMode eMode) {
        OptimizationOptions options;
        options.setProcessingMode(eMode);
        spProcessor_->processFrame(options);
        glFinish();
    }

private:
    std::shared_ptr<FilterGraph::IInputAdapter> spInput_ =
        FilterGraph::createInputAdapter(FilterGraph::IAdapter::REGION_SYNC_FROM_IMAGE);
    std::shared_ptr<FilterGraph::IFilter> spFilter_;
    std::shared_ptr<FilterGraph::IOutputAdapter> spOutput_ =
        FilterGraph::createOutputAdapter(FilterGraph::IAdapter::REGION_SYNC_FROM_IMAGE);
    std::shared_ptr<FilterGraph::IProcessor> spProcessor_;
};

Bytes texelsOf(OGL::Texture2D const& texture) {
    Bytes texels(static_cast<std::size_t>(kWidth) * kHeight * 4);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    glGetTexImage(GL_TEXTURE_2D, 0, GL_RGBA, GL_UNSIGNED_BYTE, texels.data());
    glBindTexture(GL_TEXTURE_2D, 0);
    return texels;
}

int largestDifferenceOf(Bytes const& a, Bytes const& b) {
    int largest = 0;
    for (std::size_t i = 0; i < a.size(); ++i) {
        largest = std::max(largest, std::abs(int(a[i]) - int(b[i])));
    }
    return largest;
}

void measure(benchmark::State& state, bool bColorize) {
    using FilterGraph::ImageDescriptorCPU;
    using FilterGraph::ImageDescriptorGL;
    using FilterGraph::ImageGL;
    Benchmarks::GLLayers const layers;
    FilterGraph::insertStandardFilters();
    Bytes source = makePicture();
    Bytes result(source.size());
    OGL::Texture2D sourceTexture(OGL::Texture::INTERNAL_FORMAT_RGBA8, kWidth, kHeight, false, source.data());
    OGL::Texture2D resultTexture(OGL::Texture::INTERNAL_FORMAT_RGBA8, kWidth, kHeight, false, nullptr);
    ImageGL sourceGL(ImageDescriptorGL(bytesRGBA(), {}), frame(), &sourceTexture);
    ImageGL resultGL(ImageDescriptorGL(bytesRGBA(), {}), frame(), &resultTexture);
    FilterGraph::ImageCPU sourceCPU(ImageDescriptorCPU(bytesRGBA(), {}), frame(), source.data(), 0);
    FilterGraph::ImageCPU resultCPU(ImageDescriptorCPU(bytesRGBA(), {}), frame(), result.data(), 0);
    // On OpenGL the node alone: an opaque picture needs no companions.
    Road gpu("FastBilateralFilter", "ImageFlow", "Norvane", sourceGL, resultGL, &layers.context(), bColorize);
    Road cpu("FastBilateralBlur", "Motion Loft", "Norvane Works", sourceCPU, resultCPU, &layers.context(),
             bColorize);
    gpu.run(OptimizationOptions::FULL_OPTIMIZATION);
    cpu.run(OptimizationOptions::CPU_PROCESSING);
    int const difference = largestDifferenceOf(texelsOf(resultTexture), result);
    if (difference > 8) {
        state.SkipWithError("CPU and OpenGL differ");
        return;
    }
    std::vector<double> aGPU, aCPU, aCopy;
    for ([[maybe_unused]] auto _ : state) {
        aGPU.push_back(secondsOf([&] { gpu.run(OptimizationOptions::FULL_OPTIMIZATION); }));
        aCPU.push_back(secondsOf([&] { cpu.run(OptimizationOptions::CPU_PROCESSING); }));
        aCopy.push_back(secondsOf([&] { std::memcpy(result.data(), source.data(), source.size()); }));
        state.SetIterationTime(aGPU.back());
    }
    double const seconds = medianOf(aGPU);
    state.counters["cpu_ms"] = medianOf(aCPU) * 1e3;
    state.counters["to_cpu"] = medianOf(aCPU) / seconds;
    state.counters["to_memcpy"] = seconds / medianOf(aCopy);
    state.counters["difference"] = difference;
    state.SetBytesProcessed(state.iterations() * 2 * static_cast<std::int64_t>(source.size()));
    state.SetItemsProcessed(state.iterations() * kWidth * kHeight);
    state.SetLabel(reinterpret_cast<char const*>(glGetString(GL_RENDERER)));
}

BENCHMARK_CAPTURE(measure, luminance, false)
    ->Name("bilateral_gl/luminance")
    ->Iterations(5)
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(measure, colorize, true)
    ->Name("bilateral_gl/colorize")
    ->Iterations(5)
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);

} // namespace
