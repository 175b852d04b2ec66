#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/kernels/InstructionSet.h"

#include <cstddef>
#include <cstdint>

namespace ORVO::ImageRuntime {

/// How a kernel writes its results. STREAM bypasses the caches and pays only where the whole output is larger
/// than the last-level cache; a kernel that streams has finished its stores for other threads to see when it
/// returns.
enum class StoreMode : std::int32_t { CACHED = 0, STREAM = 1 };

/// Kernels over one row of `n` channel values, made for one instruction set. The channel order passes
/// through. The two rows of a call must not overlap. Pointers need no alignment, not even of their element.
///
/// The first five work on the SIMD-optimised layout, in three stretches: a scalar head that brings the float
/// pointer to 16 bytes (((16 - (address & 15)) >> 2) & 3 values at most), groups of four, and a scalar tail.
/// The stretches differ:
///
/// | kernel            | head and tail                               | groups of four              |
/// |-------------------|---------------------------------------------|-----------------------------|
/// | `floatFromUInt8`  | value / 255.0f                              | value * (1.0f / 255.0f)     |
/// | `floatFromUInt16` | value / 32768                               | the same                    |
/// | `uInt8FromFloat`  | truncation of value * 255.0f, modulo 256    | nearest of it, saturated    |
/// | `uInt16FromFloat` | floor(value * 32768.0f + 0.5f), of 0..1     | nearest of value * 32768.0f |
/// | `copyFloat`       | copy                                        | copy                        |
///
/// The nearest integer is the even one where two are equally near. Both forms of `uInt16FromFloat` give
/// 0..32768 for any number.
///
/// The others belong to the pixel accessors and treat all places alike. A NaN becomes 0 wherever an integer
/// is stored. Results are the same, bit for bit, for all instruction sets.
///
/// Threads: free of state; may be called from any thread.
struct RowKernels {
    void (*floatFromUInt8)(float* pOutput, std::uint8_t const* pInput, std::size_t n, StoreMode eStoreMode);
    void (*floatFromUInt16)(float* pOutput, std::uint16_t const* pInput, std::size_t n, StoreMode eStoreMode);
    void (*uInt8FromFloat)(std::uint8_t* pOutput, float const* pInput, std::size_t n, StoreMode eStoreMode);
    void (*uInt16FromFloat)(std::uint16_t* pOutput, float const* pInput, std::size_t n, StoreMode eStoreMode);
    void (*copyFloat)(float* pOutput, float const* pInput, std::size_t n, StoreMode eStoreMode);

    /// value / 255.0f.
    void (*unitFromUInt8)(float* pOutput, std::uint8_t const* pInput, std::size_t n);
    /// Halves given as bit patterns, to float, exactly. A signalling NaN becomes a quiet one.
    void (*floatFromHalf)(float* pOutput, std::uint16_t const* pInput, std::size_t n);
    /// Clamped to 0..1; a NaN stays as it is.
    void (*clampedToUnit)(float* pOutput, float const* pInput, std::size_t n);
    /// Clamped to 0..1, then the truncation of the exact product with 255.
    void (*uInt8FromUnit)(std::uint8_t* pOutput, float const* pInput, std::size_t n);
    /// Clamped to 0..1 (a NaN stays one), then rounded to the nearest half, ties to even, as a bit pattern.
    void (*halfFromUnit)(std::uint16_t* pOutput, float const* pInput, std::size_t n);
};

/// The kernels of the active instruction set.
ORVO_API RowKernels const& rowKernels();

/// The kernels of a given set.
/// @throws ParameterException "isSupported(eInstructionSet)" if the processor lacks it.
ORVO_API RowKernels const& rowKernels(InstructionSet eInstructionSet);

/// STREAM if an output of so many bytes is better written past the caches (from three quarters of the
/// last-level cache on), else CACHED.
ORVO_API StoreMode storeModeForOutput(std::uint64_t nBytes);

} // namespace ORVO::ImageRuntime
