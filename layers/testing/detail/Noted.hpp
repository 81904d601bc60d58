#pragma once

#include <chrono>
#include <condition_variable>
#include <future>
#include <mutex>
#include <thread>
#include <utility>
#include <vector>

namespace velkor::layers::testing::detail {

/// What was noted, in order. Thread-safe.
template <class T>
class Noted {
public:
    void note(T thing) {
        const std::lock_guard<std::mutex> lock(mutex);
        things.push_back(std::move(thing));
        grown.notify_all();
    }

    std::vector<T> all() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return things;
    }

    /// Whether `condition`, which is asked about all that was noted, holds within `limit`.
    template <class Condition>
    [[nodiscard]] bool becomes(std::chrono::milliseconds limit, const Condition& condition) {
        std::unique_lock<std::mutex> lock(mutex);
        return grown.wait_for(lock, limit, [&] { return condition(std::as_const(things)); });
    }

    /// Whether anything is noted within `limit`.
    [[nodiscard]] bool begins(std::chrono::milliseconds limit) {
        return becomes(limit, [](const auto& noted) { return !noted.empty(); });
    }

private:
    mutable std::mutex mutex;
    std::condition_variable grown;
    std::vector<T> things;  // guarded by mutex
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
