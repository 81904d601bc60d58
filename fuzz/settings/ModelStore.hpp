#pragma once

#include <cstdint>
#include <functional>
#include <list>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/Option.hpp"

namespace velkor::fuzz::settings {

/// What is told of a key that has changed.
struct ModelChange {
    std::string key;
    std::optional<configuration::Option> option;
    std::uint64_t version;
};

/// Who is told of changes: one after the other, the newest of each key, also of those that are made
/// meanwhile.
class ModelListener {
public:
    virtual ~ModelListener() = default;

    /// Adds `changes` to those that wait, all of them before any is taken.
    void tell(std::vector<ModelChange> changes);

protected:
    virtual void take(const ModelChange& change) = 0;

    bool hasEnded = false;

private:
    void add(ModelChange&& change);

    std::list<ModelChange> waiting;
    bool isTaking = false;
};

/// A store: tables, one behind the other, and who is told of their changes.
class ModelStore {
public:
    struct Table {
        std::string name;
        std::map<std::string, configuration::ConfigurationValue> values{};
    };
    using Tables = std::list<Table>;

    std::optional<configuration::Option> find(const std::string& key) const;
    std::uint64_t version() const { return changes; }

    void set(const std::string& table, const std::string& key,
             const configuration::ConfigurationValue& value);
    void unset(const std::string& key);
    void setBoth(const configuration::ConfigurationValue& a,
                 const configuration::ConfigurationValue& b);

    /// Puts a table in front of all.
    Tables::iterator add(const std::string& key, const configuration::ConfigurationValue& value);
    void remove(Tables::iterator table, const std::string& key);

    std::weak_ptr<ModelListener> listener{};

private:
    Table& called(const std::string& name);
    void tell(const std::vector<std::string>& keys);

    Tables tables{{"override"}, {"default"}};
    std::uint64_t changes = 0;
};

}  // namespace velkor::fuzz::settings
