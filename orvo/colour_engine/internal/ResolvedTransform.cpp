#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include "orvo/colour_engine/internal/CubeFitting.h"

#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {

std::array<double, 3> evaluateShaper(MatrixShaper const& shaper, std::array<double, 3> const& colour) {
    std::array<double, 3> aLinear{};
    for (std::size_t i = 0; i < 3; ++i) {
        aLinear[i] = shaper.aInputCurves_[i](clampToUnit(colour[i]));
    }
    std::array<double, 3> aResult{};
    for (std::size_t i = 0; i < 3; ++i) {
        double const sum = shaper.aMatrix_[3 * i] * aLinear[0] + shaper.aMatrix_[3 * i + 1] * aLinear[1] +
                           shaper.aMatrix_[3 * i + 2] * aLinear[2];
        aResult[i] = clampToUnit(shaper.aOutputCurves_[i](clampToUnit(sum)));
    }
    return aResult;
}

} // namespace

ResolvedTransform::ResolvedTransform(MatrixShaper shaper) : oShaper_(std::move(shaper)) {}

ResolvedTransform::ResolvedTransform(TableStages aStages) : aStages_(std::move(aStages)) {}

ResolvedTransform::ResolvedTransform(ColourCube cube)
    : aStages_(stagesOf(cube, false)), oCube_(std::move(cube)) {}

MatrixShaper const* ResolvedTransform::matrixShaper() const noexcept {
    return oShaper_.has_value() ? &*oShaper_ : nullptr;
}

TableStages const& ResolvedTransform::stages() const noexcept { return aStages_; }

ColourCube const* ResolvedTransform::colourCube() const {
    if (oShaper_.has_value()) {
        return nullptr;
    }
    std::call_once(oCubeOnce_, [this] {
        if (!oCube_.has_value()) {
            oCube_ = fitCube(aStages_);
        }
    });
    return &*oCube_;
}

std::array<double, 3> ResolvedTransform::evaluate(std::array<double, 3> const& colour) const {
    return oShaper_.has_value() ? evaluateShaper(*oShaper_, colour)
                                : evaluateStages(aStages_, aStages_.size(), colour);
}

} // namespace ORVO::ColourEngine::Internal
