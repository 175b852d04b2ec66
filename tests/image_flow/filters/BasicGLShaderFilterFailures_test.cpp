// What a shader filter refuses, and what it leaves behind where something fails: the next frame is right.

#include "tests/image_flow/support/ShaderRoad.h"

#include <array>
#include <string>

#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/image_runtime/TexturePool.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;

constexpr char const* pWhiteShader = "void main() { gl_FragColor = vec4(1.0); }";

class BasicGLShaderFilterFailuresTest : public ShaderFlowTest {
protected:
    static std::string copyShader() { return shaderOf({"src"}, readInput("src")); }
    static int boundTexture() {
        GLint value = 0;
        glGetIntegerv(GL_TEXTURE_BINDING_2D, &value);
        return value;
    }
    static long textures() { return GLHooks::objects()["texture"]; }
};

TEST_F(BasicGLShaderFilterFailuresTest, RefusesAnImageThatSomebodyElseHasBound) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 3, 3), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    ShaderNode node(copyShader());
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    frameContext().makeCurrent();
    upInput->bind(3);
    host().makeCurrent();
    ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 3, 3)), "texUnitCount_ == firstTexUnit");
    EXPECT_EQ(-1, upInput->boundTexUnit());
    EXPECT_EQ(1, node.texUnitCount_);
    expectTexels(Texels(*road.run(world(0, 0, 3, 3))), Texels(*upInput),
                 Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
}

/// Stands in for the driver's answer to a validation.
PFNGLGETPROGRAMIVPROC pGetProgramiv = nullptr;
int nValidations = 0;
void refuseValidation(GLuint program, GLenum what, GLint* pValue) {
    pGetProgramiv(program, what, pValue);
    if (what == GL_VALIDATE_STATUS) {
        ++nValidations;
        *pValue = GL_FALSE;
    }
}

TEST_F(BasicGLShaderFilterFailuresTest, DrawsAlsoWithAProgramThatDoesNotValidate) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 7, 5), 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ShaderNode node(copyShader());
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    pGetProgramiv = epoxy_glGetProgramiv;
    epoxy_glGetProgramiv = &refuseValidation;
    ImageGPU const* const pOutput = road.run(world(0, 0, 7, 5));
    epoxy_glGetProgramiv = pGetProgramiv;
    EXPECT_EQ(1, nValidations);
    expectTexels(Texels(*pOutput), Texels(*upInput), Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
}

TEST_F(BasicGLShaderFilterFailuresTest, SaysWhenItIsRunWhyItDidNotCompile) {
    ImageGPUPtr const upInput = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ShaderNode node("void main() { gl_FragColor = nonsense; }");
    EXPECT_FALSE(node.willRunInHardware());
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    try {
        road.run(world(0, 0, 4, 4));
        ADD_FAILURE();
    } catch (OGL::ExceptionOGL const& exception) {
        EXPECT_EQ(0U, std::string(exception.message()).find("Fragment shader did not compile: "));
    }
    EXPECT_EQ(-1, upInput->boundTexUnit());
}

TEST_F(BasicGLShaderFilterFailuresTest, RefusesAnInputWithoutData) {
    ShaderNode node(copyShader());
    ShaderRoad road(frameContext(), node);
    ORVO_EXPECT_INTERNAL(node.preProcess(), "Enforce pImage != NULL");
    EXPECT_EQ(1, node.texUnitCount_);
}

TEST_F(BasicGLShaderFilterFailuresTest, RefusesToDrawBeforeItsPreProcess) {
    class Bare : public ShaderNode {
    public:
        Bare() : ShaderNode(pWhiteShader, {}) {}
        using BasicGLShaderFilter::internalProcess;
    } node;
    ORVO_EXPECT_INTERNAL(node.internalProcess(), "Enforce pOutputImage_ != NULL");
}

TEST_F(BasicGLShaderFilterFailuresTest, RefusesAnInfiniteRegion) {
    ShaderNode node(pWhiteShader, {});
    node.computeRegionParameter().setValue(infiniteWorld());
    ORVO_EXPECT_INTERNAL(node.preProcess(), "!outRect.isInfinite()");
}

TEST_F(BasicGLShaderFilterFailuresTest, SaysWhatIsWrongWithTheFramebuffer) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 4, 4), 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ShaderNode node(copyShader(), {"src"}, 3);
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    {
        GLCallFailure const failure("glCheckFramebufferStatus", 1);
        ORVO_EXPECT_OGL(road.run(world(0, 0, 4, 4)),
                        "Unsupported format (GL_TEXTURE_2D,GL_RGB8) for framebuffer object rendering.");
    }
    {
        GLCallFailure const failure("glFramebufferTexture2D", 1);
        ORVO_EXPECT_OGL(road.run(world(0, 0, 4, 4)),
                        "Framebuffer attachment error: GL_FRAMEBUFFER_INCOMPLETE_MISSING_ATTACHMENT");
    }
    frameContext().makeCurrent();
    drainErrors();
    host().makeCurrent();
    EXPECT_EQ(-1, upInput->boundTexUnit());
    EXPECT_NE(nullptr, road.run(world(0, 0, 4, 4)));
}

