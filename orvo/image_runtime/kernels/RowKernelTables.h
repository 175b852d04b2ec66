#pragma once

#include "orvo/image_runtime/kernels/RowKernels.h"

/// The tables of kernels, one from each source that is compiled for its own instruction set. Those sources
/// include nothing that defines inline functions: the linker keeps one copy of such a function for the whole
/// library, and must not find one that was compiled for instructions that the processor lacks.
///
/// Threads: free of state; may be called from any thread on a processor that has the instructions.
namespace ORVO::ImageRuntime::Internal {

RowKernels const& plainRowKernels();
RowKernels const& sse2RowKernels();
RowKernels const& avx2RowKernels();
RowKernels const& avx512RowKernels();

/// The arithmetic of heads and tails, over all `n` values (see RowKernels).
void headFloatFromUInt8(float* pOutput, std::uint8_t const* pInput, std::size_t n);
void headFloatFromUInt16(float* pOutput, std::uint16_t const* pInput, std::size_t n);
void headUInt8FromFloat(std::uint8_t* pOutput, float const* pInput, std::size_t n);
void headUInt16FromFloat(std::uint16_t* pOutput, float const* pInput, std::size_t n);

} // namespace ORVO::ImageRuntime::Internal
