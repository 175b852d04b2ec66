// What a frame and a build cost beside the work of the filters: a chain of trivial filters on an image of one
// pixel, over the whole road of a standard processor. Items are filters.
#include "orvo/core/CoreLibrary.h"
#include "orvo/data_flow/DataFlowLibrary.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/filter_graph/FilterGraph.h"
#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"
#include "orvo/image_runtime/images/PixelStructures.h"
#include "orvo/ogl/OGLLibrary.h"

#include <benchmark/benchmark.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <stdexcept>
#include <vector>

namespace {

using namespace ORVO;
using FilterGraph::OptimizationOptions;

/// Adds its parameter "value" to one pixel.
class AddNode : public ImageFilter {
public:
    AddNode()
        : ImageFilter("Add", OUTPUT_PRECISION_DEFAULT),
          oInput_("input", this),
          oOutput_("output", this),
          oValue_(1.0f, "value") {
        inputTarget_ = ORVO_TARGET_CPU;
        outputTarget_ = ORVO_TARGET_CPU;
        addImageInput(&oInput_);
        setImageOutput(&oOutput_);
        registerParameter(&oValue_);
    }

    void processSlice(std::size_t, std::size_t) override {
        auto const* const pSource = reinterpret_cast<float const*>(oInput_->pixels_Luminance32F());
        auto* const pDestination = reinterpret_cast<float*>(spOutputImage_->pixels_Luminance32F());
        *pDestination = *pSource + oValue_.value();
    }

private:
    DataFlow::ConstInput<ImageCPU> oInput_;
    DataFlow::ConstOutput<ImageCPU> oOutput_;
    DataFlow::Parameter<float> oValue_;
};

struct Layers {
    Core::AutoInitializer oCore;
    OGL::AutoInitializer oOGL;
    ImageRuntime::AutoInitializer oImageRuntime{static_cast<OGL::Context const*>(nullptr),
                                                VideoMemory::Configuration()};
    DataFlow::AutoInitializer oDataFlow;
    ImageFlow::AutoInitializer oImageFlow{false};
    FilterGraph::AutoInitializer oFilterGraph{FilterGraph::Library::InitializationOptions()};
};

/// A source, so many filters, a sink, and a processor.
class Chain {
public:
    explicit Chain(std::size_t nFilters) {
        FilterGraph::Internal::ImageFlowFilter<AddNode> prototype(
            FilterGraph::IFilter::Identifier("add", "benchmark", "ORVO", 1), ORVO_TARGET_CPU);
        prototype.initialize();
        for (std::size_t i = 0; i < nFilters; ++i) {
            aFilters_.push_back(prototype.clone());
            if (i > 0) {
                FilterGraph::Connect(aFilters_[i - 1], aFilters_[i]);
            }
        }
        FilterGraph::Connect(spSource_, aFilters_.front());
        FilterGraph::Connect(aFilters_.back(), spSink_);
        spSource_->setImage(&oInput_);
        spSink_->setImage(&oOutput_);
        oOptions_.setProcessingMode(OptimizationOptions::CPU_PROCESSING);
        recreateProcessor();
    }

    void recreateProcessor() { spProcessor_ = FilterGraph::createProcessor(spSink_, nullptr); }

    void stampImages() { oInput_.setContentStamp(1); }

    /// One more frame after a change of one filter's parameter. Checks its result.
    void frame(std::size_t iChanged) {
        fChange_ += 1.0f;
        aFilters_[iChanged]->parameter("value")->as<float>().setValue(fChange_);
        spProcessor_->processFrame(oOptions_);
        if (fOutput_ != fInput_ + static_cast<float>(aFilters_.size() - 1) + fChange_) {
            throw std::runtime_error("the chain computes a wrong pixel");
        }
    }

private:
    static FilterGraph::ImageCPU makeImage(float& pixel) {
        return {FilterGraph::ImageDescriptorCPU({1, FilterGraph::ImageDescriptor::CHANNEL_TYPE_FLOAT32},
                                                PixelExtentInWorldSpace()),
                PositionExtentInPixelSpace(ExtentInPixelSpace(1, 1)),
                reinterpret_cast<unsigned char const*>(&pixel), 0};
    }

    Layers oLayers_;
    float fInput_ = 5.0f;
    float fOutput_ = 0.0f;
    float fChange_ = 0.0f;
    FilterGraph::ImageCPU oInput_ = makeImage(fInput_);
    FilterGraph::ImageCPU oOutput_ = makeImage(fOutput_);
    std::shared_ptr<FilterGraph::IInputAdapter> spSource_ =
        FilterGraph::createInputAdapter(FilterGraph::IAdapter::REGION_SYNC_FROM_IMAGE);
    std::shared_ptr<FilterGraph::IOutputAdapter> spSink_ =
        FilterGraph::createOutputAdapter(FilterGraph::IAdapter::REGION_SYNC_FROM_IMAGE);
    std::vector<std::shared_ptr<FilterGraph::IFilter>> aFilters_;
    std::shared_ptr<FilterGraph::IProcessor> spProcessor_;
    OptimizationOptions oOptions_;
};

// fChange_ counts up to 2^24 exactly, far beyond the number of frames of a run.

/// The image is not stamped, so every filter runs on every frame.
void frameOfEverything(benchmark::State& state) {
    auto const nFilters = static_cast<std::size_t>(state.range(0));
    Chain chain(nFilters);
    chain.frame(0);
    for (auto _ : state) {
        chain.frame(0);
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations()) * state.range(0));
}

/// The image is stamped and the last filter changes, so one filter runs on every frame.
void frameOfOneChange(benchmark::State& state) {
    auto const nFilters = static_cast<std::size_t>(state.range(0));
    Chain chain(nFilters);
    chain.stampImages();
    chain.frame(nFilters - 1);
    for (auto _ : state) {
        chain.frame(nFilters - 1);
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations()) * state.range(0));
}

/// A new processor and its first frame, which builds the executable. The old executable is freed untimed.
void build(benchmark::State& state) {
    Chain chain(static_cast<std::size_t>(state.range(0)));
    for (auto _ : state) {
        state.PauseTiming();
        chain.recreateProcessor();
        state.ResumeTiming();
        chain.frame(0);
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations()) * state.range(0));
}

BENCHMARK(frameOfEverything)->Name("processor_chain/frame")->Arg(1)->Arg(1000)->Arg(4000)->UseRealTime();
BENCHMARK(frameOfOneChange)->Name("processor_chain/frame_one_runs")->Arg(1000)->UseRealTime();
BENCHMARK(build)
    ->Name("processor_chain/build_and_first_frame")
    ->Arg(250)
    ->Arg(1000)
    ->Arg(4000)
    ->UseRealTime();

} // namespace