TEST_F(BasicGLShaderFilterFailuresTest, AFailedFrameDoesNotSpoilTheNext) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 9, 5), 11), ImageGPU::PIXEL_FORMAT_RGBA8);
    Texels const input(*upInput);
    std::array<float, 2> aOne{1.0f, 1.0f};
    ShaderNode node(shaderOf({"src"}, readInput("src") + "*texture1D(one_sampler, 0.5)",
                             "uniform sampler1D one_sampler;\n"));
    node.onPreProcessed_ = [&] { node.addUniformArray("one", aOne.data(), 2); };
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    // Runs a frame with the n-th call of an entry point failing, then one without; whether one failed.
    auto const failedCall = [&](std::string const& sName, std::uint64_t n) {
        SCOPED_TRACE(sName + " " + std::to_string(n));
        ShaderManagerOGL::Instance()->clearAll();
        TexturePool::Instance()->clearAll();
        bool bFailed = false;
        {
            GLCallFailure const failure(sName, n);
            try {
                road.run(world(0, 0, 9, 5));
            } catch (LogicalException const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bFailed = failure.hasFired();
        }
        EXPECT_EQ(0U, drainErrors());
        EXPECT_EQ(0, boundTexture());
        expectTexels(Texels(*road.run(world(0, 0, 9, 5))), input,
                     Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
        EXPECT_EQ(-1, upInput->boundTexUnit());
        EXPECT_EQ(1, node.texUnitCount_);
        return bFailed;
    };
    for (char const* pName : {"glGenTextures", "glTexImage2D", "glTexImage1D", "glTexSubImage1D",
                              "glCreateProgram", "glCreateShader", "glCompileShader", "glLinkProgram",
                              "glFramebufferTexture2D", "glCheckFramebufferStatus"}) {
        std::uint64_t n = 1;
        while (n < 20 && failedCall(pName, n))
            ++n;
        EXPECT_LT(1U, n) << pName;
        EXPECT_GT(20U, n) << pName;
    }
    // The frame's own context, the pool's, and back from there.
    for (std::uint64_t n = 1; n <= 3; ++n)
        EXPECT_TRUE(failedCall("eglMakeCurrent", n)) << n;
}

TEST_F(BasicGLShaderFilterFailuresTest, AContextThatGoesInTheMidstOfAPassDoesNotSpoilTheNext) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 3, 3), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    ShaderNode node(copyShader());
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    node.onPreProcessed_ = [this] { host().release(); };
    EXPECT_THROW(road.run(world(0, 0, 3, 3)), ExceptionBase);
    EXPECT_EQ(-1, upInput->boundTexUnit());
    host().makeCurrent();
    node.onPreProcessed_ = nullptr;
    expectTexels(Texels(*road.run(world(0, 0, 3, 3))), Texels(*upInput),
                 Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
}

TEST_F(BasicGLShaderFilterFailuresTest, AFailureOfASubclassDoesNotSpoilTheNextFrame) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 9, 5), 12), ImageGPU::PIXEL_FORMAT_RGBA8);
    std::array<float, 2> aOne{1.0f, 1.0f};
    ShaderNode node(copyShader());
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    for (bool const bFlush : {true, false}) {
        node.onPreProcessed_ = [&] {
            node.addUniformArray("one", aOne.data(), 2);
            ORVO_FAIL("in between");
        };
        ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 9, 5)), "in between");
        if (bFlush) {
            road.controller().flushGraph();
            EXPECT_EQ(-1, upInput->boundTexUnit());
            EXPECT_EQ(1, node.texUnitCount_);
            EXPECT_TRUE(node.vspUniformArrays_.empty());
        }
        node.onPreProcessed_ = nullptr;
        expectTexels(Texels(*road.run(world(0, 0, 9, 5))), Texels(*upInput),
                     Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
    }
}

TEST_F(BasicGLShaderFilterFailuresTest, DiesInTheMidstOfAPassWithoutLeavingAnything) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 9, 5), 12), ImageGPU::PIXEL_FORMAT_RGBA8);
    long const nTextures = textures();
    {
        ShaderNode node(copyShader());
        ShaderRoad road(frameContext(), node);
        road.setInput(0, *upInput);
        node.onPreProcessed_ = [] { ORVO_FAIL("in between"); };
        ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 9, 5)), "in between");
    }
    EXPECT_EQ(-1, upInput->boundTexUnit());
    TexturePool::Instance()->clearAll();
    EXPECT_EQ(nTextures, textures());
}

} // namespace
