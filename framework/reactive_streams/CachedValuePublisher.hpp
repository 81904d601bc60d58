#pragma once

#include <cstdint>
#include <exception>
#include <limits>
#include <list>
#include <memory>
#include <optional>
#include <stdexcept>
#include <utility>

#include "framework/Future.hpp"
#include "framework/common/Mutex.hpp"
#include "framework/detail/FutureErrors.hpp"
#include "framework/reactive_streams/Publisher.hpp"
#include "framework/reactive_streams/Subscriber.hpp"
#include "framework/reactive_streams/Subscription.hpp"

namespace velkor::reactive_streams {

/// `demand` and `more` together, at most 2^64 - 1.
constexpr std::uint64_t addDemand(std::uint64_t demand, std::uint64_t more) noexcept {
    constexpr auto most = std::numeric_limits<std::uint64_t>::max();
    return more > most - demand ? most : demand + more;
}

/// A stream for exactly one subscriber that keeps the newest undelivered values, as many as its
/// capacity allows, until the subscriber asks. `onDone`, a callable without arguments, is called
/// once, when the stream completes, fails or is cancelled.
///
///     active ─── complete, values queued ──> completing ── queue drained ──> completed
///        │ ───── complete, nothing queued, destructor ─────────────────────> completed
///        │ ───── cancel (also while completing) ───────────────────────────> cancelled
///        └────── fail (also while completing) ─────────────────────────────> failed
///
/// Thread-safe. No subscriber, hook, continuation or value destructor runs under the mutex, so any
/// of them may call the publisher and its subscription, and may drop the last reference to either.
/// What they throw passes to the caller that made them run (except in the destructor) and leaves
/// the publisher usable. Deliveries are not serialised: a value that is published while the
/// subscriber waits is handed straight to it, from inside `onNext` or beside another delivery.
///
/// Owned by a shared pointer; its subscription holds it weakly.
template <class T, class F>
class CachedValuePublisher : public PublisherAPI<T>,
                             public std::enable_shared_from_this<CachedValuePublisher<T, F>> {
public:
    /// A stream without a subscriber. Throws `std::invalid_argument` "A publisher needs a capacity
    /// of at least 1." when `mostKept` is 0.
    CachedValuePublisher(std::uint64_t mostKept, F hook)
        : capacity(mostKept), onDone(std::move(hook)) {
        if (capacity == 0) {
            throw std::invalid_argument("A publisher needs a capacity of at least 1.");
        }
    }

    CachedValuePublisher(const CachedValuePublisher&) = delete;
    CachedValuePublisher& operator=(const CachedValuePublisher&) = delete;

    /// Completes the stream, whatever is still queued. What `onComplete` or the hook throws is
    /// dropped here.
    ~CachedValuePublisher() override {
        std::optional<Ending> ending;
        {
            const common::MutexLock lock(mutex);
            if (state > State::completing) return;
            ending = end(State::completed);
        }
        try {
            announce(*ending);
        } catch (...) {
            return;
        }
    }

    /// See `Publisher`: true when the stream completed, false when it was cancelled, the error when
    /// it failed; settled before the subscriber and the hook are told.
    Future<bool> getCompletionFuture() override VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (!completion) {
            completion.emplace();
            // Nobody can have attached anything to this new promise: no foreign code runs here.
            if (state > State::completing) resolve(*completion, state, error);
        }
        return completion->getFuture();
    }

    /// Opens the stream: `onSubscribe`, then `onComplete` or `onError` if it has ended that way.
    /// Throws `std::invalid_argument` "A subscriber must not be null." or, when there is one
    /// already, "Only one subscription allowed.".
    void subscribe(std::shared_ptr<Subscriber<T>> newSubscriber) override VELKOR_EXCLUDES(mutex) {
        if (newSubscriber == nullptr) {
            throw std::invalid_argument("A subscriber must not be null.");
        }
        const auto keepAlive = this->shared_from_this();
        std::weak_ptr<Subscription> handle;
        State found;
        std::exception_ptr failure;
        {
            const common::MutexLock lock(mutex);
            if (subscription) throw std::invalid_argument("Only one subscription allowed.");
            subscription = std::make_shared<CachedValueSubscription>(keepAlive);
            subscriber = newSubscriber;
            handle = subscription;
            found = state;
            failure = error;
        }
        newSubscriber->onSubscribe(std::move(handle));
        if (found == State::failed) return newSubscriber->onError(failure);
        if (found == State::completed) return newSubscriber->onComplete();
        drain();
    }

