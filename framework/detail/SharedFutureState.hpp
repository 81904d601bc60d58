#pragma once

#include <condition_variable>
#include <cstdint>
#include <exception>
#include <memory>
#include <utility>
#include <variant>

#include "framework/common/Mutex.hpp"
#include "framework/detail/Continuation.hpp"
#include "framework/detail/FutureErrors.hpp"

namespace velkor::detail {

/// How far a state has come.
///
///     pending ── setValue ───────────────────────> value       (final)
///        │ ───── setException, promise destroyed ─> exception   (final)
///        └────── cancel ──────────────────────────> cancelled   (final; later results are dropped)
enum class FutureStatus : std::uint32_t { pending, value, exception, cancelled };

/// What a promise and its future share: the result, and whether it was taken.
///
/// Thread-safe: every member may be called from any thread. Owned by shared pointers; `self` is one
/// to this state. Who resolves takes a reference of its own only if it has something left to do
/// after the mutex, since a consumer may destroy both ends as soon as the result is in: a POSIX
/// mutex may be destroyed by whoever locks it next. No foreign code runs under the mutex: values
/// are boxed before it is taken and destroyed after it is released, continuations are run and
/// destroyed without it.
template <class T>
class SharedFutureState {
public:
    using Self = std::shared_ptr<SharedFutureState>;

    /// A pending state.
    SharedFutureState() = default;

    /// A state that is born resolved with `value`.
    explicit SharedFutureState(std::unique_ptr<T> value) noexcept
        : result(std::move(value)), status(FutureStatus::value) {}

    /// A state that is born resolved with `error`, which is not null.
    explicit SharedFutureState(std::exception_ptr error) noexcept
        : result(std::move(error)), status(FutureStatus::exception) {}

    /// The future of this state. Throws `std::runtime_error` "Promise already returned a future."
    /// unless it is the first call, or the first one since a continuation ran.
    Future<T> retrieveFuture(const Self& self) VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (futureRetrieved) throwFutureError(future_errors::futureAlreadyRetrieved);
        futureRetrieved = true;
        return Future<T>(self);
    }

    /// Resolves with the boxed value and runs the continuation. Nothing happens on a cancelled
    /// state. Throws `std::runtime_error` "Promise already resolved." on a resolved one.
    void setValue(std::unique_ptr<T> value, const Self& self) VELKOR_EXCLUDES(mutex) {
        runAll(settle(std::move(value), self));
    }

    /// Resolves with `error`, which is not null; otherwise as `setValue`.
    void setException(std::exception_ptr error, const Self& self) VELKOR_EXCLUDES(mutex) {
        runAll(settle(std::move(error), self));
    }

    /// As `setValue`, but leaves it to the caller to run the continuation.
    Step settle(std::unique_ptr<T> value, const Self& self) VELKOR_EXCLUDES(mutex) {
        return resolve(FutureStatus::value, std::move(value), self);
    }

    /// As `setException`, but leaves it to the caller to run the continuation.
    Step settle(std::exception_ptr error, const Self& self) VELKOR_EXCLUDES(mutex) {
        return resolve(FutureStatus::exception, std::move(error), self);
    }

    /// The producer has gone: a pending state fails with "Promise destroyed before it provided a
    /// value.". Takes no memory.
    void abandon(Self self) VELKOR_EXCLUDES(mutex) {
        Step next;
        {
            const common::MutexLock lock(mutex);
            if (status != FutureStatus::pending) return;
            result.template emplace<std::exception_ptr>();
            status = FutureStatus::exception;
            if (continuation != nullptr) next = claim(std::move(continuation), self);
        }
        self->ready.notify_all();
        runAll(std::move(next));
    }

