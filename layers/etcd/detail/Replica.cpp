#include "layers/etcd/detail/Replica.hpp"

#include <algorithm>
#include <set>
#include <utility>

#include "layers/detail/TableChange.hpp"
#include "layers/etcd/detail/ValueText.hpp"

namespace velkor::layers::etcd {

using configuration::ConfigurationValue;
using configuration::ValueMap;
using configuration::ValueTable;

namespace {

using Keys = Replica::Keys;

bool isSame(const ConfigurationValue* present, const std::optional<ConfigurationValue>& value) {
    if (present == nullptr || !value) return present == nullptr && !value;
    return *present == *value;
}

/// Gives `key` a value, or none. Without memory nothing has changed.
void replace(ValueTable& table, const std::string& key, std::optional<ConfigurationValue> value) {
    if (!value) {
        table.take(key);
    } else if (ConfigurationValue* present = table.find(key)) {
        present->swap(*value);
    } else {
        table.insert(key, std::move(*value));
    }
}

/// Makes all of `updates`, each of which changes something, or nothing without memory.
Keys replaceTogether(ValueTable& table, std::vector<KeyUpdate>& updates) {
    Keys keys;
    keys.reserve(updates.size());
    for (const KeyUpdate& update : updates) keys.push_back(update.key);
    std::vector<const std::string*> added;
    added.reserve(updates.size());
    try {
        for (KeyUpdate& update : updates) {
            if (!update.value || table.find(update.key) != nullptr) continue;
            table.insert(update.key, ConfigurationValue(*update.value));
            added.push_back(&update.key);
        }
    } catch (...) {
        for (const std::string* key : added) table.take(*key);
        throw;
    }
    for (KeyUpdate& update : updates) replace(table, update.key, std::move(update.value));
    return keys;
}

std::set<std::string> keysOf(const Group& group) {
    std::set<std::string> keys;
    for (const Write& write : group.writes) keys.insert(write.key);
    return keys;
}

const Write& lastOf(const Group& group, const std::string& key) {
    return *std::find_if(group.writes.rbegin(), group.writes.rend(),
                         [&](const Write& write) { return write.key == key; });
}

std::size_t countOf(const Group& group, const std::string& key) {
    return static_cast<std::size_t>(
        std::count_if(group.writes.begin(), group.writes.end(),
                      [&](const Write& write) { return write.key == key; }));
}

}  // namespace

bool Replica::isAhead(const std::string& key, std::int64_t ofRevision) const {
    const auto found = ahead.find(key);
    return found != ahead.end() && found->second >= ofRevision;
}

void Replica::forgetPassed() {
    for (auto each = ahead.begin(); each != ahead.end();) {
        each = each->second <= current ? ahead.erase(each) : std::next(each);
    }
}

KeyChange::Condition Replica::seen(const Table& table, const std::string& key) const {
    const auto own = ahead.find(key);
    const std::int64_t ownRevision = own == ahead.end() ? 0 : own->second;
    return {std::max(current, ownRevision), table.find(key) != nullptr};
}

Replica::Keys Replica::replaceAll(Table& table, ValueMap&& values, std::int64_t newRevision,
                                  bool beginsAnew) {
    if (beginsAnew) {
        ahead.clear();
        for (auto& each : unanswered) each.second.revision = 0;
    }
    const auto keep = [&](const std::string& key) {
        const ConfigurationValue* const present = table.find(key);
        values.erase(key);
        if (present != nullptr) values.emplace(key, *present);
    };
    for (auto& [key, entry] : unanswered) {
        const auto found = values.find(key);
        if (!isAhead(key, newRevision + 1)) {
            noteServerValue(entry,
                            found == values.end() ? std::nullopt : std::optional(found->second),
                            newRevision);
        }
        keep(key);
    }
    for (const auto& [key, own] : ahead) {
        if (own > newRevision) keep(key);
    }
    layers::detail::TableChange change(table, table.keys().size(), std::move(values));
    Keys changed = change.applyTo(table);
    current = newRevision;
    forgetPassed();
    return changed;
}

Replica::Keys Replica::update(Table& table, std::vector<KeyUpdate>&& updates,
                              std::int64_t newRevision) {
    std::vector<KeyUpdate> shown;
    shown.reserve(updates.size());
    for (KeyUpdate& each : updates) {
        if (isAhead(each.key, newRevision)) continue;
        const auto waiting = unanswered.find(each.key);
        if (waiting != unanswered.end()) {
            noteServerValue(waiting->second, std::move(each.value), newRevision);
        } else if (!isSame(table.find(each.key), each.value)) {
            shown.push_back(std::move(each));
        }
    }
    Keys changed = replaceTogether(table, shown);
    current = newRevision;
    if (!ahead.empty()) forgetPassed();
    return changed;
}

void Replica::write(Table& table, const std::string& key, std::optional<Value> value) {
    const ConfigurationValue* const present = table.find(key);
    auto before = present == nullptr ? std::nullopt : std::optional(*present);
    const auto [entry, isFirst] = unanswered.try_emplace(key);
    try {
        replace(table, key, std::move(value));
    } catch (...) {
        if (isFirst) unanswered.erase(entry);
        throw;
    }
    if (isFirst) entry->second.serverValue = std::move(before);
    ++entry->second.writes;
}

void Replica::noteServerValue(Unanswered& entry, std::optional<Value> value,
                              std::int64_t ofRevision) {
    if (ofRevision < entry.revision) return;
    entry.serverValue = std::move(value);
    entry.revision = ofRevision;
}

// The key shows what the server has once nothing of it is unanswered. Until then it is known which
// group was answered last: after a lack of memory that is done again.
void Replica::answer(Table& table, UnansweredKeys::iterator entry, const Group& group,
                     Keys& changed) {
    if (entry->second.answered < group.number) {
        entry->second.writes -= countOf(group, entry->first);
        entry->second.answered = group.number;
    }
    if (entry->second.writes == 0) {
        if (!isSame(table.find(entry->first), entry->second.serverValue)) {
            changed.push_back(entry->first);
            replace(table, entry->first, entry->second.serverValue);
        }
        unanswered.erase(entry);
    }
}

void Replica::take(Table& table, const Group& group, std::int64_t newRevision, Keys& changed) {
    for (const auto& key : keysOf(group)) {
        const auto entry = unanswered.find(key);
        if (entry == unanswered.end()) continue;
        const auto& text = lastOf(group, key).text;
        if (newRevision > current) ahead[key] = newRevision;
        noteServerValue(entry->second, text ? std::optional(fromValueText(*text)) : std::nullopt,
                        newRevision);
        answer(table, entry, group, changed);
    }
}

void Replica::refuse(Table& table, const Group& group, Keys& changed) {
    for (const auto& key : keysOf(group)) {
        const auto entry = unanswered.find(key);
        if (entry == unanswered.end()) continue;
        answer(table, entry, group, changed);
    }
}

void Replica::settle(Table& table, const Group& group, const std::vector<KeyUpdate>& found,
                     std::int64_t newRevision, Keys& changed) {
    for (const KeyUpdate& each : found) {
        const auto entry = unanswered.find(each.key);
        if (entry == unanswered.end()) continue;
        if (newRevision > current) ahead[each.key] = newRevision;
        noteServerValue(entry->second, each.value, newRevision);
        answer(table, entry, group, changed);
    }
}

ValueMap Replica::serverValues(const Table& table) const {
    ValueMap values;
    for (const auto& key : table.keys()) values.emplace(key, table.at(key));
    for (const auto& [key, entry] : unanswered) {
        values.erase(key);
        if (entry.serverValue) values.emplace(key, *entry.serverValue);
    }
    return values;
}

}  // namespace velkor::layers::etcd
