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
        vfs.szOsFile += static_cast<int>(sizeof(Methods));
        usualSize = usual->szOsFile;
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

    /// Called before each sync of the log from now on, by the thread that commits. The sync fails
    /// with what it gives, unless that is SQLITE_OK.
    void beforeSync(std::function<int()> action) {
        auto shared = std::make_shared<const std::function<int()>>(std::move(action));
        const std::lock_guard<std::mutex> lock(mutex);
        syncAction.swap(shared);
    }

    /// How often the log was synchronised.
    int logSyncs() const { return syncs; }

private:
    // Behind each file of the usual VFS: its methods, and ours in their place.
    struct Methods {
        const sqlite3_io_methods* usual;
        sqlite3_io_methods own;
    };

    static Methods& methodsOf(sqlite3_file* file) {
        return *reinterpret_cast<Methods*>(reinterpret_cast<char*>(file) + current->usualSize);
    }

    static int open(sqlite3_vfs* self, const char* path, sqlite3_file* file, int flags,
                    int* outFlags) {
        const int result = current->openUsual(self, path, file, flags, outFlags);
        if (file->pMethods == nullptr) return result;
        Methods& methods = methodsOf(file);
        methods.usual = file->pMethods;
        methods.own = *file->pMethods;
        methods.own.xWrite = write;
        if ((flags & SQLITE_OPEN_WAL) != 0) methods.own.xSync = syncLog;
        file->pMethods = &methods.own;
        return result;
    }

    static int write(sqlite3_file* file, const void* bytes, int size, sqlite3_int64 offset) {
        const int answer = current->writeAnswer;
        if (answer != SQLITE_OK) return answer;
        return methodsOf(file).usual->xWrite(file, bytes, size, offset);
    }

    static int syncLog(sqlite3_file* file, int flags) {
        std::shared_ptr<const std::function<int()>> action;  // takes no memory, which may be short
        {
            const std::lock_guard<std::mutex> lock(current->mutex);
            action = current->syncAction;
        }
        ++current->syncs;
        const int answer = action != nullptr ? (*action)() : SQLITE_OK;
        return answer == SQLITE_OK ? methodsOf(file).usual->xSync(file, flags) : answer;
    }

    inline static TestDisk* current = nullptr;

    sqlite3_vfs vfs{};
    int usualSize = 0;
    int (*openUsual)(sqlite3_vfs*, const char*, sqlite3_file*, int, int*) = nullptr;
    std::atomic<int> writeAnswer{SQLITE_OK};
    std::atomic<int> syncs{0};
    std::mutex mutex;
    std::shared_ptr<const std::function<int()>> syncAction;  // guarded by mutex
};

}  // namespace velkor::testing
