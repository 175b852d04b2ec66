#include "orvo/image_flow/filters/SimpleFilterGPU.h"

#include "tests/image_flow/support/ShaderRoad.h"

#include <array>
#include <functional>
#include <limits>
#include <vector>

#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/ScopedContextWrapper.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using Hint = ImageFilter::teOutputPrecisionHint;

/// Draws its input as it is with fixed function, with all that a subclass can reach made public.
class CopyNode : public SimpleFilterGPU {
public:
    CopyNode() : SimpleFilterGPU("CopyNode") {}
    explicit CopyNode(bool bFlag) : SimpleFilterGPU("CopyNode", bFlag) {}
    ~CopyNode() override { disconnect(); }

    void internalProcess() override {
        preRender();
        if (onRendering_)
            onRendering_();
        ImageGPU const* const pInput = inputImageGPU(0);
        if (pInput != nullptr && hasPixelsToDraw()) {
            pInput->bind(0);
            pInput->setFilter(GL_NEAREST, GL_NEAREST);
            pInput->setWrap(GL_CLAMP_TO_BORDER, GL_CLAMP_TO_BORDER);
            constexpr std::array<float, 4> aZero{};
            pInput->setBorderColor(aZero.data());
            pInput->setEnvironment(OGL::TextureUnit::ENVIRONMENT_REPLACE);
        }
        renderAndTearDown();
    }

    using SimpleFilterGPU::o_Rectangle;
    using SimpleFilterGPU::oInput_;
    using SimpleFilterGPU::oOutput_;
    using SimpleFilterGPU::pFramebuffer_;
    using SimpleFilterGPU::pOutputImage_;
    using SimpleFilterGPU::preRender;
    using SimpleFilterGPU::renderAndTearDown;

    std::function<void()> onRendering_;
};

class SimpleFilterGPUTest : public ShaderFlowTest {
protected:
    /// Runs a node that has no input over a region, in the frames' context.
    void runAlone(CopyNode& node, PositionExtentInWorldSpace const& region) {
        OGL::ScopedContextWrapper const restore;
        frameContext().makeCurrent();
        ImageFlowController controller;
        controller.setContextGPU(frameContext());
        controller.addNode(&node);
        node.computeRegionParameter().setValue(region);
        node.internalProcess();
    }

    static long textures() { return GLHooks::objects()["texture"]; }
};

TEST_F(SimpleFilterGPUTest, HasTheStatedConnectors) {
    CopyNode node;
    EXPECT_EQ("CopyNode", node.name());
    ASSERT_EQ(1U, node.numberOfImageInputs());
    EXPECT_EQ("InputImage", node.imageInput(0)->name());
    EXPECT_EQ("OutputImage", node.imageOutput()->name());
    EXPECT_EQ(ORVO_TARGET_GL, node.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_GL, node.getOutputTargetPlatform());
    EXPECT_EQ(Hint::OUTPUT_PRECISION_DEFAULT, node.outputPrecisionHintParameter().value());
    EXPECT_EQ(PositionInWorldSpace(0.0f, 0.0f), node.o_Rectangle.lowerLeft());
    EXPECT_EQ(ExtentInWorldSpace(0.0f, 0.0f), node.o_Rectangle.size());
    EXPECT_TRUE(node.o_Rectangle.hasTextureCoordinates());
    EXPECT_EQ(0U, node.rangeToProcess().items);

    CopyNode const other(true);
    EXPECT_EQ(0U, other.numberOfImageInputs());
    EXPECT_EQ(0U, other.numberOfInputs());
    EXPECT_EQ("zInputName", other.oInput_.name());
    EXPECT_EQ("OutputImage", other.imageOutput()->name());
}

TEST_F(SimpleFilterGPUTest, DrawsThePartOfItsInputThatIsAskedFor) {
    struct Row {
        PositionExtentInPixelSpace oInput_;
        PixelExtentInWorldSpace oPixelExtent_;
        PositionExtentInPixelSpace oOutput_;
        bool bExactInput_;
    };
    Row const aRows[] = {
        {pixels(0, 0, 13, 7), {1.0f, 1.0f}, pixels(0, 0, 13, 7), true},
        {pixels(0, 0, 13, 7), {1.0f, 1.0f}, pixels(0, 0, 13, 7), false},
        {pixels(-9, -5, 17, 11), {1.0f, 1.0f}, pixels(-6, -4, 9, 8), false},
        {pixels(5, -20, 17, 11), {2.0f, 0.5f}, pixels(8, -17, 14, 5), true},
    };
    for (ImageGPU::tePixelFormat const format :
         {ImageGPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA16, ImageGPU::PIXEL_FORMAT_RGBA16F,
          ImageGPU::PIXEL_FORMAT_RGBA32F}) {
        for (Row const& row : aRows) {
            CopyNode node;
            ShaderRoad road(frameContext(), node);
            ImageGPUPtr const upInput =
                textureOf(randomTexels(row.oInput_, 7, row.oPixelExtent_), format, row.bExactInput_);
            Texels const input(*upInput);
            road.setInput(0, *upInput);
            ImageGPU const* const pOutput = road.run(pixelToWorldSpace(row.oOutput_, row.oPixelExtent_));
            ASSERT_NE(nullptr, pOutput);
            EXPECT_EQ(format, pOutput->pixelFormat());
            EXPECT_EQ(row.oPixelExtent_, pOutput->pixelExtent());
            Texels const expected =
                Texels(row.oOutput_, row.oPixelExtent_).fill([&](int x, int y) { return input.at(x, y); });
            expectTexels(Texels(*pOutput), expected, Precision::of(format));
            EXPECT_EQ(-1, upInput->boundTexUnit());
        }
    }
}

