#pragma once

#include <set>
#include <string>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::configuration {

/// The keys of `table`, sorted byte by byte.
inline std::set<std::string> sortedKeys(const ValueMap& table) {
    std::set<std::string> keys;
    for (const auto& entry : table) keys.insert(entry.first);
    return keys;
}

}  // namespace velkor::configuration
