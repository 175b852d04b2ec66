// The colour transform on the CPU, 1920 x 1080, in 8-bit and 16-bit integers, with the best instruction set
// on one thread and on two, and with SSE2 alone on one: from sRGB to the wide-gamut space (curves and a
// matrix), and between sRGB and profiles of tables, Lab in 33 nodes each way, as source, as destination and
// as both.
//
// What is timed is a frame of the node, with its slices and its copy of alpha. The counter to_lcms2 is its
// time in times of the colour library called directly on the same picture, in its own optimised mode and on
// as many threads, which leaves alpha alone; lcms2_ms is that time. The two run by turns, so that both see
// the same machine; both are medians.
#include "orvo/image_flow/filters/VantleFilterCPU.h"

#include "benchmarks/support/Team.h"
#include "benchmarks/support/Timing.h"
#include "orvo/colour_engine/ColourEngine.h"
#include "orvo/core/Core.h"
#include "orvo/data_flow/DataFlow.h"
#include "orvo/image_flow/ImageFlow.h"
#include "orvo/image_flow/colour/CVantle.h"
#include "orvo/image_runtime/ImageRuntime.h"
#include "orvo/ogl/OGL.h"
#include "tests/colour_engine/support/TableProfiles.h"

#include <benchmark/benchmark.h>
#include <lcms2.h>

#include <array>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <memory>
#include <random>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

using namespace ORVO;
using Benchmarks::medianOf;
using Benchmarks::secondsOf;
using Core::InstructionSet;

constexpr int kWidth = 1920;
constexpr int kHeight = 1080;

struct Layers {
    Core::AutoInitializer oCore_;
    OGL::AutoInitializer oOGL_;
    ImageRuntime::AutoInitializer oImageRuntime_{static_cast<OGL::Context const*>(nullptr),
                                                 VideoMemory::Configuration()};
    DataFlow::AutoInitializer oDataFlow_;
    ImageFlow::AutoInitializer oImageFlow_{false};
};

struct Format {
    char const* sName_;
    ImageCPU::tePixelFormat eFormat_;
    cmsUInt32Number nLcmsFormat_;
    int nChannels_;
    bool bWords_;

    std::size_t pixelBytes() const { return static_cast<std::size_t>(nChannels_) * (bWords_ ? 2 : 1); }
};

constexpr Format kFormats[] = {
    {"rgb8", ImageCPU::PIXEL_FORMAT_RGB8, TYPE_RGB_8, 3, false},
    {"rgba8", ImageCPU::PIXEL_FORMAT_RGBA8, TYPE_RGBA_8, 4, false},
    {"rgb16", ImageCPU::PIXEL_FORMAT_RGB16, TYPE_RGB_16, 3, true},
    {"rgba16", ImageCPU::PIXEL_FORMAT_RGBA16, TYPE_RGBA_16, 4, true},
};

/// Something between a photograph and noise: broad waves of light with grain, for a white of a given number.
std::vector<unsigned char> picture(Format const& format, int white) {
    std::mt19937 random(1);
    std::vector<unsigned char> aBytes(std::size_t{kWidth} * kHeight * format.pixelBytes());
    unsigned char* pSample = aBytes.data();
    for (int i = 0; i < kWidth * kHeight; ++i) {
        for (int c = 0; c < format.nChannels_; ++c) {
            double const x = i % kWidth;
            double const y = static_cast<double>(i) / kWidth;
            double const wave = 0.48 + 0.42 * std::sin(x * 0.011 + c) * std::cos(y * 0.017 + 2 * c);
            double const grain = (static_cast<double>(random() % 1024) / 1024 - 0.5) * 0.1;
            auto const value = static_cast<std::uint16_t>((wave + grain) * white);
            std::memcpy(pSample, &value, format.bWords_ ? 2 : 1);
            pSample += format.bWords_ ? 2 : 1;
        }
    }
    return aBytes;
}

/// From where to where.
struct Spaces {
    char const* sName_;
    bool bTablesIn_;
    bool bTablesOut_;
};

