#pragma once

#include <chrono>
#include <condition_variable>
#include <future>
#include <thread>
#include <utility>
#include <vector>

#include "framework/common/Mutex.hpp"

namespace velkor::layers::testing::detail {

/// What was noted, in order. Thread-safe.
template <class T>
class Noted {
public:
    void note(T thing) {
        const common::MutexLock lock(mutex);
        things.push_back(std::move(thing));
        grown.notify_all();
    }

    std::vector<T> all() const {
        const common::MutexLock lock(mutex);
        return things;
    }

    /// Whether `condition`, which is asked about all that was noted, holds within `limit`.
    template <class Condition>
    [[nodiscard]] bool becomes(std::chrono::milliseconds limit, const Condition& condition) {
        using Clock = std::chrono::steady_clock;
        const auto end = Clock::now() + limit;
        common::MutexLock lock(mutex);
        while (!condition(std::as_const(things))) {
            const auto left = end - Clock::now();
            if (left <= Clock::duration::zero()) return false;
            lock.waitFor(grown, left);
        }
        return true;
    }

    /// Whether anything is noted within `limit`.
    [[nodiscard]] bool begins(std::chrono::milliseconds limit) {
        return becomes(limit, [](const auto& noted) { return !noted.empty(); });
    }

private:
    mutable common::Mutex mutex;
    std::condition_variable grown;
    std::vector<T> things VELKOR_GUARDED_BY(mutex);
};

/// Calls `function` on a thread of its own, which is left behind if nobody waits for its answer.
template <class Function>
auto onOwnThread(Function function) {
    std::packaged_task<decltype(function())()> task(std::move(function));
    auto answer = task.get_future();
    std::thread(std::move(task)).detach();
    return answer;
}

/// Whether `answer` is there within `limit`.
template <class T>
[[nodiscard]] bool comes(const std::future<T>& answer, std::chrono::milliseconds limit) {
    return answer.wait_for(limit) == std::future_status::ready;
}

}  // namespace velkor::layers::testing::detail
