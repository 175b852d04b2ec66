#pragma once

#include <cstddef>
#include <immintrin.h>

// Included by one translation unit an instruction set: everything has internal linkage, so that no function
// built for a larger set is ever shared with code for a smaller one.
namespace {

/// Eight floats, with instructions up to AVX2. The operations of all instruction sets bear the same names.
struct Vector {
    static constexpr int kLanes = 8;
    static constexpr bool kHasGather = true;
    /// How many floats `lookup` can choose from.
    static constexpr std::size_t kLookup = 8;
    using Floats = __m256;
    using Mask = __m256;
    using Ints = __m256i;

    static Floats set(float value) { return _mm256_set1_ps(value); }
    static Floats zero() { return _mm256_setzero_ps(); }
    static Floats load(float const* p) { return _mm256_loadu_ps(p); }
    static Ints firstLanes(int n) {
        return _mm256_cmpgt_epi32(_mm256_set1_epi32(n), _mm256_setr_epi32(0, 1, 2, 3, 4, 5, 6, 7));
    }
    static Floats loadFirst(float const* p, int n) { return _mm256_maskload_ps(p, firstLanes(n)); }
    static void store(float* p, Floats v) { _mm256_storeu_ps(p, v); }
    static void storeFirst(float* p, Floats v, int n) { _mm256_maskstore_ps(p, firstLanes(n), v); }

    static Floats add(Floats a, Floats b) { return _mm256_add_ps(a, b); }
    static Floats sub(Floats a, Floats b) { return _mm256_sub_ps(a, b); }
    static Floats mul(Floats a, Floats b) { return _mm256_mul_ps(a, b); }
    static Floats div(Floats a, Floats b) { return _mm256_div_ps(a, b); }
    /// a * b + c, rounded once or twice.
    static Floats mulAdd(Floats a, Floats b, Floats c) { return add(mul(a, b), c); }
    /// Both give b where either is NaN.
    static Floats min(Floats a, Floats b) { return _mm256_min_ps(a, b); }
    static Floats max(Floats a, Floats b) { return _mm256_max_ps(a, b); }
    /// Of all lanes.
    static float lowest(Floats v) {
        __m128 const four = _mm_min_ps(_mm256_castps256_ps128(v), _mm256_extractf128_ps(v, 1));
        __m128 const pairs = _mm_min_ps(four, _mm_movehl_ps(four, four));
        return _mm_cvtss_f32(_mm_min_ss(pairs, _mm_shuffle_ps(pairs, pairs, 1)));
    }
    static float highest(Floats v) {
        __m128 const four = _mm_max_ps(_mm256_castps256_ps128(v), _mm256_extractf128_ps(v, 1));
        __m128 const pairs = _mm_max_ps(four, _mm_movehl_ps(four, four));
        return _mm_cvtss_f32(_mm_max_ss(pairs, _mm_shuffle_ps(pairs, pairs, 1)));
    }
    static Mask less(Floats a, Floats b) { return _mm256_cmp_ps(a, b, _CMP_LT_OQ); }
    static Mask equal(Floats a, Floats b) { return _mm256_cmp_ps(a, b, _CMP_EQ_OQ); }
    static Mask unequal(Floats a, Floats b) { return _mm256_cmp_ps(a, b, _CMP_NEQ_UQ); }
    static Floats select(Mask m, Floats yes, Floats no) { return _mm256_blendv_ps(no, yes, m); }
    static Floats addWhere(Floats sum, Mask m, Floats v) { return add(sum, _mm256_and_ps(m, v)); }
    static Floats abs(Floats v) { return _mm256_andnot_ps(set(-0.0F), v); }
    static Floats negateWhere(Mask m, Floats v) { return _mm256_xor_ps(v, _mm256_and_ps(m, set(-0.0F))); }
    static Floats floor(Floats v) { return _mm256_floor_ps(v); }
    /// To the nearest; for magnitudes below 2^31.
    static Floats round(Floats v) {
        return _mm256_round_ps(v, _MM_FROUND_TO_NEAREST_INT | _MM_FROUND_NO_EXC);
    }

