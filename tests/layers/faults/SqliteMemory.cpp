#include "tests/layers/faults/SqliteMemory.hpp"

#include <limits>
#include <mutex>
#include <stdexcept>

#include <sqlite3.h>

namespace velkor::testing {

namespace {

constexpr std::size_t never = std::numeric_limits<std::size_t>::max();

sqlite3_mem_methods ownMethods;

std::mutex mutex;  // guards all below
std::size_t successesLeft = never;
Shortage kind = Shortage::once;
bool hasFailed = false;
std::ptrdiff_t blocksHeld = 0;

/// Whether the allocation that is about to be made may succeed.
bool hasMemory() {
    const std::lock_guard<std::mutex> lock(mutex);
    if (successesLeft == never) return true;
    if (successesLeft > 0) {
        --successesLeft;
        return true;
    }
    hasFailed = true;
    if (kind == Shortage::once) successesLeft = never;
    return false;
}

void count(std::ptrdiff_t blocks) {
    const std::lock_guard<std::mutex> lock(mutex);
    blocksHeld += blocks;
}

void* allocate(int size) {
    void* const memory = hasMemory() ? ownMethods.xMalloc(size) : nullptr;
    if (memory != nullptr) count(1);
    return memory;
}

void release(void* memory) {
    ownMethods.xFree(memory);
    count(-1);
}

void* reallocate(void* memory, int size) {
    return hasMemory() ? ownMethods.xRealloc(memory, size) : nullptr;
}

}  // namespace

void controlSqliteMemory() {
    sqlite3_config(SQLITE_CONFIG_GETMALLOC, &ownMethods);
    sqlite3_mem_methods ours = ownMethods;
    ours.xMalloc = allocate;
    ours.xFree = release;
    ours.xRealloc = reallocate;
    if (sqlite3_config(SQLITE_CONFIG_MALLOC, &ours) != SQLITE_OK) {
        throw std::runtime_error("SQLite is in use");
    }
}

std::ptrdiff_t sqliteBlocksHeld() noexcept {
    const std::lock_guard<std::mutex> lock(mutex);
    return blocksHeld;
}

SqliteAllocationFailure::SqliteAllocationFailure(std::size_t successes,
                                                 Shortage shortage) noexcept {
    const std::lock_guard<std::mutex> lock(mutex);
    successesLeft = successes;
    kind = shortage;
    hasFailed = false;
}

SqliteAllocationFailure::~SqliteAllocationFailure() {
    const std::lock_guard<std::mutex> lock(mutex);
    successesLeft = never;
}

bool SqliteAllocationFailure::hasHappened() const noexcept {
    const std::lock_guard<std::mutex> lock(mutex);
    return hasFailed;
}

}  // namespace velkor::testing
