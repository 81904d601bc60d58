#pragma once

#include <type_traits>

namespace velkor::settings {

/// The base of all rules that values must keep, which is how they are known. A rule has
///
///     std::string description() const;                    // "between 1 and 65535"
///     template <class T>
///     std::optional<Reason> check(const T& value) const;  // nothing if the value is right
///
/// and does not say for which type it is: `between(1, 65535)` is for every number. Rules are
/// immutable; those in `Constraint.hpp` are all made by functions.
struct Rule {};

template <class T>
inline constexpr bool isRule = std::is_base_of_v<Rule, T>;

}  // namespace velkor::settings