constexpr Spaces kSpaces[] = {{"transform", false, false},
                              {"from_tables", true, false},
                              {"to_tables", false, true},
                              {"tables", true, true}};

constexpr std::uint32_t kTablesIn = ColourEngine::profileCode("TabI");
constexpr std::uint32_t kTablesOut = ColourEngine::profileCode("TabO");

Test::Bytes const& tables(bool bIn) {
    static Test::Bytes const aIn = Test::tableProfile({true, 33, Test::labOfSRGB});
    static Test::Bytes const aOut = Test::tableProfile({false, 33, Test::sRGBOfLab});
    return bIn ? aIn : aOut;
}

void check(VantleResult result) {
    if (result != 0) {
        throw std::runtime_error("the colour engine refuses");
    }
}

/// A frame of the node between two pictures in memory.
class NodeFrame {
public:
    NodeFrame(Spaces const& spaces, Format const& format, std::vector<unsigned char> const& aInput,
              std::vector<unsigned char> const& aOutput, std::size_t nThreads)
        : nThreadsBefore_(DataFlow::Controller::getNumberOfThreads()),
          oInput_(format.eFormat_, aInput.data(), region(), PixelExtentInWorldSpace(1, 1),
                  ExtentInPixelSpace()),
          oOutput_(format.eFormat_, aOutput.data(), region(), PixelExtentInWorldSpace(1, 1),
                   ExtentInPixelSpace()) {
        ColourEngine::registerProfile(kTablesIn, tables(true).data(), tables(true).size());
        ColourEngine::registerProfile(kTablesOut, tables(false).data(), tables(false).size());
        std::uint32_t const plain =
            spaces.bTablesIn_ ? ColourEngine::PROFILE_SRGB : ColourEngine::PROFILE_WIDE_GAMUT;
        check(CVantle::makeTransform(&pTransform_, spaces.bTablesIn_ ? kTablesIn : ColourEngine::PROFILE_SRGB,
                                     spaces.bTablesOut_ ? kTablesOut : plain));
        DataFlow::Controller::setNumberOfThreads(nThreads);
        oController_.setSingleThreadMode(nThreads == 1);
        DataFlow::Connect(*oSource_.imageOutput(), *oFilter_.imageInput(0));
        oController_.addNode(&oSource_);
        oController_.addNode(&oFilter_);
        oController_.setImageSink(oFilter_);
        oFilter_.transform()->setValue(pTransform_);
        oFilter_.setBoundOutputImage(&oOutput_);
    }
    ~NodeFrame() {
        oFilter_.disconnect();
        CVantle::UnReferenceTransform(pTransform_);
        DataFlow::Controller::setNumberOfThreads(nThreadsBefore_);
    }
    NodeFrame(NodeFrame const&) = delete;
    NodeFrame& operator=(NodeFrame const&) = delete;

    void run() {
        oController_.flushGraph();
        oSource_.setImageCPUWithNoOwnership(&oInput_);
        oSource_.emit();
        oController_.computeRegions(
            PositionExtentInWorldSpace(PositionInWorldSpace(0, 0), ExtentInWorldSpace(kWidth, kHeight)));
        oController_.process();
    }

private:
    static PositionExtentInPixelSpace region() {
        return PositionExtentInPixelSpace(ExtentInPixelSpace(kWidth, kHeight));
    }

    std::size_t nThreadsBefore_;
    VantleTransform* pTransform_ = nullptr;
    ImageCPU oInput_;
    ImageCPU oOutput_;
    ImageFlowController oController_;
    ImageCPUInput oSource_;
    VantleFilterCPU oFilter_;
};

