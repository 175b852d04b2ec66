// The fast bilateral filter, float RGBA 1920 x 1080, sigma 10 / 0.15, luminance and colorize (Lab), with each
// instruction set on one thread and two; and the simple bilateral filter with the same sigmas on a part of
// the picture, 480 x 270, on one thread.
//
// The counter to_plain is the time of the plain version of the same run divided by the time of the filter,
// the two run by turns so that both see the same machine: both are medians of wall-clock times. The plain
// versions are ordinary scalar programs on one thread, which walk rows by pointers and work out what they can
// beforehand. to_memcpy is the time of the fast filter in times of memcpy for the bytes of the source read
// and of the destination written, on one thread. ".../plain" is the plain version by itself. Before it is
// timed, each variant is compared with the plain one.
#include "orvo/image_flow/filters/FastBilateralCPUFilter.h"

#include "benchmarks/support/Timing.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_flow/filters/bilateral/BandRunner.h"
#include "orvo/image_flow/filters/bilateral/PlainBilateralFilter.h"
#include "orvo/image_flow/filters/bilateral/SimpleBilateral.h"
#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "orvo/image_runtime/images/PixelStructures.h"
#include "orvo/image_runtime/kernels/InstructionSet.h"

#include <benchmark/benchmark.h>

#include <algorithm>
#include <atomic>
#include <barrier>
#include <cmath>
#include <cstring>
#include <memory>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

namespace {

using namespace ORVO;
using Benchmarks::medianOf;
using Benchmarks::secondsOf;
using ImageFlow::bilateral::BandRunner;
using ImageRuntime::InstructionSet;

constexpr int kWidth = 1920;
constexpr int kHeight = 1080;
constexpr float kSpatialSigma = 10.0F;
constexpr float kRangeSigma = 0.15F;

using ImagePointer = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

ImagePointer makeImage() {
    return ImagePointer(ImageRuntime::getBlankSIMDOptimized32FFormat(
        ImageCPU::PIXEL_FORMAT_RGBA32F, ExtentInPixelSpace(kWidth, kHeight),
        PixelExtentInWorldSpace(1.0F, 1.0F), PositionInPixelSpace(0, 0)));
}

/// Gradients, edges and noise, opaque, as in a photograph.
ImagePointer makePicture() {
    ImagePointer upImage = makeImage();
    PixelRGBA32F* const pPixels = upImage->pixels_RGBA32F();
    unsigned iState = 1;
    auto const noise = [&iState] {
        iState = iState * 1664525U + 1013904223U;
        return static_cast<float>(iState >> 8U) / 16777216.0F - 0.5F;
    };
    for (int y = 0; y < kHeight; ++y) {
        for (int x = 0; x < kWidth; ++x) {
            float const edge = (x / 200 + y / 150) % 2 != 0 ? 0.1F : -0.1F;
            auto const channel = [&](float phase) {
                float const v =
                    0.5F + 0.35F * std::sin(float(x) * 0.01F + phase) * std::cos(float(y) * 0.013F);
                return std::clamp(v + edge + 0.2F * noise(), 0.0F, 1.0F);
            };
            pPixels[static_cast<std::size_t>(y) *
                        static_cast<std::size_t>(upImage->capacityExtent().width()) +
                    static_cast<std::size_t>(x)] = {channel(0.0F), channel(1.0F), channel(2.0F), 1.0F};
        }
    }
    return upImage;
}

/// Runs bands on the calling thread and on further threads that wait between phases.
class TeamRunner : public BandRunner {
public:
    explicit TeamRunner(int nThreads) : oStart_(nThreads), oEnd_(nThreads) {
        for (int i = 1; i < nThreads; ++i) {
            aThreads_.emplace_back([this] {
                for (oStart_.arrive_and_wait(); pBody_ != nullptr; oStart_.arrive_and_wait()) {
                    work();
                    oEnd_.arrive_and_wait();
                }
            });
        }
    }

