// The filters for previews against computations in double, pixel by pixel, over random pictures with values
// outside 0..1. Every row also checks that its tolerance tells the result from that of wrong formulas.

#include "tests/image_flow/support/ShaderRoad.h"

#include <algorithm>
#include <string>

#include "orvo/image_flow/filters/MirelCheckerBoardGPU.h"
#include "orvo/image_flow/filters/MirelGamutTestCompositeGPU.h"
#include "orvo/image_flow/filters/MirelToneMappingGPU.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;

/// What a filter makes of the pixel at a place, given the pictures at its inputs.
using Formula = std::function<Pixel(std::vector<Texels> const&, int, int)>;

/// Where input and output lie.
struct DisplayPlace {
    char const* pName_;
    PositionExtentInPixelSpace oInput_;
    PixelExtentInWorldSpace oPixelExtent_;
    PositionExtentInPixelSpace oOutput_;
    bool bExactTextures_;
};

DisplayPlace const aDisplayPlaces[] = {
    {"Negative", pixels(-21, -9, 17, 11), {1.0f, 1.0f}, pixels(-21, -9, 17, 11), false},
    {"SmallPixels", pixels(-5, 3, 15, 9), {0.5f, 0.25f}, pixels(-5, 3, 15, 9), true},
    {"RegionInsideLargePixels", pixels(-6, -4, 19, 13), {1.25f, 0.75f}, pixels(-1, 2, 7, 6), true},
    {"OnePixelWide", pixels(3, 2, 1, 9), {1.0f, 1.0f}, pixels(3, 2, 1, 9), false},
};

ImageGPU::tePixelFormat const aDisplayFormats[] = {
    ImageGPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA16F, ImageGPU::PIXEL_FORMAT_RGBA32F};

class DisplayFiltersReferenceTest : public ShaderFlowTest, public testing::WithParamInterface<int> {
protected:
    ImageGPU::tePixelFormat format() const { return aDisplayFormats[GetParam()]; }

    /// The picture of input `i`; colours from `low` to `high`, alpha likewise.
    static Texels picture(DisplayPlace const& place, unsigned seed, Pixel const& low, Pixel const& high) {
        Texels const random = randomTexels(place.oInput_, seed, place.oPixelExtent_);
        return Texels(place.oInput_, place.oPixelExtent_).fill([&](int x, int y) {
            Pixel pixel{};
            for (std::size_t c = 0; c < 4; ++c)
                pixel[c] = low[c] + (high[c] - low[c]) * (random.at(x, y)[c] + 0.5) / 2.0;
            return pixel;
        });
    }

    /// Runs the filter over random pictures at every place. The result must be that of the formula, and none
    /// of that of the wrong ones.
    void check(ImageFilter& filter, Formula const& formula,
               std::vector<std::pair<std::string, Formula>> const& aWrong, Precision precision,
               Pixel const& low = {-0.5, -0.5, -0.5, -0.5}, Pixel const& high = {1.5, 1.5, 1.5, 1.5}) {
        for (DisplayPlace const& place : aDisplayPlaces) {
            SCOPED_TRACE(place.pName_);
            ImageGPUPtr const upTarget(
                ORVO_NEW ImageGPU(place.oOutput_, format(), place.oPixelExtent_, true));
            std::vector<ImageGPUPtr> aupImages;
            std::vector<Texels> aInputs;
            {
                ShaderRoad road(frameContext(), filter);
                for (unsigned i = 0; i < filter.numberOfImageInputs(); ++i) {
                    aupImages.push_back(
                        textureOf(picture(place, 11 + i, low, high), format(), place.bExactTextures_));
                    aInputs.emplace_back(*aupImages.back());
                    road.setInput(i, *aupImages.back());
                }
                road.runInto(*upTarget, pixelToWorldSpace(place.oOutput_, place.oPixelExtent_));
            }
            Texels const actual(*upTarget);
            auto const resultOf = [&](Formula const& function) {
                return Texels(place.oOutput_, place.oPixelExtent_).fill([&](int x, int y) {
                    return function(aInputs, x, y);
                });
            };
            expectTexels(actual, resultOf(formula), precision);
            for (auto const& [sName, wrong] : aWrong)
                EXPECT_NE("", differences(actual, resultOf(wrong), precision)) << "does not see: " << sName;
        }
    }

