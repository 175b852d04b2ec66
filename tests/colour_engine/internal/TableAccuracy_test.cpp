// Profiles of tables against the colour library's own road in double precision: on the CPU as bytes and
// words, and as the cube that OpenGL interpolates.
#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/internal/Applier.h"
#include "orvo/colour_engine/internal/Profile.h"
#include "orvo/colour_engine/internal/ResolvedTransform.h"
#include "orvo/colour_engine/internal/TransformResolver.h"
#include "tests/colour_engine/support/TableProfiles.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <memory>
#include <random>

namespace {

using namespace ORVO::ColourEngine;
using namespace ORVO::ColourEngine::Internal;
using namespace ORVO::Test;

std::shared_ptr<Profile const> profileOf(Bytes const& aBytes) {
    return std::make_shared<Profile const>(aBytes.data(), aBytes.size());
}

/// A lattice, greys and channels alone, colours at random and dark ones, on the scale of words.
std::vector<std::uint16_t> sampleColours() {
    std::vector<std::uint16_t> aSamples;
    auto const add = [&](double r, double g, double b) {
        for (double const value : {r, g, b}) {
            aSamples.push_back(static_cast<std::uint16_t>(std::lround(value * 32768.0)));
        }
    };
    for (int i = 0; i < 729; ++i) {
        add(i % 9 / 8.0, i / 9 % 9 / 8.0, i / 81 / 8.0);
    }
    for (int i = 0; i <= 512; ++i) {
        double const x = i / 512.0;
        add(x, x, x);
        add(x, 0.0, 0.0);
        add(0.0, x, 0.0);
        add(0.0, 0.0, x);
    }
    std::mt19937 random(23);
    auto const next = [&] { return random() % 32769U / 32768.0; };
    for (int i = 0; i < 6000; ++i) {
        double const exponent = i % 3 == 0 ? 3.0 : 1.0;
        double const r = std::pow(next(), exponent);
        double const g = std::pow(next(), exponent);
        add(r, g, std::pow(next(), exponent));
    }
    return aSamples;
}

template <typename Sample>
ORVO::_t_Vantle_PackingSpec packed(std::vector<Sample>& aSamples) {
    ORVO::_t_Vantle_PackingSpec spec{};
    spec.space = ORVO::_t_Vantle_PackingSpec::SPACE_RGB;
    spec.channels = 3;
    spec.bytesPerChannel = sizeof(Sample);
    for (int c = 0; c < 3; ++c) {
        spec.planes[c] = {aSamples.data() + c, 0, 3 * sizeof(Sample), 0, 0};
    }
    return spec;
}

template <typename Sample>
std::vector<Sample> applied(ResolvedTransform const& transform, std::vector<std::uint16_t> aColours) {
    Applier const applier(std::shared_ptr<ResolvedTransform const>(&transform, [](auto*) {}));
    std::vector<Sample> aResult(aColours.size());
    EXPECT_TRUE(
        applier.apply(packed(aColours), packed(aResult), 1, static_cast<std::uint32_t>(aColours.size() / 3)));
    return aResult;
}

struct Errors {
    double largest = 0.0;
    double mean = 0.0;
    std::size_t above = 0; ///< how many are above 4/32768
};

/// Of `actual(i)`, all in 0..1.
template <typename Actual>
Errors errorsOf(std::vector<double> const& aExpected, Actual const& actual) {
    Errors errors;
    for (std::size_t i = 0; i < aExpected.size(); ++i) {
        double const error = std::abs(actual(i) - aExpected[i]);
        errors.largest = std::max(errors.largest, error);
        errors.mean += error / static_cast<double>(aExpected.size());
        errors.above += error > 4.0 / 32768.0 ? 1 : 0;
    }
    return errors;
}

struct Case {
    char const* name;
    std::shared_ptr<Profile const> spSource;
    std::shared_ptr<Profile const> spDestination;
    std::uint32_t intent;
    /// Of words, of 32768: what one of the 65535 steps of a table is behind the curves that follow.
    double step;
    /// Of the cube.
    double cubeMean;
    double cubeLargest;
};

class TableAccuracy : public testing::Test {
protected:
    void expectAccuracy(Case const& test) const {
        SCOPED_TRACE(test.name);
        auto const spTransform = resolveTransform(*test.spSource, *test.spDestination, test.intent, 0);
        std::vector<double> const aExpected = exact(test);
        auto const aWords = applied<std::uint16_t>(*spTransform, aColours_);
        Errors const words = errorsOf(aExpected, [&](std::size_t i) { return aWords[i] / 32768.0; });
        // Where a number lies in the middle between two steps of a table, the colour library and we may round
        // to different ones.
        EXPECT_LE(words.above, aExpected.size() / 1000);
        EXPECT_LE(words.mean * 32768.0, 0.6);
        EXPECT_LE(words.largest * 32768.0, test.step);
        auto const aBytes = applied<std::uint8_t>(*spTransform, aColours_);
        Errors const bytes = errorsOf(aExpected, [&](std::size_t i) { return aBytes[i] / 255.0; });
        EXPECT_LE(bytes.largest * 255.0, 1.0);

        TableStages const aCube = stagesOf(*spTransform->colourCube(), true);
        std::vector<double> aOfCube;
        for (std::size_t i = 0; i < aColours_.size(); i += 3) {
            auto const result = evaluateStages(aCube, aCube.size(), colourAt(i));
            aOfCube.insert(aOfCube.end(), result.begin(), result.end());
        }
        Errors const cube = errorsOf(aExpected, [&](std::size_t i) { return aOfCube[i]; });
        EXPECT_LE(cube.mean, test.cubeMean);
        EXPECT_LE(cube.largest, test.cubeLargest);
    }

private:
    ColourTriple colourAt(std::size_t i) const {
        return {aColours_[i] / 32768.0, aColours_[i + 1] / 32768.0, aColours_[i + 2] / 32768.0};
    }

