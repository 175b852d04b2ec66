#include "orvo/colour_engine/internal/ColourCube.h"

namespace ORVO::ColourEngine::Internal {

TableStages stagesOf(ColourCube const& cube, bool bTrilinear) {
    TableStages aStages;
    if (cube.oSpacing_.has_value()) {
        aStages.emplace_back(CurveStage{{*cube.oSpacing_, *cube.oSpacing_, *cube.oSpacing_}});
    }
    constexpr std::size_t nEdge = ColourCube::nEdge_;
    aStages.emplace_back(GridStage{{nEdge, nEdge, nEdge}, bTrilinear, false, cube.aValues_});
    if (cube.oOutputCurves_.has_value()) {
        aStages.emplace_back(CurveStage{*cube.oOutputCurves_});
    }
    return aStages;
}

} // namespace ORVO::ColourEngine::Internal
