#pragma once

#include <chrono>
#include <cstdint>
#include <exception>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/sources/ValueTable.hpp"
#include "layers/sqlite/SqliteOptions.hpp"
#include "layers/sqlite/detail/DiskHealth.hpp"
#include "layers/sqlite/detail/StateFile.hpp"
#include "layers/sqlite/detail/Write.hpp"
#include "layers/sqlite/detail/WriteQueue.hpp"

namespace velkor::layers::detail {

/// What a source and its thread share: the file and what is to get into it. Lives as long as one of
/// them. Thread-safe.
class Committer {
public:
    using Keys = WriteQueue::Keys;
    using Mutation = std::function<Keys(configuration::ValueTable&)>;

    /// Changes the table of the source as `LiveSource::change` does; false when the source has
    /// gone.
    using ChangeTable = std::function<bool(const Mutation&)>;

    /// Opens the file and gives its `values`, those that have expired meanwhile among them. Throws
    /// as `StateFile` does.
    Committer(const std::filesystem::path& path, const SqliteOptions& options,
              configuration::ValueMap& values);

    /// A write of this source at this time. Its value goes after `lifetime`, if that is given.
    PreparedWrite prepare(JournalAction action, const std::string& key,
                          std::optional<configuration::ConfigurationValue> after,
                          std::optional<std::chrono::milliseconds> lifetime = {}) const;

    /// Completes a write that is made in `values` next. Throws `std::runtime_error`
    /// `sqlite_errors::notWritten`, the path, ": " and `sqlite_errors::tooManyWaiting`.
    void complete(const configuration::ValueTable& values, PreparedWrite& write) const;

    /// One change, the last one unless its number is given, whether or not it is on the disk.
    /// Throws `std::runtime_error` with `sqlite_errors::noChange` or `noSuchChange`, or as
    /// `StateFile::find`.
    JournalEntry find(std::optional<std::int64_t> change);

    /// The thread of the source: commits what waits and lets values expire, until the queue is
    /// ended and empty.
    void run(const ChangeTable& changeTable);

    /// Takes what has expired out of `values` and gives its keys. Without memory or room it is left
    /// for later.
    Keys expire(configuration::ValueTable& values);

    WriteQueue& queue() noexcept { return writes; }
    StateFile& stateFile() noexcept { return file; }

    /// Whether the disk took what was written last.
    configuration::SourceState diskState() const { return disk.state(); }

private:
    void commit(const ChangeTable& changeTable);
    void begin(const ChangeTable& changeTable);
    void refuse(const ChangeTable& changeTable, std::exception_ptr reason);

    const std::string author;
    const std::function<Time()> clock;
    StateFile file;
    WriteQueue writes;
    DiskHealth disk;
};

}  // namespace velkor::layers::detail
