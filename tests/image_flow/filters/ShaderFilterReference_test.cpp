// Shader filters against computations in double, over random pictures with values outside 0..1. Every row
// also checks that its tolerance tells the result from a shifted, swapped, brightened or cut one.

#include "tests/image_flow/support/ShaderRoad.h"

#include <string>

namespace {

using namespace ORVO;
using namespace ORVO::Test;

/// Where input and output lie.
struct Place {
    char const* pName_;
    PositionExtentInPixelSpace oInput_;
    PixelExtentInWorldSpace oPixelExtent_;
    PositionExtentInPixelSpace oOutput_;
};

Place const aPlaces[] = {
    {"Origin", pixels(0, 0, 13, 7), {1.0f, 1.0f}, pixels(0, 0, 13, 7)},
    {"PowersOfTwo", pixels(0, 0, 16, 8), {1.0f, 1.0f}, pixels(0, 0, 16, 8)},
    {"Negative", pixels(-21, -9, 17, 11), {1.0f, 1.0f}, pixels(-21, -9, 17, 11)},
    {"SmallPixels", pixels(-5, 3, 15, 9), {0.5f, 0.25f}, pixels(-5, 3, 15, 9)},
    {"LargePixels", pixels(4, -8, 9, 15), {2.0f, 1.5f}, pixels(4, -8, 9, 15)},
    {"RegionInside", pixels(-6, -4, 19, 13), {1.0f, 1.0f}, pixels(-3, -2, 11, 5)},
    {"RegionInsideLargePixels", pixels(-6, -4, 19, 13), {1.25f, 0.75f}, pixels(-1, 2, 7, 6)},
    {"OnePixelWide", pixels(3, 2, 1, 9), {1.0f, 1.0f}, pixels(3, 2, 1, 9)},
};

ImageGPU::tePixelFormat const aFormats[] = {ImageGPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA16,
                                            ImageGPU::PIXEL_FORMAT_RGBA16F, ImageGPU::PIXEL_FORMAT_RGBA32F};

std::string nameOf(ImageGPU::tePixelFormat format) {
    std::ostringstream text;
    text << format;
    return text.str();
}

class ShaderFilterReferenceTest : public ShaderFlowTest, public testing::WithParamInterface<int> {
protected:
    ImageGPU::tePixelFormat format() const { return aFormats[GetParam()]; }

    /// A frame into a bound image of the format that covers the place's output rectangle.
    Texels run(ImageFilter& filter, Place const& place, std::vector<ImageGPU*> const& vpInputs) {
        ImageGPUPtr const upTarget(ORVO_NEW ImageGPU(place.oOutput_, format(), place.oPixelExtent_, true));
        ShaderRoad road(frameContext(), filter);
        for (std::size_t i = 0; i < vpInputs.size(); ++i)
            road.setInput(i, *vpInputs[i]);
        road.runInto(*upTarget, pixelToWorldSpace(place.oOutput_, place.oPixelExtent_));
        return Texels(*upTarget);
    }

