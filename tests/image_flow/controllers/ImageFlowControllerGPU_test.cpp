// Frames in an OpenGL context: what is current, what state is left, and what becomes of errors.

#include "orvo/image_flow/controllers/ImageFlowController.h"

#include "orvo/core/exceptions/SharedException.h"
#include "orvo/image_flow/controllers/Bedding.h"
#include "orvo/ogl/ContextOffscreen.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "tests/image_flow/support/GLFlowTest.h"

#include <atomic>
#include <chrono>
#include <thread>

namespace ORVO {

namespace {

using OGL::NativeContext;
using Test::aTextureFormats;
using Test::feed;
using Test::GLCallFailure;
using Test::GLHooks;
using Test::pixels;
using Test::textureImage;
using Test::TextureNode;
using Test::world;
using Hint = ImageFilter::teOutputPrecisionHint;

constexpr char const* pFailure = "Processing failure due to OpenGL error";

class ImageFlowControllerGPUTest : public Test::GLFlowTest {
protected:
    /// A context of the library's own, in which asynchronous frames can run.
    OGL::ContextOffscreen const& offscreen() {
        if (!upOffscreen_)
            upOffscreen_ = std::make_unique<OGL::ContextOffscreen>(&context());
        return *upOffscreen_;
    }
    void TearDown() override {
        upOffscreen_.reset();
        GLFlowTest::TearDown();
    }

private:
    std::unique_ptr<OGL::ContextOffscreen> upOffscreen_;
};

/// What a node sees of OpenGL while it runs.
struct Seen {
    void* pContext_ = nullptr;
    unsigned nUnit_ = 0;
    bool bEnabled2D_ = false;