TEST_F(SimpleFilterGPUTest, ChoosesItsFormatByTheHint) {
    struct Row {
        Hint eHint_;
        ImageGPU::tePixelFormat eFormat_;
    };
    constexpr Row aRows[] = {{Hint::OUTPUT_PRECISION_8_BIT_INT, ImageGPU::PIXEL_FORMAT_RGBA8},
                             {Hint::OUTPUT_PRECISION_16_BIT_INT, ImageGPU::PIXEL_FORMAT_RGBA16},
                             {Hint::OUTPUT_PRECISION_16_BIT_FLOAT, ImageGPU::PIXEL_FORMAT_RGBA16F}};
    ImageGPUPtr const upInput = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGB32F);
    for (Row const& row : aRows) {
        CopyNode node;
        ShaderRoad road(frameContext(), node);
        road.setInput(0, *upInput);
        node.outputPrecisionHintParameter().setValue(row.eHint_);
        EXPECT_EQ(row.eFormat_, road.run(world(0, 0, 4, 4))->pixelFormat()) << row.eHint_;
    }
    for (Hint const eHint : {Hint::OUTPUT_PRECISION_32_BIT_FLOAT, Hint::OUTPUT_PRECISION_UNDEFINED}) {
        CopyNode node;
        ShaderRoad road(frameContext(), node);
        road.setInput(0, *upInput);
        node.outputPrecisionHintParameter().setValue(eHint);
        ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 4, 4)), "Not implemented: Unknown outputPrecisionHint");
    }
}

TEST_F(SimpleFilterGPUTest, KeepsTheFormatOfItsInputByDefault) {
    for (ImageGPU::tePixelFormat const format : aTextureFormats) {
        ImageGPUPtr const upInput = textureImage(pixels(0, 0, 4, 4), format);
        CopyNode node;
        ShaderRoad road(frameContext(), node);
        road.setInput(0, *upInput);
        EXPECT_EQ(format, road.run(world(0, 0, 4, 4))->pixelFormat());
    }
}

TEST_F(SimpleFilterGPUTest, MakesEightBitPixelsOfUnitSizeWithoutAnInput) {
    CopyNode node(true);
    runAlone(node, world(-2, 3, 5, 7));
    ImageGPU const& output = *node.oOutput_;
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGBA8, output.pixelFormat());
    EXPECT_EQ(pixels(-2, 3, 5, 7), output.positionExtent());
    EXPECT_EQ(PixelExtentInWorldSpace(1.0f, 1.0f), output.pixelExtent());
    node.flushOutputs();
}

TEST_F(SimpleFilterGPUTest, HandsOnAnImageWithoutPixelsAndDrawsNothing) {
    struct Row {
        PositionExtentInWorldSpace oRegion_;
        PositionExtentInPixelSpace oRectangle_;
    };
    Row const aRows[] = {
        {world(3, 4, 0, 0), pixels(3, 4, 0, 0)},
        {world(3, 4, 5, 0), pixels(3, 4, 0, 0)},
        {PositionExtentInWorldSpace(PositionInWorldSpace(-3, 4), ExtentInWorldSpace()), pixels(-3, 4, 0, 0)},
    };
    for (Row const& row : aRows) {
        CopyNode node(true);
        auto const nAttached = GLHooks::calls("glFramebufferTexture2D");
        runAlone(node, row.oRegion_);
        EXPECT_EQ(nAttached, GLHooks::calls("glFramebufferTexture2D"));
        ASSERT_TRUE(node.oOutput_.hasData());
        EXPECT_EQ(row.oRectangle_.position(), node.oOutput_->position());
        EXPECT_EQ(0U, node.oOutput_->numberOfPixels());
        node.flushOutputs();
    }
}

