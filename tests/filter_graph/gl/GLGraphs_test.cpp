// Which converters a graph gets where images in host memory and in textures meet, and that its frames are
// right.
#include "orvo/filter_graph/internal/GraphExecutable.h"

#include <algorithm>

#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/connectors/OutputConnector.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/GLFrameTest.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;

constexpr int kWidth = 7;
constexpr int kHeight = 5;
constexpr float kTen = 10.0f / 255.0f;

using Wires = std::vector<std::string>;

/// The compiled graph's connections, "producer -> consumer" by the names of the nodes, sorted.
Wires wiresOf(GraphExecutable& executable) {
    Wires aWires;
    auto const& spController = executable.controller();
    for (auto iNode = spController->nodesBegin(); iNode != spController->nodesEnd(); ++iNode) {
        for (std::size_t iInput = 0; iInput < (*iNode)->numberOfInputs(); ++iInput) {
            aWires.push_back((*iNode)->input(iInput)->connectedOutput()->node()->name() + " -> " +
                             (*iNode)->name());
        }
    }
    std::sort(aWires.begin(), aWires.end());
    return aWires;
}

class GLGraphsTest : public GLFrameTest {
protected:
    std::unique_ptr<GraphExecutable> build(SinkPtr const& spSink,
                                           OptimizationOptions const& options = glOptions()) {
        return std::make_unique<GraphExecutable>(spSink->getIFilter(), options, context());
    }

    static void runFrame(GraphExecutable& executable) {
        executable.propagateDOD();
        executable.propagateROI();
        executable.processFrame();
    }
};

TEST_F(GLGraphsTest, HostMemoryAtBothEndsGoesUpAndComesDown) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spAdd = makeAddShader();
    SinkPtr const spSink = makeGLSink(output.handle());
    setParameter(*spAdd, "value", kTen);
    Connect(spSource, spAdd);
    Connect(spAdd, spSink);
    auto const pExecutable = build(spSink);
    EXPECT_EQ(wiresOf(*pExecutable),
              (Wires{"AddShader -> GPU2CPU", "CPU2GPU -> AddShader", "ImageCPUInput -> CPU2GPU"}));
    EXPECT_EQ(pExecutable->controller()->imageSink()->name(), "GPU2CPU");
    for (int frame = 0; frame < 3; ++frame) {
        output.fill(std::uint8_t(1));
        runFrame(*pExecutable);
        EXPECT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), 10)) << frame;
    }
}

TEST_F(GLGraphsTest, TexturesAtBothEndsNeedNoConverter) {
    TextureImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    TextureImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spAdd = makeAddShader();
    SinkPtr const spSink = makeGLSink(output.handle());
    setParameter(*spAdd, "value", kTen);
    Connect(spSource, spAdd);
    Connect(spAdd, spSink);
    auto const pExecutable = build(spSink);
    EXPECT_EQ(wiresOf(*pExecutable), (Wires{"ImageGPUInput -> AddShader"}));
    for (int frame = 0; frame < 3; ++frame) {
        output.write(std::vector<std::uint8_t>(4 * kWidth * kHeight, 1));
        runFrame(*pExecutable);
        EXPECT_EQ(output.read(), plus(pattern(kWidth, kHeight), 10)) << frame;
    }
    EXPECT_EQ(input.read(), pattern(kWidth, kHeight)) << "the client's input was changed";
}

TEST_F(GLGraphsTest, ImagesOfBothKindsMeet) {
    ByteImage bytes(0, 0, kWidth, kHeight);
    bytes.write(pattern(kWidth, kHeight));
    TextureImage texture(0, 0, kWidth, kHeight);
    FilterPtr const spAdd = makeAddShader();
    setParameter(*spAdd, "value", kTen);
    {
        SourcePtr const spSource = makeGLSource(bytes.handle());
        SinkPtr const spSink = makeGLSink(texture.handle());
        Connect(spSource, spAdd);
        Connect(spAdd, spSink);
        auto const pExecutable = build(spSink);
        EXPECT_EQ(wiresOf(*pExecutable), (Wires{"CPU2GPU -> AddShader", "ImageCPUInput -> CPU2GPU"}));
        runFrame(*pExecutable);
        EXPECT_EQ(texture.read(), plus(pattern(kWidth, kHeight), 10));
    }
    {
        SourcePtr const spSource = makeGLSource(texture.handle());
        SinkPtr const spSink = makeGLSink(bytes.handle());
        Connect(spSource, spAdd);
        Connect(spAdd, spSink);
        auto const pExecutable = build(spSink);
        EXPECT_EQ(wiresOf(*pExecutable), (Wires{"AddShader -> GPU2CPU", "ImageGPUInput -> AddShader"}));
        runFrame(*pExecutable);
        EXPECT_EQ(bytes.bytes(), plus(pattern(kWidth, kHeight), 20));
    }
}

