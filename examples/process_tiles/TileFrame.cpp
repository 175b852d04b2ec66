#include "process_tiles/TileFrame.h"

#include "orvo/core/spaces/Conversions.h"
#include "orvo/filter_graph/FilterGraph.h"
#include "orvo/image_runtime/TexturePool.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <limits>
#include <utility>

namespace example {

namespace {

namespace FG = ORVO::FilterGraph;
using FG::OptimizationOptions;

// What a picture of a few pixels takes: the libraries that the program is linked to, threads.
constexpr std::size_t program = std::size_t(140) << 20U;
constexpr std::size_t softwareDriver = std::size_t(160) << 20U;
// Unused textures that stay for the next frame.
constexpr std::size_t unusedTextures = std::size_t(64) << 20U;

FG::ImageDescriptor::Format formatOf(std::size_t channels, Depth depth) {
    return {channels, depth == Depth::uint8      ? FG::ImageDescriptor::CHANNEL_TYPE_UINT8
                      : depth == Depth::uint15_1 ? FG::ImageDescriptor::CHANNEL_TYPE_UINT15_1
                                                 : FG::ImageDescriptor::CHANNEL_TYPE_FLOAT32};
}

ORVO::PositionExtentInWorldSpace worldOf(Rectangle const& rectangle) {
    return ORVO::pixelToWorldSpace(rectangle, ORVO::PixelExtentInWorldSpace());
}

// The pixels of a rectangle, which lies in the band.
Picture partOf(Band const& band, Rectangle const& rectangle) {
    Picture part(static_cast<std::size_t>(rectangle.extent().width()),
                 static_cast<std::size_t>(rectangle.extent().height()), band.picture.channels,
                 band.picture.depth);
    std::size_t const pixelBytes = part.channels * bytesPerChannel(part.depth);
    auto const top = static_cast<std::size_t>(rectangle.position().y() - band.firstRow);
    auto const left = static_cast<std::size_t>(rectangle.position().x());
    for (std::size_t row = 0; row < part.height; ++row)
        std::memcpy(part.pixels.data() + row * part.rowBytes(),
                    band.picture.pixels.data() + (top + row) * band.picture.rowBytes() + left * pixelBytes,
                    part.rowBytes());
    return part;
}

OptimizationOptions optionsOf(TileFrameSettings const& settings) {
    OptimizationOptions options;
    if (!settings.context)
        options.setProcessingMode(OptimizationOptions::CPU_PROCESSING);
    else if (settings.depth == Depth::float32) // shader filters have 8 bits for 32-bit floats
        options.setIntermediateBufferPrecision(OptimizationOptions::INTERMEDIATE_PRECISION_16_BIT_FLOAT);
    return options;
}

std::size_t workingChannels(TileFrameSettings const& settings) {
    if (settings.context)
        return 4;
    return settings.channels < 3 ? settings.channels + 2 : settings.channels;
}

} // namespace

// Connections and bindings do not own: all that they lead to is here.
struct TileFrame::Graph {
    TileFrameSettings settings;
    std::shared_ptr<FG::IFilter> filter;
    FG::ImageDescriptorCPU descriptor;
    OptimizationOptions options;
    std::shared_ptr<FG::IInputAdapter> input = FG::createInputAdapter(FG::IAdapter::REGION_SYNC_EXPLICIT);
    std::shared_ptr<FG::IOutputAdapter> output = FG::createOutputAdapter(FG::IAdapter::REGION_SYNC_EXPLICIT);
    FG::ImageCPU source;
    FG::ImageCPU result;
    FG::Utility::Tiles textures; ///< on OpenGL: that of this frame and that of the last one
    int place = 0;               ///< that of the texture that is bound
    std::shared_ptr<FG::IEmbeddedProcessor> processor;

    Graph(std::shared_ptr<FG::IFilter> usedFilter, TileFrameSettings const& usedSettings)
        : settings(usedSettings),
          filter(std::move(usedFilter)),
          descriptor(formatOf(workingChannels(settings), settings.depth), ORVO::PixelExtentInWorldSpace()),
          options(optionsOf(settings)),
          source(descriptor),
          result(descriptor),
          textures(FG::ImageDescriptorGL(descriptor.format(), descriptor.pixelExtent()), Rectangle(), 2) {
        FG::Connect(input, filter);
        FG::Connect(filter, output);
        input->setDomainOfDefinition(worldOf(rectangleBetween(0, 0, settings.width, settings.height)));
        output->setImage(&result);
        if (settings.context) {
            std::size_t const largest = std::numeric_limits<std::int32_t>::max();
            textures.setGPUMemoryLimit(static_cast<std::int32_t>(std::min(settings.textureMemory, largest)));
            ORVO::TexturePool::Instance()->setMaximumPoolSize(unusedTextures);
            input->setImage(&textures.createTileAt(place, rectangleBetween(0, 0, 1, 1))->image());
        } else {
            input->setImage(&source);
        }
        processor = FG::createEmbeddedProcessor(output, settings.context);
    }

