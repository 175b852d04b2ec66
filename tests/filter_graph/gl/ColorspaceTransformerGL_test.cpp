// The colour transformer in frames on OpenGL.
#include "orvo/filter_graph/filters/ColorspaceTransformer.h"

#include "orvo/colour_engine/EngineStatistics.h"
#include "orvo/colour_engine/ProfileRegistry.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "tests/colour_engine/support/ICCProfiles.h"
#include "tests/filter_graph/support/ColourGraph.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/GLFrameTest.h"

#include <cmath>
#include <set>

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;
using namespace ORVO::ColourEngine;

constexpr std::uint32_t kNoCode = profileCode("none");
/// sRGB, with sampled curves: they are textures.
constexpr std::uint32_t kSampled = profileCode("File");

/// source -> transformers -> sink, in textures.
class GLColourGraph {
public:
    GLColourGraph(OGL::Context const* pContext, ImageBase* pInput, ImageBase* pOutput,
                  std::vector<FilterPtr> const& aFilters)
        : aFilters_(aFilters),
          spSource_(makeGLSource(pInput)),
          spSink_(makeGLSink(pOutput)),
          spProcessor_(createProcessor(spSink_, pContext)) {
        Connect(spSource_, aFilters_.front());
        for (std::size_t i = 1; i < aFilters_.size(); ++i)
            Connect(aFilters_[i - 1], aFilters_[i]);
        Connect(aFilters_.back(), spSink_);
    }

    IFilter& filter() { return *aFilters_.front(); }
    void frame(OptimizationOptions const& options = glOptions()) { spProcessor_->processFrame(options); }

private:
    std::vector<FilterPtr> aFilters_;
    SourcePtr spSource_;
    SinkPtr spSink_;
    std::shared_ptr<IProcessor> spProcessor_;
};

class ColorspaceTransformerGLTest : public GLFrameTest {
protected:
    ColorspaceTransformerGLTest() {
        RecordingEngine::install();
        Bytes const aBytes = sampledProfile();
        registerProfile(kSampled, aBytes.data(), aBytes.size());
    }
    ~ColorspaceTransformerGLTest() override { unregisterProfile(kSampled); }
};

TEST_F(ColorspaceTransformerGLTest, FramesFollowTheCodes) {
    PackedImage<std::uint8_t> input(37, 23);
    PackedImage<std::uint8_t> output(37, 23);
    input.fillAtRandom(1);
    GLColourGraph graph(context(), input.handle(), output.handle(),
                        {makeTransformer(PROFILE_SRGB, PROFILE_SRGB)});
    for (auto const& [source, destination] : {std::pair(PROFILE_SRGB, PROFILE_WIDE_GAMUT),
                                              {PROFILE_WIDE_GAMUT, PROFILE_SRGB},
                                              {PROFILE_DISPLAY_P3, PROFILE_BT_2020},
                                              {kSampled, PROFILE_WIDE_GAMUT},
                                              {PROFILE_LINEAR_SRGB, PROFILE_SRGB},
                                              {PROFILE_WIDE_GAMUT, kSampled},
                                              {kSampled, kSampled}}) {
        setCodes(graph.filter(), source, destination);
        graph.frame();
        EXPECT_LE(largestDifference(transformed(input.pixels(), source, destination), output.pixels()), 1);
    }
}

TEST_F(ColorspaceTransformerGLTest, FloatImagesPassInHalves) {
    // The same colours as words, for the engine, and as floats.
    PackedImage<std::uint16_t> words(37, 23);
    words.fillAtRandom(2);
    FloatImage input(0, 0, 37, 23, 4);
    FloatImage output(0, 0, 37, 23, 4);
    for (std::size_t i = 0; i < input.pixels().size(); ++i)
        input.pixels()[i] = float(words.pixels()[i]) / 32768.0F;
    GLColourGraph graph(context(), input.handle(), output.handle(),
                        {makeTransformer(PROFILE_SRGB, PROFILE_WIDE_GAMUT)});
    OptimizationOptions options = glOptions();
    options.setIntermediateBufferPrecision(OptimizationOptions::INTERMEDIATE_PRECISION_16_BIT_FLOAT);
    graph.frame(options);
    auto const aExpected = transformed(words.pixels(), PROFILE_SRGB, PROFILE_WIDE_GAMUT);
    float largest = 0.0F;
    for (std::size_t i = 0; i < aExpected.size(); ++i)
        largest = std::max(largest, std::abs(output.pixels()[i] - float(aExpected[i]) / 32768.0F));
    EXPECT_LE(largest, 1e-3F);
}

