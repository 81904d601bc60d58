#pragma once

#include <memory>
#include <set>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/common/Export.hpp"

namespace velkor::settings {

/// The keys of `store` that a setting declares secret now, be there others of the same key that do
/// not. For whoever shows values: see `masked`. Calls no store. Thread-safe.
VELKOR_EXPORT std::set<std::string> secretKeys(
    const std::shared_ptr<configuration::ConfigurationImpl>& store);

/// Whether `key` is one of them now, for whoever shows one value: looks at the settings of that key
/// only. Calls no store. Thread-safe.
VELKOR_EXPORT bool isSecret(const std::shared_ptr<configuration::ConfigurationImpl>& store,
                            const std::string& key);

/// What is shown in the place of a secret value.
inline constexpr const char* secretMark = "•••";

/// `text`, or `secretMark` in the place of a secret.
inline std::string masked(bool isSecret, std::string text) {
    if (isSecret) return secretMark;
    return text;
}

}  // namespace velkor::settings
