#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <optional>
#include <type_traits>
#include <utility>

#include "framework/common/Mutex.hpp"

namespace velkor::settings::detail {

/// Whether a value fits into one atomic, which is all of a setting that is read.
template <class T>
inline constexpr bool fitsAtomic = std::is_trivially_copyable_v<T> &&
                                   sizeof(T) <= 8 && std::is_default_constructible_v<T>;

/// The unsigned integer that has room for `size` bytes.
template <std::size_t size>
using Bits = std::conditional_t<
    size == 1, std::uint8_t,
    std::conditional_t<size == 2, std::uint16_t,
                       std::conditional_t<size <= 4, std::uint32_t, std::uint64_t>>>;

/// The published value of a small type. Thread-safe: reading it is one load. An atomic of `T`
/// itself would not be: of a type with a smaller alignment than its size, compilers call a library
/// for it.
template <class T>
class AtomicCell {
public:
    /// What `store` takes.
    using Prepared = T;
    static const T& prepare(const T& next) noexcept { return next; }

    void store(const T& next) noexcept {
        Bits<sizeof(T)> copied = 0;
        std::memcpy(&copied, static_cast<const void*>(&next), sizeof(T));
        bits.store(copied, std::memory_order_release);
    }

    T load() const noexcept {
        const Bits<sizeof(T)> copied = bits.load(std::memory_order_acquire);
        T value;
        std::memcpy(static_cast<void*>(&value), &copied, sizeof(T));
        return value;
    }

    /// Something that holds the value there is now.
    std::optional<T> held() const noexcept { return load(); }

private:
    std::atomic<Bits<sizeof(T)>> bits{0};
};

/// The published value of any other type, as an immutable snapshot with a version. Thread-safe.
template <class T>
class SnapshotCell {
public:
    using Snapshot = std::shared_ptr<const T>;

    /// What `store` takes: a snapshot, which is made beforehand, so that storing can't fail.
    using Prepared = Snapshot;
    static Prepared prepare(T&& next) { return std::make_shared<const T>(std::move(next)); }

    void store(Prepared snapshot) VELKOR_EXCLUDES(mutex) {
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
