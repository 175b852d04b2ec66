// Whole frames that cross between host memory and textures.

#include "orvo/core/exceptions/SharedException.h"
#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "tests/image_flow/support/GPURoads.h"

#include <sstream>

namespace ORVO {

namespace {

using OGL::NativeContext;
using Test::Chain;
using Test::feed;
using Test::floatImage;
using Test::GLCallFailure;
using Test::GLHooks;
using Test::HostImage;
using Test::pixelAt;
using Test::pixels;
using Test::TestFilter;
using Test::worldOf;

using Bytes = std::vector<unsigned char>;

class GPUFramesTest : public Test::GLFlowTest {};

/// host image -> texture -> host image -> filter that adds -> bound image.
struct Crossing {
    explicit Crossing(OGL::Context const& context)
        : oImage_(floatImage(pixels(-3, 2, 9, 7), [](int x, int y) { return float(x) * 0.5f - float(y); })),
          oResult_(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, pixels(-3, 2, 9, 7)),
          oChain_(context, {&oSource_, &oUp_, &oDown_, &oFilter_}) {
        oSource_.setImageCPUWithNoOwnership(oImage_.get());
        oFilter_.setBoundOutputImage(&oResult_.image());
        oFilter_.oOffset_.setValue(100.0f);
    }
    void prepare(PositionExtentInPixelSpace const& region) {
        oChain_.oController_.computeRegions(worldOf(region));
        oChain_.oController_.setDirtyState();
        ORVO::Test::emitAll(oChain_.oController_);
    }
    void expectResult(PositionExtentInPixelSpace const& region) {
        for (int y = 2; y < 9; ++y)
            for (int x = -3; x < 6; ++x) {
                PositionInPixelSpace const at = region.position();
                bool const bInside = x >= at.x() && x < at.x() + region.extent().width() && y >= at.y() &&
                                     y < at.y() + region.extent().height();
                if (bInside)
                    EXPECT_EQ(float(x) * 0.5f - float(y) + 100.0f, oResult_.channel<float>(x, y, 0));
                else
                    EXPECT_EQ(0xcdcdcdcd, oResult_.channel<std::uint32_t>(x, y, 0));
            }
    }
    Test::ImageCPUPtr oImage_;
    HostImage oResult_;
    ImageCPUInput oSource_;
    CPU2GPU oUp_;
    GPU2CPU oDown_;
    TestFilter oFilter_;
    Chain oChain_;
};

TEST_F(GPUFramesTest, aFrameCrossesBothWays) {
    for (auto const& region :
         {pixels(-3, 2, 9, 7), pixels(-1, 4, 3, 2), pixels(-3, 2, 1, 1), pixels(5, 8, 1, 1)}) {
        Crossing graph(context());
        graph.prepare(region);
        graph.oChain_.oController_.process();
        graph.expectResult(region);
    }
}

TEST_F(GPUFramesTest, asynchronousFramesCrossOnTheirThread) {
    OGL::ContextOffscreen const offscreen(&context());
    Crossing graph(offscreen);
    auto& controller = graph.oChain_.oController_;
    for (int i = 0; i < 5; ++i) {
        graph.oFilter_.oOffset_.setValue(100.0f);
        graph.prepare(pixels(-3, 2, 9, 7));
        controller.processAsync();
        EXPECT_TRUE(controller.wait(60, 0.001));
        EXPECT_NO_THROW(controller.checkException());
        graph.expectResult(pixels(-3, 2, 9, 7));
    }
    EXPECT_EQ(5, graph.oFilter_.nRuns_);
}

TEST_F(GPUFramesTest, oneGraphRunsInSeveralContextsInTurn) {
    OGL::ContextOffscreen const first(&context());
    OGL::ContextOffscreen const second(&first);
    Crossing graph(first);
    for (OGL::Context const* pContext :
         {static_cast<OGL::Context const*>(&second), &context(), static_cast<OGL::Context const*>(&first)}) {
        graph.oChain_.oController_.setContextGPU(*pContext);
        graph.prepare(pixels(-3, 2, 9, 7));
        graph.oChain_.oController_.process();
        graph.expectResult(pixels(-3, 2, 9, 7));
    }
}

TEST_F(GPUFramesTest, aFrameThatIsRunAgainMakesNothingNew) {
    Crossing graph(context());
    for (int i = 0; i < 3; ++i) {
        graph.prepare(pixels(-3, 2, 9, 7));
        graph.oChain_.oController_.process();
        glFinish(); // the buffers of the upload are free again
    }
    std::uint64_t const nTextures = GLHooks::calls("glGenTextures");
    std::uint64_t const nStorage = GLHooks::calls("glTexImage2D");
    std::uint64_t const nQueries = GLHooks::calls("glGenQueries");
    graph.prepare(pixels(-3, 2, 9, 7));
    graph.oChain_.oController_.process();
    EXPECT_EQ(nTextures, GLHooks::calls("glGenTextures"));
    EXPECT_EQ(nStorage, GLHooks::calls("glTexImage2D"));
    EXPECT_EQ(nQueries, GLHooks::calls("glGenQueries"));
}

TEST_F(GPUFramesTest, oneUploadServesSeveralConsumers) {
    auto const upImage = floatImage(pixels(0, 0, 5, 4), [](int x, int y) { return float(x + 10 * y); });
    ImageCPUInput source;
    CPU2GPU up;
    GPU2CPU down;
    GPU2CPU downToo;
    TestFilter sum(2, true, "sum");
    source.setImageCPUWithNoOwnership(upImage.get());
    feed(up, 0, source);
    feed(down, 0, up);
    feed(downToo, 0, up);
    feed(sum, 0, down);
    feed(sum, 1, downToo);
    HostImage result(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, pixels(0, 0, 5, 4));
    sum.setBoundOutputImage(&result.image());
    ImageFlowController controller;
    for (ImageFilter* pNode : std::initializer_list<ImageFilter*>{&source, &up, &down, &downToo, &sum})
        controller.addNode(pNode);
    controller.setImageSink(sum);
    controller.setContextGPU(context());
    std::uint64_t const nUploads = GLHooks::calls("glTexSubImage2D");
    controller.computeRegions(worldOf(pixels(0, 0, 5, 4)));
    controller.setDirtyState();
    ORVO::Test::emitAll(controller);
    controller.process();
    EXPECT_EQ(nUploads + 1, GLHooks::calls("glTexSubImage2D"));
    for (int y = 0; y < 4; ++y)
        for (int x = 0; x < 5; ++x)
            EXPECT_EQ(float(x + 10 * y), result.channel<float>(x, y, 0)); // the mean of two equals
    for (ImageFilter* pNode : std::initializer_list<ImageFilter*>{&source, &up, &down, &downToo, &sum})
        pNode->disconnect();
}

TEST_F(GPUFramesTest, aParameterMakesNoUploadDirty) {
    Crossing graph(context());
    graph.prepare(pixels(-3, 2, 9, 7));
    graph.oChain_.oController_.process();
    graph.oFilter_.oOffset_.setValue(200.0f);
    graph.oChain_.oController_.computeRegions(worldOf(pixels(-3, 2, 9, 7)));
    graph.oChain_.oController_.setDirtyState();
    EXPECT_FALSE(graph.oUp_.isDirty());
    EXPECT_TRUE(graph.oFilter_.isDirty());
}

// Failures

TEST_F(GPUFramesTest, aFrameThatFailsLeavesTheStateAndTheNextOneIsRight) {
    Crossing graph(context());
    graph.prepare(pixels(-3, 2, 9, 7));
    graph.oChain_.oController_.process();
    glActiveTexture(GL_TEXTURE2);
    auto const before = ORVO::Test::GLState::capture();
    for (char const* pName : {"glTexSubImage2D", "glMapBuffer", "glUnmapBuffer", "glFramebufferTexture2D",
                              "glCheckFramebufferStatus", "glReadPixels", "glGenFramebuffers"}) {
        graph.prepare(pixels(-3, 2, 9, 7));
        {
            GLCallFailure const failure(pName, 1);
            EXPECT_THROW(graph.oChain_.oController_.process(), OGL::ExceptionOGL) << pName;
            EXPECT_TRUE(failure.hasFired()) << pName;
        }
        EXPECT_EQ(0u, drainErrors()) << pName;
        EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture())) << pName;
        graph.oChain_.oController_.flushGraph();
        graph.prepare(pixels(-3, 2, 9, 7));
        graph.oChain_.oController_.process();
        graph.expectResult(pixels(-3, 2, 9, 7));
    }
    glActiveTexture(GL_TEXTURE0);
}

