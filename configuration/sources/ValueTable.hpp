#pragma once

#include <optional>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/StoreErrors.hpp"

namespace velkor::configuration {

/// The table that a source keeps its values in. A value stays where it is until its key is removed.
/// Concurrent calls of the const members are safe, as on any container.
class ValueTable {
public:
    /// Takes over the entries of `values`, which is left empty.
    explicit ValueTable(ValueMap&& values) { entries.swap(values); }

    /// The value of `key`, or null.
    const ConfigurationValue* find(const std::string& key) const {
        const auto found = entries.find(key);
        return found == entries.end() ? nullptr : &found->second;
    }

    /// As above, for writing.
    ConfigurationValue* find(const std::string& key) {
        const auto found = entries.find(key);
        return found == entries.end() ? nullptr : &found->second;
    }

    /// A copy of the value of `key`; `std::out_of_range` "_Map_base::at" when there is none.
    ConfigurationValue at(const std::string& key) const {
        const ConfigurationValue* value = find(key);
        if (value == nullptr) throw std::out_of_range(store_errors::notInTable);
        return *value;
    }

    /// Stores `value` under `key`, which is new.
    void insert(const std::string& key, ConfigurationValue&& value) {
        entries.emplace(key, std::move(value));
    }

    /// Removes `key` and gives its value, if it was there.
    std::optional<ConfigurationValue> take(const std::string& key) {
        auto entry = entries.extract(key);
        if (entry.empty()) return std::nullopt;
        return std::move(entry.mapped());
    }

    /// All keys, sorted byte by byte.
    std::set<std::string> keys() const {
        std::set<std::string> sorted;
        for (const auto& entry : entries) sorted.insert(entry.first);
        return sorted;
    }

    /// Calls `visit` with each key, in no order; it must not change the table.
    template <class Visit>
    void forEachKey(Visit&& visit) const {
        for (const auto& entry : entries) visit(entry.first);
    }

private:
    ValueMap entries;
};

}  // namespace velkor::configuration
