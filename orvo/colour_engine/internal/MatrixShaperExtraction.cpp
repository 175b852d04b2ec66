#include "orvo/colour_engine/internal/MatrixShaperExtraction.h"

#include "orvo/colour_engine/internal/ProfileTags.h"

#include <array>
#include <utility>

namespace ORVO::ColourEngine::Internal {

std::optional<MatrixShaper> extractMatrixShaper(Profile const& source, Profile const& destination,
                                                std::uint32_t intent) {
    auto const sourceTags = readTags(source);
    auto const destinationTags = readTags(destination);
    if (!sourceTags.has_value() || !destinationTags.has_value()) {
        return std::nullopt;
    }
    auto const toDevice = fromXYZ(destination, *destinationTags);
    if (!toDevice.has_value()) {
        return std::nullopt;
    }
    Matrix matrix = sourceTags->toXYZ_;
    if (intent == INTENT_ABSOLUTE_COLORIMETRIC) {
        matrix = multiply(whiteScale(source, destination), matrix);
    }
    matrix = multiply(*toDevice, matrix);

    std::array<CurveHandle, 6> aCurves;
    for (std::size_t i = 0; i < 3; ++i) {
        aCurves[i] = ownCurve(cmsDupToneCurve(sourceTags->aCurves_[i]));
        aCurves[3 + i] = ownCurve(cmsReverseToneCurve(destinationTags->aCurves_[i]));
        if (aCurves[i] == nullptr || aCurves[3 + i] == nullptr) {
            return std::nullopt;
        }
    }
    return MatrixShaper{{curveFunction(aCurves[0]), curveFunction(aCurves[1]), curveFunction(aCurves[2])},
                        matrix,
                        {curveFunction(aCurves[3]), curveFunction(aCurves[4]), curveFunction(aCurves[5])}};
}

} // namespace ORVO::ColourEngine::Internal
