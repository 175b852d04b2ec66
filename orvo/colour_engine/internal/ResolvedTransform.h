#pragma once

#include "orvo/colour_engine/internal/ChannelCurve.h"
#include "orvo/colour_engine/internal/ColourCube.h"
#include "orvo/colour_engine/internal/TableStages.h"
#include "orvo/core/Export.h"

#include <array>
#include <mutex>
#include <optional>

namespace ORVO::ColourEngine::Internal {

/// A transform of the form: curve of each channel, 3x3 matrix, clamp to 0..1, curve of each channel.
///
/// Grey spaces have this form too: from grey, only the green input counts; to grey, all outputs are equal.
struct MatrixShaper {
    std::array<ChannelCurve, 3> aInputCurves_;
    /// Row-major: linear output i is the sum over j of aMatrix_[3 * i + j] times linear input j.
    std::array<double, 9> aMatrix_;
    std::array<ChannelCurve, 3> aOutputCurves_;
};

/// What an optimised transform does to a pixel, ready to be evaluated: immutable. Colours are encoded samples
/// in 0..1. Grey pixels go in as (v, v, v) and come out as the green result.
///
/// Threads: any, at once.
class ORVO_API ResolvedTransform {
public:
    explicit ResolvedTransform(MatrixShaper shaper);
    explicit ResolvedTransform(TableStages aStages);
    /// The stages that the cube is.
    explicit ResolvedTransform(ColourCube cube);

    ResolvedTransform(ResolvedTransform const&) = delete;
    ResolvedTransform& operator=(ResolvedTransform const&) = delete;

    /// The curves and the matrix, null where the transform has tables.
    MatrixShaper const* matrixShaper() const noexcept;
    /// The steps of a transform of tables, empty where it is curves and a matrix.
    TableStages const& stages() const noexcept;
    /// A transform of tables as one table, null where it is curves and a matrix. It is fitted to the stages
    /// when it is asked for first, in some tenths of a second. Throws `std::bad_alloc`.
    ColourCube const* colourCube() const;

    /// The result for one colour, in double precision, all steps exactly. The plain version that every faster
    /// one is measured against. Input and result are clamped to 0..1.
    std::array<double, 3> evaluate(std::array<double, 3> const& colour) const;

private:
    // The shaper or the stages.
    std::optional<MatrixShaper> oShaper_;
    TableStages aStages_;
    mutable std::once_flag oCubeOnce_;
    mutable std::optional<ColourCube> oCube_;
};

} // namespace ORVO::ColourEngine::Internal
