#pragma once

#include <cstdint>
#include <limits>
#include <string>
#include <type_traits>

#include "configuration/ConfigurationValue.hpp"
#include "framework/common/Export.hpp"
#include "settings/Converted.hpp"

namespace velkor::settings::detail {

template <class T, class... Others>
inline constexpr bool isOneOf = (std::is_same_v<T, Others> || ...);

/// Whether `T` is an integer of up to 64 bits that counts. Truth values and characters do not;
/// `signed char` and `unsigned char` are the integers of 8 bits.
template <class T>
inline constexpr bool isWholeNumber =
    std::is_integral_v<T> && sizeof(T) <= sizeof(std::uint64_t) &&
    !isOneOf<std::remove_cv_t<T>, bool, char, wchar_t, char16_t, char32_t>;

/// What has to be added to `number` for the sum to be 0, in 64 bits.
constexpr std::uint64_t complement(std::uint64_t number) noexcept {
    return number == 0 ? 0 : ~number + 1;
}

/// An integer of any type.
struct Whole {
    bool negative = false;
    std::uint64_t magnitude = 0;

    template <class T>
    static constexpr Whole of(T value) noexcept {
        const auto bits = static_cast<std::uint64_t>(value);
        return value < T{0} ? Whole{true, complement(bits)} : Whole{false, bits};
    }

    /// The integer as a `T`, whose range it is in.
    template <class T>
    constexpr T as() const noexcept {
        return static_cast<T>(negative ? complement(magnitude) : magnitude);
    }
};

/// The integers from -`belowZero` to `highest`.
struct WholeRange {
    std::uint64_t belowZero;
    std::uint64_t highest;

    template <class T>
    static constexpr WholeRange of() noexcept {
        return {Whole::of(std::numeric_limits<T>::min()).magnitude,
                static_cast<std::uint64_t>(std::numeric_limits<T>::max())};
    }

    constexpr bool has(Whole whole) const noexcept {
        return whole.magnitude <= (whole.negative ? belowZero : highest);
    }

    /// "not within -128 to 127"
    VELKOR_EXPORT Reason missed() const;
};

/// A truth value: true, false, on, off, yes, no, 1 or 0 in any case.
VELKOR_EXPORT Converted<bool> readBool(const configuration::ConfigurationValue& value);

/// An integer in decimal digits, with a minus if it is negative, within `range`.
VELKOR_EXPORT Converted<Whole> readWhole(const configuration::ConfigurationValue& value,
                                         WholeRange range);

/// A finite number, as `std::from_chars` reads it, rounded to the nearest.
VELKOR_EXPORT Converted<double> readDouble(const configuration::ConfigurationValue& value);
VELKOR_EXPORT Converted<float> readFloat(const configuration::ConfigurationValue& value);

/// The fewest digits that read back as the same number; with an exponent when it is 1e21 and more,
/// or nearer to zero than 1e-6. The same in every locale.
VELKOR_EXPORT std::string showNumber(double number);
VELKOR_EXPORT std::string showNumber(float number);

/// "int", "uint8", "int64" and so on; those of 32 bits are "int" and "uint".
VELKOR_EXPORT std::string nameOfWhole(std::size_t size, bool isSigned);

}  // namespace velkor::settings::detail
