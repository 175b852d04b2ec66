#include "orvo/image_runtime/kernels/RowKernelBody.h"

namespace ORVO::ImageRuntime::Internal {

namespace {

struct Vectors {
    /// A block: its lower and its upper eight values.
    struct Floats {
        __m256 lower, upper;
    };
    struct Integers {
        __m256i lower, upper;
    };

    template <bool bStream>
    static void store(float* pOutput, Floats values) {
        if constexpr (bStream) {
            _mm256_stream_ps(pOutput, values.lower);
            _mm256_stream_ps(pOutput + 8, values.upper);
        } else {
            _mm256_storeu_ps(pOutput, values.lower);
            _mm256_storeu_ps(pOutput + 8, values.upper);
        }
    }

    /// Packing works on each half of a register by itself: the quarters are put in order behind it.
    static __m256i words(Integers integers) {
        return _mm256_permute4x64_epi64(_mm256_packus_epi32(integers.lower, integers.upper), 0xd8);
    }

    template <bool bStream>
    static void store(std::uint16_t* pOutput, Integers integers) {
        if constexpr (bStream) {
            _mm256_stream_si256(reinterpret_cast<__m256i*>(pOutput), words(integers));
        } else {
            _mm256_storeu_si256(reinterpret_cast<__m256i*>(pOutput), words(integers));
        }
    }

    template <bool bStream>
    static void store(std::uint8_t* pOutput, Integers integers) {
        __m256i const packed = words(integers);
        __m128i const bytes =
            _mm_packus_epi16(_mm256_castsi256_si128(packed), _mm256_extracti128_si256(packed, 1));
        if constexpr (bStream) {
            _mm_stream_si128(reinterpret_cast<__m128i*>(pOutput), bytes);
        } else {
            _mm_storeu_si128(reinterpret_cast<__m128i*>(pOutput), bytes);
        }
    }

    static Floats load(float const* pInput) { return {_mm256_loadu_ps(pInput), _mm256_loadu_ps(pInput + 8)}; }

    static Floats load(std::uint8_t const* pInput) {
        __m128i const bytes = _mm_loadu_si128(reinterpret_cast<__m128i const*>(pInput));
        return {_mm256_cvtepi32_ps(_mm256_cvtepu8_epi32(bytes)),
                _mm256_cvtepi32_ps(_mm256_cvtepu8_epi32(_mm_unpackhi_epi64(bytes, bytes)))};
    }

    static Floats load(std::uint16_t const* pInput) {
        __m128i const lower = _mm_loadu_si128(reinterpret_cast<__m128i const*>(pInput));
        __m128i const upper = _mm_loadu_si128(reinterpret_cast<__m128i const*>(pInput + 8));
        return {_mm256_cvtepi32_ps(_mm256_cvtepu16_epi32(lower)),
                _mm256_cvtepi32_ps(_mm256_cvtepu16_epi32(upper))};
    }

    static Floats scaled(Floats values, float factor) {
        __m256 const factors = _mm256_set1_ps(factor);
        return {_mm256_mul_ps(values.lower, factors), _mm256_mul_ps(values.upper, factors)};
    }

    static Floats divided(Floats values, float divisor) {
        __m256 const divisors = _mm256_set1_ps(divisor);
        return {_mm256_div_ps(values.lower, divisors), _mm256_div_ps(values.upper, divisors)};
    }

    /// Scaled, a NaN made 0, clamped, rounded.
    static __m256i integers(__m256 values, float white) {
        __m256 const scaled = _mm256_mul_ps(values, _mm256_set1_ps(white));
        __m256 const positive = _mm256_max_ps(scaled, _mm256_setzero_ps());
        __m256 const limited = _mm256_min_ps(positive, _mm256_set1_ps(white));
        return _mm256_cvttps_epi32(_mm256_round_ps(limited, _MM_FROUND_TO_NEAREST_INT | _MM_FROUND_NO_EXC));
    }

    static Integers integers(Floats values, float white) {
        return {integers(values.lower, white), integers(values.upper, white)};
    }

    /// A NaN is the second operand that both comparisons give back.
    static __m256 clamped(__m256 values) {
        return _mm256_min_ps(_mm256_set1_ps(1.0f), _mm256_max_ps(_mm256_setzero_ps(), values));
    }

    static Floats clamped(Floats values) { return {clamped(values.lower), clamped(values.upper)}; }

    static __m256i truncatedBytes(__m256 values) {
        __m256 const positive = _mm256_max_ps(values, _mm256_setzero_ps());
        __m256 const value = _mm256_min_ps(positive, _mm256_set1_ps(1.0f));
        __m256i const truncated = _mm256_cvttps_epi32(_mm256_mul_ps(value, _mm256_set1_ps(255.0f)));
        // The product may have been rounded up to an integer t. As 256 value - t is exact there, it is less
        // than value exactly if 255 value is less than t. The mask of the comparison is -1.
        __m256 const rest =
            _mm256_sub_ps(_mm256_mul_ps(value, _mm256_set1_ps(256.0f)), _mm256_cvtepi32_ps(truncated));
        return _mm256_add_epi32(truncated, _mm256_castps_si256(_mm256_cmp_ps(rest, value, _CMP_LT_OQ)));
    }

    static Integers truncatedBytes(Floats values) {
        return {truncatedBytes(values.lower), truncatedBytes(values.upper)};
    }

    static void floatFromHalf(float* pOutput, std::uint16_t const* pInput) {
        __m128i const lower = _mm_loadu_si128(reinterpret_cast<__m128i const*>(pInput));
        __m128i const upper = _mm_loadu_si128(reinterpret_cast<__m128i const*>(pInput + 8));
        store<false>(pOutput, Floats{_mm256_cvtph_ps(lower), _mm256_cvtph_ps(upper)});
    }

    static void halfFromUnit(std::uint16_t* pOutput, float const* pInput) {
        Floats const values = clamped(load(pInput));
        __m128i const lower = _mm256_cvtps_ph(values.lower, _MM_FROUND_TO_NEAREST_INT | _MM_FROUND_NO_EXC);
        __m128i const upper = _mm256_cvtps_ph(values.upper, _MM_FROUND_TO_NEAREST_INT | _MM_FROUND_NO_EXC);
        _mm_storeu_si128(reinterpret_cast<__m128i*>(pOutput), lower);
        _mm_storeu_si128(reinterpret_cast<__m128i*>(pOutput + 8), upper);
    }
};

} // namespace

RowKernels const& avx2RowKernels() { return RowKernelBody<Vectors>::table(); }

} // namespace ORVO::ImageRuntime::Internal