TEST_F(ColorspaceTransformerGLTest, ThereAndBackIsWithinOne) {
    // Colours as in a photograph, up to 80 apart from channel to channel: at the edges of the gamut, where a
    // dark channel is the difference of two light ones, the steps of halves are more than one of bytes.
    PackedImage<std::uint8_t> bytes(64, 64);
    bytes.fillAtRandom(3);
    for (std::size_t i = 0; i < bytes.pixels().size(); ++i)
        bytes.pixels()[i] = static_cast<std::uint8_t>(i / 4 % 64 * 175 / 63 + bytes.pixels()[i] * 80 / 255);
    FloatImage input(0, 0, 64, 64, 4);
    FloatImage output(0, 0, 64, 64, 4);
    for (std::size_t i = 0; i < input.pixels().size(); ++i)
        input.pixels()[i] = float(bytes.pixels()[i]) / 255.0F;
    GLColourGraph graph(context(), input.handle(), output.handle(),
                        {makeTransformer(PROFILE_SRGB, PROFILE_WIDE_GAMUT),
                         makeTransformer(PROFILE_WIDE_GAMUT, PROFILE_SRGB)});
    OptimizationOptions options = glOptions();
    options.setIntermediateBufferPrecision(OptimizationOptions::INTERMEDIATE_PRECISION_16_BIT_FLOAT);
    graph.frame(options);
    std::vector<std::uint8_t> aBack;
    for (float const value : output.pixels())
        aBack.push_back(static_cast<std::uint8_t>(std::clamp(value, 0.0F, 1.0F) * 255.0F + 0.5F));
    EXPECT_LE(largestDifference(bytes.pixels(), aBack), 1);
}

TEST_F(ColorspaceTransformerGLTest, FramesWithTheSameCodesMakeNothing) {
    PackedImage<std::uint8_t> input(16, 16);
    PackedImage<std::uint8_t> output(16, 16);
    input.fillAtRandom(4);
    // Without tables, and with them.
    for (std::uint32_t const source : {PROFILE_SRGB, kSampled}) {
        GLColourGraph graph(context(), input.handle(), output.handle(),
                            {makeTransformer(source, PROFILE_WIDE_GAMUT)});
        auto const nUploads = GLHooks::calls("glTexSubImage1D");
        for (int i = 0; i < 3; ++i)
            graph.frame();
        EXPECT_EQ(source == kSampled, GLHooks::calls("glTexSubImage1D") > nUploads);
        auto const nShaderCalls = RecordingEngine::shaderCalls();
        EXPECT_GT(nShaderCalls, 0U);
        std::set<std::string> const aNames{"glLinkProgram",   "glGenTextures",   "glTexImage1D",
                                           "glTexSubImage1D", "glTexSubImage3D", "glCreateShader"};
        std::map<std::string, std::uint64_t> before;
        for (std::string const& sName : aNames)
            before[sName] = GLHooks::calls(sName);
        ObjectCounts const objects = GLHooks::objects();
        for (int i = 0; i < 20; ++i)
            graph.frame();
        EXPECT_EQ(nShaderCalls, RecordingEngine::shaderCalls());
        for (std::string const& sName : aNames)
            EXPECT_EQ(before[sName], GLHooks::calls(sName)) << sName;
        EXPECT_EQ(objects, GLHooks::objects());
        EXPECT_LE(largestDifference(transformed(input.pixels(), source, PROFILE_WIDE_GAMUT), output.pixels()),
                  1);
    }
}

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr int kManyFrames = 500; // ten times slower, on the same roads
#else
constexpr int kManyFrames = 10000;
#endif

// Frames of 2 by 2 pixels, codes changed fifty times: what a change makes is given back, tables as well.
// Counted are OpenGL's objects of every kind, tracked blocks and bytes, and the engine's objects.
TEST_F(ColorspaceTransformerGLTest, ThousandsOfFramesLeaveNothing) {
    PackedImage<std::uint8_t> input(2, 2);
    PackedImage<std::uint8_t> output(2, 2);
    GLColourGraph graph(context(), input.handle(), output.handle(),
                        {makeTransformer(PROFILE_SRGB, PROFILE_WIDE_GAMUT)});
    constexpr std::pair<std::uint32_t, std::uint32_t> aCodes[] = {
        {PROFILE_SRGB, PROFILE_WIDE_GAMUT}, {kSampled, PROFILE_DISPLAY_P3}, {PROFILE_SRGB, PROFILE_BT_2020}};
    auto const frame = [&](int iCodes) {
        setCodes(graph.filter(), aCodes[iCodes % 3].first, aCodes[iCodes % 3].second);
        graph.frame();
    };
    for (int i = 0; i < 7; ++i)
        frame(i / 2);
    auto const counts = [] {
        EngineStatistics const engine = engineStatistics();
        return std::vector<std::size_t>{Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT),
                                        Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT),
                                        Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE),
                                        engine.nProfiles,
                                        engine.nTransforms,
                                        engine.nShaders,
                                        engine.nStrings,
                                        engine.nErrors};
    };
    auto const before = counts();
    ObjectCounts const objects = GLHooks::objects();
    for (int i = 0; i < kManyFrames; ++i)
        frame(i / (kManyFrames / 50));
    frame(0);
    EXPECT_EQ(before, counts());
    EXPECT_EQ(objects, GLHooks::objects());
}

