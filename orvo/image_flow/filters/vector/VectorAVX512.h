#pragma once

#include <cstddef>
#include <immintrin.h>

// Included by one translation unit an instruction set: everything has internal linkage, so that no function
// built for a larger set is ever shared with code for a smaller one.
namespace {

/// Sixteen floats, with the instructions of AVX-512 F and DQ. The operations of all instruction sets bear the
/// same names.
struct Vector {
    static constexpr int kLanes = 16;
    static constexpr bool kHasGather = true;
    /// How many floats `lookup` can choose from.
    static constexpr std::size_t kLookup = 16;
    using Floats = __m512;
    using Mask = __mmask16;
    using Ints = __m512i;

    static Floats set(float value) { return _mm512_set1_ps(value); }
    static Floats zero() { return _mm512_setzero_ps(); }
    static Floats load(float const* p) { return _mm512_loadu_ps(p); }
    static Mask firstLanes(int n) { return static_cast<Mask>((1U << static_cast<unsigned>(n)) - 1U); }
    static Floats loadFirst(float const* p, int n) { return _mm512_maskz_loadu_ps(firstLanes(n), p); }
    static void store(float* p, Floats v) { _mm512_storeu_ps(p, v); }
    static void storeFirst(float* p, Floats v, int n) { _mm512_mask_storeu_ps(p, firstLanes(n), v); }

    static Floats add(Floats a, Floats b) { return _mm512_add_ps(a, b); }
    static Floats sub(Floats a, Floats b) { return _mm512_sub_ps(a, b); }
    static Floats mul(Floats a, Floats b) { return _mm512_mul_ps(a, b); }
    static Floats div(Floats a, Floats b) { return _mm512_div_ps(a, b); }
    /// a * b + c, rounded once or twice.
    static Floats mulAdd(Floats a, Floats b, Floats c) { return _mm512_fmadd_ps(a, b, c); }
    /// Both give b where either is NaN.
    static Floats min(Floats a, Floats b) { return _mm512_min_ps(a, b); }
    static Floats max(Floats a, Floats b) { return _mm512_max_ps(a, b); }
    /// Of all lanes.
    static float lowest(Floats v) { return _mm512_reduce_min_ps(v); }
    static float highest(Floats v) { return _mm512_reduce_max_ps(v); }
    static Mask less(Floats a, Floats b) { return _mm512_cmp_ps_mask(a, b, _CMP_LT_OQ); }
    static Mask equal(Floats a, Floats b) { return _mm512_cmp_ps_mask(a, b, _CMP_EQ_OQ); }
    static Mask unequal(Floats a, Floats b) { return _mm512_cmp_ps_mask(a, b, _CMP_NEQ_UQ); }
    static Floats select(Mask m, Floats yes, Floats no) { return _mm512_mask_blend_ps(m, no, yes); }
    static Floats addWhere(Floats sum, Mask m, Floats v) { return _mm512_mask_add_ps(sum, m, sum, v); }
    static Floats abs(Floats v) { return _mm512_abs_ps(v); }
    static Floats negateWhere(Mask m, Floats v) { return _mm512_mask_sub_ps(v, m, zero(), v); }
    static Floats floor(Floats v) {
        return _mm512_roundscale_ps(v, _MM_FROUND_TO_NEG_INF | _MM_FROUND_NO_EXC);
    }
    /// To the nearest; for magnitudes below 2^31.
    static Floats round(Floats v) {
        return _mm512_roundscale_ps(v, _MM_FROUND_TO_NEAREST_INT | _MM_FROUND_NO_EXC);
    }

    static Ints bits(Floats v) { return _mm512_castps_si512(v); }
    static Floats fromBits(Ints v) { return _mm512_castsi512_ps(v); }
    static Ints setInt(int value) { return _mm512_set1_epi32(value); }
    static Ints addInt(Ints a, Ints b) { return _mm512_add_epi32(a, b); }
    static Ints subInt(Ints a, Ints b) { return _mm512_sub_epi32(a, b); }
    template <int n>
    static Ints shiftLeft(Ints v) {
        return _mm512_slli_epi32(v, n);
    }
    template <int n>
    static Ints shiftRightSigned(Ints v) {
        return _mm512_srai_epi32(v, n);
    }
    static Floats toFloats(Ints v) { return _mm512_cvtepi32_ps(v); }
    /// Whole numbers to integers; for magnitudes below 2^31.
    static Ints toInts(Floats v) { return _mm512_cvtps_epi32(v); }
    static Ints loadInts(int const* p) { return _mm512_loadu_si512(p); }
    static void storeInts(int* p, Ints v) { _mm512_storeu_si512(p, v); }

    /// The floats of p at indices 0 .. 15.
    static Floats lookup(float const* p, Ints index) { return _mm512_permutexvar_ps(index, load(p)); }
    /// The floats of p at indices 0 .. 31.
    static Floats lookupTwice(float const* p, Ints index) {
        return _mm512_permutex2var_ps(load(p), index, load(p + 16));
    }
    /// The floats of p at any indices.
    static Floats gather(float const* p, Ints index) { return _mm512_i32gather_ps(index, p, 4); }