    std::vector<double> exact(Case const& test) const {
        cmsUInt32Number const format = test.spDestination->isGray() ? TYPE_GRAY_DBL : TYPE_RGB_DBL;
        cmsHTRANSFORM const pRoad =
            cmsCreateTransform(test.spSource->handle(), TYPE_RGB_DBL, test.spDestination->handle(), format,
                               test.intent, cmsFLAGS_NOOPTIMIZE | cmsFLAGS_NOCACHE);
        std::vector<double> aResults;
        for (std::size_t i = 0; i < aColours_.size(); i += 3) {
            ColourTriple const colour = colourAt(i);
            ColourTriple result{};
            cmsDoTransform(pRoad, colour.data(), result.data(), 1);
            for (std::size_t c = 0; c < 3; ++c) {
                double const value = result[test.spDestination->isGray() ? 0 : c];
                aResults.push_back(std::clamp(value, 0.0, 1.0));
            }
        }
        cmsDeleteTransform(pRoad);
        return aResults;
    }

    std::vector<std::uint16_t> aColours_ = sampleColours();
};

struct Curve {
    explicit Curve(double exponent) : pCurve(cmsBuildGamma(nullptr, exponent)) {}
    ~Curve() { cmsFreeToneCurve(pCurve); }
    Curve(Curve const&) = delete;
    Curve& operator=(Curve const&) = delete;

    cmsToneCurve* pCurve;
};

ColourTriple labOfRoots(ColourTriple const& colour) {
    return labOfSRGB({std::sqrt(colour[0]), std::sqrt(colour[1]), std::sqrt(colour[2])});
}

TEST_F(TableAccuracy, OfSources) {
    Curve const square(2.0);
    auto const spSRGB = profileFromCode(PROFILE_SRGB);
    auto const spPlain = profileOf(tableProfile({true, 33, labOfSRGB}));
    auto const spOlder = profileOf(tableProfile({true, 21, labOfSRGB, 2.1}));
    auto const spCurves = profileOf(tableProfile({true, 33, labOfRoots, 4.3, square.pCurve}));
    auto const spCamera = profileOf(tableProfile({true, 17, labOfCamera, 2.1}));
    for (Case const& test :
         {Case{"camera to sRGB", spCamera, spSRGB, 0, 4.0, 1.5e-4, 0.008},
          Case{"camera to sRGB, absolute", spCamera, spSRGB, 3, 4.0, 1.5e-4, 0.008},
          Case{"camera to linear", spCamera, profileFromCode(PROFILE_LINEAR_SRGB), 1, 4.0, 2.5e-4, 0.015},
          Case{"camera to grey", spCamera, profileFromCode(PROFILE_GRAY), 0, 8.0, 1.5e-4, 0.008},
          // Straight lines in Lab between nodes of sRGB bend as light; saturated colours lose the most.
          Case{"plain to sRGB", spPlain, spSRGB, 0, 12.0, 2e-4, 0.006},
          Case{"plain to sRGB, relative", spPlain, spSRGB, 1, 12.0, 2.5e-4, 0.006},
          Case{"older to sRGB", spOlder, spSRGB, 0, 12.0, 3e-4, 0.008},
          Case{"curves to sRGB", spCurves, spSRGB, 1, 12.0, 6e-4, 0.012},
          // Of light 1/65535 a gamma of 2.2 makes 212/32768.
          Case{"plain to wide gamut", spPlain, profileFromCode(PROFILE_WIDE_GAMUT), 1, 212.0, 5e-4, 0.03}}) {
        expectAccuracy(test);
    }
}

TEST_F(TableAccuracy, OfDestinations) {
    auto const spSRGB = profileFromCode(PROFILE_SRGB);
    auto const spPlain = profileOf(tableProfile({false, 33, sRGBOfLab}));
    auto const spOlder = profileOf(tableProfile({false, 17, sRGBOfLab, 2.1}));
    auto const spSource = profileOf(tableProfile({true, 33, labOfCamera}));
    // In a table over Lab a clipped gamut has its edges between the nodes, and the cube its own nodes
    // elsewhere.
    for (Case const& test :
         {Case{"sRGB to plain", spSRGB, spPlain, 0, 8.0, 2e-3, 0.06},
          Case{"wide gamut to plain", profileFromCode(PROFILE_WIDE_GAMUT), spPlain, 1, 8.0, 2e-3, 0.08},
          Case{"sRGB to older", spSRGB, spOlder, 3, 8.0, 2e-3, 0.08},
          Case{"table to table", spSource, spPlain, 0, 8.0, 1e-3, 0.03}}) {
        expectAccuracy(test);
    }
}

} // namespace
