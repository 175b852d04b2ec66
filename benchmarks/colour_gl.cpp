// The pass of a colour transform on OpenGL against a shader that hands its input on: 1920 x 1080 pixels, in a
// context without a display. The label names the driver.
//
// A frame is a controller's, in which the source has changed and all runs; it ends when the driver has done
// with it. The two run by turns, so that both see the same machine. The counter of_pass_through is the time
// of the transform's frame in times of the other's. of_matrix is the same against a shader that multiplies
// colours by a matrix in floats: some drivers have a road of their own for shaders that only copy bytes.
// processor_of_pass_through is the same in processor time, which a software driver's share of a busy machine
// does not change. Curves are in closed form, and sampled ones where the name says with_tables.
// shaders_described, programs_linked and textures_made are sums over all measured frames of the transform,
// whose codes stay: they are 0.
#include "orvo/colour_engine/ColourEngine.h"
#include "orvo/core/Core.h"
#include "orvo/data_flow/DataFlow.h"
#include "orvo/image_flow/ImageFlow.h"
#include "orvo/image_flow/filters/VantleFilterGPU.h"
#include "orvo/image_flow/sources/ImageGPUInput.h"
#include "orvo/image_flow/sources/ImageGPUOutput.h"
#include "orvo/image_runtime/ImageRuntime.h"
#include "orvo/ogl/OGL.h"

#include "benchmarks/support/GLLayers.h"
#include "benchmarks/support/Timing.h"

#include <benchmark/benchmark.h>
#include <epoxy/egl.h>
#include <epoxy/gl.h>
#include <lcms2.h>

#include <array>
#include <cmath>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

using namespace ORVO;
using Layers = Benchmarks::CountingGLNodeLayers;

constexpr int nWidth = 1920;
constexpr int nHeight = 1080;
constexpr std::size_t nValues = std::size_t(4) * nWidth * nHeight;

std::string shaderOf(char const* pExpression) {
    return std::string("uniform vec2 _outOffset;\n"
                       "uniform vec2 _outPixelExtent;\n"
                       "uniform sampler2D src_sampler;\n"
                       "uniform vec2 src_offset;\n"
                       "uniform vec2 src_delta;\n"
                       "void main() {\n"
                       "    vec4 src = texture2D(src_sampler, "
                       "(gl_TexCoord[0].xy*_outPixelExtent+_outOffset-src_offset)*src_delta);\n"
                       "    gl_FragData[0] = ") +
           pExpression + ";\n}\n";
}

/// A shader over the input "src".
class ExpressionFilter : public BasicGLShaderFilter {
public:
    explicit ExpressionFilter(char const* pExpression)
        : BasicGLShaderFilter("expression", shaderOf(pExpression).c_str(), 4) {
        addInput("src");
    }
};

PositionExtentInPixelSpace frameRectangle() {
    return PositionExtentInPixelSpace(ExtentInPixelSpace(nWidth, nHeight));
}

