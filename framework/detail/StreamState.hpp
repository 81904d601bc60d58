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
#include "framework/detail/StreamQueue.hpp"
#include "framework/reactive_streams/Subscriber.hpp"
#include "framework/reactive_streams/Subscription.hpp"

namespace velkor::reactive_streams {

/// `demand` and `more` together, at most 2^64 - 1.
constexpr std::uint64_t addDemand(std::uint64_t demand, std::uint64_t more) noexcept {
    constexpr auto most = std::numeric_limits<std::uint64_t>::max();
    return more > most - demand ? most : demand + more;
}

}  // namespace velkor::reactive_streams

namespace velkor::detail {

/// How far a stream has come; `QueuedPublisher` has the picture. Above `completing` it has
/// ended.
enum class StreamPhase : std::uint32_t { active, completing, completed, cancelled, failed };

/// The result of a stream, from when somebody asks for it. Everything that settling it takes is
/// allocated with it: a stream ends whether there is memory or not.
class StreamCompletion {
public:
    StreamCompletion()
        : state(std::make_shared<SharedFutureState<bool>>()), box(std::make_unique<bool>()) {}

    /// The future; see `SharedFutureState::retrieveFuture`.
    Future<bool> getFuture() { return state->retrieveFuture(state); }

    /// Settles the future for a stream that ended as `phase`, with `error` if it failed; runs its
    /// continuation. Called once.
    void settle(StreamPhase phase, const std::exception_ptr& error) {
        if (phase == StreamPhase::failed) return state->setException(error, state);
        *box = phase == StreamPhase::completed;
        state->setValue(std::move(box), state);
    }

private:
    std::shared_ptr<SharedFutureState<bool>> state;
    std::unique_ptr<bool> box;
};

/// What a stream for one subscriber has to remember, and what it owes next: the values that are
/// kept, the demand, and how it ended.
///
/// Thread-safe, with one mutex. Calls nobody: what is to be delivered or announced is given to the
/// caller, who does so without the mutex; what is no longer needed is given out for destruction,
/// too. What has been given out is not taken back: a stream may end, or newer values be given out
/// to another thread, before the caller has delivered what it got.
template <class T, class Queue = NewestValues<T>>
class StreamState {
public:
    using Receiver = std::shared_ptr<reactive_streams::Subscriber<T>>;
    using Handle = std::shared_ptr<reactive_streams::Subscription>;

    /// The end of the stream, for the one thread that brought it about to announce.
    struct Ending {
        StreamPhase phase;
        StreamCompletion* completion;  ///< Null while nobody has asked for the future.
        Receiver subscriber;
        std::exception_ptr error;
        std::list<T> dropped;
    };

    /// What the one that drains the stream does next.
    struct Turn {
        reactive_streams::Subscriber<T>* subscriber = nullptr;  ///< Null: nothing is due.
        std::list<T> values{};  ///< The one that is due, or those that nobody will get any more.
        Receiver released{};    ///< The subscriber of a stream that has been cancelled.
        std::optional<Ending> ending{};  ///< Nothing is due, and that was the last of the stream.
    };

    /// What a new subscriber finds.
    struct Opening {
        StreamPhase phase;
        std::exception_ptr error;
    };

    /// A stream that keeps what it has not given out in `empty`.
    explicit StreamState(Queue empty) : queue(std::move(empty)) {}

    /// The future of the end, which is settled already on a stream that has ended.
    Future<bool> getCompletionFuture() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (!completion) {
            StreamCompletion made;
            // Nobody can have attached anything to this new future: no foreign code runs here.
            if (phase > StreamPhase::completing) made.settle(phase, error);
            completion = std::move(made);
        }
        return completion->getFuture();
    }

