// The filters for previews on the screen, in graphs of processors.
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

#include "orvo/filter_graph/filters/StandardFilters.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/image_runtime/TexturePool.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/GLFrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;
using Bytes = std::vector<std::uint8_t>;

class GLPreviewsTest : public GLFrameTest {
protected:
    void SetUp() override {
        GLFrameTest::SetUp();
        insertStandardFilters();
    }
    void TearDown() override {
        removeStandardFilters();
        GLFrameTest::TearDown();
    }

    static FilterPtr make(char const* name) {
        return FilterFactory::Instance()->create({name, "ImageFlow", "Norvane"});
    }
};

/// Four texels of host memory through a filter and back; its second input takes the mask.
struct PreviewGraph {
    PreviewGraph(FilterPtr const& spFilter, OGL::Context const* pContext)
        : spFilter_(spFilter),
          spSource_(makeGLSource(oInput_.handle())),
          spMask_(makeGLSource(oMask_.handle())),
          spSink_(makeGLSink(oOutput_.handle())),
          spProcessor_(createProcessor(spSink_, pContext)) {
        oInput_.write({200, 100, 50, 255, 0, 0, 0, 0, 40, 80, 120, 255, 20, 40, 10, 51});
        oMask_.write({255, 255, 255, 255, 0, 0, 0, 0, 255, 0, 255, 0, 51, 51, 51, 51});
        Connect(spSource_, spFilter->input("InputImage"));
        if (spFilter->getNumberOfInputs() == 2)
            Connect(spMask_, spFilter->input("GamutTestResultInputImage"));
        Connect(spFilter, spSink_);
    }

    Bytes run() {
        spProcessor_->processFrame(glOptions());
        return oOutput_.bytes();
    }

    ByteImage oInput_{0, 0, 4, 1};
    ByteImage oMask_{0, 0, 4, 1};
    ByteImage oOutput_{0, 0, 4, 1};
    FilterPtr spFilter_;
    SourcePtr spSource_;
    SourcePtr spMask_;
    SinkPtr spSink_;
    std::shared_ptr<IProcessor> spProcessor_;
};

TEST_F(GLPreviewsTest, ShowTheirInputsAndParameters) {
    struct Row {
        char const* name;
        std::vector<std::string> inputs;
        std::vector<std::string> parameters;
    };
    Row const rows[] = {
        {"MirelCheckerBoardGPU", {"InputImage"}, {"colorA", "colorB", "checkerSize", "compositeGamma"}},
        {"MirelToneMappingGPU",
         {"InputImage"},
         {"exposureGammaOrHDRCompression", "exposure", "gamma", "luminanceFactor"}},
        {"MirelGamutComposite", {"InputImage", "GamutTestResultInputImage"}, {"color", "opacity"}},
    };
    for (Row const& row : rows) {
        FilterPtr const spFilter = make(row.name);
        EXPECT_EQ(row.inputs.size(), spFilter->getNumberOfInputs()) << row.name;
        for (std::string const& input : row.inputs)
            EXPECT_TRUE(spFilter->input(input)) << row.name << " " << input;
        EXPECT_EQ(row.parameters.size(), spFilter->getNumberOfParameters()) << row.name;
        for (std::string const& parameter : row.parameters)
            EXPECT_TRUE(spFilter->parameter(parameter)) << row.name << " " << parameter;
    }
}

TEST_F(GLPreviewsTest, LayImagesOverACheckerBoard) {
    FilterPtr const spFilter = make("MirelCheckerBoardGPU");
    PreviewGraph graph(spFilter, context());
    spFilter->parameter("checkerSize")->as<float2>().setValue(float2(2, 2));
    // Cells of two texels: (1, 1, 1) and (0.8, 0.8, 0.8), of which a fifth is covered in the last texel.
    EXPECT_EQ((Bytes{200, 100, 50, 255, 255, 255, 255, 255, 40, 80, 120, 255, 183, 203, 173, 255}),
              graph.run());
    spFilter->parameter("colorB")->as<float4>().setValue(float4(0, 0, 0, 1));
    EXPECT_EQ((Bytes{200, 100, 50, 255, 255, 255, 255, 255, 40, 80, 120, 255, 20, 40, 10, 255}), graph.run());
}