TEST_F(GPUFramesTest, anAsynchronousFrameThatFailsReportsItsFailure) {
    OGL::ContextOffscreen const offscreen(&context());
    Crossing graph(offscreen);
    auto& controller = graph.oChain_.oController_;
    graph.prepare(pixels(-3, 2, 9, 7));
    {
        GLCallFailure const failure("glReadPixels", 1);
        controller.processAsync();
        EXPECT_TRUE(controller.wait(60, 0.001));
        EXPECT_TRUE(failure.hasFired());
    }
    try {
        controller.checkException();
        ADD_FAILURE() << "no exception";
    } catch (SharedException const& shared) {
        EXPECT_NE(nullptr, dynamic_cast<OGL::ExceptionOGL const*>(shared.exception().get()));
    }
    controller.flushGraph();
    graph.prepare(pixels(-3, 2, 9, 7));
    controller.processAsync();
    EXPECT_TRUE(controller.wait(60, 0.001));
    EXPECT_NO_THROW(controller.checkException());
    graph.expectResult(pixels(-3, 2, 9, 7));
}

std::string foreignMessage() {
    std::ostringstream text;
    void const* const pHandle = NativeContext::currentHandle();
    text << "Current context of value ";
    if (pHandle == nullptr)
        text << 0;
    else
        text << pHandle;
    text << " does not share with any context used to initialize image_runtime";
    return text.str();
}

