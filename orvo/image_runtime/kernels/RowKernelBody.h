#pragma once

#include "orvo/image_runtime/kernels/RowKernelTables.h"

#include <immintrin.h>

namespace ORVO::ImageRuntime::Internal {

/// Puts the kernels of one instruction set together from operations on blocks of sixteen values.
///
/// `Operations` names one structure for each kernel (`FloatFromUInt8`, ...) with
/// `template <bool bStream> static void run(Output*, Input const*)`, which converts a block; a block that is
/// streamed starts at a multiple of its own size in bytes. `Operations` has to stand in an unnamed namespace,
/// so that whatever is made of this template stays inside the source that was compiled for the instructions.
template <class Operations>
struct RowKernelBody {
    static constexpr std::size_t BLOCK = 16;

    /// Fewer values than a block, by way of a whole block beside the row.
    template <class Operation, class Output, class Input>
    static void runPartialBlock(Output* pOutput, Input const* pInput, std::size_t n) {
        alignas(64) Output aOutput[BLOCK];
        alignas(64) Input aInput[BLOCK] = {};
        __builtin_memcpy(aInput, pInput, n * sizeof(Input));
        Operation::template run<false>(aOutput, aInput);
        __builtin_memcpy(pOutput, aOutput, n * sizeof(Output));
    }

    /// All values by the same arithmetic.
    template <class Operation, class Output, class Input>
    static void runBlocks(Output* pOutput, Input const* pInput, std::size_t n) {
        std::size_t i = 0;
        for (; i + BLOCK <= n; i += BLOCK) {
            Operation::template run<false>(pOutput + i, pInput + i);
        }
        if (i < n) {
            runPartialBlock<Operation>(pOutput + i, pInput + i, n - i);
        }
    }

    /// As runBlocks(), past the caches.
    template <class Operation, class Output, class Input>
    static void streamBlocks(Output* pOutput, Input const* pInput, std::size_t n) {
        constexpr std::size_t BLOCK_BYTES = BLOCK * sizeof(Output);
        std::size_t const nBytesToBoundary = -reinterpret_cast<std::uintptr_t>(pOutput) & (BLOCK_BYTES - 1);
        std::size_t i = nBytesToBoundary / sizeof(Output);
        // No channel begins on a boundary where the row lies between those of its channels.
        if (i >= n || nBytesToBoundary % sizeof(Output) != 0) {
            runBlocks<Operation>(pOutput, pInput, n);
            return;
        }
        if (i) {
            runPartialBlock<Operation>(pOutput, pInput, i);
        }
        for (; i + BLOCK <= n; i += BLOCK) {
            Operation::template run<true>(pOutput + i, pInput + i);
        }
        if (i < n) {
            runPartialBlock<Operation>(pOutput + i, pInput + i, n - i);
        }
        // Streamed stores are ordered with nothing: whoever is told that the row is done has to find it.
        _mm_sfence();
    }

    template <class Operation, class Output, class Input>
    static void runGroups(Output* pOutput, Input const* pInput, std::size_t n, StoreMode eStoreMode) {
        if (eStoreMode == StoreMode::STREAM) {
            streamBlocks<Operation>(pOutput, pInput, n);
        } else {
            runBlocks<Operation>(pOutput, pInput, n);
        }
    }

    /// Splits a row in head, groups of four and tail by the address of its floats.
    template <class Operation, auto headAndTail, class Output, class Input>
    static void inStretches(Output* pOutput, Input const* pInput, std::size_t n, void const* pFloats,
                            StoreMode eStoreMode) {
        std::size_t const nToBoundary = ((16 - (reinterpret_cast<std::uintptr_t>(pFloats) & 15)) >> 2) & 3;
        std::size_t const nHead = nToBoundary < n ? nToBoundary : n;
        std::size_t const nGroups = (n - nHead) / 4 * 4;
        std::size_t const nTail = n - nHead - nGroups;
        if (nHead) {
            headAndTail(pOutput, pInput, nHead);
        }
        runGroups<Operation>(pOutput + nHead, pInput + nHead, nGroups, eStoreMode);
        if (nTail) {
            headAndTail(pOutput + nHead + nGroups, pInput + nHead + nGroups, nTail);
        }
    }

    static void floatFromUInt8(float* pOutput, std::uint8_t const* pInput, std::size_t n,
                               StoreMode eStoreMode) {
        inStretches<typename Operations::FloatFromUInt8, headFloatFromUInt8>(pOutput, pInput, n, pOutput,
                                                                             eStoreMode);
    }

    static void floatFromUInt16(float* pOutput, std::uint16_t const* pInput, std::size_t n,
                                StoreMode eStoreMode) {
        inStretches<typename Operations::FloatFromUInt16, headFloatFromUInt16>(pOutput, pInput, n, pOutput,
                                                                               eStoreMode);
    }

    static void uInt8FromFloat(std::uint8_t* pOutput, float const* pInput, std::size_t n,
                               StoreMode eStoreMode) {
        inStretches<typename Operations::UInt8FromFloat, headUInt8FromFloat>(pOutput, pInput, n, pInput,
                                                                             eStoreMode);
    }

    static void uInt16FromFloat(std::uint16_t* pOutput, float const* pInput, std::size_t n,
                                StoreMode eStoreMode) {
        inStretches<typename Operations::UInt16FromFloat, headUInt16FromFloat>(pOutput, pInput, n, pInput,
                                                                               eStoreMode);
    }

    static void copyFloat(float* pOutput, float const* pInput, std::size_t n, StoreMode eStoreMode) {
        runGroups<typename Operations::CopyFloat>(pOutput, pInput, n, eStoreMode);
    }

    static void unitFromUInt8(float* pOutput, std::uint8_t const* pInput, std::size_t n) {
        runBlocks<typename Operations::UnitFromUInt8>(pOutput, pInput, n);
    }

    static void clampedToUnit(float* pOutput, float const* pInput, std::size_t n) {
        runBlocks<typename Operations::ClampedToUnit>(pOutput, pInput, n);
    }

    static void uInt8FromUnit(std::uint8_t* pOutput, float const* pInput, std::size_t n) {
        runBlocks<typename Operations::UInt8FromUnit>(pOutput, pInput, n);
    }

    static void floatFromHalf(float* pOutput, std::uint16_t const* pInput, std::size_t n) {
        runBlocks<typename Operations::FloatFromHalf>(pOutput, pInput, n);
    }

    static void halfFromUnit(std::uint16_t* pOutput, float const* pInput, std::size_t n) {
        runBlocks<typename Operations::HalfFromUnit>(pOutput, pInput, n);
    }
};

} // namespace ORVO::ImageRuntime::Internal
