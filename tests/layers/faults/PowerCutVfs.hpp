#pragma once

#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include <sqlite3.h>

#include "tests/layers/faults/FileLocks.hpp"
#include "tests/layers/faults/SimulatedDisk.hpp"

namespace velkor::testing {

/// Registers a VFS of SQLite whose files are on a `SimulatedDisk`. It promises what the usual one
/// does: a write leaves the bytes beside it alone, and the first sync of a journal syncs the
/// folder, too. Connections of one process may share a file; a start of the disk takes their locks
/// and their shared memory. Outlives all connections that use it.
class PowerCutVfs {
public:
    explicit PowerCutVfs(std::string vfsName);
    ~PowerCutVfs();

    PowerCutVfs(const PowerCutVfs&) = delete;
    PowerCutVfs& operator=(const PowerCutVfs&) = delete;

    SimulatedDisk& disk() { return ownDisk; }
    const std::string& name() const { return ownName; }

    /// The locks of `file` as of the start of the disk that it was opened after.
    std::shared_ptr<FileLocks> locksOf(const SimulatedDisk::OpenFile& file);

private:
    SimulatedDisk ownDisk;
    const std::string ownName;
    std::mutex mutex;  // guards locks
    std::map<std::pair<const SimulatedFile*, unsigned>, std::weak_ptr<FileLocks>> locks;
    sqlite3_vfs vfs{};
};

}  // namespace velkor::testing
