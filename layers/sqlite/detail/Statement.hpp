#pragma once

#include <sqlite3.h>

#include <cstdint>
#include <memory>
#include <string_view>

#include "layers/sqlite/detail/Connection.hpp"

namespace velkor::layers::detail {

/// A statement that is prepared once and executed as often as wanted.
class Statement {
public:
    /// `connection` must live as long. Throws `std::runtime_error` with the cause.
    Statement(Connection& connection, std::string_view sql);

private:
    friend class Execution;

    struct Finalize {
        void operator()(sqlite3_stmt* prepared) const noexcept { sqlite3_finalize(prepared); }
    };

    Connection& connection;
    std::unique_ptr<sqlite3_stmt, Finalize> native;
};

/// One execution of a statement, of which there is one at a time. All functions but the getters
/// throw `std::runtime_error` with the cause when SQLite refuses.
class Execution {
public:
    explicit Execution(Statement& executed) noexcept : statement(executed) {}
    ~Execution();

    Execution(const Execution&) = delete;
    Execution& operator=(const Execution&) = delete;

    /// Gives the next parameter its value. Bytes must stay until the end of the execution.
    Execution& bind(std::int64_t number);
    Execution& bind(std::string_view bytes);
    Execution& bindNothing();

    /// Goes on to the next row; false at the end.
    bool next();

    /// Executes a statement that gives no rows.
    void run() { next(); }

    /// A column of this row. Bytes stay until the next row.
    bool isNothing(int column) const noexcept;
    std::int64_t number(int column) const noexcept;
    std::string_view bytes(int column) const noexcept;

private:
    sqlite3_stmt* native() const noexcept { return statement.native.get(); }
    void require(int result) const;

    Statement& statement;
    int bound = 0;
};

}  // namespace velkor::layers::detail
