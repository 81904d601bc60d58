#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "layers/sqlite/JournalEntry.hpp"
#include "layers/sqlite/detail/Connection.hpp"
#include "layers/sqlite/detail/Statement.hpp"
#include "layers/sqlite/detail/Time.hpp"

namespace velkor::layers::detail {

/// The journal of one database. All functions throw `std::runtime_error` with the cause when SQLite
/// refuses.
class Journal {
public:
    /// `connection` must live as long; its schema is up to date.
    explicit Journal(Connection& connection);

    /// Notes a write that is made next. What was there before it is taken from the database.
    void add(const JournalEntry& entry);

    /// Drops all but the newest `count` entries, and those from before `oldest`, except the newest
    /// of all, which has the number `newest`.
    void trim(std::int64_t newest, std::size_t count, Time oldest);

    /// The number of the newest entry; 0 when there is none.
    std::int64_t newestChange();

    /// The entry with that number, if it is there.
    std::optional<JournalEntry> find(std::int64_t change);

    /// At most `limit` entries, newest first, of one key; of all that it begins when it ends in
    /// "."; of all when it is empty.
    std::vector<JournalEntry> read(const std::string& keyOrPrefix, std::size_t limit);

private:
    Statement insertion;
    Statement trimming;
    Statement newestOne;
    Statement one;
    Statement range;
};

}  // namespace velkor::layers::detail
