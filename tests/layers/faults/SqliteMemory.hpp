#pragma once

#include <cstddef>

#include "tests/support/AllocationCounter.hpp"

namespace velkor::testing {

/// Puts allocations of SQLite, on whichever thread, under the control of this program. Called
/// before SQLite is used first. Throws `std::runtime_error` when that has happened.
void controlSqliteMemory();

/// How many blocks SQLite holds.
std::ptrdiff_t sqliteBlocksHeld() noexcept;

/// Lets allocations of SQLite fail, on whichever thread, while it lives: the first one after
/// `successes` more that succeed and, in a lasting shortage, all that follow. One at a time.
class SqliteAllocationFailure {
public:
    SqliteAllocationFailure(std::size_t successes, Shortage shortage) noexcept;
    ~SqliteAllocationFailure();

    SqliteAllocationFailure(const SqliteAllocationFailure&) = delete;
    SqliteAllocationFailure& operator=(const SqliteAllocationFailure&) = delete;

    /// Whether the allocation that was to fail first has been reached.
    bool hasHappened() const noexcept;
};

}  // namespace velkor::testing
