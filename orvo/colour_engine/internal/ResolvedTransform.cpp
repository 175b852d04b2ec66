#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {

/// NaN becomes 0.
double clampToUnit(double value) { return value > 0.0 ? std::min(value, 1.0) : 0.0; }

std::array<double, 3> evaluateShaper(MatrixShaper const& shaper, std::array<double, 3> const& colour) {
    std::array<double, 3> aLinear{};
    for (std::size_t i = 0; i < 3; ++i) {
        aLinear[i] = shaper.aInputCurves_[i](clampToUnit(colour[i]));
    }
    std::array<double, 3> aResult{};
    for (std::size_t i = 0; i < 3; ++i) {
        double const sum = shaper.aMatrix_[3 * i] * aLinear[0] + shaper.aMatrix_[3 * i + 1] * aLinear[1] +
                           shaper.aMatrix_[3 * i + 2] * aLinear[2];
        aResult[i] = shaper.aOutputCurves_[i].clamped(clampToUnit(sum));
    }
    return aResult;
}

std::array<double, 3> evaluateCube(ColourCube const& cube, std::array<double, 3> const& colour) {
    constexpr std::size_t nEdge = ColourCube::nEdge_;
    std::array<std::size_t, 3> aCell{};
    std::array<double, 3> aFraction{};
    for (std::size_t i = 0; i < 3; ++i) {
        double const position = clampToUnit(colour[i]) * static_cast<double>(nEdge - 1);
        aCell[i] = std::min(static_cast<std::size_t>(position), nEdge - 2);
        aFraction[i] = position - static_cast<double>(aCell[i]);
    }
    std::array<double, 3> aResult{};
    for (std::size_t corner = 0; corner < 8; ++corner) {
        std::size_t index = 0;
        double weight = 1.0;
        for (std::size_t axis = 3; axis-- > 0;) {
            std::size_t const bit = corner >> axis & 1U;
            index = index * nEdge + aCell[axis] + bit;
            weight *= bit != 0 ? aFraction[axis] : 1.0 - aFraction[axis];
        }
        for (std::size_t i = 0; i < 3; ++i) {
            aResult[i] += weight * static_cast<double>(cube.aValues_[3 * index + i]);
        }
    }
    return aResult;
}

} // namespace

ChannelCurve::ChannelCurve(std::function<double(double)> function, std::optional<CurveFormula> const& formula)
    : function_(std::move(function)), formula_(formula) {}

double ChannelCurve::operator()(double x) const { return function_(x); }

double ChannelCurve::clamped(double x) const { return clampToUnit(function_(x)); }

std::vector<float> ChannelCurve::sample(std::size_t nEntries) const {
    std::vector<float> aTable(nEntries);
    for (std::size_t i = 0; i < nEntries; ++i) {
        double const x = static_cast<double>(i) / static_cast<double>(nEntries - 1);
        aTable[i] = static_cast<float>(clamped(x));
    }
    return aTable;
}

std::vector<float> ChannelCurve::sampleOverRoot(std::size_t nEntries) const {
    std::vector<float> aTable(nEntries);
    for (std::size_t i = 0; i < nEntries; ++i) {
        double const root = static_cast<double>(i) / static_cast<double>(nEntries - 1);
        aTable[i] = static_cast<float>(clamped(root * root));
    }
    return aTable;
}

ResolvedTransform::ResolvedTransform(MatrixShaper shaper) : form_(std::move(shaper)) {}

ResolvedTransform::ResolvedTransform(ColourCube cube) : form_(std::move(cube)) {}

MatrixShaper const* ResolvedTransform::matrixShaper() const noexcept {
    return std::get_if<MatrixShaper>(&form_);
}

ColourCube const* ResolvedTransform::colourCube() const noexcept { return std::get_if<ColourCube>(&form_); }

std::array<double, 3> ResolvedTransform::evaluate(std::array<double, 3> const& colour) const {
    auto const* const pShaper = matrixShaper();
    return pShaper != nullptr ? evaluateShaper(*pShaper, colour)
                              : evaluateCube(std::get<ColourCube>(form_), colour);
}

} // namespace ORVO::ColourEngine::Internal