    /// Four channels of interleaved pixels.
    static void loadPixels(float const* p, Floats& r, Floats& g, Floats& b, Floats& a) {
        Floats const p0 = load(p);
        Floats const p1 = load(p + 16);
        Floats const p2 = load(p + 32);
        Floats const p3 = load(p + 48);
        Ints const rg = _mm512_setr_epi32(0, 4, 8, 12, 16, 20, 24, 28, 1, 5, 9, 13, 17, 21, 25, 29);
        Ints const ba = _mm512_setr_epi32(2, 6, 10, 14, 18, 22, 26, 30, 3, 7, 11, 15, 19, 23, 27, 31);
        Floats const rgLow = _mm512_permutex2var_ps(p0, rg, p1);
        Floats const rgHigh = _mm512_permutex2var_ps(p2, rg, p3);
        Floats const baLow = _mm512_permutex2var_ps(p0, ba, p1);
        Floats const baHigh = _mm512_permutex2var_ps(p2, ba, p3);
        r = _mm512_shuffle_f32x4(rgLow, rgHigh, 0x44);
        g = _mm512_shuffle_f32x4(rgLow, rgHigh, 0xEE);
        b = _mm512_shuffle_f32x4(baLow, baHigh, 0x44);
        a = _mm512_shuffle_f32x4(baLow, baHigh, 0xEE);
    }
    static void interleave(Floats r, Floats g, Floats b, Floats a, Floats (&pixels)[4]) {
        // Within each quarter: channels to pixels. Then the quarters, of which quarter j of vector i is pixel
        // 4 j + i.
        transposeQuarters(r, g, b, a);
        Floats const low01 = _mm512_shuffle_f32x4(r, g, 0x44);
        Floats const low23 = _mm512_shuffle_f32x4(b, a, 0x44);
        Floats const high01 = _mm512_shuffle_f32x4(r, g, 0xEE);
        Floats const high23 = _mm512_shuffle_f32x4(b, a, 0xEE);
        pixels[0] = _mm512_shuffle_f32x4(low01, low23, 0x88);
        pixels[1] = _mm512_shuffle_f32x4(low01, low23, 0xDD);
        pixels[2] = _mm512_shuffle_f32x4(high01, high23, 0x88);
        pixels[3] = _mm512_shuffle_f32x4(high01, high23, 0xDD);
    }
    static void storePixels(float* p, Floats r, Floats g, Floats b, Floats a) {
        Floats pixels[4];
        interleave(r, g, b, a, pixels);
        for (int i = 0; i < 4; ++i) {
            store(p + 16 * i, pixels[i]);
        }
    }
    /// As storePixels, past the caches; p is aligned to the vector.
    static void streamPixels(float* p, Floats r, Floats g, Floats b, Floats a) {
        Floats pixels[4];
        interleave(r, g, b, a, pixels);
        for (int i = 0; i < 4; ++i) {
            _mm512_stream_ps(p + 16 * i, pixels[i]);
        }
    }
    static void finishStreaming() { _mm_sfence(); }

    /// In each quarter of the vectors, lane j of row i becomes lane i of row j.
    static void transposeQuarters(Floats& r0, Floats& r1, Floats& r2, Floats& r3) {
        Floats const t0 = _mm512_unpacklo_ps(r0, r1);
        Floats const t1 = _mm512_unpackhi_ps(r0, r1);
        Floats const t2 = _mm512_unpacklo_ps(r2, r3);
        Floats const t3 = _mm512_unpackhi_ps(r2, r3);
        r0 = _mm512_shuffle_ps(t0, t2, 0x44);
        r1 = _mm512_shuffle_ps(t0, t2, 0xEE);
        r2 = _mm512_shuffle_ps(t1, t3, 0x44);
        r3 = _mm512_shuffle_ps(t1, t3, 0xEE);
    }

    /// Lane j of row i becomes lane i of row j.
    static void transpose(Floats (&rows)[16]) {
        for (int i = 0; i < 16; i += 4) {
            transposeQuarters(rows[i], rows[i + 1], rows[i + 2], rows[i + 3]);
        }
        for (int i = 0; i < 4; ++i) {
            // Quarter q of row 4 k + i holds the lanes 4 k .. 4 k + 3 of the result's row 4 q + i.
            Floats const low01 = _mm512_shuffle_f32x4(rows[i], rows[i + 4], 0x44);
            Floats const low23 = _mm512_shuffle_f32x4(rows[i + 8], rows[i + 12], 0x44);
            Floats const high01 = _mm512_shuffle_f32x4(rows[i], rows[i + 4], 0xEE);
            Floats const high23 = _mm512_shuffle_f32x4(rows[i + 8], rows[i + 12], 0xEE);
            rows[i] = _mm512_shuffle_f32x4(low01, low23, 0x88);
            rows[i + 4] = _mm512_shuffle_f32x4(low01, low23, 0xDD);
            rows[i + 8] = _mm512_shuffle_f32x4(high01, high23, 0x88);
            rows[i + 12] = _mm512_shuffle_f32x4(high01, high23, 0xDD);
        }
    }
};

} // namespace
