// What the frame of shader filters costs beside the passes themselves: a chain of 50 filters on 64 x 64
// pixels of 8 bits, in a context without a display. The label names the driver.
//
// "gl_chain/loop" is a loop of OpenGL calls that does the same 50 passes with all names and locations looked
// up beforehand; "gl_chain/frame" is a controller's frame in which one filter's parameter has changed and all
// filters run. Both end when the driver has done with them. The counter of_loop is the frame's time in times
// of the loop's, the two run by turns so that both see the same machine. programs_linked, textures_made and
// large_allocations (above 4 KiB, of the whole process) are sums over all measured frames.
#include "orvo/core/Core.h"
#include "orvo/data_flow/DataFlow.h"
#include "orvo/image_flow/ImageFlow.h"
#include "orvo/image_flow/filters/BasicGLShaderFilter.h"
#include "orvo/image_flow/sources/ImageGPUInput.h"
#include "orvo/image_flow/sources/ImageGPUOutput.h"
#include "orvo/image_runtime/ImageRuntime.h"
#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/ogl/OGL.h"

#include "benchmarks/support/GLLayers.h"

#include <benchmark/benchmark.h>
#include <epoxy/egl.h>
#include <epoxy/gl.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <memory>
#include <new>
#include <stdexcept>
#include <vector>

namespace {

constexpr std::size_t nLargeBytes = 4096;
std::atomic<long> nLargeAllocations{0};

void* allocate(std::size_t nBytes) {
    if (nBytes > nLargeBytes)
        nLargeAllocations.fetch_add(1, std::memory_order_relaxed);
    void* const pBlock = std::malloc(nBytes != 0 ? nBytes : 1);
    if (pBlock == nullptr)
        throw std::bad_alloc();
    return pBlock;
}

} // namespace

void* operator new(std::size_t nBytes) { return allocate(nBytes); }
void operator delete(void* pBlock) noexcept { std::free(pBlock); }
void operator delete(void* pBlock, std::size_t) noexcept { std::free(pBlock); }

namespace {

using namespace ORVO;
using Layers = Benchmarks::CountingGLNodeLayers;

constexpr int nSize = 64;
constexpr std::size_t nFilters = 50;

constexpr char const* pShader = R"(uniform vec2 _outOffset;
uniform vec2 _outPixelExtent;
uniform sampler2D src_sampler;
uniform vec2 src_offset;
uniform vec2 src_delta;
uniform float gain;
void main() {
    gl_FragColor = gain * texture2D(src_sampler,
        (gl_TexCoord[0].xy*_outPixelExtent+_outOffset-src_offset)*src_delta);
}
)";

/// Multiplies its input by its parameter "gain".
class GainFilter : public BasicGLShaderFilter {
public:
    GainFilter()
        : BasicGLShaderFilter("gain", pShader, 4), spGain_(DataFlow::Parameter<float>::create(1.0f, "gain")) {
        addInput("src");
        addParameter(spGain_);
    }

    DataFlow::Parameter<float>& gain() { return *spGain_; }

protected:
    void preProcess() override {
        BasicGLShaderFilter::preProcess();
        ShaderProgramProxyOGLAutoLock const lock(oProgram_);
        OGL::Program& program = *lock.getProgram();
        if (program.linkNumber() != nLink_) {
            iGain_ = program.getUniformLocation("gain");
            nLink_ = program.linkNumber();
        }
        program.setUniform_Unsafe(iGain_, spGain_->value());
    }

private:
    std::shared_ptr<DataFlow::Parameter<float>> spGain_;
    int iGain_ = -1;
    std::uint64_t nLink_ = 0;
};

std::vector<unsigned char> firstPicture() {
    std::vector<unsigned char> aPixels(4 * nSize * nSize);
    for (std::size_t i = 0; i < aPixels.size(); ++i)
        aPixels[i] = static_cast<unsigned char>(i * 7);
    return aPixels;
}

PositionExtentInPixelSpace frameRectangle() {
    return PositionExtentInPixelSpace(ExtentInPixelSpace(nSize, nSize));
}