    void look() {
        pContext_ = NativeContext::currentHandle();
        GLint nUnit = 0;
        glGetIntegerv(GL_ACTIVE_TEXTURE, &nUnit);
        nUnit_ = static_cast<unsigned>(nUnit);
        bEnabled2D_ = glIsEnabled(GL_TEXTURE_2D) == GL_TRUE;
    }
};

/// One node that is its own sink.
struct Lone {
    explicit Lone(OGL::Context const* pContext) : oNode_(0, false) {
        oController_.addNode(&oNode_);
        oController_.setImageSink(oNode_);
        if (pContext != nullptr)
            oController_.setContextGPU(*pContext);
    }
    TextureNode oNode_;
    ImageFlowController oController_;
};

void leaveError() { glEnable(0xffff); }

// The context and its framebuffer

TEST_F(ImageFlowControllerGPUTest, hasNeitherContextNorFramebufferAtFirst) {
    ImageFlowController controller;
    ImageFlowController const& constant = controller;
    EXPECT_EQ(nullptr, controller.contextGPU());
    EXPECT_EQ(nullptr, controller.framebuffer());
    EXPECT_EQ(nullptr, constant.framebuffer());
}

TEST_F(ImageFlowControllerGPUTest, aContextBringsAFramebufferAndWhatIsCurrentStays) {
    auto const before = GLHooks::objects();
    void* const pHandle = NativeContext::currentHandle();
    {
        ImageFlowController controller;
        controller.setContextGPU(offscreen());
        EXPECT_EQ(&offscreen(), controller.contextGPU());
        ASSERT_NE(nullptr, controller.framebuffer());
        EXPECT_EQ(controller.framebuffer(),
                  static_cast<ImageFlowController const&>(controller).framebuffer());
        EXPECT_EQ(pHandle, NativeContext::currentHandle());
        EXPECT_EQ(0u, controller.framebuffer()->objectID()) << "it is of the other context";
        {
            OGL::ScopedContextWrapper const wrapper;
            offscreen().makeCurrent();
            EXPECT_NE(0u, controller.framebuffer()->objectID());
        }
        controller.setContextGPU(context());
        EXPECT_EQ(&context(), controller.contextGPU());
        EXPECT_NE(0u, controller.framebuffer()->objectID());
    }
    EXPECT_EQ(pHandle, NativeContext::currentHandle());
    {
        OGL::ScopedContextWrapper const wrapper;
        offscreen().makeCurrent(); // deletes what was left to be deleted in it
        auto after = GLHooks::objects();
        EXPECT_EQ(before.count("framebuffer") == 0 ? 0 : before.at("framebuffer"), after["framebuffer"]);
    }
}

TEST_F(ImageFlowControllerGPUTest, aContextThatGivesNoFramebufferLeavesTheControllerAsItWas) {
    ImageFlowController controller;
    controller.setContextGPU(context());
    OGL::Framebuffer* const pFramebuffer = controller.framebuffer();
    {
        GLCallFailure const failure("glGenFramebuffers", 1);
        EXPECT_THROW(controller.setContextGPU(offscreen()), OGL::ExceptionOGL);
        EXPECT_TRUE(failure.hasFired());
    }
    EXPECT_EQ(&context(), controller.contextGPU());
    EXPECT_EQ(pFramebuffer, controller.framebuffer());
    OGL::ContextOffscreen const other(&context());
    {
        GLCallFailure const failure("eglMakeCurrent", 1);
        EXPECT_THROW(controller.setContextGPU(other), OGL::ExceptionOGL);
        EXPECT_TRUE(failure.hasFired());
    }
    EXPECT_EQ(&context(), controller.contextGPU());
    EXPECT_EQ(pFramebuffer, controller.framebuffer());
}

TEST_F(ImageFlowControllerGPUTest, theFramebufferGoesWithoutACurrentContext) {
    auto const before = GLHooks::objects();
    {
        ImageFlowController controller;
        controller.setContextGPU(context());
        host().release();
    }
    EXPECT_EQ(nullptr, NativeContext::currentHandle());
    EXPECT_EQ(before, GLHooks::objects());
}

TEST_F(ImageFlowControllerGPUTest, theBeddingKnowsTheContext) {
    ImageFlowController controller;
    Bedding bedding(controller);
    EXPECT_EQ(nullptr, bedding.contextGPU());
    bedding.setContextGPU_DEPRECATED_1_0(offscreen());
    EXPECT_EQ(&offscreen(), bedding.contextGPU());
    Bedding const other(context(), controller);
    EXPECT_EQ(&context(), other.contextGPU());
    EXPECT_EQ(&context(), controller.contextGPU());
}

// What a frame sees and leaves

TEST_F(ImageFlowControllerGPUTest, aFrameRunsInItsContextWithUnit0) {
    Lone graph(&offscreen());
    void* const pHandle = NativeContext::currentHandle();
    Seen seen;
    graph.oNode_.onRun_ = [&] { seen.look(); };
    graph.oController_.process();
    EXPECT_EQ(1, graph.oNode_.nRuns_);
    EXPECT_NE(nullptr, seen.pContext_);
    EXPECT_NE(pHandle, seen.pContext_);
    EXPECT_EQ(unsigned(GL_TEXTURE0), seen.nUnit_);
    EXPECT_TRUE(seen.bEnabled2D_);
    EXPECT_EQ(pHandle, NativeContext::currentHandle());
}

TEST_F(ImageFlowControllerGPUTest, aFrameWithNoContextCurrentLeavesNoneCurrent) {
    Lone graph(&offscreen());
    Seen seen;
    graph.oNode_.onRun_ = [&] { seen.look(); };
    host().release();
    graph.oController_.process();
    EXPECT_NE(nullptr, seen.pContext_);
    EXPECT_EQ(nullptr, NativeContext::currentHandle());
}

TEST_F(ImageFlowControllerGPUTest, unitAndEnableAreAsTheHostHadThem) {
    for (bool const bEnabled : {false, true}) {
        for (bool const bThrow : {false, true}) {
            Lone graph(&context());
            if (bEnabled)
                glEnable(GL_TEXTURE_2D);
            glActiveTexture(GL_TEXTURE3);
            Seen seen;
            graph.oNode_.onRun_ = [&] {
                seen.look();
                ORVO_CHECK(!bThrow, "node failed");
            };
            if (bThrow)
                ORVO_EXPECT_INTERNAL(graph.oController_.process(), "node failed");
            else
                graph.oController_.process();
            EXPECT_EQ(unsigned(GL_TEXTURE0), seen.nUnit_);
            EXPECT_TRUE(seen.bEnabled2D_);
            Seen after;
            after.look();
            EXPECT_EQ(unsigned(GL_TEXTURE3), after.nUnit_);
            glActiveTexture(GL_TEXTURE0);
            EXPECT_EQ(bEnabled ? GL_TRUE : GL_FALSE, glIsEnabled(GL_TEXTURE_2D));
            glDisable(GL_TEXTURE_2D);
        }
    }
}

/// Counts the calls through a pointer of the loader.
template <auto* pSlot, typename Function = std::remove_pointer_t<decltype(pSlot)>>
class CallCounter;

template <auto* pSlot, typename Result, typename... Arguments>
class CallCounter<pSlot, Result (*)(Arguments...)> {
public:
    CallCounter() : pOriginal_(*pSlot) {
        pInstance = this;
        *pSlot = &call;
    }
    ~CallCounter() { *pSlot = pOriginal_; }
    CallCounter(CallCounter const&) = delete;
    CallCounter& operator=(CallCounter const&) = delete;
    int nCalls_ = 0;

private:
    static Result call(Arguments... arguments) {
        ++pInstance->nCalls_;
        return pInstance->pOriginal_(arguments...);
    }
    static inline CallCounter* pInstance = nullptr;
    Result (*pOriginal_)(Arguments...);
};

TEST_F(ImageFlowControllerGPUTest, aControllerWithoutAContextMakesNoCall) {
    Lone with(&context());
    Lone without(nullptr);
    // Resolved by then, so that the counters keep the functions themselves.
    glIsEnabled(GL_TEXTURE_2D);
    with.oController_.process();
    with.oController_.wait(1, 0);
    CallCounter<&epoxy_glGetError> errors;
    CallCounter<&epoxy_glActiveTexture> units;
    CallCounter<&epoxy_glEnable> enables;
    CallCounter<&epoxy_glDisable> disables;
    CallCounter<&epoxy_glIsEnabled> asked;
    CallCounter<&epoxy_glGetIntegerv> got;
    auto const sum = [&] {
        return errors.nCalls_ + units.nCalls_ + enables.nCalls_ + disables.nCalls_ + asked.nCalls_ +
               got.nCalls_;
    };
    without.oController_.process();
    without.oController_.processAsync();
    without.oController_.wait(60, 0.001);
    without.oController_.sleep(0);
    EXPECT_EQ(2, without.oNode_.nRuns_);
    EXPECT_EQ(0, sum());
    with.oController_.process();
    EXPECT_LT(4, sum()) << "the counters see nothing";
}

// Errors of OpenGL

TEST_F(ImageFlowControllerGPUTest, anErrorOfTheHostFailsTheFrameBeforeItStarts) {
    Lone graph(&context());
    leaveError();
    try {
        graph.oController_.process();
        ADD_FAILURE() << "no exception";
    } catch (OGL::ExceptionOGL const& exception) {
        EXPECT_STREQ(pFailure, exception.message());
        EXPECT_EQ(0u, exception.glError());
    }
    EXPECT_EQ(0, graph.oNode_.nRuns_);
    EXPECT_EQ(0u, drainErrors());
    graph.oController_.process();
    EXPECT_EQ(1, graph.oNode_.nRuns_);
}

TEST_F(ImageFlowControllerGPUTest, anErrorOfANodeFailsTheFrameAfterItsEnd) {
    Lone graph(&context());
    graph.oNode_.onRun_ = leaveError;
    ORVO_EXPECT_OGL(graph.oController_.process(), pFailure);
    EXPECT_EQ(1, graph.oNode_.nRuns_);
    EXPECT_EQ(0u, drainErrors());
    EXPECT_EQ(DataFlow::Controller::CONTROLLER_STOPPED, graph.oController_.controllerStatus());
}

TEST_F(ImageFlowControllerGPUTest, anExceptionGoesBeforeTheErrorThatItLeavesBehind) {
    Lone graph(&context());
    graph.oNode_.onRun_ = [] {
        leaveError();
        ORVO_FAIL("node failed");
    };
    ORVO_EXPECT_INTERNAL(graph.oController_.process(), "node failed");
    EXPECT_EQ(0u, drainErrors());
    graph.oNode_.onRun_ = nullptr;
    graph.oNode_.flush();
    graph.oController_.process();
    EXPECT_EQ(2, graph.oNode_.nRuns_);
}

TEST_F(ImageFlowControllerGPUTest, aContextThatCannotBeMadeCurrentFailsTheFrame) {
    Lone graph(&offscreen());
    {
        GLCallFailure const failure("eglMakeCurrent", 1);
        EXPECT_THROW(graph.oController_.process(), OGL::ExceptionOGL);
        EXPECT_TRUE(failure.hasFired());
    }
    EXPECT_EQ(0, graph.oNode_.nRuns_);
    graph.oController_.process();
    EXPECT_EQ(1, graph.oNode_.nRuns_);
}

// Asynchronous frames

TEST_F(ImageFlowControllerGPUTest, anAsynchronousFrameRunsInItsContextOnItsThread) {
    Lone graph(&offscreen());
    Seen seen;
    std::thread::id oThread;
    graph.oNode_.onRun_ = [&] {
        seen.look();
        oThread = std::this_thread::get_id();
    };
    void* const pHandle = NativeContext::currentHandle();
    graph.oController_.processAsync();
    EXPECT_TRUE(graph.oController_.wait(60, 0.001));
    EXPECT_NO_THROW(graph.oController_.checkException());
    EXPECT_NE(std::this_thread::get_id(), oThread);
    EXPECT_NE(nullptr, seen.pContext_);
    EXPECT_NE(pHandle, seen.pContext_);
    EXPECT_EQ(unsigned(GL_TEXTURE0), seen.nUnit_);
    EXPECT_TRUE(seen.bEnabled2D_);
    EXPECT_EQ(pHandle, NativeContext::currentHandle());
}

TEST_F(ImageFlowControllerGPUTest, waitReportsAnErrorThatTheFrameLeftBehind) {
    Lone graph(&offscreen());
    graph.oNode_.onRun_ = leaveError;
    graph.oController_.processAsync();
    ORVO_EXPECT_OGL(graph.oController_.wait(60, 0.001), pFailure);
    EXPECT_NO_THROW(graph.oController_.checkException());
    graph.oNode_.onRun_ = nullptr;
    graph.oController_.processAsync();
    EXPECT_TRUE(graph.oController_.wait(60, 0.001));
    EXPECT_EQ(2, graph.oNode_.nRuns_);
}

TEST_F(ImageFlowControllerGPUTest, anExceptionOfTheFrameTakesItsErrorAlong) {
    Lone graph(&offscreen());
    graph.oNode_.onRun_ = [] {
        leaveError();
        ORVO_FAIL("node failed");
    };
    graph.oController_.processAsync();
    EXPECT_TRUE(graph.oController_.wait(60, 0.001));
    EXPECT_THROW(graph.oController_.checkException(), SharedException);
}

TEST_F(ImageFlowControllerGPUTest, waitLeavesTheContextToAFrameThatRunsOn) {
    Lone graph(&offscreen());
    std::atomic<bool> bGo{false};
    graph.oNode_.onRun_ = [&] {
        while (!bGo)
            std::this_thread::yield();
        leaveError();
    };
    void* const pHandle = NativeContext::currentHandle();
    graph.oController_.processAsync();
    EXPECT_FALSE(graph.oController_.wait(0.001, 0.002));
    EXPECT_EQ(pHandle, NativeContext::currentHandle());
    bGo = true;
    ORVO_EXPECT_OGL(graph.oController_.wait(60, 0.001), pFailure);
}

TEST_F(ImageFlowControllerGPUTest, aContextThatIsCurrentElsewhereFailsTheAsynchronousFrame) {
    Lone graph(&context());
    bool bCompleted = false;
    graph.oController_.registerProcessingCompletedCallback(
        [](void* pData) {
            *static_cast<bool*>(pData) = true;
            return true;
        },
        &bCompleted);
    {
        GLCallFailure const failure("eglMakeCurrent", 1);
        graph.oController_.processAsync();
        EXPECT_TRUE(graph.oController_.wait(60, 0.001));
        EXPECT_TRUE(failure.hasFired());
    }
    EXPECT_TRUE(bCompleted);
    EXPECT_EQ(0, graph.oNode_.nRuns_);
    EXPECT_THROW(graph.oController_.checkException(), SharedException);
    EXPECT_EQ(DataFlow::Controller::CONTROLLER_STOPPED, graph.oController_.controllerStatus());
}

/// A callback that launches the next frame, until there were enough.
struct Relauncher {
    Lone* pGraph_;
    int nLaunches_ = 0;
    std::vector<void*> aCurrent_{};

