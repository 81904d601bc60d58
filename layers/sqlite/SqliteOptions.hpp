#pragma once

#include <chrono>
#include <cstddef>
#include <functional>
#include <string>

namespace velkor::layers {

/// How a `SqliteSource` works.
struct SqliteOptions {
    /// Who writes: stands in the journal, and is named to others that want to write the same file.
    std::string author{};

    /// How long and how many entries the journal keeps at most. The newest one always stays. What
    /// is too old or too much is dropped together with the next write.
    std::chrono::hours keepFor = std::chrono::hours(24 * 366);
    std::size_t keepCount = 10'000;

    /// The SQLite VFS that reads and writes the file; empty: the usual one.
    std::string vfs{};

    /// Tells the time for the journal and for values that expire; empty: the system's. Called from
    /// any thread under locks of the source: it uses neither source nor store.
    std::function<std::chrono::system_clock::time_point()> clock{};
};

}  // namespace velkor::layers