    static Ints bits(Floats v) { return _mm256_castps_si256(v); }
    static Floats fromBits(Ints v) { return _mm256_castsi256_ps(v); }
    static Ints setInt(int value) { return _mm256_set1_epi32(value); }
    static Ints addInt(Ints a, Ints b) { return _mm256_add_epi32(a, b); }
    static Ints subInt(Ints a, Ints b) { return _mm256_sub_epi32(a, b); }
    template <int n>
    static Ints shiftLeft(Ints v) {
        return _mm256_slli_epi32(v, n);
    }
    template <int n>
    static Ints shiftRightSigned(Ints v) {
        return _mm256_srai_epi32(v, n);
    }
    static Floats toFloats(Ints v) { return _mm256_cvtepi32_ps(v); }
    /// Whole numbers to integers; for magnitudes below 2^31.
    static Ints toInts(Floats v) { return _mm256_cvtps_epi32(v); }
    static Ints loadInts(int const* p) { return _mm256_loadu_si256(reinterpret_cast<__m256i const*>(p)); }
    static void storeInts(int* p, Ints v) { _mm256_storeu_si256(reinterpret_cast<__m256i*>(p), v); }

    /// The floats of p at indices 0 .. 7.
    static Floats lookup(float const* p, Ints index) { return _mm256_permutevar8x32_ps(load(p), index); }
    /// The floats of p at indices 0 .. 15.
    static Floats lookupTwice(float const* p, Ints index) {
        Floats const low = _mm256_permutevar8x32_ps(load(p), index);
        Floats const high = _mm256_permutevar8x32_ps(load(p + 8), index);
        return _mm256_blendv_ps(low, high, _mm256_castsi256_ps(_mm256_slli_epi32(index, 28)));
    }
    /// The floats of p at any indices.
    static Floats gather(float const* p, Ints index) { return _mm256_i32gather_ps(p, index, 4); }

    static Floats join(__m128 low, __m128 high) {
        return _mm256_insertf128_ps(_mm256_castps128_ps256(low), high, 1);
    }
    /// In each half of the vectors, lane j of row i becomes lane i of row j.
    static void transposeHalves(Floats& r0, Floats& r1, Floats& r2, Floats& r3) {
        Floats const t0 = _mm256_unpacklo_ps(r0, r1);
        Floats const t1 = _mm256_unpackhi_ps(r0, r1);
        Floats const t2 = _mm256_unpacklo_ps(r2, r3);
        Floats const t3 = _mm256_unpackhi_ps(r2, r3);
        r0 = _mm256_shuffle_ps(t0, t2, 0x44);
        r1 = _mm256_shuffle_ps(t0, t2, 0xEE);
        r2 = _mm256_shuffle_ps(t1, t3, 0x44);
        r3 = _mm256_shuffle_ps(t1, t3, 0xEE);
    }

    /// Four channels of interleaved pixels.
    static void loadPixels(float const* p, Floats& r, Floats& g, Floats& b, Floats& a) {
        r = join(_mm_loadu_ps(p), _mm_loadu_ps(p + 16));
        g = join(_mm_loadu_ps(p + 4), _mm_loadu_ps(p + 20));
        b = join(_mm_loadu_ps(p + 8), _mm_loadu_ps(p + 24));
        a = join(_mm_loadu_ps(p + 12), _mm_loadu_ps(p + 28));
        transposeHalves(r, g, b, a);
    }
    static void interleave(Floats r, Floats g, Floats b, Floats a, Floats (&pixels)[4]) {
        transposeHalves(r, g, b, a);
        pixels[0] = _mm256_permute2f128_ps(r, g, 0x20);
        pixels[1] = _mm256_permute2f128_ps(b, a, 0x20);
        pixels[2] = _mm256_permute2f128_ps(r, g, 0x31);
        pixels[3] = _mm256_permute2f128_ps(b, a, 0x31);
    }
    static void storePixels(float* p, Floats r, Floats g, Floats b, Floats a) {
        Floats pixels[4];
        interleave(r, g, b, a, pixels);
        for (int i = 0; i < 4; ++i) {
            store(p + 8 * i, pixels[i]);
        }
    }
    /// As storePixels, past the caches; p is aligned to the vector.
    static void streamPixels(float* p, Floats r, Floats g, Floats b, Floats a) {
        Floats pixels[4];
        interleave(r, g, b, a, pixels);
        for (int i = 0; i < 4; ++i) {
            _mm256_stream_ps(p + 8 * i, pixels[i]);
        }
    }
    static void finishStreaming() { _mm_sfence(); }

    /// Lane j of row i becomes lane i of row j.
    static void transpose(Floats (&rows)[8]) {
        transposeHalves(rows[0], rows[1], rows[2], rows[3]);
        transposeHalves(rows[4], rows[5], rows[6], rows[7]);
        for (int i = 0; i < 4; ++i) {
            Floats const low = rows[i];
            rows[i] = _mm256_permute2f128_ps(low, rows[i + 4], 0x20);
            rows[i + 4] = _mm256_permute2f128_ps(low, rows[i + 4], 0x31);
        }
    }
};

} // namespace
