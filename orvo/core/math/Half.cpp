#include "orvo/core/math/Half.h"

#include <array>
#include <cstring>
#include <ostream>
#include <type_traits>

namespace ORVO {

namespace {

// Both formats by IEEE 754-2008: binary16 has 1 sign bit, 5 exponent bits with bias 15 and 10 fraction bits,
// binary32 has 1, 8 with bias 127, and 23.
constexpr std::uint32_t floatBitsOfHalf(std::uint32_t bits) {
    std::uint32_t const sign = (bits & 0x8000u) << 16;
    std::uint32_t const exponent = (bits >> 10) & 0x1Fu;
    std::uint32_t fraction = bits & 0x3FFu;
    if (exponent == 31)
        return sign | 0x7F800000u | (fraction << 13);
    if (exponent != 0)
        return sign | ((exponent + 112) << 23) | (fraction << 13);
    if (fraction == 0)
        return sign;
    // A subnormal half is a normal float: shift the leading one to the hidden place.
    std::uint32_t floatExponent = 113;
    for (; (fraction & 0x400u) == 0; fraction <<= 1)
        --floatExponent;
    return sign | (floatExponent << 23) | ((fraction & 0x3FFu) << 13);
}

constexpr std::array<std::uint32_t, 65536> makeTable() {
    std::array<std::uint32_t, 65536> table{};
    for (std::uint32_t bits = 0; bits < 65536; ++bits)
        table[bits] = floatBitsOfHalf(bits);
    return table;
}

constexpr std::array<std::uint32_t, 65536> aFloatBits = makeTable();

/// value / 2^shift, rounded to nearest, ties to even; shift is 1 to 31.
std::uint32_t shiftRoundingToEven(std::uint32_t value, unsigned shift) {
    std::uint32_t const result = value >> shift;
    std::uint32_t const rest = value & ((1u << shift) - 1);
    std::uint32_t const middle = 1u << (shift - 1);
    return result + (rest > middle || (rest == middle && (result & 1u) != 0));
}

std::uint16_t halfBitsOfFloat(std::uint32_t bits) {
    std::uint32_t const sign = (bits >> 16) & 0x8000u;
    std::uint32_t const magnitude = bits & 0x7FFFFFFFu;
    std::uint32_t result = 0;
    if (magnitude > 0x7F800000u) { // NaN: the quiet bit keeps it one, whatever is cut off
        result = 0x7E00u | ((magnitude >> 13) & 0x3FFu);
    } else if (magnitude >= 0x47800000u) { // 65536 and more
        result = 0x7C00u;
    } else if (magnitude >=
               0x38800000u) { // 2^-14 and more: rounding may carry into the exponent, up to infinity
        result = shiftRoundingToEven(magnitude - (112u << 23), 13);
    } else if (magnitude >= 0x33000000u) { // 2^-25 and more: a subnormal, in units of 2^-24
        result = shiftRoundingToEven((magnitude & 0x7FFFFFu) | 0x800000u, 126 - (magnitude >> 23));
    }
    return static_cast<std::uint16_t>(sign | result);
}

} // namespace

static_assert(sizeof(half) == 2 && alignof(half) == 2 && std::is_trivial_v<half>,
              "images store halves directly");

half::half(float value) noexcept {
    std::uint32_t bits = 0;
    std::memcpy(&bits, &value, sizeof(bits));
    iBits_ = halfBitsOfFloat(bits);
}

half::uif half::toFloat(std::size_t bits) noexcept {
    uif result;
    result.i = aFloatBits[bits & 0xFFFFu];
    return result;
}

std::ostream& operator<<(std::ostream& stream, half value) { return stream << static_cast<float>(value); }

} // namespace ORVO
