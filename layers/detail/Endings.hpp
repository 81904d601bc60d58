#pragma once

#include <condition_variable>
#include <cstddef>

#include "framework/common/Mutex.hpp"

namespace velkor::layers::detail {

/// The threads that end without anybody who waits for them. The process does, and the unloading of
/// the library: what they have to write gets onto the disk. Thread-safe.
class Endings {
public:
    /// The one of this library.
    static Endings& ofAll();

    Endings() = default;
    ~Endings();

    Endings(const Endings&) = delete;
    Endings& operator=(const Endings&) = delete;

    /// One more thread is to be waited for.
    void add() VELKOR_EXCLUDES(mutex);

    /// That thread has ended but for this call.
    void remove() VELKOR_EXCLUDES(mutex);

private:
    common::Mutex mutex;
    std::condition_variable removed;
    std::size_t count VELKOR_GUARDED_BY(mutex) = 0;
};

}  // namespace velkor::layers::detail
