#pragma once

#include <array>
#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/sources/JournaledSource.hpp"
#include "framework/common/Export.hpp"

namespace velkor::layers {

/// How a write came about.
enum class JournalAction {
    set,      ///< A value was set, for good or for a time.
    unset,    ///< The key was unset.
    undo,     ///< A former change was undone.
    expired,  ///< The time of the value was over.
    other,    ///< In a way that this version doesn't know.
};

/// The names of the actions, which are those in the file.
inline constexpr std::array<std::pair<JournalAction, std::string_view>, 5> journalActions{{
    {JournalAction::set, "set"},
    {JournalAction::unset, "unset"},
    {JournalAction::undo, "undo"},
    {JournalAction::expired, "expired"},
    {JournalAction::other, "other"},
}};

/// The name of `action`.
constexpr std::string_view nameOf(JournalAction action) noexcept {
    for (const auto& named : journalActions) {
        if (named.first == action) return named.second;
    }
    return "other";
}

/// One write of a `SqliteSource`.
struct JournalEntry {
    std::int64_t change = 0;  ///< Its number: grows with every write, never used twice.
    std::chrono::system_clock::time_point when{};  ///< In whole microseconds.
    std::string author{};
    JournalAction action = JournalAction::set;
    std::string key{};
    std::optional<configuration::ConfigurationValue> before{};  ///< Nothing: it had no value.
    std::optional<configuration::ConfigurationValue> after{};   ///< Nothing: it has none since.

    /// False when a value is of a kind that this version doesn't know. It stands as narrow text
    /// then, the bytes that are in the file.
    bool known = true;
};

/// `entry` as a change of any source.
VELKOR_EXPORT configuration::RecordedChange recorded(JournalEntry&& entry);

}  // namespace velkor::layers
