#include "layers/sqlite/detail/Statement.hpp"

#include <cstddef>

namespace velkor::layers::detail {

Statement::Statement(Connection& connectionOfIt, std::string_view sql)
    : connection(connectionOfIt) {
    sqlite3_stmt* prepared = nullptr;
    const int result =
        sqlite3_prepare_v3(connection.handle(), sql.data(), static_cast<int>(sql.size()),
                           SQLITE_PREPARE_PERSISTENT, &prepared, nullptr);
    native.reset(prepared);
    if (result != SQLITE_OK) connection.fail();
}

Execution::~Execution() {
    sqlite3_reset(native());
    sqlite3_clear_bindings(native());
}

Execution& Execution::bind(std::int64_t number) {
    require(sqlite3_bind_int64(native(), ++bound, number));
    return *this;
}

Execution& Execution::bind(std::string_view bytes) {
    // Without an address it would be no bytes at all instead of none.
    const char* const address = bytes.empty() ? "" : bytes.data();
    require(sqlite3_bind_blob64(native(), ++bound, address, bytes.size(), SQLITE_STATIC));
    return *this;
}

Execution& Execution::bindNothing() {
    require(sqlite3_bind_null(native(), ++bound));
    return *this;
}

bool Execution::next() {
    const int result = sqlite3_step(native());
    if (result != SQLITE_ROW && result != SQLITE_DONE) statement.connection.fail();
    return result == SQLITE_ROW;
}

bool Execution::isNothing(int column) const noexcept {
    return sqlite3_column_type(native(), column) == SQLITE_NULL;
}

std::int64_t Execution::number(int column) const noexcept {
    return sqlite3_column_int64(native(), column);
}

std::string_view Execution::bytes(int column) const noexcept {
    const auto* const address = static_cast<const char*>(sqlite3_column_blob(native(), column));
    if (address == nullptr) return {};
    return {address, static_cast<std::size_t>(sqlite3_column_bytes(native(), column))};
}

void Execution::require(int result) const {
    if (result != SQLITE_OK) statement.connection.fail();
}

}  // namespace velkor::layers::detail