TEST_F(SimpleFilterGPUTest, RefusesAnInfiniteRegion) {
    CopyNode node(true);
    ORVO_EXPECT_INTERNAL(runAlone(node, infiniteWorld()), "!outRect.isInfinite()");
    EXPECT_FALSE(node.oOutput_.hasData());
}

TEST_F(SimpleFilterGPUTest, NeedsAControllerWithAContext) {
    CopyNode node(true);
    node.computeRegionParameter().setValue(world(0, 0, 4, 4));
    ORVO_EXPECT_INTERNAL(node.internalProcess(), "Enforce pController != NULL");
    ImageFlowController controller;
    controller.addNode(&node);
    ORVO_EXPECT_INTERNAL(node.internalProcess(), "Enforce pFramebuffer_ != NULL");
    EXPECT_EQ(nullptr, node.pOutputImage_);
    ORVO_EXPECT_INTERNAL(node.renderAndTearDown(), "Enforce pOutputImage_ != NULL");
}

TEST_F(SimpleFilterGPUTest, SetsUpQuadMatricesAndViewportByTheCapacities) {
    // The input's texture is 16 by 8 pixels, the output's 8 by 4.
    ImageGPUPtr const upInput =
        textureOf(randomTexels(pixels(-3, 2, 13, 7), 8), ImageGPU::PIXEL_FORMAT_RGBA8, false);
    CopyNode node;
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    bool bSeen = false;
    node.onRendering_ = [&] {
        bSeen = true;
        EXPECT_EQ(ExtentInPixelSpace(8, 4), node.pOutputImage_->capacityExtent());
        EXPECT_EQ(PositionInWorldSpace(0.0f, 0.0f), node.o_Rectangle.lowerLeft());
        EXPECT_EQ(ExtentInWorldSpace(5.0f, 3.0f), node.o_Rectangle.size());
        // (-1 + 3) / 16, (5 - 1 + 3) / 16, (4 - 2) / 8, (3 + 4 - 2) / 8
        std::vector<float2> const aExpected{
            {0.125f, 0.25f}, {0.4375f, 0.25f}, {0.4375f, 0.625f}, {0.125f, 0.625f}};
        EXPECT_EQ(aExpected, std::vector<float2>(node.o_Rectangle.textureCoordinatesBegin(),
                                                 node.o_Rectangle.textureCoordinatesEnd()));
        std::array<GLint, 4> aViewport{};
        glGetIntegerv(GL_VIEWPORT, aViewport.data());
        EXPECT_EQ((std::array<GLint, 4>{0, 0, 8, 4}), aViewport);
        std::array<GLfloat, 16> aMatrix{};
        glGetFloatv(GL_PROJECTION_MATRIX, aMatrix.data());
        EXPECT_EQ((std::array<GLfloat, 16>{0.25f, 0, 0, 0, 0, 0.5f, 0, 0, 0, 0, -1, 0, -1, -1, 0, 1}),
                  aMatrix);
        glGetFloatv(GL_MODELVIEW_MATRIX, aMatrix.data());
        EXPECT_EQ((std::array<GLfloat, 16>{1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1}), aMatrix);
        GLint nMode = 0;
        glGetIntegerv(GL_MATRIX_MODE, &nMode);
        EXPECT_EQ(GL_MODELVIEW, nMode);
    };
    road.run(world(-1, 4, 5, 3));
    EXPECT_TRUE(bSeen);
}

TEST_F(SimpleFilterGPUTest, BlackensItsTextureBeyondTheImage) {
    ImageGPUPtr const upInput = textureOf(Texels(pixels(0, 0, 5, 3)).fill([](int, int) {
        return Pixel{1, 1, 1, 1};
    }),
                                          ImageGPU::PIXEL_FORMAT_RGBA8);
    {
        // A texture of the size class with other content waits in the pool.
        ImageGPUPtr const upOther = textureOf(Texels(pixels(0, 0, 8, 4)).fill([](int, int) {
            return Pixel{1, 1, 1, 1};
        }),
                                              ImageGPU::PIXEL_FORMAT_RGBA8);
    }
    CopyNode node;
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    auto const nTextures = GLHooks::calls("glGenTextures");
    ImageGPU const* const pOutput = road.run(world(0, 0, 5, 3));
    EXPECT_EQ(nTextures, GLHooks::calls("glGenTextures"));
    ImageGPU whole(pixels(0, 0, 8, 4), const_cast<OGL::Texture2D*>(pOutput->texture()),
                   PixelExtentInWorldSpace());
    Texels const texture(whole);
    whole.forgetTexture();
    for (int y = 0; y < 4; ++y)
        for (int x = 0; x < 8; ++x)
            EXPECT_EQ(x < 5 && y < 3 ? 1.0 : 0.0, texture.at(x, y)[3]) << x << " " << y;
}

