#include "layers/sqlite/detail/Connection.hpp"

#include <new>
#include <stdexcept>
#include <system_error>

#include "layers/sqlite/detail/Statement.hpp"

namespace velkor::layers::detail {

namespace {

constexpr int patienceWithOthers = 5000;  // milliseconds

}  // namespace

Connection::Connection(const std::filesystem::path& path, const std::string& vfs) {
    constexpr int flags =
        SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_EXRESCODE;
    sqlite3* opened = nullptr;
    const int result =
        sqlite3_open_v2(path.c_str(), &opened, flags, vfs.empty() ? nullptr : vfs.c_str());
    native.reset(opened);
    if (opened == nullptr) throw std::bad_alloc();
    if (result != SQLITE_OK) fail();
    sqlite3_busy_timeout(opened, patienceWithOthers);
    if (sqlite3_db_readonly(opened, "main") == 1) throw std::runtime_error("it is read-only");
}

void Connection::execute(const std::string& sql) {
    if (sqlite3_exec(handle(), sql.c_str(), nullptr, nullptr, nullptr) != SQLITE_OK) fail();
}

std::int64_t Connection::number(const std::string& sql) {
    Statement statement(*this, sql);
    Execution query(statement);
    return query.next() ? query.number(0) : 0;
}

std::string Connection::text(const std::string& sql) {
    Statement statement(*this, sql);
    Execution query(statement);
    return query.next() ? std::string(query.bytes(0)) : std::string();
}

void Connection::fail() const {
    std::string cause = sqlite3_errmsg(handle());
    const int kind = sqlite3_errcode(handle());
    const int reason = sqlite3_system_errno(handle());
    if ((kind == SQLITE_CANTOPEN || kind == SQLITE_IOERR) && reason != 0) {
        cause += " (" + std::generic_category().message(reason) + ")";
    }
    throw std::runtime_error(cause);
}

void Connection::writeOverRefused() noexcept {
    try {
        execute("PRAGMA user_version = " + std::to_string(number("PRAGMA user_version")));
    } catch (const std::exception&) {
        return;  // the next transaction does it
    }
}

Transaction::Transaction(Connection& changed) : connection(changed) {
    connection.execute("BEGIN IMMEDIATE");
}

Transaction::~Transaction() {
    takeBack();
}

void Transaction::commit() {
    try {
        connection.execute("COMMIT");
    } catch (...) {
        takeBack();
        connection.writeOverRefused();
        throw;
    }
}

// Some failures have taken all back already. Where this fails, the next one can't begin, and says
// why.
void Transaction::takeBack() noexcept {
    if (connection.inTransaction()) {
        sqlite3_exec(connection.handle(), "ROLLBACK", nullptr, nullptr, nullptr);
    }
}

}  // namespace velkor::layers::detail
