#include "orvo/colour_engine/internal/SampleTables.h"

#include <bit>
#include <cmath>
#include <cstring>
#include <emmintrin.h>
#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {

template <typename Sample>
void lookUp(float* pValues, unsigned char const* pSamples, std::ptrdiff_t nColumnBytes, float const* pTable,
            std::size_t n) {
#pragma GCC unroll 4
    for (std::size_t i = 0; i < n; ++i) {
        Sample sample;
        std::memcpy(&sample, pSamples, sizeof(sample));
        pValues[i] = pTable[sample];
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

/// Between neighbouring entries, for four steps.
__m128 interpolateFour(StepBlock const& block, float const* pTable, std::size_t i) {
    std::int32_t const* const pSteps = block.aSteps_ + i;
    __m128 const low = entryPairs(pTable, pSteps[0], pSteps[1]);
    __m128 const high = entryPairs(pTable, pSteps[2], pSteps[3]);
    __m128 const lower = _mm_shuffle_ps(low, high, _MM_SHUFFLE(2, 0, 2, 0));
    __m128 const upper = _mm_shuffle_ps(low, high, _MM_SHUFFLE(3, 1, 3, 1));
    __m128 const fraction = _mm_load_ps(block.aFractions_ + i);
    return _mm_add_ps(lower, _mm_mul_ps(fraction, _mm_sub_ps(upper, lower)));
}

/// The low halves of at most four numbers.
void storeWords(unsigned char* pSamples, std::ptrdiff_t nColumnBytes, __m128i words, std::size_t n) {
    storeWord(pSamples, _mm_extract_epi16(words, 0));
    if (n >= 4) {
        storeWord(pSamples + nColumnBytes, _mm_extract_epi16(words, 2));
        storeWord(pSamples + 2 * nColumnBytes, _mm_extract_epi16(words, 4));
        storeWord(pSamples + 3 * nColumnBytes, _mm_extract_epi16(words, 6));
        return;
    }
    if (n > 1) {
        storeWord(pSamples + nColumnBytes, _mm_extract_epi16(words, 2));
    }
    if (n > 2) {
        storeWord(pSamples + 2 * nColumnBytes, _mm_extract_epi16(words, 4));
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
            static_cast<std::uint8_t>(std::lround(clampToUnit(curve(light)) * 255.0));
    }
    return aTable;
}

/// An entry for every value of 16 bits: those above white are white's.
std::vector<float> wordInputTable(ChannelCurve const& curve) {
    std::vector<float> aTable = curve.sample(32769);
    aTable.resize(65536, aTable.back());
    return aTable;
}

} // namespace

std::vector<float> tableOverWordScale(ChannelCurve const& curve, double white) {
    using Scale = WordScale;
    std::vector<float> aTable(Scale::nLast_ + 2);
    for (std::int32_t step = 0; step <= Scale::nLast_; ++step) {
        double const light = step == 0 ? 0.0 : lightAt<Scale>(step, 0);
        aTable[static_cast<std::size_t>(step)] = static_cast<float>(clampToUnit(curve(light)) * white);
    }
    // Each entry is read together with the next one.
    aTable.back() = aTable[Scale::nLast_];
    return aTable;
}

void interpolate(float* pValues, StepBlock const& block, float const* pTable, std::size_t n) {
    for (std::size_t i = 0; i < n; i += 4) {
        _mm_store_ps(pValues + i, interpolateFour(block, pTable, i));
    }
}

void writeSamples(ApplyPixels::Plane const& plane, bool bWords, std::size_t row, std::size_t column,
                  float const* pValues, std::size_t n) {
    __m128 const white = _mm_set1_ps(bWords ? 32768.0F : 255.0F);
    unsigned char* pSamples = plane.at(row, column);
    for (std::size_t i = 0; i < n; i += 4) {
        // NaN becomes 0: the second operand is what such a comparison leaves.
        __m128 const raised = _mm_max_ps(_mm_load_ps(pValues + i), _mm_setzero_ps());
        __m128 const clamped = _mm_min_ps(raised, _mm_set1_ps(1.0F));
        __m128i const samples = _mm_cvtps_epi32(_mm_mul_ps(clamped, white));
        if (bWords) {
            storeWords(pSamples, plane.nColumnBytes_, samples, n - i);
            pSamples += 4 * plane.nColumnBytes_;
            continue;
        }
        alignas(16) std::int32_t aSamples[4];
        _mm_store_si128(reinterpret_cast<__m128i*>(aSamples), samples);
        for (std::size_t j = 0; j < 4 && i + j < n; ++j) {
            *pSamples = static_cast<unsigned char>(aSamples[j]);
            pSamples += plane.nColumnBytes_;
        }
    }
}

InputTables::InputTables(std::array<ChannelCurve, 3> aCurves) : aCurves_(std::move(aCurves)) {}

std::array<float const*, 3> const& InputTables::get(bool bWords) const {
    if (bWords) {
        return oWords_.get([this](std::size_t i) { return wordInputTable(aCurves_[i]); });
    }
    return oBytes_.get([this](std::size_t i) { return aCurves_[i].sample(256); });
}

void InputTables::read(float* pValues, ApplyPixels::Plane const& plane, bool bWords, std::size_t row,
                       std::size_t column, float const* pTable, std::size_t n) {
    auto const look = bWords ? lookUp<std::uint16_t> : lookUp<std::uint8_t>;
    look(pValues, plane.at(row, column), plane.nColumnBytes_, pTable, n);
}

OutputTables::OutputTables(std::array<ChannelCurve, 3> aCurves) : aCurves_(std::move(aCurves)) {}

std::array<std::uint8_t const*, 3> const& OutputTables::bytes() const {
    return oBytes_.get([this](std::size_t i) { return byteOutputTable(aCurves_[i]); });
}

std::array<float const*, 3> const& OutputTables::words() const {
    return oWords_.get([this](std::size_t i) { return tableOverWordScale(aCurves_[i], 32768.0); });
}

void OutputTables::write(ApplyPixels::Plane const& plane, std::size_t row, std::size_t column,
                         StepBlock const& block, std::uint8_t const* pTable, std::size_t n) {
    unsigned char* pSamples = plane.at(row, column);
#pragma GCC unroll 4
    for (std::size_t i = 0; i < n; ++i) {
        *pSamples = pTable[block.aSteps_[i]];
        pSamples += plane.nColumnBytes_;
    }
}

void OutputTables::write(ApplyPixels::Plane const& plane, std::size_t row, std::size_t column,
                         StepBlock const& block, float const* pTable, std::size_t n) {
    unsigned char* pSamples = plane.at(row, column);
    for (std::size_t i = 0; i < n; i += 4) {
        __m128i const words = _mm_cvtps_epi32(interpolateFour(block, pTable, i));
        storeWords(pSamples, plane.nColumnBytes_, words, n - i);
        pSamples += 4 * plane.nColumnBytes_;
    }
}

} // namespace ORVO::ColourEngine::Internal
