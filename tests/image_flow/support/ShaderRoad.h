/// Graphs of shader filters in a context of their own, and pictures to compare their results with.
#pragma once

#include "tests/image_flow/support/GLFlowTest.h"

#include <array>
#include <cmath>
#include <cstddef>
#include <functional>
#include <memory>
#include <random>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/filters/BasicGLShaderFilter.h"
#include "orvo/image_flow/sources/ImageGPUInput.h"
#include "orvo/image_flow/sources/ImageGPUOutput.h"
#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/Program.h"

namespace ORVO::Test {

/// A test of shader filters: frames run in a hidden context that shares with the host's.
class ShaderFlowTest : public GLFlowTest {
protected:
    void SetUp() override {
        GLFlowTest::SetUp();
        pFrameContext_ = std::make_unique<OGL::ContextOffscreen>(&context());
    }
    void TearDown() override {
        pFrameContext_.reset();
        GLFlowTest::TearDown();
    }
    OGL::Context const& frameContext() const { return *pFrameContext_; }

private:
    std::unique_ptr<OGL::ContextOffscreen> pFrameContext_;
};

using Pixel = std::array<double, 4>;

/// Four channels in double, red first; transparent black outside.
class Texels {
public:
    explicit Texels(PositionExtentInPixelSpace const& region,
                    PixelExtentInWorldSpace const& pixelExtent = PixelExtentInWorldSpace())
        : oRegion_(region),
          oPixelExtent_(pixelExtent),
          aPixels_(static_cast<std::size_t>(width()) * static_cast<std::size_t>(height())) {}

    /// What the image's texture holds of its rectangle.
    explicit Texels(ImageGPU const& image) : Texels(image.positionExtent(), image.pixelExtent()) {
        std::vector<unsigned char> const aBytes = readTexels(image, ImageGPU::PIXEL_FORMAT_RGBA32F);
        std::vector<float> aValues(aBytes.size() / sizeof(float));
        std::memcpy(aValues.data(), aBytes.data(), aBytes.size());
        for (std::size_t i = 0; i < aPixels_.size(); ++i)
            for (std::size_t c = 0; c < 4; ++c)
                aPixels_[i][c] = double(aValues[4 * i + c]);
    }

    /// Each pixel from its position in pixel space.
    template <typename Function>
    Texels& fill(Function const& function) {
        for (int y = top(); y < top() + height(); ++y)
            for (int x = left(); x < left() + width(); ++x)
                at(x, y) = function(x, y);
        return *this;
    }

    int left() const { return oRegion_.position().x(); }
    int top() const { return oRegion_.position().y(); }
    int width() const { return oRegion_.extent().width(); }
    int height() const { return oRegion_.extent().height(); }
    PositionExtentInPixelSpace const& region() const { return oRegion_; }
    PixelExtentInWorldSpace const& pixelExtent() const { return oPixelExtent_; }

    bool contains(int x, int y) const {
        return x >= left() && y >= top() && x < left() + width() && y < top() + height();
    }
    Pixel& at(int x, int y) {
        return aPixels_[static_cast<std::size_t>(y - top()) * static_cast<std::size_t>(width()) +
                        static_cast<std::size_t>(x - left())];
    }
    Pixel at(int x, int y) const { return contains(x, y) ? const_cast<Texels*>(this)->at(x, y) : Pixel{}; }

    /// The linear interpolation at a world position.
    Pixel sample(double worldX, double worldY) const {
        double const u = worldX / double(oPixelExtent_.width()) - 0.5;
        double const v = worldY / double(oPixelExtent_.height()) - 0.5;
        int const x = static_cast<int>(std::floor(u));
        int const y = static_cast<int>(std::floor(v));
        double const a = u - x;
        double const b = v - y;
        Pixel result{};
        for (std::size_t c = 0; c < 4; ++c)
            result[c] = (1 - b) * ((1 - a) * at(x, y)[c] + a * at(x + 1, y)[c]) +
                        b * ((1 - a) * at(x, y + 1)[c] + a * at(x + 1, y + 1)[c]);
        return result;
    }