    /// The precision of the format, where functions of the driver come in with a relative error.
    Precision precision(double dRelative = 0) const {
        Precision result = Precision::of(format());
        result.dRelative_ = std::max(result.dRelative_, dRelative);
        return result;
    }
};

double mixed(double a, double b, double share) { return a * (1 - share) + b * share; }

// The checkerboard

struct Checker {
    Pixel a;
    Pixel b;
    double width;
    double height;

    /// Cells are counted from the corner of the input.
    Pixel const& at(Texels const& input, int x, int y) const {
        double const column = std::floor((x - input.left() + 0.5) / width);
        double const row = std::floor((y - input.top() + 0.5) / height);
        return std::fmod(column + row, 2.0) == 0 ? a : b;
    }
    void giveTo(MirelCheckerBoardGPU& filter) const {
        auto const colour = [](Pixel const& p) {
            return float4(float(p[0]), float(p[1]), float(p[2]), float(p[3]));
        };
        filter.colorA().setValue(colour(a));
        filter.colorB().setValue(colour(b));
        filter.checkerSize().setValue(float2(float(width), float(height)));
    }
};

Pixel over(Pixel const& source, Pixel const& backdrop) {
    Pixel result{};
    for (std::size_t c = 0; c < 3; ++c)
        result[c] = source[c] + (1 - source[3]) * backdrop[c];
    result[3] = backdrop[3] + (1 - backdrop[3]) * source[3];
    return result;
}

Pixel blended(Pixel const& image, Pixel const& checker, double gamma) {
    auto const unpremultiplied = [](Pixel const& p, std::size_t c) { return p[3] == 0 ? 0.0 : p[c] / p[3]; };
    double const s = checker[3];
    double const b = image[3];
    double const blend = (s - s * b) / (s + b - s * b);
    Pixel result{0, 0, 0, b + (1 - b) * s};
    for (std::size_t c = 0; c < 3; ++c)
        result[c] = result[3] * std::pow(mixed(std::pow(unpremultiplied(image, c), gamma),
                                               std::pow(unpremultiplied(checker, c), gamma), blend),
                                         1 / gamma);
    return result;
}

TEST_P(DisplayFiltersReferenceTest, CheckerBoard) {
    // Sizes that no middle of a pixel is a multiple of.
    Checker const aCheckers[] = {{{0.9, 0.2, 0.3, 0.75}, {0.1, 0.6, 0.8, 0.25}, 3, 2},
                                 {{0.5, 1.25, -0.25, 0.5}, {0.75, 0.125, 0.5, 1}, 2.6, 1.4}};
    MirelCheckerBoardGPU filter;
    for (Checker const& checker : aCheckers) {
        checker.giveTo(filter);
        auto const of = [](auto const& function) {
            return [function](std::vector<Texels> const& aInputs, int x, int y) {
                return function(aInputs[0], x, y);
            };
        };
        check(filter,
              of([&](Texels const& in, int x, int y) { return over(in.at(x, y), checker.at(in, x, y)); }),
              {{"colours swapped", of([&](Texels const& in, int x, int y) {
                    return over(in.at(x, y),
                                Checker{checker.b, checker.a, checker.width, checker.height}.at(in, x, y));
                })},
               {"one pixel too wide", of([&](Texels const& in, int x, int y) {
                    return over(
                        in.at(x, y),
                        Checker{checker.a, checker.b, checker.width, checker.height + 1}.at(in, x, y));
                })},
               {"the board over the image",
                of([&](Texels const& in, int x, int y) { return over(checker.at(in, x, y), in.at(x, y)); })}},
              precision());
    }
}

