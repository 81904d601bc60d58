#pragma once

#include <cstdint>
#include <exception>
#include <functional>
#include <limits>
#include <memory>
#include <utility>
#include <vector>

#include "framework/reactive_streams/Subscriber.hpp"
#include "framework/reactive_streams/Subscription.hpp"

namespace velkor::testing {

/// A request that no test exhausts.
inline constexpr std::uint64_t allValues = std::numeric_limits<std::uint64_t>::max();

/// Keeps every signal of a stream, and then runs what the test has given for it. Not thread-safe:
/// one thread delivers at a time, and the test looks when it is done.
template <class T>
class RecordingSubscriber : public reactive_streams::Subscriber<T> {
public:
    using reactive_streams::Subscriber<T>::onNext;

    /// A subscriber that asks for `initialDemand` values as soon as it is subscribed.
    explicit RecordingSubscriber(std::uint64_t initialDemand = 0) : firstRequest(initialDemand) {}

    void onSubscribe(std::weak_ptr<reactive_streams::Subscription> opened) override {
        ++subscriptions;
        subscription = std::move(opened);
        if (whenSubscribed) whenSubscribed();
        if (firstRequest > 0) request(firstRequest);
    }

    void onNext(T&& value) override {
        values.push_back(value);
        if (whenNext) whenNext(value);
    }

    void onComplete() override {
        ++completions;
        if (whenComplete) whenComplete();
    }

    void onError(const std::exception_ptr& error) override {
        errors.push_back(error);
        if (whenError) whenError();
    }

    /// Asks the subscription, which has to be alive, for more.
    void request(std::uint64_t n) { subscription.lock()->request(n); }

    /// Cancels the subscription, which has to be alive.
    void cancel() { subscription.lock()->cancel(); }

    std::uint64_t firstRequest;
    std::function<void()> whenSubscribed;
    std::function<void(const T&)> whenNext;
    std::function<void()> whenComplete;
    std::function<void()> whenError;

    std::weak_ptr<reactive_streams::Subscription> subscription;
    std::vector<T> values;
    std::vector<std::exception_ptr> errors;
    int subscriptions = 0;
    int completions = 0;
};

}  // namespace velkor::testing
