#include "orvo/image_runtime/kernels/RowKernelTables.h"

#include "orvo/core/math/Half.h"
#include "orvo/core/utility/SaturatingCast.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <type_traits>

namespace ORVO::ImageRuntime::Internal {

namespace {

/// A channel of a row, wherever the row lies in memory.
template <class Channel>
Channel get(Channel const* pRow, std::size_t i) {
    Channel value;
    std::memcpy(&value, reinterpret_cast<unsigned char const*>(pRow) + i * sizeof(Channel), sizeof(Channel));
    return value;
}

template <class Channel>
void put(Channel* pRow, std::size_t i, std::type_identity_t<Channel> value) {
    std::memcpy(reinterpret_cast<unsigned char*>(pRow) + i * sizeof(Channel), &value, sizeof(Channel));
}

} // namespace

void headFloatFromUInt8(float* pOutput, std::uint8_t const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        put(pOutput, i, static_cast<float>(get(pInput, i)) / 255.0f);
    }
}

void headFloatFromUInt16(float* pOutput, std::uint16_t const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        put(pOutput, i, static_cast<float>(get(pInput, i)) * 3.0517578125e-05f);
    }
}

void headUInt8FromFloat(std::uint8_t* pOutput, float const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        // Out of range, the low byte of the integer is kept.
        put(pOutput, i, static_cast<std::uint8_t>(saturatingCast<std::int32_t>(get(pInput, i) * 255.0f)));
    }
}

void headUInt16FromFloat(std::uint16_t* pOutput, float const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        float const clamped = std::min(std::max(get(pInput, i), 0.0f), 1.0f);
        put(pOutput, i, saturatingCast<std::uint16_t>(std::floor(clamped * 32768.0f + 0.5f)));
    }
}

namespace {

void groupsFloatFromUInt8(float* pOutput, std::uint8_t const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        put(pOutput, i, static_cast<float>(get(pInput, i)) * (1.0f / 255.0f));
    }
}

void groupsFloatFromUInt16(float* pOutput, std::uint16_t const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        put(pOutput, i, static_cast<float>(static_cast<double>(get(pInput, i)) * 3.0517578125e-05));
    }
}

/// To the nearest integer, ties to even, whatever the rounding mode of the thread. For numbers from 0 to
/// 32768.
int roundedToNearest(float value) {
    int const lower = static_cast<int>(value);
    float const fraction = value - static_cast<float>(lower);
    bool const bUp = fraction > 0.5f || (fraction == 0.5f && lower % 2 == 1);
    return lower + bUp;
}

template <class Integer>
void groupsIntegerFromFloat(Integer* pOutput, float const* pInput, std::size_t n, float white) {
    for (std::size_t i = 0; i < n; ++i) {
        float const scaled = get(pInput, i) * white;
        // The comparisons are false for a NaN, which thus becomes 0.
        float const clamped = scaled > 0.0f ? std::min(scaled, white) : 0.0f;
        put(pOutput, i, static_cast<Integer>(roundedToNearest(clamped)));
    }
}

void groupsUInt8FromFloat(std::uint8_t* pOutput, float const* pInput, std::size_t n) {
    groupsIntegerFromFloat(pOutput, pInput, n, 255.0f);
}

void groupsUInt16FromFloat(std::uint16_t* pOutput, float const* pInput, std::size_t n) {
    groupsIntegerFromFloat(pOutput, pInput, n, 32768.0f);
}

/// Splits a row in head, groups of four and tail by the address of its floats.
template <auto headAndTail, auto groups, class OutputChannel, class InputChannel>
void inStretches(OutputChannel* pOutput, InputChannel const* pInput, std::size_t n, void const* pFloats) {
    std::size_t const nHead =
        std::min<std::size_t>(((16 - (reinterpret_cast<std::uintptr_t>(pFloats) & 15)) >> 2) & 3, n);
    std::size_t const nGroups = (n - nHead) / 4 * 4;
    headAndTail(pOutput, pInput, nHead);
    groups(pOutput + nHead, pInput + nHead, nGroups);
    headAndTail(pOutput + nHead + nGroups, pInput + nHead + nGroups, n - nHead - nGroups);
}

void floatFromUInt8(float* pOutput, std::uint8_t const* pInput, std::size_t n, StoreMode) {
    inStretches<headFloatFromUInt8, groupsFloatFromUInt8>(pOutput, pInput, n, pOutput);
}

void floatFromUInt16(float* pOutput, std::uint16_t const* pInput, std::size_t n, StoreMode) {
    inStretches<headFloatFromUInt16, groupsFloatFromUInt16>(pOutput, pInput, n, pOutput);
}

void uInt8FromFloat(std::uint8_t* pOutput, float const* pInput, std::size_t n, StoreMode) {
    inStretches<headUInt8FromFloat, groupsUInt8FromFloat>(pOutput, pInput, n, pInput);
}

void uInt16FromFloat(std::uint16_t* pOutput, float const* pInput, std::size_t n, StoreMode) {
    inStretches<headUInt16FromFloat, groupsUInt16FromFloat>(pOutput, pInput, n, pInput);
}

void copyFloat(float* pOutput, float const* pInput, std::size_t n, StoreMode) {
    if (n) {
        std::memcpy(pOutput, pInput, n * sizeof(float));
    }
}

void floatFromHalf(float* pOutput, std::uint16_t const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        // A signalling NaN is made quiet, as the processor's own conversion does.
        std::uint16_t const bits = get(pInput, i);
        bool const bNaN = (bits & 0x7fff) > 0x7c00;
        put(pOutput, i, half::fromBits(static_cast<std::uint16_t>(bNaN ? bits | 0x0200 : bits)));
    }
}

float clampedToUnit(float value) { return value > 1.0f ? 1.0f : value < 0.0f ? 0.0f : value; }

void clampedToUnit(float* pOutput, float const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        put(pOutput, i, clampedToUnit(get(pInput, i)));
    }
}

void uInt8FromUnit(std::uint8_t* pOutput, float const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        // In double the product of a float and 255 is exact.
        put(pOutput, i,
            saturatingCast<std::uint8_t>(static_cast<double>(clampedToUnit(get(pInput, i))) * 255.0));
    }
}

void halfFromUnit(std::uint16_t* pOutput, float const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < n; ++i) {
        put(pOutput, i, half(clampedToUnit(get(pInput, i))).bits());
    }
}

} // namespace

RowKernels const& plainRowKernels() {
    static constexpr RowKernels KERNELS = {
        floatFromUInt8,     floatFromUInt16, uInt8FromFloat, uInt16FromFloat, copyFloat,
        headFloatFromUInt8, floatFromHalf,   clampedToUnit,  uInt8FromUnit,   halfFromUnit};
    return KERNELS;
}

} // namespace ORVO::ImageRuntime::Internal
