#include "fuzz/settings/ModelStore.hpp"

#include <algorithm>
#include <utility>

namespace velkor::fuzz::settings {

using configuration::ConfigurationValue;
using configuration::Option;

void ModelListener::add(ModelChange&& change) {
    const auto same = std::find_if(waiting.begin(), waiting.end(),
                                   [&](const auto& each) { return each.key == change.key; });
    if (same != waiting.end()) {
        *same = std::move(change);
    } else {
        waiting.push_back(std::move(change));
    }
}

void ModelListener::tell(std::vector<ModelChange> changes) {
    for (auto& change : changes) add(std::move(change));
    if (std::exchange(isTaking, true)) return;
    while (!waiting.empty() && !hasEnded) {
        const ModelChange next = std::move(waiting.front());
        waiting.pop_front();
        take(next);
    }
    isTaking = false;
}

std::optional<Option> ModelStore::find(const std::string& key) const {
    for (const Table& table : tables) {
        const auto found = table.values.find(key);
        if (found != table.values.end()) return Option{key, table.name, found->second};
    }
    return std::nullopt;
}

ModelStore::Table& ModelStore::called(const std::string& name) {
    return *std::find_if(tables.begin(), tables.end(),
                         [&](const Table& table) { return table.name == name; });
}

void ModelStore::tell(const std::vector<std::string>& keys) {
    std::vector<ModelChange> told;
    for (const auto& key : keys) told.push_back({key, find(key), changes});
    if (const auto open = listener.lock()) open->tell(std::move(told));
}

void ModelStore::set(const std::string& table, const std::string& key,
                     const ConfigurationValue& value) {
    called(table).values[key] = value;
    ++changes;
    tell({key});
}

void ModelStore::unset(const std::string& key) {
    if (called("override").values.erase(key) == 0) return;
    ++changes;
    tell({key});
}

void ModelStore::setBoth(const ConfigurationValue& a, const ConfigurationValue& b) {
    called("override").values["a"] = a;
    called("override").values["b"] = b;
    ++changes;
    tell({"a", "b"});
}

ModelStore::Tables::iterator ModelStore::add(const std::string& key,
                                             const ConfigurationValue& value) {
    const auto added = tables.insert(tables.begin(), Table{"test override", {{key, value}}});
    ++changes;
    tell({key});
    return added;
}

void ModelStore::remove(Tables::iterator table, const std::string& key) {
    tables.erase(table);
    ++changes;
    tell({key});
}

}  // namespace velkor::fuzz::settings