TEST_P(DisplayFiltersReferenceTest, CheckerBoardCountsFromTheImageAndNotFromTheRegion) {
    Checker const checker{{1, 0, 0, 1}, {0, 0, 1, 1}, 2, 3};
    MirelCheckerBoardGPU filter;
    checker.giveTo(filter);
    DisplayPlace const& place = aDisplayPlaces[2];
    ImageGPUPtr const upInput = textureOf(Texels(place.oInput_, place.oPixelExtent_), format());
    ImageGPUPtr const upTarget(ORVO_NEW ImageGPU(place.oOutput_, format(), place.oPixelExtent_, true));
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upInput);
    road.runInto(*upTarget, pixelToWorldSpace(place.oOutput_, place.oPixelExtent_));
    Texels const input(*upInput);
    Texels const output(*upTarget);
    auto const board = [&](Texels const& from) {
        return Texels(place.oOutput_, place.oPixelExtent_).fill([&](int x, int y) {
            return checker.at(from, x, y);
        });
    };
    EXPECT_EQ("", differences(output, board(input), precision()));
    EXPECT_NE("", differences(output, board(output), precision()));
}

TEST_P(DisplayFiltersReferenceTest, CheckerBoardWithGamma) {
    Checker const aCheckers[] = {{{0.6, 0.2, 0.3, 0.75}, {0.1, 0.2, 0.25, 0.5}, 3, 2},
                                 {{1, 1, 1, 1}, {0.8, 0.8, 0.8, 1}, 2.6, 1.4}};
    MirelCheckerBoardGPU filter;
    for (Checker const& checker : aCheckers) {
        for (double const gamma : {2.25, 0.5}) {
            checker.giveTo(filter);
            filter.compositeGamma().setValue(float(gamma));
            auto const of = [](auto const& function) {
                return [function](std::vector<Texels> const& aInputs, int x, int y) {
                    return function(aInputs[0], x, y);
                };
            };
            // A power of a negative number is none: colours from 0 up, alpha in 0..1.
            check(filter, of([&](Texels const& in, int x, int y) {
                      return blended(in.at(x, y), checker.at(in, x, y), gamma);
                  }),
                  {{"image and board swapped", of([&](Texels const& in, int x, int y) {
                        return blended(checker.at(in, x, y), in.at(x, y), gamma);
                    })},
                   {"no gamma", of([&](Texels const& in, int x, int y) {
                        return blended(in.at(x, y), checker.at(in, x, y), 1);
                    })},
                   {"gamma the other way round", of([&](Texels const& in, int x, int y) {
                        return blended(in.at(x, y), checker.at(in, x, y), 1 / gamma);
                    })}},
                  precision(1e-4), {0, 0, 0, 0.1}, {1.5, 1.5, 1.5, 0.9});
        }
    }
}

// Tone mapping

struct Tone {
    bool bExposure;
    double exposure;
    double gamma;
    std::array<double, 3> factor;

    double scaled(double luminance) const {
        return bExposure ? std::pow(luminance * std::pow(2.0, exposure), gamma) : luminance / (1 + luminance);
    }
    Pixel of(Pixel pixel) const {
        double const luminance = std::abs(pixel[0] * factor[0] + pixel[1] * factor[1] + pixel[2] * factor[2]);
        for (std::size_t c = 0; c < 3; ++c)
            pixel[c] *= scaled(luminance) / luminance;
        for (double& channel : pixel)
            channel = std::min(std::max(channel, 0.0), 1.0);
        return pixel;
    }
};

