// The bilateral composite on OpenGL: what it is replaced by, and frames through it.
#include <algorithm>
#include <atomic>
#include <functional>
#include <set>

#include "orvo/filter_graph/filters/Bilateral.h"
#include "orvo/filter_graph/filters/StandardFilters.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/ExtensionManager.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/image_flow/support/GPUBilateralReference.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"
#include "tests/support/gl/GLFrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;
using gpuBilateral::Settings;
using Internal::Bilateral;

constexpr double kWait = 60.0; // seconds, far beyond what any frame here takes
constexpr int kWidth = 23;
constexpr int kHeight = 17;

using Edges = std::vector<std::string>;

/// Every connection of the graph in front of these filters, "producer -> consumer.input", sorted.
Edges edgesOf(std::vector<IFilter*> const& consumers) {
    std::set<std::string> edges;
    std::function<void(IFilter*)> const visit = [&](IFilter* pFilter) {
        for (Input* const pInput : pFilter->inputs()) {
            IFilter* const pProducer = pInput->producerFilter();
            if (pProducer == nullptr) {
                continue;
            }
            edges.insert(pProducer->identifier().name() + " -> " + pFilter->identifier().name() + "." +
                         pInput->name());
            visit(pProducer);
        }
    };
    std::for_each(consumers.begin(), consumers.end(), visit);
    return {edges.begin(), edges.end()};
}

OptimizationOptions optionsFor(OptimizationOptions::eProcessingMode eMode) {
    OptimizationOptions options;
    options.setProcessingMode(eMode);
    return options;
}

class GLBilateralTest : public GLFrameTest {
protected:
    void SetUp() override {
        GLFrameTest::SetUp();
        insertStandardFilters();
    }

    static FilterPtr create(char const* name, char const* nameSpace = "Motion Loft",
                            char const* vendor = "Norvane Works") {
        return FilterFactory::Instance()->create({name, nameSpace, vendor});
    }
};

/// producer -> bilateral -> a.in, b.left, b.right; unfolded and dumped.
struct UnfoldedGraph {
    UnfoldedGraph() {
        Internal::Connect(spProducer_.get(), &oFilter_);
        Internal::Connect(&oFilter_, spA_.get());
        Internal::Connect(&oFilter_, spB_->input("left"));
        Internal::Connect(&oFilter_, spB_->input("right"));
    }
    Edges edges() const { return edgesOf({spA_.get(), spB_.get()}); }
    Internal::Filter& node() const {
        IFilter* pFilter = spA_->input("in")->producerFilter();
        while (pFilter->identifier().name() != "Bilateral Node") {
            pFilter = (*pFilter->inputs())->producerFilter();
        }
        return dynamic_cast<Internal::Filter&>(*pFilter);
    }

    std::shared_ptr<PlainFilter> spProducer_ = makePlain("producer");
    std::shared_ptr<PlainFilter> spA_ = makePlain("a", {"in"});
    std::shared_ptr<PlainFilter> spB_ = makePlain("b", {"left", "right"});
    Bilateral oFilter_;
};

Edges const aFolded{"FastBilateralBlur -> a.in", "FastBilateralBlur -> b.left",
                    "FastBilateralBlur -> b.right", "producer -> FastBilateralBlur.src"};
Edges const aUnfoldedOnGL{"Bilateral Node -> unpremultiply.src",
                          "premultiply -> Bilateral Node.InputImage",
                          "producer -> premultiply.src",
                          "unpremultiply -> a.in",
                          "unpremultiply -> b.left",
                          "unpremultiply -> b.right"};
Edges const aUnfoldedOnCPU{"Bilateral Node -> a.in", "Bilateral Node -> b.left", "Bilateral Node -> b.right",
                           "producer -> Bilateral Node.InputImage"};

