#include "layers/sqlite/detail/Schema.hpp"

#include <cstddef>
#include <cstdint>
#include <stdexcept>

namespace velkor::layers::detail {

namespace {

constexpr std::int64_t applicationId = 0x766B7374;

// Times are microseconds since 1970 (UTC); keys, authors and values are bytes.
constexpr const char* firstStep =
    "CREATE TABLE entries ("
    " key BLOB PRIMARY KEY NOT NULL,"
    " value BLOB NOT NULL,"
    " expires INTEGER"
    ") WITHOUT ROWID;"
    "CREATE TABLE journal ("
    " change INTEGER PRIMARY KEY,"
    " time INTEGER NOT NULL,"
    " author BLOB NOT NULL,"
    " action TEXT NOT NULL,"
    " key BLOB NOT NULL,"
    " before BLOB,"
    " after BLOB"
    ");";

bool isEmpty(Connection& connection) {
    return connection.number("PRAGMA application_id") == 0 &&
           connection.number("PRAGMA user_version") == 0 &&
           connection.number("SELECT count(*) FROM sqlite_schema") == 0;
}

void migrate(Connection& connection, std::size_t version, const std::vector<std::string>& steps) {
    Transaction transaction(connection);
    for (std::size_t i = version; i < steps.size(); ++i) connection.execute(steps[i]);
    connection.execute("PRAGMA application_id = " + std::to_string(applicationId));
    connection.execute("PRAGMA user_version = " + std::to_string(steps.size()));
    transaction.commit();
}

void requireUndamaged(Connection& connection) {
    const std::string found = connection.text("PRAGMA quick_check(1)");
    if (found != "ok") throw std::runtime_error("it is damaged: " + found);
}

void logAhead(Connection& connection) {
    const std::string mode = connection.text("PRAGMA journal_mode = WAL");
    if (mode != "wal") throw std::runtime_error("its file system can't share memory");
    connection.execute("PRAGMA synchronous = FULL");
}

}  // namespace

const std::vector<std::string>& schemaSteps() {
    static const std::vector<std::string> steps{firstStep};
    return steps;
}

void bringUpToDate(Connection& connection, const std::vector<std::string>& steps) {
    if (!isEmpty(connection) && connection.number("PRAGMA application_id") != applicationId) {
        throw std::runtime_error("it is a database of another program");
    }
    const std::int64_t version = connection.number("PRAGMA user_version");
    const auto newest = static_cast<std::int64_t>(steps.size());
    if (version > newest) {
        throw std::runtime_error("its schema " + std::to_string(version) + " is newer than " +
                                 std::to_string(newest) + ", the newest that is known here");
    }
    requireUndamaged(connection);
    logAhead(connection);
    if (version < newest) migrate(connection, static_cast<std::size_t>(version), steps);
}

}  // namespace velkor::layers::detail
