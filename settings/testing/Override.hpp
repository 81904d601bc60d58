#pragma once

#include <memory>
#include <string>
#include <type_traits>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/common/Export.hpp"
#include "settings/Conversion.hpp"

namespace velkor::settings::testing {

/// For unit tests of programs: gives a key of a store another value for a scope, in front of all
/// sources, and in front of overrides made before. Afterwards the key is what it is without.
///
///     const Override noWaiting(store, "server.timeout", 0s);
///
/// What is written to the key meanwhile goes to the other sources, and shows at the end of the
/// scope. Keeps the store alive. The end waits for the store.
class VELKOR_EXPORT Override {
public:
    /// Overrides `key` with `value`: one of the kinds of the store, a character literal, or of
    /// another type the text that a setting of the type reads.
    template <class T>
    Override(const std::shared_ptr<configuration::ConfigurationImpl>& store, std::string key,
             const T& value)
        : Override(store, std::move(key), valueOf(value), Made()) {}

    /// What sources of others throw meanwhile is logged, and so is that there is no memory: then
    /// the override stays.
    ~Override();

    Override(const Override&) = delete;
    Override& operator=(const Override&) = delete;

private:
    struct Made {};

    Override(const std::shared_ptr<configuration::ConfigurationImpl>& store, std::string key,
             configuration::ConfigurationValue value, Made);

    void end() noexcept;

    template <class T>
    static configuration::ConfigurationValue valueOf(const T& value) {
        using Value = configuration::ConfigurationValue;
        if constexpr (std::is_convertible_v<const T&, std::string>) {
            return std::string(value);
        } else if constexpr (std::is_same_v<T, Value> || std::is_same_v<T, bool> ||
                             std::is_same_v<T, int> || std::is_same_v<T, unsigned> ||
                             std::is_same_v<T, double> || std::is_same_v<T, std::u16string>) {
            return Value(value);
        } else {
            return Conversion<T>::show(value);
        }
    }

    const std::shared_ptr<configuration::ConfigurationImpl> overridden;
    const std::string source;
};

}  // namespace velkor::settings::testing
