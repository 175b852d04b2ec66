#pragma once

#include <cstddef>
#include <emmintrin.h>

// Included by one translation unit an instruction set: everything has internal linkage, so that no function
// built for a larger set is ever shared with code for a smaller one.
namespace {

/// Four floats, with instructions up to SSE2. The operations of all instruction sets bear the same names.
struct Vector {
    static constexpr int kLanes = 4;
    static constexpr bool kHasGather = false;
    /// How many floats `lookup` can choose from; 0 where there is no permutation by variable indices.
    static constexpr std::size_t kLookup = 0;
    using Floats = __m128;
    using Mask = __m128;
    using Ints = __m128i;

    static Floats set(float value) { return _mm_set1_ps(value); }
    static Floats zero() { return _mm_setzero_ps(); }
    static Floats load(float const* p) { return _mm_loadu_ps(p); }
    static Floats loadFirst(float const* p, int n) {
        float lanes[4] = {0.0F, 0.0F, 0.0F, 0.0F};
        for (int i = 0; i < n; ++i) {
            lanes[i] = p[i];
        }
        return _mm_loadu_ps(lanes);
    }
    static void store(float* p, Floats v) { _mm_storeu_ps(p, v); }
    static void storeFirst(float* p, Floats v, int n) {
        float lanes[4];
        _mm_storeu_ps(lanes, v);
        for (int i = 0; i < n; ++i) {
            p[i] = lanes[i];
        }
    }

    static Floats add(Floats a, Floats b) { return _mm_add_ps(a, b); }
    static Floats sub(Floats a, Floats b) { return _mm_sub_ps(a, b); }
    static Floats mul(Floats a, Floats b) { return _mm_mul_ps(a, b); }
    static Floats div(Floats a, Floats b) { return _mm_div_ps(a, b); }
    /// a * b + c, rounded once or twice.
    static Floats mulAdd(Floats a, Floats b, Floats c) { return add(mul(a, b), c); }
    /// Both give b where either is NaN.
    static Floats min(Floats a, Floats b) { return _mm_min_ps(a, b); }
    static Floats max(Floats a, Floats b) { return _mm_max_ps(a, b); }
    /// Of all lanes.
    static float lowest(Floats v) {
        Floats const pairs = _mm_min_ps(v, _mm_movehl_ps(v, v));
        return _mm_cvtss_f32(_mm_min_ss(pairs, _mm_shuffle_ps(pairs, pairs, 1)));
    }
    static float highest(Floats v) {
        Floats const pairs = _mm_max_ps(v, _mm_movehl_ps(v, v));
        return _mm_cvtss_f32(_mm_max_ss(pairs, _mm_shuffle_ps(pairs, pairs, 1)));
    }
    static Mask less(Floats a, Floats b) { return _mm_cmplt_ps(a, b); }
    static Mask equal(Floats a, Floats b) { return _mm_cmpeq_ps(a, b); }
    static Mask unequal(Floats a, Floats b) { return _mm_cmpneq_ps(a, b); }
    static Floats select(Mask m, Floats yes, Floats no) {
        return _mm_or_ps(_mm_and_ps(m, yes), _mm_andnot_ps(m, no));
    }
    static Floats addWhere(Floats sum, Mask m, Floats v) { return add(sum, _mm_and_ps(m, v)); }
    static Floats abs(Floats v) { return _mm_andnot_ps(set(-0.0F), v); }
    static Floats negateWhere(Mask m, Floats v) { return _mm_xor_ps(v, _mm_and_ps(m, set(-0.0F))); }
    static Floats floor(Floats v) {
        Floats const truncated = _mm_cvtepi32_ps(_mm_cvttps_epi32(v));
        Floats const lower = sub(truncated, _mm_and_ps(_mm_cmpgt_ps(truncated, v), set(1.0F)));
        // From 2^23 on every float is a whole number; NaN takes this way too.
        return select(less(abs(v), set(8388608.0F)), lower, v);
    }
    /// To the nearest; for magnitudes below 2^31.
    static Floats round(Floats v) { return _mm_cvtepi32_ps(_mm_cvtps_epi32(v)); }

    static Ints bits(Floats v) { return _mm_castps_si128(v); }
    static Floats fromBits(Ints v) { return _mm_castsi128_ps(v); }
    static Ints setInt(int value) { return _mm_set1_epi32(value); }
    static Ints addInt(Ints a, Ints b) { return _mm_add_epi32(a, b); }
    static Ints subInt(Ints a, Ints b) { return _mm_sub_epi32(a, b); }
    template <int n>
    static Ints shiftLeft(Ints v) {
        return _mm_slli_epi32(v, n);
    }
    template <int n>
    static Ints shiftRightSigned(Ints v) {
        return _mm_srai_epi32(v, n);
    }
    static Floats toFloats(Ints v) { return _mm_cvtepi32_ps(v); }
    /// Whole numbers to integers; for magnitudes below 2^31.
    static Ints toInts(Floats v) { return _mm_cvtps_epi32(v); }
    static void storeInts(int* p, Ints v) { _mm_storeu_si128(reinterpret_cast<__m128i*>(p), v); }

    /// Four channels of interleaved pixels.
    static void loadPixels(float const* p, Floats& r, Floats& g, Floats& b, Floats& a) {
        r = load(p);
        g = load(p + 4);
        b = load(p + 8);
        a = load(p + 12);
        _MM_TRANSPOSE4_PS(r, g, b, a);
    }
    static void storePixels(float* p, Floats r, Floats g, Floats b, Floats a) {
        _MM_TRANSPOSE4_PS(r, g, b, a);
        store(p, r);
        store(p + 4, g);
        store(p + 8, b);
        store(p + 12, a);
    }
    /// As storePixels, past the caches; p is aligned to the vector.
    static void streamPixels(float* p, Floats r, Floats g, Floats b, Floats a) {
        _MM_TRANSPOSE4_PS(r, g, b, a);
        _mm_stream_ps(p, r);
        _mm_stream_ps(p + 4, g);
        _mm_stream_ps(p + 8, b);
        _mm_stream_ps(p + 12, a);
    }
    static void finishStreaming() { _mm_sfence(); }

    /// Lane j of row i becomes lane i of row j.
    static void transpose(Floats (&rows)[4]) { _MM_TRANSPOSE4_PS(rows[0], rows[1], rows[2], rows[3]); }
};

} // namespace
