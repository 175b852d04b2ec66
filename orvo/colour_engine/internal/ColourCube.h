#pragma once

#include "orvo/colour_engine/internal/ChannelCurve.h"
#include "orvo/colour_engine/internal/TableStages.h"
#include "orvo/core/Export.h"

#include <array>
#include <cstddef>
#include <optional>
#include <vector>

namespace ORVO::ColourEngine::Internal {

/// A transform as its result on a lattice over the RGB cube, which is what a graphics card interpolates:
/// curve of each channel, table, curve of each channel.
///
/// How far it is from what it was fitted to, in parts of white: from profiles of tables to sRGB in the mean
/// 0.0003 and at most 0.008, to a pure gamma or linear light 0.0006 and 0.023, to tables with the edges of a
/// clipped gamut between their nodes 0.0014 and 0.076.
struct ColourCube {
    static constexpr std::size_t nEdge_ = 33;
    /// What stands in the table where there are output curves: numbers in dLowest_..dLowest_ + dSpan_.
    static constexpr double dLowest_ = -0.5;
    static constexpr double dSpan_ = 2.0;

    /// nEdge_^3 triples of red, green and blue. The node (r, g, b) is the triple (b * nEdge_ + g) * nEdge_ +
    /// r: red runs fastest, as OpenGL wants it. They are the results in 0..1, or what the output curves take.
    std::vector<float> aValues_;
    /// Where along each edge a sample lies, 0..1; without it, at its own value.
    std::optional<ChannelCurve> oSpacing_;
    /// What makes the results of the values, which are clamped to 0..1 first.
    std::optional<std::array<ChannelCurve, 3>> oOutputCurves_;
};

/// The cube as steps: between the eight nodes of a cell, which is what OpenGL makes of a colour but for its
/// roundings, or in tetrahedra, as the CPU does.
ORVO_API TableStages stagesOf(ColourCube const& cube, bool bTrilinear);

} // namespace ORVO::ColourEngine::Internal