    /// Delivers a copy of `value` at once when the subscriber waits for one, else keeps it,
    /// dropping the oldest kept ones beyond the capacity. Does nothing once the stream has ended.
    void publish(const T& value) VELKOR_EXCLUDES(mutex) {
        std::list<T> dropped;
        T copy(value);
        if (const auto waiting = keepUnlessAwaited(copy, dropped)) {
            return waiting->onNext(std::move(copy));
        }
        const auto keepAlive = this->weak_from_this().lock();
        drain();
    }

    /// Keeps a copy of `value` as the first one unless something is kept already, which is newer:
    /// for a value that was read before others could publish. Called before there is a subscriber.
    void publishFirst(const T& value) VELKOR_EXCLUDES(mutex) {
        std::list<T> first;
        first.push_back(value);
        const common::MutexLock lock(mutex);
        if (state <= State::completing && queue.empty()) queue.swap(first);
    }

    /// Ends the stream once the values that are queued now or meanwhile have been delivered; at
    /// once when there are none. Does nothing on a stream that is ending or has ended.
    void complete() VELKOR_EXCLUDES(mutex) {
        const auto keepAlive = this->weak_from_this().lock();
        {
            const common::MutexLock lock(mutex);
            if (state != State::active) return;
            state = State::completing;
        }
        completeWhenDrained();
    }

    /// Ends the stream with `reason` and drops what is queued. Does nothing on a stream that has
    /// ended. A null pointer throws `std::invalid_argument` "A promise can't be resolved with a
    /// null exception.".
    void fail(std::exception_ptr reason) VELKOR_EXCLUDES(mutex) {
        detail::requireException(reason);
        const auto keepAlive = this->weak_from_this().lock();
        std::optional<Ending> ending;
        {
            const common::MutexLock lock(mutex);
            if (state > State::completing) return;
            error = std::move(reason);
            ending = end(State::failed);
        }
        announce(*ending);
    }

private:
    enum class State : std::uint32_t { active, completing, completed, cancelled, failed };

    /// The end of the stream: decided under the mutex, announced without it.
    struct Ending {
        State state;
        Promise<bool>* completion;  ///< Null while nobody has asked for the future.
        std::shared_ptr<Subscriber<T>> subscriber;
        std::exception_ptr error;
        std::list<T> dropped;
    };

    /// Values with the subscriber that they are for, or that is let go of together with them.
    struct Delivery {
        std::shared_ptr<Subscriber<T>> subscriber;
        std::list<T> values;
    };

    class CachedValueSubscription final : public Subscription {
    public:
        explicit CachedValueSubscription(const std::shared_ptr<CachedValuePublisher>& owner)
            : publisher(owner) {}

        void request(std::uint64_t n) override {
            if (const auto keepAlive = publisher.lock()) keepAlive->request(n);
        }

        void cancel() override {
            if (const auto keepAlive = publisher.lock()) keepAlive->cancel();
        }

    private:
        std::weak_ptr<CachedValuePublisher> publisher;
    };

    void request(std::uint64_t n) VELKOR_EXCLUDES(mutex) {
        {
            const common::MutexLock lock(mutex);
            demand = addDemand(demand, n);
        }
        drain();
        completeWhenDrained();
    }

    void cancel() VELKOR_EXCLUDES(mutex) {
        std::optional<Ending> ending;
        {
            const common::MutexLock lock(mutex);
            if (state > State::completing) return;
            ending = end(State::cancelled);
        }
        announce(*ending);
    }

