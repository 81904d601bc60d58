#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <unordered_map>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/sources/ValueTable.hpp"
#include "layers/etcd/detail/Outbox.hpp"

namespace velkor::layers::etcd {

/// A value that a key gets, or none.
struct KeyUpdate {
    std::string key;
    std::optional<configuration::ConfigurationValue> value{};
};

/// Makes one table of what the server has and what this source has written and the server has not
/// answered. A key shows what was written last here until that is answered, and from then on what
/// the server has, which never goes back in revision.
///
/// Not thread-safe: every function is called while the source changes its table, with its own mutex
/// held. Those that give keys give those whose values have changed. The functions that settle a
/// group may be called again, with the same `changed`, when they throw `std::bad_alloc`.
class Replica {
public:
    using Table = configuration::ValueTable;
    using Value = configuration::ConfigurationValue;
    using Keys = std::vector<std::string>;

    /// The revision up to which the table holds all that the server has.
    std::int64_t revision() const noexcept { return current; }

    /// What is known of `key` here.
    KeyChange::Condition seen(const Table& table, const std::string& key) const;

    /// Makes the table that of the server in `newRevision`. Of an older one than those before only
    /// where the server begins anew, with the history of another one.
    Keys replaceAll(Table& table, configuration::ValueMap&& values, std::int64_t newRevision,
                    bool beginsAnew);

    /// Makes the changes of the next revision. Without memory nothing has changed.
    Keys update(Table& table, std::vector<KeyUpdate>&& updates, std::int64_t newRevision);

    /// A write of this source, which the server is to answer. Without memory nothing has changed.
    void write(Table& table, const std::string& key, std::optional<Value> value);

    /// The server has taken the group in `newRevision`.
    void take(Table& table, const Group& group, std::int64_t newRevision, Keys& changed);

    /// The server has not taken the group.
    void refuse(Table& table, const Group& group, Keys& changed);

    /// In `newRevision` the server had `found`, whether or not it has taken the group.
    void settle(Table& table, const Group& group, const std::vector<KeyUpdate>& found,
                std::int64_t newRevision, Keys& changed);

    /// What the server has.
    configuration::ValueMap serverValues(const Table& table) const;

private:
    /// A key with writes that the server has not answered.
    struct Unanswered {
        std::size_t writes = 0;
        std::optional<Value> serverValue{};
        std::int64_t revision = 0;  ///< Of that value, if it is newer than the first of the writes.
        std::int64_t answered = 0;  ///< The number of the last group that the server has answered.
    };
    using UnansweredKeys = std::unordered_map<std::string, Unanswered>;

    bool isAhead(const std::string& key, std::int64_t ofRevision) const;
    void forgetPassed();
    void answer(Table& table, UnansweredKeys::iterator entry, const Group& group, Keys& changed);
    void noteServerValue(Unanswered& entry, std::optional<Value> value, std::int64_t ofRevision);

    std::int64_t current = 0;
    UnansweredKeys unanswered;
    // Keys whose values are of a later revision than the table: those that this source wrote.
    std::unordered_map<std::string, std::int64_t> ahead;
};

}  // namespace velkor::layers::etcd
