#pragma once

#include <string>
#include <utility>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::configuration {

/// The value of a key together with the source that supplied it. Owns all it holds, so it outlives
/// the source and the store.
struct Option {
    Option(std::string optionKey, std::string sourceName, ConfigurationValue optionValue)
        : key(std::move(optionKey)), source(std::move(sourceName)), value(std::move(optionValue)) {}

    std::string key;           ///< The full key, as the caller asked for it.
    std::string source;        ///< The name of the source, not its group.
    ConfigurationValue value;  ///< A copy of what the source holds.
};

}  // namespace velkor::configuration
