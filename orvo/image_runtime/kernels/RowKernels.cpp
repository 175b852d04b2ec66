#include "orvo/image_runtime/kernels/RowKernels.h"

#include "orvo/core/Check.h"
#include "orvo/image_runtime/kernels/RowKernelTables.h"

#include <algorithm>
#include <cpuid.h>

namespace ORVO::ImageRuntime {

namespace {

RowKernels const& kernelsOf(InstructionSet eInstructionSet) {
    switch (eInstructionSet) {
    case InstructionSet::SSE2:
        return Internal::sse2RowKernels();
    case InstructionSet::AVX2:
        return Internal::avx2RowKernels();
    case InstructionSet::AVX512:
        return Internal::avx512RowKernels();
    case InstructionSet::PLAIN:
        break;
    }
    return Internal::plainRowKernels();
}

/// The largest cache that a leaf of deterministic cache parameters lists, 0 if the processor lacks the leaf.
std::uint64_t largestCacheOf(unsigned nLeaf) {
    std::uint64_t nLargest = 0;
    for (unsigned iCache = 0; iCache < 16; ++iCache) {
        unsigned a = 0;
        unsigned b = 0;
        unsigned c = 0;
        unsigned d = 0;
        bool const bListed = __get_cpuid_count(nLeaf, iCache, &a, &b, &c, &d) && (a & 31) != 0;
        if (!bListed) {
            break;
        }
        std::uint64_t const nLineBytes = (b & 0xfff) + 1;
        std::uint64_t const nPartitions = (b >> 12 & 0x3ff) + 1;
        std::uint64_t const nWays = (b >> 22 & 0x3ff) + 1;
        std::uint64_t const nSets = static_cast<std::uint64_t>(c) + 1;
        nLargest = std::max(nLargest, nLineBytes * nPartitions * nWays * nSets);
    }
    return nLargest;
}

/// The last-level cache that one core can fill, or a common size where the processor does not tell. The C
/// library's own figure is no help: on processors with several such caches it is their sum.
std::uint64_t lastLevelCacheBytes() {
    constexpr unsigned INTEL_LEAF = 4;
    constexpr unsigned AMD_LEAF = 0x8000001d;
    constexpr std::uint64_t COMMON_SIZE = 32u << 20;
    std::uint64_t const nBytes = std::max(largestCacheOf(INTEL_LEAF), largestCacheOf(AMD_LEAF));
    return nBytes ? nBytes : COMMON_SIZE;
}

} // namespace

RowKernels const& rowKernels() { return kernelsOf(activeInstructionSet()); }

RowKernels const& rowKernels(InstructionSet eInstructionSet) {
    ORVO_CHECK_PARAMETER(isSupported(eInstructionSet));
    return kernelsOf(eInstructionSet);
}

StoreMode storeModeForOutput(std::uint64_t nBytes) {
    // The rows that are read pass through the same cache: of an output of nearly its size little is left at
    // the end.
    static std::uint64_t const nLargestCached = lastLevelCacheBytes() / 4 * 3;
    return nBytes > nLargestCached ? StoreMode::STREAM : StoreMode::CACHED;
}

} // namespace ORVO::ImageRuntime
