#include "orvo/colour_engine/internal/RootPolynomial.h"

#include "orvo/colour_engine/internal/ShaderNumber.h"

#include <array>
#include <cmath>
#include <cstddef>
#include <numbers>
#include <sstream>
#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {

constexpr std::size_t nFitPoints = 96;
constexpr unsigned nMostRoots = 4;
using PointColumn = std::array<double, nFitPoints>;

double inner(PointColumn const& a, PointColumn const& b) {
    double sum = 0.0;
    for (std::size_t i = 0; i < nFitPoints; ++i) {
        sum += a[i] * b[i];
    }
    return sum;
}

void subtract(PointColumn& from, PointColumn const& what, double factor) {
    for (std::size_t i = 0; i < nFitPoints; ++i) {
        from[i] -= factor * what[i];
    }
}

/// The combination of the columns that is nearest to the target; by modified Gram-Schmidt, of which the
/// target is one more column. What is left of the target is left in it.
std::vector<double> leastSquares(std::vector<PointColumn> aColumns, PointColumn& target) {
    std::size_t const n = aColumns.size();
    std::vector<double> aTriangle(n * n);
    std::vector<double> aResult(n);
    for (std::size_t column = 0; column < n; ++column) {
        double const norm = std::sqrt(inner(aColumns[column], aColumns[column]));
        for (double& value : aColumns[column]) {
            value /= norm;
        }
        aTriangle[column * n + column] = norm;
        for (std::size_t other = column + 1; other < n; ++other) {
            double const part = inner(aColumns[column], aColumns[other]);
            aTriangle[column * n + other] = part;
            subtract(aColumns[other], aColumns[column], part);
        }
        aResult[column] = inner(aColumns[column], target);
        subtract(target, aColumns[column], aResult[column]);
    }
    for (std::size_t row = n; row-- > 0;) {
        for (std::size_t column = row + 1; column < n; ++column) {
            aResult[row] -= aTriangle[row * n + column] * aResult[column];
        }
        aResult[row] /= aTriangle[row * n + row];
    }
    return aResult;
}

double rootOf(double t, unsigned nRoots) { return std::pow(t, std::ldexp(1.0, -static_cast<int>(nRoots))); }

std::string rootName(unsigned nRoots) { return nRoots == 0 ? "t" : "root" + std::to_string(nRoots); }

} // namespace

std::optional<RootPolynomial> RootPolynomial::fit(Form const& form, std::size_t nTerms, double exponent,
                                                  double from, double to,
                                                  std::function<double(double)> const& tolerance) {
    std::vector<PointColumn> aColumns(nTerms);
    PointColumn target{};
    double const first = rootOf(from, form.nRoots_);
    double const last = rootOf(to, form.nRoots_);
    for (std::size_t i = 0; i < nFitPoints; ++i) {
        // Close to each other at both ends, where polynomials stray; the last point is the end itself.
        double const angle = std::numbers::pi * static_cast<double>(i + 1) / static_cast<double>(nFitPoints);
        double const root = first + (last - first) * 0.5 * (1.0 - std::cos(angle));
        double const t = std::pow(root, std::ldexp(1.0, static_cast<int>(form.nRoots_)));
        // White is to stay white.
        double const weight = (i + 1 == nFitPoints ? 100.0 : 1.0) / tolerance(t);
        target[i] = weight * std::pow(t, exponent);
        double term = weight * rootOf(t, form.nFactorRoots_);
        for (PointColumn& column : aColumns) {
            column[i] = term;
            term *= root;
        }
    }
    RootPolynomial polynomial(form);
    for (double const coefficient : leastSquares(std::move(aColumns), target)) {
        polynomial.aCoefficients_.push_back(static_cast<float>(coefficient));
    }
    for (double const rest : target) {
        if (!(std::abs(rest) <= 1.0)) {
            return std::nullopt;
        }
    }
    return polynomial;
}

float RootPolynomial::operator()(float t) const {
    std::array<float, nMostRoots + 1> aRoots{t};
    for (unsigned i = 1; i <= oForm_.nRoots_; ++i) {
        aRoots[i] = std::sqrt(aRoots[i - 1]);
    }
    float const root = aRoots[oForm_.nRoots_];
    float const square = aRoots[oForm_.nRoots_ - 1];
    float sum = 0.0F;
    for (std::size_t i = (aCoefficients_.size() - 1) / 2 * 2;; i -= 2) {
        float pair = aCoefficients_[i];
        if (i + 1 < aCoefficients_.size()) {
            pair += aCoefficients_[i + 1] * root;
        }
        sum = pair + square * sum;
        if (i == 0) {
            return aRoots[oForm_.nFactorRoots_] * sum;
        }
    }
}

std::string RootPolynomial::statements() const {
    std::ostringstream text;
    for (unsigned i = 1; i <= oForm_.nRoots_; ++i) {
        text << "    float " << rootName(i) << " = sqrt(" << rootName(i - 1) << ");\n";
    }
    text << "    float power = " << rootName(oForm_.nFactorRoots_) << " * (";
    // In pairs of terms, so that no product waits for all of those before it.
    std::string sClosing;
    for (std::size_t i = 0; i < aCoefficients_.size(); i += 2) {
        bool const bLast = i + 2 >= aCoefficients_.size();
        text << (bLast ? "" : "(") << shaderNumber(aCoefficients_[i]);
        if (i + 1 < aCoefficients_.size()) {
            text << " + " << shaderNumber(aCoefficients_[i + 1]) << " * " << rootName(oForm_.nRoots_);
        }
        if (!bLast) {
            text << ") + " << rootName(oForm_.nRoots_ - 1) << " * (";
            sClosing += ')';
        }
    }
    text << sClosing << ");\n";
    return text.str();
}

} // namespace ORVO::ColourEngine::Internal
