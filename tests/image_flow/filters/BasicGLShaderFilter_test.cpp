#include "orvo/image_flow/filters/BasicGLShaderFilter.h"

#include "tests/image_flow/support/ShaderRoad.h"

#include <array>
#include <string>
#include <vector>

#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/ogl/ExtensionManager.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using Hint = ImageFilter::teOutputPrecisionHint;

constexpr char const* pWhite = "void main() { gl_FragColor = vec4(1.0); }";

std::string copyShader() { return shaderOf({"src"}, readInput("src")); }

class BasicGLShaderFilterTest : public ShaderFlowTest {
protected:
    static std::array<float, 2> uniformOf(OGL::Program const& program, char const* pName) {
        std::array<float, 2> aValues{-99.0f, -99.0f};
        glGetUniformfv(program.objectID(), program.getUniformLocation(pName), aValues.data());
        return aValues;
    }
    static int integerOf(GLenum token) {
        GLint value = 0;
        glGetIntegerv(token, &value);
        return value;
    }
    static int parameterOf(GLenum token) {
        GLint value = 0;
        glGetTexParameteriv(GL_TEXTURE_2D, token, &value);
        return value;
    }
};

TEST_F(BasicGLShaderFilterTest, CompilesItsProgramWhenItIsBuilt) {
    auto const nLinks = GLHooks::calls("glLinkProgram");
    ShaderNode good(pWhite, {});
    EXPECT_TRUE(good.willRunInHardware());
    EXPECT_EQ(nLinks + 1, GLHooks::calls("glLinkProgram"));
    EXPECT_EQ(pWhite, good.sFragmentSource_);

    ShaderNode bad("void main() { gl_FragColor = nonsense; }", {});
    EXPECT_FALSE(bad.willRunInHardware());

    ShaderNode empty("", {});
    EXPECT_TRUE(empty.willRunInHardware());
    EXPECT_EQ(nLinks + 1, GLHooks::calls("glLinkProgram"));
    BasicGLShaderFilter null("null", nullptr, 4);
    EXPECT_TRUE(null.willRunInHardware());
}

TEST_F(BasicGLShaderFilterTest, IsNotCompiledOnAForeignContext) {
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    ShaderNode node(pWhite, {});
    EXPECT_FALSE(node.willRunInHardware());
    host().makeCurrent();
}

TEST(BasicGLShaderFilterWithoutOpenGLTest, IsNotCompiled) {
    Core::AutoInitializer const core;
    OGL::AutoInitializer const ogl;
    ImageRuntime::AutoInitializer const runtime(nullptr, VideoMemory::Configuration());
    DataFlow::AutoInitializer const dataFlow;
    ShaderNode node(pWhite, {});
    EXPECT_FALSE(node.willRunInHardware());
}

TEST_F(BasicGLShaderFilterTest, HasTheInputsAndParametersThatAreAdded) {
    ShaderNode node(pWhite, {"a", "b"});
    ASSERT_EQ(2U, node.numberOfImageInputs());
    EXPECT_EQ("a", node.imageInput(0)->name());
    EXPECT_EQ("b", node.imageInput(1)->name());
    EXPECT_EQ(node.imageInput(0), node.vpInputs_[0]);
    EXPECT_EQ("OutputImage", node.imageOutput()->name());
    EXPECT_EQ(1, node.texUnitCount_);
    EXPECT_EQ(1, static_cast<int>(ShaderNode::firstTexUnit));
    auto const spGain = DataFlow::Parameter<float>::create(0.5f, "gain");
    std::size_t const nParameters = node.numberOfParameters();
    node.addParameter(spGain);
    EXPECT_EQ(nParameters + 1, node.numberOfParameters());
    EXPECT_EQ(spGain.get(), node.parameter("gain"));
    EXPECT_EQ(1U, node.vspParameters_.size());
    ORVO_EXPECT_INTERNAL(node.addParameter(nullptr), "Enforce spParameter.get() != NULL");
    ORVO_EXPECT_INTERNAL(node.addInput(nullptr), "Enforce name != NULL");
    ORVO_EXPECT_INTERNAL(node.addUniformArray(nullptr, nullptr, 0), "Enforce name != NULL");
    node.evaluateParameters();
}

