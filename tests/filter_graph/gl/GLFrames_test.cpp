// Frames of processors on OpenGL: synchronous and asynchronous, one after the other, on several contexts.
#include <atomic>
#include <thread>

#include "orvo/filter_graph/filters/StandardFilters.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/NativeContext.h"
#include "tests/filter_graph/gl/GLChain.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

class GLFramesTest : public GLFrameTest {};

TEST_F(GLFramesTest, NewValuesReachTheShader) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage output(0, 0, kWidth, kHeight);
    Chain chain(input.handle(), output.handle(), context());
    for (int steps : {10, 20, 0, 50}) {
        chain.add(steps);
        chain.spProcessor_->processFrame(glOptions());
        EXPECT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), steps));
    }
}

TEST_F(GLFramesTest, NewPixelsInPlaceAreSeen) {
    ByteImage input(0, 0, kWidth, kHeight);
    ByteImage output(0, 0, kWidth, kHeight);
    Chain chain(input.handle(), output.handle(), context());
    for (std::uint8_t const fill : {std::uint8_t(0), std::uint8_t(40), std::uint8_t(7)}) {
        input.fill(fill);
        chain.spProcessor_->processFrame(glOptions());
        EXPECT_EQ(output.bytes(),
                  std::vector<std::uint8_t>(output.bytes().size(), static_cast<std::uint8_t>(fill + 10)));
    }
}

TEST_F(GLFramesTest, ResultsOfAStampedTextureAreKept) {
    TextureImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    input.handle()->setContentStamp(1);
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spKept = makeAddShader("kept");
    FilterPtr const spChanged = makeAddShader("changed");
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spKept);
    Connect(spKept, spChanged);
    Connect(spChanged, spSink);
    setParameter(*spKept, "value", 10 * kStep);
    auto const spProcessor = createProcessor(spSink, context());
    // Results are kept where a clean node feeds a dirty one: from the second frame on.
    for (int steps : {1, 2}) {
        setParameter(*spChanged, "value", static_cast<float>(steps) * kStep);
        spProcessor->processFrame(glOptions());
        EXPECT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), 10 + steps));
    }
    // The stamp vouches for what is not so: the kept result shows that nothing was drawn again.
    input.write(std::vector<std::uint8_t>(4 * kWidth * kHeight, 0));
    setParameter(*spChanged, "value", 3 * kStep);
    spProcessor->processFrame(glOptions());
    EXPECT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), 13));
    input.handle()->setContentStamp(2);
    spProcessor->processFrame(glOptions());
    EXPECT_EQ(output.bytes(), std::vector<std::uint8_t>(output.bytes().size(), 13));
}

TEST_F(GLFramesTest, AFrameOfAnUnchangedGraphMakesNothingNew) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage output(0, 0, kWidth, kHeight);
    Chain chain(input.handle(), output.handle(), context());
    for (int frame = 0; frame < 3; ++frame) { // fills the pool
        chain.spProcessor_->processFrame(glOptions());
    }
    ObjectCounts const before = GLHooks::objects();
    std::uint64_t const nLinks = GLHooks::calls("glLinkProgram");
    std::uint64_t const nTextures = GLHooks::calls("glGenTextures");
    for (int steps = 0; steps < 20; ++steps) {
        chain.add(steps);
        chain.spProcessor_->processFrame(glOptions());
        ASSERT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), steps));
    }
    EXPECT_EQ(GLHooks::calls("glLinkProgram"), nLinks);
    EXPECT_EQ(GLHooks::calls("glGenTextures"), nTextures);
    EXPECT_EQ(GLHooks::objects(), before);
}

TEST_F(GLFramesTest, TheHostsStateAndContextAreAsTheyWere) {
    TextureImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    TextureImage output(0, 0, kWidth, kHeight);
    Chain chain(input.handle(), output.handle(), context());
    GLState const before = GLState::capture();
    void* const pHandle = host().handle();
    chain.spProcessor_->processFrame(glOptions());
    EXPECT_EQ(before.differencesTo(GLState::capture()), "");
    EXPECT_EQ(OGL::NativeContext::currentHandle(), pHandle);
}