    static bool completed(void* pData) {
        auto& self = *static_cast<Relauncher*>(pData);
        self.aCurrent_.push_back(NativeContext::currentHandle());
        if (++self.nLaunches_ < 3)
            self.pGraph_->oController_.processAsync();
        return true;
    }
};

TEST_F(ImageFlowControllerGPUTest, theCompletionCallbackMayLaunchTheNextFrame) {
    Lone graph(&offscreen());
    Relauncher relauncher{&graph};
    graph.oController_.registerProcessingCompletedCallback(Relauncher::completed, &relauncher);
    graph.oController_.processAsync();
    EXPECT_TRUE(graph.oController_.wait(60, 0.001));
    EXPECT_NO_THROW(graph.oController_.checkException());
    EXPECT_EQ(3, graph.oNode_.nRuns_);
    EXPECT_EQ(std::vector<void*>(3, nullptr), relauncher.aCurrent_) << "the context was not given up";
}

TEST_F(ImageFlowControllerGPUTest, sleepLeavesWhatIsCurrent) {
    Lone graph(&offscreen());
    void* const pHandle = NativeContext::currentHandle();
    graph.oController_.sleep(0.001);
    EXPECT_EQ(pHandle, NativeContext::currentHandle());
}

// Formats from the sink

TEST_F(ImageFlowControllerGPUTest, theSinksTextureDecidesThePrecision) {
    Hint const aHints[] = {ImageFilter::OUTPUT_PRECISION_8_BIT_INT, ImageFilter::OUTPUT_PRECISION_16_BIT_INT,
                           ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT,
                           ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT};
    for (ImageGPU::tePixelFormat const format : aTextureFormats) {
        auto const upImage = textureImage(pixels(0, 0, 2, 2), format);
        TextureNode source(0, true, "source");
        TextureNode sink(1, true, "sink");
        feed(sink, 0, source);
        ImageFlowController controller;
        controller.addNode(&sink);
        controller.addNode(&source);
        controller.setImageSink(sink);
        sink.setBoundOutputImage(upImage.get());
        controller.setNodeImageDescriptorInfo(true);
        EXPECT_EQ(aHints[format % 4], source.outputPrecisionHint()) << format;
        EXPECT_EQ(aHints[format % 4], sink.outputPrecisionHint()) << format;
    }
}

TEST_F(ImageFlowControllerGPUTest, aSinkWithoutATextureOfAKnownFormatDecidesNothing) {
    Lone graph(nullptr);
    TextureNode sink(0, true, "sink");
    ImageFlowController controller;
    controller.addNode(&sink);
    controller.setImageSink(sink);
    ORVO_EXPECT_INTERNAL(controller.setNodeImageDescriptorInfo(true),
                         "(pSink->imageOutput()->hasData()) == true");
    ImageGPU undefined;
    sink.setBoundOutputImage(&undefined);
    ORVO_EXPECT_INTERNAL(controller.setNodeImageDescriptorInfo(true),
                         "Not implemented: ImageGPU Pixel format not supported");
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, sink.outputPrecisionHint());
}

} // namespace

} // namespace ORVO