/// A source, the filters and a sink.
class Chain {
public:
    explicit Chain(OGL::Context const& context)
        : oImage_(frameRectangle(), ImageGPU::PIXEL_FORMAT_RGBA8, PixelExtentInWorldSpace(), true) {
        auto const aPixels = firstPicture();
        oImage_.copyImageData(aPixels.data(), frameRectangle(), PixelExtentInWorldSpace(), GL_RGBA,
                              GL_UNSIGNED_BYTE, 0);
        oController_.setContextGPU(context);
        oSource_.setImageGPUWithNoOwnership(&oImage_);
        oController_.addNode(&oSource_);
        ImageFilter* pLast = &oSource_;
        for (std::size_t i = 0; i < nFilters; ++i) {
            aFilters_.push_back(std::make_unique<GainFilter>());
            DataFlow::Connect(*aFilters_.back()->imageInput(0), *pLast->imageOutput());
            oController_.addNode(aFilters_.back().get());
            pLast = aFilters_.back().get();
        }
        DataFlow::Connect(*oSink_.imageInput(0), *pLast->imageOutput());
        oController_.addNode(&oSink_);
        oController_.setImageSink(oSink_);
        oController_.computeRegions(pixelToWorldSpace(frameRectangle(), PixelExtentInWorldSpace()));
    }
    ~Chain() {
        oController_.flushGraph();
        for (auto const& upFilter : aFilters_)
            upFilter->disconnect();
    }

    void frame(float gain) {
        aFilters_[nFilters / 2]->gain().setValue(gain);
        oSource_.emit();
        oController_.setDirtyState();
        oController_.process();
        glFinish();
    }

    std::vector<unsigned char> pixels() const {
        std::vector<unsigned char> aPixels(4 * nSize * nSize);
        OGL::TextureUnit::Unit(0).bind(oSink_.getImageGPU()->texture());
        glGetTexImage(GL_TEXTURE_2D, 0, GL_RGBA, GL_UNSIGNED_BYTE, aPixels.data());
        OGL::TextureUnit::Unit(0).bind2DDefault();
        return aPixels;
    }

private:
    ImageFlowController oController_;
    ImageGPU oImage_;
    ImageGPUInput oSource_;
    std::vector<std::unique_ptr<GainFilter>> aFilters_;
    ImageGPUOutput oSink_;
};

/// The same passes by hand.
class Loop {
public:
    Loop() {
        auto const aPixels = firstPicture();
        glGenTextures(3, aTextures_);
        for (GLuint const texture : aTextures_) {
            glBindTexture(GL_TEXTURE_2D, texture);
            glTexImage2D(GL_TEXTURE_2D, 0, GL_RGBA8, nSize, nSize, 0, GL_RGBA, GL_UNSIGNED_BYTE,
                         aPixels.data());
            for (GLenum const filter : {GL_TEXTURE_MIN_FILTER, GL_TEXTURE_MAG_FILTER})
                glTexParameteri(GL_TEXTURE_2D, filter, GL_LINEAR);
            for (GLenum const wrap : {GL_TEXTURE_WRAP_S, GL_TEXTURE_WRAP_T})
                glTexParameteri(GL_TEXTURE_2D, wrap, GL_CLAMP_TO_BORDER);
        }
        glBindTexture(GL_TEXTURE_2D, 0);
        glGenFramebuffers(1, &nFramebuffer_);
        for (std::size_t i = 0; i < nFilters; ++i)
            aPrograms_.push_back(makeProgram());
    }
    ~Loop() {
        for (Pass const& pass : aPrograms_)
            glDeleteProgram(pass.nProgram_);
        glDeleteFramebuffers(1, &nFramebuffer_);
        glDeleteTextures(3, aTextures_);
    }

    void run(float gain) {
        glBindFramebuffer(GL_FRAMEBUFFER, nFramebuffer_);
        glViewport(0, 0, nSize, nSize);
        glMatrixMode(GL_PROJECTION);
        glLoadIdentity();
        glOrtho(0, nSize, 0, nSize, 0, 1);
        glActiveTexture(GL_TEXTURE1);
        for (std::size_t i = 0; i < nFilters; ++i) {
            glFramebufferTexture2D(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, aTextures_[1 + i % 2],
                                   0);
            glBindTexture(GL_TEXTURE_2D, i == 0 ? aTextures_[0] : aTextures_[2 - i % 2]);
            glUseProgram(aPrograms_[i].nProgram_);
            if (i == nFilters / 2)
                glUniform1f(aPrograms_[i].iGain_, gain);
            glBegin(GL_QUADS);
            for (auto const& [x, y] : {std::pair{0, 0}, {0, nSize}, {nSize, nSize}, {nSize, 0}}) {
                glMultiTexCoord2f(GL_TEXTURE0, static_cast<float>(x), static_cast<float>(y));
                glVertex2f(static_cast<float>(x), static_cast<float>(y));
            }
            glEnd();
        }
        glUseProgram(0);
        glBindTexture(GL_TEXTURE_2D, 0);
        glActiveTexture(GL_TEXTURE0);
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glFinish();
    }