TEST_F(GLGraphsTest, AGraphOnTheCPUTakesAndGivesTextures) {
    TextureImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    TextureImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spAdd = makeFilter<AddConstantNode>("add");
    SinkPtr const spSink = makeGLSink(output.handle());
    setParameter(*spAdd, "value", 3.0f);
    Connect(spSource, spAdd);
    Connect(spAdd, spSink);
    auto const pExecutable = build(spSink, cpuOptions());
    EXPECT_EQ(wiresOf(*pExecutable),
              (Wires{"AddConstant -> CPU2GPU", "GPU2CPU -> AddConstant", "ImageGPUInput -> GPU2CPU"}));
    EXPECT_EQ(pExecutable->controller()->imageSink()->name(), "CPU2GPU");
    runFrame(*pExecutable);
    EXPECT_EQ(output.read(), plus(pattern(kWidth, kHeight), 3));
}

TEST_F(GLGraphsTest, TheConsumersOnOpenGLShareOneUpload) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spA = makeAddShader("a");
    FilterPtr const spB = makeAddShader("b");
    FilterPtr const spMean = makeMeanShader();
    SinkPtr const spSink = makeGLSink(output.handle());
    setParameter(*spA, "value", kTen);
    setParameter(*spB, "value", 3 * kTen);
    Connect(spSource, spA);
    Connect(spSource, spB);
    Connect(spA, spMean->input("a"));
    Connect(spB, spMean->input("b"));
    Connect(spMean, spSink);
    auto const pExecutable = build(spSink);
    EXPECT_EQ(wiresOf(*pExecutable),
              (Wires{"AddShader -> MeanShader", "AddShader -> MeanShader", "CPU2GPU -> AddShader",
                     "CPU2GPU -> AddShader", "ImageCPUInput -> CPU2GPU", "MeanShader -> GPU2CPU"}));
    runFrame(*pExecutable);
    EXPECT_EQ(output.bytes(), plus(pattern(kWidth, kHeight), 20));
}

TEST_F(GLGraphsTest, ASIMDProducerIsConvertedOnceForThePlainAndForTheTextureConsumer) {
    FloatImage input(0, 0, kWidth, kHeight, 1, 0.1f);
    FloatImage output(0, 0, kWidth, kHeight, 1, 9.0f);
    SourcePtr const spSource = makeSource(input);
    FilterPtr const spSIMD = makeFilter<SIMDGainNode>("simd");
    FilterPtr const spPlain = makeFilter<AddConstantNode>("plain");
    FilterPtr const spMean = makeMeanShader("mean", ORVO_TARGET_CPU);
    SinkPtr const spSink = makeSink(output);
    setParameter(*spSIMD, "gain", 2.0f);
    setParameter(*spPlain, "value", 0.4f);
    Connect(spSource, spSIMD);
    Connect(spSIMD, spPlain);
    Connect(spSIMD, spMean->input("a"));
    Connect(spPlain, spMean->input("b"));
    Connect(spMean, spSink);
    auto const pExecutable = build(spSink, cpuOptions());
    EXPECT_EQ(wiresOf(*pExecutable),
              (Wires{"AddConstant -> CPU2GPU", "CPU2GPU -> MeanShader", "CPU2GPU -> MeanShader",
                     "ConvertFromSIMDOptimized -> AddConstant", "ConvertFromSIMDOptimized -> CPU2GPU",
                     "ConvertToSIMDOptimized -> SIMDGain", "ImageCPUInput -> ConvertToSIMDOptimized",
                     "MeanShader -> GPU2CPU", "SIMDGain -> ConvertFromSIMDOptimized"}));
    runFrame(*pExecutable);
    // The mean of 0.2 and 0.6, which is a number of 255ths: the shader's result has 8 bits.
    for (float const value : output.pixels()) {
        EXPECT_NEAR(value, 0.4f, 1e-6f);
    }
}

TEST_F(GLGraphsTest, OneTextureFeedsTwoInputsOfAFilter) {
    TextureImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    TextureImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spMean = makeMeanShader();
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spMean->input("a"));
    Connect(spSource, spMean->input("b"));
    Connect(spMean, spSink);
    auto const pExecutable = build(spSink);
    runFrame(*pExecutable);
    EXPECT_EQ(output.read(), pattern(kWidth, kHeight));
}

