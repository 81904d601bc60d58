#pragma once

#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "benchmarks/support/Fixtures.hpp"
#include "benchmarks/support/FloorFuture.hpp"

namespace velkor::benchmarks {

/// What a store of this kind costs at least: bare tables that are looked up one after the other
/// under an uncontended recursive mutex, with one key made once, and the two allocations of a
/// future.
class FloorStore {
public:
    FloorStore(std::vector<ValueMap> layers, bool grouped)
        : tables(std::move(layers)), groupSize(grouped ? keyGroup.size() + 1 : 0) {}

    /// One table without a group.
    explicit FloorStore(ValueMap table) : groupSize(0) { tables.push_back(std::move(table)); }

    FloorFuture<ConfigurationValue> get(const std::string& key) {
        const std::lock_guard<std::recursive_mutex> lock(mutex);
        return floorReadyFuture(ConfigurationValue(*find(key)));
    }

    FloorFuture<bool> has(const std::string& key) {
        const std::lock_guard<std::recursive_mutex> lock(mutex);
        return floorReadyFuture(find(key) != nullptr);
    }

    FloorFuture<ConfigurationValue> set(const std::string& key, ConfigurationValue value) {
        const std::lock_guard<std::recursive_mutex> lock(mutex);
        return floorReadyFuture(std::exchange(*find(key), std::move(value)));
    }

private:
    ConfigurationValue* find(const std::string& key) {
        const std::string& relative = groupSize == 0 ? key : scratch.assign(key, groupSize);
        for (auto& table : tables) {
            const auto found = table.find(relative);
            if (found != table.end()) return &found->second;
        }
        return nullptr;
    }

    std::recursive_mutex mutex;
    std::vector<ValueMap> tables;
    std::size_t groupSize;
    std::string scratch;
};

}  // namespace velkor::benchmarks
