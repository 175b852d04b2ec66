#include "tests/support/gl/GLFrameTest.h"

#include <epoxy/gl.h>

#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/filters/BasicGLShaderFilter.h"
#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/ogl/PixelUnpackParameters.h"
#include "orvo/ogl/Program.h"

#include <algorithm>

namespace ORVO::Test {

using FilterGraph::ImageDescriptor;

namespace {

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height));
}

std::size_t count(int width, int height) {
    return 4 * static_cast<std::size_t>(width) * static_cast<std::size_t>(height);
}

/// Binds a texture to its target on the active unit for a scope.
class Bound {
public:
    explicit Bound(OGL::Texture2D const& texture) {
        glGetIntegerv(GL_TEXTURE_BINDING_2D, &nSaved_);
        glBindTexture(GL_TEXTURE_2D, texture.objectID());
    }
    ~Bound() { glBindTexture(GL_TEXTURE_2D, static_cast<GLuint>(nSaved_)); }
    Bound(Bound const&) = delete;
    Bound& operator=(Bound const&) = delete;

private:
    GLint nSaved_ = 0;
};

constexpr char const* kAddText =
    "uniform sampler2D src_sampler;\n"
    "uniform vec2 src_offset;\n"
    "uniform vec2 src_delta;\n"
    "uniform vec2 _outOffset;\n"
    "uniform vec2 _outPixelExtent;\n"
    "uniform float value;\n"
    "void main() {\n"
    "    vec2 place = gl_TexCoord[0].xy*_outPixelExtent + _outOffset;\n"
    "    gl_FragData[0] = texture2D(src_sampler, (place-src_offset)*src_delta) +\n"
    "                     vec4(value);\n"
    "}\n";

constexpr char const* kMeanText =
    "uniform sampler2D a_sampler;\n"
    "uniform vec2 a_offset;\n"
    "uniform vec2 a_delta;\n"
    "uniform sampler2D b_sampler;\n"
    "uniform vec2 b_offset;\n"
    "uniform vec2 b_delta;\n"
    "uniform vec2 _outOffset;\n"
    "uniform vec2 _outPixelExtent;\n"
    "void main() {\n"
    "    vec2 place = gl_TexCoord[0].xy*_outPixelExtent + _outOffset;\n"
    "    gl_FragData[0] = 0.5*(texture2D(a_sampler, (place-a_offset)*a_delta) +\n"
    "                          texture2D(b_sampler, (place-b_offset)*b_delta));\n"
    "}\n";

class AddShader : public BasicGLShaderFilter {
public:
    AddShader() : BasicGLShaderFilter("AddShader", kAddText, 4) {
        addInput("src");
        spValue_ = std::make_shared<DataFlow::Parameter<float>>(0.0f, "value", "What is added");
        addParameter(spValue_);
    }

    void preProcess() override {
        BasicGLShaderFilter::preProcess();
        ShaderProgramProxyOGLAutoLock const lock(oProgram_);
        OGL::Program& program = *lock.getProgram();
        program.enable();
        program.setUniform("value", spValue_->value());
    }

private:
    std::shared_ptr<DataFlow::Parameter<float>> spValue_;
};

class MeanShader : public BasicGLShaderFilter {
public:
    MeanShader() : BasicGLShaderFilter("MeanShader", kMeanText, 4) {
        addInput("a");
        addInput("b");
    }
};

class BrokenShader : public BasicGLShaderFilter {
public:
    BrokenShader() : BasicGLShaderFilter("BrokenShader", "void main() { undeclared = 1.0; }\n", 4) {
        addInput("src");
    }
};

template <typename Node>
FilterPtr makeShader(std::string const& name, TargetPlatform target = ORVO_TARGET_GL) {
    FilterGraph::Internal::ImageFlowFilter<Node> prototype(
        FilterGraph::IFilter::Identifier(name, "test", "ORVO", 1), target);
    prototype.initialize();
    return prototype.clone();
}

} // namespace

