#pragma once

#include "orvo/core/Export.h"

#include <optional>

namespace ORVO::ColourEngine::Internal {

/// A curve in closed form, a power and a straight line. From the break on
///     y = dResultScale_ * (dScale_ * x + dOffset_) ^ dExponent_ + dResultOffset_
/// and below it y = dSlope_ * x + dIntercept_. The parametric curves of ICC profiles (ICC.1:2010, 10.16) have
/// this form, and so have their inverses.
struct ORVO_API CurveFormula {
    double dScale_ = 1.0;
    double dOffset_ = 0.0;
    double dExponent_ = 1.0;
    double dResultScale_ = 1.0;
    double dResultOffset_ = 0.0;
    double dBreak_ = 0.0; ///< 0 or less: there is no line in 0..1
    double dSlope_ = 0.0;
    double dIntercept_ = 0.0;

    /// What the power is taken of, at x.
    double base(double x) const noexcept { return dScale_ * x + dOffset_; }
    /// The slope of the curve at x.
    double slope(double x) const noexcept;
    /// y = x all over 0..1.
    bool isIdentity() const noexcept;
};

/// The formula of a parametric curve as the colour library numbers them: type 1 to 5, the numbers of an ICC
/// profile's types 0 to 4, with its parameters in their order (g; g a b; g a b c; g a b c d; g a b c d e f),
/// or the negative of that for the inverse. Nothing for every other type.
///
/// Nothing is asked of the parameters: the result may be wrong or no number where they make no sense, and
/// where the two branches of an inverted curve do not meet.
///
/// Threads: any.
ORVO_API std::optional<CurveFormula> curveFormula(int type, double const* pParameters);

} // namespace ORVO::ColourEngine::Internal
