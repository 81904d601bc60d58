#pragma once

#include <mutex>
#include <thread>

namespace velkor::testing {

/// Whether another thread would get `mutex` now, without waiting.
inline bool isFreeForOthers(std::recursive_mutex& mutex) {
    bool free = false;
    std::thread([&] {
        const std::unique_lock<std::recursive_mutex> attempt(mutex, std::try_to_lock);
        free = attempt.owns_lock();
    }).join();
    return free;
}

}  // namespace velkor::testing
