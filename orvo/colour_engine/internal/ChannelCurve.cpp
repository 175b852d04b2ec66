#include "orvo/colour_engine/internal/ChannelCurve.h"

#include <utility>

namespace ORVO::ColourEngine::Internal {

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

} // namespace ORVO::ColourEngine::Internal
