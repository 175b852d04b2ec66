// A frame of three shader filters (a gain, a mean over 3 by 3 pixels, a summand) on an RGBA8 picture of 1920
// by 1080, over the whole road of a standard processor, in a context without a display: on a GPU where there
// is one, else on the software driver. The label names it.
//
// The name says where the images live: "memory_to_memory" uploads and reads back, "texture_to_texture" only
// draws. Every frame runs in full and ends when the driver has done with it. The counters are shares of the
// frame's time: "upload" and "read_back" are frames without filters from memory to a texture and back, run by
// turns with the others so that all see the same machine, and "passes" is what remains.
#include "benchmarks/support/GLLayers.h"
#include "benchmarks/support/Timing.h"

#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/orvo.h"

#include <benchmark/benchmark.h>
#include <epoxy/gl.h>

#include <array>
#include <cmath>
#include <cstddef>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace {

using namespace ORVO;
using Layers = Benchmarks::GLLayers;

constexpr int WIDTH = 1920;
constexpr int HEIGHT = 1080;

constexpr char const* pHead =
    "uniform vec2 _outOffset, _outPixelExtent, src_offset, src_delta;\n"
    "uniform sampler2D src_sampler;\n"
    "vec4 at(vec2 neighbour) {\n"
    "    vec2 place = (gl_TexCoord[0].xy + neighbour)*_outPixelExtent + _outOffset;\n"
    "    return texture2D(src_sampler, (place - src_offset)*src_delta);\n"
    "}\n";

/// A filter with one input whose program is a function "vec4 result()".
class Shader : public BasicGLShaderFilter {
public:
    explicit Shader(std::string const& result)
        : BasicGLShaderFilter("Benchmark",
                              (pHead + result + "void main() { gl_FragData[0] = result(); }\n").c_str(), 4) {
        addInput("src");
    }
};

class Gain : public Shader {
public:
    Gain() : Shader("vec4 result() { return 0.5*at(vec2(0.0)); }\n") {}
};

class Mean : public Shader {
public:
    Mean()
        : Shader("vec4 result() {\n"
                 "    vec4 sum = vec4(0.0);\n"
                 "    for (int y = -1; y <= 1; ++y)\n"
                 "        for (int x = -1; x <= 1; ++x)\n"
                 "            sum += at(vec2(x, y));\n"
                 "    return sum/9.0;\n"
                 "}\n") {}

    /// One pixel more on each side.
    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string inputName,
                                      RegionMap const& inputDODs) override;
};

class Summand : public Shader {
public:
    Summand() : Shader("vec4 result() { return at(vec2(0.0)) + 0.25; }\n") {}
};

PositionExtentInWorldSpace Mean::needed(PositionExtentInWorldSpace const& outputRegion,
                                        std::string /*inputName*/, RegionMap const& /*inputDODs*/) {
    PositionExtentInWorldSpace region = outputRegion;
    region.outset(float2(1.0F, 1.0F));
    return region;
}

using Bytes = std::vector<unsigned char>;

constexpr FilterGraph::ImageDescriptor::Format formatOfBytes() {
    return {4, FilterGraph::ImageDescriptor::CHANNEL_TYPE_UINT8};
}

PositionExtentInPixelSpace frame() { return PositionExtentInPixelSpace(ExtentInPixelSpace(WIDTH, HEIGHT)); }

/// The picture in memory and in a texture, both with room for it.
class Client {
public:
    explicit Client(Bytes pixels)
        : aPixels_(std::move(pixels)),
          oTexture_(OGL::Texture::INTERNAL_FORMAT_RGBA8, WIDTH, HEIGHT, false, aPixels_.data()),
          oMemoryImage_(FilterGraph::ImageDescriptorCPU(formatOfBytes(), {}), frame(), aPixels_.data(), 0),
          oTextureImage_(FilterGraph::ImageDescriptorGL(formatOfBytes(), {}), frame(), &oTexture_) {}

    FilterGraph::ImageBase* image(bool bInTexture) {
        return bInTexture ? static_cast<FilterGraph::ImageBase*>(&oTextureImage_) : &oMemoryImage_;
    }

    Bytes const& pixels() const { return aPixels_; }

    Bytes texels() const {
        Bytes texels(aPixels_.size());
        glBindTexture(GL_TEXTURE_2D, oTexture_.objectID());
        glGetTexImage(GL_TEXTURE_2D, 0, GL_RGBA, GL_UNSIGNED_BYTE, texels.data());
        glBindTexture(GL_TEXTURE_2D, 0);
        return texels;
    }

private:
    Bytes aPixels_;
    OGL::Texture2D oTexture_;
    FilterGraph::ImageCPU oMemoryImage_;
    FilterGraph::ImageGL oTextureImage_;
};

template <typename Node>
std::shared_ptr<FilterGraph::IFilter> makeFilter() {
    FilterGraph::Internal::ImageFlowFilter<Node> prototype({"shader", "benchmark", "ORVO", 1},
                                                           ORVO_TARGET_GL);
    prototype.initialize();
    return prototype.clone();
}

