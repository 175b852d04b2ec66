// Frames of the colour transformer on OpenGL: pictures of one to four channels, and the way there and back.
#include <epoxy/gl.h>

#include <memory>
#include <vector>

#include "orvo/filter_graph/impl/ImageGL.h"
#include "tests/filter_graph/support/GLColourGraph.h"
#include "tests/filter_graph/support/GreyTransforms.h"
#include "tests/filter_graph/support/RoundTrips.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;
using namespace ORVO::ColourEngine;

class ColorspaceFramesGL : public GLFrameTest {};

TEST_F(ColorspaceFramesGL, GreyGoesInAsRGBAndComesOutAsGreen) {
    UnevenProfile const profile;
    for (GreyRow const& row : greyRows()) {
        SCOPED_TRACE(row.pName_);
        PackedImage<std::uint8_t> input(16, 16, row.nInput_);
        PackedImage<std::uint8_t> output(16, 16, row.nOutput_);
        fillWithLightColours(input);
        GLColourGraph graph(context(), input.handle(), output.handle(), row.filters());
        graph.frame();
        expectResultOf(row, input.pixels(), output.pixels());
    }
}

TEST_F(ColorspaceFramesGL, GreenGoesThroughOtherFiltersIntoGrey) {
    UnevenProfile const profile;
    GreyRow const& row = greyRows()[5]; // RGB to grey
    PackedImage<std::uint8_t> input(16, 16, row.nInput_);
    PackedImage<std::uint8_t> output(16, 16, row.nOutput_);
    fillWithLightColours(input);
    std::vector<FilterPtr> aFilters = row.filters();
    aFilters.push_back(makeAddShader());
    setParameter(*aFilters.back(), "value", 0.0F);
    GLColourGraph graph(context(), input.handle(), output.handle(), aFilters);
    graph.frame();
    expectResultOf(row, input.pixels(), output.pixels());
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
    GLColourGraph graph(context(), input.handle(), &output, row.filters());
    graph.frame();
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
    PackedImage<std::uint8_t> input(64, 64);
    PackedImage<std::uint8_t> output(64, 64);
    GLColourGraph graph(context(), input.handle(), output.handle(), roundTrip());
    OptimizationOptions inHalves = glOptions();
    inHalves.setIntermediateBufferPrecision(OptimizationOptions::INTERMEDIATE_PRECISION_16_BIT_FLOAT);
    for (RoundTripRow const& row : roundTripRows()) {
        SCOPED_TRACE(row.pName_);
        row.fill(input);
        graph.frame();
        row.expectWithin(input.pixels(), output.pixels());
        if (row.nRange_ > 80)
            continue;
        // Halves are off by 1 / 2048 at most, up to white, a quarter of what bytes are: 4.7 codes become 1.2.
        graph.frame(inHalves);
        EXPECT_LE(largestDifference(input.pixels(), output.pixels()), 1);
    }
}

} // namespace
} // namespace ORVO::FilterGraph
