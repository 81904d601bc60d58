#pragma once

#include <cstdint>
#include <memory>
#include <utility>

#include "settings/detail/Cell.hpp"

#if defined(__SANITIZE_ADDRESS__)
#define VELKOR_SETTINGS_CHECK_REFERENCES 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define VELKOR_SETTINGS_CHECK_REFERENCES 1
#endif
#endif

namespace velkor::settings {

/// Reads a setting that does not fit into an atomic, or a struct, in hot code: while nothing
/// changes it costs a comparison of versions; no lock, no allocation, no atomic read-modify-write.
///
/// Each thread has one of its own: a reader is for one thread at a time. It may outlive the setting
/// and then keeps the last value. It holds one value, the one that it gave last.
template <class T>
class Reader {
public:
    /// For `reader()` of settings and structs.
    explicit Reader(std::shared_ptr<const detail::SnapshotCell<T>> read) : cell(std::move(read)) {
        refresh();
    }

    /// A reader of `source`, a `Setting` or a `Bound`.
    template <class Source, class = decltype(std::declval<const Source&>().reader())>
    explicit Reader(const Source& source) : Reader(source.reader()) {}

    /// The newest value. The reference is good until the next `get` of this reader: in a build with
    /// AddressSanitizer every call gives another copy and frees the one before, so that a kept
    /// reference shows.
    const T& get() {
        if (cell->isNewer(seen)) refresh();
#ifdef VELKOR_SETTINGS_CHECK_REFERENCES
        current = std::make_shared<const T>(*current);
#endif
        return *current;
    }

private:
    __attribute__((noinline)) void refresh() {
        cell->take(current, seen);
    }

    std::shared_ptr<const detail::SnapshotCell<T>> cell;
    std::shared_ptr<const T> current;
    std::uint64_t seen = 0;
};

}  // namespace velkor::settings