TEST_F(SimpleFilterGPUTest, DrawsIntoABoundImageAndTouchesNothingElse) {
    ImageGPUPtr const upInput =
        textureOf(randomTexels(pixels(-2, -2, 9, 9), 9), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upTarget =
        textureOf(randomTexels(pixels(-4, -3, 11, 7), 10), ImageGPU::PIXEL_FORMAT_RGBA8, false);
    Texels const input(*upInput);
    Texels const before(*upTarget);
    CopyNode node;
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    road.runInto(*upTarget, world(-1, -2, 4, 5));
    Texels const region(pixels(-1, -2, 4, 5));
    Texels const expected = Texels(upTarget->positionExtent()).fill([&](int x, int y) {
        return region.contains(x, y) ? input.at(x, y) : before.at(x, y);
    });
    expectTexels(Texels(*upTarget), expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
    EXPECT_EQ(upTarget.get(), node.oOutput_.get());
}

TEST_F(SimpleFilterGPUTest, RefusesARegionOutsideTheBoundImage) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 9, 9), 9), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upTarget =
        textureOf(randomTexels(pixels(0, 0, 5, 5), 10), ImageGPU::PIXEL_FORMAT_RGBA8);
    Texels const before(*upTarget);
    CopyNode node;
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    ORVO_EXPECT_INTERNAL(road.runInto(*upTarget, world(0, 0, 6, 5)),
                         "Compute region lies outside the bound output image");
    EXPECT_EQ("", differences(Texels(*upTarget), before, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
    road.runInto(*upTarget, world(0, 0, 5, 5));
    EXPECT_NE("", differences(Texels(*upTarget), before, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
}

TEST_F(SimpleFilterGPUTest, SaysWhatIsWrongWithTheFramebuffer) {
    CopyNode node(true);
    try {
        GLCallFailure const failure("glCheckFramebufferStatus", 1);
        runAlone(node, world(0, 0, 4, 4));
        ADD_FAILURE();
    } catch (OGL::ExceptionOGL const& exception) {
        EXPECT_STREQ("Unsupported format (GL_TEXTURE_2D,GL_RGBA8) for framebuffer object rendering.",
                     exception.message());
        EXPECT_EQ(36061U, exception.glError());
    }
    EXPECT_FALSE(node.oOutput_.hasData());
    {
        GLCallFailure const failure("glFramebufferTexture2D", 1);
        ORVO_EXPECT_OGL(runAlone(node, world(0, 0, 4, 4)),
                        "Framebuffer attachment error: GL_FRAMEBUFFER_INCOMPLETE_MISSING_ATTACHMENT");
    }
    EXPECT_EQ(nullptr, node.pFramebuffer_);
    // The error that the driver reported with it is the controller's to sweep up; here nobody did.
    OGL::ScopedContextWrapper const restore;
    frameContext().makeCurrent();
    drainErrors();
    GLint nBound = -1;
    glGetIntegerv(GL_FRAMEBUFFER_BINDING, &nBound);
    EXPECT_EQ(0, nBound);
    runAlone(node, world(0, 0, 4, 4));
    EXPECT_TRUE(node.oOutput_.hasData());
    node.flushOutputs();
}

TEST_F(SimpleFilterGPUTest, AFailedFrameDoesNotSpoilTheNext) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 9, 5), 11), ImageGPU::PIXEL_FORMAT_RGBA8);
    Texels const input(*upInput);
    CopyNode node;
    ShaderRoad road(frameContext(), node);
    road.setInput(0, *upInput);
    // The sink holds the last frame's image while the next one is made: two textures in turn.
    road.run(world(0, 0, 9, 5));
    road.run(world(0, 0, 9, 5));
    long const nTextures = textures();
    for (std::uint64_t n = 1; n < 100; ++n) {
        std::string sFailed;
        {
            GLCallFailure const failure(n);
            try {
                road.run(world(0, 0, 9, 5));
            } catch (LogicalException const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            sFailed = failure.name();
        }
        host().makeCurrent();
        drainErrors();
        if (sFailed.empty())
            break;
        ASSERT_LT(n, 99U);
        EXPECT_EQ(-1, upInput->boundTexUnit()) << sFailed;
        expectTexels(Texels(*road.run(world(0, 0, 9, 5))), input,
                     Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8));
        EXPECT_EQ(nTextures, textures()) << sFailed;
    }
}

TEST_F(SimpleFilterGPUTest, AFlushDropsAPassThatDidNotEnd) {
    CopyNode node(true);
    node.onRendering_ = [] { ORVO_FAIL("between"); };
    ORVO_EXPECT_INTERNAL(runAlone(node, world(0, 0, 4, 4)), "between");
    EXPECT_NE(nullptr, node.pOutputImage_);
    node.flush();
    EXPECT_EQ(nullptr, node.pOutputImage_);
    EXPECT_FALSE(node.oOutput_.hasData());
}

} // namespace
