#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"

namespace velkor::testing {

/// The values of a source by their keys, spelled out.
using SpelledValues = std::map<std::string, std::string>;

inline SpelledValues valuesOf(layers::SqliteSource& source) {
    SpelledValues values;
    for (const std::string& key : source.keys()) values[key] = textOf(source.get(key));
    return values;
}

/// All that the journal of a source holds, oldest first.
inline std::vector<std::string> journalOf(layers::SqliteSource& source) {
    std::vector<std::string> texts = textsOf(source.history("", 100'000));
    std::reverse(texts.begin(), texts.end());
    return texts;
}

/// What a source is to hold.
class StateModel {
public:
    using Value = configuration::ConfigurationValue;
    using Action = layers::JournalAction;
    using Time = HandClock::Time;

    /// One that holds what its author has written by now: all of a journal, newest first.
    explicit StateModel(std::string writer, const std::vector<layers::JournalEntry>& written = {})
        : author(std::move(writer)) {
        for (auto entry = written.rbegin(); entry != written.rend(); ++entry) {
            notes.push_back({*entry, {}});
            hold(notes.size() - 1);
        }
    }

    void set(const std::string& key, const Value& value, std::optional<Time> expires = {}) {
        note(Action::set, key, value, expires);
    }

    /// Says whether there was something to unset.
    bool unset(const std::string& key) {
        if (held.count(key) == 0) return false;
        note(Action::unset, key, std::nullopt);
        return true;
    }

    /// Undoes the entry at that place.
    void undo(std::size_t place) {
        const layers::JournalEntry undone = notes[place].entry;
        note(Action::undo, undone.key, undone.before);
    }

    /// Unsets what is to go by `now`.
    void expire(Time now) {
        std::vector<std::string> keys;
        for (const auto& [key, place] : held) {
            if (notes[place].expires && *notes[place].expires <= now) keys.push_back(key);
        }
        for (const std::string& key : keys) note(Action::expired, key, std::nullopt);
    }

    /// How many entries the journal holds.
    std::size_t size() const { return notes.size(); }

    std::int64_t change(std::size_t place) const { return notes[place].entry.change; }

    /// The journal, oldest first.
    std::vector<std::string> journal() const {
        std::vector<std::string> texts;
        for (const Note& each : notes) texts.push_back(textOf(each.entry));
        return texts;
    }

    /// What `SqliteSource::history` gives while the journal keeps the last `kept` entries.
    std::vector<std::string> history(const std::string& keyOrPrefix, std::size_t limit,
                                     std::size_t kept) const {
        const bool isPrefix = keyOrPrefix.empty() || keyOrPrefix.back() == '.';
        std::vector<std::string> texts;
        for (auto each = notes.rbegin(); each != notes.rend() && kept > 0; ++each, --kept) {
            const std::string& key = each->entry.key;
            const bool isMeant = isPrefix ? key.rfind(keyOrPrefix, 0) == 0 : key == keyOrPrefix;
            if (isMeant && texts.size() < limit) texts.push_back(textOf(each->entry));
        }
        return texts;
    }

    SpelledValues values() const {
        SpelledValues spelled;
        for (const auto& [key, place] : held) spelled[key] = textOf(*notes[place].entry.after);
        return spelled;
    }

    /// Forgets all entries but the first `count`.
    void keep(std::size_t count) {
        notes.resize(count);
        held.clear();
        for (std::size_t place = 0; place < count; ++place) hold(place);
    }

private:
    struct Note {
        layers::JournalEntry entry;
        std::optional<Time> expires;
    };

    void note(Action action, const std::string& key, const std::optional<Value>& after,
              std::optional<Time> expires = {}) {
        layers::JournalEntry entry;
        entry.change = notes.empty() ? 1 : notes.back().entry.change + 1;
        entry.author = author;
        entry.action = action;
        entry.key = key;
        const auto present = held.find(key);
        if (present != held.end()) entry.before = notes[present->second].entry.after;
        entry.after = after;
        notes.push_back({std::move(entry), expires});
        hold(notes.size() - 1);
    }

    void hold(std::size_t place) {
        const layers::JournalEntry& entry = notes[place].entry;
        if (entry.after) {
            held[entry.key] = place;
        } else {
            held.erase(entry.key);
        }
    }

    std::string author;
    std::vector<Note> notes;
    std::map<std::string, std::size_t> held;  ///< The note of each key that has a value.
};

/// Expects the file of `source` to hold what `model` says. Numbers of changes may be left out.
inline void expectFileToHold(layers::SqliteSource& source, const StateModel& model) {
    const auto withoutNumbers = [](std::vector<std::string> journal) {
        for (std::string& entry : journal) entry.erase(0, entry.find(' '));
        return journal;
    };
    EXPECT_EQ(withoutNumbers(journalOf(source)), withoutNumbers(model.journal()));
    EXPECT_EQ(valuesOf(source), model.values());
}

}  // namespace velkor::testing