/// source -> gain -> mean -> summand -> result, or source -> result.
class Road {
public:
    Road(FilterGraph::ImageBase* pSource, FilterGraph::ImageBase* pResult, OGL::Context const* pContext,
         bool bFilters) {
        if (bFilters) {
            FilterGraph::Connect(spInput_, aFilters_[0]);
            FilterGraph::Connect(aFilters_[0], aFilters_[1]);
            FilterGraph::Connect(aFilters_[1], aFilters_[2]);
            FilterGraph::Connect(aFilters_[2], spOutput_);
        } else {
            FilterGraph::Connect(spInput_, spOutput_);
        }
        spInput_->setImage(pSource);
        spOutput_->setImage(pResult);
        spProcessor_ = FilterGraph::createProcessor(spOutput_, pContext);
    }

    void run() {
        spProcessor_->processFrame(FilterGraph::OptimizationOptions());
        glFinish();
    }

private:
    std::shared_ptr<FilterGraph::IInputAdapter> spInput_ =
        FilterGraph::createInputAdapter(FilterGraph::IAdapter::REGION_SYNC_FROM_IMAGE);
    std::array<std::shared_ptr<FilterGraph::IFilter>, 3> aFilters_{makeFilter<Gain>(), makeFilter<Mean>(),
                                                                   makeFilter<Summand>()};
    std::shared_ptr<FilterGraph::IOutputAdapter> spOutput_ =
        FilterGraph::createOutputAdapter(FilterGraph::IAdapter::REGION_SYNC_FROM_IMAGE);
    std::shared_ptr<FilterGraph::IProcessor> spProcessor_;
};

Bytes makePicture() {
    Bytes pixels(static_cast<std::size_t>(WIDTH) * HEIGHT * 4);
    for (std::size_t i = 0; i < pixels.size(); ++i)
        pixels[i] = static_cast<unsigned char>(i * 31 + i / 4096 * 17);
    return pixels;
}

/// Throws unless the result is within 2 of 255 of what the filters compute: each of the first two rounds by
/// half a step, and the mean and the last rounding add theirs.
void requireRight(Bytes const& source, Bytes const& result) {
    constexpr std::size_t rowBytes = static_cast<std::size_t>(WIDTH) * 4;
    for (std::size_t y = 1; y < HEIGHT - 1; y += 97) {
        for (std::size_t x = 4; x < rowBytes - 4; x += 13) {
            double sum = 0.0;
            for (std::size_t row : {y - 1, y, y + 1})
                for (std::size_t column : {x - 4, x, x + 4})
                    sum += source[row * rowBytes + column];
            double const expected = std::fmin(255.0, sum / 9.0 * 0.5 + 0.25 * 255.0);
            if (std::abs(result[y * rowBytes + x] - expected) > 2.0)
                throw std::runtime_error("the frame computes a wrong pixel");
        }
    }
}

enum : std::size_t { MEMORY_TO_MEMORY, TEXTURE_TO_MEMORY, MEMORY_TO_TEXTURE, TEXTURE_TO_TEXTURE };

void measure(benchmark::State& state, std::size_t iRoad) {
    bool const bFromTexture = (iRoad & 1) != 0;
    bool const bToTexture = (iRoad & 2) != 0;
    Layers const layers;
    Client source(makePicture());
    Client result(Bytes(source.pixels().size()));
    Road road(source.image(bFromTexture), result.image(bToTexture), &layers.context(), true);
    Road upload(source.image(false), result.image(true), &layers.context(), false);
    Road readBack(source.image(true), result.image(false), &layers.context(), false);
    upload.run();
    readBack.run();
    if (result.texels() != source.pixels() || result.pixels() != source.pixels())
        throw std::runtime_error("pixels change on their way up or down");
    road.run();
    requireRight(source.pixels(), bToTexture ? result.texels() : result.pixels());

    std::vector<double> aRoad, aUpload, aReadBack;
    for (auto _ : state) {
        aRoad.push_back(Benchmarks::secondsOf([&] { road.run(); }));
        state.PauseTiming();
        aUpload.push_back(Benchmarks::secondsOf([&] { upload.run(); }));
        aReadBack.push_back(Benchmarks::secondsOf([&] { readBack.run(); }));
        state.ResumeTiming();
    }
    double const all = Benchmarks::medianOf(aRoad);
    double const up = bFromTexture ? 0.0 : Benchmarks::medianOf(aUpload) / all;
    double const down = bToTexture ? 0.0 : Benchmarks::medianOf(aReadBack) / all;
    state.counters["upload"] = up;
    state.counters["passes"] = 1.0 - up - down;
    state.counters["read_back"] = down;
    state.SetItemsProcessed(state.iterations() * WIDTH * HEIGHT);
    state.SetLabel(reinterpret_cast<char const*>(glGetString(GL_RENDERER)));
}

BENCHMARK_CAPTURE(measure, memory_to_memory, MEMORY_TO_MEMORY)
    ->Name("gl_frame/memory_to_memory")
    ->Iterations(5)
    ->UseRealTime();
BENCHMARK_CAPTURE(measure, memory_to_texture, MEMORY_TO_TEXTURE)
    ->Name("gl_frame/memory_to_texture")
    ->Iterations(5)
    ->UseRealTime();
BENCHMARK_CAPTURE(measure, texture_to_memory, TEXTURE_TO_MEMORY)
    ->Name("gl_frame/texture_to_memory")
    ->Iterations(5)
    ->UseRealTime();
BENCHMARK_CAPTURE(measure, texture_to_texture, TEXTURE_TO_TEXTURE)
    ->Name("gl_frame/texture_to_texture")
    ->Iterations(5)
    ->UseRealTime();

} // namespace
