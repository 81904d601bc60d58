#pragma once

#include <cstdint>
#include <deque>
#include <exception>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <utility>

#include "framework/Future.hpp"
#include "framework/reactive_streams/CachedValuePublisher.hpp"

namespace velkor::reactive_streams {

/// What a `BrokenPublisher` does wrong; nothing, to begin with.
struct Defects {
    bool ignoresDemand = false;
    bool signalsAfterTheEnd = false;
    bool holdsItsLockWhileDelivering = false;
};

/// A plain publisher of numbers with defects to order: what the rules have to find.
class BrokenPublisher : public PublisherAPI<int>,
                        public std::enable_shared_from_this<BrokenPublisher> {
public:
    explicit BrokenPublisher(Defects what) : defects(what) {}

    Future<bool> getCompletionFuture() override { return completion.getFuture(); }

    void subscribe(std::shared_ptr<Subscriber<int>> newSubscriber) override {
        if (newSubscriber == nullptr || subscription != nullptr) {
            throw std::invalid_argument("refused");
        }
        subscription = std::make_shared<Link>(shared_from_this());
        subscriber = newSubscriber;
        newSubscriber->onSubscribe(subscription);
        if (failure) return newSubscriber->onError(failure);
        if (ended) return newSubscriber->onComplete();
        Lock lock(mutex);
        deliver(lock);
    }

    void publish(int value) {
        Lock lock(mutex);
        if (isClosed()) return;
        queue.push_back(value);
        deliver(lock);
    }

    void complete() {
        Lock lock(mutex);
        if (isClosed()) return;
        completing = true;
        deliver(lock);
    }

    void fail(const std::exception_ptr& error) {
        Lock lock(mutex);
        if (isClosed()) return;
        if (!ended) completion.setException(error);
        ended = true;
        failure = error;
        queue.clear();
        call(lock, [&](Subscriber<int>& receiver) { receiver.onError(error); });
    }

private:
    using Lock = std::unique_lock<std::recursive_mutex>;

    class Link : public Subscription {
    public:
        explicit Link(const std::shared_ptr<BrokenPublisher>& owner) : publisher(owner) {}
        void request(std::uint64_t n) override {
            if (const auto alive = publisher.lock()) alive->request(n);
        }
        void cancel() override {
            if (const auto alive = publisher.lock()) alive->cancel();
        }

    private:
        std::weak_ptr<BrokenPublisher> publisher;
    };

    bool isClosed() const { return ended && !defects.signalsAfterTheEnd; }

    void request(std::uint64_t n) {
        Lock lock(mutex);
        if (isClosed()) return;
        demand = addDemand(demand, n);
        deliver(lock);
    }

    void cancel() {
        Lock lock(mutex);
        if (ended) return;
        ended = true;
        completion.setValue(false);
        if (!defects.signalsAfterTheEnd) subscriber.reset();
    }

    void deliver(Lock& lock) {
        if (delivering) return;
        delivering = true;
        while (subscriber && !queue.empty() && (demand > 0 || defects.ignoresDemand)) {
            if (demand > 0) --demand;
            int value = queue.front();
            queue.pop_front();
            call(lock, [&](Subscriber<int>& receiver) { receiver.onNext(std::move(value)); });
        }
        delivering = false;
        if (completing && queue.empty()) finish(lock);
    }

    void finish(Lock& lock) {
        if (!ended) completion.setValue(true);
        ended = true;
        call(lock, [](Subscriber<int>& receiver) { receiver.onComplete(); });
    }

    template <class Signal>
    void call(Lock& lock, Signal signal) {
        const auto receiver = subscriber;
        if (receiver == nullptr) return;
        if (defects.holdsItsLockWhileDelivering) return signal(*receiver);
        lock.unlock();
        signal(*receiver);
        lock.lock();
    }

    const Defects defects;
    std::recursive_mutex mutex;
    std::deque<int> queue;
    Promise<bool> completion;
    std::exception_ptr failure;
    std::shared_ptr<Subscriber<int>> subscriber;
    std::shared_ptr<Link> subscription;
    std::uint64_t demand = 0;
    bool delivering = false;
    bool completing = false;
    bool ended = false;
};

}  // namespace velkor::reactive_streams