TEST_F(BasicGLShaderFilterTest, TellsTheProgramWhereItsImagesLie) {
    // Two inputs of other pixel extents, the first in a texture of 16 by 8 pixels.
    ImageGPUPtr const upA =
        textureOf(randomTexels(pixels(-3, 5, 13, 7), 1, {0.5f, 2.0f}), ImageGPU::PIXEL_FORMAT_RGBA8, false);
    ImageGPUPtr const upB =
        textureOf(randomTexels(pixels(4, -6, 4, 8), 2, {4.0f, 1.0f}), ImageGPU::PIXEL_FORMAT_RGBA8);
    std::string const sAll = "vec4(a_pixelExtent, b_pixelExtent)+vec4(a_pixelAspectRatio)+"
                             "vec4(b_pixelAspectRatio)+" +
                             readInput("a") + "+" + readInput("b");
    ShaderNode node(shaderOf({"a", "b"}, sAll), {"a", "b"});
    OGL::Program* pProgram = nullptr;
    node.onUniforms_ = [&](OGL::Program& program) { pProgram = &program; };
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upA);
    road.setInput(1, *upB);
    road.run(pixelToWorldSpace(pixels(-2, 6, 5, 3), PixelExtentInWorldSpace(0.5f, 2.0f)));

    using Pair = std::array<float, 2>;
    struct Row {
        char const* pName_;
        Pair aValues_;
    };
    Row const aRows[] = {{"a_pixelExtent", {0.5f, 2.0f}},
                         {"b_pixelExtent", {4.0f, 1.0f}},
                         {"a_delta", {1.0f / 8.0f, 1.0f / 16.0f}},
                         {"b_delta", {1.0f / 16.0f, 1.0f / 8.0f}},
                         {"a_offset", {-1.5f, 10.0f}},
                         {"b_offset", {16.0f, -6.0f}},
                         {"_outOffset", {-1.0f, 12.0f}},
                         {"_outPixelExtent", {0.5f, 2.0f}}};
    ASSERT_NE(nullptr, pProgram);
    for (Row const& row : aRows)
        EXPECT_EQ(row.aValues_, uniformOf(*pProgram, row.pName_)) << row.pName_;
    EXPECT_EQ(0.25f, uniformOf(*pProgram, "a_pixelAspectRatio")[0]);
    EXPECT_EQ(4.0f, uniformOf(*pProgram, "b_pixelAspectRatio")[0]);
    GLint nUnit = 0;
    glGetUniformiv(pProgram->objectID(), pProgram->getUniformLocation("a_sampler"), &nUnit);
    EXPECT_EQ(1, nUnit);
    glGetUniformiv(pProgram->objectID(), pProgram->getUniformLocation("b_sampler"), &nUnit);
    EXPECT_EQ(2, nUnit);
}

