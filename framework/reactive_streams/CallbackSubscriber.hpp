#pragma once

#include <cstdint>
#include <exception>
#include <functional>
#include <limits>
#include <memory>
#include <stdexcept>
#include <utility>

#include "framework/reactive_streams/Publisher.hpp"
#include "framework/reactive_streams/Subscriber.hpp"
#include "framework/reactive_streams/Subscription.hpp"
#include "framework/reactive_streams/SubscriptionHandle.hpp"

namespace velkor::reactive_streams {

/// How many values a `CallbackSubscriber` asks for.
enum class Demand {
    unbounded,   ///< All there will ever be: every value is delivered as it is published.
    oneAtATime,  ///< The next one once the callback has returned; meanwhile newer ones replace it.
};

/// The functions that a `CallbackSubscriber` calls. The last two may be left empty.
template <class T>
struct Callbacks {
    std::function<void(T&&)> onValue;  ///< A callable that takes `T`, `const T&` or `T&&`.
    std::function<void()> onComplete = {};
    std::function<void(const std::exception_ptr&)> onError = {};
};

/// A subscriber that passes everything on to functions. `subscribe` below makes one.
///
/// The functions run on the thread that publishes or requests, without a lock of this class, and
/// may be called by two threads at once if the publisher delivers so. None begins after
/// `SubscriptionLink::cancel` on the same thread. What they throw passes to the publisher's caller.
template <class T>
class CallbackSubscriber final : public Subscriber<T> {
public:
    /// A subscriber that obeys `sharedLink`. Throws `std::invalid_argument` "A callback for values
    /// is needed." when `functions.onValue` is empty.
    CallbackSubscriber(Callbacks<T> functions, Demand wanted,
                       std::shared_ptr<SubscriptionLink> sharedLink)
        : callbacks(std::move(functions)), demand(wanted), link(std::move(sharedLink)) {
        if (!callbacks.onValue) throw std::invalid_argument("A callback for values is needed.");
    }

    using Subscriber<T>::onNext;

    /// Asks for the first values, or cancels when the link was cancelled or is open already.
    void onSubscribe(std::weak_ptr<Subscription> subscription) override {
        if (!link->open(std::move(subscription))) return;
        link->request(demand == Demand::unbounded ? std::numeric_limits<std::uint64_t>::max() : 1);
    }

    /// Calls `onValue`, then asks for the next value where demand is one at a time, in any case:
    /// a callback that throws is called again for the next value. One that is queued by then may
    /// wait until another is published, since an exception ends the publisher's draining.
    void onNext(T&& value) override {
        if (link->isCancelled()) return;
        try {
            callbacks.onValue(std::move(value));
        } catch (...) {
            askForNext();
            throw;
        }
        askForNext();
    }

    void onComplete() override {
        link->close();
        if (callbacks.onComplete && !link->isCancelled()) callbacks.onComplete();
    }

    void onError(const std::exception_ptr& error) override {
        link->close();
        if (callbacks.onError && !link->isCancelled()) callbacks.onError(error);
    }

private:
    void askForNext() {
        if (demand == Demand::oneAtATime && !link->isCancelled()) link->request(1);
    }

    const Callbacks<T> callbacks;
    const Demand demand;
    const std::shared_ptr<SubscriptionLink> link;
};

/// Subscribes `callbacks` to `publisher` and gives the handle that ends this again:
///
///     const auto watch = subscribe(*store->watchOption("net.port"), {[](auto&& value) { ... }});
///
/// The publisher owns the callbacks. They may run before this returns; the handle exists afterwards
/// only. A callback may own the handle: no cycle keeps anything alive.
///
/// Throws what `CallbackSubscriber` and the publisher's `subscribe` throw, which includes what a
/// callback throws for a first value; the subscription is cancelled then.
template <class T>
[[nodiscard]] SubscriptionHandle subscribe(PublisherAPI<T>& publisher, Callbacks<T> callbacks,
                                           Demand demand = Demand::unbounded) {
    const auto link = std::make_shared<SubscriptionLink>();
    SubscriptionHandle handle(link);
    publisher.subscribe(
        std::make_shared<CallbackSubscriber<T>>(std::move(callbacks), demand, link));
    return handle;
}

}  // namespace velkor::reactive_streams
