#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/Option.hpp"

namespace velkor::configuration {

/// Several keys as they were at one moment.
struct Reading {
    /// Grows with every change of the store, so that of two readings the one with the greater
    /// version is the newer one, and readings of the same version are equal.
    std::uint64_t version = 0;

    /// The effective value of each key that was asked for, in that order; nothing where there is
    /// none.
    std::vector<std::optional<Option>> options{};
};

/// A key that is to be set or unset.
struct Change {
    std::string key;
    std::optional<ConfigurationValue> value{};  ///< Nothing: the key is unset.
    std::optional<std::string> source{};        ///< Nothing: the first writable source.
};

/// A change that was made, or that would be.
struct AppliedChange {
    std::string key;
    std::string source;                          ///< The source that it goes to.
    std::optional<ConfigurationValue> before{};  ///< What that source held for the key.
};

/// What is effective for a key after it has changed.
struct OptionChange {
    std::string key;                 ///< The full key.
    std::optional<Option> option{};  ///< Nothing: no source has the key any more.
    std::uint64_t version = 0;       ///< That of the store when this was read; see `Reading`.
};

}  // namespace velkor::configuration
