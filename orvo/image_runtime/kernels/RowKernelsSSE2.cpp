#include "orvo/image_runtime/kernels/RowKernelBody.h"

namespace ORVO::ImageRuntime::Internal {

namespace {

struct Vectors {
    /// A block as four vectors.
    struct Floats {
        __m128 part[4];
    };
    struct Integers {
        __m128i part[4];
    };

    template <bool bStream>
    static void store(void* pOutput, __m128i value) {
        if constexpr (bStream) {
            _mm_stream_si128(static_cast<__m128i*>(pOutput), value);
        } else {
            _mm_storeu_si128(static_cast<__m128i*>(pOutput), value);
        }
    }

    template <bool bStream>
    static void store(float* pOutput, Floats const& values) {
        for (int i = 0; i < 4; ++i) {
            if constexpr (bStream) {
                _mm_stream_ps(pOutput + 4 * i, values.part[i]);
            } else {
                _mm_storeu_ps(pOutput + 4 * i, values.part[i]);
            }
        }
    }

    template <bool bStream>
    static void store(std::uint8_t* pOutput, Integers const& integers) {
        __m128i const lower = _mm_packs_epi32(integers.part[0], integers.part[1]);
        __m128i const upper = _mm_packs_epi32(integers.part[2], integers.part[3]);
        store<bStream>(static_cast<void*>(pOutput), _mm_packus_epi16(lower, upper));
    }

    /// There is no packing to unsigned words: it is done around zero.
    static __m128i words(__m128i lower, __m128i upper) {
        __m128i const half = _mm_set1_epi32(32768);
        __m128i const packed = _mm_packs_epi32(_mm_sub_epi32(lower, half), _mm_sub_epi32(upper, half));
        return _mm_xor_si128(packed, _mm_set1_epi16(-32768));
    }

    template <bool bStream>
    static void store(std::uint16_t* pOutput, Integers const& integers) {
        store<bStream>(static_cast<void*>(pOutput), words(integers.part[0], integers.part[1]));
        store<bStream>(static_cast<void*>(pOutput + 8), words(integers.part[2], integers.part[3]));
    }

    static Floats load(float const* pInput) {
        return {{_mm_loadu_ps(pInput), _mm_loadu_ps(pInput + 4), _mm_loadu_ps(pInput + 8),
                 _mm_loadu_ps(pInput + 12)}};
    }

    static Floats fromWords(__m128i lower, __m128i upper) {
        __m128i const zero = _mm_setzero_si128();
        return {{_mm_cvtepi32_ps(_mm_unpacklo_epi16(lower, zero)),
                 _mm_cvtepi32_ps(_mm_unpackhi_epi16(lower, zero)),
                 _mm_cvtepi32_ps(_mm_unpacklo_epi16(upper, zero)),
                 _mm_cvtepi32_ps(_mm_unpackhi_epi16(upper, zero))}};
    }

    static Floats load(std::uint8_t const* pInput) {
        __m128i const bytes = _mm_loadu_si128(reinterpret_cast<__m128i const*>(pInput));
        __m128i const zero = _mm_setzero_si128();
        return fromWords(_mm_unpacklo_epi8(bytes, zero), _mm_unpackhi_epi8(bytes, zero));
    }

    static Floats load(std::uint16_t const* pInput) {
        return fromWords(_mm_loadu_si128(reinterpret_cast<__m128i const*>(pInput)),
                         _mm_loadu_si128(reinterpret_cast<__m128i const*>(pInput + 8)));
    }

    static Floats scaled(Floats values, float factor) {
        for (__m128& part : values.part) {
            part = _mm_mul_ps(part, _mm_set1_ps(factor));
        }
        return values;
    }

    static Floats divided(Floats values, float divisor) {
        for (__m128& part : values.part) {
            part = _mm_div_ps(part, _mm_set1_ps(divisor));
        }
        return values;
    }

    /// Scaled, a NaN made 0, clamped, rounded.
    static Integers integers(Floats const& values, float white) {
        Integers result;
        for (int i = 0; i < 4; ++i) {
            __m128 const scaled = _mm_mul_ps(values.part[i], _mm_set1_ps(white));
            __m128 const positive = _mm_max_ps(scaled, _mm_setzero_ps());
            result.part[i] = _mm_cvtps_epi32(_mm_min_ps(positive, _mm_set1_ps(white)));
        }
        return result;
    }

    /// A NaN is the second operand that both comparisons give back.
    static Floats clamped(Floats values) {
        for (__m128& part : values.part) {
            part = _mm_min_ps(_mm_set1_ps(1.0f), _mm_max_ps(_mm_setzero_ps(), part));
        }
        return values;
    }

    static __m128i truncatedBytes(__m128 values) {
        __m128 const positive = _mm_max_ps(values, _mm_setzero_ps());
        __m128 const value = _mm_min_ps(positive, _mm_set1_ps(1.0f));
        __m128i const truncated = _mm_cvttps_epi32(_mm_mul_ps(value, _mm_set1_ps(255.0f)));
        // The product may have been rounded up to an integer t. As 256 value - t is exact there, it is less
        // than value exactly if 255 value is less than t. The mask of the comparison is -1.
        __m128 const rest = _mm_sub_ps(_mm_mul_ps(value, _mm_set1_ps(256.0f)), _mm_cvtepi32_ps(truncated));
        return _mm_add_epi32(truncated, _mm_castps_si128(_mm_cmplt_ps(rest, value)));
    }

    static Integers truncatedBytes(Floats const& values) {
        return {{truncatedBytes(values.part[0]), truncatedBytes(values.part[1]),
                 truncatedBytes(values.part[2]), truncatedBytes(values.part[3])}};
    }

    // There are no instructions for halves in this set.
    static void floatFromHalf(float* pOutput, std::uint16_t const* pInput) {
        plainRowKernels().floatFromHalf(pOutput, pInput, 16);
    }

    static void halfFromUnit(std::uint16_t* pOutput, float const* pInput) {
        plainRowKernels().halfFromUnit(pOutput, pInput, 16);
    }
};

} // namespace

RowKernels const& sse2RowKernels() { return RowKernelBody<Vectors>::table(); }

} // namespace ORVO::ImageRuntime::Internal
