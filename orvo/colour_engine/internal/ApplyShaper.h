#pragma once

#include "orvo/colour_engine/internal/ResolvedTransform.h"
#include "orvo/colour_engine/internal/SampleTables.h"

#include <array>
#include <cstddef>

namespace ORVO::ColourEngine::Internal {

struct ApplyKernels;
struct ApplyPixels;

/// Curves, a matrix and curves over pixels: input curves as one entry for each value of a sample, output
/// curves as tables over the bits of the light (`LightScale`). The tables for a size of samples are made when
/// pixels of that size come for the first time.
///
/// Against exact curves 8-bit results are within 1 and 16-bit results within 1, except where the light of a
/// channel is the small rest of a difference: it is then as exact as single precision is.
///
/// Threads: any, at once.
class ApplyShaper {
public:
    explicit ApplyShaper(MatrixShaper const& shaper);

    ApplyShaper(ApplyShaper const&) = delete;
    ApplyShaper& operator=(ApplyShaper const&) = delete;

    void apply(ApplyPixels const& source, ApplyPixels const& destination, std::size_t rows,
               std::size_t columns, ApplyKernels const& kernels) const;

private:
    std::array<float, 9> aFactors_;
    InputTables oInputs_;
    OutputTables oOutputs_;
};

} // namespace ORVO::ColourEngine::Internal
