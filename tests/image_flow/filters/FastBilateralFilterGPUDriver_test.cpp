// What the bilateral filter on OpenGL asks of a driver: what it tries when it is made, what it refuses to run
// without, and the calls of a frame.
#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"

#include "orvo/ogl/ExtensionManager.h"
#include "tests/image_flow/support/GPUBilateralReference.h"
#include "tests/support/Expect.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;

class FastBilateralFilterGPUDriverTest : public ShaderFlowTest {
protected:
    void SetUp() override {
        ShaderFlowTest::SetUp();
        upImage_ = textureOf(gpuBilateral::scene(pixels(0, 0, 9, 7), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    }
    void TearDown() override {
        upImage_.reset();
        ShaderFlowTest::TearDown();
    }

    /// The filter must not run: neither by its own account nor when it is told to.
    void expectRefusal(FastBilateralFilterGPU& filter) {
        EXPECT_EQ(GLenum(GL_NO_ERROR), glGetError());
        EXPECT_FALSE(filter.willRunInHardware());
        {
            ShaderRoad road(frameContext(), filter);
            road.setInput(0, *upImage_);
            for (int frame = 0; frame < 2; ++frame) {
                ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 9, 7)), "Enforce pFramebuffer_ != NULL");
                EXPECT_EQ(-1, upImage_->boundTexUnit());
            }
        }
        ImageGPUPtr const upTarget =
            textureOf(gpuBilateral::scene(pixels(0, 0, 9, 7), 2), ImageGPU::PIXEL_FORMAT_RGBA8);
        std::vector<unsigned char> const aBefore = readTexels(*upTarget);
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upImage_);
        ORVO_EXPECT_INTERNAL(road.runInto(*upTarget, world(0, 0, 9, 7)), "Enforce pFramebuffer_ != NULL");
        EXPECT_EQ(aBefore, readTexels(*upTarget));
    }

    /// Size in bytes and usage of each buffer that there is.
    static std::multimap<int, unsigned> buffers() {
        std::multimap<int, unsigned> aBuffers;
        for (GLuint nName = 1; nName < 1000; ++nName) {
            if (glIsBuffer(nName) == GL_FALSE) {
                continue;
            }
            GLint nSize = 0;
            GLint nUsage = 0;
            glBindBuffer(GL_ARRAY_BUFFER, nName);
            glGetBufferParameteriv(GL_ARRAY_BUFFER, GL_BUFFER_SIZE, &nSize);
            glGetBufferParameteriv(GL_ARRAY_BUFFER, GL_BUFFER_USAGE, &nUsage);
            aBuffers.emplace(nSize, static_cast<unsigned>(nUsage));
        }
        glBindBuffer(GL_ARRAY_BUFFER, 0);
        return aBuffers;
    }

    ImageGPUPtr upImage_;
};

TEST_F(FastBilateralFilterGPUDriverTest, RefusesToRunAfterAProbeThatFailed) {
    for (char const* pName : {"glGenFramebuffers", "glGenTextures", "glTexImage2D", "glFramebufferTexture2D",
                              "glCheckFramebufferStatus"}) {
        SCOPED_TRACE(pName);
        std::unique_ptr<FastBilateralFilterGPU> upFilter;
        {
            GLCallFailure const failure(pName, 1);
            upFilter = std::make_unique<FastBilateralFilterGPU>();
            EXPECT_TRUE(failure.hasFired());
        }
        expectRefusal(*upFilter);
    }
}

TEST_F(FastBilateralFilterGPUDriverTest, RefusesToRunWhereOneOfItsProgramsFailed) {
    for (char const* pName : {"glCompileShader", "glLinkProgram"}) {
        int nFailed = 0;
        for (bool bMore = true; bMore;) {
            std::unique_ptr<FastBilateralFilterGPU> upFilter;
            {
                GLCallFailure const failure(pName, static_cast<std::uint64_t>(nFailed + 1));
                upFilter = std::make_unique<FastBilateralFilterGPU>();
                bMore = failure.hasFired();
            }
            if (bMore) {
                SCOPED_TRACE(std::string(pName) + " number " + std::to_string(++nFailed));
                ASSERT_LT(nFailed, 100);
                expectRefusal(*upFilter);
            } else {
                EXPECT_TRUE(upFilter->willRunInHardware());
            }
        }
        EXPECT_GE(nFailed, 6) << pName; // once for each program at the least
    }
}

TEST_F(FastBilateralFilterGPUDriverTest, RefusesToRunOnADriverThatLacksWhatItNeeds) {
    OGL::ExtensionManager& manager = *OGL::ExtensionManager::Instance();
    for (auto const extension : {OGL::EXTENSION_ARB_TEXTURE_FLOAT, OGL::EXTENSION_APPLE_FLOAT_PIXELS,
                                 OGL::EXTENSION_ATI_TEXTURE_FLOAT}) {
        manager.overrideSupport(extension, false);
    }
    FastBilateralFilterGPU filter;
    manager.clearOverrides();
    expectRefusal(filter);
}

TEST_F(FastBilateralFilterGPUDriverTest, RefusesToRunWhenMadeWithoutAContext) {
    host().release();
    FastBilateralFilterGPU filter;
    host().makeCurrent();
    expectRefusal(filter);
}

