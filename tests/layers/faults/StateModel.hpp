#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {

/// The values of a source by their keys, spelled out.
using SpelledValues = std::map<std::string, std::string>;

inline SpelledValues valuesOf(layers::SqliteSource& source) {
    SpelledValues values;
    for (const std::string& key : source.keys()) values[key] = textOf(source.get(key));
    return values;
}

inline std::string textOf(const std::optional<configuration::ConfigurationValue>& value) {
    return value ? textOf(*value) : "nothing";
}

/// What an entry says, without its time.
inline std::string textOf(const layers::JournalEntry& entry) {
    return std::to_string(entry.change) + " by " + entry.author + ": action " +
           std::to_string(static_cast<int>(entry.action)) + " on " + entry.key + ", " +
           textOf(entry.before) + " -> " + textOf(entry.after);
}

/// All that the journal of a source holds, oldest first.
inline std::vector<layers::JournalEntry> journalOf(layers::SqliteSource& source) {
    auto journal = source.history("", static_cast<std::size_t>(-1));
    return {std::make_move_iterator(journal.rbegin()), std::make_move_iterator(journal.rend())};
}

/// The values that the journal leads to, or nothing when its entries contradict each other.
inline std::optional<SpelledValues> replayed(const std::vector<layers::JournalEntry>& journal) {
    SpelledValues values;
    for (const auto& entry : journal) {
        const auto present = values.find(entry.key);
        if (textOf(entry.before) != (present == values.end() ? "nothing" : present->second)) {
            return std::nullopt;
        }
        if (entry.after) {
            values[entry.key] = textOf(*entry.after);
        } else {
            values.erase(entry.key);
        }
    }
    return values;
}

/// What a source is to hold.
class StateModel {
public:
    using Value = configuration::ConfigurationValue;
    using Action = layers::JournalAction;

    explicit StateModel(std::string writer) : author(std::move(writer)) {}

    void set(const std::string& key, const Value& value) { note(Action::set, key, value); }

    /// Says whether there was something to unset.
    bool unset(const std::string& key) {
        if (values.count(key) == 0) return false;
        note(Action::unset, key, std::nullopt);
        return true;
    }

    /// Undoes the entry at that place.
    void undo(std::size_t place) {
        const layers::JournalEntry undone = entries[place];
        note(Action::undo, undone.key, undone.before);
    }

    /// The journal, oldest first.
    const std::vector<layers::JournalEntry>& journal() const { return entries; }

    const std::map<std::string, Value>& present() const { return values; }

    /// Forgets all entries but the first `count`: nobody was told that they are kept.
    void keep(std::size_t count) {
        entries.resize(count);
        values.clear();
        for (const auto& entry : entries) store(entry);
    }

private:
    void note(Action action, const std::string& key, const std::optional<Value>& after) {
        layers::JournalEntry entry;
        entry.change = entries.empty() ? 1 : entries.back().change + 1;
        entry.author = author;
        entry.action = action;
        entry.key = key;
        const auto present = values.find(key);
        if (present != values.end()) entry.before = present->second;
        entry.after = after;
        store(entry);
        entries.push_back(std::move(entry));
    }

    void store(const layers::JournalEntry& entry) {
        if (entry.after) {
            values[entry.key] = *entry.after;
        } else {
            values.erase(entry.key);
        }
    }

    const std::string author;
    std::map<std::string, Value> values;
    std::vector<layers::JournalEntry> entries;
};

}  // namespace velkor::testing
