#include "orvo/colour_engine/internal/ApplyShaper.h"

#include "orvo/colour_engine/internal/ApplyKernels.h"
#include "orvo/colour_engine/internal/ApplyPixels.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>
#include <emmintrin.h>

namespace ORVO::ColourEngine::Internal {

namespace {

/// What a block of pixels is between the tables.
struct LightBlock {
    alignas(64) float aLight_[3][nBlockPixels];
    alignas(64) std::int32_t aSteps_[nBlockPixels];
    alignas(64) float aFractions_[nBlockPixels];
};

template <typename Sample>
void lookUpInputs(float* pLight, unsigned char const* pSamples, std::ptrdiff_t nColumnBytes,
                  float const* pTable, std::size_t n) {
#pragma GCC unroll 4
    for (std::size_t i = 0; i < n; ++i) {
        Sample sample;
        std::memcpy(&sample, pSamples, sizeof(sample));
        pLight[i] = pTable[sample];
        pSamples += nColumnBytes;
    }
}

void lookUpBytes(unsigned char* pSamples, std::ptrdiff_t nColumnBytes, LightBlock const& block,
                 std::uint8_t const* pTable, std::size_t n) {
#pragma GCC unroll 4
    for (std::size_t i = 0; i < n; ++i) {
        *pSamples = pTable[block.aSteps_[i]];
        pSamples += nColumnBytes;
    }
}

void storeWord(unsigned char* pSample, int value) {
    auto const word = static_cast<std::uint16_t>(value);
    std::memcpy(pSample, &word, sizeof(word));
}

__m128i entryPair(float const* pEntry) { return _mm_loadl_epi64(reinterpret_cast<__m128i const*>(pEntry)); }

/// Two neighbouring entries for each of two steps.
__m128 entryPairs(float const* pTable, std::int32_t first, std::int32_t second) {
    return _mm_castsi128_ps(_mm_unpacklo_epi64(entryPair(pTable + first), entryPair(pTable + second)));
}

void interpolateWords(unsigned char* pSamples, std::ptrdiff_t nColumnBytes, LightBlock const& block,
                      float const* pTable, std::size_t n) {
    // The block is filled up to a multiple of four.
    for (std::size_t i = 0; i < n; i += 4) {
        std::int32_t const* const pSteps = block.aSteps_ + i;
        __m128 const low = entryPairs(pTable, pSteps[0], pSteps[1]);
        __m128 const high = entryPairs(pTable, pSteps[2], pSteps[3]);
        __m128 const lower = _mm_shuffle_ps(low, high, _MM_SHUFFLE(2, 0, 2, 0));
        __m128 const upper = _mm_shuffle_ps(low, high, _MM_SHUFFLE(3, 1, 3, 1));
        __m128 const fraction = _mm_load_ps(block.aFractions_ + i);
        __m128i const words =
            _mm_cvtps_epi32(_mm_add_ps(lower, _mm_mul_ps(fraction, _mm_sub_ps(upper, lower))));
        storeWord(pSamples, _mm_extract_epi16(words, 0));
        if (i + 4 <= n) {
            storeWord(pSamples + nColumnBytes, _mm_extract_epi16(words, 2));
            storeWord(pSamples + 2 * nColumnBytes, _mm_extract_epi16(words, 4));
            storeWord(pSamples + 3 * nColumnBytes, _mm_extract_epi16(words, 6));
            pSamples += 4 * nColumnBytes;
            continue;
        }
        if (i + 1 < n) {
            storeWord(pSamples + nColumnBytes, _mm_extract_epi16(words, 2));
        }
        if (i + 2 < n) {
            storeWord(pSamples + 2 * nColumnBytes, _mm_extract_epi16(words, 4));
        }
    }
}

template <typename Scale>
double lightAt(std::int32_t step, std::int32_t nBits) {
    return static_cast<double>(std::bit_cast<float>(Scale::nBias_ + (step << Scale::nDroppedBits_) + nBits));
}

/// The entry of a step holds the result for the middle of its light; the first one is black's, the last one
/// white's.
std::vector<std::uint8_t> byteOutputTable(ChannelCurve const& curve) {
    using Scale = ByteScale;
    std::vector<std::uint8_t> aTable(Scale::nLast_ + 1);
    for (std::int32_t step = 0; step <= Scale::nLast_; ++step) {
        double const light = step == 0               ? 0.0
                             : step == Scale::nLast_ ? 1.0
                                                     : lightAt<Scale>(step, 1 << (Scale::nDroppedBits_ - 1));
        aTable[static_cast<std::size_t>(step)] =
            static_cast<std::uint8_t>(std::lround(curve.clamped(light) * 255.0));
    }
    return aTable;
}

/// One entry more than there are steps, as each is read together with the next one.
std::vector<float> wordOutputTable(ChannelCurve const& curve) {
    using Scale = WordScale;
    std::vector<float> aTable(Scale::nLast_ + 2);
    for (std::int32_t step = 0; step <= Scale::nLast_; ++step) {
        double const light = step == 0 ? 0.0 : lightAt<Scale>(step, 0);
        aTable[static_cast<std::size_t>(step)] = static_cast<float>(curve.clamped(light) * 32768.0);
    }
    aTable.back() = aTable[Scale::nLast_];
    return aTable;
}

/// An entry for every value of 16 bits: those above white are white's.
std::vector<float> wordInputTable(ChannelCurve const& curve) {
    std::vector<float> aTable = curve.sample(32769);
    aTable.resize(65536, aTable.back());
    return aTable;
}

} // namespace

template <typename Entry>
template <typename Make>
std::array<Entry const*, 3> const& ApplyShaper::Tables<Entry>::get(Make const& make) {
    std::call_once(oOnce_, [&] {
        for (std::size_t i = 0; i < aTables_.size(); ++i) {
            aStorage_[i] = make(i);
            aTables_[i] = aStorage_[i].data();
            // One table for all channels stays in the caches where three would not.
            for (std::size_t j = 0; j < i; ++j) {
                if (aStorage_[j] == aStorage_[i]) {
                    std::vector<Entry>().swap(aStorage_[i]);
                    aTables_[i] = aTables_[j];
                    break;
                }
            }
        }
    });
    return aTables_;
}

ApplyShaper::ApplyShaper(MatrixShaper const& shaper) : shaper_(shaper), aFactors_() {
    std::transform(shaper.aMatrix_.begin(), shaper.aMatrix_.end(), aFactors_.begin(),
                   [](double factor) { return static_cast<float>(factor); });
}

std::array<float const*, 3> const& ApplyShaper::inputs(bool bWords) const {
    if (bWords) {
        return oWordInputs_.get([this](std::size_t i) { return wordInputTable(shaper_.aInputCurves_[i]); });
    }
    return oByteInputs_.get([this](std::size_t i) { return shaper_.aInputCurves_[i].sample(256); });
}

std::array<std::uint8_t const*, 3> const& ApplyShaper::byteOutputs() const {
    return oByteOutputs_.get([this](std::size_t i) { return byteOutputTable(shaper_.aOutputCurves_[i]); });
}

std::array<float const*, 3> const& ApplyShaper::wordOutputs() const {
    return oWordOutputs_.get([this](std::size_t i) { return wordOutputTable(shaper_.aOutputCurves_[i]); });
}

void ApplyShaper::apply(ApplyPixels const& source, ApplyPixels const& destination, std::size_t rows,
                        std::size_t columns, ApplyKernels const& kernels) const {
    auto const& aInputs = inputs(source.bWords_);
    std::array<std::uint8_t const*, 3> const aBytes =
        destination.bWords_ ? std::array<std::uint8_t const*, 3>{} : byteOutputs();
    std::array<float const*, 3> const aWords =
        destination.bWords_ ? wordOutputs() : std::array<float const*, 3>{};
    auto const lookUp = source.bWords_ ? lookUpInputs<std::uint16_t> : lookUpInputs<std::uint8_t>;
    LightBlock block{};
    float const* const aLight[3] = {block.aLight_[0], block.aLight_[1], block.aLight_[2]};
    for (std::size_t row = 0; row < rows; ++row) {
        for (std::size_t column = 0; column < columns; column += nBlockPixels) {
            std::size_t const n = std::min(nBlockPixels, columns - column);
            for (std::size_t i = 0; i < 3; ++i) {
                auto const& plane = source.aPlanes_[i];
                lookUp(block.aLight_[i], plane.at(row, column), plane.nColumnBytes_, aInputs[i], n);
            }
            for (std::size_t i = destination.iFirst_; i < destination.iEnd_; ++i) {
                auto const& plane = destination.aPlanes_[i];
                unsigned char* const pSamples = plane.at(row, column);
                float const* const pFactors = aFactors_.data() + 3 * i;
                if (destination.bWords_) {
                    kernels.mixToWords(block.aSteps_, block.aFractions_, aLight, pFactors, n);
                    interpolateWords(pSamples, plane.nColumnBytes_, block, aWords[i], n);
                } else {
                    kernels.mixToBytes(block.aSteps_, aLight, pFactors, n);
                    lookUpBytes(pSamples, plane.nColumnBytes_, block, aBytes[i], n);
                }
            }
        }
    }
}

} // namespace ORVO::ColourEngine::Internal
