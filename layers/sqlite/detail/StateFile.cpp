#include "layers/sqlite/detail/StateFile.hpp"

#include <exception>
#include <new>
#include <stdexcept>
#include <utility>

#include "layers/detail/ValueCodec.hpp"
#include "layers/sqlite/Loggers.hpp"
#include "layers/sqlite/SqliteErrors.hpp"
#include "layers/sqlite/detail/Schema.hpp"

namespace velkor::layers::detail {

namespace {

namespace fs = std::filesystem;

/// Runs `action`; what it throws gets `failure` and the path in front.
template <class Action>
auto explained(const char* failure, const fs::path& path, Action action) {
    try {
        return action();
    } catch (const std::bad_alloc&) {
        throw;
    } catch (const fs::filesystem_error& cause) {
        throw std::runtime_error(failure + path.string() + ": " + cause.code().message());
    } catch (const std::exception& cause) {
        throw std::runtime_error(failure + path.string() + ": " + cause.what());
    }
}

/// One name for each file, however it is reached.
fs::path resolved(const fs::path& path) {
    return explained(sqlite_errors::notOpened, path, [&] {
        if (path.native().find('\0') != std::string::npos)
            throw std::runtime_error("it is no file");
        fs::path file = fs::weakly_canonical(fs::absolute(path));
        // Only a link to a file that isn't there yet is left.
        while (fs::is_symlink(file)) {
            file = fs::weakly_canonical(file.parent_path() / fs::read_symlink(file));
        }
        if (fs::exists(file) && !fs::is_regular_file(file)) {
            throw std::runtime_error(fs::is_directory(file) ? "it is a folder" : "it is no file");
        }
        return file;
    });
}

Connection openedAndUpToDate(const fs::path& file, const std::string& vfs) {
    Connection connection(file, vfs);
    bringUpToDate(connection);
    return connection;
}

Time earlier(Time time, std::chrono::hours length) {
    const auto most = std::chrono::duration_cast<std::chrono::hours>(time - Time());
    return time - std::min(length, most);
}

}  // namespace

StateFile::Database::Database(const fs::path& path, const SqliteOptions& options)
    : writerLock(path, options.author),
      connection(openedAndUpToDate(path, options.vfs)),
      journal(connection),
      reading(connection, "SELECT key, value, expires FROM entries"),
      storing(connection,
              "INSERT INTO entries (key, value, expires) VALUES (?1, ?2, ?3)"
              " ON CONFLICT (key) DO UPDATE SET value = ?2, expires = ?3"),
      removing(connection, "DELETE FROM entries WHERE key = ?") {}

void StateFile::Database::write(const Write& write) {
    journal.add(write.entry);
    if (!write.entry.after) return Execution(removing).bind(write.entry.key).run();
    const std::string value = encoded(*write.entry.after);
    Execution execution(storing);
    execution.bind(write.entry.key).bind(value);
    if (write.expires) execution.bind(toFile(*write.expires));
    execution.run();
}

StateFile::StateFile(const fs::path& path, const SqliteOptions& options)
    : file(resolved(path)),
      keepFor(options.keepFor),
      keepCount(options.keepCount),
      database(explained(sqlite_errors::notOpened, file,
                         [&] { return std::make_unique<Database>(file, options); })) {}

StateFile::Content StateFile::read() {
    const FairLock lock(mutex);
    Execution query(database->reading);
    return explained(sqlite_errors::notOpened, file, [&] {
        Content content;
        while (query.next()) {
            std::string key(query.bytes(0));
            auto value = decoded(query.bytes(1));
            if (!value) {
                sqliteLogger.write(common::warning,
                                   "State file holds a value of no known kind: ", file.string(),
                                   ", ", key);
                continue;
            }
            if (!query.isNothing(2)) content.deadlines[key] = fromFile(query.number(2));
            content.values.emplace(std::move(key), std::move(*value));
        }
        return content;
    });
}

void StateFile::commit(const Writes& writes, Time now) {
    const FairLock lock(mutex);
    Database& used = *database;
    explained(sqlite_errors::notWritten, file, [&] {
        Transaction transaction(used.connection);
        for (const Write& write : writes) used.write(write);
        used.journal.trim(writes.back().entry.change, keepCount, earlier(now, keepFor));
        transaction.commit();
    });
}

std::int64_t StateFile::newestChange() {
    const FairLock lock(mutex);
    Journal& journal = database->journal;
    return explained(sqlite_errors::notRead, file, [&] { return journal.newestChange(); });
}

std::optional<JournalEntry> StateFile::find(std::int64_t change) {
    const FairLock lock(mutex);
    Journal& journal = database->journal;
    return explained(sqlite_errors::notRead, file, [&] { return journal.find(change); });
}

std::vector<JournalEntry> StateFile::history(const std::string& keyOrPrefix, std::size_t limit) {
    const FairLock lock(mutex);
    Journal& journal = database->journal;
    return explained(sqlite_errors::notRead, file,
                     [&] { return journal.read(keyOrPrefix, limit); });
}

}  // namespace velkor::layers::detail