TEST_F(BasicGLShaderFilterTest, BindsItsInputsBehindUnitZeroAndUnbindsThem) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 4, 4), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    ShaderNode node(copyShader());
    bool bSeen = false;
    node.onPreProcessed_ = [&] {
        bSeen = true;
        EXPECT_EQ(1, upInput->boundTexUnit());
        EXPECT_EQ(2, node.texUnitCount_);
        glActiveTexture(GL_TEXTURE1);
        EXPECT_EQ(static_cast<int>(upInput->texture()->objectID()), integerOf(GL_TEXTURE_BINDING_2D));
        EXPECT_TRUE(glIsEnabled(GL_TEXTURE_2D));
        EXPECT_EQ(GL_LINEAR, parameterOf(GL_TEXTURE_MIN_FILTER));
        EXPECT_EQ(GL_LINEAR, parameterOf(GL_TEXTURE_MAG_FILTER));
        EXPECT_EQ(GL_CLAMP_TO_BORDER, parameterOf(GL_TEXTURE_WRAP_S));
        EXPECT_EQ(GL_CLAMP_TO_BORDER, parameterOf(GL_TEXTURE_WRAP_T));
        std::array<float, 4> aBorder{1, 1, 1, 1};
        glGetTexParameterfv(GL_TEXTURE_2D, GL_TEXTURE_BORDER_COLOR, aBorder.data());
        EXPECT_EQ((std::array<float, 4>{}), aBorder);
    };
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    road.run(world(0, 0, 4, 4));
    EXPECT_TRUE(bSeen);
    EXPECT_EQ(-1, upInput->boundTexUnit());
    EXPECT_EQ(1, node.texUnitCount_);
    frameContext().makeCurrent();
    EXPECT_EQ(GL_TEXTURE0, integerOf(GL_ACTIVE_TEXTURE));
    EXPECT_EQ(0, integerOf(GL_CURRENT_PROGRAM));
    EXPECT_EQ(0, integerOf(GL_FRAMEBUFFER_BINDING));
    glActiveTexture(GL_TEXTURE1);
    EXPECT_EQ(0, integerOf(GL_TEXTURE_BINDING_2D));
    EXPECT_FALSE(glIsEnabled(GL_TEXTURE_2D));
    glActiveTexture(GL_TEXTURE0);
    host().makeCurrent();
}

TEST_F(BasicGLShaderFilterTest, GivesAnImageOnTwoInputsOneUnit) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(-2, 0, 9, 5), 3), ImageGPU::PIXEL_FORMAT_RGBA8);
    Texels const input(*upInput);
    ShaderNode node(shaderOf({"a", "b"}, "0.25*" + readInput("a") + "+0.5*" + readInput("b")), {"a", "b"});
    node.onPreProcessed_ = [&] { EXPECT_EQ(2, node.texUnitCount_); };
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    road.setInput(1, *upInput);
    Texels const actual(*road.run(world(-2, 0, 9, 5)));
    EXPECT_EQ(1, node.texUnitCount_);
    EXPECT_EQ(-1, upInput->boundTexUnit());
    Texels const expected = Texels(pixels(-2, 0, 9, 5)).fill([&](int x, int y) {
        Pixel pixel = input.at(x, y);
        for (double& value : pixel)
            value *= 0.75;
        return pixel;
    });
    expectTexels(actual, expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
}

TEST_F(BasicGLShaderFilterTest, RunsAProgramWithoutAnyOfTheUniforms) {
    ImageGPUPtr const upInput = textureImage(pixels(0, 0, 3, 3), ImageGPU::PIXEL_FORMAT_RGBA8);
    ShaderNode node("void main() { gl_FragColor = vec4(gl_TexCoord[0].xy, 8.0, 16.0) * 0.0625; }");
    node.outputPrecisionHintParameter().setValue(Hint::OUTPUT_PRECISION_16_BIT_FLOAT);
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    // The coordinate counts the output's own pixels, wherever it lies.
    Texels const actual(*road.run(world(1, 1, 2, 2)));
    EXPECT_EQ((Pixel{0.03125, 0.03125, 0.5, 1.0}), actual.at(1, 1));
    EXPECT_EQ((Pixel{0.09375, 0.03125, 0.5, 1.0}), actual.at(2, 1));
    EXPECT_EQ((Pixel{0.03125, 0.09375, 0.5, 1.0}), actual.at(1, 2));
}

