#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/sources/DurableSource.hpp"
#include "configuration/sources/ForgettingSource.hpp"
#include "configuration/sources/JournaledSource.hpp"
#include "configuration/sources/MonitoredSource.hpp"
#include "framework/Future.hpp"
#include "framework/common/Export.hpp"
#include "layers/LiveSource.hpp"
#include "layers/OwnThread.hpp"
#include "layers/sqlite/JournalEntry.hpp"
#include "layers/sqlite/SqliteOptions.hpp"

namespace velkor::layers {

namespace detail {
class Committer;
class PreparedWrite;
}  // namespace detail

/// A writable layer that lasts: an SQLite database with the values and a journal of all writes.
///
/// The values are read when the file is opened and stand in a table from then on: reading does no
/// input or output. A write can be read at once. A thread of the source brings it onto the disk, as
/// many as there are in one transaction, and what the store changes together together. Whoever
/// acknowledges a write waits for `committed`.
///
/// When the disk refuses, on a full one for example, nothing that waits is kept: the table goes
/// back to what is on the disk, watchers are told, `committed` fails with the reason, and the log
/// says so. Writes that come later are tried again.
///
/// One source at a time writes a file, in one process. Others may read it meanwhile; what another
/// program writes into it isn't noticed. Values of kinds, and tables, that only a newer version
/// knows stay in the file.
///
/// Thread-safe. Nobody waits for `committed` with the mutex of the store held or on the thread of
/// the source, which includes all subscribers: that thread could not go on.
///
/// When the last reference to it is given up, all that was accepted is brought onto the disk, or
/// has been refused, and the file is closed before that returns. On the thread of the source, where
/// a subscriber may give up the last one, or where the store ends that it has held for a moment, it
/// returns at once, and the thread does the rest soon afterwards: the end of the process waits.
class VELKOR_EXPORT SqliteSource final : public LiveSource,
                                         public configuration::ForgettingSource,
                                         public configuration::DurableSource,
                                         public configuration::JournaledSource,
                                         public configuration::MonitoredSource {
    struct Key {};

public:
    /// Opens the file, or makes it. Throws `std::runtime_error` "State file could not be opened: ",
    /// the path, ": " and the cause: that another process or source writes it, and which one; that
    /// it is damaged, of a newer schema, of another program, read-only, no file; what the system
    /// says. The file is as it was then.
    static std::shared_ptr<SqliteSource> open(const std::filesystem::path& path,
                                              const SqliteOptions& options = {});

    /// For `open`.
    SqliteSource(Key, std::shared_ptr<detail::Committer> shared,
                 configuration::ValueMap&& initialValues);
    ~SqliteSource() override;

    /// Stores `value` for good, calls the listener, and returns the value that was replaced, or
    /// `value` when the key is new. What the listener throws passes on; the value is stored by
    /// then.
    ///
    /// Throws `std::runtime_error` "State file could not be written: ", the path, ": too many
    /// writes wait for the disk" when 100,000 do, or 256 MiB: the disk is too slow or stands still,
    /// and waiting here would stop the store. Nothing has changed then.
    configuration::ConfigurationValue set(const std::string& key,
                                          configuration::ConfigurationValue value) override;

    /// Removes `key`, calls the listener, and gives the removed value; nothing happens when there
    /// is none. Throws as `set`.
    std::optional<configuration::ConfigurationValue> unset(const std::string& key) override;

    /// As `set`, for a time: the source unsets the key after `lifetime` by the clock, or when the
    /// file is opened later than that, unless it is written again before. Throws
    /// `std::invalid_argument` "A lifetime must be positive." and otherwise as `set`.
    configuration::ConfigurationValue setFor(const std::string& key,
                                             configuration::ConfigurationValue value,
                                             std::chrono::milliseconds lifetime);

    /// Resolves with true when all writes that were accepted before this call are on the disk.
    /// Fails with `std::runtime_error` "State file could not be written: ", the path, ": " and the
    /// cause when some of them are refused, or when some were that this thread wrote since it last
    /// asked. Resolved on the thread of the source, with no mutex held; a continuation runs there.
    Future<bool> committed() override;

    /// Well until the disk refuses a write, and again once it has taken one.
    configuration::SourceState state() const override;

    /// At most `limit` writes that are on the disk, newest first: those of one key; with a prefix
    /// that ends in "." those of all keys that it begins; with an empty text all. Waits for the
    /// disk. Throws `std::runtime_error` "State file could not be read: ", the path, ": " and the
    /// cause.
    std::vector<JournalEntry> history(const std::string& keyOrPrefix, std::size_t limit);

    /// `history` as of any source.
    std::vector<configuration::RecordedChange> changes(const std::string& keyOrPrefix,
                                                       std::size_t limit) override;

    /// Gives the key of a change, the last one unless its number is given, the value that it had
    /// before, for good, or unsets it; a write of its own, which is returned and can be undone as
    /// well. Waits for the disk.
    ///
    /// Throws `std::runtime_error` "No such change in the journal: " and the number, "There is no
    /// change in the journal.", "Change can't be undone, its value is of no known kind: " and the
    /// number, and as `history` and `set`.
    JournalEntry undo(std::optional<std::int64_t> change = {});

private:
    void finish();
    configuration::ConfigurationValue store(detail::PreparedWrite&& write);

    const std::shared_ptr<detail::Committer> committer;
    std::optional<OwnThread> thread;
};

}  // namespace velkor::layers
