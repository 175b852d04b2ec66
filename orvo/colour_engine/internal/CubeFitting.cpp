#include "orvo/colour_engine/internal/CubeFitting.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <memory>
#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {

using Colour = std::array<double, 3>;

// CIE 15, and the same mirrored below black: straight through black, so that light which leaves the gamut
// does not bend.
constexpr double dKink = 216.0 / 24389.0;
constexpr double dSlope = 24389.0 / 2700.0;

double cubeLightness(double light) {
    double const size = std::abs(light);
    return std::copysign(size > dKink ? 1.16 * std::cbrt(size) - 0.16 : dSlope * size, light);
}

double cubeLight(double lightness) {
    double const size = std::abs(lightness);
    double const root = (size + 0.16) / 1.16;
    return std::copysign(size > dSlope * dKink ? root * root * root : size / dSlope, lightness);
}

/// What a cube is to hold, and what follows behind it.
struct Content {
    ColourFunction value_;
    std::optional<std::array<ChannelCurve, 3>> oOutputCurves_;
};

Content cubeLightnessBefore(TableStages const& aStages, CurveStage const& last) {
    Content content;
    content.value_ = [&aStages](Colour const& colour) {
        Colour result = evaluateStages(aStages, aStages.size() - 1, colour);
        for (double& value : result) {
            double const part = (cubeLightness(value) - ColourCube::dLowest_) / ColourCube::dSpan_;
            value = ColourCube::dLowest_ + ColourCube::dSpan_ * clampToUnit(part);
        }
        return result;
    };
    auto const behind = [](ChannelCurve const& curve) {
        return ChannelCurve([curve](double lightness) { return curve(cubeLight(lightness)); });
    };
    content.oOutputCurves_ = {behind(last.aCurves_[0]), behind(last.aCurves_[1]), behind(last.aCurves_[2])};
    return content;
}

constexpr std::size_t nSpacingSteps = 1024;

/// How much a function bends along the greys and along the edges and the axes through the middle of the cube:
/// at each step the square root of the largest second derivative, to which the distance of nodes should be
/// inverse where the error of linear interpolation is to be even.
std::vector<double> bendsAlong(ColourFunction const& value) {
    constexpr std::size_t nReach = 8;
    constexpr double dStep = 1.0 / static_cast<double>(nSpacingSteps);
    std::vector<double> aBends(nSpacingSteps + 1, 0.0);
    for (std::size_t path = 0; path < 7; ++path) {
        std::vector<Colour> aValues;
        for (std::size_t i = 0; i <= nSpacingSteps; ++i) {
            double const x = static_cast<double>(i) * dStep;
            double const rest = path < 3 ? 0.0 : 0.5;
            Colour colour = {rest, rest, rest};
            if (path == 6) {
                colour = {x, x, x};
            } else {
                colour[path % 3] = x;
            }
            aValues.push_back(value(colour));
        }
        for (std::size_t i = nReach; i + nReach <= nSpacingSteps; ++i) {
            for (std::size_t c = 0; c < 3; ++c) {
                double const bend =
                    std::abs(aValues[i + nReach][c] - 2.0 * aValues[i][c] + aValues[i - nReach][c]);
                aBends[i] = std::max(aBends[i], std::sqrt(bend) / (dStep * nReach));
            }
        }
    }
    std::fill_n(aBends.begin(), nReach, aBends[nReach]);
    std::fill_n(aBends.rbegin(), nReach, aBends[nSpacingSteps - nReach]);
    return aBends;
}

/// The places of nodes: a rising function from 0..1 to 0..1 with its inverse.
class Spacing {
public:
    explicit Spacing(ColourFunction const& value) : aPlaces_(nSpacingSteps + 1, 0.0) {
        std::vector<double> const aBends = bendsAlong(value);
        double mean = 0.0;
        for (double const bend : aBends) {
            mean += bend / static_cast<double>(aBends.size());
        }
        // No part is left without nodes.
        constexpr double dEven = 0.2;
        for (std::size_t i = 1; i < aPlaces_.size(); ++i) {
            aPlaces_[i] = aPlaces_[i - 1] + (aBends[i - 1] + aBends[i]) / 2.0 + dEven * mean + 1e-9;
        }
        double const length = aPlaces_.back();
        for (double& place : aPlaces_) {
            place /= length;
        }
    }

