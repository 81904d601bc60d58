#pragma once

#include <atomic>
#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <mutex>
#include <utility>

#include "framework/reactive_streams/Subscriber.hpp"
#include "framework/reactive_streams/Subscription.hpp"

namespace velkor::testing {

/// Counts what it is told, by any number of threads at once.
template <class T>
class CountingSubscriber final : public reactive_streams::Subscriber<T> {
public:
    using reactive_streams::Subscriber<T>::onNext;

    explicit CountingSubscriber(std::uint64_t demand) : initialDemand(demand) {}

    void onSubscribe(std::weak_ptr<reactive_streams::Subscription> opened) override {
        subscription = opened.lock();
        if (initialDemand > 0) subscription->request(initialDemand);
    }

    void onNext(T&& value) override {
        const std::lock_guard<std::mutex> lock(mutex);
        ++received;
        latest = std::move(value);
    }

    void onComplete() override { ++completions; }
    void onError(const std::exception_ptr&) override { ++errors; }

    /// The value that arrived last.
    T last() {
        const std::lock_guard<std::mutex> lock(mutex);
        return latest;
    }

    const std::uint64_t initialDemand;
    std::shared_ptr<reactive_streams::Subscription> subscription;
    std::atomic<int> received{0};
    std::atomic<int> completions{0};
    std::atomic<int> errors{0};

private:
    std::mutex mutex;
    T latest{};  // guarded by mutex
};

}  // namespace velkor::testing
