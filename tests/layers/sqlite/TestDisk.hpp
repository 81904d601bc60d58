#pragma once

#include <sqlite3.h>

#include <atomic>
#include <cstring>
#include <functional>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>

namespace velkor::testing {

/// A disk that can be told to refuse writes, or to be slow: an SQLite VFS in front of the usual
/// one. There is one at a time.
class TestDisk {
public:
    TestDisk() {
        sqlite3_vfs* const usual = sqlite3_vfs_find(nullptr);
        if (usual == nullptr) throw std::runtime_error("SQLite has no VFS");
        vfs = *usual;
        vfs.zName = name();
        vfs.xOpen = open;
        openUsual = usual->xOpen;
        current = this;
        sqlite3_vfs_register(&vfs, 0);
    }

    ~TestDisk() { sqlite3_vfs_unregister(&vfs); }

    TestDisk(const TestDisk&) = delete;
    TestDisk& operator=(const TestDisk&) = delete;

    /// For `SqliteOptions::vfs`.
    static const char* name() { return "velkor-test-disk"; }

    /// What writing answers from now on: an SQLite error, or SQLITE_OK to write.
    void answerWrites(int answer) { writeAnswer = answer; }

    /// Called before each sync of the log from now on, by the thread that commits.
    void beforeSync(std::function<void()> action) {
        const std::lock_guard<std::mutex> lock(mutex);
        syncAction = std::move(action);
    }

    /// How often the log was synchronised.
    int logSyncs() const { return syncs; }

private:
    // The usual VFS makes a file, and its methods are replaced by ones that ask this first. Those
    // of the log are told from others by a table of their own.
    static int open(sqlite3_vfs* self, const char* path, sqlite3_file* file, int flags,
                    int* outFlags) {
        const int result = current->openUsual(self, path, file, flags, outFlags);
        if (file->pMethods == nullptr) return result;
        if (usualMethods == nullptr) {
            usualMethods = file->pMethods;
            methods = *usualMethods;
            methods.xWrite = write;
            logMethods = methods;
            logMethods.xSync = syncLog;
        }
        file->pMethods = (flags & SQLITE_OPEN_WAL) != 0 ? &logMethods : &methods;
        return result;
    }

    static int write(sqlite3_file* file, const void* bytes, int size, sqlite3_int64 offset) {
        const int answer = current->writeAnswer;
        return answer == SQLITE_OK ? usualMethods->xWrite(file, bytes, size, offset) : answer;
    }

    static int syncLog(sqlite3_file* file, int flags) {
        std::function<void()> action;
        {
            const std::lock_guard<std::mutex> lock(current->mutex);
            action = current->syncAction;
        }
        if (action) action();
        ++current->syncs;
        return usualMethods->xSync(file, flags);
    }

    inline static TestDisk* current = nullptr;
    inline static const sqlite3_io_methods* usualMethods = nullptr;
    inline static sqlite3_io_methods methods{};
    inline static sqlite3_io_methods logMethods{};

    sqlite3_vfs vfs{};
    int (*openUsual)(sqlite3_vfs*, const char*, sqlite3_file*, int, int*) = nullptr;
    std::atomic<int> writeAnswer{SQLITE_OK};
    std::atomic<int> syncs{0};
    std::mutex mutex;
    std::function<void()> syncAction;  // guarded by mutex
};

}  // namespace velkor::testing