    /// Attaches the one continuation. On a resolved state it is run at once, by this thread; on a
    /// cancelled one it is destroyed without having run. Throws `std::runtime_error` with the text
    /// of `get` when the result is taken or a continuation is attached already.
    void attach(std::unique_ptr<Continuation<T>> next, Self self) VELKOR_EXCLUDES(mutex) {
        Step claimed;
        {
            const common::MutexLock lock(mutex);
            requireUntaken();
            if (status == FutureStatus::cancelled) return;
            if (status == FutureStatus::pending) {
                continuation = std::move(next);
                return;
            }
            claimed = claim(std::move(next), std::move(self));
        }
        runAll(std::move(claimed));
    }

    /// Waits until there is a result and hands it over by move. Throws what the producer stored
    /// (see `rethrowUnwrapped`), or `std::runtime_error` "Future already returned it's value or has
    /// an associated continuation." or "Future has been cancelled.".
    T get() VELKOR_EXCLUDES(mutex) {
        common::MutexLock lock(mutex);
        requireUntaken();
        valueTaken = true;
        ++waiting;
        while (status == FutureStatus::pending) lock.wait(ready);
        --waiting;
        // The claim above makes the result this thread's own: it is used without the lock.
        const FutureStatus reached = status;
        Result taken = std::move(result);
        lock.unlock();
        switch (reached) {
            case FutureStatus::value:
                return std::move(*std::get<std::unique_ptr<T>>(taken));
            case FutureStatus::exception:
                rethrowUnwrapped(std::get<std::exception_ptr>(std::move(taken)));
            case FutureStatus::cancelled:
                throwFutureError(future_errors::cancelled);
            case FutureStatus::pending:
                break;
        }
        throwFutureError(future_errors::invalidState);
    }

    /// Gives up a pending result: waiters wake and fail, a continuation is destroyed without
    /// having run, later results are dropped. Nothing happens on a resolved state.
    void cancel() VELKOR_EXCLUDES(mutex) {
        std::unique_ptr<Continuation<T>> abandoned;
        {
            const common::MutexLock lock(mutex);
            if (status != FutureStatus::pending) return;
            status = FutureStatus::cancelled;
            abandoned = std::move(continuation);
        }
        ready.notify_all();
    }

private:
    /// The box of the value; the error, a null one for that of a destroyed promise, which is made
    /// when it is thrown; or an empty box while there is neither.
    using Result = std::variant<std::unique_ptr<T>, std::exception_ptr>;

    template <class Boxed>
    Step resolve(FutureStatus outcome, Boxed boxed, const Self& self) VELKOR_EXCLUDES(mutex) {
        Self keepAlive;
        {
            const common::MutexLock lock(mutex);
            if (status == FutureStatus::cancelled) return nullptr;
            if (status != FutureStatus::pending) throwFutureError(future_errors::alreadyResolved);
            result = std::move(boxed);  // which destroys nothing: there was no result
            status = outcome;
            // From here on the consumer may destroy both ends, and with them the owner of `self`.
            if (continuation != nullptr) return claim(std::move(continuation), self);
            if (waiting == 0) return nullptr;
            keepAlive = self;
        }
        keepAlive->ready.notify_all();
        return nullptr;
    }

    void requireUntaken() const VELKOR_REQUIRES(mutex) {
        if (valueTaken || continuation != nullptr) throwFutureError(future_errors::alreadyTaken);
    }

    /// Gives the result of this state, `self`, to `next`: the step that runs it there.
    Step claim(std::unique_ptr<Continuation<T>> next, Self self) VELKOR_REQUIRES(mutex) {
        futureRetrieved = false;
        valueTaken = false;
        next->takeOver(std::move(self));
        return next;
    }

    common::Mutex mutex;
    std::condition_variable ready;
    Result result VELKOR_GUARDED_BY(mutex);
    std::unique_ptr<Continuation<T>> continuation VELKOR_GUARDED_BY(mutex);
    FutureStatus status VELKOR_GUARDED_BY(mutex) = FutureStatus::pending;
    std::uint32_t waiting VELKOR_GUARDED_BY(mutex) = 0;
    bool futureRetrieved VELKOR_GUARDED_BY(mutex) = false;
    bool valueTaken VELKOR_GUARDED_BY(mutex) = false;
};

}  // namespace velkor::detail