TEST_F(GLFramesTest, TexturesAreSampledAsTheHostLeftThem) {
    TextureImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    TextureImage output(0, 0, kWidth, kHeight);
    Sampling::makeOdd(input.texture());
    Sampling::makeOdd(output.texture());
    Sampling const before(input.texture());
    Chain chain(input.handle(), output.handle(), context());
    chain.spProcessor_->processFrame(glOptions());
    EXPECT_TRUE(Sampling(input.texture()) == before);
    chain.spProcessor_->asyncProcessFrame(glOptions());
    ASSERT_EQ(chain.spProcessor_->waitForFrame(kLong, 0.0005), IProcessorBase::FRAME_COMPLETE);
    EXPECT_TRUE(Sampling(input.texture()) == before);
    {
        GLCallFailure const failure("glCheckFramebufferStatus", 1);
        EXPECT_THROW(chain.spProcessor_->processFrame(glOptions()), OGL::ExceptionOGL);
    }
    EXPECT_TRUE(Sampling(input.texture()) == before) << "after a frame that failed";
    EXPECT_TRUE(Sampling(output.texture()) == before);
}

TEST_F(GLFramesTest, RunWithNoContextCurrent) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage output(0, 0, kWidth, kHeight);
    {
        Chain chain(input.handle(), output.handle(), context());
        host().release();
        chain.spProcessor_->processFrame(glOptions());
        EXPECT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), 10));
        EXPECT_EQ(OGL::NativeContext::currentHandle(), nullptr);
        chain.add(20);
        chain.spProcessor_->asyncProcessFrame(glOptions());
        ASSERT_EQ(chain.spProcessor_->waitForFrame(kLong, 0.0005), IProcessorBase::FRAME_COMPLETE);
        EXPECT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), 20));
    } // the graph dies with no context current
    EXPECT_EQ(OGL::NativeContext::currentHandle(), nullptr);
}

TEST_F(GLFramesTest, TexturesAreTouchedInTheOrderOfTheHostsCommands) {
    ByteImage bytesIn(0, 0, kWidth, kHeight);
    ByteImage bytesOut(0, 0, kWidth, kHeight);
    TextureImage textureIn(0, 0, kWidth, kHeight);
    TextureImage textureOut(0, 0, kWidth, kHeight);
    struct Row {
        ImageBase* pInput;
        ImageBase* pOutput;
        std::uint64_t nWaits;      // a frame's for the host, and the host's for the frame
        std::uint64_t nAsyncWaits; // those of an asynchronous frame, which is complete when it ends
    };
    for (Row const& row :
         {Row{bytesIn.handle(), bytesOut.handle(), 0, 0}, Row{textureIn.handle(), bytesOut.handle(), 1, 1},
          Row{bytesIn.handle(), textureOut.handle(), 2, 1},
          Row{textureIn.handle(), textureOut.handle(), 2, 1}}) {
        Chain chain(row.pInput, row.pOutput, context());
        chain.spProcessor_->processFrame(glOptions());
        ObjectCounts const objects = GLHooks::objects();
        std::uint64_t const nWaits = GLHooks::calls("glWaitSync");
        chain.spProcessor_->processFrame(glOptions());
        EXPECT_EQ(GLHooks::calls("glWaitSync") - nWaits, row.nWaits);
        chain.spProcessor_->asyncProcessFrame(glOptions());
        ASSERT_EQ(chain.spProcessor_->waitForFrame(kLong, 0.0005), IProcessorBase::FRAME_COMPLETE);
        EXPECT_EQ(GLHooks::calls("glWaitSync") - nWaits, row.nWaits + row.nAsyncWaits);
        EXPECT_EQ(GLHooks::objects(), objects);
    }
}

