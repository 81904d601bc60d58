#pragma once

#include <chrono>
#include <map>
#include <optional>
#include <string>

namespace velkor::settings {

/// How a setting stands.
struct Status {
    std::string value;   ///< As text, ••• if the setting is secret.
    std::string source;  ///< Empty: the value is the default.
    std::chrono::system_clock::time_point since{};  ///< When this value took effect.
    std::optional<std::string> error{};  ///< Why the store's newest value is not the value.
    bool storeGone = false;              ///< The store is gone, and nothing changes any more.
};

/// How a struct stands.
struct BoundStatus {
    std::map<std::string, Status> fields;  ///< By full key; their `error` is empty.
    std::optional<std::string> error{};    ///< Why the struct is not the store's newest one.
    bool storeGone = false;                ///< The store is gone, and nothing changes any more.
};

}  // namespace velkor::settings
