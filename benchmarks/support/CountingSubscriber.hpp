#pragma once

#include <cstdint>
#include <limits>
#include <memory>

#include "configuration/ConfigurationValue.hpp"
#include "framework/reactive_streams/Subscriber.hpp"

namespace velkor::benchmarks {

/// Waits for every value there will ever be and counts them.
class CountingSubscriber final
    : public reactive_streams::Subscriber<configuration::ConfigurationValue> {
public:
    using Subscriber::onNext;

    void onSubscribe(std::weak_ptr<reactive_streams::Subscription> opened) override {
        if (const auto subscription = opened.lock()) {
            subscription->request(std::numeric_limits<std::uint64_t>::max());
        }
    }
    void onNext(configuration::ConfigurationValue&&) override { ++received; }
    void onComplete() override {}
    void onError(const std::exception_ptr&) override {}

private:
    std::uint64_t received = 0;
};

}  // namespace velkor::benchmarks
