#include "orvo/image_runtime/kernels/RowKernels.h"

#include "orvo/core/Check.h"
#include "orvo/image_runtime/kernels/RowKernelTables.h"

#include <unistd.h>

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

/// What the system tells of the last-level cache, or a common size where it tells nothing.
std::uint64_t lastLevelCacheBytes() {
    constexpr std::uint64_t COMMON_SIZE = 32u << 20;
    long const nBytes = sysconf(_SC_LEVEL3_CACHE_SIZE);
    return nBytes > 0 ? static_cast<std::uint64_t>(nBytes) : COMMON_SIZE;
}

} // namespace

RowKernels const& rowKernels() { return kernelsOf(activeInstructionSet()); }

RowKernels const& rowKernels(InstructionSet eInstructionSet) {
    ORVO_CHECK_PARAMETER(isSupported(eInstructionSet));
    return kernelsOf(eInstructionSet);
}

StoreMode storeModeForOutput(std::uint64_t nBytes) {
    static std::uint64_t const nCacheBytes = lastLevelCacheBytes();
    return nBytes > nCacheBytes ? StoreMode::STREAM : StoreMode::CACHED;
}

} // namespace ORVO::ImageRuntime
