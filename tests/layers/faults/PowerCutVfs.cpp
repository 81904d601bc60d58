#include "tests/layers/faults/PowerCutVfs.hpp"

#include <cstring>
#include <stdexcept>
#include <utility>

namespace velkor::testing {

namespace {

/// A file as SQLite knows it.
struct Connection {
    SimulatedDisk& disk;
    SimulatedDisk::OpenFile file;
    std::shared_ptr<FileLocks> locks;
    std::string nameToRemove;  ///< When closed; empty: none.
};

struct VfsFile : sqlite3_file {
    Connection* connection;
};

Connection& of(sqlite3_file* file) {
    return *static_cast<VfsFile*>(file)->connection;
}

/// The answer as a code of SQLite's, where `failed` says what didn't work.
int codeOf(DiskAnswer answer, int failed) {
    if (answer == DiskAnswer::done) return SQLITE_OK;
    return answer == DiskAnswer::failed ? failed : SQLITE_FULL;
}

int closeFile(sqlite3_file* file) {
    Connection& connection = of(file);
    connection.locks->unlock(&connection, SQLITE_LOCK_NONE);
    if (!connection.nameToRemove.empty()) connection.disk.remove(connection.nameToRemove, false);
    delete &connection;
    return SQLITE_OK;
}

int readFile(sqlite3_file* file, void* target, int count, sqlite3_int64 offset) {
    Connection& connection = of(file);
    auto* bytes = static_cast<unsigned char*>(target);
    const auto wanted = static_cast<std::size_t>(count);
    const auto read =
        connection.disk.read(connection.file, static_cast<std::size_t>(offset), bytes, wanted);
    if (read.answer != DiskAnswer::done) return SQLITE_IOERR_READ;
    if (read.count == wanted) return SQLITE_OK;
    std::memset(bytes + read.count, 0, wanted - read.count);
    return SQLITE_IOERR_SHORT_READ;
}

int writeFile(sqlite3_file* file, const void* source, int count, sqlite3_int64 offset) {
    Connection& connection = of(file);
    return codeOf(connection.disk.write(connection.file, static_cast<std::size_t>(offset),
                                        static_cast<const unsigned char*>(source),
                                        static_cast<std::size_t>(count)),
                  SQLITE_IOERR_WRITE);
}

int truncateFile(sqlite3_file* file, sqlite3_int64 size) {
    Connection& connection = of(file);
    return codeOf(connection.disk.resize(connection.file, static_cast<std::size_t>(size)),
                  SQLITE_IOERR_TRUNCATE);
}

int syncFile(sqlite3_file* file, int /*flags*/) {
    Connection& connection = of(file);
    return codeOf(connection.disk.sync(connection.file), SQLITE_IOERR_FSYNC);
}

int sizeOfFile(sqlite3_file* file, sqlite3_int64* size) {
    Connection& connection = of(file);
    *size = static_cast<sqlite3_int64>(connection.disk.size(connection.file));
    return SQLITE_OK;
}

int lockFile(sqlite3_file* file, int level) {
    Connection& connection = of(file);
    return connection.locks->lock(&connection, level);
}

int unlockFile(sqlite3_file* file, int level) {
    Connection& connection = of(file);
    connection.locks->unlock(&connection, level);
    return SQLITE_OK;
}

int checkReserved(sqlite3_file* file, int* isReserved) {
    *isReserved = of(file).locks->isReserved() ? 1 : 0;
    return SQLITE_OK;
}

int controlFile(sqlite3_file*, int, void*) {
    return SQLITE_NOTFOUND;
}

int sectorSizeOf(sqlite3_file*) {
    return 4096;  // as the usual VFS says
}

int characteristicsOf(sqlite3_file*) {
    return SQLITE_IOCAP_POWERSAFE_OVERWRITE;
}

int mapShared(sqlite3_file* file, int index, int size, int mayExtend, void volatile** region) {
    Connection& connection = of(file);
    if (!connection.disk.isCurrent(connection.file)) return SQLITE_IOERR_SHMMAP;
    *region = connection.locks->region(&connection, static_cast<std::size_t>(index),
                                       static_cast<std::size_t>(size), mayExtend != 0);
    return SQLITE_OK;
}

int lockShared(sqlite3_file* file, int first, int count, int flags) {
    Connection& connection = of(file);
    return connection.locks->lockShared(&connection, first, count, flags);
}

void orderShared(sqlite3_file* file) {
    of(file).locks->barrier();
}

int unmapShared(sqlite3_file* file, int) {
    Connection& connection = of(file);
    connection.locks->leaveShared(&connection);
    return SQLITE_OK;
}

constexpr sqlite3_io_methods fileMethods{
    2,           closeFile,    readFile,          writeFile,  truncateFile,
    syncFile,    sizeOfFile,   lockFile,          unlockFile, checkReserved,
    controlFile, sectorSizeOf, characteristicsOf, mapShared,  lockShared,
    orderShared, unmapShared,  nullptr,           nullptr};

PowerCutVfs& vfsOf(sqlite3_vfs* vfs) {
    return *static_cast<PowerCutVfs*>(vfs->pAppData);
}

int openFile(sqlite3_vfs* vfs, const char* name, sqlite3_file* file, int flags, int* outFlags) {
    PowerCutVfs& powerCutVfs = vfsOf(vfs);
    file->pMethods = nullptr;
    const std::string path = name == nullptr ? "" : name;
    const bool mayCreate = (flags & SQLITE_OPEN_CREATE) != 0;
    SimulatedDisk::OpenFile opened;
    const DiskAnswer answer = powerCutVfs.disk().open(path, mayCreate, opened);
    if (answer != DiskAnswer::done) return codeOf(answer, SQLITE_CANTOPEN);
    constexpr int journals = SQLITE_OPEN_WAL | SQLITE_OPEN_MAIN_JOURNAL | SQLITE_OPEN_SUPER_JOURNAL;
    opened.syncsFolder = mayCreate && (flags & journals) != 0;
    const bool isTemporary = (flags & SQLITE_OPEN_DELETEONCLOSE) != 0;
    static_cast<VfsFile*>(file)->connection = new Connection{
        powerCutVfs.disk(), opened, powerCutVfs.locksOf(opened), isTemporary ? path : ""};
    file->pMethods = &fileMethods;
    if (outFlags != nullptr) *outFlags = flags;
    return SQLITE_OK;
}

int removeFile(sqlite3_vfs* vfs, const char* name, int syncsFolder) {
    SimulatedDisk& disk = vfsOf(vfs).disk();
    if (!disk.has(name)) return SQLITE_IOERR_DELETE_NOENT;
    return codeOf(disk.remove(name, syncsFolder != 0), SQLITE_IOERR_DELETE);
}

int accessFile(sqlite3_vfs* vfs, const char* name, int, int* isThere) {
    *isThere = vfsOf(vfs).disk().has(name) ? 1 : 0;
    return SQLITE_OK;
}

int fullPath(sqlite3_vfs*, const char* name, int size, char* target) {
    sqlite3_snprintf(size, target, "%s", name);
    return SQLITE_OK;
}

sqlite3_vfs* usual() {
    return sqlite3_vfs_find(nullptr);
}

int randomBytes(sqlite3_vfs*, int count, char* target) {
    return usual()->xRandomness(usual(), count, target);
}

int sleepFor(sqlite3_vfs*, int microseconds) {
    return usual()->xSleep(usual(), microseconds);
}

int currentTime(sqlite3_vfs*, double* day) {
    return usual()->xCurrentTime(usual(), day);
}

int currentTimeInMilliseconds(sqlite3_vfs*, sqlite3_int64* milliseconds) {
    return usual()->xCurrentTimeInt64(usual(), milliseconds);
}

int lastError(sqlite3_vfs*, int, char*) {
    return 0;
}

}  // namespace

PowerCutVfs::PowerCutVfs(std::string vfsName) : ownName(std::move(vfsName)) {
    vfs.iVersion = 2;
    vfs.szOsFile = sizeof(VfsFile);
    vfs.mxPathname = 1024;
    vfs.zName = ownName.c_str();
    vfs.pAppData = this;
    vfs.xOpen = openFile;
    vfs.xDelete = removeFile;
    vfs.xAccess = accessFile;
    vfs.xFullPathname = fullPath;
    vfs.xRandomness = randomBytes;
    vfs.xSleep = sleepFor;
    vfs.xCurrentTime = currentTime;
    vfs.xGetLastError = lastError;
    vfs.xCurrentTimeInt64 = currentTimeInMilliseconds;
    if (sqlite3_vfs_register(&vfs, 0) != SQLITE_OK) throw std::runtime_error("no VFS");
}

PowerCutVfs::~PowerCutVfs() {
    sqlite3_vfs_unregister(&vfs);
}

std::shared_ptr<FileLocks> PowerCutVfs::locksOf(const SimulatedDisk::OpenFile& file) {
    const std::lock_guard<std::mutex> lock(mutex);
    std::weak_ptr<FileLocks>& known = locks[{file.file.get(), file.session}];
    std::shared_ptr<FileLocks> living = known.lock();
    if (living == nullptr) known = living = std::make_shared<FileLocks>();
    return living;
}

}  // namespace velkor::testing