    void bindBand(Band const& band, Rectangle const& part) {
        std::size_t const pitch = band.picture.rowBytes();
        std::size_t const pixelBytes = band.picture.channels * bytesPerChannel(band.picture.depth);
        auto const top = static_cast<std::size_t>(part.position().y() - band.firstRow);
        unsigned char const* const first = band.picture.pixels.data() + top * pitch +
                                           static_cast<std::size_t>(part.position().x()) * pixelBytes;
        source = FG::ImageCPU(descriptor, part, first, static_cast<int>(pitch));
    }

    void bindCopy(Picture const& pixels, Rectangle const& part) {
        source = FG::ImageCPU(descriptor, part, pixels.pixels.data(), 0);
    }

    void bindTexture(Picture const& pixels, Rectangle const& part) {
        // By turns: the image of the last frame has to stand until another one is bound, which a refused
        // texture never is.
        int const other = 1 - place;
        FG::Utility::ImageWrapper* const tile = textures.createTileAt(other, part);
        tile->initializeStorage();
        tile->storageCPU2GL(pixels.pixels.data(), tile->storageGL());
        input->setImage(&tile->image());
        place = other;
    }

    void compute(Rectangle const& computed, Picture& pixels) {
        pixels.resize(static_cast<std::size_t>(computed.extent().width()),
                      static_cast<std::size_t>(computed.extent().height()), descriptor.format().nChannel,
                      settings.depth);
        result = FG::ImageCPU(descriptor, computed, pixels.pixels.data(), 0);
        processor->processFrameEmbedded(options);
    }
};

TileFrame::TileFrame(std::shared_ptr<FG::IFilter> filter, TileFrameSettings const& settings)
    : graph_(std::make_unique<Graph>(std::move(filter), settings)) {}

TileFrame::~TileFrame() = default;

Rectangle TileFrame::needed(Rectangle const& computed) {
    Graph& graph = *graph_;
    graph.output->setRegionOfInterest(worldOf(computed));
    graph.processor->prepareForProcessing(graph.options);
    graph.processor->propagateDomainsOfDefinition();
    graph.processor->propagateRegionOfInterest();
    Rectangle const region =
        ORVO::worldToPixelSpace(graph.input->getRegionOfInterest(), ORVO::PixelExtentInWorldSpace());
    return commonPart(region, rectangleBetween(0, 0, graph.settings.width, graph.settings.height));
}

void TileFrame::run(Band const& band, Rectangle const& computed, Picture& result) {
    Graph& graph = *graph_;
    Rectangle const part = needed(computed);
    Picture copy;
    if (graph.settings.context) {
        copy = withAlpha(widenedToColour(partOf(band, part)));
        graph.bindTexture(copy, part);
    } else if (graph.settings.channels < 3) {
        copy = widenedToColour(partOf(band, part));
        graph.bindCopy(copy, part);
    } else {
        graph.bindBand(band, part);
    }
    graph.compute(computed, result);
}

void TileFrame::tryOut(Rectangle const& computed) {
    Graph& graph = *graph_;
    Rectangle const part = needed(computed);
    Picture const black(static_cast<std::size_t>(part.extent().width()),
                        static_cast<std::size_t>(part.extent().height()), graph.descriptor.format().nChannel,
                        graph.settings.depth);
    graph.bindTexture(black, part);
    Picture result;
    graph.compute(computed, result);
}

std::size_t TileFrame::channels() const { return workingChannels(graph_->settings); }

MemoryUse TileFrame::memoryUse() const {
    TileFrameSettings const& settings = graph_->settings;
    std::size_t const pixel = channels() * bytesPerChannel(settings.depth);
    // Pictures of 16 bits are read by way of floats.
    std::size_t const file = settings.channels * (settings.depth == Depth::uint8 ? 1 : sizeof(float));
    if (settings.context) {
        // The copy, its texture, and textures and buffers of floats, which may be larger than the tile.
        std::size_t const work = 2 * pixel + 96;
        return {program + softwareDriver + unusedTextures, file, pixel,
                work + gridTexturesOf(*graph_->filter), work / 2};
    }
    // Four planes of floats, which the store keeps.
    std::size_t const work = 16 + (settings.channels < 3 ? pixel : 0);
    return {program, file, pixel, work, work};
}

} // namespace example
