#pragma once

#include <cstdint>

namespace ORVO {

/// A map of two floats for each of its places, row by row without gaps. What they mean is the host's: the
/// library carries them without a look.
///
/// Threads: a plain value.
struct DeformationMap {
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    /// 2 * width * height floats, the host's; null for a map whose values are not set.
    float const* data = nullptr;
};

} // namespace ORVO
