// Conversions between 8-bit and 16-bit integers and 32-bit floats, RGBA 3840 x 2160, on one and two threads.
//
// Bytes per second count bytes read plus bytes written; "memcpy/<bytes>" moves as many. The counter to_memcpy
// is the time of the conversion in times of memcpy for the same bytes on as many threads, the two run by
// turns so that both see the same machine. ".../plain/..." are the same conversions by the plain kernels.
#include "orvo/image_runtime/ConvertSIMDOptimizedImageCPU.h"

#include "benchmarks/support/MemoryBandwidth.h"
#include "benchmarks/support/Team.h"
#include "benchmarks/support/Timing.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"
#include "orvo/image_runtime/kernels/InstructionSet.h"

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace {

using namespace ORVO;
using Benchmarks::medianOf;
using Benchmarks::secondsOf;
using Benchmarks::Team;

constexpr int WIDTH = 3840;
constexpr int HEIGHT = 2160;

PositionExtentInPixelSpace frame() { return PositionExtentInPixelSpace(ExtentInPixelSpace(WIDTH, HEIGHT)); }

using Owned = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

std::size_t bytesOf(ImageCPU::tePixelFormat eFormat) {
    return static_cast<std::size_t>(WIDTH) * HEIGHT * pixelSizeBytes(eFormat);
}

struct Setting {
    ImageCPU::tePixelFormat eFormat;
    ImageRuntime::InstructionSet eInstructionSet;
    int nThreads;

    /// Bytes read plus bytes written.
    std::size_t bytes() const { return bytesOf(eFormat) + bytesOf(ImageCPU::PIXEL_FORMAT_RGBA32F); }
};

/// Integers of all values, at random enough.
void fill(ImageCPU& image) {
    std::uint32_t state = 1;
    for (std::size_t i = 0; i < bytesOf(image.pixelFormat()); i += 2) {
        state = state * 1664525u + 1013904223u;
        std::uint16_t const word = static_cast<std::uint16_t>((state >> 16) % 32769u);
        std::memcpy(image.pixels() + i, &word, sizeof(word));
    }
}

ImageCPU touchedBytes(std::size_t n) {
    ImageCPU bytes(ImageCPU::PIXEL_FORMAT_LUMINANCE8,
                   PositionExtentInPixelSpace(ExtentInPixelSpace(static_cast<int>(n), 1)),
                   PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
    bytes.initializeToTransparentBlack();
    return bytes;
}

/// Converts row ranges on a team, in turns with memcpy for as many bytes.
void measure(benchmark::State& state, Setting const& setting,
             std::function<void(int, int)> const& convertRows) {
    Team team(setting.nThreads);
    // Storage of the same kind as that of the images.
    std::size_t const nCopied = setting.bytes() / 2;
    ImageCPU const from = touchedBytes(nCopied);
    ImageCPU to = touchedBytes(nCopied);
    auto const convert = [&] {
        team.run(HEIGHT, [&](std::size_t begin, std::size_t end) {
            convertRows(static_cast<int>(begin), static_cast<int>(end));
        });
    };
    auto const copy = [&] {
        team.run(nCopied, [&](std::size_t begin, std::size_t end) {
            std::memcpy(to.pixels() + begin, from.pixels() + begin, end - begin);
        });
    };

    ImageRuntime::setActiveInstructionSet(setting.eInstructionSet);
    convert();
    std::vector<double> aConversion, aCopy;
    for (auto _ : state) {
        aConversion.push_back(secondsOf(convert));
        state.PauseTiming();
        aCopy.push_back(secondsOf(copy));
        benchmark::DoNotOptimize(to.pixels());
        state.ResumeTiming();
    }
    ImageRuntime::setActiveInstructionSet(ImageRuntime::bestInstructionSet());
    state.counters["to_memcpy"] = medianOf(aConversion) / medianOf(aCopy);
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(setting.bytes()));
}

void toFloat(benchmark::State& state, Setting const& setting) {
    ImageCPU input(setting.eFormat, frame(), PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
    fill(input);
    Owned const pOutput(ImageRuntime::getBlankSIMDOptimized32FFormat(input));
    measure(state, setting, [&](int beginY, int endY) {
        ImageRuntime::convertImageToSIMDOptimized32FFormat(input, pOutput.get(), 0, WIDTH, beginY, endY);
    });
}

void fromFloat(benchmark::State& state, Setting const& setting) {
    ImageCPU output(setting.eFormat, frame(), PixelExtentInWorldSpace(1, 1), ExtentInPixelSpace());
    fill(output);
    Owned const pInput(ImageRuntime::convertImageToSIMDOptimized32FFormat(output));
    measure(state, setting, [&](int beginY, int endY) {
        ImageRuntime::convertImageFromSIMDOptimized32FFormat(*pInput, &output, 0, WIDTH, beginY, endY);
    });
}

void add(std::string const& sName, void (*work)(benchmark::State&, Setting const&), Setting const& setting) {
    std::string const sFullName = sName + "/threads_" + std::to_string(setting.nThreads);
    benchmark::RegisterBenchmark(sFullName.c_str(), work, setting)
        ->UseRealTime()
        ->Unit(benchmark::kMillisecond);
}

bool addAll() {
    struct Row {
        char const* sName;
        ImageCPU::tePixelFormat eFormat;
    };
    for (Row const& row :
         {Row{"rgba8", ImageCPU::PIXEL_FORMAT_RGBA8}, Row{"rgba16", ImageCPU::PIXEL_FORMAT_RGBA16}}) {
        Benchmarks::registerMemcpy(Setting{row.eFormat, ImageRuntime::InstructionSet::PLAIN, 1}.bytes() / 2);
        for (int nThreads : {1, 2}) {
            for (bool bPlain : {true, false}) {
                Setting const setting{row.eFormat,
                                      bPlain ? ImageRuntime::InstructionSet::PLAIN
                                             : ImageRuntime::bestInstructionSet(),
                                      nThreads};
                std::string const sVariant = std::string("/") + row.sName + (bPlain ? "/plain" : "/simd");
                add("to_float" + sVariant, toFloat, setting);
                add("from_float" + sVariant, fromFloat, setting);
            }
        }
    }
    return true;
}

bool const bAdded = addAll();

} // namespace
