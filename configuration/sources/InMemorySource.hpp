#pragma once

#include <memory>
#include <set>
#include <string>

#include "configuration/sources/ConfigurationSource.hpp"
#include "configuration/sources/ValueTable.hpp"

namespace velkor::configuration {

/// A writable layer held in memory. Not thread-safe by itself: the store serialises all calls.
/// Made by `std::make_shared`.
class VELKOR_EXPORT InMemorySource : public ConfigurationSource,
                                     public std::enable_shared_from_this<InMemorySource> {
public:
    /// Takes over `initialValues`, which is left empty. Starts without a listener.
    explicit InMemorySource(ValueMap&& initialValues);

    /// A copy of the value of `key`; `std::out_of_range` "_Map_base::at" when there is none.
    ConfigurationValue get(const std::string& key) override;

    /// Stores `value`, then calls the listener, whether or not the value is a different one.
    /// Returns the replaced value, or `value` when the key is new. What the listener throws passes
    /// on; the value is stored by then.
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override;

    bool has(const std::string& key) override;
    void setChangeListener(ChangeListener newListener) override;
    std::set<std::string> keys() override;

    /// The values themselves. The store looks them up here: one search instead of `has` and `get`.
    const ValueTable& table() const noexcept { return values; }

private:
    void notify(const std::string& key);

    ValueTable values;
    ChangeListener listener;
};

}  // namespace velkor::configuration
