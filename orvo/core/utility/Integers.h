#pragma once

#include <cstddef>
#include <cstdint>

#include "orvo/core/Export.h"

namespace ORVO {

/// The smallest power of two that is not less than the argument; 0 gives 1. Throws ParameterException
/// "value <= 0x80000000u" where no unsigned 32-bit number holds the result. Threads: any.
ORVO_API unsigned nextPowerOfTwo(unsigned value);

/// Whether the argument is a power of two; 0 is none. Threads: any.
constexpr bool isPowerOfTwo(unsigned value) noexcept { return value != 0 && (value & (value - 1)) == 0; }

/// Rounds value up to a multiple of boundary; a value on the boundary stays, a negative value is rounded
/// towards zero. Throws ParameterException "boundary > 0", or "Result of incrementToBoundary is out of range"
/// where no int holds the result. Threads: any.
ORVO_API int incrementToBoundary(int value, int boundary);

/// Whether the address is a multiple of alignment, which must not be 0. Threads: any.
inline bool isAligned(void const* address, std::size_t alignment) noexcept {
    return reinterpret_cast<std::uintptr_t>(address) % alignment == 0;
}

} // namespace ORVO