TEST_F(GLPreviewsTest, MapTones) {
    FilterPtr const spFilter = make("MirelToneMappingGPU");
    PreviewGraph graph(spFilter, context());
    setParameter(*spFilter, "exposure", -1.0f);
    Bytes const result = graph.run();
    Bytes const expected{100, 50, 25, 255, 0, 0, 0, 0, 20, 40, 60, 255, 10, 20, 5, 51};
    for (std::size_t i = 0; i < expected.size(); ++i) {
        bool const bColourOfBlack = i >= 4 && i < 7; // the driver's
        EXPECT_LE(bColourOfBlack ? 0 : std::abs(int(expected[i]) - int(result[i])), 1) << i;
    }
}

TEST_F(GLPreviewsTest, MarkWhatLiesOutsideAGamut) {
    FilterPtr const spFilter = make("MirelGamutComposite");
    PreviewGraph graph(spFilter, context());
    spFilter->parameter("color")->as<float4>().setValue(float4(1, 0, 0, 1));
    setParameter(*spFilter, "opacity", 1.0f);
    // Inside; outside; red, blue inside; a fifth inside: 20 / 5 + 255 * 4 / 5 = 208, 40 / 5, 10 / 5, 51 / 5 +
    // 204.
    Bytes const expected{200, 100, 50, 255, 255, 0, 0, 255, 40, 0, 120, 255, 208, 8, 2, 214};
    EXPECT_EQ(expected, graph.run());
    // On the thread of a frame.
    graph.oOutput_.fill(1);
    graph.spProcessor_->asyncProcessFrame(glOptions());
    EXPECT_EQ(IProcessorBase::FRAME_COMPLETE, graph.spProcessor_->waitForFrame(60, 0.0005));
    EXPECT_EQ(expected, graph.oOutput_.bytes());
}

TEST_F(GLPreviewsTest, CancelledFramesLeaveTheNextOneRight) {
    for (char const* name : {"MirelCheckerBoardGPU", "MirelToneMappingGPU", "MirelGamutComposite"}) {
        PreviewGraph graph(make(name), context());
        Bytes const expected = graph.run();
        for (int frame = 0; frame < 6; ++frame) {
            graph.spProcessor_->asyncProcessFrame(glOptions());
            graph.spProcessor_->cancelFrame();
            ASSERT_EQ(IProcessorBase::FRAME_COMPLETE, graph.spProcessor_->waitForFrame(60, 0.0005));
            graph.oOutput_.fill(1);
            EXPECT_EQ(expected, graph.run()) << name;
        }
    }
}

TEST_F(GLPreviewsTest, EveryCallThatFailsLeavesTheNextFrameRight) {
    for (char const* name : {"MirelCheckerBoardGPU", "MirelToneMappingGPU", "MirelGamutComposite"}) {
        PreviewGraph graph(make(name), context());
        Bytes const expected = graph.run();
        int nFailed = 0;
        bool bFired = true;
        for (std::uint64_t n = 1; bFired; ++n) {
            {
                GLCallFailure const failure(n);
                try {
                    graph.run();
                } catch (ExceptionBase const&) {
                    ++nFailed;
                }
                bFired = failure.hasFired();
            }
            host().makeCurrent();
            drainErrors();
            graph.oOutput_.fill(1);
            ASSERT_EQ(expected, graph.run()) << name << " after call " << n;
        }
        EXPECT_GT(nFailed, 3) << name;
    }
}

TEST_F(GLPreviewsTest, AreRefusedOnTheCPU) {
    for (char const* name : {"MirelCheckerBoardGPU", "MirelToneMappingGPU", "MirelGamutComposite"}) {
        PreviewGraph graph(make(name), context());
        OptimizationOptions options = glOptions();
        options.setProcessingMode(OptimizationOptions::CPU_PROCESSING);
        ORVO_EXPECT_INTERNAL(graph.spProcessor_->processFrame(options),
                             "Filter will not run on selected target!");
        EXPECT_NO_THROW(graph.run()) << name;
    }
}

} // namespace
} // namespace ORVO::FilterGraph