TEST_F(GLGraphsTest, AGraphWithoutFiltersCopiesBetweenTheKinds) {
    ByteImage bytes(0, 0, kWidth, kHeight);
    bytes.write(pattern(kWidth, kHeight));
    TextureImage texture(0, 0, kWidth, kHeight);
    ByteImage back(0, 0, kWidth, kHeight);
    for (OptimizationOptions const& options : {glOptions(), cpuOptions()}) {
        texture.write(std::vector<std::uint8_t>(4 * kWidth * kHeight, 1));
        back.fill(std::uint8_t(1));
        {
            SourcePtr const spSource = makeGLSource(bytes.handle());
            SinkPtr const spSink = makeGLSink(texture.handle());
            Connect(spSource, spSink);
            runFrame(*build(spSink, options));
        }
        EXPECT_EQ(texture.read(), pattern(kWidth, kHeight));
        {
            SourcePtr const spSource = makeGLSource(texture.handle());
            SinkPtr const spSink = makeGLSink(back.handle());
            Connect(spSource, spSink);
            runFrame(*build(spSink, options));
        }
        EXPECT_EQ(back.bytes(), pattern(kWidth, kHeight));
    }
}

TEST_F(GLGraphsTest, ASIMDConsumerOfATextureIsRefused) {
    TextureImage input(0, 0, kWidth, kHeight);
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spGain = makeFilter<SIMDGainNode>();
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spGain);
    Connect(spGain, spSink);
    ORVO_EXPECT_INTERNAL(build(spSink, cpuOptions()),
                         "pConverter->imageInput(0)->canConnect(pOutputConnector)");
}

TEST_F(GLGraphsTest, AShaderThatDoesNotCompileIsRefusedByTheBuild) {
    ByteImage input(0, 0, kWidth, kHeight);
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spBroken = makeBrokenShader();
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spBroken);
    Connect(spBroken, spSink);
    ORVO_EXPECT_INTERNAL(build(spSink), "Filter will not run on selected target!");
}

TEST_F(GLGraphsTest, AFilterForTheCPUIsRefusedByAGraphOnOpenGL) {
    ByteImage input(0, 0, kWidth, kHeight);
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spAdd = makeFilter<AddConstantNode>("add");
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spAdd);
    Connect(spAdd, spSink);
    ORVO_EXPECT_INTERNAL(build(spSink), "Filter will not run on selected target!");
}

TEST_F(GLGraphsTest, PixelsOutsideTheRegionOfInterestStay) {
    TextureImage input(0, 0, kWidth, kHeight);
    input.write(pattern(kWidth, kHeight));
    // The sink reaches beyond the source by a column on each side and a row above and below.
    TextureImage texture(-1, -1, kWidth + 2, kHeight + 2);
    ByteImage bytes(-1, -1, kWidth + 2, kHeight + 2);
    std::vector<std::uint8_t> const aOnes(bytes.bytes().size(), 1);
    FilterPtr const spAdd = makeAddShader();
    setParameter(*spAdd, "value", kTen);
    SourcePtr const spSource = makeGLSource(input.handle());
    Connect(spSource, spAdd);
    std::vector<std::uint8_t> aExpected = aOnes;
    std::vector<std::uint8_t> const aInner = plus(pattern(kWidth, kHeight), 10);
    for (std::size_t y = 0; y < kHeight; ++y) {
        std::copy_n(aInner.begin() + static_cast<std::ptrdiff_t>(4 * kWidth * y), 4 * kWidth,
                    aExpected.begin() + static_cast<std::ptrdiff_t>(4 * ((kWidth + 2) * (y + 1) + 1)));
    }
    {
        bytes.write(aOnes);
        SinkPtr const spSink = makeGLSink(bytes.handle());
        Connect(spAdd, spSink);
        runFrame(*build(spSink));
        EXPECT_EQ(bytes.bytes(), aExpected);
    }
    {
        texture.write(aOnes);
        SinkPtr const spSink = makeGLSink(texture.handle());
        Connect(spAdd, spSink);
        runFrame(*build(spSink));
        EXPECT_EQ(texture.read(), aExpected);
    }
}

TEST_F(GLGraphsTest, TheLibraryWithoutContextRefusesOne) {
    // The layers of the fixture are up with a context; this asks a graph for one that it was not given.
    ByteImage input(0, 0, kWidth, kHeight);
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spSink);
    auto const spProcessor = createProcessor(spSink, nullptr);
    ORVO_EXPECT_INTERNAL(spProcessor->processFrame(glOptions()),
                         "Processing with FULL_OPTIMIZATION needs valid GL context.");
    spProcessor->processFrame(cpuOptions());
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