TEST_F(ColorspaceTransformerGLTest, FramesWithUnknownCodesFailAndTheNextIsRight) {
    PackedImage<std::uint8_t> input(5, 4);
    PackedImage<std::uint8_t> output(5, 4);
    input.fillAtRandom(5);
    GLColourGraph graph(context(), input.handle(), output.handle(), {makeTransformer(kNoCode, kNoCode)});
    ORVO_EXPECT_INTERNAL(graph.frame(), "Cannot make src profile from code");
    setCodes(graph.filter(), PROFILE_SRGB, kNoCode);
    ORVO_EXPECT_INTERNAL(graph.frame(), "Cannot make dst profile from code");
    setCodes(graph.filter(), PROFILE_SRGB, PROFILE_DISPLAY_P3);
    graph.frame();
    EXPECT_LE(
        largestDifference(transformed(input.pixels(), PROFILE_SRGB, PROFILE_DISPLAY_P3), output.pixels()), 1);
}

TEST_F(ColorspaceTransformerGLTest, SurvivesEveryFailingCall) {
    PackedImage<std::uint8_t> input(5, 4);
    PackedImage<std::uint8_t> output(5, 4);
    input.fillAtRandom(6);
    auto const aExpected = transformed(input.pixels(), kSampled, PROFILE_DISPLAY_P3);
    GLColourGraph graph(context(), input.handle(), output.handle(),
                        {makeTransformer(kSampled, PROFILE_DISPLAY_P3)});
    for (char const* pName :
         {"glGenTextures", "glTexImage2D", "glTexSubImage1D", "glCreateProgram", "glCreateShader",
          "glCompileShader", "glLinkProgram", "glFramebufferTexture2D", "glCheckFramebufferStatus"}) {
        bool bFailed = true;
        std::uint64_t n = 1;
        for (; bFailed && n < 100; ++n) {
            // Another transform and nothing in the pool, so that program and tables are filled and the rest
            // is made.
            setCodes(graph.filter(), kSampled, n % 2 == 0 ? PROFILE_BT_2020 : PROFILE_WIDE_GAMUT);
            TexturePool::Instance()->clearAll();
            {
                GLCallFailure const failure(pName, n);
                try {
                    graph.frame();
                } catch (OGL::ExceptionOGL const&) {
                    EXPECT_TRUE(failure.hasFired());
                }
                bFailed = failure.hasFired();
            }
            setCodes(graph.filter(), kSampled, PROFILE_DISPLAY_P3);
            graph.frame();
            EXPECT_LE(largestDifference(aExpected, output.pixels()), 1) << pName << " " << n;
        }
        EXPECT_FALSE(bFailed);
        EXPECT_GT(n, 2U) << pName << " was not called";
    }
}

class ColorspaceTransformerGLWithoutEngineTest : public GLFrameTest {
protected:
    ColorspaceTransformerGLWithoutEngineTest() { Core::Library::setQuorGetAddressProc(nullptr); }
};

TEST_F(ColorspaceTransformerGLWithoutEngineTest, SaysSoAndOtherFiltersRun) {
    PackedImage<std::uint8_t> input(4, 4);
    PackedImage<std::uint8_t> output(4, 4);
    {
        GLColourGraph graph(context(), input.handle(), output.handle(),
                            {makeTransformer(PROFILE_SRGB, PROFILE_BT_2020)});
        ORVO_EXPECT_INTERNAL(graph.frame(), "Cannot make src profile from code");
    }
    FilterPtr const spAdd = makeAddShader();
    setParameter(*spAdd, "value", 0.5F);
    GLColourGraph graph(context(), input.handle(), output.handle(), {spAdd});
    graph.frame();
    EXPECT_LE(largestDifference(std::vector<std::uint8_t>(64, 128), output.pixels()), 1);
}

} // namespace
} // namespace ORVO::FilterGraph
