#include "layers/detail/TableChange.hpp"

#include <utility>

namespace velkor::layers::detail {

using configuration::ValueMap;
using configuration::ValueTable;

TableChange::TableChange(const ValueTable& before, std::size_t sizeBefore, ValueMap&& after)
    : size(after.size()) {
    std::size_t kept = 0;
    for (const auto& entry : after) {
        if (before.find(entry.first) != nullptr) ++kept;
    }
    // Most often every key is still there.
    if (kept < sizeBefore) {
        for (const auto& key : before.keys()) {
            if (after.count(key) == 0) removed.push_back(key);
        }
    }
    dropped.reserve(removed.size());

    for (auto entry = after.begin(); entry != after.end();) {
        const auto current = entry++;
        const auto* const present = before.find(current->first);
        if (present != nullptr && *present == current->second) continue;
        keys.push_back(current->first);
        (present == nullptr ? added : replaced).push_back(after.extract(current));
    }
    keys.insert(keys.end(), removed.begin(), removed.end());
}

std::vector<std::string> TableChange::applyTo(ValueTable& table) {
    insertAdded(table);
    for (auto& node : replaced) std::swap(*table.find(node.key()), node.mapped());
    for (const auto& key : removed) {
        if (auto value = table.take(key)) dropped.push_back(std::move(*value));
    }
    return std::move(keys);
}

// The only step that needs memory.
void TableChange::insertAdded(ValueTable& table) {
    std::size_t count = 0;
    try {
        for (; count < added.size(); ++count) {
            table.insert(added[count].key(), std::move(added[count].mapped()));
        }
    } catch (...) {
        while (count > 0) table.take(added[--count].key());
        throw;
    }
}

}  // namespace velkor::layers::detail
