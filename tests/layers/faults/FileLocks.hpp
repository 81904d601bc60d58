#pragma once

#include <array>
#include <cstddef>
#include <map>
#include <memory>
#include <mutex>
#include <vector>

#include <sqlite3.h>

namespace velkor::testing {

/// The locks and the shared memory of one database file, among the connections of this process.
/// Each is known by a pointer of its own. Thread-safe.
class FileLocks {
public:
    using Owner = const void*;

    /// Raises `owner`'s lock to `level` (SQLITE_LOCK_...). SQLITE_OK or SQLITE_BUSY.
    int lock(Owner owner, int level);
    void unlock(Owner owner, int level);
    bool isReserved() const;

    /// Locks (SQLITE_SHM_...) the places from `first` on. SQLITE_OK or SQLITE_BUSY.
    int lockShared(Owner owner, int first, int count, int flags);

    /// The region `index` of the shared memory; null when it isn't there and not to be made.
    void* region(Owner owner, std::size_t index, std::size_t size, bool mayExtend);

    /// `owner` uses the shared memory no longer; what nobody uses goes.
    void leaveShared(Owner owner);

    /// Waits for nothing, but orders what threads do to the shared memory.
    void barrier() const;

private:
    struct Place {
        Owner writer = nullptr;
        std::map<Owner, bool> readers;
    };

    int highestOfOthers(Owner owner) const;

    mutable std::mutex mutex;  // guards all below
    std::map<Owner, int> levels;
    std::array<Place, SQLITE_SHM_NLOCK> places;
    std::vector<std::unique_ptr<char[]>> regions;
    std::map<Owner, bool> users;
};

}  // namespace velkor::testing
