#pragma once

#include <memory>
#include <optional>
#include <string>

#include "configuration/sources/ForgettingSource.hpp"
#include "configuration/sources/TableSource.hpp"

namespace velkor::configuration {

/// A writable layer held in memory. Not thread-safe by itself: the store serialises all calls.
/// Made by `std::make_shared`.
class VELKOR_EXPORT InMemorySource : public TableSource,
                                     public ForgettingSource,
                                     public std::enable_shared_from_this<InMemorySource> {
public:
    /// Takes over `initialValues`, which is left empty. Starts without a listener.
    explicit InMemorySource(ValueMap&& initialValues);

    /// Stores `value`, then calls the listener, whether or not the value is a different one.
    /// Returns the replaced value, or `value` when the key is new. What the listener throws passes
    /// on; the value is stored by then.
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override;

    /// Removes `key`, then calls the listener, and gives the removed value; nothing happens when
    /// there is none. What the listener throws passes on; the key is gone by then.
    std::optional<ConfigurationValue> unset(const std::string& key) override;
};

}  // namespace velkor::configuration
