#pragma once

#include <atomic>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::configuration {

/// A table of values that remembers the entry that was found last: the store asks a source for a
/// value right after it asked whether there is one, and the second look-up then needs no hash.
///
/// Concurrent calls of the const members are safe, as on any container. Entries are never removed.
class ValueTable {
public:
    ValueTable() = default;

    /// Takes over the entries of `values`, which is left empty.
    explicit ValueTable(ValueMap&& values) { entries.swap(values); }

    /// The value of `key`, or null.
    const ConfigurationValue* find(const std::string& key) const {
        const Entry* entry = lastFound.load(std::memory_order_relaxed);
        if (entry != nullptr && entry->first == key) return &entry->second;
        const auto found = entries.find(key);
        if (found == entries.end()) return nullptr;
        lastFound.store(&*found, std::memory_order_relaxed);
        return &found->second;
    }

    /// As above, for writing.
    ConfigurationValue* find(const std::string& key) {
        return const_cast<ConfigurationValue*>(std::as_const(*this).find(key));
    }

    /// A copy of the value of `key`; `std::out_of_range` "_Map_base::at" when there is none.
    ConfigurationValue at(const std::string& key) const {
        const ConfigurationValue* value = find(key);
        // The text of the standard library's own look-up depends on its version.
        if (value == nullptr) throw std::out_of_range("_Map_base::at");
        return *value;
    }

    /// Stores `value` under `key`, which is new.
    void insert(const std::string& key, ConfigurationValue&& value) {
        lastFound.store(&*entries.emplace(key, std::move(value)).first, std::memory_order_relaxed);
    }

    /// All keys, sorted byte by byte.
    std::set<std::string> keys() const {
        std::set<std::string> sorted;
        for (const auto& entry : entries) sorted.insert(entry.first);
        return sorted;
    }

private:
    using Entry = ValueMap::value_type;

    ValueMap entries;
    mutable std::atomic<const Entry*> lastFound{nullptr};
};

}  // namespace velkor::configuration
