#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <stdexcept>
#include <utility>

#include "tests/framework/reactive_streams/PublisherFixture.hpp"
#include "tests/framework/reactive_streams/TrackedValue.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::reactive_streams {
namespace {

/// Whether another thread gets the publisher's mutex now.
template <class Stream>
bool mutexIsFree(Stream& stream) {
    return velkor::testing::completes([&stream] {
        try {
            stream.getCompletionFuture();
        } catch (const std::runtime_error&) {
            // The future was given out before: the mutex was taken to find that out.
            return;
        }
    });
}

class CachedValuePublisherLocks : public PublisherFixture {
protected:
    /// A callback that looks whether the mutex is free, and counts that it did.
    auto probe() {
        return [this, &stream = *publisher](auto&&...) {
            ++probes;
            EXPECT_TRUE(mutexIsFree(stream));
        };
    }

    int probes = 0;
};

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringOnSubscribe) {
    subscriber->whenSubscribed = probe();
    subscribe(0);
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringADirectDelivery) {
    subscriber->whenNext = probe();
    subscribe(1);
    publisher->publish(1);
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringADrainedDelivery) {
    subscriber->whenNext = probe();
    publisher->publish(1);
    subscribe(1);
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringOnComplete) {
    subscriber->whenComplete = probe();
    subscribe(0);
    publisher->complete();
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringOnCompleteOfADestruction) {
    subscriber->whenComplete = probe();
    subscribe(0);
    publisher.reset();
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringOnCompleteForALateSubscriber) {
    subscriber->whenComplete = probe();
    publisher->complete();
    subscribe(0);
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringOnError) {
    subscriber->whenError = probe();
    subscribe(0);
    publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringOnErrorForALateSubscriber) {
    subscriber->whenError = probe();
    publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
    subscribe(0);
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringTheHookOfACancel) {
    whenDone = probe();
    subscribe(0);
    subscriber->cancel();
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringTheHookOfACompletion) {
    whenDone = probe();
    publisher->complete();
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringTheHookOfAFailure) {
    whenDone = probe();
    publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringTheHookOfADestruction) {
    whenDone = probe();
    publisher.reset();
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeDuringAContinuationOfTheFuture) {
    auto observed =
        publisher->getCompletionFuture().then([look = probe()](Future<bool>&& completed) {
            look();
            return completed.get();
        });
    subscribe(0);
    subscriber->cancel();
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeAfterAnExceptionOfOnNext) {
    subscriber->whenNext = [](int) { throw std::runtime_error("next"); };
    publisher->publish(1);
    subscribe(0);
    EXPECT_THROW(subscriber->request(1), std::runtime_error);
    EXPECT_TRUE(mutexIsFree(*publisher));
}

TEST_F(CachedValuePublisherLocks, MutexIsFreeWhileACancelDestroysTheSubscriber) {
    struct LastWords {
        std::function<void()> say;
        ~LastWords() { say(); }
    };
    auto words = std::make_shared<LastWords>();
    words->say = probe();
    subscriber->whenComplete = [words] {};
    subscribe(0);
    words.reset();
    const auto subscription = subscriber->subscription.lock();
    subscriber.reset();
    subscription->cancel();
    EXPECT_EQ(probes, 1);
}

class CachedValuePublisherValueLocks : public ::testing::Test {
protected:
    using Stream = StreamOf<TrackedValue>;

    TrackedValue value(int number) const { return {log, number}; }

    void probeDestructions() {
        log->whenDestroyed = [this] {
            ++probes;
            EXPECT_TRUE(mutexIsFree(*publisher));
        };
    }

    int probes = 0;
    std::shared_ptr<ValueLog> log = std::make_shared<ValueLog>();
    std::shared_ptr<Stream> publisher = std::make_shared<Stream>(1, [] {});
    std::shared_ptr<velkor::testing::RecordingSubscriber<TrackedValue>> subscriber =
        std::make_shared<velkor::testing::RecordingSubscriber<TrackedValue>>();
};

TEST_F(CachedValuePublisherValueLocks, MutexIsFreeWhileAReplacedValueIsDestroyed) {
    publisher->publish(value(1));
    const TrackedValue newer = value(2);
    probeDestructions();
    publisher->publish(newer);
    log->whenDestroyed = nullptr;
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherValueLocks, MutexIsFreeWhileAValueForAnEndedStreamIsDestroyed) {
    publisher->complete();
    const TrackedValue late = value(1);
    probeDestructions();
    publisher->publish(late);
    log->whenDestroyed = nullptr;
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherValueLocks, MutexIsFreeWhileACancelDestroysTheQueue) {
    publisher->publish(value(1));
    publisher->subscribe(subscriber);
    probeDestructions();
    subscriber->cancel();
    log->whenDestroyed = nullptr;
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherValueLocks, MutexIsFreeWhileAFailureDestroysTheQueue) {
    publisher->publish(value(1));
    probeDestructions();
    publisher->fail(std::make_exception_ptr(std::runtime_error("broken")));
    log->whenDestroyed = nullptr;
    EXPECT_EQ(probes, 1);
}

TEST_F(CachedValuePublisherValueLocks, MutexIsFreeWhileADeliveredValueIsDestroyed) {
    publisher->publish(value(1));
    publisher->subscribe(subscriber);
    subscriber->whenNext = [this](const TrackedValue&) { subscriber->values.clear(); };
    probeDestructions();
    subscriber->request(1);
    log->whenDestroyed = nullptr;
    EXPECT_EQ(probes, 2);
}

}  // namespace
}  // namespace velkor::reactive_streams
