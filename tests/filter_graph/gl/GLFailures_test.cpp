// Frames on OpenGL that fail, with every call failing in turn, and what they leave behind.
#include <epoxy/gl.h>

#include <atomic>
#include <thread>

#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/image_flow/filters/BasicGLShaderFilter.h"
#include "orvo/image_runtime/TexturePool.h"
#include "tests/filter_graph/gl/GLChain.h"
#include "tests/support/gl/ExpectOGL.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

class GLFailuresTest : public GLFrameTest {};

/// Leaves an error behind when it is told to.
class ErrorShader : public BasicGLShaderFilter {
public:
    ErrorShader() : BasicGLShaderFilter("ErrorShader", "void main() { gl_FragData[0] = vec4(0.2); }\n", 4) {
        addInput("src");
    }

    void internalProcess() override {
        BasicGLShaderFilter::internalProcess();
        if (bRaises) {
            glEnable(0xFFFF);
        }
    }

    static inline std::atomic<bool> bRaises{false};
};

TEST_F(GLFailuresTest, AnErrorOfAFrameThatNobodyWaitedForIsNotTheNextOnes) {
    ByteImage input(0, 0, kWidth, kHeight);
    TextureImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    Internal::ImageFlowFilter<ErrorShader> prototype({"error", "test", "ORVO", 1}, ORVO_TARGET_GL);
    prototype.initialize();
    FilterPtr const spFilter = prototype.clone();
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spFilter);
    Connect(spFilter, spSink);
    auto const spProcessor = createProcessor(spSink, context());
    ErrorShader::bRaises = true;
    spProcessor->asyncProcessFrame(glOptions());
    while (spProcessor->frameStatus() == IProcessorBase::FRAME_RUNNING) {
        std::this_thread::yield();
    }
    ErrorShader::bRaises = false;
    spProcessor->processFrame(glOptions());
    EXPECT_EQ(output.read(), std::vector<std::uint8_t>(4 * kWidth * kHeight, 51));

    ErrorShader::bRaises = true;
    spProcessor->asyncProcessFrame(glOptions());
    ORVO_EXPECT_OGL(spProcessor->waitForFrame(kLong, 0.0005), "Processing failure due to OpenGL error");
    ErrorShader::bRaises = false;
    spProcessor->processFrame(glOptions());
}

/// A new frame each time, with another call failing, until none is left to fail; after each failure the next
/// frame is right, and the host's textures are as they were.
class GLEveryFailureTest : public GLFrameTest {
protected:
    void SetUp() override {
        GLFrameTest::SetUp();
        pInput_ = std::make_unique<ByteImage>(0, 0, kWidth, kHeight);
        pInput_->write(pattern(kWidth, kHeight));
        pOutput_ = std::make_unique<ByteImage>(0, 0, kWidth, kHeight);
        pInputTexture_ = std::make_unique<TextureImage>(0, 0, kWidth, kHeight);
        pInputTexture_->write(pattern(kWidth, kHeight));
        Sampling::makeOdd(pInputTexture_->texture());
        pOutputTexture_ = std::make_unique<TextureImage>(0, 0, kWidth, kHeight);
    }

    void TearDown() override {
        pInputTexture_.reset();
        pOutputTexture_.reset();
        GLFrameTest::TearDown();
    }

    std::vector<std::uint8_t> result(bool bTexture) {
        return bTexture ? pOutputTexture_->read() : pOutput_->bytes();
    }

    /// Whether the frame, or the building of its graph, fails.
    static bool fails(IProcessor& processor, bool bAsync) {
        try {
            if (bAsync) {
                processor.asyncProcessFrame(glOptions());
                processor.waitForFrame(kLong, 0.0005);
            } else {
                processor.processFrame(glOptions());
            }
        } catch (ExceptionBase const&) {
            return true;
        } catch (std::bad_alloc const&) {
            return true;
        }
        return false;
    }

