#pragma once

#include <map>
#include <stdexcept>
#include <string>

#include <sqlite3.h>

namespace velkor::testing {

/// A table of numbers and a journal of what was written, by bare statements: what a power cut does
/// to SQLite itself. Each write is a transaction of its own.
class BareTable {
public:
    /// Opens or makes `path`. `synchronous` is the pragma's value. Throws `std::runtime_error`.
    BareTable(const std::string& path, const std::string& vfs, const std::string& synchronous) {
        const int flags = SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE;
        const int code = sqlite3_open_v2(path.c_str(), &database, flags, vfs.c_str());
        try {
            if (code != SQLITE_OK) throw std::runtime_error("can't open " + path);
            run("PRAGMA journal_mode=WAL");
            run("PRAGMA wal_autocheckpoint=20");
            run("PRAGMA synchronous=" + synchronous);
            run("CREATE TABLE IF NOT EXISTS numbers(key TEXT PRIMARY KEY, number INTEGER)");
            run("CREATE TABLE IF NOT EXISTS journal(change INTEGER PRIMARY KEY, key TEXT, number "
                "INTEGER)");
        } catch (...) {
            sqlite3_close(database);
            throw;
        }
    }

    ~BareTable() { sqlite3_close(database); }

    BareTable(const BareTable&) = delete;
    BareTable& operator=(const BareTable&) = delete;

    /// Writes and says whether it is acknowledged.
    bool set(const std::string& key, int number) {
        const std::string entry = "('" + key + "'," + std::to_string(number) + ")";
        const std::string write = "BEGIN; REPLACE INTO numbers VALUES" + entry +
                                  "; INSERT INTO journal(key,number) VALUES" + entry + "; COMMIT";
        if (sqlite3_exec(database, write.c_str(), nullptr, nullptr, nullptr) == SQLITE_OK) {
            return true;
        }
        sqlite3_exec(database, "ROLLBACK", nullptr, nullptr, nullptr);
        return false;
    }

    std::map<std::string, int> numbers() { return read("SELECT key,number FROM numbers"); }

    /// The numbers as the journal has them.
    std::map<std::string, int> journalled() {
        return read("SELECT key,number FROM journal ORDER BY change");
    }

    std::size_t writes() {
        std::size_t count = 0;
        const auto readCount = [](void* target, int, char** texts, char**) {
            *static_cast<std::size_t*>(target) = std::stoul(texts[0]);
            return 0;
        };
        run("SELECT count(*) FROM journal", readCount, &count);
        return count;
    }

private:
    using Row = int (*)(void*, int, char**, char**);

    std::map<std::string, int> read(const char* query) {
        std::map<std::string, int> found;
        const auto readRow = [](void* target, int, char** texts, char**) {
            if (texts[0] == nullptr || texts[1] == nullptr) return 1;  // no write was like this
            (*static_cast<std::map<std::string, int>*>(target))[texts[0]] = std::stoi(texts[1]);
            return 0;
        };
        run(query, readRow, &found);
        return found;
    }

    void run(const std::string& statement, Row row = nullptr, void* target = nullptr) {
        if (sqlite3_exec(database, statement.c_str(), row, target, nullptr) != SQLITE_OK) {
            throw std::runtime_error(statement + ": " + sqlite3_errmsg(database));
        }
    }

    sqlite3* database = nullptr;
};

}  // namespace velkor::testing
