#pragma once

#include <condition_variable>
#include <cstddef>
#include <limits>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>

#include "tests/layers/faults/SimulatedFile.hpp"

namespace velkor::testing {

/// What a program asks of a disk.
enum class DiskOperation { open, read, write, sync, resize, remove };

/// What a disk answers.
enum class DiskAnswer {
    done,
    failed,
    full,        ///< No space is left.
    partlyDone,  ///< A write of which the first half is done, since no space is left for the rest.
};

/// That operations of one kind don't succeed.
struct DiskFault {
    DiskOperation operation;
    DiskAnswer answer = DiskAnswer::failed;
    std::size_t successes = 0;  ///< How many succeed first.
    bool isLasting = false;     ///< Else one fails.
};

/// A disk in memory, with one folder. It fails when it is told to, and at a power cut it loses what
/// was not synced: sectors of files, their sizes, names of files made or removed. Thread-safe.
class SimulatedDisk {
public:
    /// A file that one program has open. It answers until the disk is started again.
    struct OpenFile {
        std::shared_ptr<SimulatedFile> file;
        unsigned session = 0;
        bool syncsFolder = false;  ///< Whether its first sync is to sync the folder as well.
    };

    struct ReadAnswer {
        DiskAnswer answer;
        std::size_t count;
    };

    /// Opens the file `name`, or a file without a name for an empty one. With `mayCreate` it is
    /// made if it isn't there.
    DiskAnswer open(const std::string& name, bool mayCreate, OpenFile& opened);
    ReadAnswer read(const OpenFile& from, std::size_t offset, unsigned char* target,
                    std::size_t count);
    DiskAnswer write(const OpenFile& to, std::size_t offset, const unsigned char* bytes,
                     std::size_t count);
    DiskAnswer resize(const OpenFile& which, std::size_t size);
    DiskAnswer sync(OpenFile& which);
    DiskAnswer remove(const std::string& name, bool syncsFolder);
    std::size_t size(const OpenFile& which) const;
    bool has(const std::string& name) const;

    /// Whether the programs that opened `file` are still there.
    bool isCurrent(const OpenFile& file) const;

    /// Lets operations fail from now on, in place of what was to fail before.
    void fail(const DiskFault& newFault);

    /// Lets everything succeed again, and says whether an operation failed by the fault.
    bool recover();

    /// Cuts the power at an operation that changes the disk, which is not done: at the next one, or
    /// after `operations` of them. Everything fails then, up to the next start.
    void cutPowerAfter(std::size_t operations);
    bool hasPower() const;

    /// Cuts the power now and starts again, with a random choice of what had not been synced.
    void restartAfterPowerCut(Random& random);

    /// Starts again as after the death of all programs: nothing that was written is lost.
    void restartAfterKill();

    /// Holds up every write and sync until `letGo`.
    void hold();

    /// Waits until a thread is held up, or the power is off.
    void waitUntilHolding();
    void letGo();

private:
    using Names = std::map<std::string, std::shared_ptr<SimulatedFile>>;

    DiskAnswer admit(std::unique_lock<std::mutex>& lock, DiskOperation operation, unsigned caller);
    bool loseOneUse();
    void losePower();
    void start();

    mutable std::mutex mutex;  // guards all below
    std::condition_variable heldUp;
    std::condition_variable goesOn;
    Names names;
    Names durableNames;
    unsigned session = 0;
    std::optional<DiskFault> fault;
    bool hasFailed = false;
    std::optional<std::size_t> usesLeft;
    bool isPowered = true;
    bool isHolding = false;
    std::size_t waiting = 0;
};

}  // namespace velkor::testing