/// The colour library on the same spaces.
class DirectCall {
public:
    DirectCall(Spaces const& spaces, Format const& format) {
        cmsCIExyY const white = {0.3127, 0.3290, 1.0};
        cmsCIExyYTRIPLE const primaries = {{0.64, 0.33, 1.0}, {0.21, 0.71, 1.0}, {0.15, 0.06, 1.0}};
        cmsToneCurve* const pGamma = cmsBuildGamma(nullptr, 563.0 / 256.0);
        std::array<cmsToneCurve*, 3> const aCurves = {pGamma, pGamma, pGamma};
        cmsHPROFILE pSource = spaces.bTablesIn_ ? open(tables(true)) : cmsCreate_sRGBProfile();
        cmsHPROFILE pDestination = spaces.bTablesOut_ ? open(tables(false))
                                   : spaces.bTablesIn_
                                       ? cmsCreate_sRGBProfile()
                                       : cmsCreateRGBProfile(&white, &primaries, aCurves.data());
        pTransform_ = cmsCreateTransform(pSource, format.nLcmsFormat_, pDestination, format.nLcmsFormat_,
                                         INTENT_PERCEPTUAL, 0);
        cmsCloseProfile(pDestination);
        cmsCloseProfile(pSource);
        cmsFreeToneCurve(pGamma);
    }
    ~DirectCall() { cmsDeleteTransform(pTransform_); }
    DirectCall(DirectCall const&) = delete;
    DirectCall& operator=(DirectCall const&) = delete;

    void run(void const* pInput, void* pOutput, std::size_t nPixels) const {
        cmsDoTransform(pTransform_, pInput, pOutput, static_cast<cmsUInt32Number>(nPixels));
    }

private:
    static cmsHPROFILE open(Test::Bytes const& aBytes) {
        return cmsOpenProfileFromMem(aBytes.data(), static_cast<cmsUInt32Number>(aBytes.size()));
    }

    cmsHTRANSFORM pTransform_;
};

void transform(benchmark::State& state, Spaces const& spaces, Format const& format,
               InstructionSet eInstructionSet, int nThreads) {
    Layers const layers;
    auto const aInput = picture(format, format.bWords_ ? 32768 : 255);
    // Its own white is 65535.
    auto const aDirectInput = picture(format, format.bWords_ ? 65535 : 255);
    std::vector<unsigned char> aOutput(aInput.size());
    NodeFrame frame(spaces, format, aInput, aOutput, static_cast<std::size_t>(nThreads));
    DirectCall const direct(spaces, format);
    Benchmarks::Team team(nThreads);
    auto const runDirect = [&] {
        team.run(kHeight, [&](std::size_t begin, std::size_t end) {
            std::size_t const nRowBytes = kWidth * format.pixelBytes();
            direct.run(aDirectInput.data() + begin * nRowBytes, aOutput.data() + begin * nRowBytes,
                       (end - begin) * kWidth);
        });
    };
    Core::setActiveInstructionSet(eInstructionSet);
    frame.run();
    runDirect();
    std::vector<double> aFrame;
    std::vector<double> aDirect;
    for (auto _ : state) {
        aFrame.push_back(secondsOf([&] { frame.run(); }));
        state.PauseTiming();
        aDirect.push_back(secondsOf(runDirect));
        benchmark::DoNotOptimize(aOutput.data());
        state.ResumeTiming();
    }
    Core::setActiveInstructionSet(Core::bestInstructionSet());
    state.counters["to_lcms2"] = medianOf(aFrame) / medianOf(aDirect);
    state.counters["lcms2_ms"] = 1e3 * medianOf(aDirect);
    state.SetItemsProcessed(state.iterations() * kWidth * kHeight);
}

void add(Spaces const& spaces, Format const& format, InstructionSet eInstructionSet, char const* sSet,
         int nThreads) {
    std::string const sName = std::string(spaces.sName_) + "/" + format.sName_ + "/" + sSet + "/threads_" +
                              std::to_string(nThreads);
    benchmark::RegisterBenchmark(sName.c_str(), transform, spaces, format, eInstructionSet, nThreads)
        ->UseRealTime()
        ->Unit(benchmark::kMillisecond);
}

bool addAll() {
    for (Spaces const& spaces : kSpaces) {
        for (Format const& format : kFormats) {
            add(spaces, format, InstructionSet::SSE2, "sse2", 1);
            add(spaces, format, Core::bestInstructionSet(), "best", 1);
            add(spaces, format, Core::bestInstructionSet(), "best", 2);
        }
    }
    return true;
}

bool const bAdded = addAll();

} // namespace