TEST_F(GLFramesTest, ATextureIsCompleteWhereTheHostHasNoContextToWaitIn) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    TextureImage output(0, 0, kWidth, kHeight);
    auto const pForeign = host().another(false);
    {
        Chain chain(input.handle(), output.handle(), context());
        chain.spProcessor_->processFrame(glOptions());
        ObjectCounts const objects = GLHooks::objects();
        for (bool const bForeign : {false, true}) {
            output.write(std::vector<std::uint8_t>(4 * kWidth * kHeight, 1));
            if (bForeign) {
                pForeign->makeCurrent();
            } else {
                host().release();
            }
            std::uint64_t const nFinishes = GLHooks::calls("glFinish");
            chain.spProcessor_->processFrame(glOptions());
            EXPECT_EQ(GLHooks::calls("glFinish") - nFinishes, 1u);
            EXPECT_EQ(GLHooks::objects(), objects);
            host().makeCurrent();
            EXPECT_EQ(output.read(), plus(pattern(kWidth, kHeight), 10));
        }
    }
}

TEST_F(GLFramesTest, RunUnderAForeignContext) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage output(0, 0, kWidth, kHeight);
    Chain chain(input.handle(), output.handle(), context());
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    chain.spProcessor_->processFrame(glOptions());
    EXPECT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), 10));
    EXPECT_EQ(OGL::NativeContext::currentHandle(), pForeign->handle());
    host().makeCurrent();
}

TEST_F(GLFramesTest, ATextureIsRefusedUnderAForeignContext) {
    TextureImage image(0, 0, kWidth, kHeight);
    auto const pForeign = host().another(false);
    pForeign->makeCurrent();
    bool bThrown = false;
    try {
        image.handle()->setPixelStorage(&image.texture());
    } catch (InternalException const& exception) {
        bThrown = true;
        std::string const sText = exception.message();
        EXPECT_EQ(sText.rfind("Current context of value ", 0), 0u) << sText;
        EXPECT_NE(sText.find(" does not share with any context used to initialize image_runtime"),
                  std::string::npos);
    }
    EXPECT_TRUE(bThrown);
    host().makeCurrent();
    EXPECT_EQ(image.handle()->getPixelStorage(), &image.texture());
}

TEST_F(GLFramesTest, TwoProcessorsOnTwoContextsOfAGroup) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage outputA(0, 0, kWidth, kHeight);
    ByteImage outputB(0, 0, kWidth, kHeight);
    auto const pSecond = host().another(true);
    pSecond->makeCurrent();
    auto const pSecondContext = OGL::Context::adoptCurrent();
    host().makeCurrent();
    {
        Chain a(input.handle(), outputA.handle(), context());
        Chain b(input.handle(), outputB.handle(), pSecondContext.get());
        for (int steps = 1; steps < 4; ++steps) {
            a.add(steps);
            b.add(2 * steps);
            a.spProcessor_->asyncProcessFrame(glOptions());
            ASSERT_EQ(a.spProcessor_->waitForFrame(kLong, 0.0005), IProcessorBase::FRAME_COMPLETE);
            b.spProcessor_->processFrame(glOptions());
            EXPECT_EQ(outputA.bytes(), plus(pattern(kWidth, kHeight), steps));
            EXPECT_EQ(outputB.bytes(), plus(pattern(kWidth, kHeight), 2 * steps));
        }
    }
}

// ---- Asynchronous frames

std::atomic<int> nCallbacks{0};

bool countCallback(void*) {
    ++nCallbacks;
    return true;
}

