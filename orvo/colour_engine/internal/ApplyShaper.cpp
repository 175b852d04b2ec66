#include "orvo/colour_engine/internal/ApplyShaper.h"

#include "orvo/colour_engine/internal/ApplyKernels.h"
#include "orvo/colour_engine/internal/ApplyPixels.h"

#include <algorithm>

namespace ORVO::ColourEngine::Internal {

ApplyShaper::ApplyShaper(MatrixShaper const& shaper)
    : aFactors_(), oInputs_(shaper.aInputCurves_), oOutputs_(shaper.aOutputCurves_) {
    std::transform(shaper.aMatrix_.begin(), shaper.aMatrix_.end(), aFactors_.begin(),
                   [](double factor) { return static_cast<float>(factor); });
}

void ApplyShaper::apply(ApplyPixels const& source, ApplyPixels const& destination, std::size_t rows,
                        std::size_t columns, ApplyKernels const& kernels) const {
    auto const& aInputs = oInputs_.get(source.bWords_);
    auto const aBytes = destination.bWords_ ? std::array<std::uint8_t const*, 3>{} : oOutputs_.bytes();
    auto const aWords = destination.bWords_ ? oOutputs_.words() : std::array<float const*, 3>{};
    alignas(64) float aValues[3][nBlockPixels] = {};
    StepBlock block{};
    float const* const aLight[3] = {aValues[0], aValues[1], aValues[2]};
    for (std::size_t row = 0; row < rows; ++row) {
        for (std::size_t column = 0; column < columns; column += nBlockPixels) {
            std::size_t const n = std::min(nBlockPixels, columns - column);
            for (std::size_t i = 0; i < 3; ++i) {
                InputTables::read(aValues[i], source.aPlanes_[i], source.bWords_, row, column, aInputs[i], n);
            }
            for (std::size_t i = destination.iFirst_; i < destination.iEnd_; ++i) {
                auto const& plane = destination.aPlanes_[i];
                float const* const pFactors = aFactors_.data() + 3 * i;
                if (destination.bWords_) {
                    kernels.mixToWords(block.aSteps_, block.aFractions_, aLight, pFactors, n);
                    OutputTables::write(plane, row, column, block, aWords[i], n);
                } else {
                    kernels.mixToBytes(block.aSteps_, aLight, pFactors, n);
                    OutputTables::write(plane, row, column, block, aBytes[i], n);
                }
            }
        }
    }
}

} // namespace ORVO::ColourEngine::Internal
