#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/common/Export.hpp"

namespace velkor::settings {

/// A key that the process has declared, by a `Setting` or a field of a `Bound`, and how it stands.
struct Description {
    std::string key;
    std::string type;                          ///< "int", "duration in milliseconds"
    std::optional<std::string> defaultText{};  ///< ••• if it is secret.
    std::optional<std::string> value{};  ///< ••• if it is secret; nothing if there is none.
    std::string source;                  ///< Empty: the default.
    std::string constraint;              ///< "between 1 and 65535"; empty if there is none.
    std::string description;
    bool secret = false;  ///< By this setting or by another one of the key; see `secretKeys`.
    bool needsRestart = false;

    /// As in `Status`, of a struct that of the whole. ••• if it may repeat a value that is secret
    /// by another setting.
    std::optional<std::string> error{};
};

/// All settings of `store` that there are now, by key; those of the same key in no order. Calls no
/// store. Thread-safe.
VELKOR_EXPORT std::vector<Description> describe(
    const std::shared_ptr<configuration::ConfigurationImpl>& store);

/// The settings of `key` alone: what this takes does not grow with the number of other settings.
VELKOR_EXPORT std::vector<Description> describe(
    const std::shared_ptr<configuration::ConfigurationImpl>& store, const std::string& key);

/// A key of a store that no setting has.
struct UndeclaredKey {
    std::string key;
    std::optional<std::string> meant{};  ///< The declared key that it is a near miss of, if any.
};

/// The keys of `store` that nobody has declared, sorted. A near miss is the nearest declared key
/// that differs in the case of letters, "-", "_" or ".", or otherwise in at most two characters, in
/// keys of less than eight in one: inserted, left out, replaced, or two neighbours exchanged.
/// Compares each with all declared keys. Throws what sources throw. Thread-safe.
VELKOR_EXPORT std::vector<UndeclaredKey> undeclaredKeys(
    const std::shared_ptr<configuration::ConfigurationImpl>& store);

}  // namespace velkor::settings
