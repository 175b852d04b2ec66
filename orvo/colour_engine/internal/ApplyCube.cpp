#include "orvo/colour_engine/internal/ApplyCube.h"

#include "orvo/colour_engine/internal/ApplyKernels.h"
#include "orvo/colour_engine/internal/ApplyPixels.h"
#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <emmintrin.h>

namespace ORVO::ColourEngine::Internal {

namespace {

static_assert(ColourCube::nEdge_ == 33, "The kernels know this edge");

/// From a cell's lower corner to its upper one, in nodes.
constexpr std::int32_t nUpper = 1 + 33 + 33 * 33;

struct CubeBlock {
    alignas(64) float aColour_[3][nBlockPixels];
    CubePlaces oPlaces_;
    alignas(64) std::int32_t aResults_[nBlockPixels][4];
};

/// Where each value of a byte lies along an edge; the last one exactly on the last node.
std::array<float, 256> const& byteCoordinates() {
    static std::array<float, 256> const aCoordinates = [] {
        std::array<float, 256> aValues{};
        for (std::size_t i = 0; i < aValues.size(); ++i) {
            aValues[i] = static_cast<float>(i) * 32.0F / 255.0F;
        }
        return aValues;
    }();
    return aCoordinates;
}

void readBytes(float* pColour, ApplyPixels::Plane const& plane, std::size_t row, std::size_t column,
               std::size_t n) {
    auto const& aCoordinates = byteCoordinates();
    unsigned char const* pSample = plane.at(row, column);
    for (std::size_t i = 0; i < n; ++i) {
        pColour[i] = aCoordinates[*pSample];
        pSample += plane.nColumnBytes_;
    }
}

void readWords(float* pColour, ApplyPixels::Plane const& plane, std::size_t row, std::size_t column,
               std::size_t n) {
    unsigned char const* pSample = plane.at(row, column);
    for (std::size_t i = 0; i < n; ++i) {
        std::uint16_t word = 0;
        std::memcpy(&word, pSample, sizeof(word));
        pColour[i] = static_cast<float>(std::min<int>(word, 32768)) * (1.0F / 1024.0F);
        pSample += plane.nColumnBytes_;
    }
}

__m128 weighted(float const* pNodes, std::int32_t node, float weight) {
    return _mm_mul_ps(_mm_loadu_ps(pNodes + 4 * static_cast<std::ptrdiff_t>(node)), _mm_set1_ps(weight));
}

void interpolate(CubeBlock& block, float const* pNodes, std::size_t n) {
    CubePlaces const& places = block.oPlaces_;
    for (std::size_t i = 0; i < n; ++i) {
        std::int32_t const node = places.aNode_[i];
        __m128 const first = _mm_add_ps(weighted(pNodes, node, places.aWeights_[0][i]),
                                        weighted(pNodes, node + places.aSecond_[i], places.aWeights_[1][i]));
        __m128 const second = _mm_add_ps(weighted(pNodes, node + places.aThird_[i], places.aWeights_[2][i]),
                                         weighted(pNodes, node + nUpper, places.aWeights_[3][i]));
        _mm_store_si128(reinterpret_cast<__m128i*>(block.aResults_[i]),
                        _mm_cvtps_epi32(_mm_add_ps(first, second)));
    }
}

template <typename Sample>
void write(ApplyPixels::Plane const& plane, std::size_t row, std::size_t column, CubeBlock const& block,
           std::size_t iChannel, std::size_t n) {
    unsigned char* pSample = plane.at(row, column);
    for (std::size_t i = 0; i < n; ++i) {
        auto const sample = static_cast<Sample>(block.aResults_[i][iChannel]);
        std::memcpy(pSample, &sample, sizeof(sample));
        pSample += plane.nColumnBytes_;
    }
}

} // namespace

ApplyCube::ApplyCube(ColourCube const& cube) : aNodes_(cube.aValues_.size() / 3 * 4) {
    for (std::size_t i = 0; i < cube.aValues_.size(); ++i) {
        aNodes_[i / 3 * 4 + i % 3] = cube.aValues_[i];
    }
}

void ApplyCube::apply(ApplyPixels const& source, ApplyPixels const& destination, std::size_t rows,
                      std::size_t columns, ApplyKernels const& kernels) const {
    auto const read = source.bWords_ ? readWords : readBytes;
    auto const write = destination.bWords_ ? Internal::write<std::uint16_t> : Internal::write<std::uint8_t>;
    float const white = destination.bWords_ ? 32768.0F : 255.0F;
    CubeBlock block{};
    float const* const aColour[3] = {block.aColour_[0], block.aColour_[1], block.aColour_[2]};
    for (std::size_t row = 0; row < rows; ++row) {
        for (std::size_t column = 0; column < columns; column += nBlockPixels) {
            std::size_t const n = std::min(nBlockPixels, columns - column);
            for (std::size_t i = 0; i < 3; ++i) {
                read(block.aColour_[i], source.aPlanes_[i], row, column, n);
            }
            kernels.placeInCube(&block.oPlaces_, aColour, white, n);
            interpolate(block, aNodes_.data(), n);
            for (std::size_t i = destination.iFirst_; i < destination.iEnd_; ++i) {
                write(destination.aPlanes_[i], row, column, block, i, n);
            }
        }
    }
}

} // namespace ORVO::ColourEngine::Internal
