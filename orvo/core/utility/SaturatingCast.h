#pragma once

#include <limits>
#include <type_traits>

namespace ORVO {

/// Converts a number to an integer type without ever leaving defined behaviour. A floating-point number is
/// truncated towards zero; numbers beyond the target's range, infinities included, give its nearest bound;
/// NaN gives 0. Threads: any.
template <typename Int, typename Number>
constexpr Int saturatingCast(Number value) noexcept {
    static_assert(std::is_integral_v<Int> && !std::is_same_v<Int, bool>, "the target is an integer type");
    static_assert(std::is_arithmetic_v<Number>, "the source is a number");
    using Limits = std::numeric_limits<Int>;
    if constexpr (std::is_floating_point_v<Number>) {
        // One past the largest value is a power of two and thus exact in every floating-point type, unlike
        // the largest value itself.
        constexpr Int halfBeyond = Limits::max() / 2 + 1;
        constexpr Number beyond = static_cast<Number>(halfBeyond) * Number(2);
        constexpr Number lowest = static_cast<Number>(Limits::min());
        if (value != value)
            return 0;
        if (value >= beyond)
            return Limits::max();
        if (value <= lowest)
            return Limits::min();
        return static_cast<Int>(value);
    } else {
        if constexpr (std::is_signed_v<Number>) {
            if (value < 0) {
                if constexpr (std::is_signed_v<Int>)
                    return static_cast<long long>(value) < static_cast<long long>(Limits::min())
                               ? Limits::min()
                               : static_cast<Int>(value);
                else
                    return 0;
            }
        }
        return static_cast<unsigned long long>(value) > static_cast<unsigned long long>(Limits::max())
                   ? Limits::max()
                   : static_cast<Int>(value);
    }
}

} // namespace ORVO