TEST_F(GLFramesTest, AsynchronousFramesDrawIntoTextures) {
    TextureImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    TextureImage output(0, 0, kWidth, kHeight);
    Chain chain(input.handle(), output.handle(), context());
    chain.spProcessor_->processFrame(glOptions());
    nCallbacks = 0;
    chain.spProcessor_->setCompletionCallback(countCallback);
    for (int steps = 0; steps < 20; ++steps) {
        chain.add(steps);
        chain.spProcessor_->asyncProcessFrame(glOptions());
        while (chain.spProcessor_->frameStatus() == IProcessorBase::FRAME_RUNNING) {
            std::this_thread::yield();
        }
        ASSERT_EQ(chain.spProcessor_->waitForFrame(kLong, 0.0005), IProcessorBase::FRAME_COMPLETE);
        ASSERT_EQ(output.read(), plus(pattern(kWidth, kHeight), steps));
    }
    EXPECT_EQ(nCallbacks, 20);
}

/// The layers let frames allocate on the thread that launches them.
class GLAllocationFramesTest : public GLFrameTest {
protected:
    GLAllocationFramesTest() : GLFrameTest(Library::InitializationOptions(Library::ALLOCATE_BEFORE_LAUNCH)) {}
};

TEST_F(GLAllocationFramesTest, AreAsRightAsTheOthers) {
    ByteImage bytes(0, 0, kWidth, kHeight);
    TextureImage texture(0, 0, kWidth, kHeight);
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    for (ImageBase* const pOutput :
         {static_cast<ImageBase*>(bytes.handle()), static_cast<ImageBase*>(texture.handle())}) {
        Chain chain(input.handle(), pOutput, context());
        for (int const steps : {1, 2, 3}) {
            chain.add(steps);
            chain.spProcessor_->asyncProcessFrame(glOptions());
            ASSERT_EQ(chain.spProcessor_->waitForFrame(kLong, 0.0005), IProcessorBase::FRAME_COMPLETE);
            EXPECT_EQ(pOutput == bytes.handle() ? bytes.bytes() : texture.read(),
                      plus(pattern(kWidth, kHeight), steps));
        }
        chain.add(9);
        chain.spProcessor_->processFrame(glOptions());
        EXPECT_EQ(pOutput == bytes.handle() ? bytes.bytes() : texture.read(),
                  plus(pattern(kWidth, kHeight), 9));
    }
}

TEST_F(GLFramesTest, CancelledFramesLeaveTheNextOneRight) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage output(0, 0, kWidth, kHeight);
    Chain chain(input.handle(), output.handle(), context());
    chain.spProcessor_->processFrame(glOptions());
    for (int frame = 0; frame < 50; ++frame) {
        chain.add(frame % 40);
        chain.spProcessor_->asyncProcessFrame(glOptions());
        chain.spProcessor_->cancelFrame();
        if (frame % 3 == 0) {
            ASSERT_EQ(chain.spProcessor_->waitForFrame(kLong, 0.0005), IProcessorBase::FRAME_COMPLETE);
        }
        if (frame % 5 == 0) {
            chain.spProcessor_->processFrame(glOptions());
            ASSERT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), frame % 40));
        }
    }
    ASSERT_EQ(chain.spProcessor_->waitForFrame(kLong, 0.0005), IProcessorBase::FRAME_COMPLETE);
}

// ---- Precision and scales

TEST_F(GLFramesTest, IntermediatePrecisionKeepsWhatEightBitsLose) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spUp = makeAddShader("up");
    FilterPtr const spDown = makeAddShader("down");
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spUp);
    Connect(spUp, spDown);
    Connect(spDown, spSink);
    // Beyond white and back: 8-bit intermediates are clamped at white.
    setParameter(*spUp, "value", 1.0f);
    setParameter(*spDown, "value", -1.0f);
    auto const spProcessor = createProcessor(spSink, context());
    OptimizationOptions options = glOptions();
    spProcessor->processFrame(options);
    EXPECT_EQ(output.bytes(), std::vector<std::uint8_t>(output.bytes().size(), 0));
    options.setIntermediateBufferPrecision(OptimizationOptions::INTERMEDIATE_PRECISION_16_BIT_FLOAT);
    spProcessor->processFrame(options);
    EXPECT_EQ(output.bytes(), pattern(kWidth, kHeight));
}

