#pragma once

#include <atomic>
#include <exception>
#include <functional>
#include <memory>
#include <type_traits>
#include <utility>

#include "framework/detail/SharedFutureState.hpp"

namespace velkor {

template <class T>
class Promise;

/// The consuming side of one asynchronous result.
///
/// Thread-safe against its promise, which may live on any thread; one `Future` object is used by
/// one thread at a time, except that `cancel` may interrupt a waiting `get`. Destroying a future
/// leaves the producer alone: a result that comes later is dropped.
template <class T>
class Future {
public:
    /// An invalid future: it has no result to wait for.
    Future() noexcept = default;

    /// A future on `sharedState`; valid exactly when that is not null. For use by this library.
    explicit Future(std::shared_ptr<detail::SharedFutureState<T>> sharedState) noexcept
        : state(std::move(sharedState)) {}

    Future(Future&& other) noexcept
        : state(std::move(other.state)), continued(std::exchange(other.continued, false)) {}

    Future& operator=(Future&& other) noexcept {
        Future taken(std::move(other));
        state.swap(taken.state);
        std::swap(continued, taken.continued);
        return *this;
    }

    ~Future() = default;

    /// Whether this future belongs to a promise or a result. Stays true after `get` and `then`.
    bool valid() const noexcept { return state != nullptr; }

    /// Waits for the result and hands it over by move; may be called once.
    /// Throws the producer's exception, or `std::runtime_error` with one of
    /// "Future state isn't valid!",
    /// "Future already returned it's value or has an associated continuation.",
    /// "Future has been cancelled.", "Promise destroyed before it provided a value.".
    T get() {
        requireUsable();
        return state->get();
    }

    /// Runs `f(Future<T>&&)` once there is a result and gives a future of what it returns. Consumes
    /// this future: from now on its `get` and `then` throw the second text above.
    ///
    /// `f` runs on the thread that resolves the promise, or at once on this one when the result is
    /// there already; never under a lock of this library's futures. What it throws ends up in the
    /// returned future. When the result is cancelled `f` is destroyed without having run, and the
    /// returned future fails with "Promise destroyed before it provided a value.".
    template <class F>
    auto then(F&& f) {
        using Callable = std::decay_t<F>;
        static_assert(std::is_invocable_v<Callable&, Future&&>,
                      "the callable given to Future::then takes a Future<T>&&");
        using Returned = std::invoke_result_t<Callable&, Future&&>;
        static_assert(!std::is_void_v<Returned>,
                      "the callable given to Future::then must return a value: there is no future "
                      "of nothing");
        if constexpr (!std::is_void_v<Returned>) {
            return attach<std::decay_t<Returned>, Callable>(std::forward<F>(f));
        }
    }

    /// Gives up a result that is still pending: a waiting `get` fails with "Future has been
    /// cancelled.", a continuation is destroyed, a later result is dropped. Otherwise, and on an
    /// invalid future, nothing happens.
    void cancel() {
        // What the destroyed continuation refers to may include this future.
        if (const auto keepAlive = state) keepAlive->cancel();
    }

private:
    template <class U, class Callable>
    class CallableContinuation final : public detail::Continuation<T> {
    public:
        template <class F>
        CallableContinuation(F&& f, Promise<U>&& next)
            : callable(std::forward<F>(f)), downstream(std::move(next)) {}

        void invoke(Future&& future) override { detail::runAll(proceed(std::move(future))); }

        // Resolving the next future comes last, so it may be left to whoever runs the chain.
        detail::Step proceed(Future&& future) override {
            std::unique_ptr<U> returned;
            try {
                returned = std::make_unique<U>(std::invoke(callable, std::move(future)));
            } catch (...) {
                return downstream.settle(std::current_exception());
            }
            return downstream.settle(std::move(returned));
        }

    private:
        Callable callable;
        Promise<U> downstream;
    };

    template <class U, class Callable, class F>
    Future<U> attach(F&& f) {
        requireUsable();
        Promise<U> downstream;
        Future<U> next = downstream.getFuture();
        auto continuation = std::make_unique<CallableContinuation<U, Callable>>(
            std::forward<F>(f), std::move(downstream));
        continued = true;
        // The continuation may destroy this future: nothing of it is touched once it is attached.
        state->attach(std::move(continuation), state);
        return next;
    }