TEST_F(BasicGLShaderFilterTest, ChoosesItsFormatByHintAndChannels) {
    struct Row {
        Hint eHint_;
        std::array<ImageGPU::tePixelFormat, 5> aFormats_; // for 0 to 4 channels
    };
    constexpr auto aRGB = [](ImageGPU::tePixelFormat eRGB, ImageGPU::tePixelFormat eRGBA) {
        return std::array<ImageGPU::tePixelFormat, 5>{eRGB, eRGB, eRGB, eRGB, eRGBA};
    };
    auto const a8 = aRGB(ImageGPU::PIXEL_FORMAT_RGB8, ImageGPU::PIXEL_FORMAT_RGBA8);
    Row const aRows[] = {
        {Hint::OUTPUT_PRECISION_8_BIT_INT, a8},
        {Hint::OUTPUT_PRECISION_16_BIT_INT,
         aRGB(ImageGPU::PIXEL_FORMAT_RGB16, ImageGPU::PIXEL_FORMAT_RGBA16)},
        {Hint::OUTPUT_PRECISION_16_BIT_FLOAT,
         aRGB(ImageGPU::PIXEL_FORMAT_RGB16F, ImageGPU::PIXEL_FORMAT_RGBA16F)},
        {Hint::OUTPUT_PRECISION_32_BIT_FLOAT, a8},
        {Hint::OUTPUT_PRECISION_DEFAULT, a8},
        {Hint::OUTPUT_PRECISION_UNDEFINED, a8},
    };
    auto const formatOf = [&](Hint eHint, int nChannels) {
        ShaderNode node(pWhite, {}, nChannels);
        node.setGeneratedRegion(world(0, 0, 4, 4));
        node.outputPrecisionHintParameter().setValue(eHint);
        ShaderRoad road(frameContext(), node);
        return road.run(world(0, 0, 4, 4))->pixelFormat();
    };
    for (Row const& row : aRows)
        for (int nChannels = 0; nChannels <= 4; ++nChannels)
            EXPECT_EQ(row.aFormats_[static_cast<std::size_t>(nChannels)], formatOf(row.eHint_, nChannels))
                << row.eHint_ << " " << nChannels;
    for (int const nChannels : {5, -1}) {
        ORVO_EXPECT_INTERNAL(formatOf(Hint::OUTPUT_PRECISION_8_BIT_INT, nChannels),
                             "Not implemented: Only 1/2/3/4 channels supported");
        ORVO_EXPECT_INTERNAL(formatOf(Hint::OUTPUT_PRECISION_16_BIT_FLOAT, nChannels),
                             "Not implemented: Only 1/2/3/4 channels supported in "
                             "GlyphcastFilterGPU::internalProcess()");
    }
    OGL::ExtensionManager::Instance()->overrideSupport(OGL::EXTENSION_ARB_HALF_FLOAT_PIXEL, false);
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGB32F, formatOf(Hint::OUTPUT_PRECISION_16_BIT_FLOAT, 3));
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGBA32F, formatOf(Hint::OUTPUT_PRECISION_16_BIT_FLOAT, 4));
}

TEST_F(BasicGLShaderFilterTest, RoundsItsTextureUpUnlessItIsToBeExact) {
    for (bool const bExact : {false, true}) {
        ImageGPUPtr const upInput = textureOf(Texels(pixels(0, 0, 5, 3)).fill([](int, int) {
            return Pixel{1, 1, 1, 1};
        }),
                                              ImageGPU::PIXEL_FORMAT_RGBA8);
        ShaderNode node(copyShader());
        node.bExactOutput_ = bExact;
        ShaderRoad road(frameContext(), node);
        road.setInput(0, *upInput);
        ImageGPU const* const pOutput = road.run(world(0, 0, 5, 3));
        EXPECT_EQ(bExact ? ExtentInPixelSpace(5, 3) : ExtentInPixelSpace(8, 4), pOutput->capacityExtent());
        EXPECT_EQ(ExtentInPixelSpace(5, 3), pOutput->extent());
        if (bExact)
            continue;
        ImageGPU whole(pixels(0, 0, 8, 4), const_cast<OGL::Texture2D*>(pOutput->texture()),
                       PixelExtentInWorldSpace());
        Texels const texture(whole);
        whole.forgetTexture();
        for (int y = 0; y < 4; ++y)
            for (int x = 0; x < 8; ++x)
                EXPECT_EQ(x < 5 && y < 3 ? 1.0 : 0.0, texture.at(x, y)[3]) << x << " " << y;
    }
}