ByteImage::ByteImage(int x, int y, int width, int height, std::uint8_t fill)
    : aBytes_(count(width, height), fill),
      oHandle_(FilterGraph::ImageDescriptorCPU({4, ImageDescriptor::CHANNEL_TYPE_UINT8},
                                               PixelExtentInWorldSpace()),
               rectangle(x, y, width, height), aBytes_.data(), 0) {}

// The handle points at the bytes: they are never moved.
void ByteImage::write(std::vector<std::uint8_t> const& aBytes) {
    ASSERT_EQ(aBytes.size(), aBytes_.size());
    std::copy(aBytes.begin(), aBytes.end(), aBytes_.begin());
}

void ByteImage::fill(std::uint8_t value) { std::fill(aBytes_.begin(), aBytes_.end(), value); }

TextureImage::TextureImage(int x, int y, int width, int height, OGL::Texture::InternalFormat format,
                           ImageDescriptor::eChannelType type)
    : pTexture_(std::make_unique<OGL::Texture2D>(format, static_cast<std::size_t>(width),
                                                 static_cast<std::size_t>(height), false, nullptr)),
      oHandle_(FilterGraph::ImageDescriptorGL({4, type}, PixelExtentInWorldSpace()),
               rectangle(x, y, width, height), pTexture_.get()) {}

void TextureImage::write(std::vector<std::uint8_t> const& aBytes) {
    Bound const bound(*pTexture_);
    pTexture_->subImage(0, 0, 0, pTexture_->width(0), pTexture_->height(0), OGL::Texture::FORMAT_RGBA,
                        OGL::Texture::TYPE_UNSIGNED_BYTE, aBytes.data(), {});
}

std::vector<std::uint8_t> TextureImage::read() const {
    Bound const bound(*pTexture_);
    std::vector<std::uint8_t> aBytes(4 * pTexture_->width(0) * pTexture_->height(0));
    pTexture_->getPixelData(aBytes.data(), 0, OGL::Texture::FORMAT_RGBA, OGL::Texture::TYPE_UNSIGNED_BYTE, 1);
    return aBytes;
}

void TextureImage::write16(std::vector<std::uint16_t> const& aValues) {
    Bound const bound(*pTexture_);
    pTexture_->subImage(0, 0, 0, pTexture_->width(0), pTexture_->height(0), OGL::Texture::FORMAT_RGBA,
                        OGL::Texture::TYPE_UNSIGNED_SHORT, aValues.data(), {});
}

std::vector<std::uint16_t> TextureImage::read16() const {
    Bound const bound(*pTexture_);
    std::vector<std::uint16_t> aValues(4 * pTexture_->width(0) * pTexture_->height(0));
    pTexture_->getPixelData(aValues.data(), 0, OGL::Texture::FORMAT_RGBA, OGL::Texture::TYPE_UNSIGNED_SHORT,
                            1);
    return aValues;
}

SourcePtr makeGLSource(FilterGraph::ImageBase* pImage) {
    SourcePtr spSource = FilterGraph::createInputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    spSource->setImage(pImage);
    return spSource;
}

SinkPtr makeGLSink(FilterGraph::ImageBase* pImage) {
    SinkPtr spSink = FilterGraph::createOutputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    spSink->setImage(pImage);
    return spSink;
}

FilterPtr makeAddShader(std::string const& name) { return makeShader<AddShader>(name); }

FilterPtr makeMeanShader(std::string const& name, TargetPlatform target) {
    return makeShader<MeanShader>(name, target);
}

FilterPtr makeBrokenShader() { return makeShader<BrokenShader>("broken"); }

std::vector<std::uint8_t> pattern(int width, int height) {
    std::vector<std::uint8_t> aBytes(count(width, height));
    for (std::size_t i = 0; i < aBytes.size(); ++i) {
        aBytes[i] = static_cast<std::uint8_t>((i * 37 + i / 4 * 11) % 200);
    }
    return aBytes;
}

std::vector<std::uint8_t> plus(std::vector<std::uint8_t> aBytes, int summand) {
    for (std::uint8_t& byte : aBytes) {
        byte = static_cast<std::uint8_t>(std::clamp(byte + summand, 0, 255));
    }
    return aBytes;
}

} // namespace ORVO::Test