    /// World position of the middle of a pixel.
    std::pair<double, double> middle(int x, int y) const {
        return {(x + 0.5) * double(oPixelExtent_.width()), (y + 0.5) * double(oPixelExtent_.height())};
    }

private:
    PositionExtentInPixelSpace oRegion_;
    PixelExtentInWorldSpace oPixelExtent_;
    std::vector<Pixel> aPixels_;
};

/// Values from -0.5 to 1.5, the same for the same seed.
inline Texels randomTexels(PositionExtentInPixelSpace const& region, unsigned seed,
                           PixelExtentInWorldSpace const& pixelExtent = PixelExtentInWorldSpace()) {
    std::mt19937 engine(seed);
    auto const next = [&] { return static_cast<double>(engine()) / 2147483648.0 - 0.5; };
    return Texels(region, pixelExtent).fill([&](int, int) { return Pixel{next(), next(), next(), next()}; });
}

/// The picture in a texture, in which OpenGL rounds it to the format.
inline ImageGPUPtr textureOf(Texels const& picture, ImageGPU::tePixelFormat format, bool exact = true) {
    ImageGPUPtr upImage(ORVO_NEW ImageGPU(picture.region(), format, picture.pixelExtent(), exact));
    std::vector<float> aValues;
    for (int y = picture.top(); y < picture.top() + picture.height(); ++y)
        for (int x = picture.left(); x < picture.left() + picture.width(); ++x)
            for (double const value : picture.at(x, y))
                aValues.push_back(static_cast<float>(value));
    upImage->copyImageData(reinterpret_cast<unsigned char const*>(aValues.data()), picture.region(),
                           picture.pixelExtent(), GL_RGBA, GL_FLOAT, 0);
    return upImage;
}

/// How exact a format is: 8-bit and 16-bit integers one step, halves 2^-10 of the value, floats 1e-5, which
/// also is what the halves' computation in floats is allowed near zero.
struct Precision {
    /// The first so many channels are compared.
    std::size_t nChannels_ = 4;
    /// Integer formats clamp to 0..1.
    bool bClamps_ = true;
    double dAbsolute_ = 0;
    double dRelative_ = 0;

    static Precision of(ImageGPU::tePixelFormat format) {
        std::size_t const nChannels = format / 4 == 0 ? 4 : 3;
        switch (format % 4) {
        case 0:
            return {nChannels, true, 1.0 / 255.0 + 1e-6, 0};
        case 1:
            return {nChannels, true, 1.0 / 65535.0 + 1e-6, 0};
        case 2:
            return {nChannels, false, 1e-5, 1.0 / 1024.0};
        default:
            return {nChannels, false, 1e-5, 0};
        }
    }
    bool accepts(double actual, double expected) const {
        double const wanted = bClamps_ ? std::min(std::max(expected, 0.0), 1.0) : expected;
        return std::abs(actual - wanted) <= std::max(dAbsolute_, dRelative_ * std::abs(wanted));
    }
};

/// Empty if all pixels are as expected, else the first that is not, and their number.
inline std::string differences(Texels const& actual, Texels const& expected, Precision const& precision) {
    if (actual.region() != expected.region())
        return "another rectangle";
    std::ostringstream text;
    std::size_t nWrong = 0;
    for (int y = actual.top(); y < actual.top() + actual.height(); ++y)
        for (int x = actual.left(); x < actual.left() + actual.width(); ++x)
            for (std::size_t c = 0; c < precision.nChannels_; ++c)
                if (!precision.accepts(actual.at(x, y)[c], expected.at(x, y)[c]) && nWrong++ == 0)
                    text << "(" << x << ", " << y << ")[" << c << "]: " << actual.at(x, y)[c] << ", not "
                         << expected.at(x, y)[c];
    if (nWrong > 0)
        text << "; " << nWrong << " values";
    return text.str();
}

/// The mistakes that a comparison must find: each a name and the picture with that mistake.
inline std::vector<std::pair<std::string, Texels>> mistakesIn(Texels const& expected) {
    auto const changed = [&](auto const& function) {
        return Texels(expected.region(), expected.pixelExtent()).fill(function);
    };
    int const lastRow = expected.top() + expected.height() - 1;
    return {
        {"one pixel to the right", changed([&](int x, int y) { return expected.at(x - 1, y); })},
        {"one pixel down", changed([&](int x, int y) { return expected.at(x, y - 1); })},
        {"red and blue swapped", changed([&](int x, int y) {
             Pixel pixel = expected.at(x, y);
             std::swap(pixel[0], pixel[2]);
             return pixel;
         })},
        {"1 % gain", changed([&](int x, int y) {
             Pixel pixel = expected.at(x, y);
             for (double& value : pixel)
                 value *= 1.01;
             return pixel;
         })},
        {"last row lost", changed([&](int x, int y) { return y == lastRow ? Pixel{} : expected.at(x, y); })}};
}

/// The result must be as expected, and the comparison must see each of the mistakes.
inline void expectTexels(Texels const& actual, Texels const& expected, Precision const& precision) {
    EXPECT_EQ("", differences(actual, expected, precision));
    for (auto const& [sName, mistake] : mistakesIn(expected))
        EXPECT_NE("", differences(actual, mistake, precision)) << "does not see: " << sName;
}

/// A shader filter with everything that a subclass can reach made public, and uniforms set by a function.
class ShaderNode : public BasicGLShaderFilter {
public:
    explicit ShaderNode(std::string const& sSource, std::vector<std::string> const& aInputs = {"src"},
                        int nChannels = 4)
        : BasicGLShaderFilter("ShaderNode", sSource.c_str(), nChannels) {
        for (std::string const& sName : aInputs)
            addInput(sName.c_str());
    }
    ~ShaderNode() override { disconnect(); }

