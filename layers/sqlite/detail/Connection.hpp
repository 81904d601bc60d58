#pragma once

#include <sqlite3.h>

#include <cstdint>
#include <filesystem>
#include <memory>
#include <string>

namespace velkor::layers::detail {

/// A connection to one database. One thread at a time uses it and its statements. What other
/// programs lock is waited for, 5 s at most.
class Connection {
public:
    /// Opens the file for writing by the SQLite VFS named `vfs` (empty: the usual one); makes an
    /// empty one where there is none. Nothing is read yet. Throws `std::runtime_error` with the
    /// cause: what SQLite says, with the system's reason where there is one, or "it is read-only".
    Connection(const std::filesystem::path& path, const std::string& vfs);

    /// Runs statements whose rows, if any, are of no interest. Throws `std::runtime_error` with the
    /// cause.
    void execute(const std::string& sql);

    /// The first column of the first row of a query, 0 when there is none. Throws as `execute`.
    std::int64_t number(const std::string& sql);

    /// As above, as text.
    std::string text(const std::string& sql);

    /// Writes over what a commit that failed has left in the log. When it was the sync that failed,
    /// the log holds all of it, and whoever opened the file next would take it for done. Changes
    /// nothing, and takes its chance if the disk goes on failing.
    void writeOverRefused() noexcept;

    /// Whether a transaction is open.
    bool inTransaction() const noexcept { return sqlite3_get_autocommit(native.get()) == 0; }

    /// Throws `std::runtime_error` with the cause of the last failure.
    [[noreturn]] void fail() const;

    sqlite3* handle() const noexcept { return native.get(); }

private:
    struct Close {
        void operator()(sqlite3* opened) const noexcept { sqlite3_close_v2(opened); }
    };

    std::unique_ptr<sqlite3, Close> native;
};

/// Changes that are all made or none: what was not committed is taken back at the end of the scope.
class Transaction {
public:
    /// Begins. Throws `std::runtime_error` with the cause.
    explicit Transaction(Connection& changed);
    ~Transaction();

    Transaction(const Transaction&) = delete;
    Transaction& operator=(const Transaction&) = delete;

    /// Returns when all of it is on the disk. Throws `std::runtime_error` with the cause, and all
    /// is taken back then.
    void commit();

private:
    void takeBack() noexcept;

    Connection& connection;
};

}  // namespace velkor::layers::detail
