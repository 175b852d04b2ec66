#pragma once

#include "orvo/colour_engine/internal/ApplyKernels.h"
#include "orvo/colour_engine/internal/SampleTables.h"
#include "orvo/colour_engine/internal/TableStages.h"

#include <array>
#include <cstddef>
#include <variant>
#include <vector>

namespace ORVO::ColourEngine::Internal {

struct ApplyPixels;

/// The steps of a transform of tables over pixels, in single precision. Curves that come first have one entry
/// for each value of a sample, all other curves are tables over the bits of their numbers (`LightScale`).
///
/// Against the exact steps results of 8 bits are within 1 and results of 16 bits within 1, except where a
/// curve is steep and what it is asked the small rest of a difference.
///
/// Threads: any, at once.
class ApplyStages {
public:
    /// Throws `std::bad_alloc`.
    explicit ApplyStages(TableStages const& aStages);

    ApplyStages(ApplyStages const&) = delete;
    ApplyStages& operator=(ApplyStages const&) = delete;

    void apply(ApplyPixels const& source, ApplyPixels const& destination, std::size_t rows,
               std::size_t columns, ApplyKernels const& kernels) const;

private:
    struct Block;

    struct Curves {
        std::array<std::vector<float>, 3> aTables_;
        void run(Block& block, ApplyKernels const& kernels, std::size_t n) const;
    };
    struct Mix {
        std::array<float, 12> aFactors_;
        void run(Block& block, ApplyKernels const& kernels, std::size_t n) const;
    };
    struct Grid {
        explicit Grid(GridStage const& stage);
        void run(Block& block, ApplyKernels const& kernels, std::size_t n) const;
        template <bool bRound>
        void runTetrahedra(Block& block, std::size_t n) const;
        template <bool bRound>
        void runCells(Block& block, std::size_t n) const;

        GridShape oShape_;
        bool bTrilinear_;
        bool bWords_;               ///< nodes are 0..65535
        std::vector<float> aNodes_; ///< four floats a node: one load each
    };
    struct Connection {
        ConnectionStage eStage_;
        void run(Block& block, ApplyKernels const& kernels, std::size_t n) const;
    };
    using Step = std::variant<Curves, Mix, Grid, Connection>;

    static Step stepOf(TableStage const& stage);
    void write(Block& block, ApplyPixels const& destination, std::size_t row, std::size_t column,
               ApplyKernels const& kernels, std::size_t n) const;

    InputTables oInputs_;
    std::vector<Step> aSteps_; ///< between the curves that come first and those that come last
    bool bOutputCurves_;       ///< whether curves come last
    OutputTables oOutputs_;
};

} // namespace ORVO::ColourEngine::Internal
