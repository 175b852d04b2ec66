#include "orvo/core/utility/InstructionSet.h"

#include "orvo/core/Check.h"

#include <atomic>
#include <cpuid.h>
#include <ostream>

namespace ORVO::Core {

namespace {

/// Not every compiler's own query knows this extension by name. The registers that it needs are those of AVX.
bool hasF16C() {
    unsigned a = 0;
    unsigned b = 0;
    unsigned c = 0;
    unsigned d = 0;
    return __get_cpuid(1, &a, &b, &c, &d) && (c & bit_F16C);
}

InstructionSet askProcessor() {
    __builtin_cpu_init();
    if (!__builtin_cpu_supports("avx2") || !hasF16C()) {
        return InstructionSet::SSE2;
    }
    bool const bAVX512 = __builtin_cpu_supports("avx512f") && __builtin_cpu_supports("avx512bw") &&
                         __builtin_cpu_supports("avx512dq") && __builtin_cpu_supports("avx512vl");
    return bAVX512 ? InstructionSet::AVX512 : InstructionSet::AVX2;
}

std::atomic<InstructionSet>& activeSet() {
    static std::atomic<InstructionSet> eActive(bestInstructionSet());
    return eActive;
}

} // namespace

bool isSupported(InstructionSet eInstructionSet) {
    return eInstructionSet >= InstructionSet::PLAIN && eInstructionSet <= bestInstructionSet();
}

InstructionSet bestInstructionSet() {
    static InstructionSet const eBest = askProcessor();
    return eBest;
}

InstructionSet activeInstructionSet() { return activeSet().load(std::memory_order_relaxed); }

void setActiveInstructionSet(InstructionSet eInstructionSet) {
    ORVO_CHECK_PARAMETER(isSupported(eInstructionSet));
    activeSet().store(eInstructionSet, std::memory_order_relaxed);
}

std::ostream& operator<<(std::ostream& stream, InstructionSet eInstructionSet) {
    switch (eInstructionSet) {
    case InstructionSet::PLAIN:
        return stream << "plain";
    case InstructionSet::SSE2:
        return stream << "SSE2";
    case InstructionSet::AVX2:
        return stream << "AVX2";
    case InstructionSet::AVX512:
        return stream << "AVX-512";
    }
    return stream << "unknown";
}

} // namespace ORVO::Core