TEST_F(GLBilateralTest, UnfoldsIntoTheNodeBetweenItsCompanions) {
    UnfoldedGraph graph;
    EXPECT_EQ(aFolded, graph.edges());
    auto const spForwarder = graph.oFilter_.unFold(optionsFor(OptimizationOptions::FULL_OPTIMIZATION));
    ASSERT_NE(nullptr, spForwarder);
    EXPECT_EQ(aUnfoldedOnGL, graph.edges());
    EXPECT_TRUE(graph.node().canBuildFilterExecutable(ORVO_TARGET_GL));
    EXPECT_FALSE(graph.node().canBuildFilterExecutable(ORVO_TARGET_CPU));
    // No traversal reaches the composite any more, and the producer feeds one filter.
    EXPECT_EQ(nullptr, graph.oFilter_.input("src")->producerFilter());
    EXPECT_EQ(0U, graph.oFilter_.output()->numConsumerInputs());
    EXPECT_EQ(1U, graph.spProducer_->output()->numConsumerInputs());

    graph.oFilter_.parameter("spatialSigma")->as<float2>().setValue(float2(3.0F, 4.0F));
    graph.oFilter_.parameter("rangeSigma")->as<float>().setValue(0.5F);
    graph.oFilter_.parameter("colorize")->as<bool>().setValue(true);
    EXPECT_EQ(float2(10.0F, 10.0F), graph.node().parameter("spatialSigma")->as<float2>().value());
    spForwarder->forwardStuff();
    EXPECT_EQ(float2(3.0F, 4.0F), graph.node().parameter("spatialSigma")->as<float2>().value());
    EXPECT_EQ(0.5F, graph.node().parameter("rangeSigma")->as<float>().value());
    EXPECT_TRUE(graph.node().parameter("colorize")->as<bool>().value());
    EXPECT_EQ(0U, graph.oFilter_.clone()->output()->numConsumerInputs());
}

TEST_F(GLBilateralTest, UnfoldsIntoTheNodeAloneOnTheCPU) {
    removeStandardFilters();
    UnfoldedGraph graph;
    ASSERT_NE(nullptr, graph.oFilter_.unFold(optionsFor(OptimizationOptions::CPU_PROCESSING)));
    EXPECT_EQ(aUnfoldedOnCPU, graph.edges());
    EXPECT_TRUE(graph.node().canBuildFilterExecutable(ORVO_TARGET_CPU));
    EXPECT_FALSE(graph.node().canBuildFilterExecutable(ORVO_TARGET_GL));
}

TEST_F(GLBilateralTest, AMissingCompanionLeavesTheGraphAsItWas) {
    for (char const* const name : {"premultiply", "unpremultiply"}) {
        auto const spRemoved = FilterFactory::Instance()->remove({name, "ORVO", "Norvane", 1});
        UnfoldedGraph graph;
        ORVO_EXPECT_INTERNAL(graph.oFilter_.unFold(glOptions()), "Enforce pPrototype != NULL");
        EXPECT_EQ(aFolded, graph.edges());
        // Any version will do.
        PlainFilter other(Identifier(name, "ORVO", "Norvane", 7), {"src"});
        FilterFactory::Instance()->insert(other);
        EXPECT_NE(nullptr, graph.oFilter_.unFold(glOptions()));
        EXPECT_EQ(aUnfoldedOnGL, graph.edges());
        FilterFactory::Instance()->remove({name, "ORVO", "Norvane", 7});
        FilterFactory::Instance()->insert(*spRemoved);
    }
}

/// The bytes as a picture at (0, 0).
Texels pictureOf(std::vector<std::uint8_t> const& aBytes) {
    return Texels(pixels(0, 0, kWidth, kHeight)).fill([&](int x, int y) {
        Pixel pixel{};
        for (std::size_t c = 0; c < 4; ++c) {
            pixel[c] = aBytes[4 * static_cast<std::size_t>(y * kWidth + x) + c] / 255.0;
        }
        return pixel;
    });
}

/// What a texture of 8 bits makes of a picture.
Texels inBytes(Texels picture) {
    Texels const source = picture;
    return picture.fill([&](int x, int y) {
        Pixel pixel = source.at(x, y);
        for (double& value : pixel) {
            value = std::floor(255 * std::min(std::max(value, 0.0), 1.0) + 0.5) / 255;
        }
        return pixel;
    });
}

