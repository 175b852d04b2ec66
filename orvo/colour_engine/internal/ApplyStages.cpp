#include "orvo/colour_engine/internal/ApplyStages.h"

#include "orvo/colour_engine/internal/ApplyPixels.h"

#include <algorithm>
#include <cmath>
#include <emmintrin.h>

namespace ORVO::ColourEngine::Internal {

struct ApplyStages::Block {
    alignas(64) float aValues_[3][nBlockPixels];
    float* aPlanes_[3] = {aValues_[0], aValues_[1], aValues_[2]};
    GridPlaces oPlaces_;
    StepBlock oSteps_;
};

namespace {

bool startsWithCurves(TableStages const& aStages) {
    return !aStages.empty() && std::holds_alternative<CurveStage>(aStages.front());
}

/// Behind what comes first.
bool endsWithCurves(TableStages const& aStages) {
    return aStages.size() > 1 && std::holds_alternative<CurveStage>(aStages.back());
}

std::array<ChannelCurve, 3> straight() {
    ChannelCurve const curve([](double x) { return x; });
    return {curve, curve, curve};
}

std::array<ChannelCurve, 3> firstCurves(TableStages const& aStages) {
    return startsWithCurves(aStages) ? std::get<CurveStage>(aStages.front()).aCurves_ : straight();
}

std::array<ChannelCurve, 3> lastCurves(TableStages const& aStages) {
    return endsWithCurves(aStages) ? std::get<CurveStage>(aStages.back()).aCurves_ : straight();
}

__m128 nodeAt(float const* pNodes, std::int32_t node) {
    return _mm_loadu_ps(pNodes + 4 * static_cast<std::ptrdiff_t>(node));
}

/// To the nearest whole number, for numbers below 2^22.
__m128 rounded(__m128 value) {
    __m128 const big = _mm_set1_ps(12582912.0F); // 1.5 * 2^23: floats from here on are whole
    return _mm_sub_ps(_mm_add_ps(value, big), big);
}

template <bool bRound>
__m128 between(__m128 lower, __m128 upper, __m128 fraction) {
    __m128 const rise = _mm_mul_ps(fraction, _mm_sub_ps(upper, lower));
    return _mm_add_ps(lower, bRound ? rounded(rise) : rise);
}

/// Four colours, one a register, into the planes.
void storeFour(float* const* pPlanes, std::size_t i, __m128 (&aColours)[4]) {
    _MM_TRANSPOSE4_PS(aColours[0], aColours[1], aColours[2], aColours[3]);
    for (std::size_t c = 0; c < 3; ++c) {
        _mm_store_ps(pPlanes[c] + i, aColours[c]);
    }
}

} // namespace

ApplyStages::Grid::Grid(GridStage const& stage)
    : oShape_(),
      bTrilinear_(stage.bTrilinear_),
      bWords_(stage.bWords_),
      aNodes_(stage.aNodes_.size() / 3 * 4) {
    std::int32_t nStride = 1;
    for (std::size_t i = 0; i < 3; ++i) {
        oShape_.aLast_[i] = static_cast<float>(stage.aEdges_[i] - 1);
        oShape_.aStride_[i] = nStride;
        nStride *= static_cast<std::int32_t>(stage.aEdges_[i]);
    }
    for (std::size_t i = 0; i < stage.aNodes_.size(); ++i) {
        float const node = stage.aNodes_[i];
        aNodes_[i / 3 * 4 + i % 3] = bWords_ ? std::round(node * 65535.0F) : node;
    }
}

void ApplyStages::Grid::run(Block& block, ApplyKernels const& kernels, std::size_t n) const {
    auto const placeInCells = bWords_ ? kernels.placeWordsInCells : kernels.placeInCells;
    auto const placeInTetrahedra = bWords_ ? kernels.placeWordsInTetrahedra : kernels.placeInTetrahedra;
    auto const place = bTrilinear_ ? placeInCells : placeInTetrahedra;
    place(&block.oPlaces_, block.aPlanes_, oShape_, n);
    if (bTrilinear_) {
        bWords_ ? runCells<true>(block, n) : runCells<false>(block, n);
    } else {
        bWords_ ? runTetrahedra<true>(block, n) : runTetrahedra<false>(block, n);
    }
}

template <bool bRound>
void ApplyStages::Grid::runTetrahedra(Block& block, std::size_t n) const {
    GridPlaces const& places = block.oPlaces_;
    float const* const pNodes = aNodes_.data();
    std::int32_t const nUpper = oShape_.aStride_[0] + oShape_.aStride_[1] + oShape_.aStride_[2];
    auto const rise = [](__m128 lower, __m128 upper, float fraction) {
        return _mm_mul_ps(_mm_set1_ps(fraction), _mm_sub_ps(upper, lower));
    };
    // A cell is 65535 of 65536 long where fractions are in such parts.
    __m128 const length = _mm_set1_ps(65536.0F / 65535.0F);
    __m128 const unit = _mm_set1_ps(1.0F / 65535.0F);
    for (std::size_t i = 0; i < n; i += 4) {
        __m128 aColours[4];
        for (std::size_t j = 0; j < 4; ++j) {
            std::int32_t const node = places.aNode_[i + j];
            __m128 const first = nodeAt(pNodes, node);
            __m128 const second = nodeAt(pNodes, node + places.aSecond_[i + j]);
            __m128 const third = nodeAt(pNodes, node + places.aThird_[i + j]);
            __m128 const fourth = nodeAt(pNodes, node + nUpper);
            __m128 const sum = _mm_add_ps(_mm_add_ps(rise(first, second, places.aFractions_[0][i + j]),
                                                     rise(second, third, places.aFractions_[1][i + j])),
                                          rise(third, fourth, places.aFractions_[2][i + j]));
            aColours[j] = bRound ? _mm_mul_ps(_mm_add_ps(first, rounded(_mm_mul_ps(sum, length))), unit)
                                 : _mm_add_ps(first, sum);
        }
        storeFour(block.aPlanes_, i, aColours);
    }
}

template <bool bRound>
void ApplyStages::Grid::runCells(Block& block, std::size_t n) const {
    GridPlaces const& places = block.oPlaces_;
    std::int32_t const nSecond = oShape_.aStride_[1];
    std::int32_t const nThird = oShape_.aStride_[2];
    __m128 const unit = _mm_set1_ps(1.0F / 65535.0F);
    for (std::size_t i = 0; i < n; i += 4) {
        __m128 aColours[4];
        for (std::size_t j = 0; j < 4; ++j) {
            std::int32_t const node = places.aNode_[i + j];
            __m128 const alongFirst = _mm_set1_ps(places.aFractions_[0][i + j]);
            __m128 const alongSecond = _mm_set1_ps(places.aFractions_[1][i + j]);
            __m128 const alongThird = _mm_set1_ps(places.aFractions_[2][i + j]);
            // Along the first axis nodes are neighbours.
            auto const edge = [&](std::int32_t lower) {
                return between<bRound>(nodeAt(aNodes_.data(), lower), nodeAt(aNodes_.data(), lower + 1),
                                       alongFirst);
            };
            __m128 const near = between<bRound>(edge(node), edge(node + nSecond), alongSecond);
            __m128 const far =
                between<bRound>(edge(node + nThird), edge(node + nThird + nSecond), alongSecond);
            __m128 const colour = between<bRound>(near, far, alongThird);
            aColours[j] = bRound ? _mm_mul_ps(colour, unit) : colour;
        }
        storeFour(block.aPlanes_, i, aColours);
    }
}

void ApplyStages::Curves::run(Block& block, ApplyKernels const& kernels, std::size_t n) const {
    for (std::size_t i = 0; i < 3; ++i) {
        kernels.stepToWords(block.oSteps_.aSteps_, block.oSteps_.aFractions_, block.aPlanes_[i], n);
        interpolate(block.aPlanes_[i], block.oSteps_, aTables_[i].data(), n);
    }
}

void ApplyStages::Mix::run(Block& block, ApplyKernels const& kernels, std::size_t n) const {
    kernels.mix(block.aPlanes_, aFactors_.data(), n);
}

void ApplyStages::Connection::run(Block& block, ApplyKernels const& kernels, std::size_t n) const {
    auto const run = eStage_ == ConnectionStage::LAB_TO_XYZ ? kernels.fromLab : kernels.toLab;
    run(block.aPlanes_, n);
}

ApplyStages::Step ApplyStages::stepOf(TableStage const& stage) {
    if (auto const* const pCurves = std::get_if<CurveStage>(&stage)) {
        Curves curves;
        std::transform(pCurves->aCurves_.begin(), pCurves->aCurves_.end(), curves.aTables_.begin(),
                       [](ChannelCurve const& curve) { return tableOverWordScale(curve, 1.0); });
        return curves;
    }
    if (auto const* const pMatrix = std::get_if<MatrixStage>(&stage)) {
        Mix mix{};
        for (std::size_t i = 0; i < 3; ++i) {
            for (std::size_t j = 0; j < 3; ++j) {
                mix.aFactors_[4 * i + j] = static_cast<float>(pMatrix->aMatrix_[3 * i + j]);
            }
            mix.aFactors_[4 * i + 3] = static_cast<float>(pMatrix->aOffset_[i]);
        }
        return mix;
    }
    if (auto const* const pGrid = std::get_if<GridStage>(&stage)) {
        return Grid(*pGrid);
    }
    return Connection{std::get<ConnectionStage>(stage)};
}

ApplyStages::ApplyStages(TableStages const& aStages)
    : oInputs_(firstCurves(aStages)),
      bOutputCurves_(endsWithCurves(aStages)),
      oOutputs_(lastCurves(aStages)) {
    std::size_t const iFirst = startsWithCurves(aStages) ? 1 : 0;
    std::size_t const iEnd = aStages.size() - (bOutputCurves_ ? 1 : 0);
    for (std::size_t i = iFirst; i < iEnd; ++i) {
        aSteps_.push_back(stepOf(aStages[i]));
    }
}

void ApplyStages::write(Block& block, ApplyPixels const& destination, std::size_t row, std::size_t column,
                        ApplyKernels const& kernels, std::size_t n) const {
    StepBlock& steps = block.oSteps_;
    for (std::size_t i = destination.iFirst_; i < destination.iEnd_; ++i) {
        auto const& plane = destination.aPlanes_[i];
        if (!bOutputCurves_) {
            writeSamples(plane, destination.bWords_, row, column, block.aPlanes_[i], n);
        } else if (destination.bWords_) {
            kernels.stepToWords(steps.aSteps_, steps.aFractions_, block.aPlanes_[i], n);
            OutputTables::write(plane, row, column, steps, oOutputs_.words()[i], n);
        } else {
            kernels.stepToBytes(steps.aSteps_, block.aPlanes_[i], n);
            OutputTables::write(plane, row, column, steps, oOutputs_.bytes()[i], n);
        }
    }
}

void ApplyStages::apply(ApplyPixels const& source, ApplyPixels const& destination, std::size_t rows,
                        std::size_t columns, ApplyKernels const& kernels) const {
    auto const& aInputs = oInputs_.get(source.bWords_);
    Block block{};
    for (std::size_t row = 0; row < rows; ++row) {
        for (std::size_t column = 0; column < columns; column += nBlockPixels) {
            std::size_t const n = std::min(nBlockPixels, columns - column);
            for (std::size_t i = 0; i < 3; ++i) {
                InputTables::read(block.aPlanes_[i], source.aPlanes_[i], source.bWords_, row, column,
                                  aInputs[i], n);
            }
            // Steps work on four pixels at a time; what stands behind the last pixel is some colour.
            std::size_t const nFours = (n + 3) / 4 * 4;
            for (Step const& step : aSteps_) {
                std::visit([&](auto const& s) { s.run(block, kernels, nFours); }, step);
            }
            write(block, destination, row, column, kernels, n);
        }
    }
}

} // namespace ORVO::ColourEngine::Internal
