#pragma once

#include <cstdint>
#include <exception>
#include <list>
#include <memory>
#include <optional>
#include <stdexcept>
#include <utility>

#include "framework/Future.hpp"
#include "framework/detail/FutureErrors.hpp"
#include "framework/detail/StreamState.hpp"
#include "framework/reactive_streams/Publisher.hpp"
#include "framework/reactive_streams/Subscriber.hpp"
#include "framework/reactive_streams/Subscription.hpp"

namespace velkor::reactive_streams {

/// Base of streams for exactly one subscriber that keep undelivered values in a `Queue` until the
/// subscriber asks. `onDone`, a callable without arguments, is called once, when the stream
/// completes, fails or is cancelled.
///
///     active ─── complete, values queued ──> completing ── queue drained ──> completed
///        │ ───── complete, nothing queued, destructor ─────────────────────> completed
///        │ ───── cancel (also while completing) ───────────────────────────> cancelled
///        └────── fail (also while completing) ─────────────────────────────> failed
///
/// Thread-safe. No subscriber, hook, continuation or value destructor runs under a mutex, so any
/// of them may call the publisher and its subscription, and may drop the last reference to either.
/// What they throw passes to the caller that made them run (except in the destructor) and leaves
/// the publisher usable.
///
/// Owned by a shared pointer; its subscription holds it weakly.
template <class T, class F, class Queue>
class QueuedPublisher : public PublisherAPI<T>,
                        public std::enable_shared_from_this<QueuedPublisher<T, F, Queue>> {
public:
    QueuedPublisher(const QueuedPublisher&) = delete;
    QueuedPublisher& operator=(const QueuedPublisher&) = delete;

    /// Completes the stream, whatever is still queued. What `onComplete` or the hook throws is
    /// dropped here.
    ~QueuedPublisher() override {
        try {
            if (const auto ending = stream.endNow(Phase::completed)) announce(*ending);
        } catch (...) {
            return;
        }
    }

    /// See `Publisher`: true when the stream completed, false when it was cancelled, the error when
    /// it failed; settled before the subscriber and the hook are told. Throws `std::bad_alloc` when
    /// memory is short, and can be called again then; the end itself takes none.
    Future<bool> getCompletionFuture() override { return stream.getCompletionFuture(); }

    /// Opens the stream: `onSubscribe`, then `onComplete` or `onError` if it has ended that way.
    /// Throws `std::invalid_argument` "A subscriber must not be null." or, when there is one
    /// already, "Only one subscription allowed.".
    void subscribe(std::shared_ptr<Subscriber<T>> newSubscriber) override {
        if (newSubscriber == nullptr) {
            throw std::invalid_argument("A subscriber must not be null.");
        }
        const auto keepAlive = this->shared_from_this();
        std::weak_ptr<Subscription> handle;
        const auto found = stream.open(newSubscriber, [&] {
            auto opened = std::make_shared<QueueSubscription>(keepAlive);
            handle = opened;
            return opened;
        });
        newSubscriber->onSubscribe(std::move(handle));
        if (found.phase == Phase::failed) return newSubscriber->onError(found.error);
        if (found.phase == Phase::completed) return newSubscriber->onComplete();
        drain();
    }

    /// Ends the stream once the values that are queued now or meanwhile have been delivered; at
    /// once when there are none. Does nothing on a stream that is ending or has ended.
    void complete() {
        const auto keepAlive = this->weak_from_this().lock();
        if (stream.startCompleting()) completeIfDrained();
    }

    /// Ends the stream with `reason` and drops what is queued. Does nothing on a stream that has
    /// ended. A null pointer throws `std::invalid_argument` "A promise can't be resolved with a
    /// null exception.".
    void fail(std::exception_ptr reason) {
        detail::requireException(reason);
        const auto keepAlive = this->weak_from_this().lock();
        const auto ending = stream.endNow(Phase::failed, std::move(reason));
        if (ending) announce(*ending);
    }

protected:
    /// A stream without a subscriber that keeps what it has not delivered in `empty`.
    QueuedPublisher(Queue empty, F hook) : stream(std::move(empty)), onDone(std::move(hook)) {}

    /// Delivers what is queued as far as there is demand. A call from inside `onNext` leaves that
    /// to the running one, so that deliveries of queued values never nest.
    void drain() {
        auto turn = stream.startDraining();
        try {
            while (turn.subscriber != nullptr) {
                handOut(*turn.subscriber, std::move(turn.values));
                turn = stream.takeTurn();
            }
        } catch (...) {
            stream.abortDraining();
            throw;
        }
        if (turn.ending) announce(*turn.ending);
    }

    detail::StreamState<T, Queue> stream;

private:
    using Phase = detail::StreamPhase;
    using Ending = typename detail::StreamState<T, Queue>::Ending;

    class QueueSubscription final : public Subscription {
    public:
        explicit QueueSubscription(const std::shared_ptr<QueuedPublisher>& owner)
            : publisher(owner) {}

        void request(std::uint64_t n) override {
            if (const auto keepAlive = publisher.lock()) keepAlive->request(n);
        }

        void cancel() override {
            if (const auto keepAlive = publisher.lock()) keepAlive->cancel();
        }

    private:
        std::weak_ptr<QueuedPublisher> publisher;
    };

    void request(std::uint64_t n) {
        stream.request(n);
        drain();
        completeIfDrained();
    }

    void cancel() {
        if (const auto ending = stream.endNow(Phase::cancelled)) announce(*ending);
    }

    // A value is destroyed before the next one is taken.
    static void handOut(Subscriber<T>& subscriber, std::list<T> value) {
        subscriber.onNext(std::move(value.front()));
    }

    void completeIfDrained() {
        if (const auto ending = stream.completeIfDrained()) announce(*ending);
    }

    /// Tells the completion future, the subscriber and the hook, the last in any case.
    void announce(const Ending& ending) {
        std::exception_ptr thrown;
        try {
            if (ending.completion) ending.completion->settle(ending.phase, ending.error);
            signal(ending);
        } catch (...) {
            thrown = std::current_exception();
        }
        onDone();
        if (thrown) std::rethrow_exception(thrown);
    }

    static void signal(const Ending& ending) {
        if (ending.subscriber == nullptr) return;
        if (ending.phase == Phase::completed) ending.subscriber->onComplete();
        if (ending.phase == Phase::failed) ending.subscriber->onError(ending.error);
    }

    F onDone;  // called by the one thread that ends the stream
};

}  // namespace velkor::reactive_streams
