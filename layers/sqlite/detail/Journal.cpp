#include "layers/sqlite/detail/Journal.hpp"

#include <algorithm>
#include <limits>
#include <string_view>
#include <utility>

#include "layers/detail/ValueCodec.hpp"

namespace velkor::layers::detail {

namespace {

using configuration::ConfigurationValue;

JournalAction actionNamed(std::string_view name) {
    for (const auto& named : journalActions) {
        if (named.second == name) return named.first;
    }
    return JournalAction::other;
}

std::int64_t bounded(std::size_t count) {
    constexpr auto most = static_cast<std::size_t>(std::numeric_limits<std::int64_t>::max());
    return static_cast<std::int64_t>(std::min(count, most));
}

std::optional<ConfigurationValue> valueIn(const Execution& row, int column, bool& known) {
    if (row.isNothing(column)) return std::nullopt;
    auto value = decoded(row.bytes(column));
    if (value) return value;
    known = false;
    return std::string(row.bytes(column));
}

// The first key behind those that are meant: behind a key comes itself with a zero byte, behind all
// that begin with a prefix the prefix with the byte that follows the ".".
std::string endOf(const std::string& keyOrPrefix) {
    std::string end = keyOrPrefix;
    if (!end.empty() && end.back() == '.') {
        end.back() = '.' + 1;
    } else {
        end += '\0';
    }
    return end;
}

JournalEntry entryIn(const Execution& row) {
    JournalEntry entry;
    entry.change = row.number(0);
    entry.when = fromFile(row.number(1));
    entry.author = row.bytes(2);
    entry.action = actionNamed(row.bytes(3));
    entry.key = row.bytes(4);
    entry.before = valueIn(row, 5, entry.known);
    entry.after = valueIn(row, 6, entry.known);
    return entry;
}

}  // namespace

Journal::Journal(Connection& connection)
    : insertion(connection,
                "INSERT INTO journal (change, time, author, action, key, before, after)"
                " VALUES (?1, ?2, ?3, CAST(?4 AS TEXT), ?5,"
                " (SELECT value FROM entries WHERE key = ?5), ?6)"),
      trimming(connection,
               "DELETE FROM journal WHERE change < max(?2, coalesce("
               "(SELECT change FROM journal WHERE time >= ?3 ORDER BY change LIMIT 1), ?1))"
               " AND change < ?1"),
      newestOne(connection, "SELECT max(change) FROM journal"),
      one(connection,
          "SELECT change, time, author, action, key, before, after FROM journal"
          " WHERE change = ?"),
      range(connection,
            "SELECT change, time, author, action, key, before, after FROM journal"
            " WHERE ?3 IS NULL OR (key >= ?2 AND key < ?3) ORDER BY change DESC LIMIT ?1") {}

void Journal::add(const JournalEntry& entry) {
    const std::string after = entry.after ? encoded(*entry.after) : std::string();
    Execution execution(insertion);
    execution.bind(entry.change)
        .bind(toFile(entry.when))
        .bind(entry.author)
        .bind(nameOf(entry.action))
        .bind(entry.key);
    if (entry.after) {
        execution.bind(after);
    } else {
        execution.bindNothing();
    }
    execution.run();
}

void Journal::trim(std::int64_t newest, std::size_t count, Time oldest) {
    Execution(trimming).bind(newest).bind(newest - bounded(count) + 1).bind(toFile(oldest)).run();
}

std::int64_t Journal::newestChange() {
    Execution query(newestOne);
    return query.next() ? query.number(0) : 0;
}

std::optional<JournalEntry> Journal::find(std::int64_t change) {
    Execution query(one);
    if (!query.bind(change).next()) return std::nullopt;
    return entryIn(query);
}

std::vector<JournalEntry> Journal::read(const std::string& keyOrPrefix, std::size_t limit) {
    const std::string behind = endOf(keyOrPrefix);
    Execution query(range);
    query.bind(bounded(limit)).bind(keyOrPrefix);
    if (!keyOrPrefix.empty()) query.bind(behind);
    std::vector<JournalEntry> entries;
    while (query.next()) entries.push_back(entryIn(query));
    return entries;
}

}  // namespace velkor::layers::detail
