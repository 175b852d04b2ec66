#pragma once

#include "orvo/core/math/Bool.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/math/Int.h"
#include "orvo/core/math/Matrix.h"
#include "orvo/core/spaces/PositionExtentInWorldSpace.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

namespace ORVO::Test {

/// Two different values of each parameter type, and how the first is written.
template <typename T>
struct Samples;

/// Defines Samples<T>. The values may contain commas, and are therefore given in parentheses.
#define ORVO_TEST_SAMPLES(T, firstValue, secondValue, firstText)                                             \
    template <>                                                                                              \
    struct Samples<T> {                                                                                      \
        static T first() { return T firstValue; }                                                            \
        static T second() { return T secondValue; }                                                          \
        static std::string text() { return firstText; }                                                      \
    };

using Pointer = void*;
using UnsignedInt = unsigned int;
using UnsignedLong = unsigned long;
using UnsignedLongLong = unsigned long long;

ORVO_TEST_SAMPLES(bool, (true), (false), "1")
ORVO_TEST_SAMPLES(int, (-7), (8), "-7")
ORVO_TEST_SAMPLES(UnsignedInt, (4294967295u), (8u), "4294967295")
ORVO_TEST_SAMPLES(long, (-5000000000), (8), "-5000000000")
ORVO_TEST_SAMPLES(UnsignedLong, (5000000000u), (8u), "5000000000")
ORVO_TEST_SAMPLES(UnsignedLongLong, (18446744073709551615u), (8u), "18446744073709551615")
ORVO_TEST_SAMPLES(float, (1.5f), (2.5f), "1.5")
ORVO_TEST_SAMPLES(Pointer, (std::uintptr_t(4096)), (nullptr), "4096")
ORVO_TEST_SAMPLES(bool2, (true, false), (true, true), "(1, 0)")
ORVO_TEST_SAMPLES(bool3, (true, false, true), (true, true, true), "(1, 0, 1)")
ORVO_TEST_SAMPLES(bool4, (true, false, true, false), (true, true, true, true), "(1, 0, 1, 0)")
ORVO_TEST_SAMPLES(int2, (1, 2), (1, 3), "(1, 2)")
ORVO_TEST_SAMPLES(int3, (1, 2, 3), (1, 2, 4), "(1, 2, 3)")
ORVO_TEST_SAMPLES(int4, (1, 2, 3, 4), (1, 2, 3, 5), "(1, 2, 3, 4)")
ORVO_TEST_SAMPLES(float2, (0.5f, 2.0f), (0.5f, 3.0f), "(0.5, 2)")
ORVO_TEST_SAMPLES(float3, (0.5f, 2.0f, 3.0f), (0.5f, 2.0f, 4.0f), "(0.5, 2, 3)")
ORVO_TEST_SAMPLES(float4, (0.5f, 2.0f, 3.0f, 4.0f), (0.5f, 2.0f, 3.0f, 5.0f), "(0.5, 2, 3, 4)")
ORVO_TEST_SAMPLES(std::vector<float>, ({1.5f, 2.0f}), ({1.5f}), "[1.5, 2]")
ORVO_TEST_SAMPLES(std::vector<float2>, ({float2(1.0f, 2.0f), float2(3.0f)}), (), "[(1, 2), (3, 3)]")
ORVO_TEST_SAMPLES(std::vector<float3>, ({float3(1.0f)}), ({float3(2.0f)}), "[(1, 1, 1)]")
ORVO_TEST_SAMPLES(std::vector<float4>, ({float4(1.0f)}), ({float4(2.0f)}), "[(1, 1, 1, 1)]")
ORVO_TEST_SAMPLES(std::string, ("grey"), (""), "grey")
ORVO_TEST_SAMPLES(PositionExtentInWorldSpace,
                  (PositionInWorldSpace(1.0f, 2.0f), ExtentInWorldSpace(3.0f, 4.5f)), (), "(1, 2) (3, 4.5)")

#undef ORVO_TEST_SAMPLES

/// A matrix whose elements are 1, 2, 3, ... in memory, and another whose last element is one more.
template <typename Matrix>
struct MatrixSamples {
    static Matrix first() {
        Matrix oMatrix;
        float fNext = 1.0f;
        for (float& fElement : oMatrix) {
            fElement = fNext++;
        }
        return oMatrix;
    }
    static Matrix second() {
        Matrix oMatrix = first();
        oMatrix.end()[-1] += 1.0f;
        return oMatrix;
    }
};

template <>
struct Samples<float2x2> : MatrixSamples<float2x2> {
    static std::string text() { return "((1, 2), (3, 4))"; }
};
template <>
struct Samples<float3x3> : MatrixSamples<float3x3> {
    static std::string text() { return "((1, 2, 3), (4, 5, 6), (7, 8, 9))"; }
};
template <>
struct Samples<float4x4> : MatrixSamples<float4x4> {
    static std::string text() { return "((1, 2, 3, 4), (5, 6, 7, 8), (9, 10, 11, 12), (13, 14, 15, 16))"; }
};

/// Every type that the library has a parameter for.
using AllParameterTypes =
    testing::Types<bool, int, unsigned int, long, unsigned long, unsigned long long, float, void*, bool2,
                   bool3, bool4, int2, int3, int4, float2, float3, float4, float2x2, float3x3, float4x4,
                   std::vector<float>, std::vector<float2>, std::vector<float3>, std::vector<float4>,
                   std::string, PositionExtentInWorldSpace>;

/// Those of them that have `createArray`.
using ArrayParameterTypes =
    testing::Types<bool, int, unsigned int, long, unsigned long, unsigned long long, float, void*, bool2,
                   bool3, bool4, int2, int3, int4, float2, float3, float4, float2x2, float3x3, float4x4,
                   std::vector<float2>, std::vector<float3>, std::vector<float4>, std::string>;

/// Those of them that have bounds.
using IntervalParameterTypes =
    testing::Types<bool, int, unsigned int, long, unsigned long, unsigned long long, float, bool2, bool3,
                   bool4, int2, int3, int4, float2, float3, float4, float2x2, float3x3, float4x4,
                   std::vector<float>>;

} // namespace ORVO::Test
