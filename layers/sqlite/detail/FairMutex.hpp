#pragma once

#include <condition_variable>
#include <cstdint>

#include "framework/common/Mutex.hpp"

namespace velkor::layers::detail {

class FairLock;

/// A mutex that is given to those who wait in the order in which they came: a thread that takes it
/// again and again keeps nobody waiting for long.
class VELKOR_CAPABILITY("mutex") FairMutex {
    friend class FairLock;

    common::Mutex mutex;
    std::condition_variable passedOn;
    std::uint64_t nextTurn VELKOR_GUARDED_BY(mutex) = 0;
    std::uint64_t currentTurn VELKOR_GUARDED_BY(mutex) = 0;
};

/// Holds a `FairMutex` while it lives.
class VELKOR_SCOPED_CAPABILITY FairLock {
public:
    /// Throws `std::system_error` when the system refuses.
    explicit FairLock(FairMutex& locked) VELKOR_ACQUIRE(locked) : fair(locked) {
        common::MutexLock lock(fair.mutex);
        const std::uint64_t turn = fair.nextTurn++;
        while (fair.currentTurn != turn) lock.wait(fair.passedOn);
    }

    ~FairLock() VELKOR_RELEASE() {
        const common::MutexLock lock(fair.mutex);
        ++fair.currentTurn;
        fair.passedOn.notify_all();
    }

    FairLock(const FairLock&) = delete;
    FairLock& operator=(const FairLock&) = delete;

private:
    FairMutex& fair;
};

}  // namespace velkor::layers::detail
