#pragma once

#include <cstddef>
#include <vector>

namespace ORVO::ColourEngine::Internal {

struct ApplyKernels;
struct ApplyPixels;
struct ColourCube;

/// A cube over pixels, by tetrahedral interpolation: exact at its nodes and linear between the four corners
/// of each of the six tetrahedra of a cell that meet in the diagonal from its lower to its upper corner, so
/// that a grey axis of nodes stays grey.
///
/// Threads: any, at once.
class ApplyCube {
public:
    /// Copies the nodes.
    explicit ApplyCube(ColourCube const& cube);

    void apply(ApplyPixels const& source, ApplyPixels const& destination, std::size_t rows,
               std::size_t columns, ApplyKernels const& kernels) const;

private:
    std::vector<float> aNodes_; ///< four floats a node, in the order of the cube: one load each
};

} // namespace ORVO::ColourEngine::Internal