    /// The subscriber when it waits for `value`, which is then demanded by one less. Otherwise
    /// null, and `value` is moved into the queue unless the stream has ended; `dropped` takes what
    /// no longer fits, for destruction without the mutex.
    std::shared_ptr<Subscriber<T>> keepUnlessAwaited(T& value, std::list<T>& dropped)
        VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (state > State::completing) return nullptr;
        if (demand > 0 && queue.empty()) {
            --demand;
            return subscriber;
        }
        queue.push_back(std::move(value));
        while (queue.size() > capacity) dropped.splice(dropped.end(), queue, queue.begin());
        return nullptr;
    }

    /// Delivers what is queued as far as there is demand. A call from inside `onNext` leaves that
    /// to the running one, so that deliveries of queued values never nest.
    void drain() VELKOR_EXCLUDES(mutex) {
        if (!startDraining()) return;
        try {
            while (auto next = takeNext()) {
                next->subscriber->onNext(std::move(next->values.front()));
            }
        } catch (...) {
            abortDraining();
            throw;
        }
        completeWhenDrained();
    }

    bool startDraining() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (draining || state > State::completing) return false;
        draining = true;
        return true;
    }

    /// The next delivery, or nothing, and then the draining is over. Looks at the demand only: a
    /// stream that is cancelled from inside `onNext` still delivers what had been asked for.
    std::optional<Delivery> takeNext() VELKOR_EXCLUDES(mutex) {
        Delivery released;
        const common::MutexLock lock(mutex);
        if (demand == 0 || queue.empty()) {
            released = stopDraining();
            return std::nullopt;
        }
        --demand;
        Delivery next{subscriber, {}};
        next.values.splice(next.values.end(), queue, queue.begin());
        return next;
    }

    void abortDraining() VELKOR_EXCLUDES(mutex) {
        Delivery released;
        const common::MutexLock lock(mutex);
        released = stopDraining();
    }

    /// Gives back what a stream that was cancelled meanwhile no longer needs.
    Delivery stopDraining() VELKOR_REQUIRES(mutex) {
        draining = false;
        return state == State::cancelled ? release() : Delivery{};
    }

    Delivery release() VELKOR_REQUIRES(mutex) {
        return {std::move(subscriber), std::exchange(queue, {})};
    }

    void completeWhenDrained() VELKOR_EXCLUDES(mutex) {
        std::optional<Ending> ending;
        {
            const common::MutexLock lock(mutex);
            if (state != State::completing || !queue.empty()) return;
            ending = end(State::completed);
        }
        announce(*ending);
    }

    /// Ends the stream. Only one thread gets here, and announces what it is given.
    Ending end(State terminal) VELKOR_REQUIRES(mutex) {
        state = terminal;
        Ending ending{terminal, completion ? &*completion : nullptr, subscriber, error, {}};
        if (terminal == State::failed) ending.dropped.swap(queue);
        if (terminal == State::cancelled && !draining) ending.dropped = release().values;
        return ending;
    }

    /// Tells the completion future, the subscriber and the hook, the last in any case.
    void announce(const Ending& ending) VELKOR_EXCLUDES(mutex) {
        std::exception_ptr thrown;
        try {
            if (ending.completion) resolve(*ending.completion, ending.state, ending.error);
            signal(ending);
        } catch (...) {
            thrown = std::current_exception();
        }
        onDone();
        if (thrown) std::rethrow_exception(thrown);
    }

    static void resolve(Promise<bool>& completion, State terminal,
                        const std::exception_ptr& reason) {
        if (terminal == State::failed) return completion.setException(reason);
        completion.setValue(terminal == State::completed);
    }

    static void signal(const Ending& ending) {
        if (ending.subscriber == nullptr) return;
        if (ending.state == State::completed) ending.subscriber->onComplete();
        if (ending.state == State::failed) ending.subscriber->onError(ending.error);
    }

    common::Mutex mutex;
    const std::uint64_t capacity;
    std::list<T> queue VELKOR_GUARDED_BY(mutex);  // oldest first; a list holds nothing while empty
    F onDone;                                     // called by the one thread that ends the stream
    // Made when somebody asks: an idle watch is a third smaller without the shared state.
    std::optional<Promise<bool>> completion VELKOR_GUARDED_BY(mutex);
    std::exception_ptr error VELKOR_GUARDED_BY(mutex);
    std::shared_ptr<Subscriber<T>> subscriber VELKOR_GUARDED_BY(mutex);
    std::shared_ptr<Subscription> subscription VELKOR_GUARDED_BY(mutex);
    std::uint64_t demand VELKOR_GUARDED_BY(mutex) = 0;
    State state VELKOR_GUARDED_BY(mutex) = State::active;
    bool draining VELKOR_GUARDED_BY(mutex) = false;
};

}  // namespace velkor::reactive_streams
