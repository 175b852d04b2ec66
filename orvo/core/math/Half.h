#pragma once

#include <cstddef>
#include <cstdint>
#include <iosfwd>

#include "orvo/core/Export.h"

namespace ORVO {

/// A 16-bit float, IEEE 754 binary16: exactly two bytes that hold nothing but the bit pattern, as images
/// store it. A default-made one has no defined value (images of halves are not cleared).
///
/// Threads: a plain value.
class ORVO_API half {
public:
    half() = default;

    /// Rounds to the nearest half, ties to even. Values beyond 65519.99... become infinite, subnormals are
    /// kept, a NaN stays a (quiet) NaN with the upper bits of its payload.
    explicit half(float value) noexcept;

    /// The half with the given bit pattern.
    static half fromBits(std::uint16_t bits) noexcept {
        half result;
        result.iBits_ = bits;
        return result;
    }

    /// The bit pattern.
    std::uint16_t bits() const noexcept { return iBits_; }

    /// The same number as a float; exact. A signalling NaN stays as it is.
    operator float() const noexcept { return toFloat(iBits_).f; }

private:
    /// A float and its bit pattern.
    union uif {
        std::uint32_t i;
        float f;
    };

    /// Looks a number up by its 16-bit pattern; bits above the sixteenth are ignored.
    static uif toFloat(std::size_t bits) noexcept;

    std::uint16_t iBits_;
};

/// Writes the number as a float is written.
ORVO_API std::ostream& operator<<(std::ostream& stream, half value);

} // namespace ORVO
