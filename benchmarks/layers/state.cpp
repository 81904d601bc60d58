// Values that last: writes that are acknowledged when they are on the disk, and reading beside.

#include <sqlite3.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "benchmarks/support/Fixtures.hpp"
#include "benchmarks/support/Harness.hpp"
#include "configuration/ConfigurationImpl.hpp"
#include "layers/sqlite/SqliteSource.hpp"

namespace velkor::benchmarks {

namespace {

constexpr std::size_t keyCount = 100;
constexpr std::size_t writers = 8;
constexpr std::size_t setsOfEach = 50;
constexpr std::size_t gets = 200'000;

std::string text40() {
    return std::string(40, 'x');
}

// A folder of its own on the disk.
class Folder {
public:
    Folder() {
        std::string name = (std::filesystem::temp_directory_path() / "velkor-XXXXXX").string();
        if (::mkdtemp(name.data()) == nullptr) throw std::runtime_error("can't create " + name);
        path = name;
    }
    ~Folder() { std::filesystem::remove_all(path); }

    Folder(const Folder&) = delete;
    Folder& operator=(const Folder&) = delete;

    std::filesystem::path file() const { return path / "state.db"; }

private:
    std::filesystem::path path;
};

// The source: a write through the store, acknowledged when it is on the disk.
class OurState {
public:
    OurState() { store->addSource("state", "", -1, false, source).get(); }

    void set(std::size_t number) {
        store->set(keyNumber(number % keyCount), text40());
        source->committed().get();
    }

    void get() { keep(store->get(keyNumber(0)).get()); }

private:
    const Folder folder;
    const std::shared_ptr<layers::SqliteSource> source = layers::SqliteSource::open(folder.file());
    const std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
};

// The same tables and statements by hand, one transaction for each write.
class BareState {
public:
    BareState() {
        if (sqlite3_open(folder.file().c_str(), &connection) != SQLITE_OK) fail();
        run("PRAGMA journal_mode = WAL; PRAGMA synchronous = FULL;"
            "CREATE TABLE entries (key BLOB PRIMARY KEY NOT NULL, value BLOB NOT NULL,"
            " expires INTEGER) WITHOUT ROWID;"
            "CREATE TABLE journal (change INTEGER PRIMARY KEY, time INTEGER NOT NULL,"
            " author BLOB NOT NULL, action TEXT NOT NULL, key BLOB NOT NULL, before BLOB,"
            " after BLOB)");
        journaling = prepared(
            "INSERT INTO journal VALUES (?1, ?2, '', 'set', ?3,"
            " (SELECT value FROM entries WHERE key = ?3), ?4)");
        storing = prepared(
            "INSERT INTO entries VALUES (?1, ?2, NULL)"
            " ON CONFLICT (key) DO UPDATE SET value = ?2, expires = NULL");
    }

    ~BareState() {
        sqlite3_finalize(journaling);
        sqlite3_finalize(storing);
        sqlite3_close(connection);
    }

    BareState(const BareState&) = delete;
    BareState& operator=(const BareState&) = delete;

    void set(std::size_t number) {
        const std::string key = keyNumber(number % keyCount);
        const std::string value = "string:" + text40();
        const auto now = std::chrono::system_clock::now().time_since_epoch();
        const std::lock_guard<std::mutex> lock(mutex);
        run("BEGIN IMMEDIATE");
        sqlite3_bind_int64(journaling, 1, ++lastChange);
        sqlite3_bind_int64(journaling, 2, now.count() / 1000);
        bind(journaling, 3, key);
        bind(journaling, 4, value);
        step(journaling);
        bind(storing, 1, key);
        bind(storing, 2, value);
        step(storing);
        run("COMMIT");
    }

private:
    [[noreturn]] void fail() const { throw std::runtime_error(sqlite3_errmsg(connection)); }

    void run(const char* sql) {
        if (sqlite3_exec(connection, sql, nullptr, nullptr, nullptr) != SQLITE_OK) fail();
    }

    sqlite3_stmt* prepared(const char* sql) {
        sqlite3_stmt* statement = nullptr;
        if (sqlite3_prepare_v2(connection, sql, -1, &statement, nullptr) != SQLITE_OK) fail();
        return statement;
    }

    static void bind(sqlite3_stmt* statement, int index, const std::string& bytes) {
        sqlite3_bind_blob64(statement, index, bytes.data(), bytes.size(), SQLITE_STATIC);
    }

    void step(sqlite3_stmt* statement) {
        if (sqlite3_step(statement) != SQLITE_DONE) fail();
        sqlite3_reset(statement);
    }

    const Folder folder;
    std::mutex mutex;
    sqlite3* connection = nullptr;
    sqlite3_stmt* journaling = nullptr;
    sqlite3_stmt* storing = nullptr;
    std::int64_t lastChange = 0;
};

template <class State>
void setFromManyThreads(State& state) {
    std::vector<std::thread> threads;
    for (std::size_t i = 0; i < writers; ++i) {
        threads.emplace_back([&state, i] {
            for (std::size_t j = 0; j < setsOfEach; ++j) state.set(i + j * writers);
        });
    }
    for (auto& thread : threads) thread.join();
}

template <class State>
void measureWriting(const std::string& contender) {
    measure("state/set/" + contender, [] {
        return [state = std::make_shared<State>(), number = std::size_t{0}]() mutable {
            state->set(number++);
        };
    }).elsewhere();
    measure("state/set-by-8/" + contender,
            [] { return [state = std::make_shared<State>()] { setFromManyThreads(*state); }; })
        .perItemOf(writers * setsOfEach)
        .elsewhere();
}

double slowestGetOfAHundred(OurState& state) {
    using Clock = std::chrono::steady_clock;
    std::vector<double> seconds(gets);
    for (auto& each : seconds) {
        const auto begin = Clock::now();
        state.get();
        each = std::chrono::duration<double>(Clock::now() - begin).count();
    }
    const auto percentile = seconds.begin() + static_cast<std::ptrdiff_t>(gets * 99 / 100);
    std::nth_element(seconds.begin(), percentile, seconds.end());
    return *percentile;
}

// Sets one value after the other, each acknowledged, while it lives.
class Writer {
public:
    explicit Writer(OurState& written) : state(written), thread([this] { write(); }) {}
    ~Writer() {
        done = true;
        thread.join();
    }

    Writer(const Writer&) = delete;
    Writer& operator=(const Writer&) = delete;

private:
    void write() {
        for (std::size_t number = 0; !done; ++number) state.set(number);
    }

    OurState& state;
    std::atomic<bool> done{false};
    std::thread thread;  // the last member: it uses the others
};

void measureReadingBeside(const std::string& contender, bool besideWriter) {
    addStated("state/get-p99/" + contender, [besideWriter]() -> Stated {
        const auto state = std::make_shared<OurState>();
        state->set(0);
        const auto writer = besideWriter ? std::make_shared<Writer>(*state) : nullptr;
        return [state, writer] { return slowestGetOfAHundred(*state); };
    });
}

}  // namespace

void addOperations() {
    measureWriting<OurState>("velkor");
    measureWriting<BareState>("sqlite");
    measureReadingBeside("alone", false);
    measureReadingBeside("beside-writer", true);
}

}  // namespace velkor::benchmarks
