#pragma once

#include "orvo/colour_engine/internal/CurveFormula.h"
#include "orvo/colour_engine/internal/RootPolynomial.h"
#include "orvo/core/Export.h"

#include <optional>
#include <string>

namespace ORVO::ColourEngine::Internal {

class ChannelCurve;

/// A channel's curve as a few instructions of a shader, without a table: its formula, with square roots and a
/// polynomial in the place of the power. Only curves that have been found to keep their bound exist: they are
/// computed as the shader does it, in floats, at more than 8000 values from 0 to 1, half of them crowded
/// towards black, and compared with the curve itself.
///
/// What a driver computes otherwise (products and sums fused or in another order, a square root that is off
/// by two units of the last place, as the GLSL of later versions allows) adds about 3e-7. There is no power
/// among the instructions: drivers make it of logarithms, whose errors are theirs, and undefined at 0.
///
/// Threads: any, at once.
class ORVO_API ShaderCurve {
public:
    /// How far an input curve's light may be off.
    static constexpr double dLightBound_ = 5e-7;
    /// How far the sample may be off that stands for this light, where that is the narrower bound, as near
    /// black; light below dBlackBound_ counts as black.
    static constexpr double dSampleBound_ = 2e-4;
    static constexpr double dBlackBound_ = 1e-9;
    /// How far an output curve's sample may be off.
    static constexpr double dOutputBound_ = 2e-5;

    /// A curve from samples to light, and one from light to samples; nothing where it has no formula, or no
    /// polynomial of few terms keeps the bound, or the curve leaves 0..1.
    static std::optional<ShaderCurve> ofInput(ChannelCurve const& curve);
    static std::optional<ShaderCurve> ofOutput(ChannelCurve const& curve);

    /// y = x: there is nothing to compute.
    bool isIdentity() const noexcept { return oFormula_.isIdentity(); }
    /// The body of a GLSL function that returns the curve at its parameter, `float x`, from 0 to 1.
    std::string body() const;
    /// The curve at x from 0 to 1, computed in floats as the text does it.
    float operator()(float x) const;

private:
    explicit ShaderCurve(CurveFormula const& formula) : oFormula_(formula) {}

    template <typename Tolerance>
    static std::optional<ShaderCurve> make(ChannelCurve const& curve, Tolerance const& toleranceOf);
    bool hasLine() const noexcept { return oFormula_.dBreak_ > 0.0; }
    /// Whether the formula makes the base of the power negative, below the break, or rounding can.
    bool mayHaveNegativeBases() const noexcept;

    CurveFormula oFormula_;
    std::optional<RootPolynomial> power_; ///< none for an exponent of 1
};

} // namespace ORVO::ColourEngine::Internal
