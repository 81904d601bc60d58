#pragma once

#include <optional>

#include "settings/detail/Quantity.hpp"

namespace velkor::settings::detail {

/// Wide enough for every product of two integers of 64 bits.
__extension__ typedef unsigned __int128 Wide;

/// `left * right`, or nothing if that is too large.
inline std::optional<Wide> product(Wide left, Wide right) noexcept {
    Wide result = 0;
    if (__builtin_mul_overflow(left, right, &result)) return std::nullopt;
    return result;
}

inline Wide greatestDivisor(Wide left, Wide right) noexcept {
    while (right != 0) {
        const Wide rest = left % right;
        left = right;
        right = rest;
    }
    return left;
}

/// A ratio of two of those, in its lowest terms.
struct WideRatio {
    Wide numerator;
    Wide denominator;

    /// How often `part` goes into `whole`.
    static WideRatio between(Ratio whole, Ratio part) noexcept {
        const Wide numerator = Wide{whole.numerator} * part.denominator;
        const Wide denominator = Wide{whole.denominator} * part.numerator;
        const Wide divisor = greatestDivisor(numerator, denominator);
        return {numerator / divisor, denominator / divisor};
    }

    bool isOne() const noexcept { return numerator == 1 && denominator == 1; }
};

}  // namespace velkor::settings::detail