    /// Takes the one subscriber, with the subscription that `subscribe()` makes. Throws
    /// `std::invalid_argument` "Only one subscription allowed." when there is one already.
    template <class Subscribe>
    Opening open(Receiver newSubscriber, Subscribe subscribe) VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (subscription) throw std::invalid_argument("Only one subscription allowed.");
        subscription = subscribe();
        subscriber = std::move(newSubscriber);
        return {phase, error};
    }

    /// The subscriber when it waits for `value`, which is then demanded by one less. Otherwise
    /// null, and `value` is moved into the queue unless the stream has ended; `dropped` takes what
    /// no longer fits.
    Receiver keepUnlessAwaited(T& value, std::list<T>& dropped) VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (phase > StreamPhase::completing) return nullptr;
        if (demand > 0 && queue.empty()) {
            --demand;
            return subscriber;
        }
        queue.push(std::move(value), dropped);
        return nullptr;
    }

    /// Moves the one value in `added` into the queue unless the stream has ended; `dropped` takes
    /// what it replaces.
    void keep(std::list<T>& added, std::list<T>& dropped) VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (phase <= StreamPhase::completing) queue.push(added, dropped);
    }

    /// Moves the one value in `first` into the queue unless the stream has ended or something is
    /// kept already.
    void keepFirst(std::list<T>& first) VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (phase <= StreamPhase::completing) queue.pushFirst(first);
    }

    /// Adds `more` to the demand.
    void request(std::uint64_t more) VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        demand = reactive_streams::addDemand(demand, more);
    }

    /// The first turn of who is to deliver what is queued, until a turn has no subscriber or it
    /// calls `abortDraining`; the subscriber lives until then. An empty one while another drains
    /// the stream, and after the end. Looks at the demand only: a stream that is cancelled
    /// meanwhile still delivers what had been asked for.
    Turn startDraining() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (draining || phase > StreamPhase::completing) return {};
        draining = true;
        return nextTurn();
    }

    /// The next turn of the one that drains the stream.
    Turn takeTurn() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        return nextTurn();
    }

    /// Ends the draining before everything was delivered.
    void abortDraining() VELKOR_EXCLUDES(mutex) {
        Turn last;
        const common::MutexLock lock(mutex);
        last = stopDraining();
    }

    /// Lets the stream end once it is drained. False when it is ending or has ended.
    bool startCompleting() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (phase != StreamPhase::active) return false;
        phase = StreamPhase::completing;
        return true;
    }

    /// Ends a stream that is completing and has nothing left to deliver.
    std::optional<Ending> completeIfDrained() VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        return endIfDrained();
    }

    /// Ends the stream as `terminal`, with `reason` if that is failed; nothing if it has ended.
    std::optional<Ending> endNow(StreamPhase terminal, std::exception_ptr reason = nullptr)
        VELKOR_EXCLUDES(mutex) {
        const common::MutexLock lock(mutex);
        if (phase > StreamPhase::completing) return std::nullopt;
        error = std::move(reason);
        return end(terminal);
    }

private:
    Ending end(StreamPhase terminal) VELKOR_REQUIRES(mutex) {
        phase = terminal;
        Ending ending{terminal, completion ? &*completion : nullptr, subscriber, error, {}};
        if (terminal == StreamPhase::failed) ending.dropped = queue.takeAll();
        if (terminal == StreamPhase::cancelled && !draining) {
            ending.dropped = queue.takeAll();
            subscriber.reset();  // not the last reference
        }
        return ending;
    }

    std::optional<Ending> endIfDrained() VELKOR_REQUIRES(mutex) {
        if (phase != StreamPhase::completing || !queue.empty()) return std::nullopt;
        return end(StreamPhase::completed);
    }

    Turn nextTurn() VELKOR_REQUIRES(mutex) {
        if (demand > 0 && !queue.empty()) {
            --demand;
            return {subscriber.get(), queue.takeFirst()};
        }
        Turn last = stopDraining();
        last.ending = endIfDrained();
        return last;
    }

    /// Gives back what a stream that was cancelled meanwhile no longer needs.
    Turn stopDraining() VELKOR_REQUIRES(mutex) {
        draining = false;
        if (phase != StreamPhase::cancelled) return {};
        return {nullptr, queue.takeAll(), std::move(subscriber)};
    }

    common::Mutex mutex;
    Queue queue VELKOR_GUARDED_BY(mutex);
    // Made when somebody asks: an idle watch is a third smaller without the shared state.
    std::optional<StreamCompletion> completion VELKOR_GUARDED_BY(mutex);
    std::exception_ptr error VELKOR_GUARDED_BY(mutex);
    Receiver subscriber VELKOR_GUARDED_BY(mutex);
    Handle subscription VELKOR_GUARDED_BY(mutex);
    std::uint64_t demand VELKOR_GUARDED_BY(mutex) = 0;
    StreamPhase phase VELKOR_GUARDED_BY(mutex) = StreamPhase::active;
    bool draining VELKOR_GUARDED_BY(mutex) = false;
};

}  // namespace velkor::detail
