#pragma once

#include <chrono>
#include <optional>
#include <type_traits>
#include <vector>

#include "settings/EnumNames.hpp"

namespace velkor::settings::detail {

template <class T>
inline constexpr bool never = false;

template <class T>
inline constexpr bool isDuration = false;
template <class Count, class Tick>
inline constexpr bool isDuration<std::chrono::duration<Count, Tick>> = true;

template <class T>
inline constexpr bool isOptional = false;
template <class T>
inline constexpr bool isOptional<std::optional<T>> = true;

/// Whether `T` is a list, or one that may be missing.
template <class T>
inline constexpr bool isList = false;
template <class T>
inline constexpr bool isList<std::vector<T>> = true;
template <class T>
inline constexpr bool isList<std::optional<T>> = isList<T>;

template <class Enum, class = void>
inline constexpr bool hasNames = false;
template <class Enum>
inline constexpr bool hasNames<Enum, std::void_t<decltype(EnumNames<Enum>::table)>> = true;

}  // namespace velkor::settings::detail