    ~TeamRunner() override {
        pBody_ = nullptr;
        oStart_.arrive_and_wait();
        for (std::thread& thread : aThreads_) {
            thread.join();
        }
    }

    void run(std::size_t nBands, std::size_t /*nUnits*/, Body const& body) override {
        pBody_ = &body;
        nBands_ = nBands;
        iNext_ = 0;
        oStart_.arrive_and_wait();
        work();
        oEnd_.arrive_and_wait();
    }

private:
    void work() {
        for (std::size_t band = iNext_++; band < nBands_; band = iNext_++) {
            (*pBody_)(band, band + 1);
        }
    }

    std::barrier<> oStart_;
    std::barrier<> oEnd_;
    Body const* pBody_ = nullptr;
    std::size_t nBands_ = 0;
    std::atomic<std::size_t> iNext_{0};
    std::vector<std::thread> aThreads_;
};

double largestDifference(ImageCPU const& result, ImageCPU const& expected) {
    auto const* const pResult = reinterpret_cast<float const*>(result.pixels());
    auto const* const pExpected = reinterpret_cast<float const*>(expected.pixels());
    float largest = 0.0F;
    for (std::size_t i = 0; i < 4 * result.numberOfPixels(); ++i) {
        largest = std::max(largest, std::abs(pResult[i] - pExpected[i]));
    }
    return static_cast<double>(largest);
}

/// Source, destinations and the two versions of the filter.
struct Setting {
    explicit Setting(bool bColorize) : bColorize_(bColorize) {}

    void plain() {
        ImageFlow::bilateral::PlainBilateralFilter filter(nullptr, nullptr);
        filter.applyFilter(oRead_, oWritePlain_, kRangeSigma, kSpatialSigma, kSpatialSigma, bColorize_);
    }

    void fast(BandRunner& runner) {
        oFilter_.applyFilter(&oRead_, &oWrite_, kRangeSigma, kSpatialSigma, kSpatialSigma, bColorize_,
                             runner);
    }

    void copy() {
        std::memcpy(upResult_->pixels(), upSource_->pixels(),
                    upSource_->numberOfPixels() * sizeof(PixelRGBA32F));
    }

    double difference() const { return largestDifference(*upResult_, *upExpected_); }

