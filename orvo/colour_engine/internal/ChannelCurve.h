#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <functional>
#include <vector>

namespace ORVO::ColourEngine::Internal {

/// One channel's curve, as an exact function and as a table.
///
/// Threads: any, at once.
class ORVO_API ChannelCurve {
public:
    /// Takes y = f(x), defined for every finite x, thread-safe.
    explicit ChannelCurve(std::function<double(double)> function);

    /// The curve at x, in double precision, not clamped. Slow: it calls the colour library.
    double operator()(double x) const;

    /// The curve at i / (nEntries - 1) for i in [0, nEntries), each rounded to float and clamped to 0..1.
    std::vector<float> sample(std::size_t nEntries) const;
    /// The curve at (i / (nEntries - 1))^2, clamped to 0..1: a table whose index is the square root of the
    /// value, for output curves, which are steep at 0.
    std::vector<float> sampleOverRoot(std::size_t nEntries) const;

private:
    std::function<double(double)> function_;
};

/// NaN becomes 0.
constexpr double clampToUnit(double value) { return value > 0.0 ? (value < 1.0 ? value : 1.0) : 0.0; }

} // namespace ORVO::ColourEngine::Internal
