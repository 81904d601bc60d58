#pragma once

#include <cstdint>
#include <exception>
#include <limits>
#include <memory>
#include <string>
#include <utility>

#include "framework/reactive_streams/Subscriber.hpp"
#include "framework/reactive_streams/Subscription.hpp"
#include "tests/failing/Failing.hpp"

namespace velkor::testing {

/// A text that no string keeps in itself, so that copying it takes memory.
inline std::string longText(const std::string& begin) {
    return begin + std::string(100, '.');
}

/// A demand that no test exhausts.
inline constexpr std::uint64_t everything = std::numeric_limits<std::uint64_t>::max();

/// Counts signals, each of which is a call of foreign code, and keeps no value: it needs no memory.
template <class T>
class ForeignSubscriber final : public reactive_streams::Subscriber<T> {
public:
    using reactive_streams::Subscriber<T>::onNext;

    explicit ForeignSubscriber(std::uint64_t initialDemand = everything) : demand(initialDemand) {}

    void onSubscribe(std::weak_ptr<reactive_streams::Subscription> opened) override {
        subscription = std::move(opened);
        if (demand > 0) subscription.lock()->request(demand);
        foreignCall();
    }

    void onNext(T&& /*value*/) override {
        ++values;
        foreignCall();
    }

    void onComplete() override {
        ++completions;
        foreignCall();
    }

    void onError(const std::exception_ptr& /*error*/) override {
        ++errors;
        foreignCall();
    }

    std::weak_ptr<reactive_streams::Subscription> subscription;
    const std::uint64_t demand;
    int values = 0;
    int completions = 0;
    int errors = 0;
};

}  // namespace velkor::testing
