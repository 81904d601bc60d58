#pragma once

#include <chrono>
#include <cstdint>
#include <string>
#include <string_view>
#include <type_traits>

#include "settings/detail/Numbers.hpp"
#include "settings/detail/Quantity.hpp"
#include "settings/detail/TypeTraits.hpp"

namespace velkor::settings::detail {

/// Whether `T` is a duration that counts whole ticks.
template <class T>
inline constexpr bool isWholeDuration = false;
template <class Count, class Tick>
inline constexpr bool isWholeDuration<std::chrono::duration<Count, Tick>> = isWholeNumber<Count>;

template <class T>
inline constexpr bool isTruth = std::is_same_v<T, bool>;

template <class Count, class Tick>
constexpr Ratio tickOf(const std::chrono::duration<Count, Tick>&) noexcept {
    return {std::uint64_t{Tick::num}, std::uint64_t{Tick::den}};
}

/// Whether `left` is at most `right`: by what they mean, integers and durations of different types
/// too, where the language's own comparison converts them first and may lose a sign or overflow.
/// A number that is not one (NaN) is neither at most another nor at least.
template <class Left, class Right>
bool isAtMost(const Left& left, const Right& right) {
    if constexpr (isWholeNumber<Left> && isWholeNumber<Right>) {
        return isAtMost(Whole::of(left), {1, 1}, Whole::of(right), {1, 1});
    } else if constexpr (isWholeDuration<Left> && isWholeDuration<Right>) {
        return isAtMost(Whole::of(left.count()), tickOf(left), Whole::of(right.count()),
                        tickOf(right));
    } else if constexpr (std::is_arithmetic_v<Left> && std::is_arithmetic_v<Right>) {
        static_assert(!isTruth<Left> && !isTruth<Right>, "truth values are not in any order");
        using Common = std::common_type_t<Left, Right>;
        return static_cast<Common>(left) <= static_cast<Common>(right);
    } else if constexpr (isDuration<Left> && isDuration<Right>) {
        return left <= right;
    } else {
        return !(right < left);
    }
}

/// Whether the two mean the same.
template <class Left, class Right>
bool isSame(const Left& left, const Right& right) {
    constexpr bool areNumbers = std::is_arithmetic_v<Left> && std::is_arithmetic_v<Right>;
    constexpr bool areDurations = isDuration<Left> && isDuration<Right>;
    if constexpr ((areNumbers && !isTruth<Left> && !isTruth<Right>) || areDurations) {
        return isAtMost(left, right) && isAtMost(right, left);
    } else {
        return left == right;
    }
}

// How a rule keeps a bound that is given as `T`: texts as strings of their own.
template <class T>
struct KeptAs {
    using Type = T;
};
template <>
struct KeptAs<const char*> {
    using Type = std::string;
};
template <>
struct KeptAs<std::string_view> {
    using Type = std::string;
};
template <>
struct KeptAs<const char16_t*> {
    using Type = std::u16string;
};

template <class T>
using Kept = typename KeptAs<T>::Type;

}  // namespace velkor::settings::detail