TEST_F(GLFramesTest, AnUnknownIntermediatePrecisionFailsAtTheLaunch) {
    ByteImage input(0, 0, kWidth, kHeight);
    ByteImage output(0, 0, kWidth, kHeight);
    Chain chain(input.handle(), output.handle(), context());
    OptimizationOptions options = glOptions();
    options.setIntermediateBufferPrecision(static_cast<OptimizationOptions::eIntermediateBufferPrecision>(3));
    ORVO_EXPECT_INTERNAL(chain.spProcessor_->processFrame(options),
                         "Not implemented: This intermediate buffer precision is not supported\n");
    chain.spProcessor_->processFrame(glOptions());
    EXPECT_EQ(output.bytes(), std::vector<std::uint8_t>(output.bytes().size(), 10));
}

TEST_F(GLFramesTest, TexturesOnTheScaleOf32768AreScaledUpAndDown) {
    insertStandardFilters();
    constexpr auto kFormat = OGL::Texture::INTERNAL_FORMAT_RGBA16;
    constexpr auto kType = ImageDescriptor::CHANNEL_TYPE_UINT15_1;
    TextureImage input(0, 0, 3, 1, kFormat, kType);
    TextureImage output(0, 0, 3, 1, kFormat, kType);
    input.write16({0, 16384, 32768, 32768, 1, 2, 3, 4, 30000, 20000, 10000, 32768});
    SourcePtr const spSource = makeGLSource(input.handle());
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spSink);
    {
        auto const spProcessor = createProcessor(spSink, context());
        spProcessor->processFrame(glOptions());
        std::vector<std::uint16_t> const aResult = output.read16();
        std::vector<std::uint16_t> const aExpected = input.read16();
        for (std::size_t i = 0; i < aExpected.size(); ++i) {
            EXPECT_NEAR(aResult[i], aExpected[i], 1) << i;
        }
    }
    removeStandardFilters();
}

/// One texel through a standard filter, with intermediates of 8 bits.
std::vector<std::uint8_t> through(char const* name, std::vector<std::uint8_t> const& aTexel,
                                  OGL::Context const* pContext) {
    ByteImage input(0, 0, 1, 1);
    input.write(aTexel);
    ByteImage output(0, 0, 1, 1);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spFilter = FilterFactory::Instance()->create({name, "ORVO", "Norvane"});
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spFilter);
    Connect(spFilter, spSink);
    createProcessor(spSink, pContext)->processFrame(glOptions());
    return output.bytes();
}

TEST_F(GLFramesTest, PremultiplyAndUnpremultiply) {
    using Texel = std::vector<std::uint8_t>;
    insertStandardFilters();
    EXPECT_EQ(through("premultiply", {200, 100, 50, 51}, context()), (Texel{40, 20, 10, 51}));
    EXPECT_EQ(through("premultiply", {200, 100, 50, 255}, context()), (Texel{200, 100, 50, 255}));
    EXPECT_EQ(through("premultiply", {200, 100, 50, 0}, context()), (Texel{0, 0, 0, 0}));
    EXPECT_EQ(through("unpremultiply", {40, 20, 10, 51}, context()), (Texel{200, 100, 50, 51}));
    EXPECT_EQ(through("unpremultiply", {200, 100, 50, 0}, context()), (Texel{0, 0, 0, 0}));
    // 50 * 0.5000076 = 25.0004, 100 * 1.999969 = 199.9969: half and twice to the nearest byte.
    EXPECT_EQ(through("scaleDown4channel", {100, 50, 10, 200}, context()), (Texel{50, 25, 5, 100}));
    EXPECT_EQ(through("scaleUp4channel", {100, 50, 10, 120}, context()), (Texel{200, 100, 20, 240}));
    removeStandardFilters();
}

} // namespace
} // namespace ORVO::FilterGraph
