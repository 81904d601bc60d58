#pragma once

#include <array>
#include <boost/variant/apply_visitor.hpp>
#include <boost/variant/get.hpp>
#include <boost/variant/variant.hpp>
#include <cstddef>
#include <string>
#include <string_view>
#include <tuple>
#include <unordered_map>
#include <vector>

namespace velkor::configuration {

namespace detail {

/// One kind of value: its type and the tag that names it.
template <class T>
struct ValueKind {
    using Type = T;
    std::string_view tag;
};

/// The kinds of value, one row each. The position of a row is its index, `which()`, and part of the
/// interface: rows are never reordered.
inline constexpr std::tuple valueKinds{
    ValueKind<bool>{"bool"},
    ValueKind<int>{"int"},
    ValueKind<unsigned int>{"uint"},
    ValueKind<double>{"double"},
    ValueKind<std::u16string>{"ustring"},
    ValueKind<std::string>{"string"},
    ValueKind<std::vector<bool>>{"boolArray"},
    ValueKind<std::vector<int>>{"intArray"},
    ValueKind<std::vector<unsigned int>>{"uintArray"},
    ValueKind<std::vector<double>>{"doubleArray"},
    ValueKind<std::vector<std::string>>{"stringArray"},
    ValueKind<std::vector<std::u16string>>{"ustringArray"},
};

template <class Kinds>
struct VariantOver;

template <class... Kinds>
struct VariantOver<const std::tuple<Kinds...>> {
    using Type = boost::variant<typename Kinds::Type...>;
};

}  // namespace detail

/// The value of a key: one of twelve kinds, owned and deeply copied. A default value is `false`.
///
/// Texts are UTF-16 (`std::u16string`) or narrow (`std::string`, UTF-8 by convention, kept byte for
/// byte); neither is ever converted into the other. Write `std::string("text")`: a bare character
/// literal is a pointer and would make a `bool`.
using ConfigurationValue = detail::VariantOver<decltype(detail::valueKinds)>::Type;

/// The tag of each kind of value, indexed by `ConfigurationValue::which()`.
inline constexpr auto typeTags = std::apply(
    [](const auto&... kind) { return std::array<std::string_view, sizeof...(kind)>{kind.tag...}; },
    detail::valueKinds);

/// Calls `visit` with the row of each kind, in index order.
template <class Visit>
constexpr void forEachValueKind(Visit&& visit) {
    std::apply([&](const auto&... kind) { (visit(kind), ...); }, detail::valueKinds);
}

/// A table from key to value.
using ValueMap = std::unordered_map<std::string, ConfigurationValue>;

}  // namespace velkor::configuration
