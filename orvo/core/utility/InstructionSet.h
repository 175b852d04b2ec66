#pragma once

#include "orvo/core/Export.h"

#include <cstdint>
#include <iosfwd>

namespace ORVO::Core {

/// The instructions that kernels may use, each containing those before it. PLAIN is portable code without
/// intrinsics: the definition of all results, kept as the reference of the others.
/// AVX2 includes F16C; AVX512 asks for the F, BW, DQ and VL extensions.
///
/// Threads: all functions may be called from any thread.
enum class InstructionSet : std::int32_t { PLAIN = 0, SSE2 = 1, AVX2 = 2, AVX512 = 3 };

/// Whether the processor and the operating system support it.
ORVO_API bool isSupported(InstructionSet eInstructionSet);

/// The best set that is supported. Asked of the processor once.
ORVO_API InstructionSet bestInstructionSet();

/// The set whose kernels are in use: the best, unless it was set otherwise.
ORVO_API InstructionSet activeInstructionSet();

/// Makes all following calls use the given set, for tests and comparisons.
/// @throws ParameterException "isSupported(eInstructionSet)" if the processor lacks it; nothing changes then.
ORVO_API void setActiveInstructionSet(InstructionSet eInstructionSet);

/// Writes "plain", "SSE2", "AVX2" or "AVX-512".
ORVO_API std::ostream& operator<<(std::ostream& stream, InstructionSet eInstructionSet);

} // namespace ORVO::Core
