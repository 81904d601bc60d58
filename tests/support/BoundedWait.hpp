#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <exception>
#include <future>
#include <mutex>
#include <thread>
#include <type_traits>
#include <utility>

namespace velkor::testing {

/// How long a test waits for something that must happen. Only a broken program waits that long, so
/// it is generous enough for a sanitizer on a loaded machine.
inline constexpr std::chrono::seconds patience{20};

/// Runs `callable` on a thread of its own and says whether it returned within `limit`. A call that
/// hangs makes the test fail instead of hang; its thread is left behind, so the test must end
/// without touching what the call uses. What `callable` throws is thrown here.
template <class Callable>
[[nodiscard]] bool completesWithin(std::chrono::milliseconds limit, Callable callable) {
    std::promise<void> finished;
    std::future<void> done = finished.get_future();
    std::thread([callable = std::move(callable), finished = std::move(finished)]() mutable {
        try {
            callable();
            finished.set_value();
        } catch (...) {
            finished.set_exception(std::current_exception());
        }
    }).detach();
    if (done.wait_for(limit) != std::future_status::ready) return false;
    done.get();
    return true;
}

/// `completesWithin` with the usual patience.
template <class Callable>
[[nodiscard]] bool completes(Callable callable) {
    return completesWithin(patience, std::move(callable));
}

/// A gate that opens once it was counted down to zero, and stays open. Thread-safe. What a thread
/// did before `countDown` is visible to a thread whose wait has succeeded.
class Latch {
public:
    explicit Latch(std::size_t count = 1) : remaining(count) {}

    /// Counts down by one; does nothing on an open latch.
    void countDown() {
        const std::lock_guard<std::mutex> lock(mutex);
        if (remaining > 0 && --remaining == 0) opened.notify_all();
    }

    /// Whether the latch opened within `limit`.
    [[nodiscard]] bool waitFor(std::chrono::milliseconds limit) {
        std::unique_lock<std::mutex> lock(mutex);
        return opened.wait_for(lock, limit, [this] { return remaining == 0; });
    }

    /// `waitFor` with the usual patience.
    [[nodiscard]] bool wait() { return waitFor(patience); }

    /// Whether the latch is open now.
    [[nodiscard]] bool isOpen() {
        const std::lock_guard<std::mutex> lock(mutex);
        return remaining == 0;
    }

    /// Counts down and waits for the others: a common start for racing threads.
    [[nodiscard]] bool arriveAndWait() {
        countDown();
        return wait();
    }

private:
    std::mutex mutex;
    std::condition_variable opened;
    std::size_t remaining;  // guarded by mutex
};

}  // namespace velkor::testing
