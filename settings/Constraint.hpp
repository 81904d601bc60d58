#pragma once

#include <functional>
#include <initializer_list>
#include <optional>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "settings/Converted.hpp"
#include "settings/Rule.hpp"
#include "settings/detail/Rules.hpp"
#include "settings/detail/TypeTraits.hpp"

namespace velkor::settings {

/// What the values of a setting of type `T` must be, made of a rule; anything, if
/// default-constructed. An optional type's nothing is always right; the rule is for its values.
/// Immutable, so safe for concurrent use, as far as a predicate given to `matching` is.
template <class T>
class Constraint {
public:
    Constraint() = default;

    template <class Given, std::enable_if_t<isRule<Given>, int> = 0>
    Constraint(Given rule)
        : text(rule.description()),
          refusalOf([rule = std::move(rule)](const T& value) { return refused(rule, value); }) {}

    /// "between 1 and 65535"; empty if anything is right.
    const std::string& description() const noexcept { return text; }

    /// Why `value` is not right: "not between 1 and 65535"; nothing if it is. Like any reason it
    /// does not repeat the value. Throws what a predicate given to `matching` throws.
    std::optional<Reason> check(const T& value) const {
        return refusalOf ? refusalOf(value) : std::nullopt;
    }

private:
    template <class Given>
    static std::optional<Reason> refused(const Given& rule, const T& value) {
        if constexpr (detail::isOptional<T>) {
            return value ? rule.check(*value) : std::nullopt;
        } else {
            return rule.check(value);
        }
    }

    std::string text;
    std::function<std::optional<Reason>(const T&)> refusalOf;
};

// Bounds are compared by what they mean, whatever their types are: `between(1, 65535)` is right for
// `std::uint16_t` and for `double`, `between(1s, 1h)` for milliseconds. A bound is described as a
// setting of its type is shown.

/// "at least 1", refused with "not at least 1".
template <class Low>
auto atLeast(Low low) {
    return detail::AtLeast<detail::Kept<Low>>(std::move(low));
}

/// "at most 10MiB", refused with "not at most 10MiB".
template <class High>
auto atMost(High high) {
    return detail::AtMost<detail::Kept<High>>(std::move(high));
}

/// "between 1 and 65535", both included, refused with "not between 1 and 65535". Throws
/// `std::invalid_argument` "No value is between the given bounds." if `high` is below `low`.
template <class Low, class High>
auto between(Low low, High high) {
    detail::Between<detail::Kept<Low>, detail::Kept<High>> rule(std::move(low), std::move(high));
    if (!detail::isAtMost(rule.low, rule.high)) {
        throw std::invalid_argument("No value is between the given bounds.");
    }
    return rule;
}

/// "one of: red, green", refused with "not one of: red, green".
template <class Choice>
auto oneOf(std::initializer_list<Choice> choices) {
    using Kept = detail::Kept<Choice>;
    return detail::OneOf<Kept>(std::vector<Kept>(choices.begin(), choices.end()));
}

template <class Choice>
auto oneOf(std::vector<Choice> choices) {
    return detail::OneOf<Choice>(std::move(choices));
}

/// "not empty", for texts and lists; refused with "empty".
inline auto notEmpty() {
    return detail::NotEmpty();
}

/// What `predicate` calls right, described by the caller: of "a power of two" it is refused with
/// "not a power of two". The predicate may be called by several threads at once.
template <class Predicate>
auto matching(std::string description, Predicate predicate) {
    return detail::Matching<Predicate>(std::move(description), std::move(predicate));
}

/// What each element of a list must be: "each at least 1", refused with "element 2: not at least
/// 1", the first that is not.
template <class Given, std::enable_if_t<isRule<Given>, int> = 0>
auto each(Given rule) {
    return detail::Each<Given>(std::move(rule));
}

/// Both, the first before the second: "at least 1, a power of two", refused with the reason of the
/// first that does not hold.
template <class First, class Second, std::enable_if_t<isRule<First> && isRule<Second>, int> = 0>
auto operator&&(First first, Second second) {
    return detail::Both<First, Second>(std::move(first), std::move(second));
}

}  // namespace velkor::settings
