#pragma once

#include <algorithm>
#include <condition_variable>
#include <cstddef>
#include <list>
#include <thread>

#include "framework/common/Mutex.hpp"

namespace velkor::layers::detail {

/// The threads that the end of the process, and the unloading of their library, wait for without
/// owning them: what they have to write gets onto the disk, and what they use stays until then.
/// Thread-safe.
class Endings {
public:
    using Threads = std::list<std::thread>;

    /// Those of the library that this is compiled into, where hidden names keep it apart from
    /// others. Made at the first call: what a thread uses to its end is made before that.
    static Endings& ofLibrary() {
        static Endings all;
        return all;
    }

    Endings() = default;

    /// Waits for all of them.
    ~Endings() {
        for (Threads last = awaitedLast(); !last.empty(); last = awaitedLast()) join(last);
    }

    Endings(const Endings&) = delete;
    Endings& operator=(const Endings&) = delete;

    /// A thread of somebody else is to be waited for, until `giveBack`.
    void borrow() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        ++borrowed;
    }

    void giveBack() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        --borrowed;
        changed.notify_all();
    }

    /// Takes over the calling thread, the only one of `own`. Takes no memory.
    void adopt(Threads& own) VELKOR_EXCLUDES(mutex) {
        Threads gone;
        {
            const common::MutexLock lock(mutex);
            adopted.splice(adopted.end(), own);
            gone.swap(ended);
        }
        join(gone);
    }

    /// The calling thread, which was adopted, ends now: the next one that is adopted waits for it.
    void noteEnd() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        const auto mine =
            std::find_if(adopted.begin(), adopted.end(), [](const std::thread& thread) {
                return thread.get_id() == std::this_thread::get_id();
            });
        if (mine != adopted.end()) ended.splice(ended.end(), adopted, mine);
    }

private:
    static void join(Threads& threads) {
        for (std::thread& each : threads) each.join();
    }

    Threads awaitedLast() VELKOR_EXCLUDES(mutex) {
        Threads last;
        common::MutexLock lock(mutex);
        while (borrowed > 0) lock.wait(changed);
        last.splice(last.end(), adopted);
        last.splice(last.end(), ended);
        return last;
    }

    common::Mutex mutex;
    std::condition_variable changed;
    std::size_t borrowed VELKOR_GUARDED_BY(mutex) = 0;
    Threads adopted VELKOR_GUARDED_BY(mutex);
    Threads ended VELKOR_GUARDED_BY(mutex);
};

}  // namespace velkor::layers::detail
