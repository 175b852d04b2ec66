#include "orvo/image_runtime/kernels/RowKernelBody.h"

namespace ORVO::ImageRuntime::Internal {

namespace {

struct Vectors {
    template <bool bStream>
    static void store(float* pOutput, __m512 values) {
        if constexpr (bStream) {
            _mm512_stream_ps(pOutput, values);
        } else {
            _mm512_storeu_ps(pOutput, values);
        }
    }

    template <bool bStream>
    static void store(std::uint8_t* pOutput, __m512i integers) {
        __m128i const bytes = _mm512_cvtepi32_epi8(integers);
        if constexpr (bStream) {
            _mm_stream_si128(reinterpret_cast<__m128i*>(pOutput), bytes);
        } else {
            _mm_storeu_si128(reinterpret_cast<__m128i*>(pOutput), bytes);
        }
    }

    template <bool bStream>
    static void store(std::uint16_t* pOutput, __m512i integers) {
        __m256i const words = _mm512_cvtepi32_epi16(integers);
        if constexpr (bStream) {
            _mm256_stream_si256(reinterpret_cast<__m256i*>(pOutput), words);
        } else {
            _mm256_storeu_si256(reinterpret_cast<__m256i*>(pOutput), words);
        }
    }

    static __m512 load(float const* pInput) { return _mm512_loadu_ps(pInput); }

    static __m512 load(std::uint8_t const* pInput) {
        __m128i const bytes = _mm_loadu_si128(reinterpret_cast<__m128i const*>(pInput));
        return _mm512_cvtepi32_ps(_mm512_cvtepu8_epi32(bytes));
    }

    static __m512 load(std::uint16_t const* pInput) {
        __m256i const words = _mm256_loadu_si256(reinterpret_cast<__m256i const*>(pInput));
        return _mm512_cvtepi32_ps(_mm512_cvtepu16_epi32(words));
    }

    static __m512 scaled(__m512 values, float factor) {
        return _mm512_mul_ps(values, _mm512_set1_ps(factor));
    }

    static __m512 divided(__m512 values, float divisor) {
        return _mm512_div_ps(values, _mm512_set1_ps(divisor));
    }

    /// Scaled, a NaN made 0, clamped, rounded.
    static __m512i integers(__m512 values, float white) {
        __m512 const positive = _mm512_max_ps(scaled(values, white), _mm512_setzero_ps());
        return _mm512_cvt_roundps_epi32(_mm512_min_ps(positive, _mm512_set1_ps(white)),
                                        _MM_FROUND_TO_NEAREST_INT | _MM_FROUND_NO_EXC);
    }

    /// A NaN is the second operand that both comparisons give back.
    static __m512 clamped(__m512 values) {
        __m512 const positive = _mm512_max_ps(_mm512_setzero_ps(), values);
        return _mm512_min_ps(_mm512_set1_ps(1.0f), positive);
    }

    static __m512i truncatedBytes(__m512 values) {
        __m512 const positive = _mm512_max_ps(values, _mm512_setzero_ps());
        __m512 const value = _mm512_min_ps(positive, _mm512_set1_ps(1.0f));
        __m512i const truncated = _mm512_cvttps_epi32(_mm512_mul_ps(value, _mm512_set1_ps(255.0f)));
        // The product may have been rounded up to an integer t. As 256 value - t is exact there, it is less
        // than value exactly if 255 value is less than t.
        __m512 const rest =
            _mm512_sub_ps(_mm512_mul_ps(value, _mm512_set1_ps(256.0f)), _mm512_cvtepi32_ps(truncated));
        __mmask16 const bTooLarge = _mm512_cmp_ps_mask(rest, value, _CMP_LT_OQ);
        return _mm512_mask_sub_epi32(truncated, bTooLarge, truncated, _mm512_set1_epi32(1));
    }

    static void floatFromHalf(float* pOutput, std::uint16_t const* pInput) {
        __m256i const halves = _mm256_loadu_si256(reinterpret_cast<__m256i const*>(pInput));
        store<false>(pOutput, _mm512_cvtph_ps(halves));
    }

    static void halfFromUnit(std::uint16_t* pOutput, float const* pInput) {
        __m256i const halves =
            _mm512_cvtps_ph(clamped(load(pInput)), _MM_FROUND_TO_NEAREST_INT | _MM_FROUND_NO_EXC);
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(pOutput), halves);
    }
};

} // namespace

RowKernels const& avx512RowKernels() { return RowKernelBody<Vectors>::table(); }

} // namespace ORVO::ImageRuntime::Internal