    void preProcess() override {
        BasicGLShaderFilter::preProcess();
        if (onUniforms_) {
            ShaderProgramProxyOGLAutoLock const lock(oProgram_);
            lock.getProgram()->enable();
            onUniforms_(*lock.getProgram());
        }
        if (onPreProcessed_)
            onPreProcessed_();
    }

    using BasicGLShaderFilter::bCompiled_;
    using BasicGLShaderFilter::bExactOutput_;
    using BasicGLShaderFilter::compilePrograms;
    using BasicGLShaderFilter::firstTexUnit;
    using BasicGLShaderFilter::oProgram_;
    using BasicGLShaderFilter::sFragmentSource_;
    using BasicGLShaderFilter::texUnitCount_;
    using BasicGLShaderFilter::vpInputs_;
    using BasicGLShaderFilter::vspParameters_;
    using BasicGLShaderFilter::vspUniformArrays_;

    std::function<void(OGL::Program&)> onUniforms_;
    std::function<void()> onPreProcessed_;
};

/// Reads an input where the output pixel lies, moved by an expression in world space.
inline std::string readInput(std::string const& sName, std::string const& sMove = "vec2(0.0)") {
    return "texture2D(" + sName + "_sampler, (gl_TexCoord[0].xy*_outPixelExtent+_outOffset-" + sName +
           "_offset+" + sMove + ")*" + sName + "_delta)";
}

/// A program over the named inputs that writes the expression.
inline std::string shaderOf(std::vector<std::string> const& aInputs, std::string const& sExpression,
                            std::string const& sDeclarations = "") {
    std::string sSource = "uniform vec2 _outOffset;\nuniform vec2 _outPixelExtent;\n" + sDeclarations;
    for (std::string const& sName : aInputs)
        sSource += "uniform sampler2D " + sName + "_sampler;\nuniform vec2 " + sName + "_offset;\n" +
                   "uniform vec2 " + sName + "_delta;\nuniform vec2 " + sName + "_pixelExtent;\n" +
                   "uniform float " + sName + "_pixelAspectRatio;\n";
    return sSource + "void main() { gl_FragColor = " + sExpression + "; }\n";
}

/// Sources, one filter, and a sink.
class ShaderRoad {
public:
    ShaderRoad(OGL::Context const& context, ImageFilter& filter) : oFilter_(filter) {
        oController_.setContextGPU(context);
        for (std::size_t i = 0; i < filter.numberOfImageInputs(); ++i) {
            aupSources_.push_back(std::make_unique<ImageGPUInput>());
            feed(filter, i, *aupSources_.back());
            oController_.addNode(aupSources_.back().get());
        }
        oController_.addNode(&filter);
        oController_.setImageSink(filter);
    }
    ~ShaderRoad() {
        oController_.flushGraph();
        oFilter_.disconnect();
        oSink_.disconnect();
    }

    ImageFlowController& controller() { return oController_; }

    void setInput(std::size_t i, ImageGPU& image) {
        aupSources_[i]->setImageGPUWithNoOwnership(&image);
        aupSources_[i]->setOutputPixelExtent(image.pixelExtent());
    }

    /// Runs a frame into an image of the graph's own, which lives until the next one.
    ImageGPU const* run(PositionExtentInWorldSpace const& region) {
        if (oFilter_.imageOutput()->connectedInput() == nullptr) {
            feed(oSink_, 0, oFilter_);
            oController_.addNode(&oSink_);
            oController_.setImageSink(oSink_);
        }
        launch(region);
        return oSink_.getImageGPU();
    }

    /// Runs a frame into the given image.
    void runInto(ImageGPU& target, PositionExtentInWorldSpace const& region) {
        oFilter_.setBoundOutputImage(&target);
        launch(region);
    }

    /// Runs a frame from the controller's sink.
    void launch(PositionExtentInWorldSpace const& region) {
        oController_.flushGraph();
        for (auto const& upSource : aupSources_)
            upSource->emit();
        oController_.computeRegions(region);
        oController_.process();
    }

private:
    ImageFlowController oController_;
    std::vector<std::unique_ptr<ImageGPUInput>> aupSources_;
    ImageFilter& oFilter_;
    ImageGPUOutput oSink_;
};

} // namespace ORVO::Test