    void failEachCall(bool bInputTexture, bool bOutputTexture, bool bAsync) {
        ImageBase* const pInput = bInputTexture ? static_cast<ImageBase*>(pInputTexture_->handle())
                                                : static_cast<ImageBase*>(pInput_->handle());
        ImageBase* const pOutput = bOutputTexture ? static_cast<ImageBase*>(pOutputTexture_->handle())
                                                  : static_cast<ImageBase*>(pOutput_->handle());
        Sampling const sampling(pInputTexture_->texture());
        int nFailed = 0;
        bool bFired = true;
        for (std::uint64_t n = 1; bFired; ++n) {
            // A new processor each time, so that building fails in turn, too.
            Chain chain(pInput, pOutput, context());
            TexturePool::Instance()->clearAll();
            std::string sFailed;
            {
                GLCallFailure const failure(n);
                nFailed += fails(*chain.spProcessor_, bAsync) ? 1 : 0;
                bFired = failure.hasFired();
                sFailed = failure.name();
            }
            // A driver that refuses to make the host's context current again leaves none.
            host().makeCurrent();
            drainErrors();
            ASSERT_TRUE(Sampling(pInputTexture_->texture()) == sampling) << "after failed " << sFailed;
            pOutput_->fill(std::uint8_t(1));
            pOutputTexture_->write(pOutput_->bytes());
            ASSERT_NO_THROW(chain.spProcessor_->processFrame(glOptions())) << "after failed " << sFailed;
            ASSERT_EQ(result(bOutputTexture), plus(pattern(kWidth, kHeight), 10))
                << "after failed " << sFailed;
            ASSERT_EQ(pInputTexture_->read(), pattern(kWidth, kHeight)) << "after failed " << sFailed;
        }
        EXPECT_GT(nFailed, 5);
    }

private:
    std::unique_ptr<ByteImage> pInput_;
    std::unique_ptr<ByteImage> pOutput_;
    std::unique_ptr<TextureImage> pInputTexture_;
    std::unique_ptr<TextureImage> pOutputTexture_;
};

TEST_F(GLEveryFailureTest, HostMemory) { failEachCall(false, false, false); }

TEST_F(GLEveryFailureTest, HostMemoryIntoATexture) { failEachCall(false, true, false); }

TEST_F(GLEveryFailureTest, Textures) { failEachCall(true, true, false); }

TEST_F(GLEveryFailureTest, AsynchronousFramesOfHostMemory) { failEachCall(false, false, true); }

TEST_F(GLEveryFailureTest, AsynchronousFramesOfTextures) { failEachCall(true, true, true); }

std::atomic<int> nCallbacks{0};

bool countCallback(void*) {
    ++nCallbacks;
    return true;
}

TEST_F(GLFailuresTest, TheHostIsToldOfTheEndWhateverContextIsRefused) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    TextureImage output(0, 0, kWidth, kHeight);
    Chain chain(input.handle(), output.handle(), context());
    chain.spProcessor_->processFrame(glOptions());
    int nFrames = 0;
    bool bFired = true;
    for (std::uint64_t n = 1; bFired; ++n) {
        chain.spProcessor_->setCompletionCallback(countCallback);
        nCallbacks = 0;
        bool bLaunched = false;
        {
            GLCallFailure const failure("eglMakeCurrent", n);
            try {
                chain.spProcessor_->asyncProcessFrame(glOptions());
                bLaunched = true;
                ++nFrames;
                chain.spProcessor_->waitForFrame(kLong, 0.0005);
            } catch (ExceptionBase const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bFired = failure.hasFired();
        }
        host().makeCurrent();
        EXPECT_EQ(nCallbacks, bLaunched ? 1 : 0) << n;
        chain.spProcessor_->processFrame(glOptions());
        EXPECT_EQ(output.read(), plus(pattern(kWidth, kHeight), 10)) << n;
    }
    EXPECT_GT(nFrames, 2);
}

TEST_F(GLFailuresTest, TheGraphOutlivesTheHostsContext) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage output(0, 0, kWidth, kHeight);
    auto const pSecond = host().another(true);
    pSecond->makeCurrent();
    auto const pSecondContext = OGL::Context::adoptCurrent();
    Chain chain(input.handle(), output.handle(), pSecondContext.get());
    chain.spProcessor_->processFrame(glOptions());
    host().makeCurrent();
    pSecond->destroyContext();
    chain.add(30);
    chain.spProcessor_->processFrame(glOptions());
    EXPECT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), 30));
}

} // namespace
} // namespace ORVO::FilterGraph
