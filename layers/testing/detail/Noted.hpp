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

/// What a function answers that runs on a thread of its own. That is waited for at the end when it
/// has answered, and left behind otherwise.
template <class T>
class Answer {
public:
    /// Calls `function` on a new thread.
    template <class Function>
    static Answer of(Function function) {
        std::packaged_task<T()> task(std::move(function));
        auto future = task.get_future();
        return {std::move(future), std::thread(std::move(task))};
    }

    Answer(Answer&&) noexcept = default;
    Answer& operator=(Answer&&) = delete;

    ~Answer() {
        if (!thread.joinable()) return;
        if (!future.valid() || comes({})) {
            thread.join();
        } else {
            thread.detach();
        }
    }

    /// Whether it is there within `limit`.
    [[nodiscard]] bool comes(std::chrono::milliseconds limit) const {
        return future.wait_for(limit) == std::future_status::ready;
    }

    /// Waits for it; what the function has thrown is thrown. To be called once.
    T get() { return future.get(); }

private:
    Answer(std::future<T> given, std::thread answering)
        : future(std::move(given)), thread(std::move(answering)) {}

    std::future<T> future;
    std::thread thread;
};

/// Calls `function` on a thread of its own.
template <class Function>
auto onOwnThread(Function function) {
    return Answer<decltype(function())>::of(std::move(function));
}

}  // namespace velkor::layers::testing::detail
