#pragma once

#include "orvo/colour_engine/internal/ColourCube.h"
#include "orvo/core/Export.h"

#include <array>
#include <functional>

namespace ORVO::ColourEngine::Internal {

/// A function of three channels, defined for 0..1.
using ColourFunction = std::function<std::array<double, 3>(std::array<double, 3> const&)>;

/// The cube that follows a transform of tables best: with nodes at even distances or closer where the
/// transform bends, with results in the nodes or, where the transform ends in curves, with what goes into
/// these, as lightness and not clamped, so that neither the curves nor the border of the gamut bend what is
/// interpolated. Which one is chosen by the error of trilinear interpolation over some thousand colours.
ORVO_API ColourCube fitCube(TableStages const& aStages);

/// The same for any transform into 0..1, with results in the nodes.
ORVO_API ColourCube fitCube(ColourFunction const& exact);

} // namespace ORVO::ColourEngine::Internal
