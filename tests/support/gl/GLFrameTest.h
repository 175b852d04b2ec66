/// What tests of frames on OpenGL share: all layers up on a host's context, client textures, shader filters.
#pragma once

#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "orvo/filter_graph/impl/ImageGL.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/Texture2D.h"
#include "tests/support/FrameTest.h"
#include "tests/support/gl/GLTest.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

namespace ORVO::Test {

/// The options of a frame on OpenGL.
inline OptimizationOptions glOptions() { return OptimizationOptions(); }

/// All layers, started with one context, up for a scope.
struct GLFrameLayers {
    GLFrameLayers(OGL::Context const* pContext, FilterGraph::Library::InitializationOptions const& options)
        : oImageRuntime_(pContext, VideoMemory::Configuration()), oFilterGraph_(options) {}

    ImageRuntime::AutoInitializer oImageRuntime_;
    DataFlow::AutoInitializer oDataFlow_;
    ImageFlow::AutoInitializer oImageFlow_{true};
    FilterGraph::AutoInitializer oFilterGraph_;
};

/// All layers on a host's context. What a test makes of OpenGL must be gone when its body ends.
class GLFrameTest : public GLTest {
protected:
    explicit GLFrameTest(FilterGraph::Library::InitializationOptions const& options =
                             FilterGraph::Library::InitializationOptions())
        : oOptions_(options) {}

    void SetUp() override {
        GLTest::SetUp();
        pContext_ = OGL::Context::adoptCurrent();
        oLayers_.emplace(pContext_.get(), oOptions_);
    }

    void TearDown() override {
        host().makeCurrent();
        oLayers_.reset();
        pContext_.reset();
        GLTest::TearDown();
    }

    OGL::Context const* context() const { return pContext_.get(); }

private:
    FilterGraph::Library::InitializationOptions oOptions_;
    std::unique_ptr<OGL::Context> pContext_;
    std::optional<GLFrameLayers> oLayers_;
};

/// A client image of four 8-bit channels in host memory, without padding.
class ByteImage {
public:
    ByteImage(int x, int y, int width, int height, std::uint8_t fill = 0);

    std::vector<std::uint8_t> const& bytes() const { return aBytes_; }
    /// As many bytes as the image has.
    void write(std::vector<std::uint8_t> const& aBytes);
    void fill(std::uint8_t value);

    FilterGraph::ImageCPU* handle() { return &oHandle_; }

private:
    std::vector<std::uint8_t> aBytes_;
    FilterGraph::ImageCPU oHandle_;
};

/// A client image in a texture of its own, which is as large as the rectangle. Made and used with a context
/// of the library's current.
class TextureImage {
public:
    TextureImage(
        int x, int y, int width, int height,
        OGL::Texture::InternalFormat format = OGL::Texture::INTERNAL_FORMAT_RGBA8,
        FilterGraph::ImageDescriptor::eChannelType type = FilterGraph::ImageDescriptor::CHANNEL_TYPE_UINT8);

    /// R, G, B and A of every texel, row by row.
    void write(std::vector<std::uint8_t> const& aBytes);
    std::vector<std::uint8_t> read() const;
    /// The same as numbers from 0 to 65535.
    void write16(std::vector<std::uint16_t> const& aValues);
    std::vector<std::uint16_t> read16() const;

    FilterGraph::ImageGL* handle() { return &oHandle_; }
    OGL::Texture2D& texture() { return *pTexture_; }

private:
    std::unique_ptr<OGL::Texture2D> pTexture_;
    FilterGraph::ImageGL oHandle_;
};

/// A source or a sink with an image bound.
SourcePtr makeGLSource(FilterGraph::ImageBase* pImage);
SinkPtr makeGLSink(FilterGraph::ImageBase* pImage);

/// A filter on OpenGL that adds "value" to every channel of "src".
FilterPtr makeAddShader(std::string const& name = "add");
/// The mean of the inputs "a" and "b". With `ORVO_TARGET_CPU` the filter passes for one that graphs on the
/// CPU can run, though its node works on textures.
FilterPtr makeMeanShader(std::string const& name = "mean", TargetPlatform target = ORVO_TARGET_GL);
/// A filter whose shader does not compile: its node is made, but says that it does not run in hardware.
FilterPtr makeBrokenShader();

/// Bytes that differ from texel to texel and from channel to channel, from 0 to 199.
std::vector<std::uint8_t> pattern(int width, int height);
/// Every byte plus a number, at most 255.
std::vector<std::uint8_t> plus(std::vector<std::uint8_t> aBytes, int summand);

} // namespace ORVO::Test
