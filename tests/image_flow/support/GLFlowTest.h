/// Graphs with images in textures, in a host's context.
#pragma once

// Before the headers of OpenGL, which define macros.
#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"

#include <epoxy/gl.h>

#include <cstdint>
#include <cstring>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "orvo/core/math/Half.h"
#include "orvo/data_flow/DataFlowLibrary.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/Texture2D.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/FailEveryCall.h"
#include "tests/support/gl/GLTest.h"

namespace ORVO::Test {

/// A test in a host's context, with the layers up to image flow started on it.
class GLFlowTest : public GLTest {
protected:
    void SetUp() override {
        GLTest::SetUp();
        upContext_ = OGL::Context::adoptCurrent();
        upRuntime_ =
            std::make_unique<ImageRuntime::AutoInitializer>(upContext_.get(), VideoMemory::Configuration());
        upDataFlow_ = std::make_unique<DataFlow::AutoInitializer>();
        upImageFlow_ = std::make_unique<ImageFlow::AutoInitializer>(true);
    }

    void TearDown() override {
        upImageFlow_.reset();
        upDataFlow_.reset();
        upRuntime_.reset();
        host().makeCurrent();
        upContext_.reset();
        if (bEndWithHost_) {
            loseHost();
            GLHooks::forgetObjects();
        }
        GLTest::TearDown();
    }

    /// For tests that destroy a context: the driver ends with it what is counted on.
    void endWithHost() { bEndWithHost_ = true; }

    /// The host's context.
    OGL::Context const& context() const { return *upContext_; }

private:
    bool bEndWithHost_ = false;
    std::unique_ptr<OGL::Context> upContext_;
    std::unique_ptr<ImageRuntime::AutoInitializer> upRuntime_;
    std::unique_ptr<DataFlow::AutoInitializer> upDataFlow_;
    std::unique_ptr<ImageFlow::AutoInitializer> upImageFlow_;
};

using ImageGPUPtr = std::unique_ptr<ImageGPU, ORVODeleter<ImageGPU>>;
using ImageCPUPtr = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

/// All formats that textures can have.
constexpr ImageGPU::tePixelFormat aTextureFormats[] = {ImageGPU::PIXEL_FORMAT_RGBA8,
                                                       ImageGPU::PIXEL_FORMAT_RGBA16,
                                                       ImageGPU::PIXEL_FORMAT_RGBA16F,
                                                       ImageGPU::PIXEL_FORMAT_RGBA32F,
                                                       ImageGPU::PIXEL_FORMAT_RGB8,
                                                       ImageGPU::PIXEL_FORMAT_RGB16,
                                                       ImageGPU::PIXEL_FORMAT_RGB16F,
                                                       ImageGPU::PIXEL_FORMAT_RGB32F,
                                                       ImageGPU::PIXEL_FORMAT_LUMINANCE8,
                                                       ImageGPU::PIXEL_FORMAT_LUMINANCE16,
                                                       ImageGPU::PIXEL_FORMAT_LUMINANCE16F,
                                                       ImageGPU::PIXEL_FORMAT_LUMINANCE32F,
                                                       ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8,
                                                       ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F,
                                                       ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F};

/// How the pixels of a texture's format lie in memory when nothing is converted.
struct TexelLayout {
    unsigned nFormat_;
    unsigned nType_;
    std::size_t nChannels_;
    std::size_t nChannelBytes_;