TEST_F(BasicGLShaderFilterTest, HandsOnAnImageWithoutPixelsAndDrawsNothing) {
    for (PositionExtentInWorldSpace const& region :
         {world(3, 4, 0, 0), world(3, 4, 5, 0), world(3, 4, 0, 7)}) {
        ImageGPUPtr const upInput = textureImage(pixels(0, 0, 9, 9), ImageGPU::PIXEL_FORMAT_RGBA8);
        ShaderNode node(copyShader());
        ShaderRoad road(frameContext(), node);
        road.setInput(0, *upInput);
        auto const nAttached = GLHooks::calls("glFramebufferTexture2D");
        ImageGPU const* const pOutput = road.run(region);
        EXPECT_EQ(nAttached, GLHooks::calls("glFramebufferTexture2D"));
        ASSERT_NE(nullptr, pOutput);
        EXPECT_EQ(0U, pOutput->numberOfPixels());
        EXPECT_EQ(-1, upInput->boundTexUnit());
    }
}

TEST_F(BasicGLShaderFilterTest, PutsAnUndefinedRegionAtItsPosition) {
    ShaderNode node(pWhite, {});
    ShaderRoad road(frameContext(), node);
    ImageGPU const* const pOutput =
        road.run(PositionExtentInWorldSpace(PositionInWorldSpace(0, 0), ExtentInWorldSpace()));
    ASSERT_NE(nullptr, pOutput);
    EXPECT_EQ(pixels(0, 0, 0, 0), pOutput->positionExtent());
}