/// The composite over a region, with 8 bits between its parts.
Texels composite(Texels const& source, PositionExtentInPixelSpace const& region, Settings const& s) {
    Texels premultiplied(source.region());
    premultiplied.fill([&](int x, int y) {
        Pixel const p = source.at(x, y);
        return Pixel{p[0] * p[3], p[1] * p[3], p[2] * p[3], p[3]};
    });
    Texels const filtered = inBytes(gpuBilateral::filtered(inBytes(premultiplied), region, s));
    Texels result(region);
    result.fill([&](int x, int y) {
        Pixel const p = filtered.at(x, y);
        return p[3] > 0 ? Pixel{p[0] / p[3], p[1] / p[3], p[2] / p[3], p[3]} : Pixel{};
    });
    return inBytes(result);
}

Texels composite(Texels const& source, Settings const& s) { return composite(source, source.region(), s); }

void setBilateral(IFilter& filter, Settings const& s) {
    filter.parameter("spatialSigma")->as<float2>().setValue(float2(float(s.sigmaX), float(s.sigmaY)));
    filter.parameter("rangeSigma")->as<float>().setValue(s.rangeSigma);
    filter.parameter("colorize")->as<bool>().setValue(s.colorize);
}

/// source -> bilateral -> sink.
struct BilateralChain {
    BilateralChain(ImageBase* pInput, ImageBase* pOutput, OGL::Context const* pContext)
        : spSource_(makeGLSource(pInput)),
          spSink_(makeGLSink(pOutput)),
          spProcessor_(createProcessor(spSink_, pContext)) {
        Connect(spSource_, spBilateral_);
        Connect(spBilateral_, spSink_);
    }
    void set(Settings const& s) const { setBilateral(*spBilateral_, s); }

    SourcePtr spSource_;
    FilterPtr spBilateral_ = std::make_shared<Bilateral>();
    SinkPtr spSink_;
    std::shared_ptr<IProcessor> spProcessor_;
};

/// Opaque but for a corner of half transparent and one of transparent pixels.
std::vector<std::uint8_t> photograph() {
    std::vector<std::uint8_t> aBytes = pattern(kWidth, kHeight);
    for (int y = 0; y < kHeight; ++y) {
        for (int x = 0; x < kWidth; ++x) {
            std::size_t const i = 4 * static_cast<std::size_t>(y * kWidth + x) + 3;
            aBytes[i] = x + y < 8 ? 128 : x + y > kWidth + kHeight - 8 ? 0 : 255;
        }
    }
    return aBytes;
}

/// Two steps of 8 bits, and as many again for what a division by alpha makes of them.
double tolerance(double alpha) { return alpha > 0 ? 2.0 / 255.0 * (1 + 1 / alpha) / 2 + 1e-6 : 0; }

/// The largest excess over what is allowed; not positive if all is right.
double excess(Texels const& actual, Texels const& expected) {
    double dWorst = -1;
    for (int y = 0; y < kHeight; ++y) {
        for (int x = 0; x < kWidth; ++x) {
            for (std::size_t c = 0; c < 4; ++c) {
                double const difference = std::abs(actual.at(x, y)[c] - expected.at(x, y)[c]);
                dWorst = std::max(dWorst, difference - tolerance(expected.at(x, y)[3]));
            }
        }
    }
    return dWorst;
}

TEST_F(GLBilateralTest, FramesAreTheFilterOnPremultipliedColour) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(photograph());
    ByteImage output(0, 0, kWidth, kHeight);
    TextureImage texture(0, 0, kWidth, kHeight);
    for (bool const bTexture : {false, true}) {
        BilateralChain const chain(input.handle(),
                                   bTexture ? static_cast<ImageBase*>(texture.handle()) : output.handle(),
                                   context());
        std::uint64_t nLinks = 0;
        for (Settings const& s :
             {Settings{2, 3, 0.15F, false}, Settings{3, 3, 0.15F, true}, Settings{1, 4, 0.4F, true}}) {
            chain.set(s);
            chain.spProcessor_->processFrame(glOptions());
            EXPECT_LE(excess(pictureOf(bTexture ? texture.read() : output.bytes()),
                             composite(pictureOf(photograph()), s)),
                      0);
            // New values reach the node without a new graph, which would link programs.
            EXPECT_TRUE(nLinks == 0 || nLinks == GLHooks::calls("glLinkProgram"));
            nLinks = GLHooks::calls("glLinkProgram");
        }
    }
}