    /// The result must be what the function gives for each pixel.
    template <typename Function>
    void expect(Texels const& actual, Place const& place, Function const& function) {
        expectTexels(actual, Texels(place.oOutput_, place.oPixelExtent_).fill(function),
                     Precision::of(format()));
    }
};

TEST_P(ShaderFilterReferenceTest, GainAndOffset) {
    for (Place const& place : aPlaces) {
        SCOPED_TRACE(place.pName_);
        ShaderNode node(shaderOf({"src"}, readInput("src") + "*gain + vec4(0.0625, 0.0, -0.125, 0.25)",
                                 "uniform float gain;\n"));
        node.onUniforms_ = [](OGL::Program& program) { program.setUniform("gain", 0.75f); };
        ImageGPUPtr const upInput = textureOf(randomTexels(place.oInput_, 1, place.oPixelExtent_), format());
        Texels const input(*upInput);
        expect(run(node, place, {upInput.get()}), place, [&](int x, int y) {
            Pixel const p = input.at(x, y);
            return Pixel{0.75 * p[0] + 0.0625, 0.75 * p[1], 0.75 * p[2] - 0.125, 0.75 * p[3] + 0.25};
        });
    }
}

TEST_P(ShaderFilterReferenceTest, NeighboursOverTheEdge) {
    // The pixel with its left and its lower neighbour: at the edges transparent black comes in.
    for (Place const& place : aPlaces) {
        SCOPED_TRACE(place.pName_);
        ShaderNode node(shaderOf({"src"}, "0.25*" + readInput("src") + "+0.5*" +
                                              readInput("src", "vec2(-src_pixelExtent.x, 0.0)") + "+0.25*" +
                                              readInput("src", "vec2(0.0, src_pixelExtent.y)")));
        ImageGPUPtr const upInput = textureOf(randomTexels(place.oInput_, 2, place.oPixelExtent_), format());
        Texels const input(*upInput);
        expect(run(node, place, {upInput.get()}), place, [&](int x, int y) {
            Pixel pixel{};
            for (std::size_t c = 0; c < 4; ++c)
                pixel[c] =
                    0.25 * input.at(x, y)[c] + 0.5 * input.at(x - 1, y)[c] + 0.25 * input.at(x, y + 1)[c];
            return pixel;
        });
    }
}

TEST_P(ShaderFilterReferenceTest, TwoInputsAtDifferentPlaces) {
    for (Place const& place : aPlaces) {
        SCOPED_TRACE(place.pName_);
        ShaderNode node(
            shaderOf({"a", "b"}, "0.75*" + readInput("a") + "-0.5*" + readInput("b").append(".bgra")),
            {"a", "b"});
        PositionExtentInPixelSpace const& where = place.oInput_;
        PositionExtentInPixelSpace const moved =
            pixels(where.position().x() + 2, where.position().y() - 3, where.extent().width() + 4,
                   where.extent().height() + 1);
        ImageGPUPtr const upA = textureOf(randomTexels(where, 3, place.oPixelExtent_), format());
        ImageGPUPtr const upB = textureOf(randomTexels(moved, 4, place.oPixelExtent_), format());
        Texels const a(*upA);
        Texels const b(*upB);
        expect(run(node, place, {upA.get(), upB.get()}), place, [&](int x, int y) {
            Pixel const p = a.at(x, y);
            Pixel const q = b.at(x, y);
            return Pixel{0.75 * p[0] - 0.5 * q[2], 0.75 * p[1] - 0.5 * q[1], 0.75 * p[2] - 0.5 * q[0],
                         0.75 * p[3] - 0.5 * q[3]};
        });
    }
}

TEST_P(ShaderFilterReferenceTest, InterpolatesAnInputOfLargerPixels) {
    // Pixels of the second input are twice as wide and half again as high as those of the first one and of
    // the output.
    PixelExtentInWorldSpace const small(1.0f, 1.0f);
    PixelExtentInWorldSpace const large(2.0f, 1.5f);
    Place const place{"", pixels(-4, -3, 11, 9), small, pixels(-4, -3, 11, 9)};
    ShaderNode node(shaderOf({"a", "b"}, "0.25*" + readInput("a") + "+0.5*" + readInput("b")), {"a", "b"});
    ImageGPUPtr const upA = textureOf(randomTexels(place.oInput_, 5, small), format());
    ImageGPUPtr const upB = textureOf(randomTexels(pixels(-2, -1, 5, 4), 6, large), format());
    Texels const a(*upA);
    Texels const b(*upB);
    Texels const expected = Texels(place.oOutput_, small).fill([&](int x, int y) {
        auto const [worldX, worldY] = a.middle(x, y);
        Pixel const q = b.sample(worldX, worldY);
        Pixel pixel{};
        for (std::size_t c = 0; c < 4; ++c)
            pixel[c] = 0.25 * a.at(x, y)[c] + 0.5 * q[c];
        return pixel;
    });
    Precision precision = Precision::of(format());
    // Drivers interpolate 8-bit texels with 8-bit weights: one more step.
    if (format() == ImageGPU::PIXEL_FORMAT_RGBA8)
        precision.dAbsolute_ *= 2;
    expectTexels(run(node, place, {upA.get(), upB.get()}), expected, precision);
}

TEST_P(ShaderFilterReferenceTest, IntoImagesOfItsOwn) {
    // Each precision that a hint asks for, with three and with four channels, from each format.
    using Hint = ImageFilter::teOutputPrecisionHint;
    Place const place{"", pixels(-5, 3, 15, 9), {0.5f, 0.25f}, pixels(-3, 4, 11, 7)};
    ImageGPUPtr const upInput = textureOf(randomTexels(place.oInput_, 8, place.oPixelExtent_), format());
    Texels const input(*upInput);
    for (Hint const eHint : {Hint::OUTPUT_PRECISION_8_BIT_INT, Hint::OUTPUT_PRECISION_16_BIT_INT,
                             Hint::OUTPUT_PRECISION_16_BIT_FLOAT}) {
        for (int const nChannels : {3, 4}) {
            ShaderNode node(shaderOf({"src"}, "0.875*" + readInput("src") + "+vec4(0.0625)"), {"src"},
                            nChannels);
            node.outputPrecisionHintParameter().setValue(eHint);
            ShaderRoad road(frameContext(), node);
            road.setInput(0, *upInput);
            ImageGPU const* const pOutput = road.run(pixelToWorldSpace(place.oOutput_, place.oPixelExtent_));
            Texels const expected = Texels(place.oOutput_, place.oPixelExtent_).fill([&](int x, int y) {
                Pixel pixel = input.at(x, y);
                for (double& value : pixel)
                    value = 0.875 * value + 0.0625;
                return pixel;
            });
            SCOPED_TRACE(nameOf(pOutput->pixelFormat()));
            expectTexels(Texels(*pOutput), expected, Precision::of(pOutput->pixelFormat()));
        }
    }
}

INSTANTIATE_TEST_SUITE_P(, ShaderFilterReferenceTest, testing::Range(0, 4),
                         [](testing::TestParamInfo<int> const& row) {
                             return nameOf(aFormats[row.param]).substr(13);
                         });

} // namespace
