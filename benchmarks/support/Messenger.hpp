#pragma once

#include <atomic>
#include <functional>
#include <thread>
#include <utility>

namespace velkor::benchmarks {

/// A second thread that does something to one object at a time. It spins for the next one, so that
/// the hand-over costs little beside what is measured.
template <class T>
class Messenger {
public:
    explicit Messenger(std::function<void(T&)> action)
        : thread([this, act = std::move(action)] { run(act); }) {}

    ~Messenger() {
        stopping = true;
        thread.join();
    }

    Messenger(const Messenger&) = delete;
    Messenger& operator=(const Messenger&) = delete;

    /// Has the other thread act on `object`, which must live until `waitUntilDone`.
    void send(T& object) { pending.store(&object, std::memory_order_release); }

    void waitUntilDone() const {
        while (pending.load(std::memory_order_acquire) != nullptr) std::this_thread::yield();
    }

private:
    void run(const std::function<void(T&)>& act) {
        while (!stopping) {
            if (T* const object = pending.load(std::memory_order_acquire)) {
                act(*object);
                pending.store(nullptr, std::memory_order_release);
            } else {
                std::this_thread::yield();
            }
        }
    }

    std::atomic<T*> pending{nullptr};
    std::atomic<bool> stopping{false};
    std::thread thread;  // the last member: it uses the others
};

}  // namespace velkor::benchmarks
