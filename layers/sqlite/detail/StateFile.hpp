#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "layers/sqlite/JournalEntry.hpp"
#include "layers/sqlite/SqliteOptions.hpp"
#include "layers/sqlite/detail/Connection.hpp"
#include "layers/sqlite/detail/Deadlines.hpp"
#include "layers/sqlite/detail/FairMutex.hpp"
#include "layers/sqlite/detail/Journal.hpp"
#include "layers/sqlite/detail/Statement.hpp"
#include "layers/sqlite/detail/Write.hpp"
#include "layers/sqlite/detail/WriterLock.hpp"

namespace velkor::layers::detail {

/// The values and their journal in a file, which this alone writes. Thread-safe; one thread at a
/// time uses the file, in the order in which they came.
class StateFile {
public:
    /// Opens or makes the file. Throws `std::runtime_error`: `sqlite_errors::notOpened`, the path,
    /// ": " and the cause.
    StateFile(const std::filesystem::path& path, const SqliteOptions& options);

    /// What a file holds.
    struct Content {
        configuration::ValueMap values;
        Deadlines::Map deadlines;
    };

    /// All values but those of kinds that are not known here, which stay in the file and are
    /// reported in the log. Throws as the constructor.
    Content read();

    /// Makes all `writes` or none, and is back when they are on the disk. Throws
    /// `std::runtime_error`: `sqlite_errors::notWritten`, the path, ": " and the cause; or
    /// `std::bad_alloc`.
    void commit(const Writes& writes, Time now);

    /// The number of the newest change; 0 when there is none. This and what follows throws
    /// `std::runtime_error`: `sqlite_errors::notRead`, the path, ": " and the cause.
    std::int64_t newestChange();

    /// One change, if the journal holds it.
    std::optional<JournalEntry> find(std::int64_t change);

    /// What `Journal::read` gives.
    std::vector<JournalEntry> history(const std::string& keyOrPrefix, std::size_t limit);

    /// The path, without links and relative parts.
    const std::filesystem::path& path() const noexcept { return file; }

private:
    struct Database {
        Database(const std::filesystem::path& file, const SqliteOptions& options);

        void write(const Write& write);

        WriterLock writerLock;
        Connection connection;
        Journal journal;
        Statement reading;
        Statement storing;
        Statement removing;
    };

    const std::filesystem::path file;
    const std::chrono::hours keepFor;
    const std::size_t keepCount;
    FairMutex mutex;
    std::unique_ptr<Database> database VELKOR_GUARDED_BY(mutex);
};

}  // namespace velkor::layers::detail
