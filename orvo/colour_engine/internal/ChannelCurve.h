#pragma once

#include "orvo/colour_engine/internal/CurveFormula.h"
#include "orvo/core/Export.h"

#include <cstddef>
#include <functional>
#include <optional>
#include <vector>

namespace ORVO::ColourEngine::Internal {

/// One channel's curve, as an exact function, as a table, and in closed form where it has one.
///
/// Threads: any, at once.
class ORVO_API ChannelCurve {
public:
    /// Takes y = f(x), defined for every finite x, thread-safe, and its formula, if there is one.
    explicit ChannelCurve(std::function<double(double)> function,
                          std::optional<CurveFormula> const& formula = std::nullopt);

    /// The curve at x, in double precision, not clamped. Slow: it calls the colour library.
    double operator()(double x) const;
    /// The same, clamped to 0..1; NaN becomes 0.
    double clamped(double x) const;
    /// What the curve is said to be; it is not known to be right.
    std::optional<CurveFormula> const& formula() const noexcept { return formula_; }

    /// The curve at i / (nEntries - 1) for i in [0, nEntries), each rounded to float and clamped to 0..1.
    std::vector<float> sample(std::size_t nEntries) const;
    /// The curve at (i / (nEntries - 1))^2, clamped to 0..1: a table whose index is the square root of the
    /// value, for output curves, which are steep at 0.
    std::vector<float> sampleOverRoot(std::size_t nEntries) const;

private:
    std::function<double(double)> function_;
    std::optional<CurveFormula> formula_;
};

/// NaN becomes 0.
constexpr double clampToUnit(double value) { return value > 0.0 ? (value < 1.0 ? value : 1.0) : 0.0; }

} // namespace ORVO::ColourEngine::Internal
