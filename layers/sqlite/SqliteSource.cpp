#include "layers/sqlite/SqliteSource.hpp"

#include <stdexcept>
#include <system_error>
#include <utility>

#include "layers/sqlite/SqliteErrors.hpp"
#include "layers/sqlite/detail/Committer.hpp"
#include "layers/sqlite/detail/TableWrite.hpp"

namespace velkor::layers {

using configuration::ConfigurationValue;
using configuration::ValueMap;
using configuration::ValueTable;
using detail::Committer;
using detail::PreparedWrite;

std::shared_ptr<SqliteSource> SqliteSource::open(const std::filesystem::path& path,
                                                 const SqliteOptions& options) {
    ValueMap values;
    auto shared = std::make_shared<Committer>(path, options, values);
    auto source = std::make_shared<SqliteSource>(Key(), shared, std::move(values));
    source->change([&](ValueTable& table) { return shared->expire(table); });
    // Made here, since the thread has nobody to tell when it lacks the memory.
    const Committer::ChangeTable changeTable =
        [weak = std::weak_ptr(source)](const Committer::Mutation& mutation) {
            const OwnThread::Borrowing waitedFor;
            const auto alive = weak.lock();
            if (alive) alive->change(mutation);
            return alive != nullptr;
        };
    try {
        source->thread.emplace([shared, changeTable] { shared->run(changeTable); });
    } catch (const std::system_error& noThread) {
        throw std::runtime_error(sqlite_errors::notOpened + path.string() + ": " + noThread.what());
    }
    // The last reference of others waits for the thread, which refers to the source itself.
    return {source.get(), [source](SqliteSource*) mutable {
                source->finish();
                source.reset();
            }};
}

SqliteSource::SqliteSource(Key, std::shared_ptr<Committer> shared, ValueMap&& initialValues)
    : LiveSource(typeid(SqliteSource), std::move(initialValues), Code::own),
      committer(std::move(shared)) {}

SqliteSource::~SqliteSource() {
    finish();
}

void SqliteSource::finish() {
    committer->queue().end();
    thread.reset();
}

ConfigurationValue SqliteSource::set(const std::string& key, ConfigurationValue value) {
    return store(committer->prepare(JournalAction::set, key, std::move(value)));
}

ConfigurationValue SqliteSource::setFor(const std::string& key, ConfigurationValue value,
                                        std::chrono::milliseconds lifetime) {
    if (lifetime <= lifetime.zero()) throw std::invalid_argument(sqlite_errors::noLifetime);
    return store(committer->prepare(JournalAction::set, key, std::move(value), lifetime));
}

ConfigurationValue SqliteSource::store(PreparedWrite&& write) {
    ConfigurationValue answer;
    change([&](ValueTable& table) {
        const JournalEntry& entry = write.write().entry;
        committer->complete(table, write);
        answer = entry.before ? *entry.before : *entry.after;
        Keys changed{entry.key};
        detail::put(table, committer->queue(), std::move(write));
        return changed;
    });
    return answer;
}

std::optional<ConfigurationValue> SqliteSource::unset(const std::string& key) {
    auto write = committer->prepare(JournalAction::unset, key, std::nullopt);
    std::optional<ConfigurationValue> removed;
    change([&](ValueTable& table) {
        committer->complete(table, write);
        removed = write.write().entry.before;
        if (!removed) return Keys();
        Keys changed{key};
        detail::put(table, committer->queue(), std::move(write));
        return changed;
    });
    return removed;
}

Future<bool> SqliteSource::committed() {
    return committer->queue().committed();
}

configuration::SourceState SqliteSource::state() const {
    return committer->diskState();
}

std::vector<JournalEntry> SqliteSource::history(const std::string& keyOrPrefix, std::size_t limit) {
    return committer->stateFile().history(keyOrPrefix, limit);
}

std::vector<configuration::RecordedChange> SqliteSource::changes(const std::string& keyOrPrefix,
                                                                 std::size_t limit) {
    auto entries = history(keyOrPrefix, limit);
    std::vector<configuration::RecordedChange> changes;
    changes.reserve(entries.size());
    for (auto& entry : entries) changes.push_back(recorded(std::move(entry)));
    return changes;
}

JournalEntry SqliteSource::undo(std::optional<std::int64_t> change) {
    JournalEntry undone = committer->find(change);
    if (!undone.known) {
        throw std::runtime_error(sqlite_errors::unknownKind + std::to_string(undone.change));
    }
    auto write = committer->prepare(JournalAction::undo, undone.key, std::move(undone.before));
    JournalEntry done;
    LiveSource::change([&](ValueTable& table) {
        committer->complete(table, write);
        done = write.write().entry;
        Keys changed{done.key};
        done.change = detail::put(table, committer->queue(), std::move(write));
        return changed;
    });
    return done;
}

}  // namespace velkor::layers
