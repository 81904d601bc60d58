#pragma once

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <atomic>
#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {

using layers::JournalAction;
using layers::JournalEntry;
using layers::SqliteOptions;
using layers::SqliteSource;

/// A folder of its own for a state file; gone, with all that is in it, when this is destroyed.
class StateFolder {
public:
    StateFolder() {
        std::string name = (std::filesystem::temp_directory_path() / "velkor-XXXXXX").string();
        if (::mkdtemp(name.data()) == nullptr) throw std::runtime_error("can't create " + name);
        folder = std::filesystem::canonical(name);
    }

    ~StateFolder() {
        std::error_code leftBehind;
        std::filesystem::remove_all(folder, leftBehind);
    }

    StateFolder(const StateFolder&) = delete;
    StateFolder& operator=(const StateFolder&) = delete;

    std::filesystem::path path() const { return folder; }
    std::filesystem::path file() const { return folder / "state.db"; }

private:
    std::filesystem::path folder;
};

/// The connection of another program to a state file.
class OtherProgram {
public:
    explicit OtherProgram(const std::filesystem::path& file) {
        if (sqlite3_open(file.c_str(), &connection) != SQLITE_OK) {
            throw std::runtime_error("can't open " + file.string());
        }
    }

    ~OtherProgram() { sqlite3_close(connection); }

    OtherProgram(const OtherProgram&) = delete;
    OtherProgram& operator=(const OtherProgram&) = delete;

    /// Runs `sql` and gives the columns of all rows, each followed by a blank.
    std::string run(const std::string& sql) {
        std::string text;
        const auto append = [](void* target, int count, char** columns, char**) {
            for (int i = 0; i < count; ++i) {
                *static_cast<std::string*>(target) += columns[i] == nullptr ? "none" : columns[i];
                *static_cast<std::string*>(target) += ' ';
            }
            return 0;
        };
        if (sqlite3_exec(connection, sql.c_str(), append, &text, nullptr) != SQLITE_OK) {
            throw std::runtime_error(sqlite3_errmsg(connection));
        }
        return text;
    }

private:
    sqlite3* connection = nullptr;
};

/// A clock that stands still until it is set.
class HandClock {
public:
    using Time = std::chrono::system_clock::time_point;

    /// What the options of a source take.
    std::function<Time()> function() const {
        return [now = micros] { return Time(std::chrono::microseconds(*now)); };
    }

    void advance(std::chrono::microseconds by) { *micros += by.count(); }
    Time now() const { return function()(); }

private:
    std::shared_ptr<std::atomic<std::int64_t>> micros =
        std::make_shared<std::atomic<std::int64_t>>(1'700'000'000'000'000);
};

/// Opens a file whose source may be about to end on its own thread.
inline std::shared_ptr<SqliteSource> openAgain(const std::filesystem::path& file) {
    const auto end = std::chrono::steady_clock::now() + patience;
    for (;;) {
        try {
            return SqliteSource::open(file);
        } catch (const std::runtime_error&) {
            if (std::chrono::steady_clock::now() > end) throw;
        }
        std::this_thread::yield();
    }
}

/// "1 alice set key: int 1 -> int 2".
inline std::string textOf(const JournalEntry& entry) {
    return std::to_string(entry.change) + " " + entry.author + " " +
           std::string(nameOf(entry.action)) + " " + entry.key + ": " +
           (entry.before ? textOf(*entry.before) : "none") + " -> " +
           (entry.after ? textOf(*entry.after) : "none");
}

inline std::vector<std::string> textsOf(const std::vector<JournalEntry>& entries) {
    std::vector<std::string> texts;
    for (const auto& entry : entries) texts.push_back(textOf(entry));
    return texts;
}

inline SqliteOptions by(const std::string& author) {
    SqliteOptions options;
    options.author = author;
    return options;
}

/// All of the journal, newest first.
inline std::vector<std::string> historyOf(SqliteSource& source, const std::string& of = "") {
    return textsOf(source.history(of, 1000));
}

}  // namespace velkor::testing
