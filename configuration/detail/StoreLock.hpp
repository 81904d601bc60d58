#pragma once

#include <cstddef>
#include <memory>
#include <mutex>
#include <new>
#include <utility>
#include <vector>

#include "framework/common/Mutex.hpp"

namespace velkor::configuration::detail {

/// The store's recursive mutex as the operations of one thread hold it: it counts their levels, and
/// keeps what they let go of until the last level is given back. A source may then wait in its
/// destructor for any thread that uses the store, and a walk over a list of sources may go on when
/// a source that it calls has changed the registry.
///
/// The analysis of Clang sees this class as the mutex, since it knows nothing of
/// `std::recursive_mutex`: members that say they are guarded by the store's lock are used only
/// where a `Level` is.
class VELKOR_CAPABILITY("mutex") StoreLock {
public:
    class Level;

    /// Counts the levels of `storeMutex`, which must live as long.
    explicit StoreLock(std::recursive_mutex& storeMutex) : mutex(storeMutex) {}

    StoreLock(const StoreLock&) = delete;
    StoreLock& operator=(const StoreLock&) = delete;

    /// Takes a reference, to be given up when the mutex has been released. Throws `std::bad_alloc`.
    void retire(std::shared_ptr<const void> object) VELKOR_REQUIRES(this) {
        retired.push_back(std::move(object));
    }

    /// As above, except that without memory for it the reference is given up at once. Null is fine.
    void retireOrDrop(std::shared_ptr<const void> object) noexcept VELKOR_REQUIRES(this) {
        if (object == nullptr) return;
        try {
            retire(std::move(object));
        } catch (const std::bad_alloc&) {
            return;
        }
    }

private:
    using Retired = std::vector<std::shared_ptr<const void>>;

    std::recursive_mutex& mutex;
    // Both guarded by the mutex: no other thread has levels while this one has.
    std::size_t levels = 0;
    Retired retired;
};

/// One level of the mutex. Levels of one thread end in the reverse order of their beginning.
class VELKOR_SCOPED_CAPABILITY StoreLock::Level {
public:
    /// Takes a level. Throws `std::system_error` when the system refuses.
    explicit Level(StoreLock& storeLock) VELKOR_ACQUIRE(storeLock)
        : owner(storeLock), own(storeLock.mutex), lock(own), outermost(owner.levels++ == 0) {}

    /// Counts the level that `callers` holds already, and goes on holding afterwards. What is let
    /// go of meanwhile stays until the mutex is released by `releasedWhile` or by another level.
    Level(StoreLock& storeLock, std::unique_lock<std::recursive_mutex>& callers)
        VELKOR_ACQUIRE(storeLock)
        : owner(storeLock), lock(callers), outermost(owner.levels++ == 0) {}

    ~Level() VELKOR_RELEASE() {
        if (--owner.levels == 0 && own.owns_lock()) released.swap(owner.retired);
    }

    Level(const Level&) = delete;
    Level& operator=(const Level&) = delete;

    /// Whether this thread had no level before this one.
    bool isOutermost() const noexcept { return outermost; }

    /// Runs `f` with this level of the mutex released, and takes it back, whatever `f` throws.
    /// Throws `std::system_error` when the caller's lock can't be released or taken.
    template <class F>
    void releasedWhile(F&& f) {
        giveBack();
        try {
            released.clear();
            std::forward<F>(f)();
        } catch (...) {
            takeBack();
            throw;
        }
        takeBack();
    }

private:
    void giveBack() {
        if (!lock.owns_lock()) return lock.unlock();  // throws
        if (--owner.levels == 0) released.swap(owner.retired);
        lock.unlock();
    }

    void takeBack() {
        // Counted even if the caller's lock was taken meanwhile, which makes taking it throw.
        struct CountAgain {
            std::size_t& levels;
            ~CountAgain() { ++levels; }
        };
        const CountAgain countAgain{owner.levels};
        lock.lock();
    }

    // Destroyed from the last to the first: the level is given back, then goes what was let go of.
    Retired released;
    StoreLock& owner;
    std::unique_lock<std::recursive_mutex> own;
    std::unique_lock<std::recursive_mutex>& lock;
    const bool outermost;
};

}  // namespace velkor::configuration::detail
