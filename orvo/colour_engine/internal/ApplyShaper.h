#pragma once

#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <mutex>
#include <vector>

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
    /// Borrows the curves and the matrix.
    explicit ApplyShaper(MatrixShaper const& shaper);

    ApplyShaper(ApplyShaper const&) = delete;
    ApplyShaper& operator=(ApplyShaper const&) = delete;

    void apply(ApplyPixels const& source, ApplyPixels const& destination, std::size_t rows,
               std::size_t columns, ApplyKernels const& kernels) const;

private:
    /// A table for each channel; equal ones are kept once.
    template <typename Entry>
    struct Tables {
        std::once_flag oOnce_;
        std::array<std::vector<Entry>, 3> aStorage_;
        std::array<Entry const*, 3> aTables_{};

        template <typename Make>
        std::array<Entry const*, 3> const& get(Make const& make);
    };

    std::array<float const*, 3> const& inputs(bool bWords) const;
    std::array<std::uint8_t const*, 3> const& byteOutputs() const;
    std::array<float const*, 3> const& wordOutputs() const;

    MatrixShaper const& shaper_;
    std::array<float, 9> aFactors_;
    mutable Tables<float> oByteInputs_;
    mutable Tables<float> oWordInputs_;
    mutable Tables<std::uint8_t> oByteOutputs_;
    mutable Tables<float> oWordOutputs_;
};

} // namespace ORVO::ColourEngine::Internal