/// A source, one filter and a sink.
class Pass {
public:
    Pass(OGL::Context const& context, std::unique_ptr<BasicGLShaderFilter> upFilter, bool bHalf)
        : oImage_(frameRectangle(), bHalf ? ImageGPU::PIXEL_FORMAT_RGBA16F : ImageGPU::PIXEL_FORMAT_RGBA8,
                  PixelExtentInWorldSpace(), true),
          upFilter_(std::move(upFilter)) {
        std::vector<unsigned char> aPixels(nValues);
        for (std::size_t i = 0; i < aPixels.size(); ++i)
            aPixels[i] = static_cast<unsigned char>(i * 7 + i / 4096);
        oImage_.copyImageData(aPixels.data(), frameRectangle(), PixelExtentInWorldSpace(), GL_RGBA,
                              GL_UNSIGNED_BYTE, 0);
        oController_.setContextGPU(context);
        oSource_.setImageGPUWithNoOwnership(&oImage_);
        upFilter_->outputPrecisionHintParameter().setValue(bHalf ? ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT
                                                                 : ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
        DataFlow::Connect(*upFilter_->imageInput(0), *oSource_.imageOutput());
        DataFlow::Connect(*oSink_.imageInput(0), *upFilter_->imageOutput());
        for (ImageFilter* pNode : std::initializer_list<ImageFilter*>{&oSource_, upFilter_.get(), &oSink_})
            oController_.addNode(pNode);
        oController_.setImageSink(oSink_);
        oController_.computeRegions(pixelToWorldSpace(frameRectangle(), PixelExtentInWorldSpace()));
    }
    ~Pass() {
        oController_.flushGraph();
        upFilter_->disconnect();
    }
    Pass(Pass const&) = delete;
    Pass& operator=(Pass const&) = delete;

    void frame() {
        oSource_.emit();
        oController_.setDirtyState();
        oController_.process();
        glFinish();
    }

    std::vector<float> pixels() const {
        std::vector<float> aPixels(nValues);
        OGL::Texture2D const& texture = *oSink_.getImageGPU()->texture();
        std::vector<float> aAll(4 * texture.width(0) * texture.height(0));
        OGL::TextureUnit::Unit(0).bind(&texture);
        glGetTexImage(GL_TEXTURE_2D, 0, GL_RGBA, GL_FLOAT, aAll.data());
        OGL::TextureUnit::Unit(0).bind2DDefault();
        for (std::size_t row = 0; row < nHeight; ++row)
            std::copy_n(&aAll[4 * row * texture.width(0)], 4 * nWidth, &aPixels[4 * row * nWidth]);
        return aPixels;
    }

private:
    ImageFlowController oController_;
    ImageGPU oImage_;
    ImageGPUInput oSource_;
    std::unique_ptr<BasicGLShaderFilter> upFilter_;
    ImageGPUOutput oSink_;
};

/// What one filter's frames take.
struct Turns {
    std::vector<double> aSeconds_;
    std::vector<double> aProcessorSeconds_;