TEST_F(GPUFramesTest, framesOnAForeignContextOrOnNoneAreRefused) {
    auto const foreign = OGL::ContextOffscreen::createHeadless();
    {
        Crossing graph(*foreign);
        graph.prepare(pixels(-3, 2, 9, 7));
        std::string sMessage;
        {
            OGL::ScopedContextWrapper const wrapper;
            foreign->makeCurrent();
            sMessage = foreignMessage();
        }
        ORVO_EXPECT_INTERNAL(graph.oChain_.oController_.process(), sMessage);
        graph.oChain_.oController_.flushGraph();
        graph.oChain_.oController_.setContextGPU(context());
        graph.prepare(pixels(-3, 2, 9, 7));
        graph.oChain_.oController_.process();
        graph.expectResult(pixels(-3, 2, 9, 7));
    }
    auto const upImage = floatImage(pixels(0, 0, 2, 2), [](int, int) { return 1.0f; });
    ImageCPUInput source;
    CPU2GPU up;
    source.setImageCPUWithNoOwnership(upImage.get());
    feed(up, 0, source);
    ImageFlowController controller;
    controller.addNode(&source);
    controller.addNode(&up);
    controller.setImageSink(up);
    controller.computeRegions(worldOf(pixels(0, 0, 2, 2)));
    ORVO::Test::emitAll(controller);
    host().release();
    ORVO_EXPECT_INTERNAL(controller.process(), foreignMessage());
    up.disconnect();
}

TEST_F(GPUFramesTest, aContextThatWasDestroyedFailsTheFrame) {
    endWithHost();
    auto const other = host().another(true);
    other->makeCurrent();
    auto const upOther = OGL::Context::adoptCurrent();
    {
        Crossing graph(*upOther);
        graph.prepare(pixels(-3, 2, 9, 7));
        graph.oChain_.oController_.process();
        graph.expectResult(pixels(-3, 2, 9, 7));
        graph.prepare(pixels(-3, 2, 9, 7));
        host().makeCurrent();
        other->destroyContext();
        EXPECT_THROW(graph.oChain_.oController_.process(), OGL::ExceptionOGL);
        EXPECT_THROW(graph.oChain_.oController_.setContextGPU(*upOther), OGL::ExceptionOGL);
        graph.oChain_.oController_.flushGraph();
        graph.oChain_.oController_.setContextGPU(context());
        graph.prepare(pixels(-3, 2, 9, 7));
        graph.oChain_.oController_.process();
        graph.expectResult(pixels(-3, 2, 9, 7));
    }
}

} // namespace

} // namespace ORVO
