#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>

/// Annotations that Clang's thread-safety analysis checks (-Wthread-safety); nothing elsewhere.
#if defined(__clang__)
#define VELKOR_THREAD_ANNOTATION(x) __attribute__((x))
#else
#define VELKOR_THREAD_ANNOTATION(x)
#endif

/// A class whose objects are locks.
#define VELKOR_CAPABILITY(name) VELKOR_THREAD_ANNOTATION(capability(name))
/// A class whose objects hold a lock while they live.
#define VELKOR_SCOPED_CAPABILITY VELKOR_THREAD_ANNOTATION(scoped_lockable)
/// A member that is read and written under the named mutex only.
#define VELKOR_GUARDED_BY(...) VELKOR_THREAD_ANNOTATION(guarded_by(__VA_ARGS__))
/// A function that is called with the named mutex held, and leaves it held.
#define VELKOR_REQUIRES(...) VELKOR_THREAD_ANNOTATION(requires_capability(__VA_ARGS__))
/// A function that is called with the named mutex free, because it takes it or runs foreign code.
#define VELKOR_EXCLUDES(...) VELKOR_THREAD_ANNOTATION(locks_excluded(__VA_ARGS__))
/// A function that takes the lock.
#define VELKOR_ACQUIRE(...) VELKOR_THREAD_ANNOTATION(acquire_capability(__VA_ARGS__))
/// A function that gives the lock back.
#define VELKOR_RELEASE(...) VELKOR_THREAD_ANNOTATION(release_capability(__VA_ARGS__))

namespace velkor::common {

class MutexLock;

/// A `std::mutex` that the thread-safety analysis understands. Locked through `MutexLock` only.
class VELKOR_CAPABILITY("mutex") Mutex {
    friend class MutexLock;
    std::mutex native;
};

/// Holds a `Mutex` while it lives; `unlock` gives it back early, for good.
class VELKOR_SCOPED_CAPABILITY MutexLock {
public:
    /// Locks `mutex`. Throws `std::system_error` when the system refuses.
    explicit MutexLock(Mutex& mutex) VELKOR_ACQUIRE(mutex) : lock(mutex.native) {}
    ~MutexLock() VELKOR_RELEASE() = default;

    MutexLock(const MutexLock&) = delete;
    MutexLock& operator=(const MutexLock&) = delete;

    /// Releases the mutex before the end of the scope.
    void unlock() VELKOR_RELEASE() { lock.unlock(); }

    /// Waits for `condition` with the mutex released; it is held again on return. May wake
    /// spuriously, so callers wait in a loop.
    void wait(std::condition_variable& condition) { condition.wait(lock); }

    /// As above, no longer than `limit`.
    void waitFor(std::condition_variable& condition, std::chrono::nanoseconds limit) {
        condition.wait_for(lock, limit);
    }

private:
    std::unique_lock<std::mutex> lock;
};

}  // namespace velkor::common
