#include "apply_filter/FrameRunner.h"

#include "apply_filter/FilterList.h"
#include "apply_filter/Interrupt.h"
#include "orvo/filter_graph/FilterGraph.h"

#include <chrono>
#include <cstdio>
#include <utility>
#include <vector>

#include <unistd.h>

namespace example {

namespace {

namespace FG = ORVO::FilterGraph;
using FG::OptimizationOptions;
using Clock = std::chrono::steady_clock;

double millisecondsSince(Clock::time_point start) {
    return std::chrono::duration<double, std::milli>(Clock::now() - start).count();
}

FG::ImageDescriptorCPU descriptorOf(Picture const& picture) {
    FG::ImageDescriptor::Format format;
    format.nChannel = picture.channels;
    format.channelType = picture.depth == Depth::uint8      ? FG::ImageDescriptor::CHANNEL_TYPE_UINT8
                         : picture.depth == Depth::uint15_1 ? FG::ImageDescriptor::CHANNEL_TYPE_UINT15_1
                                                            : FG::ImageDescriptor::CHANNEL_TYPE_FLOAT32;
    return {format, ORVO::PixelExtentInWorldSpace()};
}

FG::ImageCPU imageOf(Picture const& picture) {
    ORVO::PositionExtentInPixelSpace const rectangle(
        ORVO::PositionInPixelSpace(0, 0),
        ORVO::ExtentInPixelSpace(static_cast<int>(picture.width), static_cast<int>(picture.height)));
    return {descriptorOf(picture), rectangle, picture.pixels.data(), 0};
}

// A graph of one chain with its images. Connections do not own: the filters are held here.
struct Graph {
    std::shared_ptr<FG::IInputAdapter> input = FG::createInputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    std::vector<std::shared_ptr<FG::IFilter>> chain;
    std::shared_ptr<FG::IOutputAdapter> output =
        FG::createOutputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    FG::ImageCPU sourceImage;
    FG::ImageCPU resultImage;

    Graph(Picture const& source, std::vector<std::shared_ptr<FG::IFilter>> filters, Picture& result)
        : chain(std::move(filters)), sourceImage(imageOf(source)), resultImage(imageOf(result)) {
        if (chain.empty()) {
            FG::Connect(input, output);
        } else {
            // A filter with several inputs gets the picture on each.
            for (FG::Input* const pInput : chain.front()->inputs())
                FG::Connect(input, pInput);
            for (std::size_t i = 1; i < chain.size(); ++i)
                FG::Connect(chain[i - 1], chain[i]);
            FG::Connect(chain.back(), output);
        }
        input->setImage(&sourceImage);
        output->setImage(&resultImage);
    }
    Graph(Graph const&) = delete;
    Graph& operator=(Graph const&) = delete;
};

OptimizationOptions optionsFor(ORVO::OGL::Context const* context, Depth depth) {
    OptimizationOptions options;
    if (!context)
        options.setProcessingMode(OptimizationOptions::CPU_PROCESSING);
    else if (depth == Depth::float32) // shader filters have 8 bits for 32-bit floats
        options.setIntermediateBufferPrecision(OptimizationOptions::INTERMEDIATE_PRECISION_16_BIT_FLOAT);
    return options;
}

// Polls the running frame until it ends. An interrupt cancels it; the frame is waited for in any case.
bool pollToEnd(FG::IProcessor& processor, int frame, Clock::time_point start) {
    bool const terminal = ::isatty(STDERR_FILENO) == 1;
    constexpr double timeout = 0.05;
    constexpr double interval = 0.001;
    bool cancelled = false;
    while (processor.waitForFrame(timeout, interval) != FG::IProcessorBase::FRAME_COMPLETE) {
        if (Interrupt::requested() && !cancelled) {
            processor.cancelFrame();
            cancelled = true;
        }
        if (terminal)
            std::fprintf(stderr, "\rframe %d: %.1f s%s", frame, millisecondsSince(start) / 1000.0,
                         cancelled ? ", cancelling" : "");
    }
    if (terminal)
        std::fputs("\r\033[K", stderr);
    return !cancelled;
}

bool runGraph(Graph const& graph, Depth depth, FrameSettings const& settings) {
    auto const options = optionsFor(settings.context, depth);
    auto const processor = FG::createProcessor(graph.output, settings.context);
    Interrupt const interrupt;
    for (int frame = 1; frame <= settings.repeat; ++frame) {
        auto const start = Clock::now();
        if (settings.async)
            processor->asyncProcessFrame(options);
        else
            processor->processFrame(options);
        if ((settings.async && !pollToEnd(*processor, frame, start)) || Interrupt::requested())
            return false;
        if (settings.repeat > 1)
            std::printf("frame %d: %.2f ms\n", frame, millisecondsSince(start));
    }
    return true;
}

bool runOnGL(std::shared_ptr<FG::IFilter> const& filter, Picture const& source, Picture& result,
             FrameSettings const& settings) {
    Picture const opaque = withAlpha(source);
    Picture filtered(opaque.width, opaque.height, opaque.channels, result.depth);
    if (!runGraph(Graph(opaque, {filter}, filtered), filtered.depth, settings))
        return false;
    result = result.hasAlpha() ? filtered : withoutAlpha(filtered);
    return true;
}

// Most filters on the CPU compute in 8-bit or float, in the precision of the image that the graph ends in:
// 16-bit images go into a float graph through the engine's converter, and an empty graph brings the result
// back to 16 bits.
bool runSixteenBitsThroughFloat(std::shared_ptr<FG::IFilter> const& filter, Picture const& source,
                                Picture& result, FrameSettings const& settings) {
    Picture floats(result.width, result.height, result.channels, Depth::float32);
    if (!runGraph(Graph(source, {createFilterNamed("ConvertToSIMDOptimized"), filter}, floats), floats.depth,
                  settings))
        return false;
    return runGraph(Graph(floats, {}, result), result.depth, FrameSettings());
}

} // namespace

bool takesSixteenBits(std::shared_ptr<FG::IFilter> const& filter) {
    Picture const source(4, 4, 4, Depth::uint15_1);
    Picture result(4, 4, 4, Depth::uint15_1);
    try {
        return runGraph(Graph(source, {filter}, result), result.depth, FrameSettings());
    } catch (std::exception const&) {
        return false;
    }
}

bool runFrames(std::shared_ptr<FG::IFilter> const& filter, Picture const& source, Picture& result,
               FrameSettings const& settings) {
    if (settings.context)
        return runOnGL(filter, source, result, settings);
    if (source.depth == Depth::uint15_1 && !takesSixteenBits(filter))
        return runSixteenBitsThroughFloat(filter, source, result, settings);
    return runGraph(Graph(source, {filter}, result), source.depth, settings);
}

bool runsOn(ORVO::OGL::Context const* context, std::shared_ptr<FG::IFilter> const& filter) {
    FrameSettings settings;
    settings.context = context;
    for (auto const& [from, to] : {std::pair(Depth::uint8, Depth::uint8),
                                   {Depth::uint8, Depth::float32},
                                   {Depth::float32, Depth::uint8}}) {
        Picture const source(4, 4, 4, from);
        Picture result(4, 4, 4, to);
        try {
            return runFrames(filter, source, result, settings);
        } catch (std::exception const&) {
            // The converters among the filters take one of the other pairs.
        }
    }
    return false;
}

} // namespace example
