#include "orvo/colour_engine/internal/Applier.h"

#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/internal/ApplyKernels.h"
#include "orvo/colour_engine/internal/ApplyPixels.h"

#include <utility>

namespace ORVO::ColourEngine::Internal {

Applier::Applier(std::shared_ptr<ResolvedTransform const> spTransform)
    : spTransform_(std::move(spTransform)) {
    if (MatrixShaper const* const pShaper = spTransform_->matrixShaper()) {
        oShaper_.emplace(*pShaper);
    } else {
        oStages_.emplace(spTransform_->stages());
    }
}

Applier::~Applier() = default;

bool Applier::apply(_t_Vantle_PackingSpec const& source, _t_Vantle_PackingSpec const& destination,
                    std::uint32_t rows, std::uint32_t columns) const {
    ApplyPixels from{};
    ApplyPixels to{};
    if (!from.describe(source) || !to.describe(destination)) {
        return false;
    }
    ApplyKernels const& kernels = applyKernels(Core::activeInstructionSet());
    if (oShaper_) {
        oShaper_->apply(from, to, rows, columns, kernels);
    } else {
        oStages_->apply(from, to, rows, columns, kernels);
    }
    return true;
}

} // namespace ORVO::ColourEngine::Internal
