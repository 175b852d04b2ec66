#include "apply_filter/FrameRunner.h"

#include "apply_filter/FilterList.h"
#include "apply_filter/Interrupt.h"
#include "orvo/filter_graph/FilterGraph.h"

#include <chrono>
#include <cstdio>

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

// Filters compute in 8-bit or float: 16-bit images pass through the engine's converters on both sides.
void connect(std::shared_ptr<FG::IInputAdapter> const& input, std::shared_ptr<FG::IFilter> const& filter,
             std::shared_ptr<FG::IOutputAdapter> const& output, bool convert) {
    if (!convert) {
        FG::Connect(input, filter);
        FG::Connect(filter, output);
        return;
    }
    auto const toFloat = createFilterNamed("ConvertToSIMDOptimized");
    auto const fromFloat = createFilterNamed("ConvertFromSIMDOptimized");
    FG::Connect(input, toFloat);
    FG::Connect(toFloat, filter);
    FG::Connect(filter, fromFloat);
    FG::Connect(fromFloat, output);
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

} // namespace

bool runFrames(std::shared_ptr<FG::IFilter> const& filter, Picture const& source, Picture& result, int repeat,
               bool async) {
    FG::ImageCPU sourceImage = imageOf(source);
    FG::ImageCPU resultImage = imageOf(result);
    auto const input = FG::createInputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    auto const output = FG::createOutputAdapter(FG::IAdapter::REGION_SYNC_FROM_IMAGE);
    connect(input, filter, output, source.depth == Depth::uint15_1);
    input->setImage(&sourceImage);
    output->setImage(&resultImage);

    auto const processor = FG::createProcessor(output, nullptr);
    OptimizationOptions options;
    options.setProcessingMode(OptimizationOptions::CPU_PROCESSING);
    Interrupt const interrupt;
    for (int frame = 1; frame <= repeat; ++frame) {
        auto const start = Clock::now();
        if (async)
            processor->asyncProcessFrame(options);
        else
            processor->processFrame(options);
        if ((async && !pollToEnd(*processor, frame, start)) || Interrupt::requested())
            return false;
        if (repeat > 1)
            std::printf("frame %d: %.2f ms\n", frame, millisecondsSince(start));
    }
    return true;
}

} // namespace example