    bool bColorize_;
    ImagePointer upSource_ = makePicture();
    ImagePointer upResult_ = makeImage();
    ImagePointer upExpected_ = makeImage();
    ImageCPUReadAccessor oRead_{*upSource_};
    ImageCPUWriteAccessor oWrite_{*upResult_};
    ImageCPUWriteAccessor oWritePlain_{*upExpected_};
    FastBilateralCPUFilter oFilter_;
};

void benchmarkFast(benchmark::State& state, bool bColorize, InstructionSet eInstructionSet, int nThreads) {
    ImageRuntime::setActiveInstructionSet(eInstructionSet);
    Setting setting(bColorize);
    TeamRunner runner(nThreads);
    setting.plain();
    setting.fast(runner);
    double const difference = setting.difference();
    if (!(difference < (bColorize ? 1e-3 : 1e-5))) {
        state.SkipWithError("differs from the plain version");
        return;
    }
    std::vector<double> aFast;
    std::vector<double> aPlain;
    std::vector<double> aCopy;
    for ([[maybe_unused]] auto _ : state) {
        aCopy.push_back(secondsOf([&] { setting.copy(); }));
        aFast.push_back(secondsOf([&] { setting.fast(runner); }));
        if (aPlain.size() < 3) {
            aPlain.push_back(secondsOf([&] { setting.plain(); }));
        }
        state.SetIterationTime(aFast.back());
    }
    double const fast = medianOf(aFast);
    state.counters["median_ms"] = fast * 1e3;
    state.counters["plain_ms"] = medianOf(aPlain) * 1e3;
    state.counters["to_plain"] = medianOf(aPlain) / fast;
    state.counters["to_memcpy"] = fast / medianOf(aCopy);
    state.counters["pixels_per_second"] = double(kWidth) * double(kHeight) / fast;
    state.counters["difference"] = difference;
    ImageRuntime::setActiveInstructionSet(ImageRuntime::bestInstructionSet());
}

void benchmarkPlain(benchmark::State& state, bool bColorize) {
    Setting setting(bColorize);
    for ([[maybe_unused]] auto _ : state) {
        state.SetIterationTime(secondsOf([&] { setting.plain(); }));
    }
}

void benchmarkSimple(benchmark::State& state, bool bColorize, InstructionSet eInstructionSet) {
    constexpr int kPartWidth = kWidth / 4;
    constexpr int kPartHeight = kHeight / 4;
    PositionExtentInPixelSpace const part(PositionInPixelSpace(kWidth / 3, kHeight / 3),
                                          ExtentInPixelSpace(kPartWidth, kPartHeight));
    ImagePointer const upSource = makePicture();
    ImagePointer const upResult = makeImage();
    ImagePointer const upExpected = makeImage();
    upResult->initializeToTransparentBlack();
    upExpected->initializeToTransparentBlack();
    ImageFlow::bilateral::SimpleBilateral const filter(kSpatialSigma, kRangeSigma, bColorize);
    auto const run = [&](InstructionSet eSet, ImageCPU& output) {
        ImageRuntime::setActiveInstructionSet(eSet);
        filter.filterRows(*upSource, output, part, 0, kPartHeight);
    };
    run(InstructionSet::PLAIN, *upExpected);
    run(eInstructionSet, *upResult);
    double const difference = largestDifference(*upResult, *upExpected);
    if (!(difference < 1e-5)) {
        state.SkipWithError("differs from the plain version");
        return;
    }
    std::vector<double> aFast;
    std::vector<double> aPlain;
    for ([[maybe_unused]] auto _ : state) {
        aFast.push_back(secondsOf([&] { run(eInstructionSet, *upResult); }));
        if (aPlain.size() < 3) {
            aPlain.push_back(secondsOf([&] { run(InstructionSet::PLAIN, *upExpected); }));
        }
        state.SetIterationTime(aFast.back());
    }
    double const fast = medianOf(aFast);
    state.counters["median_ms"] = fast * 1e3;
    state.counters["plain_ms"] = medianOf(aPlain) * 1e3;
    state.counters["to_plain"] = medianOf(aPlain) / fast;
    state.counters["pixels_per_second"] = double(kPartWidth) * double(kPartHeight) / fast;
    state.counters["difference"] = difference;
    ImageRuntime::setActiveInstructionSet(ImageRuntime::bestInstructionSet());
}

bool registerAll() {
    for (bool bColorize : {false, true}) {
        std::string const name = bColorize ? "bilateral/colorize/" : "bilateral/luminance/";
        benchmark::RegisterBenchmark((name + "plain").c_str(), benchmarkPlain, bColorize)
            ->UseManualTime()
            ->Unit(benchmark::kMillisecond);
        for (InstructionSet eSet : {InstructionSet::SSE2, InstructionSet::AVX2, InstructionSet::AVX512}) {
            if (ImageRuntime::isSupported(eSet)) {
                std::ostringstream simple;
                simple << "simple_" << name << eSet;
                benchmark::RegisterBenchmark(simple.str().c_str(), benchmarkSimple, bColorize, eSet)
                    ->UseManualTime()
                    ->Unit(benchmark::kMillisecond);
            }
            for (int nThreads : {1, 2}) {
                if (ImageRuntime::isSupported(eSet)) {
                    std::ostringstream full;
                    full << name << eSet << "/threads:" << nThreads;
                    benchmark::RegisterBenchmark(full.str().c_str(), benchmarkFast, bColorize, eSet, nThreads)
                        ->UseManualTime()
                        ->Unit(benchmark::kMillisecond);
                }
            }
        }
    }
    return true;
}

[[maybe_unused]] bool const bRegistered = registerAll();

} // namespace