TEST_P(DisplayFiltersReferenceTest, ToneMapping) {
    std::array<double, 3> const usual{double(0.3f), double(0.59f), double(0.11f)};
    Tone const aTones[] = {
        {true, 0, 1, usual},        {true, -1.5, 1.25, usual}, {true, 0.75, 0.5, {0.25, 0.125, 0.5}},
        {false, -1.5, 1.25, usual}, {false, 0, 1, {1, 1, 1}},
    };
    MirelToneMappingGPU filter;
    for (Tone const& tone : aTones) {
        SCOPED_TRACE(testing::Message() << tone.bExposure << " " << tone.exposure << " " << tone.gamma);
        filter.exposureGammaOrHDRCompression().setValue(tone.bExposure);
        filter.exposure().setValue(float(tone.exposure));
        filter.gamma().setValue(float(tone.gamma));
        filter.luminanceFactor().setValue(
            float3(float(tone.factor[0]), float(tone.factor[1]), float(tone.factor[2])));
        auto const with = [](Tone const& other) {
            return [other](std::vector<Texels> const& aInputs, int x, int y) {
                return other.of(aInputs[0].at(x, y));
            };
        };
        std::vector<std::pair<std::string, Formula>> aWrong{
            {"the other half", with({!tone.bExposure, tone.exposure, tone.gamma, tone.factor})}};
        if (tone.gamma != 1) {
            if (tone.bExposure) {
                aWrong.emplace_back("exposure after gamma",
                                    with({true, tone.exposure / tone.gamma, tone.gamma, tone.factor}));
                aWrong.emplace_back("brighter by 2 %",
                                    with({true, tone.exposure + 0.03, tone.gamma, tone.factor}));
            }
            aWrong.emplace_back("red and blue swapped in the luminance",
                                with({tone.bExposure,
                                      tone.exposure,
                                      tone.gamma,
                                      {tone.factor[2], tone.factor[1], tone.factor[0]}}));
        }
        check(filter, with(tone), aWrong, precision(1e-4), {-0.25, -0.25, 0.25, -0.5},
              {1.75, 1.75, 1.75, 1.5});
    }
}

// The marks of a gamut

TEST_P(DisplayFiltersReferenceTest, GamutTestComposite) {
    MirelGamutTestCompositeGPU filter;
    Pixel const color{0.75, 0.25, -0.125, 1.25};
    filter.color().setValue(float4(0.75f, 0.25f, -0.125f, 1.25f));
    for (double const opacity : {0.0, 0.375, 1.0}) {
        SCOPED_TRACE(opacity);
        filter.opacity().setValue(float(opacity));
        auto const marked = [](Pixel const& bg, Pixel const& g, Pixel const& mark, double share) {
            Pixel pixel{};
            for (std::size_t c = 0; c < 4; ++c)
                pixel[c] = bg[c] * g[c] + (1 - g[c]) * mixed(bg[c], mark[c], share);
            return pixel;
        };
        std::vector<std::pair<std::string, Formula>> aWrong;
        if (opacity > 0)
            aWrong = {{"marked inside",
                       [&](std::vector<Texels> const& aInputs, int x, int y) {
                           Pixel g = aInputs[1].at(x, y);
                           for (double& value : g)
                               value = 1 - value;
                           return marked(aInputs[0].at(x, y), g, color, opacity);
                       }},
                      {"one gamut for all channels",
                       [&](std::vector<Texels> const& aInputs, int x, int y) {
                           double const g = aInputs[1].at(x, y)[0];
                           return marked(aInputs[0].at(x, y), Pixel{g, g, g, g}, color, opacity);
                       }},
                      {"inputs swapped", [&](std::vector<Texels> const& aInputs, int x, int y) {
                           return marked(aInputs[1].at(x, y), aInputs[0].at(x, y), color, opacity);
                       }}};
        check(
            filter,
            [&](std::vector<Texels> const& aInputs, int x, int y) {
                return marked(aInputs[0].at(x, y), aInputs[1].at(x, y), color, opacity);
            },
            aWrong, precision());
    }
}

INSTANTIATE_TEST_SUITE_P(, DisplayFiltersReferenceTest, testing::Range(0, 3),
                         [](testing::TestParamInfo<int> const& row) {
                             std::ostringstream text;
                             text << aDisplayFormats[row.param];
                             return text.str().substr(13);
                         });

} // namespace