    void requireUsable() const {
        if (!valid()) detail::throwFutureError(detail::future_errors::futureInvalid);
        if (continued) detail::throwFutureError(detail::future_errors::alreadyTaken);
    }

    std::shared_ptr<detail::SharedFutureState<T>> state;
    bool continued = false;
};

/// The producing side of one asynchronous result.
///
/// `getFuture`, `setValue` and `setException` may be called by several threads at once: the first
/// one gets through, the others are refused. Moving and destroying a promise is for its owner
/// alone, and allowed as soon as the future has its result. The future may be used on any other
/// thread meanwhile. A promise that is destroyed without a result fails its future with "Promise
/// destroyed before it provided a value."; the destructor never throws and takes no memory.
template <class T>
class Promise {
public:
    /// A promise with a pending result.
    Promise() : state(std::make_shared<detail::SharedFutureState<T>>()) {}

    Promise(Promise&& other) noexcept
        : state(std::move(other.state)), resolved(other.isResolved()) {}

    Promise& operator=(Promise&& other) noexcept {
        Promise taken(std::move(other));
        state.swap(taken.state);
        const bool wasResolved = isResolved();
        setResolved(taken.isResolved());
        taken.setResolved(wasResolved);
        return *this;
    }

    ~Promise() {
        if (!valid() || isResolved()) return;
        auto* const abandoned = state.get();
        abandoned->abandon(std::move(state));
    }

    /// Whether this promise can still be used; false once it was moved from.
    bool valid() const noexcept { return state != nullptr; }

    /// The one future. Throws `std::runtime_error` "Promise state isn't valid!" or "Promise already
    /// returned a future.". After a continuation ran, a future can be had once more.
    Future<T> getFuture() {
        requireValid();
        return state->retrieveFuture(state);
    }

    /// Resolves with `value`, runs a continuation on this thread and wakes the waiter. Nothing
    /// happens when the future was cancelled. Throws `std::runtime_error` "Promise state isn't
    /// valid!" or "Promise already resolved."; when the value can't be stored, what its move or the
    /// allocation throws, and the promise can be used again.
    void setValue(T value) {
        requireValid();
        detail::runAll(settle(std::make_unique<T>(std::move(value))));
    }

    /// Resolves with `error`; otherwise as `setValue`. A null pointer throws
    /// `std::invalid_argument` "A promise can't be resolved with a null exception." and leaves the
    /// result pending.
    void setException(std::exception_ptr error) {
        requireValid();
        detail::requireException(error);
        detail::runAll(settle(std::move(error)));
    }

private:
    template <class>
    friend class Future;

    /// Resolves with a boxed value or an exception, and leaves it to the caller to run what
    /// follows.
    template <class Result>
    detail::Step settle(Result result) {
        // Noted first: the consumer may destroy this promise as soon as the result is in.
        setResolved(true);
        return state->settle(std::move(result), state);
    }

    // Only spares the destructor a lock: which of two threads resolves is for the state to say.
    bool isResolved() const noexcept { return resolved.load(std::memory_order_relaxed); }
    void setResolved(bool nowResolved) noexcept {
        resolved.store(nowResolved, std::memory_order_relaxed);
    }

    void requireValid() const {
        if (!valid()) detail::throwFutureError(detail::future_errors::promiseInvalid);
    }

    std::shared_ptr<detail::SharedFutureState<T>> state;
    std::atomic<bool> resolved{false};  // the destructor has nothing left to do
};

/// A future whose `get` gives `value` at once. Two allocations: the state, the boxed value.
template <class T>
Future<T> makeReadyFuture(T value) {
    return Future<T>(
        std::make_shared<detail::SharedFutureState<T>>(std::make_unique<T>(std::move(value))));
}

/// A future whose `get` throws `error` at once. A null pointer throws `std::invalid_argument`
/// "A promise can't be resolved with a null exception.".
template <class T>
Future<T> makeFailedFuture(std::exception_ptr error) {
    detail::requireException(error);
    return Future<T>(std::make_shared<detail::SharedFutureState<T>>(std::move(error)));
}

}  // namespace velkor