TEST_F(GLBilateralTest, TheSameGraphRunsOnBothTargetsInTurn) {
    ByteImage input(0, 0, kWidth, kHeight);
    std::vector<std::uint8_t> aOpaque = photograph();
    for (std::size_t i = 3; i < aOpaque.size(); i += 4) {
        aOpaque[i] = 255;
    }
    input.write(aOpaque);
    ByteImage output(0, 0, kWidth, kHeight);
    BilateralChain const chain(input.handle(), output.handle(), context());
    Settings const s{3, 2, 0.2F, true};
    chain.set(s);
    Texels const expected = composite(pictureOf(aOpaque), s);
    for (OptimizationOptions const& options : {glOptions(), cpuOptions(), glOptions(), cpuOptions()}) {
        output.fill(std::uint8_t(7));
        chain.spProcessor_->processFrame(options);
        EXPECT_LE(excess(pictureOf(output.bytes()), expected), 0);
    }
}

TEST_F(GLBilateralTest, SeveralConsumersAndTwoInARow) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(photograph());
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spFirst = create("FastBilateralBlur");
    FilterPtr const spSecond = create("FastBilateralBlur");
    FilterPtr const spMean = makeMeanShader();
    FilterPtr const spAdd = makeAddShader();
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spFirst);
    Connect(spFirst, spSecond);
    Connect(spFirst, spAdd);
    Connect(spSecond, spMean->input("a"));
    Connect(spAdd, spMean->input("b"));
    Connect(spMean, spSink);
    setParameter(*spAdd, "value", 40.0F / 255.0F);
    Settings const s{2, 2, 0.15F, false};
    setBilateral(*spFirst, s);
    setBilateral(*spSecond, s);

    Texels const photo = pictureOf(photograph());
    // The second filter asks the first one for as much more as it reaches: ceil(2.146 * 2) pixels.
    Texels const once = composite(photo, pixels(-5, -5, kWidth + 10, kHeight + 10), s);
    Texels const twice = composite(once, photo.region(), s);
    // In the middle of the picture none, one and two filters differ by far more than the tolerance.
    int const x = kWidth / 2;
    int const y = kHeight / 2;
    EXPECT_GT(std::abs(once.at(x, y)[0] - photo.at(x, y)[0]), 4 * tolerance(1));
    EXPECT_GT(std::abs(twice.at(x, y)[0] - once.at(x, y)[0]), 4 * tolerance(1));

    auto const spProcessor = createProcessor(spSink, context());
    for (int frame = 0; frame < 3; ++frame) {
        output.fill(std::uint8_t(7));
        spProcessor->processFrame(glOptions());
        Texels const result = pictureOf(output.bytes());
        for (std::size_t c = 0; c < 4; ++c) {
            double const brighter = std::min(once.at(x, y)[c] + 40.0 / 255.0, 1.0);
            EXPECT_NEAR((twice.at(x, y)[c] + brighter) / 2, result.at(x, y)[c], tolerance(1)) << c;
        }
    }
}

TEST_F(GLBilateralTest, TheNodeByItselfRunsOnOpenGLWhereThereIsAContext) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(photograph());
    ByteImage output(0, 0, kWidth, kHeight);
    SourcePtr const spSource = makeGLSource(input.handle());
    FilterPtr const spNode = create("FastBilateralFilter", "ImageFlow", "Norvane");
    SinkPtr const spSink = makeGLSink(output.handle());
    Connect(spSource, spNode);
    Connect(spNode, spSink);
    auto const spProcessor = createProcessor(spSink, context());
    spProcessor->processFrame(glOptions());
    Texels const expected = inBytes(
        gpuBilateral::filtered(pictureOf(photograph()), pixels(0, 0, kWidth, kHeight), {10, 10, 0.15F}));
    EXPECT_LE(gpuBilateral::largestDifference(pictureOf(output.bytes()), expected, true), 3.0 / 255.0);
    ORVO_EXPECT_INTERNAL(spProcessor->processFrame(cpuOptions()), "Filter will not run on selected target!");
}