    double place(double x) const {
        double const position = clampToUnit(x) * static_cast<double>(nSpacingSteps);
        auto const i = std::min(static_cast<std::size_t>(position), nSpacingSteps - 1);
        return aPlaces_[i] + (position - static_cast<double>(i)) * (aPlaces_[i + 1] - aPlaces_[i]);
    }
    double valueAt(double place) const {
        auto const next = std::upper_bound(aPlaces_.begin() + 1, aPlaces_.end() - 1, place);
        auto const i = static_cast<double>(next - aPlaces_.begin() - 1);
        return clampToUnit((i + (place - *(next - 1)) / (*next - *(next - 1))) /
                           static_cast<double>(nSpacingSteps));
    }

private:
    std::vector<double> aPlaces_;
};

ColourCube fill(Content const& content, std::shared_ptr<Spacing const> const& spSpacing) {
    constexpr std::size_t nEdge = ColourCube::nEdge_;
    std::array<double, nEdge> aPlaces{};
    for (std::size_t i = 0; i < nEdge; ++i) {
        double const even = static_cast<double>(i) / static_cast<double>(nEdge - 1);
        aPlaces[i] = spSpacing != nullptr ? spSpacing->valueAt(even) : even;
    }
    ColourCube cube;
    cube.aValues_.reserve(3 * nEdge * nEdge * nEdge);
    for (double const blue : aPlaces) {
        for (double const green : aPlaces) {
            for (double const red : aPlaces) {
                for (double const value : content.value_({red, green, blue})) {
                    cube.aValues_.push_back(static_cast<float>(value));
                }
            }
        }
    }
    if (spSpacing != nullptr) {
        cube.oSpacing_ = ChannelCurve([spSpacing](double x) { return spSpacing->place(x); });
    }
    cube.oOutputCurves_ = content.oOutputCurves_;
    return cube;
}

/// Colours off the nodes of any table: all of the cube, more of the dark, and greys.
std::vector<Colour> probes() {
    std::vector<Colour> aColours;
    std::uint32_t iNoise = 1;
    auto const next = [&iNoise] {
        iNoise = iNoise * 1664525U + 1013904223U;
        return static_cast<double>(iNoise >> 8U) / static_cast<double>(1U << 24U);
    };
    constexpr std::size_t nProbes = 4096;
    for (std::size_t i = 0; i < nProbes; ++i) {
        Colour colour = {next(), next(), next()};
        if (i % 4 == 0) {
            std::transform(colour.begin(), colour.end(), colour.begin(), [](double x) { return x * x * x; });
        } else if (i % 8 == 1) {
            colour = {colour[0], colour[0], colour[0]};
        }
        aColours.push_back(colour);
    }
    return aColours;
}

/// The mean of the squares of what the cube adds.
double errorOf(ColourCube const& cube, std::vector<Colour> const& aProbes,
               std::vector<Colour> const& aExpected) {
    TableStages const aStages = stagesOf(cube, true);
    double sum = 0.0;
    for (std::size_t i = 0; i < aProbes.size(); ++i) {
        Colour const actual = evaluateStages(aStages, aStages.size(), aProbes[i]);
        for (std::size_t c = 0; c < 3; ++c) {
            sum += (actual[c] - aExpected[i][c]) * (actual[c] - aExpected[i][c]);
        }
    }
    return sum / static_cast<double>(aProbes.size());
}

ColourCube best(ColourFunction const& exact, std::vector<Content> const& aContents) {
    std::vector<Colour> const aProbes = probes();
    std::vector<Colour> aExpected;
    std::transform(aProbes.begin(), aProbes.end(), std::back_inserter(aExpected), exact);
    ColourCube chosen;
    double smallest = 0.0;
    for (Content const& content : aContents) {
        for (auto const& spSpacing :
             {std::shared_ptr<Spacing const>(), std::make_shared<Spacing const>(content.value_)}) {
            ColourCube cube = fill(content, spSpacing);
            double const error = errorOf(cube, aProbes, aExpected);
            if (chosen.aValues_.empty() || error < smallest) {
                smallest = error;
                chosen = std::move(cube);
            }
        }
    }
    return chosen;
}

} // namespace

ColourCube fitCube(TableStages const& aStages) {
    ColourFunction const exact = [&aStages](Colour const& colour) {
        return evaluateStages(aStages, aStages.size(), colour);
    };
    std::vector<Content> aContents = {{exact, std::nullopt}};
    auto const* const pLast = aStages.empty() ? nullptr : std::get_if<CurveStage>(&aStages.back());
    if (pLast != nullptr) {
        aContents.push_back(cubeLightnessBefore(aStages, *pLast));
    }
    return best(exact, aContents);
}

ColourCube fitCube(ColourFunction const& exact) { return best(exact, {{exact, std::nullopt}}); }

} // namespace ORVO::ColourEngine::Internal