    explicit TexelLayout(ImageGPU::tePixelFormat format) {
        constexpr unsigned aFormats[] = {GL_RGBA, GL_RGB, GL_LUMINANCE, GL_LUMINANCE_ALPHA};
        constexpr std::size_t aChannels[] = {4, 3, 1, 2};
        constexpr unsigned aTypes[] = {GL_UNSIGNED_BYTE, GL_UNSIGNED_SHORT, GL_HALF_FLOAT, GL_FLOAT};
        constexpr std::size_t aBytes[] = {1, 2, 2, 4};
        nFormat_ = aFormats[format / 4];
        nChannels_ = aChannels[format / 4];
        nType_ = aTypes[format % 4];
        nChannelBytes_ = aBytes[format % 4];
    }
    std::size_t pixelBytes() const { return nChannels_ * nChannelBytes_; }
};

/// A new image; with `exact` false its texture is larger than the rectangle.
inline ImageGPUPtr textureImage(PositionExtentInPixelSpace const& region, ImageGPU::tePixelFormat format,
                                bool exact = true) {
    return ImageGPUPtr(ORVO_NEW ImageGPU(region, format, PixelExtentInWorldSpace(), exact));
}

/// Writes tight rows of the layout of the image's format into its rectangle.
inline void writeTexels(ImageGPU& image, std::vector<unsigned char> const& aBytes) {
    TexelLayout const layout(image.pixelFormat());
    image.copyImageData(aBytes.data(), image.positionExtent(), image.pixelExtent(), layout.nFormat_,
                        layout.nType_, 0);
}

/// The pixels of the image's rectangle, as tight rows of the given format.
inline std::vector<unsigned char> readTexels(ImageGPU const& image, ImageGPU::tePixelFormat format) {
    TexelLayout const layout(format);
    auto const width = static_cast<std::size_t>(image.extent().width());
    auto const height = static_cast<std::size_t>(image.extent().height());
    std::size_t const capacityWidth = image.texture()->width(0);
    std::vector<unsigned char> aAll(capacityWidth * image.texture()->height(0) * layout.pixelBytes());
    GLint nBound = 0;
    glGetIntegerv(GL_TEXTURE_BINDING_2D, &nBound);
    glBindTexture(GL_TEXTURE_2D, image.texture()->objectID());
    glPushClientAttrib(GL_CLIENT_PIXEL_STORE_BIT);
    glPixelStorei(GL_PACK_ALIGNMENT, 1);
    glGetTexImage(GL_TEXTURE_2D, 0, layout.nFormat_, layout.nType_, aAll.data());
    glPopClientAttrib();
    glBindTexture(GL_TEXTURE_2D, static_cast<GLuint>(nBound));
    std::vector<unsigned char> aPixels(width * height * layout.pixelBytes());
    for (std::size_t row = 0; row < height; ++row)
        std::memcpy(&aPixels[row * width * layout.pixelBytes()],
                    &aAll[row * capacityWidth * layout.pixelBytes()], width * layout.pixelBytes());
    return aPixels;
}

inline std::vector<unsigned char> readTexels(ImageGPU const& image) {
    return readTexels(image, image.pixelFormat());
}

/// Channel values of a type, `n` of them: all numbers of the type in turn, as far as they go; of floats also
/// those outside 0..1 and the ends of the range.
template <typename T>
std::vector<T> channelValues(std::size_t n) {
    std::vector<T> aValues(n);
    for (std::size_t i = 0; i < n; ++i) {
        if constexpr (std::is_same_v<T, float>) {
            constexpr float aSpecial[] = {-1.5f,    0.0f,     1.0f,     0.1f, 3.0e38f,
                                          -3.0e38f, 1.0e-38f, 65504.0f, -0.0f};
            aValues[i] = i % 2 == 0 ? aSpecial[i / 2 % 9] : static_cast<float>(i) * 0.37f - 20.0f;
        } else {
            aValues[i] = static_cast<T>(i * 40503u + i / 7u);
        }
    }
    return aValues;
}

template <typename T>
std::vector<unsigned char> bytesOf(std::vector<T> const& aValues) {
    std::vector<unsigned char> aBytes(aValues.size() * sizeof(T));
    std::memcpy(aBytes.data(), aValues.data(), aBytes.size());
    return aBytes;
}

/// Channel values in bytes, for GL_UNSIGNED_BYTE, GL_UNSIGNED_SHORT, GL_HALF_FLOAT (no infinities and NaNs)
/// or GL_FLOAT.
inline std::vector<unsigned char> channelBytes(unsigned nType, std::size_t n) {
    if (nType == GL_UNSIGNED_BYTE)
        return bytesOf(channelValues<std::uint8_t>(n));
    if (nType == GL_FLOAT)
        return bytesOf(channelValues<float>(n));
    std::vector<std::uint16_t> aValues = channelValues<std::uint16_t>(n);
    if (nType == GL_HALF_FLOAT)
        for (std::uint16_t& bits : aValues)
            if ((bits & 0x7c00) == 0x7c00)
                bits = static_cast<std::uint16_t>(bits ^ 0x0400);
    return bytesOf(aValues);
}

/// Texels for all of an image of the format.
inline std::vector<unsigned char> texelsFor(ImageGPU const& image) {
    TexelLayout const layout(image.pixelFormat());
    return channelBytes(layout.nType_, image.numberOfPixels() * layout.nChannels_);
}

/// Runs the code once for each call in it that can fail, with that call failing: each run must throw
/// ExceptionOGL, and `check` is run after each. Unlike `failEveryCall` it lets the texture pool keep what it
/// made; what is left in the end is the fixture's to see. A context that the driver does not give back at the
/// end of a scope is no failure of the code. The number of calls varies, since it depends on the driver's
/// progress which buffers the pool can use again: the first calls of `aNames` are made to fail as well.
template <typename Code, typename Check>
void failEveryCallBeforeThePool(Code code, Check check, std::vector<std::string> const& aNames) {
    auto const run = [&](GLCallFailure const& failure) {
        bool bThrown = false;
        try {
            code();
        } catch (OGL::ExceptionOGL const&) {
            bThrown = true;
        }
        if (!failure.hasFired())
            return false;
        EXPECT_TRUE(bThrown || failure.name() == "eglMakeCurrent") << failure.name() << " failed unseen";
        EXPECT_EQ(GLenum(GL_NO_ERROR), glGetError()) << failure.name() << " left its error behind";
        return true;
    };
    bool bMore = true;
    for (std::uint64_t n = 1; bMore && n < 1000; ++n) {
        bMore = run(GLCallFailure(n));
        check();
    }
    EXPECT_FALSE(bMore) << "The code never ended without a failure";
    for (std::string const& sName : aNames) {
        EXPECT_TRUE(run(GLCallFailure(sName, 1))) << sName << " was not called";
        check();
    }
}

/// A node on textures: no pixels, but its runs are seen. Inputs "in0", ...; output "out" unless told
/// otherwise.
class TextureNode : public ImageFilter {
public:
    explicit TextureNode(std::size_t nInputs = 1, bool bOutput = true, char const* name = "TextureNode")
        : ImageFilter(name, OUTPUT_PRECISION_DEFAULT), oOutput_("out", this) {
        inputTarget_ = ORVO_TARGET_GL;
        outputTarget_ = ORVO_TARGET_GL;
        for (std::size_t i = 0; i < nInputs; ++i) {
            aInputs_.push_back(
                std::make_unique<DataFlow::ConstInput<ImageGPU>>("in" + std::to_string(i), this));
            addImageInput(aInputs_.back().get());
        }
        if (bOutput)
            setImageOutput(&oOutput_);
    }
    ~TextureNode() override { disconnect(); }

    void internalProcess() override {
        ++nRuns_;
        if (!aInputs_.empty())
            pSeen_ = aInputs_.front()->get();
        if (onRun_)
            onRun_();
        allocateOutputImage();
        bPreparedForRender_ = false;
        if (pImageOutput_ != nullptr && !oOutput_.bound())
            oOutput_.setData(textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8).release());
    }

    using ImageFilter::boundOutputImageGPU;
    using ImageFilter::getNumChannelsOutput;
    using ImageFilter::nForcedChannels_;
    using ImageFilter::outputPrecisionHint;
    using ImageFilter::outputTarget_;
    using ImageFilter::postProcess;

    DataFlow::ConstInput<ImageGPU>& in(std::size_t i = 0) { return *aInputs_[i]; }
    DataFlow::ConstOutput<ImageGPU>& out() { return oOutput_; }

    int nRuns_ = 0;
    ImageGPU const* pSeen_ = nullptr;
    std::function<void()> onRun_;

private:
    std::vector<std::unique_ptr<DataFlow::ConstInput<ImageGPU>>> aInputs_;
    DataFlow::ConstOutput<ImageGPU> oOutput_;
};

} // namespace ORVO::Test
