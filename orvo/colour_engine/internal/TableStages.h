#pragma once

#include "orvo/colour_engine/internal/ChannelCurve.h"
#include "orvo/core/Export.h"

#include <array>
#include <cstddef>
#include <variant>
#include <vector>

namespace ORVO::ColourEngine::Internal {

/// A curve for each channel. What goes in and what comes out is clamped to 0..1.
struct CurveStage {
    std::array<ChannelCurve, 3> aCurves_;
};

/// Result i is aOffset_[i] plus the sum over j of aMatrix_[3 * i + j] times value j. Nothing is clamped.
struct MatrixStage {
    std::array<double, 9> aMatrix_;
    std::array<double, 3> aOffset_;
};

/// A table over three values, which are clamped to 0..1.
struct GridStage {
    std::array<std::size_t, 3> aEdges_; ///< nodes along each axis, at least 2
    /// Between the eight corners of a cell; else between four, in one of the six tetrahedra that meet in the
    /// diagonal from its lower to its upper corner.
    bool bTrilinear_;
    /// A table of 16-bit integers, 65535 for 1, as profiles have them: what goes in, where it lies in a cell
    /// (in parts of 65536) and each interpolation are rounded, as the colour library does it. Behind a steep
    /// curve, at black, one such step is many steps of the result.
    bool bWords_;
    /// Triples. The node (i, j, k), which stands for the values i / (aEdges_[0] - 1) and so on, is the triple
    /// (k * aEdges_[1] + j) * aEdges_[0] + i.
    std::vector<float> aNodes_;
};

/// Between the two spaces in which profiles meet: XYZ relative to a D50 white of luminance 1, and Lab with
/// L / 100, (a + 128) / 255 and (b + 128) / 255.
enum class ConnectionStage { LAB_TO_XYZ, XYZ_TO_LAB };

using TableStage = std::variant<CurveStage, MatrixStage, GridStage, ConnectionStage>;

/// A transform of tables, step by step, from encoded samples in 0..1 to such samples.
using TableStages = std::vector<TableStage>;

/// What the first `nStages` of the stages make of a colour, in double precision: the plain version that the
/// faster one is measured against. Of all stages the result is clamped to 0..1, of fewer it is not.
ORVO_API std::array<double, 3> evaluateStages(TableStages const& aStages, std::size_t nStages,
                                              std::array<double, 3> const& colour);

/// The white of the connection spaces.
constexpr std::array<double, 3> CONNECTION_WHITE = {0.9642, 1.0, 0.8249};

} // namespace ORVO::ColourEngine::Internal
