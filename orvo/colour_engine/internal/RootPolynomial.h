#pragma once

#include "orvo/core/Export.h"

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace ORVO::ColourEngine::Internal {

/// A power t^p in square roots, products and sums, which drivers compute nearly alike, and fast:
///     t^p ~ t^(1 / 2^nFactorRoots_) * q(t^(1 / 2^nRoots_))
/// with a polynomial q of a few terms. Roots are there because a power bends at 0 as no polynomial does: by
/// the square root of t it does so half as sharply.
///
/// Threads: any, at once.
class ORVO_API RootPolynomial {
public:
    /// Roots that are taken, and those of them that the factor has; more than 0 roots.
    struct Form {
        unsigned nRoots_;
        unsigned nFactorRoots_;
    };

    /// The best polynomial of n terms over from..to, in weighted least squares; nothing where that does not
    /// come within the tolerance at the points that it is fitted to, or some number is not finite.
    /// `tolerance` is what the power may be off by at t, above 0.
    static std::optional<RootPolynomial> fit(Form const& form, std::size_t nTerms, double exponent,
                                             double from, double to,
                                             std::function<double(double)> const& tolerance);

    /// The power of t, computed in floats as the text does it.
    float operator()(float t) const;
    /// GLSL statements, each on a line of its own, which declare the roots of the float variable t, and the
    /// power as `float power`.
    std::string statements() const;

private:
    explicit RootPolynomial(Form const& form) : oForm_(form) {}

    Form oForm_;
    std::vector<float> aCoefficients_; ///< of q, that of power 0 first
};

} // namespace ORVO::ColourEngine::Internal
