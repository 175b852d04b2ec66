#pragma once

#include "orvo/colour_engine/internal/CurveFormula.h"
#include "orvo/core/Export.h"

#include <array>
#include <cstddef>
#include <functional>
#include <optional>
#include <variant>
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

/// A transform of the form: curve of each channel, 3x3 matrix, clamp to 0..1, curve of each channel.
///
/// Grey spaces have this form too: from grey, only the green input counts; to grey, all outputs are equal.
struct MatrixShaper {
    std::array<ChannelCurve, 3> aInputCurves_;
    /// Row-major: linear output i is the sum over j of aMatrix_[3 * i + j] times linear input j.
    std::array<double, 9> aMatrix_;
    std::array<ChannelCurve, 3> aOutputCurves_;
};

/// Any other transform: its result on a lattice over the RGB cube.
struct ColourCube {
    static constexpr std::size_t nEdge_ = 33;

    /// nEdge_^3 triples of red, green and blue in 0..1. The node (r, g, b), which stands for the input
    /// (r, g, b) / (nEdge_ - 1), is the triple (b * nEdge_ + g) * nEdge_ + r: red runs fastest, as OpenGL
    /// wants it.
    std::vector<float> aValues_;
};

/// What an optimised transform does to a pixel, ready to be evaluated: immutable. Colours are encoded samples
/// in 0..1. Grey pixels go in as (v, v, v) and come out as the green result.
///
/// Threads: any, at once.
class ORVO_API ResolvedTransform {
public:
    explicit ResolvedTransform(MatrixShaper shaper);
    explicit ResolvedTransform(ColourCube cube);

    /// The curves and the matrix, null where the transform is a cube.
    MatrixShaper const* matrixShaper() const noexcept;
    /// The cube, null where the transform is curves and a matrix.
    ColourCube const* colourCube() const noexcept;

    /// The result for one colour, in double precision: curves and matrix exactly, a cube by trilinear
    /// interpolation. The plain version that every faster one is measured against. Input and result are
    /// clamped to 0..1.
    std::array<double, 3> evaluate(std::array<double, 3> const& colour) const;

private:
    std::variant<MatrixShaper, ColourCube> form_;
};

} // namespace ORVO::ColourEngine::Internal