TEST_F(BasicGLShaderFilterTest, DrawsIntoABoundImageAndTouchesNothingElse) {
    ImageGPUPtr const upInput =
        textureOf(randomTexels(pixels(-2, -2, 9, 9), 9), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upTarget =
        textureOf(randomTexels(pixels(-4, -3, 11, 7), 10), ImageGPU::PIXEL_FORMAT_RGBA8, false);
    Texels const input(*upInput);
    Texels const before(*upTarget);
    ShaderNode node(copyShader());
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    road.runInto(*upTarget, world(-1, -2, 4, 5));
    Texels const region(pixels(-1, -2, 4, 5));
    Texels const expected = Texels(upTarget->positionExtent()).fill([&](int x, int y) {
        return region.contains(x, y) ? input.at(x, y) : before.at(x, y);
    });
    expectTexels(Texels(*upTarget), expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
    ORVO_EXPECT_INTERNAL(road.runInto(*upTarget, world(-2, -2, 9, 9)),
                         "Compute region lies outside the bound output image");
    expectTexels(Texels(*upTarget), expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
}

TEST_F(BasicGLShaderFilterTest, ReadsUniformArraysForOnePass) {
    ImageGPUPtr const upInput = textureImage(pixels(0, 0, 3, 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    std::array<float, 3> aFirst{0.25f, 100.0f, -3.5f};
    std::array<float, 2> aSecond{0.5f, 2.0f};
    ShaderNode node("uniform sampler1D first_sampler; uniform float first_delta;\n"
                    "uniform sampler1D second_sampler; uniform float second_delta;\n"
                    "void main() { gl_FragColor = vec4(\n"
                    "    texture1D(first_sampler, gl_TexCoord[0].x*first_delta).r,\n"
                    "    texture1D(second_sampler, 0.5*second_delta).r,\n"
                    "    texture1D(second_sampler, 1.5*second_delta).r, first_delta); }");
    node.outputPrecisionHintParameter().setValue(Hint::OUTPUT_PRECISION_16_BIT_FLOAT);
    node.onPreProcessed_ = [&] {
        node.addUniformArray("first", aFirst.data(), 3);
        node.addUniformArray("second", aSecond.data(), 2);
        EXPECT_EQ(4, node.texUnitCount_);
        EXPECT_EQ(2U, node.vspUniformArrays_.size());
    };
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    for (int iFrame = 0; iFrame < 2; ++iFrame) {
        Texels const actual(*road.run(world(0, 0, 3, 1)));
        for (int x = 0; x < 3; ++x) {
            EXPECT_EQ(double(aFirst[static_cast<std::size_t>(x)]), actual.at(x, 0)[0]);
            EXPECT_EQ(0.5, actual.at(x, 0)[1]);
            EXPECT_EQ(2.0, actual.at(x, 0)[2]);
            EXPECT_NEAR(1.0 / 3.0, actual.at(x, 0)[3], 0.0003);
        }
        EXPECT_EQ(1, node.texUnitCount_);
        EXPECT_TRUE(node.vspUniformArrays_.empty());
    }
}

TEST_F(BasicGLShaderFilterTest, LooksUniformsUpOnceALink) {
    ImageGPUPtr const upInput =
        textureOf(randomTexels(pixels(-1, -1, 7, 5), 5), ImageGPU::PIXEL_FORMAT_RGBA8);
    Texels const input(*upInput);
    ShaderNode node(copyShader());
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    // The sink holds the last frame's image while the next one is made: two textures in turn.
    road.run(world(-1, -1, 7, 5));
    road.run(world(-1, -1, 7, 5));
    auto const nLinks = GLHooks::calls("glLinkProgram");
    auto const nTextures = GLHooks::calls("glGenTextures");
    auto const nLookUps = GLHooks::calls("glGetUniformLocation");
    for (int i = 0; i < 3; ++i)
        expectTexels(Texels(*road.run(world(-1, -1, 7, 5))), input,
                     Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
    EXPECT_EQ(nLinks, GLHooks::calls("glLinkProgram"));
    EXPECT_EQ(nTextures, GLHooks::calls("glGenTextures"));
    EXPECT_EQ(nLookUps, GLHooks::calls("glGetUniformLocation"));

    // A program that was discarded, and one with its uniforms in other places.
    ShaderManagerOGL::Instance()->clearAll();
    expectTexels(Texels(*road.run(world(-1, -1, 7, 5))), input, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
    EXPECT_EQ(nLinks + 1, GLHooks::calls("glLinkProgram"));
    node.oProgram_.removeAllShaders();
    node.sFragmentSource_ =
        shaderOf({"src"}, readInput("src") + "+vec4(before[0]+before[3])", "uniform float before[4];\n");
    node.compilePrograms();
    expectTexels(Texels(*road.run(world(-1, -1, 7, 5))), input, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
}

TEST_F(BasicGLShaderFilterTest, ChainsItsImages) {
    // Each reads its right neighbour: over the edge of an image in a larger texture comes transparent black.
    ImageGPUPtr const upInput =
        textureOf(randomTexels(pixels(-3, 2, 11, 6), 6), ImageGPU::PIXEL_FORMAT_RGBA8);
    Texels const input(*upInput);
    std::string const sNext = shaderOf({"src"}, readInput("src", "vec2(src_pixelExtent.x, 0.0)"));
    ShaderNode first(sNext);
    ShaderNode second(sNext);
    ImageGPUOutput sink;
    feed(second, 0, first);
    feed(sink, 0, second);
    ShaderRoad road(frameContext(), first);
    road.controller().addNode(&second);
    road.controller().addNode(&sink);
    road.controller().setImageSink(sink);
    road.setInput(0, *upInput);
    road.launch(world(-3, 2, 11, 6));
    Texels const expected =
        Texels(pixels(-3, 2, 11, 6)).fill([&](int x, int y) { return input.at(x + 2, y); });
    expectTexels(Texels(*sink.getImageGPU()), expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
    sink.disconnect();
}

} // namespace