    void take(Pass& pass) {
        aProcessorSeconds_.push_back(Benchmarks::processorSecondsOf(
            [&] { aSeconds_.push_back(Benchmarks::secondsOf([&] { pass.frame(); })); }));
    }
    double median() const { return Benchmarks::medianOf(aSeconds_); }
    double processorMedian() const { return Benchmarks::medianOf(aProcessorSeconds_); }
};

/// Makes a space of sampled curves known under a code: the primaries of sRGB, a gamma in 1024 entries.
std::uint32_t registerSampledSpace(std::uint32_t nCode, double gamma) {
    std::array<cmsFloat32Number, 1024> aEntries{};
    for (std::size_t i = 0; i < aEntries.size(); ++i)
        aEntries[i] = static_cast<float>(std::pow(static_cast<double>(i) / 1023.0, gamma));
    cmsToneCurve* const pCurve = cmsBuildTabulatedToneCurveFloat(
        nullptr, static_cast<cmsUInt32Number>(aEntries.size()), aEntries.data());
    cmsToneCurve* const aCurves[] = {pCurve, pCurve, pCurve};
    cmsCIExyY const white = {0.3127, 0.3290, 1.0};
    cmsCIExyYTRIPLE const primaries = {{0.64, 0.33, 1.0}, {0.30, 0.60, 1.0}, {0.15, 0.06, 1.0}};
    cmsHPROFILE pProfile = cmsCreateRGBProfile(&white, &primaries, aCurves);
    cmsFreeToneCurve(pCurve);
    cmsUInt32Number nBytes = 0;
    cmsSaveProfileToMem(pProfile, nullptr, &nBytes);
    std::vector<unsigned char> aBytes(nBytes);
    cmsSaveProfileToMem(pProfile, aBytes.data(), &nBytes);
    cmsCloseProfile(pProfile);
    ColourEngine::registerProfile(nCode, aBytes.data(), nBytes);
    return nCode;
}

/// sRGB to the wide gamut, or from sampled curves to others.
VantleTransform* makeTransform(bool bTables) {
    using namespace ColourEngine;
    auto const nSource = bTables ? registerSampledSpace(profileCode("Smp1"), 2.2) : PROFILE_SRGB;
    auto const nDestination = bTables ? registerSampledSpace(profileCode("Smp2"), 1.8) : PROFILE_WIDE_GAMUT;
    VantleTransform* pTransform = nullptr;
    if (CVantle::makeTransform(&pTransform, nSource, nDestination) != 0)
        throw std::runtime_error("no transform");
    return pTransform;
}

void requireChange(std::vector<float> const& aBefore, std::vector<float> const& aAfter) {
    double dMean = 0;
    for (std::size_t i = 0; i < nValues; ++i)
        dMean += std::abs(double(aBefore[i]) - double(aAfter[i])) / nValues;
    if (dMean < 1e-3 || dMean > 0.2)
        throw std::runtime_error("the transform does not do what it should");
}

void transform(benchmark::State& state, bool bHalf, bool bTables) {
    Layers const layers;
    VantleTransform* const pTransform = makeTransform(bTables);
    {
        auto upTransform = std::make_unique<VantleFilterGPU>();
        upTransform->transform()->setValue(pTransform);
        Pass transformed(layers.context(), std::move(upTransform), bHalf);
        Pass passed(layers.context(), std::make_unique<ExpressionFilter>("src"), bHalf);
        Pass multiplied(layers.context(),
                        std::make_unique<ExpressionFilter>(
                            "vec4(clamp(mat3(0.8,0.1,0.1,0.1,0.8,0.1,0.1,0.1,0.8)*src.rgb,0.0,1.0),src.a)"),
                        bHalf);
        for (int i = 0; i < 3; ++i) {
            transformed.frame();
            passed.frame();
            multiplied.frame();
        }
        requireChange(passed.pixels(), transformed.pixels());
        Turns ofTransformed;
        Turns ofPassed;
        Turns ofMultiplied;
        auto const nDescribed = ColourEngine::engineStatistics().nShadersDescribed;
        long nLinks = 0;
        long nTextures = 0;
        for (auto _ : state) {
            ofPassed.take(passed);
            ofMultiplied.take(multiplied);
            nLinks -= Layers::Links::nCalls;
            nTextures -= Layers::Textures::nCalls;
            ofTransformed.take(transformed);
            nLinks += Layers::Links::nCalls;
            nTextures += Layers::Textures::nCalls;
            state.SetIterationTime(ofTransformed.aSeconds_.back());
        }
        state.counters["of_pass_through"] = ofTransformed.median() / ofPassed.median();
        state.counters["of_matrix"] = ofTransformed.median() / ofMultiplied.median();
        state.counters["processor_of_pass_through"] =
            ofTransformed.processorMedian() / ofPassed.processorMedian();
        state.counters["shaders_described"] =
            static_cast<double>(ColourEngine::engineStatistics().nShadersDescribed - nDescribed);
        state.counters["programs_linked"] = static_cast<double>(nLinks);
        state.counters["textures_made"] = static_cast<double>(nTextures);
        state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations()) * nWidth * nHeight);
        state.SetLabel(reinterpret_cast<char const*>(glGetString(GL_RENDERER)));
    }
    CVantle::UnReferenceTransform(pTransform);
}

BENCHMARK_CAPTURE(transform, bytes, false, false)
    ->Name("colour_gl/8_bit")
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(transform, halves, true, false)
    ->Name("colour_gl/16_bit_float")
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(transform, tables, true, true)
    ->Name("colour_gl/16_bit_float_with_tables")
    ->UseManualTime()
    ->Unit(benchmark::kMillisecond);

} // namespace
