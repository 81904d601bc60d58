#pragma once

#include <exception>
#include <stdexcept>
#include <string>

#include "tests/stress/Race.hpp"

namespace velkor::testing {

// What futures and promises say when they refuse.
constexpr auto alreadyTaken =
    "Future already returned it's value or has an associated continuation.";
constexpr auto alreadyResolved = "Promise already resolved.";
constexpr auto brokenPromise = "Promise destroyed before it provided a value.";

/// How often each race of futures is run, each round with a thread of its own; by hand as often as
/// the races of streams.
inline int raceRounds() {
    return stressRounds(500);
}

inline std::exception_ptr invalidArgument(const std::string& text) {
    return std::make_exception_ptr(std::invalid_argument(text));
}

}  // namespace velkor::testing
