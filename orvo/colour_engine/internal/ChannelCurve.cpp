#include "orvo/colour_engine/internal/ChannelCurve.h"

#include <utility>

namespace ORVO::ColourEngine::Internal {

ChannelCurve::ChannelCurve(std::function<double(double)> function) : function_(std::move(function)) {}

double ChannelCurve::operator()(double x) const { return function_(x); }

std::vector<float> ChannelCurve::sample(std::size_t nEntries) const {
    std::vector<float> aTable(nEntries);
    for (std::size_t i = 0; i < nEntries; ++i) {
        double const x = static_cast<double>(i) / static_cast<double>(nEntries - 1);
        aTable[i] = static_cast<float>(clampToUnit(function_(x)));
    }
    return aTable;
}

std::vector<float> ChannelCurve::sampleOverRoot(std::size_t nEntries) const {
    std::vector<float> aTable(nEntries);
    for (std::size_t i = 0; i < nEntries; ++i) {
        double const root = static_cast<double>(i) / static_cast<double>(nEntries - 1);
        aTable[i] = static_cast<float>(clampToUnit(function_(root * root)));
    }
    return aTable;
}

} // namespace ORVO::ColourEngine::Internal
