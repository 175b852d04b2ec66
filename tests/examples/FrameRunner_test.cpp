#include "apply_filter/FrameRunner.h"

#include "apply_filter/FilterList.h"
#include "common/Engine.h"
#include "orvo/orvo.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <memory>
#include <random>
#include <sstream>
#include <string>
#include <vector>

namespace example {
namespace {

using Pixel = std::array<double, 4>; // red, green, blue, alpha

// The layers as the program starts them: with a context from nothing.
class FrameRunner : public testing::Test {
protected:
    ORVO::OGL::Context const* context() const { return engine_.context.get(); }

    bool run(std::string const& filter, Picture const& source, Picture& result, bool async = false) const {
        return runFrames(createFilterNamed(filter), source, result, {context(), 1, async});
    }

private:
    Engine engine_{makeContext};
};

// What a filter does to one pixel, in OpenGL's scale.
struct Model {
    char const* filter;
    std::function<Pixel(Pixel)> apply;
};

Pixel scaled(Pixel pixel, double factor) {
    for (double& value : pixel)
        value *= factor;
    return pixel;
}

std::vector<Model> models() {
    return {
        {"premultiply",
         [](Pixel p) {
             return Pixel{p[0] * p[3], p[1] * p[3], p[2] * p[3], p[3]};
         }},
        {"unpremultiply",
         [](Pixel p) {
             return p[3] > 0.0 ? Pixel{p[0] / p[3], p[1] / p[3], p[2] / p[3], p[3]} : Pixel{};
         }},
        {"scaleUp4channel", [](Pixel p) { return scaled(p, 65535.0 / 32768.0); }},
        {"scaleDown4channel", [](Pixel p) { return scaled(p, 32768.0 / 65535.0); }},
    };
}

// Every other alpha is 0: in textures that are no power of two wide, linear filtering would add a trace of
// the neighbour to a texel, and a trace divided by an alpha that is a trace may be anything.
Picture randomBytes(std::size_t channels) {
    std::mt19937 random(7);
    Picture picture(37, 23, channels, Depth::uint8);
    for (std::size_t i = 0; i < picture.pixels.size(); ++i)
        picture.pixels[i] = static_cast<unsigned char>(i % 8 == 7 ? 0 : random() % 256);
    return picture;
}

// Values from -1 to 3 that 16-bit floats hold exactly; alpha from 1/8 to 1.
std::vector<float> randomFloats(std::size_t count) {
    std::mt19937 random(11);
    std::vector<float> values(count);
    for (std::size_t i = 0; i < count; ++i)
        values[i] = i % 4 == 3 ? static_cast<float>(8 + random() % 57) / 64.0F
                               : static_cast<float>(random() % 257) / 64.0F - 1.0F;
    return values;
}

TEST_F(FrameRunner, BytesOnOpenGLAreWithinOneOfTheComputedOnes) {
    Picture const source = randomBytes(4);
    for (Model const& model : models()) {
        Picture result(source.width, source.height, 4, Depth::uint8);
        for (bool const async : {false, true}) {
            ASSERT_TRUE(run(model.filter, source, result, async));
            for (std::size_t i = 0; i < source.pixels.size(); i += 4) {
                Pixel pixel{};
                for (std::size_t c = 0; c < 4; ++c)
                    pixel[c] = source.pixels[i + c] / 255.0;
                Pixel const expected = model.apply(pixel);
                for (std::size_t c = 0; c < 4; ++c)
                    ASSERT_NEAR(result.pixels[i + c], 255.0 * std::clamp(expected[c], 0.0, 1.0), 1.0)
                        << model.filter << ", pixel " << i / 4 << ", channel " << c;
            }
        }
    }
}

TEST_F(FrameRunner, FloatsOnOpenGLAreSixteenBitFloatsAlsoOutsideZeroToOne) {
    Picture source(37, 23, 4, Depth::float32);
    std::vector<float> const values = randomFloats(37 * 23 * 4);
    std::memcpy(source.pixels.data(), values.data(), source.pixels.size());
    for (Model const& model : models()) {
        Picture result(source.width, source.height, 4, Depth::float32);
        ASSERT_TRUE(run(model.filter, source, result));
        std::vector<float> computed(values.size());
        std::memcpy(computed.data(), result.pixels.data(), result.pixels.size());
        for (std::size_t i = 0; i < values.size(); i += 4) {
            Pixel const expected = model.apply({values[i], values[i + 1], values[i + 2], values[i + 3]});
            for (std::size_t c = 0; c < 4; ++c)
                ASSERT_NEAR(computed[i + c], expected[c], std::abs(expected[c]) / 1024.0 + 1e-4)
                    << model.filter << ", pixel " << i / 4 << ", channel " << c;
        }
    }
}

TEST_F(FrameRunner, PicturesWithoutAlphaAreOpaqueOnOpenGL) {
    Picture const source = randomBytes(3);
    Picture result(source.width, source.height, 3, Depth::uint8);
    ASSERT_TRUE(run("premultiply", source, result));
    EXPECT_EQ(result.channels, 3u);
    EXPECT_EQ(result.pixels, source.pixels);
}

// The largest difference of a channel, in steps of 8 bits, of the photograph filtered on either target.
int differenceOfTargets(std::string const& sPhotograph, ORVO::OGL::Context const* context, float sigma,
                        bool colorize) {
    Picture const source = readPicture(std::string(ORVO_EXAMPLE_DATA) + "/" + sPhotograph, Depth::uint8);
    auto const filter = createFilterNamed("FastBilateralBlur");
    filter->parameter("spatialSigma")->as<ORVO::float2>().setValue(ORVO::float2(sigma, sigma));
    filter->parameter("colorize")->as<bool>().setValue(colorize);
    Picture onCPU(source.width, source.height, source.channels, Depth::uint8);
    Picture onOpenGL = onCPU;
    EXPECT_TRUE(runFrames(filter, source, onCPU, {nullptr, 1, false}));
    EXPECT_TRUE(runFrames(filter, source, onOpenGL, {context, 1, false}));
    int largest = 0;
    double sum = 0;
    for (std::size_t i = 0; i < onCPU.pixels.size(); ++i) {
        int const difference = std::abs(int(onCPU.pixels[i]) - int(onOpenGL.pixels[i]));
        largest = std::max(largest, difference);
        sum += difference;
    }
    std::printf("%s, sigma %g, %s: at most %d of 255, mean %.4f\n", sPhotograph.c_str(), double(sigma),
                colorize ? "colour" : "luminance", largest, sum / double(onCPU.pixels.size()));
    return largest;
}

// The two have the same cells and the same weights; what differs is that the grid of OpenGL holds 16-bit
// floats, which the software driver rounds toward zero, the more pixels a cell sums up the more.
TEST_F(FrameRunner, TheBilateralFilterOnOpenGLIsTheCPUsUpToTheRoundingOfItsGrid) {
    for (char const* photograph : {"astronaut.png", "chelsea.png", "coffee.png"}) {
        for (bool const colorize : {false, true}) {
            EXPECT_LE(differenceOfTargets(photograph, context(), 3.0F, colorize), 2) << photograph;
            EXPECT_LE(differenceOfTargets(photograph, context(), 10.0F, colorize), 4) << photograph;
        }
    }
}

TEST_F(FrameRunner, TellsOnWhichTargetAFilterRuns) {
    EXPECT_TRUE(runsOn(nullptr, createFilterNamed("FastBilateralBlur")));
    EXPECT_TRUE(runsOn(context(), createFilterNamed("FastBilateralBlur")));
    // A wrapper of a node type with a node for each target takes the first, OpenGL.
    EXPECT_FALSE(runsOn(nullptr, createFilterNamed("FastBilateralFilter")));
    EXPECT_TRUE(runsOn(context(), createFilterNamed("FastBilateralFilter")));
    for (char const* name : {"SimpleBilateralCPU", "RGBToLABCPU", "LABToRGBCPU", "ConvertToSIMDOptimized",
                             "ConvertFromSIMDOptimized"}) {
        EXPECT_TRUE(runsOn(nullptr, createFilterNamed(name))) << name;
        EXPECT_FALSE(runsOn(context(), createFilterNamed(name))) << name;
    }
    EXPECT_TRUE(runsOn(nullptr, createFilterNamed("ColorspaceTransformer")));
    EXPECT_TRUE(runsOn(context(), createFilterNamed("ColorspaceTransformer")));
    for (char const* name : {"premultiply", "unpremultiply", "scaleUp1channel", "scaleUp2channel",
                             "scaleUp3channel", "scaleUp4channel", "scaleDown1channel", "scaleDown2channel",
                             "scaleDown3channel", "scaleDown4channel"}) {
        EXPECT_FALSE(runsOn(nullptr, createFilterNamed(name))) << name;
        EXPECT_TRUE(runsOn(context(), createFilterNamed(name))) << name;
    }
}

TEST_F(FrameRunner, ListSaysWhereThereIsNoOpenGL) {
    std::ostringstream with;
    listFilters(with, context());
    EXPECT_NE(with.str().find("premultiply  (ORVO, Norvane, version 1)\n    runs on gl\n"),
              std::string::npos);
    EXPECT_NE(with.str().find("LABToRGBCPU  (ImageFlow, Norvane, version 1)\n    runs on cpu\n"),
              std::string::npos);
    std::ostringstream without;
    listFilters(without, nullptr);
    EXPECT_NE(
        without.str().find("premultiply  (ORVO, Norvane, version 1)\n    does not run on cpu, and there is "
                           "no OpenGL here\n"),
        std::string::npos);
}

} // namespace
} // namespace example
