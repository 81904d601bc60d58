#include "layers/sqlite/detail/Committer.hpp"

#include <chrono>
#include <stdexcept>
#include <thread>
#include <utility>

#include "layers/sqlite/Loggers.hpp"
#include "layers/sqlite/SqliteErrors.hpp"
#include "layers/sqlite/detail/TableWrite.hpp"

namespace velkor::layers::detail {

using configuration::ConfigurationValue;
using configuration::ValueMap;
using configuration::ValueTable;

namespace {

/// Notes in the log that writes were refused. What a sink of it throws is of no interest here.
void report(const std::exception_ptr& reason) noexcept {
    try {
        std::rethrow_exception(reason);
    } catch (const std::exception& error) {
        try {
            sqliteLogger.write(common::error, error.what());
        } catch (...) {
            return;
        }
    } catch (...) {
        return;
    }
}

/// Runs `attempt` until it gives true. What it throws comes from a lack of memory or from watchers:
/// it is tried again, if need be, after a while.
template <class Attempt>
void untilDone(Attempt attempt) {
    for (;;) {
        try {
            if (attempt()) return;
        } catch (...) {
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
}

Deadlines::Map readDeadlines(StateFile& file, ValueMap& values) {
    StateFile::Content content = file.read();
    values.swap(content.values);
    return std::move(content.deadlines);
}

std::function<Time()> clockOf(const SqliteOptions& options) {
    if (options.clock) return options.clock;
    return [] { return std::chrono::system_clock::now(); };
}

}  // namespace

Committer::Committer(const std::filesystem::path& path, const SqliteOptions& options,
                     ValueMap& values)
    : author(options.author),
      clock(clockOf(options)),
      file(path, options),
      writes(file.newestChange(), readDeadlines(file, values)) {}

PreparedWrite Committer::prepare(JournalAction action, const std::string& key,
                                 std::optional<ConfigurationValue> after,
                                 std::optional<std::chrono::milliseconds> lifetime) const {
    Write write;
    write.entry.when = fromFile(toFile(clock()));
    write.entry.author = author;
    write.entry.action = action;
    write.entry.key = key;
    write.entry.after = std::move(after);
    if (lifetime) write.expires = later(write.entry.when, *lifetime);
    if (action != JournalAction::expired) write.writer = std::this_thread::get_id();
    return PreparedWrite(std::move(write));
}

void Committer::complete(const ValueTable& values, PreparedWrite& prepared) const {
    Write& write = prepared.write();
    detail::complete(values, write);
    if (writes.hasRoomFor(write.weight)) return;
    throw std::runtime_error(sqlite_errors::notWritten + file.path().string() + ": " +
                             sqlite_errors::tooManyWaiting);
}

JournalEntry Committer::find(std::optional<std::int64_t> change) {
    auto entry = writes.find(change);
    if (!entry) entry = file.find(change.value_or(file.newestChange()));
    if (entry) return std::move(*entry);
    if (!change) throw std::runtime_error(sqlite_errors::noChange);
    throw std::runtime_error(sqlite_errors::noSuchChange + std::to_string(*change));
}

void Committer::run(const ChangeTable& changeTable) {
    for (;;) {
        switch (writes.awaitTask(clock)) {
            case WriteQueue::Task::commit:
                commit(changeTable);
                break;
            case WriteQueue::Task::expire:
                untilDone([&] {
                    changeTable([&](ValueTable& values) { return expire(values); });
                    return true;
                });
                break;
            case WriteQueue::Task::end:
                return;
        }
    }
}

void Committer::commit(const ChangeTable& changeTable) {
    begin(changeTable);
    // Whoever is told of a failure has it alone then: it isn't under way here any more.
    std::exception_ptr failure;
    try {
        file.commit(writes.batch(), clock());
    } catch (...) {
        failure = std::current_exception();
    }
    if (failure) return refuse(changeTable, std::move(failure));
    disk.noteCommit();
    writes.finish();
}

// A batch begins while nobody changes the table: what is changed together in the store gets onto
// the disk together.
void Committer::begin(const ChangeTable& changeTable) {
    untilDone([&] {
        const bool hasTable = changeTable([&](ValueTable&) {
            writes.begin();
            return Keys();
        });
        if (!hasTable) writes.begin();
        return true;
    });
}

void Committer::refuse(const ChangeTable& changeTable, std::exception_ptr reason) {
    WriteQueue::Refusal refusal{std::move(reason)};
    disk.noteRefusal(refusal.reason);
    report(refusal.reason);
    writes.postponeExpiry();
    untilDone([&] {
        if (refusal.isDone) return true;
        const bool hasTable =
            changeTable([&](ValueTable& values) { return writes.takeBack(&values, refusal); });
        if (!hasTable) writes.takeBack(nullptr, refusal);
        return refusal.isDone;
    });
    refusal.tell();
}

Committer::Keys Committer::expire(ValueTable& values) {
    Keys keys = writes.due(clock());
    std::size_t done = 0;
    try {
        for (; done < keys.size(); ++done) {
            PreparedWrite write = prepare(JournalAction::expired, keys[done], std::nullopt);
            complete(values, write);
            put(values, writes, std::move(write));
        }
    } catch (const std::exception&) {
        writes.postponeExpiry();
    }
    keys.resize(done);
    return keys;
}

}  // namespace velkor::layers::detail
