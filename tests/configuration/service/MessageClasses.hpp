#pragma once

#include <gtest/gtest.h>

#include <tuple>
#include <type_traits>
#include <utility>

#include "configuration/service/MessageTypes.hpp"

namespace velkor::testing {

template <class Rows>
struct ClassesOf;

template <class... Rows>
struct ClassesOf<const std::tuple<Rows...>> {
    using All = ::testing::Types<typename Rows::Class...>;
    using Requests = decltype(std::tuple_cat(
        std::declval<std::conditional_t<Rows::isRequest, std::tuple<Rows>, std::tuple<>>>()...));
};

/// The classes of all message types, and of those that are requests, as lists for typed tests: what
/// holds for each message is asked of a new one without a further line.
using EveryMessageClass = ClassesOf<decltype(configuration::messageTypes)>::All;
using EveryRequestClass =
    ClassesOf<const ClassesOf<decltype(configuration::messageTypes)>::Requests>::All;

}  // namespace velkor::testing
