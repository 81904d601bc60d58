#pragma once

#include <map>
#include <optional>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>

#include "configuration/StoreErrors.hpp"
#include "fuzz/store/System.hpp"

namespace velkor::fuzz::store {

class ModelStore;

/// A source, of any kind, as a plain table.
class ModelSource {
public:
    using Value = configuration::ConfigurationValue;

    /// A source in memory, or from a file.
    ModelSource(const configuration::ValueMap& content, bool isFromFile)
        : values(content.begin(), content.end()), fromFile(isFromFile) {}

    /// The own source `itsNumber` of `itsSystem`, which reacts as `temper` says.
    ModelSource(System& itsSystem, std::size_t itsNumber)
        : fromFile(false), system(&itsSystem), number(itsNumber) {}

    bool has(const std::string& key) const {
        temper.require(Mood::refusesHas);
        return values.count(key) != 0;
    }

    Value get(const std::string& key) const {
        temper.require(Mood::refusesGet);
        const auto found = values.find(key);
        if (found == values.end()) {
            throw std::out_of_range(configuration::store_errors::notInTable);
        }
        return found->second;
    }

    std::set<std::string> keys() const {
        temper.require(Mood::refusesKeys);
        std::set<std::string> all;
        for (const auto& [key, value] : values) all.insert(key);
        return all;
    }

    bool forgets() const noexcept { return !fromFile; }

    Value set(const std::string& key, const Value& value);
    std::optional<Value> unset(const std::string& key);

    /// The store that is told of changes with `group` in front of the key; null for none.
    void listen(ModelStore* store, const std::string& group);

    Temper temper{};

private:
    void changed(const std::string& key);

    std::map<std::string, Value> values{};
    const bool fromFile;
    System* const system = nullptr;  // null: not an own source
    const std::size_t number = 0;
    ModelStore* told = nullptr;
    std::string prefix{};
};

}  // namespace velkor::fuzz::store
