#pragma once

#include <algorithm>
#include <cstdint>
#include <deque>
#include <exception>
#include <functional>
#include <limits>
#include <memory>
#include <stdexcept>
#include <utility>

#include "framework/reactive_streams/Subscriber.hpp"
#include "framework/reactive_streams/Subscription.hpp"
#include "fuzz/models/ModelFuture.hpp"

namespace velkor::fuzz::models {

/// As `CachedValuePublisher`, with each rule written down where it applies.
template <class T>
class ModelStream : public std::enable_shared_from_this<ModelStream<T>> {
public:
    using Receiver = std::shared_ptr<reactive_streams::Subscriber<T>>;

    ModelStream(std::uint64_t mostKept, std::function<void()> hook)
        : capacity(mostKept), onDone(std::move(hook)) {}

    ModelStream(const ModelStream&) = delete;
    ModelStream& operator=(const ModelStream&) = delete;

    ~ModelStream() {
        try {
            end(Phase::completed);
        } catch (...) {
            return;  // a destructor keeps it to itself
        }
    }

    ModelFuture<bool> getCompletionFuture() { return completion.getFuture(); }

    void subscribe(Receiver added) {
        const auto keepAlive = this->shared_from_this();
        if (subscription) throw std::invalid_argument("Only one subscription allowed.");
        subscription = std::make_shared<Handle>(this->weak_from_this());
        subscriber = added;
        const Phase found = phase;
        const auto foundError = error;
        added->onSubscribe(subscription);
        if (found == Phase::failed) return added->onError(foundError);
        if (found == Phase::completed) return added->onComplete();
        drain();
    }

    void publish(const T& value) {
        if (hasEnded()) return;
        if (demand > 0 && queue.empty()) {
            --demand;
            const Receiver waiting = subscriber;
            return waiting->onNext(T(value));
        }
        queue.push_back(value);
        if (queue.size() > capacity) queue.pop_front();
        const auto keepAlive = this->weak_from_this().lock();
        drain();
    }

    /// Keeps `value` unless a newer one is kept already.
    void publishFirst(const T& value) {
        if (!hasEnded() && queue.empty()) queue.push_back(value);
    }

    /// Keeps `value` in the place of the one that `isReplaced` is true of, or behind all others.
    template <class Predicate>
    void keep(const T& value, Predicate isReplaced) {
        if (hasEnded()) return;
        const auto replaced = std::find_if(queue.begin(), queue.end(), isReplaced);
        if (replaced != queue.end()) {
            *replaced = value;
        } else {
            queue.push_back(value);
        }
    }

    void deliver() { drain(); }

    void complete() {
        const auto keepAlive = this->weak_from_this().lock();
        if (phase != Phase::active) return;
        phase = Phase::completing;
        completeIfDrained();
    }

    void fail(std::exception_ptr reason) {
        const auto keepAlive = this->weak_from_this().lock();
        if (hasEnded()) return;
        error = reason;
        end(Phase::failed);
    }

private:
    enum class Phase { active, completing, completed, cancelled, failed };

    class Handle final : public reactive_streams::Subscription {
    public:
        explicit Handle(std::weak_ptr<ModelStream> owner) : stream(std::move(owner)) {}

        void request(std::uint64_t n) override {
            if (const auto alive = stream.lock()) alive->request(n);
        }
        void cancel() override {
            if (const auto alive = stream.lock()) alive->end(Phase::cancelled);
        }

    private:
        const std::weak_ptr<ModelStream> stream;
    };

    bool hasEnded() const { return phase > Phase::completing; }

    void request(std::uint64_t more) {
        constexpr auto most = std::numeric_limits<std::uint64_t>::max();
        demand = more > most - demand ? most : demand + more;
        drain();
        completeIfDrained();
    }

    // Whether the stream has ended is looked at before, and not between the values.
    void drain() {
        if (draining || hasEnded()) return;
        draining = true;
        try {
            while (demand > 0 && !queue.empty()) {
                --demand;
                T value = std::move(queue.front());
                queue.pop_front();
                subscriber->onNext(std::move(value));
            }
        } catch (...) {
            stopDraining();
            throw;
        }
        stopDraining();
        completeIfDrained();
    }

    void stopDraining() {
        draining = false;
        if (phase != Phase::cancelled) return;
        queue.clear();
        subscriber.reset();
    }

    void completeIfDrained() {
        if (phase == Phase::completing && queue.empty()) end(Phase::completed);
    }

    void end(Phase outcome) {
        if (hasEnded()) return;
        phase = outcome;
        const Receiver told = outcome == Phase::cancelled ? nullptr : subscriber;
        if (outcome == Phase::failed) queue.clear();
        if (outcome == Phase::cancelled && !draining) stopDraining();
        const auto reason = error;
        std::exception_ptr thrown;
        try {
            if (outcome == Phase::failed) {
                completion.setException(reason);
            } else {
                completion.setValue(outcome == Phase::completed);
            }
            if (told && outcome == Phase::completed) told->onComplete();
            if (told && outcome == Phase::failed) told->onError(reason);
        } catch (...) {
            thrown = std::current_exception();
        }
        onDone();
        if (thrown) std::rethrow_exception(thrown);
    }

    const std::uint64_t capacity;
    const std::function<void()> onDone;
    ModelPromise<bool> completion;
    std::deque<T> queue;
    std::exception_ptr error;
    Receiver subscriber;
    std::shared_ptr<reactive_streams::Subscription> subscription;
    std::uint64_t demand = 0;
    Phase phase = Phase::active;
    bool draining = false;
};

}  // namespace velkor::fuzz::models
