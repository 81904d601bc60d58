#pragma once

#include <condition_variable>
#include <cstddef>

#include "framework/common/Mutex.hpp"

namespace velkor::layers::detail {

/// The threads that the end of the process, and the unloading of their library, wait for without
/// owning them: what they have to write gets onto the disk, and what they use stays until then.
/// Thread-safe.
class Endings {
public:
    /// Those of the library that this is compiled into, where hidden names keep it apart from
    /// others. Made at the first call: what a thread uses to its end is made before that.
    static Endings& ofLibrary() {
        static Endings all;
        return all;
    }

    Endings() = default;

    /// Waits for all of them.
    ~Endings() {
        common::MutexLock lock(mutex);
        while (count > 0) lock.wait(changed);
    }

    Endings(const Endings&) = delete;
    Endings& operator=(const Endings&) = delete;

    /// One more is to be waited for.
    void add() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        ++count;
    }

    /// One less is: it has ended but for this call, or somebody else waits for it.
    void remove() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        --count;
        changed.notify_all();
    }

private:
    common::Mutex mutex;
    std::condition_variable changed;
    std::size_t count VELKOR_GUARDED_BY(mutex) = 0;
};

}  // namespace velkor::layers::detail