TEST_F(GLBilateralTest, IsRefusedOnADriverThatCannotRunIt) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(photograph());
    ByteImage output(0, 0, kWidth, kHeight);
    BilateralChain const chain(input.handle(), output.handle(), context());
    OGL::ExtensionManager& manager = *OGL::ExtensionManager::Instance();
    for (OGL::teExtension const extension :
         {OGL::EXTENSION_ARB_TEXTURE_FLOAT, OGL::EXTENSION_APPLE_FLOAT_PIXELS,
          OGL::EXTENSION_ATI_TEXTURE_FLOAT}) {
        manager.overrideSupport(extension, false);
    }
    ORVO_EXPECT_INTERNAL(chain.spProcessor_->processFrame(glOptions()),
                         "Filter will not run on selected target!");
    // The CPU still does it, and with the driver's own answers OpenGL, too.
    EXPECT_NO_THROW(chain.spProcessor_->processFrame(cpuOptions()));
    manager.clearOverrides();
    EXPECT_NO_THROW(chain.spProcessor_->processFrame(glOptions()));
}

TEST_F(GLBilateralTest, AFrameWithoutACompanionFailsAndTheNextOneRuns) {
    ByteImage input(0, 0, kWidth, kHeight);
    ByteImage output(0, 0, kWidth, kHeight);
    BilateralChain const chain(input.handle(), output.handle(), context());
    removeStandardFilters();
    ORVO_EXPECT_INTERNAL(chain.spProcessor_->processFrame(glOptions()), "Enforce pPrototype != NULL");
    EXPECT_NO_THROW(chain.spProcessor_->processFrame(cpuOptions()));
    insertStandardFilters();
    EXPECT_NO_THROW(chain.spProcessor_->processFrame(glOptions()));
}

TEST_F(GLBilateralTest, AsynchronousAndCancelledFramesLeaveTheNextOneRight) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(photograph());
    ByteImage output(0, 0, kWidth, kHeight);
    BilateralChain const chain(input.handle(), output.handle(), context());
    Settings const s{3, 3, 0.15F, true};
    chain.set(s);
    Texels const expected = composite(pictureOf(photograph()), s);
    for (int frame = 0; frame < 20; ++frame) {
        chain.spProcessor_->asyncProcessFrame(glOptions());
        if (frame % 4 != 3) {
            chain.spProcessor_->cancelFrame();
        }
        ASSERT_EQ(IProcessorBase::FRAME_COMPLETE, chain.spProcessor_->waitForFrame(kWait, 0.0005));
        if (frame % 4 == 3) {
            EXPECT_LE(excess(pictureOf(output.bytes()), expected), 0);
            output.fill(std::uint8_t(9));
        }
    }
}

TEST_F(GLBilateralTest, EveryCallThatFailsLeavesTheNextFrameRight) {
    ByteImage input(0, 0, kWidth, kHeight);
    input.write(photograph());
    ByteImage output(0, 0, kWidth, kHeight);
    Settings const s{3, 3, 0.15F, true};
    Texels const expected = composite(pictureOf(photograph()), s);
    // What the filter does when a call fails while it is built, its own tests tell.
    BilateralChain const chain(input.handle(), output.handle(), context());
    chain.set(s);
    chain.spProcessor_->processFrame(glOptions());
    int nFailed = 0;
    bool bFired = true;
    for (std::uint64_t n = 1; bFired; ++n) {
        ASSERT_LT(n, 500U);
        TexturePool::Instance()->clearAll();
        std::string sFailed;
        {
            GLCallFailure const failure(n);
            try {
                chain.spProcessor_->processFrame(glOptions());
            } catch (ExceptionBase const&) {
                ++nFailed;
            }
            bFired = failure.hasFired();
            sFailed = failure.name();
        }
        host().makeCurrent();
        drainErrors();
        output.fill(std::uint8_t(1));
        ASSERT_NO_THROW(chain.spProcessor_->processFrame(glOptions())) << "after failed " << sFailed;
        ASSERT_LE(excess(pictureOf(output.bytes()), expected), 0) << "after failed " << sFailed;
    }
    EXPECT_GT(nFailed, 20);
}

} // namespace
} // namespace ORVO::FilterGraph