    std::vector<unsigned char> pixels() const {
        std::vector<unsigned char> aPixels(4 * nSize * nSize);
        glBindTexture(GL_TEXTURE_2D, aTextures_[1 + (nFilters - 1) % 2]);
        glGetTexImage(GL_TEXTURE_2D, 0, GL_RGBA, GL_UNSIGNED_BYTE, aPixels.data());
        glBindTexture(GL_TEXTURE_2D, 0);
        return aPixels;
    }

private:
    struct Pass {
        GLuint nProgram_;
        GLint iGain_;
    };

    static Pass makeProgram() {
        GLuint const nShader = glCreateShader(GL_FRAGMENT_SHADER);
        glShaderSource(nShader, 1, &pShader, nullptr);
        glCompileShader(nShader);
        GLuint const nProgram = glCreateProgram();
        glAttachShader(nProgram, nShader);
        glLinkProgram(nProgram);
        glDeleteShader(nShader);
        glUseProgram(nProgram);
        glUniform1i(glGetUniformLocation(nProgram, "src_sampler"), 1);
        glUniform2f(glGetUniformLocation(nProgram, "src_delta"), 1.0f / nSize, 1.0f / nSize);
        glUniform2f(glGetUniformLocation(nProgram, "_outPixelExtent"), 1.0f, 1.0f);
        GLint const iGain = glGetUniformLocation(nProgram, "gain");
        glUniform1f(iGain, 1.0f);
        glUseProgram(0);
        return {nProgram, iGain};
    }

    GLuint aTextures_[3] = {};
    GLuint nFramebuffer_ = 0;
    std::vector<Pass> aPrograms_;
};

template <typename Work>
double secondsOf(Work const& work) {
    auto const begin = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
}

/// A gain that differs from that of the frame before.
float gainOf(long iFrame) { return iFrame % 2 == 0 ? 0.75f : 0.5f; }

std::string driverName() { return reinterpret_cast<char const*>(glGetString(GL_RENDERER)); }

void loop(benchmark::State& state) {
    Layers const layers;
    Loop byHand;
    long iFrame = 0;
    byHand.run(gainOf(iFrame++));
    for (auto _ : state)
        byHand.run(gainOf(iFrame++));
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * nFilters));
    state.SetLabel(driverName());
}

void frame(benchmark::State& state) {
    Layers const layers;
    Chain chain(layers.context());
    Loop byHand;
    long iFrame = 0;
    for (int i = 0; i < 3; ++i) {
        chain.frame(gainOf(iFrame));
        byHand.run(gainOf(iFrame++));
    }
    if (chain.pixels() != byHand.pixels())
        throw std::runtime_error("frame and loop differ");
    double dLoop = 0;
    double dFrame = 0;
    long nLinks = 0;
    long nTextures = 0;
    long nLarge = 0;
    for (auto _ : state) {
        dLoop += secondsOf([&] { byHand.run(gainOf(iFrame)); });
        nLinks -= Layers::Links::nCalls;
        nTextures -= Layers::Textures::nCalls;
        nLarge -= nLargeAllocations;
        double const dSeconds = secondsOf([&] { chain.frame(gainOf(iFrame++)); });
        nLinks += Layers::Links::nCalls;
        nTextures += Layers::Textures::nCalls;
        nLarge += nLargeAllocations;
        dFrame += dSeconds;
        state.SetIterationTime(dSeconds);
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * nFilters));
    state.SetLabel(driverName());
    state.counters["of_loop"] = dFrame / dLoop;
    state.counters["programs_linked"] = static_cast<double>(nLinks);
    state.counters["textures_made"] = static_cast<double>(nTextures);
    state.counters["large_allocations"] = static_cast<double>(nLarge);
}

BENCHMARK(loop)->Name("gl_chain/loop")->UseRealTime();
BENCHMARK(frame)->Name("gl_chain/frame")->UseManualTime();

} // namespace