TEST_F(FastBilateralFilterGPUDriverTest, RunsWhereAHostLeftAnErrorPending) {
    glEnable(GL_NONE);
    EXPECT_TRUE(FastBilateralFilterGPU().willRunInHardware());
    EXPECT_EQ(GLenum(GL_NO_ERROR), glGetError());
}

TEST_F(FastBilateralFilterGPUDriverTest, LeavesTheFramebuffersOfAHostBound) {
    std::array<GLuint, 2> aNames{};
    glGenFramebuffers(2, aNames.data());
    struct Case {
        GLuint nDraw_;
        GLuint nRead_;
    };
    for (Case const& c :
         {Case{aNames[0], aNames[0]}, Case{aNames[0], aNames[1]}, Case{aNames[1], 0}, Case{0, aNames[1]}}) {
        SCOPED_TRACE(std::to_string(c.nDraw_) + " " + std::to_string(c.nRead_));
        glBindFramebuffer(GL_DRAW_FRAMEBUFFER, c.nDraw_);
        glBindFramebuffer(GL_READ_FRAMEBUFFER, c.nRead_);
        GLState const before = GLState::capture();
        EXPECT_TRUE(FastBilateralFilterGPU().willRunInHardware());
        EXPECT_EQ("", before.differencesTo(GLState::capture()));
        for (char const* pName : {"glTexImage2D", "glFramebufferTexture2D", "glCheckFramebufferStatus"}) {
            GLCallFailure const failure(pName, 1);
            EXPECT_FALSE(FastBilateralFilterGPU().willRunInHardware());
            EXPECT_EQ("", before.differencesTo(GLState::capture())) << pName;
        }
    }
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
    glDeleteFramebuffers(2, aNames.data());
}

TEST_F(FastBilateralFilterGPUDriverTest, OnlyOneHintWidensTheOutput) {
    struct Case {
        ImageFilter::teOutputPrecisionHint hint_;
        ImageGPU::tePixelFormat format_;
    };
    for (ImageGPU::tePixelFormat const eInput :
         {ImageGPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA16, ImageGPU::PIXEL_FORMAT_RGBA32F}) {
        ImageGPUPtr const upInput = textureOf(gpuBilateral::scene(pixels(0, 0, 9, 7), 1), eInput);
        for (Case const& c :
             {Case{ImageFilter::OUTPUT_PRECISION_8_BIT_INT, ImageGPU::PIXEL_FORMAT_RGBA8},
              Case{ImageFilter::OUTPUT_PRECISION_16_BIT_INT, ImageGPU::PIXEL_FORMAT_RGBA8},
              Case{ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT, ImageGPU::PIXEL_FORMAT_RGBA16F},
              Case{ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT, ImageGPU::PIXEL_FORMAT_RGBA8},
              Case{ImageFilter::OUTPUT_PRECISION_DEFAULT, ImageGPU::PIXEL_FORMAT_RGBA8},
              Case{ImageFilter::OUTPUT_PRECISION_UNDEFINED, ImageGPU::PIXEL_FORMAT_RGBA8}}) {
            FastBilateralFilterGPU filter;
            filter.outputPrecisionHintParameter().setValue(c.hint_);
            ShaderRoad road(frameContext(), filter);
            road.setInput(0, *upInput);
            ImageGPU const* const pResult = road.run(world(0, 0, 9, 7));
            ASSERT_NE(nullptr, pResult);
            EXPECT_EQ(c.format_, pResult->pixelFormat()) << "hint " << c.hint_ << ", input " << eInput;
        }
    }
}

TEST_F(FastBilateralFilterGPUDriverTest, PositionsAreForDrawingOnceMadeAndColoursForEveryFrame) {
    ASSERT_TRUE(buffers().empty());
    FastBilateralFilterGPU filter;
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage_);
    ASSERT_NE(nullptr, road.run(world(0, 0, 9, 7)));
    // Two and three floats for each of 63 pixels.
    EXPECT_EQ((std::multimap<int, unsigned>{{504, GL_STATIC_DRAW}, {756, GL_DYNAMIC_DRAW}}), buffers());
    ASSERT_NE(nullptr, road.run(world(0, 0, 4, 2)));
    EXPECT_EQ((std::multimap<int, unsigned>{{64, GL_STATIC_DRAW}, {96, GL_DYNAMIC_DRAW}}), buffers());
}

TEST_F(FastBilateralFilterGPUDriverTest, EachStageIsFinishedBeforeTheNextReads) {
    FastBilateralFilterGPU filter;
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage_);
    road.run(world(0, 0, 9, 7));
    auto const finishesOf = [&](PositionExtentInWorldSpace const& region) {
        std::uint64_t const nBefore = GLHooks::calls("glFinish");
        EXPECT_NE(nullptr, road.run(region));
        return GLHooks::calls("glFinish") - nBefore;
    };
    // The copy of the input, the points, three blurs and the pixels of the output.
    EXPECT_EQ(6U, finishesOf(world(0, 0, 9, 7)));
    filter.colorize().setValue(true);
    EXPECT_EQ(6U, finishesOf(world(0, 0, 9, 7)));
    // Without pixels only the grid is drawn.
    EXPECT_EQ(4U, finishesOf(PositionExtentInWorldSpace()));
}

} // namespace
