// Uploads into textures and reading back, RGBA 3840 x 2160 of bytes and of 32-bit floats, in a context
// without a display: on a GPU where there is one, else on the software driver. The label names it.
//
// ".../plain" are a single glTexSubImage2D from memory and a single glReadPixels into memory. "upload" is
// TextureUpload::asyncUpload, "read_back" the node GPU2CPU into a bound image. Each ends when the driver has
// done with it. The counter of_plain is how fast the engine's way is, in times of the plain one, the two run
// by turns so that both see the same machine. Bytes per second count bytes read plus bytes written.
#include "benchmarks/support/MemoryBandwidth.h"

#include "orvo/core/Core.h"
#include "orvo/data_flow/DataFlow.h"
#include "orvo/image_flow/ImageFlow.h"
#include "orvo/image_runtime/ImageRuntime.h"
#include "orvo/ogl/OGL.h"

#include "benchmarks/support/GLLayers.h"

#include <benchmark/benchmark.h>
#include <epoxy/gl.h>

#include <algorithm>
#include <chrono>
#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace {

using namespace ORVO;
using Layers = Benchmarks::GLNodeLayers;

constexpr int WIDTH = 3840;
constexpr int HEIGHT = 2160;

PositionExtentInPixelSpace frame() { return PositionExtentInPixelSpace(ExtentInPixelSpace(WIDTH, HEIGHT)); }

struct Setting {
    char const* sName;
    ImageCPU::tePixelFormat eCPU;
    ImageGPU::tePixelFormat eGPU;
    OGL::Texture::Type eType;

    std::size_t bytes() const { return static_cast<std::size_t>(WIDTH) * HEIGHT * pixelSizeBytes(eCPU); }
    GLenum type() const { return OGL::Texture::Type2GL(eType); }
};

/// A host image of changing bytes, none of them part of a float that is no number.
std::unique_ptr<ImageCPU> makeHostImage(Setting const& setting) {
    auto pImage = std::make_unique<ImageCPU>(setting.eCPU, frame(), PixelExtentInWorldSpace(1, 1),
                                             ExtentInPixelSpace());
    for (std::size_t i = 0; i < setting.bytes(); ++i)
        pImage->pixels()[i] = static_cast<unsigned char>((i * 31 + i / 4096) & 0x3F);
    return pImage;
}

double secondsOf(std::function<void()> const& work) {
    auto const begin = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
}

double medianOf(std::vector<double> seconds) {
    auto const middle = seconds.begin() + static_cast<std::ptrdiff_t>(seconds.size() / 2);
    std::nth_element(seconds.begin(), middle, seconds.end());
    return *middle;
}

/// Times the engine's way or the plain one, in turns with the other.
void measureEither(benchmark::State& state, Setting const& setting, bool bPlain,
                   std::function<void()> const& engine, std::function<void()> const& plain) {
    auto const& timed = bPlain ? plain : engine;
    auto const& other = bPlain ? engine : plain;
    timed();
    other();
    std::vector<double> aTimed, aOther;
    for (auto _ : state) {
        aTimed.push_back(secondsOf(timed));
        state.PauseTiming();
        aOther.push_back(secondsOf(other));
        state.ResumeTiming();
    }
    if (!bPlain)
        state.counters["of_plain"] = medianOf(aOther) / medianOf(aTimed);
    state.SetBytesProcessed(state.iterations() * 2 * static_cast<std::int64_t>(setting.bytes()));
    state.SetLabel(reinterpret_cast<char const*>(glGetString(GL_RENDERER)));
}

/// Reads a texture with a single call.
class PlainRead {
public:
    PlainRead(Setting const& setting, ImageGPU& image) : oSetting_(setting) {
        oFramebuffer_.bind();
        oFramebuffer_.attach(image.texture(), 0, 0);
        oFramebuffer_.unbind();
    }

    void into(ImageCPU& host) {
        oFramebuffer_.bind();
        glPixelStorei(GL_PACK_ALIGNMENT, 1);
        glReadPixels(0, 0, WIDTH, HEIGHT, GL_RGBA, oSetting_.type(), host.pixels());
        oFramebuffer_.unbind();
    }

    bool isEqualTo(ImageCPU const& host) {
        auto const pRead = std::make_unique<ImageCPU>(host);
        pRead->initializeToTransparentBlack();
        into(*pRead);
        return std::memcmp(pRead->pixels(), host.pixels(), oSetting_.bytes()) == 0;
    }

private:
    Setting const& oSetting_;
    OGL::Framebuffer oFramebuffer_;
};

