#pragma once

#include <condition_variable>
#include <memory>
#include <mutex>
#include <utility>

namespace velkor::benchmarks {

template <class T>
class FloorFuture;

/// What takes over a floor's result.
template <class T>
class FloorContinuation {
public:
    virtual ~FloorContinuation() = default;
    virtual void run(FloorFuture<T> future) = 0;
};

/// The least that a promise and a future can share and still be used from two threads: one mutex,
/// one condition variable, the boxed result and a continuation. No errors, no cancelling, no state
/// that is checked.
template <class T>
struct FloorState {
    std::mutex mutex;
    std::condition_variable ready;
    std::unique_ptr<T> result;
    std::unique_ptr<FloorContinuation<T>> continuation;
};

/// What any future of this kind costs at least.
template <class T>
class FloorFuture {
public:
    explicit FloorFuture(std::shared_ptr<FloorState<T>> shared) : state(std::move(shared)) {}

    /// Waits for the result and hands it over. Called once.
    T get() {
        std::unique_lock<std::mutex> lock(state->mutex);
        while (state->result == nullptr) state->ready.wait(lock);
        const std::unique_ptr<T> taken = std::move(state->result);
        lock.unlock();
        return std::move(*taken);
    }

    /// A future of what `callable(FloorFuture&&)` returns. Nothing else is called on this one.
    template <class F>
    auto then(F callable);

private:
    std::shared_ptr<FloorState<T>> state;
};

/// The producing side. It outlives its `setValue`.
template <class T>
class FloorPromise {
public:
    FloorPromise() : state(std::make_shared<FloorState<T>>()) {}

    FloorFuture<T> getFuture() { return FloorFuture<T>(state); }

    void setValue(T value) {
        auto boxed = std::make_unique<T>(std::move(value));
        std::unique_ptr<FloorContinuation<T>> next;
        {
            const std::lock_guard<std::mutex> lock(state->mutex);
            state->result = std::move(boxed);
            next = std::move(state->continuation);
        }
        if (next != nullptr) return next->run(FloorFuture<T>(std::move(state)));
        state->ready.notify_one();
    }

private:
    std::shared_ptr<FloorState<T>> state;
};

/// A future that has its result already: the state and the box are all it allocates.
template <class T>
FloorFuture<T> floorReadyFuture(T value) {
    auto state = std::make_shared<FloorState<T>>();
    state->result = std::make_unique<T>(std::move(value));
    return FloorFuture<T>(std::move(state));
}

template <class T>
template <class F>
auto FloorFuture<T>::then(F callable) {
    using U = decltype(callable(std::move(*this)));

    struct Continuation final : FloorContinuation<T> {
        explicit Continuation(F&& f) : callable(std::move(f)) {}
        void run(FloorFuture future) override { downstream.setValue(callable(std::move(future))); }

        F callable;
        FloorPromise<U> downstream;
    };

    auto continuation = std::make_unique<Continuation>(std::move(callable));
    FloorFuture<U> next = continuation->downstream.getFuture();
    {
        const std::lock_guard<std::mutex> lock(state->mutex);
        if (state->result == nullptr) {
            state->continuation = std::move(continuation);
            return next;
        }
    }
    continuation->run(std::move(*this));
    return next;
}

}  // namespace velkor::benchmarks
