#pragma once

#include "orvo/image_runtime/kernels/RowKernelTables.h"

#include <immintrin.h>

namespace ORVO::ImageRuntime::Internal {

/// Puts the kernels of one instruction set together from operations on blocks of sixteen values.
///
/// `Vectors` loads a block as floats (`load`), stores one of floats or of integers (`store<bStream>`; a block
/// that is streamed starts at a multiple of its own size in bytes), and has the arithmetic on blocks:
/// `scaled`, `divided`, `integers` (scaled, a NaN made 0, clamped, rounded), `clamped` (to 0..1, a NaN
/// stays), `truncatedBytes` (of 0..1), `floatFromHalf` and `halfFromUnit`. It has to stand in an unnamed
/// namespace, so that whatever is made of this template stays inside the source that was compiled for the
/// instructions.
template <class Vectors>
struct RowKernelBody {
    static constexpr std::size_t BLOCK = 16;

    struct FloatFromUInt8 {
        template <bool bStream>
        static void run(float* pOutput, std::uint8_t const* pInput) {
            Vectors::template store<bStream>(pOutput, Vectors::scaled(Vectors::load(pInput), 1.0f / 255.0f));
        }
    };

    struct FloatFromUInt16 {
        template <bool bStream>
        static void run(float* pOutput, std::uint16_t const* pInput) {
            Vectors::template store<bStream>(pOutput,
                                             Vectors::scaled(Vectors::load(pInput), 1.0f / 32768.0f));
        }
    };

    struct UInt8FromFloat {
        template <bool bStream>
        static void run(std::uint8_t* pOutput, float const* pInput) {
            Vectors::template store<bStream>(pOutput, Vectors::integers(Vectors::load(pInput), 255.0f));
        }
    };

    struct UInt16FromFloat {
        template <bool bStream>
        static void run(std::uint16_t* pOutput, float const* pInput) {
            Vectors::template store<bStream>(pOutput, Vectors::integers(Vectors::load(pInput), 32768.0f));
        }
    };

    struct CopyFloat {
        template <bool bStream>
        static void run(float* pOutput, float const* pInput) {
            Vectors::template store<bStream>(pOutput, Vectors::load(pInput));
        }
    };

    struct UnitFromUInt8 {
        template <bool bStream>
        static void run(float* pOutput, std::uint8_t const* pInput) {
            Vectors::template store<bStream>(pOutput, Vectors::divided(Vectors::load(pInput), 255.0f));
        }
    };

    struct ClampedToUnit {
        template <bool bStream>
        static void run(float* pOutput, float const* pInput) {
            Vectors::template store<bStream>(pOutput, Vectors::clamped(Vectors::load(pInput)));
        }
    };

    struct UInt8FromUnit {
        template <bool bStream>
        static void run(std::uint8_t* pOutput, float const* pInput) {
            Vectors::template store<bStream>(pOutput, Vectors::truncatedBytes(Vectors::load(pInput)));
        }
    };

    struct FloatFromHalf {
        template <bool bStream>
        static void run(float* pOutput, std::uint16_t const* pInput) {
            Vectors::floatFromHalf(pOutput, pInput);
        }
    };

    struct HalfFromUnit {
        template <bool bStream>
        static void run(std::uint16_t* pOutput, float const* pInput) {
            Vectors::halfFromUnit(pOutput, pInput);
        }
    };

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
        inStretches<FloatFromUInt8, headFloatFromUInt8>(pOutput, pInput, n, pOutput, eStoreMode);
    }

    static void floatFromUInt16(float* pOutput, std::uint16_t const* pInput, std::size_t n,
                                StoreMode eStoreMode) {
        inStretches<FloatFromUInt16, headFloatFromUInt16>(pOutput, pInput, n, pOutput, eStoreMode);
    }

    static void uInt8FromFloat(std::uint8_t* pOutput, float const* pInput, std::size_t n,
                               StoreMode eStoreMode) {
        inStretches<UInt8FromFloat, headUInt8FromFloat>(pOutput, pInput, n, pInput, eStoreMode);
    }

    static void uInt16FromFloat(std::uint16_t* pOutput, float const* pInput, std::size_t n,
                                StoreMode eStoreMode) {
        inStretches<UInt16FromFloat, headUInt16FromFloat>(pOutput, pInput, n, pInput, eStoreMode);
    }

    static void copyFloat(float* pOutput, float const* pInput, std::size_t n, StoreMode eStoreMode) {
        runGroups<CopyFloat>(pOutput, pInput, n, eStoreMode);
    }

    static void unitFromUInt8(float* pOutput, std::uint8_t const* pInput, std::size_t n) {
        runBlocks<UnitFromUInt8>(pOutput, pInput, n);
    }

    static void clampedToUnit(float* pOutput, float const* pInput, std::size_t n) {
        runBlocks<ClampedToUnit>(pOutput, pInput, n);
    }

    static void uInt8FromUnit(std::uint8_t* pOutput, float const* pInput, std::size_t n) {
        runBlocks<UInt8FromUnit>(pOutput, pInput, n);
    }

    static void floatFromHalf(float* pOutput, std::uint16_t const* pInput, std::size_t n) {
        runBlocks<FloatFromHalf>(pOutput, pInput, n);
    }

    static void halfFromUnit(std::uint16_t* pOutput, float const* pInput, std::size_t n) {
        runBlocks<HalfFromUnit>(pOutput, pInput, n);
    }

    static RowKernels const& table() {
        static constexpr RowKernels KERNELS = {
            floatFromUInt8, floatFromUInt16, uInt8FromFloat, uInt16FromFloat, copyFloat,
            unitFromUInt8,  floatFromHalf,   clampedToUnit,  uInt8FromUnit,   halfFromUnit};
        return KERNELS;
    }
};

} // namespace ORVO::ImageRuntime::Internal
