#include "orvo/colour_engine/internal/ShaderCurve.h"

#include "orvo/colour_engine/internal/ResolvedTransform.h"
#include "orvo/colour_engine/internal/ShaderNumber.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <utility>
#include <vector>

namespace ORVO::ColourEngine::Internal {

namespace {

/// A value, the curve there, and what the shader may be off by.
struct BoundPoint {
    float x;
    double y;
    double tolerance;
};

template <typename Tolerance>
std::vector<BoundPoint> boundPoints(ChannelCurve const& curve, Tolerance const& toleranceOf) {
    constexpr int nSteps = 4096;
    std::vector<BoundPoint> aPoints;
    aPoints.reserve(2 * nSteps + 2);
    for (int i = 0; i <= nSteps; ++i) {
        double const position = static_cast<double>(i) / nSteps;
        // Evenly, and once more by the fourth power: 1 in 8 of those lie below 1/4096.
        for (double const value : {position, position * position * position * position}) {
            auto const x = static_cast<float>(value);
            aPoints.push_back({x, curve.clamped(x), toleranceOf(static_cast<double>(x))});
        }
    }
    return aPoints;
}

bool keepsBound(ShaderCurve const& curve, std::vector<BoundPoint> const& aPoints) {
    return std::all_of(aPoints.begin(), aPoints.end(), [&](BoundPoint const& point) {
        return std::abs(static_cast<double>(curve(point.x)) - point.y) <= point.tolerance;
    });
}

/// Forms and numbers of terms, those that cost little first: a root costs about what two terms do.
std::vector<std::pair<RootPolynomial::Form, std::size_t>> polynomialCandidates() {
    constexpr std::size_t nMostTerms = 8;
    constexpr std::array<RootPolynomial::Form, 4> aForms{{{1, 0}, {2, 0}, {2, 2}, {3, 2}}};
    std::vector<std::pair<RootPolynomial::Form, std::size_t>> aCandidates;
    for (RootPolynomial::Form const& form : aForms) {
        for (std::size_t nTerms = 2; nTerms <= nMostTerms; ++nTerms) {
            aCandidates.emplace_back(form, nTerms);
        }
    }
    std::stable_sort(aCandidates.begin(), aCandidates.end(), [](auto const& a, auto const& b) {
        return 2 * a.first.nRoots_ + a.second < 2 * b.first.nRoots_ + b.second;
    });
    return aCandidates;
}

/// A shader has no text for anything else.
bool isFinite(CurveFormula const& formula) {
    std::array<double, 8> const aNumbers{formula.dScale_,       formula.dOffset_,       formula.dExponent_,
                                         formula.dResultScale_, formula.dResultOffset_, formula.dBreak_,
                                         formula.dSlope_,       formula.dIntercept_};
    return std::all_of(aNumbers.begin(), aNumbers.end(),
                       [](double number) { return std::isfinite(static_cast<float>(number)); });
}

/// scale * sValue + offset, without what does nothing.
std::string scaled(std::string const& sValue, double scale, double offset) {
    if (scale == 0.0) {
        return shaderNumber(offset);
    }
    std::string const sProduct = scale == 1.0 ? sValue : shaderNumber(scale) + " * " + sValue;
    return offset == 0.0 ? sProduct : sProduct + " + " + shaderNumber(offset);
}

} // namespace

template <typename Tolerance>
std::optional<ShaderCurve> ShaderCurve::make(ChannelCurve const& curve, Tolerance const& toleranceOf) {
    if (!curve.formula().has_value() || !isFinite(*curve.formula())) {
        return std::nullopt;
    }
    CurveFormula const& formula = *curve.formula();
    auto const aPoints = boundPoints(curve, toleranceOf);
    ShaderCurve result(formula);
    if (formula.dExponent_ == 1.0) {
        return keepsBound(result, aPoints) ? std::optional(result) : std::nullopt;
    }
    // Not below 0, where the break is a quotient that was rounded.
    double const from = std::max(formula.base(std::max(formula.dBreak_, 0.0)), 0.0);
    double const to = formula.base(1.0);
    auto const toleranceOfPower = [&](double t) {
        return toleranceOf((t - formula.dOffset_) / formula.dScale_) / std::abs(formula.dResultScale_);
    };
    for (auto const& [form, nTerms] : polynomialCandidates()) {
        result.power_ = RootPolynomial::fit(form, nTerms, formula.dExponent_, from, to, toleranceOfPower);
        if (result.power_.has_value() && keepsBound(result, aPoints)) {
            return result;
        }
    }
    return std::nullopt;
}

std::optional<ShaderCurve> ShaderCurve::ofInput(ChannelCurve const& curve) {
    return make(curve, [&](double x) {
        double const dark = dSampleBound_ * curve.formula()->slope(x);
        return std::min(dLightBound_, dark > dBlackBound_ ? dark : dBlackBound_);
    });
}

std::optional<ShaderCurve> ShaderCurve::ofOutput(ChannelCurve const& curve) {
    return make(curve, [](double) { return dOutputBound_; });
}

bool ShaderCurve::mayHaveNegativeBases() const noexcept {
    constexpr double rounding = 1e-6;
    bool const bPlain = oFormula_.dOffset_ == 0.0 && oFormula_.dScale_ > 0.0;
    return !bPlain && std::min(oFormula_.base(0.0), oFormula_.base(1.0)) < rounding;
}

float ShaderCurve::operator()(float x) const {
    if (hasLine() && x < static_cast<float>(oFormula_.dBreak_)) {
        return static_cast<float>(oFormula_.dSlope_) * x + static_cast<float>(oFormula_.dIntercept_);
    }
    float t = static_cast<float>(oFormula_.dScale_) * x + static_cast<float>(oFormula_.dOffset_);
    if (mayHaveNegativeBases()) {
        t = std::max(t, 0.0F);
    }
    float const power = power_.has_value() ? (*power_)(t) : t;
    return static_cast<float>(oFormula_.dResultScale_) * power + static_cast<float>(oFormula_.dResultOffset_);
}

std::string ShaderCurve::body() const {
    std::string sBase = scaled("x", oFormula_.dScale_, oFormula_.dOffset_);
    if (mayHaveNegativeBases()) {
        sBase = "max(" + sBase + ", 0.0)";
    }
    std::string const sPower =
        power_.has_value() ? power_->statements() : std::string("    float power = t;\n");
    std::string sResult = scaled("power", oFormula_.dResultScale_, oFormula_.dResultOffset_);
    if (hasLine()) {
        sResult = "x < " + shaderNumber(oFormula_.dBreak_) + " ? " +
                  scaled("x", oFormula_.dSlope_, oFormula_.dIntercept_) + " : " + sResult;
    }
    return "    float t = " + sBase + ";\n" + sPower + "    return " + sResult + ";\n";
}

} // namespace ORVO::ColourEngine::Internal
