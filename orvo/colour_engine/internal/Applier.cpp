#include "orvo/colour_engine/internal/Applier.h"

#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <utility>

namespace ORVO::ColourEngine::Internal {

Applier::Applier(std::shared_ptr<ResolvedTransform const> spTransform)
    : spTransform_(std::move(spTransform)) {}

Applier::~Applier() = default;

bool Applier::apply(_t_Vantle_PackingSpec const& /*source*/, _t_Vantle_PackingSpec const& /*destination*/,
                    std::uint32_t /*rows*/, std::uint32_t /*columns*/) const {
    return false;
}

} // namespace ORVO::ColourEngine::Internal
