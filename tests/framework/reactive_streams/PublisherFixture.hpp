#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <memory>
#include <utility>

#include "framework/reactive_streams/CachedValuePublisher.hpp"
#include "tests/support/RecordingSubscriber.hpp"

namespace velkor::reactive_streams {

template <class T>
using StreamOf = CachedValuePublisher<T, std::function<void()>>;

/// One stream of numbers that keeps one value, and a subscriber for it that asks for nothing.
class PublisherFixture : public ::testing::Test {
protected:
    using Stream = StreamOf<int>;
    using Recorder = velkor::testing::RecordingSubscriber<int>;

    static constexpr std::uint64_t allValues = velkor::testing::allValues;

    std::shared_ptr<Stream> makeStream(std::uint64_t capacity) {
        return std::make_shared<Stream>(capacity, [this] {
            ++endings;
            if (whenDone) whenDone();
        });
    }

    /// Subscribes the recorder and asks for `demand` values.
    void subscribe(std::uint64_t demand) {
        publisher->subscribe(subscriber);
        if (demand > 0) subscriber->request(demand);
    }

    int endings = 0;  // how often the end-of-stream hook has run
    std::function<void()> whenDone;
    std::shared_ptr<Recorder> subscriber = std::make_shared<Recorder>();
    std::shared_ptr<Stream> publisher = makeStream(1);
};

}  // namespace velkor::reactive_streams
