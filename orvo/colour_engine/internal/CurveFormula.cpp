#include "orvo/colour_engine/internal/CurveFormula.h"

#include <algorithm>
#include <cmath>

namespace ORVO::ColourEngine::Internal {

namespace {

/// y = (a x + b) ^ g + e from d on, c x + f below.
struct ParametricCurve {
    double g;
    double a;
    double b;
    double c;
    double d;
    double e;
    double f;
};

std::optional<ParametricCurve> parametricCurve(int type, double const* p) {
    switch (type) {
    case 1:
        return ParametricCurve{p[0], 1.0, 0.0, 0.0, 0.0, 0.0, 0.0};
    case 2:
        return ParametricCurve{p[0], p[1], p[2], 0.0, -p[2] / p[1], 0.0, 0.0};
    case 3:
        return ParametricCurve{p[0], p[1], p[2], 0.0, -p[2] / p[1], p[3], p[3]};
    case 4:
        return ParametricCurve{p[0], p[1], p[2], p[3], p[4], 0.0, 0.0};
    case 5:
        return ParametricCurve{p[0], p[1], p[2], p[3], p[4], p[5], p[6]};
    default:
        return std::nullopt;
    }
}

CurveFormula forward(ParametricCurve const& curve) {
    CurveFormula formula;
    formula.dScale_ = curve.a;
    formula.dOffset_ = curve.b;
    formula.dExponent_ = curve.g;
    formula.dResultOffset_ = curve.e;
    formula.dBreak_ = curve.d;
    formula.dSlope_ = curve.c;
    formula.dIntercept_ = curve.f;
    return formula;
}

CurveFormula inverse(ParametricCurve const& curve) {
    CurveFormula formula;
    formula.dOffset_ = -curve.e;
    formula.dExponent_ = 1.0 / curve.g;
    formula.dResultScale_ = 1.0 / curve.a;
    formula.dResultOffset_ = -curve.b / curve.a;
    // Not below 0, where d is a quotient that was rounded.
    formula.dBreak_ = std::pow(std::max(curve.a * curve.d + curve.b, 0.0), curve.g) + curve.e;
    if (curve.c != 0.0) {
        formula.dSlope_ = 1.0 / curve.c;
        formula.dIntercept_ = -curve.f / curve.c;
    } else {
        formula.dIntercept_ = curve.d;
    }
    return formula;
}

} // namespace

double CurveFormula::slope(double x) const noexcept {
    if (x < dBreak_) {
        return dSlope_;
    }
    return dResultScale_ * dExponent_ * dScale_ * std::pow(base(x), dExponent_ - 1.0);
}

bool CurveFormula::isIdentity() const noexcept {
    return dExponent_ == 1.0 && dResultScale_ * dScale_ == 1.0 &&
           dResultScale_ * dOffset_ + dResultOffset_ == 0.0 && !(dBreak_ > 0.0);
}

std::optional<CurveFormula> curveFormula(int type, double const* pParameters) {
    auto const curve = parametricCurve(type < 0 ? -type : type, pParameters);
    if (!curve.has_value()) {
        return std::nullopt;
    }
    return type < 0 ? inverse(*curve) : forward(*curve);
}

} // namespace ORVO::ColourEngine::Internal