void upload(benchmark::State& state, Setting const& setting, bool bPlain) {
    Layers const layers;
    auto const pHost = makeHostImage(setting);
    ImageGPU image(frame(), setting.eGPU, PixelExtentInWorldSpace(1, 1), true);
    TextureUpload upload;
    auto const async = [&] {
        upload.asyncUpload(image.texture(), 0, frame(), OGL::Texture::FORMAT_RGBA, setting.eType,
                           pHost->pixels(), 0);
        glFinish();
    };
    auto const direct = [&] {
        glBindTexture(GL_TEXTURE_2D, image.texture()->objectID());
        glTexSubImage2D(GL_TEXTURE_2D, 0, 0, 0, WIDTH, HEIGHT, GL_RGBA, setting.type(), pHost->pixels());
        glBindTexture(GL_TEXTURE_2D, 0);
        glFinish();
    };
    async();
    if (!PlainRead(setting, image).isEqualTo(*pHost)) {
        state.SkipWithError("The texture does not hold what was uploaded");
        return;
    }
    measureEither(state, setting, bPlain, async, direct);
}

/// A texture, and the node that reads it into a host image.
class ReadBack {
public:
    ReadBack(OGL::Context const& context, ImageGPU& image, ImageCPU& host) {
        oSource_.setImageGPUWithNoOwnership(&image);
        oSource_.setOutputPixelExtent(image.pixelExtent());
        oNode_.setBoundOutputImage(&host);
        DataFlow::Connect(*oNode_.imageInput(0), *oSource_.imageOutput());
        oController_.addNode(&oSource_);
        oController_.addNode(&oNode_);
        oController_.setImageSink(oNode_);
        oController_.setContextGPU(context);
    }
    ~ReadBack() {
        oSource_.disconnect();
        oNode_.disconnect();
    }
    ReadBack(ReadBack const&) = delete;
    ReadBack& operator=(ReadBack const&) = delete;

    void run() {
        oController_.computeRegions(pixelToWorldSpace(frame(), PixelExtentInWorldSpace(1, 1)));
        oController_.setDirtyState();
        oSource_.emit();
        oController_.process();
    }

private:
    ImageGPUInput oSource_;
    GPU2CPU oNode_;
    ImageFlowController oController_;
};

void readBack(benchmark::State& state, Setting const& setting, bool bPlain) {
    Layers const layers;
    auto const pFrom = makeHostImage(setting);
    auto const pTo = std::make_unique<ImageCPU>(*pFrom);
    pTo->initializeToTransparentBlack();
    ImageGPU image(frame(), setting.eGPU, PixelExtentInWorldSpace(1, 1), true);
    TextureUpload().asyncUpload(image.texture(), 0, frame(), OGL::Texture::FORMAT_RGBA, setting.eType,
                                pFrom->pixels(), 0);
    ReadBack road(layers.context(), image, *pTo);
    PlainRead plain(setting, image);
    auto const node = [&] { road.run(); };
    auto const direct = [&] { plain.into(*pTo); };
    node();
    if (std::memcmp(pTo->pixels(), pFrom->pixels(), setting.bytes()) != 0) {
        state.SkipWithError("The host image does not hold what the texture does");
        return;
    }
    measureEither(state, setting, bPlain, node, direct);
}

constexpr Setting aSettings[] = {
    {"rgba8", ImageCPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA8, OGL::Texture::TYPE_UNSIGNED_BYTE},
    {"rgba32f", ImageCPU::PIXEL_FORMAT_RGBA32F, ImageGPU::PIXEL_FORMAT_RGBA32F, OGL::Texture::TYPE_FLOAT}};

bool addAll() {
    struct Row {
        char const* sName;
        void (*work)(benchmark::State&, Setting const&, bool);
    };
    for (Setting const& setting : aSettings) {
        Benchmarks::registerMemcpy(setting.bytes());
        for (Row const& row : {Row{"upload", &upload}, Row{"read_back", &readBack}})
            for (bool const bPlain : {true, false}) {
                std::string const sName =
                    std::string(row.sName) + "/" + setting.sName + (bPlain ? "/plain" : "/engine");
                benchmark::RegisterBenchmark(sName.c_str(), row.work, setting, bPlain)
                    ->UseRealTime()
                    ->Unit(benchmark::kMillisecond);
            }
    }
    return true;
}

bool const bAdded = addAll();

} // namespace
