#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <optional>
#include <type_traits>
#include <utility>

#include "framework/common/Mutex.hpp"

namespace velkor::settings::detail {

/// Whether a value fits into one atomic, which is all of a setting that is read.
template <class T, class = void>
inline constexpr bool fitsAtomic = false;
template <class T>
inline constexpr bool
    fitsAtomic<T, std::enable_if_t<std::is_trivially_copyable_v<T> && sizeof(T) <= 8 &&
                                   std::is_default_constructible_v<T>>> =
        std::atomic<T>::is_always_lock_free;

/// The published value of a small type. Thread-safe: reading it is one load.
template <class T>
class AtomicCell {
public:
    void store(T next) noexcept { value.store(next, std::memory_order_release); }
    T load() const noexcept { return value.load(std::memory_order_acquire); }

    /// Something that holds the value there is now.
    std::optional<T> held() const noexcept { return load(); }

private:
    std::atomic<T> value{T{}};
};

/// The published value of any other type, as an immutable snapshot with a version. Thread-safe.
template <class T>
class SnapshotCell {
public:
    using Snapshot = std::shared_ptr<const T>;

    void store(T next) VELKOR_EXCLUDES(mutex) {
        auto snapshot = std::make_shared<const T>(std::move(next));
        const common::MutexLock lock(mutex);  // given back before the old value is destroyed
        current.swap(snapshot);
        version.store(version.load(std::memory_order_relaxed) + 1, std::memory_order_release);
    }

    /// The value there is now; null before the first.
    Snapshot held() const VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        return current;
    }

    /// Whether a newer value than that of `seen` is there.
    bool isNewer(std::uint64_t seen) const noexcept {
        return version.load(std::memory_order_acquire) != seen;
    }

    /// Gives the newest value to `snapshot` and its version to `seen`.
    void take(Snapshot& snapshot, std::uint64_t& seen) const VELKOR_EXCLUDES(mutex) {
        Snapshot newest;
        {
            const common::MutexLock lock(mutex);
            newest = current;
            seen = version.load(std::memory_order_relaxed);
        }
        snapshot.swap(newest);
    }

private:
    mutable common::Mutex mutex;
    Snapshot current VELKOR_GUARDED_BY(mutex);
    std::atomic<std::uint64_t> version{0};
};

}  // namespace velkor::settings::detail
