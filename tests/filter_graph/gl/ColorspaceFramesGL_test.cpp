// Frames of the colour transformer on OpenGL: pictures of one to four channels, and the way there and back.
#include <epoxy/gl.h>

#include <memory>
#include <vector>

#include "orvo/filter_graph/impl/ImageGL.h"
#include "tests/filter_graph/support/ColourGraph.h"
#include "tests/filter_graph/support/GreyTransforms.h"
#include "tests/filter_graph/support/RoundTrips.h"
#include "tests/support/gl/GLFrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;
using namespace ORVO::ColourEngine;

class ColorspaceFramesGL : public GLFrameTest {};

TEST_F(ColorspaceFramesGL, GreyGoesInAsRGBAndComesOutAsGreen) {
    UnevenProfile const profile;
    for (GreyRow const& row : greyRows()) {
        SCOPED_TRACE(row.pName_);
        PackedColourGraph<std::uint8_t> graph(16, 16, row.filters(), row.nInput_, row.nOutput_, context());
        fillWithLightColours(graph.oInput_);
        graph.spProcessor_->processFrame(glOptions());
        expectResultOf(row, graph.oInput_.pixels(), graph.oOutput_.pixels());
    }
}

TEST_F(ColorspaceFramesGL, GreenGoesThroughOtherFiltersIntoGrey) {
    UnevenProfile const profile;
    GreyRow const& row = greyRows()[5]; // RGB to grey
    std::vector<FilterPtr> aFilters = row.filters();
    aFilters.push_back(makeAddShader());
    setParameter(*aFilters.back(), "value", 0.0F);
    PackedColourGraph<std::uint8_t> graph(16, 16, aFilters, row.nInput_, row.nOutput_, context());
    fillWithLightColours(graph.oInput_);
    graph.spProcessor_->processFrame(glOptions());
    expectResultOf(row, graph.oInput_.pixels(), graph.oOutput_.pixels());
}

TEST_F(ColorspaceFramesGL, AGreyTextureOfTheHostsGetsGreen) {
    UnevenProfile const profile;
    GreyRow const& row = greyRows()[5]; // RGB to grey
    PackedImage<std::uint8_t> input(16, 16, row.nInput_);
    fillWithLightColours(input);
    OGL::Texture2D texture(OGL::Texture::INTERNAL_FORMAT_LUMINANCE8, 16, 16, false, nullptr);
    ImageGL output(
        ImageDescriptorGL({row.nOutput_, ImageDescriptor::CHANNEL_TYPE_UINT8}, PixelExtentInWorldSpace()),
        PositionExtentInPixelSpace(PositionInPixelSpace(0, 0), ExtentInPixelSpace(16, 16)), &texture);
    FilterPtr const spFilter = row.filters().front();
    SourcePtr const spSource = makeGLSource(input.handle());
    SinkPtr const spSink = makeGLSink(&output);
    Connect(spSource, spFilter);
    Connect(spFilter, spSink);
    createProcessor(spSink, context())->processFrame(glOptions());
    std::vector<std::uint8_t> aResult(256);
    glBindTexture(GL_TEXTURE_2D, texture.objectID());
    glGetTexImage(GL_TEXTURE_2D, 0, GL_LUMINANCE, GL_UNSIGNED_BYTE, aResult.data());
    glBindTexture(GL_TEXTURE_2D, 0);
    expectResultOf(row, input.pixels(), aResult);
}

// Another image at the graph's end makes another result of the same transform.
TEST_F(ColorspaceFramesGL, TheImageAtTheEndDecides) {
    UnevenProfile const profile;
    PackedImage<std::uint8_t> input(16, 16, 1);
    fillWithLightColours(input);
    FilterPtr const spFilter = makeTransformer(UnevenProfile::kCode, PROFILE_LINEAR_SRGB);
    SourcePtr const spSource = makeGLSource(input.handle());
    SinkPtr const spSink = createOutputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    auto const spProcessor = createProcessor(spSink, context());
    Connect(spSource, spFilter);
    Connect(spFilter, spSink);
    GreyRow const& greyRow = greyRows().front();
    for (std::size_t const nOutput : {1U, 3U, 1U}) {
        PackedImage<std::uint8_t> output(16, 16, nOutput);
        spSink->setImage(output.handle());
        spProcessor->processFrame(glOptions());
        GreyRow const row = {"", 1, nOutput, {}, nOutput == 1 ? greyRow.result_ : greyRows()[4].result_, 1};
        expectResultOf(row, input.pixels(), output.pixels());
        spSink->setImage(nullptr);
    }
}

TEST_F(ColorspaceFramesGL, InBytesThereAndBackIsAsFarAsBytesCarry) {
    PackedColourGraph<std::uint8_t> graph(64, 64, roundTrip(), 4, 4, context());
    auto const& aThere = graph.oInput_.pixels();
    auto const& aBack = graph.oOutput_.pixels();
    OptimizationOptions inHalves = glOptions();
    inHalves.setIntermediateBufferPrecision(OptimizationOptions::INTERMEDIATE_PRECISION_16_BIT_FLOAT);
    for (RoundTripRow const& row : roundTripRows()) {
        SCOPED_TRACE(row.pName_);
        row.fill(graph.oInput_);
        graph.spProcessor_->processFrame(glOptions());
        row.expectWithin(aThere, aBack);
        if (row.nRange_ > 80)
            continue;
        // Halves are off by 1 / 2048 at most, up to white, a quarter of what bytes are: 4.7 codes become 1.2.
        graph.spProcessor_->processFrame(inHalves);
        EXPECT_LE(largestDifference(aThere, aBack), 1);
    }
}

} // namespace
} // namespace ORVO::FilterGraph
